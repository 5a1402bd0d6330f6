// The module's own arrays and records come from here, on every platform, so
// that the allocation-failure tests reach them too.
#pragma once
#include <cstddef>

#include "tav/export.h"

extern "C" {
// Never returns the same pointer twice for live blocks, also for size 0; NULL
// when the memory is exhausted (or an injected failure says so).
TAV_PLATFORM_API void* TavMemAlloc(size_t size);
TAV_PLATFORM_API void TavMemFree(void* block);
}
