// The controller keeps names, identifiers and the language in one byte per
// character, so texts sent for them must stay within Latin-1.
#pragma once
#include <algorithm>

#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

// The result for a text the controller could not store.
inline constexpr HRESULT kTextNotLatin1 = static_cast<HRESULT>(0xC0040408);

inline bool IsLatin1(OleStringView text) {
    return std::all_of(text.begin(), text.end(), [](OLECHAR c) { return c <= 0xFF; });
}

}  // namespace tav
