#include "core/text/convert.h"

#include "tav/utf8.h"

namespace tav::text {

OleString Widen(std::string_view utf8) { return utf8::ToOle(utf8); }

OleString Widen(const char* utf8) { return utf8 == nullptr ? OleString() : utf8::ToOle(utf8); }

std::string Narrow(OleStringView text) { return utf8::FromOle(text); }

}  // namespace tav::text
