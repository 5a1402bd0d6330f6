#include "tavctl/names.h"

#include <cstdio>

#include "sim/status_codes.h"
#include "tavctl/text.h"

namespace tavctl {
namespace {

constexpr EnumName kControllerStates[] = {
    {InitState, "InitState"}, {MotorsOff, "MotorsOff"},         {MotorsOn, "MotorsOn"},     {GuardStop, "GuardStop"},
    {EmergencyStop, "EmergencyStop"}, {EmergencyStopReset, "EmergencyStopReset"}, {SysFail, "SysFail"},
};

constexpr EnumName kOperationModes[] = {
    {Auto, "Auto"},           {InitOp, "InitOp"},         {Manr, "Manr"},
    {Manf, "Manf"},           {AutoChange, "AutoChange"}, {ManfChange, "ManfChange"},
    {UndefinedMode, "UndefinedMode"},
};

constexpr EnumName kCollisionStates[] = {
    {CollisionDetect_Init, "CollisionDetect_Init"},
    {CollisionDetect_Triggered, "CollisionDetect_Triggered"},
    {CollisionDetect_Confirmed, "CollisionDetect_Confirmed"},
    {CollisionDetect_TriggeredAck, "CollisionDetect_TriggeredAck"},
};

constexpr EnumName kEnergyStates[] = {
    {TavSysEnergyStateNotPaused, "TavSysEnergyStateNotPaused"},
    {TavSysEnergyStatePaused, "TavSysEnergyStatePaused"},
    {TavSysEnergyStateBlocked, "TavSysEnergyStateBlocked"},
    {TavSysEnergyStateResuming, "TavSysEnergyStateResuming"},
    {TavSysEnergyStatePausing, "TavSysEnergyStatePausing"},
};

constexpr EnumName kRestartModes[] = {
    {WarmStart, "WarmStart"}, {ColdStart, "ColdStart"}, {PStart, "PStart"}, {IStart, "IStart"},
    {XStart, "XStart"},       {SStart, "SStart"},       {BStart, "BStart"},
};

constexpr EnumName kAutoConditions[] = {
    {AutoConditionType_BlockedSignals, "AutoConditionType_BlockedSignals"},
    {AutoConditionType_DeactivatedTasks, "AutoConditionType_DeactivatedTasks"},
    {AutoConditionType_CallChain, "AutoConditionType_CallChain"},
    {AutoConditionType_SpeedOverride, "AutoConditionType_SpeedOverride"},
    {AutoConditionType_RunMode, "AutoConditionType_RunMode"},
    {AutoConditionType_StartExecute, "AutoConditionType_StartExecute"},
    {AutoConditionType_KestoSpy, "AutoConditionType_KestoSpy"},
    {AutoConditionType_Eio, "AutoConditionType_Eio"},
};

constexpr EnumName kConfigurations[] = {
    {TavAutoConditionConfiguration_Reset, "TavAutoConditionConfiguration_Reset"},
    {TavAutoConditionConfiguration_Keep, "TavAutoConditionConfiguration_Keep"},
};

struct HresultEntry {
    HRESULT hr;
    const char* name;
};

constexpr HresultEntry kHresults[] = {
    {S_OK, "S_OK"},
    {S_FALSE, "S_FALSE"},
    {E_NOTIMPL, "E_NOTIMPL"},
    {E_NOINTERFACE, "E_NOINTERFACE"},
    {E_POINTER, "E_POINTER"},
    {E_ABORT, "E_ABORT"},
    {E_FAIL, "E_FAIL"},
    {E_UNEXPECTED, "E_UNEXPECTED"},
    {E_ACCESSDENIED, "E_ACCESSDENIED"},
    {E_HANDLE, "E_HANDLE"},
    {E_OUTOFMEMORY, "E_OUTOFMEMORY"},
    {E_INVALIDARG, "E_INVALIDARG"},
    {CLASS_E_NOAGGREGATION, "CLASS_E_NOAGGREGATION"},
    {CLASS_E_CLASSNOTAVAILABLE, "CLASS_E_CLASSNOTAVAILABLE"},
    {REGDB_E_CLASSNOTREG, "REGDB_E_CLASSNOTREG"},
    {CO_E_NOTINITIALIZED, "CO_E_NOTINITIALIZED"},
};

}  // namespace

std::span<const EnumName> ControllerStateNames() { return kControllerStates; }
std::span<const EnumName> OperationModeNames() { return kOperationModes; }
std::span<const EnumName> CollisionStateNames() { return kCollisionStates; }
std::span<const EnumName> EnergyStateNames() { return kEnergyStates; }
std::span<const EnumName> RestartModeNames() { return kRestartModes; }
std::span<const EnumName> AutoConditionNames() { return kAutoConditions; }
std::span<const EnumName> ConfigurationNames() { return kConfigurations; }

std::string NameOf(std::span<const EnumName> names, long value) {
    for (const EnumName& entry : names) {
        if (entry.value == value) {
            return entry.name;
        }
    }
    return std::to_string(value);
}

std::optional<long> ValueOf(std::span<const EnumName> names, std::string_view name) {
    const std::string wanted = Lower(name);
    for (const EnumName& entry : names) {
        if (Lower(entry.name) == wanted) {
            return entry.value;
        }
    }
    return std::nullopt;
}

std::string HresultName(HRESULT hr) {
    for (const HresultEntry& entry : kHresults) {
        if (entry.hr == hr) {
            return entry.name;
        }
    }
    const char* simName = tav::sim::StatusName(hr);
    return simName == nullptr ? std::string() : std::string(simName);
}

std::string DescribeHresult(HRESULT hr) {
    char hex[16];
    std::snprintf(hex, sizeof hex, "0x%08X", static_cast<unsigned>(hr));
    const std::string name = HresultName(hr);
    return name.empty() ? std::string(hex) : std::string(hex) + " (" + name + ")";
}

}  // namespace tavctl
