// What the panel decoders share: the reply as the controller's C text, and
// word tables that the caller walks in pieces.
#pragma once
#include <initializer_list>
#include <optional>

#include "core/reply.h"
#include "core/text/ole_string.h"

namespace tav::panel {

// The controller answers with C texts: a NUL ends the reply, as it ends every
// scan of it, so that comparisons, searches and scans all see the same text.
inline OleStringView ReplyText(const Reply& reply) {
    const OleStringView text = reply.Text();
    return text.substr(0, text.find(OLECHAR(0)));
}

// The value of word in table (exact, case-sensitive, first match wins).
template <class E>
std::optional<E> FindWord(OleStringView word, std::initializer_list<WordValue<E>> table) {
    for (const auto& entry : table) {
        if (IsWord(word, entry.word)) {
            return entry.value;
        }
    }
    return std::nullopt;
}

}  // namespace tav::panel
