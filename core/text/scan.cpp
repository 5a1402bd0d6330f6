#include "core/text/scan.h"

#include <algorithm>
#include <cassert>
#include <cstring>
#include <limits>

#include "core/text/char_class.h"
#include "core/text/float_field.h"
#include "core/text/number.h"
#include "core/text/scan_set.h"

namespace tav::text::detail {
namespace {

// A width this large never ends a field before the input does.
constexpr std::size_t kUnboundedWidth = std::numeric_limits<std::size_t>::max() / 4;

struct Directive {
    bool suppress = false;
    bool longSize = false;
    std::size_t width = 0;  // 0: none
    OLECHAR conversion = 0;
    OleStringView setMembers;
    bool setNegated = false;
    bool wellFormed = false;
};

bool IsFloatConversion(OLECHAR c) noexcept {
    return c == u'f' || c == u'e' || c == u'g' || c == u'F' || c == u'E' || c == u'G';
}

// The format ends at its end or at a NUL, found where it is reached.
bool More(const OLECHAR* f, const OLECHAR* last) noexcept {
    return f != last && *f != 0;
}

// Reads "%[*][width][l]conversion" from just after the '%'.
Directive ParseDirective(const OLECHAR*& f, const OLECHAR* last) noexcept {
    Directive d;
    if (More(f, last) && *f == u'*') {
        d.suppress = true;
        ++f;
    }
    for (; More(f, last) && IsDigit(*f); ++f) {
        d.width = std::min(d.width * 10 + static_cast<std::size_t>(*f - u'0'), kUnboundedWidth);
    }
    if (More(f, last) && *f == u'l') {
        d.longSize = true;
        ++f;
    }
    if (!More(f, last)) {
        return d;
    }
    d.conversion = *f++;
    switch (d.conversion) {
    case u'[': {
        if (More(f, last) && *f == u'^') {
            d.setNegated = true;
            ++f;
        }
        const OLECHAR* const first = f;
        if (More(f, last) && (*f == u']' || *f == u'-')) {
            ++f;
        }
        while (More(f, last) && *f != u']') {
            ++f;
        }
        if (!More(f, last)) {
            return d;
        }
        d.setMembers = OleStringView(first, static_cast<std::size_t>(f - first));
        ++f;
        d.wellFormed = true;
        break;
    }
    case u'c':
        d.wellFormed = d.width <= 1;
        break;
    case u'd':
    case u'u':
    case u's':
    case u'n':
    case u'%':
        d.wellFormed = true;
        break;
    default:
        // Only double is supported among the floating types.
        d.wellFormed = IsFloatConversion(d.conversion) && d.longSize;
        break;
    }
    return d;
}

// The kind of target a well-formed directive stores into.
bool TargetKindOf(const Directive& d, ScanTargetKind& kind) noexcept {
    switch (d.conversion) {
    case u'd':
    case u'u':
    case u'n':
        kind = ScanTargetKind::Int32;
        return true;
    case u'c':
        kind = ScanTargetKind::Char;
        return true;
    case u's':
    case u'[':
        kind = ScanTargetKind::Chars;
        return true;
    case u'%':
        return false;
    default:
        kind = ScanTargetKind::Double;
        return true;
    }
}

#ifndef NDEBUG
// Checks every directive against its target before any input is read, so
// that a wrong call shows on its first run, not only with a complete reply.
void AssertTargetsMatch(const OLECHAR* f, const OLECHAR* last, std::span<const ScanTarget> targets) noexcept {
    std::size_t next = 0;
    while (More(f, last)) {
        if (*f++ != u'%') {
            continue;
        }
        const Directive d = ParseDirective(f, last);
        assert(d.wellFormed && "unsupported or malformed scan directive");
        ScanTargetKind kind{};
        if (!d.wellFormed || d.suppress || !TargetKindOf(d, kind)) {
            continue;
        }
        assert(next < targets.size() && "scan directive without a target");
        assert((next >= targets.size() || targets[next].kind == kind) && "scan target of the wrong kind");
        ++next;
    }
    assert(next == targets.size() && "more scan targets than directives");
}
#endif

enum class Step { Next, MatchingFailure, InputFailure };

class Scanner {
public:
    Scanner(OleStringView input, std::span<const ScanTarget> targets) noexcept
        : begin_(input.data()), pos_(input.data()), end_(input.data() + input.size()), targets_(targets) {}

    int Run(const OLECHAR* f, const OLECHAR* const last) noexcept {
        bool skipSpace = false;
        while (More(f, last)) {
            const OLECHAR fc = *f++;
            if (fc != u'%') {
                if (IsSpace(fc)) {
                    skipSpace = true;
                    continue;
                }
                if (skipSpace) {
                    SkipSpace();
                    skipSpace = false;
                }
                if (AtEnd()) {
                    return InputFailure();
                }
                if (*pos_ != fc) {
                    return stored_;
                }
                ++pos_;
                continue;
            }
            const Directive d = ParseDirective(f, last);
            if (!d.wellFormed) {
                return stored_;
            }
            if (skipSpace || (d.conversion != u'[' && d.conversion != u'c' && d.conversion != u'n')) {
                SkipSpace();
                skipSpace = false;
            }
            switch (Convert(d)) {
            case Step::Next:
                break;
            case Step::MatchingFailure:
                return stored_;
            case Step::InputFailure:
                return InputFailure();
            }
        }
        return stored_;
    }

private:
    int InputFailure() const noexcept { return stored_ == 0 ? kScanEof : stored_; }

    // A NUL ends the input as it does in C. It is found where scanning
    // reaches it rather than searched for up front, so that decoders which
    // scan a long reply piece by piece do not read its rest each time.
    bool AtEnd() const noexcept { return pos_ == end_ || *pos_ == 0; }

    void SkipSpace() noexcept {
        while (pos_ != end_ && IsSpace(*pos_)) {
            ++pos_;
        }
    }

    // The field may not go past the width nor past the input.
    const OLECHAR* FieldEnd(std::size_t width) const noexcept {
        const auto available = static_cast<std::size_t>(end_ - pos_);
        return pos_ + (width == 0 ? available : std::min(width, available));
    }

    // Null target: the directive is suppressed. False: a programming error.
    bool Take(const Directive& d, const ScanTarget*& target) noexcept {
        target = nullptr;
        ScanTargetKind kind{};
        if (d.suppress || !TargetKindOf(d, kind)) {
            return true;
        }
        if (next_ >= targets_.size() || targets_[next_].kind != kind) {
            return false;
        }
        target = &targets_[next_++];
        return true;
    }

    Step Stored() noexcept {
        ++stored_;
        return Step::Next;
    }

    Step Convert(const Directive& d) noexcept {
        const ScanTarget* target = nullptr;
        if (!Take(d, target)) {
            return Step::MatchingFailure;
        }
        switch (d.conversion) {
        case u'%':
            if (AtEnd()) {
                return Step::InputFailure;
            }
            if (*pos_ != u'%') {
                return Step::MatchingFailure;
            }
            ++pos_;
            return Step::Next;
        case u'n':
            if (target != nullptr) {
                StoreInt32(*target, static_cast<std::uint32_t>(pos_ - begin_));
            }
            return Step::Next;
        case u'c':
            if (AtEnd()) {
                return Step::InputFailure;
            }
            if (target == nullptr) {
                ++pos_;
                return Step::Next;
            }
            *static_cast<OLECHAR*>(target->object) = *pos_++;
            return Stored();
        case u'd':
        case u'u':
            return Integer(d, target);
        case u's':
            return Characters(d, target, [](OLECHAR c) { return !IsSpace(c); });
        case u'[': {
            const ScanSet set(d.setMembers, d.setNegated);
            return Characters(d, target, [&set](OLECHAR c) { return set.Accepts(c); });
        }
        default:
            return Float(d, target);
        }
    }

    Step Integer(const Directive& d, const ScanTarget* target) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        const OLECHAR* const last = FieldEnd(d.width);
        const OLECHAR* p = pos_;
        bool negative = false;
        if (*p == u'-' || *p == u'+') {
            negative = *p == u'-';
            ++p;
        }
        const Magnitude m = ReadDigits(p, last);
        if (m.end == p) {
            return Step::MatchingFailure;
        }
        pos_ = m.end;
        if (target == nullptr) {
            return Step::Next;
        }
        StoreInt32(*target, d.conversion == u'd' ? SignedLow32(negative, m) : UnsignedLow32(negative, m));
        return Stored();
    }

    // strtol with a 64-bit long, then the int conversion's truncation.
    static std::uint32_t SignedLow32(bool negative, const Magnitude& m) noexcept {
        constexpr std::uint64_t kMaxPositive = std::numeric_limits<std::int64_t>::max();
        const std::uint64_t limit = negative ? kMaxPositive + 1 : kMaxPositive;
        const std::uint64_t magnitude = m.overflow ? limit : std::min(m.value, limit);
        return static_cast<std::uint32_t>(negative ? 0 - magnitude : magnitude);
    }

    // strtoul with a 64-bit unsigned long, then the truncation.
    static std::uint32_t UnsignedLow32(bool negative, const Magnitude& m) noexcept {
        if (m.overflow) {
            return std::numeric_limits<std::uint32_t>::max();
        }
        return static_cast<std::uint32_t>(negative ? 0 - m.value : m.value);
    }

    template <typename Accepts>
    Step Characters(const Directive& d, const ScanTarget* target, Accepts accepts) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        const OLECHAR* const last = FieldEnd(d.width);
        const OLECHAR* p = pos_;
        while (p != last && *p != 0 && accepts(*p)) {
            ++p;
        }
        const auto length = static_cast<std::size_t>(p - pos_);
        if (length == 0) {
            return Step::MatchingFailure;
        }
        if (target == nullptr) {
            pos_ = p;
            return Step::Next;
        }
        if (length >= target->capacity) {
            return Step::MatchingFailure;
        }
        auto* out = static_cast<OLECHAR*>(target->object);
        std::copy(pos_, p, out);
        out[length] = 0;
        pos_ = p;
        return Stored();
    }

    Step Float(const Directive& d, const ScanTarget* target) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        const FloatField field = ReadFloatField(pos_, FieldEnd(d.width));
        if (!field.matched) {
            return Step::MatchingFailure;
        }
        pos_ += field.length;
        if (target == nullptr) {
            return Step::Next;
        }
        *static_cast<double*>(target->object) = field.value;
        return Stored();
    }

    static void StoreInt32(const ScanTarget& target, std::uint32_t bits) noexcept {
        std::memcpy(target.object, &bits, sizeof bits);
    }

    const OLECHAR* const begin_;
    const OLECHAR* pos_;
    const OLECHAR* const end_;
    const std::span<const ScanTarget> targets_;
    std::size_t next_ = 0;
    int stored_ = 0;
};

}  // namespace

int ScanTargets(OleStringView input, OleStringView format, std::span<const ScanTarget> targets) noexcept {
    const OLECHAR* const f = format.data();
    const OLECHAR* const last = f + format.size();
#ifndef NDEBUG
    AssertTargetsMatch(f, last, targets);
#endif
    return Scanner(input, targets).Run(f, last);
}

}  // namespace tav::text::detail
