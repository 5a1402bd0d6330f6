// Controller clock, start-up time and restart.
#include "core/controller_object.h"
#include "core/text/format.h"
#include "core/text/scan.h"
#include "operations/controller/filetime.h"

namespace tav {

HRESULT ControllerObject::GetSystemClock(TavInParams* rip, FILETIME* clock) {
    return Command(rip)
        .ValidParams(OLESTR("GetSystemClock: Invalid TavInParams"))
        .OutPointer(clock, OLESTR("GetSystemClock: Invalid out-pointer"))
        .Initialised(OLESTR("GetSystemClock. Helper used before initialized."))
        .Get(OLESTR("SystemClock"))
        .Decode([&](VARIANT* reply) { return UnpackSystemClock(reply, clock); });
}

HRESULT ControllerObject::GetSystemStartupClock(TavInParams* rip, FILETIME* clock) {
    return Command(rip)
        .ValidParams(OLESTR("GetSystemStartupClock: Invalid TavInParams"))
        .OutPointer(clock, OLESTR(""))
        .Initialised(OLESTR("GetSystemStartupClock. Helper used before initialized."))
        .Get(OLESTR("SystemStartupClock"))
        .Decode([&](VARIANT* reply) { return UnpackSystemClock(reply, clock); });
}

HRESULT ControllerObject::SetSystemClock(TavInParams* rip, FILETIME clock) {
    const uint64_t ticks = TicksOf(clock);
    const auto seconds = static_cast<uint32_t>((ticks - kUnixEpochTicks) / kTicksPerSecond);
    return Command(rip)
        .ValidParams(OLESTR("SetSystemClock: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(ticks >= kUnixEpochTicks, E_INVALIDARG,
                 OLESTR("SetSystemClock - Clock below valid range for controller (Unix time_t)"))
        .Require(ticks <= kLastControllerTicks, E_INVALIDARG,
                 OLESTR("SetSystemClock - Clock above valid range for controller (Unix time_t)"))
        .Set(OLESTR("SystemClock"), text::Format(OLESTR("-time_t %lu"), seconds))
        .StatusOnly();
}

HRESULT ControllerObject::UnpackSystemClock(VARIANT* data, FILETIME* clock) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSystemClock. NULL data-variant"))
        .OutPointer(clock, OLESTR(""))
        .IsBstr(OLESTR("UnpackSystemClock. Invalid argument."))
        .Then([&](Reply& reply) {
            uint32_t seconds = 0;
            if (text::Scan<OLESTR("-time_t %lu")>(reply.Text(), &seconds) != 1) {
                return reply.Fail(E_FAIL, OLESTR("UnpackSystemClock. Unsupported time-format."));
            }
            *clock = FileTimeFromControllerSeconds(seconds);
            return S_OK;
        });
}

HRESULT ControllerObject::Restart(TavInParams* rip, TavRestartMode mode) {
    static constexpr const OLECHAR* kWords[] = {OLESTR("WARM"),    OLESTR("COLD"),    OLESTR("P_START"),
                                                OLESTR("I_START"), OLESTR("X_START"), OLESTR("S_START"),
                                                OLESTR("B_START")};
    const bool known = mode >= WarmStart && mode <= BStart;
    return Command(rip)
        .ValidParams(OLESTR("Restart: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(known, E_INVALIDARG, OLESTR("Restart. Unknown restart mode"))
        .Set(OLESTR("Restart"), known ? kWords[mode] : OLESTR(""))
        .StatusOnly();
}

}  // namespace tav
