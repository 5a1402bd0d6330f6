#pragma once
#include <cstdio>
#include <string>
#include <string_view>

#include "core/text/convert.h"
#include "core/text/ole_string.h"

namespace tav::text::test {

// Test tables are written in ASCII; the code under test sees OLECHAR text.
inline OleString W(std::string_view ascii) {
    return Widen(ascii);
}

inline std::string N(OleStringView text) {
    return Narrow(text);
}

// The C libraries whose sscanf and snprintf the differential tests trust:
// glibc, and MinGW-w64's own C99 stdio, which libstdc++ always selects for
// C++ (msvcrt's sscanf reads overflow, EOF and scan sets its own way).
#if defined(__GLIBC__)
inline constexpr bool kGlibc = true;
inline constexpr bool kMingwStdio = false;
#elif defined(__MINGW32__) && defined(__USE_MINGW_ANSI_STDIO) && __USE_MINGW_ANSI_STDIO
inline constexpr bool kGlibc = false;
inline constexpr bool kMingwStdio = true;
#else
inline constexpr bool kGlibc = false;
inline constexpr bool kMingwStdio = false;
#endif

}  // namespace tav::text::test
