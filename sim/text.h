#pragma once
#include <concepts>
#include <initializer_list>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "tav/platform.h"

// Text as the virtual controller keeps it: 16-bit units, as on the wire.
namespace tav::sim {

using Text = std::basic_string<OLECHAR>;
using TextView = std::basic_string_view<OLECHAR>;

// The pieces one after the other, in one allocation.
Text Concat(std::initializer_list<TextView> pieces);

// Latin-1 bytes to text; what the controller writes into its replies.
Text Widen(std::string_view bytes);

// Text to UTF-8, for people and logs.
std::string Narrow(TextView text);

template <std::integral T>
Text Decimal(T value) {
    return Widen(std::to_string(value));
}

// Whole-text decimal numbers; nothing else may follow the digits.
std::optional<std::uint32_t> ParseUnsigned(TextView text);
std::optional<std::int32_t> ParseSigned(TextView text);

bool EqualsIgnoringCase(TextView a, TextView b);
bool IsBlank(OLECHAR c);
inline bool IsDigit(OLECHAR c) { return c >= OLECHAR('0') && c <= OLECHAR('9'); }
TextView Trim(TextView text);

// The text in double quotes, as the controller quotes names in its texts.
Text Quoted(TextView text);

// The controller's error texts end in "; ", so that what a client appends to
// them stays readable; adds it where it is missing.
Text ErrorText(TextView text);

// A NULL BSTR is the empty text.
Text FromBstr(BSTR text);

}  // namespace tav::sim
