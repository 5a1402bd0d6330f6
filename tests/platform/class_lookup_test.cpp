#include <gtest/gtest.h>

#include "inproc_server/test_inproc_server.h"
#include "platform_test_support.h"
#include "tav/com_ptr.h"
#include "tav/com_scope.h"

#include <optional>

#ifndef _WIN32
#include <dlfcn.h>
#endif

namespace {

using tav::ComPtr;
using tav::test::OleString;
using tav::test::RegistrySandbox;
using tav::test::Widen;

// {0C5D2E7A-1B3F-4C6D-8E9F-A0B1C2D3E4F5}, registered by no one.
const CLSID unregisteredClass = {0x0c5d2e7a, 0x1b3f, 0x4c6d, {0x8e, 0x9f, 0xa0, 0xb1, 0xc2, 0xd3, 0xe4, 0xf5}};

// A class factory living in the test process, as the virtual controller registers its components.
class LocalFactory final : public IClassFactory {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        if (iid == __uuidof(IUnknown) || iid == __uuidof(IClassFactory)) {
            *object = static_cast<IClassFactory*>(this);
            AddRef();
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references; }
    ULONG STDMETHODCALLTYPE Release() override { return --references; }
    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown*, REFIID iid, void** object) override {
        ++instancesMade;
        return QueryInterface(iid, object);
    }
    HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }

    ULONG references = 1;
    int instancesMade = 0;
};

template <typename T>
HRESULT Create(REFCLSID clsid, ComPtr<T>& object) {
    return CoCreateInstance(clsid, nullptr, CLSCTX_INPROC_SERVER, __uuidof(T), reinterpret_cast<void**>(&object));
}

HRESULT ClassObject(REFCLSID clsid, ComPtr<IClassFactory>& factory) {
    return CoGetClassObject(clsid, CLSCTX_INPROC_SERVER, nullptr, __uuidof(IClassFactory),
                            reinterpret_cast<void**>(&factory));
}

OleString TestServerPath() {
#ifdef TAV_PLATFORM_TEST_SERVER
    return tav::test::ExecutableFolder() + Widen(TAV_PLATFORM_TEST_SERVER);
#else
    return {};
#endif
}

// Wine looks classes up in the machine's registration only, where Windows
// looks in the user's first.
bool RunningUnderWine() {
#ifdef _WIN32
    HMODULE ntdll = GetModuleHandleW(L"ntdll.dll");
    return ntdll != nullptr && GetProcAddress(ntdll, "wine_get_version") != nullptr;
#else
    return false;
#endif
}

class ClassLookup : public testing::Test {
protected:
    void SetUp() override { com_.emplace(); }
    void TearDown() override { com_.reset(); }
    std::optional<tav::ComScope> com_;

    // Writes InprocServer32 = `path`, ThreadingModel "Both" (else Windows would
    // marshal to an apartment of its own) below HKCU\Software\Classes or HKCR.
    void RegisterServer(REFCLSID clsid, const OleString& path, bool perUser) {
        OleString subkey = Widen("CLSID\\") + tav::test::GuidText(clsid) + Widen("\\InprocServer32");
        sandbox.RemoveClassKeyLater(Widen("CLSID\\") + tav::test::GuidText(clsid));
        OleString fullPath = perUser ? Widen("Software\\Classes\\") + subkey : subkey;
        HKEY key = nullptr;
        ASSERT_EQ(RegCreateKeyExW(perUser ? HKEY_CURRENT_USER : HKEY_CLASSES_ROOT, fullPath.c_str(), 0, nullptr, 0,
                                  KEY_ALL_ACCESS, nullptr, &key, nullptr),
                  ERROR_SUCCESS);
        RegSetValueExW(key, nullptr, 0, REG_SZ, reinterpret_cast<const BYTE*>(path.c_str()),
                       static_cast<DWORD>((path.size() + 1) * sizeof(OLECHAR)));
        const OLECHAR both[] = OLESTR("Both");
        RegSetValueExW(key, OLESTR("ThreadingModel"), 0, REG_SZ, reinterpret_cast<const BYTE*>(both), sizeof both);
        RegCloseKey(key);
    }

    RegistrySandbox sandbox;
};

TEST_F(ClassLookup, AnUnknownClassIsNotRegistered) {
    ComPtr<IClassFactory> factory;
    EXPECT_EQ(ClassObject(unregisteredClass, factory), REGDB_E_CLASSNOTREG);
    EXPECT_FALSE(factory);
    ComPtr<IUnknown> object;
    EXPECT_EQ(Create(unregisteredClass, object), REGDB_E_CLASSNOTREG);
}

TEST_F(ClassLookup, AClassRegisteredInTheProcessIsFoundFirstUntilRevoked) {
    RegisterServer(unregisteredClass, Widen("/nowhere/missing-module"), true);
    LocalFactory local;
    DWORD cookie = 0;
    ASSERT_EQ(CoRegisterClassObject(unregisteredClass, &local, CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE, &cookie),
              S_OK);
    EXPECT_GT(local.references, 1u);

    ComPtr<IUnknown> object;
    ASSERT_EQ(Create(unregisteredClass, object), S_OK);
    EXPECT_EQ(local.instancesMade, 1);
    object.Reset();

    ASSERT_EQ(CoRevokeClassObject(cookie), S_OK);
    EXPECT_EQ(local.references, 1u);
    EXPECT_NE(Create(unregisteredClass, object), S_OK);
    EXPECT_EQ(local.instancesMade, 1);
}

TEST_F(ClassLookup, ARegisteredServerIsLoadedAndAsked) {
    OleString path = TestServerPath();
    if (path.empty()) GTEST_SKIP() << "the test server was not built";
    RegisterServer(CLSID_TavTestCounter, path, false);
    ComPtr<ITavTestCounter> counter;
    ASSERT_EQ(Create(CLSID_TavTestCounter, counter), S_OK);
    EXPECT_EQ(counter->Increment(), 1);
    EXPECT_EQ(counter->Increment(), 2);
}

TEST_F(ClassLookup, PerUserRegistrationWinsOverTheMachineOne) {
    OleString path = TestServerPath();
    if (path.empty()) GTEST_SKIP() << "the test server was not built";
    if (RunningUnderWine()) GTEST_SKIP() << "Wine ignores per-user class registrations";
    ComPtr<IClassFactory> factory;

    RegisterServer(CLSID_TavTestCounter, Widen("/nowhere/missing-module"), false);
    RegisterServer(CLSID_TavTestCounter, path, true);
    EXPECT_EQ(ClassObject(CLSID_TavTestCounter, factory), S_OK);

    RegisterServer(CLSID_TavTestCounter, path, false);
    RegisterServer(CLSID_TavTestCounter, Widen("/nowhere/missing-module"), true);
    EXPECT_NE(ClassObject(CLSID_TavTestCounter, factory), S_OK);
}

#ifndef _WIN32

TEST_F(ClassLookup, AServerThatCannotBeLoadedOrAskedIsReported) {
    RegisterServer(unregisteredClass, Widen("/nowhere/missing-module.so"), true);
    ComPtr<IClassFactory> factory;
    EXPECT_EQ(ClassObject(unregisteredClass, factory), CO_E_DLLNOTFOUND);

    // The platform library loads fine but is no server.
    HMODULE platform = nullptr;
    ASSERT_TRUE(GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                                   reinterpret_cast<LPCWSTR>(&SysAllocString), &platform));
    OLECHAR platformPath[4096];
    ASSERT_GT(GetModuleFileNameW(platform, platformPath, 4096), 0u);
    RegisterServer(unregisteredClass, platformPath, true);
    EXPECT_EQ(ClassObject(unregisteredClass, factory), CO_E_ERRORINDLL);
}

TEST_F(ClassLookup, UnusedServersAreUnloadedOnlyWhenTheySaySo) {
    OleString path = TestServerPath();
    if (path.empty()) GTEST_SKIP() << "the test server was not built";
    RegisterServer(CLSID_TavTestCounter, path, true);
    std::string file(path.begin(), path.end());
    auto isLoaded = [&file] {
        void* handle = dlopen(file.c_str(), RTLD_NOW | RTLD_NOLOAD);
        if (handle != nullptr) dlclose(handle);
        return handle != nullptr;
    };

    ComPtr<ITavTestCounter> counter;
    ASSERT_EQ(Create(CLSID_TavTestCounter, counter), S_OK);
    CoFreeUnusedLibraries();
    EXPECT_TRUE(isLoaded()) << "unloaded while an object was alive";
    counter.Reset();
    CoFreeUnusedLibraries();
    EXPECT_FALSE(isLoaded());
}

TEST_F(ClassLookup, ProgIdLeadsToTheClsid) {
    HKEY key = nullptr;
    ASSERT_EQ(RegCreateKeyExW(HKEY_CLASSES_ROOT, OLESTR("TavController.Test.1\\CLSID"), 0, nullptr, 0, KEY_ALL_ACCESS,
                              nullptr, &key, nullptr),
              ERROR_SUCCESS);
    OleString text = tav::test::GuidText(CLSID_TavTestCounter);
    RegSetValueExW(key, nullptr, 0, REG_SZ, reinterpret_cast<const BYTE*>(text.c_str()),
                   static_cast<DWORD>((text.size() + 1) * sizeof(OLECHAR)));
    RegCloseKey(key);
    CLSID found;
    ASSERT_EQ(CLSIDFromProgID(OLESTR("tavcontroller.test.1"), &found), S_OK);
    EXPECT_TRUE(IsEqualCLSID(found, CLSID_TavTestCounter));
    EXPECT_EQ(CLSIDFromProgID(OLESTR("TavController.Missing"), &found), CO_E_CLASSSTRING);
}

#endif

}  // namespace
