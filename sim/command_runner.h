#pragma once
#include <chrono>
#include <functional>
#include <optional>

#include "sim/command_table.h"

namespace tav::sim {

// Waits the given time; false when the wait was cut short (the component is
// going away).
using Waiter = std::function<bool(std::chrono::milliseconds)>;

// Carries one command to the controller as its fault switches say: the reply
// comes after the command's delay, or as a time-out failure after timeOut
// milliseconds when the delay is longer (timeOut 0: no limit; a timed-out
// command is not carried out); a failing command is answered with its failure
// status and text. Empty when the wait was cut short.
std::optional<Reply> RunCommand(ControllerModel& controller, const Command& command, ULONG timeOut,
                                const Waiter& wait);

}  // namespace tav::sim
