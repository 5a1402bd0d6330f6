// Waitable kernel objects behind HANDLEs; semaphores are the only kind the
// module needs. The table keeps each object alive while a wait is using it,
// so CloseHandle on another thread cannot pull it away from the waiter.
#include <chrono>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <new>
#include <unordered_map>

#include "tav/com_api.h"

namespace {

class Semaphore {
public:
    Semaphore(LONG initialCount, LONG maximumCount) : count_(initialCount), maximum_(maximumCount) {}

    DWORD Release(LONG releaseCount, LONG* previousCount) {
        std::lock_guard lock(mutex_);
        if (releaseCount > maximum_ - count_) return ERROR_TOO_MANY_POSTS;
        if (previousCount != nullptr) *previousCount = count_;
        count_ += releaseCount;
        if (releaseCount == 1)
            available_.notify_one();
        else
            available_.notify_all();
        return ERROR_SUCCESS;
    }

    bool Wait(DWORD milliseconds) {
        std::unique_lock lock(mutex_);
        auto signalled = [this] { return count_ > 0; };
        if (milliseconds == INFINITE) {
            available_.wait(lock, signalled);
        } else if (!available_.wait_for(lock, std::chrono::milliseconds(milliseconds), signalled)) {
            return false;
        }
        --count_;
        return true;
    }

private:
    std::mutex mutex_;
    std::condition_variable available_;
    LONG count_;
    const LONG maximum_;
};

class HandleTable {
public:
    static HandleTable& Instance() {
        static HandleTable* table = new HandleTable;  // outlives every static destructor that might close a handle
        return *table;
    }

    HANDLE Add(std::shared_ptr<Semaphore> object) {
        std::lock_guard lock(mutex_);
        HANDLE handle = object.get();
        objects_.emplace(handle, std::move(object));
        return handle;
    }

    std::shared_ptr<Semaphore> Find(HANDLE handle) {
        std::lock_guard lock(mutex_);
        auto found = objects_.find(handle);
        return found == objects_.end() ? nullptr : found->second;
    }

    // The object itself goes when its last waiter lets go of it, outside the lock.
    std::shared_ptr<Semaphore> Remove(HANDLE handle) {
        std::lock_guard lock(mutex_);
        auto found = objects_.find(handle);
        if (found == objects_.end()) return nullptr;
        auto object = std::move(found->second);
        objects_.erase(found);
        return object;
    }

private:
    std::mutex mutex_;
    std::unordered_map<HANDLE, std::shared_ptr<Semaphore>> objects_;
};

}  // namespace

extern "C" {

HANDLE CreateSemaphoreW(LPSECURITY_ATTRIBUTES, LONG lInitialCount, LONG lMaximumCount, LPCWSTR lpName) {
    if (lpName != nullptr) {
        SetLastError(ERROR_NOT_SUPPORTED);
        return nullptr;
    }
    if (lMaximumCount <= 0 || lInitialCount < 0 || lInitialCount > lMaximumCount) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return nullptr;
    }
    try {
        return HandleTable::Instance().Add(std::make_shared<Semaphore>(lInitialCount, lMaximumCount));
    } catch (const std::bad_alloc&) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
}

BOOL ReleaseSemaphore(HANDLE hSemaphore, LONG lReleaseCount, LPLONG lpPreviousCount) {
    auto semaphore = HandleTable::Instance().Find(hSemaphore);
    DWORD error = semaphore == nullptr ? ERROR_INVALID_HANDLE
                  : lReleaseCount <= 0 ? ERROR_INVALID_PARAMETER
                                       : semaphore->Release(lReleaseCount, lpPreviousCount);
    if (error != ERROR_SUCCESS) {
        SetLastError(error);
        return FALSE;
    }
    return TRUE;
}

DWORD WaitForSingleObject(HANDLE hHandle, DWORD dwMilliseconds) {
    auto semaphore = HandleTable::Instance().Find(hHandle);
    if (semaphore == nullptr) {
        SetLastError(ERROR_INVALID_HANDLE);
        return WAIT_FAILED;
    }
    return semaphore->Wait(dwMilliseconds) ? WAIT_OBJECT_0 : WAIT_TIMEOUT;
}

BOOL CloseHandle(HANDLE hObject) {
    if (HandleTable::Instance().Remove(hObject) == nullptr) {
        SetLastError(ERROR_INVALID_HANDLE);
        return FALSE;
    }
    return TRUE;
}

}  // extern "C"
