#pragma once
#include <string>
#include <string_view>

#include "tav/platform.h"

namespace tavctl {

using OleText = std::basic_string<OLECHAR>;
using OleView = std::basic_string_view<OLECHAR>;

// UTF-8 of the command line to 16-bit text and back.
OleText ToOle(std::string_view utf8);
std::string ToUtf8(OleView text);
std::string ToUtf8(BSTR text);  // NULL is the empty text

std::string Lower(std::string_view text);

}  // namespace tavctl
