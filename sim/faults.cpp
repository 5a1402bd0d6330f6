#include "sim/faults.h"

namespace tav::sim {

void FaultSwitches::Rearm() { armed_ = !delays_.empty() || !commandFailures_.empty() || !garbled_.empty(); }

void FaultSwitches::SetDelay(TextView command, std::chrono::milliseconds delay) {
    std::lock_guard lock(mutex_);
    if (delay.count() <= 0) {
        delays_.erase(Text(command));
    } else {
        delays_[Text(command)] = delay;
    }
    Rearm();
}

std::chrono::milliseconds FaultSwitches::DelayFor(TextView command) const {
    if (!armed_) {
        return std::chrono::milliseconds(0);
    }
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
        transportFailing_ = true;
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
        transportFailing_ = false;
    }
    if (listener) {
        listener(true);
    }
}

std::optional<Failure> FaultSwitches::Transport() const {
    if (!transportFailing_) {
        return std::nullopt;
    }
    std::lock_guard lock(mutex_);
    return transport_;
}

void FaultSwitches::FailCommand(TextView command, HRESULT status, TextView text) {
    std::lock_guard lock(mutex_);
    commandFailures_[Text(command)] =
        Failure{status, text.empty() ? Text(command) + OLESTR(": simulated failure") : Text(text)};
    Rearm();
}

void FaultSwitches::ClearCommandFailure(TextView command) {
    std::lock_guard lock(mutex_);
    commandFailures_.erase(Text(command));
    Rearm();
}

std::optional<Failure> FaultSwitches::FailureFor(TextView command) const {
    if (!armed_) {
        return std::nullopt;
    }
    std::lock_guard lock(mutex_);
    const auto found = commandFailures_.find(command);
    if (found == commandFailures_.end()) {
        return std::nullopt;
    }
    return found->second;
}

void FaultSwitches::GarbleReplies(TextView command) {
    std::lock_guard lock(mutex_);
    garbled_.emplace(command);
    Rearm();
}

void FaultSwitches::ClearGarbling(TextView command) {
    std::lock_guard lock(mutex_);
    if (const auto found = garbled_.find(command); found != garbled_.end()) {
        garbled_.erase(found);
    }
    Rearm();
}

bool FaultSwitches::Garbles(TextView command) const {
    if (!armed_) {
        return false;
    }
    std::lock_guard lock(mutex_);
    return garbled_.find(command) != garbled_.end();
}

void FaultSwitches::Clear() {
    {
        std::lock_guard lock(mutex_);
        delays_.clear();
        commandFailures_.clear();
        garbled_.clear();
        Rearm();
    }
    RestoreTransport();
}

void FaultSwitches::OnTransportChange(std::function<void(bool up)> listener) {
    std::lock_guard lock(mutex_);
    transportListener_ = std::move(listener);
}

}  // namespace tav::sim
