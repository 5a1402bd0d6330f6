#include "core/bstr_order.h"

#include <cwctype>

#ifndef _WIN32
#include <locale.h>
#include <wctype.h>
#endif

namespace tav {
namespace {

bool IsDigit(OLECHAR c) noexcept { return c >= u'0' && c <= u'9'; }

bool IsAsciiLetter(OLECHAR c) noexcept { return (c >= u'A' && c <= u'Z') || (c >= u'a' && c <= u'z'); }

bool IsLatin1UpperLetter(OLECHAR c) noexcept { return c >= 0xC0 && c <= 0xDE && c != 0xD7; }
bool IsLatin1LowerLetter(OLECHAR c) noexcept { return c >= 0xE0 && c <= 0xFE && c != 0xF7; }

bool IsLatin1Letter(OLECHAR c) noexcept {
    return IsAsciiLetter(c) || IsLatin1UpperLetter(c) || IsLatin1LowerLetter(c) || c == 0xAA || c == 0xB5 ||
           c == 0xBA || c == 0xDF || c == 0xFF;
}

// Above Latin-1 the platform's wide classes decide. The C locale of the GNU
// runtime knows ASCII only, so the POSIX builds ask a UTF-8 locale object,
// which leaves the process's own locale alone.
bool IsWideLetter(OLECHAR c) noexcept {
#ifdef _WIN32
    return iswalpha(static_cast<wint_t>(c)) != 0;
#else
    static const locale_t unicode = newlocale(LC_CTYPE_MASK, "C.UTF-8", locale_t{});
    if (unicode != locale_t{}) {
        return iswalpha_l(static_cast<wint_t>(c), unicode) != 0;
    }
    return iswalpha(static_cast<wint_t>(c)) != 0;
#endif
}

bool IsLetter(OLECHAR c) noexcept { return c < 0x100 ? IsLatin1Letter(c) : IsWideLetter(c); }

// The single-byte classes of the C locale: ASCII letters and digits; every
// other character, and any that does not fit in a byte, is neither.
bool IsSingleByteAlnum(OLECHAR c) noexcept { return IsAsciiLetter(c) || IsDigit(c); }

template <class Predicate>
bool All(OleStringView text, Predicate predicate) noexcept {
    for (OLECHAR c : text) {
        if (!predicate(c)) {
            return false;
        }
    }
    return true;
}

size_t PrefixLength(OleStringView text) noexcept {
    size_t length = 0;
    while (length < text.size() && !IsDigit(text[length])) {
        ++length;
    }
    return length;
}

// The digit run at the start of text, leading zeros dropped.
OleStringView SignificantDigits(OleStringView text) noexcept {
    size_t end = 0;
    while (end < text.size() && IsDigit(text[end])) {
        ++end;
    }
    size_t begin = 0;
    while (begin < end && text[begin] == u'0') {
        ++begin;
    }
    return text.substr(begin, end - begin);
}

int CompareNumbers(OleStringView a, OleStringView b) noexcept {
    const OleStringView x = SignificantDigits(a);
    const OleStringView y = SignificantDigits(b);
    if (x.size() != y.size()) {
        return x.size() < y.size() ? -1 : 1;
    }
    return x.compare(y);
}

}  // namespace

OLECHAR FoldToLower(OLECHAR c) noexcept {
    return (c >= u'A' && c <= u'Z') || IsLatin1UpperLetter(c) ? static_cast<OLECHAR>(c + 0x20) : c;
}

OLECHAR FoldToUpper(OLECHAR c) noexcept {
    return (c >= u'a' && c <= u'z') || IsLatin1LowerLetter(c) ? static_cast<OLECHAR>(c - 0x20) : c;
}

int CompareText(OleStringView a, OleStringView b, CaseRule rule) noexcept {
    const size_t common = a.size() < b.size() ? a.size() : b.size();
    for (size_t i = 0; i < common; ++i) {
        OLECHAR x = a[i];
        OLECHAR y = b[i];
        if (rule == CaseRule::Ignore) {
            x = FoldToLower(x);
            y = FoldToLower(y);
        }
        if (x != y) {
            return x < y ? -1 : 1;
        }
    }
    if (a.size() == b.size()) {
        return 0;
    }
    return a.size() < b.size() ? -1 : 1;
}

bool NumberAwareAfter(OleStringView a, OleStringView b, CaseRule rule) noexcept {
    const size_t prefix = PrefixLength(a);
    if (prefix == PrefixLength(b) && prefix < a.size() && prefix < b.size()) {
        const int byPrefix = CompareText(a.substr(0, prefix), b.substr(0, prefix), rule);
        if (byPrefix != 0) {
            return byPrefix > 0;
        }
        return CompareNumbers(a.substr(prefix), b.substr(prefix)) > 0;
    }
    return CompareText(a, b, rule) > 0;
}

bool BstrOutOfOrder(const OLECHAR* a, const OLECHAR* b, LONG mode) noexcept {
    const OleStringView x = ViewOf(a);
    const OleStringView y = ViewOf(b);
    switch (mode) {
        case bstr_sort::kAscending:
            return CompareText(x, y, CaseRule::Sensitive) > 0;
        case bstr_sort::kAscendingNoCase:
        case bstr_sort::kAscendingNoCaseToo:
            return CompareText(x, y, CaseRule::Ignore) > 0;
        case bstr_sort::kDescending:
            return CompareText(x, y, CaseRule::Sensitive) < 0;
        case bstr_sort::kDescendingNoCase:
            return CompareText(x, y, CaseRule::Ignore) < 0;
        case bstr_sort::kNumbered:
            return NumberAwareAfter(x, y, CaseRule::Sensitive);
        case bstr_sort::kNumberedNoCase:
            return NumberAwareAfter(x, y, CaseRule::Ignore);
        case bstr_sort::kNumberedCaseByFirst: {
            const OLECHAR firstX = x.empty() ? OLECHAR{} : x.front();
            const OLECHAR firstY = y.empty() ? OLECHAR{} : y.front();
            const bool sameFirst = FoldToUpper(firstX) == FoldToUpper(firstY);
            return NumberAwareAfter(x, y, sameFirst ? CaseRule::Sensitive : CaseRule::Ignore);
        }
        default:
            return true;
    }
}

bool BstrPassesFilter(const OLECHAR* text, LONG mode) noexcept {
    const OleStringView view = ViewOf(text);
    switch (mode) {
        case bstr_filter::kLetters:
            return All(view, IsLetter);
        case bstr_filter::kDigits:
            return All(view, IsDigit);
        case bstr_filter::kLettersAndDigits:
            return All(view, IsSingleByteAlnum);
        default:
            return true;
    }
}

}  // namespace tav
