#include "allocation.h"

#include <atomic>
#include <cstdlib>

#include "tav/com_api.h"
#include "tav/fault_injection.h"
#include "tav/memory.h"

namespace tav::posix {
namespace {

// Counted on every allocation without a locked instruction, so the count is
// exact on one thread and approximate across threads; a diagnostic only.
std::atomic<long> allocationCount{0};
// Allocations left until the armed failure (1: the next one fails); 0 when
// none is armed, the common case, which costs one plain load.
std::atomic<long> countdown{0};

bool InjectedFailure() {
    allocationCount.store(allocationCount.load(std::memory_order_relaxed) + 1, std::memory_order_relaxed);
    long left = countdown.load(std::memory_order_relaxed);
    while (left > 0) {
        if (countdown.compare_exchange_weak(left, left - 1)) {
            return left == 1;
        }
    }
    return false;
}

}  // namespace

void* Allocate(std::size_t size) {
    if (InjectedFailure()) return nullptr;
    return std::malloc(size == 0 ? 1 : size);
}

void* Reallocate(void* block, std::size_t size) {
    if (InjectedFailure()) return nullptr;
    return std::realloc(block, size == 0 ? 1 : size);
}

void Deallocate(void* block) { std::free(block); }

}  // namespace tav::posix

using namespace tav::posix;

extern "C" {

bool TavFailAllocationAt(long k) {
    countdown.store(k > 0 ? k : 0);
    return true;
}

long TavAllocationCount(void) { return allocationCount.load(); }

bool TavAllocationFailurePending(void) { return countdown.load() != 0; }

void* TavMemAlloc(size_t size) { return Allocate(size); }

void TavMemFree(void* block) { Deallocate(block); }

LPVOID CoTaskMemAlloc(SIZE_T cb) { return Allocate(cb); }

LPVOID CoTaskMemRealloc(LPVOID pv, SIZE_T cb) {
    if (pv == nullptr) return Allocate(cb);
    if (cb == 0) {
        Deallocate(pv);
        return nullptr;
    }
    return Reallocate(pv, cb);
}

void CoTaskMemFree(LPVOID pv) { Deallocate(pv); }

}  // extern "C"
