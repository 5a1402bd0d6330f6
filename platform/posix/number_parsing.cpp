// VarUI4FromStr as OLE Automation parses numbers in an English locale:
// blanks around, a sign, thousands separators, a fraction and an exponent,
// or "&H"/"&O" for hexadecimal/octal; fractions round half to even.
#include <algorithm>
#include <cstdint>
#include <string>

#include "tav/com_api.h"

namespace {

constexpr std::uint64_t largestUI4 = 0xFFFFFFFFu;

bool IsBlank(OLECHAR c) { return c == u' ' || c == u'\t' || c == u'\r' || c == u'\n'; }
bool IsDigit(OLECHAR c) { return c >= u'0' && c <= u'9'; }

int DigitValue(OLECHAR c, int base) {
    int value = -1;
    if (c >= u'0' && c <= u'9') value = c - u'0';
    else if (c >= u'a' && c <= u'f') value = c - u'a' + 10;
    else if (c >= u'A' && c <= u'F') value = c - u'A' + 10;
    return value < base ? value : -1;
}

const OLECHAR* SkipBlanks(const OLECHAR* p) {
    while (IsBlank(*p)) ++p;
    return p;
}

HRESULT ParseRadix(const OLECHAR* p, int base, ULONG* out) {
    std::uint64_t value = 0;
    const OLECHAR* first = p;
    for (int digit; (digit = DigitValue(*p, base)) >= 0; ++p) {
        value = value * base + digit;
        if (value > largestUI4) return DISP_E_OVERFLOW;
    }
    if (p == first || *SkipBlanks(p) != 0) return DISP_E_TYPEMISMATCH;
    *out = static_cast<ULONG>(value);
    return S_OK;
}

// Rounds digits * 10^exponent (digits without leading zeros) half to even.
HRESULT RoundDecimal(const std::string& digits, long exponent, bool negative, ULONG* out) {
    long integerDigits = static_cast<long>(digits.size()) + exponent;
    if (digits.empty()) {
        *out = 0;
        return S_OK;
    }
    if (integerDigits > 10) return DISP_E_OVERFLOW;
    std::uint64_t value = 0;
    for (long i = 0; i < integerDigits; ++i)
        value = value * 10 + (i < static_cast<long>(digits.size()) ? digits[i] - '0' : 0);
    int firstDropped = 0;
    bool restNonZero = false;
    if (integerDigits >= 0 && integerDigits < static_cast<long>(digits.size())) {
        firstDropped = digits[integerDigits] - '0';
        restNonZero = digits.find_first_not_of('0', integerDigits + 1) != std::string::npos;
    } else if (integerDigits < 0) {
        restNonZero = true;
    }
    if (firstDropped > 5 || (firstDropped == 5 && (restNonZero || value % 2 == 1))) ++value;
    if (negative && value != 0) return DISP_E_OVERFLOW;
    if (value > largestUI4) return DISP_E_OVERFLOW;
    *out = static_cast<ULONG>(value);
    return S_OK;
}

HRESULT ParseDecimal(const OLECHAR* p, ULONG* out) {
    bool negative = false;
    if (*p == u'+' || *p == u'-') negative = *p++ == u'-';
    std::string digits;
    long exponent = 0;
    bool sawDigit = false;
    for (; IsDigit(*p) || (*p == u',' && sawDigit); ++p) {
        if (*p == u',') continue;
        sawDigit = true;
        if (!digits.empty() || *p != u'0') digits += static_cast<char>(*p);
    }
    if (*p == u'.') {
        for (++p; IsDigit(*p); ++p) {
            sawDigit = true;
            if (!digits.empty() || *p != u'0') digits += static_cast<char>(*p);
            --exponent;
        }
    }
    if (!sawDigit) return DISP_E_TYPEMISMATCH;
    if (*p == u'e' || *p == u'E') {
        ++p;
        bool negativeExponent = false;
        if (*p == u'+' || *p == u'-') negativeExponent = *p++ == u'-';
        if (!IsDigit(*p)) return DISP_E_TYPEMISMATCH;
        long written = 0;
        for (; IsDigit(*p); ++p) written = std::min(written * 10 + (*p - u'0'), 1000000L);
        exponent += negativeExponent ? -written : written;
    }
    if (*SkipBlanks(p) != 0) return DISP_E_TYPEMISMATCH;
    return RoundDecimal(digits, exponent, negative, out);
}

}  // namespace

extern "C" HRESULT VarUI4FromStr(OLECHAR* strIn, LCID, ULONG, ULONG* pulOut) {
    if (strIn == nullptr || pulOut == nullptr) return E_INVALIDARG;
    const OLECHAR* p = SkipBlanks(strIn);
    if (p[0] == u'&' && (p[1] == u'H' || p[1] == u'h')) return ParseRadix(p + 2, 16, pulOut);
    if (p[0] == u'&' && (p[1] == u'O' || p[1] == u'o')) return ParseRadix(p + 2, 8, pulOut);
    return ParseDecimal(p, pulOut);
}
