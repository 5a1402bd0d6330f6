#include <gtest/gtest.h>

#include <iterator>
#include <set>
#include <tuple>

#include "platform_test_support.h"

namespace {

using tav::test::OleString;

const GUID sample = {0x0123abcd, 0x4567, 0x89ef, {0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef}};

TEST(Guid, TextIsBracedUpperCaseInTaskMemoryAndReadInEitherCase) {
    LPOLESTR text = nullptr;
    ASSERT_EQ(StringFromCLSID(sample, &text), S_OK);
    EXPECT_EQ(OleString(text), OLESTR("{0123ABCD-4567-89EF-0123-456789ABCDEF}"));
    CoTaskMemFree(text);
    CLSID parsed;
    ASSERT_EQ(CLSIDFromString(OLESTR("{0123abcd-4567-89ef-0123-456789abcdef}"), &parsed), S_OK);
    EXPECT_TRUE(IsEqualGUID(parsed, sample));
}

TEST(Guid, TextRoundTripsThroughClsidFromString) {
    for (int i = 0; i < 20; ++i) {
        GUID original;
        ASSERT_EQ(CoCreateGuid(&original), S_OK);
        LPOLESTR text = nullptr;
        ASSERT_EQ(StringFromCLSID(original, &text), S_OK);
        CLSID parsed;
        EXPECT_EQ(CLSIDFromString(text, &parsed), S_OK);
        EXPECT_TRUE(IsEqualGUID(parsed, original));
        CoTaskMemFree(text);
    }
}

TEST(Guid, ClsidFromStringRefusesMalformedText) {
    const OLECHAR* refused[] = {
        OLESTR("0123ABCD-4567-89EF-0123-456789ABCDEF"),     // no braces: read as a ProgID nobody registered
        OLESTR("{0123ABCD-4567-89EF-0123-456789ABCDEF"),    // no closing brace
        OLESTR("{0123ABCD-4567-89EF-0123-456789ABCDEF}x"),  // trailing text
        OLESTR("{0123ABCD-4567-89EF-0123456789ABCDEF}"),    // missing dash
        OLESTR("{0123ABCG-4567-89EF-0123-456789ABCDEF}"),   // not hexadecimal
        OLESTR("{0123ABC-4567-89EF-0123-456789ABCDEF0}"),   // group too short
        OLESTR("{}"),
    };
    for (std::size_t i = 0; i < std::size(refused); ++i) {
        SCOPED_TRACE(testing::Message() << "case " << i);
        CLSID parsed;
        EXPECT_EQ(CLSIDFromString(refused[i], &parsed), CO_E_CLASSSTRING);
    }
}

TEST(Guid, StringFromGuid2NeedsRoomForTheTerminator) {
    OLECHAR text[39];
    EXPECT_EQ(StringFromGUID2(sample, text, 38), 0);
    EXPECT_EQ(StringFromGUID2(sample, text, 39), 39);
    EXPECT_EQ(text[38], 0);
}

TEST(Guid, CreatedGuidsAreDistinctVersion4Guids) {
    std::set<std::tuple<uint32_t, uint16_t, uint16_t>> seen;
    for (int i = 0; i < 100; ++i) {
        GUID id;
        ASSERT_EQ(CoCreateGuid(&id), S_OK);
        EXPECT_EQ(id.Data3 >> 12, 4);
        EXPECT_EQ(id.Data4[0] & 0xC0, 0x80);
        EXPECT_TRUE(seen.emplace(id.Data1, id.Data2, id.Data3).second);
    }
}

}  // namespace
