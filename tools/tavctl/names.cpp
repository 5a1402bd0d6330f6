#include "tavctl/names.h"

#include <cstdio>

#include "sim/status_codes.h"
#include "tavctl/text.h"

namespace tavctl {
namespace {

struct HresultEntry {
    HRESULT hr;
    const char* name;
};

constexpr HresultEntry kHresults[] = {
    {S_OK, "S_OK"},
    {S_FALSE, "S_FALSE"},
    {E_NOTIMPL, "E_NOTIMPL"},
    {E_NOINTERFACE, "E_NOINTERFACE"},
    {E_POINTER, "E_POINTER"},
    {E_ABORT, "E_ABORT"},
    {E_FAIL, "E_FAIL"},
    {E_UNEXPECTED, "E_UNEXPECTED"},
    {E_ACCESSDENIED, "E_ACCESSDENIED"},
    {E_HANDLE, "E_HANDLE"},
    {E_OUTOFMEMORY, "E_OUTOFMEMORY"},
    {E_INVALIDARG, "E_INVALIDARG"},
    {CLASS_E_NOAGGREGATION, "CLASS_E_NOAGGREGATION"},
    {CLASS_E_CLASSNOTAVAILABLE, "CLASS_E_CLASSNOTAVAILABLE"},
    {REGDB_E_CLASSNOTREG, "REGDB_E_CLASSNOTREG"},
    {CO_E_NOTINITIALIZED, "CO_E_NOTINITIALIZED"},
};

}  // namespace

std::string NameOf(std::span<const EnumName> names, long value) {
    for (const EnumName& entry : names) {
        if (entry.value == value) {
            return entry.name;
        }
    }
    return std::to_string(value);
}

std::optional<long> ValueOf(std::span<const EnumName> names, std::string_view name) {
    const std::string wanted = Lower(name);
    for (const EnumName& entry : names) {
        if (Lower(entry.name) == wanted) {
            return entry.value;
        }
    }
    // "running" for CameraStatus_Running: the part after the prefix, when only one name has it.
    std::optional<long> shortMatch;
    for (const EnumName& entry : names) {
        const std::string_view full = entry.name;
        const auto underscore = full.rfind('_');
        if (underscore != std::string_view::npos && Lower(full.substr(underscore + 1)) == wanted) {
            if (shortMatch) {
                return std::nullopt;
            }
            shortMatch = entry.value;
        }
    }
    return shortMatch;
}

std::string NameList(std::span<const EnumName> names) {
    std::string list;
    for (std::size_t i = 0; i < names.size(); ++i) {
        if (i != 0) {
            list += i + 1 == names.size() ? " or " : ", ";
        }
        list += names[i].name;
    }
    return list;
}

std::string HresultName(HRESULT hr) {
    for (const HresultEntry& entry : kHresults) {
        if (entry.hr == hr) {
            return entry.name;
        }
    }
    const char* simName = tav::sim::StatusName(hr);
    return simName == nullptr ? std::string() : std::string(simName);
}

std::string DescribeHresult(HRESULT hr) {
    char hex[16];
    std::snprintf(hex, sizeof hex, "0x%08X", static_cast<unsigned>(hr));
    const std::string name = HresultName(hr);
    return name.empty() ? std::string(hex) : std::string(hex) + " (" + name + ")";
}

}  // namespace tavctl
