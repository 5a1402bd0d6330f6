#include "sim/command_table.h"

#include "sim/status_codes.h"

namespace tav::sim {
namespace {

Service ServiceOf(TextView url) {
    const std::size_t slash = url.find(OLECHAR('/'), 1);
    if (slash != TextView::npos && url.substr(slash) == OLESTR("/DHROOT")) {
        return Service::DhRoot;
    }
    return Service::Controller;
}

const CommandRow* Find(const Command& command, bool& nameKnown) {
    const std::span<const CommandRow> groups[] = {ClockCommands(), IdentityCommands(), PanelCommands()};
    nameKnown = false;
    for (const auto& group : groups) {
        for (const CommandRow& row : group) {
            if (row.name == command.name) {
                nameKnown = true;
                if (row.verb == command.verb) {
                    return &row;
                }
            }
        }
    }
    return nullptr;
}

Text Quoted(TextView text) { return OLESTR("\"") + Text(text) + OLESTR("\""); }

}  // namespace

Reply Dispatch(ControllerModel& controller, const Command& command) {
    bool nameKnown = false;
    const CommandRow* row = Find(command, nameKnown);
    if (row == nullptr) {
        if (nameKnown) {
            return Refuse(kStatusUnknownCommand, Text(command.name) + OLESTR(": verb ") + Quoted(command.verb) +
                                                     OLESTR(" not supported"));
        }
        return Refuse(kStatusUnknownCommand, OLESTR("Unknown command ") + Quoted(command.name));
    }
    const Service service = ServiceOf(command.url);
    if (row->service != service) {
        return Refuse(kStatusUnknownCommand, Text(command.name) + OLESTR(" is not served at ") + Quoted(command.url));
    }
    return row->handler(controller, command);
}

}  // namespace tav::sim
