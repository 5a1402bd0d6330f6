#include "sim/event_table.h"

#include "sim/command_table.h"
#include "sim/controller_model.h"

namespace tav::sim {
namespace {

// The connection's own events belong to the link, not to a subsystem.
constexpr EventRow kConnectionEvent{ControllerModel::kConnectionEvent, EventStyle::Pulse, nullptr};

}  // namespace

const EventRow* FindEvent(TextView name) {
    if (name == kConnectionEvent.name) {
        return &kConnectionEvent;
    }
    for (const Subsystem* subsystem : Subsystems()) {
        for (const EventRow& row : subsystem->events) {
            if (row.name == name) {
                return &row;
            }
        }
    }
    return nullptr;
}

}  // namespace tav::sim
