// The speed ratio and the PIN lock of the operation-mode selector.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class SpeedAndPinTest : public ControllerTest {};

// Each command's text; one row of each operation also carries the texts
// of its call pattern.
TEST_F(SpeedAndPinTest, EveryOperationFollowsTheCallPatternAndSendsItsText) {
    struct Case {
        std::function<HRESULT(ControllerObject&, TavInParams*, bool nullOut)> call;
        const char* verb;
        const char* command;
        const char* args;
        const char* invalidParams = nullptr;
        const char* beforeInit = "TavController used before Initialized";
        const char* nullOut = nullptr;
    };
    short ratio = 0;
    TavOPModeLockState lock{};
    const char* lockParams = "LockOPModePinCode: Invalid TavInParams";
    const Case cases[] = {
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SetSpeedRatio(r, 100); }, "Set", "SpeedAdjust",
         "-Value 100", "SetSpeedRatio: Invalid TavInParams", "SetSpeedRatio. Helper used before initialized."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SetSpeedRatio(r, 0); }, "Set", "SpeedAdjust",
         "-Value 0"},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetSpeedRatio(r, n ? nullptr : &ratio); }, "Get",
         "SpeedAdjust", "", "GetSpeedRatio. Invalid argument.", "TavController used before Initialized",
         "GetSpeedRatio. Invalid out-parameter."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.LockOPModePinCode2(r, 7, 5); }, "Set",
         "LockOPModePinCode", "-pincode 0007 -permanent 1", lockParams},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.LockOPModePinCode2(r, 4294967295u, -3); }, "Set",
         "LockOPModePinCode", "-pincode -0001 -permanent 1"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.LockOPModePinCode(r, 123456); }, "Set",
         "LockOPModePinCode", "-pincode 123456 -permanent 0", lockParams},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.UnlockOPModePinCode(r, 42); }, "Set",
         "UnlockOPModePinCode", "-pincode 0042", "UnlockOPModePinCode: Invalid TavInParams"},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetOPModePinCodeLockState(r, n ? nullptr : &lock);
         },
         "Get", "OPModePinCodeLockState", "", "GetOPModePinCodeLockState: Invalid TavInParams",
         "TavController used before initialized", "GetOPModePinCodeLockState: Invalid pointer"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.command) + " " + c.args);
        if (c.invalidParams != nullptr) {
            ExpectCallPattern({c.call, c.invalidParams, c.beforeInit,
                               c.nullOut ? std::optional<std::string>(c.nullOut) : std::nullopt});
        }
        Script("SpeedAdjust", "50");
        Script("OPModePinCodeLockState", "-lockstate locked");
        ControllerObject* object = Make();
        ASSERT_EQ(c.call(*object, nullptr, false), S_OK);
        EXPECT_EQ(LastCommand().verb, c.verb);
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
    }
}

TEST_F(SpeedAndPinTest, RatiosOutsideAPercentAreRefusedBeforeSending) {
    ControllerObject* object = Make();
    for (const short ratio : {short{-1}, short{101}, short{-32768}, short{32767}}) {
        EXPECT_EQ(object->SetSpeedRatio(nullptr, ratio), E_INVALIDARG) << ratio;
        EXPECT_TRUE(HasError("Invalid ratio"));
    }
    EXPECT_EQ(CommandCount(), 0u);
}

TEST_F(SpeedAndPinTest, SpeedRepliesAreReadAsStringToLongIn16Bits) {
    const std::pair<const char*, short> cases[] = {
        {"100", 100}, {"250", 250}, {"  42%", 42}, {"-7", -7}, {"70000", static_cast<short>(70000)},
        {"", 0},      {"abc", 0},   {"+3x", 3},    {"99999999999", -1},
    };
    ControllerObject* object = Make();
    for (const auto& [text, value] : cases) {
        TestVariant reply = TestVariant::Text(text);
        short ratio = 1234;
        ASSERT_EQ(object->UnpackSpeedRatio(reply.Get(), &ratio), S_OK) << text;
        EXPECT_EQ(ratio, value) << text;
    }
    TestVariant number = TestVariant::Number(5);
    short ratio = 1234;
    EXPECT_EQ(object->UnpackSpeedRatio(number.Get(), &ratio), E_FAIL);
    EXPECT_TRUE(HasError("UnpackSpeedRatio. Invalid argument."));
    EXPECT_EQ(ratio, 1234) << "written only on success";
    EXPECT_EQ(object->UnpackSpeedRatio(nullptr, &ratio), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackSpeedRatio. Invalid data-variant"));
    EXPECT_EQ(object->UnpackSpeedRatio(number.Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError(""));
}

TEST_F(SpeedAndPinTest, LockStatesDecodeAndUnknownWordsAreUndefined) {
    const std::pair<const char*, TavOPModeLockState> cases[] = {
        {"-lockstate locked", OPModeLockStateLocked},
        {"-lockstate unlocked", OPModeLockStateUnlocked},
        {"-lockstate permlocked", OPModeLockStatePermLocked},
        {"-lockstate pendpermlocked", OPModeLockStatePendingPermLocked},
        {"-lockstate pending", OPModeLockStateUndefined},
        {"-lockstate Locked", OPModeLockStateUndefined},
        {"-lockstate   unlocked  ", OPModeLockStateUnlocked},
    };
    ControllerObject* object = Make();
    for (const auto& [text, value] : cases) {
        TestVariant reply = TestVariant::Text(text);
        TavOPModeLockState state{};
        ASSERT_EQ(object->UnpackOPModePinCodeLockState(reply.Get(), &state), S_OK) << text;
        EXPECT_EQ(state, value) << text;
    }
    const std::pair<const char*, const char*> failures[] = {
        {"-lockstate", "UnpackOPModePinCodeLockState failed."},
        {"-lock locked", "UnpackOPModePinCodeLockState failed."},
    };
    for (const auto& [text, error] : failures) {
        TestVariant reply = TestVariant::Text(text);
        TavOPModeLockState state = OPModeLockStatePermLocked;
        EXPECT_EQ(object->UnpackOPModePinCodeLockState(reply.Get(), &state), E_FAIL) << text;
        EXPECT_TRUE(HasError(error));
        EXPECT_EQ(state, OPModeLockStatePermLocked) << "written only on success";
    }
    TestVariant number = TestVariant::Number(5);
    TavOPModeLockState state{};
    EXPECT_EQ(object->UnpackOPModePinCodeLockState(number.Get(), &state), E_FAIL);
    EXPECT_TRUE(HasError("UnpackOPModePinCodeLockState. Data-variant not of type VT_BSTR"));
    EXPECT_EQ(object->UnpackOPModePinCodeLockState(number.Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError("UnpackOPModePinCodeLockState. Invalid out pointer"));
    EXPECT_EQ(object->UnpackOPModePinCodeLockState(nullptr, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackOPModePinCodeLockState. NULL data pointer"));
}

}  // namespace
}  // namespace tav::test
