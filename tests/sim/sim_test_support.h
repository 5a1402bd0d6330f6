#pragma once
#include <chrono>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "TavController.h"
#include "TavSiblings.h"
#include "sim/virtual_controller.h"
#include "support/com_double.h"
#include "support/event_sink.h"
#include "support/reply_recorder.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"

namespace tav::sim::test {

using namespace std::chrono_literals;
using tav::test::Ref;

inline Text T(std::string_view text) { return Widen(text); }
inline Bstr B(std::string_view text) { return Bstr(TextView(Widen(text))); }

// What one Execute produced.
struct Outcome {
    HRESULT hr = E_UNEXPECTED;  // Execute's own result
    HRESULT status = E_UNEXPECTED;
    VARTYPE type = VT_EMPTY;
    std::string text;
    ULONG userDef = 0;
};

using tav::test::EventSink;
using tav::test::AsyncParams;
using tav::test::ReplyRecorder;

// The texts of the events a sink received, in order.
std::vector<std::string> Texts(EventSink& sink);

// A command component created through CoCreateInstance, as Init creates it,
// talking to a controller of its own (a fresh URL per test).
class SimTest : public ::testing::Test {
protected:
    void SetUp() override;

    Outcome Execute(std::string_view verb, std::string_view command, std::string_view args = {},
                    TavInParams* rip = nullptr, std::string_view url = {});
    Outcome Get(std::string_view command, std::string_view args = {}) { return Execute("Get", command, args); }
    Outcome Set(std::string_view command, std::string_view args = {}) { return Execute("Set", command, args); }

    // The component's ITavComError text.
    static std::string ErrorTextOf(IUnknown* component);

    // Subscribes sink to eventName with kind 1; the cookie, 0 on failure.
    ULONG Subscribe(_ITavObjectEvents* sink, std::string_view eventName, ULONG userDef = 7,
                    TavContainData containData = Data, HRESULT* result = nullptr);

    std::string Url() const { return Narrow(url_); }

    InProcessRegistration registration_;
    Text url_;
    std::shared_ptr<ControllerModel> controller_;
    ComPtr<ITavComCtrl> command_;
};

std::chrono::milliseconds Since(std::chrono::steady_clock::time_point start);

}  // namespace tav::sim::test
