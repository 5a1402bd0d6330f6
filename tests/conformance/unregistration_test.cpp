// Unregistration with regsvr32 /u, the last step of the run.
#include <gtest/gtest.h>

#include "TavSiblings.h"
#include "class_table.h"
#include "conformance_support.h"
#include "registered_classes.h"
#include "registry_view.h"
#include "regsvr32.h"

namespace tav::conformance {
namespace {

TEST(Unregistration, RemovesWhatForceRemoveMarksAndKeepsWhatNoRemoveMarks) {
    const RegistryKey machine = MachineClasses();
    ASSERT_TRUE(machine);
    const std::wstring planted = ClassKey(5) + L"\\Implemented Categories\\Planted";
    ASSERT_TRUE(WriteString(machine.Get(), planted, L"Planted", L"by the conformance run"));

    ASSERT_EQ(0u, RunRegsvr32(Modules().controller, RegistrationAction::Unregister)) << "regsvr32 /s /u failed";
    const int keys = ExpectClassesAbsent(machine.Get());
    EXPECT_TRUE(KeyExists(machine.Get(), L"CLSID")) << "CLSID is marked NoRemove";
    EXPECT_FALSE(KeyExists(machine.Get(), TypeLibraryKey())) << "the type library is still registered";
    CLSID clsid = {};
    EXPECT_EQ(CO_E_CLASSSTRING, CLSIDFromProgID(ProgId(17).c_str(), &clsid));
    Checked("regsvr32 /s /u exits 0 and removes all " + std::to_string(keys) +
            " ProgID and CLSID\\{...} keys (with a foreign subtree under a ForceRemove key), keeps CLSID (NoRemove) "
            "and unregisters the type library; CLSIDFromProgID then fails with CO_E_CLASSSTRING");
}

TEST(Unregistration, VirtualControllerIsUnregistered) {
    if (Modules().sim.empty()) {
        Pending("unregistering TavSim.dll: it is not built");
        GTEST_SKIP() << "TavSim.dll is not built";
    }
    ASSERT_EQ(0u, RunRegsvr32(Modules().sim, RegistrationAction::Unregister)) << "regsvr32 /s /u TavSim.dll failed";
    EXPECT_FALSE(KeyExists(HKEY_CLASSES_ROOT, L"CLSID\\" + GuidText(CLSID_TavComCtrl)));
    Checked("regsvr32 /s /u TavSim.dll removes the virtual controller's components");
}

}  // namespace
}  // namespace tav::conformance
