// Motors state: requesting motors on or off, and reading the state back.
#include "core/controller_object.h"

namespace tav {
namespace {

// Only these two states can be asked for; the controller reaches the others
// by itself. The request is the bare word.
const OLECHAR* RequestWord(TavControllerState state) {
    switch (state) {
    case MotorsOff:
        return OLESTR("STAND_BY");
    case MotorsOn:
        return OLESTR("RUN");
    default:
        return nullptr;
    }
}

}  // namespace

HRESULT ControllerObject::SetControllerState(TavInParams* pRip, TavControllerState state) {
    const OLECHAR* word = RequestWord(state);
    return Command(pRip)
        .ValidParams(OLESTR("SetControllerState. Invalid TavInParams."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(word != nullptr, E_INVALIDARG, OLESTR("SetControllerState. Not allowed state change."))
        .Set(OLESTR("State"), ViewOf(word))
        .StatusOnly();
}

// The key-less request can only switch the motors on.
HRESULT ControllerObject::SetControllerStateKeyLess(TavInParams* pRip, TavControllerState state) {
    return Command(pRip)
        .ValidParams(OLESTR("SetControllerStateKeyLess. Invalid TavInParams."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(state == MotorsOn, E_INVALIDARG, OLESTR("SetControllerStateKeyLess. Not allowed state change."))
        .Set(OLESTR("StateUsingKeyLess"), OLESTR("RUN"))
        .StatusOnly();
}

HRESULT ControllerObject::GetControllerState(TavInParams* pRip, TavControllerState* pState) {
    return Command(pRip)
        .ValidParams(OLESTR("TavController::GetControllerState. Invalid argument."))
        .OutPointer(pState, OLESTR("GetControllerState. Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("State"))
        .Decode([&](VARIANT* reply) { return UnpackControllerState(reply, pState); });
}

// Also the decoder of the "State" event. POWER_ON reads as motors off and
// POWER_OFF as motors on: the controller's words, taken as they are.
HRESULT ControllerObject::UnpackControllerState(VARIANT* pData, TavControllerState* pState) {
    return Decode(pData)
        .Initialised()
        .NotNull(OLESTR("UnpackControllerState. NULL VARIANT"))
        .OutPointer(pState, OLESTR(""))
        .IsBstr(OLESTR("UnpackControllerState. Non-BSTR argument."))
        .Then([&](Reply& reply) {
            return reply.Word<TavControllerState>(reply.CText(),
                                                  {{OLESTR("STAND_BY"), MotorsOff},
                                                   {OLESTR("POWER_ON"), MotorsOff},
                                                   {OLESTR("RUN"), MotorsOn},
                                                   {OLESTR("POWER_OFF"), MotorsOn},
                                                   {OLESTR("INIT"), InitState},
                                                   {OLESTR("GUARD_STOP"), GuardStop},
                                                   {OLESTR("EM_STOP"), EmergencyStop},
                                                   {OLESTR("STB_EM_RESET"), EmergencyStopReset},
                                                   {OLESTR("GRD_EM_RESET"), EmergencyStopReset},
                                                   {OLESTR("SYS_FAIL"), SysFail}},
                                                  pState, OLESTR("UnpackControllerState. Unsupported state:%s"));
        });
}

}  // namespace tav
