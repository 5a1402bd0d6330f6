#pragma once
// What a controller object keeps of its IPC slots: the slot table (slot id
// to local queue) and the proxy table (slot id to the proxy slot id the
// controller gave for it), guarded by one critical section, and the sink
// through which the command component delivers the slots' messages.
#include <map>
#include <memory>

#include "operations/ipc/slot_queue.h"
#include "tav/com_ptr.h"
#include "tav/lock.h"

namespace tav {
class ControllerObject;
}

namespace tav::ipc {

class MessageSink;

class IpcState {
public:
    IpcState();
    ~IpcState();
    IpcState(const IpcState&) = delete;
    IpcState& operator=(const IpcState&) = delete;

    CriticalSection& Lock() { return lock_; }
    // Under Lock():
    std::map<short, std::shared_ptr<SlotQueue>>& Slots() { return slots_; }
    std::map<short, short>& Proxies() { return proxies_; }

    // The queue of slotId, or null; takes the lock itself.
    std::shared_ptr<SlotQueue> Find(short slotId);

    // The sink for owner's slots, made on first use (null when out of
    // memory), and whether the command component has it yet.
    MessageSink* Sink(ControllerObject& owner);
    bool sinkConnected = false;

    // Frees every slot and its messages, wakes every waiting Receive and
    // detaches the sink, which no longer reaches the object; for the
    // object's destruction.
    void Close();

private:
    CriticalSection lock_;
    std::map<short, std::shared_ptr<SlotQueue>> slots_;
    std::map<short, short> proxies_;
    ComPtr<MessageSink> sink_;
};

}  // namespace tav::ipc
