#include "tavctl/commands.h"

#include <vector>

#include "tavctl/session.h"

namespace tavctl {

std::span<const CommandSpec> Commands() {
    static const std::vector<CommandSpec> all = [] {
        std::vector<CommandSpec> commands;
        for (const auto group : {IdentityCommands(), ClockCommands(), PanelCommands(), EventCommands()}) {
            commands.insert(commands.end(), group.begin(), group.end());
        }
        return commands;
    }();
    return all;
}

int RunCommand(Session& session, std::vector<std::string> words) {
    if (words.empty()) {
        session.Error("no command given (tavctl --help lists them)");
        return kExitUsage;
    }
    const std::string name = words.front();
    words.erase(words.begin());
    for (const CommandSpec& command : Commands()) {
        if (name == command.name) {
            CommandArguments args(std::move(words));
            if (args.HelpWanted()) {
                session.Print(command.help);
                return kExitOk;
            }
            return command.run(session, args);
        }
    }
    session.Error("unknown command " + name + " (tavctl --help lists them)");
    return kExitUsage;
}

}  // namespace tavctl
