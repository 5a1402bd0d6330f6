#include "core/text/scan_set.h"

#include <algorithm>

namespace tav::text::detail {

ScanSet::ScanSet(OleStringView members, bool negated) noexcept : members_(members), negated_(negated) {
    ForEachSetRange(members.data(), members.data() + members.size(), [this](OLECHAR lo, OLECHAR hi) {
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
    ForEachSetRange(members_.data(), members_.data() + members_.size(),
                    [&](OLECHAR lo, OLECHAR hi) { found = found || (lo <= c && c <= hi); });
    return found;
}

}  // namespace tav::text::detail
