#include "core/text/scan_set.h"

#include <algorithm>

namespace tav::text::detail {
namespace {

// Calls visit(lo, hi) for every inclusive range of members, single members
// being ranges of one.
template <typename Visit>
void ForEachRange(OleStringView members, Visit&& visit) noexcept {
    const OLECHAR* p = members.data();
    const OLECHAR* const last = p + members.size();
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

}  // namespace

ScanSet::ScanSet(OleStringView members, bool negated) noexcept : members_(members), negated_(negated) {
    ForEachRange(members, [this](OLECHAR lo, OLECHAR hi) {
        if (hi >= 256) {
            hasHigh_ = true;
        }
        const unsigned top = std::min<unsigned>(hi, 255);
        for (unsigned c = lo; c <= top; ++c) {
            low_[c >> 5] |= 1u << (c & 31);
        }
    });
}

bool ScanSet::HighMember(OLECHAR c) const noexcept {
    if (!hasHigh_) {
        return false;
    }
    bool found = false;
    ForEachRange(members_, [&](OLECHAR lo, OLECHAR hi) { found = found || (lo <= c && c <= hi); });
    return found;
}

}  // namespace tav::text::detail
