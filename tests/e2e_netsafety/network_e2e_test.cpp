// The controller's LAN adaptor through ITavLANAdaptor2.
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

TEST_F(NetworkE2eTest, TheMethodDecidesWhatTheAdaptorUses) {
    std::string mac;
    EXPECT_EQ(Method(), FIXIP);
    EXPECT_EQ(Current(&mac), kDelivered);
    EXPECT_EQ(mac, "00:80:F4:0C:3A:21");

    struct Case {
        IPMethod method;
        Addresses current;
    };
    // Off, nothing is set: the controller's "unspec" reaches the client as
    // empty strings. The fixed settings stay whatever the method.
    const Case cases[] = {{NONE, {"", "", ""}}, {DHCP, kLease}, {FIXIP, kDelivered}, {DHCP, kLease}};
    for (const Case& c : cases) {
        ASSERT_EQ(Lan()->SetLANAdaptorIPMethod(nullptr, c.method), S_OK) << LastError();
        EXPECT_EQ(Method(), c.method);
        EXPECT_EQ(Current(&mac), c.current) << c.method;
        EXPECT_EQ(mac, "00:80:F4:0C:3A:21") << "the MAC address is never unset";
        EXPECT_EQ(Fixed(), kDelivered);
        EXPECT_EQ(Both(), std::make_pair(c.method, kDelivered));
    }
}

TEST_F(NetworkE2eTest, FixedSettingsTakeEffectUnderFixIpOnly) {
    const Addresses noGateway{"10.0.0.5", "255.0.0.0", ""};
    ASSERT_EQ(SetFixed(noGateway), S_OK) << LastError();
    EXPECT_EQ(Fixed(), noGateway) << "a gateway not set reads back empty";
    EXPECT_EQ(Current(), noGateway);

    ASSERT_EQ(Lan()->SetLANAdaptorIPMethod(nullptr, DHCP), S_OK);
    const Addresses later{"10.1.2.3", "255.255.0.0", "10.1.0.1"};
    ASSERT_EQ(SetFixed(later), S_OK) << LastError();
    EXPECT_EQ(Fixed(), later);
    EXPECT_EQ(Current(), kLease) << "kept for FIXIP, not used under DHCP";
    ASSERT_EQ(Lan()->SetLANAdaptorIPMethod(nullptr, FIXIP), S_OK);
    EXPECT_EQ(Current(), later);
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

TEST_F(NetworkE2eTest, MethodAndSettingsInOneCall) {
    auto set = [&](IPMethod method, const char* a, const char* m, const char* g) {
        Bstr address = a ? Wide(a) : Bstr(), mask = m ? Wide(m) : Bstr(), gateway = g ? Wide(g) : Bstr();
        return Lan()->SetLANAdaptorIP(nullptr, method, address.Get(), mask.Get(), gateway.Get());
    };
    // NONE sends no addresses and keeps the fixed ones.
    ASSERT_EQ(set(NONE, nullptr, nullptr, nullptr), S_OK) << LastError();
    EXPECT_EQ(Both(), std::make_pair(NONE, kDelivered));
    EXPECT_EQ(Current(), (Addresses{"", "", ""}));

    ASSERT_EQ(set(DHCP, "10.9.8.7", "255.255.255.0", nullptr), S_OK) << LastError();
    EXPECT_EQ(Both(), std::make_pair(DHCP, Addresses{"10.9.8.7", "255.255.255.0", ""}));
    EXPECT_EQ(Current(), kLease);

    ASSERT_EQ(set(FIXIP, "10.9.8.6", "255.255.255.0", "10.9.8.1"), S_OK) << LastError();
    EXPECT_EQ(Current(), (Addresses{"10.9.8.6", "255.255.255.0", "10.9.8.1"}));
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
