// Motors state, operation mode with its auto conditions, collision detection,
// events and an asynchronous call, end to end against the virtual controller.
#include <condition_variable>
#include <mutex>
#include <vector>

#include "virtual_controller_fixture.h"

namespace tav::e2e {
namespace {

using PanelE2eTest = VirtualControllerTest;

// Collects what the controller delivers: command replies and events. The
// controller's threads may hold it after a test ends, so it lives on the heap.
class Listener final : public ITavCommandCallback, public _ITavObjectEvents {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override {
        if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID_ITavCommandCallback)) {
            *object = static_cast<ITavCommandCallback*>(this);
        } else if (IsEqualIID(riid, IID__ITavObjectEvents)) {
            *object = static_cast<_ITavObjectEvents*>(this);
        } else {
            *object = nullptr;
            return E_NOINTERFACE;
        }
        AddRef();
        return S_OK;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references_; }
    ULONG STDMETHODCALLTYPE Release() override {
        const ULONG left = --references_;
        if (left == 0) {
            delete this;
        }
        return left;
    }

    HRESULT STDMETHODCALLTYPE OnCommandReply(TavCommandReply* reply) override {
        std::lock_guard hold(mutex_);
        replies_.push_back({reply->status, reply->userDef, Text(reply->data)});
        arrived_.notify_all();
        return S_OK;
    }
    HRESULT STDMETHODCALLTYPE OnChange(TavEventData* data) override {
        std::lock_guard hold(mutex_);
        events_.push_back(Text(data->Data));
        arrived_.notify_all();
        return S_OK;
    }

    struct Reply {
        HRESULT status;
        ULONG userDef;
        OleString text;
    };
    bool WaitForReplies(size_t n) {
        std::unique_lock hold(mutex_);
        return arrived_.wait_for(hold, std::chrono::seconds(10), [&] { return replies_.size() >= n; });
    }
    bool WaitForEvents(size_t n) {
        std::unique_lock hold(mutex_);
        return arrived_.wait_for(hold, std::chrono::seconds(10), [&] { return events_.size() >= n; });
    }
    std::vector<Reply> Replies() {
        std::lock_guard hold(mutex_);
        return replies_;
    }
    std::vector<OleString> Events() {
        std::lock_guard hold(mutex_);
        return events_;
    }

private:
    static OleString Text(const VARIANT& data) {
        return data.vt == VT_BSTR && data.bstrVal != nullptr ? OleString(data.bstrVal, SysStringLen(data.bstrVal))
                                                              : OleString();
    }

    std::atomic<ULONG> references_{1};
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::vector<Reply> replies_;
    std::vector<OleString> events_;
};

TEST_F(PanelE2eTest, MotorsOnAndOff) {
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOn), S_OK);
    TavControllerState state = InitState;
    ASSERT_EQ(panel->GetControllerState(nullptr, &state), S_OK);
    EXPECT_EQ(state, MotorsOn);
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOff), S_OK);
    ASSERT_EQ(panel->GetControllerState(nullptr, &state), S_OK);
    EXPECT_EQ(state, MotorsOff);
    EXPECT_EQ(panel->SetControllerState(nullptr, GuardStop), E_INVALIDARG);
}

TEST_F(PanelE2eTest, ChangeToAutomaticPassesThroughItsConditions) {
    ComPtr<ITavPanel4> panel = As<ITavPanel4>();
    ASSERT_EQ(panel->SetOPMode(nullptr, Manr), S_OK);
    ASSERT_EQ(panel->SetOPMode(nullptr, Auto), S_OK);

    TavOperationMode mode = UndefinedMode;
    ComPtr<IEnumAutoCondition2> conditions;
    ULONG cycle = 0;
    ASSERT_EQ(panel->GetOperationMode2(nullptr, &mode, &conditions, &cycle), S_OK);
    ASSERT_EQ(mode, AutoChange);
    ASSERT_TRUE(conditions);

    TavAutoCondition2 element{};
    ULONG fetched = 0;
    size_t count = 0;
    while (conditions->RemNext(1, &element, &fetched) == S_OK && fetched == 1) {
        ++count;
    }
    ASSERT_GT(count, 0u);
    // The virtual controller numbers its conditions from 1.
    for (ULONG id = 1; id <= count; ++id) {
        EXPECT_EQ(panel->AcknowledgeAutoCondition(nullptr, AutoConditionAck_Reset, id), S_OK) << id;
    }
    ASSERT_EQ(panel->GetOperationMode(nullptr, &mode), S_OK);
    EXPECT_EQ(mode, Auto);
}

TEST_F(PanelE2eTest, CollisionStateIsDecoded) {
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    TavCollisionDetectState state{};
    ASSERT_EQ(panel->GetCollisionDetectState(nullptr, &state), S_OK);
    EXPECT_GE(state, CollisionDetect_Init);
    EXPECT_LE(state, CollisionDetect_TriggeredAck);
    // Nothing was triggered, so the controller has nothing to acknowledge.
    EXPECT_LT(panel->Acknowledge(nullptr, ColDetAck), 0);
    EXPECT_NE(LastError().find("TavControllerImpl["), std::string::npos);
}

TEST_F(PanelE2eTest, StateAndModeEventsReachTheSink) {
    ComPtr<Listener> holder;
    holder.Attach(new Listener);
    Listener& listener = *holder.Get();
    TavEventParams params{};
    params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
    params.pSink = static_cast<_ITavObjectEvents*>(&listener);
    params.subscriptionType = state;
    ComPtr<ITavSubscribe> subscribe = As<ITavSubscribe>();
    ULONG stateCookie = 0;
    ASSERT_EQ(subscribe->Subscribe(nullptr, &params, &stateCookie), S_OK);

    ComPtr<ITavPanel> panel = As<ITavPanel>();
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOn), S_OK);
    ASSERT_TRUE(listener.WaitForEvents(1));

    VARIANT event;
    VariantInit(&event);
    event.vt = VT_BSTR;
    event.bstrVal = SysAllocString(listener.Events().back().c_str());
    TavControllerState decoded = InitState;
    EXPECT_EQ(panel->UnpackControllerState(&event, &decoded), S_OK);
    EXPECT_EQ(decoded, MotorsOn);
    VariantClear(&event);

    ASSERT_EQ(subscribe->Unsubscribe(nullptr, stateCookie), S_OK);
    const size_t before = listener.Events().size();
    ASSERT_EQ(panel->SetControllerState(nullptr, MotorsOff), S_OK);
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    EXPECT_EQ(listener.Events().size(), before);
}

TEST_F(PanelE2eTest, AsynchronousCallDeliversItsReplyToTheCallback) {
    ComPtr<Listener> holder;
    holder.Attach(new Listener);
    Listener& listener = *holder.Get();
    TavInParams rip{};
    rip.riid = const_cast<GUID*>(&IID_ITavCommandCallback);
    rip.pCallback = static_cast<ITavCommandCallback*>(&listener);
    rip.callType = Async;
    rip.timeOut = 5000;
    rip.userDef = 4711;
    ComPtr<ITavPanel> panel = As<ITavPanel>();
    TavControllerState untouched = SysFail;
    ASSERT_EQ(panel->GetControllerState(&rip, &untouched), S_OK);
    EXPECT_EQ(untouched, SysFail);
    ASSERT_TRUE(listener.WaitForReplies(1));
    const Listener::Reply reply = listener.Replies().front();
    EXPECT_EQ(reply.status, S_OK);
    EXPECT_EQ(reply.userDef, 4711u);

    VARIANT data;
    VariantInit(&data);
    data.vt = VT_BSTR;
    data.bstrVal = SysAllocString(reply.text.c_str());
    TavControllerState decoded = SysFail;
    EXPECT_EQ(panel->UnpackControllerState(&data, &decoded), S_OK);
    EXPECT_EQ(decoded, MotorsOff);
    VariantClear(&data);
}

}  // namespace
}  // namespace tav::e2e
