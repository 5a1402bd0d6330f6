// Runs of the tavctl executable against its embedded virtual controller,
// through the real module, and how the tool behaves across commands: batches,
// clock times, failures, the wire trace, Sync and Async giving the same
// values, JSON that parses, clients that are separate objects, the event
// types by name and what a class does not offer.
#include <gtest/gtest.h>

#include <sstream>

#include "json_check.h"
#include "tool_run.h"

namespace tavctl::test {
namespace {

class BehaviourTest : public ::testing::Test {
protected:
    void SetUp() override { TAVCTL_REQUIRE_TOOL(); }
};

std::vector<std::string> Lines(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

TEST_F(BehaviourTest, BatchSetsAndReadsTheControllerName) {
    const TempFile script("batch.txt",
                          "# a comment line\n"
                          "name set \"Smoke test cell\"\n"
                          "name get\n");
    const ToolRun run = RunTool("--echo batch \"" + script.Path().string() + "\"");
    EXPECT_EQ(0, run.exitCode) << run.output;
    EXPECT_NE(std::string::npos, run.out.find("tavctl> name get\nSmoke test cell\n")) << run.output;
}

// The clock crosses the tool as ISO-8601 UTC and the module as FILETIME.
TEST_F(BehaviourTest, ClockTimesSurviveTheRoundTrip) {
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

// --trace shows each command as the controller received and answered it.
TEST_F(BehaviourTest, TraceShowsWhatWentOverTheWire) {
    const ToolRun run = RunTool("--trace name set \"Traced cell\"");
    EXPECT_EQ(0, run.exitCode) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("trace: ")) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("CtrlName")) << run.output;
    EXPECT_NE(std::string::npos, run.err.find("Traced cell")) << run.output;
    EXPECT_EQ(std::string::npos, run.out.find("trace: ")) << "the trace keeps out of standard output";
}

// With --async the reply comes through the callback and is decoded by the
// operation's Unpack; the values must be the ones a Sync call gives.
TEST_F(BehaviourTest, AsyncRepliesDecodeToTheSyncValues) {
    const char* commands[] = {
        "name get", "id get", "guid", "version", "version release", "version name", "state get", "collision",
        "energy", "option Welding", "speed get", "vt state", "safety mode", "timezone get",
    };
    for (const char* command : commands) {
        const ToolRun sync = RunTool(std::string("--json ") + command);
        const ToolRun async = RunTool(std::string("--json --async ") + command);
        ASSERT_EQ(sync.exitCode, async.exitCode) << command << "\n" << sync.output << async.output;
        const auto asyncLines = Lines(async.out);
        if (sync.exitCode != 0) {
            continue;  // not answered yet by the virtual controller
        }
        ASSERT_EQ(2u, asyncLines.size()) << command << "\n" << async.output;
        EXPECT_EQ(0u, asyncLines[0].find("async reply: status 0x00000000 (S_OK)")) << async.output;
        EXPECT_EQ(sync.out, asyncLines[1] + "\n") << command;
    }
}

// Every line that --json prints is one JSON text, whatever the values hold.
TEST_F(BehaviourTest, JsonLinesParse) {
    const ToolRun run = RunTool("--json --keep-going batch",
                                "name set \"tab\there back\\\\slash\"\n"
                                "name get\nstate get\nmode get\nclock get --json\nversion\noption Welding\n"
                                "ipc slots\nipc sizes\nipc ping --count 5\nipc connect J\nipc name 1\n"
                                "user logon\nmaster request motion\nmaster get motion\nuas users\nls\nls /hd0a\n"
                                "error\nwatch start --type state\nstate set MotorsOn\nwatch wait\nwatch stop\n");
    EXPECT_EQ(0, run.exitCode) << run.output;
    const auto lines = Lines(run.out);
    EXPECT_GE(lines.size(), 15u) << run.out;
    // The name with its tab and backslash escaped, the state, the clock as a string.
    EXPECT_NE(std::string::npos, run.out.find("\"tab\\there back\\\\slash\"\n\"MotorsOff\"\n")) << run.out;
    EXPECT_NE(std::string::npos, run.out.find("\n\"20")) << run.out;
    for (const std::string& line : lines) {
        EXPECT_TRUE(JsonCheck::Valid(line)) << line;
    }
}

TEST(JsonCheckTest, TellsJsonFromNot) {
    for (const char* good : {"1", "-0.5e3", "\"a\\u00e9\"", "[]", "{}", "{\"a\": [1, true, null]}", " \"x\" "}) {
        EXPECT_TRUE(JsonCheck::Valid(good)) << good;
    }
    for (const char* bad : {"", "01", "\"a\tb\"", "[1,]", "{\"a\" 1}", "MotorsOn", "\"a\" \"b\"", "{1: 2}"}) {
        EXPECT_FALSE(JsonCheck::Valid(bad)) << bad;
    }
}

// Each client is an object of its own, logged on and master on its own: the
// second is refused what the first holds, and takes it once it is let go.
TEST_F(BehaviourTest, ClientsAreSeparateObjects) {
    const ToolRun run = RunTool("--keep-going batch",
                                "user logon\n"
                                "--client 2 user logon\n"
                                "master request kesto\n"
                                "--client 2 master request kesto\n"
                                "--client 2 --json master get kesto\n"
                                "master release kesto\n"
                                "--client 2 master request kesto\n"
                                "--json master get kesto\n");
    EXPECT_EQ(1, run.exitCode) << run.output;
    const auto refusals = Lines(run.err);
    ASSERT_EQ(1u, refusals.size()) << run.err;
    EXPECT_EQ(0u, refusals[0].find("tavctl: RequestMastership failed: ")) << run.err;
    const auto lines = Lines(run.out);
    ASSERT_EQ(2u, lines.size()) << run.out;
    EXPECT_NE(std::string::npos, lines[0].find("\"thisIsMe\": false")) << lines[0];
    EXPECT_NE(std::string::npos, lines[1].find("\"thisIsMe\": false")) << lines[1];
    EXPECT_NE(std::string::npos, lines[0].find("TavMastershipStatus_Held")) << lines[0];
}

TEST_F(BehaviourTest, ClientOptionAppliesToItsLineAlone) {
    const ToolRun run = RunTool("batch", "--client 3 user logon\nuser id\n");
    EXPECT_EQ(1, run.exitCode) << "client 1 never logged on\n" << run.output;
    EXPECT_NE(std::string::npos, run.err.find("GetUserId failed")) << run.output;
    const ToolRun bad = RunTool("batch", "--client x name get\n");
    EXPECT_EQ(2, bad.exitCode) << bad.output;
    EXPECT_NE(std::string::npos, bad.err.find("--client wants a number from 1 to 16, not \"x\"")) << bad.output;
}

// Failures by their exit status and text: subscriptions by type name (what
// the class knows is passed on; what it does not know is the module's
// refusal, an operation failure; a name that is no type is a usage error),
// a failed operation with its HRESULT, name and last error, interfaces a
// class does not offer, and the tool's own looks.
TEST_F(BehaviourTest, FailuresByStatusAndText) {
    struct Case {
        const char* arguments;
        int exitCode;
        const char* text;
    };
    const Case cases[] = {
        {"watch --type state,mode --count 0 --timeout 0.2", 0, ""},
        {"--class TavController14 watch --type SafetyModeStatus --timeout 0.1", 1,
         "Subscribe(SafetyModeStatus) failed: 0x80070057 (E_INVALIDARG); last error: Subscribe. Unknown "
         "subscription type."},
        {"--class TavController3 watch --type SystemDiagnosticsInfoEvent --timeout 0.1", 1,
         "Subscribe. Unknown subscription type."},
        {"watch --type 4 --timeout 0.1", 2, "unknown event type \"4\""},
        {"watch --type , --timeout 0.1", 2, "unknown event type \"\""},
        {"watch --type \"\" --timeout 0.1", 2, "--type names no event type"},
        {"--sim-fail CtrlName=0x80070005 name get", 1,
         "GetControllerName failed: 0x80070005 (E_ACCESSDENIED); last error: CtrlName: simulated failure; "},
        {"--class TavController3 pin state", 1, "class TavController3 does not offer ITavPanel3"},
        {"ls /hd0a/nothing", 1, "ls: no such file or folder \"/hd0a/nothing\""},
        {"ls hd0a/../etc", 1, "ls: no such file or folder"},
        {"ipc receive 77 --timeout 10", 1, "Receive failed: 0xC004AB00"},
        {"batch", 0, ""},  // an empty batch does nothing
    };
    for (const Case& c : cases) {
        const ToolRun run = RunTool(c.arguments);
        EXPECT_EQ(c.exitCode, run.exitCode) << c.arguments << "\n" << run.output;
        EXPECT_NE(std::string::npos, run.err.find(c.text)) << c.arguments << "\n" << run.output;
    }
}

}  // namespace
}  // namespace tavctl::test
