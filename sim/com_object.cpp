#include "sim/com_object.h"

namespace tav::sim {
namespace {

std::atomic<LONG> liveObjectsAndLocks{0};

}  // namespace

LONG LiveObjectsAndLocks() { return liveObjectsAndLocks.load(); }

void LockServer(bool lock) {
    if (lock) {
        ++liveObjectsAndLocks;
    } else {
        --liveObjectsAndLocks;
    }
}

ObjectLifetime::ObjectLifetime() { ++liveObjectsAndLocks; }
ObjectLifetime::~ObjectLifetime() { --liveObjectsAndLocks; }

}  // namespace tav::sim
