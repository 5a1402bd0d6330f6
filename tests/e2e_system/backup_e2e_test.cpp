// Backups end to end: a backup folder really written from the running
// system, its event and state, and restores that read it back with their
// findings.
#include "system_fixture.h"

namespace tav::e2e {
namespace {

class BackupE2eTest : public SystemFixture {
protected:
    void SetUp() override {
        SystemFixture::SetUp();
        ULONG cookie = 0;
        ASSERT_EQ(Subscribe(sink_.sink, BackupEvents, &cookie), S_OK);
    }

    ComPtr<ITavBackupRestore2> Backups() { return As<ITavBackupRestore2>(); }

    // Takes a backup into `path` (a controller path) and waits for its event.
    void TakeBackup(const std::string& path) {
        const size_t before = sink_->Count();
        ASSERT_EQ(Backups()->Backup(nullptr, Wide(path).Get()), S_OK) << LastError();
        ASSERT_TRUE(sink_->WaitFor(before + 1));
    }

    struct Decoded {
        TavBackupEvent event;
        ULONG sequence;
    };
    Decoded DecodeEvent(const ReceivedEvent& received) {
        Decoded decoded{};
        EXPECT_EQ(Backups()->UnpackBackupEvent(received.data->Get(), &decoded.event, &decoded.sequence), S_OK);
        return decoded;
    }

    HRESULT Check(const std::string& path, ULONG include, ULONG ignore, std::string& findings) {
        Bstr info;
        const HRESULT hr = Backups()->CheckRestore(nullptr, Wide(path).Get(), include, ignore, info.Receive());
        findings = Narrow(info);
        return hr;
    }

    SinkRef sink_;
};

TEST_F(BackupE2eTest, BackupWritesTheSystemAndTellsItsEnd) {
    sim::jobs::SetDuration(*Model(), sim::jobs::Job::Backup, kLongJob);

    ASSERT_EQ(Backups()->Backup(nullptr, Wide("CTRL:/hd0a/backups/b1").Get()), S_OK) << LastError();
    TavBackupState state = BackupState_None;
    ASSERT_EQ(Backups()->GetBackupState(nullptr, &state), S_OK);
    EXPECT_EQ(state, BackupState_InProgress);
    EXPECT_EQ(Backups()->Backup(nullptr, Wide("ctrl:/hd0a/backups/b2").Get()), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("a backup is in progress")) << LastError();

    ASSERT_TRUE(sink_->WaitFor(1));
    const Decoded first = DecodeEvent(sink_->All()[0]);
    EXPECT_EQ(first.event, BackupEvent_Finished);
    EXPECT_EQ(first.sequence, 1u);
    ASSERT_EQ(Backups()->GetBackupState(nullptr, &state), S_OK);
    EXPECT_EQ(state, BackupState_None);

    EXPECT_EQ(Read("hd0a/backups/b1/HOME/main.mod"), Read("hd0a/MainSystem/HOME/main.mod"));
    EXPECT_EQ(Read("hd0a/backups/b1/SYSPAR/MOC.cfg"), Read("hd0a/MainSystem/SYSPAR/MOC.cfg"));
    const std::string manifest = Read("hd0a/backups/b1/BACKINFO/backup.manifest");
    EXPECT_NE(manifest.find("system=MainSystem\n"), std::string::npos) << manifest;
    EXPECT_NE(manifest.find("template=TavOS-7.4.2\n"), std::string::npos) << manifest;

    Bstr info;
    ASSERT_EQ(Backups()->GetVersionInfoFromBackup(nullptr, Wide("ctrl:/hd0a/backups/b1").Get(), info.Receive()), S_OK);
    EXPECT_EQ(Narrow(info).rfind("-System \"MainSystem\" -Version \"TavOS 7.4.2 (virtual controller)\"", 0), 0u)
        << Narrow(info);

    // A second backup is numbered on; one into a folder that holds files is refused.
    sim::jobs::SetDuration(*Model(), sim::jobs::Job::Backup, 10ms);
    TakeBackup("ctrl:/hd0a/backups/b2");
    EXPECT_EQ(DecodeEvent(sink_->All()[1]).sequence, 2u);
    EXPECT_EQ(Backups()->Backup(nullptr, Wide("ctrl:/hd0a/backups/b2").Get()), sim::kStatusNotAllowed);
}

TEST_F(BackupE2eTest, BackupThatDoesNotFitEndsInAnErrorEvent) {
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("usb1"), {.serviceContent = false}));
    ASSERT_TRUE(sim::SetDeviceCapacity(*Model(), OLESTR("usb1"), 10));

    TakeBackup("ctrl:/usb1/b1");
    EXPECT_EQ(DecodeEvent(sink_->All()[0]).event, BackupEvent_Error);
    EXPECT_FALSE(Exists("usb1/b1/BACKINFO"));

    ASSERT_TRUE(sim::SetDeviceReadOnly(*Model(), OLESTR("usb1"), true));
    EXPECT_EQ(Backups()->Backup(nullptr, Wide("ctrl:/usb1/b2").Get()), sim::kStatusWriteProtected);
    EXPECT_EQ(Backups()->Backup(nullptr, Wide("ctrl:/usb9/b2").Get()), sim::kStatusPathNotFound);
}

TEST_F(BackupE2eTest, RestoreBringsBackTheIncludedParts) {
    TakeBackup("ctrl:/hd0a/backups/b1");
    const std::string module = Read("hd0a/MainSystem/HOME/main.mod");
    const std::string config = Read("hd0a/MainSystem/SYSPAR/MOC.cfg");
    Write("hd0a/MainSystem/HOME/main.mod", "changed");
    Write("hd0a/MainSystem/SYSPAR/MOC.cfg", "changed");
    Write("hd0a/MainSystem/HOME/new.mod", "added after the backup");

    std::string findings = "x";
    ASSERT_EQ(Check("ctrl:/hd0a/backups/b1", RestoreInclude_All, RestoreIgnoreMismatch_None, findings), S_OK);
    EXPECT_EQ(findings, "");
    EXPECT_EQ(Read("hd0a/MainSystem/HOME/main.mod"), "changed") << "a check changes nothing";

    Bstr info;
    ASSERT_EQ(Backups()->Restore(nullptr, Wide("ctrl:/hd0a/backups/b1").Get(), RestoreInclude_Modules,
                                 RestoreIgnoreMismatch_None, info.Receive()),
              S_OK);
    EXPECT_EQ(Read("hd0a/MainSystem/HOME/main.mod"), module);
    EXPECT_FALSE(Exists("hd0a/MainSystem/HOME/new.mod"));
    EXPECT_EQ(Read("hd0a/MainSystem/SYSPAR/MOC.cfg"), "changed") << "the configuration was not included";

    ASSERT_EQ(Backups()->Restore2(nullptr, Wide("ctrl:/hd0a/backups/b1").Get(), RestoreInclude_CFG,
                                  RestoreIgnoreMismatch_None, RestoreDeleteDirectory_Yes, info.Receive()),
              S_OK);
    EXPECT_EQ(Read("hd0a/MainSystem/SYSPAR/MOC.cfg"), config);
    EXPECT_FALSE(Exists("hd0a/backups/b1")) << "deleted after the restore";
}

TEST_F(BackupE2eTest, ControllerSettingsComeBackOnlyWhenIncluded) {
    TakeBackup("ctrl:/hd0a/backups/b1");
    auto name = [&] { return sim::Narrow(Model()->Read([](const sim::ModelState& s) { return s.name; })); };
    const std::string original = name();
    Model()->Update([](sim::ModelState& s, sim::EventPosts&) { s.name = OLESTR("renamed"); });

    Bstr info;
    ASSERT_EQ(Backups()->Restore3(nullptr, Wide("ctrl:/hd0a/backups/b1").Get(), RestoreInclude_All, 0,
                                  RestoreIgnoreMismatch_None, RestoreDeleteDirectory_No, info.Receive()),
              S_OK);
    EXPECT_EQ(name(), "renamed");
    ASSERT_EQ(Backups()->Restore3(nullptr, Wide("ctrl:/hd0a/backups/b1").Get(), RestoreInclude_All, 1,
                                  RestoreIgnoreMismatch_None, RestoreDeleteDirectory_No, info.Receive()),
              S_OK);
    EXPECT_EQ(name(), original);
}

TEST_F(BackupE2eTest, FindingsNameWhatStandsInTheWayUnlessIgnored) {
    TakeBackup("ctrl:/hd0a/backups/b1");
    const std::string manifest = Read("hd0a/backups/b1/BACKINFO/backup.manifest");
    auto replaced = [&](const std::string& key, const std::string& value) {
        const size_t at = manifest.find(key + "=");
        const size_t end = manifest.find('\n', at);
        return manifest.substr(0, at) + key + "=" + value + manifest.substr(end);
    };
    Model()->Update([&](sim::ModelState& s, sim::EventPosts&) {
        auto& files = s.Part<sim::FileSystem>();
        files.Remove(OLESTR("hd0a/backups/other_id"));
        files.Copy(OLESTR("hd0a/backups/b1"), OLESTR("hd0a/backups/other_id"));
        files.Copy(OLESTR("hd0a/backups/b1"), OLESTR("hd0a/backups/other_template"));
        files.Copy(OLESTR("hd0a/backups/b1"), OLESTR("hd0a/backups/no_home"));
        files.Remove(OLESTR("hd0a/backups/no_home/HOME"));
        files.MakeFolders(OLESTR("hd0a/backups/not_a_backup"));
    });
    Write("hd0a/backups/other_id/BACKINFO/backup.manifest", replaced("system_id", "{00000000-0000-0000-0000-000000000000}"));
    Write("hd0a/backups/other_template/BACKINFO/backup.manifest", replaced("template", "TavOS-7.3.0"));

    struct Case {
        const char* path;
        ULONG include;
        ULONG ignore;
        HRESULT hr;
        const char* finding;  // a part of the findings; empty for none
    };
    const Case cases[] = {
        {"ctrl:/hd0a/backups/none", RestoreInclude_All, RestoreIgnoreMismatch_All, sim::kStatusNotFound,
         "Directory hd0a/backups/none does not exist."},
        {"ctrl:/hd0a/backups/not_a_backup", RestoreInclude_All, RestoreIgnoreMismatch_All, sim::kStatusNotAllowed,
         "holds no backup"},
        {"ctrl:/hd0a/backups/other_id", RestoreInclude_All, RestoreIgnoreMismatch_None, sim::kStatusNotAllowed,
         "System id mismatch: the backup is of {00000000-0000-0000-0000-000000000000}"},
        {"ctrl:/hd0a/backups/other_id", RestoreInclude_All, RestoreIgnoreMismatch_TemplateId, sim::kStatusNotAllowed,
         "System id mismatch"},
        {"ctrl:/hd0a/backups/other_id", RestoreInclude_All, RestoreIgnoreMismatch_SystemId, S_OK, ""},
        {"ctrl:/hd0a/backups/other_template", RestoreInclude_All, RestoreIgnoreMismatch_None, sim::kStatusNotAllowed,
         "Template mismatch: the backup is of TavOS-7.3.0, this system of TavOS-7.4.2."},
        {"ctrl:/hd0a/backups/other_template", RestoreInclude_All, RestoreIgnoreMismatch_TemplateId, S_OK, ""},
        {"ctrl:/hd0a/backups/no_home", RestoreInclude_All, RestoreIgnoreMismatch_All, sim::kStatusNotAllowed,
         "Directory HOME is missing in the backup."},
        {"ctrl:/hd0a/backups/no_home", RestoreInclude_CFG, RestoreIgnoreMismatch_None, S_OK, ""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.path) + " ignore " + std::to_string(c.ignore));
        std::string findings;
        EXPECT_EQ(Check(c.path, c.include, c.ignore, findings), c.hr);
        if (*c.finding == '\0') {
            EXPECT_EQ(findings, "");
        } else {
            EXPECT_NE(findings.find(c.finding), std::string::npos) << findings;
        }
    }
    // A refused restore leaves the system as it was.
    Write("hd0a/MainSystem/HOME/main.mod", "kept");
    Bstr info;
    EXPECT_EQ(Backups()->Restore(nullptr, Wide("ctrl:/hd0a/backups/other_template").Get(), RestoreInclude_All,
                                 RestoreIgnoreMismatch_None, info.Receive()),
              sim::kStatusNotAllowed);
    EXPECT_EQ(Read("hd0a/MainSystem/HOME/main.mod"), "kept");

    EXPECT_EQ(Backups()->GetVersionInfoFromBackup(nullptr, Wide("ctrl:/hd0a/backups/none").Get(), info.Receive()),
              sim::kStatusNotFound);
    EXPECT_EQ(Backups()->GetVersionInfoFromBackup(nullptr, Wide("ctrl:/hd0a/MainSystem").Get(), info.Receive()),
              sim::kStatusBadArgument);
    EXPECT_TRUE(ErrorHas("holds no backup")) << LastError();
}

}  // namespace
}  // namespace tav::e2e
