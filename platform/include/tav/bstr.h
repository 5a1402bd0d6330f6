// tav::Bstr: owns one BSTR. A null BSTR is a valid empty string, as
// everywhere in OLE Automation.
#pragma once
#include <string_view>
#include <utility>

#include "tav/platform.h"

namespace tav {

using OleStringView = std::basic_string_view<OLECHAR>;

class Bstr {
public:
    Bstr() noexcept = default;
    // These allocate; when that fails the object is null (IsNull()).
    explicit Bstr(const OLECHAR* text) noexcept : value_(SysAllocString(text)) {}
    explicit Bstr(OleStringView text) noexcept
        : value_(SysAllocStringLen(text.data(), static_cast<UINT>(text.size()))) {}

    Bstr(const Bstr&) = delete;
    Bstr& operator=(const Bstr&) = delete;
    Bstr(Bstr&& other) noexcept : value_(other.Detach()) {}
    Bstr& operator=(Bstr&& other) noexcept {
        if (this != &other) Attach(other.Detach());
        return *this;
    }
    ~Bstr() { SysFreeString(value_); }

    BSTR Get() const noexcept { return value_; }
    bool IsNull() const noexcept { return value_ == nullptr; }
    UINT Length() const noexcept { return SysStringLen(value_); }
    OleStringView View() const noexcept {
        return value_ == nullptr ? OleStringView() : OleStringView(value_, SysStringLen(value_));
    }

    // Takes over `value`, freeing the string held so far.
    void Attach(BSTR value) noexcept {
        if (value != value_) SysFreeString(value_);
        value_ = value;
    }
    [[nodiscard]] BSTR Detach() noexcept { return std::exchange(value_, nullptr); }
    void Release() noexcept { SysFreeString(std::exchange(value_, nullptr)); }
    // Frees the string and hands out its slot for an [out] BSTR* parameter.
    BSTR* Receive() noexcept {
        Release();
        return &value_;
    }

    // A copy for the caller's [out] BSTR*, byte length kept; null stays null.
    HRESULT CopyTo(BSTR* target) const noexcept {
        if (target == nullptr) return E_POINTER;
        *target = nullptr;
        if (value_ == nullptr) return S_OK;
        *target = SysAllocStringByteLen(reinterpret_cast<const char*>(value_), SysStringByteLen(value_));
        return *target == nullptr ? E_OUTOFMEMORY : S_OK;
    }

    // Replaces the string by a copy of `text`; on E_OUTOFMEMORY the old one stays.
    HRESULT Assign(OleStringView text) noexcept {
        BSTR copy = SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
        if (copy == nullptr) return E_OUTOFMEMORY;
        Attach(copy);
        return S_OK;
    }

private:
    BSTR value_ = nullptr;
};

}  // namespace tav
