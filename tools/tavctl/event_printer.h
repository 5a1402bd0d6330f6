#pragma once
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>

#include "TavController.h"

namespace tavctl {

// The event sink of `watch`: prints each event, decoded, as it arrives (on
// the command component's thread) and counts them.
class EventPrinter final : public _ITavObjectEvents {
public:
    // Turns an event into the line printed; userDef tells which subscription
    // it came from.
    using Decoder = std::function<std::string(ULONG userDef, VARIANT* data, const FILETIME& time)>;
    using Printer = std::function<void(const std::string& line)>;

    // A new printer holding one reference, the caller's.
    static EventPrinter* New(Decoder decoder, Printer printer);

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;
    HRESULT STDMETHODCALLTYPE OnChange(TavEventData* data) override;

    // Waits until `count` events have arrived in all or the deadline passed;
    // the number that arrived.
    std::size_t WaitFor(std::size_t count, std::chrono::steady_clock::time_point deadline);

private:
    EventPrinter(Decoder decoder, Printer printer) : decoder_(std::move(decoder)), printer_(std::move(printer)) {}
    ~EventPrinter() = default;

    std::atomic<ULONG> references_{1};
    const Decoder decoder_;
    const Printer printer_;
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::size_t count_ = 0;
};

}  // namespace tavctl
