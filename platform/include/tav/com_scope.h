// tav::ComScope: COM entered on this thread for as long as the object lives.
#pragma once
#include "tav/platform.h"

namespace tav {

// Enters COM on the calling thread (multithreaded apartment unless told
// otherwise) and leaves it again when it goes, if entering succeeded. Tools,
// tests and benchmarks hold one for the life of the thread that calls COM.
class ComScope {
public:
    explicit ComScope(DWORD model = COINIT_MULTITHREADED) noexcept : result_(CoInitializeEx(nullptr, model)) {}
    ~ComScope() {
        if (SUCCEEDED(result_)) {
            CoUninitialize();
        }
    }
    ComScope(const ComScope&) = delete;
    ComScope& operator=(const ComScope&) = delete;

    // S_OK, S_FALSE (already entered) or the failure.
    HRESULT Result() const noexcept { return result_; }
    explicit operator bool() const noexcept { return SUCCEEDED(result_); }

private:
    HRESULT result_;
};

}  // namespace tav
