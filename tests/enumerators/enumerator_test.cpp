#include <cstdint>
#include <limits>

#include "core/module_lock.h"
#include "enum_test_util.h"

namespace tav::test {
namespace {

using Texts = std::vector<std::string>;

TEST(Enumerator, RemNextCountsAndResults) {
    const Fetched fromEmpty = Fetch(MakeStrings({}).get(), 1);
    EXPECT_EQ(S_FALSE, fromEmpty.hr);
    EXPECT_TRUE(fromEmpty.texts.empty());
    Ref<ITavEnumBSTR> strings = MakeStrings({"a", "b", "c"});
    EXPECT_EQ(S_OK, Fetch(strings.get(), 0).hr);
    Fetched five = Fetch(strings.get(), 5);
    EXPECT_EQ(S_FALSE, five.hr);
    EXPECT_EQ((Texts{"a", "b", "c"}), five.texts);
    EXPECT_EQ(S_FALSE, Fetch(strings.get(), 1).hr);

    BSTR one[2] = {};
    EXPECT_EQ(E_POINTER, strings->RemNext(1, nullptr, nullptr));
    EXPECT_EQ(E_POINTER, strings->RemNext(2, one, nullptr));
    strings->Reset();
    EXPECT_EQ(S_OK, strings->RemNext(1, one, nullptr));
    EXPECT_EQ("a", Narrow(one[0]));
    SysFreeString(one[0]);
}

TEST(Enumerator, SkipAndResetMoveThePosition) {
    Ref<ITavEnumBSTR> strings = MakeStrings({"a", "b", "c"});
    EXPECT_EQ(S_OK, strings->Skip(2));
    EXPECT_EQ((Texts{"c"}), Fetch(strings.get()).texts);
    EXPECT_EQ(S_FALSE, strings->Skip(std::numeric_limits<ULONG>::max()));
    EXPECT_EQ(0u, Fetch(strings.get()).texts.size());
    strings->Reset();
    EXPECT_EQ(S_OK, strings->Skip(3));
    strings->Reset();
    EXPECT_EQ((Texts{"a", "b", "c"}), Fetch(strings.get()).texts);
}

TEST(Enumerator, SortOrdersTheWholeListAndLeavesThePosition) {
    Ref<ITavEnumBSTR> strings = MakeStrings({"b", "a", "c"});
    EXPECT_EQ((Texts{"b"}), Fetch(strings.get(), 1).texts);
    EXPECT_EQ(S_OK, strings->Sort(4));
    EXPECT_EQ((Texts{"b", "a"}), Fetch(strings.get()).texts);
    strings->Reset();
    EXPECT_EQ((Texts{"c", "b", "a"}), Fetch(strings.get()).texts);
}

TEST(Enumerator, FilterStepsOverStringsThatDoNotPass) {
    Ref<ITavEnumBSTR> strings = MakeStrings({"12", "a1", "", "x"});
    EXPECT_EQ(S_OK, strings->Filter(2));
    const Fetched passed = Fetch(strings.get(), 3);
    EXPECT_EQ(S_FALSE, passed.hr);
    EXPECT_EQ((Texts{"12", ""}), passed.texts);
    strings->Reset();
    EXPECT_EQ(S_OK, strings->Skip(2));  // Skip counts filtered-out strings too
    EXPECT_EQ((Texts{""}), Fetch(strings.get()).texts);
    EXPECT_EQ(S_OK, strings->UnFilter());
    strings->Reset();
    EXPECT_EQ((Texts{"12", "a1", "", "x"}), Fetch(strings.get()).texts);
}

TEST(Enumerator, RecordsKeepTheirOrderAndGetTheirOwnStrings) {
    TavStorageDevice* devices = AllocateArray<TavStorageDevice>(2);
    devices[0] = {SysAllocString(OLESTR("/hd0a")), TavStorageDeviceType{}, 1, 0};
    devices[1] = {SysAllocString(OLESTR("/bd0")), TavStorageDeviceType{}, 0, 1};
    IEnumStorageDevices* raw = nullptr;
    ASSERT_EQ(S_OK, MakeEnumerator<StorageDeviceTraits>(devices, devices + 2, nullptr, EnumOwnership::Take, &raw));
    Ref<IEnumStorageDevices> list(raw);
    EXPECT_EQ(S_OK, list->Sort(1));
    EXPECT_EQ(S_OK, list->Filter(2));
    TavStorageDevice out[2] = {};
    ULONG got = 0;
    ASSERT_EQ(S_OK, list->RemNext(2, out, &got));
    EXPECT_EQ("/hd0a", Narrow(out[0].deviceName));
    EXPECT_NE(devices[0].deviceName, out[0].deviceName);
    EXPECT_EQ(1, out[1].bReadOnly);
    StorageDeviceTraits::Free(out[0]);
    StorageDeviceTraits::Free(out[1]);
}

TEST(Enumerator, CloneCopiesFromThePositionWithTheFilterOff) {
    const LONG locksBefore = ModuleLock::Count();
    {
        Ref<ITavEnumBSTR> source = MakeStrings({"1", "b", "2", "3"});
        source->Filter(2);
        EXPECT_EQ((Texts{"1"}), Fetch(source.get(), 1).texts);
        ITavEnumBSTR* raw = nullptr;
        ASSERT_EQ(S_OK, source->Clone(&raw));
        Ref<ITavEnumBSTR> clone(raw);
        EXPECT_EQ(locksBefore + 2, ModuleLock::Count());
        EXPECT_EQ((Texts{"b"}), Fetch(clone.get(), 1).texts);
        EXPECT_EQ((Texts{"2"}), Fetch(source.get(), 1).texts);
        clone->Sort(4);
        source.reset();  // the clone reads its own copy
        clone->Reset();
        EXPECT_EQ((Texts{"b", "3", "2", "1"}), Fetch(clone.get()).texts);
        EXPECT_EQ(E_POINTER, clone->Clone(nullptr));
    }
    EXPECT_EQ(locksBefore, ModuleLock::Count());
}

struct CountedOwner : IUnknown {
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references; }
    ULONG STDMETHODCALLTYPE Release() override { return --references; }
    ULONG references = 0;
};

TEST(Enumerator, BorrowedArrayStaysWithItsOwnerAndClonesHoldThatOwner) {
    CountedOwner owner;
    TavPSCUnit units[2] = {{1, 2, S_OK}, {3, 4, E_FAIL}};
    IEnumTavPSCUnits* raw = nullptr;
    ASSERT_EQ(S_OK, MakeEnumerator<PscUnitTraits>(units, units + 2, &owner, EnumOwnership::Borrow, &raw));
    Ref<IEnumTavPSCUnits> borrowed(raw);
    IEnumTavPSCUnits* clone = nullptr;
    ASSERT_EQ(S_OK, borrowed->Clone(&clone));
    EXPECT_EQ(2u, owner.references);
    clone->Release();
    borrowed.reset();
    EXPECT_EQ(0u, owner.references);
}

TEST(Enumerator, CreationStepsReportTheirFailures) {
    BstrEnum* empty = nullptr;
    ASSERT_EQ(S_OK, BstrEnum::CreateInstance(&empty));
    BSTR slot = nullptr;
    ULONG got = 0;
    ITavEnumBSTR* none = nullptr;
    EXPECT_EQ(E_FAIL, empty->RemNext(1, &slot, &got));
    EXPECT_EQ(E_FAIL, empty->Clone(&none));
    EXPECT_EQ(E_INVALIDARG, empty->Init(nullptr, nullptr, nullptr, EnumOwnership::Copy));
    BSTR* array = AllocateArray<BSTR>(1);
    array[0] = SysAllocString(OLESTR("kept"));
    ASSERT_EQ(S_OK, empty->Init(array, array + 1, nullptr, EnumOwnership::Take));
    EXPECT_EQ(E_UNEXPECTED, empty->Init(array, array + 1, nullptr, EnumOwnership::Copy));
    empty->Discard();

    EnumStep step = EnumStep::Create;
    EXPECT_EQ(E_INVALIDARG, MakeEnumerator<BstrTraits>(nullptr, nullptr, nullptr, EnumOwnership::Take, &none, &step));
    EXPECT_EQ(EnumStep::Init, step);
    EXPECT_EQ(nullptr, none);
}

TEST(Enumerator, AnswersItsOwnInterfaceAndIUnknownOnly) {
    Ref<ITavEnumBSTR> strings = MakeStrings({});
    void* out = nullptr;
    EXPECT_EQ(S_OK, strings->QueryInterface(IID_IUnknown, &out));
    static_cast<IUnknown*>(out)->Release();
    EXPECT_EQ(E_NOINTERFACE, strings->QueryInterface(IID_IEnumSlots, &out));
    EXPECT_EQ(nullptr, out);
    EXPECT_EQ(E_POINTER, strings->QueryInterface(IID_ITavEnumBSTR, nullptr));
}

TEST(Enumerator, FailedStringCopyFreesWhatTheCallHandedOut) {
    TavIPCSlot* slots = AllocateArray<TavIPCSlot>(3);
    for (size_t i = 0; i < 3; ++i) {
        slots[i].slotName = SysAllocString(OLESTR("slot"));
        slots[i].slotId = static_cast<SHORT>(i);
    }
    IEnumSlots* raw = nullptr;
    ASSERT_EQ(S_OK, MakeEnumerator<SlotTraits>(slots, slots + 3, nullptr, EnumOwnership::Take, &raw));
    Ref<IEnumSlots> list(raw);
    TavIPCSlot out[3] = {};
    ULONG got = 0;
    HRESULT hr = S_OK;
    const long failures = ForEachAllocationFailure(
        [&] {
            list->Reset();
            got = 99;
            hr = list->RemNext(3, out, &got);
        },
        [&] {
            EXPECT_EQ(E_OUTOFMEMORY, hr);
            EXPECT_EQ(0u, got);
            for (const TavIPCSlot& slot : out) EXPECT_EQ(nullptr, slot.slotName);
        });
    if (failures < 0) GTEST_SKIP() << "allocation failures cannot be injected on this platform";
    EXPECT_EQ(3, failures);
    EXPECT_EQ(S_OK, hr);
    for (TavIPCSlot& slot : out) SlotTraits::Free(slot);

    // The position stays past what was handed out, at the string that failed.
    Ref<ITavEnumBSTR> strings = MakeStrings({"a", "b", "c"});
    BSTR texts[3] = {};
    TavFailAllocationAt(2);
    EXPECT_EQ(E_OUTOFMEMORY, strings->RemNext(3, texts, &got));
    EXPECT_EQ((Texts{"b", "c"}), Fetch(strings.get()).texts);
}

TEST(Enumerator, FailedCloneLeavesNothingBehind) {
    Ref<ITavEnumBSTR> strings = MakeStrings({"a", "b", "c"});
    ITavEnumBSTR* clone = nullptr;
    HRESULT hr = S_OK;
    const LONG locksBefore = ModuleLock::Count();
    const long failures = ForEachAllocationFailure([&] { hr = strings->Clone(&clone); },
                                                   [&] {
                                                       EXPECT_EQ(E_OUTOFMEMORY, hr);
                                                       EXPECT_EQ(nullptr, clone);
                                                       EXPECT_EQ(locksBefore, ModuleLock::Count());
                                                   });
    if (failures < 0) GTEST_SKIP() << "allocation failures cannot be injected on this platform";
    EXPECT_EQ(4, failures);  // the array and three strings
    ASSERT_EQ(S_OK, hr);
    clone->Release();
}

template <class Traits>
class EveryEnumerator : public ::testing::Test {};
using AllTraits = ::testing::Types<AutoConditionTraits, AutoCondition2Traits, StorageDeviceTraits,
                                   StorageDevice2Traits, PscUnitTraits, SlotTraits, BstrTraits>;
TYPED_TEST_SUITE(EveryEnumerator, AllTraits);

TYPED_TEST(EveryEnumerator, HandsOutItsElementsThroughItsInterface) {
    using Element = typename TypeParam::Element;
    using Interface = typename TypeParam::Interface;
    Element* array = AllocateArray<Element>(2);
    Interface* raw = nullptr;
    ASSERT_EQ(S_OK, MakeEnumerator<TypeParam>(array, array + 2, nullptr, EnumOwnership::Take, &raw));
    Ref<Interface> list(raw);
    void* same = nullptr;
    ASSERT_EQ(S_OK, list->QueryInterface(__uuidof(Interface), &same));
    static_cast<Interface*>(same)->Release();
    Element out[2] = {};
    ULONG got = 0;
    EXPECT_EQ(S_OK, list->Skip(1));
    EXPECT_EQ(S_FALSE, list->RemNext(2, out, &got));
    EXPECT_EQ(1u, got);
    TypeParam::Free(out[0]);
}

TEST(EnumeratorArray, RefusesSizesThatWouldWrap) {
    EXPECT_EQ(nullptr, AllocateArray<TavIPCSlot>(SIZE_MAX / sizeof(TavIPCSlot) + 1));
    TavIPCSlot* none = AllocateArray<TavIPCSlot>(0);
    EXPECT_NE(nullptr, none);
    TavMemFree(none);
}

}  // namespace
}  // namespace tav::test
