#include "operations/ipc/message_sink.h"

#include <new>

#include "tav/guarded.h"

namespace tav::ipc {

MessageSink* MessageSink::Create(ControllerObject& owner) { return new (std::nothrow) MessageSink(owner); }

HRESULT MessageSink::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID__ITavIPCMessages)) {
        *object = static_cast<_ITavIPCMessages*>(this);
        AddRef();
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

ULONG MessageSink::AddRef() { return static_cast<ULONG>(InterlockedIncrement(&references_)); }

ULONG MessageSink::Release() {
    const LONG left = InterlockedDecrement(&references_);
    if (left == 0) {
        delete this;
    }
    return static_cast<ULONG>(left);
}

HRESULT MessageSink::OnMessage(TavIPCHeaderInternal* header, byte* data, LONG size) {
    ControllerObject* owner = nullptr;
    {
        std::lock_guard hold(mutex_);
        if (owner_ == nullptr) {
            return E_UNEXPECTED;
        }
        owner = owner_;
        ++delivering_;
    }
    // No lock is held while the message is handled: it may send a command.
    const HRESULT hr = Guarded([&] { return Arrive(*owner, header, data, size); });
    std::lock_guard hold(mutex_);
    if (--delivering_ == 0) {
        idle_.notify_all();
    }
    return hr;
}

void MessageSink::Detach() {
    std::unique_lock hold(mutex_);
    owner_ = nullptr;
    idle_.wait(hold, [this] { return delivering_ == 0; });
}

}  // namespace tav::ipc
