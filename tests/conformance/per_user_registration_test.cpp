// Per-user registration through the module's switch: every key beneath
// HKCU\Software\Classes, nothing beneath the machine's classes. A copy of the
// module at a path of its own is registered, so that anything written for it
// is told apart from the machine registration of the original.
#include <gtest/gtest.h>

#include "class_table.h"
#include "conformance_support.h"
#include "registered_classes.h"
#include "registry_view.h"
#include "regsvr32.h"
#include "tav/com_ptr.h"

namespace tav::conformance {
namespace {

std::wstring CopyOfModule() {
    wchar_t current[MAX_PATH] = {};
    GetCurrentDirectoryW(MAX_PATH, current);
    const std::wstring folder = std::wstring(current) + L"\\per-user";
    CreateDirectoryW(folder.c_str(), nullptr);
    const std::wstring copy = folder + L"\\TavController.dll";
    return CopyFileW(Modules().controller.c_str(), copy.c_str(), FALSE) ? copy : std::wstring();
}

class PerUserRegistration : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        copy_ = CopyOfModule();
        const RegistryKey user = UserClasses();
        // Whatever an interrupted earlier run left behind.
        for (int version = 1; version <= kClassCount; ++version) {
            for (const std::wstring& key : ClassKeys(version)) DeleteTree(user.Get(), key);
        }
        DeleteTree(user.Get(), TypeLibraryKey());
        const RegistryKey machine = MachineClasses();
        machineClasses_ = DumpClasses(machine.Get());
        machineLibrary_ = DumpTree(machine.Get(), TypeLibraryKey());
    }

    void SetUp() override { ASSERT_FALSE(copy_.empty()) << "could not copy the module for per-user registration"; }

    static std::wstring copy_;
    static std::wstring machineClasses_;
    static std::wstring machineLibrary_;
};

std::wstring PerUserRegistration::copy_;
std::wstring PerUserRegistration::machineClasses_;
std::wstring PerUserRegistration::machineLibrary_;

TEST_F(PerUserRegistration, WritesEveryClassBeneathTheUsersClasses) {
    ASSERT_EQ(0u, RunRegsvr32(copy_, RegistrationAction::Register, RegistrationScope::User))
        << "regsvr32 /s with the per-user switch failed";
    const RegistryKey user = UserClasses();
    const int values = ExpectClassesRegistered(user.Get(), copy_);
    Checked("regsvr32 /s with TAVCONTROLLER_REGISTER_PER_USER=1 exits 0 and writes all keys of the 17 classes "
            "beneath HKCU\\Software\\Classes with the registered copy's path (" +
            std::to_string(values) + " values)");
}

TEST_F(PerUserRegistration, LeavesTheMachineClassesAsTheyWere) {
    const RegistryKey machine = MachineClasses();
    EXPECT_EQ(machineClasses_, DumpClasses(machine.Get()));
    Checked("the classes' keys beneath HKLM\\Software\\Classes are unchanged (the machine registration of the "
            "original still names the original)");
}

TEST_F(PerUserRegistration, RegistersTheTypeLibraryForTheUser) {
    const RegistryKey user = UserClasses();
    const RegistryKey machine = MachineClasses();
    const bool systemWide = TAV_WINE_DIFFERENCE(
        "RegisterTypeLibForUser registers the type library system-wide, beneath "
        "HKLM\\Software\\Classes\\TypeLib, and writes nothing beneath HKCU");
    if (systemWide) {
        EXPECT_FALSE(KeyExists(user.Get(), TypeLibraryKey()));
        ExpectTypeLibraryRegistered(machine.Get(), copy_);
    } else {
        ExpectTypeLibraryRegistered(user.Get(), copy_);
        EXPECT_EQ(machineLibrary_, DumpTree(machine.Get(), TypeLibraryKey()));
    }
    Checked(std::string("the type library is registered through RegisterTypeLibForUser with the copy's path ") +
            (systemWide ? "(beneath HKLM, as Wine does it)" : "beneath HKCU, the machine's entry unchanged"));
}

TEST_F(PerUserRegistration, ClassesRootAndCreationPreferTheUsersEntries) {
    const std::wstring server = ClassKey(17) + L"\\InprocServer32";
    const std::wstring seen = ReadString(HKEY_CLASSES_ROOT, server).value_or(L"(missing)");
    bool loadedCopy = false;
    bool loadedOriginal = false;
    ASSERT_EQ(S_OK, RunInApartment(COINIT_MULTITHREADED, [&] {
        CLSID clsid = {};
        ASSERT_EQ(S_OK, CLSIDFromProgID(ProgId(17).c_str(), &clsid));
        ComPtr<IUnknown> object;
        ASSERT_EQ(S_OK, CoCreateInstance(clsid, nullptr, CLSCTX_INPROC_SERVER, IID_IUnknown,
                                         reinterpret_cast<void**>(&object)));
        loadedCopy = GetModuleHandleW(copy_.c_str()) != nullptr;
        loadedOriginal = GetModuleHandleW(Modules().controller.c_str()) != nullptr;
    }));
    const bool machineWins = TAV_WINE_DIFFERENCE(
        "HKEY_CLASSES_ROOT is HKLM\\Software\\Classes alone: Wine ignores HKCU\\Software\\Classes when it "
        "looks up classes, so the machine's entry wins");
    if (machineWins) {
        EXPECT_TRUE(SamePath(Modules().controller, seen)) << Narrow(seen);
        EXPECT_TRUE(loadedOriginal && !loadedCopy);
    } else {
        EXPECT_TRUE(SamePath(copy_, seen)) << Narrow(seen);
        EXPECT_TRUE(loadedCopy && !loadedOriginal);
    }
    Checked(machineWins ? "CoCreateInstance by ProgID still creates objects while both registrations exist; "
                          "HKEY_CLASSES_ROOT and the loaded DLL are the machine's (as Wine does it)"
                        : "HKEY_CLASSES_ROOT shows the user's InprocServer32 over the machine's, and "
                          "CoCreateInstance by ProgID loads the per-user copy");
}

TEST_F(PerUserRegistration, UnregistersFromTheUsersClassesOnly) {
    ASSERT_EQ(0u, RunRegsvr32(copy_, RegistrationAction::Unregister, RegistrationScope::User))
        << "regsvr32 /s /u with the per-user switch failed";
    const RegistryKey user = UserClasses();
    const RegistryKey machine = MachineClasses();
    const int keys = ExpectClassesAbsent(user.Get());
    EXPECT_TRUE(KeyExists(user.Get(), L"CLSID")) << "HKCU\\Software\\Classes\\CLSID is marked NoRemove";
    EXPECT_FALSE(KeyExists(user.Get(), TypeLibraryKey()));
    EXPECT_EQ(machineClasses_, DumpClasses(machine.Get()));
    if (TAV_WINE_DIFFERENCE("UnRegisterTypeLibForUser unregisters the type library system-wide; the machine "
                            "registration is restored with regsvr32 for the later steps")) {
        // The classes' keys are checked above, before the restoring run rewrites them.
        EXPECT_FALSE(KeyExists(machine.Get(), TypeLibraryKey()));
        ASSERT_EQ(0u, RunRegsvr32(Modules().controller, RegistrationAction::Register));
    }
    EXPECT_EQ(machineLibrary_, DumpTree(machine.Get(), TypeLibraryKey()));
    Checked("regsvr32 /s /u with the switch removes all " + std::to_string(keys) +
            " keys beneath HKCU\\Software\\Classes, keeps its CLSID key (NoRemove) and leaves the machine's "
            "registration as it was");
}

}  // namespace
}  // namespace tav::conformance
