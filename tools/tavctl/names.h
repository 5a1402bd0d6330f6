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

std::span<const EnumName> ControllerStateNames();
std::span<const EnumName> OperationModeNames();
std::span<const EnumName> CollisionStateNames();
std::span<const EnumName> EnergyStateNames();
std::span<const EnumName> RestartModeNames();
std::span<const EnumName> AutoConditionNames();
std::span<const EnumName> ConfigurationNames();

// The name of value, or the number in decimal when it has none.
std::string NameOf(std::span<const EnumName> names, long value);

// The value of a name, compared without regard to case.
std::optional<long> ValueOf(std::span<const EnumName> names, std::string_view name);

// "E_INVALIDARG" and friends, the virtual controller's statuses, or "".
std::string HresultName(HRESULT hr);

// "0x80070057 (E_INVALIDARG)", or the hex alone for an unnamed code.
std::string DescribeHresult(HRESULT hr);

}  // namespace tavctl
