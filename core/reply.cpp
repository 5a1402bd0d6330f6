#include "core/reply.h"

#include <array>
#include <span>

#include "core/controller_object.h"
#include "core/text/format.h"
#include "core/text/scan.h"

namespace tav {
namespace {

ErrorSite SiteOf(const std::source_location& where) { return ErrorSite{static_cast<int>(where.line())}; }

// Room for the widest string field of any reply grammar.
constexpr size_t kFieldRoom = 1024;

}  // namespace

Reply::Reply(ControllerObject& object, VARIANT* data) : object_(object), data_(data) {}

Reply& Reply::Initialised(const OLECHAR* text, Where where) {
    if (!failed() && !object_.Initialised()) {
        Fail(E_ABORT, text, where);
    }
    return *this;
}

Reply& Reply::NotNull(const OLECHAR* text, Where where) {
    if (!failed() && data_ == nullptr) {
        Fail(E_INVALIDARG, text, where);
    }
    return *this;
}

Reply& Reply::IsBstr(const OLECHAR* text, Where where) {
    if (!failed() && data_->vt != VT_BSTR) {
        Fail(E_FAIL, text, where);
    }
    return *this;
}

OleStringView Reply::Text() const {
    const BSTR text = data_->bstrVal;
    return text == nullptr ? OleStringView() : OleStringView(text, SysStringLen(text));
}

HRESULT Reply::Fail(HRESULT hr, OleStringView text, Where where) {
    hr_ = object_.Errors().Set(hr, SiteOf(where), text);
    return hr_;
}

HRESULT Reply::FailWith(HRESULT hr, OleStringView format, OleStringView value, Where where) {
    return Fail(hr, text::Format(format, value), where);
}

HRESULT Reply::Allocate(OleStringView text, BSTR* out, Where where) {
    *out = SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
    if (*out == nullptr) {
        return Fail(E_OUTOFMEMORY, OLESTR("SysAllocString failed"), where);
    }
    return S_OK;
}

HRESULT Reply::QuotedString(OleStringView format, OleStringView emptyForm, BSTR* out, OleStringView failText,
                            Where where) {
    if (failed()) {
        return hr_;
    }
    std::array<OLECHAR, kFieldRoom> field;
    const OleStringView text = Text();
    OleStringView value;
    if (text::Scan(text, format, std::span<OLECHAR>(field)) == 1) {
        value = OleStringView(field.data());
    } else if (text.substr(0, emptyForm.size()) != emptyForm) {
        return Fail(E_FAIL, failText, where);
    }
    return Allocate(value, out, where);
}

HRESULT Reply::WholeText(BSTR* out, OleStringView allocFailText, Where where) {
    if (failed()) {
        return hr_;
    }
    const BSTR source = data_->bstrVal;
    *out = source == nullptr ? nullptr : SysAllocStringLen(source, SysStringLen(source));
    if (source != nullptr && *out == nullptr) {
        return Fail(E_OUTOFMEMORY, allocFailText, where);
    }
    return S_OK;
}

HRESULT Reply::AfterPrefix(OleStringView prefix, BSTR* out, OleStringView failText, Where where) {
    if (failed()) {
        return hr_;
    }
    const OleStringView text = Text();
    if (text.substr(0, prefix.size()) != prefix) {
        return Fail(E_FAIL, failText, where);
    }
    return Allocate(text.substr(prefix.size()), out, where);
}

}  // namespace tav
