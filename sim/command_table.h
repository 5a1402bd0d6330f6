#pragma once
#include <span>

#include "sim/controller_model.h"
#include "sim/reply.h"

namespace tav::sim {

// One command as it reaches the controller.
struct Command {
    TextView verb;  // "Get" or "Set"
    TextView name;  // "CtrlName"
    TextView args;  // "-Name \"cell 7\"", a bare word, or empty
    TextView url;   // as given: "/sim" or "/sim/DHROOT"
};

// Where a command is served: most at the controller's URL, a few at a
// service below it (environment variables at URL + "/DHROOT").
enum class Service { Controller, DhRoot };

using CommandHandler = Reply (*)(ControllerModel& controller, const Command& command);

// One row per command the controller knows. Adding a command is one row in
// the table of its group and one handler.
struct CommandRow {
    TextView verb;
    TextView name;
    CommandHandler handler;
    Service service = Service::Controller;
};

// The tables of the command groups, one file each under commands/.
std::span<const CommandRow> ClockCommands();
std::span<const CommandRow> IdentityCommands();
std::span<const CommandRow> PanelCommands();

// Runs the command's handler, or answers a failure status and text for a
// command, verb or service that the controller does not know.
Reply Dispatch(ControllerModel& controller, const Command& command);

}  // namespace tav::sim
