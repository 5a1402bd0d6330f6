// The safety controller: its configuration and how it comes into force, its
// mode, the drive modules' safety software and the violations they caught,
// and the positional units' status.
#include "sim/subsystems/safety.h"

#include <array>
#include <bitset>
#include <cstdio>
#include <optional>
#include <variant>
#include <vector>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/file_system.h"
#include "sim/status_codes.h"
#include "sim/subsystems/sha256.h"
#include "sim/subsystems/systems.h"

namespace tav::sim {
namespace {

enum class SafetyMode { Active, Commissioning, Service };

constexpr std::pair<SafetyMode, TextView> kModeWords[] = {{SafetyMode::Active, OLESTR("active")},
                                                          {SafetyMode::Commissioning, OLESTR("commissioning")},
                                                          {SafetyMode::Service, OLESTR("service")}};

// Supervision instances of each kind: 1 to kInstances.
constexpr std::size_t kInstances = 8;
using Instances = std::bitset<kInstances>;

// What the safety controller keeps of a configuration. Texts go into the
// information reply between tabs, and a client keeps a date shorter than
// 40 characters and a name shorter than 65 with the blank before it.
struct Configuration {
    std::int32_t major = 0;
    std::int32_t minor = 0;
    Text name;
    Text createdBy;
    Text created;
    std::array<std::uint8_t, 32> checksum{};
    // The supervision instances the configuration switches on.
    Instances toolPosition, toolSpeed, axisRange;
    bool validated = false;
    Text validatedBy, validationDate;
    bool locked = false;
    Text lockedBy, lockDate;
};

constexpr std::size_t kDateRoom = 38;
constexpr std::size_t kConfigurationNameRoom = 63;

// A robot's axes, speeds and flange as the safety controller saw them.
struct Pose {
    std::array<double, 6> axes{};
    std::array<double, 6> speeds{};
    std::array<double, 3> tcp{};
    std::array<double, 3> flange{};
    std::array<double, 4> orientation{1, 0, 0, 0};
};

struct Violation {
    std::uint32_t number = 0;  // how many the module has caught; 0: none yet
    TextView type = OLESTR("none");
    std::uint32_t instance = 0;
    std::int16_t tool = 0;
    Pose pose;
    // Which instances were in violation.
    Instances standStill, upperArm, toolPosition, toolSpeed, axisRange;
};

struct DriveModule {
    bool synchronised = true;  // its safety software matches the safety controller's
    Pose pose;
    Violation last;
    bool inForce = false;  // `last` holds until the next reconfigure
};

// The configuration a controller is delivered with, as its file reads.
constexpr std::string_view kDeliveredFile =
    "name=Cell7 safety\nversion=2.1\ncreatedby=A. Lindqvist\ncreated=2024-03-12 09:41:00\n"
    "toolposition=1,2\ntoolspeed=1,2\naxisrange=1\n";

struct SafetyState {
    SafetyMode mode = SafetyMode::Active;
    std::optional<Configuration> inForce;
    std::optional<Configuration> loaded;  // waiting for a reconfigure
    std::vector<DriveModule> driveModules;

    SafetyState() {
        Configuration delivered;
        delivered.major = 2;
        delivered.minor = 1;
        delivered.name = OLESTR("Cell7 safety");
        delivered.createdBy = OLESTR("A. Lindqvist");
        delivered.created = OLESTR("2024-03-12 09:41:00");
        delivered.checksum = Sha256(kDeliveredFile);
        delivered.toolPosition = 0b11;
        delivered.toolSpeed = 0b11;
        delivered.axisRange = 0b1;
        delivered.validated = true;
        delivered.validatedBy = OLESTR("B. Okafor");
        delivered.validationDate = OLESTR("2024-03-14 15:02:00");
        inForce = delivered;

        DriveModule robot;
        robot.pose.axes = {0, -20, 30, 0, 45, 90};
        robot.pose.tcp = {850.5, 0, 1200.25};
        robot.pose.flange = {760, 0, 1210};
        // It once went too fast with its tool.
        robot.last.number = 1;
        robot.last.type = OLESTR("sts");
        robot.last.instance = 2;
        robot.last.tool = 1;
        robot.last.pose = robot.pose;
        robot.last.pose.speeds = {35, 42.5, 10, 0, 5, 0};
        robot.last.toolSpeed.set(1);
        DriveModule positioner;
        positioner.pose.axes = {90, 0, 0, 0, 0, 0};
        positioner.pose.tcp = {1500, 400, 600};
        positioner.pose.flange = {1500, 400, 500};
        driveModules = {robot, positioner};
    }
};

TextView SafetyModeWord(SafetyMode mode) {
    for (const auto& [value, word] : kModeWords) {
        if (value == mode) return word;
    }
    return {};
}

std::optional<std::size_t> UnsynchronisedModule(const SafetyState& safety) {
    for (std::size_t i = 0; i < safety.driveModules.size(); ++i) {
        if (!safety.driveModules[i].synchronised) return i;
    }
    return std::nullopt;
}

// The configuration status word, by what stands first: nothing in force,
// a configuration or software that does not match, then lock and validation.
// Its number is the client's TavVantorConfigStatus.
std::pair<TextView, std::uint32_t> ConfigStatus(const SafetyState& safety) {
    if (safety.loaded || UnsynchronisedModule(safety)) {
        return {OLESTR("mismatch"), 4};
    }
    if (!safety.inForce) {
        return {OLESTR("error"), 0};
    }
    if (safety.inForce->locked) {
        return {OLESTR("locked"), 3};
    }
    return safety.inForce->validated ? std::pair{TextView(OLESTR("validated")), 2u}
                                     : std::pair{TextView(OLESTR("loaded")), 1u};
}

// A locked configuration declines a new one; so does software that does not
// match, as an error.
TextView LoadStatus(const SafetyState& safety) {
    if (safety.inForce && safety.inForce->locked) {
        return OLESTR("declined");
    }
    return UnsynchronisedModule(safety) ? OLESTR("error") : OLESTR("ok");
}

// "-modestat active": the reply and the event "SafetyModeStatus".
Text SafetyModeText(const ModelState& state) {
    return Concat({OLESTR("-modestat "), SafetyModeWord(state.Part<SafetyState>().mode)});
}

Text Hex(const std::array<std::uint8_t, 32>& bytes) {
    constexpr char kDigits[] = "0123456789abcdef";
    Text text;
    for (std::uint8_t b : bytes) {
        text.push_back(static_cast<OLECHAR>(kDigits[b >> 4]));
        text.push_back(static_cast<OLECHAR>(kDigits[b & 15]));
    }
    return text;
}

// "2024-03-14 15:02:00", UTC.
Text DateText(std::uint32_t seconds) {
    const std::int64_t days = seconds / 86400;
    const std::uint32_t inDay = seconds % 86400;
    // Days since 1970 to a civil date (the proleptic Gregorian calendar).
    const std::int64_t z = days + 719468;
    const std::int64_t era = z / 146097;
    const std::int64_t doe = z - era * 146097;
    const std::int64_t yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
    const std::int64_t doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
    const std::int64_t mp = (5 * doy + 2) / 153;
    const int day = static_cast<int>(doy - (153 * mp + 2) / 5 + 1);
    const int month = static_cast<int>(mp < 10 ? mp + 3 : mp - 9);
    const int year = static_cast<int>(yoe + era * 400 + (month <= 2 ? 1 : 0));
    char buffer[32];
    std::snprintf(buffer, sizeof buffer, "%04d-%02d-%02d %02u:%02u:%02u", year, month, day, inDay / 3600,
                  inDay / 60 % 60, inDay % 60);
    return Widen(buffer);
}

// Tab-separated "-key value" fields; the lock's only when locked; keys
// without a value when it is not set.
Text InfoText(const Configuration& c) {
    auto field = [](TextView key, TextView value) {
        return value.empty() ? Concat({key, OLESTR("\t")}) : Concat({key, OLESTR(" "), value, OLESTR("\t")});
    };
    Text text = Concat({OLESTR("-minv "), Decimal(c.minor), OLESTR("\t-majv "), Decimal(c.major),
                        OLESTR("\t-islocked "), c.locked ? OLESTR("1") : OLESTR("0"), OLESTR("\t")});
    if (c.locked) {
        text += field(OLESTR("-lockdt"), c.lockDate) + field(OLESTR("-lockby"), c.lockedBy);
    }
    return text + Concat({field(OLESTR("-valid"), c.validated ? OLESTR("1") : OLESTR("0")),
                          field(OLESTR("-vdate"), c.validationDate), field(OLESTR("-vby"), c.validatedBy),
                          field(OLESTR("-crdate"), c.created), field(OLESTR("-crby"), c.createdBy),
                          field(OLESTR("-cnfnm"), c.name), field(OLESTR("-csum"), Hex(c.checksum))});
}

// "-axes 6[0.00,-20.00,...,]": the count, then each number ended by a comma.
template <std::size_t N>
Text NumberArray(TextView key, const std::array<double, N>& values) {
    Text text = Concat({OLESTR(" "), key, OLESTR(" "), Decimal(N), OLESTR("[")});
    for (double value : values) {
        char buffer[32];
        std::snprintf(buffer, sizeof buffer, "%.2f,", value);
        text += Widen(buffer);
    }
    return text + OLESTR("]");
}

// "-ssv 8[01000000]": one character per instance, "1" for set.
Text FlagArray(TextView key, const Instances& flags) {
    Text text = Concat({OLESTR(" "), key, OLESTR(" "), Decimal(flags.size()), OLESTR("[")});
    for (std::size_t i = 0; i < flags.size(); ++i) {
        text.push_back(flags[i] ? OLECHAR('1') : OLECHAR('0'));
    }
    return text + OLESTR("]");
}

// The head, then the arrays by key: what was violated, by which instance
// and tool, where the robot was, and which instances were in violation
// ("vs") and switched on by the configuration ("as").
Text ViolationText(const Violation& v, int module, bool unsynchronised, const Configuration* configuration) {
    const Configuration none;
    const Configuration& active = configuration ? *configuration : none;
    return Concat({OLESTR("-vnumber "), Decimal(v.number), OLESTR(" -violationtype "), v.type,
                   OLESTR(" -instanceid "), Decimal(v.instance), OLESTR(" -isunsync "),
                   unsynchronised ? OLESTR("1") : OLESTR("0"), OLESTR(" -tool "), Decimal(v.tool),
                   OLESTR(" -drive "), Decimal(module), NumberArray(OLESTR("-axes"), v.pose.axes),
                   NumberArray(OLESTR("-speed"), v.pose.speeds), NumberArray(OLESTR("-tcp"), v.pose.tcp),
                   NumberArray(OLESTR("-fpos"), v.pose.flange), NumberArray(OLESTR("-forient"), v.pose.orientation),
                   FlagArray(OLESTR("-ssv"), v.standStill), FlagArray(OLESTR("-uarmvs"), v.upperArm),
                   FlagArray(OLESTR("-toolposvs"), v.toolPosition), FlagArray(OLESTR("-toolposas"), active.toolPosition),
                   FlagArray(OLESTR("-toolspeedvs"), v.toolSpeed), FlagArray(OLESTR("-toolspeedas"), active.toolSpeed),
                   FlagArray(OLESTR("-axisrangevs"), v.axisRange), FlagArray(OLESTR("-axisrangeas"), active.axisRange)});
}

// A "1,2,5" list of instance numbers.
std::optional<Instances> InstancesOf(const std::optional<Text>& list) {
    Instances instances;
    if (!list || list->empty()) {
        return instances;
    }
    TextView rest = *list;
    while (true) {
        const std::size_t comma = rest.find(OLECHAR(','));
        const auto number = ParseUnsigned(Trim(rest.substr(0, comma)));
        if (!number || *number < 1 || *number > kInstances) {
            return std::nullopt;
        }
        instances.set(*number - 1);
        if (comma == TextView::npos) {
            return instances;
        }
        rest.remove_prefix(comma + 1);
    }
}

bool Fits(TextView text, std::size_t room) {
    return !text.empty() && text.size() <= room && text.find(OLECHAR('\t')) == TextView::npos;
}

// A configuration file: "key=value" lines with the name, "version=2.1",
// who made it and when, and the instances it switches on. Why it is none,
// when it is none.
std::variant<Configuration, Text> ReadConfiguration(const FileSystem& files, TextView path) {
    const std::string* bytes = files.Read(path);
    if (bytes == nullptr) {
        return Text(files.Exists(path) ? OLESTR("is a folder") : OLESTR("does not exist"));
    }
    Configuration c;
    const auto name = ManifestValue(files, path, "name");
    const auto version = ManifestValue(files, path, "version");
    const auto createdBy = ManifestValue(files, path, "createdby");
    const auto created = ManifestValue(files, path, "created");
    if (!name || !Fits(*name, kConfigurationNameRoom) || !createdBy || !Fits(*createdBy, kConfigurationNameRoom) ||
        !created || !Fits(*created, kDateRoom)) {
        return Text(OLESTR("lacks a usable name=, createdby= (1 to 63 characters) or created= (1 to 38) line"));
    }
    const std::size_t dot = version ? version->find(OLECHAR('.')) : Text::npos;
    const auto major = dot != Text::npos ? ParseUnsigned(TextView(*version).substr(0, dot)) : std::nullopt;
    const auto minor = dot != Text::npos ? ParseUnsigned(TextView(*version).substr(dot + 1)) : std::nullopt;
    if (!major || !minor || *major > 0x7FFFFFFF || *minor > 0x7FFFFFFF) {
        return Text(OLESTR("lacks a version=<major>.<minor> line"));
    }
    const auto toolPosition = InstancesOf(ManifestValue(files, path, "toolposition"));
    const auto toolSpeed = InstancesOf(ManifestValue(files, path, "toolspeed"));
    const auto axisRange = InstancesOf(ManifestValue(files, path, "axisrange"));
    if (!toolPosition || !toolSpeed || !axisRange) {
        return Text(OLESTR("names a supervision instance outside 1 to 8"));
    }
    c.major = static_cast<std::int32_t>(*major);
    c.minor = static_cast<std::int32_t>(*minor);
    c.name = *name;
    c.createdBy = *createdBy;
    c.created = *created;
    c.checksum = Sha256(*bytes);
    c.toolPosition = *toolPosition;
    c.toolSpeed = *toolSpeed;
    c.axisRange = *axisRange;
    return c;
}

// A name the controller records for a validation or a lock.
std::optional<Text> NameArgument(const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto name = arguments ? arguments->Find(OLESTR("-Name")) : std::nullopt;
    if (!name || !Fits(*name, kConfigurationNameRoom)) {
        return std::nullopt;
    }
    return Text(*name);
}

// What changing the configuration in force needs: one, matching what was
// loaded and the drive modules' software.
std::optional<Reply> NotChangeable(TextView command, const SafetyState& safety) {
    if (!safety.inForce) {
        return Refused(command, kStatusNotAllowed, OLESTR("the safety controller has no configuration"));
    }
    if (safety.loaded) {
        return Refused(command, kStatusNotAllowed,
                       OLESTR("a loaded configuration is not in force yet; reconfigure first"));
    }
    if (const auto module = UnsynchronisedModule(safety)) {
        return Refused(command, kStatusNotAllowed,
                       OLESTR("the safety software of drive module ") + Decimal(*module + 1) +
                           OLESTR(" is not synchronised"));
    }
    return std::nullopt;
}

Reply GetConfigStatus(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        return Concat({OLESTR("-confstatus "), ConfigStatus(state.Part<SafetyState>()).first});
    }));
}

Reply GetLoadStatus(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        return Concat({OLESTR("-loadstatus "), LoadStatus(state.Part<SafetyState>())});
    }));
}

Reply GetSafetyMode(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return SafetyModeText(state); }));
}

Reply GetSafetyConf(ControllerModel& controller, const Command&) {
    return controller.Read([](const ModelState& state) {
        const SafetyState& safety = state.Part<SafetyState>();
        return safety.inForce ? Answer(InfoText(*safety.inForce))
                              : Refused(OLESTR("SafetyConf"), kStatusNotFound,
                                        OLESTR("the safety controller has no configuration"));
    });
}

// A change to the configuration in force that records who made it: the name
// is checked first, then what any change needs, then `change` itself.
template <typename Change>
Reply ChangeByName(ControllerModel& controller, const Command& command, Change change) {
    const auto name = NameArgument(command);
    if (!name) {
        return BadArguments(command, OLESTR("-Name \"<1 to 63 characters>\""));
    }
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        if (auto refusal = NotChangeable(command.name, safety)) return std::move(*refusal);
        return change(safety, *safety.inForce, *name, DateText(ControllerModel::Now(state)));
    });
}

Reply SetValidated(ControllerModel& controller, const Command& command) {
    constexpr TextView kCommand = OLESTR("SafetyConfValidated");
    const auto validate = [&](SafetyState&, Configuration& c, const Text& name, Text date) -> Reply {
        if (c.locked) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("the configuration is locked"));
        }
        c.validated = true;
        c.validatedBy = name;
        c.validationDate = std::move(date);
        return Done();
    };
    return ChangeByName(controller, command, validate);
}

Reply SetNotValidated(ControllerModel& controller, const Command&) {
    constexpr TextView kCommand = OLESTR("VantorNotValidated");
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        if (auto refusal = NotChangeable(kCommand, safety)) return std::move(*refusal);
        if (safety.inForce->locked) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("the configuration is locked"));
        }
        safety.inForce->validated = false;
        safety.inForce->validatedBy.clear();
        safety.inForce->validationDate.clear();
        return Done();
    });
}

// A locked configuration runs in active mode only.
Reply SetMode(ControllerModel& controller, const Command& command) {
    constexpr TextView kCommand = OLESTR("VantorSafetyMode");
    const auto arguments = Arguments::Parse(command.args);
    const auto word = arguments ? arguments->Find(OLESTR("-Mode")) : std::nullopt;
    std::optional<SafetyMode> mode;
    for (const auto& [value, known] : kModeWords) {
        if (word && *word == known) mode = value;
    }
    if (!mode) {
        return BadArguments(command, OLESTR("-Mode active|commissioning|service"));
    }
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        if (*mode != SafetyMode::Active && safety.inForce && safety.inForce->locked) {
            return Refused(kCommand, kStatusNotAllowed,
                           OLESTR("the configuration is locked; it runs in active mode only"));
        }
        safety.mode = *mode;
        return Done();
    });
}

// The safety controller starts again: a loaded configuration comes into
// force, not validated, and violations in force end.
Reply Reconfigure(ControllerModel& controller, const Command&) {
    constexpr TextView kCommand = OLESTR("VantorReconfigure");
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        if (const auto module = UnsynchronisedModule(safety)) {
            return Refused(kCommand, kStatusNotAllowed,
                           OLESTR("the safety software of drive module ") + Decimal(*module + 1) +
                               OLESTR(" is not synchronised"));
        }
        if (!safety.inForce && !safety.loaded) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("no configuration is loaded"));
        }
        if (safety.loaded) {
            safety.inForce = std::move(safety.loaded);
            safety.loaded.reset();
        }
        for (DriveModule& module : safety.driveModules) {
            module.inForce = false;
        }
        return Done();
    });
}

std::optional<std::size_t> ModuleIndex(const SafetyState& safety, std::optional<std::int32_t> number) {
    if (!number || *number < 1 || static_cast<std::size_t>(*number) > safety.driveModules.size()) {
        return std::nullopt;
    }
    return static_cast<std::size_t>(*number - 1);
}

Reply SyncSoftware(ControllerModel& controller, const Command& command) {
    constexpr TextView kCommand = OLESTR("VantorSyncSoftware");
    const auto arguments = Arguments::Parse(command.args);
    const auto number = arguments ? arguments->Signed(OLESTR("-driver_module")) : std::nullopt;
    if (!number) {
        return BadArguments(command, OLESTR("-driver_module <n>"));
    }
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        const auto index = ModuleIndex(safety, number);
        if (!index) {
            return Refused(kCommand, kStatusNotFound,
                           OLESTR("no drive module ") + Decimal(*number) + OLESTR(" (1 to ") +
                               Decimal(safety.driveModules.size()) + OLESTR(")"));
        }
        safety.driveModules[*index].synchronised = true;
        return Done();
    });
}

// The file is read from the controller's file system, where a client copied
// it first when it was its own.
Reply LoadFile(ControllerModel& controller, const Command& command) {
    constexpr TextView kCommand = OLESTR("VantorLoadSupervConfig");
    const auto arguments = Arguments::Parse(command.args);
    const auto path = arguments ? arguments->Find(OLESTR("-File")) : std::nullopt;
    if (!path || path->empty()) {
        return BadArguments(command, OLESTR("-File \"<path>\""));
    }
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        if (safety.inForce && safety.inForce->locked) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("the configuration in force is locked"));
        }
        if (const auto module = UnsynchronisedModule(safety)) {
            return Refused(kCommand, kStatusNotAllowed,
                           OLESTR("the safety software of drive module ") + Decimal(*module + 1) +
                               OLESTR(" is not synchronised"));
        }
        const TextView file = WithoutControllerPrefix(*path);
        auto read = ReadConfiguration(state.Part<FileSystem>(), file);
        if (auto* why = std::get_if<Text>(&read)) {
            const HRESULT status = *why == OLESTR("does not exist") ? kStatusNotFound : kStatusBadArgument;
            return Refused(kCommand, status,
                           Concat({OLESTR("the configuration file "), Quoted(file), OLESTR(" "), *why}));
        }
        safety.loaded = std::get<Configuration>(std::move(read));
        return Done();
    });
}

Reply LockConfiguration(ControllerModel& controller, const Command& command) {
    constexpr TextView kCommand = OLESTR("LockSupervConfig");
    const auto lock = [&](SafetyState& safety, Configuration& c, const Text& name, Text date) -> Reply {
        if (c.locked) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("the configuration is locked already"));
        }
        if (!c.validated) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("only a validated configuration can be locked"));
        }
        if (safety.mode != SafetyMode::Active) {
            return Refused(kCommand, kStatusNotAllowed,
                           OLESTR("the safety controller is in ") + Text(SafetyModeWord(safety.mode)) +
                               OLESTR(" mode; a configuration is locked in active mode"));
        }
        c.locked = true;
        c.lockedBy = name;
        c.lockDate = std::move(date);
        return Done();
    };
    return ChangeByName(controller, command, lock);
}

Reply UnlockSupervision(ControllerModel& controller, const Command&) {
    constexpr TextView kCommand = OLESTR("VantorUnlockSuperv");
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        if (!safety.inForce || !safety.inForce->locked) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("the configuration is not locked"));
        }
        safety.inForce->locked = false;
        safety.inForce->lockedBy.clear();
        safety.inForce->lockDate.clear();
        return Done();
    });
}

// Back to the factory: no configuration, active mode, no violations, and
// drive modules whose software no longer matches.
Reply FactoryReset(ControllerModel& controller, const Command&) {
    constexpr TextView kCommand = OLESTR("ResetSafetyController");
    return controller.Update([&](ModelState& state, EventPosts&) -> Reply {
        SafetyState& safety = state.Part<SafetyState>();
        if (safety.inForce && safety.inForce->locked) {
            return Refused(kCommand, kStatusNotAllowed, OLESTR("the configuration is locked; unlock it first"));
        }
        safety.mode = SafetyMode::Active;
        safety.inForce.reset();
        safety.loaded.reset();
        for (DriveModule& module : safety.driveModules) {
            module.synchronised = false;
            module.last = Violation{};
            module.inForce = false;
        }
        return Done();
    });
}

// "-last_violation 0" asks for the violation in force, "none" with the
// robot where it is now when there is none; any other number for the last
// one caught.
Reply GetViolation(ControllerModel& controller, const Command& command) {
    constexpr TextView kCommand = OLESTR("VantorViolationInfo");
    const auto arguments = Arguments::Parse(command.args);
    const auto number = arguments ? arguments->Signed(OLESTR("-driver_module")) : std::nullopt;
    const auto last = arguments ? arguments->Signed(OLESTR("-last_violation")) : std::nullopt;
    if (!number || !last) {
        return BadArguments(command, OLESTR("-driver_module <n> -last_violation <0|1>"));
    }
    return controller.Read([&](const ModelState& state) {
        const SafetyState& safety = state.Part<SafetyState>();
        const auto index = ModuleIndex(safety, number);
        if (!index) {
            return Refused(kCommand, kStatusNotFound,
                           OLESTR("no drive module ") + Decimal(*number) + OLESTR(" (1 to ") +
                               Decimal(safety.driveModules.size()) + OLESTR(")"));
        }
        const DriveModule& module = safety.driveModules[*index];
        Violation shown = module.last;
        if (*last == 0 && !module.inForce) {
            shown = Violation{};
            shown.pose = module.pose;
        }
        const Configuration* active = safety.inForce ? &*safety.inForce : nullptr;
        return Answer(ViolationText(shown, *number, !module.synchronised, active));
    });
}

// "-noelts N", a tab, then per drive module's unit "id;status;call status"
// and a tab. The status is the configuration status as the unit has it; a
// unit whose software does not match answers with a failure.
Reply GetPscUnits(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        const SafetyState& safety = state.Part<SafetyState>();
        const std::uint32_t status = ConfigStatus(safety).second;
        Text text = Concat({OLESTR("-noelts "), Decimal(safety.driveModules.size()), OLESTR("\t")});
        for (std::size_t i = 0; i < safety.driveModules.size(); ++i) {
            const bool matches = safety.driveModules[i].synchronised;
            text += Concat({Decimal(i + 1), OLESTR(";"), Decimal(matches ? status : 4u), OLESTR(";"),
                            Decimal(static_cast<std::int32_t>(matches ? S_OK : kStatusNotAllowed)), OLESTR("\t")});
        }
        return text;
    }));
}

// "SafetyModeStatus": the Get reply, "-modestat active" and so on.
Text SafetyModeEvent(const ModelState& state, const Arguments&) { return SafetyModeText(state); }

// What each violation type puts in violation.
using FlagsMember = Instances Violation::*;
FlagsMember FlagsOf(TextView type) {
    if (type == OLESTR("sst")) return &Violation::standStill;
    if (type == OLESTR("stz")) return &Violation::toolPosition;
    if (type == OLESTR("sts") || type == OLESTR("red_tool_speed")) return &Violation::toolSpeed;
    if (type == OLESTR("sar")) return &Violation::axisRange;
    return nullptr;
}

constexpr TextView kViolationTypes[] = {
    OLESTR("stz"), OLESTR("sar"), OLESTR("sts"), OLESTR("sas"), OLESTR("tom"), OLESTR("osr"), OLESTR("sst"),
    OLESTR("red_tool_speed"), OLESTR("red_axis_speed"), OLESTR("unsync_speed_lim"), OLESTR("empstop"), OLESTR("other")};

}  // namespace

bool TriggerSafetyViolation(ControllerModel& controller, int driveModule, TextView typeWord, std::uint32_t instance) {
    TextView type;
    for (TextView known : kViolationTypes) {
        if (known == typeWord) type = known;
    }
    if (type.empty() || instance < 1 || instance > kInstances) {
        return false;
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        SafetyState& safety = state.Part<SafetyState>();
        const auto index = ModuleIndex(safety, driveModule);
        if (!index || !safety.inForce) {
            return false;
        }
        DriveModule& module = safety.driveModules[*index];
        Violation caught;
        caught.number = module.last.number + 1;
        caught.type = type;
        caught.instance = instance;
        caught.tool = 1;
        caught.pose = module.pose;
        if (const FlagsMember flags = FlagsOf(type)) {
            (caught.*flags).set(instance - 1);
        }
        module.last = caught;
        module.inForce = true;
        return true;
    });
}

const Subsystem& SafetySubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("VantorConfigStatus"), GetConfigStatus},
        {OLESTR("Get"), OLESTR("VantorLoadOperationStatus"), GetLoadStatus},
        {OLESTR("Get"), OLESTR("SafetyModeStatus"), GetSafetyMode},
        {OLESTR("Get"), OLESTR("SafetyConf"), GetSafetyConf},
        {OLESTR("Set"), OLESTR("SafetyConfValidated"), SetValidated},
        {OLESTR("Set"), OLESTR("VantorNotValidated"), SetNotValidated},
        {OLESTR("Set"), OLESTR("VantorSafetyMode"), SetMode},
        {OLESTR("Set"), OLESTR("VantorReconfigure"), Reconfigure},
        {OLESTR("Set"), OLESTR("VantorSyncSoftware"), SyncSoftware},
        {OLESTR("Set"), OLESTR("VantorLoadSupervConfig"), LoadFile},
        {OLESTR("Set"), OLESTR("LockSupervConfig"), LockConfiguration},
        {OLESTR("Set"), OLESTR("VantorUnlockSuperv"), UnlockSupervision},
        {OLESTR("Set"), OLESTR("ResetSafetyController"), FactoryReset},
        {OLESTR("Get"), OLESTR("VantorViolationInfo"), GetViolation},
        {OLESTR("Get"), OLESTR("PSCUnitStatus"), GetPscUnits},
    };
    static constexpr EventRow kEvents[] = {
        {OLESTR("SafetyModeStatus"), EventStyle::Value, SafetyModeEvent},
    };
    static constexpr Subsystem subsystem{kRows, kEvents};
    return subsystem;
}

}  // namespace tav::sim
