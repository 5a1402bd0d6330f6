#pragma once
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "TavController.h"
#include "tav/com_ptr.h"
#include "tavctl/event_printer.h"
#include "tavctl/names.h"
#include "tavctl/options.h"
#include "tavctl/output.h"
#include "tavctl/reply_waiter.h"

namespace tavctl {

// The subscriptions of a running `watch`.
struct WatchState {
    tav::ComPtr<ITavSubscribe> subscribe;
    tav::ComPtr<EventPrinter> printer;
    std::vector<ULONG> cookies;
};

// A command failed and said so already; unwinds to the command's end with
// the exit status.
struct CommandFailed {
    int status;
};

// Initialised controller objects (clients; --client N picks one, the first
// by default) and the way tavctl calls them: Sync, or Async with the reply
// awaited at a callback, as --async says.
class Session {
public:
    // Issues the operation with the given TavInParams; in a Sync call it
    // fills the out-values that the print step shows.
    using Call = std::function<HRESULT(TavInParams* rip)>;
    // Decodes a reply that came through the callback into the same out-values.
    using Unpack = std::function<HRESULT(VARIANT* data)>;
    // Makes and initialises one more controller object.
    using ClientFactory = std::function<HRESULT(tav::ComPtr<ITavController>& client, std::string& error)>;

    Session(GlobalOptions options, ClientFactory factory);
    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    const GlobalOptions& Options() const { return options_; }
    GlobalOptions& MutableOptions() { return options_; }

    // The current client, made on first use; null with the failure printed.
    ITavController* Controller();
    // 1-based; the object is made when a command first uses it.
    void SelectClient(unsigned number) { current_ = number; }
    unsigned CurrentClient() const { return current_; }
    // The class version of the objects (1 to 17), from --class.
    unsigned ClassVersion() const;

    // The current client's interface I; a failure naming the class it needs
    // when the class does not offer it.
    template <typename I>
    tav::ComPtr<I> Interface() {
        ITavController* controller = Controller();
        if (controller == nullptr) {
            throw CommandFailed{kExitSetup};
        }
        tav::ComPtr<I> result;
        if (FAILED(controller->QueryInterface(__uuidof(I), reinterpret_cast<void**>(&result)))) {
            Error(std::string("class ") + options_.className + " does not offer " + kInterfaceName<I> +
                  "; choose a later class with --class");
            throw CommandFailed{kExitFailed};
        }
        return result;
    }

    // Output lines, kept whole when events arrive meanwhile.
    void Print(const std::string& line);
    void Error(const std::string& line);
    // A line to standard error as it is (the wire trace).
    void Diagnostic(const std::string& line);

    // A command's result, as JSON with --json.
    void Show(const Value& value);
    void Show(const Record& record);
    void Show(const std::vector<Record>& table);

    // A reading operation: Sync, the out-values printed; with --async, the
    // reply taken from the callback, decoded by `unpack` and then printed.
    // Without an unpack step an Async reply is shown as its raw text.
    int Read(const std::string& operation, const Call& call, const Unpack& unpack, const std::function<void()>& print);
    // A writing operation; with --async the callback's status is shown.
    int Write(const std::string& operation, const Call& call);
    // Always Async: the reply record as the callback received it, or empty
    // with the failure reported and `exitStatus` set.
    std::optional<CallbackReply> CallThroughCallback(const std::string& operation, const Call& call,
                                                     int& exitStatus);
    // A Sync TavInParams with the session's time-out.
    TavInParams SyncParams() const;

    // Prints the failure with its HRESULT and the object's last-error text.
    int Fail(const std::string& operation, HRESULT hr);
    // A failure status in a reply that came through the callback.
    int FailReply(const std::string& operation, CallbackReply& reply);

    WatchState& Watch() { return watch_; }
    void StopWatch();

private:
    GlobalOptions options_;
    ClientFactory factory_;
    std::map<unsigned, tav::ComPtr<ITavController>> clients_;
    unsigned current_ = 1;
    std::mutex outputMutex_;
    ULONG nextUserDef_ = 1;
    WatchState watch_;
};

}  // namespace tavctl
