#include "tavctl/verb.h"

namespace tavctl {

std::string Verb::Name() const {
    return *entry.name == '\0' ? std::string(group.name) : std::string(group.name) + " " + entry.name;
}

std::optional<std::string> Verb::Option(const char* name) {
    bool missing = false;
    auto value = args_.Option(name, missing);
    if (missing) {
        throw UsageError{std::string(name) + " needs a value"};
    }
    return value;
}

std::string Verb::Word(const char* what) {
    auto word = args_.Next();
    if (!word) {
        throw UsageError{std::string(what) + " missing"};
    }
    return *word;
}

void Verb::End() {
    if (auto extra = args_.Next()) {
        throw UsageError{"unexpected argument " + Quote(*extra)};
    }
}

long Verb::EnumValue(const char* what, const std::string& word, std::span<const EnumName> names,
                     std::span<const EnumName> aliases) {
    if (auto value = ValueOf(names, word)) {
        return *value;
    }
    if (auto value = ValueOf(aliases, word)) {
        return *value;
    }
    if (const auto number = ParseWhole(word, true);
        number && *number >= static_cast<long double>(std::numeric_limits<LONG>::min()) &&
        *number <= static_cast<long double>(std::numeric_limits<LONG>::max())) {
        return static_cast<long>(*number);
    }
    std::string known = NameList(names);
    if (!aliases.empty()) {
        known = NameList(aliases) + "; " + known;
    }
    throw UsageError{"unknown " + std::string(what) + " " + Quote(word) + " (" + known + ", or a number)"};
}

std::optional<long double> Verb::ParseWhole(const std::string& word, bool allowMinus) {
    if (word.empty() || word.size() > 24) {
        return std::nullopt;
    }
    const bool negative = word[0] == '-';
    if ((negative && !allowMinus) || word[0] == '+' || std::isspace(static_cast<unsigned char>(word[0]))) {
        return std::nullopt;
    }
    const char* digits = word.c_str() + (negative ? 1 : 0);
    if (*digits == '\0' || *digits == '-' || *digits == '+' || std::isspace(static_cast<unsigned char>(*digits))) {
        return std::nullopt;
    }
    errno = 0;
    char* end = nullptr;
    const unsigned long long magnitude = std::strtoull(digits, &end, 0);
    if (*end != '\0' || errno == ERANGE) {
        return std::nullopt;
    }
    const long double value = static_cast<long double>(magnitude);
    return negative ? -value : value;
}

}  // namespace tavctl
