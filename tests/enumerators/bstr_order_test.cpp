#include <algorithm>
#include <random>

#include "core/bstr_order.h"
#include "enum_test_util.h"

namespace tav::test {
namespace {

struct PairCase {
    LONG mode;
    const char* a;
    const char* b;
    bool exchanged;
};

TEST(BstrOrder, ExchangesPairsAsTheModeSays) {
    const PairCase cases[] = {
        {1, "B", "a", false},        {2, "B", "a", true},       {3, "A", "b", false},
        {2, "\xC3\x89", "e", true},  // É folds to é, after e
        {4, "a", "b", true},         {5, "A", "b", true},       {5, "b", "A", false},
        {6, "item10", "item9", true}, {6, "item9", "item10", false},
        {6, "Item10", "item9", false},  // the prefixes differ, so case-sensitive text decides
        {7, "Item10", "item9", true}, {6, "item007", "item7", false}, {6, "item7", "item007", false},
        {6, "x100000000000000000000", "x99999999999999999999", true},
        {6, "item1", "item", true},  // a string that is all prefix compares whole
        {6, "ab1", "a10", true},     // prefixes of different lengths compare whole
        {6, "10", "9", true},        // empty prefixes: numbers decide
        {8, "Item10", "item9", false}, {8, "b10", "A9", true}, {8, "a10", "B9", false},
        {0, "a", "b", true},         {99, "a", "a", true},
    };
    for (const PairCase& c : cases) {
        EXPECT_EQ(c.exchanged, BstrOutOfOrder(Widen(c.a).c_str(), Widen(c.b).c_str(), c.mode))
            << "mode " << c.mode << ": " << c.a << " / " << c.b;
    }
    EXPECT_FALSE(BstrOutOfOrder(nullptr, OLESTR("a"), 1));  // NULL is the empty string
}

struct FilterCase {
    LONG mode;
    const char* text;
    bool passes;
};

TEST(BstrOrder, FiltersByCharacterClass) {
    const FilterCase cases[] = {
        {1, "", true},    {1, "abcXYZ", true}, {1, "ab1", false}, {1, "\xC3\xA9t\xC3\xA9", true},
        {1, "a b", false}, {2, "", true},       {2, "0123", true}, {2, "12a", false},
        {2, "-1", false},  {3, "", true},       {3, "a1B2", true}, {3, "a_1", false},
        {3, "\xC3\xA9", false},  // a letter, but not one of the single-byte classes
        {0, "?!", true},   {4, "%", true},
    };
    for (const FilterCase& c : cases) {
        EXPECT_EQ(c.passes, BstrPassesFilter(Widen(c.text).c_str(), c.mode)) << "mode " << c.mode << ": " << c.text;
    }
}

Texts RandomList(std::mt19937& random) {
    static const char* const prefixes[] = {"", "item", "Item", "ITEM", "a", "ab", "B", "x_", "Z"};
    static const char* const suffixes[] = {"", "a", "B", "z9", "_"};
    Texts list(random() % 41);
    for (std::string& text : list) {
        text = prefixes[random() % std::size(prefixes)];
        if (random() % 4 != 0) {
            text += random() % 5 == 0 ? "0" : "";  // a leading zero leaves the value as it is
            text += std::to_string(random() % 120);
        }
        text += suffixes[random() % std::size(suffixes)];
    }
    return list;
}

TEST(BstrOrder, SortAgreesWithAReferenceSortInEveryMode) {
    std::mt19937 random(20240607);
    for (LONG mode = 1; mode <= 8; ++mode) {
        for (int round = 0; round < 60; ++round) {
            const Texts input = RandomList(random);
            auto after = [mode](const std::string& a, const std::string& b) {
                return BstrOutOfOrder(Widen(a).c_str(), Widen(b).c_str(), mode);
            };
            Texts reference = input;
            std::stable_sort(reference.begin(), reference.end(),
                             [&](const std::string& x, const std::string& y) { return after(y, x); });

            ComPtr<ITavEnumBSTR> strings = MakeStrings(input);
            ASSERT_EQ(S_OK, strings->Sort(mode));
            const Texts sorted = Fetch(strings).texts;

            ASSERT_TRUE(std::is_permutation(sorted.begin(), sorted.end(), input.begin(), input.end()));
            for (size_t i = 0; i < sorted.size(); ++i) {
                EXPECT_FALSE(after(sorted[i], reference[i]) || after(reference[i], sorted[i]))
                    << "mode " << mode << " place " << i << ": " << sorted[i] << " against " << reference[i];
            }
        }
    }
}

TEST(BstrOrder, UnknownModeScramblesInAFixedPattern) {
    ComPtr<ITavEnumBSTR> abc = MakeStrings({"a", "b", "c"});
    ASSERT_EQ(S_OK, abc->Sort(42));
    EXPECT_EQ((Texts{"b", "a", "c"}), Fetch(abc).texts);

    std::mt19937 random(7);
    Texts input = RandomList(random);
    while (input.size() < 10) input = RandomList(random);
    ComPtr<ITavEnumBSTR> first = MakeStrings(input);
    ComPtr<ITavEnumBSTR> second = MakeStrings(input);
    first->Sort(0);
    second->Sort(0);
    EXPECT_EQ(Fetch(first).texts, Fetch(second).texts);
}

}  // namespace
}  // namespace tav::test
