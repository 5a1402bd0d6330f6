#include "support/fake_command_component.h"

#include <utility>

namespace tav::test {
namespace {

PassedParams Capture(TavInParams* rip) {
    PassedParams passed;
    passed.pointer = rip;
    if (rip != nullptr) {
        passed.fields = *rip;
    }
    return passed;
}

std::optional<TavInParams> CopyOf(const TavInParams* rip) {
    return rip == nullptr ? std::nullopt : std::optional<TavInParams>(*rip);
}

}  // namespace

ScriptedReply ScriptedReply::Text(std::string_view text, HRESULT status) {
    return Text(OleStringView(Widen(text)), status);
}

ScriptedReply ScriptedReply::Text(OleStringView text, HRESULT status) {
    ScriptedReply reply;
    reply.status = status;
    reply.vt = VT_BSTR;
    reply.text = OleString(text);
    return reply;
}

ScriptedReply ScriptedReply::NullText(HRESULT status) {
    ScriptedReply reply = Text(OleStringView(), status);
    reply.nullText = true;
    return reply;
}

ScriptedReply ScriptedReply::Number(LONG value, HRESULT status) {
    ScriptedReply reply;
    reply.status = status;
    reply.vt = VT_I4;
    reply.number = value;
    return reply;
}

ScriptedReply ScriptedReply::Empty(HRESULT status) {
    ScriptedReply reply;
    reply.status = status;
    return reply;
}

void ScriptedReply::FillVariant(VARIANT* data) const {
    data->vt = vt;
    if (vt == VT_BSTR) {
        data->bstrVal = nullText ? nullptr : SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
    } else if (vt == VT_I4) {
        data->lVal = number;
    }
}

Ref<FakeCommandComponent> FakeCommandComponent::Make(Offers offers) {
    return Ref<FakeCommandComponent>(new FakeCommandComponent(offers));
}

FakeCommandComponent::~FakeCommandComponent() {
    JoinDeliveries();
    DropIpcSink();
}

void FakeCommandComponent::Script(std::string_view command, std::string_view replyText, HRESULT status) {
    Script(command, ScriptedReply::Text(replyText, status));
}

void FakeCommandComponent::Script(std::string_view command, ScriptedReply reply) {
    std::lock_guard<std::mutex> hold(lock_);
    script_[std::string(command)].push_back(std::move(reply));
}

void FakeCommandComponent::SetDefaultReply(ScriptedReply reply) {
    std::lock_guard<std::mutex> hold(lock_);
    defaultReply_ = std::move(reply);
}

void FakeCommandComponent::Fail(ComOperation operation, HRESULT hr, std::string_view errorText,
                                std::string_view command) {
    std::lock_guard<std::mutex> hold(lock_);
    failures_[operation] = Failure{hr, std::string(command), std::string(errorText)};
}

void FakeCommandComponent::SetErrorText(std::string_view text) {
    std::lock_guard<std::mutex> hold(lock_);
    errorText_ = text;
}

void FakeCommandComponent::SetNextCookie(ULONG cookie) {
    std::lock_guard<std::mutex> hold(lock_);
    nextCookie_ = cookie;
}

void FakeCommandComponent::SetFileSize(ULONG size) {
    std::lock_guard<std::mutex> hold(lock_);
    fileSize_ = size;
}

void FakeCommandComponent::SetExecuteExResult(ULONG result) {
    std::lock_guard<std::mutex> hold(lock_);
    executeExResult_ = result;
}

void FakeCommandComponent::ClearScript() {
    std::lock_guard<std::mutex> hold(lock_);
    script_.clear();
    failures_.clear();
    defaultReply_ = ScriptedReply();
}

std::vector<RecordedCommand> FakeCommandComponent::Commands() const {
    std::lock_guard<std::mutex> hold(lock_);
    return commands_;
}

RecordedCommand FakeCommandComponent::LastCommand() const {
    std::lock_guard<std::mutex> hold(lock_);
    return commands_.empty() ? RecordedCommand() : commands_.back();
}

size_t FakeCommandComponent::CommandCount() const {
    std::lock_guard<std::mutex> hold(lock_);
    return commands_.size();
}

std::vector<RecordedCommand2> FakeCommandComponent::Command2Calls() const {
    std::lock_guard<std::mutex> hold(lock_);
    return command2Calls_;
}

std::vector<RecordedSubscription> FakeCommandComponent::Subscriptions() const {
    std::lock_guard<std::mutex> hold(lock_);
    return subscriptions_;
}

std::vector<RecordedUnsubscription> FakeCommandComponent::Unsubscriptions() const {
    std::lock_guard<std::mutex> hold(lock_);
    return unsubscriptions_;
}

std::vector<RecordedIpcSend> FakeCommandComponent::IpcSends() const {
    std::lock_guard<std::mutex> hold(lock_);
    return ipcSends_;
}

std::vector<RecordedFileCall> FakeCommandComponent::FileCalls() const {
    std::lock_guard<std::mutex> hold(lock_);
    return fileCalls_;
}

IUnknown* FakeCommandComponent::IpcSink() const {
    std::lock_guard<std::mutex> hold(lock_);
    return ipcSink_;
}

void FakeCommandComponent::DropIpcSink() {
    IUnknown* sink;
    {
        std::lock_guard<std::mutex> hold(lock_);
        sink = std::exchange(ipcSink_, nullptr);
    }
    if (sink != nullptr) {
        sink->Release();
    }
}

HRESULT FakeCommandComponent::DeliverIpcMessage(TavIPCHeaderInternal header, std::vector<BYTE> data) {
    IUnknown* sink;
    {
        std::lock_guard<std::mutex> hold(lock_);
        sink = ipcSink_;
        if (sink != nullptr) {
            sink->AddRef();
        }
    }
    if (sink == nullptr) {
        return E_NOINTERFACE;
    }
    _ITavIPCMessages* messages = nullptr;
    HRESULT hr = sink->QueryInterface(IID__ITavIPCMessages, reinterpret_cast<void**>(&messages));
    sink->Release();
    if (SUCCEEDED(hr)) {
        hr = messages->OnMessage(&header, data.empty() ? nullptr : data.data(), static_cast<LONG>(data.size()));
        messages->Release();
    }
    return hr;
}

void FakeCommandComponent::ClearRecords() {
    std::lock_guard<std::mutex> hold(lock_);
    commands_.clear();
    command2Calls_.clear();
    subscriptions_.clear();
    unsubscriptions_.clear();
    ipcSends_.clear();
    fileCalls_.clear();
}

void FakeCommandComponent::JoinDeliveries() {
    for (;;) {
        std::vector<std::thread> running;
        {
            std::lock_guard<std::mutex> hold(deliveriesLock_);
            running.swap(deliveries_);
        }
        if (running.empty()) {
            return;
        }
        for (std::thread& delivery : running) {
            delivery.join();
        }
    }
}

HRESULT FakeCommandComponent::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID_ITavComCtrl)) {
        *object = static_cast<ITavComCtrl*>(this);
    } else if (IsEqualIID(riid, IID_ITavCommand2) && offers_.command2) {
        *object = static_cast<ITavCommand2*>(this);
    } else if (IsEqualIID(riid, IID_ITavFile) && offers_.file) {
        *object = static_cast<ITavFile*>(this);
    } else if (IsEqualIID(riid, IID_ITavComError) && offers_.errorInterface) {
        *object = static_cast<ITavComError*>(this);
    } else {
        return E_NOINTERFACE;
    }
    AddRef();
    return S_OK;
}

HRESULT FakeCommandComponent::FailureFor(ComOperation operation, std::string_view command) {
    const auto found = failures_.find(operation);
    if (found == failures_.end() || SUCCEEDED(found->second.hr) ||
        (!found->second.command.empty() && found->second.command != command)) {
        return S_OK;
    }
    errorText_ = found->second.text;
    return found->second.hr;
}

ScriptedReply FakeCommandComponent::ReplyFor(const std::string& command) {
    const auto found = script_.find(command);
    if (found == script_.end() || found->second.empty()) {
        return defaultReply_;
    }
    ScriptedReply reply = found->second.front();
    if (found->second.size() > 1) {
        found->second.erase(found->second.begin());
    }
    return reply;
}

void FakeCommandComponent::Deliver(TavInParams* rip, const ScriptedReply& reply) {
    // The callback is kept alive until the reply is delivered, as the
    // component would.
    IUnknown* callback = rip->pCallback;
    callback->AddRef();
    const ULONG userDef = rip->userDef;
    std::lock_guard<std::mutex> hold(deliveriesLock_);
    deliveries_.emplace_back([callback, userDef, reply] {
        TavCommandReply record{};
        VariantInit(&record.data);
        record.status = reply.status;
        record.userDef = userDef;
        reply.FillVariant(&record.data);
        static_cast<ITavCommandCallback*>(callback)->OnCommandReply(&record);
        VariantClear(&record.data);
        callback->Release();
    });
}

HRESULT FakeCommandComponent::Execute(TavInParams* rip, TavCommandReply* reply, BSTR verb, BSTR url, BSTR command,
                                      BSTR args) {
    RecordedCommand recorded{Narrow(verb), Narrow(url), Narrow(command), Narrow(args),
                             args == nullptr ? OleString() : OleString(args, SysStringLen(args)), Capture(rip)};
    ScriptedReply answer;
    {
        std::lock_guard<std::mutex> hold(lock_);
        commands_.push_back(recorded);
        const HRESULT failure = FailureFor(ComOperation::Execute, recorded.command);
        if (FAILED(failure)) {
            return failure;
        }
        answer = ReplyFor(recorded.command);
    }
    if (recorded.params.IsAsync()) {
        if (rip->pCallback != nullptr) {
            Deliver(rip, answer);
        }
        return S_OK;
    }
    reply->status = answer.status;
    reply->userDef = rip == nullptr ? 0 : rip->userDef;
    answer.FillVariant(&reply->data);
    return S_OK;
}

HRESULT FakeCommandComponent::Subscribe(TavInParams* rip, TavEventParams* params, IUnknown* helper, BSTR eventName,
                                        BSTR eventArgs, LONG kind, ULONG* cookie) {
    RecordedSubscription recorded;
    recorded.params = Capture(rip);
    if (params != nullptr) {
        recorded.eventParams = *params;
    }
    recorded.helper = helper;
    recorded.eventName = Narrow(eventName);
    if (eventArgs != nullptr) {
        recorded.eventArgs = Narrow(eventArgs);
    }
    recorded.kind = kind;
    std::lock_guard<std::mutex> hold(lock_);
    const HRESULT failure = FailureFor(ComOperation::Subscribe);
    if (SUCCEEDED(failure) && cookie != nullptr) {
        recorded.cookie = *cookie = nextCookie_++;
    }
    subscriptions_.push_back(std::move(recorded));
    return failure;
}

HRESULT FakeCommandComponent::SubscribeConnectionEvents(TavInParams* rip, TavEventParams* params, ULONG* cookie) {
    RecordedSubscription recorded;
    recorded.params = Capture(rip);
    if (params != nullptr) {
        recorded.eventParams = *params;
    }
    recorded.connectionEvents = true;
    std::lock_guard<std::mutex> hold(lock_);
    const HRESULT failure = FailureFor(ComOperation::SubscribeConnectionEvents);
    if (SUCCEEDED(failure) && cookie != nullptr) {
        recorded.cookie = *cookie = nextCookie_++;
    }
    subscriptions_.push_back(std::move(recorded));
    return failure;
}

HRESULT FakeCommandComponent::Unsubscribe(TavInParams* rip, ULONG cookie) {
    std::lock_guard<std::mutex> hold(lock_);
    unsubscriptions_.push_back(RecordedUnsubscription{Capture(rip), cookie});
    return FailureFor(ComOperation::Unsubscribe);
}

HRESULT FakeCommandComponent::ConnectIPCSink(IUnknown* sink) {
    {
        std::lock_guard<std::mutex> hold(lock_);
        const HRESULT failure = FailureFor(ComOperation::ConnectIPCSink);
        if (FAILED(failure)) {
            return failure;
        }
    }
    DropIpcSink();
    if (sink != nullptr) {
        sink->AddRef();
    }
    std::lock_guard<std::mutex> hold(lock_);
    ipcSink_ = sink;
    return S_OK;
}

HRESULT FakeCommandComponent::SendIPCMessage(TavInParams* rip, TavIPCHeaderInternal* header, BYTE* data, LONG size) {
    RecordedIpcSend recorded;
    recorded.params = Capture(rip);
    if (header != nullptr) {
        recorded.header = *header;
    }
    if (data != nullptr && size > 0) {
        recorded.data.assign(data, data + size);
    }
    recorded.size = size;
    std::lock_guard<std::mutex> hold(lock_);
    ipcSends_.push_back(std::move(recorded));
    return FailureFor(ComOperation::SendIPCMessage);
}

HRESULT FakeCommandComponent::ExecuteEx(TavInParams* rip, TavCommandReply* reply, TavInParams* rip2,
                                        ULONG clientValue, BSTR url, BSTR command, BSTR args, ULONG* result) {
    RecordedCommand2 recorded{Capture(rip), CopyOf(rip2), clientValue, Narrow(url), Narrow(command), Narrow(args)};
    std::lock_guard<std::mutex> hold(lock_);
    command2Calls_.push_back(std::move(recorded));
    const HRESULT failure = FailureFor(ComOperation::ExecuteEx, Narrow(command));
    if (SUCCEEDED(failure) && result != nullptr) {
        *result = executeExResult_;
    }
    return failure;
}

HRESULT FakeCommandComponent::RecordFileCall(ComOperation operation, const char* name, TavInParams* rip,
                                             std::initializer_list<BSTR> texts) {
    RecordedFileCall recorded{name, Capture(rip), {}};
    for (BSTR text : texts) {
        recorded.texts.push_back(Narrow(text));
    }
    std::lock_guard<std::mutex> hold(lock_);
    fileCalls_.push_back(std::move(recorded));
    return FailureFor(operation);
}

HRESULT FakeCommandComponent::CopyFileToController(TavInParams* rip, BSTR url, BSTR localPath, BSTR ctrlPath) {
    return RecordFileCall(ComOperation::CopyFileToController, "CopyFileToController", rip, {url, localPath, ctrlPath});
}

HRESULT FakeCommandComponent::CopyFileFromController(TavInParams* rip, BSTR url, BSTR ctrlPath, BSTR localPath) {
    return RecordFileCall(ComOperation::CopyFileFromController, "CopyFileFromController", rip,
                          {url, ctrlPath, localPath});
}

HRESULT FakeCommandComponent::CreateControllerDirectory(TavInParams* rip, BSTR url, BSTR ctrlDir) {
    return RecordFileCall(ComOperation::CreateControllerDirectory, "CreateControllerDirectory", rip, {url, ctrlDir});
}

HRESULT FakeCommandComponent::DeleteControllerFile(TavInParams* rip, BSTR url, BSTR ctrlPath) {
    return RecordFileCall(ComOperation::DeleteControllerFile, "DeleteControllerFile", rip, {url, ctrlPath});
}

HRESULT FakeCommandComponent::GetControllerFileSize(TavInParams* rip, BSTR url, BSTR ctrlPath, ULONG* size) {
    const HRESULT hr =
        RecordFileCall(ComOperation::GetControllerFileSize, "GetControllerFileSize", rip, {url, ctrlPath});
    if (SUCCEEDED(hr) && size != nullptr) {
        std::lock_guard<std::mutex> hold(lock_);
        *size = fileSize_;
    }
    return hr;
}

HRESULT FakeCommandComponent::CheckLink(TavInParams* rip, TavCommandReply* reply) {
    const HRESULT hr = RecordFileCall(ComOperation::CheckLink, "CheckLink", rip, {});
    if (FAILED(hr)) {
        return hr;
    }
    ScriptedReply answer;
    {
        std::lock_guard<std::mutex> hold(lock_);
        answer = ReplyFor("CheckLink");
    }
    reply->status = answer.status;
    answer.FillVariant(&reply->data);
    return S_OK;
}

HRESULT FakeCommandComponent::GetLastErrorInfo(BSTR* errorText) {
    if (errorText == nullptr) {
        return E_POINTER;
    }
    std::lock_guard<std::mutex> hold(lock_);
    const OleString text = Widen(errorText_);
    *errorText = text.empty() ? nullptr : SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
    return S_OK;
}

}  // namespace tav::test
