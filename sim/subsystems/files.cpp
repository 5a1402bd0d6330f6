// Jobs on the controller's files: copying a file or a folder, writing the
// diagnostics information to a file, dumping the pendant's screen. The copies
// are done before the reply; a diagnostics file and a screen dump take a
// while and tell their result code in their status and event.
#include <algorithm>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"
#include "sim/subsystems/devices.h"
#include "sim/subsystems/system_jobs.h"
#include "sim/subsystems/systems.h"

namespace tav::sim {
namespace {

// A job's status while it runs.
constexpr HRESULT kJobPending = static_cast<HRESULT>(0x8000000Au);
constexpr HRESULT kAccessDenied = static_cast<HRESULT>(0x80070005u);

// The last diagnostics or screen-dump job: S_OK before the first, pending
// while one runs, then its result code.
struct JobStatus {
    HRESULT result = S_OK;
    std::uint64_t ticket = 0;  // of the running job; 0 when none runs
};
struct DiagnosticsJob : JobStatus {};
struct ScreenDumpJob : JobStatus {
    std::uint32_t dumps = 0;
};

constexpr const OLECHAR* kScreenDumpFolder = OLESTR("hd0a/temp");

Text ParentOf(const Text& key) {
    const std::size_t slash = key.rfind(OLECHAR('/'));
    return slash == Text::npos ? Text() : key.substr(0, slash);
}

Text NameOf(const Text& key) { return key.substr(key.rfind(OLECHAR('/')) + 1); }

// Paths arrive with the controller's prefix removed; a path the client left
// as a local one names nothing on the controller.
std::optional<Text> ControllerKey(TextView path) {
    const auto key = FileSystem::Normalise(WithoutControllerPrefix(path));
    if (!key || key->empty() || key->find(OLECHAR(':')) != Text::npos) {
        return std::nullopt;
    }
    return key;
}

Reply CopyOnController(ModelState& state, TextView command, const Text& from, const Text& to, bool folder) {
    FileSystem& files = state.Part<FileSystem>();
    if (!files.Exists(from)) {
        return Refused(command, kStatusNotFound, OLESTR("no such file or folder ") + Quoted(from));
    }
    if (files.IsFolder(from) != folder) {
        return Refused(command, kStatusBadArgument,
                       Quoted(from) + (folder ? OLESTR(" is a file; copy it with CopyFile")
                                              : OLESTR(" is a folder; copy it with CopyDir")));
    }
    // A file copied onto a folder goes into it; a file onto a file replaces it.
    const Text target = !folder && files.IsFolder(to) ? JoinPath(to, NameOf(from)) : to;
    if (target == from || target.starts_with(from + OLECHAR('/'))) {
        return Refused(command, kStatusBadArgument, Quoted(from) + OLESTR(" cannot be copied onto itself"));
    }
    if (folder && files.Exists(target)) {
        return Refused(command, kStatusNotAllowed, Quoted(target) + OLESTR(" already exists"));
    }
    if (files.IsFolder(target)) {
        return Refused(command, kStatusNotAllowed, Quoted(target) + OLESTR(" is a folder"));
    }
    if (!files.IsFolder(ParentOf(target))) {
        return Refused(command, kStatusPathNotFound, OLESTR("no folder ") + Quoted(ParentOf(target)));
    }
    const std::uint64_t size = files.UsedBelow(from);
    const std::uint64_t replaced = files.Size(target).value_or(0);
    if (const auto refusal = WriteRefusal(state, target, size > replaced ? size - replaced : 0)) {
        return Refused(command, refusal->status, refusal->text);
    }
    if (!folder) {
        files.Write(target, *files.Read(from));
        return Done();
    }
    const FileSystem::Result result = files.Copy(from, target);
    if (result != FileSystem::Result::Done) {
        return Refused(command, kStatusNotAllowed, ResultText(result));
    }
    return Done();
}

// "-SourcePath \"<path>\" -DestPath \"<path>\"".
Reply Copy(ControllerModel& controller, const Command& command, bool folder) {
    const auto arguments = Arguments::Parse(command.args);
    const auto source = arguments ? arguments->Find(OLESTR("-SourcePath")) : std::nullopt;
    const auto destination = arguments ? arguments->Find(OLESTR("-DestPath")) : std::nullopt;
    if (!source || !destination) {
        return BadArguments(command, OLESTR("-SourcePath \"<path>\" -DestPath \"<path>\""));
    }
    const auto from = ControllerKey(*source);
    const auto to = ControllerKey(*destination);
    if (!from || !to) {
        return Refused(command.name, kStatusPathNotFound,
                       OLESTR("not a path on the controller: ") + Quoted(!from ? *source : *destination));
    }
    return controller.Update(
        [&](ModelState& state, EventPosts&) { return CopyOnController(state, command.name, *from, *to, folder); });
}

Reply CopyFile(ControllerModel& controller, const Command& command) { return Copy(controller, command, false); }
Reply CopyDir(ControllerModel& controller, const Command& command) { return Copy(controller, command, true); }

Text JobStatusText(HRESULT result) { return OLESTR("-pstatus ") + Decimal(static_cast<std::uint32_t>(result)); }

// Writes a job's file, or tells the result code why it could not.
HRESULT WriteJobFile(ModelState& state, const Text& path, std::string bytes) {
    FileSystem& files = state.Part<FileSystem>();
    if (files.IsFolder(path)) {
        return kAccessDenied;
    }
    if (!files.IsFolder(ParentOf(path))) {
        return kStatusPathNotFound;
    }
    if (const auto refusal = WriteRefusal(state, path, bytes.size())) {
        return refusal->status;
    }
    return files.Write(path, std::move(bytes)) == FileSystem::Result::Done ? S_OK : kStatusPathNotFound;
}

std::string DiagnosticsReport(const ModelState& state) {
    std::string report = "Controller diagnostics\n";
    report += ManifestLine("controller", state.name) + ManifestLine("controller_id", state.controllerId) +
              ManifestLine("system", state.currentSystem) + ManifestLine("version", state.version.system) +
              ManifestLine("release", state.version.release) + ManifestLine("motors", state.motors) +
              ManifestLine("mode", ModeWord(state.mode)) +
              ManifestLine("clock", Decimal(ControllerModel::Now(state)));
    const FileSystem& files = state.Part<FileSystem>();
    for (const Text& device : files.Devices()) {
        report += ManifestLine("device", device + OLESTR(" ") + Decimal(files.UsedBelow(device)) + OLESTR(" bytes"));
    }
    return report;
}

// "-Path \"<file>\"": the file is written when the job ends.
Reply StartDiagnostics(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto path = arguments ? arguments->Find(OLESTR("-Path")) : std::nullopt;
    if (!path) {
        return BadArguments(command, OLESTR("-Path \"<file>\""));
    }
    const auto key = ControllerKey(*path);
    if (!key) {
        return Refused(command.name, kStatusBadArgument, OLESTR("not a path on the controller: ") + Quoted(*path));
    }
    const std::uint64_t ticket = jobs::NextTicket();
    Reply reply = controller.Update([&](ModelState& state, EventPosts&) {
        DiagnosticsJob& job = state.Part<DiagnosticsJob>();
        if (job.ticket != 0) {
            return Refused(command.name, kStatusNotAllowed, OLESTR("diagnostics are being saved already"));
        }
        job.ticket = ticket;
        job.result = kJobPending;
        return Done();
    });
    if (SUCCEEDED(reply.status)) {
        jobs::FinishLater(controller, jobs::Job::Diagnostics, [ticket, file = *key](ModelState& state, EventPosts&) {
            DiagnosticsJob& job = state.Part<DiagnosticsJob>();
            if (job.ticket == ticket) {
                job.result = WriteJobFile(state, file, DiagnosticsReport(state));
                job.ticket = 0;
            }
        });
    }
    return reply;
}

Reply GetDiagnosticsStatus(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return JobStatusText(state.Part<DiagnosticsJob>().result); }));
}

// A small 24-bit bitmap of the pendant's screen: a grey frame.
std::string ScreenImage() {
    constexpr std::uint32_t kWidth = 64;
    constexpr std::uint32_t kHeight = 48;
    constexpr std::uint32_t kPixels = kWidth * kHeight * 3;
    std::string image(54 + kPixels, '\0');
    auto put = [&](std::size_t at, std::uint32_t value, int bytes) {
        for (int i = 0; i < bytes; ++i) {
            image[at + i] = static_cast<char>((value >> (8 * i)) & 0xFF);
        }
    };
    image[0] = 'B';
    image[1] = 'M';
    put(2, static_cast<std::uint32_t>(image.size()), 4);
    put(10, 54, 4);
    put(14, 40, 4);
    put(18, kWidth, 4);
    put(22, kHeight, 4);
    put(26, 1, 2);
    put(28, 24, 2);
    put(34, kPixels, 4);
    for (std::uint32_t y = 0; y < kHeight; ++y) {
        for (std::uint32_t x = 0; x < kWidth; ++x) {
            const bool frame = x == 0 || y == 0 || x == kWidth - 1 || y == kHeight - 1;
            const char shade = frame ? '\x40' : '\xE0';
            const std::size_t at = 54 + (y * kWidth + x) * 3;
            image[at] = image[at + 1] = image[at + 2] = shade;
        }
    }
    return image;
}

// Each dump goes to a file of its own in the temporary folder.
Reply StartScreenDump(ControllerModel& controller, const Command& command) {
    const std::uint64_t ticket = jobs::NextTicket();
    Reply reply = controller.Update([&](ModelState& state, EventPosts&) {
        ScreenDumpJob& job = state.Part<ScreenDumpJob>();
        if (job.ticket != 0) {
            return Refused(command.name, kStatusNotAllowed, OLESTR("a screen dump is being taken already"));
        }
        job.ticket = ticket;
        job.result = kJobPending;
        return Done();
    });
    if (SUCCEEDED(reply.status)) {
        jobs::FinishLater(controller, jobs::Job::ScreenDump, [ticket](ModelState& state, EventPosts&) {
            ScreenDumpJob& job = state.Part<ScreenDumpJob>();
            if (job.ticket == ticket) {
                const Text file = Concat({kScreenDumpFolder, OLESTR("/ScreenDump"), Decimal(job.dumps + 1), OLESTR(".bmp")});
                job.result = WriteJobFile(state, file, ScreenImage());
                job.dumps += SUCCEEDED(job.result) ? 1 : 0;
                job.ticket = 0;
            }
        });
    }
    return reply;
}

Reply GetScreenDumpStatus(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return JobStatusText(state.Part<ScreenDumpJob>().result); }));
}

// Both events carry the job's status as its Get does: "-pstatus <code>",
// the code in unsigned decimal; they change when a job starts and ends.
Text DiagnosticsEvent(const ModelState& state, const Arguments&) { return JobStatusText(state.Part<DiagnosticsJob>().result); }
Text ScreenDumpEvent(const ModelState& state, const Arguments&) { return JobStatusText(state.Part<ScreenDumpJob>().result); }

}  // namespace

const Subsystem& FilesSubsystem() {
    static constexpr CommandRow kRows[] = {
        {OLESTR("Set"), OLESTR("CopyFile"), CopyFile},
        {OLESTR("Set"), OLESTR("CopyDir"), CopyDir},
        {OLESTR("Set"), OLESTR("SystemDiagnostics"), StartDiagnostics},
        {OLESTR("Get"), OLESTR("SystemDiagnostics"), GetDiagnosticsStatus},
        {OLESTR("Set"), OLESTR("Dorvel"), StartScreenDump},
        {OLESTR("Get"), OLESTR("Dorvel"), GetScreenDumpStatus},
    };
    static constexpr EventRow kEvents[] = {
        {OLESTR("SystemDiagnostics"), EventStyle::Value, DiagnosticsEvent},
        {OLESTR("TavDorvel"), EventStyle::Value, ScreenDumpEvent},
    };
    static constexpr Subsystem subsystem{kRows, kEvents};
    return subsystem;
}

}  // namespace tav::sim
