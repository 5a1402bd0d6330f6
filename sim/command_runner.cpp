#include "sim/command_runner.h"

#include "sim/status_codes.h"

namespace tav::sim {

std::optional<Reply> RunCommand(ControllerModel& controller, const Command& command, ULONG timeOut,
                                const Waiter& wait) {
    const std::chrono::milliseconds delay = controller.Faults().DelayFor(command.name);
    const std::chrono::milliseconds limit(timeOut);
    if (timeOut != 0 && delay > limit) {
        if (!wait(limit)) {
            return std::nullopt;
        }
        return Refuse(kStatusTimedOut, Text(command.name) + OLESTR(": no reply from the controller within ") +
                                           Decimal(timeOut) + OLESTR(" ms"));
    }
    if (delay.count() > 0 && !wait(delay)) {
        return std::nullopt;
    }
    if (auto failure = controller.Faults().FailureFor(command.name)) {
        return Refuse(failure->status, std::move(failure->text));
    }
    return Dispatch(controller, command);
}

}  // namespace tav::sim
