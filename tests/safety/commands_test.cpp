// The safety controller's commands, its last violation and its units.
#include <array>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class SafetyCommandsTest : public ControllerTest {};

TEST_F(SafetyCommandsTest, CommandsSendTheirTexts) {
    struct Case {
        std::function<HRESULT(ControllerObject&, TavInParams*)> call;
        const char* invalidParams;
        const char* command;
        const char* args;
    };
    const Case cases[] = {
        {[](ControllerObject& o, TavInParams* r) { return o.SetSafetyConfigurationValidated(r, TestBstr("Ove L").Get()); },
         "SetSafetyConfigurationValidated: Invalid TavInParams", "SafetyConfValidated", "-Name \"Ove L\""},
        {[](ControllerObject& o, TavInParams* r) { return o.SetSafetyConfigurationNotValidated(r); },
         "SetSafetyConfigurationNotValidated: Invalid TavInParams", "VantorNotValidated", ""},
        {[](ControllerObject& o, TavInParams* r) { return o.SetSafetyMode(r, VantorSafetyModeCommissioningMode); },
         "SetSafetyMode: Invalid TavInParams", "VantorSafetyMode", "-Mode commissioning"},
        {[](ControllerObject& o, TavInParams* r) { return o.SetSafetyMode(r, VantorSafetyModeActiveMode); },
         "SetSafetyMode: Invalid TavInParams", "VantorSafetyMode", "-Mode active"},
        {[](ControllerObject& o, TavInParams* r) { return o.SetSafetyMode(r, VantorSafetyModeServiceMode); },
         "SetSafetyMode: Invalid TavInParams", "VantorSafetyMode", "-Mode service"},
        {[](ControllerObject& o, TavInParams* r) { return o.Reconfigure(r); }, "Reconfigure: Invalid TavInParams",
         "VantorReconfigure", ""},
        {[](ControllerObject& o, TavInParams* r) { return o.SyncSoftware(r, -3); }, "SyncSoftware: Invalid TavInParams",
         "VantorSyncSoftware", "-driver_module -3"},
        {[](ControllerObject& o, TavInParams* r) { return o.SetSafetyConfigurationLocked(r, nullptr); },
         "SetSafetyConfigurationLocked: Invalid TavInParams", "LockSupervConfig", "-Name \"\""},
        {[](ControllerObject& o, TavInParams* r) { return o.SetSafetyConfigurationUnLocked(r); },
         "SetSafetyConfigurationUnLocked: Invalid TavInParams", "VantorUnlockSuperv", ""},
        {[](ControllerObject& o, TavInParams* r) { return o.ResetSafetyControllerToFactoryDefault(r); },
         "ResetSafetyControllerToFactoryDefault. Invalid TavInParams.", "ResetSafetyController", ""},
        {[](ControllerObject& o, TavInParams* r) {
             return o.LoadSafetyConfigurationFile(r, TestBstr("ctrl:/hd0a/cfg/safety.xml").Get());
         },
         "LoadSafetyConfigurationFile: Invalid TavInParams", "VantorLoadSupervConfig", "-File \"/hd0a/cfg/safety.xml\""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.command);
        ExpectCallPattern({[&](ControllerObject& o, TavInParams* r, bool) { return c.call(o, r); }, c.invalidParams,
                           std::string(c.command) == "VantorLoadSupervConfig"
                               ? "LoadSafetyConfigurationFile used before Initialized"
                               : "TavController used before Initialized",
                           std::nullopt});
        ControllerObject* object = Make();
        ASSERT_EQ(c.call(*object, nullptr), S_OK);
        EXPECT_EQ(LastCommand().verb, "Set");
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
    }
    ControllerObject* object = Make();
    EXPECT_EQ(object->SetSafetyMode(nullptr, VantorSafetyModeError), E_INVALIDARG);
    EXPECT_TRUE(HasError("SetSafetyMode: Invalid mode"));
}

TEST_F(SafetyCommandsTest, ALocalConfigurationFileIsCopiedFirst) {
    ControllerObject* object = Make();
    ASSERT_EQ(object->LoadSafetyConfigurationFile(nullptr, TestBstr("/home/op/cell 7/safety.xml").Get()), S_OK);
    const std::vector<RecordedFileCall> calls = Component().FileCalls();
    ASSERT_EQ(calls.size(), 2u);
    EXPECT_EQ(calls[0].operation, "CreateControllerDirectory");
    EXPECT_EQ(calls[0].texts, (std::vector<std::string>{kUrl, "/hd0a/temp/safety"}));
    EXPECT_EQ(calls[1].operation, "CopyFileToController");
    EXPECT_EQ(calls[1].texts,
              (std::vector<std::string>{kUrl, "/home/op/cell 7/safety.xml", "/hd0a/temp/safety/safety.xml"}));
    EXPECT_EQ(LastCommand().args, "-File \"/hd0a/temp/safety/safety.xml\"");

    const size_t sent = CommandCount();
    struct Case {
        std::function<void()> arrange;
        const char* path;
        HRESULT result;
        const char* error;
    };
    const Case failures[] = {
        {[] {}, "", E_INVALIDARG, "LoadSafetyConfigurationFile. Empty filepath"},
        {[] {}, "ctrl:/cfg\\safety.xml", E_INVALIDARG,
         "LoadSafetyConfigurationFile - Invalid controller path. Backslash not allowed."},
        {[] {}, "c:\\dir\\", E_INVALIDARG, "Failed to get filename from path: c:\\dir\\"},
        {[&] { Component().Fail(ComOperation::CreateControllerDirectory, E_ACCESSDENIED, "read-only"); }, "a.xml",
         E_ACCESSDENIED, "Failed to create ctrl directory /hd0a/temp/safety"},
        {[&] {
             Component().ClearScript();
             Component().Fail(ComOperation::CopyFileToController, static_cast<HRESULT>(0xC0049004), "no such file");
         },
         "d:\\a.xml", static_cast<HRESULT>(0xC0049004), "Failed to download d:\\a.xml to /hd0a/temp/safety/a.xml"},
    };
    for (const Case& c : failures) {
        SCOPED_TRACE(c.path);
        c.arrange();
        EXPECT_EQ(object->LoadSafetyConfigurationFile(nullptr, TestBstr(c.path).Get()), c.result);
        EXPECT_TRUE(HasError(c.error));
    }
    EXPECT_EQ(CommandCount(), sent);
}

// The out-values of the last violation, in the parameters' order.
struct Violation {
    std::array<std::array<double, 8>, 5> numbers{};
    std::array<LONG, 5> numberCounts{};
    std::array<std::array<LONG, 8>, 8> flags{};
    std::array<LONG, 8> flagCounts{};
    ULONG number = 9;
    TavVantorViolationType type = TavVantorViolationTypeOther;
    ULONG instance = 9;
    LONG synchronized = 9;
    short tool = 9;
    short drive = 9;
    LONG capacity = 6;

    // Calls op with the out-values in the parameters' order.
    template <class Op>
    HRESULT Fill(Op op) {
        auto& n = numbers;
        auto& c = numberCounts;
        auto& f = flags;
        auto& k = flagCounts;
        const LONG m = capacity;
        return op(m, &c[0], n[0].data(), m, &c[1], n[1].data(), m, &c[2], n[2].data(), m, &c[3], n[3].data(), m,
                  &c[4], n[4].data(), &number, &type, &instance, &synchronized, &tool, &drive, m, &k[0], f[0].data(),
                  m, &k[1], f[1].data(), m, &k[2], f[2].data(), m, &k[3], f[3].data(), m, &k[4], f[4].data(), m,
                  &k[5], f[5].data(), m, &k[6], f[6].data(), m, &k[7], f[7].data());
    }
    HRESULT Unpack(ControllerObject& o, VARIANT* data) {
        return Fill([&](auto... out) { return o.UnpackSafetyViolationStatus(data, out...); });
    }
    HRESULT Get(ControllerObject& o, LONG driveModule, LONG last) {
        return Fill([&](auto... out) { return o.GetSafetyViolationStatus(nullptr, driveModule, last, out...); });
    }
};

std::string ViolationReply(const std::string& type = "red_tool_speed") {
    return "-vnumber 12 -violationtype " + type +
           " -instanceid 3 -isunsync 1 -tool 4 -drive 2\t-axes 8[1.5,-2,3,4,5,6,7,8,]\t-speed 2[0.25,0.5,]\t"
           "-tcp 3[100,200,300,]\t-fpos 3[1,2,3,]\t-forient 4[1,0,0,0,]\t-ssv 3[101]\t-toolposvs 2[01]\t"
           "-toolposas 2[11]\t-uarmvs 1[1]\t-toolspeedvs 2[10]\t-toolspeedas 0[]\t-axisrangevs 7[1111111]\t"
           "-axisrangeas 2[x1]\t";
}

TEST_F(SafetyCommandsTest, TheLastViolationFillsItsArraysUpToTheirCapacity) {
    ControllerObject* object = Make();
    TestVariant reply = TestVariant::Text(ViolationReply());
    Violation v;
    ASSERT_EQ(v.Unpack(*object, reply.Get()), S_OK);
    EXPECT_EQ(v.number, 12u);
    EXPECT_EQ(v.type, TavVantorViolationTypeReducedToolSpeed);
    EXPECT_EQ(v.instance, 3u);
    EXPECT_EQ(v.synchronized, 1);
    EXPECT_EQ(v.tool, 4);
    EXPECT_EQ(v.drive, 2);
    EXPECT_EQ(v.numberCounts, (std::array<LONG, 5>{8, 2, 3, 3, 4})) << "the counts the reply writes";
    EXPECT_EQ(v.numbers[0][5], 6);
    EXPECT_EQ(v.numbers[0][6], 0) << "nothing past the capacity";
    EXPECT_EQ(v.numbers[1][1], 0.5);
    // Parameters' order: ssv, upper arm, tool position, its active flags,
    // tool speed, its active flags, axis range, its active flags.
    EXPECT_EQ(v.flagCounts, (std::array<LONG, 8>{3, 1, 2, 2, 2, 0, 7, 2}));
    EXPECT_EQ((std::array<LONG, 3>{v.flags[0][0], v.flags[0][1], v.flags[0][2]}), (std::array<LONG, 3>{1, 0, 1}));
    EXPECT_EQ(v.flags[1][0], 1);
    EXPECT_EQ(v.flags[2][1], 1);
    EXPECT_EQ(v.flags[6][5], 1);
    EXPECT_EQ(v.flags[6][6], 0) << "nothing past the capacity";
    EXPECT_EQ(v.flags[7][0], 0) << "any character but 1 is 0";

    for (const auto& [word, type] : std::vector<std::pair<std::string, TavVantorViolationType>>{
             {"none", TavVantorViolationTypeNone}, {"empstop", TavVantorViolationTypeEMSTOP},
             {"unsync_speed_lim", TavVantorViolationTypeUnsynchSpeed}, {"STZ", TavVantorViolationTypeUndefined}}) {
        TestVariant typed = TestVariant::Text(ViolationReply(word));
        ASSERT_EQ(v.Unpack(*object, typed.Get()), S_OK);
        EXPECT_EQ(v.type, type) << word;
    }
}

TEST_F(SafetyCommandsTest, AMissingArrayLeavesTheFailureInItsCount) {
    ControllerObject* object = Make();
    std::string text = ViolationReply();
    text.erase(text.find("-tcp"), 20);
    TestVariant reply = TestVariant::Text(text);
    Violation v;
    EXPECT_EQ(v.Unpack(*object, reply.Get()), S_OK);
    EXPECT_EQ(v.numberCounts[2], E_FAIL);
    EXPECT_TRUE(HasError("UnpackSafetyConfigurationInfo failed no axes."));
    TestVariant head = TestVariant::Text("-vnumber 12 -violationtype sar -instanceid 3");
    EXPECT_EQ(v.Unpack(*object, head.Get()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackLastSafetyViolation failed."));
    EXPECT_EQ(v.number, 0u) << "cleared";
    EXPECT_EQ(v.Unpack(*object, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackLastSafetyViolation. NULL data-variant"));
}

TEST_F(SafetyCommandsTest, ViolationStatusIsAskedOfOneDriveModule) {
    ControllerObject* object = Make();
    Script("VantorViolationInfo", ViolationReply());
    Violation v;
    ASSERT_EQ(v.Get(*object, 2, -1), S_OK);
    EXPECT_EQ(LastCommand().verb, "Get");
    EXPECT_EQ(LastCommand().args, "-driver_module 2 -last_violation -1");
    EXPECT_EQ(v.number, 12u);
}

TEST_F(SafetyCommandsTest, UnitsBecomeAnEnumerator) {
    ControllerObject* object = Make();
    Script("PSCUnitStatus", "-noelts 2\t1;0;0\t2;3;-2147467259\t");
    TavRetrievalParams retrieval{};
    retrieval.noOfElts = -2;
    IEnumTavPSCUnits* units = nullptr;
    ASSERT_EQ(object->GetPSCUnitStatus(nullptr, &retrieval, &units), S_OK);
    EXPECT_EQ(LastCommand().command, "PSCUnitStatus");
    TavPSCUnit unit[3]{};
    ULONG fetched = 0;
    EXPECT_EQ(units->RemNext(3, unit, &fetched), S_FALSE);
    units->Release();
    ASSERT_EQ(fetched, 2u);
    EXPECT_EQ(unit[1].PSCUnitID, 2u);
    EXPECT_EQ(unit[1].PSCStatus, 3u);
    EXPECT_EQ(unit[1].PSCCallStatus, E_FAIL);
    EXPECT_EQ(retrieval.noOfElts, 2);
    EXPECT_EQ(retrieval.bLast, 1);

    retrieval.noOfElts = -1;
    EXPECT_EQ(object->GetPSCUnitStatus(nullptr, &retrieval, &units), E_INVALIDARG);
    EXPECT_TRUE(HasError("GetPSCUnitStatus - Only the RetrieveAll retrieval mode is supported."));
    TestVariant bad = TestVariant::Text("-noelts 1\t1;0\t");
    EXPECT_EQ(object->UnpackPSCUnitStatus(bad.Get(), &retrieval, &units), E_FAIL);
    EXPECT_TRUE(HasError("UnpackPSCUnitStatus. Could not parse out element: 1;0\t"));
    TestVariant head = TestVariant::Text("-count 1");
    EXPECT_EQ(object->UnpackPSCUnitStatus(head.Get(), &retrieval, &units), E_FAIL);
    EXPECT_TRUE(HasError("UnpackPSCUnitStatus. Can not parse data: -count 1"));
}

}  // namespace
}  // namespace tav::test
