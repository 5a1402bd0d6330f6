// Compiles: every other file here differs from this in one mistake.
#include "core/controller_object.h"

namespace tav {

HRESULT Sample(Reply& reply, BSTR* name, LONG* count) {
    OLECHAR word[11];
    LONG number = 0;
    (void)text::Scan<OLESTR("-w %10s -n %d")>(reply.Text(), word, &number);
    return reply.Fields<OLESTR("-name %20s -count %d")>(OLESTR("failed"), name, count);
}

}  // namespace tav
