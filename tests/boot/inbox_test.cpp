// Installing systems and the installation inbox.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class InboxTest : public ControllerTest {};

// Each command's text; one row of each operation also carries the texts
// of its call pattern.
TEST_F(InboxTest, CommandsFollowTheCallPatternAndSendTheirTexts) {
    struct Case {
        std::function<HRESULT(ControllerObject&, TavInParams*, bool nullOut)> call;
        const char* command;
        const char* args;
        const char* invalidParams = nullptr;
        const char* beforeInit = "TavController used before Initialized";
        const char* nullOut = nullptr;
    };
    TavSysInboxState state{};
    LONG busy = 0;
    TestBstr text;
    const char* packageParams = "ValidateDeploymentPackage: Invalid TavInParams";
    const char* packageInit = "ValidateDeploymentPackage. Helper used before initialized.";
    const Case cases[] = {
        {[](ControllerObject& o, TavInParams* r, bool) { return o.InstallNewSystem(r, TestBstr("/pkg/SYS B").Get(), 5); },
         "InstallNewSystem", "-overwrite -system_path \"/pkg/SYS B\"", "InstallNewSystem. Invalid TavInParams."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.InstallNewSystem(r, nullptr, 0); }, "InstallNewSystem",
         "-nooverwrite -system_path \"\""},
        {[](ControllerObject& o, TavInParams* r, bool) {
             return o.InstallNewSystem2(r, TestBstr("ID1").Get(), TestBstr("Cell 7").Get(), TestBstr("/def").Get(),
                                        TestBstr("/dp").Get());
         },
         "InstallNewSystem", " -system_path \"/def\" -ctrl_name \"Cell 7\" -ctrl_id \"ID1\" -dp_pkg_root \"/dp\""},
        {[](ControllerObject& o, TavInParams* r, bool) {
             return o.InstallNewSystem2(r, TestBstr("").Get(), TestBstr("Cell 7").Get(), nullptr, nullptr);
         },
         "InstallNewSystem", " -ctrl_name \"Cell 7\""},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.InstallNewSystem2(r, nullptr, nullptr, nullptr, nullptr); },
         "InstallNewSystem", "", "InstallNewSystem. Invalid TavInParams."},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetSysInboxState(r, n ? nullptr : &state); },
         "InboxState", "", "GetSysInboxState. Invalid TavInParams.", "TavController used before Initialized",
         "GetSysInboxState. Invalid out-pointer."},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.IsInboxBusy(r, n ? nullptr : &busy); },
         "InboxIsBusy", "", "IsInboxBusy. Invalid TavInParams.", "TavController used before Initialized",
         "IsInboxBusy. Invalid out-pointer."},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetInboxPath(r, n ? nullptr : text.Out()); },
         "InboxPath", "", "GetInboxPath. Invalid TavInParams.", "TavController used before Initialized",
         "GetInboxPath. Invalid out-pointer."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.InvokeInboxOperation(r, TavInboxOperation_Open); },
         "InboxOperation", "-operation open", "InvokeInboxOperation: Invalid TavInParams",
         "InvokeInboxOperation. Helper used before initialized."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.InvokeInboxOperation(r, TavInboxOperation_Clear); },
         "InboxOperation", "-operation clear"},
        {[](ControllerObject& o, TavInParams* r, bool) {
             return o.InvokeInboxOperation(r, TavInboxOperation_LoadCompleted);
         },
         "InboxOperation", "-operation load_completed"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.InvokeInboxOperation(r, TavInboxOperation_ApplyUpdate); },
         "InboxOperation", "-operation apply_update"},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetVersion(r, TavInboxFileType_License, n ? nullptr : text.Out());
         },
         "InboxVersion", "-Name LICENSE", "GetVersion. Invalid TavInParams.", "TavController used before Initialized",
         "GetVersion. Invalid out-pointer."},
        {[&](ControllerObject& o, TavInParams* r, bool) { return o.GetVersion(r, TavInboxFileType_CtrlManifest, text.Out()); },
         "InboxVersion", "-Name CTRL_MANIFEST"},
        {[&](ControllerObject& o, TavInParams* r, bool) {
             return o.GetVersion(r, TavInboxFileType_CtrlProdSetting, text.Out());
         },
         "InboxVersion", "-Name CTRL_PROD_SETTING"},
        {[](ControllerObject& o, TavInParams* r, bool) {
             return o.ValidateDeploymentPackage(r, TestBstr("/hd0a/in box").Get());
         },
         "InboxPreInstallCheck", "-path /hd0a/in box", packageParams, packageInit},
        // The boot server upgrade reports with the package check's texts.
        {[](ControllerObject& o, TavInParams* r, bool) { return o.UpgradeBootServer(r, nullptr); },
         "InboxUpgradeBootServer", "-path ", packageParams, packageInit},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.command) + " " + c.args);
        if (c.invalidParams != nullptr) {
            ExpectCallPattern({c.call, c.invalidParams, c.beforeInit,
                               c.nullOut ? std::optional<std::string>(c.nullOut) : std::nullopt});
        }
        Script("InboxState", "-state open");
        Script("InboxIsBusy", "-busy true");
        Script("InboxPath", "-path \"/hd0a/inbox\"");
        Script("InboxVersion", "-version \"7.4\"");
        ControllerObject* object = Make();
        ASSERT_EQ(c.call(*object, nullptr, false), S_OK);
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
    }
    ControllerObject* object = Make();
    const size_t sent = CommandCount();
    EXPECT_EQ(object->InvokeInboxOperation(nullptr, static_cast<TavInboxOperation>(5)), E_INVALIDARG);
    EXPECT_TRUE(HasError("InvokeInboxOperation. Invalid operation."));
    EXPECT_EQ(object->GetVersion(nullptr, static_cast<TavInboxFileType>(7), text.Out()), E_INVALIDARG);
    EXPECT_EQ(CommandCount(), sent);
}

TEST_F(InboxTest, RepliesDecode) {
    ControllerObject* object = Make();
    Script("InboxState", "-state Loaded");
    TavSysInboxState state = TavSysInbox_Open;
    ASSERT_EQ(object->GetSysInboxState(nullptr, &state), S_OK);
    EXPECT_EQ(state, TavSysInbox_Undefined) << "case counts";
    const std::pair<const char*, TavSysInboxState> states[] = {{"-state error", TavSysInbox_Error},
                                                               {"-state empty", TavSysInbox_Empty},
                                                               {"-state committed", TavSysInbox_Committed}};
    for (const auto& [text, value] : states) {
        Component().ClearScript();
        Script("InboxState", text);
        ASSERT_EQ(object->GetSysInboxState(nullptr, &state), S_OK);
        EXPECT_EQ(state, value);
    }
    const std::tuple<const char*, HRESULT, LONG> busy[] = {
        {"-busy true", S_OK, 1}, {"-busy TRUE", S_OK, 0}, {"-busy 1", S_OK, 0}, {"-busy yes", S_OK, 0},
        {"-busy", E_FAIL, 5}};
    for (const auto& [text, result, value] : busy) {
        Component().ClearScript();
        Script("InboxIsBusy", text);
        LONG out = 5;
        EXPECT_EQ(object->IsInboxBusy(nullptr, &out), result) << text;
        EXPECT_EQ(out, value) << text;
    }
    EXPECT_TRUE(HasError("UnpackInboxIsBusy failed."));
    const std::tuple<const char*, HRESULT, const char*> paths[] = {
        {"-path \"/hd0a/inbox\"", S_OK, "/hd0a/inbox"},
        {"-path \"\"", E_FAIL, ""},
        {"-path /hd0a", E_FAIL, ""},
    };
    for (const auto& [text, result, value] : paths) {
        Component().ClearScript();
        Script("InboxPath", text);
        TestBstr path;
        EXPECT_EQ(object->GetInboxPath(nullptr, path.Out()), result) << text;
        EXPECT_EQ(path.Text(), value);
    }
    EXPECT_TRUE(HasError("UnpackInboxPath failed."));
    Component().ClearScript();
    Script("InboxVersion", "-version \"" + std::string(300, 'v') + "\"");
    TestBstr version;
    ASSERT_EQ(object->GetVersion(nullptr, TavInboxFileType_License, version.Out()), S_OK);
    EXPECT_EQ(version.Text(), std::string(260, 'v')) << "260 characters at most";
    Component().ClearScript();
    Script("InboxVersion", "-version \"\"");
    EXPECT_EQ(object->GetVersion(nullptr, TavInboxFileType_License, version.Out()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackGetVersion failed."));
}

}  // namespace
}  // namespace tav::test
