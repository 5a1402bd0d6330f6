// Jobs on the controller's files: copying a file or a directory, saving
// the diagnostics information, dumping the pendant's screen, and the result
// codes of the last two.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

// The longest path the controller takes.
constexpr std::size_t kLongestPath = 260;

constexpr const OLECHAR* kBackslash = OLESTR("Invalid controller path. Backslash not allowed.");

// Copying a file and a directory differ only in their command.
HRESULT Copy(ControllerObject& object, TavInParams* rip, BSTR source, BSTR destination, const OLECHAR* command) {
    OleStringView from;
    OleStringView to;
    return object.Command(rip)
        .ValidParams(OLESTR(""))
        .Initialised(OLESTR("Helper used before initialized."))
        .ControllerOrLocalPath(source, kBackslash, &from)
        .ControllerOrLocalPath(destination, kBackslash, &to)
        .Require([&] { return !from.empty() && !to.empty(); }, E_INVALIDARG, OLESTR("Empty path"))
        .Require([&] { return from.size() <= kLongestPath && to.size() <= kLongestPath; }, E_INVALIDARG,
                 OLESTR("Paths too long"))
        .Send(Verb::Set, ViewOf(command),
              [&] { return text::Format(OLESTR("-SourcePath \"%s\" -DestPath \"%s\""), from, to); })
        .StatusOnly();
}

// The job's result code is the reply's number, bit for bit; it failing is
// no failure of the call.
struct StatusTexts {
    const OLECHAR* nullData;
    const OLECHAR* notText;
    const OLECHAR* noNumber;
};

HRESULT UnpackJobStatus(ControllerObject& object, VARIANT* data, HRESULT* result, const StatusTexts& texts) {
    return object.Decode(data)
        .Initialised()
        .NotNull(texts.nullData)
        .OutPointer(result, OLESTR(""))
        .IsBstr(texts.notText)
        .Fields<OLESTR("-pstatus %u")>(texts.noNumber, result);
}

constexpr StatusTexts kDiagnosticsTexts{OLESTR("UnpackDiagnosticsInfoStatus. NULL VARIANT"),
                                        OLESTR("UnpackDiagnosticsInfoStatus. Non-BSTR argument."),
                                        OLESTR("UnpackDiagnosticsInfoStatus. Invalid argument.")};
constexpr StatusTexts kScreenDumpTexts{OLESTR("UnpackDorvelScreenDump. NULL VARIANT"),
                                       OLESTR("UnpackDorvelScreenDump. Non-BSTR argument."),
                                       OLESTR("UnpackDorvelScreenDump. Invalid argument.")};

}  // namespace

HRESULT ControllerObject::CopyFile(TavInParams* rip, BSTR source, BSTR destination) {
    return Copy(*this, rip, source, destination, OLESTR("CopyFile"));
}

HRESULT ControllerObject::CopyDirectory(TavInParams* rip, BSTR source, BSTR destination) {
    return Copy(*this, rip, source, destination, OLESTR("CopyDir"));
}

// Diagnostics are written only to the controller.
HRESULT ControllerObject::SaveDiagnosticsInfo(TavInParams* rip, BSTR path) {
    OleStringView sent;
    return Command(rip)
        .ValidParams(OLESTR(""))
        .Initialised(OLESTR("Helper used before initialized."))
        .Require(path != nullptr, E_INVALIDARG, OLESTR(""))
        .Require([&] { return HasControllerPrefix(ViewOf(path)); }, E_INVALIDARG,
                 OLESTR("SaveDiagnosticsInfo. Only controller path allowed"))
        .ControllerOrLocalPath(path, kBackslash, &sent)
        .Require([&] { return !sent.empty(); }, E_INVALIDARG, OLESTR("Empty path"))
        .Require([&] { return sent.size() <= kLongestPath; }, E_INVALIDARG, OLESTR("Path too long"))
        .Send(Verb::Set, OLESTR("SystemDiagnostics"), [&] { return text::Format(OLESTR("-Path \"%s\""), sent); })
        .StatusOnly();
}

HRESULT ControllerObject::GetDiagnosticsInfoStatus(TavInParams* rip, HRESULT* result) {
    return Command(rip)
        .ValidParams(OLESTR("GetDiagnosticsInfoStatus: Invalid TavInParams"))
        .OutPointer(result, OLESTR("GetDiagnosticsInfoStatus: Invalid out-pointer"))
        .Initialised(OLESTR("GetDiagnosticsInfoStatus. Helper used before initialized."))
        .Get(OLESTR("SystemDiagnostics"))
        .Decode([&](VARIANT* reply) { return UnpackDiagnosticsInfoStatus(reply, result); });
}

HRESULT ControllerObject::UnpackDiagnosticsInfoStatus(VARIANT* data, HRESULT* result) {
    return UnpackJobStatus(*this, data, result, kDiagnosticsTexts);
}

HRESULT ControllerObject::ReqDorvelScreenDump(TavInParams* rip) {
    return Command(rip)
        .ValidParams(OLESTR("ReqDorvelScreenDump: Invalid TavInParams"))
        .Initialised(OLESTR("Helper used before initialized."))
        .Set(OLESTR("Dorvel"))
        .StatusOnly();
}

HRESULT ControllerObject::GetDorvelScreenDumpStatus(TavInParams* rip, HRESULT* result) {
    return Command(rip)
        .ValidParams(OLESTR("GetDorvelScreenDumpStatus: Invalid TavInParams"))
        .OutPointer(result, OLESTR("GetDorvelScreenDumpStatus: Invalid out-pointer"))
        .Initialised(OLESTR("GetDorvelScreenDumpStatus. Helper used before initialized."))
        .Get(OLESTR("Dorvel"))
        .Decode([&](VARIANT* reply) { return UnpackDorvelScreenDump(reply, result); });
}

HRESULT ControllerObject::UnpackDorvelScreenDump(VARIANT* data, HRESULT* result) {
    return UnpackJobStatus(*this, data, result, kScreenDumpTexts);
}

}  // namespace tav
