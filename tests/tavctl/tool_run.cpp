#include "tool_run.h"

#include <cstdio>
#include <fstream>
#include <sstream>

#include "build_tree.h"

#ifndef _WIN32
#include <sys/wait.h>
#include <unistd.h>
#endif

namespace tavctl::test {
namespace {

std::string ReadFile(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    std::string result = text.str();
    std::erase(result, '\r');
    return result;
}

std::filesystem::path Scratch(const std::string& name) {
    static int counter = 0;
#ifdef _WIN32
    const long id = 0;
#else
    const long id = static_cast<long>(getpid());
#endif
    return std::filesystem::temp_directory_path() /
           ("tavctl-test-" + std::to_string(id) + "-" + std::to_string(++counter) + "-" + name);
}

}  // namespace

std::filesystem::path ToolPath() {
    return tav::sim::test::BuildFolder() / "tools" / (std::string("tavctl") + tav::sim::test::kExecutableSuffix);
}

std::filesystem::path ModulePath() {
    return tav::sim::test::BuildFolder() / "module" /
           (std::string("TavController") + tav::sim::test::kModuleSuffix);
}

ToolRun RunTool(const std::string& arguments, const std::string& input) {
    const auto in = Scratch("in");
    const auto out = Scratch("out");
    const auto err = Scratch("err");
    {
        std::ofstream file(in, std::ios::binary);
        file << input;
    }
    const std::string command = "\"" + ToolPath().string() + "\" " + arguments + " <\"" + in.string() + "\" >\"" +
                                out.string() + "\" 2>\"" + err.string() + "\"";
    ToolRun run;
#ifdef _WIN32
    // cmd /c drops the first and the last quote of its line: give it a pair.
    run.exitCode = std::system(("\"" + command + "\"").c_str());
#else
    const int status = std::system(command.c_str());
    run.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
#endif
    run.out = ReadFile(out);
    run.err = ReadFile(err);
    run.output = run.out + run.err;
    std::filesystem::remove(in);
    std::filesystem::remove(out);
    std::filesystem::remove(err);
    return run;
}

std::string ToolUnavailable() {
    static const std::string why = [] {
        if (!std::filesystem::exists(ToolPath()) || !std::filesystem::exists(ModulePath())) {
            return std::string("tavctl or the TavController module is not built");
        }
        const ToolRun help = RunTool("--help");
        if (help.exitCode != 0 || help.out.find("Usage: tavctl") == std::string::npos) {
            return "tavctl cannot be started here: " + help.output;
        }
        return std::string();
    }();
    return why;
}

TempFile::TempFile(const std::string& name, const std::string& text) : path_(Scratch(name)) {
    std::ofstream file(path_, std::ios::binary);
    file << text;
}

TempFile::~TempFile() {
    std::error_code ignored;
    std::filesystem::remove(path_, ignored);
}

}  // namespace tavctl::test
