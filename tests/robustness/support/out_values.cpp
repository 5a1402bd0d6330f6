#include "robustness/support/out_values.h"

#include <cstdlib>

namespace tav::robustness {
namespace {

bool IsUnwritten(const void* address, std::size_t size) {
    const auto* bytes = static_cast<const unsigned char*>(address);
    for (std::size_t i = 0; i < size; ++i) {
        if (bytes[i] != 0xA5) return false;
    }
    return true;
}

bool Zero(const void* address, std::size_t size) {
    const auto* bytes = static_cast<const unsigned char*>(address);
    for (std::size_t i = 0; i < size; ++i) {
        if (bytes[i] != 0) return false;
    }
    return true;
}

void FreeElement(TavAutoCondition&) {}
void FreeElement(TavAutoCondition2&) {}
void FreeElement(TavPSCUnit&) {}
void FreeElement(TavIPCSlot& slot) { SysFreeString(slot.slotName); }
void FreeElement(TavStorageDevice& device) { SysFreeString(device.deviceName); }
void FreeElement(TavStorageDevice2& device) { SysFreeString(device.deviceName); }
void FreeElement(BSTR& text) { SysFreeString(text); }

template <typename I> struct ElementOf;
template <> struct ElementOf<IEnumAutoCondition> { using Type = TavAutoCondition; };
template <> struct ElementOf<IEnumAutoCondition2> { using Type = TavAutoCondition2; };
template <> struct ElementOf<IEnumTavPSCUnits> { using Type = TavPSCUnit; };
template <> struct ElementOf<IEnumSlots> { using Type = TavIPCSlot; };
template <> struct ElementOf<IEnumStorageDevices> { using Type = TavStorageDevice; };
template <> struct ElementOf<IEnumStorageDevices2> { using Type = TavStorageDevice2; };
template <> struct ElementOf<ITavEnumBSTR> { using Type = BSTR; };

// Hands out every element in small batches, as a client would.
template <typename I>
void HandOutAll(I* enumerator) {
    using Element = typename ElementOf<I>::Type;
    Element batch[3];
    for (;;) {
        ULONG fetched = 0;
        const HRESULT hr = enumerator->RemNext(3, batch, &fetched);
        if (FAILED(hr) || fetched > 3) std::abort();
        for (ULONG i = 0; i < fetched; ++i) FreeElement(batch[i]);
        if (hr != S_OK) return;
    }
}

}  // namespace

template <typename I>
void OutValues::Drain(IUnknown* object) {
    I* enumerator = static_cast<I*>(object);
    HandOutAll(enumerator);
    I* clone = nullptr;
    if (SUCCEEDED(enumerator->Clone(&clone)) && clone != nullptr) {
        // The number-aware order and a filter read every string the reply made.
        clone->Sort(6);
        clone->Reset();
        clone->Filter(3);
        HandOutAll(clone);
        clone->Release();
    }
    enumerator->Release();
}

template void OutValues::Drain<IEnumAutoCondition>(IUnknown*);
template void OutValues::Drain<IEnumAutoCondition2>(IUnknown*);
template void OutValues::Drain<IEnumTavPSCUnits>(IUnknown*);
template void OutValues::Drain<IEnumSlots>(IUnknown*);
template void OutValues::Drain<IEnumStorageDevices>(IUnknown*);
template void OutValues::Drain<IEnumStorageDevices2>(IUnknown*);
template void OutValues::Drain<ITavEnumBSTR>(IUnknown*);

OutValues::~OutValues() = default;

BSTR* OutValues::String() { return WatchString(&stringStore_.emplace_back()); }

FILETIME* OutValues::Time() {
    FILETIME& time = times_.emplace_back();
    Watch(&time.dwLowDateTime);
    Watch(&time.dwHighDateTime);
    return &time;
}

TavLoginInfo* OutValues::Login() {
    TavLoginInfo& login = logins_.emplace_back();
    WatchString(&login.userAlias);
    WatchString(&login.location);
    WatchString(&login.application);
    return &login;
}

TavVantorConfigInfo* OutValues::ConfigInfo() {
    TavVantorConfigInfo& info = configs_.emplace_back();
    Watch(&info.configVersion.majorVersion);
    Watch(&info.configVersion.minorVersion);
    WatchString(&info.creationInfo.creationDate);
    WatchString(&info.creationInfo.createdBy);
    WatchString(&info.creationInfo.configurationName);
    Watch(&info.validationInfo.isValidated);
    WatchString(&info.validationInfo.validationDate);
    WatchString(&info.validationInfo.validatedBy);
    Watch(&info.lockInfo.isLocked);
    WatchString(&info.lockInfo.lockDate);
    WatchString(&info.lockInfo.lockedBy);
    return &info;
}

TavRetrievalParams* OutValues::Retrieval() {
    TavRetrievalParams& params = retrievals_.emplace_back();
    params.noOfElts = -2;
    return &params;
}

std::string OutValues::Check(HRESULT hr) {
    const bool succeeded = SUCCEEDED(hr);
    // An operation that is not provided touches nothing.
    const bool notProvided = hr == E_NOTIMPL;
    const bool mayKeep = notProvided || (hr == E_FAIL && (quirks_ & kTypeCheckedFirst) != 0) ||
                         (!succeeded && (quirks_ & kUntouchedOnFailure) != 0);
    std::string fault;
    const auto note = [&fault](const char* what) {
        if (fault.empty()) fault = what;
    };
    for (BSTR* text : strings_) {
        if (*text == Unwritten<BSTR>()) {
            if (!mayKeep) note(succeeded ? "left a string out-value unwritten" : "did not clear a string out-value");
        } else if (succeeded && *text == nullptr && !nullReplyText_ && (quirks_ & kNullOnSuccess) == 0) {
            note("handed out a NULL string");
        } else if (!succeeded && hr != E_OUTOFMEMORY && (quirks_ & kKeepsFilledOnFailure) == 0 && *text != nullptr) {
            // After a failed allocation the strings already handed out stay with the caller.
            note("handed out a string with a failure");
        }
    }
    // After a failed allocation what was already handed out stays too.
    if (!succeeded && hr != E_OUTOFMEMORY && (quirks_ & kKeepsFilledOnFailure) == 0) {
        for (const NumberRef& number : numbers_) {
            if (!IsUnwritten(number.address, number.size) && !Zero(number.address, number.size)) {
                note("wrote a number out-value other than zero with a failure");
            }
        }
    }
    for (EnumeratorSlot& slot : enumerators_) {
        if (slot.object == Unwritten<IUnknown*>() || slot.object == nullptr) continue;
        if (!succeeded) note("handed out an enumerator with a failure");
        slot.drain(slot.object);
        slot.object = nullptr;
    }
    for (BSTR* text : strings_) {
        if (*text != Unwritten<BSTR>()) SysFreeString(*text);
        *text = nullptr;
    }
    strings_.clear();
    return fault;
}

}  // namespace tav::robustness
