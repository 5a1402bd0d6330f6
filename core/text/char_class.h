#pragma once
#include "core/text/ole_string.h"

namespace tav::text {

// The "C" locale's classes, applied to 16-bit units: only ASCII characters
// belong to them, so the result never depends on a locale or a platform.
constexpr bool IsSpace(OLECHAR c) noexcept {
    return c == u' ' || (c >= u'\t' && c <= u'\r');
}

constexpr bool IsDigit(OLECHAR c) noexcept {
    return c >= u'0' && c <= u'9';
}

constexpr OLECHAR ToLowerAscii(OLECHAR c) noexcept {
    return (c >= u'A' && c <= u'Z') ? static_cast<OLECHAR>(c + (u'a' - u'A')) : c;
}

// Input ends at the first NUL, as it does for the C library.
constexpr OleStringView UpToNul(OleStringView text) noexcept {
    const auto nul = text.find(OLECHAR{0});
    return nul == OleStringView::npos ? text : text.substr(0, nul);
}

}  // namespace tav::text
