#include <gtest/gtest.h>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class SubscriptionsTest : public ControllerTest {
protected:
    HRESULT Subscribe(ControllerObject* object, ULONG type, ULONG pollTime = 500, ULONG* cookie = nullptr) {
        TavEventParams params{};
        params.subscriptionType = type;
        params.pollTime = pollTime;
        params.userDef = 77;
        ULONG ignored = 0;
        return object->Subscribe(nullptr, &params, cookie != nullptr ? cookie : &ignored);
    }
};

struct HandedOn {
    ULONG type;
    const char* eventName;
    const char* eventArgs;  // nullptr: none
    LONG kind;
    ULONG pollTime;  // as given 500, or forced
};

TEST_F(SubscriptionsTest, EachTypeReachesTheComponentAsTabled) {
    constexpr ULONG kForced = 2147483647;
    const HandedOn table[] = {
        {state, "State", nullptr, 1, 500},
        {mode, "Mode", nullptr, 1, 500},
        {MasterKESTO, "CurrentMasterUid", "-Domain KESTO", 4, 500},
        {SpeedRatio, "SpeedAdjust", nullptr, 1, 500},
        {MasterCFG, "CurrentMasterUid", "-Domain CFG", 4, 500},
        {MasterMotion, "CurrentMasterUid", "-Domain MOTION", 4, 500},
        {ManualModePrivRequestEvent, "RMMPRequest", nullptr, 2, kForced},
        {ManualModePrivilegesState, "RMMPStateUid", nullptr, 1, 500},
        {BackupEvents, "BackupSub", nullptr, 2, kForced},
        {AutoConditionEvent, "AutoCondSub", nullptr, 1, kForced},
        {SystemDiagnosticsInfoEvent, "SystemDiagnostics", nullptr, 1, 500},
        {DorvelScreenDumpEvent, "TavDorvel", nullptr, 1, 500},
        {SysEnergyState, "SysEnergyStateSub", nullptr, 1, 500},
        {OPModePinCodeLockState, "OPModePinCodeLockState", nullptr, 1, 500},
        {SafetyModeStatus, "SafetyModeStatus", nullptr, 1, 500},
        // Connection events go through an operation of their own, with no name.
        {ConnectionEvents, "", nullptr, 0, kForced},
    };
    ControllerObject* object = Make(17);
    for (const HandedOn& row : table) {
        SCOPED_TRACE(row.eventName);
        Component().SetNextCookie(40 + row.type);
        ULONG cookie = 0;
        ASSERT_EQ(Subscribe(object, row.type, 500, &cookie), S_OK);
        EXPECT_EQ(cookie, 40 + row.type);
        const RecordedSubscription sent = Component().Subscriptions().back();
        EXPECT_EQ(sent.connectionEvents, row.type == ConnectionEvents);
        EXPECT_EQ(sent.eventName, row.eventName);
        EXPECT_EQ(sent.eventArgs, row.eventArgs ? std::optional<std::string>(row.eventArgs) : std::nullopt);
        EXPECT_EQ(sent.kind, row.kind);
        EXPECT_EQ(sent.eventParams.pollTime, row.pollTime);
        EXPECT_EQ(sent.eventParams.userDef, 77u);
    }
}

TEST_F(SubscriptionsTest, TypesUnknownOrTooNewForTheClassAreRefused) {
    struct Case {
        LONG version;
        ULONG type;
    };
    const Case refused[] = {{17, 4}, {17, 6}, {17, 9}, {17, 19}, {14, SafetyModeStatus}, {3, SystemDiagnosticsInfoEvent},
                            {5, DorvelScreenDumpEvent}, {11, SysEnergyState}, {12, OPModePinCodeLockState}};
    for (const Case& c : refused) {
        SCOPED_TRACE(testing::Message() << "version " << c.version << " type " << c.type);
        ControllerObject* object = Make(c.version);
        EXPECT_EQ(Subscribe(object, c.type), E_INVALIDARG);
        const std::string text = ErrorText(object);
        EXPECT_EQ(text.rfind("Subscribe. Unknown subscription type.TavControllerImpl[", 0), 0u) << text;
        EXPECT_EQ(text.back(), ';') << text;
    }
    EXPECT_TRUE(Component().Subscriptions().empty());
    EXPECT_EQ(Subscribe(Make(15), SafetyModeStatus), S_OK);
}

TEST_F(SubscriptionsTest, ChecksComeInOrderWithTheirTexts) {
    ControllerObject* fresh = MakeUninitialised();
    TavInParams foreign = ForeignCallback();
    TavEventParams params{};
    ULONG cookie = 0;
    EXPECT_EQ(fresh->Subscribe(&foreign, &params, &cookie), E_INVALIDARG);
    EXPECT_TRUE(HasError("Subscribe: Invalid TavInParams", fresh));
    EXPECT_EQ(fresh->Subscribe(nullptr, &params, &cookie), E_ABORT);
    EXPECT_TRUE(HasError("Subscribe - Helper used before initialized", fresh));
    EXPECT_EQ(fresh->Unsubscribe(&foreign, 1), E_INVALIDARG);
    EXPECT_TRUE(HasError("Unsubscribe. Invalid TavInParams.", fresh));
    EXPECT_EQ(fresh->Unsubscribe(nullptr, 1), E_ABORT);
    EXPECT_TRUE(HasError("Unsubscribe() - Helper isn't initialized", fresh));
}

TEST_F(SubscriptionsTest, ComponentFailuresAreTakenOverWithTheirText) {
    ControllerObject* object = Make();
    Component().Fail(ComOperation::Subscribe, E_ACCESSDENIED, "no more subscriptions");
    EXPECT_EQ(Subscribe(object, state), E_ACCESSDENIED);
    EXPECT_TRUE(HasAdoptedError("no more subscriptions", object));

    Component().Fail(ComOperation::Unsubscribe, E_INVALIDARG, "unknown cookie");
    EXPECT_EQ(object->Unsubscribe(nullptr, 99), E_INVALIDARG);
    EXPECT_TRUE(HasAdoptedError("unknown cookie", object));
    ASSERT_FALSE(Component().Unsubscriptions().empty());
    EXPECT_EQ(Component().Unsubscriptions().back().cookie, 99u);
}

}  // namespace
}  // namespace tav::test
