#include "module/server_registration.h"

#include <cstdlib>
#include <memory>
#include <string_view>

#include "TavController.h"
#include "module/class_table.h"
#include "module/module_state.h"
#include "module/registry_script.h"
#include "module/type_library.h"

namespace tav {
namespace {

struct TaskMemoryFree {
    void operator()(OLECHAR* text) const { CoTaskMemFree(text); }
};

HRESULT SetGuidVariable(Registrar& registrar, OleStringView name, REFGUID guid) {
    LPOLESTR text = nullptr;
    const HRESULT hr = StringFromCLSID(guid, &text);
    const std::unique_ptr<OLECHAR, TaskMemoryFree> owned(text);
    if (SUCCEEDED(hr)) {
        registrar.SetVariable(name, owned.get());
    }
    return hr;
}

// The script's variables: the module path and every GUID, taken from the
// interface definitions so that they are written down once only.
HRESULT PrepareRegistrar(Registrar& registrar, OleString& modulePath) {
    HRESULT hr = ModuleFileName(modulePath);
    if (FAILED(hr)) {
        return hr;
    }
    registrar.SetVariable(OLESTR("MODULE"), modulePath);
    hr = SetGuidVariable(registrar, OLESTR("LIBID_TAVCONTROLLERLib"), LIBID_TAVCONTROLLERLib);
    for (const ClassRow& row : ClassTable()) {
        if (SUCCEEDED(hr)) {
            hr = SetGuidVariable(registrar, OleString(OLESTR("CLSID_")) + row.name, *row.clsid);
        }
    }
    return hr;
}

bool PerUserRequested() {
#ifdef _WIN32
    // The process environment, not the C runtime's copy made at start-up.
    char value[4] = {};
    return GetEnvironmentVariableA(kPerUserVariable, value, sizeof value) == 1 && value[0] == '1';
#else
    const char* value = std::getenv(kPerUserVariable);
    return value != nullptr && std::string_view(value) == "1";
#endif
}

}  // namespace

RegistrationScope RequestedRegistrationScope() {
    return PerUserRequested() ? RegistrationScope::User : RegistrationScope::Machine;
}

namespace {

// Every row runs the whole script, as each class registers itself; then the
// type library follows.
HRESULT RunRegistration(RegistrationScope scope, bool registering) {
    Registrar registrar(scope);
    OleString modulePath;
    std::string_view script;
    HRESULT hr = PrepareRegistrar(registrar, modulePath);
    if (SUCCEEDED(hr)) hr = LoadRegistryScript(script);
    for (size_t row = 0; row < ClassTable().size() && SUCCEEDED(hr); ++row) {
        hr = registering ? registrar.Register(script) : registrar.Unregister(script);
    }
    if (SUCCEEDED(hr)) {
        hr = registering ? RegisterTypeLibrary(modulePath, scope) : UnregisterTypeLibrary(modulePath, scope);
    }
    return hr;
}

}  // namespace

HRESULT RegisterServer(RegistrationScope scope) { return RunRegistration(scope, true); }

HRESULT UnregisterServer(RegistrationScope scope) { return RunRegistration(scope, false); }

}  // namespace tav
