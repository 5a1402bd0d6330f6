#pragma once
#include <atomic>
#include <chrono>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>

#include "sim/status_codes.h"
#include "sim/text.h"

namespace tav::sim {

struct Failure {
    HRESULT status = S_OK;
    Text text;
};

// Switches that make one controller misbehave, for tests and demonstrations.
// All are off for a fresh controller; each may be flipped from any thread.
class FaultSwitches {
public:
    // Every reply to `command` takes this long. An empty command name sets the
    // delay of every command that has none of its own. Zero switches it off.
    void SetDelay(TextView command, std::chrono::milliseconds delay);
    std::chrono::milliseconds DelayFor(TextView command) const;

    // Execute (and Subscribe) fail with hr before anything reaches the
    // controller; the component's error text becomes `text`.
    void FailTransport(HRESULT hr = kStatusLinkDown, TextView text = {});
    void RestoreTransport();
    std::optional<Failure> Transport() const;

    // Every later `command` is answered with this failure status and text
    // (and not carried out).
    void FailCommand(TextView command, HRESULT status = kStatusSimulatedFailure, TextView text = {});
    void ClearCommandFailure(TextView command);
    std::optional<Failure> FailureFor(TextView command) const;

    // Every later successful reply to `command` arrives cut short and ends in
    // a character no grammar expects, as from a controller whose answer was
    // mangled on the way.
    void GarbleReplies(TextView command);
    void ClearGarbling(TextView command);
    bool Garbles(TextView command) const;

    void Clear();

    // Told when the transport goes down (false) or comes back (true).
    void OnTransportChange(std::function<void(bool up)> listener);

private:
    void Rearm();  // under mutex_

    // Whether any delay or command failure is set: the common case, none,
    // takes no lock.
    std::atomic<bool> armed_{false};
    std::atomic<bool> transportFailing_{false};
    mutable std::mutex mutex_;
    std::map<Text, std::chrono::milliseconds, std::less<>> delays_;
    std::map<Text, Failure, std::less<>> commandFailures_;
    std::set<Text, std::less<>> garbled_;
    std::optional<Failure> transport_;
    std::function<void(bool)> transportListener_;
};

}  // namespace tav::sim
