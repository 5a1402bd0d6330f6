// Vision cameras: the ones the controller has found, their names, states and
// network settings, and the login the controller uses on each.
#include "sim/subsystems/vision.h"

#include <variant>
#include <vector>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"
#include "sim/subsystems/network.h"

namespace tav::sim {
namespace {

enum class CameraState { Unknown, Disconnected, Program, Running, Unconfigured };

struct CameraSettings {
    Ipv4Settings ip;
    std::optional<std::uint32_t> dnsServer;
    Text dnsSuffix;  // empty: none
    bool dhcp = false;
};

struct Camera {
    Text mac;
    Text name;              // what the controller lists it by
    bool configured = true;  // named by a client; else `name` is the factory one
    CameraState state = CameraState::Program;
    bool plugged = true;  // on the network
    CameraSettings settings;
    std::uint32_t lease = 0;  // the DHCP server's address for it, once asked
    Text user = OLESTR("admin");
    Text password;
    std::uint32_t ledFlashes = 0;
};

// The camera network, and the DHCP server on it that gives cameras their
// addresses from .100 upward.
constexpr std::uint32_t kCameraNetwork = 0xC0A87D00u;  // 192.168.125.0
constexpr std::uint32_t kCameraMask = 0xFFFFFF00u;
constexpr std::uint32_t kCameraGateway = kCameraNetwork | 1;
constexpr std::uint32_t kFirstLease = kCameraNetwork | 100;

constexpr std::size_t kCameraNameRoom = 32;  // what a client may send
constexpr std::size_t kFieldRoom = 40;       // what a client reads of a reply field

Camera Delivered(TextView mac, TextView name, CameraState state, std::uint32_t host, bool dhcp) {
    Camera camera;
    camera.mac = Text(mac);
    camera.name = Text(name);
    camera.state = state;
    camera.plugged = state != CameraState::Disconnected;
    camera.settings.ip = {kCameraNetwork | host, kCameraMask, kCameraGateway};
    camera.settings.dhcp = dhcp;
    if (!dhcp) {
        camera.settings.dnsServer = kCameraGateway;
        camera.settings.dnsSuffix = OLESTR("cell.local");
    }
    return camera;
}

struct VisionState {
    std::vector<Camera> cameras;  // listed, by index
    std::vector<Camera> unseen;   // plugged in, not found yet
    std::uint32_t nextLease = kFirstLease;

    VisionState() {
        cameras.push_back(Delivered(OLESTR("00:1A:2B:3C:4D:5E"), OLESTR("Gripper"), CameraState::Running, 21, false));
        cameras.push_back(Delivered(OLESTR("00:1A:2B:3C:4D:5F"), OLESTR("Conveyor"), CameraState::Program, 22, true));
        cameras.push_back(
            Delivered(OLESTR("00:1A:2B:3C:4E:01"), OLESTR("Pallet"), CameraState::Disconnected, 23, false));
        cameras[1].lease = nextLease++;
    }
};

// "00:1A:2B:3C:4D:5E", upper-case as the controller writes it; nothing for
// anything else.
std::optional<Text> MacOf(TextView text) {
    if (text.size() != 17) {
        return std::nullopt;
    }
    Text mac;
    for (std::size_t i = 0; i < text.size(); ++i) {
        OLECHAR c = text[i];
        if (i % 3 == 2) {
            if (c != ':') return std::nullopt;
        } else if (c >= 'a' && c <= 'f') {
            c = static_cast<OLECHAR>(c - 'a' + 'A');
        } else if (!((c >= '0' && c <= '9') || (c >= 'A' && c <= 'F'))) {
            return std::nullopt;
        }
        mac.push_back(c);
    }
    return mac;
}

// The host name a camera gives itself: "lm-" and the last three bytes of its
// MAC address.
Text HostName(const Camera& camera) {
    Text host = OLESTR("lm-");
    for (OLECHAR c : TextView(camera.mac).substr(9)) {
        if (c != ':') host.push_back(c >= 'A' && c <= 'F' ? static_cast<OLECHAR>(c - 'A' + 'a') : c);
    }
    return host;
}

bool Connected(const Camera& camera) { return camera.state != CameraState::Disconnected; }

// What the camera uses now: nothing while it is off the network.
std::optional<CameraSettings> Current(const Camera& camera) {
    if (!Connected(camera)) {
        return std::nullopt;
    }
    CameraSettings current = camera.settings;
    if (current.dhcp) {
        current.ip = {camera.lease, kCameraMask, kCameraGateway};
        current.dnsServer = kCameraGateway;
        current.dnsSuffix = OLESTR("cell.local");
    }
    return current;
}

// The addresses cameras use now, but this one's.
bool AddressTaken(const VisionState& vision, const Camera& self, std::uint32_t address) {
    for (const Camera& other : vision.cameras) {
        const auto current = Current(other);
        if (&other != &self && current && current->ip.address == address) {
            return true;
        }
    }
    return false;
}

// The reply. Every value is one word after an opening quote and has no
// closing one, which the client would keep in its string; "unspec" for a
// value that is not set. The four grammars differ in blanks, in the case of
// one key, in naming the camera by name or by index, and in the status of
// the second generation, which ends at the next blank, before "-username".
enum class Grammar { ByIndex, ByName, ByIndex2, ByName2 };

TextView InfoStatusWord(CameraState state) {
    switch (state) {
        case CameraState::Disconnected: return OLESTR("Disconnected");
        case CameraState::Program: return OLESTR("Program");
        case CameraState::Running: return OLESTR("Running");
        case CameraState::Unconfigured: return OLESTR("Unconfigured");
        case CameraState::Unknown: break;
    }
    return OLESTR("Unknown");
}

Text OrUnspecified(const std::optional<std::uint32_t>& address) {
    return address ? Ipv4Text(*address) : Text(kUnspecified);
}
Text OrUnspecified(const Text& text) { return text.empty() ? Text(kUnspecified) : text; }

Text SettingsFields(const std::optional<CameraSettings>& settings, const Camera& camera, TextView prefix,
                    bool byName) {
    const bool set = settings.has_value();
    const bool current = prefix == OLESTR("curr");
    // A camera from the factory has no fixed address.
    const bool addressed = set && settings->ip.address != 0;
    return Concat({OLESTR("-"), prefix, OLESTR("IPAddress \""),
                   addressed ? Ipv4Text(settings->ip.address) : Text(kUnspecified), OLESTR(" -"), prefix,
                   OLESTR("SubnetMask \""), addressed ? Ipv4Text(settings->ip.mask) : Text(kUnspecified), OLESTR(" -"),
                   prefix, OLESTR("DefaultGateway \""), OrUnspecified(set ? settings->ip.gateway : std::nullopt),
                   OLESTR(" -"), prefix, OLESTR("HostName \""), set ? HostName(camera) : Text(kUnspecified),
                   OLESTR(" -"), prefix, byName && current ? OLESTR("DNSServer\"") : OLESTR("DNSServer \""),
                   OrUnspecified(set ? settings->dnsServer : std::nullopt), OLESTR(" -"),
                   byName && !current ? OLESTR("Conf") : prefix, OLESTR("DNSSuffix \""),
                   OrUnspecified(set ? settings->dnsSuffix : Text()), OLESTR(" -"), prefix,
                   OLESTR("IsDHCPEnabled "), set && settings->dhcp ? OLESTR("1") : OLESTR("0")});
}

Text InfoText(const Camera& camera, std::size_t index, Grammar grammar) {
    const bool byName = grammar == Grammar::ByName || grammar == Grammar::ByName2;
    Text text = Concat({SettingsFields(Current(camera), camera, OLESTR("curr"), byName), OLESTR(" "),
                        SettingsFields(camera.settings, camera, OLESTR("conf"), byName), OLESTR(" -confCameraName \""),
                        camera.configured ? camera.name : Text(kUnspecified)});
    if (byName) {
        text += Concat({OLESTR(" -cameraIdx "), Decimal(index), OLESTR(" -macAddress\""), camera.mac,
                        OLESTR("  -Status \""), InfoStatusWord(camera.state)});
    } else {
        text += Concat({OLESTR(" -cameraName \""), camera.name, OLESTR(" -macAddress \""), camera.mac,
                        OLESTR(" -Status \""), InfoStatusWord(camera.state)});
    }
    switch (grammar) {
        case Grammar::ByIndex:
        case Grammar::ByName: return text + OLESTR("\"");
        case Grammar::ByIndex2: return Concat({text, OLESTR(" -username \""), camera.user, OLESTR("\"")});
        case Grammar::ByName2: return Concat({text, OLESTR("  -username \""), camera.user, OLESTR("\"")});
    }
    return text;
}

// The status reply's own vocabulary: "Standby" for a camera in program state.
TextView StatusWord(CameraState state) {
    return state == CameraState::Program ? TextView(OLESTR("Standby")) : InfoStatusWord(state);
}

// What a command needs of its camera.
enum class Needs {
    Listed,
    Connected,
    Configured,    // connected and named
    NotRunning,    // connected and in program state or not yet named
};

std::optional<Reply> Unmet(const Command& command, const Camera& camera, Needs needs) {
    const Text who = OLESTR("the camera ") + Quoted(camera.name);
    if (needs != Needs::Listed && !Connected(camera)) {
        return Refused(command.name, kStatusNotAllowed, who + OLESTR(" is disconnected"));
    }
    if (needs == Needs::Configured && !camera.configured) {
        return Refused(command.name, kStatusNotAllowed, who + OLESTR(" is not configured; name it first"));
    }
    if (needs == Needs::NotRunning && camera.state == CameraState::Running) {
        return Refused(command.name, kStatusNotAllowed, who + OLESTR(" is running; set it to program state first"));
    }
    return std::nullopt;
}

// The camera a command names with `key`: by name for "-Camera", by index
// otherwise.
std::variant<std::size_t, Reply> Locate(const VisionState& vision, const Command& command,
                                        const Arguments& arguments, TextView key) {
    const auto value = arguments.Find(key);
    if (!value) {
        return BadArguments(command, key);
    }
    if (key == OLESTR("-Camera")) {
        for (std::size_t i = 0; i < vision.cameras.size(); ++i) {
            if (vision.cameras[i].name == *value) {
                return i;
            }
        }
        return Refused(command.name, kStatusNotFound, OLESTR("no camera named ") + Quoted(*value));
    }
    const auto index = ParseUnsigned(*value);
    if (!index || *index >= vision.cameras.size()) {
        return Refused(command.name, kStatusNotFound, OLESTR("no camera with index ") + Text(*value));
    }
    return std::size_t{*index};
}

// Finds the command's camera, checks what it needs and lets `use` have it,
// all under one hold of the controller: use(VisionState&, Camera&,
// arguments, index) returns the reply. Reading commands leave the state as
// it is.
template <bool Changes, typename Use>
Reply OnCamera(ControllerModel& controller, const Command& command, TextView key, Needs needs, Use use) {
    const auto arguments = Arguments::Parse(command.args);
    if (!arguments) {
        return Refused(command.name, kStatusBadArgument, OLESTR("cannot read ") + Quoted(command.args));
    }
    auto serve = [&](auto& vision) -> Reply {
        auto located = Locate(vision, command, *arguments, key);
        if (auto* refusal = std::get_if<Reply>(&located)) {
            return std::move(*refusal);
        }
        const std::size_t index = std::get<std::size_t>(located);
        auto& camera = vision.cameras[index];
        if (auto unmet = Unmet(command, camera, needs)) {
            return std::move(*unmet);
        }
        return use(vision, camera, *arguments, index);
    };
    if constexpr (Changes) {
        return controller.Update(
            [&](ModelState& state, EventPosts&) { return serve(state.Part<VisionState>()); });
    } else {
        return controller.Read([&](const ModelState& state) { return serve(state.Part<VisionState>()); });
    }
}

template <typename Change>
Reply ChangeCamera(ControllerModel& controller, const Command& command, TextView key, Needs needs, Change change) {
    return OnCamera<true>(controller, command, key, needs, change);
}

template <typename Look>
Reply ReadCamera(ControllerModel& controller, const Command& command, TextView key, Look look) {
    return OnCamera<false>(controller, command, key, Needs::Listed, look);
}

// Names, user names and DNS suffixes go into replies as one word.
bool IsWord(TextView text, std::size_t room) {
    if (text.empty() || text.size() > room) {
        return false;
    }
    for (OLECHAR c : text) {
        if (IsBlank(c) || c == '"' || c < 0x20) {
            return false;
        }
    }
    return true;
}

bool IsCameraName(TextView name) {
    if (name.empty() || name.size() > kCameraNameRoom || name == kUnspecified) {
        return false;
    }
    for (OLECHAR c : name) {
        const bool ok = (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') || c == '_' ||
                        c == '-';
        if (!ok) {
            return false;
        }
    }
    return true;
}

Reply IsValid(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto name = arguments ? arguments->Find(OLESTR("-Camera")) : std::nullopt;
    if (!name) {
        return BadArguments(command, OLESTR("-Camera <name>"));
    }
    const bool known = controller.Read([&](const ModelState& state) {
        for (const Camera& camera : state.Part<VisionState>().cameras) {
            if (camera.name == *name) return true;
        }
        return false;
    });
    return Answer(known ? OLESTR("-CameraValid 1") : OLESTR("-CameraValid 0"));
}

Reply Status(ControllerModel& controller, const Command& command) {
    return ReadCamera(controller, command, OLESTR("-Camera"),
                      [](const VisionState&, const Camera& camera, const Arguments&, std::size_t) {
                          return Answer(Text(StatusWord(camera.state)));
                      });
}

Reply Count(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        return OLESTR("-CameraCount ") + Decimal(state.Part<VisionState>().cameras.size());
    }));
}

template <Grammar G>
Reply Info(ControllerModel& controller, const Command& command) {
    const TextView key = G == Grammar::ByName || G == Grammar::ByName2 ? OLESTR("-Camera") : OLESTR("-CameraIdx");
    return ReadCamera(controller, command, key,
                      [](const VisionState&, const Camera& camera, const Arguments&, std::size_t index) {
                          return Answer(InfoText(camera, index, G));
                      });
}

// The name is given to the camera itself, so it must be on the network and
// not running; naming a camera that is not configured yet configures it.
Reply Rename(ControllerModel& controller, const Command& command) {
    return ChangeCamera(controller, command, OLESTR("-Idx"), Needs::NotRunning,
                    [&](VisionState& vision, Camera& camera, const Arguments& arguments, std::size_t) -> Reply {
                        const TextView name = arguments.Find(OLESTR("-Camera")).value_or(TextView());
                        if (!IsCameraName(name)) {
                            return Refused(command.name, kStatusBadArgument,
                                           Quoted(name) + OLESTR(" is no camera name (1 to 32 letters, digits, "
                                                                 "'_' or '-')"));
                        }
                        for (const Camera& other : vision.cameras) {
                            if (&other != &camera && other.name == name) {
                                return Refused(command.name, kStatusNotAllowed,
                                               OLESTR("another camera is named ") + Quoted(name));
                            }
                        }
                        camera.name = Text(name);
                        if (!camera.configured) {
                            camera.configured = true;
                            camera.state = CameraState::Program;
                        }
                        return Done();
                    });
}

// "-State 1" program, "-State 2" running.
Reply SetCameraState(ControllerModel& controller, const Command& command) {
    return ChangeCamera(controller, command, OLESTR("-Camera"), Needs::Configured,
                    [&](VisionState&, Camera& camera, const Arguments& arguments, std::size_t) -> Reply {
                        const auto number = arguments.Unsigned(OLESTR("-State"));
                        if (!number || (*number != 1 && *number != 2)) {
                            return BadArguments(command, OLESTR("-State 1 (program) or 2 (running)"));
                        }
                        camera.state = *number == 1 ? CameraState::Program : CameraState::Running;
                        return Done();
                    });
}

// Fixed settings take effect at once and end DHCP.
Reply SetIp(ControllerModel& controller, const Command& command) {
    return ChangeCamera(
        controller, command, OLESTR("-Camera"), Needs::NotRunning,
        [&](VisionState& vision, Camera& camera, const Arguments& arguments, std::size_t) -> Reply {
            const auto address = ParseIpv4(arguments.Find(OLESTR("-Address")).value_or(TextView()));
            const auto mask = ParseIpv4(arguments.Find(OLESTR("-Subnetmask")).value_or(TextView()));
            const auto gatewayText = arguments.Find(OLESTR("-Gateway"));
            const auto gateway = gatewayText && !gatewayText->empty() ? ParseIpv4(*gatewayText) : std::nullopt;
            if (!address || !mask || !gatewayText || (!gatewayText->empty() && !gateway)) {
                return BadArguments(command, OLESTR("-Address A -Subnetmask M -Gateway G in IPv4 form"));
            }
            const Ipv4Settings settings{*address, *mask, gateway};
            if (const auto why = Ipv4Refusal(settings)) {
                return Refused(command.name, kStatusBadArgument, *why);
            }
            if (AddressTaken(vision, camera, *address)) {
                return Refused(command.name, kStatusNotAllowed,
                               OLESTR("another camera uses the address ") + Ipv4Text(*address));
            }
            camera.settings.ip = settings;
            camera.settings.dhcp = false;
            return Done();
        });
}

Reply SetDhcp(ControllerModel& controller, const Command& command) {
    return ChangeCamera(controller, command, OLESTR("-Camera"), Needs::NotRunning,
                    [](VisionState& vision, Camera& camera, const Arguments&, std::size_t) {
                        if (camera.lease == 0) {
                            camera.lease = vision.nextLease++;
                        }
                        camera.settings.dhcp = true;
                        return Done();
                    });
}

// An empty server or suffix is none.
Reply SetDns(ControllerModel& controller, const Command& command) {
    return ChangeCamera(
        controller, command, OLESTR("-Camera"), Needs::NotRunning,
        [&](VisionState&, Camera& camera, const Arguments& arguments, std::size_t) -> Reply {
            const auto serverText = arguments.Find(OLESTR("-DNSServer"));
            const auto suffix = arguments.Find(OLESTR("-DNSSuffix"));
            const auto server = serverText && !serverText->empty() ? ParseIpv4(*serverText) : std::nullopt;
            if (!serverText || !suffix || (!serverText->empty() && !server) ||
                (!suffix->empty() && (!IsWord(*suffix, kFieldRoom) || *suffix == kUnspecified))) {
                return BadArguments(command,
                                    OLESTR("-DNSServer <IPv4 address> -DNSSuffix <domain of at most 40 characters>"));
            }
            camera.settings.dnsServer = server;
            camera.settings.dnsSuffix = Text(*suffix);
            return Done();
        });
}

Reply Flash(ControllerModel& controller, const Command& command) {
    return ChangeCamera(controller, command, OLESTR("-Camera"), Needs::Connected,
                    [](VisionState&, Camera& camera, const Arguments&, std::size_t) {
                        ++camera.ledFlashes;
                        return Done();
                    });
}

// The login is the controller's own record, kept also for a camera that is
// away.
Reply SetCredentials(ControllerModel& controller, const Command& command) {
    return ChangeCamera(controller, command, OLESTR("-CameraIdx"), Needs::Listed,
                    [&](VisionState&, Camera& camera, const Arguments& arguments, std::size_t) -> Reply {
                        const auto user = arguments.Find(OLESTR("-Username"));
                        const auto password = arguments.Find(OLESTR("-Password"));
                        if (!user || !IsWord(*user, kFieldRoom) || !password ||
                            (!password->empty() && !IsWord(*password, kFieldRoom))) {
                            return BadArguments(command,
                                                OLESTR("-Username <1 to 40 characters> -Password <at most 40>"));
                        }
                        camera.user = Text(*user);
                        camera.password = Text(*password);
                        return Done();
                    });
}

// Looks at the network again: cameras plugged in since are listed, not yet
// configured; listed ones that are back come up in program state; ones
// never configured and gone are dropped.
Reply Refresh(ControllerModel& controller, const Command&) {
    controller.Update([](ModelState& state, EventPosts&) {
        VisionState& vision = state.Part<VisionState>();
        std::erase_if(vision.cameras, [](const Camera& camera) { return !camera.plugged && !camera.configured; });
        for (Camera& camera : vision.cameras) {
            if (camera.plugged && camera.state == CameraState::Disconnected) {
                camera.state = camera.configured ? CameraState::Program : CameraState::Unconfigured;
            }
        }
        for (Camera& camera : vision.unseen) {
            if (camera.lease == 0) {
                camera.lease = vision.nextLease++;
            }
            vision.cameras.push_back(std::move(camera));
        }
        vision.unseen.clear();
    });
    return Done();
}

}  // namespace

bool PlugCamera(ControllerModel& controller, TextView macText) {
    const auto mac = MacOf(macText);
    if (!mac) {
        return false;
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        VisionState& vision = state.Part<VisionState>();
        for (const Camera& camera : vision.unseen) {
            if (camera.mac == *mac) return false;
        }
        for (Camera& camera : vision.cameras) {
            if (camera.mac == *mac) {
                if (camera.plugged) return false;
                camera.plugged = true;  // listed again as it was, at the next refresh
                return true;
            }
        }
        Camera camera;
        camera.mac = *mac;
        camera.name = Concat({OLESTR("Lumeret-"), TextView(*mac).substr(12, 2), TextView(*mac).substr(15, 2)});
        camera.configured = false;
        camera.state = CameraState::Unconfigured;
        camera.settings.ip = {0, kCameraMask, std::nullopt};
        camera.settings.dhcp = true;
        vision.unseen.push_back(std::move(camera));
        return true;
    });
}

bool UnplugCamera(ControllerModel& controller, TextView macText) {
    const auto mac = MacOf(macText);
    if (!mac) {
        return false;
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        VisionState& vision = state.Part<VisionState>();
        if (std::erase_if(vision.unseen, [&](const Camera& camera) { return camera.mac == *mac; }) > 0) {
            return true;
        }
        for (Camera& camera : vision.cameras) {
            if (camera.mac == *mac && camera.plugged) {
                camera.plugged = false;
                camera.state = CameraState::Disconnected;
                return true;
            }
        }
        return false;
    });
}

const Subsystem& VisionSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("LMIsCameraValid"), IsValid},
        {OLESTR("Get"), OLESTR("LMCameraStatus"), Status},
        {OLESTR("Get"), OLESTR("LMNumberOfCameras"), Count},
        {OLESTR("Set"), OLESTR("LMCameraName"), Rename},
        {OLESTR("Set"), OLESTR("LMRefreshCameras"), Refresh},
        {OLESTR("Get"), OLESTR("LMCameraInfoUsingIndex"), Info<Grammar::ByIndex>},
        {OLESTR("Get"), OLESTR("LMCameraInfo"), Info<Grammar::ByName>},
        {OLESTR("Get"), OLESTR("LMCameraInfoUsingIndex2"), Info<Grammar::ByIndex2>},
        {OLESTR("Get"), OLESTR("LMCameraInfo2"), Info<Grammar::ByName2>},
        {OLESTR("Set"), OLESTR("LMCameraState"), SetCameraState},
        {OLESTR("Set"), OLESTR("LMCameraIPSettings"), SetIp},
        {OLESTR("Set"), OLESTR("LMCameraDHCP"), SetDhcp},
        {OLESTR("Set"), OLESTR("LMCameraDNSSettings"), SetDns},
        {OLESTR("Set"), OLESTR("LMFlashCameraLED"), Flash},
        {OLESTR("Set"), OLESTR("LMUserCredentials"), SetCredentials},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
