#pragma once
#include <cstddef>
#include <new>

#include "core/array.h"
#include "core/module_lock.h"
#include "tav/com_ptr.h"
#include "tav/platform.h"

namespace tav {

// What an enumerator does with the element array given to Init.
enum class EnumOwnership {
    // The array (from AllocateArray) and the strings in it become the
    // enumerator's, without a copy, whatever Init returns; the enumerator
    // frees them when it is destroyed (at once when Init fails).
    Take,
    // The enumerator makes its own copy, strings duplicated; the caller keeps
    // and frees its array.
    Copy,
    // The enumerator reads the caller's array in place and never frees it;
    // the owner reference given to Init keeps that array alive.
    Borrow,
};

// Frees the strings of count elements and then the array itself. Elements
// never filled are still zero from AllocateArray and free as nothing.
template <class Traits>
void FreeElements(typename Traits::Element* array, size_t count) noexcept {
    if (array == nullptr) {
        return;
    }
    for (size_t i = 0; i < count; ++i) {
        Traits::Free(array[i]);
    }
    TavMemFree(array);
}

// The one implementation behind the seven enumerator interfaces. Traits give:
//   Element, Interface, static const IID& Iid();
//   static HRESULT Copy(const Element& from, Element* to)  (strings duplicated;
//       on failure *to holds no string and the result is E_OUTOFMEMORY);
//   static void Free(Element&)  (frees its strings and clears them);
// and, for the string enumerator only, the real ordering and filtering:
//   static void Sort(Element* begin, Element* end, LONG mode);
//   static bool Passes(const Element&, LONG mode).
template <class Traits>
class EnumeratorObject final : public Traits::Interface {
public:
    using Element = typename Traits::Element;
    using Interface = typename Traits::Interface;

    // A new, empty object with a reference count of 0: the creator takes the
    // first reference by QueryInterface, or destroys it with Discard.
    static HRESULT CreateInstance(EnumeratorObject** object) noexcept {
        if (object == nullptr) {
            return E_POINTER;
        }
        *object = new (std::nothrow) EnumeratorObject();
        return *object != nullptr ? S_OK : E_OUTOFMEMORY;
    }

    // Gives the object its elements [begin, end), once. owner, when not
    // null, is held until the object is destroyed. E_INVALIDARG for a null
    // or reversed range, E_UNEXPECTED for a second Init, E_OUTOFMEMORY when
    // a copy cannot be made.
    HRESULT Init(Element* begin, Element* end, IUnknown* owner, EnumOwnership ownership) noexcept {
        const bool validRange = begin != nullptr && end != nullptr && begin <= end;
        HRESULT hr = S_OK;
        if (!validRange) {
            hr = E_INVALIDARG;
        } else if (begin_ != nullptr) {
            hr = E_UNEXPECTED;
        }
        if (FAILED(hr)) {
            if (ownership == EnumOwnership::Take) {
                if (validRange) {
                    FreeElements<Traits>(begin, static_cast<size_t>(end - begin));
                } else {
                    TavMemFree(begin);
                }
            }
            return hr;
        }
        if (ownership == EnumOwnership::Copy) {
            hr = CopyElements(begin, end);
            if (FAILED(hr)) {
                return hr;
            }
        } else {
            begin_ = begin;
            end_ = end;
        }
        position_ = begin_;
        ownsArray_ = ownership != EnumOwnership::Borrow;
        owner_ = ComPtr<IUnknown>(owner);
        return S_OK;
    }

    // Destroys an object from CreateInstance that was never handed out.
    void Discard() noexcept {
        AddRef();
        Release();
    }

    // IUnknown
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override {
        if (object == nullptr) {
            return E_POINTER;
        }
        if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, Traits::Iid())) {
            *object = static_cast<Interface*>(this);
            AddRef();
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }

    ULONG STDMETHODCALLTYPE AddRef() override { return static_cast<ULONG>(InterlockedIncrement(&references_)); }

    ULONG STDMETHODCALLTYPE Release() override {
        const LONG left = InterlockedDecrement(&references_);
        if (left == 0) {
            delete this;
        }
        return static_cast<ULONG>(left);
    }

    // The enumerator interface
    HRESULT STDMETHODCALLTYPE RemNext(ULONG cElems, Element* prgElems, ULONG* pcFetched) override {
        if (prgElems == nullptr || (cElems != 1 && pcFetched == nullptr)) {
            return E_POINTER;
        }
        if (begin_ == nullptr || end_ == nullptr || position_ == nullptr) {
            return E_FAIL;
        }
        ULONG fetched = 0;
        while (fetched < cElems && position_ < end_) {
            const Element& next = *position_;
            if (filtered_ && !PassesFilter(next)) {
                ++position_;
                continue;
            }
            const HRESULT hr = Traits::Copy(next, &prgElems[fetched]);
            if (FAILED(hr)) {
                for (ULONG i = 0; i < fetched; ++i) {
                    Traits::Free(prgElems[i]);
                }
                if (pcFetched != nullptr) {
                    *pcFetched = 0;
                }
                return hr;
            }
            ++position_;
            ++fetched;
        }
        if (pcFetched != nullptr) {
            *pcFetched = fetched;
        }
        return fetched == cElems ? S_OK : S_FALSE;
    }

    HRESULT STDMETHODCALLTYPE Skip(ULONG cElems) override {
        const size_t left = position_ != nullptr ? static_cast<size_t>(end_ - position_) : 0;
        if (cElems <= left) {
            if (cElems != 0) {
                position_ += cElems;
            }
            return S_OK;
        }
        position_ = end_;
        return S_FALSE;
    }

    HRESULT STDMETHODCALLTYPE Reset() override {
        position_ = begin_;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Clone(Interface** ppenum) override {
        if (ppenum == nullptr) {
            return E_POINTER;
        }
        *ppenum = nullptr;
        if (begin_ == nullptr) {
            return E_FAIL;
        }
        EnumeratorObject* copy = nullptr;
        HRESULT hr = CreateInstance(&copy);
        if (FAILED(hr)) {
            return hr;
        }
        // A clone reads its own copy, yet keeps alive whoever keeps the
        // source's elements alive: the source when it owns them.
        IUnknown* owner = ownsArray_ ? static_cast<Interface*>(this) : owner_.Get();
        hr = copy->Init(begin_, end_, owner, EnumOwnership::Copy);
        if (SUCCEEDED(hr)) {
            copy->position_ = copy->begin_ + (position_ - begin_);
            hr = copy->QueryInterface(Traits::Iid(), reinterpret_cast<void**>(ppenum));
        }
        if (FAILED(hr)) {
            copy->Discard();
        }
        return hr;
    }

    HRESULT STDMETHODCALLTYPE Sort(LONG mode) override {
        if constexpr (requires(Element* items, LONG anyMode) { Traits::Sort(items, items, anyMode); }) {
            if (begin_ != nullptr) {
                Traits::Sort(begin_, end_, mode);
            }
        }
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Filter(LONG mode) override {
        filtered_ = true;
        filterMode_ = mode;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE UnFilter() override {
        filtered_ = false;
        return S_OK;
    }

private:
    EnumeratorObject() noexcept { ModuleLock::Add(); }

    ~EnumeratorObject() {
        if (ownsArray_) {
            FreeElements<Traits>(begin_, static_cast<size_t>(end_ - begin_));
        }
        owner_.Reset();
        ModuleLock::Remove();
    }

    EnumeratorObject(const EnumeratorObject&) = delete;
    EnumeratorObject& operator=(const EnumeratorObject&) = delete;

    bool PassesFilter(const Element& element) const noexcept {
        if constexpr (requires(LONG anyMode) { Traits::Passes(element, anyMode); }) {
            return Traits::Passes(element, filterMode_);
        } else {
            return true;
        }
    }

    HRESULT CopyElements(const Element* begin, const Element* end) noexcept {
        const size_t count = static_cast<size_t>(end - begin);
        Element* copy = AllocateArray<Element>(count);
        if (copy == nullptr) {
            return E_OUTOFMEMORY;
        }
        for (size_t i = 0; i < count; ++i) {
            const HRESULT hr = Traits::Copy(begin[i], &copy[i]);
            if (FAILED(hr)) {
                FreeElements<Traits>(copy, i);
                return hr;
            }
        }
        begin_ = copy;
        end_ = copy + count;
        return S_OK;
    }

    Element* begin_ = nullptr;
    Element* end_ = nullptr;
    Element* position_ = nullptr;  // the next element RemNext hands out
    bool filtered_ = false;
    LONG filterMode_ = 0;  // kept after UnFilter, unused until the next Filter
    bool ownsArray_ = false;
    ComPtr<IUnknown> owner_;
    LONG volatile references_ = 0;
};

// Which of the three steps of MakeEnumerator failed, so that a decoder can
// report its own text for each.
enum class EnumStep { Create, Init, Query };

// Creates an enumerator over [begin, end), initialises it and queries it for
// its interface into *out (null on failure). With EnumOwnership::Take the
// array is the enumerator's in every case, also when creation fails.
template <class Traits>
HRESULT MakeEnumerator(typename Traits::Element* begin, typename Traits::Element* end, IUnknown* owner,
                       EnumOwnership ownership, typename Traits::Interface** out,
                       EnumStep* failedStep = nullptr) noexcept {
    using Object = EnumeratorObject<Traits>;
    if (out == nullptr) {
        return E_POINTER;
    }
    *out = nullptr;
    auto fail = [failedStep](EnumStep step, HRESULT hr) {
        if (failedStep != nullptr) {
            *failedStep = step;
        }
        return hr;
    };
    Object* object = nullptr;
    HRESULT hr = Object::CreateInstance(&object);
    if (FAILED(hr)) {
        if (ownership == EnumOwnership::Take) {
            FreeElements<Traits>(begin, begin != nullptr && end > begin ? static_cast<size_t>(end - begin) : 0);
        }
        return fail(EnumStep::Create, hr);
    }
    hr = object->Init(begin, end, owner, ownership);
    if (FAILED(hr)) {
        object->Discard();
        return fail(EnumStep::Init, hr);
    }
    hr = object->QueryInterface(Traits::Iid(), reinterpret_cast<void**>(out));
    if (FAILED(hr)) {
        object->Discard();
        return fail(EnumStep::Query, hr);
    }
    return S_OK;
}

}  // namespace tav
