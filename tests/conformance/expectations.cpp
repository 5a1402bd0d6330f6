#include "expectations.h"

namespace tav::conformance {

const InterfaceShape* HeaderInterface(std::wstring_view name) {
    for (const InterfaceShape& shape : kHeaderInterfaces) {
        if (shape.name == name) return &shape;
    }
    return nullptr;
}

const ClassShape* HeaderClass(std::wstring_view name) {
    for (const ClassShape& shape : kHeaderClasses) {
        if (shape.name == name) return &shape;
    }
    return nullptr;
}

}  // namespace tav::conformance
