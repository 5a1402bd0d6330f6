// Storage devices: the devices of the controller's file system, listed in
// the two list grammars, and the demo switches that plug a device in and
// out or make it read-only or small.
#include "sim/subsystems/devices.h"

#include <map>

#include "sim/command_table.h"
#include "sim/file_system.h"
#include "sim/status_codes.h"
#include "sim/subsystems/systems.h"

namespace tav::sim {
namespace {

constexpr std::size_t kLongestDeviceName = 30;

// Devices whose properties are not those of a fixed disk; a device of the
// file system that is not here is one.
struct DeviceTable {
    std::map<Text, DeviceOptions, std::less<>> devices;
};

DeviceOptions FixedDisk() {
    DeviceOptions disk;
    disk.kind = DeviceKind::Fixed;
    disk.capacity = 2ull << 30;
    disk.serviceContent = false;
    return disk;
}

DeviceOptions OptionsOf(const ModelState& state, TextView device) {
    const auto& devices = state.Part<DeviceTable>().devices;
    const auto found = devices.find(device);
    return found == devices.end() ? FixedDisk() : found->second;
}

TextView KindWord(DeviceKind kind) {
    switch (kind) {
        case DeviceKind::Removable: return OLESTR("Removable");
        case DeviceKind::Ramdisk: return OLESTR("Ramdisk");
        case DeviceKind::Remote: return OLESTR("Remote");
        case DeviceKind::Fixed: return OLESTR("Fixed");
        case DeviceKind::Unknown: break;
    }
    return OLESTR("Unknown");
}

TextView Flag(bool on) { return on ? OLESTR("1") : OLESTR("0"); }

// "-noelts <n>" and a TAB, then per device "name;type;enabled;read-only"
// (the second list adds ";shown") and a TAB.
Text DeviceList(const ModelState& state, bool withShown) {
    const std::vector<Text> devices = state.Part<FileSystem>().Devices();
    Text list = Concat({OLESTR("-noelts "), Decimal(devices.size()), OLESTR("\t")});
    for (const Text& device : devices) {
        const DeviceOptions options = OptionsOf(state, device);
        list += Concat({device, OLESTR(";"), KindWord(options.kind), OLESTR(";"), Flag(options.enabled), OLESTR(";"),
                        Flag(options.readOnly)});
        if (withShown) {
            list += Concat({OLESTR(";"), Flag(options.shown)});
        }
        list += OLECHAR('\t');
    }
    return list;
}

Reply GetStorageDevices(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return DeviceList(state, false); }));
}

Reply GetStorageDevices2(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return DeviceList(state, true); }));
}

bool UsableDeviceName(TextView name) {
    return !name.empty() && name.size() <= kLongestDeviceName && name.find_first_of(OLESTR(";/\\ \t")) == TextView::npos;
}

void WriteServiceContent(FileSystem& files, TextView device) {
    const Text image = JoinPath(device, OLESTR("BOOTIMAGE"));
    files.MakeFolders(image);
    files.Write(JoinPath(image, OLESTR("boot.001")), std::string(4096, '\x5A'));
    files.Write(JoinPath(image, OLESTR("boot.002")), std::string(1024, '\xA5'));
    WritePackage(files, JoinPath(device, OLESTR("packages/CellSystem")), OLESTR("CellSystem"), "7.5.0", false);
    WritePackage(files, JoinPath(device, OLESTR("packages/CellDeployment")), OLESTR("CellSystem2"), "7.5.1", true);
    files.MakeFolders(JoinPath(device, OLESTR("packages/BootServer")));
    files.Write(JoinPath(device, OLESTR("packages/BootServer/bootserver.manifest")), ManifestLine("version", OLESTR("3.2.0")));
}

template <typename F>
bool ChangeDevice(ControllerModel& controller, TextView name, F change) {
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (!UsableDeviceName(name) || !state.Part<FileSystem>().IsFolder(name)) {
            return false;
        }
        auto& devices = state.Part<DeviceTable>().devices;
        auto found = devices.find(name);
        if (found == devices.end()) {
            found = devices.emplace(Text(name), FixedDisk()).first;
        }
        change(found->second);
        return true;
    });
}

}  // namespace

Text DeviceOf(TextView path) {
    const auto key = FileSystem::Normalise(path);
    if (!key) {
        return Text();
    }
    return key->substr(0, key->find(OLECHAR('/')));
}

bool PlugDevice(ControllerModel& controller, TextView name, DeviceOptions options) {
    if (!UsableDeviceName(name)) {
        return false;
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        FileSystem& files = state.Part<FileSystem>();
        if (files.Exists(name)) {
            return false;
        }
        files.Plug(name);
        if (options.serviceContent) {
            WriteServiceContent(files, name);
        }
        state.Part<DeviceTable>().devices[Text(name)] = options;
        return true;
    });
}

bool UnplugDevice(ControllerModel& controller, TextView name) {
    return controller.Update([&](ModelState& state, EventPosts&) {
        FileSystem& files = state.Part<FileSystem>();
        if (!UsableDeviceName(name) || !files.IsFolder(name)) {
            return false;
        }
        files.Unplug(name);
        state.Part<DeviceTable>().devices.erase(Text(name));
        BootDeviceGone(state, name);
        return true;
    });
}

bool SetDeviceReadOnly(ControllerModel& controller, TextView name, bool readOnly) {
    return ChangeDevice(controller, name, [&](DeviceOptions& options) { options.readOnly = readOnly; });
}

bool SetDeviceCapacity(ControllerModel& controller, TextView name, std::uint64_t bytes) {
    return ChangeDevice(controller, name, [&](DeviceOptions& options) { options.capacity = bytes; });
}

std::optional<Failure> WriteRefusal(const ModelState& state, TextView path, std::uint64_t bytes) {
    const Text device = DeviceOf(path);
    const FileSystem& files = state.Part<FileSystem>();
    if (device.empty() || !files.IsFolder(device)) {
        return Failure{kStatusPathNotFound, OLESTR("no device ") + Quoted(device.empty() ? path : TextView(device))};
    }
    const DeviceOptions options = OptionsOf(state, device);
    if (!options.enabled) {
        return Failure{kStatusNotAllowed, OLESTR("device ") + Quoted(device) + OLESTR(" is disabled")};
    }
    if (options.readOnly) {
        return Failure{kStatusWriteProtected, OLESTR("device ") + Quoted(device) + OLESTR(" is read-only")};
    }
    const std::uint64_t used = files.UsedBelow(device);
    const std::uint64_t free = used < options.capacity ? options.capacity - used : 0;
    if (bytes > free) {
        return Failure{kStatusDiskFull, Concat({OLESTR("device "), Quoted(device), OLESTR(" is full: "), Decimal(bytes),
                                                OLESTR(" bytes needed, "), Decimal(free), OLESTR(" free")})};
    }
    return std::nullopt;
}

const Subsystem& DevicesSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("StorageDevice"), GetStorageDevices},
        {OLESTR("Get"), OLESTR("StorageDevice2"), GetStorageDevices2},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
