// The process heap rather than the C runtime's, so that a block may be
// allocated in the module and freed in its host even when each carries a
// runtime of its own.
#include "tav/platform.h"

extern "C" {

void* TavMemAlloc(size_t size) { return HeapAlloc(GetProcessHeap(), 0, size == 0 ? 1 : size); }

void TavMemFree(void* block) {
    if (block != nullptr) HeapFree(GetProcessHeap(), 0, block);
}

}  // extern "C"
