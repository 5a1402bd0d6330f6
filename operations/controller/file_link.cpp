// Whether files can travel between the pendant and the controller.
#include "core/controller_object.h"

namespace tav {

HRESULT ControllerObject::CheckFileTransferLink(TavInParams* rip) {
    return Command(rip)
        .ValidParams(OLESTR("CheckFileTransferLink: Invalid TavInParams"))
        .Initialised(OLESTR("CheckFileTransferLink. TavController used before Initialized"))
        .ThroughFile([&](ITavFile& file, TavCommandReply& reply) { return file.CheckLink(rip, &reply); },
                     OLESTR("CheckFileTransferLink. Could not QI ITavFile"))
        .StatusOnly();
}

}  // namespace tav
