#include "sim/command_component.h"

#include <algorithm>
#include <fstream>
#include <iterator>
#include <thread>

#include "sim/command_runner.h"
#include "sim/file_system.h"
#include "sim/controller_registry.h"
#include "sim/subsystems/ipc.h"
#include "tav/guarded.h"
#include "sim/status_codes.h"
#include "tav/variant.h"

namespace tav::sim {
namespace {

constexpr TextView kCommandComponent = OLESTR("TavComCtrl.");
// A controller takes only so many asynchronous requests from one client
// ahead of their replies; more are refused rather than queued without end.
constexpr std::size_t kMostWaitingRequests = 256;

TextView ViewOf(BSTR text) { return text == nullptr ? TextView() : TextView(text, SysStringLen(text)); }

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

bool Succeeded(FileSystem::Result result, TextView path, Text& error) {
    if (result == FileSystem::Result::Done) {
        return true;
    }
    error = Concat({Quoted(path), OLESTR(": "), ResultText(result)});
    return false;
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
        ipc::ClientGone(*bound, clientId_.load());
        bound->DisconnectClient(clientId_.load());
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
        boundDirect_.store(controller.get(), std::memory_order_release);
    }
    clientId_ = controller->ConnectClient(OLESTR("TavController"));
    LinkMessageSink();
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
    return Guarded([&] { return Carry(rip, reply, ViewOf(verb), url, command, args, 0, OLESTR("Execute")); });
}

HRESULT CommandComponent::ExecuteEx(TavInParams* rip, TavCommandReply* reply, TavInParams*, ULONG clientValue, BSTR url,
                                    BSTR command, BSTR args, ULONG* result) {
    return Guarded([&] {
        if (result != nullptr) {
            *result = 0;
        }
        return Carry(rip, reply, OLESTR("Set"), url, command, args, clientValue, OLESTR("ExecuteEx"));
    });
}

// The success path makes no copies and no texts: a Sync call reads the
// caller's strings where they are.
HRESULT CommandComponent::Carry(TavInParams* rip, TavCommandReply* reply, TextView verb, BSTR url, BSTR command,
                                BSTR args, ULONG clientValue, TextView operation) {
    auto where = [operation] { return Text(kCommandComponent) + Text(operation); };
    if (reply == nullptr) {
        return Fail(E_POINTER, where() + OLESTR(": no reply record"));
    }
    Command request{verb, ViewOf(command), ViewOf(args), ViewOf(url)};
    // The bound controller is reached without the registry: controllers live
    // as long as the process, so the plain pointer stays good.
    ControllerModel* bound = boundDirect_.load(std::memory_order_acquire);
    std::shared_ptr<ControllerModel> controller;
    if (bound == nullptr || ControllerUrlOf(request.url) != TextView(bound->Url())) {
        controller = Reach(request.url);
        if (!controller) {
            return Fail(E_INVALIDARG, where() + OLESTR(": no controller at URL ") + Quoted(request.url));
        }
        bound = controller.get();
    }
    request.caller = Caller{clientId_.load(std::memory_order_relaxed), clientValue};
    if (auto down = bound->Faults().Transport()) {
        return Fail(down->status, std::move(down->text));
    }
    const ULONG timeOut = rip == nullptr ? 0 : rip->timeOut;

    if (rip == nullptr || rip->callType == Sync) {
        const auto result = RunCommand(*bound, request, timeOut, [](std::chrono::milliseconds delay) {
            std::this_thread::sleep_for(delay);
            return true;
        });
        if (FAILED(Fill(*reply, *result, rip == nullptr ? 0 : rip->userDef))) {
            return Fail(E_OUTOFMEMORY, where() + OLESTR(": no memory for the reply"));
        }
        return S_OK;
    }
    if (!controller) {
        controller = Reach(request.url);
    }

    const ComPtr<ITavCommandCallback> callback = CallbackOf(*rip);
    if (rip->pCallback != nullptr && !callback) {
        return Fail(E_NOINTERFACE, where() + OLESTR(": the callback is no ITavCommandCallback"));
    }
    const ULONG userDef = rip->userDef;
    const auto posted = replies_.PostUnlessFull([controller, callback, userDef, timeOut, caller = request.caller,
                                       verbText = Text(request.verb),
                                       nameText = Text(request.name), argsText = Text(request.args),
                                       urlText = Text(request.url)](const TaskQueue::Context& context) {
        Guarded([&] {
            const auto result = RunCommand(*controller, Command{verbText, nameText, argsText, urlText, caller}, timeOut,
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
    }, kMostWaitingRequests);
    if (posted == TaskQueue::Posted::Full) {
        return Fail(kStatusBusy, where() + OLESTR(": ") + Decimal(kMostWaitingRequests) +
                                     OLESTR(" asynchronous requests are waiting for the controller already"));
    }
    if (posted == TaskQueue::Posted::Stopping) {
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
    const Text where = Text(kCommandComponent) + Text(operation);
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
            return Fail(E_INVALIDARG, Text(kCommandComponent) + OLESTR("Unsubscribe: unknown cookie ") + Decimal(cookie));
        }
        return S_OK;
    });
}

HRESULT CommandComponent::ConnectIPCSink(IUnknown* sink) {
    return Guarded([&] {
        ComPtr<_ITavIPCMessages> messages;
        if (sink != nullptr &&
            FAILED(sink->QueryInterface(IID__ITavIPCMessages, reinterpret_cast<void**>(&messages)))) {
            return Fail(E_NOINTERFACE, Text(kCommandComponent) + OLESTR("ConnectIPCSink: the sink is no _ITavIPCMessages"));
        }
        {
            std::lock_guard lock(mutex_);
            messageSink_ = std::move(messages);
        }
        LinkMessageSink();
        return S_OK;
    });
}

void CommandComponent::LinkMessageSink() {
    std::shared_ptr<ControllerModel> bound;
    ComPtr<_ITavIPCMessages> sink;
    {
        std::lock_guard lock(mutex_);
        bound = bound_;
        sink = messageSink_;
    }
    const std::uint32_t id = clientId_.load();
    if (bound && id != 0) {
        bound->Links().SetMessageSink(id, std::move(sink));
    }
}

HRESULT CommandComponent::SendIPCMessage(TavInParams*, TavIPCHeaderInternal* header, byte* data, LONG size) {
    return Guarded([&] {
        if (header == nullptr) {
            return Fail(E_POINTER, Text(kCommandComponent) + OLESTR("SendIPCMessage: no message header"));
        }
        std::shared_ptr<ControllerModel> bound;
        {
            std::lock_guard lock(mutex_);
            bound = bound_;
        }
        if (!bound) {
            return Fail(E_UNEXPECTED, Text(kCommandComponent) + OLESTR("SendIPCMessage: not connected to a controller"));
        }
        if (auto down = bound->Faults().Transport()) {
            return Fail(down->status, std::move(down->text));
        }
        Text error;
        const HRESULT hr = ipc::RouteMessage(*bound, Caller{clientId_.load(std::memory_order_relaxed), 0}, *header,
                                             data, size, error);
        return FAILED(hr) ? Fail(hr, std::move(error)) : S_OK;
    });
}

HRESULT CommandComponent::CopyFileToController(TavInParams*, BSTR url, BSTR localPath, BSTR ctrlPath) {
    return Guarded([&] {
        return OnFiles(url, OLESTR("CopyFileToController"), [&](FileSystem& files, Text& error) {
            std::ifstream in(Narrow(ViewOf(localPath)), std::ios::binary);
            if (!in) {
                error = OLESTR("cannot read the local file ") + Quoted(ViewOf(localPath));
                return false;
            }
            std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
            return Succeeded(files.Write(ViewOf(ctrlPath), std::move(bytes)), ViewOf(ctrlPath), error);
        });
    });
}

HRESULT CommandComponent::CopyFileFromController(TavInParams*, BSTR url, BSTR ctrlPath, BSTR localPath) {
    return Guarded([&] {
        return OnFiles(url, OLESTR("CopyFileFromController"), [&](FileSystem& files, Text& error) {
            const std::string* bytes = files.Read(ViewOf(ctrlPath));
            if (bytes == nullptr) {
                return Succeeded(FileSystem::Result::NotFound, ViewOf(ctrlPath), error);
            }
            std::ofstream out(Narrow(ViewOf(localPath)), std::ios::binary | std::ios::trunc);
            if (!out || !out.write(bytes->data(), static_cast<std::streamsize>(bytes->size()))) {
                error = OLESTR("cannot write the local file ") + Quoted(ViewOf(localPath));
                return false;
            }
            return true;
        });
    });
}

HRESULT CommandComponent::CreateControllerDirectory(TavInParams*, BSTR url, BSTR ctrlDir) {
    return Guarded([&] {
        return OnFiles(url, OLESTR("CreateControllerDirectory"), [&](FileSystem& files, Text& error) {
            return Succeeded(files.MakeFolders(ViewOf(ctrlDir)), ViewOf(ctrlDir), error);
        });
    });
}

HRESULT CommandComponent::DeleteControllerFile(TavInParams*, BSTR url, BSTR ctrlPath) {
    return Guarded([&] {
        return OnFiles(url, OLESTR("DeleteControllerFile"), [&](FileSystem& files, Text& error) {
            if (files.IsFolder(ViewOf(ctrlPath))) {
                return Succeeded(FileSystem::Result::IsAFolder, ViewOf(ctrlPath), error);
            }
            return Succeeded(files.Remove(ViewOf(ctrlPath)), ViewOf(ctrlPath), error);
        });
    });
}

HRESULT CommandComponent::GetControllerFileSize(TavInParams*, BSTR url, BSTR ctrlPath, ULONG* size) {
    return Guarded([&] {
        if (size == nullptr) {
            return Fail(E_POINTER, Text(kCommandComponent) + OLESTR("GetControllerFileSize: no size pointer"));
        }
        *size = 0;
        return OnFiles(url, OLESTR("GetControllerFileSize"), [&](FileSystem& files, Text& error) {
            const auto found = files.Size(ViewOf(ctrlPath));
            if (!found) {
                return Succeeded(FileSystem::Result::NotFound, ViewOf(ctrlPath), error);
            }
            *size = static_cast<ULONG>(std::min<std::uint64_t>(*found, 0xFFFFFFFFu));
            return true;
        });
    });
}

template <typename F>
HRESULT CommandComponent::OnFiles(BSTR url, TextView operation, F&& work) {
    const auto controller = Reach(ViewOf(url));
    if (!controller) {
        return Fail(E_INVALIDARG, Concat({kCommandComponent, operation, OLESTR(": no controller at URL "), Quoted(ViewOf(url))}));
    }
    if (auto down = controller->Faults().Transport()) {
        return Fail(down->status, std::move(down->text));
    }
    Text error;
    const bool done = controller->Update(
        [&](ModelState& state, EventPosts&) { return work(state.Part<FileSystem>(), error); });
    return done ? S_OK : Fail(kStatusNotFound, Concat({kCommandComponent, operation, OLESTR(": "), error}));
}

// The file link is the command link: up unless the transport is failing.
HRESULT CommandComponent::CheckLink(TavInParams* rip, TavCommandReply* reply) {
    return Guarded([&] {
        if (reply == nullptr) {
            return Fail(E_POINTER, Text(kCommandComponent) + OLESTR("CheckLink: no reply record"));
        }
        std::shared_ptr<ControllerModel> bound;
        {
            std::lock_guard lock(mutex_);
            bound = bound_;
        }
        if (!bound) {
            return Fail(E_UNEXPECTED, Text(kCommandComponent) + OLESTR("CheckLink: not connected to a controller"));
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
            return Fail(E_INVALIDARG, Text(kCommandComponent) + OLESTR("BindController: no controller at URL ") +
                                          Quoted(ViewOf(url)));
        }
        return S_OK;
    });
}

HRESULT CommandComponent::GetClientId(ULONG* clientId) {
    if (clientId == nullptr) {
        return E_POINTER;
    }
    *clientId = clientId_.load();
    return *clientId == 0 ? E_UNEXPECTED : S_OK;
}

}  // namespace tav::sim
