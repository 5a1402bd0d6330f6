#include "core/controller_object.h"

namespace tav {
namespace {

// One slash followed by a non-empty name holding no other slash.
bool ValidUrl(BSTR url) {
    if (url == nullptr) {
        return false;
    }
    const OleStringView text(url, SysStringLen(url));
    return text.size() >= 2 && text.front() == OLECHAR('/') &&
           text.find(OLECHAR('/'), 1) == OleStringView::npos;
}

}  // namespace

HRESULT ControllerObject::Init(BSTR url) {
    if (!ValidUrl(url)) {
        return errors_.Set(E_INVALIDARG, ErrorSite::Here(), OLESTR("TavController::Init - Invalid URL."));
    }
    if (Initialised()) {
        if (OleStringView(url, SysStringLen(url)) == url_.View()) {
            return S_OK;
        }
        return errors_.Set(E_INVALIDARG, ErrorSite::Here(),
                           OLESTR("TavController::Init - Reinitialization to new controller not allowed."));
    }

    HRESULT hr = CoCreateInstance(CLSID_TavComCtrl, nullptr, CLSCTX_INPROC_SERVER, IID_PPV_ARGS(&command_));
    if (FAILED(hr)) {
        return errors_.Set(hr, ErrorSite::Here(), OLESTR("TavController::Init. Could not create TavComCtrl."));
    }

    // Every failure from here on leaves the object as it was before Init.
    auto fail = [this](HRESULT failure) {
        ReleaseComponents();
        return failure;
    };

    if (version_ >= 8) {
        if (FAILED(QueryTo(command_.Get(), command2_))) {
            return fail(errors_.Set(E_NOINTERFACE, ErrorSite::Here(),
                                    OLESTR("TavController::Init. Could not create ITavCommand2.")));
        }
    }

    ComPtr<ITavUserComponent> userComponent;
    hr = CoCreateInstance(CLSID_TavUser, nullptr, CLSCTX_INPROC_SERVER, IID_PPV_ARGS(&userComponent));
    if (FAILED(hr)) {
        return fail(errors_.Set(hr, ErrorSite::Here(), OLESTR("Could not create TavUser")));
    }
    hr = QueryTo(userComponent.Get(), user_);
    if (FAILED(hr)) {
        return fail(errors_.Set(hr, ErrorSite::Here(), OLESTR("Could not QI TavUser for ITavUser3")));
    }
    hr = QueryTo(userComponent.Get(), mastership_);
    if (FAILED(hr)) {
        return fail(errors_.Set(hr, ErrorSite::Here(), OLESTR("Could not QI TavUser for ITavMastership")));
    }
    hr = userComponent->Initialize(url, command_.Get());
    if (FAILED(hr)) {
        return fail(errors_.AdoptFromComponent(hr, userComponent.Get(), ErrorSite::Here()));
    }
    if (FAILED(QueryTo(command_.Get(), file_))) {
        return fail(errors_.Set(E_FAIL, ErrorSite::Here(), OLESTR("Init. Failed to query for ITavFile.")));
    }

    Bstr stored(OleStringView(url, SysStringLen(url)));
    if (stored.IsNull()) {
        return fail(errors_.Set(E_OUTOFMEMORY, ErrorSite::Here(), OLESTR("SysAllocString failed")));
    }
    url_ = std::move(stored);
    initialised_ = 1;
    return S_OK;
}

HRESULT ControllerObject::GetLastErrorInfo(BSTR* errorText) {
    if (errorText == nullptr) {
        return E_POINTER;
    }
    return errors_.CopyTo(errorText);
}

HRESULT ControllerObject::SetLastErrorInfo(VARIANT* data) { return errors_.SetFromVariant(data); }

}  // namespace tav
