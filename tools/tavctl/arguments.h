#pragma once
#include <optional>
#include <string>
#include <vector>

namespace tavctl {

// The words after a command's name.
class CommandArguments {
public:
    explicit CommandArguments(std::vector<std::string> words) : words_(std::move(words)) {}

    bool Done() const { return next_ >= words_.size(); }
    std::optional<std::string> Next();
    bool HelpWanted() const;
    // "--count 3": the value after the option, removed from the words; empty
    // when the option is absent. `missing` is set when the value is.
    std::optional<std::string> Option(const std::string& name, bool& missing);
    bool Flag(const std::string& name);
    std::vector<std::string> Rest();

private:
    std::vector<std::string> words_;
    std::size_t next_ = 0;
};

// Splits a batch line into words: blanks separate, double quotes group (a
// backslash takes the next character literally); "#" starts a comment.
// Empty with error set for an unterminated quote.
std::optional<std::vector<std::string>> SplitLine(const std::string& line, std::string& error);

}  // namespace tavctl
