#include <gtest/gtest.h>

#include "tav/variant.h"

namespace {

// Counts its references so that a test can see VariantCopy and VariantClear at work.
class CountedObject : public IUnknown {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID, void** object) override {
        *object = nullptr;
        return E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references; }
    ULONG STDMETHODCALLTYPE Release() override { return --references; }
    ULONG references = 1;
};

TEST(Variant, CopyOfABstrIsADeepCopyAndClearFreesBoth) {
    VARIANT source;
    VariantInit(&source);
    source.vt = VT_BSTR;
    source.bstrVal = SysAllocString(OLESTR("-Name \"IRB\""));
    VARIANT copy;
    VariantInit(&copy);
    ASSERT_EQ(VariantCopy(&copy, &source), S_OK);
    EXPECT_EQ(copy.vt, VT_BSTR);
    EXPECT_NE(copy.bstrVal, source.bstrVal);
    EXPECT_EQ(tav::OleStringView(copy.bstrVal, SysStringLen(copy.bstrVal)), OLESTR("-Name \"IRB\""));
    // Both must be freed here: a shallow copy would free twice, a missing
    // clear would leak; either fails the run under the address sanitizer.
    EXPECT_EQ(VariantClear(&source), S_OK);
    EXPECT_EQ(VariantClear(&copy), S_OK);
    EXPECT_EQ(copy.vt, VT_EMPTY);
}

// Scalars are copied whole; the string the target held is freed (else the
// leak checker fails the run).
TEST(Variant, ScalarsAreCopiedOverWhatTheTargetHeld) {
    VARIANT target;
    VariantInit(&target);
    target.vt = VT_BSTR;
    target.bstrVal = SysAllocString(OLESTR("old"));
    VARIANT source;
    VariantInit(&source);
    source.vt = VT_I4;
    source.lVal = -7;
    ASSERT_EQ(VariantCopy(&target, &source), S_OK);
    EXPECT_EQ(target.vt, VT_I4);
    EXPECT_EQ(target.lVal, -7);
    source.vt = VT_R8;
    source.dblVal = 2.5;
    ASSERT_EQ(VariantCopy(&target, &source), S_OK);
    EXPECT_EQ(target.vt, VT_R8);
    EXPECT_EQ(target.dblVal, 2.5);
    source.vt = VT_BOOL;
    source.boolVal = VARIANT_TRUE;
    ASSERT_EQ(VariantCopy(&target, &source), S_OK);
    EXPECT_EQ(target.boolVal, VARIANT_TRUE);
}

TEST(Variant, InterfacesAreAddRefedOnCopyAndReleasedOnClear) {
    CountedObject object;
    VARIANT source;
    VariantInit(&source);
    source.vt = VT_UNKNOWN;
    source.punkVal = &object;
    VARIANT copy;
    VariantInit(&copy);
    ASSERT_EQ(VariantCopy(&copy, &source), S_OK);
    EXPECT_EQ(object.references, 2u);
    VariantClear(&copy);
    VariantClear(&source);
    EXPECT_EQ(object.references, 0u);
}

TEST(Variant, UnknownTypeIsRefused) {
    VARIANT odd;
    VariantInit(&odd);
    odd.vt = 0x0FFF;
    EXPECT_EQ(VariantClear(&odd), DISP_E_BADVARTYPE);
}

TEST(VariantOwner, MovesOwnershipAndClearsOnDestruction) {
    CountedObject object;
    {
        tav::Variant first;
        ASSERT_EQ(first.SetString(OLESTR("reply")), S_OK);
        tav::Variant second = std::move(first);
        EXPECT_EQ(first.Type(), VT_EMPTY);
        EXPECT_EQ(second.StringView(), OLESTR("reply"));
        second.SetUnknown(&object);  // frees the string
        EXPECT_EQ(object.references, 2u);
        tav::Variant copy;
        ASSERT_EQ(copy.CopyFrom(*second.Get()), S_OK);
        EXPECT_EQ(object.references, 3u);
    }
    EXPECT_EQ(object.references, 1u);
}

TEST(VariantOwner, CopyToTreatsTheTargetAsUninitialised) {
    tav::Variant source;
    source.SetString(OLESTR("text"));
    VARIANT target;
    target.vt = VT_BSTR;  // garbage, as an [out] parameter arrives
    target.bstrVal = reinterpret_cast<BSTR>(0x1);
    ASSERT_EQ(source.CopyTo(&target), S_OK);
    tav::Variant owner;
    owner.Attach(target);
    EXPECT_EQ(owner.StringView(), OLESTR("text"));
}

struct UI4Case {
    const OLECHAR* text;
    HRESULT result;
    ULONG value;
};

TEST(VarUI4FromStr, ParsesAsOleAutomationDoes) {
    const UI4Case cases[] = {
        {OLESTR("0"), S_OK, 0},
        {OLESTR("  42  "), S_OK, 42},
        {OLESTR("+17"), S_OK, 17},
        {OLESTR("4294967295"), S_OK, 4294967295u},
        {OLESTR("4294967296"), DISP_E_OVERFLOW, 0},
        {OLESTR("-1"), DISP_E_OVERFLOW, 0},
        {OLESTR("-0"), S_OK, 0},
        {OLESTR("2.5"), S_OK, 2},
        {OLESTR("3.5"), S_OK, 4},
        {OLESTR("2.51"), S_OK, 3},
        {OLESTR("1e3"), S_OK, 1000},
        {OLESTR("1,000"), S_OK, 1000},
        {OLESTR("&HFF"), S_OK, 255},
        {OLESTR(""), DISP_E_TYPEMISMATCH, 0},
        {OLESTR("12abc"), DISP_E_TYPEMISMATCH, 0},
        {OLESTR("abc"), DISP_E_TYPEMISMATCH, 0},
    };
    for (const UI4Case& c : cases) {
        SCOPED_TRACE(testing::Message() << "case " << (&c - cases));
        ULONG value = 0;
        EXPECT_EQ(VarUI4FromStr(const_cast<OLECHAR*>(c.text), LOCALE_USER_DEFAULT, 0, &value), c.result);
        if (c.result == S_OK) {
            EXPECT_EQ(value, c.value);
        }
    }
}

}  // namespace
