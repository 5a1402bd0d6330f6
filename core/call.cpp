#include "core/call.h"

#include "core/controller_object.h"
#include "tav/bstr.h"

namespace tav {

bool ValidInParams(const TavInParams* rip) {
    return rip == nullptr || rip->pCallback == nullptr ||
           (rip->riid != nullptr && IsEqualGUID(*rip->riid, IID_ITavCommandCallback));
}

CommandReply::CommandReply() : record_{} { VariantInit(&record_.data); }

CommandReply::~CommandReply() { VariantClear(&record_.data); }

CommandReply::CommandReply(CommandReply&& other) noexcept : record_(other.record_) {
    VariantInit(&other.record_.data);
}

void CommandReply::Clear() { VariantClear(&record_.data); }

HRESULT NotifyCallback(ControllerObject& object, TavInParams* rip, HRESULT hr) {
    if (rip == nullptr || rip->pCallback == nullptr) {
        return hr;
    }
    CommandReply reply;
    reply.Record().status = hr;
    reply.Record().userDef = rip->userDef;
    if (FAILED(hr)) {
        const OleString text = object.Errors().Text();
        reply.Data()->vt = VT_BSTR;
        reply.Data()->bstrVal = SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
    }
    // The TavInParams check accepted this callback as an ITavCommandCallback.
    static_cast<ITavCommandCallback*>(rip->pCallback)->OnCommandReply(&reply.Record());
    return hr;
}

Call::Call(ControllerObject& object, TavInParams* rip) : object_(object), rip_(rip) {}

Call& Call::ValidParams(const OLECHAR* text, Where where) {
    if (!failed() && !ValidInParams(rip_)) {
        // The callback is not to be trusted, so it is not told.
        hr_ = object_.Errors().Set(E_INVALIDARG, ErrorSite::From(where), ViewOf(text));
    }
    return *this;
}

Call& Call::Initialised(const OLECHAR* text, Where where) {
    return Require(object_.Initialised(), E_ABORT, text, where);
}

Call& Call::Require(bool ok, HRESULT hr, const OLECHAR* text, Where where) {
    if (!failed() && !ok) {
        Fail(hr, ViewOf(text), where);
    }
    return *this;
}

Call& Call::RetrievalParams(const TavRetrievalParams* params, LONG retrieveAll, const OLECHAR* nullText,
                            const OLECHAR* modeText, Where where) {
    if (!failed()) {
        if (params == nullptr) {
            Fail(E_INVALIDARG, ViewOf(nullText), where);
        } else if (params->noOfElts != retrieveAll) {
            Fail(E_INVALIDARG, ViewOf(modeText));
        }
    }
    return *this;
}

HRESULT Call::Fail(HRESULT hr, OleStringView text, Where where) { return Fail(hr, text, ErrorSite::From(where)); }

HRESULT Call::Fail(HRESULT hr, OleStringView text, ErrorSite site) {
    hr_ = object_.Errors().Set(hr, site, text);
    return NotifyCallback(object_, rip_, hr_);
}

BSTR Call::StoredUrl() const { return object_.Url(); }

SentCommand Call::Get(OleStringView command, OleStringView args, Where where) {
    return SendTo(object_.Url(), Verb::Get, command, args, where);
}

SentCommand Call::Set(OleStringView command, OleStringView args, Where where) {
    return SendTo(object_.Url(), Verb::Set, command, args, where);
}

SentCommand Call::Send(Verb verb, OleStringView command, OleStringView args, Where where) {
    return SendTo(object_.Url(), verb, command, args, where);
}

SentCommand Call::SendTo(BSTR url, Verb verb, OleStringView command, OleStringView args, Where where) {
    SentCommand sent(object_, rip_, hr_);
    if (failed()) {
        return sent;
    }
    Bstr verbText(verb == Verb::Get ? OLESTR("Get") : OLESTR("Set"));
    Bstr commandText(command);
    Bstr argsText(args);
    if (verbText.IsNull() || commandText.IsNull() || argsText.IsNull()) {
        // A command that could not be built reports from here, apart from one
        // that could not be delivered.
        sent.hr_ = Fail(E_OUTOFMEMORY, OLESTR("SysAllocString failed"));
        return sent;
    }
    ITavComCtrl* component = object_.CommandComponent();
    sent.hr_ = Delivered(component->Execute(rip_, &sent.reply_.Record(), verbText.Get(), url, commandText.Get(),
                                            argsText.Get()),
                         component, where);
    return sent;
}

HRESULT Call::SendMessage(TavIPCHeaderInternal* header, byte* data, LONG size, Where where) {
    if (failed()) {
        return hr_;
    }
    ITavComCtrl* component = object_.CommandComponent();
    return Delivered(component->SendIPCMessage(rip_, header, data, size), component, where);
}

ComPtr<ITavFile> Call::FileInterface(const OLECHAR* noFileText) {
    ComPtr<ITavFile> file;
    if (FAILED(QueryTo(object_.CommandComponent(), file)) || !file) {
        file = nullptr;
        Fail(E_FAIL, ViewOf(noFileText));
    }
    return file;
}

HRESULT Call::Delivered(HRESULT hr, IUnknown* component, Where where) {
    if (FAILED(hr)) {
        object_.Errors().AdoptFromComponent(hr, component, ErrorSite::From(where));
        NotifyCallback(object_, rip_, hr);
    }
    return hr;
}

SentCommand::SentCommand(ControllerObject& object, TavInParams* rip, HRESULT hr)
    : object_(object), rip_(rip), hr_(hr) {}

bool SentCommand::Finished(HRESULT* result, Where where) {
    if (FAILED(hr_)) {
        *result = hr_;
        return true;
    }
    if (IsAsync(rip_)) {
        reply_.Clear();
        *result = S_OK;
        return true;
    }
    if (reply_.Record().status < 0) {
        *result = object_.Errors().SetFromReply(reply_.Record(), ErrorSite::From(where));
        return true;
    }
    *result = S_OK;
    return false;
}

HRESULT SentCommand::RecordReplyFailure(Where where) {
    return object_.Errors().SetFromReply(reply_.Record(), ErrorSite::From(where));
}

HRESULT SentCommand::StatusOnly(Where where) {
    HRESULT result;
    Finished(&result, where);
    return result;
}

HRESULT SentCommand::TakeText(BSTR* out, const OLECHAR* notText, Where where) {
    HRESULT result;
    if (Finished(&result, where)) {
        return result;
    }
    VARIANT& data = *reply_.Data();
    if (data.vt != VT_BSTR) {
        return object_.Errors().Set(E_FAIL, ErrorSite::Here(), ViewOf(notText));
    }
    *out = data.bstrVal;
    data.vt = VT_EMPTY;
    data.bstrVal = nullptr;
    return S_OK;
}

}  // namespace tav
