// The speed ratio: the program speed override in percent.
#include "core/controller_object.h"
#include "core/text/format.h"
#include "core/text/number.h"

namespace tav {

HRESULT ControllerObject::SetSpeedRatio(TavInParams* rip, short ratio) {
    return Command(rip)
        .ValidParams(OLESTR("SetSpeedRatio: Invalid TavInParams"))
        .Initialised(OLESTR("SetSpeedRatio. Helper used before initialized."))
        .Require(ratio >= 0 && ratio <= 100, E_INVALIDARG, OLESTR("Invalid ratio"))
        .Set(OLESTR("SpeedAdjust"), text::Format(OLESTR("-Value %d"), ratio))
        .StatusOnly();
}

HRESULT ControllerObject::GetSpeedRatio(TavInParams* rip, short* ratio) {
    return Command(rip)
        .ValidParams(OLESTR("GetSpeedRatio. Invalid argument."))
        .OutPointer(ratio, OLESTR("GetSpeedRatio. Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("SpeedAdjust"))
        .Decode([&](VARIANT* reply) { return UnpackSpeedRatio(reply, ratio); });
}

// A bare number, read as the C library's string-to-long reads it and kept in
// 16 bits; the controller's value is not checked again here.
HRESULT ControllerObject::UnpackSpeedRatio(VARIANT* data, short* ratio) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSpeedRatio. Invalid data-variant"))
        .OutPointer(ratio, OLESTR(""))
        .IsBstr(OLESTR("UnpackSpeedRatio. Invalid argument."))
        .Then([&](Reply& reply) {
            *ratio = static_cast<short>(text::StrToLong(reply.Text()).value);
            return S_OK;
        });
}

}  // namespace tav
