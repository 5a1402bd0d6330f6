#include "sim/event_table.h"

#include "sim/command_table.h"
#include "sim/controller_model.h"

namespace tav::sim {
namespace {

// The connection's own events belong to the link, not to a subsystem:
// "-Connection established" (or "-Connection lost" if the link is down) to
// each new subscriber, then "-Connection lost" and "-Connection restored" as
// the link goes and comes back.
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

std::optional<Text> GreetingOf(const EventRow& event, ControllerModel& controller) {
    if (&event == &kConnectionEvent) {
        return Text(controller.Faults().Transport() ? OLESTR("-Connection lost") : OLESTR("-Connection established"));
    }
    return std::nullopt;
}

}  // namespace tav::sim
