#include "sim/arguments.h"

namespace tav::sim {
namespace {

// "-Name" starts a key; "-1" is a negative number.
bool StartsKey(TextView rest) { return rest.size() >= 2 && rest[0] == OLECHAR('-') && !IsDigit(rest[1]); }

TextView SkipBlanks(TextView rest) {
    while (!rest.empty() && IsBlank(rest.front())) {
        rest.remove_prefix(1);
    }
    return rest;
}

TextView TakeWord(TextView& rest) {
    std::size_t n = 0;
    while (n < rest.size() && !IsBlank(rest[n])) {
        ++n;
    }
    const TextView word = rest.substr(0, n);
    rest.remove_prefix(n);
    return word;
}

}  // namespace

std::optional<Arguments> Arguments::Parse(TextView text) {
    Arguments arguments;
    TextView rest = SkipBlanks(text);
    while (!rest.empty()) {
        if (!StartsKey(rest)) {
            return std::nullopt;
        }
        rest.remove_prefix(1);
        Text key(TakeWord(rest));
        rest = SkipBlanks(rest);
        Text value;
        if (!rest.empty() && rest.front() == OLECHAR('"')) {
            const std::size_t close = rest.find(OLECHAR('"'), 1);
            if (close == TextView::npos) {
                return std::nullopt;
            }
            value = Text(rest.substr(1, close - 1));
            rest.remove_prefix(close + 1);
        } else if (!rest.empty() && !StartsKey(rest)) {
            value = Text(TakeWord(rest));
        }
        arguments.pairs_.emplace_back(std::move(key), std::move(value));
        rest = SkipBlanks(rest);
    }
    return arguments;
}

std::optional<TextView> Arguments::Find(TextView key) const {
    if (!key.empty() && key.front() == OLECHAR('-')) {
        key.remove_prefix(1);
    }
    for (const auto& [name, value] : pairs_) {
        if (name == key) {
            return TextView(value);
        }
    }
    return std::nullopt;
}

std::optional<std::uint32_t> Arguments::Unsigned(TextView key) const {
    const auto value = Find(key);
    return value ? ParseUnsigned(*value) : std::nullopt;
}

std::optional<std::int32_t> Arguments::Signed(TextView key) const {
    const auto value = Find(key);
    return value ? ParseSigned(*value) : std::nullopt;
}

}  // namespace tav::sim
