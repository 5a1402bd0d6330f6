#include "module/class_factory.h"

#include "core/controller_object.h"
#include "core/module_lock.h"

namespace tav {
namespace {
// The reference that the class row itself holds.
constexpr LONG kCacheReference = 1;
}  // namespace

void* ClassFactory::operator new(std::size_t size, const std::nothrow_t&) noexcept { return TavMemAlloc(size); }

void ClassFactory::operator delete(void* block) noexcept { TavMemFree(block); }

ClassFactory* ClassFactory::Create(LONG classVersion) { return new (std::nothrow) ClassFactory(classVersion); }

HRESULT ClassFactory::QueryInterface(REFIID riid, void** object) {
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

ULONG ClassFactory::AddRef() {
    const LONG count = InterlockedIncrement(&references_);
    if (count == kCacheReference + 1) {
        ModuleLock::Add();
    }
    return static_cast<ULONG>(count);
}

ULONG ClassFactory::Release() {
    const LONG count = InterlockedDecrement(&references_);
    if (count == kCacheReference) {
        ModuleLock::Remove();
    } else if (count == 0) {
        delete this;
    }
    return static_cast<ULONG>(count);
}

HRESULT ClassFactory::CreateInstance(IUnknown* outer, REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    return ControllerObject::Create(classVersion_, outer, riid, object);
}

HRESULT ClassFactory::LockServer(BOOL lock) {
    if (lock) {
        ModuleLock::Add();
    } else {
        ModuleLock::Remove();
    }
    return S_OK;
}

}  // namespace tav
