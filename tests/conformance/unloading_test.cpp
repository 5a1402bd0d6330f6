// DllCanUnloadNow as the COM runtime uses it: CoFreeUnusedLibrariesEx with no
// delay unloads the module exactly when no object, enumerator or class-object
// lock is left.
#include <gtest/gtest.h>

#include "TavController.h"
#include "class_table.h"
#include "com_client.h"
#include "conformance_support.h"
#include "tav/bstr.h"
#include "tav/variant.h"

namespace tav::conformance {
namespace {

void FreeUnusedLibraries() { CoFreeUnusedLibrariesEx(0, 0); }

TEST(Unloading, ModuleStaysLoadedWhileAnObjectLives) {
    ASSERT_EQ(S_OK, RunInApartment(COINIT_MULTITHREADED, [] {
        ComPtr<IUnknown> object;
        ASSERT_EQ(S_OK, CreateByProgId(ProgId(17), object));
        FreeUnusedLibraries();
        EXPECT_TRUE(ControllerModuleLoaded()) << "unloaded while an object lives";
        object = nullptr;
        FreeUnusedLibraries();
        EXPECT_FALSE(ControllerModuleLoaded()) << "still loaded with no object left";
        // Loaded again after the unload, the module serves as before.
        ASSERT_EQ(S_OK, CreateByProgId(ProgId(1), object));
        object = nullptr;
        FreeUnusedLibraries();
        EXPECT_FALSE(ControllerModuleLoaded());
    }));
    Checked("CoFreeUnusedLibrariesEx keeps the DLL while an object lives, unloads it after the last Release, and "
            "the DLL loads and serves again afterwards");
}

TEST(Unloading, ModuleStaysLoadedWhileTheServerIsLocked) {
    ASSERT_EQ(S_OK, RunInApartment(COINIT_MULTITHREADED, [] {
        CLSID clsid = {};
        ASSERT_EQ(S_OK, CLSIDFromProgID(ProgId(8).c_str(), &clsid));
        ComPtr<IClassFactory> factory;
        ASSERT_EQ(S_OK, CoGetClassObject(clsid, CLSCTX_INPROC_SERVER, nullptr, IID_IClassFactory,
                                         reinterpret_cast<void**>(&factory)));
        EXPECT_EQ(S_OK, factory->LockServer(TRUE));
        factory = nullptr;
        FreeUnusedLibraries();
        EXPECT_TRUE(ControllerModuleLoaded()) << "unloaded while locked";
        ASSERT_EQ(S_OK, CoGetClassObject(clsid, CLSCTX_INPROC_SERVER, nullptr, IID_IClassFactory,
                                         reinterpret_cast<void**>(&factory)));
        EXPECT_EQ(S_OK, factory->LockServer(FALSE));
        factory = nullptr;
        FreeUnusedLibraries();
        EXPECT_FALSE(ControllerModuleLoaded()) << "still loaded after the unlock";
    }));
    Checked("IClassFactory::LockServer(TRUE) keeps the DLL loaded without any object; LockServer(FALSE) lets it go");
}

TEST(Unloading, ModuleStaysLoadedWhileAnEnumeratorOutlivesItsController) {
    if (Modules().sim.empty()) {
        Pending("an enumerator keeping the DLL loaded: TavSim.dll is not built, so Init cannot run and no "
                "enumerator can be handed out");
        GTEST_SKIP() << "TavSim.dll is not built";
    }
    ASSERT_EQ(S_OK, RunInApartment(COINIT_MULTITHREADED, [] {
        ComPtr<IEnumAutoCondition> conditions;
        {
            ComPtr<IUnknown> object;
            ASSERT_EQ(S_OK, CreateByProgId(ProgId(17), object));
            ComPtr<ITavController> controller;
            ASSERT_EQ(S_OK, object.As(controller));
            Bstr url(L"/conformance");
            ASSERT_EQ(S_OK, controller->Init(url.Get())) << "Init against the virtual controller";
            ComPtr<ITavPanel> panel;
            ASSERT_EQ(S_OK, object.As(panel));
            Variant reply;
            ASSERT_EQ(S_OK, reply.SetString(L"-auto_ch 1 -noelts 2\tBlk;1;7\tDeact;0;9\t"));
            LONG autoChange = 0;
            ASSERT_EQ(S_OK, panel->UnpackAutoConditions(reply.Get(), &autoChange, &conditions));
            EXPECT_EQ(1, autoChange);
        }
        FreeUnusedLibraries();
        ASSERT_TRUE(ControllerModuleLoaded()) << "unloaded while an enumerator lives";
        TavAutoCondition elements[3] = {};
        ULONG fetched = 0;
        EXPECT_EQ(S_FALSE, conditions->RemNext(3, elements, &fetched));
        EXPECT_EQ(2u, fetched);
        EXPECT_EQ(7u, elements[0].ConditionID);
        EXPECT_EQ(9u, elements[1].ConditionID);
        conditions = nullptr;
        FreeUnusedLibraries();
        EXPECT_FALSE(ControllerModuleLoaded()) << "still loaded after the enumerator's last Release";
    }));
    Checked("an IEnumAutoCondition from ITavPanel::UnpackAutoConditions (after Init against TavSim.dll) keeps the "
            "DLL loaded after its controller is released, still hands out its elements, and the DLL unloads "
            "after its last Release");
}

}  // namespace
}  // namespace tav::conformance
