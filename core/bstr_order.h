#pragma once
#include <cstddef>
#include <utility>

#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

// How the string enumerator orders and filters its strings. A NULL BSTR is
// the empty string; a string ends at its first NUL, as the C runtime's
// wide-string comparisons see it.

enum class CaseRule { Sensitive, Ignore };

// Sort modes and filter modes as clients pass them.
namespace bstr_sort {
inline constexpr LONG kAscending = 1;
inline constexpr LONG kAscendingNoCase = 2;
inline constexpr LONG kAscendingNoCaseToo = 3;
inline constexpr LONG kDescending = 4;
inline constexpr LONG kDescendingNoCase = 5;
inline constexpr LONG kNumbered = 6;
inline constexpr LONG kNumberedNoCase = 7;
inline constexpr LONG kNumberedCaseByFirst = 8;
}  // namespace bstr_sort

namespace bstr_filter {
inline constexpr LONG kLetters = 1;
inline constexpr LONG kDigits = 2;
inline constexpr LONG kLettersAndDigits = 3;
}  // namespace bstr_filter

// Case folding covers ASCII and the Latin-1 letters, the characters that the
// controller's texts are made of; it is the same on every platform.
OLECHAR FoldToLower(OLECHAR c) noexcept;
OLECHAR FoldToUpper(OLECHAR c) noexcept;

// <0, 0 or >0 as a is before, equal to or after b, by 16-bit code units.
int CompareText(OleStringView a, OleStringView b, CaseRule rule) noexcept;

// The number-aware comparison of sort modes 6 to 8. Two strings whose
// prefixes (the characters before the first decimal digit) are equally long
// and that both go on with digits are ordered by prefix, then by the value of
// the digits after it ("item9" before "item10"); all other pairs by their
// whole text. Digit runs of any length compare by value, without overflow.
bool NumberAwareAfter(OleStringView a, OleStringView b, CaseRule rule) noexcept;

// True when Sort in this mode exchanges a and b standing in this order. An
// unknown mode exchanges every pair it is asked about.
bool BstrOutOfOrder(const OLECHAR* a, const OLECHAR* b, LONG mode) noexcept;

// True when Filter in this mode lets the string through.
bool BstrPassesFilter(const OLECHAR* text, LONG mode) noexcept;

// Batcher's merge-exchange sort (Knuth, Algorithm 5.2.2M): a fixed network of
// compare-exchange steps that depends on count alone, so even an order that
// is no order at all gives a fixed result. Not stable.
template <class T, class OutOfOrder>
void MergeExchangeSort(T* items, size_t count, OutOfOrder outOfOrder) {
    if (count < 2) {
        return;
    }
    size_t top = 1;  // 2^t, with t the smallest number such that 2^(t+1) >= count
    while (top < (count + 1) / 2) {
        top *= 2;
    }
    for (size_t p = top; p > 0; p /= 2) {
        size_t q = top;
        size_t r = 0;
        size_t d = p;
        for (;;) {
            for (size_t i = 0; i + d < count; ++i) {
                if ((i & p) == r && outOfOrder(items[i], items[i + d])) {
                    using std::swap;
                    swap(items[i], items[i + d]);
                }
            }
            if (q == p) {
                break;
            }
            d = q - p;
            q /= 2;
            r = p;
        }
    }
}

}  // namespace tav
