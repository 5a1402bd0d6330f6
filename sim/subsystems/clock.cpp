// Clock and restart.
#include <array>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/reply_texts.h"
#include "sim/status_codes.h"
#include "sim/subsystems/pin_lock.h"

namespace tav::sim {
namespace {

constexpr std::array kRestartModes = {
    TextView(OLESTR("WARM")),    TextView(OLESTR("COLD")),    TextView(OLESTR("P_START")), TextView(OLESTR("I_START")),
    TextView(OLESTR("X_START")), TextView(OLESTR("S_START")), TextView(OLESTR("B_START")),
};

Reply GetSystemClock(ControllerModel& controller, const Command&) { return Answer(ClockText(controller.Now())); }

Reply SetSystemClock(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto seconds = arguments ? arguments->Unsigned(OLESTR("-time_t")) : std::nullopt;
    if (!seconds) {
        return BadArguments(command, OLESTR("-time_t <seconds since 1970>"));
    }
    controller.Update([&](ModelState& state, EventPosts&) {
        state.clockOffset += static_cast<std::int64_t>(*seconds) - ControllerModel::Now(state);
    });
    return Done();
}

Reply GetSystemStartupClock(ControllerModel& controller, const Command&) {
    return Answer(ClockText(controller.Read([](const ModelState& state) { return state.startupTime; })));
}

// Every mode boots the system again: motors off, a pending mode change
// dropped, a plain PIN lock lifted and a pending permanent one made
// permanent, the start-up clock reset.
Reply SetRestart(ControllerModel& controller, const Command& command) {
    const TextView mode = Trim(command.args);
    bool known = false;
    for (TextView word : kRestartModes) {
        known = known || word == mode;
    }
    if (!known) {
        return Refuse(kStatusBadArgument, OLESTR("Restart: unknown restart mode \"") + Text(mode) + OLESTR("\""));
    }
    controller.Update([&](ModelState& state, EventPosts&) {
        state.startupTime = ControllerModel::Now(state);
        state.lastRestart = Text(mode);
        ++state.restarts;
        state.motors = OLESTR("STAND_BY");
        state.collision = CollisionState::Init;
        if (state.mode == OperationMode::AutoChange || state.mode == OperationMode::ManfChange) {
            state.mode = state.modeBeforeChange;
        }
        state.pendingConditions.clear();
        RestartPinLock(state);
    });
    return Done();
}

}  // namespace

const Subsystem& ClockSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("SystemClock"), GetSystemClock},
        {OLESTR("Set"), OLESTR("SystemClock"), SetSystemClock},
        {OLESTR("Get"), OLESTR("SystemStartupClock"), GetSystemStartupClock},
        {OLESTR("Set"), OLESTR("Restart"), SetRestart},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
