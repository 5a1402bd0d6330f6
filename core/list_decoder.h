#pragma once
// Replies that carry a list: a count, then that many elements, decoded into
// an array that an enumerator object takes over. A list decoder states its
// texts, its order and how to read one element; everything else is here:
// the allocation (a count whose size overflows 32 bits fails as the
// allocation would on the 32-bit target; a count the text cannot hold costs
// no more memory than the text), the element failure quoting the rest of
// the reply, the enumerator's creation, initialisation and query with their
// texts, and freeing everything on every failure.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <utility>

#include "core/enumerators.h"
#include "core/reply.h"

namespace tav {

struct ListTexts {
    const OLECHAR* outOfMemory;  // the array cannot be allocated ("" for an empty text)
    const OLECHAR* element;      // an element does not scan; %s: the rest of the reply from it on
    const OLECHAR* create;       // the enumerator cannot be created
    const OLECHAR* init;         // the enumerator cannot be initialised
    const OLECHAR* query;        // the enumerator does not answer its interface
};

// When the enumerator object is created: after the elements (most lists),
// or before the array is allocated.
enum class ListOrder { ArrayFirst, EnumeratorFirst };

struct ListShape {
    ListOrder order = ListOrder::ArrayFirst;
    // No element that reads is shorter: a count beyond what the text can
    // hold fails at its first missing element without being allocated.
    std::size_t shortestElement = 1;
    // The loop counts elements in 16 bits: a count above 65535 never ends it,
    // so elements are read until one fails.
    bool sixteenBitCounter = false;
    // Take: the enumerator takes the array; Copy: it copies the elements and
    // the decoder frees its own.
    EnumOwnership ownership = EnumOwnership::Take;
};

// What reading one element gives: S_OK with the characters it consumed,
// S_FALSE when the element does not match (the list then fails with the
// element text), or a failure the reader has recorded itself.
struct ElementRead {
    HRESULT hr = S_OK;
    std::size_t consumed = 0;

    static ElementRead Read(std::size_t consumed) { return {S_OK, consumed}; }
    static ElementRead Mismatch() { return {S_FALSE, 0}; }
};

// Decodes count elements from `elements` with read(rest, element) and hands
// them to a new enumerator in *out. A count of zero or less gives an empty
// enumerator. *out stays null on failure.
//
// afterElements(rest), when given, runs once every element is read and
// before the enumerator is made: S_FALSE refuses the list with the element
// text (something follows the last element that may not), a failure is one
// it has recorded.
template <class Traits, class ReadElement, class AfterElements>
HRESULT DecodeList(Reply& reply, const ListTexts& texts, const ListShape& shape, LONG count,
                   OleStringView elements, ReadElement&& read, AfterElements&& afterElements,
                   typename Traits::Interface** out) {
    using Element = typename Traits::Element;
    using Object = EnumeratorObject<Traits>;
    struct Discard {
        void operator()(Object* object) const noexcept { object->Discard(); }
    };
    std::unique_ptr<Object, Discard> enumerator;
    auto create = [&]() -> HRESULT {
        Object* created = nullptr;
        const HRESULT hr = Object::CreateInstance(&created);
        if (FAILED(hr)) {
            return reply.Fail(hr, ViewOf(texts.create));
        }
        enumerator.reset(created);
        return S_OK;
    };
    if (shape.order == ListOrder::EnumeratorFirst && FAILED(create())) {
        return reply.Result();
    }

    const std::size_t wanted = count > 0 ? static_cast<std::size_t>(count) : 0;
    // Sizes count in 32 bits, as on the controller's pendant.
    if (wanted > std::numeric_limits<std::uint32_t>::max() / Traits::kTargetSize) {
        return reply.Fail(E_OUTOFMEMORY, ViewOf(texts.outOfMemory));
    }
    const bool endless = shape.sixteenBitCounter && wanted > std::numeric_limits<std::uint16_t>::max();
    const std::size_t room = std::min(wanted, elements.size() / std::max<std::size_t>(shape.shortestElement, 1));
    struct Free {
        std::size_t count;
        void operator()(Element* array) const noexcept { FreeElements<Traits>(array, count); }
    };
    std::unique_ptr<Element, Free> records(AllocateArray<Element>(endless ? 1 : room), Free{endless ? 1 : room});
    if (!records) {
        return reply.Fail(E_OUTOFMEMORY, ViewOf(texts.outOfMemory));
    }

    OleStringView rest = elements;
    for (std::size_t i = 0; endless || i < wanted; ++i) {
        Element& record = records.get()[endless ? 0 : i];
        if (endless) {
            Traits::Free(record);
            record = Element{};
        }
        const ElementRead result = i < room || endless ? read(rest, record) : ElementRead::Mismatch();
        if (result.hr == S_FALSE) {
            return reply.FailWith(E_FAIL, ViewOf(texts.element), rest);
        }
        if (FAILED(result.hr)) {
            return result.hr;
        }
        rest = rest.substr(std::min(result.consumed, rest.size()));
    }

    const HRESULT after = afterElements(rest);
    if (after == S_FALSE) {
        return reply.FailWith(E_FAIL, ViewOf(texts.element), rest);
    }
    if (FAILED(after)) {
        return after;
    }
    if (!enumerator && FAILED(create())) {
        return reply.Result();
    }
    Element* begin = shape.ownership == EnumOwnership::Take ? records.release() : records.get();
    HRESULT hr = enumerator->Init(begin, begin + wanted, nullptr, shape.ownership);
    if (FAILED(hr)) {
        return reply.Fail(hr, ViewOf(texts.init));
    }
    hr = enumerator->QueryInterface(Traits::Iid(), reinterpret_cast<void**>(out));
    if (FAILED(hr)) {
        *out = nullptr;
        return reply.Fail(hr, ViewOf(texts.query));
    }
    // The interface holds the object's one reference now.
    enumerator.release();
    return S_OK;
}

template <class Traits, class ReadElement>
HRESULT DecodeList(Reply& reply, const ListTexts& texts, const ListShape& shape, LONG count,
                   OleStringView elements, ReadElement&& read, typename Traits::Interface** out) {
    return DecodeList<Traits>(
        reply, texts, shape, count, elements, std::forward<ReadElement>(read), [](OleStringView) { return S_OK; },
        out);
}

// The retrieve-all request: the only retrieval the lists take, written as
// -2 by most of them and as -1 by the IPC slot list.
inline constexpr LONG kRetrieveAll = -2;
inline constexpr LONG kRetrieveAllSlots = -1;

// A complete list as the retrieve-all request reports it.
inline void SetRetrieved(TavRetrievalParams* params, LONG count) {
    params->noOfElts = count;
    params->bLast = 1;
}

}  // namespace tav
