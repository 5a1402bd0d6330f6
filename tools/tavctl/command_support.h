#pragma once
#include <optional>
#include <string>

#include "tav/bstr.h"
#include "tavctl/arguments.h"
#include "tavctl/session.h"
#include "tavctl/text.h"

// Small helpers shared by the command groups.
namespace tavctl {

// The next word, or a usage error (returned through `exitStatus`).
std::optional<std::string> Required(Session& session, CommandArguments& args, const char* command, const char* what,
                                    int& exitStatus);

// True when no word is left; otherwise a usage error through `exitStatus`.
bool NoMore(Session& session, CommandArguments& args, const char* command, int& exitStatus);

inline tav::Bstr ToBstr(const std::string& utf8) { return tav::Bstr(tav::OleStringView(ToOle(utf8))); }

inline std::string ToUtf8(const tav::Bstr& text) { return ToUtf8(OleView(text.View())); }

}  // namespace tavctl
