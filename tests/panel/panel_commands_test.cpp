// The panel's commands: the call pattern of each, the texts sent, the values
// refused before anything is sent, and the Sync mode reply decoded.
#include "support/controller_test.h"

namespace tav::test {
namespace {

using Call = std::function<HRESULT(ControllerObject&, TavInParams*)>;
// One panel call on object o with the TavInParams rip.
#define PANEL_CALL(expression) [&](ControllerObject& o, TavInParams* rip) { return expression; }

TavControllerState state{};
TavOperationMode mode{};
TavCollisionDetectState collision{};

class PanelCommandsTest : public ControllerTest {};

// Each command's text; one row of each operation also carries the texts
// of its call pattern (invalidParams, and nullOut with the call that passes
// a NULL out-pointer).
TEST_F(PanelCommandsTest, CommandsFollowTheCallPatternAndSendTheirTexts) {
    struct Case {
        Call call;
        const char* verb;
        const char* command;
        const char* args;
        const char* invalidParams = nullptr;
        const char* nullOut = nullptr;
        Call callNullOut = {};
    };
    const char* opModeParams = "LockOPModePinCode: Invalid TavInParams";
    const Case cases[] = {
        {PANEL_CALL(o.SetControllerState(rip, MotorsOff)), "Set", "State", "STAND_BY"},
        {PANEL_CALL(o.SetControllerState(rip, MotorsOn)), "Set", "State", "RUN",
         "SetControllerState. Invalid TavInParams."},
        {PANEL_CALL(o.SetControllerStateKeyLess(rip, MotorsOn)), "Set", "StateUsingKeyLess", "RUN",
         "SetControllerStateKeyLess. Invalid TavInParams."},
        {PANEL_CALL(o.GetControllerState(rip, &state)), "Get", "State", "",
         "TavController::GetControllerState. Invalid argument.", "GetControllerState. Invalid out-parameter.",
         PANEL_CALL(o.GetControllerState(rip, nullptr))},
        {PANEL_CALL(o.GetOperationMode(rip, &mode)), "Get", "Mode", "", "GetOperationMode. Invalid TavInParams.",
         "GetOperationMode. Invalid out-parameter.", PANEL_CALL(o.GetOperationMode(rip, nullptr))},
        {PANEL_CALL(o.GetOperationMode2(rip, &mode, nullptr, nullptr)), "Get", "Mode", "",
         "GetOperationMode. Invalid TavInParams.", "GetOperationMode. Invalid out-parameter.",
         PANEL_CALL(o.GetOperationMode2(rip, nullptr, nullptr, nullptr))},
        {PANEL_CALL(o.SetOPMode(rip, Auto)), "Set", "OPMode", "-opmode auto"},
        {PANEL_CALL(o.SetOPMode(rip, Manr)), "Set", "OPMode", "-opmode manr", opModeParams},
        {PANEL_CALL(o.SetOPMode(rip, Manf)), "Set", "OPMode", "-opmode manf"},
        {PANEL_CALL(o.GetCollisionDetectState(rip, &collision)), "Get", "ColdetState", "",
         "GetCollisionDetectState. Invalid argument.", "GetCollisionDetectState. Invalid out-parameter.",
         PANEL_CALL(o.GetCollisionDetectState(rip, nullptr))},
        {PANEL_CALL(o.Acknowledge(rip, AutoAck)), "Set", "Ack", "AUTO"},
        {PANEL_CALL(o.Acknowledge(rip, ManfAck)), "Set", "Ack", "MANF"},
        {PANEL_CALL(o.Acknowledge(rip, ColDetAck)), "Set", "Ack", "COLDET", "Acknowledge: Invalid TavInParams"},
        {PANEL_CALL(o.AcknowledgeAutoCondition(rip, AutoConditionAck_Reset, 0)), "Set", "AutoCondAck",
         "-AutoCondAck Reset -ID 0"},
        {PANEL_CALL(o.AcknowledgeAutoCondition(rip, AutoConditionAck_Keep, 17)), "Set", "AutoCondAck",
         "-AutoCondAck Keep -ID 17", "AcknowledgeAutoCondition: Invalid TavInParams"},
        {PANEL_CALL(o.AcknowledgeAutoCondition(rip, AutoConditionAck_Keep, 4294967295u)), "Set", "AutoCondAck",
         "-AutoCondAck Keep -ID 4294967295"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.command) + " " + c.args);
        if (c.invalidParams != nullptr) {
            CallPattern pattern;
            pattern.call = [&c](ControllerObject& o, TavInParams* rip, bool null) {
                return null ? c.callNullOut(o, rip) : c.call(o, rip);
            };
            pattern.invalidParams = c.invalidParams;
            pattern.beforeInit = "TavController used before Initialized";
            if (c.nullOut != nullptr) pattern.nullOut = c.nullOut;
            ExpectCallPattern(pattern);
        }
        ControllerObject* object = Make();
        TavInParams rip = AsyncCall();
        EXPECT_EQ(c.call(*object, &rip), S_OK);
        EXPECT_EQ(LastCommand().verb, c.verb);
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
        Component().JoinDeliveries();
    }
}

// After the initialised check, and before anything is sent.
TEST_F(PanelCommandsTest, RefusesValuesItCannotSend) {
    const char* state = "SetControllerState. Not allowed state change.";
    const char* opMode = "LockOPModePinCode: Invalid operator mode";
    const char* ack = "TavController::Acknowledge. Unknown acknowledge.";
    const char* condAck = "TavController::AcknowledgeAutoCondition. Unknown acknowledge.";
    const std::tuple<Call, HRESULT, const char*> cases[] = {
        {PANEL_CALL(o.SetControllerState(rip, InitState)), E_INVALIDARG, state},
        {PANEL_CALL(o.SetControllerState(rip, GuardStop)), E_INVALIDARG, state},
        {PANEL_CALL(o.SetControllerStateKeyLess(rip, MotorsOff)), E_INVALIDARG,
         "SetControllerStateKeyLess. Not allowed state change."},
        {PANEL_CALL(o.SetOPMode(rip, InitOp)), E_INVALIDARG, opMode},
        {PANEL_CALL(o.SetOPMode(rip, AutoChange)), E_INVALIDARG, opMode},
        {PANEL_CALL(o.SetOPMode(rip, UndefinedMode)), E_INVALIDARG, opMode},
        {PANEL_CALL(o.Acknowledge(rip, static_cast<TavAcknowledge>(3))), E_NOTIMPL, ack},
        {PANEL_CALL(o.AcknowledgeAutoCondition(rip, static_cast<TavAutoConditionAck>(0), 1)), E_NOTIMPL, condAck},
        {PANEL_CALL(o.AcknowledgeAutoCondition(rip, static_cast<TavAutoConditionAck>(3), 1)), E_NOTIMPL, condAck},
    };
    for (const auto& [call, hr, error] : cases) {
        SCOPED_TRACE(error);
        ControllerObject* object = Make();
        TavInParams rip = SyncCall();
        const size_t told = Callback().Count();
        EXPECT_EQ(call(*object, &rip), hr);
        EXPECT_TRUE(HasError(error, object));
        EXPECT_EQ(Callback().Count(), told + 1);
        EXPECT_EQ(call(*MakeUninitialised(), nullptr), E_ABORT);
    }
    EXPECT_EQ(CommandCount(), 0u);
}

TEST_F(PanelCommandsTest, ModeReplyIsDecodedWithOrWithoutConditions) {
    ControllerObject* object = Make();
    Script("Mode", "AUTO_CH -auto_ch 1 -noelts 1\tRunMode;0;250\t");
    mode = Auto;
    EXPECT_EQ(object->GetOperationMode(nullptr, &mode), S_OK);
    EXPECT_EQ(mode, AutoChange);
    IEnumAutoCondition2* conditions = nullptr;
    ULONG cycle = 1;
    EXPECT_EQ(object->GetOperationMode2(nullptr, &mode, &conditions, &cycle), S_OK);
    EXPECT_EQ(cycle, 250u);
    ASSERT_NE(conditions, nullptr);
    conditions->Release();
}

#undef PANEL_CALL

}  // namespace
}  // namespace tav::test
