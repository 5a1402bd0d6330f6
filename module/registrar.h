#pragma once
#include <string_view>

#include "core/text/ole_string.h"
#include "module/script_parser.h"
#include "tav/platform.h"

namespace tav {

enum class RegistrationScope {
    Machine,
    // Every HKCR root of a script is written beneath HKCU\Software\Classes.
    User,
};

// Writes and removes the keys of a registry script (see script_parser.h).
// Registering creates the keys, sets their values and first deletes every
// ForceRemove or Delete subtree. Unregistering deletes ForceRemove subtrees
// and named values, and every other key that is left without subkeys unless
// it is marked NoRemove (a key kept for others' subkeys loses the default
// value the script gave it); keys already missing are no error. The script
// is parsed completely before the registry is touched.
class Registrar {
public:
    explicit Registrar(RegistrationScope scope) : scope_(scope) {}

    void SetVariable(OleStringView name, OleStringView value) { variables_[OleString(name)] = OleString(value); }

    HRESULT Register(std::string_view script) const;
    HRESULT Unregister(std::string_view script) const;

private:
    HRESULT Run(std::string_view script, bool registering) const;

    RegistrationScope scope_;
    ScriptVariables variables_;
};

}  // namespace tav
