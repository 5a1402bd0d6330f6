#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <string>
#include <vector>

#include "core/text/number.h"
#include "core/text/tokenize.h"
#include "text_test_util.h"

namespace tav::text::test {
namespace {

struct LongCase {
    const char* text;
    std::int32_t value;
    std::size_t end;
    bool overflow;
};

class StringToLong : public testing::TestWithParam<LongCase> {};

TEST_P(StringToLong, ReadsAsWcstolWithA32BitLong) {
    const LongCase& c = GetParam();
    const ParsedNumber<std::int32_t> n = StrToLong(W(c.text));
    EXPECT_EQ(n.value, c.value);
    EXPECT_EQ(n.end, c.end);
    EXPECT_EQ(n.overflow, c.overflow);
}

INSTANTIATE_TEST_SUITE_P(Texts, StringToLong,
                         testing::Values(LongCase{"2 -Names A,B", 2, 1, false}, LongCase{" \t-17x", -17, 5, false},
                                         LongCase{"+0", 0, 2, false}, LongCase{"", 0, 0, false},
                                         LongCase{"  -", 0, 0, false}, LongCase{"abc", 0, 0, false},
                                         LongCase{"2147483647", INT32_MAX, 10, false},
                                         LongCase{"2147483648", INT32_MAX, 10, true},
                                         LongCase{"-2147483648", INT32_MIN, 11, false},
                                         LongCase{"-2147483649", INT32_MIN, 11, true},
                                         LongCase{"99999999999999999999999", INT32_MAX, 23, true}));

struct ULongCase {
    const char* text;
    std::uint32_t value;
    bool overflow;
};

class StringToULong : public testing::TestWithParam<ULongCase> {};

TEST_P(StringToULong, ReadsAsWcstoulWithA32BitLong) {
    const ULongCase& c = GetParam();
    const ParsedNumber<std::uint32_t> n = StrToULong(W(c.text));
    EXPECT_EQ(n.value, c.value);
    EXPECT_EQ(n.overflow, c.overflow);
}

INSTANTIATE_TEST_SUITE_P(Texts, StringToULong,
                         testing::Values(ULongCase{"4294967296", UINT32_MAX, true}, ULongCase{"-1", UINT32_MAX, false},
                                         ULongCase{"-4294967295", 1, false},
                                         ULongCase{"-4294967296", UINT32_MAX, true}));

struct TokenCase {
    std::string text;
    const char* delimiters;
    std::vector<std::string> tokens;
};

class Tokens : public testing::TestWithParam<TokenCase> {};

TEST_P(Tokens, SplitAsWcstokDoes) {
    const TokenCase& c = GetParam();
    const OleString text = W(c.text);
    const OleString delimiters = W(c.delimiters);
    Tokenizer tokenizer(text, delimiters);
    std::vector<std::string> tokens;
    while (const auto token = tokenizer.Next()) {
        tokens.push_back(N(*token));
    }
    EXPECT_EQ(tokens, c.tokens);
    EXPECT_FALSE(tokenizer.Next());
}

INSTANTIATE_TEST_SUITE_P(
    Texts, Tokens,
    testing::Values(TokenCase{"SYS_A,SYS_B", ",", {"SYS_A", "SYS_B"}},
                    TokenCase{",,A b,,,C,", ",", {"A b", "C"}}, TokenCase{"", ",", {}}, TokenCase{",,,", ",", {}},
                    TokenCase{"a;b c", "; ", {"a", "b", "c"}}, TokenCase{"abc", "", {"abc"}},
                    TokenCase{std::string("a,b\0,c", 7), ",", {"a", "b"}}));

TEST(Convert, RoundTripsUtf8AndUtf16) {
    const std::string text = "ASCII \xC3\xA9 \xE4\xB8\xAD \xF0\x9F\x98\x80";
    const OleString wide = Widen(text);
    EXPECT_EQ(wide.size(), 12u);  // the last character is a surrogate pair
    EXPECT_EQ(wide[10], static_cast<OLECHAR>(0xD83D));
    EXPECT_EQ(Narrow(wide), text);
    EXPECT_EQ(Widen(static_cast<const char*>(nullptr)), OleString());
}

TEST(Convert, ReplacesMalformedInput) {
    // Truncated sequence, overlong form, encoded surrogate, stray continuation.
    EXPECT_EQ(Narrow(Widen("a\xE4\xB8" "b\xC0\xAF" "c\xED\xA0\x80" "d\x80")),
              "a\xEF\xBF\xBD" "b\xEF\xBF\xBD\xEF\xBF\xBD" "c\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBD" "d\xEF\xBF\xBD");
    const OLECHAR lone[] = {u'x', static_cast<OLECHAR>(0xDC00), static_cast<OLECHAR>(0xD800)};
    EXPECT_EQ(Narrow(OleStringView(lone, 3)), "x\xEF\xBF\xBD\xEF\xBF\xBD");
}

}  // namespace
}  // namespace tav::text::test
