// Allocation-failure injection, so that tests can make each allocation of an
// operation fail in turn. It covers every BSTR allocation, CoTaskMemAlloc,
// CoTaskMemRealloc and TavMemAlloc of our own platform layer; on Windows the
// system allocators cannot be failed and TavFailAllocationAt says so.
#pragma once
#include "tav/export.h"

extern "C" {
// The k-th allocation from now (1: the next one) fails, once; 0 switches the
// failure off. Returns false where failures cannot be injected.
TAV_PLATFORM_API bool TavFailAllocationAt(long k);
// The number of allocations made so far in the process (0 where not counted).
TAV_PLATFORM_API long TavAllocationCount(void);
// True while an armed failure has not been reached yet.
TAV_PLATFORM_API bool TavAllocationFailurePending(void);
}

namespace tav {

// Runs `operation` again and again, its 1st, 2nd, ... allocation failing, and
// calls `afterFailure` after each run in which the failure was reached. Stops
// at the first run that finishes without reaching it and returns the number
// of runs with a failure (the number of allocations the operation makes), or
// -1 where failures cannot be injected.
template <typename Operation, typename AfterFailure>
long ForEachAllocationFailure(Operation&& operation, AfterFailure&& afterFailure) {
    for (long k = 1;; ++k) {
        if (!TavFailAllocationAt(k)) return -1;
        operation();
        if (TavAllocationFailurePending()) {
            TavFailAllocationAt(0);
            return k - 1;
        }
        afterFailure();
    }
}

}  // namespace tav
