// The controller's LAN adaptor: how it gets its address, the fixed settings
// it keeps for FIXIP, and what it uses now.
#include "sim/subsystems/network.h"

#include <variant>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"

namespace tav::sim {

std::optional<std::uint32_t> ParseIpv4(TextView text) {
    std::uint32_t address = 0;
    for (int part = 0; part < 4; ++part) {
        if (part > 0) {
            if (text.empty() || text.front() != OLECHAR('.')) {
                return std::nullopt;
            }
            text.remove_prefix(1);
        }
        std::size_t digits = 0;
        while (digits < text.size() && digits < 4 && text[digits] >= OLECHAR('0') && text[digits] <= OLECHAR('9')) {
            ++digits;
        }
        const auto number = ParseUnsigned(text.substr(0, digits));
        if (!number || *number > 255) {
            return std::nullopt;
        }
        address = address << 8 | *number;
        text.remove_prefix(digits);
    }
    if (!text.empty()) {
        return std::nullopt;
    }
    return address;
}

Text Ipv4Text(std::uint32_t address) {
    return Concat({Decimal(address >> 24), OLESTR("."), Decimal(address >> 16 & 0xFF), OLESTR("."),
                   Decimal(address >> 8 & 0xFF), OLESTR("."), Decimal(address & 0xFF)});
}

std::optional<Text> Ipv4Refusal(const Ipv4Settings& settings) {
    const std::uint32_t mask = settings.mask;
    // Ones from the top, then only zeros: ~mask + 1 is then a power of two.
    if (mask == 0 || ((~mask + 1) & ~mask) != 0) {
        return OLESTR("the subnet mask ") + Ipv4Text(mask) + OLESTR(" is not contiguous");
    }
    const std::uint32_t host = settings.address & ~mask;
    // /31 and /32 networks have no subnet or broadcast address of their own.
    if (settings.address == 0 || (~mask > 1 && (host == 0 || host == ~mask))) {
        return OLESTR("the address ") + Ipv4Text(settings.address) + OLESTR(" is no host address in its subnet");
    }
    if (settings.gateway) {
        const std::uint32_t gateway = *settings.gateway;
        if ((gateway & mask) != (settings.address & mask) || gateway == settings.address) {
            return OLESTR("the gateway ") + Ipv4Text(gateway) + OLESTR(" is not another host of the subnet");
        }
    }
    return std::nullopt;
}

namespace {

enum class IpMethod { None, FixIp, Dhcp };

constexpr std::pair<IpMethod, TextView> kMethodWords[] = {
    {IpMethod::None, OLESTR("NONE")}, {IpMethod::FixIp, OLESTR("FIXIP")}, {IpMethod::Dhcp, OLESTR("DHCP")}};

TextView MethodWord(IpMethod method) {
    for (const auto& [value, word] : kMethodWords) {
        if (value == method) {
            return word;
        }
    }
    return {};
}

std::optional<IpMethod> MethodOf(TextView word) {
    for (const auto& [value, known] : kMethodWords) {
        if (known == word) {
            return value;
        }
    }
    return std::nullopt;
}

// What the plant network's DHCP server leases to the adaptor.
constexpr Ipv4Settings kDhcpLease{0xAC140525u /* 172.20.5.37 */, 0xFFFFFC00u /* 255.255.252.0 */,
                                  0xAC140401u /* 172.20.4.1 */};

struct LanAdaptorState {
    IpMethod method = IpMethod::FixIp;
    // The settings FIXIP uses; kept while another method is in force.
    Ipv4Settings fixed{0xC0A80132u /* 192.168.1.50 */, 0xFFFFFF00u, 0xC0A80101u /* 192.168.1.1 */};
    Text mac = OLESTR("00:80:F4:0C:3A:21");
};

Text AddressFields(const std::optional<Ipv4Settings>& settings) {
    if (!settings) {
        return Concat({OLESTR("-Address "), kUnspecified, OLESTR(" -Submask "), kUnspecified, OLESTR(" -Gateway "),
                       kUnspecified});
    }
    return Concat({OLESTR("-Address "), Ipv4Text(settings->address), OLESTR(" -Submask "), Ipv4Text(settings->mask),
                   OLESTR(" -Gateway "), settings->gateway ? Ipv4Text(*settings->gateway) : Text(kUnspecified)});
}

// What the adaptor uses now: nothing while it is off.
std::optional<Ipv4Settings> CurrentSettings(const LanAdaptorState& lan) {
    switch (lan.method) {
        case IpMethod::FixIp: return lan.fixed;
        case IpMethod::Dhcp: return kDhcpLease;
        case IpMethod::None: break;
    }
    return std::nullopt;
}

// The address, mask and gateway of a setting ("\"\"" for no gateway), as
// the controller takes them.
std::variant<Ipv4Settings, Reply> SettingsOf(TextView command, const Arguments& arguments) {
    const auto address = arguments.Find(OLESTR("-Address"));
    const auto mask = arguments.Find(OLESTR("-Submask"));
    const auto gateway = arguments.Find(OLESTR("-Gateway"));
    if (!address || !mask || !gateway) {
        return Refused(command, kStatusBadArgument, OLESTR("expected -Address A -Submask M -Gateway G"));
    }
    Ipv4Settings settings;
    const std::pair<TextView, std::uint32_t*> parts[] = {{*address, &settings.address}, {*mask, &settings.mask}};
    for (const auto& [text, into] : parts) {
        const auto value = ParseIpv4(text);
        if (!value) {
            return Refused(command, kStatusBadArgument, Quoted(text) + OLESTR(" is no IPv4 address"));
        }
        *into = *value;
    }
    if (!gateway->empty()) {
        settings.gateway = ParseIpv4(*gateway);
        if (!settings.gateway) {
            return Refused(command, kStatusBadArgument, Quoted(*gateway) + OLESTR(" is no IPv4 address"));
        }
    }
    if (const auto why = Ipv4Refusal(settings)) {
        return Refused(command, kStatusBadArgument, *why);
    }
    return settings;
}

Reply GetMethod(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        return Concat({OLESTR("-Method "), MethodWord(state.Part<LanAdaptorState>().method)});
    }));
}

Reply SetMethod(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto word = arguments ? arguments->Find(OLESTR("-Method")) : std::nullopt;
    const auto method = word ? MethodOf(*word) : std::nullopt;
    if (!method) {
        return BadArguments(command, OLESTR("-Method NONE|FIXIP|DHCP"));
    }
    controller.Update([&](ModelState& state, EventPosts&) { state.Part<LanAdaptorState>().method = *method; });
    return Done();
}

Reply GetFixedSettings(ControllerModel& controller, const Command&) {
    return Answer(controller.Read(
        [](const ModelState& state) { return AddressFields(state.Part<LanAdaptorState>().fixed); }));
}

// The fixed settings; they take effect at once when FIXIP is in force.
Reply SetFixedSettings(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    if (!arguments) {
        return Refused(OLESTR("LANAdaptorIP"), kStatusBadArgument, OLESTR("cannot read ") + Quoted(command.args));
    }
    auto settings = SettingsOf(OLESTR("LANAdaptorIP"), *arguments);
    if (auto* refusal = std::get_if<Reply>(&settings)) {
        return std::move(*refusal);
    }
    controller.Update([&](ModelState& state, EventPosts&) {
        state.Part<LanAdaptorState>().fixed = std::get<Ipv4Settings>(settings);
    });
    return Done();
}

Reply GetInfo(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        const LanAdaptorState& lan = state.Part<LanAdaptorState>();
        return Concat({AddressFields(CurrentSettings(lan)), OLESTR(" -Mac "), lan.mac});
    }));
}

Reply GetMethodAndSettings(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        const LanAdaptorState& lan = state.Part<LanAdaptorState>();
        return Concat({OLESTR("-Method "), MethodWord(lan.method), OLESTR(" "), AddressFields(lan.fixed)});
    }));
}

// "-Method FIXIP-Address 10.0.0.5 -Submask ..." : clients write no blank
// between the method and "-Address", so the method word ends at the dash.
// NONE carries empty addresses, which are not looked at; DHCP carries the
// fixed settings to keep for later.
Reply SetMethodAndSettings(ControllerModel& controller, const Command& command) {
    constexpr TextView kCommand = OLESTR("LANAdaptor");
    constexpr TextView kKey = OLESTR("-Method ");
    TextView rest = Trim(command.args);
    std::optional<IpMethod> method;
    if (rest.starts_with(kKey)) {
        rest.remove_prefix(kKey.size());
        std::size_t end = 0;
        while (end < rest.size() && rest[end] != OLECHAR('-') && !IsBlank(rest[end])) {
            ++end;
        }
        method = MethodOf(rest.substr(0, end));
        rest.remove_prefix(end);
    }
    const auto arguments = Arguments::Parse(rest);
    if (!method || !arguments) {
        return BadArguments(command, OLESTR("-Method NONE|FIXIP|DHCP and the addresses"));
    }
    std::optional<Ipv4Settings> fixed;
    if (*method != IpMethod::None) {
        auto settings = SettingsOf(kCommand, *arguments);
        if (auto* refusal = std::get_if<Reply>(&settings)) {
            return std::move(*refusal);
        }
        fixed = std::get<Ipv4Settings>(settings);
    }
    controller.Update([&](ModelState& state, EventPosts&) {
        LanAdaptorState& lan = state.Part<LanAdaptorState>();
        lan.method = *method;
        if (fixed) {
            lan.fixed = *fixed;
        }
    });
    return Done();
}

}  // namespace

bool LanAdaptorUp(const ModelState& state) { return state.Part<LanAdaptorState>().method != IpMethod::None; }

const Subsystem& NetworkSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("LANAdaptorMethod"), GetMethod},
        {OLESTR("Set"), OLESTR("LANAdaptorMethod"), SetMethod},
        {OLESTR("Get"), OLESTR("LANAdaptorIP"), GetFixedSettings},
        {OLESTR("Set"), OLESTR("LANAdaptorIP"), SetFixedSettings},
        {OLESTR("Get"), OLESTR("LANAdaptorInfo"), GetInfo},
        {OLESTR("Get"), OLESTR("LANAdaptor"), GetMethodAndSettings},
        {OLESTR("Set"), OLESTR("LANAdaptor"), SetMethodAndSettings},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
