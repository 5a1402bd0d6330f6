#include "sim/text.h"
#include "tav/utf8.h"

#include <limits>

namespace tav::sim {

Text Concat(std::initializer_list<TextView> pieces) {
    std::size_t size = 0;
    for (TextView piece : pieces) {
        size += piece.size();
    }
    Text text;
    text.reserve(size);
    for (TextView piece : pieces) {
        text.append(piece);
    }
    return text;
}

Text Widen(std::string_view bytes) {
    Text text;
    text.reserve(bytes.size());
    for (char c : bytes) {
        text.push_back(static_cast<OLECHAR>(static_cast<unsigned char>(c)));
    }
    return text;
}

std::string Narrow(TextView text) { return utf8::FromOle(text); }

namespace {

std::optional<std::uint64_t> ParseDigits(TextView digits, std::uint64_t limit) {
    if (digits.empty()) {
        return std::nullopt;
    }
    std::uint64_t value = 0;
    for (OLECHAR c : digits) {
        if (c < OLECHAR('0') || c > OLECHAR('9')) {
            return std::nullopt;
        }
        value = value * 10 + static_cast<std::uint64_t>(c - OLECHAR('0'));
        if (value > limit) {
            return std::nullopt;
        }
    }
    return value;
}

}  // namespace

std::optional<std::uint32_t> ParseUnsigned(TextView text) {
    const auto value = ParseDigits(text, std::numeric_limits<std::uint32_t>::max());
    if (!value) {
        return std::nullopt;
    }
    return static_cast<std::uint32_t>(*value);
}

std::optional<std::int32_t> ParseSigned(TextView text) {
    const bool negative = !text.empty() && text.front() == OLECHAR('-');
    if (negative) {
        text.remove_prefix(1);
    }
    const std::uint64_t limit = negative ? 2147483648ull : 2147483647ull;
    const auto value = ParseDigits(text, limit);
    if (!value) {
        return std::nullopt;
    }
    const std::int64_t signedValue = negative ? -static_cast<std::int64_t>(*value) : static_cast<std::int64_t>(*value);
    return static_cast<std::int32_t>(signedValue);
}

bool EqualsIgnoringCase(TextView a, TextView b) {
    if (a.size() != b.size()) {
        return false;
    }
    auto lower = [](OLECHAR c) { return (c >= OLECHAR('A') && c <= OLECHAR('Z')) ? OLECHAR(c + 32) : c; };
    for (std::size_t i = 0; i < a.size(); ++i) {
        if (lower(a[i]) != lower(b[i])) {
            return false;
        }
    }
    return true;
}

bool IsBlank(OLECHAR c) {
    return c == OLECHAR(' ') || c == OLECHAR('\t') || c == OLECHAR('\n') || c == OLECHAR('\r') ||
           c == OLECHAR('\v') || c == OLECHAR('\f');
}

TextView Trim(TextView text) {
    while (!text.empty() && IsBlank(text.front())) {
        text.remove_prefix(1);
    }
    while (!text.empty() && IsBlank(text.back())) {
        text.remove_suffix(1);
    }
    return text;
}

Text ErrorText(TextView text) {
    Text terminated(text);
    if (!terminated.ends_with(OLESTR("; "))) {
        terminated += OLESTR("; ");
    }
    return terminated;
}

Text FromBstr(BSTR text) {
    if (text == nullptr) {
        return Text();
    }
    return Text(text, SysStringLen(text));
}

Text Quoted(TextView text) { return Concat({OLESTR("\""), text, OLESTR("\"")}); }

}  // namespace tav::sim
