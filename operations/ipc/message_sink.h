#pragma once
// The object's own _ITavIPCMessages: the command component delivers the
// messages of the object's slots here, on its own threads.
#include <condition_variable>
#include <mutex>

#include "TavController.h"
#include "tav/platform.h"

namespace tav {
class ControllerObject;
}

namespace tav::ipc {

class MessageSink final : public _ITavIPCMessages {
public:
    // A sink with one reference for the caller, or null when out of memory.
    static MessageSink* Create(ControllerObject& owner);

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;
    HRESULT STDMETHODCALLTYPE OnMessage(TavIPCHeaderInternal* header, byte* data, LONG size) override;

    // The object is going: messages that arrive from now on are refused,
    // and Detach returns once none is being handled.
    void Detach();

private:
    explicit MessageSink(ControllerObject& owner) : owner_(&owner) {}
    ~MessageSink() = default;

    std::mutex mutex_;
    std::condition_variable idle_;
    ControllerObject* owner_;  // null once detached
    int delivering_ = 0;
    LONG volatile references_ = 1;
};

// A message for one of owner's slots, or the controller's notice that one
// was closed.
HRESULT Arrive(ControllerObject& owner, TavIPCHeaderInternal* header, byte* data, LONG size);

}  // namespace tav::ipc
