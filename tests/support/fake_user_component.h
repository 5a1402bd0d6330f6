#pragma once
#include <map>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include "TavSiblings.h"
#include "support/com_double.h"
#include "support/fake_command_component.h"

namespace tav::test {

// One call into the user component: the operation's name, the TavInParams
// (for the operations that take one), the VARIANT pointer (for the Unpack
// operations) and the other in-arguments as text, such as "priv=1" or
// "userID=7 priv=2".
struct UserCall {
    std::string operation;
    PassedParams params;
    VARIANT* data = nullptr;
    std::string args;
};

// What the user component writes to the out-parameters of a successful call.
struct UserAnswers {
    TavManualModePrivilegesState privState = TavManualModePrivilegesState_Modify;
    TavManualModePrivileges priv = TavManualModePrivileges_Exec;
    std::string userAlias = "alias";
    std::string location = "location";
    std::string application = "application";
    LONG thisIsMe = 1;
    ULONG userId = 42;
    ULONG cid = 7;
    std::string grants = "grants";
    TavMastershipStatus mastershipStatus = TavMastershipStatus_HeldLocal;
};

// The user component TavUser as the controller object sees it: Initialize,
// the forwarded ITavUser3 and ITavMastership operations, and its error text.
// Every call is recorded; any operation can be made to fail.
class FakeUserComponent final : public ITavUserComponent,
                                public ITavUser3,
                                public ITavMastership,
                                public ITavComError {
public:
    struct Offers {
        bool user3 = true;
        bool mastership = true;
        bool errorInterface = true;
    };
    static Ref<FakeUserComponent> Make(Offers offers);
    static Ref<FakeUserComponent> Make() { return Make(Offers{}); }

    // The named operation (such as "Initialize" or "LogonUser") fails with
    // hr from now on (S_OK: succeeds again); errorText becomes the
    // component's error text (empty: a NULL BSTR).
    void Fail(std::string_view operation, HRESULT hr, std::string_view errorText);
    void FailInitialize(HRESULT hr, std::string_view errorText) { Fail("Initialize", hr, errorText); }
    void SetAnswers(UserAnswers answers);

    std::vector<UserCall> Calls() const;
    UserCall LastCall() const;  // an empty record when nothing was called
    size_t CallCount() const;
    // What Initialize was given.
    std::string InitializedUrl() const;
    IUnknown* InitializedWith() const;
    int Initializations() const;
    void ClearRecords();

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    TAV_TEST_DOUBLE_REFCOUNT
    // ITavUserComponent
    HRESULT STDMETHODCALLTYPE Initialize(BSTR url, IUnknown* commandComponent) override;
    // ITavUser, ITavUser2, ITavUser3
    HRESULT STDMETHODCALLTYPE LogonUser(TavInParams* rip) override;
    HRESULT STDMETHODCALLTYPE LogonUserAsLocal(TavInParams* rip) override;
    HRESULT STDMETHODCALLTYPE LogoffUser(TavInParams* rip) override;
    HRESULT STDMETHODCALLTYPE RequestManualModePrivileges(TavInParams* rip, TavManualModePrivileges priv) override;
    HRESULT STDMETHODCALLTYPE PollActiveRequest(TavInParams* rip) override;
    HRESULT STDMETHODCALLTYPE CancelManualModePrivileges(TavInParams* rip) override;
    HRESULT STDMETHODCALLTYPE UnpackManualModePrivRequestEvent(VARIANT* data, TavLoginInfo* user, ULONG* userId,
                                                               TavManualModePrivileges* priv) override;
    HRESULT STDMETHODCALLTYPE GrantManualModePrivileges(TavInParams* rip, ULONG userId,
                                                        TavManualModePrivileges priv) override;
    HRESULT STDMETHODCALLTYPE GetManualModePrivilegesState(TavInParams* rip, TavManualModePrivilegesState* privState,
                                                           TavLoginInfo* user, LONG* thisIsMe) override;
    HRESULT STDMETHODCALLTYPE UnpackManualModePrivilegesState(VARIANT* data, ULONG clientId,
                                                              TavManualModePrivilegesState* privState,
                                                              TavLoginInfo* user, LONG* thisIsMe) override;
    HRESULT STDMETHODCALLTYPE GetUserGrants(TavInParams* rip, BSTR* grants) override;
    HRESULT STDMETHODCALLTYPE GetPendingManualModePrivRequest(TavInParams* rip, TavLoginInfo* user, ULONG* userId,
                                                              TavManualModePrivileges* priv) override;
    HRESULT STDMETHODCALLTYPE UnpackPendingManualModePrivRequest(VARIANT* data, TavLoginInfo* user, ULONG* userId,
                                                                 TavManualModePrivileges* priv) override;
    HRESULT STDMETHODCALLTYPE GetUserId(TavInParams* rip, ULONG* userId) override;
    HRESULT STDMETHODCALLTYPE ImpersonateUser(TavInParams* rip, ULONG userId, ULONG* cid) override;
    HRESULT STDMETHODCALLTYPE RemoveImpersonation(TavInParams* rip) override;
    // ITavMastership
    HRESULT STDMETHODCALLTYPE RequestMastership(TavInParams* rip, TavMastershipResource resource) override;
    HRESULT STDMETHODCALLTYPE ReleaseMastership(TavInParams* rip, TavMastershipResource resource) override;
    HRESULT STDMETHODCALLTYPE GetCurrentMaster(TavInParams* rip, TavMastershipResource resource,
                                               TavMastershipStatus* status, TavLoginInfo* loginInfo,
                                               LONG* thisIsMe) override;
    HRESULT STDMETHODCALLTYPE UnpackCurrentMaster(VARIANT* data, ULONG cid, TavMastershipStatus* status,
                                                  TavLoginInfo* loginInfo, LONG* thisIsMe) override;
    // ITavComError
    HRESULT STDMETHODCALLTYPE GetLastErrorInfo(BSTR* errorText) override;

private:
    struct Failure {
        HRESULT hr = S_OK;
        std::string text;
    };

    explicit FakeUserComponent(Offers offers) : offers_(offers) {}
    ~FakeUserComponent();

    // Records the call; returns the chosen failure or S_OK, and on success
    // the answers to write.
    HRESULT Record(const char* operation, TavInParams* rip, VARIANT* data, std::string args,
                   UserAnswers* answers = nullptr);
    static void Fill(TavLoginInfo* info, const UserAnswers& answers);

    RefCount refs_;
    const Offers offers_;
    mutable std::mutex lock_;
    std::map<std::string, Failure, std::less<>> failures_;
    UserAnswers answers_;
    std::string errorText_;
    std::vector<UserCall> calls_;
    std::string initializedUrl_;
    IUnknown* initializedWith_ = nullptr;
    int initializations_ = 0;
};

}  // namespace tav::test
