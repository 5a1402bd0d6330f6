#include "tavctl/text.h"

#include <cctype>
#include <cstdint>

namespace tavctl {

OleText ToOle(std::string_view utf8) {
    OleText text;
    for (std::size_t i = 0; i < utf8.size();) {
        const auto byte = static_cast<unsigned char>(utf8[i]);
        std::uint32_t code = byte;
        std::size_t length = 1;
        if (byte >= 0xF0) {
            length = 4;
            code = byte & 0x07;
        } else if (byte >= 0xE0) {
            length = 3;
            code = byte & 0x0F;
        } else if (byte >= 0xC0) {
            length = 2;
            code = byte & 0x1F;
        }
        if (i + length > utf8.size()) {
            length = 1;  // a cut sequence: take the byte as Latin-1
            code = byte;
        } else {
            for (std::size_t k = 1; k < length; ++k) {
                code = (code << 6) | (static_cast<unsigned char>(utf8[i + k]) & 0x3F);
            }
        }
        if (code >= 0x10000) {
            code -= 0x10000;
            text.push_back(static_cast<OLECHAR>(0xD800 + (code >> 10)));
            text.push_back(static_cast<OLECHAR>(0xDC00 + (code & 0x3FF)));
        } else {
            text.push_back(static_cast<OLECHAR>(code));
        }
        i += length;
    }
    return text;
}

std::string ToUtf8(OleView text) {
    std::string out;
    for (std::size_t i = 0; i < text.size(); ++i) {
        std::uint32_t c = static_cast<std::uint16_t>(text[i]);
        if (c >= 0xD800 && c < 0xDC00 && i + 1 < text.size()) {
            const std::uint32_t low = static_cast<std::uint16_t>(text[i + 1]);
            if (low >= 0xDC00 && low < 0xE000) {
                c = 0x10000 + ((c - 0xD800) << 10) + (low - 0xDC00);
                ++i;
            }
        }
        if (c < 0x80) {
            out.push_back(static_cast<char>(c));
        } else if (c < 0x800) {
            out.push_back(static_cast<char>(0xC0 | (c >> 6)));
            out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
        } else if (c < 0x10000) {
            out.push_back(static_cast<char>(0xE0 | (c >> 12)));
            out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
            out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
        } else {
            out.push_back(static_cast<char>(0xF0 | (c >> 18)));
            out.push_back(static_cast<char>(0x80 | ((c >> 12) & 0x3F)));
            out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
            out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
        }
    }
    return out;
}

std::string ToUtf8(BSTR text) { return text == nullptr ? std::string() : ToUtf8(OleView(text, SysStringLen(text))); }

std::string Lower(std::string_view text) {
    std::string lower(text);
    for (char& c : lower) {
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    return lower;
}

}  // namespace tavctl
