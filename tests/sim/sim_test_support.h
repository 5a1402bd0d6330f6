#pragma once
#include <chrono>
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "TavController.h"
#include "TavSiblings.h"
#include "sim/virtual_controller.h"
#include "support/com_double.h"
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

// Records the replies handed to an asynchronous call's callback.
class ReplyCollector final : public ITavCommandCallback {
public:
    struct Received {
        HRESULT status;
        VARTYPE type;
        std::string text;
        ULONG userDef;
        bool onCallingThread;
    };

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    HRESULT STDMETHODCALLTYPE OnCommandReply(TavCommandReply* reply) override;
    TAV_TEST_DOUBLE_REFCOUNT

    // True when `count` replies arrived within `limit`.
    bool WaitFor(std::size_t count, std::chrono::milliseconds limit = 5s);
    std::vector<Received> All();

private:
    ~ReplyCollector() = default;

    tav::test::RefCount refs_;
    const std::thread::id creator_ = std::this_thread::get_id();
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::vector<Received> replies_;
};

// Records the events handed to a subscription's sink; `during`, when set,
// runs inside OnChange.
class EventCollector final : public _ITavObjectEvents {
public:
    struct Received {
        ULONG userDef;
        VARTYPE type;
        std::string text;
        FILETIME time;
        HRESULT status;
        ULONG eventId;
    };

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    HRESULT STDMETHODCALLTYPE OnChange(TavEventData* data) override;
    TAV_TEST_DOUBLE_REFCOUNT

    bool WaitFor(std::size_t count, std::chrono::milliseconds limit = 5s);
    std::vector<Received> All();
    std::vector<std::string> Texts();
    std::function<void()> during;

private:
    ~EventCollector() = default;

    tav::test::RefCount refs_;
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::vector<Received> events_;
};

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
    ULONG Subscribe(EventCollector* sink, std::string_view eventName, ULONG userDef = 7,
                    TavContainData containData = Data, HRESULT* result = nullptr);

    std::string Url() const { return Narrow(url_); }

    InProcessRegistration registration_;
    Text url_;
    std::shared_ptr<ControllerModel> controller_;
    ComPtr<ITavComCtrl> command_;
};

// Async TavInParams that deliver to `callback`.
TavInParams AsyncParams(ITavCommandCallback* callback, ULONG userDef, ULONG timeOut = 0);

std::chrono::milliseconds Since(std::chrono::steady_clock::time_point start);

}  // namespace tav::sim::test
