#pragma once
#include "sim/com_object.h"

namespace tav::sim {

using CreateFunction = HRESULT (*)(IUnknown* outer, REFIID riid, void** object);

// The class object of one of the virtual controller's components.
class ClassFactory final : public IClassFactory {
public:
    // A new class object with no reference yet.
    static ClassFactory* New(CreateFunction create);

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    TAV_SIM_REFERENCE_COUNT
    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID riid, void** object) override;
    HRESULT STDMETHODCALLTYPE LockServer(BOOL lock) override;

private:
    explicit ClassFactory(CreateFunction create) : create_(create) {}
    ~ClassFactory() = default;

    ObjectLifetime lifetime_;
    const CreateFunction create_;
};

// The class object of TavComCtrl or TavUser; CLASS_E_CLASSNOTAVAILABLE for
// any other class.
HRESULT GetClassObject(REFCLSID clsid, REFIID riid, void** object);

}  // namespace tav::sim
