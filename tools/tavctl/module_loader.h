#pragma once
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "TavController.h"

namespace tavctl {

// The controller module, loaded by path and reached only through its
// exported DllGetClassObject, as a COM runtime would reach it.
class ControllerModule {
public:
    // Empty, with the reason in error, when the file cannot be loaded or does
    // not export DllGetClassObject.
    static std::optional<ControllerModule> Load(const std::filesystem::path& path, std::string& error);

    // An object of the class, queried for riid.
    HRESULT CreateInstance(REFCLSID clsid, REFIID riid, void** object) const;

    const std::filesystem::path& Path() const { return path_; }

private:
    ControllerModule(std::filesystem::path path, LPFNGETCLASSOBJECT getClassObject)
        : path_(std::move(path)), getClassObject_(getClassObject) {}

    std::filesystem::path path_;
    LPFNGETCLASSOBJECT getClassObject_;
};

// Where the module is looked for when --module is not given: next to the
// executable, then in the build tree's module folder beside it.
std::vector<std::filesystem::path> DefaultModulePaths();

// The CLSID of "TavController" ... "TavController17" (any case), or NULL.
const CLSID* ClassByName(const std::string& name);

}  // namespace tavctl
