// A minimal in-process server: one class, ITavTestCounter, and the two entry
// points that the COM runtime asks. Built as a loadable module of its own
// (see platform/CMakeLists.txt); the ".cc" keeps it out of the test
// executable, which compiles every .cpp of this folder.
#include <new>

#include "test_inproc_server.h"

#ifdef _WIN32
#define TEST_SERVER_EXPORT extern "C" __declspec(dllexport)
#else
#define TEST_SERVER_EXPORT extern "C" __attribute__((visibility("default")))
#endif

namespace {

LONG volatile liveObjects = 0;
LONG volatile serverLocks = 0;

class Counter final : public ITavTestCounter {
public:
    Counter() { InterlockedIncrement(&liveObjects); }
    ~Counter() { InterlockedDecrement(&liveObjects); }

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        if (object == nullptr) return E_POINTER;
        if (iid == __uuidof(IUnknown) || iid == __uuidof(ITavTestCounter)) {
            *object = static_cast<ITavTestCounter*>(this);
            AddRef();
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return InterlockedIncrement(&references_); }
    ULONG STDMETHODCALLTYPE Release() override {
        LONG left = InterlockedDecrement(&references_);
        if (left == 0) delete this;
        return left;
    }
    LONG STDMETHODCALLTYPE Increment() override { return InterlockedIncrement(&count_); }

private:
    LONG volatile references_ = 1;
    LONG volatile count_ = 0;
};

class CounterFactory final : public IClassFactory {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        if (object == nullptr) return E_POINTER;
        if (iid == __uuidof(IUnknown) || iid == __uuidof(IClassFactory)) {
            *object = static_cast<IClassFactory*>(this);
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return 2; }
    ULONG STDMETHODCALLTYPE Release() override { return 1; }
    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID iid, void** object) override {
        if (object == nullptr) return E_POINTER;
        *object = nullptr;
        if (outer != nullptr) return CLASS_E_NOAGGREGATION;
        auto* counter = new (std::nothrow) Counter;
        if (counter == nullptr) return E_OUTOFMEMORY;
        HRESULT hr = counter->QueryInterface(iid, object);
        counter->Release();
        return hr;
    }
    HRESULT STDMETHODCALLTYPE LockServer(BOOL lock) override {
        if (lock)
            InterlockedIncrement(&serverLocks);
        else
            InterlockedDecrement(&serverLocks);
        return S_OK;
    }
};

CounterFactory factory;

}  // namespace

TEST_SERVER_EXPORT HRESULT STDAPICALLTYPE DllGetClassObject(REFCLSID clsid, REFIID iid, void** object) {
    if (object == nullptr) return E_POINTER;
    *object = nullptr;
    if (clsid != CLSID_TavTestCounter) return CLASS_E_CLASSNOTAVAILABLE;
    return factory.QueryInterface(iid, object);
}

TEST_SERVER_EXPORT HRESULT STDAPICALLTYPE DllCanUnloadNow() {
    return liveObjects == 0 && serverLocks == 0 ? S_OK : S_FALSE;
}
