#include "core/reply.h"

#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {

Reply::Reply(ControllerObject& object, VARIANT* data) : object_(object), data_(data) {}

Reply& Reply::Initialised(const OLECHAR* text, Where where) {
    if (!failed() && !object_.Initialised()) {
        Fail(E_ABORT, ViewOf(text), where);
    }
    return *this;
}

Reply& Reply::NotNull(const OLECHAR* text, Where where) {
    if (!failed() && data_ == nullptr) {
        Fail(E_INVALIDARG, ViewOf(text), where);
    }
    return *this;
}

Reply& Reply::IsBstr(const OLECHAR* text, Where where) {
    if (!failed() && data_->vt != VT_BSTR) {
        Fail(E_FAIL, ViewOf(text), where);
    }
    return *this;
}

OleStringView Reply::Text() const {
    const BSTR text = data_->bstrVal;
    return text == nullptr ? OleStringView() : OleStringView(text, SysStringLen(text));
}

std::size_t Reply::Find(OleStringView key) const {
    const OleStringView text = Text();
    if (key.empty()) {
        return 0;
    }
    // One pass that stops at the first NUL: a reply searched for many keys
    // is read once per key, not twice (the key, then the text before it).
    const OLECHAR first = key.front();
    for (std::size_t at = 0; at < text.size(); ++at) {
        const OLECHAR c = text[at];
        if (c == first && text.substr(at, key.size()) == key) {
            return at;
        }
        if (c == OLECHAR(0)) {
            break;
        }
    }
    return OleStringView::npos;
}

HRESULT Reply::Fail(HRESULT hr, OleStringView text, Where where) { return Fail(hr, text, ErrorSite::From(where)); }

HRESULT Reply::Fail(HRESULT hr, OleStringView text, ErrorSite site) {
    hr_ = object_.Errors().Set(hr, site, text);
    return hr_;
}

HRESULT Reply::FailWith(HRESULT hr, OleStringView format, OleStringView value, Where where) {
    // Some texts that may quote a value do not: they stand as they are.
    if (format.find(OLESTR("%s")) == OleStringView::npos) {
        return Fail(hr, format, where);
    }
    return Fail(hr, text::Format(format, text::UpToNul(value)), where);
}

HRESULT Reply::Allocate(OleStringView text, BSTR* out, Where where) {
    *out = SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
    if (*out == nullptr) {
        return Fail(E_OUTOFMEMORY, OLESTR("SysAllocString failed"), where);
    }
    return S_OK;
}

HRESULT Reply::WholeText(BSTR* out, const OLECHAR* allocFailText, Where where) {
    if (failed()) {
        return hr_;
    }
    const BSTR source = data_->bstrVal;
    *out = source == nullptr ? nullptr : SysAllocStringLen(source, SysStringLen(source));
    if (source != nullptr && *out == nullptr) {
        return Fail(E_OUTOFMEMORY, ViewOf(allocFailText), where);
    }
    return S_OK;
}

HRESULT Reply::AfterPrefix(OleStringView prefix, BSTR* out, const OLECHAR* failText, Where where) {
    if (failed()) {
        return hr_;
    }
    const OleStringView text = Text();
    if (text.substr(0, prefix.size()) != prefix) {
        return Fail(E_FAIL, ViewOf(failText), where);
    }
    return Allocate(text.substr(prefix.size()), out);
}

}  // namespace tav
