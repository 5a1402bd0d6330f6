// Operating panel: motors state, operation mode, auto conditions,
// acknowledgements and collision detection. The speed ratio and the PIN lock
// of the mode selector have files of their own.
#include <algorithm>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/reply_texts.h"
#include "sim/status_codes.h"
#include "sim/subsystems/pin_lock.h"

namespace tav::sim {
namespace {

bool IsModeChange(OperationMode mode) {
    return mode == OperationMode::AutoChange || mode == OperationMode::ManfChange;
}

// Changing the operation mode stops the motors, as the key switch does.
void EnterMode(ModelState& state, OperationMode mode) {
    if (!IsModeChange(state.mode) && IsModeChange(mode)) {
        state.modeBeforeChange = state.mode;
    }
    if (state.mode != mode && state.motors == OLESTR("RUN")) {
        state.motors = OLESTR("STAND_BY");
    }
    state.mode = mode;
    if (mode != OperationMode::AutoChange) {
        state.pendingConditions.clear();
    }
}

Reply GetState(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return state.motors; }));
}

Reply MotorsOn(ModelState& state) {
    if (state.motors == OLESTR("EM_STOP") || state.motors == OLESTR("SYS_FAIL") ||
        state.motors == OLESTR("GUARD_STOP")) {
        return Refuse(kStatusNotAllowed, OLESTR("State: motors on not allowed in state ") + state.motors);
    }
    if (state.collision == CollisionState::Triggered) {
        return Refuse(kStatusNotAllowed, OLESTR("State: motors on not allowed before the collision is acknowledged"));
    }
    if (IsModeChange(state.mode)) {
        return Refuse(kStatusNotAllowed,
                      OLESTR("State: motors on not allowed while the change to ") +
                          Text(state.mode == OperationMode::AutoChange ? OLESTR("AUTO") : OLESTR("MANF")) +
                          OLESTR(" is not acknowledged"));
    }
    state.motors = OLESTR("RUN");
    if (state.collision == CollisionState::TriggeredAck) {
        state.collision = CollisionState::Init;
    }
    return Done();
}

Reply MotorsOff(ModelState& state) {
    if (state.motors == OLESTR("EM_STOP") || state.motors == OLESTR("SYS_FAIL")) {
        return Refuse(kStatusNotAllowed, OLESTR("State: motors off not possible in state ") + state.motors);
    }
    state.motors = OLESTR("STAND_BY");
    return Done();
}

Reply SetState(ControllerModel& controller, const Command& command) {
    const TextView word = Trim(command.args);
    if (word == OLESTR("RUN")) {
        return controller.Update([](ModelState& state, EventPosts&) { return MotorsOn(state); });
    }
    if (word == OLESTR("STAND_BY")) {
        return controller.Update([](ModelState& state, EventPosts&) { return MotorsOff(state); });
    }
    return Refuse(kStatusBadArgument, OLESTR("State: cannot request state ") + Quoted(word));
}

Reply SetStateUsingKeyLess(ControllerModel& controller, const Command& command) {
    const TextView word = Trim(command.args);
    if (word != OLESTR("RUN")) {
        return Refuse(kStatusBadArgument, OLESTR("StateUsingKeyLess: cannot request state ") + Quoted(word));
    }
    return controller.Update([](ModelState& state, EventPosts&) { return MotorsOn(state); });
}

Reply GetMode(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return ModeText(state); }));
}

// A change to automatic raises the configured conditions, which wait for
// their answers (AutoCondAck) or for Ack AUTO; manual full speed waits for
// Ack MANF; manual reduced speed is taken at once.
Reply SetOperationMode(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto mode = arguments ? arguments->Find(OLESTR("-opmode")) : std::nullopt;
    if (!mode || (*mode != OLESTR("auto") && *mode != OLESTR("manr") && *mode != OLESTR("manf"))) {
        return BadArguments(command, OLESTR("-opmode auto|manr|manf"));
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (ModeIsLocked(state)) {
            return Refuse(kStatusNotAllowed, OLESTR("OPMode: the operation mode is locked by a PIN code"));
        }
        if (*mode == OLESTR("manr")) {
            EnterMode(state, OperationMode::Manr);
        } else if (*mode == OLESTR("manf")) {
            if (state.mode != OperationMode::Manf) {
                EnterMode(state, OperationMode::ManfChange);
            }
        } else if (state.mode != OperationMode::Auto && state.mode != OperationMode::AutoChange) {
            EnterMode(state, OperationMode::AutoChange);
            state.pendingConditions = state.autoConditions;
            state.answers.clear();
        }
        return Done();
    });
}

Reply SetAcknowledge(ControllerModel& controller, const Command& command) {
    const TextView what = Trim(command.args);
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (what == OLESTR("AUTO")) {
            if (state.mode != OperationMode::AutoChange) {
                return Refuse(kStatusNotAllowed, OLESTR("Ack: no change to AUTO pending"));
            }
            for (const AutoCondition& condition : state.pendingConditions) {
                state.answers.push_back({condition.id, condition.name, false});
            }
            EnterMode(state, OperationMode::Auto);
            return Done();
        }
        if (what == OLESTR("MANF")) {
            if (state.mode != OperationMode::ManfChange) {
                return Refuse(kStatusNotAllowed, OLESTR("Ack: no change to MANF pending"));
            }
            EnterMode(state, OperationMode::Manf);
            return Done();
        }
        if (what == OLESTR("COLDET")) {
            if (state.collision != CollisionState::Triggered) {
                return Refuse(kStatusNotAllowed, OLESTR("Ack: no collision to acknowledge"));
            }
            state.collision = CollisionState::TriggeredAck;
            return Done();
        }
        return Refuse(kStatusBadArgument, OLESTR("Ack: unknown acknowledgement ") + Quoted(what));
    });
}

Reply SetAutoConditionAck(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto answer = arguments ? arguments->Find(OLESTR("-AutoCondAck")) : std::nullopt;
    const auto id = arguments ? arguments->Unsigned(OLESTR("-ID")) : std::nullopt;
    if (!answer || !id || (*answer != OLESTR("Reset") && *answer != OLESTR("Keep"))) {
        return BadArguments(command, OLESTR("-AutoCondAck Reset|Keep -ID <id>"));
    }
    const bool keep = *answer == OLESTR("Keep");
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (state.mode != OperationMode::AutoChange) {
            return Refuse(kStatusNotAllowed, OLESTR("AutoCondAck: no change to AUTO pending"));
        }
        auto& pending = state.pendingConditions;
        const auto found =
            std::find_if(pending.begin(), pending.end(), [&](const AutoCondition& c) { return c.id == *id; });
        if (found == pending.end()) {
            return Refuse(kStatusNotFound, OLESTR("AutoCondAck: no pending condition with ID ") + Decimal(*id));
        }
        if (keep && found->keep == 0) {
            return Refuse(kStatusNotAllowed,
                          OLESTR("AutoCondAck: condition ") + Decimal(*id) + OLESTR(" (") + found->name +
                              OLESTR(") cannot be kept"));
        }
        state.answers.push_back({found->id, found->name, keep});
        pending.erase(found);
        if (pending.empty()) {
            EnterMode(state, OperationMode::Auto);
        }
        return Done();
    });
}

Reply GetCollisionDetectState(ControllerModel& controller, const Command&) {
    return Answer(Text(controller.Read([](const ModelState& state) { return CollisionWord(state.collision); })));
}

Text StateEvent(const ModelState& state, const Arguments&) { return state.motors; }
Text ModeEvent(const ModelState& state, const Arguments&) { return ModeText(state); }
Text AutoConditionEvent(const ModelState& state, const Arguments&) { return AutoConditionList(state); }

}  // namespace

const Subsystem& PanelSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("State"), GetState},
        {OLESTR("Set"), OLESTR("State"), SetState},
        {OLESTR("Set"), OLESTR("StateUsingKeyLess"), SetStateUsingKeyLess},
        {OLESTR("Get"), OLESTR("Mode"), GetMode},
        {OLESTR("Set"), OLESTR("OPMode"), SetOperationMode},
        {OLESTR("Set"), OLESTR("Ack"), SetAcknowledge},
        {OLESTR("Set"), OLESTR("AutoCondAck"), SetAutoConditionAck},
        {OLESTR("Get"), OLESTR("ColdetState"), GetCollisionDetectState},
    };
    static constexpr EventRow kEvents[] = {
        {OLESTR("State"), EventStyle::Value, StateEvent},
        {OLESTR("Mode"), EventStyle::Value, ModeEvent},
        {OLESTR("AutoCondSub"), EventStyle::Value, AutoConditionEvent},
    };
    static constexpr Subsystem subsystem{kRows, kEvents};
    return subsystem;
}

}  // namespace tav::sim
