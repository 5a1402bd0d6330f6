// Time zone and time server: commands, refusals, lenient replies.
#include "operations/controller/filetime.h"
#include "support/controller_test.h"

namespace tav::test {
namespace {

class TimeSettingsTest : public ControllerTest {};

TEST_F(TimeSettingsTest, CommandsFollowTheCallPattern) {
    TestBstr text;
    FILETIME time{};
    const CallPattern patterns[] = {
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SetTimeZone(r, TestBstr("CET").Get()); },
         "SetTimeZone: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetTimeZone(r, n ? nullptr : text.Out()); },
         "GetTimeZone: Invalid TavInParams", "GetTimeZone. TavController used before Initialized",
         "GetTimeZone: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SetTimeServer(r, TestBstr("ntp").Get()); },
         "SetTimeServer: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetTimeServer(r, n ? nullptr : text.Out()); },
         "GetTimeServer: Invalid TavInParams", "GetTimeServer. TavController used before Initialized",
         "GetTimeServer: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool) { return o.TestTimeServer(r, TestBstr("ntp").Get(), &time); },
         "TestTimeServer: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
    };
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams);
        ExpectCallPattern(pattern);
    }
}

TEST_F(TimeSettingsTest, ValuesAreSentAsGivenWithinTheirRoom) {
    ControllerObject* object = Make();
    ASSERT_EQ(object->SetTimeZone(nullptr, TestBstr("Europe/Stockholm").Get()), S_OK);
    EXPECT_EQ(LastCommand().args, "-timezone Europe/Stockholm");
    ASSERT_EQ(object->SetTimeZone(nullptr, nullptr), S_OK);
    EXPECT_EQ(LastCommand().args, "-timezone ");
    ASSERT_EQ(object->SetTimeServer(nullptr, TestBstr("pool.ntp.org").Get()), S_OK);
    EXPECT_EQ(LastCommand().args, "-timeserver \"pool.ntp.org\"");
    ASSERT_EQ(object->SetTimeZone(nullptr, TestBstr(std::string(245, 'z')).Get()), S_OK);
    ASSERT_EQ(object->SetTimeServer(nullptr, TestBstr(std::string(241, 's')).Get()), S_OK);
    const size_t sent = CommandCount();
    EXPECT_EQ(object->SetTimeZone(nullptr, TestBstr(std::string(246, 'z')).Get()), E_INVALIDARG);
    EXPECT_EQ(object->SetTimeServer(nullptr, TestBstr(std::string(242, 's')).Get()), E_INVALIDARG);
    FILETIME time{};
    EXPECT_EQ(object->TestTimeServer(nullptr, TestBstr(std::string(10000, 's')).Get(), &time), E_INVALIDARG);
    EXPECT_TRUE(HasError("TestTimeServer: Invalid argument"));
    EXPECT_EQ(CommandCount(), sent);
}

TEST_F(TimeSettingsTest, RepliesNeverFailOnTheirText) {
    const std::tuple<const char*, const char*, const char*> cases[] = {
        {"-timezone UTC", "-timeserver ntp1", "UTC|ntp1"},
        {"-tz UTC", "-server ntp1", "|"},
        {"-timezone \"Central Europe\"", "-timeserver \"ntp 1\"", "\"Central|\"ntp"},
    };
    ControllerObject* object = Make();
    for (const auto& [zoneReply, serverReply, expected] : cases) {
        TestVariant zone = TestVariant::Text(zoneReply);
        TestVariant server = TestVariant::Text(serverReply);
        TestBstr z, s;
        ASSERT_EQ(object->UnpackTimeZone(zone.Get(), z.Out()), S_OK);
        ASSERT_EQ(object->UnpackTimeServer(server.Get(), s.Out()), S_OK);
        EXPECT_FALSE(z.IsNull());
        EXPECT_EQ(z.Text() + "|" + s.Text(), expected);
    }
    TestVariant wide = TestVariant::Text("-timezone " + std::string(300, 'w'));
    TestBstr z;
    ASSERT_EQ(object->UnpackTimeZone(wide.Get(), z.Out()), S_OK);
    EXPECT_EQ(z.Text(), std::string(254, 'w'));
    // The type comes before the out-pointer.
    TestVariant number = TestVariant::Number(1);
    EXPECT_EQ(object->UnpackTimeZone(number.Get(), nullptr), E_FAIL);
    EXPECT_TRUE(HasError("UnpackTimeZone. Non-BSTR variant."));
    EXPECT_EQ(object->UnpackTimeServer(wide.Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError("ptmserver == NULL"));
    EXPECT_EQ(object->UnpackTimeZone(wide.Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError("pTimeZone == NULL"));
    EXPECT_EQ(object->UnpackTimeServer(nullptr, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackTimeServer. NULL variant"));
}

TEST_F(TimeSettingsTest, TheTestedTimeReadsAsTheControllerClock) {
    ControllerObject* object = Make();
    Script("TestTimeServer", "-time_t 86400");
    FILETIME time{};
    ASSERT_EQ(object->TestTimeServer(nullptr, TestBstr("ntp").Get(), &time), S_OK);
    EXPECT_EQ(LastCommand().verb, "Set");
    EXPECT_EQ(LastCommand().args, "-timeserver \"ntp\"");
    EXPECT_EQ(TicksOf(time), kUnixEpochTicks + 86400 * kTicksPerSecond);
    // Its out-pointer is checked after initialisation, unlike the getters'.
    EXPECT_EQ(object->TestTimeServer(nullptr, TestBstr("ntp").Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError("TestTimeServer: Invalid out-pointer"));
    TestVariant bad = TestVariant::Text("-time 5");
    EXPECT_EQ(object->UnpackTestTimeServer(bad.Get(), &time), E_FAIL);
    EXPECT_TRUE(HasError("UnpackSystemClock. Unsupported time-format."));
    EXPECT_EQ(object->UnpackTestTimeServer(nullptr, &time), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackSystemClock. NULL data-variant"));
}

}  // namespace
}  // namespace tav::test
