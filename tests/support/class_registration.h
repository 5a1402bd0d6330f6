#pragma once
#include <atomic>

#include "support/com_double.h"
#include "tav/platform.h"

namespace tav::test {

// The class object that CoCreateInstance finds for a sibling component: every
// creation hands out the one instance the test holds, so the test sees what
// the controller object did with it.
class FakeClassFactory final : public IClassFactory {
public:
    explicit FakeClassFactory(IUnknown* instance);

    // Creations fail with hr from now on (S_OK: they succeed again).
    void FailCreation(HRESULT hr) { failure_ = hr; }
    int Creations() const { return creations_; }

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID riid, void** object) override;
    HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }
    TAV_TEST_DOUBLE_REFCOUNT

private:
    ~FakeClassFactory();

    RefCount refs_;
    IUnknown* instance_;
    std::atomic<HRESULT> failure_{S_OK};
    std::atomic<int> creations_{0};
};

// Registers a class object in-process for the life of the registration.
class ClassRegistration {
public:
    ClassRegistration(REFCLSID clsid, IUnknown* classObject);
    ~ClassRegistration();
    ClassRegistration(const ClassRegistration&) = delete;
    ClassRegistration& operator=(const ClassRegistration&) = delete;

    HRESULT Result() const { return result_; }

private:
    HRESULT result_ = E_FAIL;
    DWORD cookie_ = 0;
};

}  // namespace tav::test
