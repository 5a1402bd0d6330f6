// Backups of the running system into a folder on the controller, checking
// and restoring them, and the version information they keep. A backup folder
// holds the system's HOME and SYSPAR and, in BACKINFO/backup.manifest, the
// system's name, its id, its template and versions and the controller's name
// and id ("key=value" lines).
#include <vector>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"
#include "sim/subsystems/devices.h"
#include "sim/subsystems/system_jobs.h"
#include "sim/subsystems/systems.h"

namespace tav::sim {
namespace {

constexpr const OLECHAR* kManifest = OLESTR("BACKINFO/backup.manifest");
constexpr const OLECHAR* kBackupEvent = OLESTR("BackupSub");

// What a restore may take: bits of the include value.
constexpr std::uint32_t kIncludeConfiguration = 1;  // SYSPAR
constexpr std::uint32_t kIncludeModules = 2;        // HOME
// Mismatches a restore may be told to ignore: bits of the ignore value.
constexpr std::uint32_t kIgnoreSystemId = 1;
constexpr std::uint32_t kIgnoreTemplate = 2;

struct BackupJob {
    std::uint64_t ticket = 0;  // of the running backup; 0 when none runs
    std::uint32_t sequence = 0;  // of the last BackupSub event
};

Text SystemFolder(const ModelState& state) { return JoinPath(kSystemsDevice, state.currentSystem); }

std::optional<Text> FolderKey(TextView path) {
    const auto key = FileSystem::Normalise(WithoutControllerPrefix(path));
    if (!key || key->empty() || key->find(OLECHAR(':')) != Text::npos) {
        return std::nullopt;
    }
    return key;
}

std::string ManifestOf(const ModelState& state) {
    return ManifestLine("system", state.currentSystem) + ManifestLine("system_id", state.systemGuid) +
           ManifestLine("template", TemplateOf(state.Part<FileSystem>(), state.currentSystem)) +
           ManifestLine("version", state.version.system) + ManifestLine("release", state.version.release) +
           ManifestLine("controller_name", state.name) + ManifestLine("controller_id", state.controllerId) +
           ManifestLine("created", Decimal(ControllerModel::Now(state)));
}

// "-BackupEvent Finished|Error -SeqNo <n>", numbered from 1.
void PostBackupEvent(BackupJob& job, EventPosts& posts, bool finished) {
    posts.Post(kBackupEvent, Concat({OLESTR("-BackupEvent "), finished ? OLESTR("Finished") : OLESTR("Error"),
                                     OLESTR(" -SeqNo "), Decimal(++job.sequence)}));
}

void FinishBackup(ModelState& state, EventPosts& posts, const Text& target) {
    FileSystem& files = state.Part<FileSystem>();
    const Text system = SystemFolder(state);
    const std::string manifest = ManifestOf(state);
    const std::uint64_t size =
        files.UsedBelow(JoinPath(system, OLESTR("HOME"))) + files.UsedBelow(JoinPath(system, OLESTR("SYSPAR"))) +
        manifest.size();
    const bool written = !WriteRefusal(state, target, size) && files.MakeFolders(JoinPath(target, OLESTR("BACKINFO"))) ==
                                                                   FileSystem::Result::Done;
    if (written) {
        for (const OLECHAR* part : {OLESTR("HOME"), OLESTR("SYSPAR")}) {
            files.Remove(JoinPath(target, part));
            files.Copy(JoinPath(system, part), JoinPath(target, part));
        }
        files.Write(JoinPath(target, kManifest), manifest);
    }
    PostBackupEvent(state.Part<BackupJob>(), posts, written);
}

// "-Path \"<folder>\"": the folder is made, or must be empty.
Reply StartBackup(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto path = arguments ? arguments->Find(OLESTR("-Path")) : std::nullopt;
    const auto key = path ? FolderKey(*path) : std::nullopt;
    if (!key) {
        return BadArguments(command, OLESTR("-Path \"<folder on the controller>\""));
    }
    const std::uint64_t ticket = jobs::NextTicket();
    const Reply reply = controller.Update([&](ModelState& state, EventPosts&) {
        BackupJob& job = state.Part<BackupJob>();
        if (job.ticket != 0) {
            return Refused(command.name, kStatusNotAllowed, OLESTR("a backup is in progress"));
        }
        const FileSystem& files = state.Part<FileSystem>();
        if (files.Exists(*key) && (!files.IsFolder(*key) || !files.List(*key)->empty())) {
            return Refused(command.name, kStatusNotAllowed, Quoted(*key) + OLESTR(" exists and is not an empty folder"));
        }
        if (const auto refusal = WriteRefusal(state, *key, 0)) {
            return Refused(command.name, refusal->status, refusal->text);
        }
        job.ticket = ticket;
        return Done();
    });
    if (SUCCEEDED(reply.status)) {
        jobs::FinishLater(controller, jobs::Job::Backup, [ticket, target = *key](ModelState& state, EventPosts& posts) {
            BackupJob& job = state.Part<BackupJob>();
            if (job.ticket == ticket) {
                job.ticket = 0;
                FinishBackup(state, posts, target);
            }
        });
    }
    return reply;
}

Reply GetBackupState(ControllerModel& controller, const Command&) {
    const bool running = controller.Read([](const ModelState& state) { return state.Part<BackupJob>().ticket != 0; });
    return Answer(running ? OLESTR("-BackupState InProgress") : OLESTR("-BackupState None"));
}

struct RestoreRequest {
    Text folder;
    std::uint32_t include = 0;
    std::uint32_t ignore = 0;
    bool deleteFolder = false;
    bool controllerSettings = false;
};

// Why the backup cannot be restored as asked, one sentence each; nothing
// when it can.
std::vector<Text> Findings(const ModelState& state, const RestoreRequest& request) {
    const FileSystem& files = state.Part<FileSystem>();
    if (!files.IsFolder(request.folder)) {
        return {OLESTR("Directory ") + request.folder + OLESTR(" does not exist.")};
    }
    const Text manifest = JoinPath(request.folder, kManifest);
    if (!files.Exists(manifest)) {
        return {OLESTR("Directory ") + request.folder + OLESTR(" holds no backup: ") + Text(kManifest) +
                OLESTR(" is missing.")};
    }
    std::vector<Text> findings;
    const Text systemId = ManifestValue(files, manifest, "system_id").value_or(Text());
    if (systemId != state.systemGuid && (request.ignore & kIgnoreSystemId) == 0) {
        findings.push_back(OLESTR("System id mismatch: the backup is of ") + systemId + OLESTR(", this system is ") +
                           state.systemGuid + OLESTR("."));
    }
    const Text backupTemplate = ManifestValue(files, manifest, "template").value_or(Text());
    const Text systemTemplate = TemplateOf(files, state.currentSystem);
    if (backupTemplate != systemTemplate && (request.ignore & kIgnoreTemplate) == 0) {
        findings.push_back(OLESTR("Template mismatch: the backup is of ") + backupTemplate + OLESTR(", this system of ") +
                           systemTemplate + OLESTR("."));
    }
    const std::pair<std::uint32_t, const OLECHAR*> parts[] = {{kIncludeConfiguration, OLESTR("SYSPAR")},
                                                              {kIncludeModules, OLESTR("HOME")}};
    for (const auto& [bit, part] : parts) {
        if ((request.include & bit) != 0 && !files.IsFolder(JoinPath(request.folder, part))) {
            findings.push_back(OLESTR("Directory ") + Text(part) + OLESTR(" is missing in the backup."));
        }
    }
    return findings;
}

void ApplyRestore(ModelState& state, const RestoreRequest& request) {
    FileSystem& files = state.Part<FileSystem>();
    const Text system = SystemFolder(state);
    const std::pair<std::uint32_t, const OLECHAR*> parts[] = {{kIncludeConfiguration, OLESTR("SYSPAR")},
                                                              {kIncludeModules, OLESTR("HOME")}};
    for (const auto& [bit, part] : parts) {
        if ((request.include & bit) != 0) {
            files.Remove(JoinPath(system, part));
            files.Copy(JoinPath(request.folder, part), JoinPath(system, part));
        }
    }
    if (request.controllerSettings) {
        const Text manifest = JoinPath(request.folder, kManifest);
        state.name = ManifestValue(files, manifest, "controller_name").value_or(state.name);
        state.controllerId = ManifestValue(files, manifest, "controller_id").value_or(state.controllerId);
    }
    if (request.deleteFolder) {
        files.Remove(request.folder);
    }
}

// "-Path \"<folder>\" -Include <n> -Ignore <n> -DeleteDir <n>
// [-IncludeCtrlSettings <n>]", the numbers signed. Findings are refused
// with "-RestoreErrInfo \"<findings>\"" in the text.
Reply RestoreOrCheck(ControllerModel& controller, const Command& command, bool check) {
    const auto arguments = Arguments::Parse(command.args);
    const auto path = arguments ? arguments->Find(OLESTR("-Path")) : std::nullopt;
    const auto key = path ? FolderKey(*path) : std::nullopt;
    const auto include = arguments ? arguments->Signed(OLESTR("-Include")) : std::nullopt;
    const auto ignore = arguments ? arguments->Signed(OLESTR("-Ignore")) : std::nullopt;
    const auto deleteDir = arguments ? arguments->Signed(OLESTR("-DeleteDir")) : std::nullopt;
    const auto settings =
        arguments && arguments->Has(OLESTR("-IncludeCtrlSettings")) ? arguments->Signed(OLESTR("-IncludeCtrlSettings"))
                                                                     : std::optional<std::int32_t>(0);
    if (!key || !include || !ignore || !deleteDir || !settings) {
        return BadArguments(
            command, OLESTR("-Path \"<folder>\" -Include <n> -Ignore <n> -DeleteDir <n> [-IncludeCtrlSettings <n>]"));
    }
    const RestoreRequest request{*key, static_cast<std::uint32_t>(*include), static_cast<std::uint32_t>(*ignore),
                                 *deleteDir != 0, *settings != 0};
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (state.Part<BackupJob>().ticket != 0) {
            return Refused(command.name, kStatusNotAllowed, OLESTR("a backup is in progress"));
        }
        const std::vector<Text> findings = Findings(state, request);
        if (!findings.empty()) {
            Text joined;
            for (const Text& finding : findings) {
                joined += (joined.empty() ? Text() : Text(OLESTR(" "))) + finding;
            }
            const bool missing = !state.Part<FileSystem>().IsFolder(request.folder);
            return Refused(command.name, missing ? kStatusNotFound : kStatusNotAllowed,
                           Concat({OLESTR("the backup cannot be restored -RestoreErrInfo \""), joined, OLESTR("\"")}));
        }
        if (!check) {
            ApplyRestore(state, request);
        }
        return Done();
    });
}

Reply CheckRestore(ControllerModel& controller, const Command& command) { return RestoreOrCheck(controller, command, true); }
Reply Restore(ControllerModel& controller, const Command& command) { return RestoreOrCheck(controller, command, false); }

// "-BackupPath \"<folder>\"": the manifest's system, versions, template and
// system id, each "-Key \"value\"".
Reply VersionInfoFromBackup(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto path = arguments ? arguments->Find(OLESTR("-BackupPath")) : std::nullopt;
    const auto key = path ? FolderKey(*path) : std::nullopt;
    if (!key) {
        return BadArguments(command, OLESTR("-BackupPath \"<folder>\""));
    }
    return controller.Read([&](const ModelState& state) {
        const FileSystem& files = state.Part<FileSystem>();
        if (!files.IsFolder(*key)) {
            return Refused(command.name, kStatusNotFound, OLESTR("no folder ") + Quoted(*key));
        }
        const Text manifest = JoinPath(*key, kManifest);
        if (!files.Exists(manifest)) {
            return Refused(command.name, kStatusBadArgument, Quoted(*key) + OLESTR(" holds no backup"));
        }
        auto value = [&](std::string_view name) { return Quoted(ManifestValue(files, manifest, name).value_or(Text())); };
        return Answer(Concat({OLESTR("-System "), value("system"), OLESTR(" -Version "), value("version"),
                              OLESTR(" -Release "), value("release"), OLESTR(" -Template "), value("template"),
                              OLESTR(" -SystemId "), value("system_id")}));
    });
}

}  // namespace

const Subsystem& BackupSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Set"), OLESTR("Backup"), StartBackup},
        {OLESTR("Get"), OLESTR("BackupState"), GetBackupState},
        {OLESTR("Set"), OLESTR("CheckRestore"), CheckRestore},
        {OLESTR("Set"), OLESTR("Restore"), Restore},
        {OLESTR("Get"), OLESTR("VersionInfoFromBackup"), VersionInfoFromBackup},
    };
    // "BackupSub" is posted when a backup ends (PostBackupEvent).
    static constexpr EventRow kEvents[] = {
        {kBackupEvent, EventStyle::Pulse, nullptr},
    };
    static constexpr Subsystem subsystem{kRows, kEvents};
    return subsystem;
}

}  // namespace tav::sim
