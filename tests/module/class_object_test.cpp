// The exported class-object functions, the class factory and the module's
// lock count.
#include <gtest/gtest.h>

#include "core/enumerators.h"
#include "core/module_lock.h"
#include "module/class_objects.h"
#include "module_test_support.h"
#include "tav/com_scope.h"

namespace tav::test {
namespace {

class ClassObjects : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(DllCanUnloadNow(), S_OK) << "an earlier test left a lock behind"; }
    void TearDown() override { EXPECT_EQ(DllCanUnloadNow(), S_OK) << "this test left a lock behind"; }
};

TEST_F(ClassObjects, GetClassObjectRefusesBadArguments) {
    EXPECT_EQ(DllGetClassObject(CLSID_TavController, IID_IClassFactory, nullptr), E_POINTER);

    for (const GUID* unknown : {&GUID_NULL, &IID_ITavController, &LIBID_TAVCONTROLLERLib}) {
        void* raw = reinterpret_cast<void*>(1);
        EXPECT_EQ(DllGetClassObject(*unknown, IID_IClassFactory, &raw), CLASS_E_CLASSNOTAVAILABLE);
        EXPECT_EQ(raw, nullptr);
    }

    void* raw = reinterpret_cast<void*>(1);
    EXPECT_EQ(DllGetClassObject(CLSID_TavController, IID_ITavController, &raw), E_NOINTERFACE);
    EXPECT_EQ(raw, nullptr);
}

TEST_F(ClassObjects, OneClassObjectPerClass) {
    ComPtr<IClassFactory> first[kClasses.size()];
    for (size_t i = 0; i < kClasses.size(); ++i) {
        ASSERT_EQ(ClassObjectFor(kClasses[i], first[i]), S_OK);
        for (size_t j = 0; j < i; ++j) {
            EXPECT_NE(first[i].Get(), first[j].Get()) << kClasses[i].name << " shares " << kClasses[j].name;
        }
        ComPtr<IUnknown> again;
        ASSERT_EQ(DllGetClassObject(*kClasses[i].clsid, IID_IUnknown, Out(again)), S_OK);
        EXPECT_EQ(static_cast<IUnknown*>(first[i].Get()), again.Get()) << kClasses[i].name;
    }
}

TEST_F(ClassObjects, CreateInstanceRefusesBadArgumentsWithoutLeaking) {
    ComPtr<IClassFactory> factory;
    ASSERT_EQ(ClassObjectFor(kClasses[0], factory), S_OK);
    EXPECT_EQ(factory->CreateInstance(nullptr, IID_ITavController, nullptr), E_POINTER);

    void* raw = reinterpret_cast<void*>(1);
    EXPECT_EQ(factory->CreateInstance(nullptr, IID_ITavController2, &raw), E_NOINTERFACE);
    EXPECT_EQ(raw, nullptr);
    EXPECT_EQ(ModuleLock::Count(), 1) << "only the held class object may remain";
}

TEST_F(ClassObjects, UnloadIsRefusedWhileAnythingLives) {
    ComPtr<IClassFactory> factory;
    ASSERT_EQ(ClassObjectFor(kClasses[16], factory), S_OK);
    EXPECT_EQ(DllCanUnloadNow(), S_FALSE) << "a held class object";

    ComPtr<ITavController> object;
    ASSERT_EQ(factory->CreateInstance(nullptr, IID_ITavController, Out(object)), S_OK);
    factory.Reset();
    EXPECT_EQ(DllCanUnloadNow(), S_FALSE) << "a live object";
    object.Reset();
    EXPECT_EQ(DllCanUnloadNow(), S_OK);

    ASSERT_EQ(ClassObjectFor(kClasses[16], factory), S_OK);
    EXPECT_EQ(factory->LockServer(TRUE), S_OK);
    EXPECT_EQ(factory->LockServer(TRUE), S_OK);
    factory.Reset();
    EXPECT_EQ(DllCanUnloadNow(), S_FALSE) << "two server locks";
    for (const HRESULT afterUnlock : {S_FALSE, S_OK}) {
        ASSERT_EQ(ClassObjectFor(kClasses[16], factory), S_OK);
        EXPECT_EQ(factory->LockServer(FALSE), S_OK);
        factory.Reset();
        EXPECT_EQ(DllCanUnloadNow(), afterUnlock);
    }
}

TEST_F(ClassObjects, UnloadIsRefusedWhileAnEnumeratorOutlivesItsController) {
    ComPtr<IClassFactory> factory;
    ASSERT_EQ(ClassObjectFor(kClasses[16], factory), S_OK);
    ComPtr<IUnknown> controller;
    ASSERT_EQ(factory->CreateInstance(nullptr, IID_IUnknown, Out(controller)), S_OK);
    factory.Reset();

    TavAutoCondition conditions[2] = {};
    ComPtr<IEnumAutoCondition> enumerator;
    ASSERT_EQ(MakeEnumerator<AutoConditionTraits>(conditions, conditions + 2, controller.Get(), EnumOwnership::Copy,
                                                  &enumerator),
              S_OK);
    controller.Reset();
    EXPECT_EQ(DllCanUnloadNow(), S_FALSE);
    enumerator.Reset();
    EXPECT_EQ(DllCanUnloadNow(), S_OK);
}

TEST_F(ClassObjects, ReleasedClassObjectsAreMadeAgainAndSurviveTheirHolders) {
    ComPtr<IClassFactory> held;
    ASSERT_EQ(ClassObjectFor(kClasses[2], held), S_OK);
    ReleaseClassObjects();

    ComPtr<IClassFactory> fresh;
    ASSERT_EQ(ClassObjectFor(kClasses[2], fresh), S_OK);
    ComPtr<ITavController3> object;
    EXPECT_EQ(held->CreateInstance(nullptr, IID_ITavController3, Out(object)), S_OK)
        << "a class object dropped from the table still works for its holder";
    object.Reset();
    held.Reset();
    EXPECT_EQ(DllCanUnloadNow(), S_FALSE);
    fresh.Reset();
}

TEST_F(ClassObjects, AllocationFailureGivesOutOfMemory) {
    ReleaseClassObjects();
    if (!TavFailAllocationAt(1)) {
        GTEST_SKIP() << "allocation failures cannot be injected here";
    }
    void* raw = reinterpret_cast<void*>(1);
    const HRESULT hr = DllGetClassObject(CLSID_TavController5, IID_IClassFactory, &raw);
    TavFailAllocationAt(0);
    EXPECT_EQ(hr, E_OUTOFMEMORY);
    EXPECT_EQ(raw, nullptr);

    ComPtr<IClassFactory> factory;
    EXPECT_EQ(ClassObjectFor(kClasses[4], factory), S_OK) << "the failure is not cached";
}

TEST_F(ClassObjects, RegisteredClassObjectsServeCoCreateInstance) {
    const ComScope com;
    ASSERT_TRUE(com);
    ASSERT_EQ(RegisterClassObjects(CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE), S_OK);
    EXPECT_EQ(RegisterClassObjects(CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE), S_OK) << "a second call is harmless";
    {
        ComPtr<ITavControllerTime> object;
        EXPECT_EQ(CoCreateInstance(CLSID_TavController13, nullptr, CLSCTX_INPROC_SERVER, IID_ITavControllerTime,
                                   Out(object)),
                  S_OK);
        EXPECT_EQ(DllCanUnloadNow(), S_FALSE);
    }
    RevokeClassObjects();
}

}  // namespace
}  // namespace tav::test
