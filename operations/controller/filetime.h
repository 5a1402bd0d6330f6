#pragma once
#include <cstdint>

#include "tav/platform.h"

namespace tav {

// The controller keeps time as unsigned 32-bit seconds since 1970-01-01 UTC;
// the interface speaks FILETIME, 100 ns ticks since 1601-01-01 UTC.
inline constexpr uint64_t kUnixEpochTicks = 116444736000000000ull;
inline constexpr uint64_t kTicksPerSecond = 10000000ull;
inline constexpr uint64_t kLastControllerTicks = kUnixEpochTicks + 4294967295ull * kTicksPerSecond;

inline uint64_t TicksOf(const FILETIME& time) {
    return (static_cast<uint64_t>(time.dwHighDateTime) << 32) | time.dwLowDateTime;
}

inline FILETIME FileTimeOf(uint64_t ticks) {
    return FILETIME{static_cast<DWORD>(ticks & 0xFFFFFFFFu), static_cast<DWORD>(ticks >> 32)};
}

inline FILETIME FileTimeFromControllerSeconds(uint32_t seconds) {
    return FileTimeOf(seconds * kTicksPerSecond + kUnixEpochTicks);
}

}  // namespace tav
