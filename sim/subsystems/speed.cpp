// Speed ratio: the program speed override, in percent.
#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"

namespace tav::sim {
namespace {

struct SpeedState {
    std::int16_t ratio = 100;
};

// The reply is the bare number, without a key.
Text RatioText(const ModelState& state) { return Decimal(state.Part<SpeedState>().ratio); }

Reply GetSpeedRatio(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return RatioText(state); }));
}

Reply SetSpeedRatio(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto ratio = arguments ? arguments->Signed(OLESTR("-Value")) : std::nullopt;
    if (!ratio) {
        return BadArguments(command, OLESTR("-Value <0 to 100>"));
    }
    if (*ratio < 0 || *ratio > 100) {
        return Refuse(kStatusBadArgument,
                      OLESTR("SpeedAdjust: the speed ratio ") + Decimal(*ratio) + OLESTR(" is outside 0 to 100"));
    }
    controller.Update([&](ModelState& state, EventPosts&) {
        state.Part<SpeedState>().ratio = static_cast<std::int16_t>(*ratio);
    });
    return Done();
}

// "SpeedAdjust": the same bare number as the Get reply ("75").
Text SpeedEvent(const ModelState& state, const Arguments&) { return RatioText(state); }

}  // namespace

const Subsystem& SpeedSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("SpeedAdjust"), GetSpeedRatio},
        {OLESTR("Set"), OLESTR("SpeedAdjust"), SetSpeedRatio},
    };
    static constexpr EventRow kEvents[] = {
        {OLESTR("SpeedAdjust"), EventStyle::Value, SpeedEvent},
    };
    static constexpr Subsystem subsystem{kRows, kEvents};
    return subsystem;
}

}  // namespace tav::sim
