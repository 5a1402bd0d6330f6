#include "core/text/convert.h"

namespace tav::text {
namespace detail {
namespace {

constexpr char32_t kReplacement = 0xFFFD;

bool InRange(unsigned char c, unsigned char lo, unsigned char hi) noexcept {
    return c >= lo && c <= hi;
}

}  // namespace

char32_t NextCodePoint(const char*& p, const char* last) noexcept {
    const auto lead = static_cast<unsigned char>(*p++);
    if (lead < 0x80) {
        return lead;
    }
    // The second byte's range rules out overlong forms, surrogates and
    // values above U+10FFFF; later bytes are plain continuation bytes.
    std::size_t more = 0;
    unsigned char lo = 0x80;
    unsigned char hi = 0xBF;
    char32_t value = 0;
    if (InRange(lead, 0xC2, 0xDF)) {
        more = 1;
        value = lead & 0x1Fu;
    } else if (InRange(lead, 0xE0, 0xEF)) {
        more = 2;
        value = lead & 0x0Fu;
        lo = lead == 0xE0 ? 0xA0 : 0x80;
        hi = lead == 0xED ? 0x9F : 0xBF;
    } else if (InRange(lead, 0xF0, 0xF4)) {
        more = 3;
        value = lead & 0x07u;
        lo = lead == 0xF0 ? 0x90 : 0x80;
        hi = lead == 0xF4 ? 0x8F : 0xBF;
    } else {
        return kReplacement;
    }
    for (; more > 0; --more) {
        if (p == last || !InRange(static_cast<unsigned char>(*p), lo, hi)) {
            return kReplacement;
        }
        value = (value << 6) | (static_cast<unsigned char>(*p++) & 0x3Fu);
        lo = 0x80;
        hi = 0xBF;
    }
    return value;
}

Utf16Units ToUtf16(char32_t c) noexcept {
    if (c < 0x10000) {
        return {{static_cast<OLECHAR>(c), 0}, 1};
    }
    c -= 0x10000;
    return {{static_cast<OLECHAR>(0xD800 + (c >> 10)), static_cast<OLECHAR>(0xDC00 + (c & 0x3FF))}, 2};
}

}  // namespace detail

OleString Widen(std::string_view utf8) {
    OleString out;
    out.reserve(utf8.size());
    const char* p = utf8.data();
    const char* const last = p + utf8.size();
    while (p != last) {
        const detail::Utf16Units units = detail::ToUtf16(detail::NextCodePoint(p, last));
        out.append(units.unit, units.count);
    }
    return out;
}

OleString Widen(const char* utf8) {
    return utf8 == nullptr ? OleString() : Widen(std::string_view(utf8));
}

std::string Narrow(OleStringView text) {
    std::string out;
    out.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t c = text[i];
        if (c >= 0xD800 && c <= 0xDFFF) {
            const bool paired = c <= 0xDBFF && i + 1 < text.size() && text[i + 1] >= 0xDC00 && text[i + 1] <= 0xDFFF;
            if (paired) {
                c = 0x10000 + ((c - 0xD800) << 10) + (static_cast<char32_t>(text[++i]) - 0xDC00);
            } else {
                c = 0xFFFD;
            }
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

}  // namespace tav::text
