// The auto condition lists: what the operator must answer, Reset or Keep,
// before a pending change to automatic mode completes. Version 1 is the
// public decoder (also for the "AutoCondSub" event); version 2 serves the
// "AUTO_CH" mode reply only.
//
// A list reads "-auto_ch <flag> -noelts <count>", a TAB, then per element
// "<name>;<second>;<third>" and a TAB; text before "-auto_ch" is ignored.
#include "operations/panel/auto_conditions.h"

#include <cstdint>

#include "core/controller_object.h"
#include "core/list_decoder.h"
#include "core/text/scan.h"

namespace tav {
namespace {

struct ConditionListTexts {
    const OLECHAR* nullVariant;
    const OLECHAR* nonBstr;
    const OLECHAR* noList;
    const OLECHAR* header;
    ListTexts list;
};

// Kept as clients know them, misspellings and all.
constexpr ConditionListTexts kVersion1Texts{
    OLESTR("UnpackAutoConditions. NULL VARIANT"),
    OLESTR("UnpackAutoConditions. Non-BSTR argument."),
    OLESTR("UnpackAutoCondition. Could not parse string: %s"),
    OLESTR("UnpackAutoConditions. Cannot parse overhead data: %s"),
    {OLESTR(""), OLESTR("UnpackAutoConditons. Could not parse element: %s"),
     OLESTR("UnpackAutoConditions. Can't create enum object!"),
     OLESTR("UnpackAutoConditions. Can't initialize the enum object"),
     OLESTR("UnpackAutoConditions. QI failed on enum object")},
};

constexpr ConditionListTexts kVersion2Texts{
    OLESTR("UnpackAutoConditions2. NULL VARIANT"),
    OLESTR("UnpackAutoConditions2. Non-BSTR argument."),
    OLESTR("UnpackAutoCondition2. Could not parse string: %s"),
    OLESTR("UnpackAutoConditions2. Cannot parse overhead data: %s"),
    {OLESTR(""), OLESTR("UnpackAutoConditons2. Could not parse element: %s"),
     OLESTR("UnpackAutoConditions2. Can't create enum object!"),
     OLESTR("UnpackAutoConditions2. Can't initialize the enum object"),
     OLESTR("UnpackAutoConditions2. QI failed on enum object")},
};

// One element as sent: a name of 1 to 10 characters, a signed field and an
// unsigned one.
struct ConditionElement {
    OleStringView name;
    LONG second = 0;
    ULONG third = 0;
};

// "a;0;0": no element that scans is shorter.
constexpr ListShape kConditionList{.shortestElement = 5};

// Decodes the list after the checks of the VARIANT and the out-pointers;
// fill(record, element) maps one element into its record.
template <class Traits, class Fill>
HRESULT DecodeConditionList(Reply& reply, const ConditionListTexts& texts, LONG* change,
                            typename Traits::Interface** conditions, Fill fill) {
    const size_t marker = reply.Find(OLESTR("-auto_ch"));
    if (marker == OleStringView::npos) {
        return reply.FailWith(E_FAIL, texts.noList, reply.Text());
    }
    const OleStringView list = reply.Text().substr(marker);
    LONG flag = 0;
    LONG count = 0;
    int32_t elementsAt = 0;
    if (text::Scan<OLESTR("-auto_ch %d -noelts %d\t%n")>(list, &flag, &count, &elementsAt) != 2) {
        return reply.FailWith(E_FAIL, texts.header, list);
    }
    *change = flag;
    return DecodeList<Traits>(
        reply, texts.list, kConditionList, count, list.substr(static_cast<size_t>(elementsAt)),
        [&](OleStringView rest, typename Traits::Element& record) {
            OLECHAR name[11];
            ConditionElement element;
            int32_t consumed = 0;
            if (text::Scan<OLESTR("%10[^;];%d;%lu\t%n")>(rest, name, &element.second, &element.third, &consumed) !=
                3) {
                return ElementRead::Mismatch();
            }
            element.name = name;
            fill(record, element);
            return ElementRead::Read(static_cast<size_t>(consumed));
        },
        conditions);
}

// Version 1 knows only the first three kinds of condition.
TavAutoConditionType Version1Condition(OleStringView name) {
    return FindWord<TavAutoConditionType>(name, {{OLESTR("Blk"), AutoConditionType_BlockedSignals},
                                                        {OLESTR("Deact"), AutoConditionType_DeactivatedTasks},
                                                        {OLESTR("CallChn"), AutoConditionType_CallChain}})
        .value_or(TavAutoConditionType{});
}

TavAutoConditionType Version2Condition(OleStringView name) {
    return FindWord<TavAutoConditionType>(name, {{OLESTR("Blk"), AutoConditionType_BlockedSignals},
                                                        {OLESTR("Deact"), AutoConditionType_DeactivatedTasks},
                                                        {OLESTR("CallChn"), AutoConditionType_CallChain},
                                                        {OLESTR("SpeedOvr"), AutoConditionType_SpeedOverride},
                                                        {OLESTR("RunMode"), AutoConditionType_RunMode},
                                                        {OLESTR("StartExc"), AutoConditionType_StartExecute},
                                                        {OLESTR("KestoSpy"), AutoConditionType_KestoSpy},
                                                        {OLESTR("Eio"), AutoConditionType_Eio}})
        .value_or(TavAutoConditionType{});
}

}  // namespace

HRESULT ControllerObject::UnpackAutoConditions(VARIANT* pVar, LONG* pAutoChange, IEnumAutoCondition** ppenum) {
    const ConditionListTexts& texts = kVersion1Texts;
    return Decode(pVar)
        .Initialised()
        .NotNull(texts.nullVariant)
        .OutPointer(pAutoChange, OLESTR(""))
        .OutPointer(ppenum, OLESTR(""))
        .Clear(ppenum)
        .IsBstr(texts.nonBstr)
        .Then([&](Reply& reply) {
            return DecodeConditionList<AutoConditionTraits>(
                reply, texts, pAutoChange, ppenum, [](TavAutoCondition& record, const ConditionElement& element) {
                    record.Condition = Version1Condition(element.name);
                    record.KeepIsAllowed = element.second;
                    record.ConditionID = element.third;
                });
        });
}

HRESULT UnpackAutoConditions2(ControllerObject& object, VARIANT* data, LONG* change, IEnumAutoCondition2** conditions,
                              ULONG* cycle) {
    const ConditionListTexts& texts = kVersion2Texts;
    return object.Decode(data)
        .Initialised()
        .NotNull(texts.nullVariant)
        .OutPointer(change, OLESTR(""))
        .OutPointer(conditions, OLESTR(""))
        .Clear(conditions)
        .IsBstr(texts.nonBstr)
        .Then([&](Reply& reply) {
            return DecodeConditionList<AutoCondition2Traits>(
                reply, texts, change, conditions, [cycle](TavAutoCondition2& record, const ConditionElement& element) {
                    record.Condition = Version2Condition(element.name);
                    record.Configuration =
                        element.second != 0 ? TavAutoConditionConfiguration_Reset : TavAutoConditionConfiguration_Keep;
                    // The run mode's cycle rides on its identifier field.
                    if (cycle != nullptr && element.name == OLESTR("RunMode")) {
                        *cycle = element.third;
                    }
                });
        });
}

}  // namespace tav
