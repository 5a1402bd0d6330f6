#include "tavctl/text.h"
#include "tav/utf8.h"

#include <cctype>
#include <cstdint>

namespace tavctl {

OleText ToOle(std::string_view utf8) { return tav::utf8::ToOle(utf8); }

std::string ToUtf8(OleView text) { return tav::utf8::FromOle(text); }

std::string ToUtf8(BSTR text) { return text == nullptr ? std::string() : ToUtf8(OleView(text, SysStringLen(text))); }

std::string Lower(std::string_view text) {
    std::string lower(text);
    for (char& c : lower) {
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    return lower;
}

}  // namespace tavctl
