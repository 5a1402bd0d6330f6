// What each event carries besides its text: the subscriber's own value, the
// data in the form asked for, the time, the status and an identifier.
#include <cstdlib>

#include "events_fixture.h"

namespace tav::e2e {
namespace {

using namespace std::chrono_literals;

constexpr std::uint64_t kUnixEpochTicks = 116444736000000000ull;

long long SecondsOf(const FILETIME& time) {
    const std::uint64_t ticks = (static_cast<std::uint64_t>(time.dwHighDateTime) << 32) | time.dwLowDateTime;
    return static_cast<long long>((ticks - kUnixEpochTicks) / 10000000ull);
}

struct Form {
    TavContainData containData;
    VARTYPE type;
    UINT byteLength;
    std::string bytes;
};

using EventRecordE2eTest = EventsFixture;

TEST_F(EventRecordE2eTest, DataComesInTheFormAskedFor) {
    const Form forms[] = {
        {Data, VT_BSTR, 2 * sizeof(OLECHAR), std::string("4\0" "5\0", 2 * sizeof(OLECHAR))},
        {NoData, VT_EMPTY, 0, ""},
        {BinaryData, VT_BSTR, 2, "45"},
    };
    // Every form of the same change, with the same subscriber's value.
    SinkRef sinks[3];
    ULONG cookies[3] = {};
    for (int i = 0; i < 3; ++i) {
        ASSERT_EQ(Subscribe(sinks[i].sink, SpeedRatio, &cookies[i], 0xC0FFEEu + i, forms[i].containData), S_OK);
    }
    ASSERT_EQ(Panel()->SetSpeedRatio(nullptr, 45), S_OK);
    for (int i = 0; i < 3; ++i) {
        SCOPED_TRACE("containData " + std::to_string(forms[i].containData));
        ASSERT_TRUE(sinks[i]->WaitFor(1));
        const ReceivedEvent event = sinks[i]->All()[0];
        EXPECT_EQ(event.userDef, 0xC0FFEEu + i);
        EXPECT_EQ(event.type, forms[i].type);
        EXPECT_EQ(event.byteLength, forms[i].byteLength);
        EXPECT_EQ(event.bytes, forms[i].bytes);
        EXPECT_EQ(event.status, S_OK);
        EXPECT_NE(event.eventId, 0u);
        EXPECT_LE(std::llabs(SecondsOf(event.time) - Model()->Now()), 2);
        EXPECT_EQ(Unsubscribe(cookies[i]), S_OK);
    }
    // Only the text form decodes as text.
    short ratio = 0;
    EXPECT_EQ(Panel()->UnpackSpeedRatio(sinks[0]->All()[0].data->Get(), &ratio), S_OK);
    EXPECT_EQ(ratio, 45);
    EXPECT_EQ(Panel()->UnpackSpeedRatio(sinks[1]->All()[0].data->Get(), &ratio), E_FAIL);
}

// A forced poll time must not stop the changes themselves from arriving:
// the auto conditions come on change only, whatever poll time is asked for.
TEST_F(EventRecordE2eTest, ForcedPollTimeStillDeliversEveryChange) {
    SinkRef sink;
    ULONG cookie = 0;
    ASSERT_EQ(Subscribe(sink.sink, AutoConditionEvent, &cookie, 0, Data, 10), S_OK);
    EXPECT_FALSE(sink->WaitFor(1, 100ms));  // nothing changed, nothing polled out
    ASSERT_EQ(Panel()->SetOPMode(nullptr, Auto), S_OK);
    ASSERT_EQ(Panel()->AcknowledgeAutoCondition(nullptr, AutoConditionAck_Reset, 1), S_OK);
    ASSERT_TRUE(sink->WaitFor(2));
    EXPECT_EQ(sink->All()[1].text, "-auto_ch 1 -noelts 2\tSpeedOvr;1;2\tRunMode;0;3\t");
    EXPECT_EQ(Unsubscribe(cookie), S_OK);
}

}  // namespace
}  // namespace tav::e2e
