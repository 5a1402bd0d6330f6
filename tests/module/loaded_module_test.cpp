// The built module file itself, loaded as a host loads it: its four exports,
// its resources (on Windows) and self-registration that CoCreateInstance
// then follows.
#include <gtest/gtest.h>

#include <filesystem>

#include "module_test_support.h"
#include "tav/com_scope.h"
#include "registry_sandbox.h"

#ifndef _WIN32
#include <dlfcn.h>
#endif

namespace tav::test {
namespace {

using ServerFunction = HRESULT(STDAPICALLTYPE*)();
using GetClassObjectFunction = HRESULT(STDAPICALLTYPE*)(REFCLSID, REFIID, LPVOID*);

std::filesystem::path BuiltModulePath() {
#ifdef _WIN32
    const char* file = "TavController.dll";
#else
    const char* file = "TavController.so";
#endif
    return std::filesystem::path(ExecutablePath()).parent_path().parent_path() / "module" / file;
}

class LoadedModule {
public:
    explicit LoadedModule(const std::filesystem::path& path) {
#ifdef _WIN32
        handle_ = LoadLibraryW(path.wstring().c_str());
#else
        handle_ = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
#endif
    }
    ~LoadedModule() {
        if (handle_ == nullptr) return;
#ifdef _WIN32
        FreeLibrary(static_cast<HMODULE>(handle_));
#else
        dlclose(handle_);
#endif
    }
    LoadedModule(const LoadedModule&) = delete;
    LoadedModule& operator=(const LoadedModule&) = delete;

    bool Loaded() const { return handle_ != nullptr; }

    template <typename Function>
    Function Find(const char* name) const {
#ifdef _WIN32
        void* found = reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(handle_), name));
#else
        void* found = dlsym(handle_, name);
#endif
        return reinterpret_cast<Function>(found);
    }

private:
    void* handle_ = nullptr;
};

TEST(LoadedModule, RegistersItselfAndServesItsClassesThroughCoCreateInstance) {
    const std::filesystem::path path = BuiltModulePath();
    if (!std::filesystem::exists(path)) {
        GTEST_SKIP() << "module not built: " << path.string();
    }
    RegistrySandbox sandbox;
    ASSERT_TRUE(sandbox.Ready());
    PerUserSwitch machine(nullptr);
    LoadedModule module(path);
    ASSERT_TRUE(module.Loaded()) << path.string();

    const auto getClassObject = module.Find<GetClassObjectFunction>("DllGetClassObject");
    const auto canUnloadNow = module.Find<ServerFunction>("DllCanUnloadNow");
    const auto registerServer = module.Find<ServerFunction>("DllRegisterServer");
    const auto unregisterServer = module.Find<ServerFunction>("DllUnregisterServer");
    ASSERT_TRUE(getClassObject && canUnloadNow && registerServer && unregisterServer);

    ASSERT_EQ(registerServer(), S_OK);
    for (const ClassInfo& info : kClasses) {
        const std::string server = ReadString(HKEY_CLASSES_ROOT, "CLSID\\" + GuidText(*info.clsid) + "\\InprocServer32", "");
        std::error_code error;
        EXPECT_TRUE(std::filesystem::equivalent(server, path, error)) << info.name << ": " << server;
    }

    {
        ComPtr<IClassFactory> factory;
        ASSERT_EQ(getClassObject(CLSID_TavController8, IID_IClassFactory, Out(factory)), S_OK);
        ComPtr<ITavIPC> object;
        EXPECT_EQ(factory->CreateInstance(nullptr, IID_ITavIPC, Out(object)), S_OK);
        factory.Reset();
        EXPECT_EQ(canUnloadNow(), S_FALSE);
    }
    EXPECT_EQ(canUnloadNow(), S_OK);
#ifndef _WIN32
    // The platform's COM runtime follows the registration to the module.
    // (Windows' own runtime does not see the sandbox's stand-in keys.)
    {
        const ComScope com;
        ASSERT_TRUE(com);
        ComPtr<ITavPanel4> object;
        EXPECT_EQ(CoCreateInstance(CLSID_TavController17, nullptr, CLSCTX_INPROC_SERVER, IID_ITavPanel4, Out(object)),
                  S_OK);
        EXPECT_EQ(canUnloadNow(), S_FALSE);
    }
    EXPECT_EQ(canUnloadNow(), S_OK);
#endif

    EXPECT_EQ(unregisterServer(), S_OK);
    EXPECT_EQ(ReadString(HKEY_CLASSES_ROOT, "TavController.TavController", ""), "<missing>");
}

}  // namespace
}  // namespace tav::test
