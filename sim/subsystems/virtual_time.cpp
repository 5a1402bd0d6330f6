// The virtual clock of a controller that runs in simulation. Time and time
// slice are in milliseconds of virtual time, the speed in percent of real
// time. Stopped, the clock stands; running freely it follows the host clock
// at its speed; in the two stepping states each VTRun moves it on, by one
// slice (RunSlice) or to the next slice boundary, where the controller's next
// scheduled work falls (NextEvent).
#include <array>
#include <chrono>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"

namespace tav::sim {
namespace {

using HostClock = std::chrono::steady_clock;

enum class VtState { Stop, FreeRun, RunSlice, NextEvent };

struct VtWords {
    VtState state;
    TextView command;  // as Set VTState carries it
    TextView reply;    // as the state reply carries it
};

constexpr std::array kVtWords = {
    VtWords{VtState::Stop, OLESTR("VTStop"), OLESTR("Stop")},
    VtWords{VtState::FreeRun, OLESTR("VTFreeRun"), OLESTR("FreeRun")},
    VtWords{VtState::RunSlice, OLESTR("VTRunSlice"), OLESTR("RunSlice")},
    VtWords{VtState::NextEvent, OLESTR("VTNextEvent"), OLESTR("NextEvent")},
};

struct VirtualTimeState {
    VtState state = VtState::Stop;
    std::uint32_t slice = 24;
    std::uint32_t speed = 100;
    std::uint64_t time = 0;  // while running freely: the time at `since`
    HostClock::time_point since;
};

std::uint64_t TimeNow(const VirtualTimeState& clock) {
    if (clock.state != VtState::FreeRun) {
        return clock.time;
    }
    const auto elapsed = std::chrono::duration_cast<std::chrono::milliseconds>(HostClock::now() - clock.since);
    return clock.time + static_cast<std::uint64_t>(elapsed.count()) * clock.speed / 100;
}

// Takes the running time as the new starting point, before the state or
// the speed changes what follows.
void Rebase(VirtualTimeState& clock) {
    clock.time = TimeNow(clock);
    clock.since = HostClock::now();
}

// Every reply carries the low 32 bits; the clock itself does not wrap.
Text TimeText(std::uint64_t time) { return OLESTR("-time ") + Decimal(static_cast<std::uint32_t>(time)); }


std::optional<std::uint32_t> ValueOf(const Command& command, TextView key) {
    const auto arguments = Arguments::Parse(command.args);
    return arguments ? arguments->Unsigned(key) : std::nullopt;
}

Reply GetVtState(ControllerModel& controller, const Command&) {
    const VtState state = controller.Read([](const ModelState& s) { return s.Part<VirtualTimeState>().state; });
    for (const VtWords& words : kVtWords) {
        if (words.state == state) {
            return Answer(Concat({OLESTR("-VTState "), words.reply}));
        }
    }
    return Refuse(E_UNEXPECTED, OLESTR("VTState: the clock is in no known state"));
}

Reply SetVtState(ControllerModel& controller, const Command& command) {
    const TextView word = Trim(command.args);
    for (const VtWords& words : kVtWords) {
        if (words.command == word) {
            controller.Update([&](ModelState& state, EventPosts&) {
                VirtualTimeState& clock = state.Part<VirtualTimeState>();
                Rebase(clock);
                clock.state = words.state;
            });
            return Done();
        }
    }
    return BadArguments(command, OLESTR("VTStop|VTFreeRun|VTRunSlice|VTNextEvent"));
}

Reply GetTimeSlice(ControllerModel& controller, const Command&) {
    return Answer(TimeText(controller.Read([](const ModelState& s) { return s.Part<VirtualTimeState>().slice; })));
}

Reply SetTimeSlice(ControllerModel& controller, const Command& command) {
    const auto slice = ValueOf(command, OLESTR("-time"));
    if (!slice) {
        return BadArguments(command, OLESTR("-time <milliseconds>"));
    }
    if (*slice == 0) {
        return Refuse(kStatusBadArgument, OLESTR("VTTimeSlice: a time slice of 0 would never advance the clock"));
    }
    controller.Update([&](ModelState& state, EventPosts&) { state.Part<VirtualTimeState>().slice = *slice; });
    return Done();
}

Reply GetTime(ControllerModel& controller, const Command&) {
    return Answer(TimeText(controller.Read([](const ModelState& s) { return TimeNow(s.Part<VirtualTimeState>()); })));
}

Reply Run(ControllerModel& controller, const Command&) {
    return controller.Update([](ModelState& state, EventPosts&) {
        VirtualTimeState& clock = state.Part<VirtualTimeState>();
        switch (clock.state) {
            case VtState::RunSlice:
                clock.time += clock.slice;
                return Done();
            case VtState::NextEvent:
                clock.time += clock.slice - clock.time % clock.slice;
                return Done();
            case VtState::FreeRun:
                return Refuse(kStatusNotAllowed, OLESTR("VTRun: the clock runs freely"));
            case VtState::Stop:
                break;
        }
        return Refuse(kStatusNotAllowed, OLESTR("VTRun: the clock is stopped; step it in VTRunSlice or VTNextEvent"));
    });
}

Reply GetSpeed(ControllerModel& controller, const Command&) {
    return Answer(OLESTR("-speed ") +
                  Decimal(controller.Read([](const ModelState& s) { return s.Part<VirtualTimeState>().speed; })));
}

Reply SetSpeed(ControllerModel& controller, const Command& command) {
    const auto speed = ValueOf(command, OLESTR("-speed"));
    if (!speed) {
        return BadArguments(command, OLESTR("-speed <percent of real time>"));
    }
    controller.Update([&](ModelState& state, EventPosts&) {
        VirtualTimeState& clock = state.Part<VirtualTimeState>();
        Rebase(clock);
        clock.speed = *speed;
    });
    return Done();
}

}  // namespace

const Subsystem& VirtualTimeSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("VTState"), GetVtState},
        {OLESTR("Set"), OLESTR("VTState"), SetVtState},
        {OLESTR("Get"), OLESTR("VTTimeSlice"), GetTimeSlice},
        {OLESTR("Set"), OLESTR("VTTimeSlice"), SetTimeSlice},
        {OLESTR("Get"), OLESTR("VTTime"), GetTime},
        {OLESTR("Set"), OLESTR("VTRun"), Run},
        {OLESTR("Get"), OLESTR("VTSpeed"), GetSpeed},
        {OLESTR("Set"), OLESTR("VTSpeed"), SetSpeed},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
