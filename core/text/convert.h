#pragma once
#include <cstddef>
#include <string>
#include <string_view>

#include "core/text/ole_string.h"

namespace tav::text {

// UTF-8 (so also plain ASCII) to OLECHAR text. Each malformed part of the
// input becomes one U+FFFD, as Unicode recommends; a null pointer is empty.
OleString Widen(std::string_view utf8);
OleString Widen(const char* utf8);

// OLECHAR text to UTF-8; an unpaired surrogate becomes U+FFFD.
std::string Narrow(OleStringView text);

namespace detail {

// Reads one code point from UTF-8, advancing p; malformed input gives U+FFFD.
char32_t NextCodePoint(const char*& p, const char* last) noexcept;

// The UTF-16 form of a code point: one unit, or a surrogate pair.
struct Utf16Units {
    OLECHAR unit[2];
    std::size_t count;
};
Utf16Units ToUtf16(char32_t c) noexcept;

}  // namespace detail
}  // namespace tav::text
