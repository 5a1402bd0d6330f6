#pragma once
#include <cstddef>

#include "core/text/ole_string.h"

namespace tav::text::detail {

struct FloatField {
    bool matched = false;   // false: a matching failure
    std::size_t length = 0; // characters consumed, also on a matching failure
    double value = 0.0;
};

// Reads a %lf field from [first, last), which is not empty: what glibc's
// scanf consumes (including a dangling exponent such as the "e" of "1e,"),
// converted as strtod converts it.
FloatField ReadFloatField(const OLECHAR* first, const OLECHAR* last) noexcept;

}  // namespace tav::text::detail
