#pragma once
#include <cstdint>
#include "TavController.h"
#include "core/enumerator.h"
#include "tav/platform.h"

namespace tav {

// A copy of source for the caller, who frees it; NULL stays NULL. The length
// is taken from the BSTR, so embedded NULs survive the copy.
inline HRESULT DuplicateString(BSTR source, BSTR* copy) noexcept {
    *copy = nullptr;
    if (source == nullptr) {
        return S_OK;
    }
    *copy = SysAllocStringLen(source, SysStringLen(source));
    return *copy != nullptr ? S_OK : E_OUTOFMEMORY;
}

inline void FreeString(BSTR& text) noexcept {
    SysFreeString(text);
    text = nullptr;
}

// Every traits class also gives kTargetSize, the element's size on the
// 32-bit target, by which list sizes are counted.

// Records of numbers only: copied as they are.
template <class Record>
struct PlainRecordElements {
    using Element = Record;
    static HRESULT Copy(const Record& from, Record* to) noexcept {
        *to = from;
        return S_OK;
    }
    static void Free(Record&) noexcept {}
};

// Records with one string: copied with the string duplicated.
template <class Record, BSTR Record::*Text>
struct NamedRecordElements {
    using Element = Record;
    static HRESULT Copy(const Record& from, Record* to) noexcept {
        *to = from;
        return DuplicateString(from.*Text, &(to->*Text));
    }
    static void Free(Record& record) noexcept { FreeString(record.*Text); }
};

struct AutoConditionTraits : PlainRecordElements<TavAutoCondition> {
    static constexpr size_t kTargetSize = 12;
    using Interface = IEnumAutoCondition;
    static const IID& Iid() noexcept { return IID_IEnumAutoCondition; }
};

struct AutoCondition2Traits : PlainRecordElements<TavAutoCondition2> {
    static constexpr size_t kTargetSize = 8;
    using Interface = IEnumAutoCondition2;
    static const IID& Iid() noexcept { return IID_IEnumAutoCondition2; }
};

struct StorageDeviceTraits : NamedRecordElements<TavStorageDevice, &TavStorageDevice::deviceName> {
    static constexpr size_t kTargetSize = 16;
    using Interface = IEnumStorageDevices;
    static const IID& Iid() noexcept { return IID_IEnumStorageDevices; }
};

struct StorageDevice2Traits : NamedRecordElements<TavStorageDevice2, &TavStorageDevice2::deviceName> {
    static constexpr size_t kTargetSize = 20;
    using Interface = IEnumStorageDevices2;
    static const IID& Iid() noexcept { return IID_IEnumStorageDevices2; }
};

struct PscUnitTraits : PlainRecordElements<TavPSCUnit> {
    static constexpr size_t kTargetSize = 12;
    using Interface = IEnumTavPSCUnits;
    static const IID& Iid() noexcept { return IID_IEnumTavPSCUnits; }
};

struct SlotTraits : NamedRecordElements<TavIPCSlot, &TavIPCSlot::slotName> {
    static constexpr size_t kTargetSize = 16;
    using Interface = IEnumSlots;
    static const IID& Iid() noexcept { return IID_IEnumSlots; }
};

// The string enumerator, the only one that really sorts and filters.
struct BstrTraits {
    static constexpr size_t kTargetSize = 4;
    using Element = BSTR;
    using Interface = ITavEnumBSTR;
    static const IID& Iid() noexcept { return IID_ITavEnumBSTR; }
    static HRESULT Copy(const BSTR& from, BSTR* to) noexcept { return DuplicateString(from, to); }
    static void Free(BSTR& text) noexcept { FreeString(text); }
    static void Sort(BSTR* begin, BSTR* end, LONG mode) noexcept;
    static bool Passes(const BSTR& text, LONG mode) noexcept;
};

using AutoConditionEnum = EnumeratorObject<AutoConditionTraits>;
using AutoCondition2Enum = EnumeratorObject<AutoCondition2Traits>;
using StorageDeviceEnum = EnumeratorObject<StorageDeviceTraits>;
using StorageDevice2Enum = EnumeratorObject<StorageDevice2Traits>;
using PscUnitEnum = EnumeratorObject<PscUnitTraits>;
using SlotEnum = EnumeratorObject<SlotTraits>;
using BstrEnum = EnumeratorObject<BstrTraits>;

// Compiled once, in enumerators.cpp.
extern template class EnumeratorObject<AutoConditionTraits>;
extern template class EnumeratorObject<AutoCondition2Traits>;
extern template class EnumeratorObject<StorageDeviceTraits>;
extern template class EnumeratorObject<StorageDevice2Traits>;
extern template class EnumeratorObject<PscUnitTraits>;
extern template class EnumeratorObject<SlotTraits>;
extern template class EnumeratorObject<BstrTraits>;

#if UINTPTR_MAX == 0xFFFFFFFFu
static_assert(sizeof(TavAutoCondition) == AutoConditionTraits::kTargetSize);
static_assert(sizeof(TavAutoCondition2) == AutoCondition2Traits::kTargetSize);
static_assert(sizeof(TavStorageDevice) == StorageDeviceTraits::kTargetSize);
static_assert(sizeof(TavStorageDevice2) == StorageDevice2Traits::kTargetSize);
static_assert(sizeof(TavPSCUnit) == PscUnitTraits::kTargetSize);
static_assert(sizeof(TavIPCSlot) == SlotTraits::kTargetSize);
static_assert(sizeof(BSTR) == BstrTraits::kTargetSize);
#endif

}  // namespace tav
