#include "sim/arguments.h"
#include "sim_test_support.h"

namespace tav::sim::test {
namespace {

struct ParseCase {
    const char* text;
    bool parses;
    const char* key;
    const char* value;  // nullptr: the key is absent
};

class ArgumentsTest : public ::testing::TestWithParam<ParseCase> {};

TEST_P(ArgumentsTest, ReadsKeyValuePairs) {
    const ParseCase& c = GetParam();
    const auto arguments = Arguments::Parse(T(c.text));
    ASSERT_EQ(c.parses, arguments.has_value());
    if (!arguments) {
        return;
    }
    const auto value = arguments->Find(T(c.key));
    ASSERT_EQ(c.value != nullptr, value.has_value());
    if (value) {
        EXPECT_EQ(c.value, Narrow(*value));
    }
}

INSTANTIATE_TEST_SUITE_P(
    Texts, ArgumentsTest,
    ::testing::Values(ParseCase{"", true, "-Name", nullptr},
                      ParseCase{"-Name \"two words\"", true, "-Name", "two words"},
                      ParseCase{"-Name \"\"", true, "-Name", ""},
                      ParseCase{"  -time_t 17  ", true, "-time_t", "17"},
                      ParseCase{"-SlotId -1 -QFull", true, "-SlotId", "-1"},
                      ParseCase{"-SlotId -1 -QFull", true, "-QFull", ""},
                      ParseCase{"-AutoCondAck Keep -ID 4294967295", true, "-ID", "4294967295"},
                      ParseCase{"-Type System -SystemName \"Main System\"", true, "-SystemName", "Main System"},
                      ParseCase{"-name lower", true, "-Name", nullptr},
                      ParseCase{"RUN", false, "", nullptr},
                      ParseCase{"-Name \"open", false, "", nullptr}));

TEST(ArgumentsNumbers, ReadWholeDecimalNumbersWithinRange) {
    const auto arguments = Arguments::Parse(T("-a 4294967295 -b 4294967296 -c -2147483648 -d 12x -e 2147483648"));
    ASSERT_TRUE(arguments);
    EXPECT_EQ(4294967295u, arguments->Unsigned(T("-a")));
    EXPECT_FALSE(arguments->Unsigned(T("-b")));
    EXPECT_EQ(-2147483647 - 1, arguments->Signed(T("-c")));
    EXPECT_FALSE(arguments->Unsigned(T("-d")));
    EXPECT_FALSE(arguments->Signed(T("-e")));
}

}  // namespace
}  // namespace tav::sim::test
