#include "operations/ipc/slot_queue.h"

#include <limits>
#include <new>

namespace tav::ipc {
namespace {

constexpr LONG kMostQueued = 200;
// Close wakes at most this many waiters at once; more never wait on one slot.
constexpr LONG kWakeAll = 1024;

}  // namespace

std::shared_ptr<SlotQueue> SlotQueue::Create(short slotId, short maxMsg, short maxSize) {
    std::shared_ptr<SlotQueue> queue(new (std::nothrow) SlotQueue(slotId, maxMsg, maxSize));
    if (!queue || FAILED(queue->available_.Create(0, std::numeric_limits<LONG>::max()))) {
        return nullptr;
    }
    return queue;
}

SlotQueue::~SlotQueue() {
    CriticalSectionLock hold(lock_);
    FreeAll();
}

LONG SlotQueue::Count() {
    CriticalSectionLock hold(lock_);
    return static_cast<LONG>(messages_.size());
}

LevelReport SlotQueue::ReportBeforeStoring(LONG* level) {
    CriticalSectionLock hold(lock_);
    *level = static_cast<LONG>(messages_.size());
    if (*level >= maxMsg_) {
        fullReported_ = true;
        return LevelReport::Full;
    }
    if (fullReported_) {
        fullReported_ = false;
        return LevelReport::Room;
    }
    return LevelReport::None;
}

HRESULT SlotQueue::Store(const TavIPCParams& params, BSTR body) {
    HRESULT result = kMessageRefused;
    {
        CriticalSectionLock hold(lock_);
        const auto queued = static_cast<LONG>(messages_.size());
        if (!closed_ && queued <= kMostQueued && queued <= maxMsg_) {
            try {
                messages_.push_back(Message{params, body});
            } catch (const std::bad_alloc&) {
                result = E_OUTOFMEMORY;
            }
            if (result != E_OUTOFMEMORY) {
                available_.Release();
                return S_OK;
            }
        }
    }
    SysFreeString(body);
    return result;
}

bool SlotQueue::Take(DWORD milliseconds, TavIPCOutParams* out) {
    if (available_.Wait(milliseconds) != WAIT_OBJECT_0) {
        return false;
    }
    CriticalSectionLock hold(lock_);
    if (messages_.empty()) {
        return false;
    }
    out->ipcParams = messages_.front().params;
    out->Data = messages_.front().body;
    messages_.pop_front();
    return true;
}

void SlotQueue::Close() {
    {
        CriticalSectionLock hold(lock_);
        closed_ = true;
        FreeAll();
    }
    available_.Release(kWakeAll);
}

void SlotQueue::FreeAll() {
    for (Message& message : messages_) {
        SysFreeString(message.body);
    }
    messages_.clear();
}

}  // namespace tav::ipc
