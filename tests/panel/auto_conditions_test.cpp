// The auto condition lists: version 1 through UnpackAutoConditions, version 2
// through the "AUTO_CH" mode reply; their mapping, counts and failures.
#include <vector>

#include "support/controller_test.h"

namespace tav::test {
namespace {

template <class Enum>
Enum* Garbage() {
    return reinterpret_cast<Enum*>(uintptr_t{0xBAD});
}

class AutoConditionsTest : public ControllerTest {
protected:
    void SetUp() override {
        ControllerTest::SetUp();
        object_ = Make();
    }
    // Version 1; the elements when it succeeds.
    HRESULT Unpack1(std::string_view text, std::vector<TavAutoCondition>* elements = nullptr, LONG* change = nullptr) {
        TestVariant data = TestVariant::Text(text);
        LONG flag = 0;
        IEnumAutoCondition* conditions = Garbage<IEnumAutoCondition>();
        const HRESULT hr = object_->UnpackAutoConditions(data.Get(), change ? change : &flag, &conditions);
        return Collect(hr, conditions, elements);
    }
    // Version 2, through the mode reply "AUTO_CH" + separator + list.
    HRESULT Unpack2(std::string_view list, std::vector<TavAutoCondition2>* elements = nullptr, ULONG* cycle = nullptr) {
        TestVariant data = TestVariant::Text("AUTO_CH " + std::string(list));
        TavOperationMode mode = Auto;
        IEnumAutoCondition2* conditions = Garbage<IEnumAutoCondition2>();
        const HRESULT hr = object_->UnpackOperationMode2(data.Get(), &mode, &conditions, cycle);
        EXPECT_EQ(mode, SUCCEEDED(hr) ? AutoChange : Auto);
        return Collect(hr, conditions, elements);
    }

    ControllerObject* object_ = nullptr;

private:
    template <class Element, class Enum>
    static HRESULT Collect(HRESULT hr, Enum* conditions, std::vector<Element>* elements) {
        if (FAILED(hr)) {
            EXPECT_EQ(conditions, nullptr) << "a failure left the enumerator out-pointer set";
            return hr;
        }
        Element next{};
        while (conditions->RemNext(1, &next, nullptr) == S_OK) {
            if (elements != nullptr) elements->push_back(next);
        }
        conditions->Release();
        return hr;
    }
};

TEST_F(AutoConditionsTest, Version1KnowsThreeKindsAndKeepsTheFieldsAsSent) {
    LONG change = 0;
    std::vector<TavAutoCondition> got;
    ASSERT_EQ(Unpack1("x -auto_ch 1 -noelts 5\tBlk;1;17\tDeact;0;4294967295\tCallChn;-3;2\tSpeedOvr;1;9\tblk;1;1\t",
                      &got, &change),
              S_OK);
    EXPECT_EQ(change, 1);
    const std::tuple<int, LONG, ULONG> expected[] = {{1, 1, 17}, {2, 0, 4294967295u}, {3, -3, 2}, {0, 1, 9}, {0, 1, 1}};
    ASSERT_EQ(got.size(), std::size(expected));
    for (size_t i = 0; i < got.size(); ++i) {
        EXPECT_EQ(std::tuple(int(got[i].Condition), got[i].KeepIsAllowed, got[i].ConditionID), expected[i]) << i;
    }
}

TEST_F(AutoConditionsTest, Version2KnowsEightKindsAndTheRunModeCycle) {
    ULONG cycle = 7;
    std::vector<TavAutoCondition2> got;
    ASSERT_EQ(Unpack2("-auto_ch 1 -noelts 10\tBlk;1;1\tDeact;0;1\tCallChn;-1;1\tSpeedOvr;1;1\tRunMode;0;250\t"
                      "StartExc;1;1\tKestoSpy;1;1\tEio;1;1\tRunMode;1;300\tABCDEFGHIJ;0;1\t",
                      &got, &cycle),
              S_OK);
    EXPECT_EQ(cycle, 300u) << "the last RunMode element gives the cycle";
    const int kinds[] = {1, 2, 3, 4, 5, 6, 7, 8, 5, 0};
    const int reset = TavAutoConditionConfiguration_Reset, keep = TavAutoConditionConfiguration_Keep;
    const int configurations[] = {reset, keep, reset, reset, keep, reset, reset, reset, reset, keep};
    ASSERT_EQ(got.size(), 10u);
    for (size_t i = 0; i < got.size(); ++i) {
        EXPECT_EQ(got[i].Condition, kinds[i]) << i;
        EXPECT_EQ(got[i].Configuration, configurations[i]) << i;
    }
    EXPECT_EQ(Unpack2("-auto_ch 0 -noelts 1\tBlk;1;250\t", nullptr, &cycle), S_OK);
    EXPECT_EQ(cycle, 0u) << "no RunMode element, no cycle";
}

// Sizes are counted in 32 bits: 12 bytes per version-1 record, 8 per version-2 one.
TEST_F(AutoConditionsTest, CountsAreCheckedBeforeTheElements) {
    const std::tuple<const char*, HRESULT, HRESULT> cases[] = {
        {"0", S_OK, S_OK},
        {"-5", S_OK, S_OK},
        {"357913941", E_FAIL, E_FAIL},  // fits; then the second element is missing
        {"357913942", E_OUTOFMEMORY, E_FAIL},
        {"536870911", E_OUTOFMEMORY, E_FAIL},
        {"536870912", E_OUTOFMEMORY, E_OUTOFMEMORY},
        {"2147483647", E_OUTOFMEMORY, E_OUTOFMEMORY},
    };
    for (const auto& [count, hr1, hr2] : cases) {
        SCOPED_TRACE(count);
        const std::string list = std::string("-auto_ch 1 -noelts ") + count + "\tBlk;1;1\t";
        std::vector<TavAutoCondition> got;
        LONG change = 0;
        EXPECT_EQ(Unpack1(list, &got, &change), hr1);
        EXPECT_EQ(change, 1);
        EXPECT_TRUE(got.empty());
        EXPECT_TRUE(hr1 != E_OUTOFMEMORY || HasError(""));
        EXPECT_EQ(Unpack2(list), hr2);
    }
}

TEST_F(AutoConditionsTest, ParseFailuresQuoteWhatWasNotUnderstood) {
    const std::pair<const char*, const char*> cases[] = {
        // the list, its version-1 error
        {"-auto_c 1 -noelts 0\t", "UnpackAutoCondition. Could not parse string: -auto_c 1 -noelts 0\t"},
        {"x -auto_ch 1 -elts 0", "UnpackAutoConditions. Cannot parse overhead data: -auto_ch 1 -elts 0"},
        {"-auto_ch 1 -noelts 3\tBlk;1;1\tABCDEFGHIJK;1;2\tEio;0;3\t",
         "UnpackAutoConditons. Could not parse element: ABCDEFGHIJK;1;2\tEio;0;3\t"},
        {"-auto_ch 1 -noelts 2\tBlk;1;1\t", "UnpackAutoConditons. Could not parse element: "},
        {"-auto_ch 1 -noelts 1\tBlk;x;1\t", "UnpackAutoConditons. Could not parse element: Blk;x;1\t"},
    };
    for (const auto& [list, error] : cases) {
        SCOPED_TRACE(list);
        EXPECT_EQ(Unpack1(list), E_FAIL);
        EXPECT_TRUE(HasError(error));
        std::string error2 = error;
        error2.insert(error2.find('.'), "2");
        EXPECT_EQ(Unpack2(list), E_FAIL);
        EXPECT_TRUE(HasError(error2));
    }
}

TEST_F(AutoConditionsTest, AutoChangeWithoutAListFailsOnlyWhenConditionsAreAsked) {
    for (const char* text : {"AUTO_CH", "AUTO_CH "}) {
        SCOPED_TRACE(text);
        TestVariant data = TestVariant::Text(text);
        TavOperationMode mode = Auto;
        IEnumAutoCondition2* conditions = Garbage<IEnumAutoCondition2>();
        EXPECT_EQ(object_->UnpackOperationMode2(data.Get(), &mode, &conditions, nullptr), E_FAIL);
        EXPECT_TRUE(HasError("UnpackOperationMode2. No autocond string"));
        EXPECT_EQ(conditions, nullptr);
        EXPECT_EQ(mode, Auto);
        EXPECT_EQ(object_->UnpackOperationMode2(data.Get(), &mode, nullptr, nullptr), S_OK);
        EXPECT_EQ(mode, AutoChange);
    }
}

TEST_F(AutoConditionsTest, UnpackAutoConditionsChecksInOrder) {
    TestVariant number = TestVariant::Number(1);
    LONG change = 0;
    IEnumAutoCondition* conditions = Garbage<IEnumAutoCondition>();
    EXPECT_EQ(object_->UnpackAutoConditions(nullptr, nullptr, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackAutoConditions. NULL VARIANT"));
    EXPECT_EQ(object_->UnpackAutoConditions(number.Get(), nullptr, &conditions), E_POINTER);
    const int flagLine = Error().line;
    EXPECT_EQ(object_->UnpackAutoConditions(number.Get(), &change, nullptr), E_POINTER);
    EXPECT_TRUE(HasError(""));
    EXPECT_NE(Error().line, flagLine);
    EXPECT_EQ(object_->UnpackAutoConditions(number.Get(), &change, &conditions), E_FAIL);
    EXPECT_TRUE(HasError("UnpackAutoConditions. Non-BSTR argument."));
    EXPECT_EQ(conditions, nullptr);
}

// Each allocation failing in turn (the list's copy, the records): a failure
// without an enumerator, and nothing leaks.
TEST_F(AutoConditionsTest, AllocationFailuresLeaveNoEnumerator) {
    TestVariant data = TestVariant::Text("AUTO_CH -auto_ch 1 -noelts 1\tRunMode;1;1\t");
    TavOperationMode mode{};
    IEnumAutoCondition2* conditions = nullptr;
    HRESULT hr = S_OK;
    const long runs = ForEachAllocationFailure(
        [&] {
            conditions = Garbage<IEnumAutoCondition2>();
            hr = object_->UnpackOperationMode2(data.Get(), &mode, &conditions, nullptr);
        },
        [&] {
            EXPECT_TRUE(hr == S_OK || (hr == E_OUTOFMEMORY && conditions == nullptr)) << hr;
            if (hr == S_OK) conditions->Release();
        });
    if (runs < 0) {
        GTEST_SKIP() << "allocation failures cannot be injected here";
    }
    EXPECT_GE(runs, 2);
    conditions->Release();
}

}  // namespace
}  // namespace tav::test
