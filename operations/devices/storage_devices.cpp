// The storage devices the controller sees, as enumerators.
//
// A list reads "-noelts <count>", white space, then per device
// "<name>;<type>;<enabled>;<read-only>" (the second list adds ";<shown>")
// and white space. Names hold at most 30 characters, types 20.
#include "core/controller_object.h"
#include "core/list_decoder.h"

namespace tav {
namespace {

constexpr WordValue<TavStorageDeviceType> kDeviceTypeWords[] = {{OLESTR("Unknown"), StorageDeviceType_Unknown},
                                                                {OLESTR("Removable"), StorageDeviceType_Removable},
                                                                {OLESTR("Ramdisk"), StorageDeviceType_Ramdisk},
                                                                {OLESTR("Remote"), StorageDeviceType_Remote},
                                                                {OLESTR("Fixed"), StorageDeviceType_Fixed}};

struct DeviceListTexts {
    const OLECHAR* nullVariant;
    const OLECHAR* nonBstr;
    const OLECHAR* head;
    ListTexts list;
};

constexpr DeviceListTexts kDevicesTexts{
    OLESTR("UnpackStorageDevices. NULL VARIANT"),
    OLESTR("UnpackStorageDevices. Non-BSTR VARIANT"),
    OLESTR("UnpackStorageDevices. Can not parse data: %s"),
    {OLESTR(""), OLESTR("UnpackStorageDevices. Could not parse out element: %s"),
     OLESTR("UnpackStorageDevices. Can't create enum object!"),
     OLESTR("UnpackStorageDevices. Can't initialize the enum object"),
     OLESTR("UnpackStorageDevices. QI failed on enum object")},
};

constexpr DeviceListTexts kDevices2Texts{
    OLESTR("UnpackStorageDevices2. NULL VARIANT"),
    OLESTR("UnpackStorageDevices2. Non-BSTR VARIANT"),
    OLESTR("UnpackStorageDevices2. Can not parse data: %s"),
    {OLESTR(""), OLESTR("UnpackStorageDevices2. Could not parse out element: %s"),
     OLESTR("UnpackStorageDevices2. Can't create enum object!"),
     OLESTR("UnpackStorageDevices2. Can't initialize the enum object"),
     OLESTR("UnpackStorageDevices2. QI failed on enum object")},
};

// Reads one device into its record; the second list's record also has the
// shown flag.
ElementRead ReadDevice(Reply& reply, OleStringView rest, TavStorageDevice& device) {
    OLECHAR name[31];
    OLECHAR type[21];
    std::int32_t consumed = 0;
    if (text::Scan<OLESTR("%30[^;];%20[^;];%d;%d\t%n")>(rest, name, type, &device.bEnabled, &device.bReadOnly,
                                                         &consumed) != 4) {
        return ElementRead::Mismatch();
    }
    device.deviceType = WordOr(OleStringView(type), kDeviceTypeWords, StorageDeviceType_Unknown);
    if (FAILED(reply.Allocate(OleStringView(name), &device.deviceName))) {
        return {reply.Result(), 0};
    }
    return ElementRead::Read(static_cast<std::size_t>(consumed));
}

ElementRead ReadDevice(Reply& reply, OleStringView rest, TavStorageDevice2& device) {
    OLECHAR name[31];
    OLECHAR type[21];
    std::int32_t consumed = 0;
    if (text::Scan<OLESTR("%30[^;];%20[^;];%d;%d;%d\t%n")>(rest, name, type, &device.bEnabled, &device.bReadOnly,
                                                            &device.bShowDevice, &consumed) != 5) {
        return ElementRead::Mismatch();
    }
    device.deviceType = WordOr(OleStringView(type), kDeviceTypeWords, StorageDeviceType_Unknown);
    if (FAILED(reply.Allocate(OleStringView(name), &device.deviceName))) {
        return {reply.Result(), 0};
    }
    return ElementRead::Read(static_cast<std::size_t>(consumed));
}

// "a;b;0;0" (the second list: "a;b;0;0;0"): no device that reads is shorter.
template <class Traits>
constexpr ListShape kDeviceList{.order = ListOrder::EnumeratorFirst,
                                .shortestElement = std::is_same_v<Traits, StorageDeviceTraits> ? 7 : 9,
                                .sixteenBitCounter = true};

template <class Traits>
HRESULT DecodeDeviceList(Reply& reply, const DeviceListTexts& texts, TavRetrievalParams* retrieval,
                         typename Traits::Interface** devices) {
    const OleStringView text = reply.Text();
    LONG count = 0;
    std::int32_t consumed = 0;
    if (text::Scan<OLESTR("-noelts %ld\t%n")>(text, &count, &consumed) != 1) {
        return reply.FailWith(E_FAIL, texts.head, text);
    }
    const HRESULT hr = DecodeList<Traits>(
        reply, texts.list, kDeviceList<Traits>, count, text.substr(static_cast<std::size_t>(consumed)),
        [&](OleStringView rest, typename Traits::Element& device) { return ReadDevice(reply, rest, device); },
        devices);
    if (SUCCEEDED(hr)) {
        SetRetrieved(retrieval, count);
    }
    return hr;
}

}  // namespace

HRESULT ControllerObject::GetStorageDevices(TavInParams* rip, TavRetrievalParams* retrieval,
                                            IEnumStorageDevices** devices) {
    return Command(rip)
        .ValidParams(OLESTR(""))
        .Initialised(OLESTR("Helper used before initialized."))
        .OutPointers(OLESTR(""), retrieval, devices)
        .Clear(devices)
        .Require([&] { return retrieval->noOfElts == kRetrieveAll; }, E_INVALIDARG,
                 OLESTR("GetStorageDevice - Only the RetrieveAll retrieval mode is supported."))
        .Get(OLESTR("StorageDevice"))
        .Decode([&](VARIANT* reply) { return UnpackStorageDevices(reply, retrieval, devices); });
}

HRESULT ControllerObject::UnpackStorageDevices(VARIANT* data, TavRetrievalParams* retrieval,
                                               IEnumStorageDevices** devices) {
    return Decode(data)
        .Initialised()
        .NotNull(kDevicesTexts.nullVariant)
        .OutPointer(retrieval, OLESTR(""))
        .OutPointer(devices, OLESTR(""))
        .Clear(devices)
        .IsBstr(kDevicesTexts.nonBstr)
        .Then([&](Reply& reply) {
            return DecodeDeviceList<StorageDeviceTraits>(reply, kDevicesTexts, retrieval, devices);
        });
}

HRESULT ControllerObject::GetStorageDevices2(TavInParams* rip, TavRetrievalParams* retrieval,
                                             IEnumStorageDevices2** devices) {
    return Command(rip)
        .ValidParams(OLESTR(""))
        .Initialised(OLESTR("Helper used before initialized."))
        .OutPointers(OLESTR(""), retrieval, devices)
        .Clear(devices)
        .Require([&] { return retrieval->noOfElts == kRetrieveAll; }, E_INVALIDARG,
                 OLESTR("GetStorageDevice - Only the RetrieveAll retrieval mode is supported."))
        .Get(OLESTR("StorageDevice2"))
        .Decode([&](VARIANT* reply) { return UnpackStorageDevices2(reply, retrieval, devices); });
}

HRESULT ControllerObject::UnpackStorageDevices2(VARIANT* data, TavRetrievalParams* retrieval,
                                                IEnumStorageDevices2** devices) {
    return Decode(data)
        .Initialised()
        .NotNull(kDevices2Texts.nullVariant)
        .OutPointer(retrieval, OLESTR(""))
        .OutPointer(devices, OLESTR(""))
        .Clear(devices)
        .IsBstr(kDevices2Texts.nonBstr)
        .Then([&](Reply& reply) {
            return DecodeDeviceList<StorageDevice2Traits>(reply, kDevices2Texts, retrieval, devices);
        });
}

}  // namespace tav
