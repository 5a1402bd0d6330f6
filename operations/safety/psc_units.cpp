// The positional safety controller's units and their status, as an
// enumerator. The list reads "-noelts <count>", white space, then per unit
// "<id>;<status>;<call status>" (the HRESULT in signed decimal) and white
// space, as the storage-device lists do.
#include "core/controller_object.h"
#include "core/list_decoder.h"

namespace tav {
namespace {

constexpr ListTexts kUnitListTexts{OLESTR(""), OLESTR("UnpackPSCUnitStatus. Could not parse out element: %s"),
                                   OLESTR("UnpackPSCUnitStatus. Can't create enum object!"),
                                   OLESTR("UnpackPSCUnitStatus. Can't initialize the enum object"),
                                   OLESTR("UnpackPSCUnitStatus. QI failed on enum object")};

// "0;0;0": no unit that reads is shorter.
constexpr ListShape kUnitList{.order = ListOrder::EnumeratorFirst, .shortestElement = 5, .sixteenBitCounter = true};

}  // namespace

HRESULT ControllerObject::GetPSCUnitStatus(TavInParams* rip, TavRetrievalParams* retrieval, IEnumTavPSCUnits** units) {
    return Command(rip)
        .ValidParams(OLESTR(""))
        .Initialised(OLESTR("Helper used before initialized."))
        .OutPointers(OLESTR(""), retrieval, units)
        .Clear(units)
        .Require([&] { return retrieval->noOfElts == kRetrieveAll; }, E_INVALIDARG,
                 OLESTR("GetPSCUnitStatus - Only the RetrieveAll retrieval mode is supported."))
        .Get(OLESTR("PSCUnitStatus"))
        .Decode([&](VARIANT* reply) { return UnpackPSCUnitStatus(reply, retrieval, units); });
}

HRESULT ControllerObject::UnpackPSCUnitStatus(VARIANT* data, TavRetrievalParams* retrieval, IEnumTavPSCUnits** units) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackPSCUnitStatus. NULL VARIANT"))
        .OutPointer(retrieval, OLESTR(""))
        .OutPointer(units, OLESTR(""))
        .Clear(units)
        .IsBstr(OLESTR("UnpackPSCUnitStatus. Non-BSTR VARIANT"))
        .Then([&](Reply& reply) {
            const OleStringView text = reply.Text();
            LONG count = 0;
            std::int32_t consumed = 0;
            if (text::Scan<OLESTR("-noelts %ld\t%n")>(text, &count, &consumed) != 1) {
                return reply.FailWith(E_FAIL, OLESTR("UnpackPSCUnitStatus. Can not parse data: %s"), text);
            }
            const HRESULT hr = DecodeList<PscUnitTraits>(
                reply, kUnitListTexts, kUnitList, count, text.substr(static_cast<std::size_t>(consumed)),
                [](OleStringView rest, TavPSCUnit& unit) {
                    std::int32_t used = 0;
                    if (text::Scan<OLESTR("%lu;%lu;%ld\t%n")>(rest, &unit.PSCUnitID, &unit.PSCStatus,
                                                              &unit.PSCCallStatus, &used) != 3) {
                        return ElementRead::Mismatch();
                    }
                    return ElementRead::Read(static_cast<std::size_t>(used));
                },
                units);
            if (SUCCEEDED(hr)) {
                SetRetrieved(retrieval, count);
            }
            return hr;
        });
}

}  // namespace tav
