// What changes the safety controller's configuration: validation, the safety
// mode, reconfiguration, software sync, locking, the factory reset, and
// loading a configuration file, copied from the pendant first when it is a
// local one.
#include "core/controller_object.h"
#include "core/text/format.h"
#include "operations/safety/safety_mode_words.h"

namespace tav {
namespace {

// Where a local configuration file is put on the controller before it is loaded.
constexpr OleStringView kUploadDirectory = OLESTR("/hd0a/temp/safety");

// The file's name: what follows the last separator of a local path.
OleStringView FileNameOf(OleStringView path) {
    const std::size_t separator = path.find_last_of(OLESTR("/\\:"));
    return separator == OleStringView::npos ? path : path.substr(separator + 1);
}

HRESULT SetNamed(ControllerObject& object, TavInParams* rip, BSTR name, const OLECHAR* invalidParams,
                 const OLECHAR* command) {
    return object.Command(rip)
        .ValidParams(invalidParams)
        .Initialised(OLESTR("TavController used before Initialized"))
        .Send(Verb::Set, ViewOf(command), [&] { return text::Format(OLESTR("-Name \"%s\""), ViewOf(name)); })
        .StatusOnly();
}

HRESULT SetPlain(ControllerObject& object, TavInParams* rip, const OLECHAR* invalidParams, const OLECHAR* command) {
    return object.Command(rip)
        .ValidParams(invalidParams)
        .Initialised(OLESTR("TavController used before Initialized"))
        .Set(ViewOf(command))
        .StatusOnly();
}

}  // namespace

HRESULT ControllerObject::SetSafetyConfigurationValidated(TavInParams* rip, BSTR validatedBy) {
    return SetNamed(*this, rip, validatedBy, OLESTR("SetSafetyConfigurationValidated: Invalid TavInParams"),
                    OLESTR("SafetyConfValidated"));
}

HRESULT ControllerObject::SetSafetyConfigurationNotValidated(TavInParams* rip) {
    return SetPlain(*this, rip, OLESTR("SetSafetyConfigurationNotValidated: Invalid TavInParams"),
                    OLESTR("VantorNotValidated"));
}

HRESULT ControllerObject::SetSafetyMode(TavInParams* rip, TavVantorSafetyMode mode) {
    const OLECHAR* word = WordOf(mode, kSafetyModeWords);
    return Command(rip)
        .ValidParams(OLESTR("SetSafetyMode: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(word != nullptr, E_INVALIDARG, OLESTR("SetSafetyMode: Invalid mode"))
        .Send(Verb::Set, OLESTR("VantorSafetyMode"), [&] { return text::Format(OLESTR("-Mode %s"), ViewOf(word)); })
        .StatusOnly();
}

HRESULT ControllerObject::Reconfigure(TavInParams* rip) {
    return SetPlain(*this, rip, OLESTR("Reconfigure: Invalid TavInParams"), OLESTR("VantorReconfigure"));
}

HRESULT ControllerObject::SyncSoftware(TavInParams* rip, INT driveModule) {
    return Command(rip)
        .ValidParams(OLESTR("SyncSoftware: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Set(OLESTR("VantorSyncSoftware"), text::Format(OLESTR("-driver_module %d"), driveModule))
        .StatusOnly();
}

HRESULT ControllerObject::SetSafetyConfigurationLocked(TavInParams* rip, BSTR lockedBy) {
    return SetNamed(*this, rip, lockedBy, OLESTR("SetSafetyConfigurationLocked: Invalid TavInParams"),
                    OLESTR("LockSupervConfig"));
}

HRESULT ControllerObject::SetSafetyConfigurationUnLocked(TavInParams* rip) {
    return SetPlain(*this, rip, OLESTR("SetSafetyConfigurationUnLocked: Invalid TavInParams"),
                    OLESTR("VantorUnlockSuperv"));
}

HRESULT ControllerObject::ResetSafetyControllerToFactoryDefault(TavInParams* rip) {
    return SetPlain(*this, rip, OLESTR("ResetSafetyControllerToFactoryDefault. Invalid TavInParams."),
                    OLESTR("ResetSafetyController"));
}

// A controller path is loaded as it is; a local file is first copied into
// the controller's upload directory, made when needed, and loaded from there.
HRESULT ControllerObject::LoadSafetyConfigurationFile(TavInParams* rip, BSTR configFile) {
    const OleStringView path = ViewOf(configFile);
    const bool local = !HasControllerPrefix(path);
    OleStringView converted;
    OleString controllerPath;
    const Bstr directory(kUploadDirectory);
    Bstr target;
    return Command(rip)
        .ValidParams(OLESTR("LoadSafetyConfigurationFile: Invalid TavInParams"))
        .Initialised(OLESTR("LoadSafetyConfigurationFile used before Initialized"))
        .Require(!path.empty(), E_INVALIDARG, OLESTR("LoadSafetyConfigurationFile. Empty filepath"))
        .ControllerOrLocalPath(configFile,
                               OLESTR("LoadSafetyConfigurationFile - Invalid controller path. Backslash not allowed."),
                               &converted)
        .Require([&] { return !local || !FileNameOf(path).empty(); }, E_INVALIDARG,
                 text::Format(OLESTR("Failed to get filename from path: %s"), path).c_str())
        .Invoke(
            [&] {
                if (!local) {
                    return S_OK;
                }
                controllerPath = OleString(kUploadDirectory) + OLESTR("/") + OleString(FileNameOf(path));
                target = Bstr(controllerPath);
                return file_->CreateControllerDirectory(nullptr, Url(), directory.Get());
            },
            text::Format(OLESTR("Failed to create ctrl directory %s"), kUploadDirectory))
        .Invoke([&] { return local ? file_->CopyFileToController(nullptr, Url(), configFile, target.Get()) : S_OK; },
                text::Format(OLESTR("Failed to download %s to %s"), path,
                             OleString(kUploadDirectory) + OLESTR("/") + OleString(FileNameOf(path))))
        .Send(Verb::Set, OLESTR("VantorLoadSupervConfig"),
              [&] {
                  return text::Format(OLESTR("-File \"%s\""), local ? OleStringView(controllerPath) : converted);
              })
        .StatusOnly();
}

}  // namespace tav
