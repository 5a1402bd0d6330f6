// The virtual clock of a controller that runs in simulation: its state, time
// slice, time and speed. Some operations report with their neighbours'
// texts; clients know them so.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

// The set command carries the state with its "VT" prefix, the reply without.
constexpr WordValue<TavVTState> kVtStateWords[] = {{OLESTR("VTStop"), VTStop},
                                                   {OLESTR("VTFreeRun"), VTFreeRun},
                                                   {OLESTR("VTRunSlice"), VTRunSlice},
                                                   {OLESTR("VTNextEvent"), VTNextEvent}};

constexpr WordValue<TavVTState> kStateReplies[] = {{OLESTR("-VTState Stop"), VTStop},
                                                   {OLESTR("-VTState FreeRun"), VTFreeRun},
                                                   {OLESTR("-VTState RunSlice"), VTRunSlice},
                                                   {OLESTR("-VTState NextEvent"), VTNextEvent}};

}  // namespace

HRESULT ControllerObject::VTGetState(TavInParams* rip, TavVTState* state) {
    return Command(rip)
        .ValidParams(OLESTR("VTGetState: Invalid TavInParams"))
        .OutPointer(state, OLESTR("VTGetState: Invalid out-pointer"))
        .Initialised(OLESTR("VTGetState. TavController used before Initialized"))
        .Get(OLESTR("VTState"))
        .Decode([&](VARIANT* reply) { return UnpackVTState(reply, state); });
}

HRESULT ControllerObject::VTSetState(TavInParams* rip, TavVTState state) {
    const OLECHAR* word = WordOf(state, kVtStateWords);
    return Command(rip)
        .ValidParams(OLESTR("VTSetState: Invalid TavInParams"))
        .Initialised(OLESTR("VTSetState. Helper used before initialized."))
        .Require(word != nullptr, E_INVALIDARG, OLESTR("VTSetState - Unknown state"))
        .Set(OLESTR("VTState"), ViewOf(word))
        .StatusOnly();
}

HRESULT ControllerObject::VTGetTimeSlice(TavInParams* rip, ULONG* timeSlice) {
    return Command(rip)
        .ValidParams(OLESTR("VTGetTimeSlice: Invalid TavInParams"))
        .OutPointer(timeSlice, OLESTR("VTGetTimeSlice: Invalid out-pointer"))
        .Initialised(OLESTR("VTGetTimeSlice. TavController used before Initialized"))
        .Get(OLESTR("VTTimeSlice"))
        .Decode([&](VARIANT* reply) { return UnpackVTTime(reply, timeSlice); });
}

HRESULT ControllerObject::VTSetTimeSlice(TavInParams* rip, ULONG timeSlice) {
    return Command(rip)
        .ValidParams(OLESTR("VTSetTimeSlice: Invalid TavInParams"))
        .Initialised(OLESTR("VTSetState. Helper used before initialized."))
        .Set(OLESTR("VTTimeSlice"), text::Format(OLESTR("-time %lu"), timeSlice))
        .StatusOnly();
}

HRESULT ControllerObject::VTGetTime(TavInParams* rip, ULONG* time) {
    return Command(rip)
        .ValidParams(OLESTR("VTGetTimeSlice: Invalid TavInParams"))
        .OutPointer(time, OLESTR("VTGetTimeSlice: Invalid out-pointer"))
        .Initialised(OLESTR("VTGetTimeSlice. TavController used before Initialized"))
        .Get(OLESTR("VTTime"))
        .Decode([&](VARIANT* reply) { return UnpackVTTime(reply, time); });
}

HRESULT ControllerObject::VTRun(TavInParams* rip) {
    return Command(rip)
        .ValidParams(OLESTR("VTRun: Invalid TavInParams"))
        .Initialised(OLESTR("VTRun. Helper used before initialized."))
        .Set(OLESTR("VTRun"))
        .StatusOnly();
}

HRESULT ControllerObject::UnpackVTState(VARIANT* data, TavVTState* state) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackVTState. NULL data-variant"))
        .OutPointer(state, OLESTR(""))
        .IsBstr(OLESTR("UnpackVTState. Non-BSTR argument."))
        .Then([&](Reply& reply) {
            return reply.Word(reply.CText(), std::span<const WordValue<TavVTState>>(kStateReplies), state,
                              OLESTR("UnpackVTState. Unknown state %s."));
        });
}

HRESULT ControllerObject::UnpackVTTime(VARIANT* data, ULONG* time) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackVTTime. NULL data-variant"))
        .OutPointer(time, OLESTR(""))
        .IsBstr(OLESTR("UnpackVTTime. Non-BSTR argument."))
        .FieldsQuotingReply<OLESTR("-time %lu")>(OLESTR("UnpackVTTime. Could not parse: %s."), time);
}

HRESULT ControllerObject::VTSetSpeed(TavInParams* rip, ULONG speed) {
    return Command(rip)
        .ValidParams(OLESTR("VTSetSpeed: Invalid TavInParams"))
        .Initialised(OLESTR("VTSetSpeed. Helper used before initialized."))
        .Set(OLESTR("VTSpeed"), text::Format(OLESTR("-speed %lu"), speed))
        .StatusOnly();
}

HRESULT ControllerObject::VTGetSpeed(TavInParams* rip, ULONG* speed) {
    return Command(rip)
        .ValidParams(OLESTR("VTGetSpeed: Invalid TavInParams"))
        .OutPointer(speed, OLESTR("VTGetSpeed: Invalid out-pointer"))
        .Initialised(OLESTR("VTGetSpeed. TavController used before Initialized"))
        .Get(OLESTR("VTSpeed"))
        .Decode([&](VARIANT* reply) { return UnpackVTSpeed(reply, speed); });
}

HRESULT ControllerObject::UnpackVTSpeed(VARIANT* data, ULONG* speed) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackVTSpeed. NULL data-variant"))
        .OutPointer(speed, OLESTR(""))
        .IsBstr(OLESTR("UnpackVTSpeed. Non-BSTR argument."))
        .FieldsQuotingReply<OLESTR("-speed %lu")>(OLESTR("UnpackVTSpeed. Could not parse: %s."), speed);
}

}  // namespace tav
