// The speed ratio and the PIN lock of the mode selector, end to end: the
// controller keeps them, enforces their rules and refuses with its own texts.
#include "events_fixture.h"

namespace tav::e2e {
namespace {

using SpeedAndPinE2eTest = EventsFixture;

TEST_F(SpeedAndPinE2eTest, SpeedRatioKeepsTheLastAcceptedValue) {
    EXPECT_EQ(Fetch(&ITavPanel::GetSpeedRatio), 100);
    struct Step {
        short ratio;
        HRESULT hr;
        short after;
    };
    const Step steps[] = {
        {0, S_OK, 0}, {100, S_OK, 100}, {55, S_OK, 55}, {101, E_INVALIDARG, 55}, {-1, E_INVALIDARG, 55},
    };
    for (const Step& step : steps) {
        SCOPED_TRACE(step.ratio);
        EXPECT_EQ(Panel()->SetSpeedRatio(nullptr, step.ratio), step.hr);
        EXPECT_EQ(Fetch(&ITavPanel::GetSpeedRatio), step.after);
    }
}

// The module never sends a ratio outside 0 to 100; the controller refuses
// one all the same.
TEST_F(SpeedAndPinE2eTest, ControllerRefusesRatiosTheModuleWouldNotSend) {
    for (const char* args : {"-Value 101", "-Value -1", "-Value x", ""}) {
        EXPECT_EQ(Send("Set", "SpeedAdjust", args).status, sim::kStatusBadArgument) << args;
    }
    EXPECT_EQ(Fetch(&ITavPanel::GetSpeedRatio), 100);
}

enum class Action { Lock, LockPermanent, Unlock, Restart, SetManf, SetManr };

struct PinStep {
    Action action;
    ULONG pin;
    HRESULT hr;
    const char* error;  // a part of the last error on failure
    TavOPModeLockState after;
};

TEST_F(SpeedAndPinE2eTest, PinLockFollowsItsRules) {
    const HRESULT refused = sim::kStatusNotAllowed;
    const PinStep steps[] = {
        {Action::Unlock, 1234, refused, "not locked", OPModeLockStateUnlocked},
        {Action::Lock, 1234, S_OK, "", OPModeLockStateLocked},
        {Action::SetManf, 0, refused, "locked by a PIN code", OPModeLockStateLocked},
        {Action::Lock, 99, refused, "already locked", OPModeLockStateLocked},
        {Action::Unlock, 4321, refused, "wrong PIN code", OPModeLockStateLocked},
        {Action::Unlock, 1234, S_OK, "", OPModeLockStateUnlocked},
        {Action::SetManf, 0, S_OK, "", OPModeLockStateUnlocked},
        // A PIN of 7 goes out as four digits and must come back the same way.
        {Action::LockPermanent, 7, S_OK, "", OPModeLockStatePendingPermLocked},
        {Action::SetManr, 0, refused, "locked by a PIN code", OPModeLockStatePendingPermLocked},
        {Action::Restart, 0, S_OK, "", OPModeLockStatePermLocked},
        {Action::Restart, 0, S_OK, "", OPModeLockStatePermLocked},
        {Action::Unlock, 70, refused, "wrong PIN code", OPModeLockStatePermLocked},
        {Action::Unlock, 7, S_OK, "", OPModeLockStateUnlocked},
        {Action::Lock, 55555, S_OK, "", OPModeLockStateLocked},
        {Action::Restart, 0, S_OK, "", OPModeLockStateUnlocked},  // a plain lock lasts until restart
        // Above the signed range the PIN goes out negative; no PIN at all.
        {Action::Lock, 0xFFFFFFFF, sim::kStatusBadArgument, "four or more digits", OPModeLockStateUnlocked},
    };
    ComPtr<ITavPanel4> panel = Panel();
    for (size_t i = 0; i < std::size(steps); ++i) {
        const PinStep& step = steps[i];
        SCOPED_TRACE("step " + std::to_string(i));
        HRESULT hr = E_UNEXPECTED;
        switch (step.action) {
            case Action::Lock: hr = panel->LockOPModePinCode(nullptr, step.pin); break;
            case Action::LockPermanent: hr = panel->LockOPModePinCode2(nullptr, step.pin, -3); break;
            case Action::Unlock: hr = panel->UnlockOPModePinCode(nullptr, step.pin); break;
            case Action::Restart: hr = controller_->Restart(nullptr, WarmStart); break;
            case Action::SetManf: hr = panel->SetOPMode(nullptr, Manf); break;
            case Action::SetManr: hr = panel->SetOPMode(nullptr, Manr); break;
        }
        EXPECT_EQ(hr, step.hr);
        if (FAILED(step.hr)) {
            EXPECT_TRUE(ErrorHas(step.error)) << LastError();
        }
        EXPECT_EQ(Fetch(&ITavPanel3::GetOPModePinCodeLockState), step.after);
    }
}

}  // namespace
}  // namespace tav::e2e
