#pragma once
// The conversions of the scanner, one function each, shared by the scanner
// that reads a format at run time and the one compiled from a format known at
// compile time, so that both read input exactly alike.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>

#include "core/text/char_class.h"
#include "core/text/float_field.h"
#include "core/text/number.h"

namespace tav::text::detail {

enum class Step : std::uint8_t { Next, MatchingFailure, InputFailure };

// A width this large never ends a field before the input does.
inline constexpr std::size_t kUnboundedWidth = std::numeric_limits<std::size_t>::max() / 4;

class ScanCursor {
public:
    ScanCursor(const OLECHAR* begin, const OLECHAR* end) noexcept : begin_(begin), pos_(begin), end_(end) {}

    // A NUL ends the input as it does in C. It is found where scanning
    // reaches it rather than searched for up front, so that decoders which
    // scan a long reply piece by piece do not read its rest each time.
    bool AtEnd() const noexcept { return pos_ == end_ || *pos_ == 0; }

    void SkipSpace() noexcept {
        while (pos_ != end_ && IsSpace(*pos_)) {
            ++pos_;
        }
    }

    std::uint32_t Consumed() const noexcept { return static_cast<std::uint32_t>(pos_ - begin_); }

    // One literal character of the format.
    Step Literal(OLECHAR expected) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        if (*pos_ != expected) {
            return Step::MatchingFailure;
        }
        ++pos_;
        return Step::Next;
    }

    // A run of literal characters, as that many single ones.
    Step Literal(const OLECHAR* expected, std::size_t length) noexcept {
        const std::size_t available = static_cast<std::size_t>(end_ - pos_);
        const std::size_t n = std::min(length, available);
        for (std::size_t i = 0; i < n; ++i) {
            if (pos_[i] != expected[i]) {
                pos_ += i;
                return pos_[0] == 0 ? Step::InputFailure : Step::MatchingFailure;
            }
        }
        pos_ += n;
        return n == length ? Step::Next : Step::InputFailure;
    }

    // %d (isSigned) or %u into the low 32 bits of *out; out null: suppressed.
    Step Integer(std::size_t width, bool isSigned, std::uint32_t* out) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        const OLECHAR* const last = FieldEnd(width);
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
        if (out != nullptr) {
            *out = isSigned ? SignedLow32(negative, m) : UnsignedLow32(negative, m);
        }
        return Step::Next;
    }

    // %s or %[...]: the characters that accepts() takes, at least one, at
    // most width; out null: suppressed. A field that does not fit capacity
    // (terminator included) is a matching failure.
    template <typename Accepts>
    Step Characters(std::size_t width, Accepts&& accepts, OLECHAR* out, std::size_t capacity) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        const OLECHAR* const last = FieldEnd(width);
        const OLECHAR* p = pos_;
        while (p != last && *p != 0 && accepts(*p)) {
            ++p;
        }
        const auto length = static_cast<std::size_t>(p - pos_);
        if (length == 0) {
            return Step::MatchingFailure;
        }
        if (out != nullptr) {
            if (length >= capacity) {
                return Step::MatchingFailure;
            }
            std::copy(pos_, p, out);
            out[length] = 0;
        }
        pos_ = p;
        return Step::Next;
    }

    // The same without a copy: *out views the field in the input. A field
    // of capacity characters or more (capacity 0: no limit) is a matching
    // failure, as it is for a buffer of that size with its terminator.
    template <typename Accepts>
    Step CharactersView(std::size_t width, Accepts&& accepts, OleStringView* out, std::size_t capacity) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        const OLECHAR* const last = FieldEnd(width);
        const OLECHAR* p = pos_;
        while (p != last && *p != 0 && accepts(*p)) {
            ++p;
        }
        const auto length = static_cast<std::size_t>(p - pos_);
        if (length == 0 || (capacity != 0 && length >= capacity)) {
            return Step::MatchingFailure;
        }
        *out = OleStringView(pos_, length);
        pos_ = p;
        return Step::Next;
    }

    // %c: one character; out null: suppressed.
    Step Character(OLECHAR* out) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        if (out != nullptr) {
            *out = *pos_;
        }
        ++pos_;
        return Step::Next;
    }

    // %lf; out null: suppressed.
    Step Float(std::size_t width, double* out) noexcept {
        if (AtEnd()) {
            return Step::InputFailure;
        }
        const FloatField field = ReadFloatField(pos_, FieldEnd(width));
        if (!field.matched) {
            return Step::MatchingFailure;
        }
        pos_ += field.length;
        if (out != nullptr) {
            *out = field.value;
        }
        return Step::Next;
    }

    // %%.
    Step Percent() noexcept { return Literal(u'%'); }

private:
    // The field may not go past the width nor past the input.
    const OLECHAR* FieldEnd(std::size_t width) const noexcept {
        const auto available = static_cast<std::size_t>(end_ - pos_);
        return pos_ + (width == 0 ? available : std::min(width, available));
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

    const OLECHAR* const begin_;
    const OLECHAR* pos_;
    const OLECHAR* const end_;
};

}  // namespace tav::text::detail
