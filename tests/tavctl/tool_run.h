#pragma once
// Runs the built tavctl as a process, its output captured.
#include <filesystem>
#include <string>

namespace tavctl::test {

struct ToolRun {
    int exitCode = -1;
    std::string out;     // standard output
    std::string err;     // standard error
    std::string output;  // both, standard output first
};

std::filesystem::path ToolPath();
std::filesystem::path ModulePath();

// `arguments` is a shell command-line tail; `input` goes to standard input.
ToolRun RunTool(const std::string& arguments, const std::string& input = {});

// Skips the calling test when tavctl or the module is not built or cannot
// be started here (as under user-mode emulation without binfmt).
#define TAVCTL_REQUIRE_TOOL()                                                          \
    do {                                                                               \
        if (const std::string why = ::tavctl::test::ToolUnavailable(); !why.empty()) { \
            GTEST_SKIP() << why;                                                       \
        }                                                                              \
    } while (false)
std::string ToolUnavailable();

// A file with the given text in the temporary folder, removed with the object.
class TempFile {
public:
    TempFile(const std::string& name, const std::string& text);
    ~TempFile();
    TempFile(const TempFile&) = delete;
    TempFile& operator=(const TempFile&) = delete;
    const std::filesystem::path& Path() const { return path_; }

private:
    std::filesystem::path path_;
};

}  // namespace tavctl::test
