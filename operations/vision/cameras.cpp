// The controller's vision cameras: whether one is known, its status, how
// many there are; renaming, program and running state, network settings,
// the LED that finds one, and the credentials the controller logs in with.
// The camera operations check initialisation before their arguments.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

// The longest camera name the controller takes.
constexpr std::size_t kLongestCameraName = 32;

bool NameFits(BSTR name) { return text::UpToNul(ViewOf(name)).size() <= kLongestCameraName; }

// The status reply says "Standby" where the info replies say "Program";
// its own "Program" and any word it does not know read as unknown.
constexpr WordValue<TavCameraStatus> kStatusWords[] = {{OLESTR("Disconnected"), CameraStatus_Disconnected},
                                                       {OLESTR("Standby"), CameraStatus_Program},
                                                       {OLESTR("Running"), CameraStatus_Running},
                                                       {OLESTR("Unconfigured"), CameraStatus_Unconfigured}};

// The number the controller takes for each of the two states a camera may
// be put in; 0 for any other.
ULONG StateNumber(TavCameraStatus state) {
    switch (state) {
    case CameraStatus_Program:
        return 1;
    case CameraStatus_Running:
        return 2;
    default:
        return 0;
    }
}

OleString CameraArgument(BSTR name) { return text::Format(OLESTR("-Camera %s"), ViewOf(name)); }

}  // namespace

HRESULT ControllerObject::IsCameraValid(TavInParams* rip, BSTR name, LONG* valid) {
    return Command(rip)
        .ValidParams(OLESTR("IsCameraValid: Invalid TavInParams"))
        .Initialised(OLESTR("IsCameraValid. TavController used before Initialized"))
        .OutPointer(valid, OLESTR("IsCameraValid. Invalid out-pointer"))
        .Get(OLESTR("LMIsCameraValid"), CameraArgument(name))
        .Decode([&](VARIANT* reply) { return UnpackIsCameraValid(reply, valid); });
}

HRESULT ControllerObject::UnpackIsCameraValid(VARIANT* data, LONG* valid) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackIsCameraValid. NULL data-variant"))
        .OutPointers(OLESTR(""), valid)
        .IsBstr(OLESTR("UnpackIsCameraValid. Non-BSTR variant."))
        .FieldsQuotingReply<OLESTR("-CameraValid %d")>(OLESTR("UnpackIsCameraValid. Bad result string: %s"), valid);
}

HRESULT ControllerObject::GetCameraStatus(TavInParams* rip, BSTR name, TavCameraStatus* status) {
    return Command(rip)
        .ValidParams(OLESTR("GetCameraStatus: Invalid TavInParams"))
        .Initialised(OLESTR("GetCameraStatus. TavController used before Initialized"))
        .OutPointer(status, OLESTR("GetCameraStatus: Invalid out-pointer"))
        .Get(OLESTR("LMCameraStatus"), CameraArgument(name))
        .Decode([&](VARIANT* reply) { return UnpackCameraStatus(reply, status); });
}

// The whole reply is the status word.
HRESULT ControllerObject::UnpackCameraStatus(VARIANT* data, TavCameraStatus* status) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackCameraStatus. NULL VARIANT"))
        .OutPointers(OLESTR(""), status)
        .IsBstr(OLESTR("UnpackCameraStatus. Non-BSTR argument."))
        .Then([&](Reply& reply) {
            *status = WordOr(reply.CText(), kStatusWords, CameraStatus_Unknown);
            return S_OK;
        });
}

HRESULT ControllerObject::GetNumberOfCameras(TavInParams* rip, ULONG* count) {
    return Command(rip)
        .ValidParams(OLESTR("GetNumberOfCameras: Invalid TavInParams"))
        .Initialised(OLESTR("GetNumberOfCameras. TavController used before Initialized"))
        .OutPointer(count, OLESTR("GetNumberOfCameras: Invalid out-pointer"))
        .Get(OLESTR("LMNumberOfCameras"))
        .Decode([&](VARIANT* reply) { return UnpackNumberOfCameras(reply, count); });
}

HRESULT ControllerObject::UnpackNumberOfCameras(VARIANT* data, ULONG* count) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackNumberOfCameras. NULL data-variant"))
        .OutPointers(OLESTR("UnpackNumberOfCameras. Invalid out pointer"), count)
        .IsBstr(OLESTR("UnpackNumberOfCameras. Invalid argument."))
        .Fields<OLESTR("-CameraCount %d")>(OLESTR("UnpackNumberOfCameras failed."), count);
}

HRESULT ControllerObject::SetCameraName(TavInParams* rip, ULONG index, BSTR name) {
    return Command(rip)
        .ValidParams(OLESTR("SetCameraName: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(NameFits(name), E_INVALIDARG, OLESTR("SetCameraName invalid argument"))
        .Set(OLESTR("LMCameraName"), text::Format(OLESTR("-Camera %s -Idx %lu"), ViewOf(name), index))
        .StatusOnly();
}

HRESULT ControllerObject::RefreshCameras(TavInParams* rip) {
    return Command(rip)
        .ValidParams(OLESTR("RefreshCameras: Invalid TavInParams"))
        .Initialised(OLESTR("RefreshCameras. TavController used before Initialized"))
        .Set(OLESTR("LMRefreshCameras"))
        .StatusOnly();
}

// Clients know this operation by an older name in its texts.
HRESULT ControllerObject::SetCameraState(TavInParams* rip, BSTR name, TavCameraStatus state) {
    const ULONG number = StateNumber(state);
    return Command(rip)
        .ValidParams(OLESTR("SetCameraRunning: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(NameFits(name), E_INVALIDARG, OLESTR("SetCameraRunning invalid argument"))
        .Require(number != 0, E_INVALIDARG, OLESTR("Set camera state. Not valid camera state"))
        .Set(OLESTR("LMCameraState"), text::Format(OLESTR("-Camera %s -State %lu"), ViewOf(name), number))
        .StatusOnly();
}

HRESULT ControllerObject::SetCameraIPSettings(TavInParams* rip, BSTR name, BSTR address, BSTR mask, BSTR gateway) {
    return Command(rip)
        .ValidParams(OLESTR("SetCameraIPSettings: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(NameFits(name), E_INVALIDARG, OLESTR("SetCameraIPSettings invalid argument"))
        .Set(OLESTR("LMCameraIPSettings"),
             text::Format(OLESTR("-Camera %s -Address %s -Subnetmask %s -Gateway %s"), ViewOf(name), ViewOf(address),
                          ViewOf(mask), ViewOf(gateway)))
        .StatusOnly();
}

HRESULT ControllerObject::SetCameraDHCP(TavInParams* rip, BSTR name) {
    return Command(rip)
        .ValidParams(OLESTR("SetCameraDHCP: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(NameFits(name), E_INVALIDARG, OLESTR("SetCameraDHCP invalid argument"))
        .Set(OLESTR("LMCameraDHCP"), CameraArgument(name))
        .StatusOnly();
}

HRESULT ControllerObject::SetCameraDNSSettings(TavInParams* rip, BSTR name, BSTR server, BSTR suffix) {
    return Command(rip)
        .ValidParams(OLESTR("SetCameraDNSSettings: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(NameFits(name), E_INVALIDARG, OLESTR("SetCameraDNSSettings invalid argument"))
        .Set(OLESTR("LMCameraDNSSettings"), text::Format(OLESTR("-Camera %s -DNSServer %s -DNSSuffix %s"),
                                                         ViewOf(name), ViewOf(server), ViewOf(suffix)))
        .StatusOnly();
}

HRESULT ControllerObject::FlashCameraLED(TavInParams* rip, BSTR name) {
    return Command(rip)
        .ValidParams(OLESTR("FlashCameraLED: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(NameFits(name), E_INVALIDARG, OLESTR("FlashCameraLED invalid argument"))
        .Set(OLESTR("LMFlashCameraLED"), CameraArgument(name))
        .StatusOnly();
}

HRESULT ControllerObject::SetCameraUserCredentials(TavInParams* rip, ULONG index, BSTR user, BSTR password) {
    return Command(rip)
        .ValidParams(OLESTR("SetCameraUserCredentials: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Set(OLESTR("LMUserCredentials"), text::Format(OLESTR("-Username %s -Password %s -CameraIdx %lu"),
                                                       ViewOf(user), ViewOf(password), index))
        .StatusOnly();
}

}  // namespace tav
