// tav::Variant: owns one VARIANT and clears it on destruction, which frees
// its BSTR or releases its interface.
#pragma once
#include <utility>

#include "tav/bstr.h"
#include "tav/platform.h"

namespace tav {

class Variant {
public:
    Variant() noexcept { VariantInit(&value_); }
    Variant(const Variant&) = delete;
    Variant& operator=(const Variant&) = delete;
    Variant(Variant&& other) noexcept : value_(other.value_) { VariantInit(&other.value_); }
    Variant& operator=(Variant&& other) noexcept {
        if (this != &other) {
            VariantClear(&value_);
            value_ = other.value_;
            VariantInit(&other.value_);
        }
        return *this;
    }
    ~Variant() { VariantClear(&value_); }

    VARIANT* Get() noexcept { return &value_; }
    const VARIANT* Get() const noexcept { return &value_; }
    VARTYPE Type() const noexcept { return value_.vt; }
    // Clears the value and hands out the VARIANT for an [out] VARIANT* parameter.
    VARIANT* Receive() noexcept {
        Clear();
        return &value_;
    }
    void Clear() noexcept { VariantClear(&value_); }

    // Takes over `source`, which is left VT_EMPTY.
    void Attach(VARIANT& source) noexcept {
        Clear();
        value_ = source;
        VariantInit(&source);
    }
    [[nodiscard]] VARIANT Detach() noexcept {
        VARIANT detached = value_;
        VariantInit(&value_);
        return detached;
    }

    // Deep copy (BSTR copied, interface AddRef'ed); VariantCopy's result.
    HRESULT CopyFrom(const VARIANT& source) noexcept {
        return VariantCopy(&value_, const_cast<VARIANT*>(&source));  // MinGW's declaration lacks the const
    }
    // For a caller's [out] VARIANT*, which is taken to hold nothing yet.
    HRESULT CopyTo(VARIANT* target) const noexcept {
        if (target == nullptr) return E_POINTER;
        VariantInit(target);
        return VariantCopy(target, const_cast<VARIANT*>(&value_));
    }

    void SetNull() noexcept { Set(VT_NULL); }
    void SetI4(LONG value) noexcept { Set(VT_I4).lVal = value; }
    void SetUI4(ULONG value) noexcept { Set(VT_UI4).ulVal = value; }
    void SetBool(bool value) noexcept { Set(VT_BOOL).boolVal = value ? VARIANT_TRUE : VARIANT_FALSE; }
    void SetR8(double value) noexcept { Set(VT_R8).dblVal = value; }
    void SetBstr(Bstr&& text) noexcept { Set(VT_BSTR).bstrVal = text.Detach(); }
    HRESULT SetString(OleStringView text) noexcept {
        Bstr copy(text);
        if (copy.IsNull()) return E_OUTOFMEMORY;
        SetBstr(std::move(copy));
        return S_OK;
    }
    // AddRef's `object`.
    void SetUnknown(IUnknown* object) noexcept {
        if (object != nullptr) object->AddRef();
        Set(VT_UNKNOWN).punkVal = object;
    }

    // The text of a VT_BSTR value; empty for any other type.
    OleStringView StringView() const noexcept {
        if (value_.vt != VT_BSTR || value_.bstrVal == nullptr) return {};
        return OleStringView(value_.bstrVal, SysStringLen(value_.bstrVal));
    }

private:
    VARIANT& Set(VARTYPE type) noexcept {
        Clear();
        value_.vt = type;
        return value_;
    }

    VARIANT value_;
};

}  // namespace tav
