#pragma once
// Text-to-enum tables: exact, case-sensitive whole words in a fixed order,
// first match wins; several words may map to one value.
#include <initializer_list>
#include <optional>
#include <span>
#include <type_traits>

#include "core/text/ole_string.h"

namespace tav {

template <class E>
struct WordValue {
    const OLECHAR* word;
    E value;
};

// text equals the NUL-terminated word, compared in one pass (a table's words
// are never measured first).
inline bool IsWord(OleStringView text, const OLECHAR* word) {
    size_t i = 0;
    for (; word[i] != 0; ++i) {
        if (i == text.size() || text[i] != word[i]) {
            return false;
        }
    }
    return i == text.size();
}

// The value of word in table, or nothing for a word the table does not hold.
template <class E>
std::optional<E> FindWord(OleStringView word, std::span<const WordValue<E>> table) {
    for (const auto& entry : table) {
        if (IsWord(word, entry.word)) {
            return entry.value;
        }
    }
    return std::nullopt;
}

template <class E>
std::optional<E> FindWord(OleStringView word, std::initializer_list<WordValue<E>> table) {
    return FindWord(word, std::span<const WordValue<E>>(table.begin(), table.size()));
}

template <class E, std::size_t N>
std::optional<E> FindWord(OleStringView word, const WordValue<E> (&table)[N]) {
    return FindWord(word, std::span<const WordValue<E>>(table));
}

// The value of word in table, or fallback for a word the table does not
// hold (the decoders that succeed on an unknown word).
template <class E>
E WordOr(OleStringView word, std::type_identity_t<std::span<const WordValue<E>>> table, E fallback) {
    return FindWord(word, table).value_or(fallback);
}

template <class E>
E WordOr(OleStringView word, std::initializer_list<WordValue<E>> table, E fallback) {
    return FindWord(word, table).value_or(fallback);
}

// The word of value in table (the first entry holding it), or null: the
// direction of the setters.
template <class E>
const OLECHAR* WordOf(E value, std::type_identity_t<std::span<const WordValue<E>>> table) {
    for (const auto& entry : table) {
        if (entry.value == value) {
            return entry.word;
        }
    }
    return nullptr;
}

}  // namespace tav
