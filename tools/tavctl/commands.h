#pragma once
#include <span>

#include "tavctl/arguments.h"

namespace tavctl {

class Session;

using CommandFunction = int (*)(Session& session, CommandArguments& args);

// One command of the tool. Adding a command is one row in its group's table
// and one function.
struct CommandSpec {
    const char* name;
    const char* summary;  // one line for tavctl --help
    const char* help;     // the text of COMMAND --help
    CommandFunction run;
};

std::span<const CommandSpec> IdentityCommands();
std::span<const CommandSpec> ClockCommands();
std::span<const CommandSpec> PanelCommands();
std::span<const CommandSpec> EventCommands();

// Every command, in the order tavctl --help lists them.
std::span<const CommandSpec> Commands();

// Runs one command line (words after the options); prints COMMAND --help
// when asked.
int RunCommand(Session& session, std::vector<std::string> words);

}  // namespace tavctl
