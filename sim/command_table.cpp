#include "sim/command_table.h"

#include <algorithm>
#include <vector>

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

// Every command row of every subsystem, sorted by name and verb once, so that
// a command is found by a binary search whatever the number of subsystems.
class CommandIndex {
public:
    CommandIndex() {
        for (const Subsystem* subsystem : Subsystems()) {
            for (const CommandRow& row : subsystem->commands) {
                rows_.push_back(&row);
            }
        }
        std::sort(rows_.begin(), rows_.end(), [](const CommandRow* a, const CommandRow* b) {
            return a->name != b->name ? a->name < b->name : a->verb < b->verb;
        });
    }

    // The rows of this name (both verbs), empty for an unknown name.
    std::span<const CommandRow* const> Named(TextView name) const {
        const auto first = std::lower_bound(rows_.begin(), rows_.end(), name,
                                            [](const CommandRow* row, TextView key) { return row->name < key; });
        auto last = first;
        while (last != rows_.end() && (*last)->name == name) {
            ++last;
        }
        return {first, last};
    }

private:
    std::vector<const CommandRow*> rows_;
};

const CommandIndex& Index() {
    static const CommandIndex index;
    return index;
}

}  // namespace

std::span<const Subsystem* const> Subsystems() {
#define TAV_SIM_SUBSYSTEM(name) &name##Subsystem(),
    static const Subsystem* const all[] = {
#include "sim/subsystems/list.inc"
    };
#undef TAV_SIM_SUBSYSTEM
    return all;
}

Reply Dispatch(ControllerModel& controller, const Command& command) {
    const auto rows = Index().Named(command.name);
    if (rows.empty()) {
        return Refuse(kStatusUnknownCommand, OLESTR("Unknown command ") + Quoted(command.name));
    }
    const auto row = std::find_if(rows.begin(), rows.end(),
                                  [&command](const CommandRow* candidate) { return candidate->verb == command.verb; });
    if (row == rows.end()) {
        return Refuse(kStatusUnknownCommand, Text(command.name) + OLESTR(": verb ") + Quoted(command.verb) +
                                                 OLESTR(" not supported"));
    }
    if ((*row)->service != ServiceOf(command.url)) {
        return Refuse(kStatusUnknownCommand, Text(command.name) + OLESTR(" is not served at ") + Quoted(command.url));
    }
    return (*row)->handler(controller, command);
}

}  // namespace tav::sim
