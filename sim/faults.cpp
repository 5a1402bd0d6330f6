#include "sim/faults.h"

namespace tav::sim {

void FaultSwitches::SetDelay(TextView command, std::chrono::milliseconds delay) {
    std::lock_guard lock(mutex_);
    if (delay.count() <= 0) {
        delays_.erase(Text(command));
    } else {
        delays_[Text(command)] = delay;
    }
}

std::chrono::milliseconds FaultSwitches::DelayFor(TextView command) const {
    std::lock_guard lock(mutex_);
    auto found = delays_.find(command);
    if (found == delays_.end()) {
        found = delays_.find(TextView());
    }
    return found == delays_.end() ? std::chrono::milliseconds(0) : found->second;
}

void FaultSwitches::FailTransport(HRESULT hr, TextView text) {
    std::function<void(bool)> listener;
    {
        std::lock_guard lock(mutex_);
        const bool wasUp = !transport_.has_value();
        transport_ = Failure{hr, text.empty() ? Text(OLESTR("TavComCtrl: connection to the controller lost")) : Text(text)};
        if (wasUp) {
            listener = transportListener_;
        }
    }
    if (listener) {
        listener(false);
    }
}

void FaultSwitches::RestoreTransport() {
    std::function<void(bool)> listener;
    {
        std::lock_guard lock(mutex_);
        if (transport_.has_value()) {
            listener = transportListener_;
        }
        transport_.reset();
    }
    if (listener) {
        listener(true);
    }
}

std::optional<Failure> FaultSwitches::Transport() const {
    std::lock_guard lock(mutex_);
    return transport_;
}

void FaultSwitches::FailCommand(TextView command, HRESULT status, TextView text) {
    std::lock_guard lock(mutex_);
    commandFailures_[Text(command)] =
        Failure{status, text.empty() ? Text(command) + OLESTR(": simulated failure") : Text(text)};
}

void FaultSwitches::ClearCommandFailure(TextView command) {
    std::lock_guard lock(mutex_);
    commandFailures_.erase(Text(command));
}

std::optional<Failure> FaultSwitches::FailureFor(TextView command) const {
    std::lock_guard lock(mutex_);
    const auto found = commandFailures_.find(command);
    if (found == commandFailures_.end()) {
        return std::nullopt;
    }
    return found->second;
}

void FaultSwitches::Clear() {
    {
        std::lock_guard lock(mutex_);
        delays_.clear();
        commandFailures_.clear();
    }
    RestoreTransport();
}

void FaultSwitches::OnTransportChange(std::function<void(bool up)> listener) {
    std::lock_guard lock(mutex_);
    transportListener_ = std::move(listener);
}

}  // namespace tav::sim
