#pragma once
#include <initializer_list>
#include <optional>
#include <source_location>
#include <type_traits>
#include <utility>

#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

class ControllerObject;

// One entry of a text-to-enum table: an exact, case-sensitive whole word.
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

// The checks that every Unpack operation runs, in their order (initialised,
// VARIANT, out-pointers, clearing the out-values, VARIANT type), then the
// decoding of the reply text. After the first failure every later step is
// skipped and the result is that failure.
class Reply {
public:
    using Where = std::source_location;

    Reply(ControllerObject& object, VARIANT* data);

    Reply& Initialised(const OLECHAR* text = OLESTR("TavController used before Initialized"),
                       Where where = Where::current());
    Reply& NotNull(const OLECHAR* text, Where where = Where::current());
    template <class T>
    Reply& OutPointer(T* out, const OLECHAR* text, Where where = Where::current()) {
        if (!failed() && out == nullptr) {
            Fail(E_POINTER, text, where);
        }
        return *this;
    }
    // Clears the out-values (NULL, 0) once the pointers are known good.
    template <class... T>
    Reply& Clear(T*... outs) {
        if (!failed()) {
            (ClearOne(outs), ...);
        }
        return *this;
    }
    Reply& IsBstr(const OLECHAR* text, Where where = Where::current());

    // Decoding shapes shared by many operations. Each is the last step.

    // A quoted string field scanned with format (one %N[^"] conversion into a
    // buffer of N+1), or the empty string when the reply begins with emptyForm.
    HRESULT QuotedString(OleStringView format, OleStringView emptyForm, BSTR* out, OleStringView failText,
                         Where where = Where::current());
    // The reply text handed on whole as a new BSTR.
    HRESULT WholeText(BSTR* out, OleStringView allocFailText = OLESTR("SysAllocString failed"),
                      Where where = Where::current());
    // The text after a fixed prefix (compared over its own length), as it stands.
    HRESULT AfterPrefix(OleStringView prefix, BSTR* out, OleStringView failText, Where where = Where::current());
    // One whole word mapped by table (first match wins); unknown words fail
    // with unknownFormat, its %s filled with the word.
    template <class E>
    HRESULT Word(OleStringView word, std::initializer_list<WordValue<E>> table, E* out,
                 OleStringView unknownFormat, Where where = Where::current()) {
        if (failed()) {
            return hr_;
        }
        if (const std::optional<E> value = FindWord(word, table)) {
            *out = *value;
            return S_OK;
        }
        return FailWith(E_FAIL, unknownFormat, word, where);
    }

    // Custom decoding: decode(*this) returns the result; it reads Text() and
    // reports with Fail, FailWith and Allocate.
    template <class F>
    HRESULT Then(F&& decode) {
        if (failed()) {
            return hr_;
        }
        return std::forward<F>(decode)(*this);
    }

    bool failed() const { return FAILED(hr_); }
    HRESULT Result() const { return hr_; }
    // The reply text (a VT_BSTR reply; empty for a NULL BSTR).
    OleStringView Text() const;
    // Records a failure with its text and line.
    HRESULT Fail(HRESULT hr, OleStringView text, Where where = Where::current());
    // Records a failure whose text is format with its %s filled by value.
    HRESULT FailWith(HRESULT hr, OleStringView format, OleStringView value, Where where = Where::current());
    // A new BSTR for text, or E_OUTOFMEMORY with "SysAllocString failed".
    HRESULT Allocate(OleStringView text, BSTR* out, Where where = Where::current());

private:
    template <class T>
    static void ClearOne(T* out) {
        if constexpr (std::is_pointer_v<T>) {
            *out = nullptr;
        } else {
            *out = T{};
        }
    }

    ControllerObject& object_;
    VARIANT* data_;
    HRESULT hr_ = S_OK;
};

}  // namespace tav
