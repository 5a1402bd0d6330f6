// The speed ratio and the PIN lock of the operation-mode selector.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class SpeedAndPinTest : public ControllerTest {};

using NullableCall = std::function<HRESULT(ControllerObject&, TavInParams*, bool nullOut)>;

TEST_F(SpeedAndPinTest, EveryOperationFollowsTheCallPattern) {
    short ratio = 0;
    TavOPModeLockState lock{};
    const CallPattern patterns[] = {
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SetSpeedRatio(r, 50); },
         "SetSpeedRatio: Invalid TavInParams", "SetSpeedRatio. Helper used before initialized.", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetSpeedRatio(r, n ? nullptr : &ratio); },
         "GetSpeedRatio. Invalid argument.", "TavController used before Initialized",
         "GetSpeedRatio. Invalid out-parameter."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.LockOPModePinCode2(r, 1234, 1); },
         "LockOPModePinCode: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.LockOPModePinCode(r, 1234); },
         "LockOPModePinCode: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.UnlockOPModePinCode(r, 1234); },
         "UnlockOPModePinCode: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetOPModePinCodeLockState(r, n ? nullptr : &lock);
         },
         "GetOPModePinCodeLockState: Invalid TavInParams", "TavController used before initialized",
         "GetOPModePinCodeLockState: Invalid pointer"},
    };
    Script("SpeedAdjust", "50");
    Script("OPModePinCodeLockState", "-lockstate locked");
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams);
        ExpectCallPattern(pattern);
    }
}

TEST_F(SpeedAndPinTest, SendsTheCommandTexts) {
    struct Case {
        std::function<HRESULT(ControllerObject&)> call;
        const char* verb;
        const char* command;
        const char* args;
    };
    const Case cases[] = {
        {[](ControllerObject& o) { return o.SetSpeedRatio(nullptr, 100); }, "Set", "SpeedAdjust", "-Value 100"},
        {[](ControllerObject& o) { return o.SetSpeedRatio(nullptr, 0); }, "Set", "SpeedAdjust", "-Value 0"},
        {[](ControllerObject& o) { return o.LockOPModePinCode2(nullptr, 7, 5); }, "Set", "LockOPModePinCode",
         "-pincode 0007 -permanent 1"},
        {[](ControllerObject& o) { return o.LockOPModePinCode(nullptr, 123456); }, "Set", "LockOPModePinCode",
         "-pincode 123456 -permanent 0"},
        {[](ControllerObject& o) { return o.LockOPModePinCode2(nullptr, 4294967295u, -3); }, "Set",
         "LockOPModePinCode", "-pincode -0001 -permanent 1"},
        {[](ControllerObject& o) { return o.UnlockOPModePinCode(nullptr, 42); }, "Set", "UnlockOPModePinCode",
         "-pincode 0042"},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.args);
        ASSERT_EQ(c.call(*object), S_OK);
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
