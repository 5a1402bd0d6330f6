#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <cstdio>
#include <random>
#include <string>

#include "core/text/format.h"
#include "text_test_util.h"

namespace tav::text::test {
namespace {

// One directive at a time against the C library's snprintf, with random
// flags, widths and precisions; %ld/%lu are 32-bit on our side, so the C
// side gets plain %d/%u with the same value.
TEST(FormatDifferential, AgreesWithSnprintf) {
    if (!kGlibc && !kMingwStdio) {
        GTEST_SKIP() << "no trusted snprintf here";
    }
    std::mt19937 rng(7);
    const auto uniform = [&](int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); };
    const std::int32_t edges[] = {0, 1, -1, 7, -7, 42, 2147483647, -2147483647 - 1, 65535, -100000};
    const char* const texts[] = {"", "a", "Robot", "name with blanks", "0123456789012345678901234567890123456789xyz"};
    for (int i = 0; i < 20000; ++i) {
        std::string flags;
        for (const char flag : {'-', '0', '+', ' ', '#'}) {
            if (uniform(0, 4) == 0) {
                flags += flag;
            }
        }
        const std::string width = uniform(0, 2) == 0 ? std::to_string(uniform(0, 25)) : "";
        const std::string precision = uniform(0, 2) == 0 ? "." + std::to_string(uniform(0, 15)) : "";
        const char conversion = "diuxXsc"[uniform(0, 6)];
        const bool isText = conversion == 's';
        // '0' and '#' mean nothing defined for texts and characters.
        std::string usedFlags =
            isText || conversion == 'c' ? std::string(flags.find('-') != std::string::npos ? "-" : "") : flags;
        if (kMingwStdio && (conversion == 'u' || conversion == 'x' || conversion == 'X')) {
            // MinGW's printf signs unsigned numbers for '+' and ' ', which C
            // leaves to signed conversions.
            std::erase_if(usedFlags, [](char flag) { return flag == '+' || flag == ' '; });
        }
        const std::string theirs =
            "<%" + usedFlags + width + (conversion == 'c' ? "" : precision) + std::string(1, conversion) + ">";
        const std::string ours =
            "<%" + usedFlags + width + (conversion == 'c' ? "" : precision) + (uniform(0, 1) ? "l" : "") +
            std::string(1, conversion) + ">";

        char expected[256];
        OleString got;
        if (isText) {
            const char* text = texts[uniform(0, 4)];
            std::snprintf(expected, sizeof expected, theirs.c_str(), text);
            got = uniform(0, 1) ? Format(W(ours), W(text)) : Format(W(ours), text);
        } else if (conversion == 'c') {
            const char c = static_cast<char>(uniform(' ', '~'));
            std::snprintf(expected, sizeof expected, theirs.c_str(), c);
            got = Format(W(ours), static_cast<OLECHAR>(c));
        } else {
            const std::int32_t value = uniform(0, 1) ? edges[uniform(0, 9)] : uniform(-99999, 99999);
            std::snprintf(expected, sizeof expected, theirs.c_str(), value);
            got = Format(W(ours), value);
        }
        ASSERT_EQ(N(got), expected) << "format " << ours;
    }
}

struct FormatCase {
    const char* expected;
    OleString got;
};

class SystemFormats : public testing::TestWithParam<FormatCase> {};

TEST_P(SystemFormats, WriteAsTheCLibraryDoes) {
    EXPECT_EQ(N(GetParam().got), GetParam().expected);
}

enum class Mode { Off, On };
const std::string k50 = "Messenger-of-the-east-wing-robot-cell-number-0042!";

INSTANTIATE_TEST_SUITE_P(
    Commands, SystemFormats,
    testing::Values(FormatCase{"-pincode 0007 -permanent 1", Format(W("-pincode %.4d -permanent %d"), 7, 1)},
                    FormatCase{"-pincode -0007", Format(W("-pincode %.4d"), -7)},
                    FormatCase{"-pincode 123456", Format(W("-pincode %.4d"), 123456u)},
                    FormatCase{"-Mode 1", Format(W("-Mode %d"), Mode::On)},
                    FormatCase{"-Name Messenger-of-the-east-wing-robot-cell- -MaxMsg 10 -MaxSize 512 -SlotId -1",
                               Format(W("-Name %.38s -MaxMsg %d -MaxSize %d -SlotId -1"), W(k50), 10, 512)},
                    FormatCase{"-speed 4294967295", Format(W("-speed %lu"), 4294967295u)},
                    FormatCase{"-Value -1 0", Format(W("-Value %d %lu"), 4294967295u, std::uint64_t{1} << 32)},
                    FormatCase{"-big 4294967296", Format(W("-big %llu"), std::uint64_t{1} << 32)},
                    FormatCase{":TavControllerImpl[42]; ", Format(W(":%s[%d]; "), "TavControllerImpl", 42)},
                    FormatCase{"(null)[7]; ", Format(W("%s[%d]; "), static_cast<const OLECHAR*>(nullptr), 7)},
                    FormatCase{"<(null)> <>", Format(W("<%.6s> <%.5s>"), static_cast<BSTR>(nullptr), nullptr)},
                    FormatCase{"-Path \"C:\\dir\\\xC3\xA9\"", Format(W("-Path \"%s\""), W("C:\\dir\\\xC3\xA9"))},
                    FormatCase{"100% 0x80004005", Format(W("100%% %#x"), static_cast<std::uint32_t>(0x80004005))},
                    FormatCase{"\xF0\x9F\x98\x80|", Format(W("%.2s|"), "\xF0\x9F\x98\x80" "a")},
                    FormatCase{"|", Format(W("%.1s|"), "\xF0\x9F\x98\x80")}));

TEST(Format, AppendsOrWritesToABufferCutAndTerminatedLikeSnprintf) {
    OleString text = W("UnpackVTTime. Could not parse: ");
    FormatAppend(text, W("%s."), W("-time x"));
    EXPECT_EQ(N(text), "UnpackVTTime. Could not parse: -time x.");

    std::array<OLECHAR, 8> buffer{};
    buffer.fill(u'#');
    EXPECT_EQ(FormatTo(std::span<OLECHAR>(buffer.data(), 6), W("%s-%d"), W("abcd"), 123), 8u);
    EXPECT_EQ(N(buffer.data()), "abcd-");
    EXPECT_EQ(buffer[6], u'#');
    EXPECT_EQ(FormatTo(std::span<OLECHAR>(), W("%d"), 5), 1u);
    EXPECT_EQ(FormatTo(buffer, W("%d"), 5), 1u);
    EXPECT_EQ(N(buffer.data()), "5");
}

TEST(FormatDeathTest, WrongArgumentIsAProgrammingError) {
    EXPECT_DEBUG_DEATH(EXPECT_EQ(N(Format(W("<%d>"), W("text"))), "<>"), "wrong kind");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(N(Format(W("<%s>"), 5)), "<>"), "wrong kind");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(N(Format(W("<%d>"))), "<>"), "without an argument");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(N(Format(W("<%d>"), 1, 2)), "<1>"), "more format arguments");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(N(Format(W("<%f>"), 1)), "<%f>"), "unsupported");
}

}  // namespace
}  // namespace tav::text::test
