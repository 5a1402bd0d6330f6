// The reply formats the decoders use, and what the C library cannot show:
// buffer capacity, NUL, text beyond ASCII, wrong targets.
#include <gtest/gtest.h>

#include <array>
#include <string>
#include <vector>

#include "core/text/scan.h"
#include "tav/platform.h"
#include "text_test_util.h"

namespace tav::text::test {
namespace {

struct NumberCase {
    const char* format;
    const char* input;
    int result;
    std::uint32_t value;  // when result is 1
};

class OneNumber : public testing::TestWithParam<NumberCase> {};

TEST_P(OneNumber, ReadsOrRefuses) {
    const NumberCase& c = GetParam();
    std::uint32_t value = 0xDEADBEEF;
    EXPECT_EQ(Scan(W(c.input), W(c.format), &value), c.result);
    EXPECT_EQ(value, c.result == 1 ? c.value : 0xDEADBEEF);
}

INSTANTIATE_TEST_SUITE_P(ReplyFormats, OneNumber,
                         testing::Values(NumberCase{"-time_t %lu", "-time_t 1700000000", 1, 1700000000},
                                         NumberCase{"-time_t %lu", "-time_t -1", 1, 4294967295},
                                         NumberCase{"-time_t %lu", "-time_t 4294967296", 1, 0},
                                         NumberCase{"-time_t %lu", "-time_t   ", -1, 0},
                                         NumberCase{"-time_t %lu", "-time_x 12", 0, 0},
                                         NumberCase{"-pstatus %u", "-pstatus 2147500037", 1, 0x80004005},
                                         NumberCase{"-IsDone %d", "-IsDone 2147483648", 1, 0x80000000},
                                         NumberCase{"-SlotId %3d", "-SlotId 12345", 1, 123}));

TEST(Scan, StoresIntoTheInterfaceIntegerTypes) {
    HRESULT status = S_OK;
    ULONG files = 0;
    LONG done = 0;
    EXPECT_EQ(Scan(W("-pstatus 2147500037 -FileCount 7 -IsDone -1"), W("-pstatus %u -FileCount %lu -IsDone %d"),
                   &status, &files, &done),
              3);
    EXPECT_EQ(status, E_FAIL);
    EXPECT_EQ(files, 7u);
    EXPECT_EQ(done, -1);
}

struct QuotedCase {
    std::string input;
    std::size_t capacity;
    int result;
    std::string value;  // '#' where the buffer was not written
};

class QuotedName : public testing::TestWithParam<QuotedCase> {};

TEST_P(QuotedName, FitsTheBufferOrFails) {
    const QuotedCase& c = GetParam();
    std::vector<OLECHAR> buffer(c.capacity + 1, u'#');
    buffer.back() = 0;
    EXPECT_EQ(Scan(W(c.input), W("-Name \"%256[^\"]"), std::span<OLECHAR>(buffer.data(), c.capacity)), c.result);
    EXPECT_EQ(N(buffer.data()), c.value);
}

INSTANTIATE_TEST_SUITE_P(ReplyFormats, QuotedName,
                         testing::Values(QuotedCase{"-Name \"Robot cell 1\"", 257, 1, "Robot cell 1"},
                                         QuotedCase{"-Name \"\"", 257, 0, std::string(257, '#')},
                                         QuotedCase{"-Name \"", 257, -1, std::string(257, '#')},
                                         QuotedCase{"-Name \"" + std::string(300, 'n'), 257, 1, std::string(256, 'n')},
                                         QuotedCase{"-Name \"Robot cell 1\"", 13, 1, "Robot cell 1"},
                                         QuotedCase{"-Name \"Robot cell 1\"", 12, 0, std::string(12, '#')},
                                         QuotedCase{"-Name \"x\"", 0, 0, ""}));

// A word longer than its destination stops the scan there, whatever the
// width says; the fields before it count.
TEST(Scan, FieldTooLongForItsBufferStopsTheScan) {
    std::array<OLECHAR, 10> method{};
    std::array<OLECHAR, 8> address{};
    std::array<OLECHAR, 16> mask{};
    EXPECT_EQ(Scan(W("-Method DHCP -Address 192.168.100.200 -Submask 255.255.0.0"),
                   W("-Method %9s -Address %s -Submask %s"), method, address, mask),
              1);
    EXPECT_EQ(N(method.data()), "DHCP");
    EXPECT_EQ(address[0], 0);
}

// List decoders scan piece by piece, each scan starting where %n said.
TEST(Scan, WalksAnAutoConditionList) {
    const OleString reply = W("-auto_ch 1 -noelts 3\tMotorOn;1;100\tRunMode;0;4294967295\tTooLongName;1;2\t");
    int change = 0, count = 0, used = 0;
    ASSERT_EQ(Scan(reply, W("-auto_ch %d -noelts %d\t%n"), &change, &count, &used), 2);
    OleStringView rest = OleStringView(reply).substr(static_cast<std::size_t>(used));
    std::string names;
    int keep = 0;
    std::uint32_t value = 0;
    std::array<OLECHAR, 11> name{};
    while (Scan(rest, W("%10[^;];%d;%lu\t%n"), name, &keep, &value, &used) == 3) {
        names += N(name.data()) + "=" + std::to_string(value) + " ";
        rest.remove_prefix(static_cast<std::size_t>(used));
    }
    // Ten characters of the long name are taken, then ';' does not match.
    EXPECT_EQ(names, "MotorOn=100 RunMode=4294967295 ");
    EXPECT_EQ(N(name.data()), "TooLongNam");
}

TEST(Scan, ReadsCameraInfoAndWords) {
    // %40s keeps a closing quote; %20[^\"] stops before it.
    std::array<OLECHAR, 41> host{};
    int dhcp = 0;
    std::array<OLECHAR, 21> status{};
    EXPECT_EQ(Scan(W("-currHostName \"cam-7\" -currIsDHCPEnabled 1 -Status \"Running fine\""),
                   W("-currHostName \"%40s -currIsDHCPEnabled %d -Status \"%20[^\"]"), host, &dhcp, status),
              3);
    EXPECT_EQ(N(host.data()), "cam-7\"");
    EXPECT_EQ(N(status.data()), "Running fine");
    std::array<OLECHAR, 16> word{};
    EXPECT_EQ(Scan(W("-sysenergy SAVINGMODEISVERYLONG"), W("-sysenergy %15s"), word), 1);
    EXPECT_EQ(N(word.data()), "SAVINGMODEISVER");
}

TEST(Scan, NulEndsInputAndFormat) {
    const OLECHAR reply[] = {u'-', u'n', u' ', u'1', u'2', 0, u' ', u'3', u'4'};
    const OleStringView text(reply, std::size(reply));
    std::uint32_t first = 0, second = 0;
    EXPECT_EQ(Scan(text, W("-n %lu %lu"), &first, &second), 1);
    std::array<OLECHAR, 16> rest{};
    EXPECT_EQ(Scan(text.substr(5), W("%[^x]"), rest), -1);
    EXPECT_EQ(Scan(text.substr(2), W("%[^x]"), rest), 1);
    EXPECT_EQ(N(rest.data()), " 12");
    const OLECHAR format[] = {u'%', u'd', 0, u'%', u'd'};
    EXPECT_EQ(Scan(W("5 6"), OleStringView(format, std::size(format)), &first), 1);
}

// Units beyond ASCII are ordinary characters; only ASCII white space counts.
TEST(Scan, TreatsTextBeyondAsciiAsCharacters) {
    std::array<OLECHAR, 32> name{};
    std::array<OLECHAR, 32> word{};
    EXPECT_EQ(Scan(W("-Name \"Zelle \xC3\xA9\xE4\xB8\xAD\" -w \xE4\xB8\xAD\xC2\xA0z"), W("-Name \"%256[^\"]\" -w %s"),
                   name, word),
              2);
    EXPECT_EQ(N(name.data()), "Zelle \xC3\xA9\xE4\xB8\xAD");
    EXPECT_EQ(N(word.data()), "\xE4\xB8\xAD\xC2\xA0z");
    const OLECHAR set[] = {u'%', u'[', u'a', u'-', 0x4E2D, u']', 0};
    EXPECT_EQ(Scan(W("z\xE4\xB8\xAD\xE4\xB8\xAE"), set, word), 1);
    EXPECT_EQ(N(word.data()), "z\xE4\xB8\xAD");
}

// Mantissas longer than any fixed buffer still round correctly.
TEST(Scan, ReadsLongDoubles) {
    double value = 0;
    EXPECT_EQ(Scan(W("0." + std::string(2000, '0') + "123e2003"), W("%lf"), &value), 1);
    EXPECT_EQ(value, 123.0);
    EXPECT_EQ(Scan(W(std::string(1000, '9') + "e-1000"), W("%lf"), &value), 1);
    EXPECT_EQ(value, 1.0);
}

TEST(ScanDeathTest, WrongTargetIsAProgrammingError) {
    double real = 0;
    int number = 0;
    std::array<OLECHAR, 4> text{};
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("5"), W("%d"), &real), 0), "wrong kind");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("abc"), W("%s"), &number), 0), "wrong kind");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("5 6"), W("%d %d"), &number), 1), "without a target");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("5"), W("%d"), &number, text), 1), "more scan targets");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("5"), W("%x"), &number), 0), "unsupported");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("abc"), W("%[abc"), text), 0), "malformed");
}

}  // namespace
}  // namespace tav::text::test
