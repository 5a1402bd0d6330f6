#pragma once
// Paths on the controller are written "ctrl:" (in any case) and the path on
// the controller, with forward slashes only. The prefix is stripped before a
// path is sent.
#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

// The texts of an operation that takes only a controller path.
struct ControllerPathTexts {
    const OLECHAR* notControllerPath;  // no "ctrl:" prefix
    const OLECHAR* backslash;          // a backslash anywhere
    const OLECHAR* empty;              // nothing after the prefix
};

inline constexpr OleStringView kControllerPrefix = OLESTR("ctrl:");

// path begins with "ctrl:", compared without regard to case.
bool HasControllerPrefix(OleStringView path);

// Empty or white space only.
bool IsBlank(OleStringView path);

}  // namespace tav
