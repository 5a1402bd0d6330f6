// Users, manual-mode privileges and mastership between two controller
// objects, through the module's forwarding to the user component.
#include "virtual_controller_fixture.h"

namespace tav::e2e {
namespace {

class UsersEndToEndTest : public VirtualControllerTest {
protected:
    void SetUp() override {
        VirtualControllerTest::SetUp();
        ASSERT_EQ(Make(17, other_), S_OK);
        ASSERT_EQ(controller_.As(firstUser_), S_OK);
        ASSERT_EQ(other_.As(secondUser_), S_OK);
        ASSERT_EQ(controller_.As(firstMaster_), S_OK);
        ASSERT_EQ(other_.As(secondMaster_), S_OK);
    }

    struct Master {
        TavMastershipStatus status = TavMastershipStatus_None;
        std::string alias;
        LONG thisIsMe = -1;
    };

    static Master CurrentMaster(ITavMastership* mastership, TavMastershipResource resource) {
        TavLoginInfo login{};
        Master master;
        EXPECT_EQ(mastership->GetCurrentMaster(nullptr, resource, &master.status, &login, &master.thisIsMe), S_OK);
        master.alias = text::Narrow(OleStringView(login.userAlias, SysStringLen(login.userAlias)));
        Free(login);
        return master;
    }
    static void Free(TavLoginInfo& login) {
        SysFreeString(login.userAlias);
        SysFreeString(login.location);
        SysFreeString(login.application);
        login = {};
    }

    ComPtr<ITavController> other_;
    ComPtr<ITavUser3> firstUser_, secondUser_;
    ComPtr<ITavMastership> firstMaster_, secondMaster_;
};

TEST_F(UsersEndToEndTest, OnlyOneClientHoldsAResourceAtATime) {
    EXPECT_EQ(firstMaster_->RequestMastership(nullptr, ResourceMotion), static_cast<HRESULT>(0xC0049003))
        << "mastership needs a user";
    ASSERT_EQ(firstUser_->LogonUser(nullptr), S_OK) << LastError();
    ASSERT_EQ(secondUser_->LogonUserAsLocal(nullptr), S_OK);

    ASSERT_EQ(firstMaster_->RequestMastership(nullptr, ResourceMotion), S_OK) << LastError();
    EXPECT_EQ(secondMaster_->RequestMastership(nullptr, ResourceMotion), static_cast<HRESULT>(0xC0049003));
    EXPECT_NE(LastErrorOf(other_).find("MOTION is held by Default User"), std::string::npos) << LastErrorOf(other_);

    const Master seenByFirst = CurrentMaster(firstMaster_.Get(), ResourceMotion);
    const Master seenBySecond = CurrentMaster(secondMaster_.Get(), ResourceMotion);
    EXPECT_EQ(seenByFirst.status, TavMastershipStatus_HeldRemote);
    EXPECT_EQ(seenByFirst.thisIsMe, 1);
    EXPECT_EQ(seenBySecond.thisIsMe, 0);
    EXPECT_EQ(seenByFirst.alias, "Default User");

    EXPECT_EQ(secondMaster_->ReleaseMastership(nullptr, ResourceMotion), static_cast<HRESULT>(0xC0049003));
    ASSERT_EQ(firstMaster_->ReleaseMastership(nullptr, ResourceMotion), S_OK);
    ASSERT_EQ(secondMaster_->RequestMastership(nullptr, ResourceMotion), S_OK);
    EXPECT_EQ(CurrentMaster(firstMaster_.Get(), ResourceMotion).status, TavMastershipStatus_HeldLocal);

    // Logging off lets go of what the user held.
    ASSERT_EQ(secondUser_->LogoffUser(nullptr), S_OK);
    EXPECT_EQ(CurrentMaster(firstMaster_.Get(), ResourceMotion).status, TavMastershipStatus_None);
}

TEST_F(UsersEndToEndTest, APrivilegeRequestIsGrantedByAnotherClient) {
    ASSERT_EQ(firstUser_->LogonUser(nullptr), S_OK);
    ASSERT_EQ(secondUser_->LogonUser(nullptr), S_OK);
    ULONG requester = 0;
    ASSERT_EQ(firstUser_->GetUserId(nullptr, &requester), S_OK);

    ASSERT_EQ(firstUser_->RequestManualModePrivileges(nullptr, TavManualModePrivileges_Exec), S_OK) << LastError();
    TavLoginInfo login{};
    ULONG pendingUser = 0;
    TavManualModePrivileges asked = TavManualModePrivileges_None;
    ASSERT_EQ(secondUser_->GetPendingManualModePrivRequest(nullptr, &login, &pendingUser, &asked), S_OK);
    EXPECT_EQ(pendingUser, requester);
    EXPECT_EQ(asked, TavManualModePrivileges_Exec);
    Free(login);

    EXPECT_TRUE(FAILED(firstUser_->GrantManualModePrivileges(nullptr, requester, TavManualModePrivileges_Exec)))
        << "nobody grants their own request";
    ASSERT_EQ(secondUser_->GrantManualModePrivileges(nullptr, requester, TavManualModePrivileges_Exec), S_OK)
        << LastErrorOf(other_);

    TavManualModePrivilegesState state = TavManualModePrivilegesState_None;
    LONG thisIsMe = -1;
    ASSERT_EQ(firstUser_->GetManualModePrivilegesState(nullptr, &state, &login, &thisIsMe), S_OK);
    EXPECT_EQ(state, TavManualModePrivilegesState_Exec);
    EXPECT_EQ(thisIsMe, 1);
    Free(login);

    ASSERT_EQ(firstUser_->CancelManualModePrivileges(nullptr), S_OK);
    EXPECT_TRUE(FAILED(firstUser_->PollActiveRequest(nullptr)));
}

TEST_F(UsersEndToEndTest, ImpersonationActsAsTheOtherUser) {
    ASSERT_EQ(firstUser_->LogonUser(nullptr), S_OK);
    ASSERT_EQ(secondUser_->LogonUser(nullptr), S_OK);
    ULONG secondId = 0;
    ASSERT_EQ(secondUser_->GetUserId(nullptr, &secondId), S_OK);
    ASSERT_EQ(secondMaster_->RequestMastership(nullptr, ResourceCFG), S_OK);

    ULONG cid = 0;
    ASSERT_EQ(firstUser_->ImpersonateUser(nullptr, secondId, &cid), S_OK) << LastError();
    EXPECT_NE(cid, 0u);
    EXPECT_EQ(CurrentMaster(firstMaster_.Get(), ResourceCFG).thisIsMe, 1);
    ASSERT_EQ(firstMaster_->ReleaseMastership(nullptr, ResourceCFG), S_OK);
    ASSERT_EQ(firstUser_->RemoveImpersonation(nullptr), S_OK);
    EXPECT_EQ(CurrentMaster(firstMaster_.Get(), ResourceCFG).status, TavMastershipStatus_None);
    EXPECT_TRUE(FAILED(firstUser_->ImpersonateUser(nullptr, 99999, &cid)));
}

}  // namespace
}  // namespace tav::e2e
