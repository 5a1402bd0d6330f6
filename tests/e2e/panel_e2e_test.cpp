// Motors state, operation mode with its auto conditions, collision detection,
// events and an asynchronous call, end to end against the virtual controller.
#include <thread>

#include "support/event_sink.h"
#include "support/reply_recorder.h"
#include "support/test_text.h"
#include "virtual_controller_fixture.h"

namespace tav::e2e {
namespace {

using PanelE2eTest = VirtualControllerTest;

TEST_F(PanelE2eTest, MotorsOnAndOff) {
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOn), S_OK);
    TavControllerState state = InitState;
    ASSERT_EQ(panel->GetControllerState(nullptr, &state), S_OK);
    EXPECT_EQ(state, MotorsOn);
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOff), S_OK);
    ASSERT_EQ(panel->GetControllerState(nullptr, &state), S_OK);
    EXPECT_EQ(state, MotorsOff);
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

TEST_F(PanelE2eTest, CollisionStateIsDecoded) {
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    TavCollisionDetectState state{};
    ASSERT_EQ(panel->GetCollisionDetectState(nullptr, &state), S_OK);
    EXPECT_GE(state, CollisionDetect_Init);
    EXPECT_LE(state, CollisionDetect_TriggeredAck);
    // Nothing was triggered, so the controller has nothing to acknowledge.
    EXPECT_LT(panel->Acknowledge(nullptr, ColDetAck), 0);
    EXPECT_NE(LastError().find("TavControllerImpl["), std::string::npos);
}

TEST_F(PanelE2eTest, StateAndModeEventsReachTheSink) {
    SinkRef sink;
    TavEventParams params{};
    params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
    params.pSink = sink.sink;
    params.subscriptionType = state;
    ComPtr<ITavSubscribe> subscribe = As<ITavSubscribe>();
    ULONG stateCookie = 0;
    ASSERT_EQ(subscribe->Subscribe(nullptr, &params, &stateCookie), S_OK);

    ComPtr<ITavPanel> panel = As<ITavPanel>();
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOn), S_OK);
    ASSERT_TRUE(sink->WaitFor(1));

    TavControllerState decoded = InitState;
    EXPECT_EQ(panel->UnpackControllerState(sink->All().back().data->Get(), &decoded), S_OK);
    EXPECT_EQ(decoded, MotorsOn);

    ASSERT_EQ(subscribe->Unsubscribe(nullptr, stateCookie), S_OK);
    const size_t before = sink->Count();
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOff), S_OK);
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    EXPECT_EQ(sink->Count(), before);
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
