// The out-values of a grammar in the wrong order: a string field given a
// number's out-value.
#include "core/controller_object.h"

namespace tav {

HRESULT Sample(Reply& reply, BSTR* name, LONG* count) {
    return reply.Fields<OLESTR("-name %20s -count %d")>(OLESTR("failed"), count, name);
}

}  // namespace tav
