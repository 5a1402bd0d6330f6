// One step of the conformance run per invocation: CTest runs the steps in
// order, each with its own filter, and each prints what it checked.
//
// usage: tav_conformance_tests --controller=<TavController.dll> [--sim=<TavSim.dll>]
//                              --step="<title>" [gtest options]
#include <cstdio>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

#include "conformance_support.h"

namespace {

// A full Windows path with backslashes, whatever slashes the build gave.
std::wstring WindowsPath(std::string_view path) {
    if (path.empty()) return {};
    const std::wstring wide(path.begin(), path.end());
    wchar_t full[MAX_PATH] = {};
    const DWORD length = GetFullPathNameW(wide.c_str(), MAX_PATH, full, nullptr);
    return length == 0 || length >= MAX_PATH ? wide : std::wstring(full, length);
}

std::string_view Option(std::string_view argument, std::string_view name) {
    return argument.substr(0, name.size()) == name ? argument.substr(name.size()) : std::string_view();
}

void PrintSummary(const std::string& step, bool passed) {
    using namespace tav::conformance;
    std::printf("\n==== conformance %s: %s ====\n", step.c_str(), passed ? "passed" : "FAILED");
    for (const std::string& line : CheckedLines()) std::printf("  %s\n", line.c_str());
    if (WineDifferences().empty()) {
        std::printf("  Wine differences accepted: none\n");
    } else {
        for (const std::string& line : WineDifferences()) std::printf("  Wine difference accepted: %s\n", line.c_str());
    }
    std::fflush(stdout);
}

}  // namespace

int main(int argc, char** argv) {
    testing::InitGoogleTest(&argc, argv);
    tav::conformance::ModulePaths paths;
    std::string step = "(unnamed step)";
    for (int i = 1; i < argc; ++i) {
        const std::string_view argument = argv[i];
        if (auto value = Option(argument, "--controller="); !value.empty()) paths.controller = WindowsPath(value);
        if (auto value = Option(argument, "--sim="); !value.empty()) paths.sim = WindowsPath(value);
        if (auto value = Option(argument, "--step="); !value.empty()) step = value;
    }
    if (paths.controller.empty()) {
        std::fprintf(stderr, "usage: %s --controller=<TavController.dll> [--sim=<TavSim.dll>] --step=<title>\n",
                     argv[0]);
        return 2;
    }
    std::printf("module under test: %s\n", tav::conformance::Narrow(paths.controller).c_str());
    tav::conformance::SetModules(std::move(paths));
    const int result = RUN_ALL_TESTS();
    PrintSummary(step, result == 0);
    return result;
}
