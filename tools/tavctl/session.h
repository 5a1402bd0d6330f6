#pragma once
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "TavController.h"
#include "tav/com_ptr.h"
#include "tavctl/event_printer.h"
#include "tavctl/options.h"
#include "tavctl/reply_waiter.h"

namespace tavctl {

// The subscriptions of a running `watch`.
struct WatchState {
    tav::ComPtr<ITavSubscribe> subscribe;
    tav::ComPtr<EventPrinter> printer;
    std::vector<ULONG> cookies;
};

// One initialised controller object and the way tavctl calls it: Sync, or
// Async with the reply awaited at a callback, as --async says.
class Session {
public:
    // Issues the operation with the given TavInParams; in a Sync call it
    // fills the out-values that the print step shows.
    using Call = std::function<HRESULT(TavInParams* rip)>;
    // Decodes a reply that came through the callback into the same out-values.
    using Unpack = std::function<HRESULT(VARIANT* data)>;

    Session(GlobalOptions options, tav::ComPtr<ITavController> controller);
    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    const GlobalOptions& Options() const { return options_; }
    ITavController* Controller() const { return controller_.Get(); }

    // The object's interface I, or null with a message naming the class it
    // needs (`name` is the interface's name).
    template <typename I>
    tav::ComPtr<I> Interface(const char* name) {
        tav::ComPtr<I> result;
        if (FAILED(controller_->QueryInterface(__uuidof(I), reinterpret_cast<void**>(&result)))) {
            Error(std::string("class ") + options_.className + " does not offer " + name +
                  "; choose a later class with --class");
        }
        return result;
    }

    // Output lines, kept whole when events arrive meanwhile.
    void Print(const std::string& line);
    void Error(const std::string& line);

    // A reading operation: Sync, the out-values printed; with --async, the
    // reply taken from the callback, decoded by `unpack` and then printed.
    int Read(const std::string& operation, const Call& call, const Unpack& unpack, const std::function<void()>& print);
    // A writing operation; with --async the callback's status is shown.
    int Write(const std::string& operation, const Call& call);
    // Always Async: the reply record as the callback received it, or empty
    // with the failure reported and `exitStatus` set.
    std::optional<CallbackReply> CallThroughCallback(const std::string& operation, const Call& call,
                                                     int& exitStatus);

    // Prints the failure with its HRESULT and the object's last-error text.
    int Fail(const std::string& operation, HRESULT hr);
    // A failure status in a reply that came through the callback.
    int FailReply(const std::string& operation, CallbackReply& reply);
    int Usage(const std::string& command, const std::string& message);

    WatchState& Watch() { return watch_; }
    void StopWatch();

private:
    TavInParams SyncParams() const;

    GlobalOptions options_;
    tav::ComPtr<ITavController> controller_;
    std::mutex outputMutex_;
    ULONG nextUserDef_ = 1;
    WatchState watch_;
};

}  // namespace tavctl
