#include "module/class_objects.h"

#include "module/class_factory.h"
#include "tav/lock.h"

namespace tav {
namespace {

// The module's critical section: guards the creation of class objects.
// Declared before the teardown so that it outlives it.
CriticalSection moduleSection;

// Where no DllMain runs, the static state's end is the module's unload.
struct TeardownAtUnload {
    ~TeardownAtUnload() { ReleaseClassObjects(); }
} teardownAtUnload;

ClassFactory* CachedClassObject(ClassRow& row) {
    ClassFactory* factory = row.classObject.load(std::memory_order_acquire);
    if (factory != nullptr) {
        return factory;
    }
    CriticalSectionLock hold(moduleSection);
    // Another thread may have created it while this one waited.
    factory = row.classObject.load(std::memory_order_relaxed);
    if (factory == nullptr) {
        factory = ClassFactory::Create(row.version);
        row.classObject.store(factory, std::memory_order_release);
    }
    return factory;
}

}  // namespace

HRESULT GetClassObject(ClassRow& row, REFIID riid, void** object) {
    ClassFactory* factory = CachedClassObject(row);
    if (factory == nullptr) {
        return E_OUTOFMEMORY;
    }
    return factory->QueryInterface(riid, object);
}

void ReleaseClassObjects() {
    for (ClassRow& row : ClassTable()) {
        ClassFactory* factory = nullptr;
        {
            CriticalSectionLock hold(moduleSection);
            factory = row.classObject.exchange(nullptr, std::memory_order_acq_rel);
        }
        if (factory != nullptr) {
            factory->Release();
        }
    }
}

HRESULT RegisterClassObjects(DWORD context, DWORD flags) {
    for (ClassRow& row : ClassTable()) {
        if (row.cookie != 0) {
            continue;
        }
        IUnknown* classObject = nullptr;
        HRESULT hr = GetClassObject(row, IID_IUnknown, reinterpret_cast<void**>(&classObject));
        if (SUCCEEDED(hr)) {
            hr = CoRegisterClassObject(*row.clsid, classObject, context, flags, &row.cookie);
            classObject->Release();
        }
        if (FAILED(hr)) {
            row.cookie = 0;
            RevokeClassObjects();
            return hr;
        }
    }
    return S_OK;
}

void RevokeClassObjects() {
    for (ClassRow& row : ClassTable()) {
        if (row.cookie != 0) {
            CoRevokeClassObject(row.cookie);
            row.cookie = 0;
        }
    }
}

}  // namespace tav
