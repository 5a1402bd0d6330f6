// The safety controller and the positional safety controller units.
#include <cstdio>

#include "tavctl/list_reader.h"
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using S = ITavSafety;

int SafetyStatus(Verb& v) {
    v.End();
    return v.Get("GetConfigStatus", &S::GetConfigStatus, &S::UnpackConfigStatus);
}
int LoadStatus(Verb& v) {
    v.End();
    return v.Get("GetLoadOperationStatus", &S::GetLoadOperationStatus, &S::UnpackLoadOperationStatus);
}
int Mode(Verb& v) {
    v.End();
    return v.Get("GetSafeyModeStatus", &S::GetSafeyModeStatus, &S::UnpackSafetyModeStatus);
}
// The controller's own words for the modes.
constexpr EnumName kModeWords[] = {{VantorSafetyModeActiveMode, "active"},
                                   {VantorSafetyModeCommissioningMode, "commissioning"},
                                   {VantorSafetyModeServiceMode, "service"}};

int SetMode(Verb& v) {
    const auto mode = v.Enum<TavVantorSafetyMode>("MODE", kModeWords);
    v.End();
    return v.Set("SetSafetyMode", &S::SetSafetyMode, mode);
}

// A TavVantorConfigInfo whose strings are freed with it.
struct ConfigInfo {
    TavVantorConfigInfo info{};
    ~ConfigInfo() { Clear(); }
    TavVantorConfigInfo* Out() {
        Clear();
        return &info;
    }
    void Clear() {
        for (BSTR text : {info.creationInfo.creationDate, info.creationInfo.createdBy,
                          info.creationInfo.configurationName, info.validationInfo.validationDate,
                          info.validationInfo.validatedBy, info.lockInfo.lockDate, info.lockInfo.lockedBy}) {
            SysFreeString(text);
        }
        info = TavVantorConfigInfo{};
    }
    Record ToRecord() const {
        std::string checksum;
        for (const byte b : info.checksum.csum) {
            char hex[3];
            std::snprintf(hex, sizeof hex, "%02x", static_cast<unsigned>(b));
            checksum += hex;
        }
        return {{"version", Value::Text(std::to_string(info.configVersion.majorVersion) + "." +
                                        std::to_string(info.configVersion.minorVersion))},
                {"name", TextValue(info.creationInfo.configurationName)},
                {"created", TextValue(info.creationInfo.creationDate)},
                {"createdBy", TextValue(info.creationInfo.createdBy)},
                {"validated", AsBoolean(info.validationInfo.isValidated)},
                {"validationDate", TextValue(info.validationInfo.validationDate)},
                {"validatedBy", TextValue(info.validationInfo.validatedBy)},
                {"locked", AsBoolean(info.lockInfo.isLocked)},
                {"lockDate", TextValue(info.lockInfo.lockDate)},
                {"lockedBy", TextValue(info.lockInfo.lockedBy)},
                {"checksum", Value::Text(checksum)}};
    }
};

int SafetyInfo(Verb& v) {
    v.End();
    const auto safety = v.Interface<S>();
    ConfigInfo info;
    return v.session.Read(
        "GetSafetyConfigurationInfo", [&](TavInParams* rip) { return safety->GetSafetyConfigurationInfo(rip, info.Out()); },
        [&](VARIANT* data) { return safety->UnpackSafetyConfigurationInfo(data, info.Out()); },
        [&] { v.session.Show(info.ToRecord()); });
}

int Validate(Verb& v) {
    const auto by = v.Text("BY");
    v.End();
    return v.Set("SetSafetyConfigurationValidated", &S::SetSafetyConfigurationValidated, by.Get());
}
int Unvalidate(Verb& v) {
    v.End();
    return v.Set("SetSafetyConfigurationNotValidated", &S::SetSafetyConfigurationNotValidated);
}
int Lock(Verb& v) {
    const auto by = v.Text("BY");
    v.End();
    return v.Set("SetSafetyConfigurationLocked", &S::SetSafetyConfigurationLocked, by.Get());
}
int Unlock(Verb& v) {
    v.End();
    return v.Set("SetSafetyConfigurationUnLocked", &S::SetSafetyConfigurationUnLocked);
}
int Load(Verb& v) {
    const auto file = v.Text("FILE");
    v.End();
    return v.Set("LoadSafetyConfigurationFile", &S::LoadSafetyConfigurationFile, file.Get());
}
int Reconfigure(Verb& v) {
    v.End();
    return v.Set("Reconfigure", &S::Reconfigure);
}
int SyncSoftware(Verb& v) {
    const int module = v.Number<int>("DRIVE_MODULE");
    v.End();
    return v.Set("SyncSoftware", &S::SyncSoftware, module);
}
int FactoryReset(Verb& v) {
    v.End();
    return v.Set("ResetSafetyControllerToFactoryDefault", &S::ResetSafetyControllerToFactoryDefault);
}

// One array of the violation status: its capacity, the count the reply
// announced, and the elements.
template <typename T>
struct Array {
    static constexpr LONG kCapacity = 16;
    T elements[kCapacity]{};
    LONG count = 0;
    Value ToValue() const {
        if (count < 0) {
            return HresultValue(count);
        }
        std::string text;
        for (LONG i = 0; i < count && i < kCapacity; ++i) {
            text += (i == 0 ? "" : ",") + (std::is_floating_point_v<T> ? Value::Real(static_cast<double>(elements[i])).text
                                                                      : std::to_string(elements[i]));
        }
        if (count > kCapacity) {
            text += ",... (" + std::to_string(count) + ")";
        }
        return Value::Text(text);
    }
};

#define TAVCTL_ARRAY(a) Array<std::remove_extent_t<decltype(a.elements)>>::kCapacity, &a.count, a.elements

int Violation(Verb& v) {
    const LONG drive = v.NumberOption<LONG>("--drive").value_or(1);
    const bool last = v.Flag("--last");
    v.End();
    const auto safety = v.Interface<S>();
    Array<double> axes, speeds, tcp, flange, orientation;
    Array<LONG> ssv, upperArm, toolPosition, toolPositionActive, toolSpeed, toolSpeedActive, axisRange,
        axisRangeActive;
    ULONG number = 0;
    TavVantorViolationType type = TavVantorViolationTypeUndefined;
    ULONG instance = 0;
    LONG synchronized = 0;
    short tool = 0;
    short driveModule = 0;
    return v.session.Read(
        "GetSafetyViolationStatus",
        [&](TavInParams* rip) {
            return safety->GetSafetyViolationStatus(
                rip, drive, last ? 1 : 0, TAVCTL_ARRAY(axes), TAVCTL_ARRAY(speeds), TAVCTL_ARRAY(tcp),
                TAVCTL_ARRAY(flange), TAVCTL_ARRAY(orientation), &number, &type, &instance, &synchronized, &tool,
                &driveModule, TAVCTL_ARRAY(ssv), TAVCTL_ARRAY(upperArm), TAVCTL_ARRAY(toolPosition),
                TAVCTL_ARRAY(toolPositionActive), TAVCTL_ARRAY(toolSpeed), TAVCTL_ARRAY(toolSpeedActive),
                TAVCTL_ARRAY(axisRange), TAVCTL_ARRAY(axisRangeActive));
        },
        [&](VARIANT* data) {
            return safety->UnpackSafetyViolationStatus(
                data, TAVCTL_ARRAY(axes), TAVCTL_ARRAY(speeds), TAVCTL_ARRAY(tcp), TAVCTL_ARRAY(flange),
                TAVCTL_ARRAY(orientation), &number, &type, &instance, &synchronized, &tool, &driveModule,
                TAVCTL_ARRAY(ssv), TAVCTL_ARRAY(upperArm), TAVCTL_ARRAY(toolPosition),
                TAVCTL_ARRAY(toolPositionActive), TAVCTL_ARRAY(toolSpeed), TAVCTL_ARRAY(toolSpeedActive),
                TAVCTL_ARRAY(axisRange), TAVCTL_ARRAY(axisRangeActive));
        },
        [&] {
            v.session.Show(Record{{"number", Show(number)},
                                  {"type", Show(type)},
                                  {"instance", Show(instance)},
                                  {"synchronized", AsBoolean(synchronized)},
                                  {"tool", Show(tool)},
                                  {"driveModule", Show(driveModule)},
                                  {"axes", axes.ToValue()},
                                  {"speeds", speeds.ToValue()},
                                  {"tcp", tcp.ToValue()},
                                  {"flangePosition", flange.ToValue()},
                                  {"flangeOrientation", orientation.ToValue()},
                                  {"ssv", ssv.ToValue()},
                                  {"upperArm", upperArm.ToValue()},
                                  {"toolPosition", toolPosition.ToValue()},
                                  {"toolPositionActive", toolPositionActive.ToValue()},
                                  {"toolSpeed", toolSpeed.ToValue()},
                                  {"toolSpeedActive", toolSpeedActive.ToValue()},
                                  {"axisRange", axisRange.ToValue()},
                                  {"axisRangeActive", axisRangeActive.ToValue()}});
        });
}

int Units(Verb& v) {
    v.End();
    const auto psc = v.Interface<ITavPositionalSafetyController>();
    return ReadList<IEnumTavPSCUnits, TavPSCUnit>(
        v, "GetPSCUnitStatus", -2,
        [&](TavInParams* rip, TavRetrievalParams* params, IEnumTavPSCUnits** units) {
            return psc->GetPSCUnitStatus(rip, params, units);
        },
        [&](VARIANT* data, TavRetrievalParams* params, IEnumTavPSCUnits** units) {
            return psc->UnpackPSCUnitStatus(data, params, units);
        },
        [](TavPSCUnit& unit) {
            return Record{{"unit", Show(unit.PSCUnitID)},
                          {"status", Show(unit.PSCStatus)},
                          {"callStatus", HresultValue(unit.PSCCallStatus)}};
        });
}

constexpr VerbEntry kSafety[] = {
    {"status", "", "print the configuration status (GetConfigStatus)", SafetyStatus},
    {"load-status", "", "print whether loading a configuration is permitted (GetLoadOperationStatus)", LoadStatus},
    {"mode", "", "print the safety mode (GetSafeyModeStatus)", Mode},
    {"set-mode", "MODE", "set the safety mode (SetSafetyMode)", SetMode,
     "MODE: active, commissioning, service, a TavVantorSafetyMode name\n"
     "(VantorSafetyModeActiveMode, ...) or a number.\n"},
    {"info", "", "print the configuration information (GetSafetyConfigurationInfo)", SafetyInfo},
    {"validate", "BY", "mark the configuration validated (SetSafetyConfigurationValidated)", Validate},
    {"unvalidate", "", "mark the configuration not validated (SetSafetyConfigurationNotValidated)", Unvalidate},
    {"lock", "BY", "lock the configuration (SetSafetyConfigurationLocked)", Lock},
    {"unlock", "", "unlock the configuration (SetSafetyConfigurationUnLocked)", Unlock},
    {"load", "FILE", "load a configuration file (LoadSafetyConfigurationFile)", Load,
     "FILE: a local file, copied to the controller first, or a ctrl: path. The\n"
     "virtual controller reads key=value lines: name=, version=MAJOR.MINOR,\n"
     "createdby=, created= (required), toolposition=, toolspeed=, axisrange=\n"
     "(instances 1 to 8, comma-separated). A loaded file is in force after\n"
     "'safety reconfigure'.\n"},
    {"reconfigure", "", "reconfigure the safety controller (Reconfigure)", Reconfigure},
    {"sync", "DRIVE_MODULE", "synchronise a drive module's software (SyncSoftware)", SyncSoftware},
    {"factory-reset", "", "reset to the factory defaults (ResetSafetyControllerToFactoryDefault)", FactoryReset},
    {"violation", "[--drive N] [--last]", "print the violation status (GetSafetyViolationStatus)", Violation,
     "--drive: the drive module (default 1); --last: the last violation. Up to 16\n"
     "elements of each array are shown, with the count when there are more.\n"},
};
constexpr VerbEntry kPsc[] = {{"units", "", "list the units' status (GetPSCUnitStatus)", Units}};

}  // namespace

std::span<const GroupEntry> SafetyGroups() {
    static constexpr GroupEntry kGroups[] = {
        {"safety", "The safety controller", kSafety},
        {"psc", "Positional safety controller units", kPsc},
    };
    return kGroups;
}

}  // namespace tavctl
