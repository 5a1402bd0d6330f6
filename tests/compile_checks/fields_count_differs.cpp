// One out-value short.
#include "core/controller_object.h"

namespace tav {

HRESULT Sample(Reply& reply, BSTR* name) {
    return reply.Fields<OLESTR("-name %20s -count %d")>(OLESTR("failed"), name);
}

}  // namespace tav
