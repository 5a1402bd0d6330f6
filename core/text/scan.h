#pragma once
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <tuple>
#include <type_traits>
#include <utility>

#include "core/text/ole_string.h"
#include "core/text/scan_format.h"

// Scanning of OLECHAR text with the conventions of sscanf, identical on every
// platform because none of it is delegated to the C library.
//
// Directives: literal text; white space (any run of white space, also none);
// %d %u %ld %lu (32 bits each, also with l, as on the original 32-bit target),
// %s, %[set] (^ negation, ']' first, ranges a-z), %c, %lf %le %lg (double),
// %n (not counted), %% ; each with an optional '*' (read but not stored) and
// width. White space is the six ASCII white-space characters.
//
// Integers: digits are read into 64 bits; %d saturates at the 64-bit signed
// limits and %u at UINT64_MAX (a minus sign negates modulo 2^64), then the
// low 32 bits are stored. So "-1" read by %u gives 4294967295 and
// "4294967296" read by %d gives 0, on every platform.
// Doubles: a decimal number with optional fraction and exponent, "inf",
// "infinity" or "nan", correctly rounded as strtod does; hexadecimal forms
// are not read. As with glibc the field takes a dangling exponent along:
// "1e," gives 1.0 and %n counts the 'e'.
//
// Targets, one per storing directive, in order:
//   %d %u %n    pointer to any 4-byte integer (int32_t, uint32_t, LONG, ...)
//   %lf         double*
//   %c          OLECHAR* (one character; a width above 1 is not supported)
//   %s %[...]   std::span<OLECHAR> or an OLECHAR array: the capacity counts
//               the terminator; a field that does not fit is a matching
//               failure (nothing is stored, the field does not count and
//               scanning stops): the span, not the width, bounds the write.
// A directive whose target is missing or of another kind is a programming
// error: it asserts in debug builds and is a matching failure otherwise.
//
// Input and format end at their first NUL. The result is the number of
// stored fields, or kScanEof (-1) when the input ended before the first one,
// as with glibc's sscanf. Scan does not allocate.

namespace tav::text {

inline constexpr int kScanEof = -1;

namespace detail {

enum class ScanTargetKind : std::uint8_t { Int32, Double, Char, Chars };

struct ScanTarget {
    ScanTargetKind kind;
    void* object;
    std::size_t capacity;  // Chars: OLECHARs, terminator included
};

template <typename>
inline constexpr bool kNoScanTarget = false;

template <typename T>
inline constexpr bool kIsStdString = false;
template <typename C, typename Tr, typename A>
inline constexpr bool kIsStdString<std::basic_string<C, Tr, A>> = true;

template <typename T>
ScanTarget MakeScanTarget(T&& target) noexcept {
    using U = std::remove_cvref_t<T>;
    if constexpr (std::is_pointer_v<U>) {
        using Pointee = std::remove_pointer_t<U>;
        static_assert(!std::is_const_v<Pointee>, "a scan target must be writable");
        if constexpr (std::is_same_v<Pointee, OLECHAR>) {
            return {ScanTargetKind::Char, target, 1};
        } else if constexpr (std::is_same_v<Pointee, double>) {
            return {ScanTargetKind::Double, target, 0};
        } else if constexpr (kIsInt32Target<Pointee>) {
            return {ScanTargetKind::Int32, target, 0};
        } else {
            static_assert(kNoScanTarget<U>, "integers are scanned into 4-byte integers, %lf into double");
        }
    } else if constexpr (!kIsStdString<U> && std::is_convertible_v<T, std::span<OLECHAR>>) {
        const std::span<OLECHAR> buffer = target;
        return {ScanTargetKind::Chars, buffer.data(), buffer.size()};
    } else {
        static_assert(kNoScanTarget<U>, "strings are scanned into a std::span<OLECHAR> or an OLECHAR array");
    }
}

int ScanTargets(OleStringView input, OleStringView format, std::span<const ScanTarget> targets) noexcept;

}  // namespace detail

// The format fixed at compile time: Scan<OLESTR("-time_t %lu")>(text, &seconds).
// Same conventions and result as below, without reading the format at run
// time; the number and kinds of the targets, and the size of a string array
// against its field's width, are checked by the compiler.
template <ScanFormat F, typename... Targets>
int Scan(OleStringView input, Targets&&... targets) noexcept {
    using Compiled = detail::Compiled<F>;
    static_assert(sizeof...(Targets) == Compiled::kTargets,
                  "the format's storing conversions and the targets differ in number");
    auto list = std::forward_as_tuple(targets...);
    detail::ScanCursor cursor(input.data(), input.data() + input.size());
    return detail::RunCompiled<F, 0, 0>(cursor, 0, list);
}

// The format read at run time.
template <typename... Targets>
int Scan(OleStringView input, OleStringView format, Targets&&... targets) noexcept {
    if constexpr (sizeof...(Targets) == 0) {
        return detail::ScanTargets(input, format, {});
    } else {
        const detail::ScanTarget list[] = {detail::MakeScanTarget(std::forward<Targets>(targets))...};
        return detail::ScanTargets(input, format, list);
    }
}

}  // namespace tav::text
