// Where the registry lives on platforms without one of their own: the file
// given here, else $TAV_REGISTRY_FILE, else $HOME/.tavcontroller/registry.
// On Windows the system registry is used and this call does nothing.
#pragma once
#include "tav/export.h"
#include "tav/platform.h"

extern "C" {
// NULL goes back to the environment's choice. Keys already open keep their
// names and from now on refer to the keys of the new file.
TAV_PLATFORM_API void TavSetRegistryFile(const char* path);

// A run of changes saved as one. Where the registry is a file, every change
// otherwise rewrites the whole file; within a batch the changes stay in
// memory, the file stays locked against other processes, and it is written
// once when the outermost batch ends (the status of that save is returned).
// On Windows both calls do nothing.
TAV_PLATFORM_API void TavBeginRegistryBatch(void);
TAV_PLATFORM_API LONG TavEndRegistryBatch(void);
}

namespace tav {

class RegistryBatch {
public:
    RegistryBatch() { TavBeginRegistryBatch(); }
    RegistryBatch(const RegistryBatch&) = delete;
    RegistryBatch& operator=(const RegistryBatch&) = delete;
    ~RegistryBatch() {
        if (open_) TavEndRegistryBatch();
    }
    // Saves what the batch changed; ERROR_SUCCESS or why the save failed.
    LONG End() {
        open_ = false;
        return TavEndRegistryBatch();
    }

private:
    bool open_ = true;
};

}  // namespace tav
