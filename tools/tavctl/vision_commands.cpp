// Vision cameras, by name or by index.
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using L = ITavLumeret;
using L2 = ITavLumeret2;

// Every out-value of the camera-info operations, in their order.
struct CameraInfo {
    tav::Bstr currAddress, currMask, currGateway, currHost, currDnsServer, currDnsSuffix;
    LONG currDhcp = 0;
    tav::Bstr confAddress, confMask, confGateway, confHost, confDnsServer, confDnsSuffix;
    LONG confDhcp = 0;
    tav::Bstr confName, name, mac, user;
    ULONG index = 0;
    TavCameraStatus status = CameraStatus_Unknown;

    Record ToRecord(bool byIndex) const {
        Record record{{byIndex ? "name" : "index", byIndex ? Show(name) : Show(index)},
                      {"status", Show(status)},
                      {"mac", Show(mac)},
                      {"user", Show(user)},
                      {"currAddress", Show(currAddress)},
                      {"currMask", Show(currMask)},
                      {"currGateway", Show(currGateway)},
                      {"currHost", Show(currHost)},
                      {"currDnsServer", Show(currDnsServer)},
                      {"currDnsSuffix", Show(currDnsSuffix)},
                      {"currDhcp", AsBoolean(currDhcp)},
                      {"confName", Show(confName)},
                      {"confAddress", Show(confAddress)},
                      {"confMask", Show(confMask)},
                      {"confGateway", Show(confGateway)},
                      {"confHost", Show(confHost)},
                      {"confDnsServer", Show(confDnsServer)},
                      {"confDnsSuffix", Show(confDnsSuffix)},
                      {"confDhcp", AsBoolean(confDhcp)}};
        return record;
    }
};

// The settings part of the out-list, the same in every camera-info call.
#define TAVCTL_CAMERA_SETTINGS(c)                                                                        \
    (c).currAddress.Receive(), (c).currMask.Receive(), (c).currGateway.Receive(), (c).currHost.Receive(), \
        (c).currDnsServer.Receive(), (c).currDnsSuffix.Receive(), &(c).currDhcp, (c).confAddress.Receive(), \
        (c).confMask.Receive(), (c).confGateway.Receive(), (c).confHost.Receive(),                        \
        (c).confDnsServer.Receive(), (c).confDnsSuffix.Receive(), &(c).confDhcp, (c).confName.Receive()

int ReadByName(Verb& v, const tav::Bstr& camera, CameraInfo& info, bool print) {
    const auto lumeret = v.Interface<L2>();
    return v.session.Read(
        "GetCameraInfo2",
        [&](TavInParams* rip) {
            return lumeret->GetCameraInfo2(rip, camera.Get(), TAVCTL_CAMERA_SETTINGS(info), &info.index,
                                           info.mac.Receive(), &info.status, info.user.Receive());
        },
        [&](VARIANT* data) {
            return lumeret->UnpackCameraInfo2(data, TAVCTL_CAMERA_SETTINGS(info), &info.index, info.mac.Receive(),
                                              &info.status, info.user.Receive());
        },
        [&] {
            if (print) v.session.Show(info.ToRecord(false));
        });
}

HRESULT ReadByIndex(Verb& v, ULONG index, CameraInfo& info) {
    const auto lumeret = v.Interface<L2>();
    TavInParams rip = v.session.SyncParams();
    return lumeret->GetCameraInfoUsingIndex2(&rip, index, TAVCTL_CAMERA_SETTINGS(info), info.name.Receive(),
                                             info.mac.Receive(), &info.status, info.user.Receive());
}

int ShowCamera(Verb& v) {
    const auto index = v.NumberOption<ULONG>("--index");
    if (!index) {
        const auto camera = v.Text("CAMERA");
        v.End();
        CameraInfo info;
        return ReadByName(v, camera, info, true);
    }
    v.End();
    const auto lumeret = v.Interface<L2>();
    CameraInfo info;
    return v.session.Read(
        "GetCameraInfoUsingIndex2",
        [&](TavInParams* rip) {
            return lumeret->GetCameraInfoUsingIndex2(rip, *index, TAVCTL_CAMERA_SETTINGS(info), info.name.Receive(),
                                                     info.mac.Receive(), &info.status, info.user.Receive());
        },
        [&](VARIANT* data) {
            return lumeret->UnpackCameraInfoUsingIndex2(data, TAVCTL_CAMERA_SETTINGS(info), info.name.Receive(),
                                                        info.mac.Receive(), &info.status, info.user.Receive());
        },
        [&] { v.session.Show(info.ToRecord(true)); });
}

int Count(Verb& v) {
    v.End();
    return v.Get("GetNumberOfCameras", &L::GetNumberOfCameras, &L::UnpackNumberOfCameras);
}

// The cameras one by one through their indexes (the count first).
int CameraList(Verb& v) {
    v.End();
    const auto lumeret = v.Interface<L>();
    ULONG count = 0;
    TavInParams rip = v.session.SyncParams();
    if (const HRESULT hr = lumeret->GetNumberOfCameras(&rip, &count); FAILED(hr)) {
        return v.session.Fail("GetNumberOfCameras", hr);
    }
    std::vector<Record> table;
    for (ULONG index = 0; index < count; ++index) {
        CameraInfo info;
        if (const HRESULT hr = ReadByIndex(v, index, info); FAILED(hr)) {
            return v.session.Fail("GetCameraInfoUsingIndex2(" + std::to_string(index) + ")", hr);
        }
        table.push_back({{"index", Show(index)},
                         {"name", Show(info.name)},
                         {"status", Show(info.status)},
                         {"address", Show(info.currAddress)},
                         {"mac", Show(info.mac)}});
    }
    v.session.Show(table);
    return kExitOk;
}

int Valid(Verb& v) {
    const auto camera = v.Text("CAMERA");
    v.End();
    return v.GetShown(AsBoolean, "IsCameraValid", &L::IsCameraValid, &L::UnpackIsCameraValid, camera.Get());
}

int CameraStatus(Verb& v) {
    const auto camera = v.Text("CAMERA");
    v.End();
    return v.Get("GetCameraStatus", &L::GetCameraStatus, &L::UnpackCameraStatus, camera.Get());
}

int Rename(Verb& v) {
    const auto index = v.Number<ULONG>("INDEX");
    const auto name = v.Text("NAME");
    v.End();
    return v.Set("SetCameraName", &L::SetCameraName, index, name.Get());
}

int CameraState(Verb& v) {
    const auto camera = v.Text("CAMERA");
    const auto state = v.Enum<TavCameraStatus>("STATE");
    v.End();
    return v.Set("SetCameraState", &L::SetCameraState, camera.Get(), state);
}

int Ip(Verb& v) {
    const auto camera = v.Text("CAMERA");
    const auto address = v.Text("ADDRESS");
    const auto mask = v.Text("MASK");
    const auto gateway = v.Text("GATEWAY");
    v.End();
    return v.Set("SetCameraIPSettings", &L::SetCameraIPSettings, camera.Get(), address.Get(), mask.Get(),
                 gateway.Get());
}

int Dns(Verb& v) {
    const auto camera = v.Text("CAMERA");
    const auto server = v.Text("SERVER");
    const auto suffix = v.Text("SUFFIX");
    v.End();
    return v.Set("SetCameraDNSSettings", &L::SetCameraDNSSettings, camera.Get(), server.Get(), suffix.Get());
}

int Dhcp(Verb& v) {
    const auto camera = v.Text("CAMERA");
    v.End();
    return v.Set("SetCameraDHCP", &L::SetCameraDHCP, camera.Get());
}

int Flash(Verb& v) {
    const auto camera = v.Text("CAMERA");
    v.End();
    return v.Set("FlashCameraLED", &L::FlashCameraLED, camera.Get());
}

int Refresh(Verb& v) {
    v.End();
    return v.Set("RefreshCameras", &L::RefreshCameras);
}

int Credentials(Verb& v) {
    const auto index = v.Number<ULONG>("INDEX");
    const auto user = v.Text("USER");
    const auto password = v.Text("PASSWORD");
    v.End();
    return v.Set("SetCameraUserCredentials", &L2::SetCameraUserCredentials, index, user.Get(), password.Get());
}

constexpr VerbEntry kCamera[] = {
    {"list", "", "list the cameras (GetNumberOfCameras, GetCameraInfoUsingIndex2)", CameraList},
    {"count", "", "print the number of cameras (GetNumberOfCameras)", Count},
    {"valid", "CAMERA", "tell whether a camera name is valid (IsCameraValid)", Valid},
    {"status", "CAMERA", "print a camera's status (GetCameraStatus)", CameraStatus},
    {"info", "CAMERA | --index N", "print everything about a camera (GetCameraInfo2, GetCameraInfoUsingIndex2)",
     ShowCamera},
    {"rename", "INDEX NAME", "rename a camera (SetCameraName)", Rename},
    {"state", "CAMERA STATE", "set a camera's state (SetCameraState)", CameraState,
     "STATE: a TavCameraStatus name (CameraStatus_Program, CameraStatus_Running, ...),\n"
     "or its last part (program, running).\n"},
    {"ip", "CAMERA ADDRESS MASK GATEWAY", "set a camera's IP settings (SetCameraIPSettings)", Ip},
    {"dns", "CAMERA SERVER SUFFIX", "set a camera's DNS settings (SetCameraDNSSettings)", Dns},
    {"dhcp", "CAMERA", "let a camera use DHCP (SetCameraDHCP)", Dhcp},
    {"flash", "CAMERA", "flash a camera's LED (FlashCameraLED)", Flash},
    {"refresh", "", "look for cameras again (RefreshCameras)", Refresh},
    {"credentials", "INDEX USER PASSWORD", "set a camera's user credentials (SetCameraUserCredentials)",
     Credentials},
};

}  // namespace

std::span<const GroupEntry> VisionGroups() {
    static constexpr GroupEntry kGroups[] = {{"camera", "Vision cameras", kCamera}};
    return kGroups;
}

}  // namespace tavctl
