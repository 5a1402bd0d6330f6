#pragma once
#include "sim/model_state.h"

namespace tav::sim {

// The PIN lock of the operation-mode selector. A plain lock lasts until it is
// unlocked or the controller restarts; a permanent one is pending until the
// next restart and from then on survives restarts until it is unlocked.
enum class ModeLock { Unlocked, Locked, PendingPermLocked, PermLocked };

struct PinLockState {
    ModeLock lock = ModeLock::Unlocked;
    std::int64_t pin = 0;  // meaningful while locked
};

// Whether the operation mode may not be changed now.
bool ModeIsLocked(const ModelState& state);

// What a restart does to the lock.
void RestartPinLock(ModelState& state);

}  // namespace tav::sim
