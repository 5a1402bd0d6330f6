// What identifies a controller: its name, its controller identifier and the
// GUID of its system.
#include "core/controller_object.h"
#include "core/text/format.h"
#include "operations/controller/latin1.h"

namespace tav {
namespace {

// The longest name or identifier the controller keeps.
constexpr size_t kLongestIdentity = 256;

// "{xxxxxxxx-xxxx-xxxx-xxxx-xxxxxxxxxxxx}"
constexpr size_t kBracedGuidLength = 38;

}  // namespace

HRESULT ControllerObject::SetControllerName(TavInParams* rip, BSTR name) {
    const OleStringView text = ViewOf(name);
    return Command(rip)
        .ValidParams(OLESTR("SetControllerName: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(text.size() <= kLongestIdentity, E_INVALIDARG,
                 OLESTR("SetControllerName invalid argument"))
        .Require(IsLatin1(text), kTextNotLatin1, OLESTR(""))
        .Set(OLESTR("CtrlName"), text::Format(OLESTR("-Name \"%s\""), text))
        .StatusOnly();
}

HRESULT ControllerObject::GetControllerName(TavInParams* rip, BSTR* name) {
    return Command(rip)
        .ValidParams(OLESTR("GetControllerName: Invalid TavInParams"))
        .OutPointer(name, OLESTR("GetControllerName: Invalid out-pointer"))
        .Initialised(OLESTR("GetControllerName. TavController used before Initialized"))
        .Get(OLESTR("CtrlName"))
        .Decode([&](VARIANT* reply) { return UnpackControllerName(reply, name); });
}

HRESULT ControllerObject::UnpackControllerName(VARIANT* data, BSTR* name) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackControllerName. NULL data-variant"))
        .OutPointer(name, OLESTR(""))
        .Clear(name)
        .IsBstr(OLESTR("UnpackControllerName. Invalid argument."))
        .QuotedString<OLESTR("-Name \"%256[^\"]")>(OLESTR("-Name \"\""), name,
                      OLESTR("UnpackControllerName failed."));
}

HRESULT ControllerObject::SetControllerId(TavInParams* rip, BSTR id) {
    const OleStringView text = ViewOf(id);
    // The controller takes a missing identifier under another key.
    const OleString args = id == nullptr ? OleString(OLESTR("-Id \"\""))
                                         : text::Format(OLESTR("-ctrlId \"%s\""), text);
    return Command(rip)
        .ValidParams(OLESTR("SetControllerId: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(text.size() <= kLongestIdentity, E_INVALIDARG,
                 OLESTR("SetControllerId invalid argument"))
        .Require(IsLatin1(text), kTextNotLatin1, OLESTR(""))
        .Set(OLESTR("CtrlID"), args)
        .StatusOnly();
}

HRESULT ControllerObject::GetControllerID(TavInParams* rip, BSTR* id) {
    return Command(rip)
        .ValidParams(OLESTR("GetControllerID: Invalid TavInParams"))
        .OutPointer(id, OLESTR("GetControllerID: Invalid out-pointer"))
        .Initialised(OLESTR("GetControllerID. TavController used before Initialized"))
        .Get(OLESTR("CtrlID"))
        .Decode([&](VARIANT* reply) { return UnpackControllerID(reply, id); });
}

HRESULT ControllerObject::UnpackControllerID(VARIANT* data, BSTR* id) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackControllerID. NULL data-variant"))
        .OutPointer(id, OLESTR(""))
        .Clear(id)
        .IsBstr(OLESTR("UnpackControllerID. Non-BSTR VARIANT."))
        .QuotedString<OLESTR("-ID \"%256[^\"]")>(OLESTR("-ID \"\""), id,
                      OLESTR("UnpackControllerID failed."));
}

HRESULT ControllerObject::GetSystemID(TavInParams* rip, BSTR* guid) {
    return Command(rip)
        .ValidParams(OLESTR("GetSystemID: Invalid TavInParams"))
        .OutPointer(guid, OLESTR("GetSystemID: Invalid out-pointer"))
        .Initialised(OLESTR("GetSystemID. TavController used before Initialized"))
        .Get(OLESTR("GUID"))
        .Decode([&](VARIANT* reply) { return UnpackSystemID(reply, guid); });
}

HRESULT ControllerObject::UnpackSystemID(VARIANT* data, BSTR* guid) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSystemID. NULL data-variant"))
        .OutPointer(guid, OLESTR(""))
        .Clear(guid)
        .IsBstr(OLESTR("UnpackSystemID. Non-BSTR variant."))
        .Then([&](Reply& reply) {
            // The GUID may stand anywhere in the reply; the first braces hold it.
            const OleStringView text = reply.Text();
            const size_t open = text.find(OLESTR("{"));
            if (open == OleStringView::npos) {
                return reply.Fail(E_FAIL, OLESTR("UnpackSystemID - Bad GUID format"));
            }
            const size_t close = text.find(OLESTR("}"), open + 1);
            if (close == OleStringView::npos) {
                return reply.Fail(E_FAIL, OLESTR("UnpackSystemID - Bad GUID format"));
            }
            const OleStringView braced = text.substr(open, close - open + 1);
            if (braced.size() != kBracedGuidLength) {
                return reply.Fail(E_FAIL, OLESTR("UnpackSystemID - Bad GUID format"));
            }
            if (FAILED(reply.Allocate(braced, guid))) {
                return reply.Result();
            }
            GUID parsed;
            if (FAILED(CLSIDFromString(*guid, &parsed))) {
                SysFreeString(*guid);
                *guid = nullptr;
                return reply.Fail(E_FAIL, OLESTR("UnpackSystemID - Invalid GUID"));
            }
            return S_OK;
        });
}

}  // namespace tav
