#pragma once
#include <optional>

#include "sim/arguments.h"
#include "sim/model_state.h"

namespace tav::sim {

// Value events tell a subscriber when a text computed from the controller's
// state changes (checked on every change and every poll period); pulse events
// deliver every occurrence that the controller posts.
enum class EventStyle { Value, Pulse };

using EventText = Text (*)(const ModelState& state, const Arguments& eventArgs);

// One row per event name the controller knows; adding an event is one row
// (and, for a pulse event, a Post where it happens).
struct EventRow {
    TextView name;
    EventStyle style;
    EventText current;  // Value events only
};

// NULL for an event the controller does not know.
const EventRow* FindEvent(TextView name);

class ControllerModel;

// What a new subscriber of a pulse event is told at once, before any post:
// the state it joins in (the link up or down). Empty for most events.
std::optional<Text> GreetingOf(const EventRow& event, ControllerModel& controller);

}  // namespace tav::sim
