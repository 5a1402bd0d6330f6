// The safety controller through ITavSafety and ITavPositionalSafetyController:
// its configuration's way into force, its locks, its mode and event, its
// drive modules and their violations.
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <functional>
#include <thread>
#include <vector>

#include "netsafety_fixture.h"
#include "sim/file_system.h"
#include "sim/subsystems/safety.h"

namespace tav::e2e {
namespace {

constexpr ULONG kSafetyModeSubscription = 18;

// A configuration file as the controller reads it, and its SHA-256.
constexpr const char* kLine4File =
    "name=Line 4 cell\nversion=3.0\ncreatedby=C. Ferreira\ncreated=2025-01-20 08:15:00\ntoolspeed=1,3\naxisrange=2\n";
constexpr const char* kLine4Checksum = "afdd1eea703ee03affee83d6331e72bd1a0c76fb2c40aef000b36fdb994644bc";
constexpr const char* kDeliveredChecksum = "3d140e3c1b812a117468b89bf6fa423f790a42f32008423aeef61f82878f2210";

struct Info {
    int major = -1, minor = -1;
    std::string name, createdBy, created, validatedBy, validationDate, lockedBy, lockDate, checksum;
    bool validated = false, locked = false;

    // Everything but the dates the controller stamps and the checksum.
    std::string Line() const {
        return std::to_string(major) + "." + std::to_string(minor) + "|" + name + "|" + createdBy + "|" + created +
               (validated ? "|validated|" : "|not validated|") + validatedBy + (locked ? "|locked|" : "|unlocked|") +
               lockedBy;
    }
};

// One violation status; arrays hold what the reply announced, up to 16.
struct Violation {
    static constexpr LONG kRoom = 16;
    struct Numbers {
        double values[kRoom]{};
        LONG count = -1;
        std::vector<double> Read() const { return {values, values + std::min(count, kRoom)}; }
    };
    struct Flags {
        LONG values[kRoom]{};
        LONG count = -1;
        std::string Read() const {
            std::string text;
            for (LONG i = 0; i < std::min(count, kRoom); ++i) text += values[i] ? '1' : '0';
            return text;
        }
    };
    Numbers axes, speeds, tcp, flange, orientation;
    ULONG number = 99;
    TavVantorViolationType type = static_cast<TavVantorViolationType>(99);
    ULONG instance = 99;
    LONG unsynchronised = -1;
    short tool = -1, drive = -1;
    Flags ssv, upperArm, toolPosition, toolPositionActive, toolSpeed, toolSpeedActive, axisRange, axisRangeActive;
};

#define NUMBERS(a) Violation::kRoom, &(a).count, (a).values

class SafetyE2eTest : public NetSafetyFixture {
protected:
    ComPtr<ITavSafety> Safety() { return As<ITavSafety>(); }

    TavVantorConfigStatus Status() { return Fetch(&ITavSafety::GetConfigStatus); }
    TavVantorLoadConfigStatus LoadStatus() { return Fetch(&ITavSafety::GetLoadOperationStatus); }
    TavVantorSafetyMode Mode() { return Fetch(&ITavSafety::GetSafeyModeStatus); }
    HRESULT ReadInfo(Info& out) {
        TavVantorConfigInfo info{};
        const HRESULT hr = Safety()->GetSafetyConfigurationInfo(nullptr, &info);
        auto take = [](BSTR& text) {
            std::string narrow = text ? text::Narrow(OleStringView(text, SysStringLen(text))) : "<null>";
            SysFreeString(text);
            text = nullptr;
            return narrow;
        };
        out.major = info.configVersion.majorVersion;
        out.minor = info.configVersion.minorVersion;
        out.name = take(info.creationInfo.configurationName);
        out.createdBy = take(info.creationInfo.createdBy);
        out.created = take(info.creationInfo.creationDate);
        out.validatedBy = take(info.validationInfo.validatedBy);
        out.validationDate = take(info.validationInfo.validationDate);
        out.lockedBy = take(info.lockInfo.lockedBy);
        out.lockDate = take(info.lockInfo.lockDate);
        out.validated = info.validationInfo.isValidated != 0;
        out.locked = info.lockInfo.isLocked != 0;
        char hex[3];
        for (byte b : info.checksum.csum) {
            std::snprintf(hex, sizeof hex, "%02x", static_cast<unsigned>(b));
            out.checksum += hex;
        }
        return hr;
    }
    Info ReadInfo() {
        Info info;
        EXPECT_EQ(ReadInfo(info), S_OK) << LastError();
        return info;
    }
    HRESULT ReadViolation(LONG module, LONG last, Violation& v) {
        return Safety()->GetSafetyViolationStatus(
            nullptr, module, last, NUMBERS(v.axes), NUMBERS(v.speeds), NUMBERS(v.tcp), NUMBERS(v.flange),
            NUMBERS(v.orientation), &v.number, &v.type, &v.instance, &v.unsynchronised, &v.tool, &v.drive,
            NUMBERS(v.ssv), NUMBERS(v.upperArm), NUMBERS(v.toolPosition), NUMBERS(v.toolPositionActive),
            NUMBERS(v.toolSpeed), NUMBERS(v.toolSpeedActive), NUMBERS(v.axisRange), NUMBERS(v.axisRangeActive));
    }
    Violation ReadViolation(LONG module, LONG last) {
        Violation v;
        EXPECT_EQ(ReadViolation(module, last, v), S_OK) << LastError();
        return v;
    }
    // "id;status;call status" per unit.
    std::vector<std::string> Units() {
        TavRetrievalParams retrieval{};
        retrieval.noOfElts = -2;
        ComPtr<IEnumTavPSCUnits> units;
        EXPECT_EQ(As<ITavPositionalSafetyController>()->GetPSCUnitStatus(nullptr, &retrieval, &units), S_OK)
            << LastError();
        std::vector<std::string> all;
        TavPSCUnit unit{};
        ULONG fetched = 0;
        while (units && units->RemNext(1, &unit, &fetched) == S_OK && fetched == 1) {
            all.push_back(std::to_string(unit.PSCUnitID) + ";" + std::to_string(unit.PSCStatus) + ";" +
                          std::to_string(unit.PSCCallStatus));
        }
        return all;
    }
    void WriteOnController(const std::string& path, const std::string& bytes) {
        Model()->Update([&](sim::ModelState& s, sim::EventPosts&) {
            auto& files = s.Part<sim::FileSystem>();
            const sim::Text key = sim::Widen(path);
            files.MakeFolders(key.substr(0, key.rfind('/')));
            ASSERT_EQ(files.Write(key, bytes), sim::FileSystem::Result::Done) << path;
        });
    }
    HRESULT Load(const std::string& path) { return Safety()->LoadSafetyConfigurationFile(nullptr, Wide(path).Get()); }
    HRESULT Named(HRESULT (STDMETHODCALLTYPE ITavSafety::*set)(TavInParams*, BSTR), const std::string& name) {
        return (Safety().Get()->*set)(nullptr, Wide(name).Get());
    }
};

TEST_F(SafetyE2eTest, DeliveredConfigurationIsValidatedAndUnlocked) {
    EXPECT_EQ(Status(), VantorConfigValidate);
    EXPECT_EQ(LoadStatus(), VantorLoadConfigPermitted);
    EXPECT_EQ(Mode(), VantorSafetyModeActiveMode);
    // The module hands keyed values on with the blank after their key.
    const Info info = ReadInfo();
    EXPECT_EQ(info.Line(), "2.1| Cell7 safety| A. Lindqvist| 2024-03-12 09:41:00|validated| B. Okafor|unlocked|");
    EXPECT_EQ(info.lockDate, "");
    EXPECT_EQ(info.checksum, kDeliveredChecksum);
    EXPECT_EQ(Units(), (std::vector<std::string>{"1;2;0", "2;2;0"}));
}

// Each step with what it answers and where it leaves the configuration.
TEST_F(SafetyE2eTest, ValidationLockAndModeFollowTheirRules) {
    auto safety = Safety();
    auto mode = [&](TavVantorSafetyMode m) { return [=] { return safety->SetSafetyMode(nullptr, m); }; };
    auto lock = [&](const char* by) {
        return [=, this] { return Named(&ITavSafety::SetSafetyConfigurationLocked, by); };
    };
    auto validate = [&](const char* by) {
        return [=, this] { return Named(&ITavSafety::SetSafetyConfigurationValidated, by); };
    };
    auto unlock = [&] { return safety->SetSafetyConfigurationUnLocked(nullptr); };
    auto unvalidate = [&] { return safety->SetSafetyConfigurationNotValidated(nullptr); };
    auto reset = [&] { return safety->ResetSafetyControllerToFactoryDefault(nullptr); };
    auto load = [&] { return Load("ctrl:/hd0a/temp/line4.cfg"); };
    WriteOnController("hd0a/temp/line4.cfg", kLine4File);

    const HRESULT refused = sim::kStatusNotAllowed;
    struct Step {
        const char* what;
        std::function<HRESULT()> action;
        HRESULT hr;
        const char* error;
        TavVantorConfigStatus status;
        TavVantorLoadConfigStatus load;
    };
    const Step steps[] = {
        {"lock", lock("Anna Berg"), S_OK, "", VantorConfigLocked, VantorLoadConfigDeclined},
        {"leave active mode", mode(VantorSafetyModeCommissioningMode), refused, "it runs in active mode only",
         VantorConfigLocked, VantorLoadConfigDeclined},
        {"unvalidate", unvalidate, refused, "VantorNotValidated: the configuration is locked", VantorConfigLocked,
         VantorLoadConfigDeclined},
        {"load", load, refused, "VantorLoadSupervConfig: the configuration in force is locked", VantorConfigLocked,
         VantorLoadConfigDeclined},
        {"factory reset", reset, refused, "ResetSafetyController: the configuration is locked; unlock it first",
         VantorConfigLocked, VantorLoadConfigDeclined},
        {"unlock", unlock, S_OK, "", VantorConfigValidate, VantorLoadConfigPermitted},
        {"unvalidate", unvalidate, S_OK, "", VantorConfigLoaded, VantorLoadConfigPermitted},
        {"lock unvalidated", lock("Anna Berg"), refused, "only a validated configuration can be locked",
         VantorConfigLoaded, VantorLoadConfigPermitted},
        {"validate", validate("Ove Nilsson"), S_OK, "", VantorConfigValidate, VantorLoadConfigPermitted},
        {"service mode", mode(VantorSafetyModeServiceMode), S_OK, "", VantorConfigValidate, VantorLoadConfigPermitted},
        {"lock in service mode", lock("Anna Berg"), refused, "is in service mode; a configuration is locked in active",
         VantorConfigValidate, VantorLoadConfigPermitted},
        {"active mode", mode(VantorSafetyModeActiveMode), S_OK, "", VantorConfigValidate, VantorLoadConfigPermitted},
        {"validate without a name", validate(""), sim::kStatusBadArgument, "SafetyConfValidated: expected -Name",
         VantorConfigValidate, VantorLoadConfigPermitted},
        {"lock", lock("Anna Berg"), S_OK, "", VantorConfigLocked, VantorLoadConfigDeclined},
    };
    for (const Step& step : steps) {
        SCOPED_TRACE(step.what);
        EXPECT_EQ(step.action(), step.hr);
        if (FAILED(step.hr)) {
            EXPECT_TRUE(ErrorHas(step.error)) << LastError();
        }
        EXPECT_EQ(Status(), step.status);
        EXPECT_EQ(LoadStatus(), step.load);
    }
    // The lock's fields are read without the blank.
    const Info info = ReadInfo();
    EXPECT_EQ(info.Line(),
              "2.1| Cell7 safety| A. Lindqvist| 2024-03-12 09:41:00|validated| Ove Nilsson|locked|Anna Berg");
    EXPECT_EQ(info.lockDate.size(), 19u) << info.lockDate;
    EXPECT_EQ(info.validationDate.size(), 20u) << info.validationDate;
    EXPECT_EQ(Units(), (std::vector<std::string>{"1;3;0", "2;3;0"}));
}

// A loaded file waits for a reconfigure; then it is in force, not validated.
TEST_F(SafetyE2eTest, ALoadedFileComesIntoForceByAReconfigure) {
    WriteOnController("hd0a/temp/line4.cfg", kLine4File);
    ASSERT_EQ(Load("ctrl:/hd0a/temp/line4.cfg"), S_OK) << LastError();
    EXPECT_EQ(Status(), VantorConfigMismatch);
    EXPECT_EQ(ReadInfo().name, " Cell7 safety") << "still the one in force";
    EXPECT_EQ(Named(&ITavSafety::SetSafetyConfigurationValidated, "Ove"), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("a loaded configuration is not in force yet; reconfigure first")) << LastError();

    ASSERT_EQ(Safety()->Reconfigure(nullptr), S_OK) << LastError();
    EXPECT_EQ(Status(), VantorConfigLoaded);
    Info info = ReadInfo();
    EXPECT_EQ(info.Line(), "3.0| Line 4 cell| C. Ferreira| 2025-01-20 08:15:00|not validated||unlocked|");
    EXPECT_EQ(info.validationDate, "");
    EXPECT_EQ(info.checksum, kLine4Checksum);
    // The instances it switches on show in every violation status.
    const Violation v = ReadViolation(1, 0);
    EXPECT_EQ(v.toolSpeedActive.Read(), "10100000");
    EXPECT_EQ(v.axisRangeActive.Read(), "01000000");
    EXPECT_EQ(v.toolPositionActive.Read(), "00000000");

    // A file of the client's own is copied to the controller first.
    const auto stamp = std::chrono::steady_clock::now().time_since_epoch().count();
    const std::filesystem::path local =
        std::filesystem::temp_directory_path() / ("netsafety_" + std::to_string(stamp) + ".cfg");
    {
        std::ofstream out(local, std::ios::binary);
        out << "name=Local\nversion=1.4\ncreatedby=me\ncreated=today\n";
    }
    EXPECT_EQ(Load(local.string()), S_OK) << LastError();
    std::filesystem::remove(local);
    ASSERT_EQ(Safety()->Reconfigure(nullptr), S_OK);
    EXPECT_EQ(ReadInfo().Line(), "1.4| Local| me| today|not validated||unlocked|");
}

TEST_F(SafetyE2eTest, FilesThatAreNoConfigurationAreRefused) {
    WriteOnController("hd0a/temp/cfg/noversion.cfg", "name=A\ncreatedby=B\ncreated=C\n");
    WriteOnController("hd0a/temp/cfg/instance.cfg", "name=A\nversion=1.0\ncreatedby=B\ncreated=C\ntoolspeed=2,9\n");
    WriteOnController("hd0a/temp/cfg/longname.cfg",
                      "name=" + std::string(64, 'x') + "\nversion=1.0\ncreatedby=B\ncreated=C\n");
    struct Case {
        const char* path;
        HRESULT status;
        const char* why;
    };
    const Case cases[] = {
        {"ctrl:/hd0a/temp/cfg/none.cfg", sim::kStatusNotFound, "does not exist"},
        {"ctrl:/hd0a/temp/cfg", sim::kStatusBadArgument, "is a folder"},
        {"ctrl:/hd0a/temp/cfg/noversion.cfg", sim::kStatusBadArgument, "lacks a version=<major>.<minor> line"},
        {"ctrl:/hd0a/temp/cfg/instance.cfg", sim::kStatusBadArgument, "outside 1 to 8"},
        {"ctrl:/hd0a/temp/cfg/longname.cfg", sim::kStatusBadArgument, "lacks a usable name="},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(Load(c.path), c.status) << c.path;
        EXPECT_TRUE(ErrorHas("VantorLoadSupervConfig: the configuration file \"") && ErrorHas(c.why)) << LastError();
        EXPECT_EQ(Status(), VantorConfigValidate) << "nothing loaded";
    }
}

// After a factory reset nothing is in force and every drive module must
// have its software synchronised before a configuration can be loaded.
TEST_F(SafetyE2eTest, FactoryResetThenSynchroniseLoadAndReconfigure) {
    ASSERT_EQ(Safety()->SetSafetyMode(nullptr, VantorSafetyModeServiceMode), S_OK);
    ASSERT_EQ(Safety()->ResetSafetyControllerToFactoryDefault(nullptr), S_OK) << LastError();
    EXPECT_EQ(Mode(), VantorSafetyModeActiveMode);
    EXPECT_EQ(Status(), VantorConfigMismatch);
    EXPECT_EQ(LoadStatus(), VantorLoadConfigError);
    Info info;
    EXPECT_EQ(ReadInfo(info), sim::kStatusNotFound);
    EXPECT_TRUE(ErrorHas("SafetyConf: the safety controller has no configuration")) << LastError();
    const std::string unsynchronised = std::to_string(sim::kStatusNotAllowed);
    EXPECT_EQ(Units(), (std::vector<std::string>{"1;4;" + unsynchronised, "2;4;" + unsynchronised}));
    EXPECT_EQ(ReadViolation(1, 1).number, 0u) << "the record is gone";
    EXPECT_EQ(ReadViolation(1, 1).unsynchronised, 1);

    WriteOnController("hd0a/temp/line4.cfg", kLine4File);
    EXPECT_EQ(Load("ctrl:/hd0a/temp/line4.cfg"), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("the safety software of drive module 1 is not synchronised")) << LastError();
    EXPECT_EQ(Safety()->Reconfigure(nullptr), sim::kStatusNotAllowed);

    for (int module : {0, 3, -1}) {
        EXPECT_EQ(Safety()->SyncSoftware(nullptr, module), sim::kStatusNotFound) << module;
        EXPECT_TRUE(ErrorHas("VantorSyncSoftware: no drive module " + std::to_string(module) + " (1 to 2)"))
            << LastError();
    }
    ASSERT_EQ(Safety()->SyncSoftware(nullptr, 2), S_OK) << LastError();
    EXPECT_EQ(Units(), (std::vector<std::string>{"1;4;" + unsynchronised, "2;4;0"}));
    EXPECT_EQ(LoadStatus(), VantorLoadConfigError);
    ASSERT_EQ(Safety()->SyncSoftware(nullptr, 1), S_OK) << LastError();
    EXPECT_EQ(Status(), VantorConfigError) << "in step, but nothing in force";
    EXPECT_EQ(LoadStatus(), VantorLoadConfigPermitted);
    EXPECT_EQ(Safety()->Reconfigure(nullptr), sim::kStatusNotAllowed);
    EXPECT_TRUE(ErrorHas("VantorReconfigure: no configuration is loaded")) << LastError();

    ASSERT_EQ(Load("ctrl:/hd0a/temp/line4.cfg"), S_OK) << LastError();
    EXPECT_EQ(Status(), VantorConfigMismatch);
    ASSERT_EQ(Safety()->Reconfigure(nullptr), S_OK) << LastError();
    EXPECT_EQ(Status(), VantorConfigLoaded);
    EXPECT_EQ(Units(), (std::vector<std::string>{"1;1;0", "2;1;0"}));
}

TEST_F(SafetyE2eTest, ViolationsInForceAndLast) {
    // The robot's record from before delivery: a tool speed violation.
    Violation last = ReadViolation(1, 1);
    EXPECT_EQ(last.number, 1u);
    EXPECT_EQ(last.type, TavVantorViolationTypeSTS);
    EXPECT_EQ(last.instance, 2u);
    EXPECT_EQ(last.unsynchronised, 0);
    EXPECT_EQ(last.axes.Read(), (std::vector<double>{0, -20, 30, 0, 45, 90}));
    EXPECT_EQ(last.speeds.Read(), (std::vector<double>{35, 42.5, 10, 0, 5, 0}));
    EXPECT_EQ(last.orientation.Read(), (std::vector<double>{1, 0, 0, 0}));
    EXPECT_EQ(last.toolSpeed.Read(), "01000000");
    EXPECT_EQ(last.toolSpeedActive.Read(), "11000000");
    EXPECT_EQ(last.upperArm.count, 8);

    // Nothing in force: "none", the robot where it stands, at rest.
    const Violation now = ReadViolation(1, 0);
    EXPECT_EQ(now.number, 0u);
    EXPECT_EQ(now.type, TavVantorViolationTypeNone);
    EXPECT_EQ(now.axes.Read(), last.axes.Read());
    EXPECT_EQ(now.speeds.Read(), (std::vector<double>(6, 0.0)));
    EXPECT_EQ(ReadViolation(2, 1).type, TavVantorViolationTypeNone) << "the positioner never had one";

    ASSERT_TRUE(sim::TriggerSafetyViolation(*Model(), 2, OLESTR("sar"), 3));
    EXPECT_FALSE(sim::TriggerSafetyViolation(*Model(), 3, OLESTR("sar"), 3));
    EXPECT_FALSE(sim::TriggerSafetyViolation(*Model(), 2, OLESTR("none"), 3));
    EXPECT_FALSE(sim::TriggerSafetyViolation(*Model(), 2, OLESTR("sar"), 9));
    for (LONG which : {0, 1}) {
        const Violation v = ReadViolation(2, which);
        EXPECT_EQ(v.number, 1u) << which;
        EXPECT_EQ(v.type, TavVantorViolationTypeSAR) << which;
        EXPECT_EQ(v.drive, 2);
        EXPECT_EQ(v.axisRange.Read(), "00100000");
        EXPECT_EQ(v.axes.Read(), (std::vector<double>{90, 0, 0, 0, 0, 0}));
    }
    // A reconfigure ends it; the record stays.
    ASSERT_EQ(Safety()->Reconfigure(nullptr), S_OK);
    EXPECT_EQ(ReadViolation(2, 0).type, TavVantorViolationTypeNone);
    EXPECT_EQ(ReadViolation(2, 1).type, TavVantorViolationTypeSAR);
    ASSERT_TRUE(sim::TriggerSafetyViolation(*Model(), 2, OLESTR("empstop"), 1));
    EXPECT_EQ(ReadViolation(2, 1).number, 2u);
    EXPECT_EQ(ReadViolation(2, 1).type, TavVantorViolationTypeEMSTOP);

    Violation none;
    EXPECT_EQ(ReadViolation(3, 0, none), sim::kStatusNotFound);
    EXPECT_TRUE(ErrorHas("VantorViolationInfo: no drive module 3 (1 to 2)")) << LastError();
}

// The mode's event tells each change once, in the Get reply's words.
TEST_F(SafetyE2eTest, ModeChangesRaiseTheEvent) {
    SinkRef sink;
    ULONG cookie = 0;
    ASSERT_EQ(Subscribe(sink.sink, kSafetyModeSubscription, &cookie, 7), S_OK) << LastError();
    ASSERT_EQ(Safety()->SetSafetyMode(nullptr, VantorSafetyModeCommissioningMode), S_OK);
    ASSERT_EQ(Safety()->SetSafetyMode(nullptr, VantorSafetyModeCommissioningMode), S_OK);
    ASSERT_EQ(Safety()->SetSafetyMode(nullptr, VantorSafetyModeActiveMode), S_OK);
    ASSERT_EQ(Named(&ITavSafety::SetSafetyConfigurationLocked, "Anna"), S_OK);
    EXPECT_EQ(Safety()->SetSafetyMode(nullptr, VantorSafetyModeServiceMode), sim::kStatusNotAllowed);
    ASSERT_EQ(Safety()->SetSafetyConfigurationUnLocked(nullptr), S_OK);
    ASSERT_EQ(Safety()->SetSafetyMode(nullptr, VantorSafetyModeServiceMode), S_OK);
    ASSERT_EQ(Safety()->ResetSafetyControllerToFactoryDefault(nullptr), S_OK);

    ASSERT_TRUE(sink->WaitFor(4)) << sink->Count();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    const auto events = sink->All();
    ASSERT_EQ(events.size(), 4u);
    const TavVantorSafetyMode expected[] = {VantorSafetyModeCommissioningMode, VantorSafetyModeActiveMode,
                                            VantorSafetyModeServiceMode, VantorSafetyModeActiveMode};
    for (std::size_t i = 0; i < events.size(); ++i) {
        EXPECT_EQ(events[i].userDef, 7u);
        TavVantorSafetyMode mode = static_cast<TavVantorSafetyMode>(99);
        EXPECT_EQ(Safety()->UnpackSafetyModeStatus(events[i].data->Get(), &mode), S_OK) << events[i].text;
        EXPECT_EQ(mode, expected[i]) << events[i].text;
    }
    EXPECT_EQ(events[0].text, "-modestat commissioning");
    EXPECT_EQ(Unsubscribe(cookie), S_OK);
}

}  // namespace
}  // namespace tav::e2e
