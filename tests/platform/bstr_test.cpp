#include <gtest/gtest.h>

#include <cstring>

#include "tav/bstr.h"

namespace {

DWORD PrefixOf(BSTR text) {
    DWORD prefix;
    std::memcpy(&prefix, reinterpret_cast<const BYTE*>(text) - sizeof(DWORD), sizeof prefix);
    return prefix;
}

// The byte length stands before the text and a terminator after it; the
// length is that prefix, not the first terminator.
TEST(Bstr, StoresByteLengthBeforeTheTextAndATerminatorAfterIt) {
    BSTR robot = SysAllocString(OLESTR("Robot"));
    ASSERT_NE(robot, nullptr);
    EXPECT_EQ(PrefixOf(robot), 10u);
    EXPECT_EQ(SysStringLen(robot), 5u);
    EXPECT_EQ(robot[5], 0);
    SysFreeString(robot);

    const OLECHAR withNull[] = {'a', 0, 'b'};
    BSTR text = SysAllocStringLen(withNull, 3);
    ASSERT_NE(text, nullptr);
    EXPECT_EQ(PrefixOf(text), 6u);
    EXPECT_EQ(SysStringLen(text), 3u);
    EXPECT_EQ(SysStringByteLen(text), 6u);
    EXPECT_EQ(text[2], 'b');
    EXPECT_EQ(text[3], 0);
    SysFreeString(text);
}

TEST(Bstr, ByteLengthMayBeOddAndIsStillTerminated) {
    for (UINT length : {0u, 1u, 2u, 3u, 7u}) {
        SCOPED_TRACE(length);
        BSTR text = SysAllocStringByteLen("abcdefg", length);
        ASSERT_NE(text, nullptr);
        EXPECT_EQ(SysStringByteLen(text), length);
        EXPECT_EQ(SysStringLen(text), length / 2);
        auto* bytes = reinterpret_cast<const BYTE*>(text);
        EXPECT_EQ(std::memcmp(bytes, "abcdefg", length), 0);
        EXPECT_EQ(bytes[length], 0);
        EXPECT_EQ(bytes[length + 1], 0);
        SysFreeString(text);
    }
}

TEST(Bstr, NullSourcesGiveNullOrZeroedStrings) {
    EXPECT_EQ(SysAllocString(nullptr), nullptr);
    EXPECT_EQ(SysStringLen(nullptr), 0u);
    EXPECT_EQ(SysStringByteLen(nullptr), 0u);
    SysFreeString(nullptr);

    BSTR empty = SysAllocStringLen(nullptr, 0);
    ASSERT_NE(empty, nullptr);
    EXPECT_EQ(SysStringLen(empty), 0u);
    EXPECT_EQ(empty[0], 0);
    SysFreeString(empty);
}

TEST(Bstr, ReAllocateFromItsOwnText) {
    BSTR text = SysAllocString(OLESTR("controller"));
    ASSERT_TRUE(SysReAllocString(&text, text + 4));
    EXPECT_EQ(tav::OleStringView(text, SysStringLen(text)), OLESTR("roller"));
    ASSERT_TRUE(SysReAllocStringLen(&text, text, 4));
    EXPECT_EQ(tav::OleStringView(text, SysStringLen(text)), OLESTR("roll"));
    SysFreeString(text);
}

TEST(BstrOwner, FreesOnDestructionAndAfterReceive) {
    tav::Bstr text(OLESTR("first"));
    EXPECT_EQ(text.View(), OLESTR("first"));
    *text.Receive() = SysAllocString(OLESTR("second"));  // the first is freed, else the leak checker fails the run
    EXPECT_EQ(text.Length(), 6u);
    BSTR detached = text.Detach();
    EXPECT_TRUE(text.IsNull());
    text.Attach(detached);
    EXPECT_EQ(text.View(), OLESTR("second"));
}

TEST(BstrOwner, CopyKeepsAnOddByteLength) {
    tav::Bstr odd;
    odd.Attach(SysAllocStringByteLen("abc", 3));
    BSTR copy = nullptr;
    ASSERT_EQ(odd.CopyTo(&copy), S_OK);
    EXPECT_NE(copy, odd.Get());
    EXPECT_EQ(SysStringByteLen(copy), 3u);
    SysFreeString(copy);

    tav::Bstr none;
    copy = SysAllocString(OLESTR("stale"));
    SysFreeString(copy);
    ASSERT_EQ(none.CopyTo(&copy), S_OK);
    EXPECT_EQ(copy, nullptr);
}

TEST(BstrOwner, EmptyViewStillMakesAString) {
    tav::Bstr empty{tav::OleStringView()};
    EXPECT_FALSE(empty.IsNull());
    EXPECT_EQ(empty.Length(), 0u);
}

}  // namespace
