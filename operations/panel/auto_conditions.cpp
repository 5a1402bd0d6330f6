// The auto condition lists: what the operator must answer, Reset or Keep,
// before a pending change to automatic mode completes. Version 1 is the
// public decoder (also for the "AutoCondSub" event); version 2 serves the
// "AUTO_CH" mode reply only.
//
// A list reads "-auto_ch <flag> -noelts <count>", a TAB, then per element
// "<name>;<second>;<third>" and a TAB; text before "-auto_ch" is ignored.
#include "operations/panel/auto_conditions.h"

#include <algorithm>
#include <cstdint>
#include <memory>

#include "core/controller_object.h"
#include "core/enumerators.h"
#include "core/text/scan.h"
#include "operations/panel/reply_words.h"

namespace tav {
namespace {

struct ListTexts {
    const OLECHAR* nullVariant;
    const OLECHAR* nonBstr;
    const OLECHAR* noList;
    const OLECHAR* header;
    const OLECHAR* element;
    const OLECHAR* create;
    const OLECHAR* init;
    const OLECHAR* query;
};

// Kept as clients know them, misspellings and all.
constexpr ListTexts kVersion1Texts{
    OLESTR("UnpackAutoConditions. NULL VARIANT"),
    OLESTR("UnpackAutoConditions. Non-BSTR argument."),
    OLESTR("UnpackAutoCondition. Could not parse string: %s"),
    OLESTR("UnpackAutoConditions. Cannot parse overhead data: %s"),
    OLESTR("UnpackAutoConditons. Could not parse element: %s"),
    OLESTR("UnpackAutoConditions. Can't create enum object!"),
    OLESTR("UnpackAutoConditions. Can't initialize the enum object"),
    OLESTR("UnpackAutoConditions. QI failed on enum object"),
};

constexpr ListTexts kVersion2Texts{
    OLESTR("UnpackAutoConditions2. NULL VARIANT"),
    OLESTR("UnpackAutoConditions2. Non-BSTR argument."),
    OLESTR("UnpackAutoCondition2. Could not parse string: %s"),
    OLESTR("UnpackAutoConditions2. Cannot parse overhead data: %s"),
    OLESTR("UnpackAutoConditons2. Could not parse element: %s"),
    OLESTR("UnpackAutoConditions2. Can't create enum object!"),
    OLESTR("UnpackAutoConditions2. Can't initialize the enum object"),
    OLESTR("UnpackAutoConditions2. QI failed on enum object"),
};

// One element as sent: a name of 1 to 10 characters, a signed field and an
// unsigned one.
struct ConditionElement {
    OleStringView name;
    LONG second = 0;
    ULONG third = 0;
};

constexpr size_t kNameRoom = 11;  // "%10[^;]" and its terminator
// "a;0;0": no element that scans is shorter.
constexpr size_t kShortestElement = 5;

struct ArrayFree {
    void operator()(void* block) const noexcept { TavMemFree(block); }
};
template <class Element>
using OwnedArray = std::unique_ptr<Element, ArrayFree>;

// Record sizes are counted in 32 bits, as on the controller's pendant: a count
// whose size does not fit fails as an allocation would, never wraps.
template <class Element>
bool SizeFits32Bits(LONG count) {
    return count <= 0 || static_cast<uint64_t>(count) * sizeof(Element) <= UINT32_MAX;
}

// Decodes the list after the checks of the VARIANT and the out-pointers;
// fill(record, element) maps one element into its record.
template <class Traits, class Fill>
HRESULT DecodeConditionList(Reply& reply, const ListTexts& texts, LONG* change, typename Traits::Interface** conditions,
                            Fill fill) {
    using Element = typename Traits::Element;
    const OleStringView text = panel::ReplyText(reply);
    const size_t marker = text.find(OLESTR("-auto_ch"));
    if (marker == OleStringView::npos) {
        return reply.FailWith(E_FAIL, texts.noList, text);
    }
    const OleStringView list = text.substr(marker);
    LONG flag = 0;
    LONG count = 0;
    int32_t elementsAt = 0;
    if (text::Scan(list, OLESTR("-auto_ch %d -noelts %d\t%n"), &flag, &count, &elementsAt) != 2) {
        return reply.FailWith(E_FAIL, texts.header, list);
    }
    *change = flag;
    if (!SizeFits32Bits<Element>(count)) {
        return reply.Fail(E_OUTOFMEMORY, OLESTR(""));
    }
    const size_t wanted = count > 0 ? static_cast<size_t>(count) : 0;
    OleStringView rest = list.substr(static_cast<size_t>(elementsAt));
    // A count that the text cannot hold fails at its first missing element,
    // so only the records that can be filled are allocated: a bogus count
    // costs no more memory than the reply itself.
    const size_t room = std::min(wanted, rest.size() / kShortestElement);
    OwnedArray<Element> records(AllocateArray<Element>(room));
    if (!records) {
        return reply.Fail(E_OUTOFMEMORY, OLESTR(""));
    }
    for (size_t i = 0; i < wanted; ++i) {
        OLECHAR name[kNameRoom] = {};
        ConditionElement element;
        int32_t consumed = 0;
        if (i >= room ||
            text::Scan(rest, OLESTR("%10[^;];%d;%lu\t%n"), name, &element.second, &element.third, &consumed) != 3) {
            return reply.FailWith(E_FAIL, texts.element, rest);
        }
        element.name = name;
        fill(records.get()[i], element);
        rest = rest.substr(static_cast<size_t>(consumed));
    }
    Element* begin = records.release();
    EnumStep failedStep{};
    const HRESULT hr =
        MakeEnumerator<Traits>(begin, begin + wanted, nullptr, EnumOwnership::Take, conditions, &failedStep);
    if (SUCCEEDED(hr)) {
        return S_OK;
    }
    switch (failedStep) {
    case EnumStep::Create:
        return reply.Fail(hr, texts.create);
    case EnumStep::Init:
        return reply.Fail(hr, texts.init);
    case EnumStep::Query:
        break;
    }
    return reply.Fail(hr, texts.query);
}

// Version 1 knows only the first three kinds of condition.
TavAutoConditionType Version1Condition(OleStringView name) {
    return panel::FindWord<TavAutoConditionType>(name, {{OLESTR("Blk"), AutoConditionType_BlockedSignals},
                                                        {OLESTR("Deact"), AutoConditionType_DeactivatedTasks},
                                                        {OLESTR("CallChn"), AutoConditionType_CallChain}})
        .value_or(TavAutoConditionType{});
}

TavAutoConditionType Version2Condition(OleStringView name) {
    return panel::FindWord<TavAutoConditionType>(name, {{OLESTR("Blk"), AutoConditionType_BlockedSignals},
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
    const ListTexts& texts = kVersion1Texts;
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
    const ListTexts& texts = kVersion2Texts;
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
