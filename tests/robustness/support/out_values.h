#pragma once
// The out-values of one decoder call. Each is handed out holding a value that
// no decoder produces, so that afterwards it shows whether the decoder wrote
// it; Check then holds the result against what a success or a failure may
// leave and frees whatever the call handed out.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <deque>
#include <string>
#include <vector>

#include "TavController.h"

namespace tav::robustness {

class OutValues {
public:
    // Where an operation departs from the common decoding rules.
    enum Quirks : unsigned {
        kNone = 0,
        // The reply's type is checked before the out-values are cleared, so a
        // reply that is not a text leaves them as they were.
        kTypeCheckedFirst = 1,
        // A success may hand out a NULL string (a reply without the value).
        kNullOnSuccess = 2,
        // What was filled before a failure stays with the caller.
        kKeepsFilledOnFailure = 4,
        // A failure may come before anything is written (a command that
        // could not be built or sent leaves its out-values alone).
        kUntouchedOnFailure = 8,
    };
    // A NULL BSTR in the reply may be passed on whole as a NULL string.
    explicit OutValues(bool nullReplyText, unsigned quirks = kNone)
        : nullReplyText_(nullReplyText), quirks_(quirks) {}
    OutValues(const OutValues&) = delete;
    OutValues& operator=(const OutValues&) = delete;
    ~OutValues();

    BSTR* String();
    template <typename T>
    T* Number() {
        static_assert(sizeof(T) <= sizeof(std::uint64_t));
        auto& slot = numberStore_.emplace_back();
        return Watch(reinterpret_cast<T*>(&slot));
    }
    FILETIME* Time();
    TavLoginInfo* Login();
    TavVantorConfigInfo* ConfigInfo();
    TavRetrievalParams* Retrieval();
    // An array of exactly `count` elements, in the heap so that a write past
    // its end is caught.
    template <typename T>
    T* Array(LONG count) {
        arrays_.emplace_back(static_cast<std::size_t>(count) * sizeof(T) + (count == 0 ? 1 : 0));
        return reinterpret_cast<T*>(arrays_.back().data());
    }
    template <typename I>
    I** Enumerator() {
        auto& slot = enumerators_.emplace_back(EnumeratorSlot{Unwritten<IUnknown*>(), &Drain<I>});
        return reinterpret_cast<I**>(&slot.object);
    }

    // What the call left that a call with this result may not leave (empty
    // when all is well); then frees what the call handed out.
    std::string Check(HRESULT hr);

private:
    struct EnumeratorSlot {
        IUnknown* object;
        void (*drain)(IUnknown*);
    };
    struct NumberRef {
        void* address;
        std::size_t size;
    };

    template <typename P>
    static P Unwritten() {
        return reinterpret_cast<P>(std::uintptr_t{1});
    }
    template <typename T>
    T* Watch(T* number) {
        std::memset(number, 0xA5, sizeof(T));
        numbers_.push_back({number, sizeof(T)});
        return number;
    }
    BSTR* WatchString(BSTR* text) {
        *text = Unwritten<BSTR>();
        strings_.push_back(text);
        return text;
    }
    template <typename I>
    static void Drain(IUnknown* object);

    const bool nullReplyText_;
    const unsigned quirks_;
    std::deque<BSTR> stringStore_;
    std::deque<std::uint64_t> numberStore_;
    std::deque<FILETIME> times_;
    std::deque<TavLoginInfo> logins_;
    std::deque<TavVantorConfigInfo> configs_;
    std::deque<TavRetrievalParams> retrievals_;
    std::deque<std::vector<unsigned char>> arrays_;
    std::deque<EnumeratorSlot> enumerators_;
    std::vector<BSTR*> strings_;
    std::vector<NumberRef> numbers_;
};

}  // namespace tav::robustness
