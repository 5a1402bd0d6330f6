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
struct VerbSpec {
    const char* name;
    const char* args;     // the arguments in the usage line
    const char* summary;  // one line
    VerbFunction run;
    const char* details = nullptr;  // more for GROUP VERB --help
};

// One group of verbs, mostly one subsystem. Adding a verb is one row and
// one function; adding a group is one entry in its file's list.
struct GroupSpec {
    const char* name;
    const char* summary;
    std::span<const VerbSpec> verbs;
};

std::span<const GroupSpec> IdentityGroups();
std::span<const GroupSpec> ClockGroups();
std::span<const GroupSpec> PanelGroups();
std::span<const GroupSpec> EventGroups();
std::span<const GroupSpec> VirtualTimeGroups();
std::span<const GroupSpec> IpcGroups();
std::span<const GroupSpec> BackupGroups();
std::span<const GroupSpec> BootGroups();
std::span<const GroupSpec> DeviceGroups();
std::span<const GroupSpec> NetworkGroups();
std::span<const GroupSpec> VisionGroups();
std::span<const GroupSpec> TimeGroups();
std::span<const GroupSpec> SafetyGroups();
std::span<const GroupSpec> UserGroups();

// Every group, in the order tavctl --help lists them.
std::span<const GroupSpec> Groups();
const GroupSpec* FindGroup(const std::string& name);

// "Usage: tavctl GROUP VERB ARGS" lines of one verb, or of every verb.
std::string VerbUsage(const GroupSpec& group, const VerbSpec& verb);
std::string GroupHelp(const GroupSpec& group);
std::string VerbHelp(const GroupSpec& group, const VerbSpec& verb);

// When the words ask for help (tavctl GROUP --help, GROUP VERB --help), the
// help text, which needs neither module nor controller; else empty.
std::optional<std::string> HelpFor(const std::vector<std::string>& words);

// Runs one command line (words after the global options). Leading
// "--client N" and "--json" apply to this command alone.
int RunCommand(Session& session, std::vector<std::string> words);

}  // namespace tavctl
