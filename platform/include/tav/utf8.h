// UTF-8 <-> OLECHAR (UTF-16) text, the same on every platform. Each malformed
// part of UTF-8 input, and each unpaired surrogate, becomes one U+FFFD.
#pragma once
#include <cstddef>
#include <string>
#include <string_view>

#include "tav/platform.h"

namespace tav::utf8 {

inline constexpr char32_t kReplacement = 0xFFFD;

// Reads one code point, advancing p. The second byte's range rules out
// overlong forms, surrogates and values above U+10FFFF.
inline char32_t NextCodePoint(const char*& p, const char* last) noexcept {
    auto in = [](unsigned char c, unsigned char lo, unsigned char hi) { return c >= lo && c <= hi; };
    const auto lead = static_cast<unsigned char>(*p++);
    if (lead < 0x80) {
        return lead;
    }
    std::size_t more = 0;
    unsigned char lo = 0x80;
    unsigned char hi = 0xBF;
    char32_t value = 0;
    if (in(lead, 0xC2, 0xDF)) {
        more = 1;
        value = lead & 0x1Fu;
    } else if (in(lead, 0xE0, 0xEF)) {
        more = 2;
        value = lead & 0x0Fu;
        lo = lead == 0xE0 ? 0xA0 : 0x80;
        hi = lead == 0xED ? 0x9F : 0xBF;
    } else if (in(lead, 0xF0, 0xF4)) {
        more = 3;
        value = lead & 0x07u;
        lo = lead == 0xF0 ? 0x90 : 0x80;
        hi = lead == 0xF4 ? 0x8F : 0xBF;
    } else {
        return kReplacement;
    }
    for (; more > 0; --more) {
        if (p == last || !in(static_cast<unsigned char>(*p), lo, hi)) {
            return kReplacement;
        }
        value = (value << 6) | (static_cast<unsigned char>(*p++) & 0x3Fu);
        lo = 0x80;
        hi = 0xBF;
    }
    return value;
}

// The UTF-16 form of a code point: one unit, or a surrogate pair.
struct Utf16Units {
    OLECHAR unit[2];
    std::size_t count;
};

inline Utf16Units ToUtf16(char32_t c) noexcept {
    if (c < 0x10000) {
        return {{static_cast<OLECHAR>(c), 0}, 1};
    }
    c -= 0x10000;
    return {{static_cast<OLECHAR>(0xD800 + (c >> 10)), static_cast<OLECHAR>(0xDC00 + (c & 0x3FF))}, 2};
}

inline std::basic_string<OLECHAR> ToOle(std::string_view text) {
    std::basic_string<OLECHAR> out;
    out.reserve(text.size());
    const char* p = text.data();
    const char* const last = p + text.size();
    while (p != last) {
        const Utf16Units units = ToUtf16(NextCodePoint(p, last));
        out.append(units.unit, units.count);
    }
    return out;
}

inline std::string FromOle(std::basic_string_view<OLECHAR> text) {
    std::string out;
    out.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t c = static_cast<char16_t>(text[i]);
        if (c >= 0xD800 && c <= 0xDFFF) {
            const bool paired = c <= 0xDBFF && i + 1 < text.size() && static_cast<char16_t>(text[i + 1]) >= 0xDC00 &&
                                static_cast<char16_t>(text[i + 1]) <= 0xDFFF;
            c = paired ? 0x10000 + ((c - 0xD800) << 10) + (static_cast<char16_t>(text[++i]) - 0xDC00) : kReplacement;
        }
        if (c < 0x80) {
            out += static_cast<char>(c);
        } else if (c < 0x800) {
            out += static_cast<char>(0xC0 | (c >> 6));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else if (c < 0x10000) {
            out += static_cast<char>(0xE0 | (c >> 12));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else {
            out += static_cast<char>(0xF0 | (c >> 18));
            out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        }
    }
    return out;
}

}  // namespace tav::utf8
