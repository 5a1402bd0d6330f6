// A camera's information: its current and configured network settings,
// names, MAC address and status (and, in the second generation, the user
// name it logs in with), found by index or by name.
//
// The four grammars are kept as the controller's replies match them, with
// their irregular blanks: no blank before two of the quotes in the by-name
// grammars, "-ConfDNSSuffix", two blanks before "-Status" and "-username".
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

// The info replies say "Program" where the status reply says "Standby";
// any other word is refused.
constexpr WordValue<TavCameraStatus> kInfoStatusWords[] = {{OLESTR("Disconnected"), CameraStatus_Disconnected},
                                                           {OLESTR("Program"), CameraStatus_Program},
                                                           {OLESTR("Running"), CameraStatus_Running},
                                                           {OLESTR("Unconfigured"), CameraStatus_Unconfigured},
                                                           {OLESTR("Unknown"), CameraStatus_Unknown}};

struct InfoTexts {
    const OLECHAR* nullData;
    const OLECHAR* nullOut;
    const OLECHAR* notText;
    const OLECHAR* scanShort;
    const OLECHAR* unknownStatus;
};

// Clients know the first two decoders by the index decoder's texts and by a
// LAN decoder's failure text.
constexpr InfoTexts kByIndexTexts{OLESTR("UnpackCameraInfoUsingIndex. NULL data-variant"),
                                  OLESTR("UnpackCameraInfoUsingIndex. Invalid out pointer"),
                                  OLESTR("UnpackCameraInfoUsingIndex. Invalid argument."),
                                  OLESTR("UnpackLANAdaptorIPConfig failed."),
                                  OLESTR("UnpackCameraInfoUsingIndex received unexpected camera status.")};
constexpr InfoTexts kByNameTexts{OLESTR("UnpackCameraInfoUsingIndex. NULL data-variant"),
                                 OLESTR("UnpackCameraInfoUsingIndex. Invalid out pointer"),
                                 OLESTR("UnpackCameraInfoUsingIndex. Invalid argument."),
                                 OLESTR("UnpackLANAdaptorIPConfig failed."),
                                 OLESTR("UnpackCameraInfo received unexpected camera status.")};
constexpr InfoTexts kByIndex2Texts{OLESTR("UnpackCameraInfoUsingIndex2. NULL data-variant"),
                                   OLESTR("UnpackCameraInfoUsingIndex2. Invalid out pointer"),
                                   OLESTR("UnpackCameraInfoUsingIndex2. Invalid argument."),
                                   OLESTR("UnpackCameraInfoUsingIndex2 failed."),
                                   OLESTR("UnpackCameraInfoUsingIndex2 received unexpected camera status.")};
constexpr InfoTexts kByName2Texts{OLESTR("UnpackCameraInfo2. NULL data-variant"),
                                  OLESTR("UnpackCameraInfo2. Invalid out pointer"),
                                  OLESTR("UnpackCameraInfo2. Invalid argument."), OLESTR("UnpackCameraInfo2 failed."),
                                  OLESTR("UnpackCameraInfo2 received unexpected camera status.")};

// The out-values in reply order: Identity is the camera's name (by index) or
// its index (by name); the user name only in the second generation.
template <class Identity>
struct InfoOuts {
    BSTR *currIp, *currMask, *currGateway, *currHost, *currDnsServer, *currDnsSuffix;
    LONG* currDhcp;
    BSTR *confIp, *confMask, *confGateway, *confHost, *confDnsServer, *confDnsSuffix;
    LONG* confDhcp;
    BSTR* confCameraName;
    Identity* identity;
    BSTR* mac;
    TavCameraStatus* status;
    BSTR* user;
};

template <text::ScanFormat F, class Identity>
HRESULT UnpackInfo(ControllerObject& object, VARIANT* data, const InfoTexts& texts, const InfoOuts<Identity>& o) {
    Reply reply = object.Decode(data);
    static_cast<void>(reply.Initialised().NotNull(texts.nullData));
    const fields::Mapped<TavCameraStatus> status{o.status, kInfoStatusWords, texts.unknownStatus};
    if constexpr (text::kScanFields<F>.size() == 19) {
        return reply
            .OutPointers(texts.nullOut, o.currIp, o.currMask, o.currGateway, o.currHost, o.currDnsServer,
                         o.currDnsSuffix, o.currDhcp, o.confIp, o.confMask, o.confGateway, o.confHost,
                         o.confDnsServer, o.confDnsSuffix, o.confDhcp, o.confCameraName, o.identity, o.mac, o.status,
                         o.user)
            .IsBstr(texts.notText)
            .template Fields<F>(texts.scanShort, o.currIp, o.currMask, o.currGateway, o.currHost, o.currDnsServer,
                                o.currDnsSuffix, o.currDhcp, o.confIp, o.confMask, o.confGateway, o.confHost,
                                o.confDnsServer, o.confDnsSuffix, o.confDhcp, o.confCameraName, o.identity, o.mac,
                                status, o.user);
    } else {
        return reply
            .OutPointers(texts.nullOut, o.currIp, o.currMask, o.currGateway, o.currHost, o.currDnsServer,
                         o.currDnsSuffix, o.currDhcp, o.confIp, o.confMask, o.confGateway, o.confHost,
                         o.confDnsServer, o.confDnsSuffix, o.confDhcp, o.confCameraName, o.identity, o.mac, o.status)
            .IsBstr(texts.notText)
            .template Fields<F>(texts.scanShort, o.currIp, o.currMask, o.currGateway, o.currHost, o.currDnsServer,
                                o.currDnsSuffix, o.currDhcp, o.confIp, o.confMask, o.confGateway, o.confHost,
                                o.confDnsServer, o.confDnsSuffix, o.confDhcp, o.confCameraName, o.identity, o.mac,
                                status);
    }
}

}  // namespace

HRESULT ControllerObject::GetCameraInfoUsingIndex(TavInParams* rip, ULONG index, BSTR* a1, BSTR* a2, BSTR* a3,
                                                  BSTR* a4, BSTR* a5, BSTR* a6, LONG* d1, BSTR* b1, BSTR* b2, BSTR* b3,
                                                  BSTR* b4, BSTR* b5, BSTR* b6, LONG* d2, BSTR* confName, BSTR* name,
                                                  BSTR* mac, TavCameraStatus* status) {
    return Command(rip)
        .ValidParams(OLESTR("GetCameraInfoUsingIndex. Invalid argument."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("LMCameraInfoUsingIndex"), text::Format(OLESTR("-CameraIdx %lu"), index))
        .Decode([&](VARIANT* reply) {
            return UnpackCameraInfoUsingIndex(reply, a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2, confName,
                                              name, mac, status);
        });
}

HRESULT ControllerObject::UnpackCameraInfoUsingIndex(VARIANT* data, BSTR* a1, BSTR* a2, BSTR* a3, BSTR* a4, BSTR* a5,
                                                     BSTR* a6, LONG* d1, BSTR* b1, BSTR* b2, BSTR* b3, BSTR* b4,
                                                     BSTR* b5, BSTR* b6, LONG* d2, BSTR* confName, BSTR* name,
                                                     BSTR* mac, TavCameraStatus* status) {
    return UnpackInfo<OLESTR(
        "-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
        "-currDNSServer \"%40s -currDNSSuffix \"%40s -currIsDHCPEnabled %d -confIPAddress \"%40s "
        "-confSubnetMask \"%40s -confDefaultGateway \"%40s -confHostName \"%40s -confDNSServer \"%40s "
        "-confDNSSuffix \"%40s -confIsDHCPEnabled %d -confCameraName \"%40s -cameraName \"%40s "
        "-macAddress \"%40s -Status \"%20[^\"]")>(
        *this, data, kByIndexTexts,
        InfoOuts<BSTR>{a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2, confName, name, mac, status, nullptr});
}

HRESULT ControllerObject::GetCameraInfo(TavInParams* rip, BSTR cameraName, BSTR* a1, BSTR* a2, BSTR* a3, BSTR* a4,
                                        BSTR* a5, BSTR* a6, LONG* d1, BSTR* b1, BSTR* b2, BSTR* b3, BSTR* b4, BSTR* b5,
                                        BSTR* b6, LONG* d2, BSTR* confName, ULONG* index, BSTR* mac,
                                        TavCameraStatus* status) {
    return Command(rip)
        .ValidParams(OLESTR("GetCameraInfoUsingIndex. Invalid argument."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(SysStringLen(cameraName) > 0, E_INVALIDARG, OLESTR("GetCameraInfo: Empty camera name"))
        .Get(OLESTR("LMCameraInfo"), text::Format(OLESTR("-Camera %s"), ViewOf(cameraName)))
        .Decode([&](VARIANT* reply) {
            return UnpackCameraInfo(reply, a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2, confName, index, mac,
                                    status);
        });
}

HRESULT ControllerObject::UnpackCameraInfo(VARIANT* data, BSTR* a1, BSTR* a2, BSTR* a3, BSTR* a4, BSTR* a5, BSTR* a6,
                                           LONG* d1, BSTR* b1, BSTR* b2, BSTR* b3, BSTR* b4, BSTR* b5, BSTR* b6,
                                           LONG* d2, BSTR* confName, ULONG* index, BSTR* mac,
                                           TavCameraStatus* status) {
    return UnpackInfo<OLESTR(
        "-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
        "-currDNSServer\"%40s -currDNSSuffix \"%40s -currIsDHCPEnabled %d -confIPAddress \"%40s "
        "-confSubnetMask \"%40s -confDefaultGateway \"%40s -confHostName \"%40s -confDNSServer \"%40s "
        "-ConfDNSSuffix \"%40s -confIsDHCPEnabled %d -confCameraName \"%40s -cameraIdx %d "
        "-macAddress\"%40s  -Status \"%20[^\"]")>(
        *this, data, kByNameTexts,
        InfoOuts<ULONG>{a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2, confName, index, mac, status, nullptr});
}

HRESULT ControllerObject::GetCameraInfoUsingIndex2(TavInParams* rip, ULONG index, BSTR* a1, BSTR* a2, BSTR* a3,
                                                   BSTR* a4, BSTR* a5, BSTR* a6, LONG* d1, BSTR* b1, BSTR* b2,
                                                   BSTR* b3, BSTR* b4, BSTR* b5, BSTR* b6, LONG* d2, BSTR* confName,
                                                   BSTR* name, BSTR* mac, TavCameraStatus* status, BSTR* user) {
    return Command(rip)
        .ValidParams(OLESTR("GetCameraInfoUsingIndex2. Invalid argument."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("LMCameraInfoUsingIndex2"), text::Format(OLESTR("-CameraIdx %lu"), index))
        .Decode([&](VARIANT* reply) {
            return UnpackCameraInfoUsingIndex2(reply, a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2,
                                               confName, name, mac, status, user);
        });
}

// The status of the second generation is a word up to the next blank: one
// followed directly by its quote is no status.
HRESULT ControllerObject::UnpackCameraInfoUsingIndex2(VARIANT* data, BSTR* a1, BSTR* a2, BSTR* a3, BSTR* a4, BSTR* a5,
                                                      BSTR* a6, LONG* d1, BSTR* b1, BSTR* b2, BSTR* b3, BSTR* b4,
                                                      BSTR* b5, BSTR* b6, LONG* d2, BSTR* confName, BSTR* name,
                                                      BSTR* mac, TavCameraStatus* status, BSTR* user) {
    return UnpackInfo<OLESTR(
        "-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
        "-currDNSServer \"%40s -currDNSSuffix \"%40s -currIsDHCPEnabled %d -confIPAddress \"%40s "
        "-confSubnetMask \"%40s -confDefaultGateway \"%40s -confHostName \"%40s -confDNSServer \"%40s "
        "-confDNSSuffix \"%40s -confIsDHCPEnabled %d -confCameraName \"%40s -cameraName \"%40s "
        "-macAddress \"%40s -Status \"%20s -username \"%40[^\"]")>(
        *this, data, kByIndex2Texts,
        InfoOuts<BSTR>{a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2, confName, name, mac, status, user});
}

HRESULT ControllerObject::GetCameraInfo2(TavInParams* rip, BSTR cameraName, BSTR* a1, BSTR* a2, BSTR* a3, BSTR* a4,
                                         BSTR* a5, BSTR* a6, LONG* d1, BSTR* b1, BSTR* b2, BSTR* b3, BSTR* b4,
                                         BSTR* b5, BSTR* b6, LONG* d2, BSTR* confName, ULONG* index, BSTR* mac,
                                         TavCameraStatus* status, BSTR* user) {
    return Command(rip)
        .ValidParams(OLESTR("GetCameraInfo2. Invalid argument."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(SysStringLen(cameraName) > 0, E_INVALIDARG, OLESTR("GetCameraInfo2: Empty camera name"))
        .Get(OLESTR("LMCameraInfo2"), text::Format(OLESTR("-Camera %s"), ViewOf(cameraName)))
        .Decode([&](VARIANT* reply) {
            return UnpackCameraInfo2(reply, a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2, confName, index,
                                     mac, status, user);
        });
}

HRESULT ControllerObject::UnpackCameraInfo2(VARIANT* data, BSTR* a1, BSTR* a2, BSTR* a3, BSTR* a4, BSTR* a5, BSTR* a6,
                                            LONG* d1, BSTR* b1, BSTR* b2, BSTR* b3, BSTR* b4, BSTR* b5, BSTR* b6,
                                            LONG* d2, BSTR* confName, ULONG* index, BSTR* mac,
                                            TavCameraStatus* status, BSTR* user) {
    return UnpackInfo<OLESTR(
        "-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
        "-currDNSServer\"%40s -currDNSSuffix \"%40s -currIsDHCPEnabled %d -confIPAddress \"%40s "
        "-confSubnetMask \"%40s -confDefaultGateway \"%40s -confHostName \"%40s -confDNSServer \"%40s "
        "-ConfDNSSuffix \"%40s -confIsDHCPEnabled %d -confCameraName \"%40s -cameraIdx %d "
        "-macAddress\"%40s  -Status \"%20s  -username \"%40[^\"]")>(
        *this, data, kByName2Texts,
        InfoOuts<ULONG>{a1, a2, a3, a4, a5, a6, d1, b1, b2, b3, b4, b5, b6, d2, confName, index, mac, status, user});
}

}  // namespace tav
