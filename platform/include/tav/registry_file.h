// Where the registry lives on platforms without one of their own: the file
// given here, else $TAV_REGISTRY_FILE, else $HOME/.tavcontroller/registry.
// On Windows the system registry is used and this call does nothing.
#pragma once
#include "tav/export.h"

extern "C" {
// NULL goes back to the environment's choice. Keys already open keep their
// names and from now on refer to the keys of the new file.
TAV_PLATFORM_API void TavSetRegistryFile(const char* path);
}
