#pragma once
#include <array>
#include <initializer_list>
#include <optional>
#include <source_location>
#include <span>
#include <type_traits>
#include <utility>

#include "core/error_site.h"
#include "core/reply_fields.h"
#include "core/text/char_class.h"
#include "core/text/format.h"
#include "core/text/ole_string.h"
#include "core/text/scan.h"
#include "core/word_table.h"
#include "tav/platform.h"

namespace tav {

class ControllerObject;

// The checks that every Unpack operation runs, in their order (initialised,
// VARIANT, out-pointers, clearing the out-values, VARIANT type), then the
// decoding of the reply text. After the first failure every later step is
// skipped and the result is that failure.
class Reply {
public:
    using Where = std::source_location;

    Reply(ControllerObject& object, VARIANT* data);

    [[nodiscard]] Reply& Initialised(const OLECHAR* text = OLESTR("TavController used before Initialized"),
                                     Where where = Where::current());
    [[nodiscard]] Reply& NotNull(const OLECHAR* text, Where where = Where::current());
    template <class T>
    [[nodiscard]] Reply& OutPointer(T* out, const OLECHAR* text, Where where = Where::current()) {
        if (!failed() && out == nullptr) {
            Fail(E_POINTER, ViewOf(text), where);
        }
        return *this;
    }
    // Every out-pointer at once: the first NULL one fails with text; when all
    // are good, every out-value is cleared (NULL, 0, zero-filled record).
    template <class... T>
    [[nodiscard]] Reply& OutPointers(SitedText text, T*... outs) {
        if (!failed()) {
            if ((false || ... || (outs == nullptr))) {
                Fail(E_POINTER, ViewOf(text.text), text.site);
            } else {
                (ClearOne(outs), ...);
            }
        }
        return *this;
    }
    // Clears the out-values (NULL, 0) once the pointers are known good.
    template <class... T>
    [[nodiscard]] Reply& Clear(T*... outs) {
        if (!failed()) {
            (ClearOne(outs), ...);
        }
        return *this;
    }
    [[nodiscard]] Reply& IsBstr(const OLECHAR* text, Where where = Where::current());
    // A step of the decoder's own that cannot fail (clearing a field of an
    // in/out record), run only while nothing has failed.
    template <class F>
    [[nodiscard]] Reply& Do(F&& step) {
        if (!failed()) {
            std::forward<F>(step)();
        }
        return *this;
    }

    // Decoding shapes shared by many operations. Each is the last step.

    // A quoted string field scanned with the format F (one %N[^"]
    // conversion), or the empty string when the reply begins with emptyForm.
    template <text::ScanFormat F>
    [[nodiscard]] HRESULT QuotedString(OleStringView emptyForm, BSTR* out, const OLECHAR* failText,
                                       Where where = Where::current()) {
        if (failed()) {
            return hr_;
        }
        static_assert(text::kScanFields<F>.size() == 1 && text::kScanFields<F>[0].kind == text::FieldKind::Chars &&
                          text::kScanFields<F>[0].width > 0,
                      "a quoted string is one string field of a fixed width");
        OleStringView field;
        const OleStringView reply = Text();
        if (text::Scan<F>(reply, text::FieldView{&field}) == 1) {
            return Allocate(field, out);
        }
        if (reply.substr(0, emptyForm.size()) != emptyForm) {
            return Fail(E_FAIL, ViewOf(failText), where);
        }
        return Allocate(OleStringView(), out);
    }
    // The reply text handed on whole as a new BSTR (a NULL BSTR stays NULL).
    [[nodiscard]] HRESULT WholeText(BSTR* out, const OLECHAR* allocFailText = OLESTR("SysAllocString failed"),
                                    Where where = Where::current());
    // The text after a fixed prefix (compared over its own length), as it stands.
    [[nodiscard]] HRESULT AfterPrefix(OleStringView prefix, BSTR* out, const OLECHAR* failText,
                                      Where where = Where::current());
    // One whole word mapped by table (first match wins); unknown words fail
    // with unknownFormat, its %s filled with the word.
    template <class E>
    [[nodiscard]] HRESULT Word(OleStringView word, std::span<const WordValue<E>> table, E* out,
                               const OLECHAR* unknownFormat, Where where = Where::current()) {
        if (failed()) {
            return hr_;
        }
        if (const std::optional<E> value = FindWord(word, table)) {
            *out = *value;
            return S_OK;
        }
        return FailWith(E_FAIL, ViewOf(unknownFormat), word, where);
    }
    template <class E>
    [[nodiscard]] HRESULT Word(OleStringView word, std::initializer_list<WordValue<E>> table, E* out,
                               const OLECHAR* unknownFormat, Where where = Where::current()) {
        return Word(word, std::span<const WordValue<E>>(table.begin(), table.size()), out, unknownFormat, where);
    }

    // The reply scanned with the format F, every field required (else E_FAIL
    // with failText), each field then handed to its out-value in order; see
    // core/reply_fields.h.
    template <text::ScanFormat F, class... Outs>
    [[nodiscard]] HRESULT Fields(SitedText failText, Outs... outs) {
        if (failed()) {
            return hr_;
        }
        static_assert(sizeof...(Outs) == text::kScanFields<F>.size(),
                      "one out-value for every storing conversion of the format");
        return FieldsOf<F>(failText, std::index_sequence_for<Outs...>{}, fields::detail::Adapter<Outs>::Of(outs)...);
    }

    // The same, with a failure text whose %s is filled by the reply.
    template <text::ScanFormat F, class... Outs>
    [[nodiscard]] HRESULT FieldsQuotingReply(SitedText failFormat, Outs... outs) {
        if (failed()) {
            return hr_;
        }
        static_assert(sizeof...(Outs) == text::kScanFields<F>.size(),
                      "one out-value for every storing conversion of the format");
        quoteReply_ = true;
        return FieldsOf<F>(failFormat, std::index_sequence_for<Outs...>{}, fields::detail::Adapter<Outs>::Of(outs)...);
    }

    // Custom decoding: decode(*this) returns the result; it reads Text() and
    // reports with Fail, FailWith and Allocate.
    template <class F>
    [[nodiscard]] HRESULT Then(F&& decode) {
        if (failed()) {
            return hr_;
        }
        return std::forward<F>(decode)(*this);
    }

    bool failed() const { return FAILED(hr_); }
    HRESULT Result() const { return hr_; }
    // The reply text (a VT_BSTR reply; empty for a NULL BSTR).
    OleStringView Text() const;
    // The reply as the controller's C text: up to its first NUL, as every
    // comparison with a whole word must see it.
    OleStringView CText() const { return text::UpToNul(Text()); }
    // Where key first occurs in the C text, or npos; the NUL is looked for
    // only before a match (scans stop there by themselves).
    std::size_t Find(OleStringView key) const;
    // Records a failure with its text and line.
    HRESULT Fail(HRESULT hr, OleStringView text, Where where = Where::current());
    HRESULT Fail(HRESULT hr, OleStringView text, ErrorSite site);
    // Records a failure whose text is format with its %s filled by value
    // (the value cut at a NUL, as the controller's C text ends there).
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

    template <text::ScanFormat F, std::size_t... I, class... A>
    HRESULT FieldsOf(SitedText failText, std::index_sequence<I...>, const A&... adapters) {
        using namespace fields::detail;
        StorageSet<std::index_sequence<I...>, Storage<text::kScanFields<F>[I], A>...> set;
        if (text::Scan<F>(Text(), Get<I>(set).Target()...) != CountedFields<F>()) {
            if (quoteReply_) {
                return Fail(E_FAIL, text::Format(ViewOf(failText.text), text::UpToNul(Text())), failText.site);
            }
            return Fail(E_FAIL, ViewOf(failText.text), failText.site);
        }
        HRESULT hr = S_OK;
        auto check = [&](const auto& adapter, const auto& value) {
            if constexpr (HasCheck<std::remove_cvref_t<decltype(adapter)>, std::remove_cvref_t<decltype(value)>>) {
                if (SUCCEEDED(hr)) {
                    hr = adapter.Check(*this, value);
                }
            }
        };
        (check(adapters, Get<I>(set).Value()), ...);
        auto commit = [&](const auto& adapter, const auto& value) {
            if (SUCCEEDED(hr)) {
                hr = adapter.Commit(*this, value);
            }
        };
        (commit(adapters, Get<I>(set).Value()), ...);
        return hr;
    }

    ControllerObject& object_;
    VARIANT* data_;
    HRESULT hr_ = S_OK;
    bool quoteReply_ = false;
};

namespace fields {

template <std::size_t Room>
HRESULT Bounded<Room>::Commit(Reply& reply, OleStringView value) const {
    return reply.Allocate(value, out);
}

template <class E>
HRESULT Mapped<E>::Check(Reply& reply, OleStringView value) const {
    return FindWord(value, table) ? S_OK : reply.Fail(E_FAIL, ViewOf(unknownText));
}

namespace detail {

inline HRESULT StringOut::Commit(Reply& reply, OleStringView value) const { return reply.Allocate(value, out); }

}  // namespace detail
}  // namespace fields
}  // namespace tav
