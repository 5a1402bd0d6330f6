#pragma once
#include <cstddef>
#include <cstdint>

#include "core/text/ole_string.h"

namespace tav::text {

template <typename T>
struct ParsedNumber {
    T value = 0;
    // Index just past the last digit; 0 when no digit was found, so that a
    // caller can tell "0" from nothing, as with the end pointer of wcstol.
    std::size_t end = 0;
    // The text's value lay outside T and was clamped.
    bool overflow = false;
};

// wcstol(text, &end, 10) as on the original 32-bit target, where long has 32
// bits: leading white space, an optional sign, then decimal digits up to the
// first non-digit. A value outside INT32_MIN..INT32_MAX is clamped to the
// nearer limit and flagged. The text ends at its first NUL.
ParsedNumber<std::int32_t> StrToLong(OleStringView text) noexcept;

// wcstoul(text, &end, 10) with a 32-bit unsigned long: as StrToLong, but a
// minus sign negates modulo 2^32 ("-1" gives 4294967295), and a magnitude
// above UINT32_MAX gives UINT32_MAX, flagged, whatever the sign.
ParsedNumber<std::uint32_t> StrToULong(OleStringView text) noexcept;

namespace detail {

// Decimal digits read into 64 bits, stopping the growth at UINT64_MAX.
struct Magnitude {
    std::uint64_t value = 0;
    bool overflow = false;
    const OLECHAR* end = nullptr;
};

Magnitude ReadDigits(const OLECHAR* first, const OLECHAR* last) noexcept;

}  // namespace detail
}  // namespace tav::text
