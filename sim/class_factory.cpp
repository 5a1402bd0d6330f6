#include "sim/class_factory.h"

#include <new>

#include "TavSiblings.h"
#include "sim/command_component.h"
#include "sim/user_component.h"

namespace tav::sim {

ClassFactory* ClassFactory::New(CreateFunction create) { return new (std::nothrow) ClassFactory(create); }

HRESULT ClassFactory::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (riid == IID_IUnknown || riid == IID_IClassFactory) {
        *object = static_cast<IClassFactory*>(this);
        AddRef();
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

HRESULT ClassFactory::CreateInstance(IUnknown* outer, REFIID riid, void** object) {
    return create_(outer, riid, object);
}

HRESULT ClassFactory::LockServer(BOOL lock) {
    sim::LockServer(lock != FALSE);
    return S_OK;
}

HRESULT GetClassObject(REFCLSID clsid, REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    CreateFunction create = nullptr;
    if (clsid == CLSID_TavComCtrl) {
        create = &CommandComponent::Create;
    } else if (clsid == CLSID_TavUser) {
        create = &UserComponent::Create;
    } else {
        return CLASS_E_CLASSNOTAVAILABLE;
    }
    ClassFactory* factory = ClassFactory::New(create);
    return factory == nullptr ? E_OUTOFMEMORY : HandOut(factory, riid, object);
}

}  // namespace tav::sim
