// Installed systems, the boot device and image, and the installation inbox.
#include "tavctl/list_reader.h"
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using Boot = ITavBoot;
using Boot3 = ITavBoot3;

int SystemList(Verb& v) {
    const auto sort = v.NumberOption<LONG>("--sort");
    const auto filter = v.NumberOption<LONG>("--filter");
    v.End();
    const auto boot = v.Interface<Boot>();
    return ReadList<ITavEnumBSTR, BSTR>(
        v, "GetSystemNameList", 0,
        [&](TavInParams* rip, TavRetrievalParams* params, ITavEnumBSTR** names) {
            return boot->GetSystemNameList(rip, params, names);
        },
        [&](VARIANT* data, TavRetrievalParams* params, ITavEnumBSTR** names) {
            return boot->UnpackSystemNameList(data, params, names);
        },
        [](BSTR& name) {
            Record row{{"name", TextValue(name)}};
            SysFreeString(name);
            return row;
        },
        [&](ITavEnumBSTR* names) {
            HRESULT hr = sort ? names->Sort(*sort) : S_OK;
            if (SUCCEEDED(hr) && filter) {
                hr = names->Filter(*filter);
            }
            return hr;
        });
}

int SystemCurrent(Verb& v) {
    v.End();
    return v.Get("GetSystemName", &Boot::GetSystemName, &Boot::UnpackSystemName);
}
int SystemSelected(Verb& v) {
    v.End();
    return v.Get("GetSelectedSystem", &Boot::GetSelectedSystem, &Boot::UnpackSelectedSystem);
}
int SystemSelect(Verb& v) {
    const auto name = v.Text("SYSTEM");
    v.End();
    return v.Set("SelectSystem", &Boot::SelectSystem, name.Get());
}
int SystemDeselect(Verb& v) {
    v.End();
    return v.Set("DeselectSystem", &Boot::DeselectSystem);
}
int SystemRemove(Verb& v) {
    const auto name = v.Text("SYSTEM");
    v.End();
    return v.Set("RemoveSystem", &Boot::RemoveSystem, name.Get());
}
int SystemInstall(Verb& v) {
    const bool overwrite = v.Flag("--overwrite");
    const auto package = v.Text("PACKAGE");
    v.End();
    return v.Set("InstallNewSystem", &ITavBoot2::InstallNewSystem, package.Get(), LONG{overwrite ? 1 : 0});
}
int SystemInstall2(Verb& v) {
    const auto id = v.Text("CTRLID");
    const auto name = v.Text("CTRLNAME");
    const auto definition = v.Text("SYSDEF");
    const auto root = v.Text("PKGROOT");
    v.End();
    return v.Set("InstallNewSystem2", &Boot3::InstallNewSystem2, id.Get(), name.Get(), definition.Get(), root.Get());
}

int BootDevice(Verb& v) {
    if (v.Done()) {
        return v.Get("GetBootDevice", &Boot::GetBootDevice, &Boot::UnpackBootDevice);
    }
    const auto device = v.Text("DEVICE");
    v.End();
    return v.Set("SetBootDevice", &Boot::SetBootDevice, device.Get());
}
int BootSpanned(Verb& v) {
    v.End();
    return v.Get("GetNoOfSpannedFiles", &Boot::GetNoOfSpannedFiles, &Boot::UnpackNoOfSpannedFiles);
}
int BootLoad(Verb& v) {
    v.End();
    return v.GetShown(AsBoolean, "LoadBootImage", &Boot::LoadBootImage, &Boot::UnpackLoadBootImage);
}
int BootUndo(Verb& v) {
    v.End();
    return v.Set("UndoLoadBootImage", &Boot::UndoLoadBootImage);
}

int InboxState(Verb& v) {
    v.End();
    return v.GetOnly("GetSysInboxState", &Boot3::GetSysInboxState);
}
int InboxBusy(Verb& v) {
    v.End();
    return v.GetOnlyShown(AsBoolean, "IsInboxBusy", &Boot3::IsInboxBusy);
}
int InboxPath(Verb& v) {
    v.End();
    return v.GetOnly("GetInboxPath", &Boot3::GetInboxPath);
}
int InboxOperation(Verb& v, TavInboxOperation operation) {
    v.End();
    return v.Set("InvokeInboxOperation", &Boot3::InvokeInboxOperation, operation);
}
int InboxOpen(Verb& v) { return InboxOperation(v, TavInboxOperation_Open); }
int InboxClear(Verb& v) { return InboxOperation(v, TavInboxOperation_Clear); }
int InboxPreCheck(Verb& v) { return InboxOperation(v, TavInboxOperation_PreCheck); }
int InboxLoadCompleted(Verb& v) { return InboxOperation(v, TavInboxOperation_LoadCompleted); }
int InboxApply(Verb& v) { return InboxOperation(v, TavInboxOperation_ApplyUpdate); }

constexpr EnumName kFileTypes[] = {
    {TavInboxFileType_CtrlManifest, "ctrl-manifest"},       {TavInboxFileType_Sys_Manifest, "sys-manifest"},
    {TavInboxFileType_InstallPkgManifest, "install-pkg"},   {TavInboxFileType_UpdatePkgManifest, "update-pkg"},
    {TavInboxFileType_UpdateSummary, "update-summary"},     {TavInboxFileType_License, "license"},
    {TavInboxFileType_CtrlProdSetting, "ctrl-prod-setting"},
};

int InboxVersion(Verb& v) {
    const std::string word = v.Word("TYPE");
    v.End();
    const auto type = static_cast<TavInboxFileType>(v.EnumValue("TYPE", word, NamesOf<TavInboxFileType>(), kFileTypes));
    return v.GetOnly("GetVersion", &Boot3::GetVersion, type);
}
int InboxValidate(Verb& v) {
    const auto folder = v.Text("FOLDER");
    v.End();
    return v.Set("ValidateDeploymentPackage", &Boot3::ValidateDeploymentPackage, folder.Get());
}
int InboxUpgrade(Verb& v) {
    const auto folder = v.Text("FOLDER");
    v.End();
    return v.Set("UpgradeBootServer", &Boot3::UpgradeBootServer, folder.Get());
}

constexpr VerbEntry kSystem[] = {
    {"list", "[--sort MODE] [--filter MODE]", "list the installed systems (GetSystemNameList)", SystemList,
     "--sort and --filter hand MODE (a number) to the enumerator's Sort and Filter\n"
     "before the names are read, so the list shows what the enumerator hands out.\n"},
    {"current", "", "print the running system (GetSystemName)", SystemCurrent},
    {"selected", "", "print the system selected for the next start (GetSelectedSystem)", SystemSelected},
    {"select", "SYSTEM", "select a system for the next start (SelectSystem)", SystemSelect},
    {"deselect", "", "deselect the selected system (DeselectSystem)", SystemDeselect},
    {"remove", "SYSTEM", "remove an installed system (RemoveSystem)", SystemRemove},
    {"install", "PACKAGE [--overwrite]", "install a system from a package (InstallNewSystem)", SystemInstall},
    {"install2", "CTRLID CTRLNAME SYSDEF PKGROOT", "install a system from a deployment package (InstallNewSystem2)",
     SystemInstall2},
};
constexpr VerbEntry kBoot[] = {
    {"device", "[DEVICE]", "print the boot device (GetBootDevice), or set it (SetBootDevice)", BootDevice},
    {"spanned", "", "print the number of spanned files (GetNoOfSpannedFiles)", BootSpanned},
    {"load", "", "load the boot image; prints whether it is done (LoadBootImage)", BootLoad},
    {"undo", "", "undo loading the boot image (UndoLoadBootImage)", BootUndo},
};
constexpr VerbEntry kInbox[] = {
    {"state", "", "print the inbox state (GetSysInboxState)", InboxState},
    {"busy", "", "print whether the inbox is busy (IsInboxBusy)", InboxBusy},
    {"path", "", "print the inbox folder (GetInboxPath)", InboxPath},
    {"open", "", "open the inbox (InvokeInboxOperation)", InboxOpen},
    {"clear", "", "clear the inbox (InvokeInboxOperation)", InboxClear},
    {"precheck", "", "check what the inbox holds (InvokeInboxOperation)", InboxPreCheck},
    {"load-completed", "", "tell that loading the inbox is complete (InvokeInboxOperation)", InboxLoadCompleted},
    {"apply", "", "apply the update in the inbox (InvokeInboxOperation)", InboxApply},
    {"version", "TYPE", "print the version of an inbox file (GetVersion)", InboxVersion,
     "TYPE: a TavInboxFileType name or ctrl-manifest, sys-manifest, install-pkg,\n"
     "update-pkg, update-summary, license, ctrl-prod-setting.\n"},
    {"validate", "FOLDER", "validate a deployment package (ValidateDeploymentPackage)", InboxValidate},
    {"upgrade", "FOLDER", "upgrade the boot server (UpgradeBootServer)", InboxUpgrade},
};

}  // namespace

std::span<const GroupEntry> BootGroups() {
    static constexpr GroupEntry kGroups[] = {
        {"system", "Installed controller systems", kSystem},
        {"boot", "The boot device and image", kBoot},
        {"inbox", "The installation inbox", kInbox},
    };
    return kGroups;
}

}  // namespace tavctl
