#pragma once
#include <array>
#include <cstdint>

#include "core/text/ole_string.h"

namespace tav::text::detail {

// Calls visit(lo, hi) for every inclusive range of the members of a %[...]
// directive (the text between "[" or "[^" and the closing ']'), single
// members being ranges of one, as glibc reads them: a ']' or '-' right after
// the opening bracket (and the '^') is a member; "x-y" with x not above y is
// the range x..y; any other '-' is a member.
template <typename Visit>
constexpr void ForEachSetRange(const OLECHAR* p, const OLECHAR* last, Visit&& visit) noexcept {
    if (p != last && (*p == u']' || *p == u'-')) {
        visit(*p, *p);
        ++p;
    }
    while (p != last) {
        const OLECHAR c = *p++;
        // p[-2] exists here: a '-' in first place was taken above.
        if (c == u'-' && p != last && p[-2] <= *p) {
            // The upper bound itself is added as the next member.
            if (p[-2] < *p) {
                visit(p[-2], static_cast<OLECHAR>(*p - 1));
            }
        } else {
            visit(c, c);
        }
    }
}

// The members of a %[...] directive, read as glibc reads them: a ']' or '-'
// right after the opening bracket (and the '^') is a member; "x-y" with x not
// above y is the range x..y; any other '-' is a member.
class ScanSet {
public:
    // members: the text between "[" or "[^" and the closing ']'.
    ScanSet(OleStringView members, bool negated) noexcept;

    bool Accepts(OLECHAR c) const noexcept {
        const bool member = c < 256 ? ((low_[c >> 5] >> (c & 31)) & 1u) != 0 : HighMember(c);
        return member != negated_;
    }

private:
    bool HighMember(OLECHAR c) const noexcept;

    // Units below 256 are looked up in a bitmap; the rare members above are
    // found by reading the members again.
    std::array<std::uint32_t, 8> low_{};
    OleStringView members_;
    bool negated_;
    bool hasHigh_ = false;
};

}  // namespace tav::text::detail
