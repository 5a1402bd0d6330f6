// The controller's time zone and time server through ITavControllerTime.
#include <chrono>

#include "netsafety_fixture.h"

namespace tav::e2e {
namespace {

constexpr std::uint64_t kTicksAt1970 = 116444736000000000ull;

std::int64_t SecondsOf(const FILETIME& time) {
    const std::uint64_t ticks = (std::uint64_t{time.dwHighDateTime} << 32) | time.dwLowDateTime;
    return static_cast<std::int64_t>((ticks - kTicksAt1970) / 10000000ull);
}

std::int64_t HostNow() {
    return std::chrono::duration_cast<std::chrono::seconds>(std::chrono::system_clock::now().time_since_epoch())
        .count();
}

class TimeSettingsE2eTest : public NetSafetyFixture {
protected:
    ComPtr<ITavControllerTime> Time() { return As<ITavControllerTime>(); }
    std::string Zone() { return FetchText(&ITavControllerTime::GetTimeZone); }
    std::string Server() { return FetchText(&ITavControllerTime::GetTimeServer); }
};

TEST_F(TimeSettingsE2eTest, ZoneNamesAreJudgedByTheController) {
    EXPECT_EQ(Zone(), "UTC");
    for (const char* zone : {"Europe/Stockholm", "UTC+05:30", "UTC-12", "America/Argentina/Buenos_Aires", "GMT",
                             "Etc/GMT+3"}) {
        ASSERT_EQ(Time()->SetTimeZone(nullptr, Wide(zone).Get()), S_OK) << zone << ": " << LastError();
        EXPECT_EQ(Zone(), zone);
    }
    for (const char* zone : {"", "Mars/Olympus", "Europe", "Europe/", "UTC+15", "UTC+1", "UTC+01:60", "utc",
                             "Europe/Stock holm", "Europe/9ville"}) {
        EXPECT_EQ(Time()->SetTimeZone(nullptr, Wide(zone).Get()), sim::kStatusBadArgument) << zone;
        EXPECT_TRUE(ErrorHas("TimeZone: unknown time zone")) << LastError();
        EXPECT_EQ(Zone(), "Etc/GMT+3") << "a refused zone leaves the last one";
    }
}

TEST_F(TimeSettingsE2eTest, ServerIsSetClearedAndJudged) {
    EXPECT_EQ(Server(), "") << "none at delivery";
    for (const char* server : {"ntp.plant.local", "10.0.0.1", "time-a.example.com"}) {
        ASSERT_EQ(Time()->SetTimeServer(nullptr, Wide(server).Get()), S_OK) << server << ": " << LastError();
        EXPECT_EQ(Server(), server);
    }
    for (const char* server : {"bad_name", "-lead.example", "trail-.example", "a..b", "300.1.1.1", "two words"}) {
        EXPECT_EQ(Time()->SetTimeServer(nullptr, Wide(server).Get()), sim::kStatusBadArgument) << server;
        EXPECT_EQ(Server(), "time-a.example.com");
    }
    ASSERT_EQ(Time()->SetTimeServer(nullptr, nullptr), S_OK) << "an empty name takes the server away";
    EXPECT_EQ(Server(), "");
}

// A server gives the true time, not the controller's own clock.
TEST_F(TimeSettingsE2eTest, TestingAServerAnswersItsTime) {
    const std::int64_t dayAgo = HostNow() - 86400;
    const std::uint64_t ticks = kTicksAt1970 + static_cast<std::uint64_t>(dayAgo) * 10000000ull;
    ASSERT_EQ(controller_->SetSystemClock(nullptr, {static_cast<DWORD>(ticks), static_cast<DWORD>(ticks >> 32)}),
              S_OK);
    ASSERT_EQ(Time()->SetTimeServer(nullptr, Wide("ntp.plant.local").Get()), S_OK);

    for (const char* server : {"pool.ntp.org", "172.20.4.1", "NTP.Plant.Local"}) {
        FILETIME answer{};
        const std::int64_t before = HostNow();
        ASSERT_EQ(Time()->TestTimeServer(nullptr, Wide(server).Get(), &answer), S_OK) << server << LastError();
        EXPECT_GE(SecondsOf(answer), before);
        EXPECT_LE(SecondsOf(answer), HostNow());
    }

    struct Refused {
        const char* server;
        HRESULT status;
        const char* text;
    };
    const Refused refused[] = {
        {"ntp.elsewhere.org", sim::kStatusTimedOut,
         "TestTimeServer: no answer from the time server \"ntp.elsewhere.org\""},
        {"", sim::kStatusBadArgument, "TestTimeServer: expected -timeserver"},
        {"bad_name", sim::kStatusBadArgument, "TestTimeServer: expected -timeserver"},
    };
    for (const Refused& r : refused) {
        FILETIME answer{1, 2};
        EXPECT_EQ(Time()->TestTimeServer(nullptr, Wide(r.server).Get(), &answer), r.status) << r.server;
        EXPECT_TRUE(ErrorHas(r.text)) << LastError();
        EXPECT_EQ(answer.dwLowDateTime, 1u) << "nothing written for a refusal";
    }
    EXPECT_EQ(Server(), "ntp.plant.local") << "testing a server does not set it";

    // With the LAN adaptor off no server answers.
    ASSERT_EQ(As<ITavLANAdaptor>()->SetLANAdaptorIPMethod(nullptr, NONE), S_OK);
    FILETIME answer{};
    EXPECT_EQ(Time()->TestTimeServer(nullptr, Wide("pool.ntp.org").Get(), &answer), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("the LAN adaptor is off")) << LastError();
}

}  // namespace
}  // namespace tav::e2e
