#pragma once
#include <mutex>

#include "TavSiblings.h"
#include "sim/com_object.h"
#include "sim/last_error.h"
#include "sim/text.h"
#include "tav/com_ptr.h"

namespace tav::sim {

// The user component (class TavUser) of the virtual controller. Initialize
// binds the command component to the controller URL; the user and mastership
// operations send commands of their own through that command component (so
// the controller knows the client) and decode the replies.
class UserComponent final : public ITavUserComponent, public ITavUser3, public ITavMastership, public ITavComError {
public:
    static HRESULT Create(IUnknown* outer, REFIID riid, void** object);

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    TAV_SIM_REFERENCE_COUNT

    // ITavUserComponent
    HRESULT STDMETHODCALLTYPE Initialize(BSTR url, IUnknown* commandComponent) override;

    // ITavUser
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
    HRESULT STDMETHODCALLTYPE GetManualModePrivilegesState(TavInParams* rip, TavManualModePrivilegesState* state,
                                                           TavLoginInfo* user, LONG* thisIsMe) override;
    HRESULT STDMETHODCALLTYPE UnpackManualModePrivilegesState(VARIANT* data, ULONG clientId,
                                                              TavManualModePrivilegesState* state, TavLoginInfo* user,
                                                              LONG* thisIsMe) override;
    HRESULT STDMETHODCALLTYPE GetUserGrants(TavInParams* rip, BSTR* grants) override;

    // ITavUser2
    HRESULT STDMETHODCALLTYPE GetPendingManualModePrivRequest(TavInParams* rip, TavLoginInfo* user, ULONG* userId,
                                                              TavManualModePrivileges* priv) override;
    HRESULT STDMETHODCALLTYPE UnpackPendingManualModePrivRequest(VARIANT* data, TavLoginInfo* user, ULONG* userId,
                                                                 TavManualModePrivileges* priv) override;

    // ITavUser3
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
    UserComponent() = default;
    ~UserComponent() = default;

    HRESULT Fail(HRESULT hr, Text text);

    // Sends one command. Sync (or no pRip): the reply text in `reply` once the
    // controller accepted it; Async: S_OK once sent, the reply goes to the
    // caller's callback and `sent` stays false.
    HRESULT Send(TavInParams* rip, TextView operation, TextView verb, TextView command, TextView args,
                 Text* reply = nullptr, bool* answered = nullptr);
    // A decoder's result with its text: E_FAIL for a text that is not `what`.
    HRESULT Decoded(HRESULT hr, TextView operation, TextView what);
    // The client this component acts as: its own, or the one it impersonates.
    ULONG Me() const;

    ObjectLifetime lifetime_;
    mutable std::mutex mutex_;
    LastError lastError_;
    Text url_;
    ComPtr<IUnknown> commandComponent_;
    ComPtr<ITavComCtrl> commands_;
    ULONG clientId_ = 0;
    ULONG actingAs_ = 0;
};

}  // namespace tav::sim
