#include "support/fake_user_component.h"

#include <utility>

namespace tav::test {
namespace {

BSTR Allocate(const std::string& text) {
    const OleString wide = Widen(text);
    return SysAllocStringLen(wide.data(), static_cast<UINT>(wide.size()));
}

std::string Arg(const char* name, unsigned long long value) { return std::string(name) + "=" + std::to_string(value); }

}  // namespace

Ref<FakeUserComponent> FakeUserComponent::Make(Offers offers) {
    return Ref<FakeUserComponent>(new FakeUserComponent(offers));
}

FakeUserComponent::~FakeUserComponent() = default;

void FakeUserComponent::Fail(std::string_view operation, HRESULT hr, std::string_view errorText) {
    std::lock_guard<std::mutex> hold(lock_);
    failures_[std::string(operation)] = Failure{hr, std::string(errorText)};
}

void FakeUserComponent::SetAnswers(UserAnswers answers) {
    std::lock_guard<std::mutex> hold(lock_);
    answers_ = std::move(answers);
}

std::vector<UserCall> FakeUserComponent::Calls() const {
    std::lock_guard<std::mutex> hold(lock_);
    return calls_;
}

UserCall FakeUserComponent::LastCall() const {
    std::lock_guard<std::mutex> hold(lock_);
    return calls_.empty() ? UserCall() : calls_.back();
}

size_t FakeUserComponent::CallCount() const {
    std::lock_guard<std::mutex> hold(lock_);
    return calls_.size();
}

std::string FakeUserComponent::InitializedUrl() const {
    std::lock_guard<std::mutex> hold(lock_);
    return initializedUrl_;
}

IUnknown* FakeUserComponent::InitializedWith() const {
    std::lock_guard<std::mutex> hold(lock_);
    return initializedWith_;
}

int FakeUserComponent::Initializations() const {
    std::lock_guard<std::mutex> hold(lock_);
    return initializations_;
}

void FakeUserComponent::ClearRecords() {
    std::lock_guard<std::mutex> hold(lock_);
    calls_.clear();
}

HRESULT FakeUserComponent::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID_ITavUserComponent)) {
        *object = static_cast<ITavUserComponent*>(this);
    } else if ((IsEqualIID(riid, IID_ITavUser3) || IsEqualIID(riid, IID_ITavUser2) ||
                IsEqualIID(riid, IID_ITavUser)) &&
               offers_.user3) {
        *object = static_cast<ITavUser3*>(this);
    } else if (IsEqualIID(riid, IID_ITavMastership) && offers_.mastership) {
        *object = static_cast<ITavMastership*>(this);
    } else if (IsEqualIID(riid, IID_ITavComError) && offers_.errorInterface) {
        *object = static_cast<ITavComError*>(this);
    } else {
        return E_NOINTERFACE;
    }
    AddRef();
    return S_OK;
}

HRESULT FakeUserComponent::Record(const char* operation, TavInParams* rip, VARIANT* data, std::string args,
                                  UserAnswers* answers) {
    UserCall call{operation, PassedParams{rip, rip == nullptr ? std::nullopt : std::optional<TavInParams>(*rip)},
                  data, std::move(args)};
    std::lock_guard<std::mutex> hold(lock_);
    calls_.push_back(std::move(call));
    const auto found = failures_.find(std::string_view(operation));
    if (found != failures_.end() && FAILED(found->second.hr)) {
        errorText_ = found->second.text;
        return found->second.hr;
    }
    if (answers != nullptr) {
        *answers = answers_;
    }
    return S_OK;
}

void FakeUserComponent::Fill(TavLoginInfo* info, const UserAnswers& answers) {
    if (info != nullptr) {
        info->userAlias = Allocate(answers.userAlias);
        info->location = Allocate(answers.location);
        info->application = Allocate(answers.application);
    }
}

HRESULT FakeUserComponent::Initialize(BSTR url, IUnknown* commandComponent) {
    {
        std::lock_guard<std::mutex> hold(lock_);
        ++initializations_;
        initializedUrl_ = Narrow(url);
        initializedWith_ = commandComponent;
    }
    return Record("Initialize", nullptr, nullptr, "url=" + Narrow(url));
}

HRESULT FakeUserComponent::LogonUser(TavInParams* rip) { return Record("LogonUser", rip, nullptr, {}); }

HRESULT FakeUserComponent::LogonUserAsLocal(TavInParams* rip) { return Record("LogonUserAsLocal", rip, nullptr, {}); }

HRESULT FakeUserComponent::LogoffUser(TavInParams* rip) { return Record("LogoffUser", rip, nullptr, {}); }

HRESULT FakeUserComponent::RequestManualModePrivileges(TavInParams* rip, TavManualModePrivileges priv) {
    return Record("RequestManualModePrivileges", rip, nullptr, Arg("priv", priv));
}

HRESULT FakeUserComponent::PollActiveRequest(TavInParams* rip) { return Record("PollActiveRequest", rip, nullptr, {}); }

HRESULT FakeUserComponent::CancelManualModePrivileges(TavInParams* rip) {
    return Record("CancelManualModePrivileges", rip, nullptr, {});
}

HRESULT FakeUserComponent::UnpackManualModePrivRequestEvent(VARIANT* data, TavLoginInfo* user, ULONG* userId,
                                                            TavManualModePrivileges* priv) {
    UserAnswers answers;
    const HRESULT hr = Record("UnpackManualModePrivRequestEvent", nullptr, data, {}, &answers);
    if (SUCCEEDED(hr)) {
        Fill(user, answers);
        if (userId != nullptr) *userId = answers.userId;
        if (priv != nullptr) *priv = answers.priv;
    }
    return hr;
}

HRESULT FakeUserComponent::GrantManualModePrivileges(TavInParams* rip, ULONG userId, TavManualModePrivileges priv) {
    return Record("GrantManualModePrivileges", rip, nullptr, Arg("userID", userId) + " " + Arg("priv", priv));
}

HRESULT FakeUserComponent::GetManualModePrivilegesState(TavInParams* rip, TavManualModePrivilegesState* privState,
                                                        TavLoginInfo* user, LONG* thisIsMe) {
    UserAnswers answers;
    const HRESULT hr = Record("GetManualModePrivilegesState", rip, nullptr, {}, &answers);
    if (SUCCEEDED(hr)) {
        if (privState != nullptr) *privState = answers.privState;
        Fill(user, answers);
        if (thisIsMe != nullptr) *thisIsMe = answers.thisIsMe;
    }
    return hr;
}

HRESULT FakeUserComponent::UnpackManualModePrivilegesState(VARIANT* data, ULONG clientId,
                                                           TavManualModePrivilegesState* privState, TavLoginInfo* user,
                                                           LONG* thisIsMe) {
    UserAnswers answers;
    const HRESULT hr = Record("UnpackManualModePrivilegesState", nullptr, data, Arg("clientID", clientId), &answers);
    if (SUCCEEDED(hr)) {
        if (privState != nullptr) *privState = answers.privState;
        Fill(user, answers);
        if (thisIsMe != nullptr) *thisIsMe = answers.thisIsMe;
    }
    return hr;
}

HRESULT FakeUserComponent::GetUserGrants(TavInParams* rip, BSTR* grants) {
    UserAnswers answers;
    const HRESULT hr = Record("GetUserGrants", rip, nullptr, {}, &answers);
    if (SUCCEEDED(hr) && grants != nullptr) {
        *grants = Allocate(answers.grants);
    }
    return hr;
}

HRESULT FakeUserComponent::GetPendingManualModePrivRequest(TavInParams* rip, TavLoginInfo* user, ULONG* userId,
                                                           TavManualModePrivileges* priv) {
    UserAnswers answers;
    const HRESULT hr = Record("GetPendingManualModePrivRequest", rip, nullptr, {}, &answers);
    if (SUCCEEDED(hr)) {
        Fill(user, answers);
        if (userId != nullptr) *userId = answers.userId;
        if (priv != nullptr) *priv = answers.priv;
    }
    return hr;
}

HRESULT FakeUserComponent::UnpackPendingManualModePrivRequest(VARIANT* data, TavLoginInfo* user, ULONG* userId,
                                                              TavManualModePrivileges* priv) {
    UserAnswers answers;
    const HRESULT hr = Record("UnpackPendingManualModePrivRequest", nullptr, data, {}, &answers);
    if (SUCCEEDED(hr)) {
        Fill(user, answers);
        if (userId != nullptr) *userId = answers.userId;
        if (priv != nullptr) *priv = answers.priv;
    }
    return hr;
}

HRESULT FakeUserComponent::GetUserId(TavInParams* rip, ULONG* userId) {
    UserAnswers answers;
    const HRESULT hr = Record("GetUserId", rip, nullptr, {}, &answers);
    if (SUCCEEDED(hr) && userId != nullptr) {
        *userId = answers.userId;
    }
    return hr;
}

HRESULT FakeUserComponent::ImpersonateUser(TavInParams* rip, ULONG userId, ULONG* cid) {
    UserAnswers answers;
    const HRESULT hr = Record("ImpersonateUser", rip, nullptr, Arg("userID", userId), &answers);
    if (SUCCEEDED(hr) && cid != nullptr) {
        *cid = answers.cid;
    }
    return hr;
}

HRESULT FakeUserComponent::RemoveImpersonation(TavInParams* rip) {
    return Record("RemoveImpersonation", rip, nullptr, {});
}

HRESULT FakeUserComponent::RequestMastership(TavInParams* rip, TavMastershipResource resource) {
    return Record("RequestMastership", rip, nullptr, Arg("resource", resource));
}

HRESULT FakeUserComponent::ReleaseMastership(TavInParams* rip, TavMastershipResource resource) {
    return Record("ReleaseMastership", rip, nullptr, Arg("resource", resource));
}

HRESULT FakeUserComponent::GetCurrentMaster(TavInParams* rip, TavMastershipResource resource,
                                            TavMastershipStatus* status, TavLoginInfo* loginInfo, LONG* thisIsMe) {
    UserAnswers answers;
    const HRESULT hr = Record("GetCurrentMaster", rip, nullptr, Arg("resource", resource), &answers);
    if (SUCCEEDED(hr)) {
        if (status != nullptr) *status = answers.mastershipStatus;
        Fill(loginInfo, answers);
        if (thisIsMe != nullptr) *thisIsMe = answers.thisIsMe;
    }
    return hr;
}

HRESULT FakeUserComponent::UnpackCurrentMaster(VARIANT* data, ULONG cid, TavMastershipStatus* status,
                                               TavLoginInfo* loginInfo, LONG* thisIsMe) {
    UserAnswers answers;
    const HRESULT hr = Record("UnpackCurrentMaster", nullptr, data, Arg("cid", cid), &answers);
    if (SUCCEEDED(hr)) {
        if (status != nullptr) *status = answers.mastershipStatus;
        Fill(loginInfo, answers);
        if (thisIsMe != nullptr) *thisIsMe = answers.thisIsMe;
    }
    return hr;
}

HRESULT FakeUserComponent::GetLastErrorInfo(BSTR* errorText) {
    if (errorText == nullptr) {
        return E_POINTER;
    }
    std::lock_guard<std::mutex> hold(lock_);
    *errorText = errorText_.empty() ? nullptr : Allocate(errorText_);
    return S_OK;
}

}  // namespace tav::test
