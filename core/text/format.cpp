#include "core/text/format.h"

#include <algorithm>
#include <cassert>

#include "core/text/char_class.h"
#include "core/text/convert.h"

namespace tav::text::detail {
namespace {

constexpr std::size_t kMaxWidth = 65535;

class Sink {
public:
    virtual void Write(const OLECHAR* text, std::size_t length) = 0;
    virtual void Repeat(OLECHAR c, std::size_t count) = 0;

protected:
    ~Sink() = default;
};

class StringSink final : public Sink {
public:
    explicit StringSink(OleString& out) : out_(out) {}
    void Write(const OLECHAR* text, std::size_t length) override { out_.append(text, length); }
    void Repeat(OLECHAR c, std::size_t count) override { out_.append(count, c); }

private:
    OleString& out_;
};

// Keeps what fits, leaving room for the terminator, and counts the rest.
class BufferSink final : public Sink {
public:
    explicit BufferSink(std::span<OLECHAR> buffer) noexcept : buffer_(buffer) {}

    void Write(const OLECHAR* text, std::size_t length) noexcept override {
        const std::size_t kept = std::min(length, Room());
        std::copy(text, text + kept, buffer_.data() + total_);
        total_ += length;
    }

    void Repeat(OLECHAR c, std::size_t count) noexcept override {
        const std::size_t kept = std::min(count, Room());
        std::fill(buffer_.data() + total_, buffer_.data() + total_ + kept, c);
        total_ += count;
    }

    std::size_t Finish() noexcept {
        if (!buffer_.empty()) {
            buffer_[std::min(total_, buffer_.size() - 1)] = 0;
        }
        return total_;
    }

private:
    std::size_t Room() const noexcept {
        const std::size_t usable = buffer_.empty() ? 0 : buffer_.size() - 1;
        return total_ >= usable ? 0 : usable - total_;
    }

    std::span<OLECHAR> buffer_;
    std::size_t total_ = 0;
};

struct Conversion {
    bool left = false;
    bool zero = false;
    bool plus = false;
    bool space = false;
    bool alternate = false;
    std::size_t width = 0;
    bool hasPrecision = false;
    std::size_t precision = 0;
    bool wide = false;  // ll: 64 bits
    OLECHAR conversion = 0;
};

std::size_t ReadCount(const OLECHAR*& f, const OLECHAR* last) noexcept {
    std::size_t n = 0;
    for (; f != last && IsDigit(*f); ++f) {
        n = std::min(n * 10 + static_cast<std::size_t>(*f - u'0'), kMaxWidth);
    }
    return n;
}

// Reads "[flags][width][.precision][l|ll]conversion" from just after the '%';
// conversion 0 when the format ends first.
Conversion ParseConversion(const OLECHAR*& f, const OLECHAR* last) noexcept {
    Conversion s;
    for (; f != last; ++f) {
        if (*f == u'-') {
            s.left = true;
        } else if (*f == u'0') {
            s.zero = true;
        } else if (*f == u'+') {
            s.plus = true;
        } else if (*f == u' ') {
            s.space = true;
        } else if (*f == u'#') {
            s.alternate = true;
        } else {
            break;
        }
    }
    s.width = ReadCount(f, last);
    if (f != last && *f == u'.') {
        ++f;
        s.hasPrecision = true;
        s.precision = ReadCount(f, last);
    }
    if (f != last && *f == u'l') {
        ++f;
        if (f != last && *f == u'l') {
            ++f;
            s.wide = true;
        }
    }
    if (f != last) {
        s.conversion = *f++;
    }
    return s;
}

void Pad(Sink& sink, std::size_t used, const Conversion& s, bool beforeText) {
    if (s.width > used && s.left != beforeText) {
        sink.Repeat(u' ', s.width - used);
    }
}

void WriteInteger(Sink& sink, const Conversion& s, std::uint64_t bits) {
    const bool isSigned = s.conversion == u'd' || s.conversion == u'i';
    const bool hex = s.conversion == u'x' || s.conversion == u'X';
    bool negative = false;
    std::uint64_t magnitude = s.wide ? bits : static_cast<std::uint32_t>(bits);
    if (isSigned) {
        const std::int64_t value =
            s.wide ? static_cast<std::int64_t>(bits) : static_cast<std::int32_t>(static_cast<std::uint32_t>(bits));
        negative = value < 0;
        magnitude = negative ? 0 - static_cast<std::uint64_t>(value) : static_cast<std::uint64_t>(value);
    }

    OLECHAR digits[24];
    OLECHAR* const digitsEnd = digits + std::size(digits);
    OLECHAR* first = digitsEnd;
    const char* const alphabet = s.conversion == u'X' ? "0123456789ABCDEF" : "0123456789abcdef";
    const unsigned base = hex ? 16 : 10;
    for (std::uint64_t rest = magnitude; rest != 0; rest /= base) {
        *--first = static_cast<OLECHAR>(alphabet[rest % base]);
    }
    if (magnitude == 0 && !(s.hasPrecision && s.precision == 0)) {
        *--first = u'0';
    }
    const auto digitCount = static_cast<std::size_t>(digitsEnd - first);

    OLECHAR prefix[2];
    std::size_t prefixLength = 0;
    if (isSigned && (negative || s.plus || s.space)) {
        prefix[prefixLength++] = negative ? u'-' : (s.plus ? u'+' : u' ');
    } else if (hex && s.alternate && magnitude != 0) {
        prefix[prefixLength++] = u'0';
        prefix[prefixLength++] = s.conversion;
    }
    std::size_t zeros = s.hasPrecision && s.precision > digitCount ? s.precision - digitCount : 0;
    std::size_t used = prefixLength + zeros + digitCount;
    if (s.zero && !s.left && !s.hasPrecision && s.width > used) {
        zeros += s.width - used;
        used = s.width;
    }
    Pad(sink, used, s, true);
    sink.Write(prefix, prefixLength);
    sink.Repeat(u'0', zeros);
    sink.Write(first, digitCount);
    Pad(sink, used, s, false);
}

void WriteUtf8(Sink& sink, std::string_view text, std::size_t maxUnits, bool write) {
    const char* p = text.data();
    const char* const last = p + text.size();
    std::size_t written = 0;
    while (p != last) {
        const Utf16Units units = ToUtf16(NextCodePoint(p, last));
        if (written + units.count > maxUnits) {
            break;
        }
        if (write) {
            sink.Write(units.unit, units.count);
        }
        written += units.count;
    }
}

std::size_t Utf8Units(std::string_view text, std::size_t maxUnits) {
    const char* p = text.data();
    const char* const last = p + text.size();
    std::size_t units = 0;
    while (p != last) {
        const std::size_t next = units + ToUtf16(NextCodePoint(p, last)).count;
        if (next > maxUnits) {
            break;
        }
        units = next;
    }
    return units;
}

void WriteText(Sink& sink, const Conversion& s, const FormatArg& arg) {
    static constexpr OLECHAR kNull[] = {u'(', u'n', u'u', u'l', u'l', u')'};
    const std::size_t maxUnits = s.hasPrecision ? s.precision : static_cast<std::size_t>(-1);
    if (arg.kind == FormatArgKind::Utf8Text) {
        const std::string_view text(static_cast<const char*>(arg.text), arg.length);
        const std::size_t units = Utf8Units(text, maxUnits);
        Pad(sink, units, s, true);
        WriteUtf8(sink, text, units, true);
        Pad(sink, units, s, false);
        return;
    }
    const OLECHAR* text = static_cast<const OLECHAR*>(arg.text);
    std::size_t length = arg.length;
    if (arg.kind == FormatArgKind::NullText) {
        // As glibc: the marker is not cut; it is left out when it would be.
        text = kNull;
        length = maxUnits >= std::size(kNull) ? std::size(kNull) : 0;
    }
    length = std::min(length, maxUnits);
    Pad(sink, length, s, true);
    sink.Write(text, length);
    Pad(sink, length, s, false);
}

bool IsInteger(const FormatArg& arg) noexcept {
    return arg.kind == FormatArgKind::Signed || arg.kind == FormatArgKind::Unsigned;
}

void Run(Sink& sink, OleStringView format, std::span<const FormatArg> args) {
    format = UpToNul(format);
    const OLECHAR* f = format.data();
    const OLECHAR* const last = f + format.size();
    std::size_t next = 0;
    while (f != last) {
        const OLECHAR* const literal = f;
        while (f != last && *f != u'%') {
            ++f;
        }
        sink.Write(literal, static_cast<std::size_t>(f - literal));
        if (f == last) {
            break;
        }
        const OLECHAR* const directive = f++;
        const Conversion s = ParseConversion(f, last);
        const bool integer = s.conversion == u'd' || s.conversion == u'i' || s.conversion == u'u' ||
                             s.conversion == u'x' || s.conversion == u'X' || s.conversion == u'c';
        if (s.conversion == u'%') {
            sink.Write(directive, 1);
            continue;
        }
        if (!integer && s.conversion != u's') {
            assert(!"unsupported format directive");
            sink.Write(directive, static_cast<std::size_t>(f - directive));
            continue;
        }
        if (next >= args.size()) {
            assert(!"format directive without an argument");
            continue;
        }
        const FormatArg& arg = args[next++];
        if (integer != IsInteger(arg)) {
            assert(!"format argument of the wrong kind");
            continue;
        }
        if (s.conversion == u'c') {
            const auto c = static_cast<OLECHAR>(arg.bits);
            Pad(sink, 1, s, true);
            sink.Write(&c, 1);
            Pad(sink, 1, s, false);
        } else if (integer) {
            WriteInteger(sink, s, arg.bits);
        } else {
            WriteText(sink, s, arg);
        }
    }
    assert(next == args.size() && "more format arguments than directives");
}

}  // namespace

void AppendArgs(OleString& out, OleStringView format, std::span<const FormatArg> args) {
    StringSink sink(out);
    Run(sink, format, args);
}

std::size_t FormatArgsTo(std::span<OLECHAR> buffer, OleStringView format, std::span<const FormatArg> args) noexcept {
    BufferSink sink(buffer);
    Run(sink, format, args);
    return sink.Finish();
}

}  // namespace tav::text::detail
