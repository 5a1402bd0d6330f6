#pragma once
// Scan formats fixed at compile time. The format is parsed by the compiler
// into a sequence of typed steps, so that a decoder pays nothing at run time
// for reading its format, and a format whose conversions do not match their
// targets (their number, their kinds, a string buffer shorter than the
// field's width) does not compile. The steps read input exactly as the
// run-time scanner does: both are built from ScanCursor.
#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <tuple>
#include <type_traits>

#include "core/text/scan_cursor.h"
#include "core/text/scan_set.h"

namespace tav::text {

// A format as a template argument: Scan<OLESTR("-time_t %lu")>(...).
template <std::size_t N>
struct ScanFormat {
    OLECHAR text[N]{};

    constexpr ScanFormat(const OLECHAR (&literal)[N]) noexcept {  // NOLINT: implicit by design
        for (std::size_t i = 0; i < N; ++i) {
            text[i] = literal[i];
        }
    }

    static constexpr std::size_t kLength = N - 1;
};

// What one storing conversion of a format writes.
enum class FieldKind : std::uint8_t {
    Signed,    // %d %ld: a 32-bit signed value
    Unsigned,  // %u %lu: a 32-bit unsigned value
    Double,    // %lf %le %lg
    Char,      // %c: one character
    Chars,     // %s %[...]: a text of at most `width` characters (0: unbounded)
    Count,     // %n: characters consumed so far, not counted in the result
};

struct FieldShape {
    FieldKind kind;
    std::size_t width;
};

namespace detail {

enum class OpKind : std::uint8_t { Literal, Signed, Unsigned, Double, Char, Word, Set, Count, Percent };

// One step of a compiled format.
struct Op {
    OpKind kind = OpKind::Literal;
    bool skipSpace = false;  // input white space is skipped first
    bool store = false;      // writes into the next target
    std::size_t width = 0;   // 0: none
    std::size_t begin = 0;   // Literal: the characters; Set: the members
    std::size_t length = 0;
    bool negated = false;  // Set: %[^...]
};

// Reports a malformed format at compile time: the call is not a constant
// expression, so the compiler names this function in its diagnostic.
inline void UnsupportedScanDirective() {}

constexpr bool IsFormatSpace(OLECHAR c) noexcept { return IsSpace(c); }

// Parses the format into ops; with out null only counts them.
template <std::size_t N>
constexpr std::size_t ParseOps(const ScanFormat<N>& format, Op* out) {
    const OLECHAR* const text = format.text;
    std::size_t last = 0;
    while (last < N && text[last] != 0) {
        ++last;
    }
    std::size_t count = 0;
    bool skipSpace = false;
    auto emit = [&](const Op& op) {
        if (out != nullptr) {
            out[count] = op;
        }
        ++count;
    };
    std::size_t i = 0;
    while (i < last) {
        const OLECHAR c = text[i];
        if (c != u'%') {
            if (IsFormatSpace(c)) {
                skipSpace = true;
                ++i;
                continue;
            }
            Op op;
            op.kind = OpKind::Literal;
            op.skipSpace = skipSpace;
            op.begin = i;
            while (i < last && text[i] != u'%' && !IsFormatSpace(text[i])) {
                ++i;
            }
            op.length = i - op.begin;
            skipSpace = false;
            emit(op);
            continue;
        }
        ++i;
        Op op;
        op.store = true;
        if (i < last && text[i] == u'*') {
            op.store = false;
            ++i;
        }
        while (i < last && IsDigit(text[i])) {
            op.width = op.width * 10 + static_cast<std::size_t>(text[i] - u'0');
            ++i;
        }
        bool longSize = false;
        if (i < last && text[i] == u'l') {
            longSize = true;
            ++i;
        }
        if (i >= last) {
            UnsupportedScanDirective();
        }
        const OLECHAR conversion = text[i++];
        switch (conversion) {
        case u'd':
            op.kind = OpKind::Signed;
            break;
        case u'u':
            op.kind = OpKind::Unsigned;
            break;
        case u'f':
        case u'e':
        case u'g':
            if (!longSize) {
                UnsupportedScanDirective();  // only double is read
            }
            op.kind = OpKind::Double;
            break;
        case u'c':
            if (op.width > 1) {
                UnsupportedScanDirective();
            }
            op.kind = OpKind::Char;
            break;
        case u's':
            op.kind = OpKind::Word;
            break;
        case u'n':
            op.kind = OpKind::Count;
            break;
        case u'%':
            op.kind = OpKind::Percent;
            op.store = false;
            break;
        case u'[': {
            op.kind = OpKind::Set;
            if (i < last && text[i] == u'^') {
                op.negated = true;
                ++i;
            }
            op.begin = i;
            if (i < last && (text[i] == u']' || text[i] == u'-')) {
                ++i;
            }
            while (i < last && text[i] != u']') {
                ++i;
            }
            if (i >= last) {
                UnsupportedScanDirective();
            }
            op.length = i - op.begin;
            ++i;
            break;
        }
        default:
            UnsupportedScanDirective();
        }
        // As in C: white space is skipped before every conversion but
        // %[...], %c and %n, and before those only where the format has some.
        op.skipSpace = skipSpace || (op.kind != OpKind::Set && op.kind != OpKind::Char && op.kind != OpKind::Count);
        skipSpace = false;
        emit(op);
    }
    return count;
}

template <ScanFormat F>
struct Compiled {
    static constexpr std::size_t kOpCount = ParseOps(F, nullptr);
    static constexpr std::array<Op, kOpCount> kOps = [] {
        std::array<Op, kOpCount> ops{};
        ParseOps(F, ops.data());
        return ops;
    }();
    static constexpr std::size_t kTargets = [] {
        std::size_t n = 0;
        for (const Op& op : kOps) {
            n += op.store ? 1 : 0;
        }
        return n;
    }();
    static constexpr std::array<FieldShape, kTargets> kFields = [] {
        std::array<FieldShape, kTargets> fields{};
        std::size_t n = 0;
        for (const Op& op : kOps) {
            if (!op.store) {
                continue;
            }
            FieldKind kind = FieldKind::Count;
            switch (op.kind) {
            case OpKind::Signed: kind = FieldKind::Signed; break;
            case OpKind::Unsigned: kind = FieldKind::Unsigned; break;
            case OpKind::Double: kind = FieldKind::Double; break;
            case OpKind::Char: kind = FieldKind::Char; break;
            case OpKind::Word:
            case OpKind::Set: kind = FieldKind::Chars; break;
            default: break;
            }
            fields[n++] = FieldShape{kind, op.width};
        }
        return fields;
    }();
};

// The members of the set of op I below 256 as a bitmap; members above 255
// are not supported in a compiled format.
template <ScanFormat F, std::size_t I>
inline constexpr std::array<std::uint32_t, 8> kSetBits = [] {
    constexpr Op op = Compiled<F>::kOps[I];
    std::array<std::uint32_t, 8> bits{};
    ForEachSetRange(F.text + op.begin, F.text + op.begin + op.length, [&](OLECHAR lo, OLECHAR hi) {
        if (hi >= 256) {
            UnsupportedScanDirective();
        }
        for (unsigned c = lo; c <= hi; ++c) {
            bits[c >> 5] |= 1u << (c & 31);
        }
    });
    return bits;
}();

// Whether op I's set takes c. Most sets in reply grammars are a single
// excluded character ("%256[^\"]", "%10[^;]"), compared directly.
template <ScanFormat F, std::size_t I>
struct SetMembership {
    static constexpr Op kOp = Compiled<F>::kOps[I];
    constexpr bool operator()(OLECHAR c) const noexcept {
        if constexpr (kOp.length == 1) {
            return (c == F.text[kOp.begin]) != kOp.negated;
        } else {
            const bool member = c < 256 && ((kSetBits<F, I>[c >> 5] >> (c & 31)) & 1u) != 0;
            return member != kOp.negated;
        }
    }
};

template <ScanFormat F, std::size_t I>
inline constexpr SetMembership<F, I> SetAccepts{};

template <typename T>
inline constexpr bool kIsCharType = std::is_same_v<T, char> || std::is_same_v<T, signed char> ||
                                    std::is_same_v<T, unsigned char> || std::is_same_v<T, wchar_t> ||
                                    std::is_same_v<T, char8_t> || std::is_same_v<T, char16_t> ||
                                    std::is_same_v<T, char32_t>;

template <typename T>
inline constexpr bool kIsInt32Target =
    std::is_integral_v<T> && sizeof(T) == 4 && !std::is_same_v<T, bool> && !kIsCharType<T>;

template <typename>
inline constexpr bool kBadScanTarget = false;

}  // namespace detail

// A string field read without a copy: the view points into the input and is
// valid as long as the input is. A field of capacity characters or more (0:
// no limit beyond the width) fails as it would in a buffer of that size.
struct FieldView {
    OleStringView* out;
    std::size_t capacity = 0;
};

namespace detail {

// Where a string field goes: a fixed array (its size checked against the
// width at compile time) or a span (checked as it is written).
template <typename T>
struct CharsTarget {
    static_assert(kBadScanTarget<T>, "a string field is scanned into an OLECHAR array or a std::span<OLECHAR>");
};
template <std::size_t M>
struct CharsTarget<OLECHAR (&)[M]> {
    static constexpr std::size_t kCapacity = M;
    static OLECHAR* Data(OLECHAR (&target)[M]) noexcept { return target; }
    static std::size_t Capacity(OLECHAR (&)[M]) noexcept { return M; }
};
template <>
struct CharsTarget<std::span<OLECHAR>&> {
    static constexpr std::size_t kCapacity = 0;  // known at run time only
    static OLECHAR* Data(std::span<OLECHAR> target) noexcept { return target.data(); }
    static std::size_t Capacity(std::span<OLECHAR> target) noexcept { return target.size(); }
};
template <>
struct CharsTarget<std::span<OLECHAR>> : CharsTarget<std::span<OLECHAR>&> {};
template <>
struct CharsTarget<const std::span<OLECHAR>&> : CharsTarget<std::span<OLECHAR>&> {};

// The integer is stored as its target's own type: a long is no uint32_t to
// the optimiser, even where both have 32 bits.
template <typename T>
constexpr void StoreInteger(T* target, std::uint32_t bits) noexcept {
    static_assert(kIsInt32Target<T>, "%d, %u and %n are scanned into a pointer to a 4-byte integer");
    *target = static_cast<T>(bits);
}

template <typename T>
constexpr void StoreCount(T* target, std::uint32_t consumed) noexcept {
    static_assert(kIsInt32Target<T>, "%n is scanned into a pointer to a 4-byte integer");
    *target = static_cast<T>(consumed);
}

// Runs op I with the target at index T (when it stores), then the rest.
template <ScanFormat F, std::size_t I, std::size_t T, typename Targets>
inline int RunCompiled(ScanCursor& cursor, int stored, Targets& targets) noexcept {
    using C = Compiled<F>;
    if constexpr (I == C::kOpCount) {
        return stored;
    } else {
        constexpr Op op = C::kOps[I];
        if constexpr (op.skipSpace) {
            cursor.SkipSpace();
        }
        Step step = Step::Next;
        if constexpr (op.kind == OpKind::Literal) {
            if constexpr (op.length == 1) {
                step = cursor.Literal(F.text[op.begin]);
            } else {
                step = cursor.Literal(F.text + op.begin, op.length);
            }
        } else if constexpr (op.kind == OpKind::Percent) {
            step = cursor.Percent();
        } else if constexpr (!op.store) {
            if constexpr (op.kind == OpKind::Signed || op.kind == OpKind::Unsigned) {
                step = cursor.Integer(op.width, op.kind == OpKind::Signed, nullptr);
            } else if constexpr (op.kind == OpKind::Double) {
                step = cursor.Float(op.width, nullptr);
            } else if constexpr (op.kind == OpKind::Char) {
                step = cursor.Character(nullptr);
            } else if constexpr (op.kind == OpKind::Word) {
                step = cursor.Characters(op.width, [](OLECHAR c) { return !IsSpace(c); }, nullptr, 0);
            } else if constexpr (op.kind == OpKind::Set) {
                step = cursor.Characters(op.width, SetAccepts<F, I>, nullptr, 0);
            }
        } else {
            auto&& target = std::get<T>(targets);
            using Target = decltype(target);
            if constexpr (op.kind == OpKind::Signed || op.kind == OpKind::Unsigned) {
                std::uint32_t bits = 0;
                step = cursor.Integer(op.width, op.kind == OpKind::Signed, &bits);
                if (step == Step::Next) {
                    StoreInteger(target, bits);
                }
            } else if constexpr (op.kind == OpKind::Count) {
                StoreCount(target, cursor.Consumed());
            } else if constexpr (op.kind == OpKind::Double) {
                static_assert(std::is_same_v<std::remove_cvref_t<Target>, double*>,
                              "%lf is scanned into a pointer to double");
                step = cursor.Float(op.width, target);
            } else if constexpr (op.kind == OpKind::Char) {
                static_assert(std::is_same_v<std::remove_cvref_t<Target>, OLECHAR*>,
                              "%c is scanned into a pointer to OLECHAR");
                step = cursor.Character(target);
            } else if constexpr (std::is_same_v<std::remove_cvref_t<Target>, FieldView>) {
                if constexpr (op.kind == OpKind::Word) {
                    step = cursor.CharactersView(
                        op.width, [](OLECHAR c) { return !IsSpace(c); }, target.out, target.capacity);
                } else {
                    step = cursor.CharactersView(op.width, SetAccepts<F, I>, target.out, target.capacity);
                }
            } else {
                using Chars = CharsTarget<Target>;
                static_assert(Chars::kCapacity == 0 || op.width == 0 || Chars::kCapacity > op.width,
                              "the buffer is shorter than the field's width and its terminator");
                if constexpr (op.kind == OpKind::Word) {
                    step = cursor.Characters(
                        op.width, [](OLECHAR c) { return !IsSpace(c); }, Chars::Data(target), Chars::Capacity(target));
                } else {
                    step = cursor.Characters(op.width, SetAccepts<F, I>, Chars::Data(target), Chars::Capacity(target));
                }
            }
        }
        if (step == Step::Next) [[likely]] {
            constexpr bool counted = op.store && op.kind != OpKind::Count;
            return RunCompiled<F, I + 1, T + (op.store ? 1 : 0)>(cursor, stored + (counted ? 1 : 0), targets);
        }
        if (step == Step::MatchingFailure) {
            return stored;
        }
        return stored == 0 ? -1 : stored;
    }
}

}  // namespace detail
// The storing conversions of a compiled format, in order (%n included).
template <ScanFormat F>
inline constexpr auto kScanFields = detail::Compiled<F>::kFields;

}  // namespace tav::text
