// The system's energy state: running, or paused to save energy (and the
// steps between). It changes outside the client's reach; hosts and tests move
// it with ControllerModel::SetEnergyState.
#include "sim/command_table.h"

namespace tav::sim {
namespace {

// "-sysenergy " and the word: notpaused, pausing, paused, resuming, blocked.
Text EnergyText(const ModelState& state) { return OLESTR("-sysenergy ") + state.energy; }

Reply GetSysEnergyState(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return EnergyText(state); }));
}

// "SysEnergyStateSub": the Get reply.
Text EnergyEvent(const ModelState& state, const Arguments&) { return EnergyText(state); }

}  // namespace

const Subsystem& EnergySubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("SysEnergyState"), GetSysEnergyState},
    };
    static constexpr EventRow kEvents[] = {
        {OLESTR("SysEnergyStateSub"), EventStyle::Value, EnergyEvent},
    };
    static constexpr Subsystem subsystem{kRows, kEvents};
    return subsystem;
}

}  // namespace tav::sim
