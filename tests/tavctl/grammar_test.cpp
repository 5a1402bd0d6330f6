// The tool's pieces in-process: help at every level, argument reading, the
// printed forms of values and the generated enum names.
#include <gtest/gtest.h>

#include <set>

#include "tavctl/commands.h"
#include "tavctl/output.h"
#include "tavctl/session.h"
#include "tavctl/verb.h"

namespace tavctl::test {
namespace {

TEST(HelpTest, EveryGroupAndVerbHasHelp) {
    std::set<std::string> groups;
    for (const GroupEntry& group : Groups()) {
        EXPECT_TRUE(groups.insert(group.name).second) << "two groups named " << group.name;
        const auto groupHelp = HelpFor({group.name, "--help"});
        ASSERT_TRUE(groupHelp) << group.name;
        std::set<std::string> verbs;
        for (const VerbEntry& verb : group.verbs) {
            EXPECT_TRUE(verbs.insert(verb.name).second) << group.name << " has two verbs " << verb.name;
            EXPECT_NE(std::string::npos, groupHelp->find(VerbUsage(group, verb))) << *groupHelp;
            if (*verb.name == '\0') {
                continue;
            }
            const auto verbHelp = HelpFor({group.name, verb.name, "-h"});
            ASSERT_TRUE(verbHelp) << group.name << " " << verb.name;
            EXPECT_EQ(0u, verbHelp->find("Usage: tavctl " + std::string(group.name) + " " + verb.name))
                << *verbHelp;
        }
    }
    EXPECT_FALSE(HelpFor({"nosuchgroup", "--help"}));
    EXPECT_FALSE(HelpFor({"name", "get"}));
}

// A verb of no group, for reading arguments without a controller.
constexpr VerbEntry kVerb = {"set", "VALUE", "test", nullptr};
constexpr GroupEntry kGroup = {"test", "test", {}};

class ArgumentTest : public ::testing::Test {
protected:
    Verb Make(std::vector<std::string> words) { return Verb(session_, kGroup, kVerb, std::move(words)); }
    Session session_{GlobalOptions{}, [](tav::ComPtr<ITavController>&, std::string& error) {
                         error = "no controller in this test";
                         return E_FAIL;
                     }};
};

TEST_F(ArgumentTest, NumbersWithinTheirType) {
    struct Case {
        std::string word;
        std::optional<long long> asShort;
        std::optional<long long> asUnsigned;
    };
    const Case cases[] = {
        {"0", 0, 0},
        {"-32768", -32768, std::nullopt},
        {"32767", 32767, 32767},
        {"32768", std::nullopt, 32768},
        {"4294967295", std::nullopt, 4294967295LL},
        {"4294967296", std::nullopt, std::nullopt},
        {"0x10", 16, 16},
        {"99999999999999999999999", std::nullopt, std::nullopt},
        {"", std::nullopt, std::nullopt},
        {"1.5", std::nullopt, std::nullopt},
        {" 1", std::nullopt, std::nullopt},
        {"+1", std::nullopt, std::nullopt},
        {"--1", std::nullopt, std::nullopt},
        {"-", std::nullopt, std::nullopt},
        {"12abc", std::nullopt, std::nullopt},
    };
    for (const Case& c : cases) {
        auto asShort = Make({c.word});
        try {
            EXPECT_EQ(c.asShort, asShort.Number<short>("N")) << c.word;
        } catch (const UsageError& error) {
            EXPECT_FALSE(c.asShort) << c.word << ": " << error.message;
        }
        auto asUnsigned = Make({c.word});
        try {
            EXPECT_EQ(c.asUnsigned, asUnsigned.Number<ULONG>("N")) << c.word;
        } catch (const UsageError& error) {
            EXPECT_FALSE(c.asUnsigned) << c.word << ": " << error.message;
        }
    }
}

TEST_F(ArgumentTest, EnumsByNameAliasOrNumber) {
    constexpr EnumName aliases[] = {{MotorsOn, "on"}};
    struct Case {
        const char* word;
        std::optional<long> value;
    };
    const Case cases[] = {
        {"MotorsOn", MotorsOn}, {"motorsoff", MotorsOff}, {"on", MotorsOn}, {"17", 17},
        {"-1", -1},             {"Motors", std::nullopt}, {"", std::nullopt}, {"4294967296", std::nullopt},
    };
    for (const Case& c : cases) {
        auto verb = Make({c.word});
        try {
            EXPECT_EQ(c.value, static_cast<LONG>(verb.Enum<TavControllerState>("STATE", aliases))) << c.word;
        } catch (const UsageError& error) {
            EXPECT_FALSE(c.value) << c.word;
            EXPECT_NE(std::string::npos, error.message.find("MotorsOn")) << error.message;
        }
    }
}

TEST_F(ArgumentTest, OptionsAnywhereWordsInOrderNothingLeftOver) {
    auto verb = Make({"a", "--count", "3", "--flag", "b"});
    EXPECT_EQ(3u, verb.NumberOption<ULONG>("--count"));
    EXPECT_TRUE(verb.Flag("--flag"));
    EXPECT_EQ("a", verb.Word("FIRST"));
    EXPECT_THROW(verb.End(), UsageError);

    auto missing = Make({"--count"});
    EXPECT_THROW(missing.NumberOption<ULONG>("--count"), UsageError);
    auto none = Make({});
    EXPECT_THROW(none.Word("VALUE"), UsageError);
    EXPECT_NO_THROW(none.End());
}

TEST(OutputTest, JsonAndPlainForms) {
    struct Case {
        Value value;
        const char* json;
        const char* plain;
    };
    const Case cases[] = {
        {Value::Text("a \"b\" \\ c"), "\"a \\\"b\\\" \\\\ c\"", "a \"b\" \\ c"},
        {Value::Text("tab\tnew\nline\x01"), "\"tab\\tnew\\nline\\u0001\"", "tab\tnew\nline\x01"},
        {Value::Text("Zürich"), "\"Zürich\"", "Zürich"},
        {Value::Number(-5), "-5", "-5"},
        {Value::Unsigned(4294967295u), "4294967295", "4294967295"},
        {Value::Boolean(true), "true", "true"},
        {Value::Null(), "null", "(none)"},
        {Value::Real(0.5), "0.5", "0.5"},
        {Value::Real(1.0 / 0.0), "null", "(none)"},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(c.json, Json(c.value));
        EXPECT_EQ(c.plain, PlainText(c.value));
    }
    const Record record{{"a", Value::Number(1)}, {"long name", Value::Text("x")}};
    EXPECT_EQ("{\"a\": 1, \"long name\": \"x\"}", Json(record));
    EXPECT_EQ("a:         1\nlong name: x", PlainText(record));
    EXPECT_EQ("[]", Json(std::vector<Record>{}));
    EXPECT_EQ("a  long name\n1  x", PlainText(std::vector<Record>{record}));
}

TEST(OutputTest, QuotedWordsStayShortAndOnOneLine) {
    EXPECT_EQ("\"abc\"", Quote("abc"));
    EXPECT_EQ("\"a\\x0Ab\"", Quote("a\nb"));
    const std::string quoted = Quote(std::string(100000, 'x'));
    EXPECT_LT(quoted.size(), 80u);
    EXPECT_NE(std::string::npos, quoted.find("(100000 bytes)"));
    // A multi-byte character at the cut is dropped whole, not split.
    const std::string cut = Quote(std::string(39, 'x') + "€€€");
    EXPECT_EQ(0u, cut.find("\"" + std::string(39, 'x') + "...\""));
}

TEST(EnumNamesTest, EveryGeneratedNameReadsBackToItsValue) {
    ASSERT_GT(std::size(kEnumTypes), 30u);
    for (const EnumType& type : kEnumTypes) {
        std::set<std::string> seen;
        for (const EnumName& entry : type.names()) {
            EXPECT_TRUE(seen.insert(entry.name).second) << type.name << "." << entry.name;
            EXPECT_EQ(entry.value, ValueOf(type.names(), entry.name)) << type.name << "." << entry.name;
        }
    }
    EXPECT_EQ("SafetyModeStatus", NameOf(static_cast<TavControllerSubscriptions>(18)));
    EXPECT_EQ("4", NameOf(static_cast<TavControllerSubscriptions>(4)));
    EXPECT_STREQ("ITavPanel4", kInterfaceName<ITavPanel4>);
}

TEST(EnumNamesTest, TheLastPartOfANameReadsBackWhenNoOtherNameSharesIt) {
    constexpr EnumName kNames[] = {{1, "Cam_Running"}, {2, "Cam_Program"}, {3, "Lan_Program"}, {4, "Plain"}};
    EXPECT_EQ(1, ValueOf(kNames, "running"));
    EXPECT_EQ(4, ValueOf(kNames, "plain"));
    EXPECT_EQ(std::nullopt, ValueOf(kNames, "program"));
    EXPECT_EQ(std::nullopt, ValueOf(kNames, "ning"));
}

}  // namespace
}  // namespace tavctl::test
