#pragma once
#include <atomic>
#include <span>

#include "tav/platform.h"

namespace tav {

class ClassFactory;

// One creatable class. All rows share the registry script, the class-object
// routine and the controller implementation; only the class version differs.
struct ClassRow {
    const CLSID* clsid;
    const OLECHAR* name;
    LONG version;
    // Created on first use under the module's lock, then read without it.
    std::atomic<ClassFactory*> classObject{nullptr};
    // Set while the class object is registered with CoRegisterClassObject.
    DWORD cookie = 0;
};

// The seventeen classes, TavController first, in class-version order.
std::span<ClassRow> ClassTable();

// nullptr for a class this module does not serve.
ClassRow* FindClass(REFCLSID clsid);

}  // namespace tav
