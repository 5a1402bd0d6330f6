// Windows has a registry of its own.
#include "tav/registry_file.h"

extern "C" void TavSetRegistryFile(const char*) {}
