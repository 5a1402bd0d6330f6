#include "sim/command_table.h"

#include <algorithm>
#include <cstdint>
#include <unordered_map>
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

// Every command row of every subsystem by name, hashed once, so that a
// command is found in one probe whatever the number of subsystems.
class CommandIndex {
public:
    CommandIndex() {
        for (const Subsystem* subsystem : Subsystems()) {
            for (const CommandRow& row : subsystem->commands) {
                rows_[row.name].push_back(&row);
            }
        }
    }

    // The rows of this name (both verbs), empty for an unknown name.
    std::span<const CommandRow* const> Named(TextView name) const {
        const auto found = rows_.find(name);
        if (found == rows_.end()) {
            return {};
        }
        return found->second;
    }

private:
    struct Hash {
        std::size_t operator()(TextView text) const noexcept {
            std::uint64_t hash = 14695981039346656037ull;
            for (OLECHAR c : text) {
                hash = (hash ^ static_cast<std::uint16_t>(c)) * 1099511628211ull;
            }
            return static_cast<std::size_t>(hash ^ (hash >> 32));
        }
    };
    std::unordered_map<TextView, std::vector<const CommandRow*>, Hash> rows_;
};

const CommandIndex& Index() {
    static const CommandIndex index;
    return index;
}

}  // namespace

Reply BadArguments(const Command& command, TextView expected) {
    return Refused(command.name, kStatusBadArgument,
                   Concat({OLESTR("expected "), expected, OLESTR(", got "), Quoted(command.args)}));
}

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
