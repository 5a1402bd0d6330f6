// tav::Semaphore: owns an unnamed counting semaphore.
#pragma once
#include <utility>

#include "tav/platform.h"

namespace tav {

class Semaphore {
public:
    Semaphore() noexcept = default;
    Semaphore(const Semaphore&) = delete;
    Semaphore& operator=(const Semaphore&) = delete;
    Semaphore(Semaphore&& other) noexcept : handle_(std::exchange(other.handle_, nullptr)) {}
    Semaphore& operator=(Semaphore&& other) noexcept {
        if (this != &other) {
            Close();
            handle_ = std::exchange(other.handle_, nullptr);
        }
        return *this;
    }
    ~Semaphore() { Close(); }

    // Replaces any semaphore held before.
    HRESULT Create(LONG initialCount, LONG maximumCount) noexcept {
        Close();
        handle_ = CreateSemaphoreW(nullptr, initialCount, maximumCount, nullptr);
        if (handle_ != nullptr) return S_OK;
        DWORD error = GetLastError();
        return error != ERROR_SUCCESS ? HRESULT_FROM_WIN32(error) : E_FAIL;
    }
    bool IsValid() const noexcept { return handle_ != nullptr; }
    HANDLE Handle() const noexcept { return handle_; }

    // False when the count would pass the maximum; the count is then unchanged.
    bool Release(LONG count = 1, LONG* previousCount = nullptr) noexcept {
        return ReleaseSemaphore(handle_, count, previousCount) != FALSE;
    }
    // WAIT_OBJECT_0 when a count was taken, WAIT_TIMEOUT when `milliseconds`
    // passed first (INFINITE: never), WAIT_FAILED on a bad handle.
    DWORD Wait(DWORD milliseconds = INFINITE) noexcept { return WaitForSingleObject(handle_, milliseconds); }

    void Close() noexcept {
        if (handle_ != nullptr) CloseHandle(std::exchange(handle_, nullptr));
    }

private:
    HANDLE handle_ = nullptr;
};

}  // namespace tav
