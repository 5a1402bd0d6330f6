#include "core/error_info.h"

#include "TavSiblings.h"
#include "core/text/convert.h"
#include "core/text/format.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"

namespace tav {
namespace {

// Formatted messages have room for 1024 wide characters, terminator included.
constexpr size_t kMessageRoom = 1023;

OleString Suffix(ErrorSite site, bool leadingColon) {
    OleString suffix = leadingColon ? OleString(OLESTR(":")) : OleString();
    suffix += text::Widen(kErrorSource);
    suffix += text::Format(OLESTR("[%d]; "), site.line);
    return suffix;
}

}  // namespace

ErrorInfo::ErrorInfo() = default;

ErrorInfo::~ErrorInfo() { SysFreeString(text_); }

void ErrorInfo::Replace(OleString text) {
    // Allocated before the lock is taken; a failed allocation leaves no text.
    BSTR fresh = SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
    BSTR old;
    {
        CriticalSectionLock hold(lock_);
        old = text_;
        text_ = fresh;
    }
    SysFreeString(old);
}

HRESULT ErrorInfo::Set(HRESULT hr, ErrorSite site, OleStringView message) {
    OleString text(message.substr(0, kMessageRoom));
    text += Suffix(site, true);
    Replace(std::move(text));
    return hr;
}

HRESULT ErrorInfo::SetWithShortSuffix(HRESULT hr, ErrorSite site, OleStringView message) {
    OleString text(message.substr(0, kMessageRoom));
    text += text::Widen(kErrorSource);
    text += text::Format(OLESTR("[%d];"), site.line);
    Replace(std::move(text));
    return hr;
}

HRESULT ErrorInfo::AdoptFromComponent(HRESULT hr, IUnknown* component, ErrorSite site) {
    OleString text;
    ComPtr<ITavComError> errors;
    if (component != nullptr && SUCCEEDED(QueryTo(component, errors))) {
        Bstr componentText;
        if (SUCCEEDED(errors->GetLastErrorInfo(componentText.Receive())) && !componentText.IsNull()) {
            text.assign(componentText.View());
        }
    }
    text += Suffix(site, false);
    Replace(std::move(text));
    return hr;
}

HRESULT ErrorInfo::SetFromReply(const TavCommandReply& reply, ErrorSite site) {
    OleString text;
    if (reply.data.vt == VT_BSTR) {
        if (reply.data.bstrVal != nullptr) {
            text.assign(reply.data.bstrVal, SysStringLen(reply.data.bstrVal));
        }
    } else {
        text = OLESTR("Controller error, no errinfo available; ");
    }
    text += Suffix(site, false);
    Replace(std::move(text));
    return reply.status;
}

HRESULT ErrorInfo::CopyTo(BSTR* out) const {
    CriticalSectionLock hold(lock_);
    *out = text_ == nullptr ? nullptr : SysAllocStringLen(text_, SysStringLen(text_));
    return text_ != nullptr && *out == nullptr ? E_OUTOFMEMORY : S_OK;
}

HRESULT ErrorInfo::SetFromVariant(const VARIANT* data) {
    if (data->vt == VT_BSTR) {
        const BSTR source = data->bstrVal;
        Replace(source == nullptr ? OleString() : OleString(source, SysStringLen(source)));
        return S_OK;
    }
    Replace(OleString());
    return E_FAIL;
}

OleString ErrorInfo::Text() const {
    CriticalSectionLock hold(lock_);
    return text_ == nullptr ? OleString() : OleString(text_, SysStringLen(text_));
}

}  // namespace tav
