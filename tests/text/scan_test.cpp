// The reply formats the decoders use, and what the C library cannot show:
// buffer capacity, NUL, text beyond ASCII, wrong targets.
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string>
#include <tuple>
#include <vector>

#include "core/text/scan.h"
#include "tav/platform.h"
#include "text_test_util.h"

namespace tav::text::test {
namespace {

struct OneNumberCase {
    const char* format;
    const char* input;
    int result;
    std::uint32_t value;  // when result is 1
};

class OneNumber : public testing::TestWithParam<OneNumberCase> {};

TEST_P(OneNumber, ReadsOrRefuses) {
    const OneNumberCase& c = GetParam();
    std::uint32_t value = 0xDEADBEEF;
    EXPECT_EQ(Scan(W(c.input), W(c.format), &value), c.result);
    EXPECT_EQ(value, c.result == 1 ? c.value : 0xDEADBEEF);
}

INSTANTIATE_TEST_SUITE_P(
    ReplyFormats, OneNumber,
    testing::Values(OneNumberCase{"-time_t %lu", "-time_t 1700000000", 1, 1700000000},
                    OneNumberCase{"-time_t %lu", "-time_t 4294967295", 1, 4294967295},
                    OneNumberCase{"-time_t %lu", "-time_t -1", 1, 4294967295},
                    OneNumberCase{"-time_t %lu", "-time_t 4294967296", 1, 0},
                    OneNumberCase{"-time_t %lu", "-time_t 99999999999999999999", 1, 4294967295},
                    OneNumberCase{"-time_t %lu", "-time_t\t\n 12 trailing", 1, 12},
                    OneNumberCase{"-time_t %lu", "-time_t", -1, 0},
                    OneNumberCase{"-time_t %lu", "-time_t   ", -1, 0},
                    OneNumberCase{"-time_t %lu", "", -1, 0},
                    OneNumberCase{"-time_t %lu", "-time_x 12", 0, 0},
                    OneNumberCase{"-time_t %lu", "-time_t x", 0, 0},
                    OneNumberCase{"-time_t %lu", "-time_t -", 0, 0},
                    OneNumberCase{"-pstatus %u", "-pstatus 2147500037", 1, 0x80004005},
                    OneNumberCase{"-IsDone %d", "-IsDone -1", 1, 0xFFFFFFFF},
                    OneNumberCase{"-IsDone %d", "-IsDone 2147483648", 1, 0x80000000},
                    OneNumberCase{"-IsDone %d", "-IsDone 9223372036854775808", 1, 0xFFFFFFFF},
                    OneNumberCase{"-IsDone %d", "-IsDone -9223372036854775809", 1, 0},
                    OneNumberCase{"-IsDone %d", "-IsDone +0007", 1, 7},
                    OneNumberCase{"-SlotId %3d", "-SlotId 12345", 1, 123},
                    OneNumberCase{"-SlotId %1d", "-SlotId -5", 0, 0},
                    OneNumberCase{"%%%d", " % 5", 1, 5}));

// Integers go into any 4-byte integer, signed or not: the bits are the same.
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
    const char* input;
    std::size_t capacity;
    int result;
    const char* value;  // nullptr: the buffer keeps its old content
};

class QuotedName : public testing::TestWithParam<QuotedCase> {};

TEST_P(QuotedName, FitsTheBufferOrFails) {
    const QuotedCase& c = GetParam();
    std::vector<OLECHAR> buffer(c.capacity + 1, u'#');
    const std::span<OLECHAR> field(buffer.data(), c.capacity);
    EXPECT_EQ(Scan(W(c.input), W("-Name \"%256[^\"]"), field), c.result);
    if (c.value != nullptr) {
        EXPECT_EQ(N(buffer.data()), c.value);
    } else {
        EXPECT_EQ(buffer[0], u'#');
    }
    EXPECT_EQ(buffer[c.capacity], u'#') << "written past the span";
}

const std::string k256(256, 'n');
const std::string k257(257, 'n');
const std::string kName256 = "-Name \"" + k256 + "\"";
const std::string kName257 = "-Name \"" + k257 + "\"";

INSTANTIATE_TEST_SUITE_P(ReplyFormats, QuotedName,
                         testing::Values(QuotedCase{"-Name \"Robot cell 1\"", 257, 1, "Robot cell 1"},
                                         QuotedCase{"-Name \"no closing quote", 257, 1, "no closing quote"},
                                         QuotedCase{"-Name \"\"", 257, 0, nullptr},
                                         QuotedCase{"-Name \"", 257, -1, nullptr},
                                         QuotedCase{"-Name Robot", 257, 0, nullptr},
                                         QuotedCase{kName256.c_str(), 257, 1, k256.c_str()},
                                         QuotedCase{kName257.c_str(), 257, 1, k256.c_str()},
                                         QuotedCase{"-Name \"Robot cell 1\"", 13, 1, "Robot cell 1"},
                                         QuotedCase{"-Name \"Robot cell 1\"", 12, 0, nullptr},
                                         QuotedCase{"-Name \"x\"", 0, 0, nullptr}));

// A word longer than its destination fails that field and stops there,
// whatever the width says; the fields before it count.
TEST(Scan, FieldTooLongForItsBufferStopsTheScan) {
    std::array<OLECHAR, 10> method{};
    std::array<OLECHAR, 8> address{};
    std::array<OLECHAR, 16> mask{};
    std::array<OLECHAR, 16> gateway{};
    const OleString reply = W("-Method DHCP -Address 192.168.100.200 -Submask 255.255.0.0 -Gateway 10.0.0.1");
    EXPECT_EQ(Scan(reply, W("-Method %9s -Address %s -Submask %s -Gateway %s"), method, address, mask, gateway), 1);
    EXPECT_EQ(N(method.data()), "DHCP");
    EXPECT_EQ(address[0], 0);
    EXPECT_EQ(mask[0], 0);
}

// The decoders walk a list with %n, each scan starting where the last ended.
TEST(Scan, WalksAnAutoConditionList) {
    const OleString reply = W("-auto_ch 1 -noelts 3\tMotorOn;1;100\tRunMode;0;4294967295\tTooLongName;1;2\t");
    int change = 0;
    int count = 0;
    int used = 0;
    ASSERT_EQ(Scan(reply, W("-auto_ch %d -noelts %d\t%n"), &change, &count, &used), 2);
    EXPECT_EQ(change, 1);
    EXPECT_EQ(count, 3);
    OleStringView rest = OleStringView(reply).substr(static_cast<std::size_t>(used));

    // A name of more than ten characters: ten are taken, then ';' does not
    // match, so one field instead of three.
    const std::vector<std::tuple<int, std::string, int, std::uint32_t>> expected = {
        {3, "MotorOn", 1, 100}, {3, "RunMode", 0, 4294967295}, {1, "", 0, 0}};
    for (const auto& [result, name, keep, value] : expected) {
        std::array<OLECHAR, 11> element{};
        int gotKeep = 0;
        std::uint32_t gotValue = 0;
        ASSERT_EQ(Scan(rest, W("%10[^;];%d;%lu\t%n"), element, &gotKeep, &gotValue, &used), result);
        if (result == 3) {
            EXPECT_EQ(N(element.data()), name);
            EXPECT_EQ(gotKeep, keep);
            EXPECT_EQ(gotValue, value);
            rest.remove_prefix(static_cast<std::size_t>(used));
        }
    }
}

TEST(Scan, ReadsStorageDeviceAndSlotHeads) {
    const OleString devices = W("-noelts 2\tHD0;disk;1;0\tUSB1;usb stick;0;1\t");
    LONG count = 0;
    int used = 0;
    ASSERT_EQ(Scan(devices, W("-noelts %ld\t%n"), &count, &used), 1);
    EXPECT_EQ(count, 2);
    std::array<OLECHAR, 31> name{};
    std::array<OLECHAR, 21> type{};
    int enabled = -1;
    int readOnly = -1;
    OleStringView rest = OleStringView(devices).substr(static_cast<std::size_t>(used));
    ASSERT_EQ(Scan(rest, W("%30[^;];%20[^;];%d;%d\t%n"), name, type, &enabled, &readOnly, &used), 4);
    rest.remove_prefix(static_cast<std::size_t>(used));
    ASSERT_EQ(Scan(rest, W("%30[^;];%20[^;];%d;%d\t%n"), name, type, &enabled, &readOnly, &used), 4);
    EXPECT_EQ(N(name.data()), "USB1");
    EXPECT_EQ(N(type.data()), "usb stick");
    EXPECT_EQ(enabled, 0);
    EXPECT_EQ(readOnly, 1);

    std::int32_t elements = 0;
    std::int32_t all = 0;
    std::uint32_t mark = 0;
    std::uint32_t cursor = 0;
    const std::string head = "-noelts,all,mark,cc -1,1,7,4294967295\t";
    EXPECT_EQ(Scan(W(head + "first"), W("-noelts,all,mark,cc %ld,%ld,%lu,%lu\t%n"), &elements, &all, &mark, &cursor,
                   &used),
              4);
    EXPECT_EQ(elements, -1);
    EXPECT_EQ(cursor, 4294967295u);
    EXPECT_EQ(used, static_cast<int>(head.size()));
}

TEST(Scan, ReadsNumberAndFlagArrays) {
    const OleString reply = W("-axes 3[1.5,-2e3,0.000125,]-ssv 4[1011]");
    std::array<OLECHAR, 16> key{};
    int count = 0;
    int used = 0;
    ASSERT_EQ(Scan(reply, W("-%s %d[%n"), key, &count, &used), 2);
    EXPECT_EQ(N(key.data()), "axes");
    OleStringView rest = OleStringView(reply).substr(static_cast<std::size_t>(used));
    std::vector<double> values;
    for (int i = 0; i < count; ++i) {
        double value = 0;
        ASSERT_EQ(Scan(rest, W("%lf,%n"), &value, &used), 1);
        values.push_back(value);
        rest.remove_prefix(static_cast<std::size_t>(used));
    }
    EXPECT_EQ(values, (std::vector<double>{1.5, -2000.0, 0.000125}));

    rest.remove_prefix(1);  // the ']'
    ASSERT_EQ(Scan(rest, W("-%s %d[%n"), key, &count, &used), 2);
    rest.remove_prefix(static_cast<std::size_t>(used));
    std::string flags;
    for (int i = 0; i < count; ++i) {
        OLECHAR flag = 0;
        ASSERT_EQ(Scan(rest, W("%c%n"), &flag, &used), 1);
        flags += static_cast<char>(flag);
        rest.remove_prefix(static_cast<std::size_t>(used));
    }
    EXPECT_EQ(flags, "1011");
}

TEST(Scan, ReadsAddressesAndCameraInfo) {
    std::array<std::uint32_t, 4> part{};
    EXPECT_EQ(Scan(W(" 192. 168.1.10 and more"), W("%lu.%lu.%lu.%lu"), &part[0], &part[1], &part[2], &part[3]), 4);
    EXPECT_EQ(part, (std::array<std::uint32_t, 4>{192, 168, 1, 10}));

    // %40s keeps a closing quote; %20[^\"] stops before it.
    std::array<OLECHAR, 41> host{};
    int dhcp = 0;
    std::array<OLECHAR, 21> status{};
    EXPECT_EQ(Scan(W("-currHostName \"cam-7\" -currIsDHCPEnabled 1 -Status \"Running fine\""),
                   W("-currHostName \"%40s -currIsDHCPEnabled %d -Status \"%20[^\"]"), host, &dhcp, status),
              3);
    EXPECT_EQ(N(host.data()), "cam-7\"");
    EXPECT_EQ(dhcp, 1);
    EXPECT_EQ(N(status.data()), "Running fine");

    std::array<OLECHAR, 16> word{};
    EXPECT_EQ(Scan(W("-sysenergy SAVINGMODEISVERYLONG"), W("-sysenergy %15s"), word), 1);
    EXPECT_EQ(N(word.data()), "SAVINGMODEISVER");
}

TEST(Scan, NulEndsTheInput) {
    const OLECHAR reply[] = {u'-', u'n', u' ', u'1', u'2', 0, u' ', u'3', u'4'};
    const OleStringView text(reply, std::size(reply));
    std::uint32_t first = 0;
    std::uint32_t second = 0;
    EXPECT_EQ(Scan(text, W("-n %lu %lu"), &first, &second), 1);
    EXPECT_EQ(first, 12u);
    std::array<OLECHAR, 16> rest{};
    EXPECT_EQ(Scan(text.substr(5), W("%[^x]"), rest), -1);
    EXPECT_EQ(Scan(text.substr(2), W("%[^x]"), rest), 1);
    EXPECT_EQ(N(rest.data()), " 12");
}

// Units beyond ASCII are ordinary characters; only ASCII white space counts.
TEST(Scan, TreatsTextBeyondAsciiAsCharacters) {
    const OleString reply = W("-Name \"Zelle \xC3\xA9\xE4\xB8\xAD\xC2\xA0" "1\" -w \xE4\xB8\xAD\xC2\xA0z");
    std::array<OLECHAR, 32> name{};
    std::array<OLECHAR, 32> word{};
    EXPECT_EQ(Scan(reply, W("-Name \"%256[^\"]\" -w %s"), name, word), 2);
    EXPECT_EQ(N(name.data()), "Zelle \xC3\xA9\xE4\xB8\xAD\xC2\xA0" "1");
    EXPECT_EQ(N(word.data()), "\xE4\xB8\xAD\xC2\xA0z");

    const OLECHAR set[] = {u'%', u'[', u'a', u'-', 0x4E2D, u']', 0};
    EXPECT_EQ(Scan(W("z\xE4\xB8\xAD\xE4\xB8\xAE"), set, word), 1);
    EXPECT_EQ(N(word.data()), "z\xE4\xB8\xAD");
}

TEST(Scan, ReadsDoublesAsStrtodDoes) {
    double value = 0;
    EXPECT_EQ(Scan(W("0.1"), W("%lf"), &value), 1);
    EXPECT_EQ(value, 0.1);
    EXPECT_EQ(Scan(W("-Infinity"), W("%lf"), &value), 1);
    EXPECT_EQ(value, -std::numeric_limits<double>::infinity());
    EXPECT_EQ(Scan(W("1e-400"), W("%lf"), &value), 1);
    EXPECT_EQ(value, 0.0);
    EXPECT_EQ(Scan(W("4e-320"), W("%lf"), &value), 1);
    EXPECT_EQ(value, 4e-320);
    // The exponent's digits are far beyond what any field holds.
    const std::string longMantissa = "0." + std::string(2000, '0') + "123e2003";
    EXPECT_EQ(Scan(W(longMantissa), W("%lf"), &value), 1);
    EXPECT_EQ(value, 123.0);
    const std::string manyDigits = std::string(1000, '9') + "e-1000";
    EXPECT_EQ(Scan(W(manyDigits), W("%lf"), &value), 1);
    EXPECT_EQ(value, 1.0);
}

TEST(Scan, SuppressedFieldsAreReadButNotCounted) {
    int value = 0;
    int used = 0;
    EXPECT_EQ(Scan(W("skip 12 34"), W("%*s %*d %d%n"), &value, &used), 1);
    EXPECT_EQ(value, 34);
    EXPECT_EQ(used, 10);
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
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("5"), W("%f"), &real), 0), "unsupported");
    EXPECT_DEBUG_DEATH(EXPECT_EQ(Scan(W("abc"), W("%[abc"), text), 0), "malformed");
}

}  // namespace
}  // namespace tav::text::test
