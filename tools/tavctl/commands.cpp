#include "tavctl/commands.h"

#include <algorithm>

#include "tavctl/output.h"
#include "tavctl/session.h"
#include "tavctl/verb.h"

namespace tavctl {
namespace {

bool IsHelp(const std::string& word) { return word == "--help" || word == "-h"; }

const VerbEntry* FindVerb(const GroupEntry& group, const std::string& name) {
    for (const VerbEntry& verb : group.verbs) {
        if (*verb.name != '\0' && name == verb.name) {
            return &verb;
        }
    }
    return nullptr;
}

const VerbEntry* BareVerb(const GroupEntry& group) {
    for (const VerbEntry& verb : group.verbs) {
        if (*verb.name == '\0') {
            return &verb;
        }
    }
    return nullptr;
}

std::string VerbList(const GroupEntry& group) {
    std::string list;
    for (const VerbEntry& verb : group.verbs) {
        if (*verb.name != '\0') {
            list += (list.empty() ? "" : ", ") + std::string(verb.name);
        }
    }
    return list;
}

}  // namespace

std::span<const GroupEntry> Groups() {
    static const std::vector<GroupEntry> all = [] {
        std::vector<GroupEntry> groups;
        for (const auto list : {IdentityGroups(), ClockGroups(), PanelGroups(), EventGroups(), VirtualTimeGroups(),
                                IpcGroups(), BackupGroups(), BootGroups(), DeviceGroups(), NetworkGroups(),
                                VisionGroups(), TimeGroups(), SafetyGroups(), UserGroups()}) {
            groups.insert(groups.end(), list.begin(), list.end());
        }
        return groups;
    }();
    return all;
}

const GroupEntry* FindGroup(const std::string& name) {
    for (const GroupEntry& group : Groups()) {
        if (name == group.name) {
            return &group;
        }
    }
    return nullptr;
}

std::string VerbUsage(const GroupEntry& group, const VerbEntry& verb) {
    std::string line = "tavctl " + std::string(group.name);
    if (*verb.name != '\0') {
        line += " " + std::string(verb.name);
    }
    if (*verb.args != '\0') {
        line += " " + std::string(verb.args);
    }
    return line;
}

std::string GroupHelp(const GroupEntry& group) {
    std::string help = "Usage:";
    for (const VerbEntry& verb : group.verbs) {
        help += (help == "Usage:" ? " " : "       ") + VerbUsage(group, verb) + "\n";
    }
    help += std::string(group.summary) + ".\n\nVerbs:\n";
    for (const VerbEntry& verb : group.verbs) {
        const std::string name = *verb.name == '\0' ? "(none)" : verb.name;
        help += "  " + name + std::string(name.size() < 15 ? 15 - name.size() : 1, ' ') + verb.summary + "\n";
    }
    help += "\ntavctl " + std::string(group.name) + " VERB --help describes a verb.\n";
    return help;
}

std::string VerbHelp(const GroupEntry& group, const VerbEntry& verb) {
    std::string help = "Usage: " + VerbUsage(group, verb) + "\n" + verb.summary + ".\n";
    if (verb.details != nullptr) {
        help += verb.details;
    }
    return help;
}

std::optional<std::string> HelpFor(const std::vector<std::string>& words) {
    if (std::none_of(words.begin(), words.end(), IsHelp)) {
        return std::nullopt;
    }
    std::size_t first = 0;
    while (first < words.size() && (words[first] == "--json" || words[first] == "--client")) {
        first += words[first] == "--client" ? 2 : 1;
    }
    if (first >= words.size() || IsHelp(words[first])) {
        return std::nullopt;
    }
    const GroupEntry* group = FindGroup(words[first]);
    if (group == nullptr) {
        return std::nullopt;
    }
    if (first + 1 < words.size()) {
        if (const VerbEntry* verb = FindVerb(*group, words[first + 1])) {
            return VerbHelp(*group, *verb);
        }
    }
    return GroupHelp(*group);
}

int RunCommand(Session& session, std::vector<std::string> words) {
    // Options of this one command, restored when it ends.
    const GlobalOptions saved = session.Options();
    const unsigned savedClient = session.CurrentClient();
    struct Restore {
        Session& session;
        const GlobalOptions& options;
        unsigned client;
        ~Restore() {
            session.MutableOptions() = options;
            session.SelectClient(client);
        }
    } restore{session, saved, savedClient};
    std::size_t first = 0;
    while (first < words.size() && (words[first] == "--json" || words[first] == "--client")) {
        if (words[first] == "--json") {
            session.MutableOptions().json = true;
            ++first;
            continue;
        }
        const auto number = first + 1 < words.size() ? ClientNumber(words[first + 1]) : std::nullopt;
        if (!number) {
            session.Error("--client wants a number from 1 to " + std::to_string(kMaxClients) +
                          (first + 1 < words.size() ? ", not " + Quote(words[first + 1]) : std::string()) +
                          "\n(tavctl --help shows the usage)");
            return kExitUsage;
        }
        session.SelectClient(*number);
        first += 2;
    }
    words.erase(words.begin(), words.begin() + static_cast<std::ptrdiff_t>(first));
    if (words.empty()) {
        session.Error("no command given\n(tavctl --help lists the groups)");
        return kExitUsage;
    }
    const GroupEntry* group = FindGroup(words.front());
    if (group == nullptr) {
        session.Error("unknown group " + Quote(words.front()) + "\n(tavctl --help lists the groups)");
        return kExitUsage;
    }
    if (auto help = HelpFor(words)) {
        session.Print(*help);
        return kExitOk;
    }
    const VerbEntry* verb = words.size() > 1 ? FindVerb(*group, words[1]) : nullptr;
    std::size_t consumed = 2;
    if (verb == nullptr) {
        verb = BareVerb(*group);
        consumed = 1;
        if (verb == nullptr) {
            const std::string problem = words.size() > 1 ? "unknown verb " + Quote(words[1]) : "verb missing";
            session.Error(std::string(group->name) + ": " + problem + " (" + VerbList(*group) + ")\n" +
                          GroupHelp(*group).substr(0, GroupHelp(*group).find("\n\n")));
            return kExitUsage;
        }
    }
    words.erase(words.begin(), words.begin() + static_cast<std::ptrdiff_t>(consumed));
    Verb run(session, *group, *verb, std::move(words));
    if (run.Flag("--json")) {
        session.MutableOptions().json = true;
    }
    try {
        return verb->run(run);
    } catch (const UsageError& error) {
        session.Error(run.Name() + ": " + error.message + "\nUsage: " + VerbUsage(*group, *verb));
        return kExitUsage;
    } catch (const CommandFailed& failed) {
        return failed.status;
    }
}

}  // namespace tavctl
