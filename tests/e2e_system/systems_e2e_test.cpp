// Installed systems, the boot device and the boot image end to end.
#include <vector>

#include "system_fixture.h"

namespace tav::e2e {
namespace {

class SystemsE2eTest : public SystemFixture {
protected:
    ComPtr<ITavBoot3> Boot() { return As<ITavBoot3>(); }

    std::string Selected() { return FetchText(&ITavBoot::GetSelectedSystem); }
    std::vector<std::string> Systems() {
        TavRetrievalParams retrieval{};
        ComPtr<ITavEnumBSTR> names;
        EXPECT_EQ(Boot()->GetSystemNameList(nullptr, &retrieval, &names), S_OK) << LastError();
        std::vector<std::string> all;
        BSTR name = nullptr;
        ULONG fetched = 0;
        while (names && names->RemNext(1, &name, &fetched) == S_OK && fetched == 1) {
            all.push_back(text::Narrow(OleStringView(name, SysStringLen(name))));
            SysFreeString(name);
        }
        EXPECT_EQ(retrieval.noOfElts, static_cast<LONG>(all.size()));
        return all;
    }
    std::string BootDevice() { return FetchText(&ITavBoot::GetBootDevice); }
    ULONG Spanned() { return Fetch(&ITavBoot::GetNoOfSpannedFiles); }
};

TEST_F(SystemsE2eTest, SelectingDeselectingAndRemovingFollowTheRules) {
    EXPECT_EQ(FetchText(&ITavBoot::GetSystemName), "MainSystem");
    EXPECT_EQ(Systems(), (std::vector<std::string>{"MainSystem", "ServiceSystem"}));
    EXPECT_EQ(Selected(), "MainSystem") << "the running system starts next unless another is selected";

    EXPECT_EQ(Boot()->SelectSystem(nullptr, Wide("ServiceSystem").Get()), S_OK);
    EXPECT_EQ(Selected(), "ServiceSystem");
    EXPECT_EQ(Boot()->SelectSystem(nullptr, Wide("NoSuchSystem").Get()), sim::kStatusNotFound);
    EXPECT_EQ(Selected(), "ServiceSystem");
    EXPECT_EQ(Boot()->DeselectSystem(nullptr), S_OK);
    EXPECT_EQ(Selected(), "");

    EXPECT_EQ(Boot()->RemoveSystem(nullptr, Wide("MainSystem").Get()), sim::kStatusNotAllowed);
    EXPECT_NE(LastError().find("is the running system"), std::string::npos) << LastError();
    EXPECT_EQ(Boot()->SelectSystem(nullptr, Wide("ServiceSystem").Get()), S_OK);
    EXPECT_EQ(Boot()->RemoveSystem(nullptr, Wide("ServiceSystem").Get()), S_OK);
    EXPECT_EQ(Systems(), (std::vector<std::string>{"MainSystem"}));
    EXPECT_FALSE(Exists("hd0a/ServiceSystem"));
    EXPECT_EQ(Selected(), "MainSystem") << "a removed selection falls back to the running system";
    EXPECT_EQ(Boot()->RemoveSystem(nullptr, Wide("ServiceSystem").Get()), sim::kStatusNotFound);
}

TEST_F(SystemsE2eTest, BootImageComesFromTheBootDevice) {
    EXPECT_EQ(BootDevice(), "hd0a");
    EXPECT_EQ(Spanned(), 0u);
    LONG done = 7;
    ASSERT_EQ(Boot()->LoadBootImage(nullptr, &done), S_OK);
    EXPECT_EQ(done, 0) << "hd0a holds no boot image";
    EXPECT_EQ(Boot()->UndoLoadBootImage(nullptr), sim::kStatusNotAllowed);
    EXPECT_EQ(Boot()->SetBootDevice(nullptr, Wide("usb1").Get()), sim::kStatusNotFound);

    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("usb1")));
    ASSERT_EQ(Boot()->SetBootDevice(nullptr, Wide("usb1").Get()), S_OK);
    EXPECT_EQ(BootDevice(), "usb1");
    EXPECT_EQ(Spanned(), 2u);
    ASSERT_EQ(Boot()->LoadBootImage(nullptr, &done), S_OK);
    EXPECT_EQ(done, 1);
    EXPECT_EQ(Boot()->UndoLoadBootImage(nullptr), S_OK);
    EXPECT_EQ(Boot()->UndoLoadBootImage(nullptr), sim::kStatusNotAllowed);

    ASSERT_EQ(Boot()->LoadBootImage(nullptr, &done), S_OK);
    ASSERT_TRUE(sim::UnplugDevice(*Model(), OLESTR("usb1")));
    EXPECT_EQ(BootDevice(), "hd0a") << "pulling the boot device out";
    EXPECT_EQ(Boot()->UndoLoadBootImage(nullptr), sim::kStatusNotAllowed) << "the image went with its device";
}

TEST_F(SystemsE2eTest, InstallingFromAPackageCreatesTheSystem) {
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("usb1")));
    const Bstr package = Wide("/usb1/packages/CellSystem");
    ASSERT_EQ(Boot()->InstallNewSystem(nullptr, package.Get(), 0), S_OK) << LastError();
    EXPECT_EQ(Systems(), (std::vector<std::string>{"CellSystem", "MainSystem", "ServiceSystem"}));
    EXPECT_EQ(Read("hd0a/CellSystem/HOME/main.mod"), Read("usb1/packages/CellSystem/HOME/main.mod"));
    EXPECT_TRUE(Exists("hd0a/CellSystem/TavOS-7.5.0/system.manifest"));
    Bstr version;
    ASSERT_EQ(controller_->GetVersionInfoFromSystem(nullptr, Wide("CellSystem").Get(), SystemInfo, version.Receive()), S_OK)
        << LastError();
    EXPECT_EQ(Narrow(version), "TavOS 7.5.0 (virtual controller)");

    EXPECT_EQ(Boot()->InstallNewSystem(nullptr, package.Get(), 0), sim::kStatusNotAllowed);
    Write("hd0a/CellSystem/HOME/local.mod", "kept only without overwrite");
    EXPECT_EQ(Boot()->InstallNewSystem(nullptr, package.Get(), 5), S_OK);
    EXPECT_FALSE(Exists("hd0a/CellSystem/HOME/local.mod"));

    EXPECT_EQ(Boot()->InstallNewSystem(nullptr, Wide("/usb1/packages").Get(), 1), sim::kStatusBadArgument);
    EXPECT_EQ(Boot()->InstallNewSystem(nullptr, Wide("/usb1/nothing").Get(), 1), sim::kStatusNotFound);

    // The running system is never overwritten.
    Write("usb1/packages/CellSystem/system.manifest", "name=MainSystem\nversion=7.5.0\n");
    EXPECT_EQ(Boot()->InstallNewSystem(nullptr, package.Get(), 1), sim::kStatusNotAllowed);
}

TEST_F(SystemsE2eTest, InstallingADeploymentPackageRecordsTheControllerIdentity) {
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("usb1")));
    ASSERT_EQ(Boot()->InstallNewSystem2(nullptr, Wide("ID-7").Get(), Wide("cell 7").Get(), nullptr,
                                        Wide("/usb1/packages/CellDeployment").Get()),
              S_OK)
        << LastError();
    EXPECT_EQ(Read("hd0a/CellSystem2/controller.manifest"), "name=cell 7\nid=ID-7\n");
    // A plain system package is no deployment package.
    EXPECT_EQ(Boot()->InstallNewSystem2(nullptr, nullptr, nullptr, nullptr, Wide("/usb1/packages/CellSystem").Get()),
              sim::kStatusBadArgument);
    EXPECT_NE(LastError().find("is no deployment package"), std::string::npos) << LastError();
    EXPECT_EQ(Boot()->InstallNewSystem2(nullptr, nullptr, nullptr, nullptr, nullptr), sim::kStatusBadArgument);
}

}  // namespace
}  // namespace tav::e2e
