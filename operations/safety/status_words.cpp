// The safety controller's three status words: its configuration, whether a
// new configuration may be loaded, and its mode. A word the controller adds
// later reads as the default, which differs on purpose: an unknown load
// status is a refusal, an unknown configuration or mode an error.
#include "core/controller_object.h"
#include "operations/safety/safety_mode_words.h"

namespace tav {
namespace {

constexpr WordValue<TavVantorConfigStatus> kConfigWords[] = {{OLESTR("loaded"), VantorConfigLoaded},
                                                             {OLESTR("validated"), VantorConfigValidate},
                                                             {OLESTR("locked"), VantorConfigLocked},
                                                             {OLESTR("mismatch"), VantorConfigMismatch}};

constexpr WordValue<TavVantorLoadConfigStatus> kLoadWords[] = {{OLESTR("ok"), VantorLoadConfigPermitted},
                                                               {OLESTR("error"), VantorLoadConfigError}};

}  // namespace

HRESULT ControllerObject::GetConfigStatus(TavInParams* rip, TavVantorConfigStatus* status) {
    return Command(rip)
        .ValidParams(OLESTR("GetConfigStatus: Invalid TavInParams"))
        .OutPointer(status, OLESTR("GetConfigStatus - Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("VantorConfigStatus"))
        .Decode([&](VARIANT* reply) { return UnpackConfigStatus(reply, status); });
}

HRESULT ControllerObject::UnpackConfigStatus(VARIANT* data, TavVantorConfigStatus* status) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackConfigStatus. NULL data-variant"))
        .OutPointers(OLESTR("UnpackConfigStatus. Invalid out pointer"), status)
        .IsBstr(OLESTR("UnpackConfigStatus. Invalid argument."))
        .Fields<OLESTR("-confstatus %40s")>(OLESTR("UnpackConfigStatus failed."),
                                            fields::MappedOr<TavVantorConfigStatus>{status, kConfigWords,
                                                                                    VantorConfigError});
}

HRESULT ControllerObject::GetLoadOperationStatus(TavInParams* rip, TavVantorLoadConfigStatus* status) {
    return Command(rip)
        .ValidParams(OLESTR("GetLoadOperationStatus: Invalid TavInParams"))
        .OutPointer(status, OLESTR("GetLoadOperationStatus - Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("VantorLoadOperationStatus"))
        .Decode([&](VARIANT* reply) { return UnpackLoadOperationStatus(reply, status); });
}

HRESULT ControllerObject::UnpackLoadOperationStatus(VARIANT* data, TavVantorLoadConfigStatus* status) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackLoadOperationStatus. NULL data-variant"))
        .OutPointers(OLESTR("UnpackLoadOperationStatus. Invalid out pointer"), status)
        .IsBstr(OLESTR("UnpackLoadOperationStatus. Invalid argument."))
        .Fields<OLESTR("-loadstatus %40s")>(OLESTR("UnpackLoadOperationStatus failed."),
                                            fields::MappedOr<TavVantorLoadConfigStatus>{status, kLoadWords,
                                                                                        VantorLoadConfigDeclined});
}

HRESULT ControllerObject::GetSafeyModeStatus(TavInParams* rip, TavVantorSafetyMode* status) {
    return Command(rip)
        .ValidParams(OLESTR("GetSafeyModeStatus: Invalid TavInParams"))
        .OutPointer(status, OLESTR("GetSafeyModeStatus - Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("SafetyModeStatus"))
        .Decode([&](VARIANT* reply) { return UnpackSafetyModeStatus(reply, status); });
}

HRESULT ControllerObject::UnpackSafetyModeStatus(VARIANT* data, TavVantorSafetyMode* status) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSafetyModeStatus. NULL data-variant"))
        .OutPointers(OLESTR("UnpackSafetyModeStatus. Invalid out pointer"), status)
        .IsBstr(OLESTR("UnpackSafetyModeStatus. Invalid argument."))
        .Fields<OLESTR("-modestat %40s")>(OLESTR("UnpackSafetyModeStatus failed."),
                                          fields::MappedOr<TavVantorSafetyMode>{status, kSafetyModeWords,
                                                                                VantorSafetyModeError});
}

}  // namespace tav
