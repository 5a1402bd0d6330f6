// Motors state, operation mode with its auto conditions, collision detection
// and an asynchronous call, end to end against the virtual controller (their
// events: e2e_events).
#include "sim/controller_registry.h"
#include "support/reply_recorder.h"
#include "support/test_text.h"
#include "virtual_controller_fixture.h"

namespace tav::e2e {
namespace {

using PanelE2eTest = VirtualControllerTest;

TEST_F(PanelE2eTest, MotorsOnAndOff) {
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    for (TavControllerState wanted : {MotorsOn, MotorsOff}) {
        ASSERT_EQ(panel->SetControllerState(nullptr, wanted), S_OK);
        TavControllerState state = InitState;
        ASSERT_EQ(panel->GetControllerState(nullptr, &state), S_OK);
        EXPECT_EQ(state, wanted);
    }
    EXPECT_EQ(panel->SetControllerState(nullptr, GuardStop), E_INVALIDARG);
}

TEST_F(PanelE2eTest, ChangeToAutomaticPassesThroughItsConditions) {
    ComPtr<ITavPanel4> panel = As<ITavPanel4>();
    ASSERT_EQ(panel->SetOPMode(nullptr, Manr), S_OK);
    ASSERT_EQ(panel->SetOPMode(nullptr, Auto), S_OK);

    TavOperationMode mode = UndefinedMode;
    ComPtr<IEnumAutoCondition2> conditions;
    ULONG cycle = 0;
    ASSERT_EQ(panel->GetOperationMode2(nullptr, &mode, &conditions, &cycle), S_OK);
    ASSERT_EQ(mode, AutoChange);
    ASSERT_TRUE(conditions);

    TavAutoCondition2 element{};
    ULONG fetched = 0;
    size_t count = 0;
    while (conditions->RemNext(1, &element, &fetched) == S_OK && fetched == 1) {
        ++count;
    }
    ASSERT_GT(count, 0u);
    // The virtual controller numbers its conditions from 1.
    for (ULONG id = 1; id <= count; ++id) {
        EXPECT_EQ(panel->AcknowledgeAutoCondition(nullptr, AutoConditionAck_Reset, id), S_OK) << id;
    }
    ASSERT_EQ(panel->GetOperationMode(nullptr, &mode), S_OK);
    EXPECT_EQ(mode, Auto);
}

TEST_F(PanelE2eTest, CollisionIsDecodedAndAcknowledged) {
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    // Nothing was triggered, so the controller has nothing to acknowledge.
    EXPECT_LT(panel->Acknowledge(nullptr, ColDetAck), 0);
    EXPECT_NE(LastError().find("TavControllerImpl["), std::string::npos);
    sim::ControllerAt(Url())->TriggerCollision();
    for (TavCollisionDetectState expected : {CollisionDetect_Triggered, CollisionDetect_TriggeredAck}) {
        TavCollisionDetectState state{};
        ASSERT_EQ(panel->GetCollisionDetectState(nullptr, &state), S_OK);
        EXPECT_EQ(state, expected);
        if (expected == CollisionDetect_Triggered) {
            ASSERT_EQ(panel->Acknowledge(nullptr, ColDetAck), S_OK) << LastError();
        }
    }
}

TEST_F(PanelE2eTest, AsynchronousCallDeliversItsReplyToTheCallback) {
    test::Ref<test::ReplyRecorder> recorder = test::ReplyRecorder::Make();
    TavInParams rip = test::AsyncParams(recorder.get(), 4711);
    rip.timeOut = 5000;
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    TavControllerState untouched = SysFail;
    ASSERT_EQ(panel->GetControllerState(&rip, &untouched), S_OK);
    EXPECT_EQ(untouched, SysFail);
    ASSERT_TRUE(recorder->WaitFor(1));
    const test::ReceivedReply reply = recorder->Last();
    EXPECT_EQ(reply.status, S_OK);
    EXPECT_EQ(reply.userDef, 4711u);

    test::TestVariant data = test::TestVariant::Text(reply.text);
    TavControllerState decoded = SysFail;
    EXPECT_EQ(panel->UnpackControllerState(data.Get(), &decoded), S_OK);
    EXPECT_EQ(decoded, MotorsOff);
}

}  // namespace
}  // namespace tav::e2e
