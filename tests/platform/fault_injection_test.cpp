#include <gtest/gtest.h>

#include "tav/bstr.h"
#include "tav/variant.h"

namespace {

class FaultInjection : public testing::Test {
protected:
    void SetUp() override {
        if (!TavFailAllocationAt(0)) GTEST_SKIP() << "allocations cannot be failed on this platform";
    }
    void TearDown() override { TavFailAllocationAt(0); }
};

TEST_F(FaultInjection, TheKthAllocationFailsOnceAndOnlyIt) {
    long before = TavAllocationCount();
    ASSERT_TRUE(TavFailAllocationAt(3));
    void* first = TavMemAlloc(8);
    BSTR second = SysAllocString(OLESTR("x"));
    void* third = CoTaskMemAlloc(8);
    BSTR fourth = SysAllocStringByteLen("odd", 3);
    EXPECT_NE(first, nullptr);
    EXPECT_NE(second, nullptr);
    EXPECT_EQ(third, nullptr);
    EXPECT_NE(fourth, nullptr);
    EXPECT_FALSE(TavAllocationFailurePending());
    EXPECT_EQ(TavAllocationCount() - before, 4);
    TavMemFree(first);
    SysFreeString(second);
    SysFreeString(fourth);
}

TEST_F(FaultInjection, ZeroSwitchesAnArmedFailureOff) {
    TavFailAllocationAt(1);
    EXPECT_TRUE(TavAllocationFailurePending());
    TavFailAllocationAt(0);
    EXPECT_FALSE(TavAllocationFailurePending());
    void* block = CoTaskMemAlloc(16);
    EXPECT_NE(block, nullptr);
    CoTaskMemFree(block);
}

TEST_F(FaultInjection, ReallocationFailureKeepsTheOldBlock) {
    auto* block = static_cast<char*>(CoTaskMemAlloc(4));
    block[0] = 'k';
    TavFailAllocationAt(1);
    EXPECT_EQ(CoTaskMemRealloc(block, 1024), nullptr);
    EXPECT_EQ(block[0], 'k');
    CoTaskMemFree(block);
}

TEST_F(FaultInjection, EveryAllocationOfAnOperationFailsInTurnWithoutLeaking) {
    tav::Variant source;
    ASSERT_EQ(source.SetString(OLESTR("-Name \"Controller\"")), S_OK);
    int failures = 0;
    HRESULT lastResult = S_OK;
    long allocations = tav::ForEachAllocationFailure(
        [&] {
            tav::Variant copy;
            lastResult = copy.CopyFrom(*source.Get());
            LPOLESTR text = nullptr;
            if (SUCCEEDED(lastResult)) lastResult = StringFromCLSID(GUID_NULL, &text);
            CoTaskMemFree(text);
        },
        [&] {
            ++failures;
            EXPECT_EQ(lastResult, E_OUTOFMEMORY);
        });
    EXPECT_EQ(allocations, 2);  // the copied BSTR, then the GUID text
    EXPECT_EQ(failures, 2);
    EXPECT_EQ(lastResult, S_OK);
}

TEST_F(FaultInjection, FailedStringsLeaveTheOwnerNullOrUnchanged) {
    TavFailAllocationAt(1);
    tav::Bstr text(OLESTR("lost"));
    EXPECT_TRUE(text.IsNull());
    ASSERT_EQ(text.Assign(OLESTR("kept")), S_OK);
    TavFailAllocationAt(1);
    EXPECT_EQ(text.Assign(OLESTR("other")), E_OUTOFMEMORY);
    EXPECT_EQ(text.View(), OLESTR("kept"));
    TavFailAllocationAt(1);
    EXPECT_FALSE(SysReAllocString(text.Receive(), OLESTR("x")));
}

}  // namespace
