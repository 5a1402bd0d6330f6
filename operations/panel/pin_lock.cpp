// The PIN lock of the operation-mode selector.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

constexpr WordValue<TavOPModeLockState> kLockWords[] = {{OLESTR("locked"), OPModeLockStateLocked},
                                                        {OLESTR("unlocked"), OPModeLockStateUnlocked},
                                                        {OLESTR("permlocked"), OPModeLockStatePermLocked},
                                                        {OLESTR("pendpermlocked"), OPModeLockStatePendingPermLocked}};

}  // namespace

// The PIN is written as a signed number of at least four digits; the client
// leaves its range to the controller.
HRESULT ControllerObject::LockOPModePinCode2(TavInParams* rip, ULONG pincode, LONG permanent) {
    return Command(rip)
        .ValidParams(OLESTR("LockOPModePinCode: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Set(OLESTR("LockOPModePinCode"),
             text::Format(OLESTR("-pincode %.4d -permanent %d"), pincode, permanent != 0 ? 1 : 0))
        .StatusOnly();
}

HRESULT ControllerObject::LockOPModePinCode(TavInParams* rip, ULONG pincode) {
    return LockOPModePinCode2(rip, pincode, 0);
}

HRESULT ControllerObject::UnlockOPModePinCode(TavInParams* rip, ULONG pincode) {
    return Command(rip)
        .ValidParams(OLESTR("UnlockOPModePinCode: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Set(OLESTR("UnlockOPModePinCode"), text::Format(OLESTR("-pincode %.4d"), pincode))
        .StatusOnly();
}

HRESULT ControllerObject::GetOPModePinCodeLockState(TavInParams* rip, TavOPModeLockState* state) {
    return Command(rip)
        .ValidParams(OLESTR("GetOPModePinCodeLockState: Invalid TavInParams"))
        .OutPointer(state, OLESTR("GetOPModePinCodeLockState: Invalid pointer"))
        .Initialised(OLESTR("TavController used before initialized"))
        .Get(OLESTR("OPModePinCodeLockState"))
        .Decode([&](VARIANT* reply) { return UnpackOPModePinCodeLockState(reply, state); });
}

// A word the controller adds later reads as undefined, not as a failure.
HRESULT ControllerObject::UnpackOPModePinCodeLockState(VARIANT* data, TavOPModeLockState* state) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackOPModePinCodeLockState. NULL data pointer"))
        .OutPointer(state, OLESTR("UnpackOPModePinCodeLockState. Invalid out pointer"))
        .IsBstr(OLESTR("UnpackOPModePinCodeLockState. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-lockstate %20s")>(
            OLESTR("UnpackOPModePinCodeLockState failed."),
            fields::MappedOr<TavOPModeLockState>{state, kLockWords, OPModeLockStateUndefined});
}

}  // namespace tav
