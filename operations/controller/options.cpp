// Whether an option is installed on the controller.
#include "core/controller_object.h"
#include "core/text/format.h"
#include "core/text/scan.h"

namespace tav {

HRESULT ControllerObject::IsOptionPresent(TavInParams* rip, BSTR option, LONG* present) {
    return Command(rip)
        .ValidParams(OLESTR("IsOptionPresent: Invalid TavInParams"))
        .OutPointer(present, OLESTR("IsOptionPresent. Invalid out-pointer"))
        .Initialised(OLESTR("IsOptionPresent. TavController used before Initialized"))
        .Get(OLESTR("IsOptionPresent"), text::Format(OLESTR("-Option \"%s\""), ViewOf(option)))
        .Decode([&](VARIANT* reply) { return UnpackIsOptionPresent(reply, present); });
}

HRESULT ControllerObject::UnpackIsOptionPresent(VARIANT* data, LONG* present) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackIsOptionPresent. NULL data-variant"))
        .OutPointer(present, OLESTR(""))
        .IsBstr(OLESTR("UnpackIsOptionPresent. Non-BSTR variant."))
        .Then([&](Reply& reply) {
            if (text::Scan<OLESTR("-OptionPresent %d")>(reply.Text(), present) != 1) {
                return reply.FailWith(E_FAIL, OLESTR("UnpackIsOptionPresent. Bad result string: %s"), reply.Text());
            }
            return S_OK;
        });
}

}  // namespace tav
