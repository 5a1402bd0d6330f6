#include "support/test_text.h"
#include "tav/utf8.h"

#include <utility>

namespace tav::test {

std::string Narrow(OleStringView text) { return utf8::FromOle(text); }

std::string Narrow(BSTR text) { return text == nullptr ? std::string() : Narrow(OleStringView(text, SysStringLen(text))); }

OleString Widen(std::string_view text) { return utf8::ToOle(text); }

TestBstr::TestBstr(std::string_view text) : TestBstr(OleStringView(Widen(text))) {}

TestBstr::TestBstr(OleStringView text) : text_(SysAllocStringLen(text.data(), static_cast<UINT>(text.size()))) {}

TestBstr::~TestBstr() { SysFreeString(text_); }

TestBstr::TestBstr(TestBstr&& other) noexcept : text_(std::exchange(other.text_, nullptr)) {}

TestBstr& TestBstr::operator=(TestBstr&& other) noexcept {
    std::swap(text_, other.text_);
    return *this;
}

BSTR* TestBstr::Out() {
    SysFreeString(std::exchange(text_, nullptr));
    return &text_;
}

TestVariant::TestVariant() { VariantInit(&value_); }

TestVariant::~TestVariant() { VariantClear(&value_); }

TestVariant::TestVariant(TestVariant&& other) noexcept : value_(other.value_) { VariantInit(&other.value_); }

TestVariant TestVariant::Text(std::string_view text) { return Text(OleStringView(Widen(text))); }

TestVariant TestVariant::Text(OleStringView text) {
    TestVariant v;
    v.value_.vt = VT_BSTR;
    v.value_.bstrVal = SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
    return v;
}

TestVariant TestVariant::NullBstr() {
    TestVariant v;
    v.value_.vt = VT_BSTR;
    v.value_.bstrVal = nullptr;
    return v;
}

TestVariant TestVariant::Number(LONG value) {
    TestVariant v;
    v.value_.vt = VT_I4;
    v.value_.lVal = value;
    return v;
}

}  // namespace tav::test
