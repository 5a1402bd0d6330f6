// Operation mode: automatic, manual reduced or full speed, and the pending
// changes between them. While a change to automatic mode is pending, the
// controller sends its auto conditions with the mode.
#include "core/controller_object.h"
#include "operations/panel/auto_conditions.h"
#include "tav/variant.h"

namespace tav {
namespace {

constexpr OleStringView kAutoChangePrefix = OLESTR("AUTO_CH");
// "AUTO_CH" and the one separator before its condition list.
constexpr size_t kConditionListAt = 8;

const OLECHAR* ModeRequest(TavOperationMode mode) {
    switch (mode) {
    case Auto:
        return OLESTR("-opmode auto");
    case Manr:
        return OLESTR("-opmode manr");
    case Manf:
        return OLESTR("-opmode manf");
    default:
        return nullptr;
    }
}

// The conditions after "AUTO_CH" and its separator.
HRESULT DecodeAutoChangeConditions(ControllerObject& object, Reply& reply, OleStringView text,
                                   IEnumAutoCondition2** conditions, ULONG* cycle) {
    *conditions = nullptr;
    // Also "AUTO_CH" alone: there is no list to read.
    if (text.size() <= kConditionListAt) {
        return reply.Fail(E_FAIL, OLESTR("UnpackOperationMode2. No autocond string"));
    }
    Bstr listText(text.substr(kConditionListAt));
    if (listText.IsNull()) {
        return reply.Fail(E_OUTOFMEMORY, OLESTR("SysAllocString failed"));
    }
    Variant list;
    list.SetBstr(std::move(listText));
    LONG listChange = 0;  // the list's own change flag, of no use beside the mode
    return UnpackAutoConditions2(object, list.Get(), &listChange, conditions, cycle);
}

}  // namespace

HRESULT ControllerObject::GetOperationMode(TavInParams* pRip, TavOperationMode* pMode) {
    return GetOperationMode2(pRip, pMode, nullptr, nullptr);
}

HRESULT ControllerObject::GetOperationMode2(TavInParams* pRip, TavOperationMode* pMode, IEnumAutoCondition2** ppenum,
                                            ULONG* pCycle) {
    return Command(pRip)
        .ValidParams(OLESTR("GetOperationMode. Invalid TavInParams."))
        .OutPointer(pMode, OLESTR("GetOperationMode. Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("Mode"))
        .Decode([&](VARIANT* reply) { return UnpackOperationMode2(reply, pMode, ppenum, pCycle); });
}

// Also the decoder of the "Mode" event. Version 1 knows "AUTO_CH" only as a
// whole word, without conditions.
HRESULT ControllerObject::UnpackOperationMode(VARIANT* pData, TavOperationMode* pMode) {
    return Decode(pData)
        .Initialised()
        .NotNull(OLESTR("UnpackOperationMode. NULL data-variant"))
        .OutPointer(pMode, OLESTR(""))
        .IsBstr(OLESTR("UnpackOperationMode. Non-BSTR argument."))
        .Then([&](Reply& reply) {
            return reply.Word<TavOperationMode>(reply.CText(),
                                                {{OLESTR("AUTO"), Auto},
                                                 {OLESTR("INIT"), InitOp},
                                                 {OLESTR("MANR"), Manr},
                                                 {OLESTR("MANF"), Manf},
                                                 {OLESTR("AUTO_CH"), AutoChange},
                                                 {OLESTR("MANF_CH"), ManfChange},
                                                 {OLESTR("UNDEF"), UndefinedMode}},
                                                pMode, OLESTR("UnpackOperationMode. Unsupported mode %s."));
        });
}

// A mode reply is a bare word, or "AUTO_CH", one separator and the condition
// list. The conditions (and the run mode's cycle) are decoded only for a
// caller that asks for them. The mode is written only on success.
HRESULT ControllerObject::UnpackOperationMode2(VARIANT* pData, TavOperationMode* pMode, IEnumAutoCondition2** ppenum,
                                               ULONG* pCycle) {
    ULONG noCycle = 0;
    return Decode(pData)
        .Initialised()
        .NotNull(OLESTR("UnpackOperationMode2. NULL data-variant"))
        .OutPointer(pMode, OLESTR(""))
        .Clear(pCycle != nullptr ? pCycle : &noCycle)
        .IsBstr(OLESTR("UnpackOperationMode2. Non-BSTR argument."))
        .Then([&](Reply& reply) {
            const OleStringView text = reply.CText();
            const auto steady = FindWord<TavOperationMode>(
                text,
                {{OLESTR("AUTO"), Auto}, {OLESTR("INIT"), InitOp}, {OLESTR("MANR"), Manr}, {OLESTR("MANF"), Manf}});
            if (steady) {
                *pMode = *steady;
                return S_OK;
            }
            if (!text.starts_with(kAutoChangePrefix)) {
                // Unknown modes are reported with version 1's text.
                return reply.Word<TavOperationMode>(text,
                                                    {{OLESTR("MANF_CH"), ManfChange}, {OLESTR("UNDEF"), UndefinedMode}},
                                                    pMode, OLESTR("UnpackOperationMode. Unsupported mode %s."));
            }
            if (ppenum != nullptr) {
                const HRESULT hr = DecodeAutoChangeConditions(*this, reply, text, ppenum, pCycle);
                if (FAILED(hr)) {
                    return hr;
                }
            }
            *pMode = AutoChange;
            return S_OK;
        });
}

HRESULT ControllerObject::SetOPMode(TavInParams* pRip, TavOperationMode opode) {
    const OLECHAR* request = ModeRequest(opode);
    return Command(pRip)
        .ValidParams(OLESTR("LockOPModePinCode: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(request != nullptr, E_INVALIDARG, OLESTR("LockOPModePinCode: Invalid operator mode"))
        .Set(OLESTR("OPMode"), ViewOf(request))
        .StatusOnly();
}

}  // namespace tav
