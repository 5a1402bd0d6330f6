// Installing new systems, and the installation inbox through which
// deployment packages arrive.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

constexpr WordValue<TavSysInboxState> kInboxStateWords[] = {{OLESTR("error"), TavSysInbox_Error},
                                                            {OLESTR("empty"), TavSysInbox_Empty},
                                                            {OLESTR("open"), TavSysInbox_Open},
                                                            {OLESTR("loaded"), TavSysInbox_Loaded},
                                                            {OLESTR("committed"), TavSysInbox_Committed}};

// The operations and file types are kept as 8-bit texts, widened when sent.
constexpr const char* kOperations[] = {"clear", "open", "precheck", "load_completed", "apply_update"};
constexpr const char* kFileTypes[] = {"CTRL_MANIFEST",         "SYS_MANIFEST",   "INSTALL_PKG_MANIFEST",
                                      "UPDATE_PKG_MANIFEST",   "UPDATE_SUMMARY", "LICENSE",
                                      "CTRL_PROD_SETTING"};

constexpr WordValue<LONG> kBusyWords[] = {{OLESTR("true"), 1}};

template <std::size_t N>
const char* TextOf(const char* const (&texts)[N], LONG value) {
    return value >= 0 && static_cast<std::size_t>(value) < N ? texts[value] : nullptr;
}

// One optional part of the argument text: present only for a value.
void AppendPart(OleString& args, const OLECHAR* key, BSTR value) {
    if (SysStringLen(value) > 0) {
        text::FormatAppend(args, OLESTR(" -%s \"%s\""), ViewOf(key), ViewOf(value));
    }
}

}  // namespace

HRESULT ControllerObject::InstallNewSystem(TavInParams* rip, BSTR packagePath, LONG overwrite) {
    return Command(rip)
        .ValidParams(OLESTR("InstallNewSystem. Invalid TavInParams."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Set(OLESTR("InstallNewSystem"),
             text::Format(OLESTR("%s -system_path \"%s\""), overwrite != 0 ? OLESTR("-overwrite") : OLESTR("-nooverwrite"),
                          ViewOf(packagePath)))
        .StatusOnly();
}

// The parts go in their fixed order, not the parameters'.
HRESULT ControllerObject::InstallNewSystem2(TavInParams* rip, BSTR ctrlId, BSTR ctrlName, BSTR sysDefFolder,
                                            BSTR deploymentPkgRoot) {
    return Command(rip)
        .ValidParams(OLESTR("InstallNewSystem. Invalid TavInParams."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Send(Verb::Set, OLESTR("InstallNewSystem"),
              [&] {
                  OleString args;
                  AppendPart(args, OLESTR("system_path"), sysDefFolder);
                  AppendPart(args, OLESTR("ctrl_name"), ctrlName);
                  AppendPart(args, OLESTR("ctrl_id"), ctrlId);
                  AppendPart(args, OLESTR("dp_pkg_root"), deploymentPkgRoot);
                  return args;
              })
        .StatusOnly();
}

namespace {

HRESULT UnpackSysInboxState(ControllerObject& object, VARIANT* data, TavSysInboxState* state) {
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSysInboxState. NULL data pointer"))
        .OutPointer(state, OLESTR("UnpackSysInboxState. Invalid out pointer"))
        .IsBstr(OLESTR("UnpackSysInboxState. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-state %16s")>(OLESTR("UnpackSysInboxState failed."),
                                       fields::MappedOr<TavSysInboxState>{state, kInboxStateWords,
                                                                          TavSysInbox_Undefined});
}

// Busy is exactly "true"; anything else is not busy.
HRESULT UnpackInboxIsBusy(ControllerObject& object, VARIANT* data, LONG* busy) {
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackInboxIsBusy. NULL data pointer"))
        .OutPointer(busy, OLESTR("UnpackInboxIsBusy. Invalid out pointer"))
        .IsBstr(OLESTR("UnpackInboxIsBusy. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-busy %16s")>(OLESTR("UnpackInboxIsBusy failed."),
                                      fields::MappedOr<LONG>{busy, kBusyWords, 0});
}

HRESULT UnpackInboxPath(ControllerObject& object, VARIANT* data, BSTR* path) {
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackInboxPath. NULL VARIANT"))
        .OutPointers(OLESTR(""), path)
        .IsBstr(OLESTR("UnpackInboxPath. Non-BSTR VARIANT"))
        .Fields<OLESTR("-path \"%260[^\"]")>(OLESTR("UnpackInboxPath failed."), path);
}

HRESULT UnpackGetVersion(ControllerObject& object, VARIANT* data, BSTR* version) {
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackGetVersion. NULL VARIANT"))
        .OutPointers(OLESTR(""), version)
        .IsBstr(OLESTR("UnpackGetVersion. Non-BSTR VARIANT"))
        .Fields<OLESTR("-version \"%260[^\"]")>(OLESTR("UnpackGetVersion failed."), version);
}

}  // namespace

HRESULT ControllerObject::GetSysInboxState(TavInParams* rip, TavSysInboxState* state) {
    return Command(rip)
        .ValidParams(OLESTR("GetSysInboxState. Invalid TavInParams."))
        .OutPointer(state, OLESTR("GetSysInboxState. Invalid out-pointer."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("InboxState"))
        .Decode([&](VARIANT* reply) { return UnpackSysInboxState(*this, reply, state); });
}

HRESULT ControllerObject::IsInboxBusy(TavInParams* rip, LONG* busy) {
    return Command(rip)
        .ValidParams(OLESTR("IsInboxBusy. Invalid TavInParams."))
        .OutPointer(busy, OLESTR("IsInboxBusy. Invalid out-pointer."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("InboxIsBusy"))
        .Decode([&](VARIANT* reply) { return UnpackInboxIsBusy(*this, reply, busy); });
}

HRESULT ControllerObject::GetInboxPath(TavInParams* rip, BSTR* path) {
    return Command(rip)
        .ValidParams(OLESTR("GetInboxPath. Invalid TavInParams."))
        .OutPointer(path, OLESTR("GetInboxPath. Invalid out-pointer."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("InboxPath"))
        .Decode([&](VARIANT* reply) { return UnpackInboxPath(*this, reply, path); });
}

HRESULT ControllerObject::InvokeInboxOperation(TavInParams* rip, TavInboxOperation operation) {
    const char* word = TextOf(kOperations, operation);
    return Command(rip)
        .ValidParams(OLESTR("InvokeInboxOperation: Invalid TavInParams"))
        .Initialised(OLESTR("InvokeInboxOperation. Helper used before initialized."))
        .Require(word != nullptr, E_INVALIDARG, OLESTR("InvokeInboxOperation. Invalid operation."))
        .Send(Verb::Set, OLESTR("InboxOperation"), [&] { return text::Format(OLESTR("-operation %s"), word); })
        .StatusOnly();
}

HRESULT ControllerObject::GetVersion(TavInParams* rip, TavInboxFileType type, BSTR* version) {
    const char* word = TextOf(kFileTypes, type);
    return Command(rip)
        .ValidParams(OLESTR("GetVersion. Invalid TavInParams."))
        .OutPointer(version, OLESTR("GetVersion. Invalid out-pointer."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(word != nullptr, E_INVALIDARG, OLESTR("GetVersion. Invalid file type."))
        .Send(Verb::Get, OLESTR("InboxVersion"), [&] { return text::Format(OLESTR("-Name %s"), word); })
        .Decode([&](VARIANT* reply) { return UnpackGetVersion(*this, reply, version); });
}

// Folders are sent as given, without quotes; the controller judges them.
HRESULT ControllerObject::ValidateDeploymentPackage(TavInParams* rip, BSTR inboxFolder) {
    return Command(rip)
        .ValidParams(OLESTR("ValidateDeploymentPackage: Invalid TavInParams"))
        .Initialised(OLESTR("ValidateDeploymentPackage. Helper used before initialized."))
        .Set(OLESTR("InboxPreInstallCheck"), text::Format(OLESTR("-path %s"), ViewOf(inboxFolder)))
        .StatusOnly();
}

// Reports with the package check's texts, as clients know them.
HRESULT ControllerObject::UpgradeBootServer(TavInParams* rip, BSTR sourceFolder) {
    return Command(rip)
        .ValidParams(OLESTR("ValidateDeploymentPackage: Invalid TavInParams"))
        .Initialised(OLESTR("ValidateDeploymentPackage. Helper used before initialized."))
        .Set(OLESTR("InboxUpgradeBootServer"), text::Format(OLESTR("-path %s"), ViewOf(sourceFolder)))
        .StatusOnly();
}

}  // namespace tav
