#include "tavctl/command_support.h"

namespace tavctl {

std::optional<std::string> Required(Session& session, CommandArguments& args, const char* command, const char* what,
                                    int& exitStatus) {
    auto word = args.Next();
    if (!word) {
        exitStatus = session.Usage(command, std::string(what) + " missing");
    }
    return word;
}

bool NoMore(Session& session, CommandArguments& args, const char* command, int& exitStatus) {
    if (args.Done()) {
        return true;
    }
    exitStatus = session.Usage(command, "unexpected " + *args.Next());
    return false;
}

}  // namespace tavctl
