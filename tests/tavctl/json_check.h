#pragma once
// A strict reader of one JSON text, for checking what --json prints.
#include <cctype>
#include <string_view>

namespace tavctl::test {

class JsonCheck {
public:
    // True when `text` is exactly one JSON value (blanks around it allowed).
    static bool Valid(std::string_view text) {
        JsonCheck check(text);
        check.Blanks();
        if (!check.AnyValue()) {
            return false;
        }
        check.Blanks();
        return check.at_ == text.size();
    }

private:
    explicit JsonCheck(std::string_view text) : text_(text) {}

    bool More() const { return at_ < text_.size(); }
    char Peek() const { return More() ? text_[at_] : '\0'; }
    void Blanks() {
        while (More() && (Peek() == ' ' || Peek() == '\n' || Peek() == '\t' || Peek() == '\r')) ++at_;
    }
    bool Literal(std::string_view word) {
        if (text_.substr(at_, word.size()) != word) return false;
        at_ += word.size();
        return true;
    }
    bool String() {
        if (Peek() != '"') return false;
        for (++at_; More(); ++at_) {
            const unsigned char c = static_cast<unsigned char>(text_[at_]);
            if (c == '"') {
                ++at_;
                return true;
            }
            if (c < 0x20) return false;
            if (c == '\\') {
                ++at_;
                const char e = Peek();
                if (e == 'u') {
                    for (int i = 0; i < 4; ++i) {
                        ++at_;
                        if (!std::isxdigit(static_cast<unsigned char>(Peek()))) return false;
                    }
                } else if (std::string_view("\"\\/bfnrt").find(e) == std::string_view::npos) {
                    return false;
                }
            }
        }
        return false;
    }
    bool Number() {
        const std::size_t start = at_;
        if (Peek() == '-') ++at_;
        if (!std::isdigit(static_cast<unsigned char>(Peek()))) return false;
        if (Peek() == '0' && at_ + 1 < text_.size() && std::isdigit(static_cast<unsigned char>(text_[at_ + 1]))) {
            return false;
        }
        while (std::isdigit(static_cast<unsigned char>(Peek()))) ++at_;
        if (Peek() == '.') {
            ++at_;
            if (!std::isdigit(static_cast<unsigned char>(Peek()))) return false;
            while (std::isdigit(static_cast<unsigned char>(Peek()))) ++at_;
        }
        if (Peek() == 'e' || Peek() == 'E') {
            ++at_;
            if (Peek() == '+' || Peek() == '-') ++at_;
            if (!std::isdigit(static_cast<unsigned char>(Peek()))) return false;
            while (std::isdigit(static_cast<unsigned char>(Peek()))) ++at_;
        }
        return at_ > start;
    }
    template <typename Element>
    bool Sequence(char open, char close, Element element) {
        if (Peek() != open) return false;
        ++at_;
        Blanks();
        if (Peek() == close) {
            ++at_;
            return true;
        }
        for (;;) {
            Blanks();
            if (!element()) return false;
            Blanks();
            if (Peek() == close) {
                ++at_;
                return true;
            }
            if (Peek() != ',') return false;
            ++at_;
        }
    }
    bool AnyValue() {
        switch (Peek()) {
            case '"': return String();
            case '{':
                return Sequence('{', '}', [&] {
                    if (!String()) return false;
                    Blanks();
                    if (Peek() != ':') return false;
                    ++at_;
                    Blanks();
                    return AnyValue();
                });
            case '[': return Sequence('[', ']', [&] { return AnyValue(); });
            case 't': return Literal("true");
            case 'f': return Literal("false");
            case 'n': return Literal("null");
            default: return Number();
        }
    }

    std::string_view text_;
    std::size_t at_ = 0;
};

}  // namespace tavctl::test
