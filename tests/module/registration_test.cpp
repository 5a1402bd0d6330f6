// DllRegisterServer and DllUnregisterServer against a private registry.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <string_view>

#include "module/server_registration.h"
#include "module_test_support.h"
#include "registry_sandbox.h"

namespace tav::test {
namespace {

// What one class writes, as TakeSnapshot reports it.
RegistrySnapshot ExpectedEntries(const ClassInfo& info, const std::string& module) {
    const std::string name = info.name;
    const std::string clsid = GuidText(*info.clsid);
    const std::string progId = "TavController." + name + ".1";
    const std::string independentProgId = "TavController." + name;
    const std::string description = name + " Class";
    const std::string independentDescription = info.version == 3 ? "TavController2 Class" : description;
    const std::string key = "CLSID\\" + clsid;
    return {
        progId,
        progId + "|@=" + description,
        progId + "\\CLSID",
        progId + "\\CLSID|@=" + clsid,
        independentProgId,
        independentProgId + "|@=" + independentDescription,
        independentProgId + "\\CLSID",
        independentProgId + "\\CLSID|@=" + clsid,
        independentProgId + "\\CurVer",
        independentProgId + "\\CurVer|@=" + progId,
        key,
        key + "|@=" + description,
        key + "\\ProgID",
        key + "\\ProgID|@=" + progId,
        key + "\\VersionIndependentProgID",
        key + "\\VersionIndependentProgID|@=" + independentProgId,
        key + "\\InprocServer32",
        key + "\\InprocServer32|@=" + module,
        key + "\\InprocServer32|ThreadingModel=Both",
        key + "\\TypeLib",
        key + "\\TypeLib|@=" + GuidText(LIBID_TAVCONTROLLERLib),
    };
}

RegistrySnapshot ExpectedRegistration() {
    RegistrySnapshot expected = {"CLSID"};
    for (const ClassInfo& info : kClasses) {
        const RegistrySnapshot entries = ExpectedEntries(info, ExecutablePath());
        expected.insert(entries.begin(), entries.end());
    }
    return expected;
}

// The type library's own keys (Windows only) are checked on their own.
RegistrySnapshot WithoutTypeLibraryKeys(RegistrySnapshot snapshot) {
    auto startsWith = [](const std::string& entry, std::string_view prefix) {
        return entry.size() >= prefix.size() &&
               std::equal(prefix.begin(), prefix.end(), entry.begin(),
                          [](char a, char b) { return std::tolower(a) == std::tolower(b); });
    };
    std::erase_if(snapshot, [&](const std::string& entry) {
        return startsWith(entry, "TypeLib") || startsWith(entry, "Interface");
    });
    return snapshot;
}

RegistrySnapshot MachineClasses() { return WithoutTypeLibraryKeys(TakeSnapshot(HKEY_LOCAL_MACHINE, kClassesKey)); }
RegistrySnapshot UserClasses() { return WithoutTypeLibraryKeys(TakeSnapshot(HKEY_CURRENT_USER, kClassesKey)); }

#ifdef _WIN32
bool TypeLibraryRegistered(HKEY root) {
    return !TakeSnapshot(root, kClassesKey + "\\TypeLib\\" + GuidText(LIBID_TAVCONTROLLERLib)).empty();
}
#endif

// Each registration runs the seventeen-class script seventeen times, so the
// cases below share registrations where they can.
class Registration : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_TRUE(sandbox_.Ready()); }

    RegistrySandbox sandbox_;
    PerUserSwitch machine_{nullptr};
};

TEST_F(Registration, MachineRegistrationWritesEveryClassOverForeignKeysAndTakesItBack) {
    const std::string clsidKey = "CLSID\\" + GuidText(CLSID_TavController7);
    WriteString(HKEY_CLASSES_ROOT, clsidKey + "\\Stale", "", "left by an old version");
    WriteString(HKEY_CLASSES_ROOT, clsidKey, "Extra", "stale value");
    WriteString(HKEY_CLASSES_ROOT, "CLSID\\{00000000-1111-2222-3333-444444444444}", "", "another server");
    WriteString(HKEY_CLASSES_ROOT, "TavController.TavController12.1\\Foreign", "", "another tool");
    RegistrySnapshot untouched = MachineClasses();
    std::erase_if(untouched, [&](const std::string& entry) { return entry.rfind(clsidKey, 0) == 0; });

    ASSERT_EQ(DllRegisterServer(), S_OK);
    RegistrySnapshot expected = ExpectedRegistration();
    expected.insert(untouched.begin(), untouched.end());
    EXPECT_EQ(MachineClasses(), expected) << "ForceRemove replaces the class key whole, other keys are kept";
    EXPECT_EQ(ReadString(HKEY_CLASSES_ROOT, "TavController.TavController3", ""), "TavController2 Class");
    EXPECT_EQ(ReadString(HKEY_CLASSES_ROOT, "TavController.TavController3.1", ""), "TavController3 Class");
    EXPECT_TRUE(UserClasses().empty());
#ifdef _WIN32
    EXPECT_TRUE(TypeLibraryRegistered(HKEY_LOCAL_MACHINE));
#endif

    const RegistrySnapshot first = TakeSnapshot(HKEY_LOCAL_MACHINE, kClassesKey);
    ASSERT_EQ(DllRegisterServer(), S_OK);
    EXPECT_EQ(TakeSnapshot(HKEY_LOCAL_MACHINE, kClassesKey), first) << "registering again changes nothing";

    ASSERT_EQ(DllUnregisterServer(), S_OK);
    EXPECT_EQ(MachineClasses(), untouched)
        << "CLSID is NoRemove and a key holding foreign subkeys stays, without what the script wrote";
#ifdef _WIN32
    EXPECT_FALSE(TypeLibraryRegistered(HKEY_LOCAL_MACHINE));
#endif
    EXPECT_EQ(DllUnregisterServer(), S_OK) << "unregistering what is not there is no error";
}

TEST_F(Registration, PerUserRegistrationStaysBeneathTheUsersClasses) {
    PerUserSwitch perUser("1");
    ASSERT_EQ(DllRegisterServer(), S_OK);
    EXPECT_EQ(UserClasses(), ExpectedRegistration());
    EXPECT_TRUE(MachineClasses().empty());

    ASSERT_EQ(DllUnregisterServer(), S_OK);
    EXPECT_EQ(UserClasses(), RegistrySnapshot{"CLSID"});
    EXPECT_TRUE(MachineClasses().empty());
}

TEST(RegistrationScope, OnlyTheValueOneSelectsPerUser) {
    const struct {
        const char* value;
        RegistrationScope scope;
    } cases[] = {
        {nullptr, RegistrationScope::Machine}, {"1", RegistrationScope::User},
        {"0", RegistrationScope::Machine},     {"", RegistrationScope::Machine},
        {"yes", RegistrationScope::Machine},   {"11", RegistrationScope::Machine},
    };
    for (const auto& c : cases) {
        PerUserSwitch setting(c.value);
        EXPECT_EQ(RequestedRegistrationScope(), c.scope) << (c.value != nullptr ? c.value : "(unset)");
    }
}

}  // namespace
}  // namespace tav::test
