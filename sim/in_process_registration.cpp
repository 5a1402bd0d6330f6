#include <utility>

#include "TavSiblings.h"
#include "sim/class_factory.h"
#include "sim/virtual_controller.h"
#include "tav/com_ptr.h"

namespace tav::sim {
namespace {

HRESULT RegisterOne(REFCLSID clsid, DWORD* cookie) {
    ComPtr<IUnknown> factory;
    HRESULT hr = GetClassObject(clsid, IID_IUnknown, reinterpret_cast<void**>(&factory));
    if (SUCCEEDED(hr)) {
        hr = CoRegisterClassObject(clsid, factory.Get(), CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE, cookie);
    }
    return hr;
}

}  // namespace

InProcessRegistration RegisterInProcess() {
    InProcessRegistration registration;
    registration.result_ = RegisterOne(CLSID_TavComCtrl, &registration.commandCookie_);
    if (SUCCEEDED(registration.result_)) {
        registration.result_ = RegisterOne(CLSID_TavUser, &registration.userCookie_);
    }
    if (FAILED(registration.result_)) {
        const HRESULT failure = registration.result_;
        registration.Revoke();
        registration.result_ = failure;
    }
    return registration;
}

InProcessRegistration::InProcessRegistration(InProcessRegistration&& other) noexcept
    : result_(std::exchange(other.result_, E_UNEXPECTED)),
      commandCookie_(std::exchange(other.commandCookie_, 0)),
      userCookie_(std::exchange(other.userCookie_, 0)) {}

InProcessRegistration& InProcessRegistration::operator=(InProcessRegistration&& other) noexcept {
    if (this != &other) {
        Revoke();
        result_ = std::exchange(other.result_, E_UNEXPECTED);
        commandCookie_ = std::exchange(other.commandCookie_, 0);
        userCookie_ = std::exchange(other.userCookie_, 0);
    }
    return *this;
}

InProcessRegistration::~InProcessRegistration() { Revoke(); }

void InProcessRegistration::Revoke() {
    if (commandCookie_ != 0) {
        CoRevokeClassObject(std::exchange(commandCookie_, 0));
    }
    if (userCookie_ != 0) {
        CoRevokeClassObject(std::exchange(userCookie_, 0));
    }
    result_ = E_UNEXPECTED;
}

}  // namespace tav::sim
