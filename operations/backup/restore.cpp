// Restoring a backup, or checking first what a restore would find.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

constexpr ControllerPathTexts kRestorePathTexts{
    OLESTR("Restore - Only controller path allowed."),
    OLESTR("Restore - Invalid controller path. Backslash not allowed."),
    OLESTR("Restore. Controller path empty")};

struct RestoreRequest {
    bool check = false;  // CheckRestore: only tell what a restore would find
    ULONG deleteDirectory = 0;
    bool withControllerSettings = false;
    ULONG controllerSettings = 0;
};

// The one routine behind the five restore entries. Numbers go out as signed
// decimals, whatever the caller gives; the delete-directory field always.
HRESULT RestoreBackup(ControllerObject& object, TavInParams* rip, BSTR path, ULONG include, ULONG ignore,
                      BSTR* errorInfo, const RestoreRequest& request) {
    OleStringView sent;
    return object.Command(rip)
        .ValidParams(OLESTR("Restore. Invalid argument."))
        .OutPointer(errorInfo, OLESTR("pErrInfo == NULL"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .ControllerPathOnly(path, kRestorePathTexts, &sent)
        .Send(Verb::Set, request.check ? OLESTR("CheckRestore") : OLESTR("Restore"),
              [&] {
                  OleString args = text::Format(OLESTR("-Path \"%s\" -Include %d -Ignore %d -DeleteDir %d"), sent,
                                                include, ignore, request.deleteDirectory);
                  if (request.withControllerSettings) {
                      text::FormatAppend(args, OLESTR(" -IncludeCtrlSettings %d"), request.controllerSettings);
                  }
                  return args;
              })
        // A failed restore's reply may carry the controller's findings.
        .DecodeEvenOnFailure([&](VARIANT* reply) { return object.UnpackRestoreErrorInfo(reply, errorInfo); });
}

}  // namespace

HRESULT ControllerObject::CheckRestore(TavInParams* rip, BSTR path, ULONG include, ULONG ignore, BSTR* errorInfo) {
    return RestoreBackup(*this, rip, path, include, ignore, errorInfo, {.check = true});
}

HRESULT ControllerObject::Restore(TavInParams* rip, BSTR path, ULONG include, ULONG ignore, BSTR* errorInfo) {
    return RestoreBackup(*this, rip, path, include, ignore, errorInfo, {});
}

HRESULT ControllerObject::Restore2(TavInParams* rip, BSTR path, ULONG include, ULONG ignore, ULONG deleteDirectory,
                                   BSTR* errorInfo) {
    return RestoreBackup(*this, rip, path, include, ignore, errorInfo, {.deleteDirectory = deleteDirectory});
}

HRESULT ControllerObject::Restore3(TavInParams* rip, BSTR path, ULONG include, ULONG controllerSettings, ULONG ignore,
                                   ULONG deleteDirectory, BSTR* errorInfo) {
    return RestoreBackup(*this, rip, path, include, ignore, errorInfo,
                         {.deleteDirectory = deleteDirectory,
                          .withControllerSettings = true,
                          .controllerSettings = controllerSettings});
}

HRESULT ControllerObject::CheckRestore3(TavInParams* rip, BSTR path, ULONG include, ULONG controllerSettings,
                                        ULONG ignore, BSTR* errorInfo) {
    return RestoreBackup(*this, rip, path, include, ignore, errorInfo,
                         {.check = true, .withControllerSettings = true, .controllerSettings = controllerSettings});
}

// A reply without findings (not a text, or without the key) is a restore
// that found nothing: success with no text. Quotes inside the findings are
// not escaped: they end at the first quote.
HRESULT ControllerObject::UnpackRestoreErrorInfo(VARIANT* data, BSTR* errorInfo) {
    if (errorInfo == nullptr) {
        return errors_.Set(E_POINTER, ErrorSite::Here(), OLESTR("pErrInfo == NULL"));
    }
    *errorInfo = nullptr;
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackRestoreErrorInfo. NULL variant"))
        .Then([&](Reply& reply) {
            if (data->vt != VT_BSTR) {
                return S_OK;
            }
            constexpr OleStringView kKey = OLESTR("-RestoreErrInfo ");
            const OleStringView text = reply.CText();
            const std::size_t key = text.find(kKey);
            if (key == OleStringView::npos) {
                return S_OK;
            }
            const std::size_t first = text.find(OLECHAR(u'"'), key + kKey.size());
            if (first == OleStringView::npos) {
                return reply.Fail(E_FAIL, OLESTR("UnpackRestoreErrorInfo. first == NULL"));
            }
            const std::size_t last = text.find(OLECHAR(u'"'), first + 1);
            if (last == OleStringView::npos) {
                return reply.Fail(E_FAIL, OLESTR("UnpackRestoreErrorInfo. last == NULL"));
            }
            const OleStringView findings = text.substr(first + 1, last - first - 1);
            *errorInfo = SysAllocStringLen(findings.data(), static_cast<UINT>(findings.size()));
            if (*errorInfo == nullptr && !findings.empty()) {
                return reply.Fail(E_OUTOFMEMORY, OLESTR("UnpackRestoreErrorInfo. Allocation failed"));
            }
            return S_OK;
        });
}

}  // namespace tav
