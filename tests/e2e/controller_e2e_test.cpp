// Clock, restart and identity operations end to end against the virtual
// controller. That objects of one URL share their controller shows in the
// IPC and users tests, which need two of them.
#include "sim/status_codes.h"
#include "virtual_controller_fixture.h"

namespace tav::e2e {
namespace {

using ControllerE2eTest = VirtualControllerTest;

uint64_t Ticks(const FILETIME& time) { return (uint64_t{time.dwHighDateTime} << 32) | time.dwLowDateTime; }

TEST_F(ControllerE2eTest, ClockSetThenReadBack) {
    const uint64_t ticks = 116444736000000000ull + 1795000000ull * 10000000ull;  // whole seconds
    const FILETIME set{static_cast<DWORD>(ticks), static_cast<DWORD>(ticks >> 32)};
    ASSERT_EQ(controller_->SetSystemClock(nullptr, set), S_OK);
    FILETIME read{};
    ASSERT_EQ(controller_->GetSystemClock(nullptr, &read), S_OK);
    EXPECT_GE(Ticks(read), ticks);
    EXPECT_LT(Ticks(read), ticks + 60ull * 10000000ull);

    FILETIME started{};
    ASSERT_EQ(As<ITavController3>()->GetSystemStartupClock(nullptr, &started), S_OK);
    EXPECT_GE(Ticks(started), 116444736000000000ull);
}

TEST_F(ControllerE2eTest, EveryRestartModeIsAccepted) {
    for (int mode = WarmStart; mode <= BStart; ++mode) {
        EXPECT_EQ(controller_->Restart(nullptr, static_cast<TavRestartMode>(mode)), S_OK) << mode;
    }
    EXPECT_EQ(controller_->Restart(nullptr, static_cast<TavRestartMode>(7)), E_INVALIDARG);
}

TEST_F(ControllerE2eTest, NamesAndIdentifiersRoundTrip) {
    Bstr name(OLESTR("Cell 7 welding"));
    ASSERT_EQ(controller_->SetControllerName(nullptr, name.Get()), S_OK);
    Bstr readName;
    ASSERT_EQ(controller_->GetControllerName(nullptr, readName.Receive()), S_OK);
    EXPECT_EQ(Narrow(readName), "Cell 7 welding");

    Bstr id(OLESTR("ID-0042"));
    ASSERT_EQ(controller_->SetControllerId(nullptr, id.Get()), S_OK);
    Bstr readId;
    ASSERT_EQ(controller_->GetControllerID(nullptr, readId.Receive()), S_OK);
    EXPECT_EQ(Narrow(readId), "ID-0042");

    Bstr guid;
    ASSERT_EQ(controller_->GetSystemID(nullptr, guid.Receive()), S_OK);
    EXPECT_EQ(guid.Length(), 38u);
    GUID parsed{};
    EXPECT_EQ(CLSIDFromString(guid.Get(), &parsed), S_OK);

    Bstr language(OLESTR("de"));
    EXPECT_EQ(As<ITavController2>()->SetLanguage(nullptr, language.Get()), S_OK);
}

TEST_F(ControllerE2eTest, VersionsEnvironmentOptionsAndState) {
    for (TavControllerInfo info : {SystemInfo, ReleaseInfo}) {
        Bstr version;
        ASSERT_EQ(controller_->GetVersionInfo(nullptr, info, version.Receive()), S_OK);
        EXPECT_FALSE(version.View().empty());
    }
    Bstr versionName;
    ASSERT_EQ(As<ITavController5>()->GetVersionName(nullptr, versionName.Receive()), S_OK);
    EXPECT_FALSE(versionName.View().empty());

    Bstr xml;
    ASSERT_EQ(As<ITavController4>()->GetConnectedTavAPIClients(nullptr, xml.Receive()), S_OK);
    EXPECT_EQ(xml.View().substr(0, 1), OLESTR("<"));

    TavSysEnergyState energy{};
    ASSERT_EQ(As<ITavController4>()->GetSysEnergyState(nullptr, &energy), S_OK);
    EXPECT_GE(energy, TavSysEnergyStateNotPaused);
    EXPECT_LE(energy, TavSysEnergyStatePausing);

    LONG present = -1;
    Bstr option(OLESTR("NoSuchOption"));
    ASSERT_EQ(controller_->IsOptionPresent(nullptr, option.Get(), &present), S_OK);
    EXPECT_EQ(present, 0);

    EXPECT_EQ(controller_->CheckFileTransferLink(nullptr), S_OK);
}

TEST_F(ControllerE2eTest, EnvironmentVariablesAreReadAtTheControllersRoot) {
    Bstr name(OLESTR("TEMP"));
    Bstr value;
    ASSERT_EQ(controller_->GetEnvironmentVariable(nullptr, name.Get(), value.Receive()), S_OK) << LastError();
    EXPECT_EQ(Narrow(value), "/hd0a/temp");
    Bstr unknown(OLESTR("TAV_NO_SUCH_VARIABLE"));
    EXPECT_EQ(controller_->GetEnvironmentVariable(nullptr, unknown.Get(), value.Receive()), sim::kStatusNotFound);
    EXPECT_NE(LastError().find("TavControllerImpl["), std::string::npos) << LastError();
}

}  // namespace
}  // namespace tav::e2e
