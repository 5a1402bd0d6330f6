// The operator's acknowledgements: of a pending mode change or a collision,
// and the Reset or Keep answer to one auto condition.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

const OLECHAR* AcknowledgeWord(TavAcknowledge ack) {
    switch (ack) {
    case AutoAck:
        return OLESTR("AUTO");
    case ManfAck:
        return OLESTR("MANF");
    case ColDetAck:
        return OLESTR("COLDET");
    default:
        return nullptr;
    }
}

const OLECHAR* AutoConditionAnswer(TavAutoConditionAck ack) {
    switch (ack) {
    case AutoConditionAck_Reset:
        return OLESTR("Reset");
    case AutoConditionAck_Keep:
        return OLESTR("Keep");
    default:
        return nullptr;
    }
}

}  // namespace

// An acknowledgement this object does not know is one it does not support
// (E_NOTIMPL) rather than a bad value (E_INVALIDARG, as for the panel's
// refused states and modes); nothing is sent for it.
HRESULT ControllerObject::Acknowledge(TavInParams* pRip, TavAcknowledge ack) {
    const OLECHAR* word = AcknowledgeWord(ack);
    return Command(pRip)
        .ValidParams(OLESTR("Acknowledge: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(word != nullptr, E_NOTIMPL, OLESTR("TavController::Acknowledge. Unknown acknowledge."))
        .Set(OLESTR("Ack"), ViewOf(word))
        .StatusOnly();
}

HRESULT ControllerObject::AcknowledgeAutoCondition(TavInParams* pRip, TavAutoConditionAck ack, ULONG ConditionID) {
    const OLECHAR* answer = AutoConditionAnswer(ack);
    return Command(pRip)
        .ValidParams(OLESTR("AcknowledgeAutoCondition: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(answer != nullptr, E_NOTIMPL, OLESTR("TavController::AcknowledgeAutoCondition. Unknown acknowledge."))
        .Set(OLESTR("AutoCondAck"),
             answer != nullptr ? text::Format(OLESTR("-AutoCondAck %s -ID %lu"), answer, ConditionID) : OleString())
        .StatusOnly();
}

}  // namespace tav
