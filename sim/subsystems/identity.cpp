// Identity, names, version information, environment, options, language,
// connected clients.
#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/reply_texts.h"
#include "sim/status_codes.h"

namespace tav::sim {
namespace {

// The value of the first of `keys` present in the argument text.
std::optional<Text> ValueOf(const Command& command, std::initializer_list<TextView> keys) {
    const auto arguments = Arguments::Parse(command.args);
    if (!arguments) {
        return std::nullopt;
    }
    for (TextView key : keys) {
        if (const auto value = arguments->Find(key)) {
            return Text(*value);
        }
    }
    return std::nullopt;
}

Reply GetControllerName(ControllerModel& controller, const Command&) {
    return Answer(controller.Read(
        [](const ModelState& state) { return Concat({OLESTR("-Name \""), state.name, OLESTR("\"")}); }));
}

Reply SetControllerName(ControllerModel& controller, const Command& command) {
    auto name = ValueOf(command, {OLESTR("-Name")});
    if (!name) {
        return BadArguments(command, OLESTR("-Name \"<name>\""));
    }
    controller.Update([&](ModelState& state, EventPosts&) { state.name = std::move(*name); });
    return Done();
}

Reply GetControllerId(ControllerModel& controller, const Command&) {
    return Answer(controller.Read(
        [](const ModelState& state) { return Concat({OLESTR("-ID \""), state.controllerId, OLESTR("\"")}); }));
}

// The identifier comes as -ctrlId, or as -Id when it is cleared.
Reply SetControllerId(ControllerModel& controller, const Command& command) {
    auto id = ValueOf(command, {OLESTR("-ctrlId"), OLESTR("-Id")});
    if (!id) {
        return BadArguments(command, OLESTR("-ctrlId \"<identifier>\""));
    }
    controller.Update([&](ModelState& state, EventPosts&) { state.controllerId = std::move(*id); });
    return Done();
}

Reply GetSystemGuid(ControllerModel& controller, const Command&) {
    return Answer(OLESTR("-GUID ") + controller.Read([](const ModelState& state) { return state.systemGuid; }));
}

std::optional<bool> SystemType(TextView type) {
    if (type == OLESTR("System")) {
        return true;
    }
    if (type == OLESTR("Release")) {
        return false;
    }
    return std::nullopt;
}

Reply GetVersionInfo(ControllerModel& controller, const Command& command) {
    const auto type = ValueOf(command, {OLESTR("-Type")});
    const auto system = type ? SystemType(*type) : std::nullopt;
    if (!system) {
        return BadArguments(command, OLESTR("-Type System|Release"));
    }
    return Answer(controller.Read(
        [&](const ModelState& state) { return *system ? state.version.system : state.version.release; }));
}

Reply GetSystemInfo(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto type = arguments ? arguments->Find(OLESTR("-Type")) : std::nullopt;
    const auto name = arguments ? arguments->Find(OLESTR("-SystemName")) : std::nullopt;
    const auto system = type ? SystemType(*type) : std::nullopt;
    if (!system || !name) {
        return BadArguments(command, OLESTR("-Type System|Release -SystemName \"<system>\""));
    }
    return controller.Read([&](const ModelState& state) {
        const auto found = state.systems.find(Text(*name));
        if (found == state.systems.end()) {
            return Refuse(kStatusNotFound, OLESTR("SystemInfo: no system named ") + Quoted(*name));
        }
        return Answer(*system ? found->second.system : found->second.release);
    });
}

// The argument is the variable's name alone.
Reply GetEnvironmentVariable(ControllerModel& controller, const Command& command) {
    const TextView name = Trim(command.args);
    return controller.Read([&](const ModelState& state) {
        for (const auto& [variable, value] : state.environment) {
            if (EqualsIgnoringCase(variable, name)) {
                return Answer(value);
            }
        }
        return Refuse(kStatusNotFound, OLESTR("EnvironmentVar: no variable ") + Quoted(name));
    });
}

Reply IsOptionPresent(ControllerModel& controller, const Command& command) {
    const auto option = ValueOf(command, {OLESTR("-Option")});
    if (!option) {
        return BadArguments(command, OLESTR("-Option \"<option>\""));
    }
    const bool present = controller.Read([&](const ModelState& state) { return state.options.contains(*option); });
    return Answer(OLESTR("-OptionPresent ") + Decimal(present ? 1 : 0));
}

Reply SetLanguage(ControllerModel& controller, const Command& command) {
    auto language = ValueOf(command, {OLESTR("-Language")});
    if (!language || Trim(*language).empty()) {
        return BadArguments(command, OLESTR("-Language \"<language>\""));
    }
    controller.Update([&](ModelState& state, EventPosts&) { state.language = std::move(*language); });
    return Done();
}

Reply GetConnectedClients(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return ConnectedClientsXml(state); }));
}

// The version name follows "-Name " without quotes, up to the end.
Reply GetVersionName(ControllerModel& controller, const Command&) {
    return Answer(OLESTR("-Name ") + controller.Read([](const ModelState& state) { return state.versionName; }));
}

Reply GetProductVersionName(ControllerModel& controller, const Command& command) {
    const auto product = ValueOf(command, {OLESTR("-Name")});
    if (!product) {
        return BadArguments(command, OLESTR("-Name \"<product>\""));
    }
    return controller.Read([&](const ModelState& state) {
        const auto found = state.productVersions.find(*product);
        if (found == state.productVersions.end()) {
            return Refuse(kStatusNotFound, OLESTR("ProductVersionName: no product named ") + Quoted(*product));
        }
        return Answer(OLESTR("-Name ") + Text(found->first) + OLESTR(" ") + found->second);
    });
}

}  // namespace

const Subsystem& IdentitySubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("CtrlName"), GetControllerName},
        {OLESTR("Set"), OLESTR("CtrlName"), SetControllerName},
        {OLESTR("Get"), OLESTR("CtrlID"), GetControllerId},
        {OLESTR("Set"), OLESTR("CtrlID"), SetControllerId},
        {OLESTR("Get"), OLESTR("GUID"), GetSystemGuid},
        {OLESTR("Get"), OLESTR("VersionInfo"), GetVersionInfo},
        {OLESTR("Get"), OLESTR("SystemInfo"), GetSystemInfo},
        {OLESTR("Get"), OLESTR("EnvironmentVar"), GetEnvironmentVariable, Service::DhRoot},
        {OLESTR("Get"), OLESTR("IsOptionPresent"), IsOptionPresent},
        {OLESTR("Set"), OLESTR("Language"), SetLanguage},
        {OLESTR("Get"), OLESTR("ConnectedClients"), GetConnectedClients},
        {OLESTR("Get"), OLESTR("VersionName"), GetVersionName},
        {OLESTR("Get"), OLESTR("ProductVersionName"), GetProductVersionName},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
