// Wrong command lines: each gives one line naming the problem, the usage of
// the command concerned, and an exit status that tells usage errors (2),
// operation failures (1) and setup failures (3) apart.
#include <gtest/gtest.h>

#include "tool_run.h"

namespace tavctl::test {
namespace {

struct HostileCase {
    const char* label;
    std::string arguments;
    int exitCode;
    const char* problem;  // in the first line of standard error
    const char* usage;    // in what follows it ("" when none is due)
};

std::string Long(std::size_t bytes) { return std::string(bytes, 'a'); }

// The tests start tavctl through the shell, and cmd.exe takes a line of at
// most 8191 characters; elsewhere a word of 100 KB passes whole.
#ifdef _WIN32
constexpr std::size_t kLongWord = 6000;
#else
constexpr std::size_t kLongWord = 100000;
#endif
const std::string kLongWordCount = "...\" (" + std::to_string(kLongWord) + " bytes)";

std::vector<HostileCase> Cases() {
    return {
        {"unknown group", "fly away", 2, "unknown group \"fly\"", "tavctl --help"},
        {"unknown verb", "speed fly", 2, "speed: unknown verb \"fly\" (get, set)", "Usage: tavctl speed get"},
        {"missing verb", "pin", 2, "pin: verb missing (lock, unlock, state)", "tavctl pin lock PIN"},
        {"missing argument", "speed set", 2, "speed set: RATIO missing", "Usage: tavctl speed set RATIO"},
        {"extra argument", "name get now", 2, "name get: unexpected argument \"now\"", "Usage: tavctl name get"},
        {"not a number", "speed set fast", 2, "RATIO must be a whole number from -32768 to 32767, not \"fast\"",
         "Usage: tavctl speed set RATIO"},
        {"out of range for a short", "speed set 32768", 2, "from -32768 to 32767, not \"32768\"",
         "Usage: tavctl speed set RATIO"},
        {"negative unsigned", "pin unlock -1", 2, "PIN must be a whole number from 0 to 4294967295, not \"-1\"",
         "Usage: tavctl pin unlock PIN"},
        {"beyond 32 bits", "autocond ack 4294967296 reset", 2, "ID must be a whole number from 0 to 4294967295",
         "Usage: tavctl autocond ack ID reset|keep"},
        {"number with trailing text", "vt slice 10ms", 2, "not \"10ms\"", "Usage: tavctl vt slice"},
        {"unknown enum name", "master get everything", 2, "unknown RESOURCE \"everything\"",
         "Usage: tavctl master get RESOURCE"},
        {"option without value", "ipc connect slot --max-msg", 2, "--max-msg needs a value",
         "Usage: tavctl ipc connect NAME"},
        {"unknown event type", "watch --type state,weather --count 1", 2, "unknown event type \"weather\"",
         "Usage: tavctl watch"},
        {"long word quoted back cut", "speed set " + Long(kLongWord), 2, kLongWordCount.c_str(),
         "Usage: tavctl speed set RATIO"},
        {"long name reaches the module", "name set " + Long(kLongWord), 1,
         "SetControllerName failed: 0x80070057 (E_INVALIDARG); last error: ", ""},
        {"text beyond Latin-1", "name set \"Zürich €\"", 1, "SetControllerName failed: 0xC0040408", ""},
        {"non-ASCII number", "speed set \"５０\"", 2, "RATIO must be a whole number", "Usage: tavctl speed set"},
        {"URL without slash", "--url cell7 name get", 3, "Init(\"cell7\") failed: 0x80070057 (E_INVALIDARG)", ""},
        {"URL of no registered controller", "--url /cell7 name get", 3, "Init(\"/cell7\") failed: 0x80040154", ""},
        {"client 0", "--client 0 name get", 2, "--client wants a number from 1 to 16, not 0", "tavctl --help"},
        {"unknown global option", "--colour name get", 2, "unknown option --colour", "tavctl --help"},
        {"unknown class", "--class TavController99 name get", 2, "unknown class \"TavController99\"", ""},
        {"time-out not a number", "--timeout soon name get", 2, "--timeout wants milliseconds, not soon", ""},
        {"batch with two files", "batch a b", 2, "batch: expected at most one file", "Usage: tavctl batch"},
        {"batch file missing", "batch /nonexistent/commands", 2, "batch: cannot read", ""},
        {"operation refused", "state set GuardStop", 1,
         "SetControllerState failed: 0x80070057 (E_INVALIDARG); last error: SetControllerState. Not allowed state "
         "change.",
         ""},
    };
}

class HostileInputTest : public ::testing::TestWithParam<HostileCase> {
protected:
    void SetUp() override { TAVCTL_REQUIRE_TOOL(); }
};

TEST_P(HostileInputTest, NamesTheProblemShowsTheUsageAndExitsDistinctly) {
    const HostileCase& c = GetParam();
    const ToolRun run = RunTool(c.arguments);
    EXPECT_EQ(c.exitCode, run.exitCode) << run.output;
    const std::string first = run.err.substr(0, run.err.find('\n'));
    EXPECT_NE(std::string::npos, first.find(c.problem)) << run.err;
    EXPECT_LT(first.size(), 400u) << "the message stays one readable line";
    if (*c.usage != '\0') {
        EXPECT_NE(std::string::npos, run.err.find(c.usage, first.size())) << run.err;
    }
    EXPECT_EQ("", run.out) << "errors go to standard error";
}

INSTANTIATE_TEST_SUITE_P(Cases, HostileInputTest, ::testing::ValuesIn(Cases()),
                         [](const ::testing::TestParamInfo<HostileCase>& info) {
                             std::string name;
                             for (const char c : std::string(info.param.label)) {
                                 name += std::isalnum(static_cast<unsigned char>(c)) ? c : '_';
                             }
                             return name;
                         });

// In a batch a usage error stops it with 2, unless --keep-going, which goes
// on and still reports the first failure.
TEST(HostileBatchTest, UsageErrorsInABatch) {
    TAVCTL_REQUIRE_TOOL();
    const ToolRun stopped = RunTool("batch", "name get\nspeed set fast\nname get\n");
    EXPECT_EQ(2, stopped.exitCode) << stopped.output;
    EXPECT_NE(std::string::npos, stopped.err.find("batch stopped at line 2")) << stopped.output;

    const ToolRun going = RunTool("--keep-going batch", "speed set fast\nname get\n\"unterminated\n");
    EXPECT_EQ(2, going.exitCode) << going.output;
    EXPECT_NE(std::string::npos, going.out.find("sim")) << going.output;
    EXPECT_NE(std::string::npos, going.err.find("batch line 3: unterminated quote")) << going.output;
}

}  // namespace
}  // namespace tavctl::test
