// A camera's current and configured network settings, its name, index, MAC
// address, status and user name, found by the camera's name.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

// The camera-info replies say "Program" where the status reply says
// "Standby"; any other word is refused.
constexpr WordValue<TavCameraStatus> kInfoStatusWords[] = {{OLESTR("Disconnected"), CameraStatus_Disconnected},
                                                           {OLESTR("Program"), CameraStatus_Program},
                                                           {OLESTR("Running"), CameraStatus_Running},
                                                           {OLESTR("Unconfigured"), CameraStatus_Unconfigured},
                                                           {OLESTR("Unknown"), CameraStatus_Unknown}};

}  // namespace

HRESULT ControllerObject::GetCameraInfo2(TavInParams* rip, BSTR cameraName, BSTR* currIp, BSTR* currMask,
                                         BSTR* currGateway, BSTR* currHost, BSTR* currDnsServer, BSTR* currDnsSuffix,
                                         LONG* currDhcp, BSTR* confIp, BSTR* confMask, BSTR* confGateway,
                                         BSTR* confHost, BSTR* confDnsServer, BSTR* confDnsSuffix, LONG* confDhcp,
                                         BSTR* confCameraName, ULONG* cameraIdx, BSTR* mac, TavCameraStatus* status,
                                         BSTR* userName) {
    return Command(rip)
        .ValidParams(OLESTR("GetCameraInfo2. Invalid argument."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(!ViewOf(cameraName).empty(), E_INVALIDARG, OLESTR("GetCameraInfo2: Empty camera name"))
        .Get(OLESTR("LMCameraInfo2"), text::Format(OLESTR("-Camera %s"), ViewOf(cameraName)))
        .Decode([&](VARIANT* reply) {
            return UnpackCameraInfo2(reply, currIp, currMask, currGateway, currHost, currDnsServer, currDnsSuffix,
                                     currDhcp, confIp, confMask, confGateway, confHost, confDnsServer, confDnsSuffix,
                                     confDhcp, confCameraName, cameraIdx, mac, status, userName);
        });
}

HRESULT ControllerObject::UnpackCameraInfo2(VARIANT* data, BSTR* currIp, BSTR* currMask, BSTR* currGateway,
                                            BSTR* currHost, BSTR* currDnsServer, BSTR* currDnsSuffix, LONG* currDhcp,
                                            BSTR* confIp, BSTR* confMask, BSTR* confGateway, BSTR* confHost,
                                            BSTR* confDnsServer, BSTR* confDnsSuffix, LONG* confDhcp,
                                            BSTR* confCameraName, ULONG* cameraIdx, BSTR* mac,
                                            TavCameraStatus* status, BSTR* userName) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackCameraInfo2. NULL data-variant"))
        .OutPointers(OLESTR("UnpackCameraInfo2. Invalid out pointer"), currIp, currMask, currGateway, currHost,
                     currDnsServer, currDnsSuffix, currDhcp, confIp, confMask, confGateway, confHost, confDnsServer,
                     confDnsSuffix, confDhcp, confCameraName, cameraIdx, mac, status, userName)
        .IsBstr(OLESTR("UnpackCameraInfo2. Invalid argument."))
        // The controller's replies match this text as it stands: no blank before two of the
        // quotes, "-ConfDNSSuffix", two blanks before "-Status" and "-username".
        .Fields<OLESTR("-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
                       "-currDNSServer\"%40s -currDNSSuffix \"%40s -currIsDHCPEnabled %d -confIPAddress \"%40s "
                       "-confSubnetMask \"%40s -confDefaultGateway \"%40s -confHostName \"%40s "
                       "-confDNSServer \"%40s -ConfDNSSuffix \"%40s -confIsDHCPEnabled %d -confCameraName \"%40s "
                       "-cameraIdx %d -macAddress\"%40s  -Status \"%20s  -username \"%40[^\"]")>(
            OLESTR("UnpackCameraInfo2 failed."), currIp, currMask, currGateway, currHost, currDnsServer,
            currDnsSuffix, currDhcp, confIp, confMask, confGateway, confHost, confDnsServer, confDnsSuffix, confDhcp,
            confCameraName, cameraIdx, mac,
            fields::Mapped<TavCameraStatus>{status, kInfoStatusWords,
                                            OLESTR("UnpackCameraInfo2 received unexpected camera status.")},
            userName);
}

}  // namespace tav
