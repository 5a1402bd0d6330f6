#pragma once
#include <optional>
#include <string>
#include <string_view>

#include "sim/file_system.h"
#include "sim/model_state.h"
#include "sim/reply.h"

// Installed systems and what they are installed from. A system lives in
// "hd0a/<name>" with its HOME, its SYSPAR and a folder named after its
// template ("TavOS-7.4.2"). A package folder describes its system in
// "system.manifest"; a deployment package also holds "controller.manifest"
// and "install_package.manifest". Manifests are "key=value" lines.
namespace tav::sim {

inline constexpr const OLECHAR* kSystemsDevice = OLESTR("hd0a");
inline constexpr const OLECHAR* kSystemManifest = OLESTR("system.manifest");
inline constexpr const OLECHAR* kControllerManifest = OLESTR("controller.manifest");
inline constexpr const OLECHAR* kInstallManifest = OLESTR("install_package.manifest");

// "a/b" of "a", "b"; either may be empty.
Text JoinPath(TextView folder, TextView name);

// A client may write a controller path with its "ctrl:" prefix (any case)
// where the module sends paths as given.
TextView WithoutControllerPrefix(TextView path);

// Manifest lines, Latin-1.
std::string ManifestLine(std::string_view key, TextView value);
std::optional<Text> ManifestValue(const FileSystem& files, TextView file, std::string_view key);

// The template folder of an installed system ("TavOS-7.4.2"); empty when it
// has none.
Text TemplateOf(const FileSystem& files, TextView system);

struct SystemPackage {
    Text name;
    VersionTexts versions;
    Text templateName;
};

// The system a package folder describes, or why it describes none. A
// deployment package must also hold its controller and install manifests.
std::optional<SystemPackage> ReadPackage(const FileSystem& files, TextView folder, bool deployment, Text& problem);

struct InstallRequest {
    TextView command{};  // for the texts: "InstallNewSystem"
    TextView folder{};
    bool deployment = false;
    bool overwrite = false;
    TextView controllerName{};  // recorded in the new system when given
    TextView controllerId{};
};

// Installs the system of a package folder: its folder made and its HOME and
// SYSPAR copied, the system listed with its versions. The running system is
// never overwritten.
Reply InstallSystem(ModelState& state, const InstallRequest& request);

// Writes a package for a system of that name and TavOS version.
void WritePackage(FileSystem& files, TextView folder, TextView system, std::string_view version, bool deployment);

// A device went away: the boot device and a boot image loaded from it go
// with it.
void BootDeviceGone(ModelState& state, TextView device);

}  // namespace tav::sim
