// Subscriptions: OnChange delivery of State and Mode, unsubscribing, the
// connection's own events, and clean shutdown.
#include <cstdlib>

#include "sim/status_codes.h"
#include "sim_test_support.h"

namespace tav::sim::test {
namespace {

using SubscriptionTest = SimTest;

constexpr std::uint64_t kUnixEpochTicks = 116444736000000000ull;

std::uint64_t SecondsOf(const FILETIME& time) {
    const std::uint64_t ticks = (static_cast<std::uint64_t>(time.dwHighDateTime) << 32) | time.dwLowDateTime;
    return (ticks - kUnixEpochTicks) / 10000000ull;
}

TEST_F(SubscriptionTest, StateChangesReachTheSinkAsTheyHappen) {
    ASSERT_EQ(S_OK, Get("State").status);  // binds the component to its controller
    Ref<EventCollector> sink(new EventCollector);
    const ULONG cookie = Subscribe(sink.get(), "State", 42);
    ASSERT_NE(0u, cookie);

    ASSERT_EQ(S_OK, Set("State", "STAND_BY").status);  // no change, no event
    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    ASSERT_TRUE(sink->WaitFor(1));
    ASSERT_EQ(S_OK, Set("State", "STAND_BY").status);
    ASSERT_TRUE(sink->WaitFor(2));

    const auto events = sink->All();
    ASSERT_EQ(2u, events.size());
    EXPECT_EQ("RUN", events[0].text);
    EXPECT_EQ("STAND_BY", events[1].text);
    EXPECT_EQ(42u, events[0].userDef);
    EXPECT_EQ(VT_BSTR, events[0].type);
    EXPECT_EQ(S_OK, events[0].status);
    EXPECT_LT(events[0].eventId, events[1].eventId);
    const auto lag = static_cast<long long>(SecondsOf(events[0].time)) - static_cast<long long>(controller_->Now());
    EXPECT_LE(std::llabs(lag), 2);
}

TEST_F(SubscriptionTest, ModeEventsFollowTheChangeToAutomatic) {
    ASSERT_EQ(S_OK, Get("Mode").status);
    Ref<EventCollector> sink(new EventCollector);
    ASSERT_NE(0u, Subscribe(sink.get(), "Mode"));
    Ref<EventCollector> conditions(new EventCollector);
    ASSERT_NE(0u, Subscribe(conditions.get(), "AutoCondSub"));

    // Every change gives its event, however quickly the next one follows.
    ASSERT_EQ(S_OK, Set("OPMode", "-opmode auto").status);
    ASSERT_EQ(S_OK, Set("AutoCondAck", "-AutoCondAck Reset -ID 1").status);
    ASSERT_EQ(S_OK, Set("Ack", "AUTO").status);
    ASSERT_TRUE(sink->WaitFor(3) && conditions->WaitFor(3));

    const auto texts = sink->Texts();
    EXPECT_EQ("AUTO_CH -auto_ch 1 -noelts 3\tBlk;1;1\tSpeedOvr;1;2\tRunMode;0;3\t", texts[0]);
    EXPECT_EQ("AUTO_CH -auto_ch 1 -noelts 2\tSpeedOvr;1;2\tRunMode;0;3\t", texts[1]);
    EXPECT_EQ("AUTO", texts[2]);
    EXPECT_EQ("-auto_ch 0 -noelts 0\t", conditions->Texts()[2]);
}

TEST_F(SubscriptionTest, NoDataSubscriptionGetsTheNoticeAlone) {
    ASSERT_EQ(S_OK, Get("State").status);
    Ref<EventCollector> sink(new EventCollector);
    ASSERT_NE(0u, Subscribe(sink.get(), "State", 1, NoData));
    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    ASSERT_TRUE(sink->WaitFor(1));
    EXPECT_EQ(VT_EMPTY, sink->All()[0].type);
}

TEST_F(SubscriptionTest, UnsubscribeStopsDeliveryAndReleasesTheSink) {
    ASSERT_EQ(S_OK, Get("State").status);
    Ref<EventCollector> kept(new EventCollector);
    Ref<EventCollector> dropped(new EventCollector);
    const ULONG keptCookie = Subscribe(kept.get(), "State");
    const ULONG droppedCookie = Subscribe(dropped.get(), "State");
    ASSERT_NE(keptCookie, droppedCookie);

    EXPECT_EQ(S_OK, command_->Unsubscribe(nullptr, droppedCookie));
    EXPECT_EQ(1u, dropped->References());
    EXPECT_EQ(E_INVALIDARG, command_->Unsubscribe(nullptr, droppedCookie));
    EXPECT_NE(std::string::npos, ErrorTextOf(command_.Get()).find(std::to_string(droppedCookie)));

    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    ASSERT_TRUE(kept->WaitFor(1));
    EXPECT_TRUE(dropped->All().empty());
}

TEST_F(SubscriptionTest, SinkMayUnsubscribeFromItsOwnOnChange) {
    ASSERT_EQ(S_OK, Get("State").status);
    Ref<EventCollector> sink(new EventCollector);
    ULONG cookie = 0;
    ITavComCtrl* command = command_.Get();
    sink->during = [&cookie, command] { command->Unsubscribe(nullptr, cookie); };
    cookie = Subscribe(sink.get(), "State");
    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    ASSERT_TRUE(sink->WaitFor(1));
    ASSERT_EQ(S_OK, Set("State", "STAND_BY").status);
    EXPECT_FALSE(sink->WaitFor(2, 200ms));
}

TEST_F(SubscriptionTest, SubscriptionsNeedAKnownEventAKnownKindAndAController) {
    Ref<EventCollector> sink(new EventCollector);
    HRESULT hr = S_OK;
    EXPECT_EQ(0u, Subscribe(sink.get(), "State", 1, Data, &hr));
    EXPECT_EQ(E_UNEXPECTED, hr);  // nothing bound the component yet

    ComPtr<ITavUserComponent> user;
    ASSERT_EQ(S_OK, CoCreateInstance(CLSID_TavUser, nullptr, CLSCTX_INPROC_SERVER, IID_ITavUserComponent,
                                     reinterpret_cast<void**>(&user)));
    const Bstr url{TextView(url_)};
    ASSERT_EQ(S_OK, user->Initialize(url.Get(), command_.Get()));
    EXPECT_NE(0u, Subscribe(sink.get(), "State", 1, Data, &hr));

    EXPECT_EQ(0u, Subscribe(sink.get(), "Weather", 1, Data, &hr));
    EXPECT_EQ(E_INVALIDARG, hr);
    EXPECT_NE(std::string::npos, ErrorTextOf(command_.Get()).find("\"Weather\""));

    TavEventParams params{};
    params.pSink = sink.get();
    ULONG cookie = 0;
    const Bstr state = B("State");
    EXPECT_EQ(E_INVALIDARG, command_->Subscribe(nullptr, &params, nullptr, state.Get(), nullptr, 3, &cookie));
    params.pSink = nullptr;
    EXPECT_EQ(E_INVALIDARG, command_->Subscribe(nullptr, &params, nullptr, state.Get(), nullptr, 1, &cookie));

    controller_->Faults().FailTransport();
    params.pSink = sink.get();
    EXPECT_EQ(kStatusLinkDown, command_->Subscribe(nullptr, &params, nullptr, state.Get(), nullptr, 1, &cookie));
}

TEST_F(SubscriptionTest, ConnectionEventsTellWhenTheLinkGoesAndReturns) {
    ASSERT_EQ(S_OK, Get("State").status);
    Ref<EventCollector> sink(new EventCollector);
    TavEventParams params{};
    params.pSink = sink.get();
    params.pollTime = 0x7FFFFFFF;
    params.userDef = 5;
    ULONG cookie = 0;
    ASSERT_EQ(S_OK, command_->SubscribeConnectionEvents(nullptr, &params, &cookie));

    controller_->Faults().FailTransport();
    controller_->Faults().FailTransport();  // already down: no second notice
    controller_->Faults().RestoreTransport();
    ASSERT_TRUE(sink->WaitFor(3));
    EXPECT_EQ((std::vector<std::string>{"-Connection established", "-Connection lost", "-Connection restored"}),
              sink->Texts());
    EXPECT_FALSE(sink->WaitFor(4, 100ms));
}

TEST_F(SubscriptionTest, ReleasingTheComponentEndsItsSubscriptions) {
    ASSERT_EQ(S_OK, Get("State").status);
    Ref<EventCollector> sink(new EventCollector);
    ASSERT_NE(0u, Subscribe(sink.get(), "State"));
    ASSERT_NE(0u, Subscribe(sink.get(), "Mode"));
    command_ = nullptr;
    EXPECT_EQ(1u, sink->References());
    controller_->SetMotorsState(T("RUN"));
    EXPECT_FALSE(sink->WaitFor(1, 100ms));
}

}  // namespace
}  // namespace tav::sim::test
