// Which class may subscribe to which type: every type is refused as unknown
// through the class just below its threshold and reaches the controller
// through the class at it; types no class defines are refused by all.
#include "events_fixture.h"
#include "sim/event_table.h"

namespace tav::e2e {
namespace {

struct TypeThreshold {
    ULONG type;
    int fromClass;
    const OLECHAR* event;  // as the controller knows it; null for the link's own
};

const TypeThreshold kThresholds[] = {
    {state, 1, OLESTR("State")},
    {mode, 1, OLESTR("Mode")},
    {MasterKESTO, 1, OLESTR("CurrentMasterUid")},
    {SpeedRatio, 1, OLESTR("SpeedAdjust")},
    {ConnectionEvents, 1, nullptr},
    {MasterCFG, 1, OLESTR("CurrentMasterUid")},
    {MasterMotion, 1, OLESTR("CurrentMasterUid")},
    {ManualModePrivRequestEvent, 1, OLESTR("RMMPRequest")},
    {ManualModePrivilegesState, 1, OLESTR("RMMPStateUid")},
    {BackupEvents, 1, OLESTR("BackupSub")},
    {AutoConditionEvent, 1, OLESTR("AutoCondSub")},
    {SystemDiagnosticsInfoEvent, 4, OLESTR("SystemDiagnostics")},
    {DorvelScreenDumpEvent, 6, OLESTR("TavDorvel")},
    {SysEnergyState, 12, OLESTR("SysEnergyStateSub")},
    {OPModePinCodeLockState, 13, OLESTR("OPModePinCodeLockState")},
    {SafetyModeStatus, 15, OLESTR("SafetyModeStatus")},
};

constexpr ULONG kUndefined[] = {4, 6, 9, 19, 0xFFFFFFFF};

constexpr const char* kUnknownType = "Subscribe. Unknown subscription type.";

using ClassVersionE2eTest = EventsFixture;

TEST_F(ClassVersionE2eTest, EveryTypeFromItsOwnClassOn) {
    for (const TypeThreshold& row : kThresholds) {
        SCOPED_TRACE("type " + std::to_string(row.type));
        SinkRef sink;
        ULONG cookie = 0;
        if (row.fromClass > 1) {
            ComPtr<ITavController> older;
            ASSERT_EQ(Make(row.fromClass - 1, older), S_OK);
            EXPECT_EQ(Subscribe(older, sink.sink, row.type, &cookie), E_INVALIDARG);
            EXPECT_EQ(cookie, 0u);
            EXPECT_EQ(LastErrorOf(older).rfind(kUnknownType, 0), 0u) << LastErrorOf(older);
        }
        ComPtr<ITavController> current;
        ASSERT_EQ(Make(row.fromClass, current), S_OK);
        const HRESULT hr = Subscribe(current, sink.sink, row.type, &cookie);
        const std::string error = LastErrorOf(current);
        // An event whose subsystem the controller does not have yet is
        // refused by the controller, never as an unknown type.
        if (row.event == nullptr || sim::FindEvent(row.event) != nullptr) {
            ASSERT_EQ(hr, S_OK) << error;
            ComPtr<ITavSubscribe> subscribe;
            ASSERT_EQ(current.As(subscribe), S_OK);
            EXPECT_EQ(subscribe->Unsubscribe(nullptr, cookie), S_OK);
        } else {
            EXPECT_EQ(error.find(kUnknownType), std::string::npos) << error;
        }
        // Types no class defines are unknown whatever the class.
        const ULONG undefined = kUndefined[(&row - kThresholds) % std::size(kUndefined)];
        EXPECT_EQ(Subscribe(current, sink.sink, undefined, &cookie), E_INVALIDARG) << undefined;
        EXPECT_EQ(LastErrorOf(current).rfind(kUnknownType, 0), 0u) << LastErrorOf(current);
    }
}

}  // namespace
}  // namespace tav::e2e
