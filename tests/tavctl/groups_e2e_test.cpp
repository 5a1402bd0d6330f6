// A few verbs of each group against the embedded virtual controller, as a
// user runs them: one batch per group, its output checked line by line.
#include <gtest/gtest.h>

#include "tool_run.h"

namespace tavctl::test {
namespace {

struct Session {
    const char* group;
    const char* options;
    const char* commands;
    std::vector<const char*> expected;  // in the output, in this order
};

std::vector<Session> Sessions() {
    return {
        {"identity", "", "name set Cell\nname get\nid get\nversion name\noption Welding\n",
         {"Cell\n"}},
        {"panel", "", "state set on\nstate get\nmode set Manr\nmode get\ncollision\n",
         {"MotorsOn\n", "Manr\n", "CollisionDetect_"}},
        {"speed and pin", "",
         "speed set 40\nspeed get\npin lock 1234\npin state\npin unlock 1234\npin state\n",
         {"40\n", "OPModeLockStateLocked\n", "OPModeLockStateUnlocked\n"}},
        {"vt", "", "vt set free\nvt state\nvt slice 20\nvt slice\nvt speed 3\nvt speed\n",
         {"VTFreeRun\n", "20\n", "3\n"}},
        {"watch by type name", "",
         "watch start --type SpeedRatio,OPModePinCodeLockState\nspeed set 70\nwatch wait --count 1 --timeout 5\n"
         "pin lock 99 --permanent\nwatch wait --count 2 --timeout 5\nwatch stop\n",
         {"SpeedRatio 70\n", "OPModePinCodeLockState OPModeLockStatePendingPermLocked\n"}},
        {"watch", "", "watch start --type state\nstate set MotorsOn\nwatch wait --count 1\nwatch stop\n",
         {"state MotorsOn\n"}},
        {"watch json", "--json", "watch start --type state,mode\nstate set MotorsOn\nwatch wait --count 1\nwatch stop\n",
         {"\"type\": \"state\", \"state\": \"MotorsOn\"}\n"}},
        {"ipc", "",
         "ipc connect Inbox --max-msg 5 --max-size 100\nipc send Echo 7 hello --from 2 --user-data 42\n"
         "ipc receive 2 --timeout 2000\nipc slots\nipc name 1\nipc id Echo\n",
         {"2\n", "cmd:      7", "userData: 42", "data:     hello", "Echo ", "Inbox", "Echo\n", "1\n"}},
        {"ipc ping", "--json", "ipc ping --count 20 --size 8\n", {"{\"messages\": 20, \"perSecond\": "}},
        {"ipc sizes", "--json", "ipc sizes\n", {"{\"maxMessageSize\": "}},
        {"users and mastership", "",
         "user logon\n--client 2 user logon\nmaster request cfg\nmaster get cfg\n--client 2 master get cfg\n"
         "master release cfg\n--client 2 master request cfg\n--client 2 master get cfg\nuas users\n",
         {"TavMastershipStatus_", "thisIsMe:    true", "thisIsMe:    false", "thisIsMe:    true"}},
        {"ls", "--json", "ls /hd0a\n", {"{\"name\": \"backups/\", \"size\": null}"}},
    };
}

class GroupSessionTest : public ::testing::TestWithParam<Session> {
protected:
    void SetUp() override { TAVCTL_REQUIRE_TOOL(); }
};

TEST_P(GroupSessionTest, PrintsWhatTheControllerSays) {
    const Session& s = GetParam();
    const ToolRun run = RunTool(std::string(s.options) + " batch", s.commands);
    ASSERT_EQ(0, run.exitCode) << run.output;
    std::size_t at = 0;
    for (const char* text : s.expected) {
        const std::size_t found = run.out.find(text, at);
        ASSERT_NE(std::string::npos, found) << "\"" << text << "\" after offset " << at << " in\n" << run.out;
        at = found + 1;
    }
}

INSTANTIATE_TEST_SUITE_P(Groups, GroupSessionTest, ::testing::ValuesIn(Sessions()),
                         [](const ::testing::TestParamInfo<Session>& info) {
                             std::string name;
                             for (const char c : std::string(info.param.group)) {
                                 name += std::isalnum(static_cast<unsigned char>(c)) ? c : '_';
                             }
                             return name;
                         });

// Every group's verbs reach the module with well-formed arguments: the run
// ends either with the controller's answer or with an operation failure
// that names the operation, never with a usage error or a crash. (Groups the
// virtual controller does not answer yet fail with its status.)
TEST(GroupReachTest, EveryGroupReachesTheModule) {
    TAVCTL_REQUIRE_TOOL();
    const char* commands[] = {
        "speed get", "speed set 50", "pin state", "pin lock 1234 --permanent", "pin unlock 1234",
        "vt state", "vt set VTFreeRun", "vt slice 10", "vt time", "vt run", "vt speed 2",
        "backup state", "backup start /hd0a/backups/b1", "backup check /hd0a/backups/b1 --include RestoreInclude_CFG",
        "backup restore /hd0a/backups/b1 --settings 0 --delete", "backup version /hd0a/backups/b1",
        "system list --sort 1 --filter 2", "system current", "system select Main", "system deselect",
        "system remove Old", "system install /hd0a/pkg --overwrite", "boot device", "boot device usb1",
        "boot spanned", "boot load", "boot undo", "inbox state", "inbox busy", "inbox path", "inbox open",
        "inbox clear", "inbox precheck", "inbox load-completed", "inbox apply", "inbox version license",
        "inbox validate /hd0a/inbox", "inbox upgrade /hd0a/boot", "devices", "devices --v2",
        "copy file /hd0a/a /hd0a/b", "copy dir /hd0a/temp /hd0a/temp2", "diag save /hd0a/diag", "diag status",
        "screendump request", "screendump status", "lan method", "lan method DHCP", "lan get", "lan config",
        "lan set --method FIXIP --address 10.0.0.2 --mask 255.0.0.0 --gateway 10.0.0.1", "lan info",
        "camera count", "camera list", "camera valid Cam1", "camera status Cam1", "camera info Cam1",
        "camera info --index 0", "camera rename 0 Cam2", "camera state Cam1 CameraStatus_Running",
        "camera ip Cam1 10.0.0.5 255.0.0.0 10.0.0.1", "camera dns Cam1 10.0.0.1 local", "camera dhcp Cam1",
        "camera flash Cam1", "camera refresh", "camera credentials 0 admin secret", "timezone get",
        "timezone set Europe/Stockholm", "timeserver get", "timeserver set ntp.local", "timeserver test ntp.local",
        "safety status", "safety load-status", "safety mode", "safety set-mode VantorSafetyModeServiceMode",
        "safety info", "safety validate me", "safety unvalidate", "safety lock me", "safety unlock",
        "safety load /hd0a/safety.xml", "safety reconfigure", "safety sync 1", "safety factory-reset",
        "safety violation --drive 1 --last", "psc units", "user logon --local", "user id", "user grants",
        "user list", "user impersonate 1", "user unimpersonate", "user logoff", "rmmp request modify",
        "rmmp poll", "rmmp cancel", "rmmp grant 1 exec", "rmmp state", "rmmp pending", "uas grants",
        "energy", "clients", "guid", "env HOME", "link", "version release", "clock startup", "error",
    };
    std::string batch;
    for (const char* command : commands) {
        batch += std::string(command) + "\n";
    }
    const ToolRun run = RunTool("--keep-going --echo batch", batch);
    EXPECT_TRUE(run.exitCode == 0 || run.exitCode == 1) << run.output;
    EXPECT_EQ(std::string::npos, run.err.find("Usage:")) << run.err;
    EXPECT_EQ(std::string::npos, run.err.find("missing")) << run.err;
    EXPECT_EQ(std::string::npos, run.err.find("does not offer")) << run.err;
    for (const char* command : commands) {
        EXPECT_NE(std::string::npos, run.out.find(std::string("tavctl> ") + command + "\n")) << command;
    }
}

}  // namespace
}  // namespace tavctl::test
