#include "sim/user_component.h"

#include "sim/controller_binding.h"
#include "sim/controller_registry.h"
#include "sim/arguments.h"
#include "tav/bstr.h"
#include "tav/guarded.h"
#include "tav/variant.h"

namespace tav::sim {
namespace {

constexpr TextView kUserComponent = OLESTR("TavUser.");

}  // namespace

HRESULT UserComponent::Create(IUnknown* outer, REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    if (outer != nullptr) {
        return CLASS_E_NOAGGREGATION;
    }
    auto* component = new (std::nothrow) UserComponent();
    return component == nullptr ? E_OUTOFMEMORY : HandOut(component, riid, object);
}

HRESULT UserComponent::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (riid == IID_IUnknown || riid == IID_ITavUserComponent) {
        *object = static_cast<ITavUserComponent*>(this);
    } else if (riid == IID_ITavUser || riid == IID_ITavUser2 || riid == IID_ITavUser3) {
        *object = static_cast<ITavUser3*>(this);
    } else if (riid == IID_ITavMastership) {
        *object = static_cast<ITavMastership*>(this);
    } else if (riid == IID_ITavComError) {
        *object = static_cast<ITavComError*>(this);
    } else {
        *object = nullptr;
        return E_NOINTERFACE;
    }
    AddRef();
    return S_OK;
}

HRESULT UserComponent::Fail(HRESULT hr, Text text) { return lastError_.Record(hr, text); }

HRESULT UserComponent::Initialize(BSTR url, IUnknown* commandComponent) {
    return Guarded([&] {
        const Text urlText = FromBstr(url);
        if (!ControllerAt(urlText)) {
            return Fail(E_INVALIDARG, Text(kUserComponent) + OLESTR("Initialize: no controller at URL \"") + urlText +
                                          OLESTR("\""));
        }
        ComPtr<ITavComCtrl> commands;
        if (commandComponent == nullptr ||
            FAILED(commandComponent->QueryInterface(IID_ITavComCtrl, reinterpret_cast<void**>(&commands)))) {
            return Fail(E_NOINTERFACE, Text(kUserComponent) + OLESTR("Initialize: no command component"));
        }
        // Another command component (a test's) simply is not told.
        ComPtr<IControllerBinding> binding;
        ULONG clientId = 0;
        if (SUCCEEDED(commandComponent->QueryInterface(IID_IControllerBinding, reinterpret_cast<void**>(&binding)))) {
            const HRESULT hr = binding->BindController(url);
            if (FAILED(hr)) {
                return Fail(hr, Text(kUserComponent) + OLESTR("Initialize: the command component refused the URL"));
            }
            binding->GetClientId(&clientId);
        }
        std::lock_guard lock(mutex_);
        url_ = urlText;
        commandComponent_ = ComPtr<IUnknown>(commandComponent);
        commands_ = std::move(commands);
        clientId_ = clientId;
        actingAs_ = clientId;
        return S_OK;
    });
}

HRESULT UserComponent::Send(TavInParams* rip, TextView operation, TextView verb, TextView command, TextView args,
                            Text* reply, bool* answered) {
    if (answered != nullptr) {
        *answered = false;
    }
    ComPtr<ITavComCtrl> commands;
    Text url;
    {
        std::lock_guard lock(mutex_);
        commands = commands_;
        url = url_;
    }
    if (!commands) {
        return Fail(E_UNEXPECTED, Concat({kUserComponent, operation, OLESTR(": not initialized")}));
    }
    const Bstr verbText{OleStringView(verb)};
    const Bstr urlText{OleStringView(url)};
    const Bstr commandText{OleStringView(command)};
    const Bstr argsText{OleStringView(args)};
    TavCommandReply record{};
    VariantInit(&record.data);
    const HRESULT hr = commands->Execute(rip, &record, verbText.Get(), urlText.Get(), commandText.Get(), argsText.Get());
    Variant data;
    data.Attach(record.data);
    if (FAILED(hr)) {
        Bstr text;
        ComPtr<ITavComError> errors;
        if (SUCCEEDED(commands.As(errors))) {
            errors->GetLastErrorInfo(text.Receive());
        }
        return Fail(hr, Concat({kUserComponent, operation, OLESTR(": "), FromBstr(text.Get())}));
    }
    if (rip != nullptr && rip->callType != Sync) {
        return S_OK;
    }
    const Text replyText = data.Get()->vt == VT_BSTR ? FromBstr(data.Get()->bstrVal) : Text();
    if (FAILED(record.status)) {
        return Fail(record.status, Concat({kUserComponent, operation, OLESTR(": "), replyText}));
    }
    if (reply != nullptr) {
        *reply = replyText;
    }
    if (answered != nullptr) {
        *answered = true;
    }
    return S_OK;
}

ULONG UserComponent::Me() const {
    std::lock_guard lock(mutex_);
    return actingAs_;
}

namespace {

// The texts of a login in a reply, handed out as BSTRs; nothing is handed
// out unless all three are.
HRESULT FillLogin(const Arguments& arguments, TavLoginInfo* login) {
    if (login == nullptr) {
        return S_OK;
    }
    Bstr alias{OleStringView(arguments.Find(OLESTR("-Alias")).value_or(TextView()))};
    Bstr location{OleStringView(arguments.Find(OLESTR("-Location")).value_or(TextView()))};
    Bstr application{OleStringView(arguments.Find(OLESTR("-Application")).value_or(TextView()))};
    if (alias.Get() == nullptr || location.Get() == nullptr || application.Get() == nullptr) {
        return E_OUTOFMEMORY;
    }
    login->userAlias = alias.Detach();
    login->location = location.Detach();
    login->application = application.Detach();
    return S_OK;
}

void ClearLogin(TavLoginInfo* login) {
    if (login != nullptr) {
        *login = TavLoginInfo{};
    }
}

// Reads "-Key value" replies; the text of a VARIANT that must hold a BSTR.
std::optional<Arguments> RepliedPairs(const VARIANT* data) {
    if (data == nullptr || data->vt != VT_BSTR) {
        return std::nullopt;
    }
    return Arguments::Parse(FromBstr(data->bstrVal));
}

// The two numbers and the login of a reply or event text, as the three
// decoders read them: out-values cleared first, handed out only when all of
// it is read.
struct LoginText {
    std::int32_t number = 0;  // the privilege, state or status
    std::uint32_t id = 0;     // the user id or the client
};

HRESULT ReadLoginText(VARIANT* data, TextView numberKey, TextView idKey, LoginText& read, TavLoginInfo* login) {
    ClearLogin(login);
    const auto pairs = RepliedPairs(data);
    const auto number = pairs ? pairs->Signed(numberKey) : std::nullopt;
    const auto id = pairs ? pairs->Unsigned(idKey) : std::nullopt;
    if (!number || !id) {
        return E_FAIL;
    }
    if (FAILED(FillLogin(*pairs, login))) {
        return E_OUTOFMEMORY;
    }
    read = LoginText{number.value_or(0), id.value_or(0)};
    return S_OK;
}

// A Sync reply handed to the component's own decoder, as a client hands an
// event's data.
template <typename Unpack>
HRESULT DecodeReply(const Text& reply, Unpack&& unpack) {
    const Bstr text{OleStringView(reply)};
    VARIANT data;
    data.vt = VT_BSTR;
    data.bstrVal = text.Get();
    return unpack(&data);
}

}  // namespace

HRESULT UserComponent::Decoded(HRESULT hr, TextView operation, TextView what) {
    if (hr == E_FAIL) {
        return Fail(E_FAIL, Concat({kUserComponent, operation, OLESTR(": not "), what}));
    }
    return FAILED(hr) ? Fail(hr, Concat({kUserComponent, operation, OLESTR(": out of memory")})) : S_OK;
}

HRESULT UserComponent::LogonUser(TavInParams* rip) {
    return Guarded([&] { return Send(rip, OLESTR("LogonUser"), OLESTR("Set"), OLESTR("UserLogon"), OLESTR("-Local 0")); });
}

HRESULT UserComponent::LogonUserAsLocal(TavInParams* rip) {
    return Guarded(
        [&] { return Send(rip, OLESTR("LogonUserAsLocal"), OLESTR("Set"), OLESTR("UserLogon"), OLESTR("-Local 1")); });
}

HRESULT UserComponent::LogoffUser(TavInParams* rip) {
    return Guarded([&] {
        const HRESULT hr = Send(rip, OLESTR("LogoffUser"), OLESTR("Set"), OLESTR("UserLogoff"), {});
        if (SUCCEEDED(hr)) {
            std::lock_guard lock(mutex_);
            actingAs_ = clientId_;
        }
        return hr;
    });
}

HRESULT UserComponent::RequestManualModePrivileges(TavInParams* rip, TavManualModePrivileges priv) {
    return Guarded([&] {
        return Send(rip, OLESTR("RequestManualModePrivileges"), OLESTR("Set"), OLESTR("RMMPRequest"),
                    OLESTR("-Priv ") + Decimal(static_cast<int>(priv)));
    });
}

HRESULT UserComponent::PollActiveRequest(TavInParams* rip) {
    return Guarded([&] { return Send(rip, OLESTR("PollActiveRequest"), OLESTR("Set"), OLESTR("RMMPPoll"), {}); });
}

HRESULT UserComponent::CancelManualModePrivileges(TavInParams* rip) {
    return Guarded(
        [&] { return Send(rip, OLESTR("CancelManualModePrivileges"), OLESTR("Set"), OLESTR("RMMPCancel"), {}); });
}

HRESULT UserComponent::UnpackManualModePrivRequestEvent(VARIANT* data, TavLoginInfo* user, ULONG* userId,
                                                        TavManualModePrivileges* priv) {
    return Guarded([&] {
        const TextView operation = OLESTR("UnpackManualModePrivRequestEvent");
        if (userId == nullptr || priv == nullptr || user == nullptr) {
            return Fail(E_POINTER, Concat({kUserComponent, operation, OLESTR(": invalid out-pointer")}));
        }
        *userId = 0;
        *priv = TavManualModePrivileges_None;
        LoginText read;
        const HRESULT hr = ReadLoginText(data, OLESTR("-Priv"), OLESTR("-UserId"), read, user);
        if (SUCCEEDED(hr)) {
            *userId = read.id;
            *priv = static_cast<TavManualModePrivileges>(read.number);
        }
        return Decoded(hr, operation, OLESTR("a privilege request"));
    });
}

HRESULT UserComponent::GrantManualModePrivileges(TavInParams* rip, ULONG userId, TavManualModePrivileges priv) {
    return Guarded([&] {
        return Send(rip, OLESTR("GrantManualModePrivileges"), OLESTR("Set"), OLESTR("RMMPGrant"),
                    Concat({OLESTR("-UserId "), Decimal(userId), OLESTR(" -Priv "), Decimal(static_cast<int>(priv))}));
    });
}

HRESULT UserComponent::GetManualModePrivilegesState(TavInParams* rip, TavManualModePrivilegesState* state,
                                                    TavLoginInfo* user, LONG* thisIsMe) {
    return Guarded([&] {
        Text reply;
        bool answered = false;
        const HRESULT hr =
            Send(rip, OLESTR("GetManualModePrivilegesState"), OLESTR("Get"), OLESTR("RMMPState"), {}, &reply, &answered);
        if (FAILED(hr) || !answered) {
            return hr;
        }
        return DecodeReply(reply, [&](VARIANT* data) {
            return UnpackManualModePrivilegesState(data, Me(), state, user, thisIsMe);
        });
    });
}

HRESULT UserComponent::UnpackManualModePrivilegesState(VARIANT* data, ULONG clientId,
                                                       TavManualModePrivilegesState* state, TavLoginInfo* user,
                                                       LONG* thisIsMe) {
    return Guarded([&] {
        const TextView operation = OLESTR("UnpackManualModePrivilegesState");
        if (state == nullptr || user == nullptr || thisIsMe == nullptr) {
            return Fail(E_POINTER, Concat({kUserComponent, operation, OLESTR(": invalid out-pointer")}));
        }
        *state = TavManualModePrivilegesState_None;
        *thisIsMe = 0;
        LoginText read;
        const HRESULT hr = ReadLoginText(data, OLESTR("-State"), OLESTR("-Cid"), read, user);
        if (SUCCEEDED(hr)) {
            *state = static_cast<TavManualModePrivilegesState>(read.number);
            *thisIsMe = read.id != 0 && read.id == clientId ? 1 : 0;
        }
        return Decoded(hr, operation, OLESTR("a privilege state"));
    });
}

HRESULT UserComponent::GetUserGrants(TavInParams* rip, BSTR* grants) {
    return Guarded([&] {
        if (grants == nullptr) {
            return Fail(E_POINTER, Text(kUserComponent) + OLESTR("GetUserGrants: invalid out-pointer"));
        }
        *grants = nullptr;
        Text reply;
        bool answered = false;
        const HRESULT hr = Send(rip, OLESTR("GetUserGrants"), OLESTR("Get"), OLESTR("UserGrants"), {}, &reply, &answered);
        if (FAILED(hr) || !answered) {
            return hr;
        }
        Bstr text{OleStringView(reply)};
        if (text.Get() == nullptr) {
            return Fail(E_OUTOFMEMORY, Text(kUserComponent) + OLESTR("GetUserGrants: out of memory"));
        }
        *grants = text.Detach();
        return S_OK;
    });
}

HRESULT UserComponent::GetPendingManualModePrivRequest(TavInParams* rip, TavLoginInfo* user, ULONG* userId,
                                                       TavManualModePrivileges* priv) {
    return Guarded([&] {
        Text reply;
        bool answered = false;
        const HRESULT hr = Send(rip, OLESTR("GetPendingManualModePrivRequest"), OLESTR("Get"), OLESTR("RMMPPending"),
                                {}, &reply, &answered);
        if (FAILED(hr) || !answered) {
            return hr;
        }
        return DecodeReply(reply, [&](VARIANT* data) {
            return UnpackPendingManualModePrivRequest(data, user, userId, priv);
        });
    });
}

HRESULT UserComponent::UnpackPendingManualModePrivRequest(VARIANT* data, TavLoginInfo* user, ULONG* userId,
                                                          TavManualModePrivileges* priv) {
    return UnpackManualModePrivRequestEvent(data, user, userId, priv);
}

HRESULT UserComponent::GetUserId(TavInParams* rip, ULONG* userId) {
    return Guarded([&] {
        if (userId == nullptr) {
            return Fail(E_POINTER, Text(kUserComponent) + OLESTR("GetUserId: invalid out-pointer"));
        }
        *userId = 0;
        Text reply;
        bool answered = false;
        const HRESULT hr = Send(rip, OLESTR("GetUserId"), OLESTR("Get"), OLESTR("UserId"), {}, &reply, &answered);
        if (FAILED(hr) || !answered) {
            return hr;
        }
        const auto pairs = Arguments::Parse(reply);
        const auto id = pairs ? pairs->Unsigned(OLESTR("-UserId")) : std::nullopt;
        if (!id) {
            return Fail(E_FAIL, Text(kUserComponent) + OLESTR("GetUserId: bad reply ") + Quoted(reply));
        }
        *userId = *id;
        return S_OK;
    });
}

HRESULT UserComponent::ImpersonateUser(TavInParams* rip, ULONG userId, ULONG* cid) {
    return Guarded([&] {
        if (cid == nullptr) {
            return Fail(E_POINTER, Text(kUserComponent) + OLESTR("ImpersonateUser: invalid out-pointer"));
        }
        *cid = 0;
        Text reply;
        bool answered = false;
        const HRESULT hr = Send(rip, OLESTR("ImpersonateUser"), OLESTR("Set"), OLESTR("Impersonate"),
                                OLESTR("-UserId ") + Decimal(userId), &reply, &answered);
        if (FAILED(hr) || !answered) {
            return hr;
        }
        const auto pairs = Arguments::Parse(reply);
        const auto other = pairs ? pairs->Unsigned(OLESTR("-Cid")) : std::nullopt;
        if (!other) {
            return Fail(E_FAIL, Text(kUserComponent) + OLESTR("ImpersonateUser: bad reply ") + Quoted(reply));
        }
        *cid = *other;
        std::lock_guard lock(mutex_);
        actingAs_ = *other;
        return S_OK;
    });
}

HRESULT UserComponent::RemoveImpersonation(TavInParams* rip) {
    return Guarded([&] {
        const HRESULT hr = Send(rip, OLESTR("RemoveImpersonation"), OLESTR("Set"), OLESTR("RemoveImpersonation"), {});
        if (SUCCEEDED(hr)) {
            std::lock_guard lock(mutex_);
            actingAs_ = clientId_;
        }
        return hr;
    });
}

HRESULT UserComponent::RequestMastership(TavInParams* rip, TavMastershipResource resource) {
    return Guarded([&] {
        return Send(rip, OLESTR("RequestMastership"), OLESTR("Set"), OLESTR("MastershipRequest"),
                    OLESTR("-Resource ") + Decimal(static_cast<int>(resource)));
    });
}

HRESULT UserComponent::ReleaseMastership(TavInParams* rip, TavMastershipResource resource) {
    return Guarded([&] {
        return Send(rip, OLESTR("ReleaseMastership"), OLESTR("Set"), OLESTR("MastershipRelease"),
                    OLESTR("-Resource ") + Decimal(static_cast<int>(resource)));
    });
}

HRESULT UserComponent::GetCurrentMaster(TavInParams* rip, TavMastershipResource resource, TavMastershipStatus* status,
                                        TavLoginInfo* loginInfo, LONG* thisIsMe) {
    return Guarded([&] {
        Text reply;
        bool answered = false;
        const HRESULT hr = Send(rip, OLESTR("GetCurrentMaster"), OLESTR("Get"), OLESTR("CurrentMaster"),
                                OLESTR("-Resource ") + Decimal(static_cast<int>(resource)), &reply, &answered);
        if (FAILED(hr) || !answered) {
            return hr;
        }
        return DecodeReply(reply, [&](VARIANT* data) {
            return UnpackCurrentMaster(data, Me(), status, loginInfo, thisIsMe);
        });
    });
}

HRESULT UserComponent::UnpackCurrentMaster(VARIANT* data, ULONG cid, TavMastershipStatus* status,
                                           TavLoginInfo* loginInfo, LONG* thisIsMe) {
    return Guarded([&] {
        const TextView operation = OLESTR("UnpackCurrentMaster");
        if (status == nullptr || loginInfo == nullptr || thisIsMe == nullptr) {
            return Fail(E_POINTER, Concat({kUserComponent, operation, OLESTR(": invalid out-pointer")}));
        }
        *status = TavMastershipStatus_None;
        *thisIsMe = 0;
        LoginText read;
        const HRESULT hr = ReadLoginText(data, OLESTR("-Status"), OLESTR("-Cid"), read, loginInfo);
        if (SUCCEEDED(hr)) {
            *status = static_cast<TavMastershipStatus>(read.number);
            *thisIsMe = read.id != 0 && read.id == cid ? 1 : 0;
        }
        return Decoded(hr, operation, OLESTR("a master text"));
    });
}

HRESULT UserComponent::GetLastErrorInfo(BSTR* errorText) { return lastError_.CopyTo(errorText); }

}  // namespace tav::sim
