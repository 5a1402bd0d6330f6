#include "core/text/float_field.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <limits>
#include <system_error>

#include "core/text/char_class.h"
#include "core/text/number.h"

namespace tav::text::detail {
namespace {

// Enough significant digits to round every double correctly; the digits
// beyond only matter as "something non-zero follows", kept as one more digit.
constexpr std::size_t kSignificantDigits = 800;
// Far outside the range of double, so clamping an exponent changes nothing.
constexpr std::int64_t kExponentLimit = 100000;
// Written exponents are clamped before the position of the decimal point is
// added, which can itself be as large as the input is long.
constexpr std::uint64_t kWrittenExponentLimit = 1000000000000000;

bool StartsWithWord(const OLECHAR* p, const OLECHAR* last, std::u16string_view lowerWord) noexcept {
    if (static_cast<std::size_t>(last - p) < lowerWord.size()) {
        return false;
    }
    return std::equal(lowerWord.begin(), lowerWord.end(), p,
                      [](char16_t w, OLECHAR c) { return ToLowerAscii(c) == w; });
}

double Signed(bool negative, double magnitude) noexcept {
    return negative ? -magnitude : magnitude;
}

// The mantissa [first, last) holds digits and at most one '.', with at least
// one digit. It is rewritten as "0.<significant digits>e<exponent>" so that
// any length of input converts in a fixed buffer.
double DecimalToDouble(bool negative, const OLECHAR* first, const OLECHAR* last, std::int64_t exponent) noexcept {
    char text[kSignificantDigits + 32];
    char* out = text;
    if (negative) {
        *out++ = '-';
    }
    *out++ = '0';
    *out++ = '.';
    std::int64_t pointPosition = 0;
    std::size_t significant = 0;
    bool beforePoint = true;
    bool truncatedNonZero = false;
    for (const OLECHAR* p = first; p != last; ++p) {
        if (*p == u'.') {
            beforePoint = false;
            continue;
        }
        if (significant == 0 && *p == u'0') {
            pointPosition -= beforePoint ? 0 : 1;
            continue;
        }
        pointPosition += beforePoint ? 1 : 0;
        if (significant < kSignificantDigits) {
            *out++ = static_cast<char>(*p);
            ++significant;
        } else if (*p != u'0') {
            truncatedNonZero = true;
        }
    }
    if (significant == 0) {
        return Signed(negative, 0.0);
    }
    if (truncatedNonZero) {
        *out++ = '1';
    }
    pointPosition = std::clamp(pointPosition + exponent, -kExponentLimit, kExponentLimit);
    *out++ = 'e';
    out = std::to_chars(out, text + sizeof text, pointPosition).ptr;

    double value = 0.0;
    const auto result = std::from_chars(text, out, value, std::chars_format::general);
    if (result.ec == std::errc::result_out_of_range) {
        // 0.d... x 10^p: above 1 it overflowed, below it underflowed to zero.
        return Signed(negative, pointPosition > 0 ? HUGE_VAL : 0.0);
    }
    return value;
}

}  // namespace

FloatField ReadFloatField(const OLECHAR* first, const OLECHAR* last) noexcept {
    FloatField field;
    const OLECHAR* p = first;
    bool negative = false;
    if (*p == u'-' || *p == u'+') {
        negative = *p == u'-';
        ++p;
        if (p == last) {
            field.length = 1;
            return field;
        }
    }

    const OLECHAR lead = ToLowerAscii(*p);
    if (lead == u'n' || lead == u'i') {
        const bool nan = lead == u'n';
        if (!StartsWithWord(p, last, nan ? u"nan" : u"inf")) {
            return field;
        }
        p += 3;
        if (!nan && p != last && ToLowerAscii(*p) == u'i') {
            if (!StartsWithWord(p, last, u"inity")) {
                return field;
            }
            p += 5;
        }
        field.matched = true;
        field.length = static_cast<std::size_t>(p - first);
        field.value = nan ? std::copysign(std::numeric_limits<double>::quiet_NaN(), negative ? -1.0 : 1.0)
                          : Signed(negative, std::numeric_limits<double>::infinity());
        return field;
    }

    // What scanf takes in: digits, one '.', and after a digit an 'e' with an
    // optional sign, whether or not exponent digits follow.
    const OLECHAR* const mantissa = p;
    const OLECHAR* exponentMark = nullptr;
    bool gotDigit = false;
    bool gotDot = false;
    for (; p != last; ++p) {
        const OLECHAR c = *p;
        if (IsDigit(c)) {
            gotDigit = true;
        } else if (exponentMark != nullptr && p == exponentMark + 1 && (c == u'+' || c == u'-')) {
            // the exponent's sign
        } else if (gotDigit && exponentMark == nullptr && ToLowerAscii(c) == u'e') {
            exponentMark = p;
            gotDot = true;
        } else if (!gotDot && c == u'.') {
            gotDot = true;
        } else {
            break;
        }
    }
    field.length = static_cast<std::size_t>(p - first);
    if (!gotDigit) {
        return field;
    }

    // What strtod converts: the exponent only when it has digits.
    std::int64_t exponent = 0;
    if (exponentMark != nullptr) {
        const OLECHAR* e = exponentMark + 1;
        const bool negativeExponent = e != p && *e == u'-';
        if (e != p && (*e == u'+' || *e == u'-')) {
            ++e;
        }
        const Magnitude digits = ReadDigits(e, p);
        const auto magnitude =
            static_cast<std::int64_t>(std::min(digits.value, kWrittenExponentLimit));
        exponent = negativeExponent ? -magnitude : magnitude;
    }
    field.matched = true;
    field.value = DecimalToDouble(negative, mantissa, exponentMark != nullptr ? exponentMark : p, exponent);
    return field;
}

}  // namespace tav::text::detail
