#pragma once
#include <span>

#include "tav/platform.h"

namespace tav {

class ControllerObject;

// One interface that the controller answers: from which class version on,
// and how the object is seen through it (one pointer per interface family).
struct InterfaceEntry {
    const IID* iid;
    const char* name;
    LONG sinceVersion;
    void* (*view)(ControllerObject*);
};

std::span<const InterfaceEntry> ControllerInterfaces();

}  // namespace tav
