#pragma once
#include <set>
#include <string>

#include "tav/platform.h"

namespace tav::test {

// Points the registry at a private, empty one for the sandbox's lifetime: a
// temporary registry file here, and on Windows temporary keys standing in for
// HKCR, HKCU and HKLM (HKCR being HKLM\Software\Classes, as here), so that
// no test touches a real registry.
class RegistrySandbox {
public:
    RegistrySandbox();
    ~RegistrySandbox();
    RegistrySandbox(const RegistrySandbox&) = delete;
    RegistrySandbox& operator=(const RegistrySandbox&) = delete;

    bool Ready() const { return ready_; }

private:
    bool ready_ = false;
    std::string location_;
#ifdef _WIN32
    HKEY machine_ = nullptr;
    HKEY user_ = nullptr;
    HKEY classes_ = nullptr;
#endif
};

// Every key below root\path as "Key\Sub" and every value as
// "Key\Sub|name=text" ("@" for the default value), relative to path; empty
// when path does not exist.
using RegistrySnapshot = std::set<std::string>;
inline const std::string kClassesKey = "Software\\Classes";
RegistrySnapshot TakeSnapshot(HKEY root, const std::string& path);

// The string value, or "<missing>".
std::string ReadString(HKEY root, const std::string& key, const std::string& name);
void WriteString(HKEY root, const std::string& key, const std::string& name, const std::string& text);

// Sets or clears TAVCONTROLLER_REGISTER_PER_USER for its lifetime.
class PerUserSwitch {
public:
    explicit PerUserSwitch(const char* value);
    ~PerUserSwitch();
    PerUserSwitch(const PerUserSwitch&) = delete;
    PerUserSwitch& operator=(const PerUserSwitch&) = delete;
};

// The full path of the running executable.
std::string ExecutablePath();

}  // namespace tav::test
