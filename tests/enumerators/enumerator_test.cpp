#include <cstdint>
#include <limits>

#include "core/module_lock.h"
#include "enum_test_util.h"

namespace tav::test {
namespace {

TEST(Enumerator, RemNextSkipAndResetFollowThePosition) {
    EXPECT_EQ((Fetched{S_FALSE, {}}), Fetch(MakeStrings({}), 1));
    ComPtr<ITavEnumBSTR> strings = MakeStrings({"a", "b", "c"});
    EXPECT_EQ((Fetched{S_OK, {}}), Fetch(strings, 0));
    EXPECT_EQ((Fetched{S_FALSE, {"a", "b", "c"}}), Fetch(strings, 5));
    EXPECT_EQ((Fetched{S_FALSE, {}}), Fetch(strings, 1));

    BSTR one[2] = {};
    EXPECT_EQ(E_POINTER, strings->RemNext(0, nullptr, nullptr));
    EXPECT_EQ(E_POINTER, strings->RemNext(2, one, nullptr));
    strings->Reset();
    EXPECT_EQ(S_OK, strings->RemNext(1, one, nullptr));
    EXPECT_EQ("a", Narrow(one[0]));
    SysFreeString(one[0]);

    EXPECT_EQ(S_OK, strings->Skip(1));
    EXPECT_EQ((Fetched{S_OK, {"c"}}), Fetch(strings, 1));
    strings->Reset();
    EXPECT_EQ(S_FALSE, strings->Skip(std::numeric_limits<ULONG>::max()));
    EXPECT_EQ((Fetched{S_FALSE, {}}), Fetch(strings, 1));
    strings->Reset();
    EXPECT_EQ(S_OK, strings->Skip(3));
}

TEST(Enumerator, SortOrdersTheWholeListAndLeavesThePosition) {
    ComPtr<ITavEnumBSTR> strings = MakeStrings({"b", "a", "c"});
    EXPECT_EQ((Texts{"b"}), Fetch(strings, 1).texts);
    EXPECT_EQ(S_OK, strings->Sort(4));
    EXPECT_EQ((Texts{"b", "a"}), Fetch(strings).texts);
    strings->Reset();
    EXPECT_EQ((Texts{"c", "b", "a"}), Fetch(strings).texts);
}

TEST(Enumerator, FilterStepsOverStringsThatDoNotPass) {
    ComPtr<ITavEnumBSTR> strings = MakeStrings({"12", "a1", "", "x"});
    EXPECT_EQ(S_OK, strings->Filter(2));
    EXPECT_EQ((Fetched{S_FALSE, {"12", ""}}), Fetch(strings, 3));
    strings->Reset();
    EXPECT_EQ(S_OK, strings->Skip(2));  // Skip counts filtered-out strings too
    EXPECT_EQ((Texts{""}), Fetch(strings).texts);
    EXPECT_EQ(S_OK, strings->UnFilter());
    strings->Reset();
    EXPECT_EQ((Texts{"12", "a1", "", "x"}), Fetch(strings).texts);
}

TEST(Enumerator, CloneCopiesFromThePositionWithTheFilterOff) {
    const LONG locksBefore = ModuleLock::Count();
    {
        ComPtr<ITavEnumBSTR> source = MakeStrings({"1", "b", "2", "3"});
        source->Filter(2);
        EXPECT_EQ((Texts{"1"}), Fetch(source, 1).texts);
        ComPtr<ITavEnumBSTR> clone;
        ASSERT_EQ(S_OK, source->Clone(&clone));
        EXPECT_EQ(locksBefore + 2, ModuleLock::Count());
        EXPECT_EQ((Texts{"b"}), Fetch(clone, 1).texts);
        EXPECT_EQ((Texts{"2"}), Fetch(source, 1).texts);
        clone->Sort(4);
        source = nullptr;  // the clone reads its own copy
        clone->Reset();
        EXPECT_EQ((Texts{"b", "3", "2", "1"}), Fetch(clone).texts);
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

TEST(Enumerator, RecordListsIgnoreSortAndFilterAndClonesHoldTheOwner) {
    CountedOwner owner;
    TavPSCUnit units[2] = {{1, 2, S_OK}, {3, 4, E_FAIL}};
    ComPtr<IEnumTavPSCUnits> borrowed;
    ASSERT_EQ(S_OK, MakeEnumerator<PscUnitTraits>(units, units + 2, &owner, EnumOwnership::Borrow, &borrowed));
    EXPECT_EQ(S_OK, borrowed->Sort(4));
    EXPECT_EQ(S_OK, borrowed->Filter(2));
    TavPSCUnit out[2] = {};
    ULONG got = 0;
    ASSERT_EQ(S_OK, borrowed->RemNext(2, out, &got));
    EXPECT_EQ(1u, out[0].PSCUnitID);
    EXPECT_EQ(E_FAIL, out[1].PSCCallStatus);
    ComPtr<IEnumTavPSCUnits> clone;
    ASSERT_EQ(S_OK, borrowed->Clone(&clone));
    EXPECT_EQ(2u, owner.references);  // a clone of a borrowed list holds the list's owner
    clone = nullptr;
    borrowed = nullptr;
    EXPECT_EQ(0u, owner.references);
}

TEST(Enumerator, CreationStepsReportTheirFailures) {
    BstrEnum* bare = nullptr;
    ASSERT_EQ(S_OK, BstrEnum::CreateInstance(&bare));
    BSTR slot = nullptr;
    ULONG got = 0;
    ITavEnumBSTR* none = nullptr;
    EXPECT_EQ(E_FAIL, bare->RemNext(1, &slot, &got));
    EXPECT_EQ(E_FAIL, bare->Clone(&none));
    EXPECT_EQ(E_INVALIDARG, bare->Init(nullptr, nullptr, nullptr, EnumOwnership::Copy));
    BSTR* array = AllocateArray<BSTR>(1);
    array[0] = SysAllocString(OLESTR("kept"));
    ASSERT_EQ(S_OK, bare->Init(array, array + 1, nullptr, EnumOwnership::Take));
    EXPECT_EQ(E_UNEXPECTED, bare->Init(array, array + 1, nullptr, EnumOwnership::Copy));
    bare->Discard();

    EnumStep step = EnumStep::Create;
    EXPECT_EQ(E_INVALIDARG, MakeEnumerator<BstrTraits>(nullptr, nullptr, nullptr, EnumOwnership::Take, &none, &step));
    EXPECT_EQ(EnumStep::Init, step);
    EXPECT_EQ(nullptr, none);

    EXPECT_EQ(nullptr, AllocateArray<TavIPCSlot>(SIZE_MAX / sizeof(TavIPCSlot) + 1));  // would wrap
}

TEST(Enumerator, FailedStringCopyFreesWhatTheCallHandedOut) {
    TavIPCSlot* slots = AllocateArray<TavIPCSlot>(3);
    for (size_t i = 0; i < 3; ++i) slots[i].slotName = SysAllocString(OLESTR("slot"));
    ComPtr<IEnumSlots> list;
    ASSERT_EQ(S_OK, MakeEnumerator<SlotTraits>(slots, slots + 3, nullptr, EnumOwnership::Take, &list));
    TavIPCSlot out[3] = {};
    ULONG got = 0;
    HRESULT hr = S_OK;
    auto fetchAll = [&] {
        list->Reset();
        got = 99;
        hr = list->RemNext(3, out, &got);
    };
    auto nothingHandedOut = [&] {
        EXPECT_EQ(E_OUTOFMEMORY, hr);
        EXPECT_EQ(0u, got);
        for (const TavIPCSlot& slot : out) EXPECT_EQ(nullptr, slot.slotName);
    };
    const long failures = ForEachAllocationFailure(fetchAll, nothingHandedOut);
    if (failures < 0) GTEST_SKIP() << "allocation failures cannot be injected on this platform";
    EXPECT_EQ(3, failures);
    EXPECT_EQ(S_OK, hr);
    for (TavIPCSlot& slot : out) SlotTraits::Free(slot);

    // What was handed out stays consumed; the string that failed comes next.
    ComPtr<ITavEnumBSTR> strings = MakeStrings({"a", "b", "c"});
    TavFailAllocationAt(2);
    EXPECT_EQ((Fetched{E_OUTOFMEMORY, {}}), Fetch(strings, 3));
    EXPECT_EQ((Fetched{S_OK, {"b", "c"}}), Fetch(strings, 2));
}

TEST(Enumerator, FailedCloneLeavesNothingBehind) {
    ComPtr<ITavEnumBSTR> strings = MakeStrings({"a", "b", "c"});
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

TYPED_TEST(EveryEnumerator, AnswersItsOwnInterfaceAndIUnknownOnly) {
    using Element = typename TypeParam::Element;
    using Interface = typename TypeParam::Interface;
    Element* array = AllocateArray<Element>(2);
    ComPtr<Interface> list;
    ASSERT_EQ(S_OK, MakeEnumerator<TypeParam>(array, array + 2, nullptr, EnumOwnership::Take, &list));
    ComPtr<Interface> same;
    ComPtr<IUnknown> identity;
    ComPtr<IClassFactory> foreign;
    EXPECT_EQ(S_OK, list.As(same));
    EXPECT_EQ(S_OK, list.As(identity));
    EXPECT_EQ(E_NOINTERFACE, list.As(foreign));
    EXPECT_FALSE(foreign);
    Element out[2] = {};
    ULONG got = 0;
    EXPECT_EQ(S_OK, list->Skip(1));
    EXPECT_EQ(S_FALSE, list->RemNext(2, out, &got));
    EXPECT_EQ(1u, got);
    TypeParam::Free(out[0]);
}

}  // namespace
}  // namespace tav::test
