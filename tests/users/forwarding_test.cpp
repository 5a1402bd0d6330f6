// The user and mastership operations are handed slot for slot to the user
// component: after the initialised check, with the arguments unchanged, its
// error adopted on failure. Every one of them, from one table.
#include <functional>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class ForwardingTest : public ControllerTest {};

struct Forwarded {
    const char* operation;
    std::string args;  // as the user component records them
    std::function<HRESULT(ControllerObject&, TavInParams*, VARIANT*)> call;
};

std::vector<Forwarded> AllForwarded() {
    return {
        {"LogonUser", "", [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.LogonUser(r); }},
        {"LogonUserAsLocal", "", [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.LogonUserAsLocal(r); }},
        {"LogoffUser", "", [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.LogoffUser(r); }},
        {"RequestManualModePrivileges", "priv=2",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             return o.RequestManualModePrivileges(r, TavManualModePrivileges_Exec);
         }},
        {"PollActiveRequest", "", [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.PollActiveRequest(r); }},
        {"CancelManualModePrivileges", "",
         [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.CancelManualModePrivileges(r); }},
        {"UnpackManualModePrivRequestEvent", "",
         [](ControllerObject& o, TavInParams*, VARIANT* d) {
             TavLoginInfo user{};
             ULONG id = 0;
             TavManualModePrivileges priv{};
             const HRESULT hr = o.UnpackManualModePrivRequestEvent(d, &user, &id, &priv);
             SysFreeString(user.userAlias), SysFreeString(user.location), SysFreeString(user.application);
             return hr;
         }},
        {"GrantManualModePrivileges", "userID=7 priv=1",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             return o.GrantManualModePrivileges(r, 7, TavManualModePrivileges_Modify);
         }},
        {"GetManualModePrivilegesState", "",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             TavManualModePrivilegesState state{};
             TavLoginInfo user{};
             LONG me = 0;
             const HRESULT hr = o.GetManualModePrivilegesState(r, &state, &user, &me);
             SysFreeString(user.userAlias), SysFreeString(user.location), SysFreeString(user.application);
             return hr;
         }},
        {"UnpackManualModePrivilegesState", "clientID=9",
         [](ControllerObject& o, TavInParams*, VARIANT* d) {
             TavManualModePrivilegesState state{};
             TavLoginInfo user{};
             LONG me = 0;
             const HRESULT hr = o.UnpackManualModePrivilegesState(d, 9, &state, &user, &me);
             SysFreeString(user.userAlias), SysFreeString(user.location), SysFreeString(user.application);
             return hr;
         }},
        {"GetUserGrants", "",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             TestBstr grants;
             return o.GetUserGrants(r, grants.Out());
         }},
        {"GetPendingManualModePrivRequest", "",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             TavLoginInfo user{};
             ULONG id = 0;
             TavManualModePrivileges priv{};
             const HRESULT hr = o.GetPendingManualModePrivRequest(r, &user, &id, &priv);
             SysFreeString(user.userAlias), SysFreeString(user.location), SysFreeString(user.application);
             return hr;
         }},
        {"UnpackPendingManualModePrivRequest", "",
         [](ControllerObject& o, TavInParams*, VARIANT* d) {
             TavLoginInfo user{};
             ULONG id = 0;
             TavManualModePrivileges priv{};
             const HRESULT hr = o.UnpackPendingManualModePrivRequest(d, &user, &id, &priv);
             SysFreeString(user.userAlias), SysFreeString(user.location), SysFreeString(user.application);
             return hr;
         }},
        {"GetUserId", "",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             ULONG id = 0;
             return o.GetUserId(r, &id);
         }},
        {"ImpersonateUser", "userID=12",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             ULONG cid = 0;
             return o.ImpersonateUser(r, 12, &cid);
         }},
        {"RemoveImpersonation", "",
         [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.RemoveImpersonation(r); }},
        {"RequestMastership", "resource=2",
         [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.RequestMastership(r, ResourceMotion); }},
        {"ReleaseMastership", "resource=1",
         [](ControllerObject& o, TavInParams* r, VARIANT*) { return o.ReleaseMastership(r, ResourceCFG); }},
        {"GetCurrentMaster", "resource=3",
         [](ControllerObject& o, TavInParams* r, VARIANT*) {
             TavMastershipStatus status{};
             TavLoginInfo info{};
             LONG me = 0;
             const HRESULT hr = o.GetCurrentMaster(r, ResourceInfoStream, &status, &info, &me);
             SysFreeString(info.userAlias), SysFreeString(info.location), SysFreeString(info.application);
             return hr;
         }},
        {"UnpackCurrentMaster", "cid=5",
         [](ControllerObject& o, TavInParams*, VARIANT* d) {
             TavMastershipStatus status{};
             TavLoginInfo info{};
             LONG me = 0;
             const HRESULT hr = o.UnpackCurrentMaster(d, 5, &status, &info, &me);
             SysFreeString(info.userAlias), SysFreeString(info.location), SysFreeString(info.application);
             return hr;
         }},
    };
}

TEST_F(ForwardingTest, EveryOperationReachesItsSlotWithItsArgumentsUnchanged) {
    ControllerObject* object = Make();
    TestVariant data = TestVariant::Text("-User x");
    TavInParams rip = SyncCall(11);
    for (const Forwarded& f : AllForwarded()) {
        SCOPED_TRACE(f.operation);
        User().ClearRecords();
        ASSERT_EQ(f.call(*object, &rip, data.Get()), S_OK);
        ASSERT_EQ(User().CallCount(), 1u);
        const UserCall call = User().LastCall();
        EXPECT_EQ(call.operation, f.operation);
        EXPECT_EQ(call.args, f.args);
        if (call.data != nullptr) {
            EXPECT_EQ(call.data, data.Get()) << "the caller's own VARIANT";
        } else {
            EXPECT_EQ(call.params.pointer, &rip) << "the caller's own TavInParams";
        }
    }
    EXPECT_EQ(CommandCount(), 0u) << "nothing is sent by the object itself";
}

TEST_F(ForwardingTest, BeforeInitNothingIsCalled) {
    ControllerObject* fresh = MakeUninitialised();
    TestVariant data = TestVariant::Text("-User x");
    for (const Forwarded& f : AllForwarded()) {
        SCOPED_TRACE(f.operation);
        EXPECT_EQ(f.call(*fresh, nullptr, data.Get()), E_ABORT);
        EXPECT_TRUE(HasError("TavController used before Initialized", fresh));
    }
    EXPECT_EQ(User().CallCount(), 0u);
}

TEST_F(ForwardingTest, TheComponentsFailureAndTextAreAdopted) {
    ControllerObject* object = Make();
    TestVariant data = TestVariant::Text("-User x");
    constexpr HRESULT kHeld = static_cast<HRESULT>(0xC0041010);
    for (const Forwarded& f : AllForwarded()) {
        SCOPED_TRACE(f.operation);
        User().Fail(f.operation, kHeld, std::string("Held by another client: ") + f.operation);
        EXPECT_EQ(f.call(*object, nullptr, data.Get()), kHeld);
        EXPECT_TRUE(HasAdoptedError(std::string("Held by another client: ") + f.operation));
        User().Fail(f.operation, S_OK, "");
    }
}

// The two failures of one forwarded operation read apart.
TEST_F(ForwardingTest, NotInitialisedAndComponentFailureHaveLinesOfTheirOwn) {
    ControllerObject* fresh = MakeUninitialised();
    ControllerObject* object = Make();
    EXPECT_EQ(fresh->LogonUser(nullptr), E_ABORT);
    const int beforeInit = Error(fresh).line;
    User().Fail("LogonUser", E_ACCESSDENIED, "no");
    EXPECT_EQ(object->LogonUser(nullptr), E_ACCESSDENIED);
    EXPECT_NE(Error(object).line, beforeInit);
}

}  // namespace
}  // namespace tav::test
