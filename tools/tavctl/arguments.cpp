#include "tavctl/arguments.h"

#include <algorithm>

namespace tavctl {

std::optional<std::string> CommandArguments::Next() {
    if (Done()) {
        return std::nullopt;
    }
    return words_[next_++];
}

bool CommandArguments::HelpWanted() const {
    return std::any_of(words_.begin(), words_.end(), [](const std::string& w) { return w == "--help" || w == "-h"; });
}

std::optional<std::string> CommandArguments::Option(const std::string& name, bool& missing) {
    missing = false;
    for (std::size_t i = next_; i < words_.size(); ++i) {
        if (words_[i] == name) {
            if (i + 1 >= words_.size()) {
                missing = true;
                words_.erase(words_.begin() + static_cast<std::ptrdiff_t>(i));
                return std::nullopt;
            }
            std::string value = words_[i + 1];
            words_.erase(words_.begin() + static_cast<std::ptrdiff_t>(i),
                         words_.begin() + static_cast<std::ptrdiff_t>(i + 2));
            return value;
        }
    }
    return std::nullopt;
}

bool CommandArguments::Flag(const std::string& name) {
    for (std::size_t i = next_; i < words_.size(); ++i) {
        if (words_[i] == name) {
            words_.erase(words_.begin() + static_cast<std::ptrdiff_t>(i));
            return true;
        }
    }
    return false;
}

std::vector<std::string> CommandArguments::Rest() {
    std::vector<std::string> rest(words_.begin() + static_cast<std::ptrdiff_t>(std::min(next_, words_.size())),
                                  words_.end());
    next_ = words_.size();
    return rest;
}

std::optional<std::vector<std::string>> SplitLine(const std::string& line, std::string& error) {
    std::vector<std::string> words;
    std::string word;
    bool inWord = false;
    bool quoted = false;
    for (std::size_t i = 0; i < line.size(); ++i) {
        const char c = line[i];
        if (quoted) {
            if (c == '\\' && i + 1 < line.size()) {
                word.push_back(line[++i]);
            } else if (c == '"') {
                quoted = false;
            } else {
                word.push_back(c);
            }
        } else if (c == '"') {
            quoted = true;
            inWord = true;
        } else if (c == '#' && !inWord) {
            break;
        } else if (c == ' ' || c == '\t' || c == '\r' || c == '\n') {
            if (inWord) {
                words.push_back(std::move(word));
                word.clear();
                inWord = false;
            }
        } else {
            word.push_back(c);
            inWord = true;
        }
    }
    if (quoted) {
        error = "unterminated quote";
        return std::nullopt;
    }
    if (inWord) {
        words.push_back(std::move(word));
    }
    return words;
}

}  // namespace tavctl
