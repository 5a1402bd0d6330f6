#pragma once
// A controller object of the newest class on a fresh virtual controller, with
// a direct hand on that controller's model for the changes no operation
// makes (the link, the energy state).
#include <memory>
#include <string>

#include "e2e/virtual_controller_fixture.h"
#include "support/event_sink.h"
#include "sim/controller_registry.h"

namespace tav::e2e {

class EventsFixture : public VirtualControllerTest {
public:
    std::shared_ptr<sim::ControllerModel> Model() { return sim::ControllerAt(Url()); }

    ComPtr<ITavPanel4> Panel() { return As<ITavPanel4>(); }

    HRESULT Subscribe(EventSink* sink, ULONG type, ULONG* cookie, ULONG userDef = 0,
                      TavContainData containData = Data, ULONG pollTime = 0) {
        return Subscribe(controller_, sink, type, cookie, userDef, containData, pollTime);
    }
    HRESULT Subscribe(ComPtr<ITavController>& object, EventSink* sink, ULONG type, ULONG* cookie,
                      ULONG userDef = 0, TavContainData containData = Data, ULONG pollTime = 0) {
        TavEventParams params{};
        params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
        params.pSink = sink;
        params.subscriptionType = type;
        params.pollTime = pollTime;
        params.userDef = userDef;
        params.containData = containData;
        ComPtr<ITavSubscribe> subscribe;
        EXPECT_EQ(object.As(subscribe), S_OK);
        return subscribe->Subscribe(nullptr, &params, cookie);
    }
    HRESULT Unsubscribe(ULONG cookie) { return As<ITavSubscribe>()->Unsubscribe(nullptr, cookie); }

    using VirtualControllerTest::As;
    using VirtualControllerTest::LastError;
    using VirtualControllerTest::Make;
};

}  // namespace tav::e2e
