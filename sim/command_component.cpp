#include "sim/command_component.h"

#include <thread>

#include "sim/command_runner.h"
#include "sim/controller_registry.h"
#include "tav/guarded.h"
#include "sim/status_codes.h"
#include "tav/variant.h"

namespace tav::sim {
namespace {

constexpr TextView kComponent = OLESTR("TavComCtrl.");

TextView ViewOf(BSTR text) { return text == nullptr ? TextView() : TextView(text, SysStringLen(text)); }

Text Quoted(TextView text) { return OLESTR("\"") + Text(text) + OLESTR("\""); }

// Puts a reply into the caller's record; the record's VARIANT is taken to
// hold nothing.
HRESULT Fill(TavCommandReply& record, const Reply& reply, ULONG userDef) {
    record.status = reply.status;
    record.userDef = userDef;
    VariantInit(&record.data);
    if (reply.hasText) {
        Variant data;
        const HRESULT hr = FAILED(reply.status) ? data.SetString(ErrorText(reply.text)) : data.SetString(reply.text);
        if (FAILED(hr)) {
            return E_OUTOFMEMORY;
        }
        record.data = data.Detach();
    }
    return S_OK;
}

// The caller's callback: pCallback itself when riid says that it is one (the
// reply goes to its first operation), else what QueryInterface finds.
ComPtr<ITavCommandCallback> CallbackOf(const TavInParams& rip) {
    ComPtr<ITavCommandCallback> callback;
    if (rip.pCallback == nullptr) {
        return callback;
    }
    if (rip.riid != nullptr && *rip.riid == IID_ITavCommandCallback) {
        return ComPtr<ITavCommandCallback>(static_cast<ITavCommandCallback*>(rip.pCallback));
    }
    rip.pCallback->QueryInterface(IID_ITavCommandCallback, reinterpret_cast<void**>(&callback));
    return callback;
}

ComPtr<_ITavObjectEvents> SinkOf(const TavEventParams& params) {
    ComPtr<_ITavObjectEvents> sink;
    if (params.pSink == nullptr) {
        return sink;
    }
    if (params.riid != nullptr && *params.riid == IID__ITavObjectEvents) {
        return ComPtr<_ITavObjectEvents>(static_cast<_ITavObjectEvents*>(params.pSink));
    }
    params.pSink->QueryInterface(IID__ITavObjectEvents, reinterpret_cast<void**>(&sink));
    return sink;
}

}  // namespace

HRESULT CommandComponent::Create(IUnknown* outer, REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    if (outer != nullptr) {
        return CLASS_E_NOAGGREGATION;
    }
    return Guarded([&] {
        auto* component = new (std::nothrow) CommandComponent();
        return component == nullptr ? E_OUTOFMEMORY : HandOut(component, riid, object);
    });
}

CommandComponent::CommandComponent() = default;

CommandComponent::~CommandComponent() {
    std::shared_ptr<SubscriptionHub> hub;
    std::shared_ptr<ControllerModel> bound;
    {
        std::lock_guard lock(mutex_);
        hub = std::move(hub_);
        bound = bound_;
    }
    if (hub) {
        hub->Stop();
    }
    replies_.Stop();
    if (bound) {
        bound->DisconnectClient(clientId_);
    }
}

HRESULT CommandComponent::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (riid == IID_IUnknown || riid == IID_ITavComCtrl) {
        *object = static_cast<ITavComCtrl*>(this);
    } else if (riid == IID_ITavCommand2) {
        *object = static_cast<ITavCommand2*>(this);
    } else if (riid == IID_ITavFile) {
        *object = static_cast<ITavFile*>(this);
    } else if (riid == IID_ITavComError) {
        *object = static_cast<ITavComError*>(this);
    } else if (riid == IID_IControllerBinding) {
        *object = static_cast<IControllerBinding*>(this);
    } else {
        *object = nullptr;
        return E_NOINTERFACE;
    }
    AddRef();
    return S_OK;
}

HRESULT CommandComponent::Fail(HRESULT hr, Text text) { return lastError_.Record(hr, text); }

HRESULT CommandComponent::NotProvided(TextView operation) {
    return Fail(E_NOTIMPL, Text(kComponent) + Text(operation) + OLESTR(": not provided by the virtual controller"));
}

std::shared_ptr<ControllerModel> CommandComponent::Reach(TextView url) {
    auto controller = ControllerAt(url);
    if (!controller) {
        return controller;
    }
    {
        std::lock_guard lock(mutex_);
        if (bound_) {
            return controller;
        }
        bound_ = controller;
    }
    const std::uint32_t id = controller->ConnectClient(OLESTR("TavController"));
    std::lock_guard lock(mutex_);
    clientId_ = id;
    return controller;
}

std::shared_ptr<SubscriptionHub> CommandComponent::Hub() {
    std::lock_guard lock(mutex_);
    if (!hub_ && bound_) {
        hub_ = std::make_shared<SubscriptionHub>(bound_);
    }
    return hub_;
}

HRESULT CommandComponent::Execute(TavInParams* rip, TavCommandReply* reply, BSTR verb, BSTR url, BSTR command,
                                  BSTR args) {
    return Guarded([&] { return Carry(rip, reply, ViewOf(verb), url, command, args, OLESTR("Execute")); });
}

HRESULT CommandComponent::ExecuteEx(TavInParams* rip, TavCommandReply* reply, TavInParams*, ULONG, BSTR url,
                                    BSTR command, BSTR args, ULONG* result) {
    return Guarded([&] {
        if (result != nullptr) {
            *result = 0;
        }
        return Carry(rip, reply, OLESTR("Set"), url, command, args, OLESTR("ExecuteEx"));
    });
}

// The success path makes no copies and no texts: a Sync call reads the
// caller's strings where they are.
HRESULT CommandComponent::Carry(TavInParams* rip, TavCommandReply* reply, TextView verb, BSTR url, BSTR command,
                                BSTR args, TextView operation) {
    auto where = [operation] { return Text(kComponent) + Text(operation); };
    if (reply == nullptr) {
        return Fail(E_POINTER, where() + OLESTR(": no reply record"));
    }
    const Command request{verb, ViewOf(command), ViewOf(args), ViewOf(url)};
    const auto controller = Reach(request.url);
    if (!controller) {
        return Fail(E_INVALIDARG, where() + OLESTR(": no controller at URL ") + Quoted(request.url));
    }
    if (auto down = controller->Faults().Transport()) {
        return Fail(down->status, std::move(down->text));
    }
    const ULONG timeOut = rip == nullptr ? 0 : rip->timeOut;

    if (rip == nullptr || rip->callType == Sync) {
        const auto result = RunCommand(*controller, request, timeOut, [](std::chrono::milliseconds delay) {
            std::this_thread::sleep_for(delay);
            return true;
        });
        if (FAILED(Fill(*reply, *result, rip == nullptr ? 0 : rip->userDef))) {
            return Fail(E_OUTOFMEMORY, where() + OLESTR(": no memory for the reply"));
        }
        return S_OK;
    }

    const ComPtr<ITavCommandCallback> callback = CallbackOf(*rip);
    if (rip->pCallback != nullptr && !callback) {
        return Fail(E_NOINTERFACE, where() + OLESTR(": the callback is no ITavCommandCallback"));
    }
    const ULONG userDef = rip->userDef;
    const bool posted = replies_.Post([controller, callback, userDef, timeOut, verbText = Text(request.verb),
                                       nameText = Text(request.name), argsText = Text(request.args),
                                       urlText = Text(request.url)](const TaskQueue::Context& context) {
        Guarded([&] {
            const auto result = RunCommand(*controller, Command{verbText, nameText, argsText, urlText}, timeOut,
                                           [&context](std::chrono::milliseconds delay) { return context.Sleep(delay); });
            if (result && callback) {
                TavCommandReply record{};
                if (FAILED(Fill(record, *result, userDef))) {
                    record.status = E_OUTOFMEMORY;
                }
                callback->OnCommandReply(&record);
                VariantClear(&record.data);
            }
            return S_OK;
        });
    });
    if (!posted) {
        return Fail(E_UNEXPECTED, where() + OLESTR(": the component is shutting down"));
    }
    return S_OK;
}

HRESULT CommandComponent::Subscribe(TavInParams*, TavEventParams* params, IUnknown*, BSTR eventName,
                                    BSTR eventArgs, LONG kind, ULONG* cookie) {
    return Guarded(
        [&] { return AddSubscription(params, ViewOf(eventName), eventArgs, kind, cookie, OLESTR("Subscribe")); });
}

HRESULT CommandComponent::SubscribeConnectionEvents(TavInParams*, TavEventParams* params, ULONG* cookie) {
    return Guarded([&] {
        return AddSubscription(params, ControllerModel::kConnectionEvent, nullptr, 2, cookie,
                               OLESTR("SubscribeConnectionEvents"));
    });
}

HRESULT CommandComponent::AddSubscription(TavEventParams* params, TextView eventName, BSTR eventArgs, LONG kind,
                                          ULONG* cookie, TextView operation) {
    const Text where = Text(kComponent) + Text(operation);
    if (cookie == nullptr || params == nullptr) {
        return Fail(E_POINTER, where + OLESTR(": no cookie or no subscription parameters"));
    }
    *cookie = 0;
    const EventRow* event = FindEvent(eventName);
    if (event == nullptr) {
        return Fail(E_INVALIDARG, where + OLESTR(": unknown event ") + Quoted(eventName));
    }
    if (kind != 1 && kind != 2 && kind != 4) {
        return Fail(E_INVALIDARG, where + OLESTR(": unknown subscription kind ") + Decimal(kind));
    }
    auto arguments = Arguments::Parse(ViewOf(eventArgs));
    if (!arguments) {
        return Fail(E_INVALIDARG, where + OLESTR(": bad event arguments ") + Quoted(ViewOf(eventArgs)));
    }
    ComPtr<_ITavObjectEvents> sink = SinkOf(*params);
    if (!sink) {
        return Fail(params->pSink == nullptr ? E_INVALIDARG : E_NOINTERFACE,
                    where + OLESTR(": the sink is no _ITavObjectEvents"));
    }
    const auto hub = Hub();
    if (!hub) {
        return Fail(E_UNEXPECTED, where + OLESTR(": not connected to a controller"));
    }
    const bool linkEvent = event->name == ControllerModel::kConnectionEvent;
    if (auto down = hub->Controller().Faults().Transport(); down && !linkEvent) {
        return Fail(down->status, std::move(down->text));
    }
    SubscriptionRequest request;
    request.event = event;
    request.eventArgs = std::move(*arguments);
    request.sink = std::move(sink);
    request.pollTime = params->pollTime;
    request.userDef = params->userDef;
    request.containData = params->containData;
    request.kind = kind;
    const ULONG added = hub->Add(std::move(request));
    if (added == 0) {
        return Fail(E_UNEXPECTED, where + OLESTR(": the component is shutting down"));
    }
    *cookie = added;
    return S_OK;
}

HRESULT CommandComponent::Unsubscribe(TavInParams*, ULONG cookie) {
    return Guarded([&] {
        std::shared_ptr<SubscriptionHub> hub;
        {
            std::lock_guard lock(mutex_);
            hub = hub_;
        }
        if (!hub || !hub->Remove(cookie)) {
            return Fail(E_INVALIDARG, Text(kComponent) + OLESTR("Unsubscribe: unknown cookie ") + Decimal(cookie));
        }
        return S_OK;
    });
}

HRESULT CommandComponent::ConnectIPCSink(IUnknown* sink) {
    std::lock_guard lock(mutex_);
    ipcSink_ = ComPtr<IUnknown>(sink);
    return S_OK;
}

HRESULT CommandComponent::SendIPCMessage(TavInParams*, TavIPCHeaderInternal*, byte*, LONG) {
    return Guarded([&] { return NotProvided(OLESTR("SendIPCMessage")); });
}

HRESULT CommandComponent::CopyFileToController(TavInParams*, BSTR, BSTR, BSTR) {
    return Guarded([&] { return NotProvided(OLESTR("CopyFileToController")); });
}

HRESULT CommandComponent::CopyFileFromController(TavInParams*, BSTR, BSTR, BSTR) {
    return Guarded([&] { return NotProvided(OLESTR("CopyFileFromController")); });
}

HRESULT CommandComponent::CreateControllerDirectory(TavInParams*, BSTR, BSTR) {
    return Guarded([&] { return NotProvided(OLESTR("CreateControllerDirectory")); });
}

HRESULT CommandComponent::DeleteControllerFile(TavInParams*, BSTR, BSTR) {
    return Guarded([&] { return NotProvided(OLESTR("DeleteControllerFile")); });
}

HRESULT CommandComponent::GetControllerFileSize(TavInParams*, BSTR, BSTR, ULONG*) {
    return Guarded([&] { return NotProvided(OLESTR("GetControllerFileSize")); });
}

// The file link is the command link: up unless the transport is failing.
HRESULT CommandComponent::CheckLink(TavInParams* rip, TavCommandReply* reply) {
    return Guarded([&] {
        if (reply == nullptr) {
            return Fail(E_POINTER, Text(kComponent) + OLESTR("CheckLink: no reply record"));
        }
        std::shared_ptr<ControllerModel> bound;
        {
            std::lock_guard lock(mutex_);
            bound = bound_;
        }
        if (!bound) {
            return Fail(E_UNEXPECTED, Text(kComponent) + OLESTR("CheckLink: not connected to a controller"));
        }
        if (auto down = bound->Faults().Transport()) {
            return Fail(down->status, std::move(down->text));
        }
        return Fill(*reply, Done(), rip == nullptr ? 0 : rip->userDef);
    });
}

HRESULT CommandComponent::GetLastErrorInfo(BSTR* errorText) { return lastError_.CopyTo(errorText); }

HRESULT CommandComponent::BindController(BSTR url) {
    return Guarded([&] {
        if (!Reach(ViewOf(url))) {
            return Fail(E_INVALIDARG, Text(kComponent) + OLESTR("BindController: no controller at URL ") +
                                          Quoted(ViewOf(url)));
        }
        return S_OK;
    });
}

}  // namespace tav::sim
