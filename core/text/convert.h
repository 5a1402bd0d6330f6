#pragma once
#include <cstddef>
#include <string>
#include <string_view>

#include "core/text/ole_string.h"
#include "tav/utf8.h"

namespace tav::text {

// UTF-8 (so also plain ASCII) to OLECHAR text. Each malformed part of the
// input becomes one U+FFFD, as Unicode recommends; a null pointer is empty.
OleString Widen(std::string_view utf8);
OleString Widen(const char* utf8);

// OLECHAR text to UTF-8; an unpaired surrogate becomes U+FFFD.
std::string Narrow(OleStringView text);

namespace detail {

using utf8::NextCodePoint;
using utf8::ToUtf16;
using utf8::Utf16Units;

}  // namespace detail
}  // namespace tav::text
