// tav::CriticalSection owns a CRITICAL_SECTION (recursive, as on Windows);
// tav::CriticalSectionLock holds one for a scope. CriticalSection also meets
// the standard Lockable requirements, for std::unique_lock and friends.
#pragma once
#include "tav/platform.h"

namespace tav {

class CriticalSection {
public:
    CriticalSection() noexcept { InitializeCriticalSection(&section_); }
    CriticalSection(const CriticalSection&) = delete;
    CriticalSection& operator=(const CriticalSection&) = delete;
    ~CriticalSection() { DeleteCriticalSection(&section_); }

    void Enter() noexcept { EnterCriticalSection(&section_); }
    bool TryEnter() noexcept { return TryEnterCriticalSection(&section_) != FALSE; }
    void Leave() noexcept { LeaveCriticalSection(&section_); }

    void lock() noexcept { Enter(); }
    bool try_lock() noexcept { return TryEnter(); }
    void unlock() noexcept { Leave(); }

    CRITICAL_SECTION* Native() noexcept { return &section_; }

private:
    CRITICAL_SECTION section_;
};

class CriticalSectionLock {
public:
    explicit CriticalSectionLock(CriticalSection& section) noexcept : CriticalSectionLock(*section.Native()) {}
    explicit CriticalSectionLock(CRITICAL_SECTION& section) noexcept : section_(&section) {
        EnterCriticalSection(section_);
    }
    CriticalSectionLock(const CriticalSectionLock&) = delete;
    CriticalSectionLock& operator=(const CriticalSectionLock&) = delete;
    ~CriticalSectionLock() { LeaveCriticalSection(section_); }

private:
    CRITICAL_SECTION* section_;
};

}  // namespace tav
