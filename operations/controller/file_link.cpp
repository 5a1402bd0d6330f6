// Whether files can travel between the pendant and the controller.
#include "core/controller_object.h"

namespace tav {

HRESULT ControllerObject::CheckFileTransferLink(TavInParams* rip) {
    // Asked of the command component each time rather than of the file
    // interface kept since Init, so that the check sees the component as it is now.
    ComPtr<ITavFile> file;
    Call call = Command(rip);
    call.ValidParams(OLESTR("CheckFileTransferLink: Invalid TavInParams"))
        .Initialised(OLESTR("CheckFileTransferLink. TavController used before Initialized"))
        .Require(
            [&] {
                return SUCCEEDED(CommandComponent()->QueryInterface(IID_ITavFile, reinterpret_cast<void**>(&file))) &&
                       file;
            },
            E_FAIL, OLESTR("CheckFileTransferLink. Could not QI ITavFile"));
    if (call.failed()) {
        return call.Result();
    }
    SentCommand sent(*this, rip, S_OK);
    const HRESULT hr = file->CheckLink(rip, &sent.Reply().Record());
    if (FAILED(hr)) {
        Errors().AdoptFromComponent(hr, file.Get(), ErrorSite::Here());
        return NotifyCallback(*this, rip, hr);
    }
    return sent.StatusOnly();
}

}  // namespace tav
