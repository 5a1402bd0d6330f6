#include "core/text/number.h"

#include <limits>

#include "core/text/char_class.h"

namespace tav::text {
namespace detail {

Magnitude ReadDigits(const OLECHAR* first, const OLECHAR* last) noexcept {
    constexpr std::uint64_t kMax = std::numeric_limits<std::uint64_t>::max();
    // Nineteen digits always fit, so most numbers need no overflow check.
    constexpr std::ptrdiff_t kAlwaysFits = 19;
    Magnitude m;
    const OLECHAR* const safeEnd = last - first > kAlwaysFits ? first + kAlwaysFits : last;
    for (; first != safeEnd && IsDigit(*first); ++first) {
        m.value = m.value * 10 + static_cast<std::uint64_t>(*first - u'0');
    }
    for (; first != last && IsDigit(*first); ++first) {
        const auto digit = static_cast<std::uint64_t>(*first - u'0');
        if (m.overflow || m.value > (kMax - digit) / 10) {
            m.overflow = true;
            m.value = kMax;
        } else {
            m.value = m.value * 10 + digit;
        }
    }
    m.end = first;
    return m;
}

}  // namespace detail

namespace {

struct SignedDigits {
    bool negative = false;
    detail::Magnitude magnitude;
    std::size_t end = 0;  // 0 when there were no digits
};

SignedDigits ReadSignedDigits(OleStringView text) noexcept {
    text = UpToNul(text);
    const OLECHAR* const begin = text.data();
    const OLECHAR* const last = begin + text.size();
    const OLECHAR* p = begin;
    while (p != last && IsSpace(*p)) {
        ++p;
    }
    SignedDigits result;
    if (p != last && (*p == u'-' || *p == u'+')) {
        result.negative = *p == u'-';
        ++p;
    }
    result.magnitude = detail::ReadDigits(p, last);
    if (result.magnitude.end != p) {
        result.end = static_cast<std::size_t>(result.magnitude.end - begin);
    }
    return result;
}

}  // namespace

ParsedNumber<std::int32_t> StrToLong(OleStringView text) noexcept {
    const SignedDigits digits = ReadSignedDigits(text);
    ParsedNumber<std::int32_t> result;
    result.end = digits.end;
    const std::uint64_t m = digits.magnitude.value;
    const std::uint64_t limit = digits.negative ? std::uint64_t{1} << 31 : (std::uint64_t{1} << 31) - 1;
    if (digits.magnitude.overflow || m > limit) {
        result.overflow = true;
        result.value = digits.negative ? std::numeric_limits<std::int32_t>::min()
                                       : std::numeric_limits<std::int32_t>::max();
    } else {
        const auto low = static_cast<std::uint32_t>(digits.negative ? 0 - m : m);
        result.value = static_cast<std::int32_t>(low);
    }
    return result;
}

ParsedNumber<std::uint32_t> StrToULong(OleStringView text) noexcept {
    const SignedDigits digits = ReadSignedDigits(text);
    ParsedNumber<std::uint32_t> result;
    result.end = digits.end;
    const std::uint64_t m = digits.magnitude.value;
    if (digits.magnitude.overflow || m > std::numeric_limits<std::uint32_t>::max()) {
        result.overflow = true;
        result.value = std::numeric_limits<std::uint32_t>::max();
    } else {
        result.value = static_cast<std::uint32_t>(digits.negative ? 0 - m : m);
    }
    return result;
}

}  // namespace tav::text
