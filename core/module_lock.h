#pragma once
#include "tav/platform.h"

namespace tav {

// The module's lock count: every live controller object, enumerator and
// class-object lock holds one. DllCanUnloadNow answers S_OK only at zero.
class ModuleLock {
public:
    static void Add();
    static void Remove();
    static LONG Count();
};

}  // namespace tav
