#pragma once
#include <optional>
#include <string>
#include <string_view>

#include "tav/platform.h"

namespace tavctl {

// "2026-11-21T02:30:00Z" (UTC, whole seconds) and FILETIME, both ways. A
// time before 1601 or that does not fit the format gives nothing.
std::optional<FILETIME> ParseIsoUtc(std::string_view text);
std::string FormatIsoUtc(const FILETIME& time);

}  // namespace tavctl
