#pragma once
#include <optional>
#include <utility>
#include <vector>

#include "sim/text.h"

namespace tav::sim {

// The key-value pairs of a command's argument text: "-Key value", where the
// value is a bare word, a number (also negative), or a text in double quotes
// that may hold blanks. A key followed directly by another key (or by the end)
// is a flag with an empty value.
class Arguments {
public:
    // Empty when the text is not a sequence of such pairs (a word without a
    // key, an unterminated quote).
    static std::optional<Arguments> Parse(TextView text);

    // The value of the first pair with exactly this key.
    std::optional<TextView> Find(TextView key) const;
    std::optional<std::uint32_t> Unsigned(TextView key) const;
    std::optional<std::int32_t> Signed(TextView key) const;
    bool Has(TextView key) const { return Find(key).has_value(); }
    bool Empty() const { return pairs_.empty(); }

private:
    std::vector<std::pair<Text, Text>> pairs_;
};

}  // namespace tav::sim
