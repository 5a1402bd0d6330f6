#include "allocation.h"

#include <atomic>
#include <cstdlib>

#include "tav/com_api.h"
#include "tav/fault_injection.h"
#include "tav/memory.h"

namespace tav::posix {
namespace {

std::atomic<long> allocationCount{0};
// The value of allocationCount at which the armed failure strikes; 0 when none is armed.
std::atomic<long> failingAllocation{0};

bool InjectedFailure() {
    long number = allocationCount.fetch_add(1) + 1;
    long armed = failingAllocation.load();
    return armed != 0 && number == armed && failingAllocation.compare_exchange_strong(armed, 0);
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
    failingAllocation.store(k > 0 ? allocationCount.load() + k : 0);
    return true;
}

long TavAllocationCount(void) { return allocationCount.load(); }

bool TavAllocationFailurePending(void) { return failingAllocation.load() != 0; }

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
