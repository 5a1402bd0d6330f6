// The virtual clock end to end: its states, stepping by slices and to the
// next slice boundary, free running at a speed, and what it refuses.
#include <thread>

#include "events_fixture.h"
#include "sim/status_codes.h"

namespace tav::e2e {
namespace {

using namespace std::chrono_literals;

class VirtualTimeE2eTest : public EventsFixture {
protected:
    ComPtr<ITavVirtualTime> Clock() { return As<ITavVirtualTime>(); }
    ULONG Time() { return Fetch(&ITavVirtualTime::VTGetTime); }
};

TEST_F(VirtualTimeE2eTest, StartsStoppedAtZeroAndEveryStateReadsBackAsSet) {
    EXPECT_EQ(Fetch(&ITavVirtualTime::VTGetTimeSlice), 24u);
    EXPECT_EQ(Fetch(&ITavVirtualTime::VTGetSpeed), 100u);
    EXPECT_EQ(Time(), 0u);
    TavVTState expected = VTStop;
    for (TavVTState next : {VTFreeRun, VTRunSlice, VTNextEvent, VTStop, VTStop}) {
        EXPECT_EQ(Fetch(&ITavVirtualTime::VTGetState), expected);
        ASSERT_EQ(Clock()->VTSetState(nullptr, next), S_OK);
        expected = next;
    }
}

TEST_F(VirtualTimeE2eTest, SteppingMovesBySliceOrToTheNextBoundary) {
    struct Step {
        TavVTState state;
        ULONG slice;
        ULONG timeAfterRun;
    };
    const Step steps[] = {
        {VTRunSlice, 24, 24}, {VTRunSlice, 10, 34},  // a slice from where it stands
        {VTNextEvent, 10, 40}, {VTNextEvent, 10, 50},  // to the boundary, then a whole slice
        {VTNextEvent, 15, 60}, {VTRunSlice, 1000, 1060},
    };
    for (const Step& step : steps) {
        SCOPED_TRACE(step.timeAfterRun);
        ASSERT_EQ(Clock()->VTSetState(nullptr, step.state), S_OK);
        ASSERT_EQ(Clock()->VTSetTimeSlice(nullptr, step.slice), S_OK);
        ASSERT_EQ(Clock()->VTRun(nullptr), S_OK) << LastError();
        EXPECT_EQ(Time(), step.timeAfterRun);
    }
}

TEST_F(VirtualTimeE2eTest, RefusesWhatWouldNotAdvanceTheClock) {
    EXPECT_EQ(Clock()->VTRun(nullptr), sim::kStatusNotAllowed);  // stopped
    EXPECT_TRUE(ErrorHas("stopped")) << LastError();
    ASSERT_EQ(Clock()->VTSetState(nullptr, VTFreeRun), S_OK);
    EXPECT_EQ(Clock()->VTRun(nullptr), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("runs freely")) << LastError();
    EXPECT_EQ(Clock()->VTSetTimeSlice(nullptr, 0), sim::kStatusBadArgument);
    EXPECT_EQ(Fetch(&ITavVirtualTime::VTGetTimeSlice), 24u);
}

TEST_F(VirtualTimeE2eTest, FreeRunningFollowsTheHostAtItsSpeed) {
    ASSERT_EQ(Clock()->VTSetSpeed(nullptr, 1000), S_OK);
    EXPECT_EQ(Fetch(&ITavVirtualTime::VTGetSpeed), 1000u);

    ASSERT_EQ(Clock()->VTSetState(nullptr, VTFreeRun), S_OK);
    std::this_thread::sleep_for(60ms);
    const ULONG running = Time();
    EXPECT_GE(running, 600u);  // ten times the host's 60 ms at least

    ASSERT_EQ(Clock()->VTSetSpeed(nullptr, 0), S_OK);  // a speed of 0 holds it
    const ULONG held = Time();
    EXPECT_GE(held, running);
    std::this_thread::sleep_for(30ms);
    EXPECT_EQ(Time(), held);

    ASSERT_EQ(Clock()->VTSetSpeed(nullptr, 100), S_OK);
    std::this_thread::sleep_for(30ms);
    ASSERT_EQ(Clock()->VTSetState(nullptr, VTStop), S_OK);
    const ULONG stopped = Time();
    EXPECT_GE(stopped, held + 30);
    std::this_thread::sleep_for(30ms);
    EXPECT_EQ(Time(), stopped);  // stopping keeps the time reached
}

}  // namespace
}  // namespace tav::e2e
