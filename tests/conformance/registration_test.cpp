// Machine-wide registration with the system's regsvr32, read back through the
// registry API. Leaves the module (and the virtual controller) registered for
// the steps that create objects and read the type library.
#include <algorithm>

#include <gtest/gtest.h>

#include "TavSiblings.h"
#include "class_table.h"
#include "conformance_support.h"
#include "registered_classes.h"
#include "registry_view.h"
#include "regsvr32.h"

namespace tav::conformance {
namespace {

constexpr wchar_t kLeftover[] = L"\\LeftoverOfAnOlderRelease";

std::wstring MachineRegistration(HKEY classes) { return DumpClasses(classes) + DumpTree(classes, TypeLibraryKey()); }

TEST(Registration, Regsvr32WritesEveryClassAndTheTypeLibrary) {
    ASSERT_EQ(0u, RunRegsvr32(Modules().controller, RegistrationAction::Register)) << "regsvr32 /s failed";
    const RegistryKey machine = MachineClasses();
    ASSERT_TRUE(machine);
    const int values = ExpectClassesRegistered(machine.Get(), Modules().controller);
    const int library = ExpectTypeLibraryRegistered(machine.Get(), Modules().controller);
    Checked("regsvr32 /s exits 0; HKLM\\Software\\Classes holds, for each of the 17 classes, both ProgIDs with "
            "description, CLSID and CurVer, and CLSID\\{...} with description, ProgID, VersionIndependentProgID, "
            "InprocServer32 = the DLL's path, ThreadingModel = Both and TypeLib (" +
            std::to_string(values) + " values)");
    Checked("TypeLib\\{LIBID}\\1.0 with its description and 0\\win64 = the DLL's path (" + std::to_string(library) +
            " values)");
}

TEST(Registration, ThirdClassKeepsTheSecondClassDescriptionOnItsProgId) {
    const RegistryKey machine = MachineClasses();
    EXPECT_EQ(L"TavController2 Class", ReadString(machine.Get(), L"TavController.TavController3").value_or(L""));
    EXPECT_EQ(L"TavController3 Class", ReadString(machine.Get(), L"TavController.TavController3.1").value_or(L""));
    EXPECT_EQ(L"TavController3 Class", ReadString(machine.Get(), ClassKey(3)).value_or(L""));
    Checked("\"TavController.TavController3\" says \"TavController2 Class\"; its versioned ProgID and CLSID key say "
            "\"TavController3 Class\"");
}

TEST(Registration, ClassesRootShowsTheMachineRegistration) {
    const RegistryKey machine = MachineClasses();
    EXPECT_EQ(MachineRegistration(machine.Get()), MachineRegistration(HKEY_CLASSES_ROOT));
    Checked("HKEY_CLASSES_ROOT shows the same keys and values as HKLM\\Software\\Classes");
}

TEST(Registration, RegisteringAgainGivesTheSameRegistryAndClearsForceRemoveKeys) {
    const RegistryKey machine = MachineClasses();
    const std::wstring first = MachineRegistration(machine.Get());
    ASSERT_TRUE(WriteString(machine.Get(), ClassKey(1) + kLeftover, L"Planted", L"by the conformance run"));

    ASSERT_EQ(0u, RunRegsvr32(Modules().controller, RegistrationAction::Register)) << "second regsvr32 /s failed";
    EXPECT_FALSE(KeyExists(machine.Get(), ClassKey(1) + kLeftover))
        << "a CLSID key marked ForceRemove keeps a foreign subkey over registration";
    const std::wstring second = MachineRegistration(machine.Get());
    EXPECT_EQ(first, second);
    Checked("a second regsvr32 /s leaves the registry byte for byte as the first (" +
            std::to_string(std::count(first.begin(), first.end(), L'\n')) +
            " lines of keys and values compared) and deletes a foreign subkey under a ForceRemove CLSID key");
}

TEST(Registration, VirtualControllerIsRegisteredForTheLaterSteps) {
    if (Modules().sim.empty()) {
        Pending("registering TavSim.dll: it is not built");
        GTEST_SKIP() << "TavSim.dll is not built";
    }
    ASSERT_EQ(0u, RunRegsvr32(Modules().sim, RegistrationAction::Register)) << "regsvr32 /s TavSim.dll failed";
    for (const CLSID* clsid : {&CLSID_TavComCtrl, &CLSID_TavUser}) {
        const std::wstring server = L"CLSID\\" + GuidText(*clsid) + L"\\InprocServer32";
        EXPECT_TRUE(SamePath(Modules().sim, ReadString(HKEY_CLASSES_ROOT, server).value_or(L"")))
            << Narrow(server);
    }
    Checked("regsvr32 /s TavSim.dll registers the virtual controller's command and user components");
}

}  // namespace
}  // namespace tav::conformance
