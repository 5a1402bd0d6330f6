// How often the subscription hub looks at a value event: after every change,
// and on a timer only for a poll time below the forced one.
#include <atomic>
#include <thread>

#include <gtest/gtest.h>

#include "support/event_sink.h"
#include "sim/subscription_hub.h"

namespace tav::sim {
namespace {

using namespace std::chrono_literals;

std::atomic<int> looks{0};

Text CountedLook(const ModelState&, const Arguments&) {
    ++looks;
    return OLESTR("unchanged");
}

constexpr EventRow kCounted{OLESTR("Counted"), EventStyle::Value, CountedLook};

struct PollCase {
    ULONG pollTime;
    bool polled;
};

TEST(HubPolling, OnlyPollTimesBelowTheForcedOneArePolled) {
    const PollCase cases[] = {{0x7FFFFFFF, false}, {0xFFFFFFFF, false}, {0, false}, {20, true}};
    for (const PollCase& c : cases) {
        SCOPED_TRACE("poll time " + std::to_string(c.pollTime));
        auto controller = std::make_shared<ControllerModel>(OLESTR("/hubpolling"));
        auto hub = std::make_shared<SubscriptionHub>(controller);
        e2e::SinkRef sink;
        SubscriptionRequest request;
        request.event = &kCounted;
        request.sink = ComPtr<_ITavObjectEvents>(sink.sink);
        request.pollTime = c.pollTime;
        request.kind = 1;
        looks = 0;
        ASSERT_NE(hub->Add(std::move(request)), 0u);
        std::this_thread::sleep_for(200ms);
        const int idle = looks.load();
        controller->SetEnergyState(OLESTR("paused"));  // any change: one more look
        if (c.polled) {
            EXPECT_GE(idle, 3);
        } else {
            EXPECT_EQ(idle, 1);  // the look that takes the starting text
            EXPECT_EQ(looks.load(), 2);
        }
        EXPECT_EQ(sink->Count(), 0u);  // the text never changed
        hub->Stop();
    }
}

}  // namespace
}  // namespace tav::sim
