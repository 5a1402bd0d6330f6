// The LAN adaptor's method, its configured addresses and what it uses now.
#include <algorithm>
#include "core/controller_object.h"
#include "core/text/format.h"
#include "operations/network/lan_fields.h"

namespace tav {
namespace {

using network::AddressField;

// Four numbers of at most 255 each, read as the C library reads "%lu":
// blanks before each number skipped, anything after the fourth ignored, a
// minus sign wrapping to a large value. Nothing else is checked.
bool IsAddress(BSTR text) {
    ULONG parts[4] = {};
    if (text::Scan<OLESTR("%lu.%lu.%lu.%lu")>(ViewOf(text), &parts[0], &parts[1], &parts[2], &parts[3]) != 4) {
        return false;
    }
    return std::all_of(std::begin(parts), std::end(parts), [](ULONG part) { return part <= 255; });
}

struct AddressTexts {
    const OLECHAR* missing;
    const OLECHAR* address;
    const OLECHAR* mask;
    const OLECHAR* gateway;
};

// The address checks of both setters, in their order: the emptiness of
// address and mask first, then each value; an empty gateway is allowed.
Call& CheckAddresses(Call& call, BSTR address, BSTR mask, BSTR gateway, const AddressTexts& texts) {
    return call.Require(SysStringLen(address) > 0 && SysStringLen(mask) > 0, E_INVALIDARG, texts.missing)
        .Require([&] { return IsAddress(address); }, E_INVALIDARG, texts.address)
        .Require([&] { return IsAddress(mask); }, E_INVALIDARG, texts.mask)
        .Require([&] { return SysStringLen(gateway) == 0 || IsAddress(gateway); }, E_INVALIDARG, texts.gateway);
}

// Values go out as given, without quotes; an empty gateway as two quotes.
OleString AddressArguments(BSTR address, BSTR mask, BSTR gateway) {
    return text::Format(OLESTR("-Address %s -Submask %s -Gateway %s"), ViewOf(address), ViewOf(mask),
                        SysStringLen(gateway) > 0 ? ViewOf(gateway) : OleStringView(OLESTR("\"\"")));
}

}  // namespace

HRESULT ControllerObject::SetLANAdaptorIPMethod(TavInParams* rip, IPMethod method) {
    const OLECHAR* word = WordOf(method, network::kMethodWords);
    return Command(rip)
        .ValidParams(OLESTR("SetLANAdaptorIPMethod: Invalid TavInParams"))
        .Initialised(OLESTR("SetLANAdaptorIPMethod. TavController used before Initialized"))
        .Require(word != nullptr, E_INVALIDARG, OLESTR("SetLANAdaptorIPMethod. Unexpected method type"))
        .Set(OLESTR("LANAdaptorMethod"), text::Format(OLESTR("-Method %s"), ViewOf(word)))
        .StatusOnly();
}

HRESULT ControllerObject::GetLANAdaptorIPMethod(TavInParams* rip, IPMethod* method) {
    return Command(rip)
        .ValidParams(OLESTR("GetLANAdaptorIPMethod: Invalid TavInParams"))
        .OutPointer(method, OLESTR("GetLANAdaptorIPMethod: Invalid out-pointer"))
        .Initialised(OLESTR("GetLANAdaptorIPMethod. TavController used before Initialized"))
        .Get(OLESTR("LANAdaptorMethod"))
        .Decode([&](VARIANT* reply) { return UnpackLANAdaptorIPMethod(reply, method); });
}

HRESULT ControllerObject::UnpackLANAdaptorIPMethod(VARIANT* data, IPMethod* method) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackLANAdaptorIPMethod. NULL data pointer"))
        .OutPointers(OLESTR("UnpackLANAdaptorIPMethod. Invalid out pointer"), method)
        .IsBstr(OLESTR("UnpackLANAdaptorIPMethod. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-Method %9s")>(OLESTR("UnpackLANAdaptorIPMethod failed."), network::MethodField(method));
}

HRESULT ControllerObject::SetLANAdaptorIPConfig(TavInParams* rip, BSTR address, BSTR mask, BSTR gateway) {
    Call call = Command(rip);
    static_cast<void>(call.ValidParams(OLESTR("SetLANAdaptorIPConfig: Invalid TavInParams")));
    return CheckAddresses(call, address, mask, gateway,
                          {OLESTR("SetLANAdaptorIPConfig: Invalid argument"),
                           OLESTR("SetLANAdaptorIPConfig: Invalid IP-address."),
                           OLESTR("SetLANAdaptorIPConfig: Invalid subnetmask."),
                           OLESTR("SetLANAdaptorIPConfig: Invalid gateway address.")})
        .Initialised(OLESTR("SetLANAdaptorIPConfig used before Initialized"))
        .Send(Verb::Set, OLESTR("LANAdaptorIP"), [&] { return AddressArguments(address, mask, gateway); })
        .StatusOnly();
}

HRESULT ControllerObject::GetLANAdaptorIPConfig(TavInParams* rip, BSTR* address, BSTR* mask, BSTR* gateway) {
    return Command(rip)
        .ValidParams(OLESTR("GetLANAdaptorIPConfig: Invalid TavInParams"))
        .OutPointers(OLESTR("GetLANAdaptorIPConfig: Invalid out-pointer"), address, mask, gateway)
        .Initialised(OLESTR("GetLANAdaptorIPConfig. TavController used before Initialized"))
        .Get(OLESTR("LANAdaptorIP"))
        .Decode([&](VARIANT* reply) { return UnpackLANAdaptorIPConfig(reply, address, mask, gateway); });
}

HRESULT ControllerObject::UnpackLANAdaptorIPConfig(VARIANT* data, BSTR* address, BSTR* mask, BSTR* gateway) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackLANAdaptorIPConfig. NULL data pointer"))
        .OutPointers(OLESTR("UnpackLANAdaptorIPConfig. Invalid out pointer"), address, mask, gateway)
        .IsBstr(OLESTR("UnpackLANAdaptorIPConfig. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-Address %s -Submask %s -Gateway %s")>(OLESTR("UnpackLANAdaptorIPConfig failed."),
                                                               AddressField{address}, AddressField{mask},
                                                               AddressField{gateway});
}

HRESULT ControllerObject::GetLANAdaptorInfo(TavInParams* rip, BSTR* address, BSTR* mask, BSTR* gateway, BSTR* mac) {
    return Command(rip)
        .ValidParams(OLESTR("GetLANAdaptorInfo: Invalid TavInParams"))
        .OutPointers(OLESTR("GetLANAdaptorInfo: Invalid out-pointer"), address, mask, gateway, mac)
        .Initialised(OLESTR("GetLANAdaptorInfo. TavController used before Initialized"))
        .Get(OLESTR("LANAdaptorInfo"))
        .Decode([&](VARIANT* reply) { return UnpackLANAdaptorInfo(reply, address, mask, gateway, mac); });
}

HRESULT ControllerObject::UnpackLANAdaptorInfo(VARIANT* data, BSTR* address, BSTR* mask, BSTR* gateway, BSTR* mac) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackLANAdaptorInfo. NULL data pointer"))
        .OutPointers(OLESTR("UnpackLANAdaptorInfo. Invalid out pointer"), address, mask, gateway, mac)
        .IsBstr(OLESTR("UnpackLANAdaptorInfo. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-Address %s -Submask %s -Gateway %s -Mac %s")>(
            OLESTR("UnpackLANAdaptorInfo failed."), AddressField{address}, AddressField{mask}, AddressField{gateway},
            network::MacField{mac});
}

// NONE ignores the addresses altogether; any other method, known or not,
// must carry good ones before the method itself is looked at. The receiving
// side relies on the missing blank before "-Address".
HRESULT ControllerObject::SetLANAdaptorIP(TavInParams* rip, IPMethod method, BSTR address, BSTR mask, BSTR gateway) {
    const OLECHAR* word = WordOf(method, network::kMethodWords);
    Call call = Command(rip);
    static_cast<void>(call.ValidParams(OLESTR("SetLANAdaptorIP: Invalid TavInParams")));
    if (method != NONE) {
        static_cast<void>(CheckAddresses(call, address, mask, gateway,
                                         {OLESTR("SetLANAdaptorIP: Invalid argument"),
                                          OLESTR("SetLANAdaptorIP: Invalid IP-address."),
                                          OLESTR("SetLANAdaptorIP: Invalid subnetmask."),
                                          OLESTR("SetLANAdaptorIP: Invalid gateway address.")}));
    }
    return call.Initialised(OLESTR("SetLANAdaptorIP. TavController used before Initialized"))
        .Require(word != nullptr, E_INVALIDARG, OLESTR("SetLANAdaptorIP. Unexpected method type"))
        .Send(Verb::Set, OLESTR("LANAdaptor"),
              [&] {
                  return method == NONE ? text::Format(OLESTR("-Method %s-Address  -Submask  -Gateway \"\""), ViewOf(word))
                                        : text::Format(OLESTR("-Method %s"), ViewOf(word)) +
                                              AddressArguments(address, mask, gateway);
              })
        .StatusOnly();
}

}  // namespace tav
