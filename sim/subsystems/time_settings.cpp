// The controller's time zone and network time server, and asking a time
// server for the time.
#include <array>
#include <chrono>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/reply_texts.h"
#include "sim/status_codes.h"
#include "sim/subsystems/network.h"

namespace tav::sim {
namespace {

struct TimeSettingsState {
    Text zone = OLESTR("UTC");
    Text server;  // none
};

// The time servers that answer on the plant network.
constexpr std::array<TextView, 4> kReachableServers = {OLESTR("pool.ntp.org"), OLESTR("time.nist.gov"),
                                                       OLESTR("ntp.plant.local"), OLESTR("172.20.4.1")};

bool IsLetter(OLECHAR c) { return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z'); }

// "hh" or "hh:mm", at most 14 hours.
bool IsOffset(TextView text) {
    if (text.size() != 2 && text.size() != 5) {
        return false;
    }
    if (!IsDigit(text[0]) || !IsDigit(text[1]) || (text[0] - '0') * 10 + (text[1] - '0') > 14) {
        return false;
    }
    return text.size() == 2 || (text[2] == ':' && text[3] >= '0' && text[3] <= '5' && IsDigit(text[4]));
}

// The zone names the controller's zone database knows the shape of: "UTC"
// or "GMT", a fixed offset "UTC+01:00", or "Area/Location" with one of the
// database's areas.
bool IsZoneName(TextView zone) {
    if (zone == OLESTR("UTC") || zone == OLESTR("GMT")) {
        return true;
    }
    if (zone.size() > 4 && zone.starts_with(OLESTR("UTC")) && (zone[3] == '+' || zone[3] == '-')) {
        return IsOffset(zone.substr(4));
    }
    constexpr TextView kAreas[] = {OLESTR("Africa"),   OLESTR("America"), OLESTR("Antarctica"), OLESTR("Asia"),
                                   OLESTR("Atlantic"), OLESTR("Australia"), OLESTR("Europe"),   OLESTR("Indian"),
                                   OLESTR("Pacific"),  OLESTR("Etc")};
    const std::size_t slash = zone.find(OLECHAR('/'));
    if (slash == TextView::npos || zone.size() > 64) {
        return false;
    }
    bool knownArea = false;
    for (TextView area : kAreas) {
        knownArea = knownArea || zone.substr(0, slash) == area;
    }
    TextView location = zone.substr(slash + 1);
    if (!knownArea || location.empty() || !IsLetter(location.front())) {
        return false;
    }
    for (OLECHAR c : location) {
        if (!IsLetter(c) && !IsDigit(c) && c != '_' && c != '-' && c != '+' && c != '/') {
            return false;
        }
    }
    return location.back() != '/';
}

// A host name ("ntp.plant.local": labels of letters, digits and inner
// dashes) or an IPv4 address.
bool IsServerName(TextView server) {
    if (ParseIpv4(server)) {
        return true;
    }
    if (server.empty() || server.size() > 253) {
        return false;
    }
    std::size_t label = 0;
    for (std::size_t i = 0; i <= server.size(); ++i) {
        if (i == server.size() || server[i] == '.') {
            if (label == 0 || label > 63 || server[i - 1] == '-' || server[i - label] == '-') {
                return false;
            }
            label = 0;
        } else if (IsLetter(server[i]) || IsDigit(server[i]) || server[i] == '-') {
            ++label;
        } else {
            return false;
        }
    }
    // All digits and dots is an address, and not a good one.
    return server.find_first_not_of(OLESTR("0123456789.")) != TextView::npos;
}

std::optional<Text> ServerArgument(const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto server = arguments ? arguments->Find(OLESTR("-timeserver")) : std::nullopt;
    return server ? std::optional<Text>(*server) : std::nullopt;
}

Reply GetZone(ControllerModel& controller, const Command&) {
    return Answer(controller.Read(
        [](const ModelState& state) { return Concat({OLESTR("-timezone "), state.Part<TimeSettingsState>().zone}); }));
}

Reply SetZone(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto zone = arguments ? arguments->Find(OLESTR("-timezone")) : std::nullopt;
    if (!zone || !IsZoneName(*zone)) {
        return Refuse(kStatusBadArgument,
                      OLESTR("TimeZone: unknown time zone ") + Quoted(zone ? *zone : Trim(command.args)) +
                          OLESTR(" (UTC, UTC+hh:mm or Area/Location)"));
    }
    controller.Update([&](ModelState& state, EventPosts&) { state.Part<TimeSettingsState>().zone = Text(*zone); });
    return Done();
}

// The reply holds no quotes: a client reads the value up to the first blank.
// With no server set the value is missing and reads as an empty one.
Reply GetServer(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        const Text& server = state.Part<TimeSettingsState>().server;
        return server.empty() ? Text(OLESTR("-timeserver")) : Concat({OLESTR("-timeserver "), server});
    }));
}

// An empty name takes the time server away.
Reply SetServer(ControllerModel& controller, const Command& command) {
    const auto server = ServerArgument(command);
    if (!server || (!server->empty() && !IsServerName(*server))) {
        return BadArguments(command, OLESTR("-timeserver \"<host name or address>\""));
    }
    controller.Update([&](ModelState& state, EventPosts&) { state.Part<TimeSettingsState>().server = *server; });
    return Done();
}

// A server that answers gives the true time, whatever the controller's own
// clock was set to; the controller's settings do not change.
Reply TestServer(ControllerModel& controller, const Command& command) {
    const auto server = ServerArgument(command);
    if (!server || !IsServerName(*server)) {
        return BadArguments(command, OLESTR("-timeserver \"<host name or address>\""));
    }
    if (!controller.Read([](const ModelState& state) { return LanAdaptorUp(state); })) {
        return Refuse(kStatusNotAllowed, OLESTR("TestTimeServer: the LAN adaptor is off (method NONE)"));
    }
    bool reachable = false;
    for (TextView known : kReachableServers) {
        reachable = reachable || EqualsIgnoringCase(known, *server);
    }
    if (!reachable) {
        return Refuse(kStatusTimedOut, OLESTR("TestTimeServer: no answer from the time server ") + Quoted(*server));
    }
    const auto now = std::chrono::duration_cast<std::chrono::seconds>(
        std::chrono::system_clock::now().time_since_epoch());
    return Answer(ClockText(static_cast<std::uint32_t>(now.count())));
}

}  // namespace

const Subsystem& TimeSettingsSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("TimeZone"), GetZone},       {OLESTR("Set"), OLESTR("TimeZone"), SetZone},
        {OLESTR("Get"), OLESTR("TimeServer"), GetServer},   {OLESTR("Set"), OLESTR("TimeServer"), SetServer},
        {OLESTR("Set"), OLESTR("TestTimeServer"), TestServer},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
