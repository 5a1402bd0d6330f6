#pragma once
#include <span>

#include "sim/caller.h"
#include "sim/controller_model.h"
#include "sim/event_table.h"
#include "sim/reply.h"

namespace tav::sim {

// One command as it reaches the controller.
struct Command {
    TextView verb;  // "Get" or "Set"
    TextView name;  // "CtrlName"
    TextView args;  // "-Name \"cell 7\"", a bare word, or empty
    TextView url;   // as given: "/sim" or "/sim/DHROOT"
    Caller caller{};
};

// The refusal of arguments that do not read as `expected`:
// "NAME: expected EXPECTED, got \"ARGS\"".
Reply BadArguments(const Command& command, TextView expected);

// Where a command is served: most at the controller's URL, a few at a
// service below it (environment variables at URL + "/DHROOT").
enum class Service { Controller, DhRoot };

using CommandHandler = Reply (*)(ControllerModel& controller, const Command& command);

// One row per command the controller knows.
struct CommandRow {
    TextView verb;
    TextView name;
    CommandHandler handler;
    Service service = Service::Controller;
};

// What one subsystem of the controller answers: its commands and the events
// it raises. Its state is a record of its own in ModelState::Part.
struct Subsystem {
    std::span<const CommandRow> commands;
    std::span<const EventRow> events = {};
    // A client went away: what it held is let go. Under the model's lock.
    void (*clientGone)(ModelState& state, std::uint32_t clientId) = nullptr;
};

// The subsystems, one file each under subsystems/, listed in
// subsystems/list.inc.
#define TAV_SIM_SUBSYSTEM(name) const Subsystem& name##Subsystem();
#include "sim/subsystems/list.inc"
#undef TAV_SIM_SUBSYSTEM

std::span<const Subsystem* const> Subsystems();

// Runs the command's handler, or answers a failure status and text for a
// command, verb or service that the controller does not know.
Reply Dispatch(ControllerModel& controller, const Command& command);

}  // namespace tav::sim
