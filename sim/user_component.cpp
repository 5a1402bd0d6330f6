#include "sim/user_component.h"

#include "sim/controller_binding.h"
#include "sim/controller_registry.h"
#include "tav/guarded.h"

namespace tav::sim {
namespace {

constexpr TextView kComponent = OLESTR("TavUser.");

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

HRESULT UserComponent::NotProvided(TextView operation) {
    return Guarded([&] {
        return Fail(E_NOTIMPL, Text(kComponent) + Text(operation) + OLESTR(": not provided by the virtual controller"));
    });
}

HRESULT UserComponent::Initialize(BSTR url, IUnknown* commandComponent) {
    return Guarded([&] {
        const Text urlText = FromBstr(url);
        if (!ControllerAt(urlText)) {
            return Fail(E_INVALIDARG, Text(kComponent) + OLESTR("Initialize: no controller at URL \"") + urlText +
                                          OLESTR("\""));
        }
        // Another command component (a test's) simply is not told.
        ComPtr<IControllerBinding> binding;
        if (commandComponent != nullptr &&
            SUCCEEDED(commandComponent->QueryInterface(IID_IControllerBinding, reinterpret_cast<void**>(&binding)))) {
            const HRESULT hr = binding->BindController(url);
            if (FAILED(hr)) {
                return Fail(hr, Text(kComponent) + OLESTR("Initialize: the command component refused the URL"));
            }
        }
        std::lock_guard lock(mutex_);
        url_ = urlText;
        commandComponent_ = ComPtr<IUnknown>(commandComponent);
        return S_OK;
    });
}

HRESULT UserComponent::LogonUser(TavInParams*) { return NotProvided(OLESTR("LogonUser")); }
HRESULT UserComponent::LogonUserAsLocal(TavInParams*) { return NotProvided(OLESTR("LogonUserAsLocal")); }
HRESULT UserComponent::LogoffUser(TavInParams*) { return NotProvided(OLESTR("LogoffUser")); }
HRESULT UserComponent::RequestManualModePrivileges(TavInParams*, TavManualModePrivileges) {
    return NotProvided(OLESTR("RequestManualModePrivileges"));
}
HRESULT UserComponent::PollActiveRequest(TavInParams*) { return NotProvided(OLESTR("PollActiveRequest")); }
HRESULT UserComponent::CancelManualModePrivileges(TavInParams*) {
    return NotProvided(OLESTR("CancelManualModePrivileges"));
}
HRESULT UserComponent::UnpackManualModePrivRequestEvent(VARIANT*, TavLoginInfo*, ULONG*, TavManualModePrivileges*) {
    return NotProvided(OLESTR("UnpackManualModePrivRequestEvent"));
}
HRESULT UserComponent::GrantManualModePrivileges(TavInParams*, ULONG, TavManualModePrivileges) {
    return NotProvided(OLESTR("GrantManualModePrivileges"));
}
HRESULT UserComponent::GetManualModePrivilegesState(TavInParams*, TavManualModePrivilegesState*, TavLoginInfo*,
                                                    LONG*) {
    return NotProvided(OLESTR("GetManualModePrivilegesState"));
}
HRESULT UserComponent::UnpackManualModePrivilegesState(VARIANT*, ULONG, TavManualModePrivilegesState*, TavLoginInfo*,
                                                       LONG*) {
    return NotProvided(OLESTR("UnpackManualModePrivilegesState"));
}
HRESULT UserComponent::GetUserGrants(TavInParams*, BSTR*) { return NotProvided(OLESTR("GetUserGrants")); }
HRESULT UserComponent::GetPendingManualModePrivRequest(TavInParams*, TavLoginInfo*, ULONG*,
                                                       TavManualModePrivileges*) {
    return NotProvided(OLESTR("GetPendingManualModePrivRequest"));
}
HRESULT UserComponent::UnpackPendingManualModePrivRequest(VARIANT*, TavLoginInfo*, ULONG*,
                                                          TavManualModePrivileges*) {
    return NotProvided(OLESTR("UnpackPendingManualModePrivRequest"));
}
HRESULT UserComponent::GetUserId(TavInParams*, ULONG*) { return NotProvided(OLESTR("GetUserId")); }
HRESULT UserComponent::ImpersonateUser(TavInParams*, ULONG, ULONG*) { return NotProvided(OLESTR("ImpersonateUser")); }
HRESULT UserComponent::RemoveImpersonation(TavInParams*) { return NotProvided(OLESTR("RemoveImpersonation")); }
HRESULT UserComponent::RequestMastership(TavInParams*, TavMastershipResource) {
    return NotProvided(OLESTR("RequestMastership"));
}
HRESULT UserComponent::ReleaseMastership(TavInParams*, TavMastershipResource) {
    return NotProvided(OLESTR("ReleaseMastership"));
}
HRESULT UserComponent::GetCurrentMaster(TavInParams*, TavMastershipResource, TavMastershipStatus*, TavLoginInfo*,
                                        LONG*) {
    return NotProvided(OLESTR("GetCurrentMaster"));
}
HRESULT UserComponent::UnpackCurrentMaster(VARIANT*, ULONG, TavMastershipStatus*, TavLoginInfo*, LONG*) {
    return NotProvided(OLESTR("UnpackCurrentMaster"));
}

HRESULT UserComponent::GetLastErrorInfo(BSTR* errorText) { return lastError_.CopyTo(errorText); }

}  // namespace tav::sim
