// The LAN adaptor, the controller's time zone and time server.
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using Lan = ITavLANAdaptor;
using Lan2 = ITavLANAdaptor2;

int Method(Verb& v) {
    if (v.Done()) {
        return v.Get("GetLANAdaptorIPMethod", &Lan::GetLANAdaptorIPMethod, &Lan::UnpackLANAdaptorIPMethod);
    }
    const auto method = v.Enum<IPMethod>("METHOD");
    v.End();
    return v.Set("SetLANAdaptorIPMethod", &Lan::SetLANAdaptorIPMethod, method);
}

int Get(Verb& v) {
    v.End();
    const auto lan = v.Interface<Lan2>();
    IPMethod method = NONE;
    tav::Bstr address, mask, gateway;
    return v.session.Read(
        "GetLANAdaptorIP",
        [&](TavInParams* rip) {
            return lan->GetLANAdaptorIP(rip, &method, address.Receive(), mask.Receive(), gateway.Receive());
        },
        [&](VARIANT* data) {
            return lan->UnpackLANAdaptorIP(data, &method, address.Receive(), mask.Receive(), gateway.Receive());
        },
        [&] {
            v.session.Show(Record{{"method", Show(method)},
                                  {"address", Show(address)},
                                  {"mask", Show(mask)},
                                  {"gateway", Show(gateway)}});
        });
}

int Config(Verb& v) {
    v.End();
    const auto lan = v.Interface<Lan>();
    tav::Bstr address, mask, gateway;
    return v.session.Read(
        "GetLANAdaptorIPConfig",
        [&](TavInParams* rip) {
            return lan->GetLANAdaptorIPConfig(rip, address.Receive(), mask.Receive(), gateway.Receive());
        },
        [&](VARIANT* data) {
            return lan->UnpackLANAdaptorIPConfig(data, address.Receive(), mask.Receive(), gateway.Receive());
        },
        [&] {
            v.session.Show(Record{{"address", Show(address)}, {"mask", Show(mask)}, {"gateway", Show(gateway)}});
        });
}

int Set(Verb& v) {
    const auto methodWord = v.Option("--method");
    const auto address = Verb::ToBstr(v.Option("--address").value_or(""));
    const auto mask = Verb::ToBstr(v.Option("--mask").value_or(""));
    const auto gateway = Verb::ToBstr(v.Option("--gateway").value_or(""));
    v.End();
    if (!methodWord) {
        return v.Set("SetLANAdaptorIPConfig", &Lan::SetLANAdaptorIPConfig, address.Get(), mask.Get(), gateway.Get());
    }
    const auto method = v.EnumFrom<IPMethod>("--method", *methodWord);
    return v.Set("SetLANAdaptorIP", &Lan2::SetLANAdaptorIP, method, address.Get(), mask.Get(), gateway.Get());
}

int LanInfo(Verb& v) {
    v.End();
    const auto lan = v.Interface<Lan>();
    tav::Bstr address, mask, gateway, mac;
    return v.session.Read(
        "GetLANAdaptorInfo",
        [&](TavInParams* rip) {
            return lan->GetLANAdaptorInfo(rip, address.Receive(), mask.Receive(), gateway.Receive(), mac.Receive());
        },
        [&](VARIANT* data) {
            return lan->UnpackLANAdaptorInfo(data, address.Receive(), mask.Receive(), gateway.Receive(),
                                             mac.Receive());
        },
        [&] {
            v.session.Show(Record{{"address", Show(address)},
                                  {"mask", Show(mask)},
                                  {"gateway", Show(gateway)},
                                  {"mac", Show(mac)}});
        });
}

using T = ITavControllerTime;

int TimeZoneGet(Verb& v) {
    v.End();
    return v.Get("GetTimeZone", &T::GetTimeZone, &T::UnpackTimeZone);
}
int TimeZoneSet(Verb& v) {
    const auto zone = v.Text("ZONE");
    v.End();
    return v.Set("SetTimeZone", &T::SetTimeZone, zone.Get());
}

int TimeServerGet(Verb& v) {
    v.End();
    return v.Get("GetTimeServer", &T::GetTimeServer, &T::UnpackTimeServer);
}
int TimeServerSet(Verb& v) {
    const auto server = v.Text("SERVER");
    v.End();
    return v.Set("SetTimeServer", &T::SetTimeServer, server.Get());
}
int TimeServerTest(Verb& v) {
    const auto server = v.Text("SERVER");
    v.End();
    return v.Get("TestTimeServer", &T::TestTimeServer, &T::UnpackTestTimeServer, server.Get());
}

constexpr VerbEntry kLan[] = {
    {"method", "[METHOD]", "print the IP method (GetLANAdaptorIPMethod), or set it: NONE, FIXIP, DHCP", Method},
    {"get", "", "print the method and IP settings (GetLANAdaptorIP)", Get},
    {"config", "", "print the IP settings (GetLANAdaptorIPConfig)", Config},
    {"set", "[--method METHOD] --address A --mask M --gateway G",
     "set the IP settings (SetLANAdaptorIP; without --method SetLANAdaptorIPConfig)", Set,
     "Example: tavctl lan set --method FIXIP --address 192.168.125.1 --mask\n"
     "255.255.255.0 --gateway 192.168.125.254\n"},
    {"info", "", "print the adaptor's current settings and MAC address (GetLANAdaptorInfo)", LanInfo},
};
constexpr VerbEntry kTimeZone[] = {
    {"get", "", "print the time zone (GetTimeZone)", TimeZoneGet},
    {"set", "ZONE", "set the time zone (SetTimeZone)", TimeZoneSet},
};
constexpr VerbEntry kTimeServer[] = {
    {"get", "", "print the time server (GetTimeServer)", TimeServerGet},
    {"set", "SERVER", "set the time server (SetTimeServer)", TimeServerSet},
    {"test", "SERVER", "ask a time server for the time (TestTimeServer)", TimeServerTest},
};

constexpr GroupEntry kNetworkGroups[] = {{"lan", "The LAN adaptor", kLan}};
constexpr GroupEntry kTimeGroups[] = {
    {"timezone", "The controller's time zone", kTimeZone},
    {"timeserver", "The controller's time server", kTimeServer},
};

}  // namespace

std::span<const GroupEntry> NetworkGroups() { return kNetworkGroups; }
std::span<const GroupEntry> TimeGroups() { return kTimeGroups; }

}  // namespace tavctl
