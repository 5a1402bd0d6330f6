#pragma once
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "TavController.h"

namespace tavctl {

// One value of an interface enum with the name it has in the type library.
struct EnumName {
    long value;
    const char* name;
};

// The names of every value of enum E, taken from the IDL at build time.
template <typename E>
std::span<const EnumName> NamesOf();

struct EnumType {
    const char* name;
    std::span<const EnumName> (*names)();
};

// The name of interface I as the type library has it.
template <typename I>
inline constexpr const char* kInterfaceName = "the interface";

#include "enum_names.inc"

// The name of value, or the number in decimal when it has none.
std::string NameOf(std::span<const EnumName> names, long value);

template <typename E>
std::string NameOf(E value) {
    return NameOf(NamesOf<E>(), static_cast<long>(value));
}

// The value of a name, compared without regard to case.
std::optional<long> ValueOf(std::span<const EnumName> names, std::string_view name);

// "A, B or C": the names of a table, for usage messages.
std::string NameList(std::span<const EnumName> names);

// "E_INVALIDARG" and friends, the virtual controller's statuses, or "".
std::string HresultName(HRESULT hr);

// "0x80070057 (E_INVALIDARG)", or the hex alone for an unnamed code.
std::string DescribeHresult(HRESULT hr);

}  // namespace tavctl
