// The auto condition lists: version 1 through UnpackAutoConditions, version 2
// through the "AUTO_CH" mode reply; their mapping, counts and failures.
#include <array>
#include <vector>

#include "support/controller_test.h"

namespace tav::test {
namespace {

using Row = std::array<int64_t, 3>;  // version 1: kind, keep, ID; version 2: kind, configuration, 0
constexpr int64_t kReset = TavAutoConditionConfiguration_Reset, kKeep = TavAutoConditionConfiguration_Keep;

struct Decoded {
    HRESULT hr = S_OK;
    LONG change = -9;
    ULONG cycle = 9;
    std::vector<Row> rows;
};

template <class Enum>
Enum* Garbage() {
    return reinterpret_cast<Enum*>(uintptr_t{0xBAD});
}

template <class Element, class Enum, class ToRow>
Decoded Drain(HRESULT hr, Enum* conditions, Decoded decoded, ToRow toRow) {
    decoded.hr = hr;
    if (FAILED(hr)) {
        EXPECT_EQ(conditions, nullptr) << "a failure left the enumerator out-pointer set";
        return decoded;
    }
    Element next{};
    while (conditions->RemNext(1, &next, nullptr) == S_OK) decoded.rows.push_back(toRow(next));
    conditions->Release();
    return decoded;
}

class AutoConditionsTest : public ControllerTest {
protected:
    void SetUp() override {
        ControllerTest::SetUp();
        object_ = Make();
    }
    Decoded Unpack1(std::string_view text) {
        TestVariant data = TestVariant::Text(text);
        Decoded decoded;
        IEnumAutoCondition* conditions = Garbage<IEnumAutoCondition>();
        const HRESULT hr = object_->UnpackAutoConditions(data.Get(), &decoded.change, &conditions);
        return Drain<TavAutoCondition>(hr, conditions, decoded, [](const TavAutoCondition& c) {
            return Row{c.Condition, c.KeepIsAllowed, c.ConditionID};
        });
    }
    // The mode reply "AUTO_CH", a separator and list.
    Decoded Unpack2(std::string_view list) {
        TestVariant data = TestVariant::Text("AUTO_CH " + std::string(list));
        Decoded decoded;
        TavOperationMode mode = Auto;
        IEnumAutoCondition2* conditions = Garbage<IEnumAutoCondition2>();
        const HRESULT hr = object_->UnpackOperationMode2(data.Get(), &mode, &conditions, &decoded.cycle);
        EXPECT_EQ(mode, SUCCEEDED(hr) ? AutoChange : Auto);
        return Drain<TavAutoCondition2>(hr, conditions, decoded, [](const TavAutoCondition2& c) {
            return Row{c.Condition, c.Configuration, 0};
        });
    }

    ControllerObject* object_ = nullptr;
};

TEST_F(AutoConditionsTest, Version1KnowsThreeKindsAndKeepsTheFieldsAsSent) {
    const Decoded got =
        Unpack1("x -auto_ch 1 -noelts 5\tBlk;1;17\tDeact;0;4294967295\tCallChn;-3;2\tSpeedOvr;1;9\tblk;1;1\t");
    EXPECT_EQ(got.hr, S_OK);
    EXPECT_EQ(got.change, 1);
    EXPECT_EQ(got.rows, (std::vector<Row>{{1, 1, 17}, {2, 0, 4294967295}, {3, -3, 2}, {0, 1, 9}, {0, 1, 1}}));
}

TEST_F(AutoConditionsTest, Version2KnowsEightKindsAndTheRunModeCycle) {
    Decoded got = Unpack2(
        "-auto_ch 1 -noelts 10\tBlk;1;1\tDeact;0;1\tCallChn;-1;1\tSpeedOvr;1;1\tRunMode;0;250\t"
        "StartExc;1;1\tKestoSpy;1;1\tEio;1;1\tRunMode;1;300\tABCDEFGHIJ;0;1\t");
    EXPECT_EQ(got.hr, S_OK);
    EXPECT_EQ(got.cycle, 300u) << "the last RunMode element gives the cycle";
    EXPECT_EQ(got.rows, (std::vector<Row>{{1, kReset, 0},
                                          {2, kKeep, 0},
                                          {3, kReset, 0},
                                          {4, kReset, 0},
                                          {5, kKeep, 0},
                                          {6, kReset, 0},
                                          {7, kReset, 0},
                                          {8, kReset, 0},
                                          {5, kReset, 0},
                                          {0, kKeep, 0}}));
    EXPECT_EQ(Unpack2("-auto_ch 0 -noelts 1\tBlk;1;250\t").cycle, 0u) << "no RunMode element, no cycle";
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
        const Decoded got = Unpack1(list);
        EXPECT_EQ(got.hr, hr1);
        EXPECT_EQ(got.change, 1);
        EXPECT_TRUE(got.rows.empty());
        EXPECT_TRUE(hr1 != E_OUTOFMEMORY || HasError(""));
        EXPECT_EQ(Unpack2(list).hr, hr2);
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
        EXPECT_EQ(Unpack1(list).hr, E_FAIL);
        EXPECT_TRUE(HasError(error));
        std::string error2 = error;
        EXPECT_EQ(Unpack2(list).hr, E_FAIL);
        EXPECT_TRUE(HasError(error2.insert(error2.find('.'), "2")));
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

// The two out-pointers fail on lines of their own; a non-BSTR leaves no enumerator.
TEST_F(AutoConditionsTest, OutPointersAreCheckedBeforeTheType) {
    TestVariant number = TestVariant::Number(1);
    LONG change = 0;
    IEnumAutoCondition* conditions = Garbage<IEnumAutoCondition>();
    EXPECT_EQ(object_->UnpackAutoConditions(number.Get(), nullptr, &conditions), E_POINTER);
    const int flagLine = Error().line;
    EXPECT_EQ(object_->UnpackAutoConditions(number.Get(), &change, nullptr), E_POINTER);
    EXPECT_NE(Error().line, flagLine);
    EXPECT_EQ(object_->UnpackAutoConditions(number.Get(), &change, &conditions), E_FAIL);
    EXPECT_TRUE(HasError("UnpackAutoConditions. Non-BSTR argument."));
    EXPECT_EQ(conditions, nullptr);
}

}  // namespace
}  // namespace tav::test
