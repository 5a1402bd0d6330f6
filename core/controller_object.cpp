#include "core/controller_object.h"

#include <new>

#include "core/interface_table.h"
#include "core/module_lock.h"

namespace tav {

namespace {

LONG volatile lastClientValue = 0;

}  // namespace

ControllerObject::ControllerObject(LONG version, IUnknown* outer)
    : version_(version),
      clientValue_(static_cast<ULONG>(InterlockedIncrement(&lastClientValue))),
      inner_(this),
      controlling_(outer != nullptr ? outer : &inner_) {
    ModuleLock::Add();
}

ControllerObject::~ControllerObject() {
    // Messages may still be arriving on the command component's threads.
    ipc_.Close();
    ReleaseComponents();
    ModuleLock::Remove();
}

HRESULT ControllerObject::Create(LONG version, IUnknown* outer, REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    if (version < 1 || version > kNewestVersion) {
        return E_INVALIDARG;
    }
    if (outer != nullptr && !IsEqualIID(riid, IID_IUnknown)) {
        return CLASS_E_NOAGGREGATION;
    }
    ControllerObject* created = Allocate(version, outer);
    if (created == nullptr) {
        return E_OUTOFMEMORY;
    }
    // The temporary reference keeps the object alive through the query, and
    // its release destroys the object when the query fails.
    created->inner_.AddRef();
    const HRESULT hr = created->inner_.QueryInterface(riid, object);
    created->inner_.Release();
    return hr;
}

HRESULT ControllerObject::FindInterface(REFIID riid, void** object) {
    if (IsEqualIID(riid, IID_IUnknown)) {
        *object = static_cast<IUnknown*>(&inner_);
        return S_OK;
    }
    for (const InterfaceEntry& entry : ControllerInterfaces()) {
        if (IsEqualIID(riid, *entry.iid)) {
            if (entry.sinceVersion > version_) {
                break;
            }
            *object = entry.view(this);
            return S_OK;
        }
    }
    return E_NOINTERFACE;
}

HRESULT ControllerObject::QueryInterface(REFIID riid, void** object) {
    return controlling_->QueryInterface(riid, object);
}

ULONG ControllerObject::AddRef() { return controlling_->AddRef(); }

ULONG ControllerObject::Release() { return controlling_->Release(); }

HRESULT ControllerObject::Inner::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    ControllerObject& owner = Owner();
    const HRESULT hr = owner.FindInterface(riid, object);
    if (SUCCEEDED(hr)) {
        static_cast<IUnknown*>(*object)->AddRef();
    }
    return hr;
}

ULONG ControllerObject::Inner::AddRef() {
    return static_cast<ULONG>(InterlockedIncrement(&Owner().references_));
}

ULONG ControllerObject::Inner::Release() {
    ControllerObject& owner = Owner();
    const LONG left = InterlockedDecrement(&owner.references_);
    if (left == 0) {
        delete &owner;
    }
    return static_cast<ULONG>(left);
}

void ControllerObject::ReleaseComponents() {
    user_.Reset();
    mastership_.Reset();
    command2_.Reset();
    file_.Reset();
    command_.Reset();
}

}  // namespace tav
