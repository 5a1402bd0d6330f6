#pragma once
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <optional>

#include "TavController.h"
#include "tav/variant.h"

namespace tavctl {

struct CallbackReply {
    HRESULT status = S_OK;
    ULONG userDef = 0;
    tav::Variant data;
};

// The callback of an asynchronous call: keeps a copy of every reply record it
// is given (the command component clears its own after the call).
class ReplyWaiter final : public ITavCommandCallback {
public:
    // A new waiter holding one reference, the caller's.
    static ReplyWaiter* New();

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;
    HRESULT STDMETHODCALLTYPE OnCommandReply(TavCommandReply* reply) override;

    // The first reply not taken yet, waiting up to `limit` for it.
    std::optional<CallbackReply> Wait(std::chrono::milliseconds limit);

private:
    ReplyWaiter() = default;
    ~ReplyWaiter() = default;

    std::atomic<ULONG> references_{1};
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::deque<CallbackReply> replies_;
};

}  // namespace tavctl
