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

// The out-values of the user operations, their strings freed when they go.
struct Outs {
    TavLoginInfo user{};
    ULONG id = 0;
    LONG me = 0;
    TavManualModePrivileges priv{};
    TavManualModePrivilegesState state{};
    TavMastershipStatus status{};
    TestBstr grants;
    ~Outs() { SysFreeString(user.userAlias), SysFreeString(user.location), SysFreeString(user.application); }
};

#define USER_CALL(expression) [](ControllerObject& o, TavInParams* r, VARIANT* d) { Outs x; return expression; }

std::vector<Forwarded> AllForwarded() {
    return {
        {"LogonUser", "", USER_CALL(o.LogonUser(r))},
        {"LogonUserAsLocal", "", USER_CALL(o.LogonUserAsLocal(r))},
        {"LogoffUser", "", USER_CALL(o.LogoffUser(r))},
        {"RequestManualModePrivileges", "priv=2",
         USER_CALL(o.RequestManualModePrivileges(r, TavManualModePrivileges_Exec))},
        {"PollActiveRequest", "", USER_CALL(o.PollActiveRequest(r))},
        {"CancelManualModePrivileges", "", USER_CALL(o.CancelManualModePrivileges(r))},
        {"UnpackManualModePrivRequestEvent", "",
         USER_CALL(o.UnpackManualModePrivRequestEvent(d, &x.user, &x.id, &x.priv))},
        {"GrantManualModePrivileges", "userID=7 priv=1",
         USER_CALL(o.GrantManualModePrivileges(r, 7, TavManualModePrivileges_Modify))},
        {"GetManualModePrivilegesState", "",
         USER_CALL(o.GetManualModePrivilegesState(r, &x.state, &x.user, &x.me))},
        {"UnpackManualModePrivilegesState", "clientID=9",
         USER_CALL(o.UnpackManualModePrivilegesState(d, 9, &x.state, &x.user, &x.me))},
        {"GetUserGrants", "", USER_CALL(o.GetUserGrants(r, x.grants.Out()))},
        {"GetPendingManualModePrivRequest", "",
         USER_CALL(o.GetPendingManualModePrivRequest(r, &x.user, &x.id, &x.priv))},
        {"UnpackPendingManualModePrivRequest", "",
         USER_CALL(o.UnpackPendingManualModePrivRequest(d, &x.user, &x.id, &x.priv))},
        {"GetUserId", "", USER_CALL(o.GetUserId(r, &x.id))},
        {"ImpersonateUser", "userID=12", USER_CALL(o.ImpersonateUser(r, 12, &x.id))},
        {"RemoveImpersonation", "", USER_CALL(o.RemoveImpersonation(r))},
        {"RequestMastership", "resource=2", USER_CALL(o.RequestMastership(r, ResourceMotion))},
        {"ReleaseMastership", "resource=1", USER_CALL(o.ReleaseMastership(r, ResourceCFG))},
        {"GetCurrentMaster", "resource=3",
         USER_CALL(o.GetCurrentMaster(r, ResourceInfoStream, &x.status, &x.user, &x.me))},
        {"UnpackCurrentMaster", "cid=5", USER_CALL(o.UnpackCurrentMaster(d, 5, &x.status, &x.user, &x.me))},
    };
}

#undef USER_CALL

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
