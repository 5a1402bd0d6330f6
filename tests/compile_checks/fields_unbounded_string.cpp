// A string field without a width needs an out-value that bounds it.
#include "core/controller_object.h"

namespace tav {

HRESULT Sample(Reply& reply, BSTR* name) { return reply.Fields<OLESTR("-name %s")>(OLESTR("failed"), name); }

}  // namespace tav
