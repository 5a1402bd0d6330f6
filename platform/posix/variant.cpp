#include <cstring>

#include "tav/com_api.h"

namespace {

bool IsPlainValue(VARTYPE type) {
    switch (type) {
    case VT_EMPTY: case VT_NULL: case VT_I1: case VT_I2: case VT_I4: case VT_I8: case VT_UI1:
    case VT_UI2: case VT_UI4: case VT_UI8: case VT_INT: case VT_UINT: case VT_R4: case VT_R8:
    case VT_CY: case VT_DATE: case VT_BOOL: case VT_ERROR:
        return true;
    default:
        return false;
    }
}

bool IsInterface(VARTYPE type) { return type == VT_UNKNOWN || type == VT_DISPATCH; }

// By reference the VARIANT owns nothing, whatever it points to.
bool IsKnown(VARTYPE type) {
    if (type & VT_BYREF) return true;
    return IsPlainValue(type) || type == VT_BSTR || IsInterface(type);
}

}  // namespace

extern "C" {

void VariantInit(VARIANTARG* pvarg) { std::memset(pvarg, 0, sizeof *pvarg); }

HRESULT VariantClear(VARIANTARG* pvarg) {
    if (pvarg == nullptr) return E_INVALIDARG;
    if (!IsKnown(pvarg->vt)) return DISP_E_BADVARTYPE;
    if (pvarg->vt == VT_BSTR) {
        SysFreeString(pvarg->bstrVal);
    } else if (IsInterface(pvarg->vt) && pvarg->punkVal != nullptr) {
        pvarg->punkVal->Release();
    }
    VariantInit(pvarg);
    return S_OK;
}

HRESULT VariantCopy(VARIANTARG* pvargDest, VARIANTARG* pvargSrc) {
    if (pvargDest == nullptr || pvargSrc == nullptr) return E_INVALIDARG;
    if (pvargDest == pvargSrc) return S_OK;
    if (!IsKnown(pvargSrc->vt)) return DISP_E_BADVARTYPE;
    HRESULT hr = VariantClear(pvargDest);
    if (FAILED(hr)) return hr;
    if (pvargSrc->vt == VT_BSTR && pvargSrc->bstrVal != nullptr) {
        BSTR copy = SysAllocStringByteLen(reinterpret_cast<LPCSTR>(pvargSrc->bstrVal),
                                          SysStringByteLen(pvargSrc->bstrVal));
        if (copy == nullptr) return E_OUTOFMEMORY;
        *pvargDest = *pvargSrc;
        pvargDest->bstrVal = copy;
        return S_OK;
    }
    *pvargDest = *pvargSrc;
    if (IsInterface(pvargSrc->vt) && pvargSrc->punkVal != nullptr) pvargSrc->punkVal->AddRef();
    return S_OK;
}

}  // extern "C"
