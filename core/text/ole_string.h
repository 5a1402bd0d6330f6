#pragma once
#include <string>
#include <string_view>

#include "tav/platform.h"

namespace tav {

// Text as COM carries it: 16-bit units, whatever the platform's wchar_t is.
using OleString = std::basic_string<OLECHAR>;
using OleStringView = std::basic_string_view<OLECHAR>;

// A NULL BSTR or LPCOLESTR is an empty text, never a crash.
inline OleStringView ViewOf(const OLECHAR* text) noexcept {
    return text == nullptr ? OleStringView() : OleStringView(text);
}

}  // namespace tav
