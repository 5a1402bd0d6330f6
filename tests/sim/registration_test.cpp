// In-process registration, and the TavSim module with its own entry points
// and registry entries.
#include <filesystem>

#include "build_tree.h"
#include "sim_test_support.h"

#ifdef _WIN32
#include <windows.h>
#else
#include <dlfcn.h>
#include <unistd.h>

#include "tav/registry_file.h"
#endif

namespace tav::sim::test {
namespace {

TEST(InProcessRegistration, LastsAsLongAsItsGuard) {
#ifndef _WIN32
    // An empty registry, so that nothing but the registration can answer.
    TavSetRegistryFile((std::filesystem::temp_directory_path() / "tav-sim-test-no-registry").c_str());
#endif
    ComPtr<IUnknown> component;
    {
        InProcessRegistration moved;
        {
            InProcessRegistration registration = RegisterInProcess();
            ASSERT_TRUE(registration);
            moved = std::move(registration);
        }
        EXPECT_EQ(S_OK, CoCreateInstance(CLSID_TavComCtrl, nullptr, CLSCTX_INPROC_SERVER, IID_IUnknown,
                                         reinterpret_cast<void**>(&component)));
        EXPECT_EQ(S_OK, CoCreateInstance(CLSID_TavUser, nullptr, CLSCTX_INPROC_SERVER, IID_IUnknown,
                                         reinterpret_cast<void**>(&component)));
        ComPtr<IUnknown> aggregated;
        EXPECT_EQ(CLASS_E_NOAGGREGATION, CoCreateInstance(CLSID_TavComCtrl, component.Get(), CLSCTX_INPROC_SERVER,
                                                          IID_IUnknown, reinterpret_cast<void**>(&aggregated)));
    }
    EXPECT_TRUE(FAILED(CoCreateInstance(CLSID_TavComCtrl, nullptr, CLSCTX_INPROC_SERVER, IID_IUnknown,
                                        reinterpret_cast<void**>(&component))));
#ifndef _WIN32
    TavSetRegistryFile(nullptr);
#endif
}

// The module's exports, looked up by name as a COM runtime does.
template <typename F>
F Export(void* module, const char* name) {
#ifdef _WIN32
    return reinterpret_cast<F>(reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(module), name)));
#else
    return reinterpret_cast<F>(dlsym(module, name));
#endif
}

Text RegistryText(const std::string& key, const OLECHAR* valueName) {
    HKEY handle = nullptr;
    const Text path = T(key);
    if (RegOpenKeyExW(HKEY_CLASSES_ROOT, path.c_str(), 0, KEY_READ, &handle) != ERROR_SUCCESS) {
        return T("(missing)");
    }
    OLECHAR buffer[1024] = {};
    DWORD size = sizeof buffer - sizeof(OLECHAR);
    DWORD type = 0;
    RegQueryValueExW(handle, valueName, nullptr, &type, reinterpret_cast<BYTE*>(buffer), &size);
    RegCloseKey(handle);
    return Text(buffer);
}

std::filesystem::path PathOf(const Text& text) {
#ifdef _WIN32
    return std::filesystem::path(std::wstring(text));
#else
    return std::filesystem::path(Narrow(text));
#endif
}

std::string ClassKey(REFCLSID clsid) {
    OLECHAR text[39] = {};
    StringFromGUID2(clsid, text, 39);
    return "CLSID\\" + Narrow(TextView(text));
}

TEST(SimModuleTest, RegistersBothClassesAndServesThemThroughTheRegistry) {
    const std::filesystem::path path = BuildFolder() / "sim" / (std::string("TavSim") + kModuleSuffix);
    if (!std::filesystem::exists(path)) {
        GTEST_SKIP() << path << " is not built";
    }
#ifdef _WIN32
    void* handle = LoadLibraryW(path.wstring().c_str());
#else
    const std::filesystem::path registry =
        std::filesystem::temp_directory_path() / ("tav-sim-test-registry-" + std::to_string(::getpid()));
    TavSetRegistryFile(registry.c_str());
    void* handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
#endif
    ASSERT_NE(nullptr, handle);
    const auto getClassObject = Export<LPFNGETCLASSOBJECT>(handle, "DllGetClassObject");
    const auto canUnloadNow = Export<LPFNCANUNLOADNOW>(handle, "DllCanUnloadNow");
    const auto registerServer = Export<HRESULT(STDAPICALLTYPE*)()>(handle, "DllRegisterServer");
    const auto unregisterServer = Export<HRESULT(STDAPICALLTYPE*)()>(handle, "DllUnregisterServer");
    ASSERT_TRUE(getClassObject && canUnloadNow && registerServer && unregisterServer);

    ComPtr<IClassFactory> factory;
    EXPECT_EQ(CLASS_E_CLASSNOTAVAILABLE,
              getClassObject(IID_ITavComCtrl, IID_IClassFactory, reinterpret_cast<void**>(&factory)));
    EXPECT_EQ(S_OK, canUnloadNow());

    ASSERT_EQ(S_OK, registerServer());
    for (const CLSID* clsid : {&CLSID_TavComCtrl, &CLSID_TavUser}) {
        const std::string key = ClassKey(*clsid) + "\\InprocServer32";
        std::error_code error;
        EXPECT_TRUE(std::filesystem::equivalent(PathOf(RegistryText(key, nullptr)), path, error))
            << Narrow(RegistryText(key, nullptr));
        EXPECT_EQ(T("Both"), RegistryText(key, OLESTR("ThreadingModel")));
    }

    // No in-process registration here: COM finds the module by the registry.
    ComPtr<ITavComCtrl> command;
    ASSERT_EQ(S_OK, CoCreateInstance(CLSID_TavComCtrl, nullptr, CLSCTX_INPROC_SERVER, IID_ITavComCtrl,
                                     reinterpret_cast<void**>(&command)));
    EXPECT_EQ(S_FALSE, canUnloadNow());
    TavCommandReply reply{};
    const Bstr verb = B("Get"), url = B("/registered"), name = B("Mode");
    EXPECT_EQ(S_OK, command->Execute(nullptr, &reply, verb.Get(), url.Get(), name.Get(), nullptr));
    EXPECT_EQ(T("MANR"), FromBstr(reply.data.bstrVal));
    VariantClear(&reply.data);
    command = nullptr;
    EXPECT_EQ(S_OK, canUnloadNow());

    ASSERT_EQ(S_OK, unregisterServer());
    EXPECT_EQ(T("(missing)"), RegistryText(ClassKey(CLSID_TavComCtrl), nullptr));
    EXPECT_EQ(S_OK, unregisterServer());  // nothing left to remove is no failure
#ifndef _WIN32
    TavSetRegistryFile(nullptr);
    std::filesystem::remove_all(registry);
#endif
}

}  // namespace
}  // namespace tav::sim::test
