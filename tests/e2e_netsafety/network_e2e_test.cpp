// The controller's LAN adaptor through ITavLANAdaptor2.
#include <functional>

#include "netsafety_fixture.h"

namespace tav::e2e {
namespace {

struct Addresses {
    std::string address, mask, gateway;
    bool operator==(const Addresses&) const = default;
};

std::ostream& operator<<(std::ostream& out, const Addresses& a) {
    return out << a.address << "/" << a.mask << " via " << a.gateway;
}

class NetworkE2eTest : public NetSafetyFixture {
protected:
    ComPtr<ITavLANAdaptor2> Lan() { return As<ITavLANAdaptor2>(); }

    IPMethod Method() { return Fetch(&ITavLANAdaptor::GetLANAdaptorIPMethod); }
    Addresses Fixed() {
        Bstr a, m, g;
        EXPECT_EQ(Lan()->GetLANAdaptorIPConfig(nullptr, a.Receive(), m.Receive(), g.Receive()), S_OK) << LastError();
        return {Narrow(a), Narrow(m), Narrow(g)};
    }
    Addresses Current(std::string* mac = nullptr) {
        Bstr a, m, g, macText;
        EXPECT_EQ(Lan()->GetLANAdaptorInfo(nullptr, a.Receive(), m.Receive(), g.Receive(), macText.Receive()), S_OK)
            << LastError();
        if (mac) *mac = Narrow(macText);
        return {Narrow(a), Narrow(m), Narrow(g)};
    }
    // The method and settings of the second interface, which must agree
    // with the first one's.
    std::pair<IPMethod, Addresses> Both() {
        IPMethod method{};
        Bstr a, m, g;
        EXPECT_EQ(Lan()->GetLANAdaptorIP(nullptr, &method, a.Receive(), m.Receive(), g.Receive()), S_OK)
            << LastError();
        return {method, {Narrow(a), Narrow(m), Narrow(g)}};
    }
    HRESULT SetFixed(const Addresses& a) {
        return Lan()->SetLANAdaptorIPConfig(nullptr, Wide(a.address).Get(), Wide(a.mask).Get(),
                                            Wide(a.gateway).Get());
    }
};

const Addresses kDelivered{"192.168.1.50", "255.255.255.0", "192.168.1.1"};
const Addresses kLease{"172.20.5.37", "255.255.252.0", "172.20.4.1"};

// Each step with the method and the fixed settings it leaves, and what the
// adaptor then uses: the fixed settings are kept whatever the method and
// used under FIXIP only, DHCP takes its lease, and off, the controller's
// "unspec" reaches the client as empty strings.
TEST_F(NetworkE2eTest, TheMethodDecidesWhatTheAdaptorUses) {
    auto method = [this](IPMethod m) { return [=, this] { return Lan()->SetLANAdaptorIPMethod(nullptr, m); }; };
    auto fixed = [this](Addresses a) { return [=, this] { return SetFixed(a); }; };
    // Method and settings in one call; a null text sends no address.
    auto both = [this](IPMethod m, const char* a, const char* k, const char* g) {
        return [=, this] {
            Bstr address = a ? Wide(a) : Bstr(), mask = k ? Wide(k) : Bstr(), gateway = g ? Wide(g) : Bstr();
            return Lan()->SetLANAdaptorIP(nullptr, m, address.Get(), mask.Get(), gateway.Get());
        };
    };
    const Addresses off{"", "", ""};
    const Addresses later{"10.1.2.3", "255.255.0.0", "10.1.0.1"};
    const Addresses noGateway{"10.0.0.5", "255.0.0.0", ""};
    const Addresses oneCall{"10.9.8.6", "255.255.255.0", "10.9.8.1"};
    struct Step {
        const char* what;
        std::function<HRESULT()> set;
        IPMethod method;
        Addresses fixed, current;
    };
    const Step steps[] = {
        {"as delivered", [] { return S_OK; }, FIXIP, kDelivered, kDelivered},
        {"off", method(NONE), NONE, kDelivered, off},
        {"DHCP", method(DHCP), DHCP, kDelivered, kLease},
        {"fixed", method(FIXIP), FIXIP, kDelivered, kDelivered},
        {"DHCP again", method(DHCP), DHCP, kDelivered, kLease},
        {"fixed settings under DHCP", fixed(later), DHCP, later, kLease},
        {"fixed again", method(FIXIP), FIXIP, later, later},
        {"no gateway", fixed(noGateway), FIXIP, noGateway, noGateway},
        {"off in one call", both(NONE, nullptr, nullptr, nullptr), NONE, noGateway, off},
        {"DHCP in one call", both(DHCP, "10.9.8.7", "255.255.255.0", nullptr), DHCP,
         {"10.9.8.7", "255.255.255.0", ""}, kLease},
        {"fixed in one call", both(FIXIP, "10.9.8.6", "255.255.255.0", "10.9.8.1"), FIXIP, oneCall, oneCall},
    };
    for (const Step& step : steps) {
        SCOPED_TRACE(step.what);
        ASSERT_EQ(step.set(), S_OK) << LastError();
        std::string mac;
        EXPECT_EQ(Method(), step.method);
        EXPECT_EQ(Fixed(), step.fixed);
        EXPECT_EQ(Both(), std::make_pair(step.method, step.fixed));
        EXPECT_EQ(Current(&mac), step.current);
        EXPECT_EQ(mac, "00:80:F4:0C:3A:21") << "the MAC address is never unset";
    }
}

// Settings the module lets through but no network can use.
TEST_F(NetworkE2eTest, TheControllerRefusesUnusableSettings) {
    struct Case {
        Addresses settings;
        const char* why;
    };
    const Case cases[] = {
        {{"10.0.0.5", "255.0.255.0", ""}, "is not contiguous"},
        {{"1.2.3.4xyz", "255.255.255.0", ""}, "\"1.2.3.4xyz\" is no IPv4 address"},
        {{"10.0.0.5", "255.255.255.0", "10.0.1.1"}, "is not another host of the subnet"},
        {{"10.0.0.5", "255.255.255.0", "10.0.0.5"}, "is not another host of the subnet"},
        {{"10.0.0.255", "255.255.255.0", ""}, "is no host address in its subnet"},
        {{"10.0.0.0", "255.255.255.0", ""}, "is no host address in its subnet"},
        {{"0.0.0.0", "255.255.255.255", ""}, "is no host address in its subnet"},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(SetFixed(c.settings), sim::kStatusBadArgument) << c.settings;
        EXPECT_TRUE(ErrorHas("LANAdaptorIP: ") && ErrorHas(c.why)) << LastError();
        EXPECT_EQ(Lan()->SetLANAdaptorIP(nullptr, DHCP, Wide(c.settings.address).Get(), Wide(c.settings.mask).Get(),
                                         Wide(c.settings.gateway).Get()),
                  sim::kStatusBadArgument)
            << c.settings;
        EXPECT_TRUE(ErrorHas("LANAdaptor: ") && ErrorHas(c.why)) << LastError();
    }
    EXPECT_EQ(Both(), std::make_pair(FIXIP, kDelivered)) << "nothing of a refused setting is kept";

    // A /31 link has no subnet or broadcast address to avoid.
    EXPECT_EQ(SetFixed({"10.0.0.0", "255.255.255.254", "10.0.0.1"}), S_OK) << LastError();
}

// The wire as the module writes it, and words the module never sends.
TEST_F(NetworkE2eTest, TheWireIsReadAsTheModuleWritesIt) {
    EXPECT_EQ(Send("Set", "LANAdaptor", "-Method DHCP-Address 10.0.0.9 -Submask 255.0.0.0 -Gateway \"\"").status,
              S_OK);
    EXPECT_EQ(TextOf(Send("Get", "LANAdaptor")), "-Method DHCP -Address 10.0.0.9 -Submask 255.0.0.0 -Gateway unspec");
    for (const char* args : {"-Method dhcp", "-Method", "-Method NONE-Address"}) {
        const sim::Reply reply = Send("Set", "LANAdaptorMethod", args);
        EXPECT_EQ(reply.status, sim::kStatusBadArgument) << args;
    }
    EXPECT_EQ(Send("Set", "LANAdaptor", "-Method AUTO-Address 10.0.0.9 -Submask 255.0.0.0 -Gateway \"\"").status,
              sim::kStatusBadArgument);
    EXPECT_EQ(Method(), DHCP);
}

}  // namespace
}  // namespace tav::e2e
