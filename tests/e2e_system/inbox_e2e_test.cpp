// The installation inbox end to end: a deployment package copied in,
// checked and applied, and the operations each state refuses.
#include "system_fixture.h"

namespace tav::e2e {
namespace {

class InboxE2eTest : public SystemFixture {
protected:
    ComPtr<ITavBoot3> Boot() { return As<ITavBoot3>(); }

    TavSysInboxState State() { return Fetch(&ITavBoot3::GetSysInboxState); }
    bool Busy() { return Fetch(&ITavBoot3::IsInboxBusy) == 1; }
    HRESULT Operate(TavInboxOperation operation) { return Boot()->InvokeInboxOperation(nullptr, operation); }
    // Runs an operation that takes time and waits until the inbox is idle.
    HRESULT OperateAndWait(TavInboxOperation operation) {
        const HRESULT hr = Operate(operation);
        EXPECT_TRUE(WaitUntil([&] { return !Busy(); }));
        return hr;
    }
    // The package's files, copied in as a client would.
    void CopyPackageIn() {
        auto files = As<ITavFileManagement>();
        for (const char* name : {"system.manifest", "controller.manifest", "install_package.manifest",
                                 "update_summary.txt", "license.txt"}) {
            ASSERT_EQ(files->CopyFile(nullptr, Wide(std::string("ctrl:/usb1/packages/CellDeployment/") + name).Get(),
                                      Wide("ctrl:/hd0a/inbox").Get()),
                      S_OK)
                << name << ": " << LastError();
        }
        for (const char* folder : {"HOME", "SYSPAR"}) {
            ASSERT_EQ(files->CopyDirectory(nullptr, Wide(std::string("ctrl:/usb1/packages/CellDeployment/") + folder).Get(),
                                           Wide(std::string("ctrl:/hd0a/inbox/") + folder).Get()),
                      S_OK)
                << folder << ": " << LastError();
        }
    }
};

TEST_F(InboxE2eTest, DeploymentPackageIsInstalledThroughTheInbox) {
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("usb1")));
    EXPECT_EQ(State(), TavSysInbox_Empty);
    EXPECT_EQ(FetchText(&ITavBoot3::GetInboxPath), "/hd0a/inbox");

    ASSERT_EQ(Operate(TavInboxOperation_Open), S_OK);
    EXPECT_EQ(State(), TavSysInbox_Open);
    CopyPackageIn();
    ASSERT_EQ(Operate(TavInboxOperation_LoadCompleted), S_OK);
    EXPECT_EQ(State(), TavSysInbox_Loaded);

    Bstr version;
    ASSERT_EQ(Boot()->GetVersion(nullptr, TavInboxFileType_Sys_Manifest, version.Receive()), S_OK);
    EXPECT_EQ(Narrow(version), "7.5.1");
    ASSERT_EQ(Boot()->GetVersion(nullptr, TavInboxFileType_License, version.Receive()), S_OK);
    EXPECT_EQ(Narrow(version), "L-7.5.1");
    EXPECT_EQ(Boot()->GetVersion(nullptr, TavInboxFileType_CtrlProdSetting, version.Receive()), sim::kStatusNotFound);

    EXPECT_EQ(Operate(TavInboxOperation_ApplyUpdate), sim::kStatusNotAllowed) << "not checked yet";
    sim::jobs::SetDuration(*Model(), sim::jobs::Job::Inbox, kLongJob);
    ASSERT_EQ(Operate(TavInboxOperation_PreCheck), S_OK);
    EXPECT_TRUE(Busy());
    EXPECT_EQ(Operate(TavInboxOperation_Clear), sim::kStatusNotAllowed) << "busy";
    ASSERT_TRUE(WaitUntil([&] { return !Busy(); }));
    EXPECT_EQ(State(), TavSysInbox_Loaded);

    sim::jobs::SetDuration(*Model(), sim::jobs::Job::Inbox, 10ms);
    ASSERT_EQ(OperateAndWait(TavInboxOperation_ApplyUpdate), S_OK);
    EXPECT_EQ(State(), TavSysInbox_Committed);
    EXPECT_EQ(Read("hd0a/CellSystem2/HOME/main.mod"), Read("usb1/packages/CellDeployment/HOME/main.mod"));
    EXPECT_TRUE(Exists("hd0a/CellSystem2/TavOS-7.5.1"));

    ASSERT_EQ(Operate(TavInboxOperation_Clear), S_OK);
    EXPECT_EQ(State(), TavSysInbox_Empty);
    EXPECT_FALSE(Exists("hd0a/inbox/system.manifest"));
}

TEST_F(InboxE2eTest, FailedPrecheckLeavesTheInboxInErrorUntilCleared) {
    ASSERT_EQ(Operate(TavInboxOperation_Open), S_OK);
    Write("hd0a/inbox/system.manifest", "name=Half\nversion=1.0\n");
    ASSERT_EQ(Operate(TavInboxOperation_LoadCompleted), S_OK);
    ASSERT_EQ(OperateAndWait(TavInboxOperation_PreCheck), S_OK);
    EXPECT_EQ(State(), TavSysInbox_Error);
    for (auto operation : {TavInboxOperation_Open, TavInboxOperation_LoadCompleted, TavInboxOperation_PreCheck,
                           TavInboxOperation_ApplyUpdate}) {
        EXPECT_EQ(Operate(operation), sim::kStatusNotAllowed) << operation;
    }
    ASSERT_EQ(Operate(TavInboxOperation_Clear), S_OK);
    EXPECT_EQ(State(), TavSysInbox_Empty);
}

TEST_F(InboxE2eTest, EachStateRefusesTheOperationsThatDoNotFollowIt) {
    struct Step {
        TavInboxOperation operation;
        HRESULT hr;
        TavSysInboxState after;
    };
    const HRESULT refused = sim::kStatusNotAllowed;
    const Step steps[] = {
        {TavInboxOperation_LoadCompleted, refused, TavSysInbox_Empty},
        {TavInboxOperation_PreCheck, refused, TavSysInbox_Empty},
        {TavInboxOperation_ApplyUpdate, refused, TavSysInbox_Empty},
        {TavInboxOperation_Open, S_OK, TavSysInbox_Open},
        {TavInboxOperation_Open, refused, TavSysInbox_Open},
        {TavInboxOperation_PreCheck, refused, TavSysInbox_Open},
        {TavInboxOperation_LoadCompleted, S_OK, TavSysInbox_Loaded},
        {TavInboxOperation_LoadCompleted, refused, TavSysInbox_Loaded},
        {TavInboxOperation_Clear, S_OK, TavSysInbox_Empty},
        {TavInboxOperation_Clear, S_OK, TavSysInbox_Empty},
    };
    for (const Step& step : steps) {
        SCOPED_TRACE(step.operation);
        EXPECT_EQ(Operate(step.operation), step.hr) << LastError();
        EXPECT_EQ(State(), step.after);
    }
}

TEST_F(InboxE2eTest, PackageFoldersAreJudgedAsTheyAreNamed) {
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("usb1")));
    Model()->Update([](sim::ModelState& s, sim::EventPosts&) {
        s.Part<sim::FileSystem>().Copy(OLESTR("usb1/packages/CellDeployment"), OLESTR("usb1/my package"));
    });
    struct Case {
        const char* folder;
        HRESULT validate;
        HRESULT upgrade;
    };
    const Case cases[] = {
        {"/usb1/packages/CellDeployment", S_OK, sim::kStatusBadArgument},
        {"/usb1/my package", S_OK, sim::kStatusBadArgument},
        {"ctrl:/usb1/packages/CellDeployment", S_OK, sim::kStatusBadArgument},
        {"/usb1/packages/CellSystem", sim::kStatusBadArgument, sim::kStatusBadArgument},
        {"/usb1/packages/BootServer", sim::kStatusBadArgument, S_OK},
        {"/usb1/nothing", sim::kStatusNotFound, sim::kStatusNotFound},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.folder);
        EXPECT_EQ(Boot()->ValidateDeploymentPackage(nullptr, Wide(c.folder).Get()), c.validate) << LastError();
        EXPECT_EQ(Boot()->UpgradeBootServer(nullptr, Wide(c.folder).Get()), c.upgrade) << LastError();
    }
    EXPECT_EQ(Read("hd0a/BOOTSRV/bootserver.manifest"), "version=3.2.0\n");
}

}  // namespace
}  // namespace tav::e2e
