// The installation inbox: a folder on the controller where a deployment
// package is staged and installed. Its states: empty, open (the client copies
// the package in), loaded (the client said so), committed (the package's
// system is installed) and error (a check or an installation failed; only
// clearing leaves it). The pre-check and the update take a while; the inbox
// is busy meanwhile and refuses other operations.
#include <array>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"
#include "sim/subsystems/system_jobs.h"
#include "sim/subsystems/systems.h"

namespace tav::sim {
namespace {

constexpr const OLECHAR* kInboxFolder = OLESTR("hd0a/inbox");
constexpr const OLECHAR* kBootServerManifest = OLESTR("bootserver.manifest");
constexpr const OLECHAR* kBootServerFolder = OLESTR("hd0a/BOOTSRV");

enum class InboxState { Empty, Open, Loaded, Committed, Error };

constexpr std::array<TextView, 5> kStateWords = {OLESTR("empty"), OLESTR("open"), OLESTR("loaded"),
                                                 OLESTR("committed"), OLESTR("error")};

TextView WordOf(InboxState state) { return kStateWords[static_cast<std::size_t>(state)]; }

struct Inbox {
    InboxState state = InboxState::Empty;
    bool checked = false;      // the loaded package passed the pre-check
    std::uint64_t ticket = 0;  // of the running operation: busy
    Text problem;              // why the inbox is in error
};

// The file of the inbox that keeps each version ("version=" line).
struct VersionFile {
    TextView type;
    const OLECHAR* file;
};
constexpr VersionFile kVersionFiles[] = {
    {OLESTR("CTRL_MANIFEST"), kControllerManifest},
    {OLESTR("SYS_MANIFEST"), kSystemManifest},
    {OLESTR("INSTALL_PKG_MANIFEST"), kInstallManifest},
    {OLESTR("UPDATE_PKG_MANIFEST"), OLESTR("update_package.manifest")},
    {OLESTR("UPDATE_SUMMARY"), OLESTR("update_summary.txt")},
    {OLESTR("LICENSE"), OLESTR("license.txt")},
    {OLESTR("CTRL_PROD_SETTING"), OLESTR("production_settings.txt")},
};

Reply GetInboxState(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        return Concat({OLESTR("-state "), WordOf(state.Part<Inbox>().state)});
    }));
}

Reply GetBusy(ControllerModel& controller, const Command&) {
    const bool busy = controller.Read([](const ModelState& state) { return state.Part<Inbox>().ticket != 0; });
    return Answer(busy ? OLESTR("-busy true") : OLESTR("-busy false"));
}

Reply GetPath(ControllerModel& controller, const Command&) {
    return Answer(Concat({OLESTR("-path \"/"), kInboxFolder, OLESTR("\"")}));
}

void Fail(Inbox& inbox, Text problem) {
    inbox.state = InboxState::Error;
    inbox.checked = false;
    inbox.problem = std::move(problem);
}

// The end of a pre-check or an update.
void Finish(ModelState& state, std::uint64_t ticket, bool apply) {
    Inbox& inbox = state.Part<Inbox>();
    if (inbox.ticket != ticket) {
        return;
    }
    inbox.ticket = 0;
    Text problem;
    if (!apply) {
        if (ReadPackage(state.Part<FileSystem>(), kInboxFolder, true, problem)) {
            inbox.checked = true;
        } else {
            Fail(inbox, problem);
        }
        return;
    }
    const Reply installed =
        InstallSystem(state, {.command = OLESTR("apply_update"), .folder = kInboxFolder, .deployment = true, .overwrite = true});
    if (SUCCEEDED(installed.status)) {
        inbox.state = InboxState::Committed;
    } else {
        Fail(inbox, installed.text);
    }
}

// "-operation clear|open|precheck|load_completed|apply_update".
Reply Operate(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto word = arguments ? arguments->Find(OLESTR("-operation")) : std::nullopt;
    if (!word) {
        return BadArguments(command, OLESTR("-operation <operation>"));
    }
    const Text operation(*word);
    const std::uint64_t ticket = jobs::NextTicket();
    bool started = false;
    bool apply = false;
    const Reply reply = controller.Update([&](ModelState& state, EventPosts&) {
        Inbox& inbox = state.Part<Inbox>();
        FileSystem& files = state.Part<FileSystem>();
        if (inbox.ticket != 0) {
            return Refused(command.name, kStatusNotAllowed, OLESTR("the inbox is busy"));
        }
        auto notNow = [&] {
            return Refused(command.name, kStatusNotAllowed,
                           Concat({Quoted(operation), OLESTR(" is not possible while the inbox is "), WordOf(inbox.state)}));
        };
        if (operation == OLESTR("clear")) {
            files.Remove(kInboxFolder);
            inbox = Inbox{};
            return Done();
        }
        if (operation == OLESTR("open")) {
            if (inbox.state != InboxState::Empty) {
                return notNow();
            }
            files.MakeFolders(kInboxFolder);
            inbox.state = InboxState::Open;
            return Done();
        }
        if (operation == OLESTR("load_completed")) {
            if (inbox.state != InboxState::Open) {
                return notNow();
            }
            inbox.state = InboxState::Loaded;
            return Done();
        }
        if (operation == OLESTR("precheck") || operation == OLESTR("apply_update")) {
            apply = operation == OLESTR("apply_update");
            if (inbox.state != InboxState::Loaded) {
                return notNow();
            }
            if (apply && !inbox.checked) {
                return Refused(command.name, kStatusNotAllowed, OLESTR("the package has not passed the precheck"));
            }
            inbox.ticket = ticket;
            started = true;
            return Done();
        }
        return Refused(command.name, kStatusBadArgument, OLESTR("unknown operation ") + Quoted(operation));
    });
    if (started) {
        jobs::FinishLater(controller, jobs::Job::Inbox,
                          [ticket, apply](ModelState& state, EventPosts&) { Finish(state, ticket, apply); });
    }
    return reply;
}

// "-Name <type>": the version in the inbox's file of that type.
Reply GetVersion(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto type = arguments ? arguments->Find(OLESTR("-Name")) : std::nullopt;
    const VersionFile* file = nullptr;
    for (const VersionFile& candidate : kVersionFiles) {
        if (type && candidate.type == *type) {
            file = &candidate;
        }
    }
    if (file == nullptr) {
        return Refused(command.name, kStatusBadArgument, OLESTR("unknown file type in ") + Quoted(command.args));
    }
    return controller.Read([&](const ModelState& state) {
        const Text path = JoinPath(kInboxFolder, file->file);
        const auto version = ManifestValue(state.Part<FileSystem>(), path, "version");
        if (!version) {
            return Refused(command.name, kStatusNotFound,
                           Concat({OLESTR("the inbox holds no "), file->file, OLESTR(" with a version")}));
        }
        return Answer(Concat({OLESTR("-version \""), *version, OLESTR("\"")}));
    });
}

// "-path <folder>", the folder as the client gave it: blanks and quotes
// included.
std::optional<Text> FolderOf(const Command& command) {
    TextView rest = Trim(command.args);
    constexpr TextView kKey = OLESTR("-path");
    if (rest.substr(0, kKey.size()) != kKey) {
        return std::nullopt;
    }
    rest = Trim(rest.substr(kKey.size()));
    if (rest.size() >= 2 && rest.front() == OLECHAR('"') && rest.back() == OLECHAR('"')) {
        rest = rest.substr(1, rest.size() - 2);
    }
    return FileSystem::Normalise(WithoutControllerPrefix(rest));
}

Reply PreInstallCheck(ControllerModel& controller, const Command& command) {
    const auto folder = FolderOf(command);
    if (!folder) {
        return BadArguments(command, OLESTR("-path <folder>"));
    }
    return controller.Read([&](const ModelState& state) {
        Text problem;
        if (!ReadPackage(state.Part<FileSystem>(), *folder, true, problem)) {
            return Refused(command.name, state.Part<FileSystem>().IsFolder(*folder) ? kStatusBadArgument : kStatusNotFound,
                           problem);
        }
        return Done();
    });
}

// The folder holds a boot server ("bootserver.manifest" with its version);
// it replaces the controller's in hd0a/BOOTSRV.
Reply UpgradeBootServer(ControllerModel& controller, const Command& command) {
    const auto folder = FolderOf(command);
    if (!folder) {
        return BadArguments(command, OLESTR("-path <folder>"));
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        FileSystem& files = state.Part<FileSystem>();
        if (state.Part<Inbox>().ticket != 0) {
            return Refused(command.name, kStatusNotAllowed, OLESTR("the inbox is busy"));
        }
        const Text manifest = JoinPath(*folder, kBootServerManifest);
        if (!ManifestValue(files, manifest, "version")) {
            return Refused(command.name, files.IsFolder(*folder) ? kStatusBadArgument : kStatusNotFound,
                           Quoted(*folder) + OLESTR(" holds no boot server (") + Text(kBootServerManifest) +
                               OLESTR(" with a version)"));
        }
        files.Remove(kBootServerFolder);
        files.Copy(*folder, kBootServerFolder);
        return Done();
    });
}

}  // namespace

const Subsystem& InboxSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Get"), OLESTR("InboxState"), GetInboxState},
        {OLESTR("Get"), OLESTR("InboxIsBusy"), GetBusy},
        {OLESTR("Get"), OLESTR("InboxPath"), GetPath},
        {OLESTR("Set"), OLESTR("InboxOperation"), Operate},
        {OLESTR("Get"), OLESTR("InboxVersion"), GetVersion},
        {OLESTR("Set"), OLESTR("InboxPreInstallCheck"), PreInstallCheck},
        {OLESTR("Set"), OLESTR("InboxUpgradeBootServer"), UpgradeBootServer},
    };
    static constexpr Subsystem subsystem{kRows};
    return subsystem;
}

}  // namespace tav::sim
