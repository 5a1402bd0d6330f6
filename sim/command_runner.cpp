#include "sim/command_runner.h"

#include "sim/status_codes.h"
#include "sim/trace.h"

namespace tav::sim {

namespace {

std::optional<Reply> Carry(ControllerModel& controller, const Command& command, ULONG timeOut, const Waiter& wait) {
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
    Reply reply = Dispatch(controller, command);
    if (reply.status == S_OK && reply.hasText && controller.Faults().Garbles(command.name)) {
        reply.text.resize(reply.text.size() / 2);
        reply.text += OLESTR("\x7f");
    }
    return reply;
}

}  // namespace

std::optional<Reply> RunCommand(ControllerModel& controller, const Command& command, ULONG timeOut,
                                const Waiter& wait) {
    if (!Tracing()) {
        return Carry(controller, command, timeOut, wait);
    }
    const auto started = std::chrono::steady_clock::now();
    std::optional<Reply> reply = Carry(controller, command, timeOut, wait);
    if (reply) {
        TraceRecord record;
        record.client = command.caller.clientId;
        record.url = command.url;
        record.verb = command.verb;
        record.command = command.name;
        record.args = command.args;
        record.status = reply->status;
        record.hasText = reply->hasText;
        record.text = reply->text;
        record.took = std::chrono::steady_clock::now() - started;
        Trace(record);
    }
    return reply;
}

}  // namespace tav::sim
