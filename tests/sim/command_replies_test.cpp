// The replies of the controller's commands, in the grammars the decoders
// read, and what Set commands change.
#include <regex>

#include "sim/status_codes.h"
#include "sim_test_support.h"

namespace tav::sim::test {
namespace {

struct ReplyCase {
    const char* verb;
    const char* command;
    const char* args;
    const char* pattern;  // the whole reply text
};

class CommandReplyTest : public SimTest, public ::testing::WithParamInterface<ReplyCase> {};

TEST_P(CommandReplyTest, AnswersInTheDecodersGrammar) {
    const ReplyCase& c = GetParam();
    const Outcome reply = Execute(c.verb, c.command, c.args);
    ASSERT_EQ(S_OK, reply.hr);
    EXPECT_EQ(S_OK, reply.status) << reply.text;
    EXPECT_EQ(VT_BSTR, reply.type);
    EXPECT_TRUE(std::regex_match(reply.text, std::regex(c.pattern))) << reply.text;
}

INSTANTIATE_TEST_SUITE_P(
    Reads, CommandReplyTest,
    ::testing::Values(
        ReplyCase{"Get", "CtrlName", "", R"(-Name "simtest\d+")"},
        ReplyCase{"Get", "CtrlID", "", R"(-ID "VC-simtest\d+")"},
        ReplyCase{"Get", "GUID", "", R"(-GUID \{[0-9A-F]{8}-[0-9A-F]{4}-4[0-9A-F]{3}-[89AB][0-9A-F]{3}-[0-9A-F]{12}\})"},
        ReplyCase{"Get", "SystemClock", "", R"(-time_t \d+)"},
        ReplyCase{"Get", "SystemStartupClock", "", R"(-time_t \d+)"},
        ReplyCase{"Get", "VersionInfo", "-Type System", R"(TavOS 7\.4\.2 .*)"},
        ReplyCase{"Get", "VersionInfo", "-Type Release", R"(TavOS release 7\.4\.2 .*)"},
        ReplyCase{"Get", "SystemInfo", "-Type Release -SystemName \"ServiceSystem\"", R"(TavOS release 7\.3\.0 .*)"},
        ReplyCase{"Get", "IsOptionPresent", "-Option \"World Zones\"", "-OptionPresent 1"},
        ReplyCase{"Get", "IsOptionPresent", "-Option \"Welding\"", "-OptionPresent 0"},
        ReplyCase{"Get", "ConnectedClients", "", R"(<\?xml[\s\S]*<TavAPIClients count="1">[\s\S]*</TavAPIClients>)"},
        ReplyCase{"Get", "SysEnergyState", "", "-sysenergy notpaused"},
        ReplyCase{"Get", "VersionName", "", "-Name TavOS 7.4"},
        ReplyCase{"Get", "ProductVersionName", "-Name \"TavSafety\"", "-Name TavSafety 3.0.1"}));

struct RefusalCase {
    const char* verb;
    const char* command;
    const char* args;
    bool atDhRoot;
    HRESULT status;
};

class CommandRefusalTest : public SimTest, public ::testing::WithParamInterface<RefusalCase> {};

// A refusal is a failure status with the controller's text, never a failing
// Execute; and nothing changes.
TEST_P(CommandRefusalTest, AnswersAFailureStatusWithAText) {
    const RefusalCase& c = GetParam();
    const std::string before = Get("CtrlName").text;
    const Outcome reply = Execute(c.verb, c.command, c.args, nullptr, c.atDhRoot ? Url() + "/DHROOT" : "");
    EXPECT_EQ(S_OK, reply.hr);
    EXPECT_EQ(c.status, reply.status);
    EXPECT_EQ(VT_BSTR, reply.type);
    EXPECT_TRUE(reply.text.ends_with("; ")) << reply.text;
    EXPECT_GT(reply.text.size(), 2u);
    EXPECT_EQ(before, Get("CtrlName").text);
}

INSTANTIATE_TEST_SUITE_P(
    Refusals, CommandRefusalTest,
    ::testing::Values(RefusalCase{"Get", "NoSuchCommand", "", false, kStatusUnknownCommand},
                      RefusalCase{"Put", "CtrlName", "", false, kStatusUnknownCommand},
                      RefusalCase{"Get", "EnvironmentVar", "HOME", false, kStatusUnknownCommand},
                      RefusalCase{"Get", "CtrlName", "", true, kStatusUnknownCommand},
                      RefusalCase{"Get", "EnvironmentVar", "NO_SUCH_VARIABLE", true, kStatusNotFound},
                      RefusalCase{"Set", "CtrlName", "bare words", false, kStatusBadArgument},
                      RefusalCase{"Set", "CtrlName", "-Name \"unterminated", false, kStatusBadArgument},
                      RefusalCase{"Set", "SystemClock", "-time_t soon", false, kStatusBadArgument},
                      RefusalCase{"Set", "SystemClock", "-time_t 4294967296", false, kStatusBadArgument},
                      RefusalCase{"Set", "Restart", "HOT", false, kStatusBadArgument},
                      RefusalCase{"Get", "VersionInfo", "-Type Debug", false, kStatusBadArgument},
                      RefusalCase{"Get", "SystemInfo", "-Type System -SystemName \"Nowhere\"", false, kStatusNotFound},
                      RefusalCase{"Get", "ProductVersionName", "-Name \"Nothing\"", false, kStatusNotFound},
                      RefusalCase{"Set", "Language", "-Language \"\"", false, kStatusBadArgument},
                      RefusalCase{"Set", "State", "GUARD_STOP", false, kStatusBadArgument},
                      RefusalCase{"Set", "OPMode", "-opmode fast", false, kStatusBadArgument},
                      RefusalCase{"Set", "Ack", "EVERYTHING", false, kStatusBadArgument},
                      RefusalCase{"Set", "AutoCondAck", "-AutoCondAck Maybe -ID 1", false, kStatusBadArgument}));

using CommandStateTest = SimTest;

TEST_F(CommandStateTest, SetCommandsChangeWhatGetCommandsAnswer) {
    struct Change {
        const char* set;
        const char* args;
        const char* get;
        const char* after;
    };
    const Change changes[] = {
        {"CtrlName", "-Name \"Cell 7\"", "CtrlName", "-Name \"Cell 7\""},
        {"CtrlName", "-Name \"\"", "CtrlName", "-Name \"\""},
        {"CtrlID", "-ctrlId \"R-1200\"", "CtrlID", "-ID \"R-1200\""},
        {"CtrlID", "-Id \"\"", "CtrlID", "-ID \"\""},
        {"SystemClock", "-time_t 1795314600", "SystemClock", "-time_t 17953146(00|01|02)"},
    };
    for (const Change& change : changes) {
        SCOPED_TRACE(change.args);
        const Outcome set = Set(change.set, change.args);
        ASSERT_EQ(S_OK, set.status) << set.text;
        EXPECT_EQ(VT_EMPTY, set.type);
        EXPECT_TRUE(std::regex_match(Get(change.get).text, std::regex(change.after))) << Get(change.get).text;
    }
}

TEST_F(CommandStateTest, LanguageAndRestartReachTheModel) {
    ASSERT_EQ(S_OK, Set("Language", "-Language \"de\"").status);
    ASSERT_EQ(S_OK, Set("SystemClock", "-time_t 2000000000").status);
    ASSERT_EQ(S_OK, Set("Restart", "I_START").status);
    controller_->Read([](const ModelState& state) {
        EXPECT_EQ(T("de"), state.language);
        EXPECT_EQ(T("I_START"), state.lastRestart);
        EXPECT_GE(state.startupTime, 2000000000u);
        EXPECT_LE(state.startupTime, 2000000002u);
    });
    EXPECT_TRUE(std::regex_match(Get("SystemStartupClock").text, std::regex("-time_t 200000000[0-2]")));
}

TEST_F(CommandStateTest, EveryControllerHasItsOwnState) {
    ASSERT_EQ(S_OK, Set("CtrlName", "-Name \"first\"").status);
    const Outcome other = Execute("Get", "CtrlName", "", nullptr, Url() + "x");
    EXPECT_EQ("-Name \"" + Url().substr(1) + "x\"", other.text);
}

}  // namespace
}  // namespace tav::sim::test
