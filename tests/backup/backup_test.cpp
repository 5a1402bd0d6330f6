// Backup, restore and their replies.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class BackupTest : public ControllerTest {};

TEST_F(BackupTest, CommandsFollowTheCallPattern) {
    TestBstr info;
    TavBackupState state{};
    const CallPattern patterns[] = {
        {[](ControllerObject& o, TavInParams* r, bool) { return o.Backup(r, TestBstr("ctrl:/bak").Get()); },
         "Backup. Invalid TavInParams.", "Backup. Helper used before initialized.", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.Restore(r, TestBstr("ctrl:/bak").Get(), 1, 0, n ? nullptr : info.Out());
         },
         "Restore. Invalid argument.", "TavController used before Initialized", "pErrInfo == NULL"},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetBackupState(r, n ? nullptr : &state); },
         "GetBackupState - Invalid argument.", "TavController used before Initialized",
         "GetBackupState - Invalid out-parameter."},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetVersionInfoFromBackup(r, TestBstr("ctrl:/bak").Get(), n ? nullptr : info.Out());
         },
         "TavController::GetVersionInfoFromBackup: Invalid TavInParams.",
         "TavController::GetVersionInfoFromBackup. TavController used before Initialized",
         "TavController::GetVersionInfoFromBackup: Invalid out-pointer"},
    };
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams);
        ExpectCallPattern(pattern);
    }
}

TEST_F(BackupTest, RestoresSendOneArgumentTextInSignedDecimals) {
    struct Case {
        std::function<HRESULT(ControllerObject&, BSTR, BSTR*)> call;
        const char* command;
        const char* args;
    };
    const Case cases[] = {
        {[](ControllerObject& o, BSTR p, BSTR* e) { return o.Restore(nullptr, p, 65535, 2, e); }, "Restore",
         "-Path \"/bak/b1\" -Include 65535 -Ignore 2 -DeleteDir 0"},
        {[](ControllerObject& o, BSTR p, BSTR* e) { return o.CheckRestore(nullptr, p, 1, 0, e); }, "CheckRestore",
         "-Path \"/bak/b1\" -Include 1 -Ignore 0 -DeleteDir 0"},
        {[](ControllerObject& o, BSTR p, BSTR* e) { return o.Restore2(nullptr, p, 2, 65535, 1, e); }, "Restore",
         "-Path \"/bak/b1\" -Include 2 -Ignore 65535 -DeleteDir 1"},
        {[](ControllerObject& o, BSTR p, BSTR* e) { return o.Restore3(nullptr, p, 3, 0, 1, 2147483648u, e); },
         "Restore", "-Path \"/bak/b1\" -Include 3 -Ignore 1 -DeleteDir -2147483648 -IncludeCtrlSettings 0"},
        {[](ControllerObject& o, BSTR p, BSTR* e) { return o.CheckRestore3(nullptr, p, 1, 4294967295u, 0, e); },
         "CheckRestore", "-Path \"/bak/b1\" -Include 1 -Ignore 0 -DeleteDir 0 -IncludeCtrlSettings -1"},
    };
    ControllerObject* object = Make();
    const TestBstr path("CTRL:/bak/b1");
    for (const Case& c : cases) {
        SCOPED_TRACE(c.args);
        TestBstr findings;
        ASSERT_EQ(c.call(*object, path.Get(), findings.Out()), S_OK);
        EXPECT_EQ(LastCommand().verb, "Set");
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
        EXPECT_TRUE(findings.IsNull()) << "a reply without findings";
    }
}

TEST_F(BackupTest, PathsAreCheckedBeforeAnythingIsSent) {
    struct Case {
        const char* path;
        const char* backupError;   // Backup's text
        const char* restoreError;  // the restore routine's
        const char* versionError;  // GetVersionInfoFromBackup's
    };
    const Case cases[] = {
        {"", "", "", ""},
        {"   ", "", "", ""},
        {"c:/bak", "Backup - Only controller path allowed.", "Restore - Only controller path allowed.",
         "Backup - Only controller path allowed."},
        {"ctrl:/bak\\b1", "Backup - Invalid controller path. Backslash not allowed.",
         "Restore - Invalid controller path. Backslash not allowed.",
         "GetVersionInfoFromBackup - Invalid controller path. Backslash not allowed."},
        {"ctrl:", "Backup. Controller path empty", "Restore. Controller path empty",
         "GetVersionInfoFromBackup. Controller path empty"},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.path);
        const TestBstr path(c.path);
        TestBstr out;
        EXPECT_EQ(object->Backup(nullptr, path.Get()), E_INVALIDARG);
        EXPECT_TRUE(HasError(c.backupError));
        EXPECT_EQ(object->Restore3(nullptr, path.Get(), 1, 0, 0, 0, out.Out()), E_INVALIDARG);
        EXPECT_TRUE(HasError(c.restoreError));
        EXPECT_EQ(object->GetVersionInfoFromBackup(nullptr, path.Get(), out.Out()), E_INVALIDARG);
        EXPECT_TRUE(HasError(c.versionError));
    }
    TestBstr out;
    EXPECT_EQ(object->GetVersionInfoFromBackup(nullptr, nullptr, out.Out()), E_INVALIDARG);
    EXPECT_TRUE(HasError("GetVersionInfoFromBackup: Invalid argument"));
    EXPECT_EQ(CommandCount(), 0u);

    ASSERT_EQ(object->Backup(nullptr, TestBstr("CtRl:/bak/b1").Get()), S_OK);
    EXPECT_EQ(LastCommand().args, "-Path \"/bak/b1\"");
}

// A failed restore's reply carries the findings: they are handed out and
// the reply's own text is the error.
TEST_F(BackupTest, FindingsOfAFailedRestoreAreHandedOut) {
    ControllerObject* object = Make();
    Script("Restore", "-RestoreErrInfo \"other system id\"", static_cast<HRESULT>(0xC0049003));
    TestBstr findings;
    EXPECT_EQ(object->Restore(nullptr, TestBstr("ctrl:/bak").Get(), 1, 0, findings.Out()),
              static_cast<HRESULT>(0xC0049003));
    EXPECT_EQ(findings.Text(), "other system id");
    EXPECT_TRUE(HasAdoptedError("-RestoreErrInfo \"other system id\""));
}

TEST_F(BackupTest, RestoreFindingsDecode) {
    struct Case {
        std::function<TestVariant()> reply;
        HRESULT result;
        const char* findings;  // nullptr: no string
        const char* error;
    };
    const Case cases[] = {
        {[] { return TestVariant::Text("-RestoreErrInfo \"a \\\"b\" c\""); }, S_OK, "a \\", nullptr},
        {[] { return TestVariant::Text("-Status 0 -RestoreErrInfo \"\""); }, S_OK, "", nullptr},
        {[] { return TestVariant::Text("-RestoreErrInfo\"x\""); }, S_OK, nullptr, nullptr},
        {[] { return TestVariant::Text("nothing"); }, S_OK, nullptr, nullptr},
        {[] { return TestVariant::Number(4); }, S_OK, nullptr, nullptr},
        {[] { return TestVariant::Text("-RestoreErrInfo x"); }, E_FAIL, nullptr,
         "UnpackRestoreErrorInfo. first == NULL"},
        {[] { return TestVariant::Text("-RestoreErrInfo \"x"); }, E_FAIL, nullptr,
         "UnpackRestoreErrorInfo. last == NULL"},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        TestVariant reply = c.reply();
        TestBstr findings;
        EXPECT_EQ(object->UnpackRestoreErrorInfo(reply.Get(), findings.Out()), c.result);
        if (c.findings != nullptr) {
            EXPECT_EQ(findings.Text(), c.findings);
        } else {
            EXPECT_TRUE(findings.IsNull());
        }
        if (c.error != nullptr) {
            EXPECT_TRUE(HasError(c.error));
        }
    }
    // The out-pointer comes first, before initialisation.
    EXPECT_EQ(MakeUninitialised()->UnpackRestoreErrorInfo(nullptr, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("pErrInfo == NULL"));
    TestBstr findings;
    EXPECT_EQ(MakeUninitialised()->UnpackRestoreErrorInfo(nullptr, findings.Out()), E_ABORT);
    EXPECT_EQ(object->UnpackRestoreErrorInfo(nullptr, findings.Out()), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackRestoreErrorInfo. NULL variant", object));
}

TEST_F(BackupTest, EventsAndStatesDecode) {
    ControllerObject* object = Make();
    const std::tuple<const char*, HRESULT, TavBackupEvent, ULONG, const char*> events[] = {
        {"-BackupEvent Finished -SeqNo 17", S_OK, BackupEvent_Finished, 17, nullptr},
        {"-BackupEvent Error -SeqNo 4294967295", S_OK, BackupEvent_Error, 4294967295u, nullptr},
        {"-BackupEvent Finished", S_OK, BackupEvent_Finished, 0, nullptr},
        {"-BackupEvent Done -SeqNo 1", E_FAIL, BackupEvent_Finished, 0, "UnpackBackupEvent. Unsupported event"},
        {"-BackupEvent", E_FAIL, BackupEvent_Finished, 0, "UnpackBackupEvent. Failed to extract data"},
        {"-BackupEvent Finished12345 -SeqNo 3", E_FAIL, BackupEvent_Finished, 0,
         "UnpackBackupEvent. Unsupported event"},
    };
    for (const auto& [text, result, event, sequence, error] : events) {
        SCOPED_TRACE(text);
        TestVariant reply = TestVariant::Text(text);
        TavBackupEvent e = BackupEvent_Error;
        ULONG s = 99;
        EXPECT_EQ(object->UnpackBackupEvent(reply.Get(), &e, &s), result);
        EXPECT_EQ(e, SUCCEEDED(result) ? event : BackupEvent_Finished) << "cleared on failure";
        EXPECT_EQ(s, sequence);
        if (error != nullptr) {
            EXPECT_TRUE(HasError(error));
        }
    }
    const std::tuple<const char*, HRESULT, TavBackupState, const char*> states[] = {
        {"-BackupState None", S_OK, BackupState_None, nullptr},
        {"-BackupState InProgress", S_OK, BackupState_InProgress, nullptr},
        {"-BackupState Busy", E_FAIL, BackupState_InProgress, "Unsupported state"},
        {"-State None", E_FAIL, BackupState_InProgress, "Failed to fetch state"},
    };
    for (const auto& [text, result, state, error] : states) {
        SCOPED_TRACE(text);
        TestVariant reply = TestVariant::Text(text);
        TavBackupState s = BackupState_InProgress;
        EXPECT_EQ(object->UnpackBackupState(reply.Get(), &s), result);
        EXPECT_EQ(s, state);
        if (error != nullptr) {
            EXPECT_TRUE(HasError(error));
        }
    }
    TestVariant number = TestVariant::Number(1);
    TavBackupState s{};
    EXPECT_EQ(object->UnpackBackupState(number.Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError("pStatus == NULL"));
    EXPECT_EQ(object->UnpackBackupState(number.Get(), &s), E_FAIL);
    EXPECT_TRUE(HasError("UnpackBackupState. Non-BSTR variant."));
}

TEST_F(BackupTest, CompressionIsNotOfferedButItsReplyReads) {
    ControllerObject* object = Make();
    EXPECT_EQ(object->Compress(nullptr, nullptr, nullptr, nullptr), E_NOTIMPL);
    EXPECT_EQ(object->Decompress(nullptr, nullptr, nullptr), E_NOTIMPL);
    TestVariant reply = TestVariant::Text("-File /temp/b1.zip  ");
    TestBstr file;
    ASSERT_EQ(object->UnpackCompress(reply.Get(), file.Out()), S_OK);
    EXPECT_EQ(file.Text(), "/temp/b1.zip  ");
    TestVariant wrong = TestVariant::Text("-file x");
    EXPECT_EQ(object->UnpackCompress(wrong.Get(), file.Out()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackCompress failed."));
    TestVariant null = TestVariant::NullBstr();
    EXPECT_EQ(object->UnpackCompress(null.Get(), file.Out()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackCompress. Data-variant not of type VT_BSTR or BSTR NULL"));
    EXPECT_EQ(object->UnpackCompress(reply.Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError("UnpackCompress. Invalid pointer"));
}

TEST_F(BackupTest, VersionInfoIsTheWholeReply) {
    ControllerObject* object = Make();
    Script("VersionInfoFromBackup", "-Name \"B1\" -Version 7.4.2");
    TestBstr info;
    ASSERT_EQ(object->GetVersionInfoFromBackup(nullptr, TestBstr("ctrl:/bak/b1").Get(), info.Out()), S_OK);
    EXPECT_EQ(LastCommand().verb, "Get");
    EXPECT_EQ(LastCommand().args, "-BackupPath \"/bak/b1\"");
    EXPECT_EQ(info.Text(), "-Name \"B1\" -Version 7.4.2");
    Component().ClearScript();
    Script("VersionInfoFromBackup", ScriptedReply::Number(5));
    EXPECT_EQ(object->GetVersionInfoFromBackup(nullptr, TestBstr("ctrl:/bak/b1").Get(), info.Out()), E_FAIL);
    EXPECT_TRUE(HasError("TavController::GetVersionInfoFromBackup - Controller returned invalid result"));
}

}  // namespace
}  // namespace tav::test
