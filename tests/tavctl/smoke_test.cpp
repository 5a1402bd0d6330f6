// One end-to-end run of the tavctl executable against its embedded virtual
// controller, through the real module; skipped where either is not built or
// cannot be started (as under user-mode emulation without binfmt).
#include <cstdio>
#include <filesystem>
#include <fstream>

#include "build_tree.h"
#include "sim_test_support.h"

#ifndef _WIN32
#include <sys/wait.h>
#include <unistd.h>
#endif

namespace tav::sim::test {
namespace {

struct ToolRun {
    int exitCode = -1;
    std::string output;  // standard output and error together
};

ToolRun RunTool(const std::filesystem::path& tool, const std::string& arguments) {
    const std::string command = "\"" + tool.string() + "\" " + arguments + " 2>&1";
    ToolRun run;
#ifdef _WIN32
    // cmd /c drops the first and the last quote of its line: give it a pair.
    FILE* pipe = _popen(("\"" + command + "\"").c_str(), "r");
#else
    FILE* pipe = popen(command.c_str(), "r");
#endif
    if (pipe == nullptr) {
        return run;
    }
    char buffer[512];
    while (std::fgets(buffer, sizeof buffer, pipe) != nullptr) {
        run.output += buffer;
    }
#ifdef _WIN32
    run.exitCode = _pclose(pipe);
#else
    const int status = pclose(pipe);
    run.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
#endif
    std::erase(run.output, '\r');
    return run;
}

class TavctlSmokeTest : public ::testing::Test {
protected:
    void SetUp() override {
        tool_ = BuildFolder() / "tools" / (std::string("tavctl") + kExecutableSuffix);
        const auto module = BuildFolder() / "module" / (std::string("TavController") + kModuleSuffix);
        if (!std::filesystem::exists(tool_) || !std::filesystem::exists(module)) {
            GTEST_SKIP() << "tavctl or the TavController module is not built";
        }
        const ToolRun help = RunTool(tool_, "--help");
        if (help.exitCode != 0 || help.output.find("Usage: tavctl") == std::string::npos) {
            GTEST_SKIP() << "tavctl cannot be started here: " << help.output;
        }
    }

    std::filesystem::path tool_;
};

TEST_F(TavctlSmokeTest, BatchSetsAndReadsTheControllerName) {
    const auto script = std::filesystem::temp_directory_path() / "tavctl-smoke-batch.txt";
    {
        std::ofstream file(script);
        file << "# a comment line\n"
                "name set \"Smoke test cell\"\n"
                "name get\n";
    }
    const ToolRun run = RunTool(tool_, "--echo batch \"" + script.string() + "\"");
    std::filesystem::remove(script);
    EXPECT_EQ(0, run.exitCode) << run.output;
    EXPECT_NE(std::string::npos, run.output.find("tavctl> name get\nSmoke test cell\n")) << run.output;
}

// The clock crosses the tool as ISO-8601 UTC and the module as FILETIME.
TEST_F(TavctlSmokeTest, ClockTimesSurviveTheRoundTrip) {
    const auto script = std::filesystem::temp_directory_path() / "tavctl-smoke-clock.txt";
    const char* times[] = {"1970-01-01T00:00:00Z", "2024-02-29T23:59:59Z", "2106-02-07T06:28:15Z"};
    {
        std::ofstream file(script);
        for (const char* time : times) {
            file << "clock set " << time << "\nclock get\n";
        }
    }
    const ToolRun run = RunTool(tool_, "batch \"" + script.string() + "\"");
    std::filesystem::remove(script);
    EXPECT_EQ(0, run.exitCode) << run.output;
    // The clock runs on between set and get; a second at most.
    EXPECT_NE(std::string::npos, run.output.find("1970-01-01T00:00:0")) << run.output;
    const bool leapDay = run.output.find("2024-02-29T23:59:59Z\n") != std::string::npos ||
                         run.output.find("2024-03-01T00:00:00Z\n") != std::string::npos;
    EXPECT_TRUE(leapDay) << run.output;
    EXPECT_NE(std::string::npos, run.output.find("2106-02-07T06:28:1")) << run.output;

    for (const char* bad : {"2026-02-30T00:00:00Z", "2026-13-01T00:00:00Z", "2026-11-21T02:30:00", "yesterday"}) {
        EXPECT_EQ(2, RunTool(tool_, std::string("clock set ") + bad).exitCode) << bad;
    }
}

TEST_F(TavctlSmokeTest, FailurePrintsTheHresultItsNameAndTheLastError) {
    const ToolRun run = RunTool(tool_, "--sim-fail CtrlName=0x80070005 name get");
    EXPECT_EQ(1, run.exitCode) << run.output;
    EXPECT_NE(std::string::npos, run.output.find("0x80070005 (E_ACCESSDENIED)")) << run.output;
    EXPECT_NE(std::string::npos, run.output.find("last error: CtrlName: simulated failure; ")) << run.output;
}

TEST_F(TavctlSmokeTest, UsageErrorsExitWithTwo) {
    EXPECT_EQ(2, RunTool(tool_, "name rename x").exitCode);
    EXPECT_EQ(2, RunTool(tool_, "--no-such-option name get").exitCode);
    const ToolRun help = RunTool(tool_, "clock --help");
    EXPECT_EQ(0, help.exitCode);
    EXPECT_NE(std::string::npos, help.output.find("2026-11-21T02:30:00Z")) << help.output;
}

}  // namespace
}  // namespace tav::sim::test
