#include "module/script_parser.h"

#include <cctype>
#include <string>

namespace tav {
namespace {

constexpr HRESULT kMalformed = HRESULT_FROM_WIN32(ERROR_INVALID_DATA);

struct Token {
    enum class Kind { Word, Quoted, Open, Close, Equals, End };
    Kind kind = Kind::End;
    std::string_view raw;  // as written, quotes removed but '' not yet undone
};

bool SameWord(std::string_view a, std::string_view b) {
    if (a.size() != b.size()) {
        return false;
    }
    for (size_t i = 0; i < a.size(); ++i) {
        if (std::tolower(static_cast<unsigned char>(a[i])) != std::tolower(static_cast<unsigned char>(b[i]))) {
            return false;
        }
    }
    return true;
}

class Parser {
public:
    Parser(std::string_view text, const ScriptVariables& variables) : text_(text), variables_(variables) {}

    HRESULT Parse(std::vector<ScriptBlock>& blocks) {
        HRESULT hr = Advance();
        while (SUCCEEDED(hr) && current_.kind != Token::Kind::End) {
            ScriptBlock block{};
            hr = ParseRoot(block.root);
            if (SUCCEEDED(hr)) hr = Expect(Token::Kind::Open);
            if (SUCCEEDED(hr)) hr = ParseBody(block.entries);
            if (SUCCEEDED(hr)) blocks.push_back(std::move(block));
        }
        return hr;
    }

private:
    HRESULT ParseRoot(ScriptRoot& root) {
        if (current_.kind != Token::Kind::Word) {
            return kMalformed;
        }
        const std::string_view name = current_.raw;
        if (SameWord(name, "HKCR") || SameWord(name, "HKEY_CLASSES_ROOT")) {
            root = ScriptRoot::ClassesRoot;
        } else if (SameWord(name, "HKCU") || SameWord(name, "HKEY_CURRENT_USER")) {
            root = ScriptRoot::CurrentUser;
        } else if (SameWord(name, "HKLM") || SameWord(name, "HKEY_LOCAL_MACHINE")) {
            root = ScriptRoot::LocalMachine;
        } else {
            return kMalformed;
        }
        return Advance();
    }

    // Entries up to and including the closing brace.
    HRESULT ParseBody(std::vector<ScriptEntry>& entries) {
        while (current_.kind != Token::Kind::Close) {
            ScriptEntry entry;
            HRESULT hr = ParseEntry(entry);
            if (FAILED(hr)) {
                return hr;
            }
            entries.push_back(std::move(entry));
        }
        return Advance();
    }

    HRESULT ParseEntry(ScriptEntry& entry) {
        HRESULT hr = ParseModifiers(entry);
        if (FAILED(hr)) {
            return hr;
        }
        if (IsWord("val")) {
            entry.kind = ScriptEntry::Kind::NamedValue;
            hr = Advance();
            if (SUCCEEDED(hr)) hr = TakeName(entry.name);
            if (SUCCEEDED(hr)) hr = Expect(Token::Kind::Equals);
            OleString value;
            if (SUCCEEDED(hr)) hr = ParseValue(value);
            if (SUCCEEDED(hr)) entry.value = std::move(value);
            return hr;
        }
        hr = TakeName(entry.name);
        if (SUCCEEDED(hr) && entry.name.find(OLECHAR('\\')) != OleString::npos) {
            hr = kMalformed;  // one key per entry, so that removal knows what it wrote
        }
        if (SUCCEEDED(hr) && current_.kind == Token::Kind::Equals) {
            OleString value;
            hr = Advance();
            if (SUCCEEDED(hr)) hr = ParseValue(value);
            if (SUCCEEDED(hr)) entry.value = std::move(value);
        }
        if (SUCCEEDED(hr) && current_.kind == Token::Kind::Open) {
            hr = Advance();
            if (SUCCEEDED(hr)) hr = ParseBody(entry.children);
        }
        return hr;
    }

    HRESULT ParseModifiers(ScriptEntry& entry) {
        for (;;) {
            bool* flag = IsWord("NoRemove")      ? &entry.noRemove
                         : IsWord("ForceRemove") ? &entry.forceRemove
                         : IsWord("Delete")      ? &entry.deleteKey
                                                 : nullptr;
            if (flag == nullptr) {
                return S_OK;
            }
            *flag = true;
            HRESULT hr = Advance();
            if (FAILED(hr)) {
                return hr;
            }
        }
    }

    HRESULT ParseValue(OleString& value) {
        if (!IsWord("s")) {
            return kMalformed;
        }
        HRESULT hr = Advance();
        if (SUCCEEDED(hr) && current_.kind != Token::Kind::Quoted) {
            hr = kMalformed;
        }
        if (SUCCEEDED(hr)) hr = Expand(current_, value);
        if (SUCCEEDED(hr)) hr = Advance();
        return hr;
    }

    HRESULT TakeName(OleString& name) {
        if (current_.kind != Token::Kind::Word && current_.kind != Token::Kind::Quoted) {
            return kMalformed;
        }
        HRESULT hr = Expand(current_, name);
        if (SUCCEEDED(hr) && name.empty()) {
            hr = kMalformed;
        }
        if (SUCCEEDED(hr)) hr = Advance();
        return hr;
    }

    HRESULT Expect(Token::Kind kind) { return current_.kind == kind ? Advance() : kMalformed; }

    bool IsWord(std::string_view keyword) const {
        return current_.kind == Token::Kind::Word && SameWord(current_.raw, keyword);
    }

    // The token's text with '' undone and the variables replaced. The script
    // is ASCII; each byte becomes one character.
    HRESULT Expand(const Token& token, OleString& out) const {
        out.clear();
        const std::string_view raw = token.raw;
        for (size_t i = 0; i < raw.size(); ++i) {
            const char c = raw[i];
            if (c == '\'' && token.kind == Token::Kind::Quoted) {
                ++i;  // the tokenizer only lets doubled quotes through
                out.push_back(OLECHAR('\''));
            } else if (c == '%') {
                const size_t end = raw.find('%', i + 1);
                if (end == std::string_view::npos) {
                    return kMalformed;
                }
                if (end == i + 1) {
                    out.push_back(OLECHAR('%'));
                } else {
                    const std::string_view name = raw.substr(i + 1, end - i - 1);
                    const auto found = variables_.find(OleString(name.begin(), name.end()));
                    if (found == variables_.end()) {
                        return kMalformed;
                    }
                    out += found->second;
                }
                i = end;
            } else {
                out.push_back(static_cast<OLECHAR>(static_cast<unsigned char>(c)));
            }
        }
        return S_OK;
    }

    HRESULT Advance() {
        while (pos_ < text_.size() && std::isspace(static_cast<unsigned char>(text_[pos_])) != 0) {
            ++pos_;
        }
        current_ = Token{};
        if (pos_ == text_.size()) {
            return S_OK;
        }
        if (text_[pos_] == '\'') {
            return AdvanceQuoted();
        }
        // Words end at white space only, so that {GUID} is one word and a
        // brace or an equals sign is a token only when it stands alone.
        const size_t start = pos_;
        while (pos_ < text_.size() && std::isspace(static_cast<unsigned char>(text_[pos_])) == 0) {
            ++pos_;
        }
        current_.raw = text_.substr(start, pos_ - start);
        current_.kind = current_.raw == "{"   ? Token::Kind::Open
                        : current_.raw == "}" ? Token::Kind::Close
                        : current_.raw == "=" ? Token::Kind::Equals
                                              : Token::Kind::Word;
        return S_OK;
    }

    HRESULT AdvanceQuoted() {
        const size_t start = ++pos_;
        for (;;) {
            const size_t quote = text_.find('\'', pos_);
            if (quote == std::string_view::npos) {
                return kMalformed;
            }
            if (quote + 1 < text_.size() && text_[quote + 1] == '\'') {
                pos_ = quote + 2;
                continue;
            }
            current_.kind = Token::Kind::Quoted;
            current_.raw = text_.substr(start, quote - start);
            pos_ = quote + 1;
            return S_OK;
        }
    }

    std::string_view text_;
    size_t pos_ = 0;
    Token current_;
    const ScriptVariables& variables_;
};

}  // namespace

HRESULT ParseRegistryScript(std::string_view text, const ScriptVariables& variables,
                            std::vector<ScriptBlock>& blocks) {
    std::vector<ScriptBlock> parsed;
    const HRESULT hr = Parser(text, variables).Parse(parsed);
    if (SUCCEEDED(hr)) {
        blocks = std::move(parsed);
    }
    return hr;
}

}  // namespace tav
