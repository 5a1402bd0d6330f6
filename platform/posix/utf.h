// UTF-16 <-> UTF-8 for file names and the registry file. Unpaired surrogates
// survive a round trip (encoded as three bytes each, as WTF-8 does), so any
// registry name or value can be written and read back.
#pragma once
#include <string>
#include <string_view>

namespace tav::posix {

std::string ToUtf8(std::u16string_view text);
// Malformed bytes become U+FFFD; `valid`, when given, tells whether there were
// any. Encoded surrogates count as malformed only when `strict`.
std::u16string FromUtf8(std::string_view text, bool* valid = nullptr, bool strict = false);

}  // namespace tav::posix
