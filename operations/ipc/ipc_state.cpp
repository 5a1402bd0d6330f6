#include "operations/ipc/ipc_state.h"

#include "operations/ipc/message_sink.h"

namespace tav::ipc {

IpcState::IpcState() = default;

IpcState::~IpcState() { Close(); }

std::shared_ptr<SlotQueue> IpcState::Find(short slotId) {
    CriticalSectionLock hold(lock_);
    const auto found = slots_.find(slotId);
    return found == slots_.end() ? nullptr : found->second;
}

MessageSink* IpcState::Sink(ControllerObject& owner) {
    CriticalSectionLock hold(lock_);
    if (!sink_) {
        sink_.Attach(MessageSink::Create(owner));
    }
    return sink_.Get();
}

void IpcState::Close() {
    ComPtr<MessageSink> sink;
    std::map<short, std::shared_ptr<SlotQueue>> slots;
    {
        CriticalSectionLock hold(lock_);
        sink = std::move(sink_);
        slots.swap(slots_);
        proxies_.clear();
    }
    if (sink) {
        sink->Detach();
    }
    for (auto& [id, queue] : slots) {
        queue->Close();
    }
}

}  // namespace tav::ipc
