// End-to-end runs of the tavctl executable against its embedded virtual
// controller, through the real module.
#include <gtest/gtest.h>

#include "tool_run.h"

namespace tavctl::test {
namespace {

class TavctlSmokeTest : public ::testing::Test {
protected:
    void SetUp() override { TAVCTL_REQUIRE_TOOL(); }
};

TEST_F(TavctlSmokeTest, BatchSetsAndReadsTheControllerName) {
    const TempFile script("batch.txt",
                          "# a comment line\n"
                          "name set \"Smoke test cell\"\n"
                          "name get\n");
    const ToolRun run = RunTool("--echo batch \"" + script.Path().string() + "\"");
    EXPECT_EQ(0, run.exitCode) << run.output;
    EXPECT_NE(std::string::npos, run.out.find("tavctl> name get\nSmoke test cell\n")) << run.output;
}

// The clock crosses the tool as ISO-8601 UTC and the module as FILETIME.
TEST_F(TavctlSmokeTest, ClockTimesSurviveTheRoundTrip) {
    std::string commands;
    for (const char* time : {"1970-01-01T00:00:00Z", "2024-02-29T23:59:59Z", "2106-02-07T06:28:15Z"}) {
        commands += std::string("clock set ") + time + "\nclock get\n";
    }
    const ToolRun run = RunTool("batch", commands);
    EXPECT_EQ(0, run.exitCode) << run.output;
    // The clock runs on between set and get; a second at most.
    EXPECT_NE(std::string::npos, run.out.find("1970-01-01T00:00:0")) << run.output;
    const bool leapDay = run.out.find("2024-02-29T23:59:59Z\n") != std::string::npos ||
                         run.out.find("2024-03-01T00:00:00Z\n") != std::string::npos;
    EXPECT_TRUE(leapDay) << run.output;
    EXPECT_NE(std::string::npos, run.out.find("2106-02-07T06:28:1")) << run.output;

    for (const char* bad : {"2026-02-30T00:00:00Z", "2026-13-01T00:00:00Z", "2026-11-21T02:30:00", "yesterday"}) {
        EXPECT_EQ(2, RunTool(std::string("clock set ") + bad).exitCode) << bad;
    }
}

TEST_F(TavctlSmokeTest, FailurePrintsTheHresultItsNameAndTheLastError) {
    const ToolRun run = RunTool("--sim-fail CtrlName=0x80070005 name get");
    EXPECT_EQ(1, run.exitCode) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("GetControllerName failed: 0x80070005 (E_ACCESSDENIED)")) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("last error: CtrlName: simulated failure; ")) << run.output;
}

// --trace shows each command as the controller received and answered it.
TEST_F(TavctlSmokeTest, TraceShowsWhatWentOverTheWire) {
    const ToolRun run = RunTool("--trace name set \"Traced cell\"");
    EXPECT_EQ(0, run.exitCode) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("trace: ")) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("CtrlName")) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("Traced cell")) << run.output;
    EXPECT_EQ(std::string::npos, run.out.find("trace: ")) << "the trace keeps out of standard output";
}

}  // namespace
}  // namespace tavctl::test
