#pragma once
// What the fields of a scanned reply become: the out-values of a decoder.
//
// Reply::Fields<format>(failText, outs...) scans the reply into storage that
// the format itself determines (a string field of width N into N + 1
// characters, a number into 32 bits), requires every field, and only then
// hands each field to its out-value, in order: first every check (a word
// that must be known), so that a refused reply leaves every out-value as it
// was cleared, then every commit (strings allocated in order; when one
// allocation fails, the strings already handed out stay with the caller).
//
// An out-value is a plain pointer (BSTR* for a string field; a pointer to an
// integer or enumeration of at most 32 bits for a number, truncated as C
// truncates; double*; OLECHAR* for %c) or an adapter from this file. An
// adapter of one's own has
//     HRESULT Commit(Reply&, Value) and optionally HRESULT Check(Reply&, Value)
// with Value OleStringView for a string field, std::uint32_t for a number,
// double or OLECHAR; and, for a string field without a width ("%s"), the
// room it allows, terminator included, as static constexpr size_t kRoom (0:
// any length, for a word that is only compared): a longer field is refused,
// never cut.
#include <cstddef>
#include <cstdint>
#include <span>
#include <type_traits>

#include "core/text/scan_format.h"
#include "core/word_table.h"
#include "tav/platform.h"

namespace tav {

class Reply;

namespace fields {

// A string field without a width, allowed Room - 1 characters.
template <std::size_t Room>
struct Bounded {
    static constexpr std::size_t kRoom = Room;
    BSTR* out;
    HRESULT Commit(Reply& reply, OleStringView value) const;
};

// A word mapped by table; an unknown word refuses the reply with text. A
// word is only compared, never kept: a field without a width may hold any.
template <class E>
struct Mapped {
    static constexpr std::size_t kRoom = 0;
    E* out;
    std::span<const WordValue<E>> table;
    const OLECHAR* unknownText;
    HRESULT Check(Reply& reply, OleStringView value) const;
    HRESULT Commit(Reply&, OleStringView value) const {
        *out = *FindWord(value, table);
        return S_OK;
    }
};

// A word mapped by table; an unknown word gives fallback.
template <class E>
struct MappedOr {
    static constexpr std::size_t kRoom = 0;
    E* out;
    std::span<const WordValue<E>> table;
    E fallback;
    HRESULT Commit(Reply&, OleStringView value) const {
        *out = WordOr(value, table, fallback);
        return S_OK;
    }
};

// A field that is read and not kept.
struct Skip {
    template <class Value>
    HRESULT Commit(Reply&, const Value&) const {
        return S_OK;
    }
};

namespace detail {

template <class T>
inline constexpr bool kIsNumberOut = (std::is_integral_v<T> || std::is_enum_v<T>) && sizeof(T) <= 4;

// The adapter of a plain pointer, or the adapter itself.
template <class Out>
struct Adapter {
    using Type = Out;
    static Out Of(const Out& out) { return out; }
};

struct StringOut {
    BSTR* out;
    HRESULT Commit(Reply& reply, OleStringView value) const;
};

template <>
struct Adapter<BSTR*> {
    using Type = StringOut;
    static StringOut Of(BSTR* out) { return StringOut{out}; }
};

template <class T>
    requires kIsNumberOut<T>
struct Adapter<T*> {
    struct Type {
        T* out;
        HRESULT Commit(Reply&, std::uint32_t bits) const {
            *out = static_cast<T>(bits);
            return S_OK;
        }
    };
    static Type Of(T* out) { return Type{out}; }
};

template <>
struct Adapter<double*> {
    struct Type {
        double* out;
        HRESULT Commit(Reply&, double value) const {
            *out = value;
            return S_OK;
        }
    };
    static Type Of(double* out) { return Type{out}; }
};

template <>
struct Adapter<OLECHAR*> {
    struct Type {
        OLECHAR* out;
        HRESULT Commit(Reply&, OLECHAR value) const {
            *out = value;
            return S_OK;
        }
    };
    static Type Of(OLECHAR* out) { return Type{out}; }
};

template <class A>
concept HasRoom = requires { A::kRoom; };

template <class A, class Value>
concept HasCheck = requires(const A& adapter, Reply& reply, const Value& value) {
    { adapter.Check(reply, value) } -> std::same_as<HRESULT>;
};

// Where field I of the format is scanned to, for its adapter A.
template <text::FieldShape Shape, class A>
struct Storage;

template <text::FieldShape Shape, class A>
    requires(Shape.kind == text::FieldKind::Chars)
struct Storage<Shape, A> {
    static_assert(Shape.width > 0 || HasRoom<A>,
                  "a string field without a width needs an out-value that bounds it (fields::Bounded<N>)");
    // Read in place: a field without a width is bounded by its out-value's room.
    static constexpr std::size_t kRoom = [] {
        if constexpr (Shape.width > 0) {
            return std::size_t{0};
        } else {
            return A::kRoom;
        }
    }();
    OleStringView value;
    text::FieldView Target() { return text::FieldView{&value, kRoom}; }
    OleStringView Value() const { return value; }
};

template <text::FieldShape Shape, class A>
    requires(Shape.kind == text::FieldKind::Signed || Shape.kind == text::FieldKind::Unsigned ||
             Shape.kind == text::FieldKind::Count)
struct Storage<Shape, A> {
    std::uint32_t value;
    std::uint32_t* Target() { return &value; }
    std::uint32_t Value() const { return value; }
};

template <text::FieldShape Shape, class A>
    requires(Shape.kind == text::FieldKind::Double)
struct Storage<Shape, A> {
    double value;
    double* Target() { return &value; }
    double Value() const { return value; }
};

template <text::FieldShape Shape, class A>
    requires(Shape.kind == text::FieldKind::Char)
struct Storage<Shape, A> {
    OLECHAR value;
    OLECHAR* Target() { return &value; }
    OLECHAR Value() const { return value; }
};

// All fields' storage side by side, left uninitialised: the scan writes
// every field before anything reads it.
template <std::size_t I, class S>
struct Slot {
    S storage;
};

template <class Indices, class... S>
struct StorageSet;

template <std::size_t... I, class... S>
struct StorageSet<std::index_sequence<I...>, S...> : Slot<I, S>... {};

template <std::size_t I, class S>
S& Get(Slot<I, S>& slot) {
    return slot.storage;
}

// The number of fields a full scan counts (%n is not counted).
template <text::ScanFormat F>
constexpr int CountedFields() {
    int n = 0;
    for (const text::FieldShape& field : text::kScanFields<F>) {
        n += field.kind == text::FieldKind::Count ? 0 : 1;
    }
    return n;
}

}  // namespace detail
}  // namespace fields
}  // namespace tav
