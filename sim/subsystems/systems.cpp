// Installed systems and the boot device: which system runs, which starts
// next, installing and removing systems, the boot device and the boot image
// loaded from it.
#include "sim/subsystems/systems.h"

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"
#include "sim/subsystems/devices.h"

namespace tav::sim {
namespace {

// The boot image is spread over the files of this folder on the boot device.
constexpr const OLECHAR* kBootImageFolder = OLESTR("BOOTIMAGE");
constexpr std::size_t kLongestSystemName = 256;

struct BootState {
    // The system for the next start: the running one unless another was
    // selected; none at all once deselected.
    Text selected;
    bool deselected = false;
    Text bootDevice = kSystemsDevice;
    bool imageLoaded = false;
};

std::string Latin1(TextView text) {
    std::string bytes;
    bytes.reserve(text.size());
    for (OLECHAR c : text) {
        bytes.push_back(static_cast<std::uint16_t>(c) < 256 ? static_cast<char>(c) : '?');
    }
    return bytes;
}

Text NameOrEmpty(const Arguments* arguments) {
    const auto name = arguments ? arguments->Find(OLESTR("-Name")) : std::nullopt;
    return name ? Text(*name) : Text();
}

// A system name becomes a folder name and an element of the comma-separated
// system list.
bool UsableSystemName(TextView name) {
    return !name.empty() && name.size() <= kLongestSystemName &&
           name.find_first_of(OLESTR(",;/\\\"")) == TextView::npos && Trim(name) == name;
}

Reply NeedsName(const Command& command) {
    return BadArguments(command, OLESTR("-Name \"<name>\""));
}

Reply GetSystemName(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return OLESTR("-Name ") + state.currentSystem; }));
}

Reply GetSelectedSystem(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        const BootState& boot = state.Part<BootState>();
        if (boot.deselected) {
            return Text(OLESTR("-Name "));
        }
        return OLESTR("-Name ") + (boot.selected.empty() ? state.currentSystem : boot.selected);
    }));
}

Reply SelectSystem(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const Text name = NameOrEmpty(arguments ? &*arguments : nullptr);
    if (name.empty()) {
        return NeedsName(command);
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (state.systems.count(name) == 0) {
            return Refuse(kStatusNotFound, OLESTR("SelectSystem: no system named ") + Quoted(name));
        }
        BootState& boot = state.Part<BootState>();
        boot.selected = name;
        boot.deselected = false;
        return Done();
    });
}

Reply DeselectSystem(ControllerModel& controller, const Command&) {
    controller.Update([](ModelState& state, EventPosts&) {
        BootState& boot = state.Part<BootState>();
        boot.selected.clear();
        boot.deselected = true;
    });
    return Done();
}

// "-NoOfElements <n> -Names a,b,c"; names hold no commas.
Reply GetSystemList(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        Text names;
        for (const auto& [name, versions] : state.systems) {
            if (!names.empty()) {
                names += OLECHAR(',');
            }
            names += name;
        }
        return Concat({OLESTR("-NoOfElements "), Decimal(state.systems.size()), OLESTR(" -Names "), names});
    }));
}

Reply RemoveSystem(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const Text name = NameOrEmpty(arguments ? &*arguments : nullptr);
    if (name.empty()) {
        return NeedsName(command);
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (state.systems.count(name) == 0) {
            return Refuse(kStatusNotFound, OLESTR("RemoveSystem: no system named ") + Quoted(name));
        }
        if (name == state.currentSystem) {
            return Refuse(kStatusNotAllowed,
                          OLESTR("RemoveSystem: ") + Quoted(name) + OLESTR(" is the running system"));
        }
        state.Part<FileSystem>().Remove(JoinPath(kSystemsDevice, name));
        state.systems.erase(name);
        BootState& boot = state.Part<BootState>();
        if (boot.selected == name) {
            boot.selected.clear();
        }
        return Done();
    });
}

Reply GetBootDevice(ControllerModel& controller, const Command&) {
    return Answer(
        controller.Read([](const ModelState& state) { return OLESTR("-Name ") + state.Part<BootState>().bootDevice; }));
}

Reply SetBootDevice(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const Text name = NameOrEmpty(arguments ? &*arguments : nullptr);
    if (name.empty()) {
        return NeedsName(command);
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        const auto key = FileSystem::Normalise(name);
        if (!key || key->empty() || key->find(OLECHAR('/')) != Text::npos ||
            !state.Part<FileSystem>().IsFolder(*key)) {
            return Refuse(kStatusNotFound, OLESTR("BootDevice: no device named ") + Quoted(name));
        }
        BootState& boot = state.Part<BootState>();
        if (boot.bootDevice != *key) {
            boot.bootDevice = *key;
            boot.imageLoaded = false;
        }
        return Done();
    });
}

std::size_t BootImageFiles(const ModelState& state) {
    const auto entries =
        state.Part<FileSystem>().List(JoinPath(state.Part<BootState>().bootDevice, kBootImageFolder));
    std::size_t files = 0;
    for (const FileSystem::Entry& entry : entries.value_or(std::vector<FileSystem::Entry>{})) {
        files += entry.folder ? 0 : 1;
    }
    return files;
}

Reply GetSpannedFiles(ControllerModel& controller, const Command&) {
    return Answer(OLESTR("-FileCount ") +
                  Decimal(controller.Read([](const ModelState& state) { return BootImageFiles(state); })));
}

// Not done (0) when the boot device holds no boot image.
Reply LoadBootImage(ControllerModel& controller, const Command&) {
    return controller.Update([](ModelState& state, EventPosts&) {
        BootState& boot = state.Part<BootState>();
        boot.imageLoaded = BootImageFiles(state) > 0;
        return Answer(boot.imageLoaded ? OLESTR("-IsDone 1") : OLESTR("-IsDone 0"));
    });
}

Reply UndoLoadBootImage(ControllerModel& controller, const Command&) {
    return controller.Update([](ModelState& state, EventPosts&) {
        BootState& boot = state.Part<BootState>();
        if (!boot.imageLoaded) {
            return Refuse(kStatusNotAllowed, OLESTR("UndoLoadBootImage: no boot image is loaded"));
        }
        boot.imageLoaded = false;
        return Done();
    });
}

// Two forms: "-overwrite|-nooverwrite -system_path \"<package>\"", and up to
// four parts "-system_path", "-ctrl_name", "-ctrl_id", "-dp_pkg_root", where
// a deployment package root is installed from unless a system folder is
// named.
Reply InstallNewSystem(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    if (!arguments || arguments->Empty()) {
        return Refuse(kStatusBadArgument,
                      OLESTR("InstallNewSystem: nothing to install; expected -system_path or -dp_pkg_root, got ") +
                          Quoted(command.args));
    }
    const auto systemPath = arguments->Find(OLESTR("-system_path"));
    const auto packageRoot = arguments->Find(OLESTR("-dp_pkg_root"));
    InstallRequest request{.command = command.name};
    const bool firstForm = arguments->Has(OLESTR("-overwrite")) || arguments->Has(OLESTR("-nooverwrite"));
    request.overwrite = arguments->Has(OLESTR("-overwrite"));
    request.controllerName = arguments->Find(OLESTR("-ctrl_name")).value_or(TextView());
    request.controllerId = arguments->Find(OLESTR("-ctrl_id")).value_or(TextView());
    if (systemPath && !systemPath->empty()) {
        request.folder = WithoutControllerPrefix(*systemPath);
    } else if (!firstForm && packageRoot && !packageRoot->empty()) {
        request.folder = WithoutControllerPrefix(*packageRoot);
        request.deployment = true;
    } else {
        return Refuse(kStatusBadArgument,
                      OLESTR("InstallNewSystem: no package folder given in ") + Quoted(command.args));
    }
    return controller.Update([&](ModelState& state, EventPosts&) { return InstallSystem(state, request); });
}

}  // namespace

Text JoinPath(TextView folder, TextView name) {
    if (folder.empty() || name.empty()) {
        return Concat({folder, name});
    }
    return Concat({folder, OLESTR("/"), name});
}

TextView WithoutControllerPrefix(TextView path) {
    constexpr TextView kPrefix = OLESTR("ctrl:");
    if (path.size() >= kPrefix.size() && EqualsIgnoringCase(path.substr(0, kPrefix.size()), kPrefix)) {
        path.remove_prefix(kPrefix.size());
    }
    return path;
}

std::string ManifestLine(std::string_view key, TextView value) {
    return std::string(key) + '=' + Latin1(value) + '\n';
}

std::optional<Text> ManifestValue(const FileSystem& files, TextView file, std::string_view key) {
    const std::string* bytes = files.Read(file);
    if (bytes == nullptr) {
        return std::nullopt;
    }
    std::size_t at = 0;
    while (at < bytes->size()) {
        std::size_t end = bytes->find('\n', at);
        if (end == std::string::npos) {
            end = bytes->size();
        }
        const std::string_view line(bytes->data() + at, end - at);
        if (line.size() > key.size() && line.substr(0, key.size()) == key && line[key.size()] == '=') {
            std::string_view value = line.substr(key.size() + 1);
            if (!value.empty() && value.back() == '\r') {
                value.remove_suffix(1);
            }
            return Widen(value);
        }
        at = end + 1;
    }
    return std::nullopt;
}

Text TemplateOf(const FileSystem& files, TextView system) {
    const auto entries = files.List(JoinPath(kSystemsDevice, system));
    for (const FileSystem::Entry& entry : entries.value_or(std::vector<FileSystem::Entry>{})) {
        if (entry.folder && entry.name.starts_with(OLESTR("TavOS-"))) {
            return entry.name;
        }
    }
    return Text();
}

std::optional<SystemPackage> ReadPackage(const FileSystem& files, TextView folder, bool deployment, Text& problem) {
    if (!files.IsFolder(folder)) {
        problem = OLESTR("no package folder ") + Quoted(folder);
        return std::nullopt;
    }
    const Text manifest = JoinPath(folder, kSystemManifest);
    if (!files.Exists(manifest)) {
        problem = Quoted(folder) + OLESTR(" holds no ") + Text(kSystemManifest);
        return std::nullopt;
    }
    if (deployment) {
        for (const OLECHAR* required : {kControllerManifest, kInstallManifest}) {
            if (!files.Exists(JoinPath(folder, required))) {
                problem = Quoted(folder) + OLESTR(" is no deployment package: ") + Text(required) +
                          OLESTR(" is missing");
                return std::nullopt;
            }
        }
    }
    SystemPackage package;
    const auto name = ManifestValue(files, manifest, "name");
    const auto version = ManifestValue(files, manifest, "version");
    if (!name || !UsableSystemName(*name) || !version || version->empty()) {
        problem = Text(kSystemManifest) + OLESTR(" in ") + Quoted(folder) +
                  OLESTR(" lacks a usable name=<system> or version=<version> line");
        return std::nullopt;
    }
    package.name = *name;
    package.templateName = ManifestValue(files, manifest, "template").value_or(OLESTR("TavOS-") + *version);
    package.versions.system =
        ManifestValue(files, manifest, "system").value_or(OLESTR("TavOS ") + *version + OLESTR(" (virtual controller)"));
    package.versions.release =
        ManifestValue(files, manifest, "release").value_or(OLESTR("TavOS release ") + *version);
    return package;
}

Reply InstallSystem(ModelState& state, const InstallRequest& request) {
    FileSystem& files = state.Part<FileSystem>();
    Text problem;
    const auto package = ReadPackage(files, request.folder, request.deployment, problem);
    if (!package) {
        return Refuse(files.IsFolder(request.folder) ? kStatusBadArgument : kStatusNotFound,
                      Concat({request.command, OLESTR(": "), problem}));
    }
    const bool installed = state.systems.count(package->name) != 0;
    if (installed && package->name == state.currentSystem) {
        return Refuse(kStatusNotAllowed, Concat({request.command, OLESTR(": "), Quoted(package->name),
                                                 OLESTR(" is the running system and cannot be overwritten")}));
    }
    if (installed && !request.overwrite) {
        return Refuse(kStatusNotAllowed,
                      Concat({request.command, OLESTR(": a system named "), Quoted(package->name),
                              OLESTR(" is already installed")}));
    }
    const Text target = JoinPath(kSystemsDevice, package->name);
    std::uint64_t size = files.UsedBelow(request.folder);
    if (const auto refusal = WriteRefusal(state, target, size)) {
        return Refuse(refusal->status, Concat({request.command, OLESTR(": "), refusal->text}));
    }
    files.Remove(target);
    files.MakeFolders(JoinPath(target, package->templateName));
    files.Copy(JoinPath(request.folder, kSystemManifest), JoinPath(JoinPath(target, package->templateName), kSystemManifest));
    for (const OLECHAR* part : {OLESTR("HOME"), OLESTR("SYSPAR")}) {
        if (files.Copy(JoinPath(request.folder, part), JoinPath(target, part)) != FileSystem::Result::Done) {
            files.MakeFolders(JoinPath(target, part));
        }
    }
    if (!request.controllerName.empty() || !request.controllerId.empty()) {
        files.Write(JoinPath(target, kControllerManifest),
                    ManifestLine("name", request.controllerName) + ManifestLine("id", request.controllerId));
    }
    state.systems[package->name] = package->versions;
    return Done();
}

void WritePackage(FileSystem& files, TextView folder, TextView system, std::string_view version, bool deployment) {
    const Text wide = Widen(version);
    files.MakeFolders(JoinPath(folder, OLESTR("HOME")));
    files.MakeFolders(JoinPath(folder, OLESTR("SYSPAR")));
    files.Write(JoinPath(folder, kSystemManifest),
                ManifestLine("name", system) + ManifestLine("version", wide) +
                    ManifestLine("template", OLESTR("TavOS-") + wide) +
                    ManifestLine("system", OLESTR("TavOS ") + wide + OLESTR(" (virtual controller)")) +
                    ManifestLine("release", OLESTR("TavOS release ") + wide + OLESTR(" build 2100")));
    files.Write(JoinPath(folder, OLESTR("HOME/main.mod")),
                "MODULE main\n  PROC main()\n    ! " + Latin1(system) + "\n  ENDPROC\nENDMODULE\n");
    files.Write(JoinPath(folder, OLESTR("SYSPAR/MOC.cfg")), "# motion configuration\nMOTION_SYSTEM: -name \"system_1\"\n");
    if (deployment) {
        files.Write(JoinPath(folder, kControllerManifest), ManifestLine("version", wide));
        files.Write(JoinPath(folder, kInstallManifest), ManifestLine("version", wide));
        files.Write(JoinPath(folder, OLESTR("update_summary.txt")), ManifestLine("version", wide));
        files.Write(JoinPath(folder, OLESTR("license.txt")), ManifestLine("version", OLESTR("L-") + wide));
    }
}

void BootDeviceGone(ModelState& state, TextView device) {
    BootState& boot = state.Part<BootState>();
    if (boot.bootDevice == device) {
        boot.bootDevice = kSystemsDevice;
        boot.imageLoaded = false;
    }
}

const Subsystem& SystemsSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("SystemName"), GetSystemName},
        {OLESTR("Get"), OLESTR("SelectSystem"), GetSelectedSystem},
        {OLESTR("Set"), OLESTR("SelectSystem"), SelectSystem},
        {OLESTR("Set"), OLESTR("DeselectSystem"), DeselectSystem},
        {OLESTR("Get"), OLESTR("SystemList"), GetSystemList},
        {OLESTR("Set"), OLESTR("RemoveSystem"), RemoveSystem},
        {OLESTR("Get"), OLESTR("BootDevice"), GetBootDevice},
        {OLESTR("Set"), OLESTR("BootDevice"), SetBootDevice},
        {OLESTR("Get"), OLESTR("SpannedFiles"), GetSpannedFiles},
        {OLESTR("Set"), OLESTR("LoadBootImage"), LoadBootImage},
        {OLESTR("Set"), OLESTR("UndoLoadBootImage"), UndoLoadBootImage},
        {OLESTR("Set"), OLESTR("InstallNewSystem"), InstallNewSystem},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
