#pragma once
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <type_traits>

#include "core/text/ole_string.h"

// printf-style formatting into OLECHAR text, identical on every platform.
//
// Directives: %[flags][width][.precision][l|ll]conversion with the flags
// '-' '0' '+' ' ' '#' and the conversions d i u x X c s %. As on the original
// 32-bit target, d and i format the argument as a 32-bit signed value and
// u x X as a 32-bit unsigned one, with or without l; ll formats 64 bits.
// So "%.4d" with 7 gives "0007", with -7 "-0007"; "%.38s" cuts a text at 38
// characters; a null string argument prints "(null)", or nothing when a
// precision below 6 would cut that, as glibc does.
//
// Arguments: any integer or enumeration (for d i u x X c), and for s:
// const OLECHAR* / BSTR, OleStringView, OleString, or narrow UTF-8 text
// (const char*, std::string_view, std::string). A directive whose argument
// is missing or of the other kind is a programming error: it asserts in
// debug builds and writes nothing otherwise. Widths and precisions above
// 65535 are taken as 65535.

namespace tav::text {

namespace detail {

enum class FormatArgKind : std::uint8_t { Signed, Unsigned, OleText, Utf8Text, NullText };

struct FormatArg {
    FormatArgKind kind;
    std::uint64_t bits;  // integers: the value, two's complement
    const void* text;
    std::size_t length;
};

template <typename>
inline constexpr bool kNoFormatArg = false;

template <typename T>
FormatArg MakeFormatArg(const T& arg) noexcept {
    using D = std::decay_t<const T&>;
    if constexpr (std::is_null_pointer_v<D>) {
        return {FormatArgKind::NullText, 0, nullptr, 0};
    } else if constexpr (std::is_enum_v<D>) {
        return MakeFormatArg(static_cast<std::underlying_type_t<D>>(arg));
    } else if constexpr (std::is_integral_v<D>) {
        const auto kind = std::is_signed_v<D> ? FormatArgKind::Signed : FormatArgKind::Unsigned;
        const auto bits = std::is_signed_v<D> ? static_cast<std::uint64_t>(static_cast<std::int64_t>(arg))
                                              : static_cast<std::uint64_t>(arg);
        return {kind, bits, nullptr, 0};
    } else if constexpr (std::is_same_v<D, const OLECHAR*> || std::is_same_v<D, OLECHAR*>) {
        const D text = arg;
        if (text == nullptr) {
            return {FormatArgKind::NullText, 0, nullptr, 0};
        }
        return {FormatArgKind::OleText, 0, text, std::char_traits<OLECHAR>::length(text)};
    } else if constexpr (std::is_same_v<D, const char*> || std::is_same_v<D, char*>) {
        const D text = arg;
        if (text == nullptr) {
            return {FormatArgKind::NullText, 0, nullptr, 0};
        }
        return {FormatArgKind::Utf8Text, 0, text, std::char_traits<char>::length(text)};
    } else if constexpr (std::is_convertible_v<const T&, OleStringView>) {
        const OleStringView text = arg;
        return {FormatArgKind::OleText, 0, text.data(), text.size()};
    } else if constexpr (std::is_convertible_v<const T&, std::string_view>) {
        const std::string_view text = arg;
        return {FormatArgKind::Utf8Text, 0, text.data(), text.size()};
    } else {
        static_assert(kNoFormatArg<T>, "format arguments are integers, enumerations and texts");
    }
}

void AppendArgs(OleString& out, OleStringView format, std::span<const FormatArg> args);
std::size_t FormatArgsTo(std::span<OLECHAR> buffer, OleStringView format, std::span<const FormatArg> args) noexcept;

template <typename... Args, typename Run>
decltype(auto) WithArgs(Run&& run, const Args&... args) {
    if constexpr (sizeof...(Args) == 0) {
        return run(std::span<const FormatArg>());
    } else {
        const FormatArg list[] = {MakeFormatArg(args)...};
        return run(std::span<const FormatArg>(list));
    }
}

}  // namespace detail

// Appends the formatted text to out. Throws std::bad_alloc like any string.
template <typename... Args>
void FormatAppend(OleString& out, OleStringView format, const Args&... args) {
    detail::WithArgs([&](std::span<const detail::FormatArg> list) { detail::AppendArgs(out, format, list); },
                     args...);
}

template <typename... Args>
OleString Format(OleStringView format, const Args&... args) {
    OleString out;
    FormatAppend(out, format, args...);
    return out;
}

// snprintf: writes what fits of the text and a terminator (when the buffer
// is not empty) and returns the length of the whole text; never allocates.
template <typename... Args>
std::size_t FormatTo(std::span<OLECHAR> buffer, OleStringView format, const Args&... args) noexcept {
    return detail::WithArgs(
        [&](std::span<const detail::FormatArg> list) { return detail::FormatArgsTo(buffer, format, list); },
        args...);
}

}  // namespace tav::text
