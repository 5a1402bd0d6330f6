#pragma once
#include <cerrno>
#include <cstdlib>
#include <limits>
#include <optional>
#include <span>
#include <string>
#include <type_traits>
#include <vector>

#include "tav/bstr.h"
#include "tavctl/arguments.h"
#include "tavctl/commands.h"
#include "tavctl/names.h"
#include "tavctl/output.h"
#include "tavctl/session.h"
#include "tavctl/text.h"

namespace tavctl {

// The command line is wrong: the message names the problem; the verb's
// usage follows it.
struct UsageError {
    std::string message;
};

// How a value of each out-parameter type is printed.
inline Value Show(BSTR text) { return TextValue(text); }
inline Value Show(const tav::Bstr& text) { return TextValue(text.Get()); }
inline Value Show(short number) { return Value::Number(number); }
inline Value Show(LONG number) { return Value::Number(number); }
inline Value Show(ULONG number) { return Value::Unsigned(number); }
inline Value Show(int64_t number) { return Value::Number(number); }
inline Value Show(const FILETIME& time) { return TimeValue(time); }
template <typename E>
    requires std::is_enum_v<E>
Value Show(E value) {
    return Value::Text(NameOf(value));
}
// A LONG that the interface uses as a truth value.
inline Value AsBoolean(LONG flag) { return Value::Boolean(flag != 0); }
// A LONG that is an HRESULT (a job's own result).
inline Value AsHresult(LONG hr) { return HresultValue(hr); }

// Where an operation writes one out-value: a BSTR owned here, or the value.
template <typename T>
struct OutSlot {
    T value{};
    T* Out() { return &value; }
    const T& Held() const { return value; }
};
template <>
struct OutSlot<BSTR> {
    tav::Bstr value;
    BSTR* Out() { return value.Receive(); }
    BSTR Held() const { return value.Get(); }
};

namespace detail {
template <typename... P>
struct Last;
template <typename P>
struct Last<P> {
    using Type = P;
};
template <typename P, typename... Rest>
struct Last<P, Rest...> : Last<Rest...> {};
}  // namespace detail

// One run of a verb: its words, its usage, the session it runs in. Argument
// readers throw UsageError; Interface() throws CommandFailed.
class Verb {
public:
    Verb(Session& session, const GroupEntry& group, const VerbEntry& entry, std::vector<std::string> words)
        : session(session), group(group), entry(entry), args_(std::move(words)) {}

    Session& session;
    const GroupEntry& group;
    const VerbEntry& entry;

    // "group verb", for messages.
    std::string Name() const;

    // --- arguments -------------------------------------------------------
    // Options first (they may stand anywhere), then the words in order,
    // then End().
    std::optional<std::string> Option(const char* name);
    bool Flag(const char* name) { return args_.Flag(name); }
    std::string Word(const char* what);
    std::optional<std::string> OptionalWord() { return args_.Next(); }
    std::vector<std::string> Rest() { return args_.Rest(); }
    bool Done() const { return args_.Done(); }
    void End();

    // A whole number within T's range (decimal, or 0x-hexadecimal).
    template <typename T>
    T Number(const char* what) {
        return NumberFrom<T>(what, Word(what));
    }
    template <typename T>
    std::optional<T> NumberOption(const char* name) {
        const auto text = Option(name);
        return text ? std::optional<T>(NumberFrom<T>(name, *text)) : std::nullopt;
    }
    template <typename T>
    T NumberFrom(const char* what, const std::string& word) {
        using Wide = std::conditional_t<std::is_signed_v<T>, long long, unsigned long long>;
        const auto value = ParseWhole(word, std::is_signed_v<T>);
        const bool fits = value && (std::is_signed_v<T> ? *value >= static_cast<long double>(std::numeric_limits<T>::min())
                                                         : true) &&
                          *value <= static_cast<long double>(std::numeric_limits<T>::max());
        if (!fits) {
            throw UsageError{std::string(what) + " must be a whole number from " +
                             std::to_string(static_cast<Wide>(std::numeric_limits<T>::min())) + " to " +
                             std::to_string(static_cast<Wide>(std::numeric_limits<T>::max())) + ", not " + Quote(word)};
        }
        return static_cast<T>(*value);
    }

    // A value of enum E by its name (any case) or one of `aliases`; a
    // number is passed on as it is, for the module to judge.
    template <typename E>
    E Enum(const char* what, std::span<const EnumName> aliases = {}) {
        return EnumFrom<E>(what, Word(what), aliases);
    }
    template <typename E>
    E EnumFrom(const char* what, const std::string& word, std::span<const EnumName> aliases = {}) {
        return static_cast<E>(EnumValue(what, word, NamesOf<E>(), aliases));
    }
    long EnumValue(const char* what, const std::string& word, std::span<const EnumName> names,
                   std::span<const EnumName> aliases);

    // A text argument as the module takes it.
    tav::Bstr Text(const char* what) { return ToBstr(Word(what)); }
    static tav::Bstr ToBstr(const std::string& utf8) { return tav::Bstr(tav::OleStringView(ToOle(utf8))); }

    // --- calls -----------------------------------------------------------
    template <typename I>
    tav::ComPtr<I> Interface() {
        return session.Interface<I>();
    }

    // Get, then (with --async) its Unpack, then print the one out-value.
    // (The Unpack may be the base interface's.)
    template <typename I, typename J, typename T, typename... P, typename... A>
    int Get(const char* operation, HRESULT (STDMETHODCALLTYPE I::*get)(TavInParams*, P...),
            HRESULT (STDMETHODCALLTYPE J::*unpack)(VARIANT*, T*), A&&... given) {
        return GetShown([](const auto& v) { return Show(v); }, operation, get, unpack, std::forward<A>(given)...);
    }
    template <typename S, typename I, typename J, typename T, typename... P, typename... A>
    int GetShown(S show, const char* operation, HRESULT (STDMETHODCALLTYPE I::*get)(TavInParams*, P...),
                 HRESULT (STDMETHODCALLTYPE J::*unpack)(VARIANT*, T*), A&&... given) {
        const auto object = Interface<I>();
        OutSlot<T> slot;
        return session.Read(
            operation, [&](TavInParams* rip) { return (object.Get()->*get)(rip, given..., slot.Out()); },
            [&](VARIANT* data) { return (object.Get()->*unpack)(data, slot.Out()); },
            [&] { session.Show(show(slot.Held())); });
    }
    // A Get without an Unpack of its own: with --async the raw reply shows.
    template <typename I, typename... P, typename... A>
    int GetOnly(const char* operation, HRESULT (STDMETHODCALLTYPE I::*get)(TavInParams*, P...), A&&... given) {
        return GetOnlyShown([](const auto& v) { return Show(v); }, operation, get, std::forward<A>(given)...);
    }
    template <typename S, typename I, typename... P, typename... A>
    int GetOnlyShown(S show, const char* operation, HRESULT (STDMETHODCALLTYPE I::*get)(TavInParams*, P...),
                     A&&... given) {
        using T = std::remove_pointer_t<typename detail::Last<P...>::Type>;
        const auto object = Interface<I>();
        OutSlot<T> slot;
        return session.Read(
            operation, [&](TavInParams* rip) { return (object.Get()->*get)(rip, given..., slot.Out()); }, nullptr,
            [&] { session.Show(show(slot.Held())); });
    }
    // An operation that only acts.
    template <typename I, typename... P, typename... A>
    int Set(const char* operation, HRESULT (STDMETHODCALLTYPE I::*set)(TavInParams*, P...), A&&... given) {
        const auto object = Interface<I>();
        return session.Write(operation, [&](TavInParams* rip) { return (object.Get()->*set)(rip, given...); });
    }

private:
    static std::optional<long double> ParseWhole(const std::string& word, bool allowMinus);

    CommandArguments args_;
};

// Bare BSTR arguments for the templates: `Arg(b)` is what the call takes.
inline BSTR Arg(const tav::Bstr& text) { return text.Get(); }

}  // namespace tavctl
