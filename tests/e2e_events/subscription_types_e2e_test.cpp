// Each subscription type end to end through the module: subscribe, make the
// change it watches, receive the event and decode it with the matching
// Unpack operation, unsubscribe, and see no event for the next change.
#include <thread>

#include "events_fixture.h"

namespace tav::e2e {
namespace {

using namespace std::chrono_literals;

struct WatchedType {
    const char* name;
    ULONG type;
    // Delivered at once on subscribing, before any change.
    size_t greetings;
    // step 0: the change watched for; step 1: a further change after
    // unsubscribing.
    HRESULT (*cause)(EventsFixture& test, int step);
    // The event's data through the type's decoder, as a readable text.
    std::string (*decode)(EventsFixture& test, VARIANT* data);
    std::string expected;
};

// The value an Unpack operation of interface I reads from the data, as a
// number, or its failure.
template <class I, class T>
std::string Unpacked(EventsFixture& test, HRESULT (STDMETHODCALLTYPE I::*unpack)(VARIANT*, T*), VARIANT* data) {
    T value{};
    const HRESULT hr = (test.As<I>().Get()->*unpack)(data, &value);
    return hr == S_OK ? std::to_string(static_cast<long>(value)) : "failed " + std::to_string(hr);
}

const WatchedType kTypes[] = {
    {"state", state, 0,
     [](EventsFixture& t, int step) {
         return t.Panel()->SetControllerState(nullptr, step == 0 ? MotorsOn : MotorsOff);
     },
     [](EventsFixture& t, VARIANT* data) { return Unpacked(t, &ITavPanel::UnpackControllerState, data); },
     std::to_string(MotorsOn)},
    {"mode", mode, 0,
     [](EventsFixture& t, int step) { return t.Panel()->SetOPMode(nullptr, step == 0 ? Manf : Manr); },
     [](EventsFixture& t, VARIANT* data) { return Unpacked(t, &ITavPanel::UnpackOperationMode, data); },
     std::to_string(ManfChange)},
    {"SpeedRatio", SpeedRatio, 0,
     [](EventsFixture& t, int step) { return t.Panel()->SetSpeedRatio(nullptr, step == 0 ? 40 : 60); },
     [](EventsFixture& t, VARIANT* data) { return Unpacked(t, &ITavPanel::UnpackSpeedRatio, data); },
     "40"},
    {"ConnectionEvents", ConnectionEvents, 1,
     [](EventsFixture& t, int step) {
         if (step == 0) {
             t.Model()->Faults().FailTransport();
         } else {
             t.Model()->Faults().RestoreTransport();
         }
         return S_OK;
     },
     [](EventsFixture&, VARIANT* data) {
         return data->vt == VT_BSTR ? text::Narrow(OleStringView(data->bstrVal, SysStringLen(data->bstrVal)))
                                    : std::string("not a text");
     },
     "-Connection lost"},
    {"AutoConditionEvent", AutoConditionEvent, 0,
     [](EventsFixture& t, int step) { return t.Panel()->SetOPMode(nullptr, step == 0 ? Auto : Manr); },
     [](EventsFixture& t, VARIANT* data) {
         LONG autoChange = -1;
         ComPtr<IEnumAutoCondition> conditions;
         const HRESULT hr = t.Panel()->UnpackAutoConditions(data, &autoChange, &conditions);
         if (hr != S_OK || !conditions) {
             return "failed " + std::to_string(hr);
         }
         TavAutoCondition element{};
         ULONG fetched = 0;
         int count = 0;
         while (conditions->RemNext(1, &element, &fetched) == S_OK && fetched == 1) {
             ++count;
         }
         return "auto_ch " + std::to_string(autoChange) + ", " + std::to_string(count) + " conditions";
     },
     "auto_ch 1, 3 conditions"},
    {"SysEnergyState", SysEnergyState, 0,
     [](EventsFixture& t, int step) {
         t.Model()->SetEnergyState(step == 0 ? OLESTR("pausing") : OLESTR("paused"));
         return S_OK;
     },
     [](EventsFixture& t, VARIANT* data) { return Unpacked(t, &ITavController4::UnpackSysEnergyState, data); },
     std::to_string(TavSysEnergyStatePausing)},
    {"OPModePinCodeLockState", OPModePinCodeLockState, 0,
     [](EventsFixture& t, int step) {
         return step == 0 ? t.Panel()->LockOPModePinCode2(nullptr, 4711, 1)
                          : t.Panel()->UnlockOPModePinCode(nullptr, 4711);
     },
     [](EventsFixture& t, VARIANT* data) { return Unpacked(t, &ITavPanel3::UnpackOPModePinCodeLockState, data); },
     std::to_string(OPModeLockStatePendingPermLocked)},
};

class EachType : public EventsFixture, public ::testing::WithParamInterface<WatchedType> {};

TEST_P(EachType, DeliversDecodableEventsUntilUnsubscribed) {
    const WatchedType& watched = GetParam();
    SinkRef sink;
    ULONG cookie = 0;
    ASSERT_EQ(Subscribe(sink.sink, watched.type, &cookie, 77), S_OK) << LastError();
    ASSERT_NE(cookie, 0u);
    ASSERT_TRUE(sink->WaitFor(watched.greetings));

    ASSERT_EQ(watched.cause(*this, 0), S_OK) << LastError();
    ASSERT_TRUE(sink->WaitFor(watched.greetings + 1));
    std::this_thread::sleep_for(100ms);  // one change, one event
    const auto events = sink->All();
    ASSERT_EQ(events.size(), watched.greetings + 1);
    const ReceivedEvent& event = events.back();
    EXPECT_EQ(event.userDef, 77u);
    EXPECT_EQ(event.status, S_OK);
    EXPECT_EQ(watched.decode(*this, event.data->Get()), watched.expected);

    ASSERT_EQ(Unsubscribe(cookie), S_OK) << LastError();
    ASSERT_EQ(watched.cause(*this, 1), S_OK) << LastError();
    EXPECT_FALSE(sink->WaitFor(events.size() + 1, 200ms));
    EXPECT_EQ(Unsubscribe(cookie), E_INVALIDARG);  // the cookie is spent
}

INSTANTIATE_TEST_SUITE_P(Owned, EachType, ::testing::ValuesIn(kTypes),
                         [](const auto& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace tav::e2e
