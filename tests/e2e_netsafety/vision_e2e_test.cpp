// Vision cameras through ITavLumeret2, with the demo switches that plug
// cameras into the controller's camera network.
#include <array>
#include <functional>

#include "netsafety_fixture.h"
#include "sim/subsystems/vision.h"

namespace tav::e2e {
namespace {

// Everything the camera-info operations hand out, as text.
struct CameraInfo {
    std::array<std::string, 6> current, configured;  // address, mask, gateway, host, DNS server, DNS suffix
    LONG currentDhcp = -1, configuredDhcp = -1;
    std::string configuredName, name, mac, user;
    ULONG index = 99;
    TavCameraStatus status = static_cast<TavCameraStatus>(99);
};

// The out-values of one call, freed when they go.
struct InfoOuts {
    std::array<Bstr, 6> curr, conf;
    LONG currDhcp = -1, confDhcp = -1;
    Bstr confName, name, mac, user;
    ULONG index = 99;
    TavCameraStatus status = static_cast<TavCameraStatus>(99);

    CameraInfo Read() const {
        CameraInfo info;
        for (std::size_t i = 0; i < 6; ++i) {
            info.current[i] = text::Narrow(curr[i].View());
            info.configured[i] = text::Narrow(conf[i].View());
        }
        info.currentDhcp = currDhcp;
        info.configuredDhcp = confDhcp;
        info.configuredName = text::Narrow(confName.View());
        info.name = text::Narrow(name.View());
        info.mac = text::Narrow(mac.View());
        info.user = text::Narrow(user.View());
        info.index = index;
        info.status = status;
        return info;
    }
};

#define CAMERA_SETTINGS(o)                                                                                    \
    (o).curr[0].Receive(), (o).curr[1].Receive(), (o).curr[2].Receive(), (o).curr[3].Receive(),               \
        (o).curr[4].Receive(), (o).curr[5].Receive(), &(o).currDhcp, (o).conf[0].Receive(), (o).conf[1].Receive(), \
        (o).conf[2].Receive(), (o).conf[3].Receive(), (o).conf[4].Receive(), (o).conf[5].Receive(), &(o).confDhcp, \
        (o).confName.Receive()

class VisionE2eTest : public NetSafetyFixture {
protected:
    ComPtr<ITavLumeret2> Cameras() { return As<ITavLumeret2>(); }

    // By index through the second generation, checked against the first.
    CameraInfo ByIndex(ULONG index) {
        InfoOuts two, one;
        EXPECT_EQ(Cameras()->GetCameraInfoUsingIndex2(nullptr, index, CAMERA_SETTINGS(two), two.name.Receive(),
                                                      two.mac.Receive(), &two.status, two.user.Receive()),
                  S_OK)
            << LastError();
        EXPECT_EQ(Cameras()->GetCameraInfoUsingIndex(nullptr, index, CAMERA_SETTINGS(one), one.name.Receive(),
                                                     one.mac.Receive(), &one.status),
                  S_OK)
            << LastError();
        CameraInfo info = two.Read(), first = one.Read();
        first.user = info.user;
        EXPECT_EQ(Same(first, info), "") << "index " << index;
        info.index = index;
        return info;
    }
    // By name through both generations; they must agree with each other.
    CameraInfo ByName(const std::string& camera) {
        InfoOuts two, one;
        EXPECT_EQ(Cameras()->GetCameraInfo2(nullptr, Wide(camera).Get(), CAMERA_SETTINGS(two), &two.index,
                                            two.mac.Receive(), &two.status, two.user.Receive()),
                  S_OK)
            << LastError();
        EXPECT_EQ(Cameras()->GetCameraInfo(nullptr, Wide(camera).Get(), CAMERA_SETTINGS(one), &one.index,
                                           one.mac.Receive(), &one.status),
                  S_OK)
            << LastError();
        CameraInfo info = two.Read(), first = one.Read();
        first.user = info.user;
        EXPECT_EQ(Same(first, info), "") << camera;
        info.name = camera;
        return info;
    }
    // What differs, named; empty when nothing does.
    static std::string Same(const CameraInfo& a, const CameraInfo& b) {
        std::string differs;
        for (std::size_t i = 0; i < 6; ++i) {
            if (a.current[i] != b.current[i]) differs += " current[" + std::to_string(i) + "]";
            if (a.configured[i] != b.configured[i]) differs += " configured[" + std::to_string(i) + "]";
        }
        if (a.currentDhcp != b.currentDhcp || a.configuredDhcp != b.configuredDhcp) differs += " dhcp";
        if (a.configuredName != b.configuredName || a.name != b.name) differs += " name";
        if (a.mac != b.mac || a.user != b.user || a.index != b.index || a.status != b.status) differs += " other";
        return differs;
    }
    ULONG Count() {
        ULONG count = 0;
        EXPECT_EQ(Cameras()->GetNumberOfCameras(nullptr, &count), S_OK) << LastError();
        return count;
    }
    TavCameraStatus Status(const std::string& camera) {
        TavCameraStatus status = static_cast<TavCameraStatus>(99);
        EXPECT_EQ(Cameras()->GetCameraStatus(nullptr, Wide(camera).Get(), &status), S_OK) << LastError();
        return status;
    }
    bool Valid(const std::string& camera) {
        LONG valid = -1;
        EXPECT_EQ(Cameras()->IsCameraValid(nullptr, Wide(camera).Get(), &valid), S_OK) << LastError();
        return valid == 1;
    }
    HRESULT SetState(const std::string& camera, TavCameraStatus state) {
        return Cameras()->SetCameraState(nullptr, Wide(camera).Get(), state);
    }
    HRESULT SetIp(const std::string& camera, const char* address, const char* mask, const char* gateway) {
        return Cameras()->SetCameraIPSettings(nullptr, Wide(camera).Get(), Wide(address).Get(), Wide(mask).Get(),
                                              Wide(gateway).Get());
    }
    HRESULT Refresh() { return Cameras()->RefreshCameras(nullptr); }
};

TEST_F(VisionE2eTest, DeliveredCamerasReadTheSameEveryWay) {
    ASSERT_EQ(Count(), 3u);
    struct Expected {
        const char* name;
        const char* mac;
        TavCameraStatus infoStatus;
        TavCameraStatus statusReply;
        std::array<const char*, 6> current;
        std::array<const char*, 6> configured;
        LONG currentDhcp, configuredDhcp;
    };
    const Expected cameras[] = {
        {"Gripper", "00:1A:2B:3C:4D:5E", CameraStatus_Running, CameraStatus_Running,
         {"192.168.125.21", "255.255.255.0", "192.168.125.1", "lm-3c4d5e", "192.168.125.1", "cell.local"},
         {"192.168.125.21", "255.255.255.0", "192.168.125.1", "lm-3c4d5e", "192.168.125.1", "cell.local"}, 0, 0},
        // Its fixed address is kept while DHCP gives it another one.
        {"Conveyor", "00:1A:2B:3C:4D:5F", CameraStatus_Program, CameraStatus_Program,
         {"192.168.125.100", "255.255.255.0", "192.168.125.1", "lm-3c4d5f", "192.168.125.1", "cell.local"},
         {"192.168.125.22", "255.255.255.0", "192.168.125.1", "lm-3c4d5f", "unspec", "unspec"}, 1, 1},
        // Away: it uses nothing now.
        {"Pallet", "00:1A:2B:3C:4E:01", CameraStatus_Disconnected, CameraStatus_Disconnected,
         {"unspec", "unspec", "unspec", "unspec", "unspec", "unspec"},
         {"192.168.125.23", "255.255.255.0", "192.168.125.1", "lm-3c4e01", "192.168.125.1", "cell.local"}, 0, 0},
    };
    for (ULONG index = 0; index < 3; ++index) {
        const Expected& e = cameras[index];
        const CameraInfo byIndex = ByIndex(index);
        EXPECT_EQ(Same(byIndex, ByName(e.name)), "") << e.name;
        EXPECT_EQ(byIndex.name, e.name);
        EXPECT_EQ(byIndex.configuredName, e.name);
        EXPECT_EQ(byIndex.mac, e.mac);
        EXPECT_EQ(byIndex.user, "admin");
        EXPECT_EQ(byIndex.status, e.infoStatus);
        for (std::size_t i = 0; i < 6; ++i) {
            EXPECT_EQ(byIndex.current[i], e.current[i]) << e.name << " current " << i;
            EXPECT_EQ(byIndex.configured[i], e.configured[i]) << e.name << " configured " << i;
        }
        EXPECT_EQ(byIndex.currentDhcp, e.currentDhcp) << e.name;
        EXPECT_EQ(byIndex.configuredDhcp, e.configuredDhcp) << e.name;
        // The status reply says "Standby" for program state; the module
        // reads that as Program too.
        EXPECT_EQ(Status(e.name), e.statusReply) << e.name;
        EXPECT_TRUE(Valid(e.name));
    }
    EXPECT_FALSE(Valid("gripper")) << "names compare as written";
    EXPECT_EQ(TextOf(Send("Get", "LMCameraStatus", "-Camera Conveyor")), "Standby");
}

// Each command with a camera it cannot serve: unknown, away, running, or a
// value the controller will not take.
TEST_F(VisionE2eTest, RefusalsCarryAStatusAndTheirCause) {
    auto lumeret = Cameras();
    auto named = [&](HRESULT (*call)(ITavLumeret2*, BSTR), const char* camera) {
        return [=] { return call(lumeret.Get(), Wide(camera).Get()); };
    };
    auto status = [](ITavLumeret2* l, BSTR c) {
        TavCameraStatus s{};
        return l->GetCameraStatus(nullptr, c, &s);
    };
    auto info = [](ITavLumeret2* l, BSTR c) {
        InfoOuts o;
        return l->GetCameraInfo2(nullptr, c, CAMERA_SETTINGS(o), &o.index, o.mac.Receive(), &o.status,
                                 o.user.Receive());
    };
    auto program = [](ITavLumeret2* l, BSTR c) { return l->SetCameraState(nullptr, c, CameraStatus_Program); };
    auto ip = [](ITavLumeret2* l, BSTR c) {
        return l->SetCameraIPSettings(nullptr, c, Bstr(OLESTR("192.168.125.60")).Get(),
                                      Bstr(OLESTR("255.255.255.0")).Get(), Bstr(OLESTR("192.168.125.1")).Get());
    };
    auto dhcp = [](ITavLumeret2* l, BSTR c) { return l->SetCameraDHCP(nullptr, c); };
    auto dns = [](ITavLumeret2* l, BSTR c) {
        return l->SetCameraDNSSettings(nullptr, c, Bstr(OLESTR("10.0.0.53")).Get(), Bstr(OLESTR("lab")).Get());
    };
    auto flash = [](ITavLumeret2* l, BSTR c) { return l->FlashCameraLED(nullptr, c); };
    auto rename = [&](ULONG index, const char* name) {
        return [=] { return lumeret->SetCameraName(nullptr, index, Wide(name).Get()); };
    };

    struct Case {
        const char* what;
        std::function<HRESULT()> call;
        HRESULT status;
        const char* text;
    };
    const Case cases[] = {
        {"status of nobody", named(status, "Nobody"), sim::kStatusNotFound, "LMCameraStatus: no camera named \"Nobody\""},
        {"info of nobody", named(info, "Nobody"), sim::kStatusNotFound, "LMCameraInfo2: no camera named \"Nobody\""},
        {"state of nobody", named(program, "Nobody"), sim::kStatusNotFound, "no camera named"},
        {"ip of nobody", named(ip, "Nobody"), sim::kStatusNotFound, "no camera named"},
        {"dhcp of nobody", named(dhcp, "Nobody"), sim::kStatusNotFound, "no camera named"},
        {"dns of nobody", named(dns, "Nobody"), sim::kStatusNotFound, "no camera named"},
        {"flash nobody", named(flash, "Nobody"), sim::kStatusNotFound, "LMFlashCameraLED: no camera named"},
        {"rename index 3", rename(3, "Spare"), sim::kStatusNotFound, "LMCameraName: no camera with index 3"},
        {"credentials index 7",
         [&] { return lumeret->SetCameraUserCredentials(nullptr, 7, Bstr(OLESTR("u")).Get(), Bstr(OLESTR("p")).Get()); },
         sim::kStatusNotFound, "LMUserCredentials: no camera with index 7"},
        {"state of an away camera", named(program, "Pallet"), sim::kStatusNotAllowed,
         "LMCameraState: the camera \"Pallet\" is disconnected"},
        {"ip of an away camera", named(ip, "Pallet"), sim::kStatusNotAllowed, "is disconnected"},
        {"flash an away camera", named(flash, "Pallet"), sim::kStatusNotAllowed, "is disconnected"},
        {"rename an away camera", rename(2, "Spare"), sim::kStatusNotAllowed, "is disconnected"},
        {"ip while running", named(ip, "Gripper"), sim::kStatusNotAllowed,
         "LMCameraIPSettings: the camera \"Gripper\" is running; set it to program state first"},
        {"dhcp while running", named(dhcp, "Gripper"), sim::kStatusNotAllowed, "is running"},
        {"dns while running", named(dns, "Gripper"), sim::kStatusNotAllowed, "is running"},
        {"rename while running", rename(0, "Spare"), sim::kStatusNotAllowed, "is running"},
        {"a name taken", rename(1, "Gripper"), sim::kStatusNotAllowed, "another camera is named \"Gripper\""},
        {"a name with a dot", rename(1, "a.b"), sim::kStatusBadArgument, "\"a.b\" is no camera name"},
        {"an empty name", rename(1, ""), sim::kStatusBadArgument, "is no camera name"},
        {"a mask with holes", [&] { return SetIp("Conveyor", "10.0.0.5", "255.0.255.0", ""); },
         sim::kStatusBadArgument, "is not contiguous"},
        {"no address", [&] { return SetIp("Conveyor", "", "255.255.255.0", ""); }, sim::kStatusBadArgument,
         "expected -Address A -Subnetmask M -Gateway G"},
        {"another camera's address", [&] { return SetIp("Conveyor", "192.168.125.21", "255.255.255.0", ""); },
         sim::kStatusNotAllowed, "another camera uses the address 192.168.125.21"},
        {"a DNS suffix of 41 characters",
         [&] {
             return lumeret->SetCameraDNSSettings(nullptr, Wide("Conveyor").Get(), Wide("10.0.0.53").Get(),
                                                  Wide(std::string(41, 'd')).Get());
         },
         sim::kStatusBadArgument, "LMCameraDNSSettings: expected -DNSServer"},
        {"a DNS server that is no address",
         [&] {
             return lumeret->SetCameraDNSSettings(nullptr, Wide("Conveyor").Get(), Wide("dns.local").Get(),
                                                  Wide("lab").Get());
         },
         sim::kStatusBadArgument, "expected -DNSServer"},
        {"a user name with a quote",
         [&] { return lumeret->SetCameraUserCredentials(nullptr, 0, Wide("o\"k").Get(), Wide("p").Get()); },
         sim::kStatusBadArgument, "LMUserCredentials: expected -Username"},
    };
    const CameraInfo conveyor = ByName("Conveyor");
    for (const Case& c : cases) {
        EXPECT_EQ(c.call(), c.status) << c.what;
        EXPECT_TRUE(ErrorHas(c.text)) << c.what << ": " << LastError();
    }
    EXPECT_EQ(Same(ByName("Conveyor"), conveyor), "") << "nothing of a refused change is kept";
    EXPECT_EQ(Status("Gripper"), CameraStatus_Running);
    EXPECT_EQ(ByIndex(0).user, "admin");
}

TEST_F(VisionE2eTest, SettingsTakeEffectInProgramState) {
    ASSERT_EQ(SetState("Gripper", CameraStatus_Program), S_OK) << LastError();
    EXPECT_EQ(Status("Gripper"), CameraStatus_Program);

    ASSERT_EQ(SetIp("Gripper", "192.168.125.40", "255.255.255.128", ""), S_OK) << LastError();
    CameraInfo gripper = ByName("Gripper");
    EXPECT_EQ(gripper.current[0], "192.168.125.40");
    EXPECT_EQ(gripper.current[1], "255.255.255.128");
    EXPECT_EQ(gripper.current[2], "unspec") << "no gateway";
    EXPECT_EQ(gripper.configured[0], "192.168.125.40");

    ASSERT_EQ(Cameras()->SetCameraDNSSettings(nullptr, Wide("Gripper").Get(), Wide("192.168.125.2").Get(),
                                              Wide("vision.lab").Get()),
              S_OK)
        << LastError();
    gripper = ByName("Gripper");
    EXPECT_EQ(gripper.current[4], "192.168.125.2");
    EXPECT_EQ(gripper.configured[5], "vision.lab");

    // DHCP: the server's address now, the fixed one kept for later; each
    // camera keeps its own lease.
    ASSERT_EQ(Cameras()->SetCameraDHCP(nullptr, Wide("Gripper").Get()), S_OK) << LastError();
    gripper = ByName("Gripper");
    EXPECT_EQ(gripper.current[0], "192.168.125.101");
    EXPECT_EQ(gripper.configured[0], "192.168.125.40");
    EXPECT_EQ(gripper.currentDhcp, 1);
    EXPECT_EQ(gripper.configuredDhcp, 1);

    // Conveyor may take the fixed address Gripper no longer uses.
    EXPECT_EQ(SetIp("Conveyor", "192.168.125.40", "255.255.255.0", "192.168.125.1"), S_OK) << LastError();
    const CameraInfo conveyor = ByIndex(1);
    EXPECT_EQ(conveyor.current[0], "192.168.125.40");
    EXPECT_EQ(conveyor.currentDhcp, 0);
    EXPECT_EQ(conveyor.configuredDhcp, 0);

    ASSERT_EQ(SetState("Gripper", CameraStatus_Running), S_OK) << LastError();
    EXPECT_EQ(SetIp("Gripper", "192.168.125.41", "255.255.255.0", ""), sim::kStatusNotAllowed);
    EXPECT_EQ(Cameras()->FlashCameraLED(nullptr, Wide("Gripper").Get()), S_OK) << "flashing does not need program state";
}

TEST_F(VisionE2eTest, RenamingAndCredentials) {
    ASSERT_EQ(Cameras()->SetCameraName(nullptr, 1, Wide("Infeed_2").Get()), S_OK) << LastError();
    EXPECT_FALSE(Valid("Conveyor"));
    EXPECT_TRUE(Valid("Infeed_2"));
    EXPECT_EQ(ByIndex(1).name, "Infeed_2");
    EXPECT_EQ(ByName("Infeed_2").configuredName, "Infeed_2");
    EXPECT_EQ(ByName("Infeed_2").index, 1u);
    EXPECT_EQ(Cameras()->SetCameraName(nullptr, 1, Wide("Infeed_2").Get()), S_OK) << "its own name again";

    // The login is the controller's record: kept also for a camera away.
    ASSERT_EQ(Cameras()->SetCameraUserCredentials(nullptr, 2, Wide("line.operator").Get(), Wide("s3cret").Get()),
              S_OK)
        << LastError();
    EXPECT_EQ(ByIndex(2).user, "line.operator");
    EXPECT_EQ(Cameras()->SetCameraUserCredentials(nullptr, 1, Wide("viewer").Get(), nullptr), S_OK)
        << "an empty password: " << LastError();
    EXPECT_EQ(ByName("Infeed_2").user, "viewer");
}

TEST_F(VisionE2eTest, ARefreshFindsWhatWasPluggedIn) {
    const OLECHAR* fresh = OLESTR("00:1a:2b:3c:4d:60");
    ASSERT_TRUE(sim::PlugCamera(*Model(), fresh));
    EXPECT_FALSE(sim::PlugCamera(*Model(), OLESTR("00:1A:2B:3C:4D:60"))) << "already plugged";
    EXPECT_FALSE(sim::PlugCamera(*Model(), OLESTR("00:1A:2B:3C:4D"))) << "no MAC address";
    EXPECT_FALSE(sim::PlugCamera(*Model(), OLESTR("00:1A:2B:3C:4D:5E"))) << "Gripper is plugged in";
    EXPECT_EQ(Count(), 3u) << "not found before a refresh";

    ASSERT_EQ(Refresh(), S_OK);
    ASSERT_EQ(Count(), 4u);
    CameraInfo found = ByIndex(3);
    EXPECT_EQ(found.name, "Lumeret-4D60");
    EXPECT_EQ(found.configuredName, "unspec");
    EXPECT_EQ(found.mac, "00:1A:2B:3C:4D:60");
    EXPECT_EQ(found.status, CameraStatus_Unconfigured);
    EXPECT_EQ(found.current[0], "192.168.125.101") << "a factory camera asks for DHCP";
    EXPECT_EQ(found.configured[0], "unspec");
    EXPECT_EQ(found.configuredDhcp, 1);
    EXPECT_EQ(SetState("Lumeret-4D60", CameraStatus_Running), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("is not configured; name it first")) << LastError();

    ASSERT_EQ(Cameras()->SetCameraName(nullptr, 3, Wide("Welder").Get()), S_OK) << LastError();
    EXPECT_EQ(Status("Welder"), CameraStatus_Program) << "named, it is configured";
    ASSERT_EQ(SetState("Welder", CameraStatus_Running), S_OK) << LastError();

    // Pulled out it reads Disconnected at once; plugged back it is found
    // again by the next refresh, as it was configured.
    ASSERT_TRUE(sim::UnplugCamera(*Model(), fresh));
    EXPECT_FALSE(sim::UnplugCamera(*Model(), fresh));
    EXPECT_EQ(Status("Welder"), CameraStatus_Disconnected);
    ASSERT_TRUE(sim::PlugCamera(*Model(), fresh));
    EXPECT_EQ(Status("Welder"), CameraStatus_Disconnected);
    ASSERT_TRUE(sim::PlugCamera(*Model(), OLESTR("00:1A:2B:3C:4E:01")));  // Pallet
    ASSERT_EQ(Refresh(), S_OK);
    EXPECT_EQ(Status("Welder"), CameraStatus_Program);
    EXPECT_EQ(Status("Pallet"), CameraStatus_Program);
    EXPECT_EQ(ByName("Pallet").current[0], "192.168.125.23");

    // A camera never named and gone is forgotten by the next refresh.
    ASSERT_TRUE(sim::PlugCamera(*Model(), OLESTR("00:1A:2B:3C:4D:61")));
    ASSERT_EQ(Refresh(), S_OK);
    ASSERT_EQ(Count(), 5u);
    ASSERT_TRUE(sim::UnplugCamera(*Model(), OLESTR("00:1A:2B:3C:4D:61")));
    EXPECT_EQ(Status("Lumeret-4D61"), CameraStatus_Disconnected);
    ASSERT_EQ(Refresh(), S_OK);
    EXPECT_EQ(Count(), 4u);
    EXPECT_FALSE(Valid("Lumeret-4D61"));
}

}  // namespace
}  // namespace tav::e2e
