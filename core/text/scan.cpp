#include "core/text/scan.h"

#include <algorithm>
#include <cassert>
#include <cstring>
#include <limits>

#include "core/text/char_class.h"
#include "core/text/float_field.h"
#include "core/text/number.h"
#include "core/text/scan_cursor.h"
#include "core/text/scan_set.h"

namespace tav::text::detail {
namespace {

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

class Scanner {
public:
    Scanner(OleStringView input, std::span<const ScanTarget> targets) noexcept
        : cursor_(input.data(), input.data() + input.size()), targets_(targets) {}

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
                    cursor_.SkipSpace();
                    skipSpace = false;
                }
                if (const int end = Finish(cursor_.Literal(fc)); end != kGoOn) {
                    return end;
                }
                continue;
            }
            const Directive d = ParseDirective(f, last);
            if (!d.wellFormed) {
                return stored_;
            }
            if (skipSpace || (d.conversion != u'[' && d.conversion != u'c' && d.conversion != u'n')) {
                cursor_.SkipSpace();
                skipSpace = false;
            }
            if (const int end = Finish(Convert(d)); end != kGoOn) {
                return end;
            }
        }
        return stored_;
    }

private:
    static constexpr int kGoOn = -2;

    // The result of the whole scan when step ends it, else kGoOn.
    int Finish(Step step) const noexcept {
        switch (step) {
        case Step::Next:
            return kGoOn;
        case Step::MatchingFailure:
            return stored_;
        case Step::InputFailure:
            break;
        }
        return stored_ == 0 ? kScanEof : stored_;
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

    Step Counted(Step step, const ScanTarget* target) noexcept {
        if (step == Step::Next && target != nullptr) {
            ++stored_;
        }
        return step;
    }

    Step Convert(const Directive& d) noexcept {
        const ScanTarget* target = nullptr;
        if (!Take(d, target)) {
            return Step::MatchingFailure;
        }
        void* const object = target != nullptr ? target->object : nullptr;
        switch (d.conversion) {
        case u'%':
            return cursor_.Percent();
        case u'n':
            if (object != nullptr) {
                const std::uint32_t consumed = cursor_.Consumed();
                std::memcpy(object, &consumed, sizeof consumed);
            }
            return Step::Next;
        case u'c':
            return Counted(cursor_.Character(static_cast<OLECHAR*>(object)), target);
        case u'd':
        case u'u': {
            std::uint32_t bits = 0;
            const Step step = cursor_.Integer(d.width, d.conversion == u'd', object != nullptr ? &bits : nullptr);
            if (step == Step::Next && object != nullptr) {
                std::memcpy(object, &bits, sizeof bits);
            }
            return Counted(step, target);
        }
        case u's':
            return Counted(cursor_.Characters(
                               d.width, [](OLECHAR c) { return !IsSpace(c); }, static_cast<OLECHAR*>(object),
                               target != nullptr ? target->capacity : 0),
                           target);
        case u'[': {
            const ScanSet set(d.setMembers, d.setNegated);
            return Counted(cursor_.Characters(
                               d.width, [&set](OLECHAR c) { return set.Accepts(c); }, static_cast<OLECHAR*>(object),
                               target != nullptr ? target->capacity : 0),
                           target);
        }
        default:
            return Counted(cursor_.Float(d.width, static_cast<double*>(object)), target);
        }
    }

    ScanCursor cursor_;
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
