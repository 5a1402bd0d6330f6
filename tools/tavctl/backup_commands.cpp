// Backup and restore.
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using B = ITavBackupRestore;

// The restore selectors take any number; the names are the well-known ones.
struct RestoreOptions {
    ULONG include = RestoreInclude_All;
    ULONG ignore = RestoreIgnoreMismatch_None;
    std::optional<ULONG> settings;
    bool deleteDirectory = false;
};

RestoreOptions ReadRestoreOptions(Verb& v, bool withDelete) {
    RestoreOptions options;
    if (const auto include = v.Option("--include")) {
        options.include = static_cast<ULONG>(v.EnumValue("--include", *include, NamesOf<TavRestoreInclude>(), {}));
    }
    if (const auto ignore = v.Option("--ignore")) {
        options.ignore =
            static_cast<ULONG>(v.EnumValue("--ignore", *ignore, NamesOf<TavRestoreIgnoreMismatch>(), {}));
    }
    options.settings = v.NumberOption<ULONG>("--settings");
    options.deleteDirectory = withDelete && v.Flag("--delete");
    return options;
}

int Start(Verb& v) {
    const auto path = v.Text("PATH");
    v.End();
    return v.Set("Backup", &B::Backup, path.Get());
}

int BackupState(Verb& v) {
    v.End();
    return v.Get("GetBackupState", &B::GetBackupState, &B::UnpackBackupState);
}

int Check(Verb& v) {
    const RestoreOptions options = ReadRestoreOptions(v, false);
    const auto path = v.Text("PATH");
    v.End();
    if (options.settings) {
        return v.Get("CheckRestore3", &ITavBackupRestore2::CheckRestore3, &B::UnpackRestoreErrorInfo, path.Get(),
                     options.include, *options.settings, options.ignore);
    }
    return v.Get("CheckRestore", &B::CheckRestore, &B::UnpackRestoreErrorInfo, path.Get(), options.include,
                 options.ignore);
}

int Restore(Verb& v) {
    const RestoreOptions options = ReadRestoreOptions(v, true);
    const auto path = v.Text("PATH");
    v.End();
    const ULONG deleteDirectory = options.deleteDirectory ? RestoreDeleteDirectory_Yes : RestoreDeleteDirectory_No;
    if (options.settings) {
        return v.Get("Restore3", &ITavBackupRestore2::Restore3, &B::UnpackRestoreErrorInfo, path.Get(),
                     options.include, *options.settings, options.ignore, deleteDirectory);
    }
    if (options.deleteDirectory) {
        return v.Get("Restore2", &B::Restore2, &B::UnpackRestoreErrorInfo, path.Get(), options.include,
                     options.ignore, deleteDirectory);
    }
    return v.Get("Restore", &B::Restore, &B::UnpackRestoreErrorInfo, path.Get(), options.include, options.ignore);
}

int Version(Verb& v) {
    const auto path = v.Text("PATH");
    v.End();
    return v.Get("GetVersionInfoFromBackup", &B::GetVersionInfoFromBackup, &B::UnpackVersionInfoFromBackup,
                 path.Get());
}

int Compress(Verb& v) {
    const auto source = v.Text("SOURCE");
    const auto destination = v.Text("DESTINATION");
    v.End();
    return v.Get("Compress", &B::Compress, &B::UnpackCompress, source.Get(), destination.Get());
}

int Decompress(Verb& v) {
    const auto file = v.Text("FILE");
    const auto destination = v.Text("DESTINATION");
    v.End();
    return v.Set("Decompress", &B::Decompress, file.Get(), destination.Get());
}

constexpr const char* kRestoreDetails =
    "--include: RestoreInclude_CFG, RestoreInclude_Modules, RestoreInclude_All\n"
    "(default) or a number; --ignore: RestoreIgnoreMismatch_None (default),\n"
    "_SystemId, _TemplateId, _All or a number; --settings N: the controller\n"
    "settings to include (the ...3 operations of ITavBackupRestore2). Prints the\n"
    "controller's error information, empty when there is none.\n";

constexpr VerbEntry kBackup[] = {
    {"start", "PATH", "start a backup into a controller folder (Backup)", Start},
    {"state", "", "print whether a backup runs (GetBackupState)", BackupState},
    {"check", "PATH [--include I] [--ignore M] [--settings N]", "check that a backup can be restored (CheckRestore)",
     Check, kRestoreDetails},
    {"restore", "PATH [--include I] [--ignore M] [--settings N] [--delete]", "restore a backup (Restore)", Restore,
     kRestoreDetails},
    {"version", "PATH", "print the version a backup was made with (GetVersionInfoFromBackup)", Version},
    {"compress", "SOURCE DESTINATION", "compress a controller folder (Compress)", Compress},
    {"decompress", "FILE DESTINATION", "decompress a file on the controller (Decompress)", Decompress},
};

}  // namespace

std::span<const GroupEntry> BackupGroups() {
    static constexpr GroupEntry kGroups[] = {{"backup", "Backup and restore", kBackup}};
    return kGroups;
}

}  // namespace tavctl
