#pragma once
#include <array>
#include <cstdint>

#include "core/text/ole_string.h"

namespace tav::text::detail {

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
