// Identity, names and version information: the common checks of each
// operation, what it sends, how its Sync reply comes back, and which
// arguments are refused before sending.
#include <functional>
#include <optional>

#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr HRESULT kNotLatin1 = static_cast<HRESULT>(0xC0040408);

using BstrOp = std::function<HRESULT(ControllerObject&, TavInParams*, BSTR*)>;

class IdentityCommandsTest : public ControllerTest {
protected:
    // The common texts of a reading operation.
    static CallPattern Reading(const std::string& name, BstrOp op) {
        CallPattern pattern;
        pattern.call = [op](ControllerObject& object, TavInParams* rip, bool nullOut) {
            TestBstr out;
            return op(object, rip, nullOut ? nullptr : out.Out());
        };
        pattern.invalidParams = name + ": Invalid TavInParams";
        pattern.nullOut = name + ": Invalid out-pointer";
        pattern.beforeInit = name + ". TavController used before Initialized";
        return pattern;
    }
};

TEST_F(IdentityCommandsTest, ReadsFollowTheCallPatternSendTheirCommandAndDecodeTheReply) {
    struct Case {
        const char* name;  // in the texts of the common checks
        BstrOp call;
        const char* command;
        const char* args;
        const char* reply;
        const char* decoded;
        const char* url = "/ctrl";
    };
    TestBstr system("Sys 1"), variable("HOME"), product("Vision");
    const Case cases[] = {
        {"TavController::GetVersionInfo", [](auto& o, auto* rip, BSTR* out) { return o.GetVersionInfo(rip, SystemInfo, out); },
         "VersionInfo", "-Type System", "OS 7 \"as it is\"", "OS 7 \"as it is\""},
        {"TavController::GetVersionInfo", [](auto& o, auto* rip, BSTR* out) { return o.GetVersionInfo(rip, ReleaseInfo, out); },
         "VersionInfo", "-Type Release", "R 1", "R 1"},
        {"GetVersionInfoFromSystem",
         [&](auto& o, auto* rip, BSTR* out) { return o.GetVersionInfoFromSystem(rip, system.Get(), ReleaseInfo, out); },
         "SystemInfo", "-Type Release -SystemName \"Sys 1\"", "R 2", "R 2"},
        {"GetControllerName", [](auto& o, auto* rip, BSTR* out) { return o.GetControllerName(rip, out); }, "CtrlName",
         "", "-Name \"Cell 4\"", "Cell 4"},
        {"GetControllerID", [](auto& o, auto* rip, BSTR* out) { return o.GetControllerID(rip, out); }, "CtrlID", "",
         "-ID \"42-A\"", "42-A"},
        {"GetSystemID", [](auto& o, auto* rip, BSTR* out) { return o.GetSystemID(rip, out); }, "GUID", "",
         "-GUID {0A1B2C3D-4E5F-6071-8293-A4B5C6D7E8F9}", "{0A1B2C3D-4E5F-6071-8293-A4B5C6D7E8F9}"},
        {"GetEnvironmentVariable",
         [&](auto& o, auto* rip, BSTR* out) { return o.GetEnvironmentVariable(rip, variable.Get(), out); },
         "EnvironmentVar", "HOME", "/hd0a", "/hd0a", "/ctrl/DHROOT"},
        {"GetConnectedTavAPIClients", [](auto& o, auto* rip, BSTR* out) { return o.GetConnectedTavAPIClients(rip, out); },
         "ConnectedClients", "", "<Clients/>", "<Clients/>"},
        {"GetVersionName", [](auto& o, auto* rip, BSTR* out) { return o.GetVersionName(rip, out); }, "VersionName", "",
         "-Name \"7.2\"", "\"7.2\""},
        {"GetProductVersionName",
         [&](auto& o, auto* rip, BSTR* out) { return o.GetProductVersionName(rip, product.Get(), out); },
         "ProductVersionName", "-Name \"Vision\"", "-Name 3.1", "3.1"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.args);
        CallPattern pattern = Reading(c.name, c.call);
        if (c.command == std::string("VersionInfo")) {
            pattern.invalidParams += ".";
        }
        ExpectCallPattern(pattern);
        ControllerObject* object = Make();
        Script(c.command, c.reply);
        TestBstr out;
        EXPECT_EQ(c.call(*object, nullptr, out.Out()), S_OK) << ErrorText();
        EXPECT_EQ(out.Text(), c.decoded);
        const RecordedCommand sent = LastCommand();
        EXPECT_EQ(sent.verb, "Get");
        EXPECT_EQ(sent.command, c.command);
        EXPECT_EQ(sent.args, c.args);
        EXPECT_EQ(sent.url, c.url);
    }
}

TEST_F(IdentityCommandsTest, OptionAndEnergyStateFollowTheCallPatternAndAreSent) {
    TestBstr option("Vision Guidance");
    CallPattern pattern = Reading("IsOptionPresent", [&](auto& o, auto* rip, BSTR* out) {
        LONG present = 0;
        return o.IsOptionPresent(rip, option.Get(), out ? &present : nullptr);
    });
    pattern.nullOut = "IsOptionPresent. Invalid out-pointer";
    ExpectCallPattern(pattern);
    ExpectCallPattern(Reading("GetEnergyState", [](auto& o, auto* rip, BSTR* out) {
        TavSysEnergyState state{};
        return o.GetSysEnergyState(rip, out ? &state : nullptr);
    }));

    ControllerObject* object = Make();
    Script("IsOptionPresent", "-OptionPresent 1");
    LONG present = 0;
    EXPECT_EQ(object->IsOptionPresent(nullptr, option.Get(), &present), S_OK);
    EXPECT_EQ(present, 1);
    EXPECT_EQ(LastCommand().verb + LastCommand().args, "Get-Option \"Vision Guidance\"");
    Script("SysEnergyState", "-sysenergy resuming");
    TavSysEnergyState state{};
    EXPECT_EQ(object->GetSysEnergyState(nullptr, &state), S_OK);
    EXPECT_EQ(state, TavSysEnergyStateResuming);
    EXPECT_EQ(LastCommand().verb + LastCommand().command + LastCommand().args, "GetSysEnergyState");
}

TEST_F(IdentityCommandsTest, VersionInfoThatIsNotTextIsRefused) {
    ControllerObject* object = Make();
    TestBstr system("Sys");
    Script("VersionInfo", ScriptedReply::Number(1));
    Script("SystemInfo", ScriptedReply::Number(1));
    TestBstr out;
    EXPECT_EQ(object->GetVersionInfo(nullptr, SystemInfo, out.Out()), E_FAIL);
    EXPECT_TRUE(HasError("TavController::GetVersionInfo - Controller returned invalid result"));
    EXPECT_EQ(object->GetVersionInfoFromSystem(nullptr, system.Get(), SystemInfo, out.Out()), E_FAIL);
    EXPECT_TRUE(HasError("GetVersionInfoFromSystem - Controller returned invalid result"));
}

// Names, identifiers and the language travel in quotes, within 256
// characters (name and identifier) and within Latin-1.
TEST_F(IdentityCommandsTest, WritesQuoteTheirTextOrRefuseIt) {
    using Set = HRESULT (STDMETHODCALLTYPE ControllerObject::*)(TavInParams*, BSTR);
    for (auto [set, name] : {std::pair<Set, std::string>{&ControllerObject::SetControllerName, "SetControllerName"},
                             {&ControllerObject::SetControllerId, "SetControllerId"},
                             {&ControllerObject::SetLanguage, "SetLanguage"}}) {
        CallPattern pattern;
        pattern.call = [set](ControllerObject& o, TavInParams* rip, bool) { return (o.*set)(rip, nullptr); };
        pattern.invalidParams = name + ": Invalid TavInParams";
        pattern.beforeInit = "TavController used before Initialized";
        ExpectCallPattern(pattern);
    }
    struct Case {
        Set set;
        const char* command;
        std::optional<std::string> value;  // nullopt: a NULL BSTR
        HRESULT hr;
        const char* argsOrError;  // nullptr: "-Name \"<value>\""
    };
    const std::string n256(256, 'n'), n257(257, 'n');
    const Case cases[] = {
        {&ControllerObject::SetControllerName, "CtrlName", "Cell 4", S_OK, "-Name \"Cell 4\""},
        {&ControllerObject::SetControllerName, "CtrlName", std::nullopt, S_OK, "-Name \"\""},
        {&ControllerObject::SetControllerName, "CtrlName", "Zelle \xC3\xBF", S_OK, "-Name \"Zelle \xC3\xBF\""},
        {&ControllerObject::SetControllerName, "CtrlName", n256, S_OK, nullptr},
        {&ControllerObject::SetControllerName, "CtrlName", n257, E_INVALIDARG, "SetControllerName invalid argument"},
        {&ControllerObject::SetControllerName, "CtrlName", "Cell \xC4\x80", kNotLatin1, ""},
        {&ControllerObject::SetControllerName, "CtrlName", n257 + "\xC4\x80", E_INVALIDARG,
         "SetControllerName invalid argument"},
        {&ControllerObject::SetControllerId, "CtrlID", "42-A", S_OK, "-ctrlId \"42-A\""},
        {&ControllerObject::SetControllerId, "CtrlID", std::nullopt, S_OK, "-Id \"\""},
        {&ControllerObject::SetControllerId, "CtrlID", "", S_OK, "-ctrlId \"\""},
        {&ControllerObject::SetControllerId, "CtrlID", n257, E_INVALIDARG, "SetControllerId invalid argument"},
        {&ControllerObject::SetControllerId, "CtrlID", "\xE2\x82\xAC", kNotLatin1, ""},
        {&ControllerObject::SetLanguage, "Language", "de", S_OK, "-Language \"de\""},
        {&ControllerObject::SetLanguage, "Language", std::nullopt, S_OK, "-Language \"\""},
        {&ControllerObject::SetLanguage, "Language", "\xE6\x97\xA5", kNotLatin1, ""},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.value.value_or("NULL").substr(0, 20));
        Component().ClearRecords();
        TestBstr value;
        if (c.value) {
            value = TestBstr(*c.value);
        }
        EXPECT_EQ((object->*c.set)(nullptr, value.Get()), c.hr);
        if (SUCCEEDED(c.hr)) {
            EXPECT_EQ(LastCommand().verb + LastCommand().command, std::string("Set") + c.command);
            EXPECT_EQ(LastCommand().args, c.argsOrError ? c.argsOrError : "-Name \"" + *c.value + "\"");
        } else {
            EXPECT_EQ(CommandCount(), 0u);
            EXPECT_TRUE(HasError(c.argsOrError));
        }
    }
}

TEST_F(IdentityCommandsTest, RefusedArgumentsAreReportedBeforeSending) {
    TestBstr empty(""), name("x");
    const auto unknown = static_cast<TavControllerInfo>(2);
    const std::pair<BstrOp, const char*> cases[] = {
        {[&](auto& o, auto* rip, BSTR* out) { return o.GetVersionInfo(rip, unknown, out); },
         "TavController::GetVersionInfo - Unknown information type"},
        {[&](auto& o, auto* rip, BSTR* out) { return o.GetVersionInfoFromSystem(rip, nullptr, SystemInfo, out); },
         "GetVersionInfoFromSystem: Invalid argument"},
        {[&](auto& o, auto* rip, BSTR* out) { return o.GetVersionInfoFromSystem(rip, name.Get(), unknown, out); },
         "GetVersionInfoFromSystem - Unknown information type"},
        {[&](auto& o, auto* rip, BSTR* out) { return o.GetEnvironmentVariable(rip, empty.Get(), out); },
         "GetEnvironmentVariable: Empty environment variable"},
        {[&](auto& o, auto* rip, BSTR* out) { return o.GetProductVersionName(rip, nullptr, out); },
         "GetProductVersionName: Invalid product name"},
    };
    ControllerObject* object = Make();
    for (const auto& [call, error] : cases) {
        SCOPED_TRACE(error);
        TavInParams rip = SyncCall(3);
        TestBstr out;
        EXPECT_EQ(call(*object, &rip, out.Out()), E_INVALIDARG);
        EXPECT_TRUE(HasError(error));
        EXPECT_EQ(Callback().Last().status, E_INVALIDARG) << "the callback was not told";
    }
    EXPECT_EQ(CommandCount(), 0u);
}

}  // namespace
}  // namespace tav::test
