// Registration as a user does it: the system's regsvr32 in a process of its own.
#pragma once
#include <string>

#include "tav/platform.h"

namespace tav::conformance {

enum class RegistrationScope { Machine, User };
enum class RegistrationAction { Register, Unregister };

// Runs "regsvr32 /s [/u] <module>" and returns its exit code (0 on success),
// or a nonzero code of its own when the process could not be run. For the
// user scope the module's per-user switch is set in regsvr32's environment.
DWORD RunRegsvr32(const std::wstring& module, RegistrationAction action,
                  RegistrationScope scope = RegistrationScope::Machine);

// The environment variable that asks the module for per-user registration.
inline constexpr wchar_t kPerUserSwitch[] = L"TAVCONTROLLER_REGISTER_PER_USER";

}  // namespace tav::conformance
