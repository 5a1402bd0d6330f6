#include "support/test_text.h"

#include <utility>

namespace tav::test {

std::string Narrow(OleStringView text) {
    std::string out;
    for (size_t i = 0; i < text.size(); ++i) {
        char32_t c = text[i];
        if (c >= 0xD800 && c < 0xDC00 && i + 1 < text.size() && text[i + 1] >= 0xDC00 && text[i + 1] < 0xE000) {
            c = 0x10000 + ((c - 0xD800) << 10) + (text[i + 1] - 0xDC00);
            ++i;
        }
        if (c < 0x80) {
            out += static_cast<char>(c);
        } else if (c < 0x800) {
            out += static_cast<char>(0xC0 | (c >> 6));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else if (c < 0x10000) {
            out += static_cast<char>(0xE0 | (c >> 12));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else {
            out += static_cast<char>(0xF0 | (c >> 18));
            out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        }
    }
    return out;
}

std::string Narrow(BSTR text) { return text == nullptr ? std::string() : Narrow(OleStringView(text, SysStringLen(text))); }

OleString Widen(std::string_view text) {
    OleString out;
    for (size_t i = 0; i < text.size();) {
        const auto lead = static_cast<unsigned char>(text[i]);
        const int extra = lead < 0x80 ? 0 : lead < 0xE0 ? 1 : lead < 0xF0 ? 2 : 3;
        char32_t c = extra == 0 ? lead : lead & (0x3F >> extra);
        for (int k = 1; k <= extra && i + k < text.size(); ++k) {
            c = (c << 6) | (static_cast<unsigned char>(text[i + k]) & 0x3F);
        }
        i += 1 + extra;
        if (c >= 0x10000) {
            c -= 0x10000;
            out += static_cast<OLECHAR>(0xD800 + (c >> 10));
            out += static_cast<OLECHAR>(0xDC00 + (c & 0x3FF));
        } else {
            out += static_cast<OLECHAR>(c);
        }
    }
    return out;
}

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
