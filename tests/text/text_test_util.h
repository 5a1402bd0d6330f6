#pragma once
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

// The C library the differential tests compare with, and what may be
// compared with it.
#if defined(__GLIBC__)
inline constexpr bool kGlibc = true;
#else
inline constexpr bool kGlibc = false;
#endif

}  // namespace tav::text::test
