// The controller's message slots as seen from outside: the largest message
// and package sizes, every slot, and a slot's name and id.
//
// A slot list reads "-noelts,all,mark,cc <count>,<all>,<mark>,<cursor>",
// white space, then per slot "<name>;<id>;<queue size>;<largest message
// size>;<remote accessible>" and white space. Names hold at most 38
// characters.
#include "core/controller_object.h"
#include "core/list_decoder.h"
#include "core/text/format.h"

namespace tav {
namespace {

constexpr LONG kNoCommandType = 0;

constexpr ListTexts kSlotListTexts{OLESTR(""), OLESTR("UnpackSlotInformation - Could not parse out element: %s"),
                                   OLESTR("UnpackSlotInformation. Can't create enum object!"),
                                   OLESTR("UnpackSlotInformation. Can't initialize the enum object."),
                                   OLESTR("UnpackSlotInformation. QI failed on enum object.")};

// "a;0;0;0;0": no slot that reads is shorter.
constexpr ListShape kSlotList{.shortestElement = 9};

struct MaxProperties {
    LONG messageSize = 0;
    LONG packageSize = 0;
    LONG bodySize = 0;
};

// The system's own name for the decoder, kept.
HRESULT UnpackIPCMaxPoperties(ControllerObject& object, VARIANT* data, LONG* messageSize, LONG* packageSize,
                              LONG* bodySize) {
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackIPCMaxPoperties. NULL data pointer"))
        .OutPointers(OLESTR("UnpackIPCMaxPoperties. Invalid out pointer"), messageSize, packageSize, bodySize)
        .IsBstr(OLESTR("UnpackIPCMaxPoperties. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-MaxMsgSize %d -MaxPackageSize %d -MaxBodySize %d")>(
            OLESTR("UnpackIPCMaxPoperties failed."), messageSize, packageSize, bodySize);
}

HRESULT GetIPCMaxProperties(ControllerObject& object, TavInParams* rip, LONG* messageSize, LONG* packageSize,
                            LONG* bodySize, LONG commandType) {
    return object.Command(rip)
        .ValidParams(OLESTR("TavController::GetIPCMaxPoperties. Invalid argument."))
        .OutPointers(OLESTR("TavController::GetIPCMaxPoperties. Invalid argument."), messageSize, packageSize,
                     bodySize)
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("IPCMaxProperties"), text::Format(OLESTR("-CmdType %d"), commandType))
        .Decode([&](VARIANT* reply) {
            return UnpackIPCMaxPoperties(object, reply, messageSize, packageSize, bodySize);
        });
}

HRESULT UnpackSlotName(ControllerObject& object, VARIANT* data, BSTR* name) {
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSlotName. NULL data pointer"))
        .OutPointers(OLESTR("UnpackSlotName. Invalid out pointer"), name)
        .IsBstr(OLESTR("UnpackSlotName. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-SlotName %38s")>(OLESTR("UnpackSlotName failed."), name);
}

HRESULT UnpackSlotId(ControllerObject& object, VARIANT* data, short* slotId) {
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSlotId. NULL data pointer"))
        .OutPointer(slotId, OLESTR("UnpackSlotId. Invalid out pointer"))
        .IsBstr(OLESTR("UnpackSlotId. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-SlotId %d")>(OLESTR("UnpackSlotId failed."), slotId);
}

}  // namespace

// The message size handed out is the largest body, not the largest message.
HRESULT ControllerObject::GetMaxMessageSize(TavInParams* rip, LONG* maxMessageSize) {
    MaxProperties sizes;
    return GetIPCMaxProperties(*this, rip, &sizes.messageSize, &sizes.packageSize, maxMessageSize, kNoCommandType);
}

HRESULT ControllerObject::GetMaxPackageSize(TavInParams* rip, LONG* packageSize) {
    MaxProperties sizes;
    return GetIPCMaxProperties(*this, rip, &sizes.messageSize, packageSize, &sizes.bodySize, kNoCommandType);
}

HRESULT ControllerObject::GetSlotInformation(TavInParams* rip, TavRetrievalParams* retrieval, IEnumSlots** slots) {
    // Both misspellings of the first text are clients' own.
    return Command(rip)
        .ValidParams(OLESTR("GetSlotInformation: Invalid TavInParams"))
        .OutPointer(slots, OLESTR("GetSlotInformation: Invalid pointer to interface IEnumSlots"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .RetrievalParams(retrieval, kRetrieveAllSlots, OLESTR("GetSlotInformations: Invalid TavRetreivalParams"),
                         OLESTR("GetSlotInformation: Invalid TavRetrievalParams, only RetrieveAll supported"))
        .Get(OLESTR("SlotInfo"))
        .Decode([&](VARIANT* reply) { return UnpackSlotInformation(reply, retrieval, slots); });
}

HRESULT ControllerObject::UnpackSlotInformation(VARIANT* data, TavRetrievalParams* retrieval, IEnumSlots** slots) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSlotInformation. NULL VARIANT"))
        .OutPointer(retrieval, OLESTR(""))
        .OutPointer(slots, OLESTR(""))
        .Clear(slots)
        .IsBstr(OLESTR("UnpackSlotInformation. Non-BSTR VARIANT"))
        .Then([&](Reply& reply) {
            LONG count = 0;
            LONG all = 0;
            ULONG mark = 0;
            ULONG cursor = 0;
            std::int32_t consumed = 0;
            const OleStringView text = reply.Text();
            if (text::Scan<OLESTR("-noelts,all,mark,cc %ld,%ld,%lu,%lu\t%n")>(text, &count, &all, &mark, &cursor,
                                                                              &consumed) != 4) {
                return reply.Fail(E_FAIL, OLESTR("UnpackSlotInformation - Could not parse out retrieval parameters"));
            }
            const HRESULT hr = DecodeList<SlotTraits>(
                reply, kSlotListTexts, kSlotList, count, text.substr(static_cast<std::size_t>(consumed)),
                [&](OleStringView rest, TavIPCSlot& slot) {
                    OleStringView name;
                    LONG id = 0;
                    LONG queueSize = 0;
                    std::int32_t used = 0;
                    if (text::Scan<OLESTR("%38[^;];%d;%d;%ld;%ld\t%n")>(rest, text::FieldView{&name}, &id,
                                                                          &queueSize, &slot.maxMessageSize,
                                                                          &slot.remote_accessible, &used) != 5) {
                        return ElementRead::Mismatch();
                    }
                    slot.slotId = static_cast<short>(id);
                    slot.queueSize = static_cast<short>(queueSize);
                    if (FAILED(reply.Allocate(name, &slot.slotName))) {
                        return ElementRead{reply.Result(), 0};
                    }
                    return ElementRead::Read(static_cast<std::size_t>(used));
                },
                slots);
            if (SUCCEEDED(hr)) {
                retrieval->noOfElts = count;
                retrieval->bLast = all;
                retrieval->mark = mark;
                retrieval->cursor.cursor[0] = cursor;
            }
            return hr;
        });
}

HRESULT ControllerObject::GetSlotName(TavInParams* rip, short slotId, BSTR* name) {
    return Command(rip)
        .ValidParams(OLESTR("GetSlotName: Invalid TavInParams"))
        .OutPointer(name, OLESTR("GetSlotName: Invalid pointer"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("SlotName"), text::Format(OLESTR("-SlotId %d"), slotId))
        .Decode([&](VARIANT* reply) { return UnpackSlotName(*this, reply, name); });
}

HRESULT ControllerObject::GetSlotId(TavInParams* rip, BSTR name, short* slotId) {
    return Command(rip)
        .ValidParams(OLESTR("GetSlotId: Invalid TavInParams"))
        .OutPointer(slotId, OLESTR("GetSlotId: Invalid pointer"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("SlotId"), text::Format(OLESTR("-Name %.38s"), ViewOf(name)))
        .Decode([&](VARIANT* reply) { return UnpackSlotId(*this, reply, slotId); });
}

}  // namespace tav
