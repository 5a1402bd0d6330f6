#pragma once
// A controller object of the newest class on a fresh virtual controller, with
// a direct hand on that controller's model for the changes no operation
// makes (the link, the energy state) and on its wire for texts the module
// would never send (which the controller itself must refuse).
#include <memory>
#include <string>

#include "e2e/virtual_controller_fixture.h"
#include "sim/command_table.h"
#include "sim/controller_registry.h"
#include "sim/status_codes.h"
#include "support/event_sink.h"

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

    sim::Reply Send(const char* verb, const char* name, const std::string& args = {}) {
        const sim::Text v = sim::Widen(verb), n = sim::Widen(name), a = sim::Widen(args);
        return sim::Dispatch(*Model(), {v, n, a, Url()});
    }
    static std::string TextOf(const sim::Reply& reply) { return sim::Narrow(reply.text); }
    static Bstr Wide(const std::string& text) { return Bstr(text::Widen(text).c_str()); }
    bool ErrorHas(const std::string& part) { return LastError().find(part) != std::string::npos; }

    // What a getter of interface I hands out; the call must succeed. The
    // value starts as one no getter gives, so that one left unwritten shows.
    template <class I, class T>
    T Fetch(HRESULT (STDMETHODCALLTYPE I::*get)(TavInParams*, T*)) {
        T value = static_cast<T>(0x5A5A);
        EXPECT_EQ((As<I>().Get()->*get)(nullptr, &value), S_OK) << LastError();
        return value;
    }
    template <class I>
    std::string FetchText(HRESULT (STDMETHODCALLTYPE I::*get)(TavInParams*, BSTR*)) {
        Bstr text;
        EXPECT_EQ((As<I>().Get()->*get)(nullptr, text.Receive()), S_OK) << LastError();
        return Narrow(text);
    }

    using VirtualControllerTest::As;
    using VirtualControllerTest::LastError;
    using VirtualControllerTest::Make;
};

}  // namespace tav::e2e
