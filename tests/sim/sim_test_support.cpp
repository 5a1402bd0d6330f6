#include "sim_test_support.h"

#include <atomic>

namespace tav::sim::test {
namespace {

// COM as the tests' host thread needs it where the platform asks (Windows).
class ComEnvironment : public ::testing::Environment {
public:
    void SetUp() override { CoInitializeEx(nullptr, COINIT_MULTITHREADED); }
    void TearDown() override { CoUninitialize(); }
};

const auto* const kComEnvironment = ::testing::AddGlobalTestEnvironment(new ComEnvironment);

std::string TextOf(const VARIANT& data) {
    return data.vt == VT_BSTR && data.bstrVal != nullptr ? Narrow(TextView(data.bstrVal, SysStringLen(data.bstrVal)))
                                                          : std::string();
}

}  // namespace

std::vector<std::string> Texts(EventSink& sink) {
    std::vector<std::string> texts;
    for (const auto& event : sink.All()) {
        texts.push_back(event.text);
    }
    return texts;
}

void SimTest::SetUp() {
    static std::atomic<int> next{1};
    registration_ = RegisterInProcess();
    ASSERT_TRUE(registration_) << std::hex << registration_.Result();
    url_ = T("/simtest" + std::to_string(next++));
    controller_ = ControllerAt(url_);
    ASSERT_TRUE(controller_);
    ASSERT_EQ(S_OK, CoCreateInstance(CLSID_TavComCtrl, nullptr, CLSCTX_INPROC_SERVER, IID_ITavComCtrl,
                                     reinterpret_cast<void**>(&command_)));
}

Outcome SimTest::Execute(std::string_view verb, std::string_view command, std::string_view args, TavInParams* rip,
                         std::string_view url) {
    const Bstr verbText = B(verb);
    const Bstr urlText = url.empty() ? Bstr(TextView(url_)) : B(url);
    const Bstr commandText = B(command);
    const Bstr argsText = B(args);
    TavCommandReply reply{};
    Outcome outcome;
    outcome.hr = command_->Execute(rip, &reply, verbText.Get(), urlText.Get(), commandText.Get(), argsText.Get());
    outcome.status = reply.status;
    outcome.type = reply.data.vt;
    outcome.text = TextOf(reply.data);
    outcome.userDef = reply.userDef;
    VariantClear(&reply.data);
    return outcome;
}

std::string SimTest::ErrorTextOf(IUnknown* component) {
    ComPtr<ITavComError> error;
    if (FAILED(component->QueryInterface(IID_ITavComError, reinterpret_cast<void**>(&error)))) {
        return "(no ITavComError)";
    }
    Bstr text;
    error->GetLastErrorInfo(text.Receive());
    return Narrow(text.View());
}

ULONG SimTest::Subscribe(_ITavObjectEvents* sink, std::string_view eventName, ULONG userDef, TavContainData containData,
                         HRESULT* result) {
    TavEventParams params{};
    params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
    params.pSink = sink;
    params.pollTime = 1000;
    params.userDef = userDef;
    params.containData = containData;
    const Bstr name = B(eventName);
    ULONG cookie = 0;
    const HRESULT hr = command_->Subscribe(nullptr, &params, nullptr, name.Get(), nullptr, 1, &cookie);
    if (result != nullptr) {
        *result = hr;
    }
    return cookie;
}

std::chrono::milliseconds Since(std::chrono::steady_clock::time_point start) {
    return std::chrono::duration_cast<std::chrono::milliseconds>(std::chrono::steady_clock::now() - start);
}

}  // namespace tav::sim::test
