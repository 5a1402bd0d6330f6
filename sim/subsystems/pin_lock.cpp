// The PIN lock of the operation-mode selector.
#include "sim/subsystems/pin_lock.h"

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"

namespace tav::sim {
namespace {

TextView LockWord(ModeLock lock) {
    switch (lock) {
        case ModeLock::Locked: return OLESTR("locked");
        case ModeLock::PendingPermLocked: return OLESTR("pendpermlocked");
        case ModeLock::PermLocked: return OLESTR("permlocked");
        case ModeLock::Unlocked: break;
    }
    return OLESTR("unlocked");
}

// "-lockstate " and the word: locked, unlocked, permlocked, pendpermlocked.
Text LockStateText(const ModelState& state) {
    return Concat({OLESTR("-lockstate "), LockWord(state.Part<PinLockState>().lock)});
}

// The client writes the PIN with at least four digits; the controller takes
// any such number, but no shorter one and nothing negative.
std::optional<std::int64_t> PinOf(const Arguments& arguments) {
    const auto text = arguments.Find(OLESTR("-pincode"));
    if (!text || text->size() < 4) {
        return std::nullopt;
    }
    std::int64_t pin = 0;
    for (OLECHAR c : *text) {
        if (c < '0' || c > '9' || pin > 999999999) {
            return std::nullopt;
        }
        pin = pin * 10 + (c - '0');
    }
    return pin;
}

Reply GetLockState(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return LockStateText(state); }));
}

Reply Lock(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto pin = arguments ? PinOf(*arguments) : std::nullopt;
    const auto permanent = arguments ? arguments->Signed(OLESTR("-permanent")) : std::nullopt;
    if (!pin || !permanent || (*permanent != 0 && *permanent != 1)) {
        return BadArguments(command, OLESTR("-pincode <four or more digits> -permanent 0|1"));
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        PinLockState& lock = state.Part<PinLockState>();
        if (lock.lock != ModeLock::Unlocked) {
            return Refuse(kStatusNotAllowed, OLESTR("LockOPModePinCode: the operation mode is already ") +
                                                 Text(LockWord(lock.lock)));
        }
        lock.lock = *permanent == 1 ? ModeLock::PendingPermLocked : ModeLock::Locked;
        lock.pin = *pin;
        return Done();
    });
}

Reply Unlock(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto pin = arguments ? PinOf(*arguments) : std::nullopt;
    if (!pin) {
        return BadArguments(command, OLESTR("-pincode <four or more digits>"));
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        PinLockState& lock = state.Part<PinLockState>();
        if (lock.lock == ModeLock::Unlocked) {
            return Refuse(kStatusNotAllowed, OLESTR("UnlockOPModePinCode: the operation mode is not locked"));
        }
        if (lock.pin != *pin) {
            return Refuse(kStatusNotAllowed, OLESTR("UnlockOPModePinCode: wrong PIN code"));
        }
        lock = PinLockState{};
        return Done();
    });
}

// "OPModePinCodeLockState": the Get reply, "-lockstate locked" and so on.
Text LockStateEvent(const ModelState& state, const Arguments&) { return LockStateText(state); }

}  // namespace

bool ModeIsLocked(const ModelState& state) { return state.Part<PinLockState>().lock != ModeLock::Unlocked; }

void RestartPinLock(ModelState& state) {
    PinLockState& lock = state.Part<PinLockState>();
    if (lock.lock == ModeLock::Locked) {
        lock = PinLockState{};
    } else if (lock.lock == ModeLock::PendingPermLocked) {
        lock.lock = ModeLock::PermLocked;
    }
}

const Subsystem& PinLockSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("OPModePinCodeLockState"), GetLockState},
        {OLESTR("Set"), OLESTR("LockOPModePinCode"), Lock},
        {OLESTR("Set"), OLESTR("UnlockOPModePinCode"), Unlock},
    };
    static constexpr EventRow kEvents[] = {
        {OLESTR("OPModePinCodeLockState"), EventStyle::Value, LockStateEvent},
    };
    static constexpr Subsystem subsystem{kRows, kEvents};
    return subsystem;
}

}  // namespace tav::sim
