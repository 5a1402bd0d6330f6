// Storage devices, copying files on the controller, diagnostics, the
// pendant screen dump, and a look into the embedded controller's disks.
#include "sim/file_system.h"
#include "sim/virtual_controller.h"
#include "tavctl/list_reader.h"
#include "tavctl/verb.h"

namespace tavctl {
namespace {

// The storage-device lists take -2 for "all".
constexpr long kAllDevices = -2;

int Devices(Verb& v) {
    const bool second = v.Flag("--v2");
    v.End();
    if (!second) {
        const auto devices = v.Interface<ITavDynamicDevices>();
        return ReadList<IEnumStorageDevices, TavStorageDevice>(
            v, "GetStorageDevices", kAllDevices,
            [&](TavInParams* rip, TavRetrievalParams* params, IEnumStorageDevices** list) {
                return devices->GetStorageDevices(rip, params, list);
            },
            [&](VARIANT* data, TavRetrievalParams* params, IEnumStorageDevices** list) {
                return devices->UnpackStorageDevices(data, params, list);
            },
            [](TavStorageDevice& device) {
                Record row{{"name", TextValue(device.deviceName)},
                           {"type", Show(device.deviceType)},
                           {"enabled", AsBoolean(device.bEnabled)},
                           {"readOnly", AsBoolean(device.bReadOnly)}};
                SysFreeString(device.deviceName);
                return row;
            });
    }
    const auto devices = v.Interface<ITavDynamicDevices2>();
    return ReadList<IEnumStorageDevices2, TavStorageDevice2>(
        v, "GetStorageDevices2", kAllDevices,
        [&](TavInParams* rip, TavRetrievalParams* params, IEnumStorageDevices2** list) {
            return devices->GetStorageDevices2(rip, params, list);
        },
        [&](VARIANT* data, TavRetrievalParams* params, IEnumStorageDevices2** list) {
            return devices->UnpackStorageDevices2(data, params, list);
        },
        [](TavStorageDevice2& device) {
            Record row{{"name", TextValue(device.deviceName)},
                       {"type", Show(device.deviceType)},
                       {"enabled", AsBoolean(device.bEnabled)},
                       {"readOnly", AsBoolean(device.bReadOnly)},
                       {"shown", AsBoolean(device.bShowDevice)}};
            SysFreeString(device.deviceName);
            return row;
        });
}

int CopyFile(Verb& v) {
    const auto source = v.Text("SOURCE");
    const auto destination = v.Text("DESTINATION");
    v.End();
    return v.Set("CopyFile", &ITavFileManagement::CopyFile, source.Get(), destination.Get());
}

int CopyDirectory(Verb& v) {
    const auto source = v.Text("SOURCE");
    const auto destination = v.Text("DESTINATION");
    v.End();
    return v.Set("CopyDirectory", &ITavFileManagement::CopyDirectory, source.Get(), destination.Get());
}

int DiagSave(Verb& v) {
    const auto path = v.Text("PATH");
    v.End();
    return v.Set("SaveDiagnosticsInfo", &ITavSystemDiagnostics::SaveDiagnosticsInfo, path.Get());
}

int DiagStatus(Verb& v) {
    v.End();
    return v.GetShown(AsHresult, "GetDiagnosticsInfoStatus", &ITavSystemDiagnostics::GetDiagnosticsInfoStatus,
                      &ITavSystemDiagnostics::UnpackDiagnosticsInfoStatus);
}

int DumpRequest(Verb& v) {
    v.End();
    return v.Set("ReqDorvelScreenDump", &ITavDorvel::ReqDorvelScreenDump);
}

int DumpStatus(Verb& v) {
    v.End();
    return v.GetShown(AsHresult, "GetDorvelScreenDumpStatus", &ITavDorvel::GetDorvelScreenDumpStatus,
                      &ITavDorvel::UnpackDorvelScreenDump);
}

// No operation of the module lists a folder, so this looks at the embedded
// virtual controller's disks directly; a controller named by --url alone
// cannot be looked into.
int DeviceList(Verb& v) {
    const std::string path = v.OptionalWord().value_or("/");
    v.End();
    const auto controller = v.session.Options().embedded ? tav::sim::ControllerAt(ToOle(v.session.Options().url))
                                                         : nullptr;
    if (!controller) {
        v.session.Error("ls: only the embedded virtual controller can be looked into (no --url, or --sim)");
        return kExitFailed;
    }
    const OleText wanted = ToOle(path);
    using tav::sim::FileSystem;
    const auto entries = controller->Read([&](const tav::sim::ModelState& state) {
        const FileSystem& disks = state.Part<FileSystem>();
        std::optional<std::vector<FileSystem::Entry>> found;
        const auto normal = FileSystem::Normalise(wanted);
        if (!normal) {
            return found;
        }
        if (normal->empty() || disks.IsFolder(wanted)) {
            found = disks.List(wanted);
        } else if (disks.Exists(wanted)) {
            found = std::vector<FileSystem::Entry>{{*normal, false, disks.Size(wanted).value_or(0)}};
        }
        return found;
    });
    if (!entries) {
        v.session.Error("ls: no such file or folder " + Quote(path));
        return kExitFailed;
    }
    std::vector<Record> table;
    for (const auto& entry : *entries) {
        table.push_back({{"name", Value::Text(ToUtf8(entry.name) + (entry.folder ? "/" : ""))},
                         {"size", entry.folder ? Value::Null() : Value::Unsigned(entry.size)}});
    }
    v.session.Show(table);
    return kExitOk;
}

constexpr VerbEntry kDevices[] = {
    {"", "[--v2]", "list the storage devices (GetStorageDevices, GetStorageDevices2 with --v2)", Devices}};
constexpr VerbEntry kCopy[] = {
    {"file", "SOURCE DESTINATION", "copy a file on the controller (CopyFile)", CopyFile},
    {"dir", "SOURCE DESTINATION", "copy a folder on the controller (CopyDirectory)", CopyDirectory},
};
constexpr VerbEntry kDiag[] = {
    {"save", "PATH", "save the diagnostics information (SaveDiagnosticsInfo)", DiagSave},
    {"status", "", "print the result of the last save (GetDiagnosticsInfoStatus)", DiagStatus},
};
constexpr VerbEntry kScreenDump[] = {
    {"request", "", "ask the pendant for a screen dump (ReqDorvelScreenDump)", DumpRequest},
    {"status", "", "print the result of the last screen dump (GetDorvelScreenDumpStatus)", DumpStatus},
};
constexpr VerbEntry kList[] = {
    {"", "[PATH]", "list a folder of the embedded virtual controller's disks", DeviceList,
     "The module has no operation that lists a folder; ls reads the embedded\n"
     "virtual controller's disks (hd0a, usb1, ...) directly.\n"}};

}  // namespace

std::span<const GroupEntry> DeviceGroups() {
    static constexpr GroupEntry kGroups[] = {
        {"devices", "Storage devices", kDevices},
        {"copy", "Copying files and folders on the controller", kCopy},
        {"diag", "Diagnostics information", kDiag},
        {"screendump", "The pendant screen dump", kScreenDump},
        {"ls", "The embedded controller's disks", kList},
    };
    return kGroups;
}

}  // namespace tavctl
