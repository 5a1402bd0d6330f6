#pragma once
#include <string>
#include <string_view>

#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav::test {

// Tests state texts as UTF-8 literals; COM carries UTF-16.
std::string Narrow(OleStringView text);
std::string Narrow(BSTR text);  // NULL reads as ""
OleString Widen(std::string_view text);

// A BSTR owned by the test.
class TestBstr {
public:
    TestBstr() = default;
    explicit TestBstr(std::string_view text);
    explicit TestBstr(OleStringView text);
    ~TestBstr();
    TestBstr(TestBstr&& other) noexcept;
    TestBstr& operator=(TestBstr&& other) noexcept;
    TestBstr(const TestBstr&) = delete;
    TestBstr& operator=(const TestBstr&) = delete;

    BSTR Get() const { return text_; }
    // Frees the held string and hands out the slot for an out-parameter.
    BSTR* Out();
    std::string Text() const { return Narrow(text_); }
    bool IsNull() const { return text_ == nullptr; }

private:
    BSTR text_ = nullptr;
};

// A VARIANT owned by the test, cleared when it goes.
class TestVariant {
public:
    TestVariant();
    ~TestVariant();
    TestVariant(const TestVariant&) = delete;
    TestVariant& operator=(const TestVariant&) = delete;

    static TestVariant Text(std::string_view text);
    static TestVariant Text(OleStringView text);
    static TestVariant NullBstr();
    static TestVariant Number(LONG value);
    TestVariant(TestVariant&& other) noexcept;

    VARIANT* Get() { return &value_; }
    const VARIANT& operator*() const { return value_; }

private:
    VARIANT value_;
};

}  // namespace tav::test
