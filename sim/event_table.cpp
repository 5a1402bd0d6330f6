#include "sim/event_table.h"

#include "sim/controller_model.h"
#include "sim/reply_texts.h"

namespace tav::sim {
namespace {

Text StateEvent(const ModelState& state, const Arguments&) { return state.motors; }
Text ModeEvent(const ModelState& state, const Arguments&) { return ModeText(state); }
Text AutoConditionEvent(const ModelState& state, const Arguments&) { return AutoConditionList(state); }

constexpr EventRow kEvents[] = {
    {OLESTR("State"), EventStyle::Value, StateEvent},
    {OLESTR("Mode"), EventStyle::Value, ModeEvent},
    {OLESTR("AutoCondSub"), EventStyle::Value, AutoConditionEvent},
    {ControllerModel::kConnectionEvent, EventStyle::Pulse, nullptr},
};

}  // namespace

const EventRow* FindEvent(TextView name) {
    for (const EventRow& row : kEvents) {
        if (row.name == name) {
            return &row;
        }
    }
    return nullptr;
}

}  // namespace tav::sim
