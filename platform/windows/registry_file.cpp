// Windows has a registry of its own.
#include "tav/registry_file.h"

extern "C" void TavSetRegistryFile(const char*) {}
extern "C" void TavBeginRegistryBatch(void) {}
extern "C" LONG TavEndRegistryBatch(void) { return ERROR_SUCCESS; }
