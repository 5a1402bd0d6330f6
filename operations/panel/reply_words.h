// What the panel decoders share: the reply as the controller's C text.
#pragma once
#include "core/reply.h"
#include "core/text/ole_string.h"

namespace tav::panel {

// The controller answers with C texts: a NUL ends the reply, as it ends every
// scan of it, so that comparisons, searches and scans all see the same text.
inline OleStringView ReplyText(const Reply& reply) {
    const OleStringView text = reply.Text();
    return text.substr(0, text.find(OLECHAR(0)));
}

using tav::FindWord;

}  // namespace tav::panel
