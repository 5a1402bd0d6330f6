// What the type library must say, as generated from the widl header.
#pragma once
#include <cstddef>
#include <span>
#include <string_view>

#include "TavController.h"

namespace tav::conformance {

struct MethodShape {
    const wchar_t* name;
    const wchar_t* parameters;  // names separated by single spaces
};
struct InterfaceShape {
    const wchar_t* name;
    const IID* iid;
    const wchar_t* base;
    std::span<const MethodShape> methods;
};
struct FieldShape {
    const wchar_t* name;
    size_t offset;
};
struct RecordShape {
    const wchar_t* name;
    size_t size;
    std::span<const FieldShape> fields;
};
struct EnumeratorShape {
    const wchar_t* name;
    LONG value;
};
struct EnumShape {
    const wchar_t* name;
    std::span<const EnumeratorShape> values;
};
struct ClassShape {
    const wchar_t* name;
    const CLSID* clsid;
};

#include "typelib_expectations.inc"

// Looked up by name in the tables above; null when the header has none.
const InterfaceShape* HeaderInterface(std::wstring_view name);
const ClassShape* HeaderClass(std::wstring_view name);

}  // namespace tav::conformance
