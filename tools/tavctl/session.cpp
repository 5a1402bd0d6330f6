#include "tavctl/session.h"

#include <cstdlib>
#include <iostream>

#include "tavctl/text.h"

namespace tavctl {

Session::Session(GlobalOptions options, ClientFactory factory)
    : options_(std::move(options)), factory_(std::move(factory)) {}

Session::~Session() { StopWatch(); }

ITavController* Session::Controller() {
    auto found = clients_.find(current_);
    if (found != clients_.end()) {
        return found->second.Get();
    }
    tav::ComPtr<ITavController> client;
    std::string error;
    if (FAILED(factory_(client, error)) || !client) {
        Error("client " + std::to_string(current_) + ": " + error);
        return nullptr;
    }
    return clients_.emplace(current_, std::move(client)).first->second.Get();
}

unsigned Session::ClassVersion() const {
    const std::string& name = options_.className;
    const std::size_t digits = name.find_first_of("0123456789");
    return digits == std::string::npos ? 1u : static_cast<unsigned>(std::strtoul(name.c_str() + digits, nullptr, 10));
}

void Session::Print(const std::string& line) {
    std::lock_guard lock(outputMutex_);
    std::cout << line << std::endl;
}

void Session::Error(const std::string& line) {
    std::lock_guard lock(outputMutex_);
    std::cout.flush();
    std::cerr << "tavctl: " << line << std::endl;
}

void Session::Diagnostic(const std::string& line) {
    std::lock_guard lock(outputMutex_);
    std::cout.flush();
    std::cerr << line << std::endl;
}

void Session::Show(const Value& value) { Print(options_.json ? Json(value) : PlainText(value)); }
void Session::Show(const Record& record) { Print(options_.json ? Json(record) : PlainText(record)); }
void Session::Show(const std::vector<Record>& table) { Print(options_.json ? Json(table) : PlainText(table)); }

TavInParams Session::SyncParams() const {
    TavInParams rip{};
    rip.callType = Sync;
    rip.timeOut = options_.timeoutMs;
    return rip;
}

int Session::Fail(const std::string& operation, HRESULT hr) {
    std::string text = "(none)";
    tav::ComPtr<ITavHelperBase> helper;
    ITavController* controller = Controller();
    if (controller != nullptr &&
        SUCCEEDED(controller->QueryInterface(IID_ITavHelperBase, reinterpret_cast<void**>(&helper)))) {
        BSTR lastError = nullptr;
        if (SUCCEEDED(helper->GetLastErrorInfo(&lastError)) && lastError != nullptr) {
            text = ToUtf8(lastError);
        }
        SysFreeString(lastError);
    }
    Error(operation + " failed: " + DescribeHresult(hr) + "; last error: " + text);
    return kExitFailed;
}

// The reply's text is what the controller said; the object learns it as its
// last error the way an asynchronous client hands it over.
int Session::FailReply(const std::string& operation, CallbackReply& reply) {
    tav::ComPtr<ITavHelperBase> helper;
    ITavController* controller = Controller();
    if (controller != nullptr && reply.data.Type() == VT_BSTR &&
        SUCCEEDED(controller->QueryInterface(IID_ITavHelperBase, reinterpret_cast<void**>(&helper)))) {
        helper->SetLastErrorInfo(reply.data.Get());
    }
    Error(operation + " failed: the reply's status is " + DescribeHresult(reply.status) + "; reply: " +
          (reply.data.Type() == VT_BSTR ? ToUtf8(reply.data.StringView()) : std::string("(no text)")));
    return kExitFailed;
}

std::optional<CallbackReply> Session::CallThroughCallback(const std::string& operation, const Call& call,
                                                          int& exitStatus) {
    tav::ComPtr<ReplyWaiter> waiter;
    waiter.Attach(ReplyWaiter::New());
    TavInParams rip{};
    rip.riid = const_cast<GUID*>(&IID_ITavCommandCallback);
    rip.pCallback = waiter.Get();
    rip.callType = Async;
    rip.timeOut = options_.timeoutMs;
    rip.userDef = nextUserDef_++;
    const HRESULT hr = call(&rip);
    if (FAILED(hr)) {
        exitStatus = Fail(operation, hr);
        return std::nullopt;
    }
    auto reply = waiter->Wait(std::chrono::milliseconds(options_.timeoutMs) + std::chrono::seconds(2));
    if (!reply) {
        Error(operation + ": no reply reached the callback within " + std::to_string(options_.timeoutMs + 2000) +
              " ms");
        exitStatus = kExitFailed;
        return std::nullopt;
    }
    if (options_.async) {
        Print("async reply: status " + DescribeHresult(reply->status) + ", userDef " +
              std::to_string(reply->userDef));
    }
    if (FAILED(reply->status)) {
        exitStatus = FailReply(operation, *reply);
        return std::nullopt;
    }
    exitStatus = kExitOk;
    return reply;
}

int Session::Read(const std::string& operation, const Call& call, const Unpack& unpack,
                  const std::function<void()>& print) {
    if (!options_.async) {
        TavInParams rip = SyncParams();
        const HRESULT hr = call(&rip);
        if (FAILED(hr)) {
            return Fail(operation, hr);
        }
        print();
        return kExitOk;
    }
    int exitStatus = kExitOk;
    auto reply = CallThroughCallback(operation, call, exitStatus);
    if (!reply) {
        return exitStatus;
    }
    if (!unpack) {
        Show(Record{{"reply", reply->data.Type() == VT_BSTR ? Value::Text(ToUtf8(reply->data.StringView()))
                                                             : Value::Null()}});
        return kExitOk;
    }
    const HRESULT hr = unpack(reply->data.Get());
    if (FAILED(hr)) {
        return Fail("decoding the reply of " + operation, hr);
    }
    print();
    return kExitOk;
}

int Session::Write(const std::string& operation, const Call& call) {
    if (!options_.async) {
        TavInParams rip = SyncParams();
        const HRESULT hr = call(&rip);
        return FAILED(hr) ? Fail(operation, hr) : kExitOk;
    }
    int exitStatus = kExitOk;
    CallThroughCallback(operation, call, exitStatus);
    return exitStatus;
}

void Session::StopWatch() {
    for (ULONG cookie : watch_.cookies) {
        TavInParams rip = SyncParams();
        const HRESULT hr = watch_.subscribe->Unsubscribe(&rip, cookie);
        if (FAILED(hr)) {
            Fail("Unsubscribe", hr);
        }
    }
    watch_ = WatchState{};
}

}  // namespace tavctl
