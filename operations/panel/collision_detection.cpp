// Collision detection state.
#include "core/controller_object.h"

namespace tav {

HRESULT ControllerObject::GetCollisionDetectState(TavInParams* pRip, TavCollisionDetectState* pState) {
    return Command(pRip)
        .ValidParams(OLESTR("GetCollisionDetectState. Invalid argument."))
        .OutPointer(pState, OLESTR("GetCollisionDetectState. Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("ColdetState"))
        .Decode([&](VARIANT* reply) { return UnpackCollisionDetectState(reply, pState); });
}

HRESULT ControllerObject::UnpackCollisionDetectState(VARIANT* pVar, TavCollisionDetectState* pState) {
    return Decode(pVar)
        .Initialised()
        .NotNull(OLESTR("UnpackCollisionDetectState. NULL VARIANT"))
        .OutPointer(pState, OLESTR(""))
        .IsBstr(OLESTR("UnpackCollisionDetectState. Non-BSTR argument."))
        .Then([&](Reply& reply) {
            const auto state = FindWord<TavCollisionDetectState>(
                reply.CText(), {{OLESTR("INIT"), CollisionDetect_Init},
                                          {OLESTR("TRIGGERED"), CollisionDetect_Triggered},
                                          {OLESTR("CONFIRMED"), CollisionDetect_Confirmed},
                                          {OLESTR("TRIGGERED_ACK"), CollisionDetect_TriggeredAck}});
            if (!state) {
                // Unlike the other panel decoders, this text does not quote the word.
                return reply.Fail(E_FAIL, OLESTR("UnpackCollisionDetectState. Invalid argument."));
            }
            *pState = *state;
            return S_OK;
        });
}

}  // namespace tav
