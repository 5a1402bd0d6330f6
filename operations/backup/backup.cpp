// Backups of the controller's system into a directory on the controller,
// their progress and the version information they keep.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

constexpr ControllerPathTexts kBackupPathTexts{
    OLESTR("Backup - Only controller path allowed."),
    OLESTR("Backup - Invalid controller path. Backslash not allowed."),
    OLESTR("Backup. Controller path empty")};

// Reading a backup's version takes the backup's text for a path that is not
// the controller's, and its own for the others.
constexpr ControllerPathTexts kVersionPathTexts{
    OLESTR("Backup - Only controller path allowed."),
    OLESTR("GetVersionInfoFromBackup - Invalid controller path. Backslash not allowed."),
    OLESTR("GetVersionInfoFromBackup. Controller path empty")};

constexpr WordValue<TavBackupEvent> kEventWords[] = {{OLESTR("Finished"), BackupEvent_Finished},
                                                     {OLESTR("Error"), BackupEvent_Error}};

constexpr WordValue<TavBackupState> kBackupStateWords[] = {{OLESTR("None"), BackupState_None},
                                                           {OLESTR("InProgress"), BackupState_InProgress}};

}  // namespace

HRESULT ControllerObject::Backup(TavInParams* rip, BSTR path) {
    OleStringView sent;
    return Command(rip)
        .ValidParams(OLESTR("Backup. Invalid TavInParams."))
        .Initialised(OLESTR("Backup. Helper used before initialized."))
        .ControllerPathOnly(path, kBackupPathTexts, &sent)
        .Set(OLESTR("Backup"), text::Format(OLESTR("-Path \"%s\""), sent))
        .StatusOnly();
}

HRESULT ControllerObject::GetBackupState(TavInParams* rip, TavBackupState* state) {
    return Command(rip)
        .ValidParams(OLESTR("GetBackupState - Invalid argument."))
        .OutPointer(state, OLESTR("GetBackupState - Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("BackupState"))
        .Decode([&](VARIANT* reply) { return UnpackBackupState(reply, state); });
}

HRESULT ControllerObject::UnpackBackupState(VARIANT* data, TavBackupState* state) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackBackupState. NULL variant"))
        .OutPointer(state, OLESTR("pStatus == NULL"))
        .IsBstr(OLESTR("UnpackBackupState. Non-BSTR variant."))
        .Then([&](Reply& reply) {
            OLECHAR word[12];
            if (text::Scan<OLESTR("-BackupState %11s")>(reply.Text(), word) != 1) {
                return reply.Fail(E_FAIL, OLESTR("Failed to fetch state"));
            }
            const std::optional<TavBackupState> value = FindWord(OleStringView(word), kBackupStateWords);
            if (!value) {
                return reply.Fail(E_FAIL, OLESTR("Unsupported state"));
            }
            *state = *value;
            return S_OK;
        });
}

// The sequence number may be missing; it is then 0.
HRESULT ControllerObject::UnpackBackupEvent(VARIANT* data, TavBackupEvent* event, ULONG* sequence) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackBackupEvent. NULL variant"))
        .OutPointers(OLESTR(""), event, sequence)
        .IsBstr(OLESTR("UnpackBackupEvent. Non-BSTR variant."))
        .Then([&](Reply& reply) {
            OLECHAR word[12];
            ULONG number = 0;
            if (text::Scan<OLESTR("-BackupEvent %11s -SeqNo %lu")>(reply.Text(), word, &number) < 1) {
                return reply.Fail(E_FAIL, OLESTR("UnpackBackupEvent. Failed to extract data"));
            }
            const std::optional<TavBackupEvent> value = FindWord(OleStringView(word), kEventWords);
            if (!value) {
                return reply.Fail(E_FAIL, OLESTR("UnpackBackupEvent. Unsupported event"));
            }
            *event = *value;
            *sequence = number;
            return S_OK;
        });
}

HRESULT ControllerObject::GetVersionInfoFromBackup(TavInParams* rip, BSTR path, BSTR* info) {
    OleStringView sent;
    return Command(rip)
        .ValidParams(OLESTR("TavController::GetVersionInfoFromBackup: Invalid TavInParams."))
        .OutPointer(info, OLESTR("TavController::GetVersionInfoFromBackup: Invalid out-pointer"))
        .Initialised(OLESTR("TavController::GetVersionInfoFromBackup. TavController used before Initialized"))
        .Require(path != nullptr, E_INVALIDARG, OLESTR("GetVersionInfoFromBackup: Invalid argument"))
        .ControllerPathOnly(path, kVersionPathTexts, &sent)
        .Get(OLESTR("VersionInfoFromBackup"), text::Format(OLESTR("-BackupPath \"%s\""), sent))
        .Decode([&](VARIANT* reply) {
            if (reply->vt != VT_BSTR) {
                return errors_.Set(E_FAIL, ErrorSite::Here(),
                                   OLESTR("TavController::GetVersionInfoFromBackup - Controller returned invalid result"));
            }
            return UnpackVersionInfoFromBackup(reply, info);
        });
}

HRESULT ControllerObject::UnpackVersionInfoFromBackup(VARIANT* data, BSTR* info) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackVersionInfoFromBackup. NULL VARIANT"))
        .OutPointers(OLESTR(""), info)
        .IsBstr(OLESTR("UnpackVersionInfoFromBackup. Non-BSTR VARIANT"))
        .WholeText(info);
}

// Compression is not offered here; only its reply can be read.
HRESULT ControllerObject::Compress(TavInParams*, BSTR, BSTR, BSTR*) { return E_NOTIMPL; }

HRESULT ControllerObject::Decompress(TavInParams*, BSTR, BSTR) { return E_NOTIMPL; }

HRESULT ControllerObject::UnpackCompress(VARIANT* data, BSTR* file) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackCompress. NULL data-variant"))
        .OutPointers(OLESTR("UnpackCompress. Invalid pointer"), file)
        .IsBstr(OLESTR("UnpackCompress. Data-variant not of type VT_BSTR or BSTR NULL"))
        .Then([&](Reply& reply) {
            if (data->bstrVal == nullptr) {
                return reply.Fail(E_FAIL, OLESTR("UnpackCompress. Data-variant not of type VT_BSTR or BSTR NULL"));
            }
            return reply.AfterPrefix(OLESTR("-File "), file, OLESTR("UnpackCompress failed."));
        });
}

}  // namespace tav
