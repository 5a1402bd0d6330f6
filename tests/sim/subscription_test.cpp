// Subscriptions: OnChange delivery of State and Mode, unsubscribing, the
// connection's own events, and clean shutdown. What an event carries besides
// its text is checked end to end (e2e_events).
#include <atomic>

#include "sim/status_codes.h"
#include "sim_test_support.h"

namespace tav::sim::test {
namespace {

using SubscriptionTest = SimTest;

TEST_F(SubscriptionTest, StateChangesReachTheSinkAsTheyHappen) {
    ASSERT_EQ(S_OK, Get("State").status);  // binds the component to its controller
    tav::test::SinkRef sink;
    ASSERT_NE(0u, Subscribe(sink.sink, "State"));

    ASSERT_EQ(S_OK, Set("State", "STAND_BY").status);  // no change, no event
    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    ASSERT_TRUE(sink->WaitFor(1));
    ASSERT_EQ(S_OK, Set("State", "STAND_BY").status);
    ASSERT_TRUE(sink->WaitFor(2));

    const auto events = sink->All();
    ASSERT_EQ(2u, events.size());
    EXPECT_EQ("RUN", events[0].text);
    EXPECT_EQ("STAND_BY", events[1].text);
    EXPECT_LT(events[0].eventId, events[1].eventId);
}

TEST_F(SubscriptionTest, ModeEventsFollowTheChangeToAutomatic) {
    ASSERT_EQ(S_OK, Get("Mode").status);
    tav::test::SinkRef sink;
    ASSERT_NE(0u, Subscribe(sink.sink, "Mode"));
    tav::test::SinkRef conditions;
    ASSERT_NE(0u, Subscribe(conditions.sink, "AutoCondSub"));

    // Every change gives its event, however quickly the next one follows.
    ASSERT_EQ(S_OK, Set("OPMode", "-opmode auto").status);
    ASSERT_EQ(S_OK, Set("AutoCondAck", "-AutoCondAck Reset -ID 1").status);
    ASSERT_EQ(S_OK, Set("Ack", "AUTO").status);
    ASSERT_TRUE(sink->WaitFor(3) && conditions->WaitFor(3));

    const auto texts = Texts(*sink.sink);
    EXPECT_EQ("AUTO_CH -auto_ch 1 -noelts 3\tBlk;1;1\tSpeedOvr;1;2\tRunMode;0;3\t", texts[0]);
    EXPECT_EQ("AUTO_CH -auto_ch 1 -noelts 2\tSpeedOvr;1;2\tRunMode;0;3\t", texts[1]);
    EXPECT_EQ("AUTO", texts[2]);
    EXPECT_EQ("-auto_ch 0 -noelts 0\t", Texts(*conditions.sink)[2]);
}

TEST_F(SubscriptionTest, UnsubscribeStopsDeliveryAndReleasesTheSink) {
    ASSERT_EQ(S_OK, Get("State").status);
    tav::test::SinkRef kept, dropped;
    const ULONG keptCookie = Subscribe(kept.sink, "State");
    const ULONG droppedCookie = Subscribe(dropped.sink, "State");
    ASSERT_NE(keptCookie, droppedCookie);

    EXPECT_EQ(S_OK, command_->Unsubscribe(nullptr, droppedCookie));
    EXPECT_EQ(1u, dropped->References());
    EXPECT_EQ(E_INVALIDARG, command_->Unsubscribe(nullptr, droppedCookie));
    EXPECT_NE(std::string::npos, ErrorTextOf(command_.Get()).find(std::to_string(droppedCookie)));

    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    ASSERT_TRUE(kept->WaitFor(1));
    EXPECT_EQ(0u, dropped->Count());
}

// Unsubscribes from inside its own OnChange.
TEST_F(SubscriptionTest, SinkMayUnsubscribeFromItsOwnOnChange) {
    ASSERT_EQ(S_OK, Get("State").status);
    tav::test::SinkRef sink;
    ULONG cookie = 0;
    std::atomic<HRESULT> unsubscribed{E_UNEXPECTED};
    sink->onChange = [&] { unsubscribed = command_->Unsubscribe(nullptr, cookie); };
    cookie = Subscribe(sink.sink, "State");
    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    ASSERT_TRUE(sink->WaitFor(1));
    EXPECT_EQ(S_OK, unsubscribed.load());
    ASSERT_EQ(S_OK, Set("State", "STAND_BY").status);
    std::this_thread::sleep_for(200ms);
    EXPECT_EQ(1u, sink->Count());
}

TEST_F(SubscriptionTest, SubscriptionsNeedAKnownEventAKnownKindAndAController) {
    tav::test::SinkRef sink;
    HRESULT hr = S_OK;
    EXPECT_EQ(0u, Subscribe(sink.sink, "State", 1, Data, &hr));
    EXPECT_EQ(E_UNEXPECTED, hr);  // nothing bound the component yet

    ComPtr<ITavUserComponent> user;
    ASSERT_EQ(S_OK, CoCreateInstance(CLSID_TavUser, nullptr, CLSCTX_INPROC_SERVER, IID_ITavUserComponent,
                                     reinterpret_cast<void**>(&user)));
    const Bstr url{TextView(url_)};
    ASSERT_EQ(S_OK, user->Initialize(url.Get(), command_.Get()));
    EXPECT_NE(0u, Subscribe(sink.sink, "State", 1, Data, &hr));

    EXPECT_EQ(0u, Subscribe(sink.sink, "Weather", 1, Data, &hr));
    EXPECT_EQ(E_INVALIDARG, hr);
    EXPECT_NE(std::string::npos, ErrorTextOf(command_.Get()).find("\"Weather\""));

    TavEventParams params{};
    params.pSink = sink.sink;
    ULONG cookie = 0;
    const Bstr state = B("State");
    EXPECT_EQ(E_INVALIDARG, command_->Subscribe(nullptr, &params, nullptr, state.Get(), nullptr, 3, &cookie));
    params.pSink = nullptr;
    EXPECT_EQ(E_INVALIDARG, command_->Subscribe(nullptr, &params, nullptr, state.Get(), nullptr, 1, &cookie));

    controller_->Faults().FailTransport();
    params.pSink = sink.sink;
    EXPECT_EQ(kStatusLinkDown, command_->Subscribe(nullptr, &params, nullptr, state.Get(), nullptr, 1, &cookie));
}

TEST_F(SubscriptionTest, ConnectionEventsTellWhenTheLinkGoesAndReturns) {
    ASSERT_EQ(S_OK, Get("State").status);
    tav::test::SinkRef sink;
    TavEventParams params{};
    params.pSink = sink.sink;
    params.pollTime = 0x7FFFFFFF;
    params.userDef = 5;
    ULONG cookie = 0;
    ASSERT_EQ(S_OK, command_->SubscribeConnectionEvents(nullptr, &params, &cookie));

    controller_->Faults().FailTransport();
    controller_->Faults().FailTransport();  // already down: no second notice
    controller_->Faults().RestoreTransport();
    ASSERT_TRUE(sink->WaitFor(3));
    EXPECT_EQ((std::vector<std::string>{"-Connection established", "-Connection lost", "-Connection restored"}),
              Texts(*sink.sink));
    EXPECT_FALSE(sink->WaitFor(4, 100ms));
}

TEST_F(SubscriptionTest, ReleasingTheComponentEndsItsSubscriptions) {
    ASSERT_EQ(S_OK, Get("State").status);
    tav::test::SinkRef sink;
    ASSERT_NE(0u, Subscribe(sink.sink, "State"));
    ASSERT_NE(0u, Subscribe(sink.sink, "Mode"));
    command_ = nullptr;
    EXPECT_EQ(1u, sink->References());
    controller_->SetMotorsState(T("RUN"));
    EXPECT_FALSE(sink->WaitFor(1, 100ms));
}

}  // namespace
}  // namespace tav::sim::test
