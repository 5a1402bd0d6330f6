#include "support/class_registration.h"

namespace tav::test {

FakeClassFactory::FakeClassFactory(IUnknown* instance) : instance_(instance) { instance_->AddRef(); }

FakeClassFactory::~FakeClassFactory() { instance_->Release(); }

HRESULT FakeClassFactory::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID_IClassFactory)) {
        *object = static_cast<IClassFactory*>(this);
        AddRef();
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

HRESULT FakeClassFactory::CreateInstance(IUnknown* outer, REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    ++creations_;
    if (FAILED(failure_.load())) {
        return failure_.load();
    }
    if (outer != nullptr) {
        return CLASS_E_NOAGGREGATION;
    }
    return instance_->QueryInterface(riid, object);
}

ClassRegistration::ClassRegistration(REFCLSID clsid, IUnknown* classObject) {
    result_ = CoRegisterClassObject(clsid, classObject, CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE, &cookie_);
}

ClassRegistration::~ClassRegistration() {
    if (SUCCEEDED(result_)) {
        CoRevokeClassObject(cookie_);
    }
}

}  // namespace tav::test
