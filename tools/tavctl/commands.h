#pragma once
#include <optional>
#include <span>
#include <string>
#include <vector>

namespace tavctl {

class Session;
class Verb;

using VerbFunction = int (*)(Verb& verb);

// One verb of a group: `tavctl GROUP VERB ARGS`. A verb named "" is the
// group's bare form, run when the next word names no verb of the group.
struct VerbEntry {
    const char* name;
    const char* args;     // the arguments in the usage line
    const char* summary;  // one line
    VerbFunction run;
    const char* details = nullptr;  // more for GROUP VERB --help
};

// One group of verbs, mostly one subsystem. Adding a verb is one row and
// one function; adding a group is one entry in its file's list.
struct GroupEntry {
    const char* name;
    const char* summary;
    std::span<const VerbEntry> verbs;
};

std::span<const GroupEntry> IdentityGroups();
std::span<const GroupEntry> ClockGroups();
std::span<const GroupEntry> PanelGroups();
std::span<const GroupEntry> EventGroups();
std::span<const GroupEntry> VirtualTimeGroups();
std::span<const GroupEntry> IpcGroups();
std::span<const GroupEntry> BackupGroups();
std::span<const GroupEntry> BootGroups();
std::span<const GroupEntry> DeviceGroups();
std::span<const GroupEntry> NetworkGroups();
std::span<const GroupEntry> VisionGroups();
std::span<const GroupEntry> TimeGroups();
std::span<const GroupEntry> SafetyGroups();
std::span<const GroupEntry> UserGroups();

// Every group, in the order tavctl --help lists them.
std::span<const GroupEntry> Groups();
const GroupEntry* FindGroup(const std::string& name);

// "Usage: tavctl GROUP VERB ARGS" lines of one verb, or of every verb.
std::string VerbUsage(const GroupEntry& group, const VerbEntry& verb);
std::string GroupHelp(const GroupEntry& group);
std::string VerbHelp(const GroupEntry& group, const VerbEntry& verb);

// When the words ask for help (tavctl GROUP --help, GROUP VERB --help), the
// help text, which needs neither module nor controller; else empty.
std::optional<std::string> HelpFor(const std::vector<std::string>& words);

// Runs one command line (words after the global options). Leading
// "--client N" and "--json" apply to this command alone.
int RunCommand(Session& session, std::vector<std::string> words);

}  // namespace tavctl
