// The system's allocators cannot be made to fail on request.
#include "tav/fault_injection.h"

extern "C" {

bool TavFailAllocationAt(long) { return false; }

long TavAllocationCount(void) { return 0; }

bool TavAllocationFailurePending(void) { return false; }

}  // extern "C"
