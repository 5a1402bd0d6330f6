#pragma once
// The local queue of one connected slot: messages in arrival order, a count
// that a semaphore carries between the thread that delivers and the one
// that receives, and whether the controller was told that the queue is full.
#include <deque>
#include <memory>

#include "TavController.h"
#include "tav/lock.h"
#include "tav/platform.h"
#include "tav/semaphore.h"

namespace tav::ipc {

inline constexpr HRESULT kMessageRefused = static_cast<HRESULT>(0xC0040404);

// What the controller is to be told of a queue's level before a message is
// stored.
enum class LevelReport { None, Full, Room };

class SlotQueue {
public:
    // A queue for the slot, or null when its semaphore cannot be made.
    static std::shared_ptr<SlotQueue> Create(short slotId, short maxMsg, short maxSize);
    ~SlotQueue();
    SlotQueue(const SlotQueue&) = delete;
    SlotQueue& operator=(const SlotQueue&) = delete;

    short SlotId() const { return slotId_; }
    short MaxMsg() const { return maxMsg_; }
    short MaxSize() const { return maxSize_; }
    LONG Count();

    // The report due before a message is stored: full (and remembered as
    // told) while maxMsg or more are queued, room again once fewer are.
    LevelReport ReportBeforeStoring(LONG* level);

    // Stores the message (its body becomes the queue's) while at most
    // maxMsg, and never more than 200, are queued before it: a margin of
    // one. Refused (kMessageRefused) or out of memory, the body is freed and
    // the message lost.
    HRESULT Store(const TavIPCParams& params, BSTR body);

    // Waits for a message, milliseconds at most (INFINITE: no limit), and
    // moves the front one into *out (the body becomes the caller's). False
    // on a time-out, or when the queue is empty or closed.
    bool Take(DWORD milliseconds, TavIPCOutParams* out);

    // Frees every queued message and wakes every waiting Take; nothing is
    // stored after.
    void Close();

private:
    struct Message {
        TavIPCParams params;
        BSTR body;
    };

    SlotQueue(short slotId, short maxMsg, short maxSize) : slotId_(slotId), maxMsg_(maxMsg), maxSize_(maxSize) {}
    void FreeAll();  // under lock_

    const short slotId_;
    const short maxMsg_;
    const short maxSize_;
    CriticalSection lock_;
    std::deque<Message> messages_;
    bool fullReported_ = false;
    bool closed_ = false;
    Semaphore available_;
};

}  // namespace tav::ipc
