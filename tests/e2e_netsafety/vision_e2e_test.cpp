// Vision cameras through ITavLumeret2, with the demo switches that plug
// cameras into the controller's camera network.
#include <array>
#include <functional>

#include "netsafety_fixture.h"
#include "sim/subsystems/vision.h"

namespace tav::e2e {
namespace {

// The out-values of one camera-info call, freed when they go.
struct InfoOuts {
    std::array<Bstr, 6> curr, conf;  // address, mask, gateway, host, DNS server, DNS suffix
    LONG currDhcp = -1, confDhcp = -1;
    Bstr confName, name, mac, user;
    ULONG index = 99;
    TavCameraStatus status = static_cast<TavCameraStatus>(99);

    // Everything but the camera's name or index, which only one kind of call
    // hands out, and the user, which only the second generation does.
    std::string Settings() const {
        std::string text;
        for (const auto* group : {&curr, &conf}) {
            for (const Bstr& value : *group) text += text::Narrow(value.View()) + " ";
            text += "| ";
        }
        return text + "dhcp " + std::to_string(currDhcp) + "/" + std::to_string(confDhcp) + " conf " +
               text::Narrow(confName.View()) + " mac " + text::Narrow(mac.View()) + " status " +
               std::to_string(status);
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

    // Through both generations, which must agree; the index of a by-name
    // call and the name of a by-index call.
    InfoOuts ByIndex(ULONG index) {
        InfoOuts two, one;
        EXPECT_EQ(Cameras()->GetCameraInfoUsingIndex2(nullptr, index, CAMERA_SETTINGS(two), two.name.Receive(),
                                                      two.mac.Receive(), &two.status, two.user.Receive()),
                  S_OK)
            << LastError();
        EXPECT_EQ(Cameras()->GetCameraInfoUsingIndex(nullptr, index, CAMERA_SETTINGS(one), one.name.Receive(),
                                                     one.mac.Receive(), &one.status),
                  S_OK)
            << LastError();
        EXPECT_EQ(one.Settings(), two.Settings());
        EXPECT_EQ(Narrow(one.name), Narrow(two.name));
        return two;
    }
    InfoOuts ByName(const std::string& camera) {
        InfoOuts two, one;
        EXPECT_EQ(Cameras()->GetCameraInfo2(nullptr, Wide(camera).Get(), CAMERA_SETTINGS(two), &two.index,
                                            two.mac.Receive(), &two.status, two.user.Receive()),
                  S_OK)
            << LastError();
        EXPECT_EQ(Cameras()->GetCameraInfo(nullptr, Wide(camera).Get(), CAMERA_SETTINGS(one), &one.index,
                                           one.mac.Receive(), &one.status),
                  S_OK)
            << LastError();
        EXPECT_EQ(one.Settings(), two.Settings());
        EXPECT_EQ(one.index, two.index);
        return two;
    }
    std::string Current(const std::string& camera, std::size_t field) { return Narrow(ByName(camera).curr[field]); }
    ULONG Count() { return Fetch(&ITavLumeret::GetNumberOfCameras); }
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
    HRESULT Rename(ULONG index, const std::string& name) {
        return Cameras()->SetCameraName(nullptr, index, Wide(name).Get());
    }
};

TEST_F(VisionE2eTest, DeliveredCamerasReadTheSameEveryWay) {
    ASSERT_EQ(Count(), 3u);
    struct Expected {
        const char* name;
        const char* settings;
        TavCameraStatus status;
    };
    const Expected cameras[] = {
        {"Gripper",
         "192.168.125.21 255.255.255.0 192.168.125.1 lm-3c4d5e 192.168.125.1 cell.local | "
         "192.168.125.21 255.255.255.0 192.168.125.1 lm-3c4d5e 192.168.125.1 cell.local | "
         "dhcp 0/0 conf Gripper mac 00:1A:2B:3C:4D:5E status 3",
         CameraStatus_Running},
        // DHCP gives it an address; its fixed one is kept for later.
        {"Conveyor",
         "192.168.125.100 255.255.255.0 192.168.125.1 lm-3c4d5f 192.168.125.1 cell.local | "
         "192.168.125.22 255.255.255.0 192.168.125.1 lm-3c4d5f unspec unspec | "
         "dhcp 1/1 conf Conveyor mac 00:1A:2B:3C:4D:5F status 2",
         CameraStatus_Program},
        // Away, it uses nothing.
        {"Pallet",
         "unspec unspec unspec unspec unspec unspec | "
         "192.168.125.23 255.255.255.0 192.168.125.1 lm-3c4e01 192.168.125.1 cell.local | "
         "dhcp 0/0 conf Pallet mac 00:1A:2B:3C:4E:01 status 1",
         CameraStatus_Disconnected},
    };
    for (ULONG index = 0; index < 3; ++index) {
        const Expected& e = cameras[index];
        const InfoOuts byIndex = ByIndex(index);
        const InfoOuts byName = ByName(e.name);
        EXPECT_EQ(byIndex.Settings(), e.settings);
        EXPECT_EQ(byName.Settings(), e.settings);
        EXPECT_EQ(Narrow(byIndex.name), e.name);
        EXPECT_EQ(byName.index, index);
        EXPECT_EQ(Narrow(byIndex.user), "admin");
        // The status reply says "Standby" for program state.
        EXPECT_EQ(Status(e.name), e.status);
        EXPECT_TRUE(Valid(e.name));
    }
    EXPECT_FALSE(Valid("gripper")) << "names compare as written";
    EXPECT_EQ(TextOf(Send("Get", "LMCameraStatus", "-Camera Conveyor")), "Standby");
}

// A camera the command cannot serve (unknown, away, running) or a value the
// controller will not take.
TEST_F(VisionE2eTest, RefusalsCarryAStatusAndTheirCause) {
    auto lumeret = Cameras();
    auto flash = [&](const char* camera) {
        return [=] { return lumeret->FlashCameraLED(nullptr, Wide(camera).Get()); };
    };
    auto dhcp = [&](const char* camera) { return [=] { return lumeret->SetCameraDHCP(nullptr, Wide(camera).Get()); }; };
    auto dns = [&](const char* server, const std::string& suffix) {
        return [=] {
            return lumeret->SetCameraDNSSettings(nullptr, Wide("Conveyor").Get(), Wide(server).Get(),
                                                 Wide(suffix).Get());
        };
    };
    auto status = [&](const char* camera) {
        return [=] {
            TavCameraStatus s{};
            return lumeret->GetCameraStatus(nullptr, Wide(camera).Get(), &s);
        };
    };
    struct Case {
        const char* what;
        std::function<HRESULT()> call;
        HRESULT status;
        const char* text;
    };
    const Case cases[] = {
        {"status of nobody", status("Nobody"), sim::kStatusNotFound, "LMCameraStatus: no camera named \"Nobody\""},
        {"flash nobody", flash("Nobody"), sim::kStatusNotFound, "LMFlashCameraLED: no camera named \"Nobody\""},
        {"rename index 3", [&] { return Rename(3, "Spare"); }, sim::kStatusNotFound,
         "LMCameraName: no camera with index 3"},
        {"credentials index 7",
         [&] { return lumeret->SetCameraUserCredentials(nullptr, 7, Wide("u").Get(), Wide("p").Get()); },
         sim::kStatusNotFound, "LMUserCredentials: no camera with index 7"},
        {"state of an away camera", [&] { return SetState("Pallet", CameraStatus_Program); }, sim::kStatusNotAllowed,
         "LMCameraState: the camera \"Pallet\" is disconnected"},
        {"flash an away camera", flash("Pallet"), sim::kStatusNotAllowed, "is disconnected"},
        {"dhcp while running", dhcp("Gripper"), sim::kStatusNotAllowed,
         "LMCameraDHCP: the camera \"Gripper\" is running; set it to program state first"},
        {"rename while running", [&] { return Rename(0, "Spare"); }, sim::kStatusNotAllowed, "is running"},
        {"a name taken", [&] { return Rename(1, "Gripper"); }, sim::kStatusNotAllowed,
         "another camera is named \"Gripper\""},
        {"a name with a dot", [&] { return Rename(1, "a.b"); }, sim::kStatusBadArgument, "\"a.b\" is no camera name"},
        {"an empty name", [&] { return Rename(1, ""); }, sim::kStatusBadArgument, "is no camera name"},
        {"a mask with holes", [&] { return SetIp("Conveyor", "10.0.0.5", "255.0.255.0", ""); },
         sim::kStatusBadArgument, "is not contiguous"},
        {"no address", [&] { return SetIp("Conveyor", "", "255.255.255.0", ""); }, sim::kStatusBadArgument,
         "expected -Address A -Subnetmask M -Gateway G"},
        {"another camera's address", [&] { return SetIp("Conveyor", "192.168.125.21", "255.255.255.0", ""); },
         sim::kStatusNotAllowed, "another camera uses the address 192.168.125.21"},
        {"a DNS suffix of 41 characters", dns("10.0.0.53", std::string(41, 'd')), sim::kStatusBadArgument,
         "LMCameraDNSSettings: expected -DNSServer"},
        {"a DNS server that is no address", dns("dns.local", "lab"), sim::kStatusBadArgument, "expected -DNSServer"},
        {"a user name with a quote",
         [&] { return lumeret->SetCameraUserCredentials(nullptr, 0, Wide("o\"k").Get(), Wide("p").Get()); },
         sim::kStatusBadArgument, "LMUserCredentials: expected -Username"},
    };
    const std::string conveyor = ByName("Conveyor").Settings();
    for (const Case& c : cases) {
        EXPECT_EQ(c.call(), c.status) << c.what;
        EXPECT_TRUE(ErrorHas(c.text)) << c.what << ": " << LastError();
    }
    EXPECT_EQ(ByName("Conveyor").Settings(), conveyor) << "nothing of a refused change is kept";
    EXPECT_EQ(Narrow(ByIndex(0).user), "admin");
}

TEST_F(VisionE2eTest, SettingsTakeEffectInProgramState) {
    ASSERT_EQ(SetState("Gripper", CameraStatus_Program), S_OK) << LastError();
    EXPECT_EQ(Status("Gripper"), CameraStatus_Program);
    ASSERT_EQ(SetIp("Gripper", "192.168.125.40", "255.255.255.128", ""), S_OK) << LastError();
    ASSERT_EQ(Cameras()->SetCameraDNSSettings(nullptr, Wide("Gripper").Get(), Wide("192.168.125.2").Get(),
                                              Wide("vision.lab").Get()),
              S_OK)
        << LastError();
    EXPECT_EQ(ByName("Gripper").Settings(),
              "192.168.125.40 255.255.255.128 unspec lm-3c4d5e 192.168.125.2 vision.lab | "
              "192.168.125.40 255.255.255.128 unspec lm-3c4d5e 192.168.125.2 vision.lab | "
              "dhcp 0/0 conf Gripper mac 00:1A:2B:3C:4D:5E status 2");

    // DHCP: the server's next address now, the fixed one kept for later,
    // which another camera may then take.
    ASSERT_EQ(Cameras()->SetCameraDHCP(nullptr, Wide("Gripper").Get()), S_OK) << LastError();
    const InfoOuts gripper = ByName("Gripper");
    EXPECT_EQ(Narrow(gripper.curr[0]), "192.168.125.101");
    EXPECT_EQ(Narrow(gripper.conf[0]), "192.168.125.40");
    EXPECT_EQ(gripper.currDhcp + gripper.confDhcp, 2);
    ASSERT_EQ(SetIp("Conveyor", "192.168.125.40", "255.255.255.0", "192.168.125.1"), S_OK) << LastError();
    EXPECT_EQ(Current("Conveyor", 0), "192.168.125.40");
    EXPECT_EQ(ByIndex(1).currDhcp, 0);

    ASSERT_EQ(SetState("Gripper", CameraStatus_Running), S_OK) << LastError();
    EXPECT_EQ(SetIp("Gripper", "192.168.125.41", "255.255.255.0", ""), sim::kStatusNotAllowed);
    EXPECT_EQ(Cameras()->FlashCameraLED(nullptr, Wide("Gripper").Get()), S_OK) << "flashing while running";
}

TEST_F(VisionE2eTest, RenamingAndCredentials) {
    ASSERT_EQ(Rename(1, "Infeed_2"), S_OK) << LastError();
    EXPECT_FALSE(Valid("Conveyor"));
    EXPECT_TRUE(Valid("Infeed_2"));
    EXPECT_EQ(Narrow(ByIndex(1).name), "Infeed_2");
    EXPECT_EQ(Narrow(ByName("Infeed_2").confName), "Infeed_2");
    EXPECT_EQ(Rename(1, "Infeed_2"), S_OK) << "its own name again";

    // The login is the controller's record: kept also for a camera away.
    ASSERT_EQ(Cameras()->SetCameraUserCredentials(nullptr, 2, Wide("line.operator").Get(), Wide("s3cret").Get()),
              S_OK)
        << LastError();
    EXPECT_EQ(Narrow(ByIndex(2).user), "line.operator");
    EXPECT_EQ(Cameras()->SetCameraUserCredentials(nullptr, 1, Wide("viewer").Get(), nullptr), S_OK)
        << "an empty password: " << LastError();
    EXPECT_EQ(Narrow(ByName("Infeed_2").user), "viewer");
}

TEST_F(VisionE2eTest, ARefreshFindsWhatWasPluggedIn) {
    const OLECHAR* fresh = OLESTR("00:1a:2b:3c:4d:60");
    ASSERT_TRUE(sim::PlugCamera(*Model(), fresh));
    for (const OLECHAR* refused :
         {OLESTR("00:1A:2B:3C:4D:60"), OLESTR("00:1A:2B:3C:4D"), OLESTR("00:1A:2B:3C:4D:5E")}) {
        EXPECT_FALSE(sim::PlugCamera(*Model(), refused)) << "plugged already, or no MAC address";
    }
    EXPECT_EQ(Count(), 3u) << "not found before a refresh";

    ASSERT_EQ(Cameras()->RefreshCameras(nullptr), S_OK);
    ASSERT_EQ(Count(), 4u);
    const InfoOuts found = ByIndex(3);
    EXPECT_EQ(Narrow(found.name), "Lumeret-4D60");
    EXPECT_EQ(found.Settings(),
              "192.168.125.101 255.255.255.0 192.168.125.1 lm-3c4d60 192.168.125.1 cell.local | "
              "unspec unspec unspec lm-3c4d60 unspec unspec | dhcp 1/1 conf unspec mac 00:1A:2B:3C:4D:60 status 4");
    EXPECT_EQ(SetState("Lumeret-4D60", CameraStatus_Running), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("is not configured; name it first")) << LastError();
    ASSERT_EQ(Rename(3, "Welder"), S_OK) << LastError();
    EXPECT_EQ(Status("Welder"), CameraStatus_Program) << "named, it is configured";

    // Pulled out it reads Disconnected at once; plugged back it is found
    // again by the next refresh.
    ASSERT_TRUE(sim::UnplugCamera(*Model(), fresh));
    EXPECT_FALSE(sim::UnplugCamera(*Model(), fresh));
    EXPECT_EQ(Status("Welder"), CameraStatus_Disconnected);
    ASSERT_TRUE(sim::PlugCamera(*Model(), fresh));
    ASSERT_TRUE(sim::PlugCamera(*Model(), OLESTR("00:1A:2B:3C:4E:01")));  // Pallet
    EXPECT_EQ(Status("Welder"), CameraStatus_Disconnected);
    ASSERT_EQ(Cameras()->RefreshCameras(nullptr), S_OK);
    EXPECT_EQ(Status("Welder"), CameraStatus_Program);
    EXPECT_EQ(Current("Pallet", 0), "192.168.125.23");

    // One never named and gone is forgotten.
    ASSERT_TRUE(sim::PlugCamera(*Model(), OLESTR("00:1A:2B:3C:4D:61")));
    ASSERT_EQ(Cameras()->RefreshCameras(nullptr), S_OK);
    ASSERT_TRUE(sim::UnplugCamera(*Model(), OLESTR("00:1A:2B:3C:4D:61")));
    EXPECT_EQ(Count(), 5u);
    ASSERT_EQ(Cameras()->RefreshCameras(nullptr), S_OK);
    EXPECT_EQ(Count(), 4u);
    EXPECT_FALSE(Valid("Lumeret-4D61"));
}

}  // namespace
}  // namespace tav::e2e
