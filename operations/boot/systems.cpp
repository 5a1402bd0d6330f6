// The controller's installed systems: which runs, which starts next, the
// list of them all, removing one; the boot device and the boot image.
#include "core/controller_object.h"
#include "core/list_decoder.h"
#include "core/text/format.h"
#include "core/text/number.h"
#include "core/text/tokenize.h"

namespace tav {
namespace {

// The longest system name the controller takes.
constexpr std::size_t kLongestSystemName = 256;

// A name's length counts up to its first NUL.
bool ValidSystemName(BSTR name) {
    const std::size_t length = text::UpToNul(ViewOf(name)).size();
    return length > 0 && length <= kLongestSystemName;
}

constexpr ListTexts kSystemListTexts{OLESTR("UnpackSystemNameList. Out of memory"),
                                     OLESTR("UnpackSystemNameList. Unexpected number of elements."),
                                     OLESTR("UnpackSystemNameList. Can't create enum object!"),
                                     OLESTR("UnpackSystemNameList. Can't initialize the enum object."),
                                     OLESTR("UnpackSystemNameList. QI failed on enum object.")};

// The enumerator keeps copies of the names; the decoder frees its own.
constexpr ListShape kSystemList{.shortestElement = 1, .ownership = EnumOwnership::Copy};

}  // namespace

HRESULT ControllerObject::GetSystemName(TavInParams* rip, BSTR* name) {
    return Command(rip)
        .ValidParams(OLESTR("GetSystemName: Invalid TavInParams"))
        .OutPointer(name, OLESTR("GetSystemName: Invalid out-pointer"))
        .Initialised(OLESTR("GetSystemName. TavController used before Initialized"))
        .Get(OLESTR("SystemName"))
        .Decode([&](VARIANT* reply) { return UnpackSystemName(reply, name); });
}

// The name is what follows "-Name ", quotes and all, as it stands.
HRESULT ControllerObject::UnpackSystemName(VARIANT* data, BSTR* name) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSystemName. NULL data pointer"))
        .OutPointers(OLESTR("UnpackSystemName. Invalid out pointer"), name)
        .IsBstr(OLESTR("UnpackSystemName. Data-variant not of type VT_BSTR"))
        .AfterPrefix(OLESTR("-Name "), name, OLESTR("UnpackSystemName. Bad format."));
}

HRESULT ControllerObject::SelectSystem(TavInParams* rip, BSTR name) {
    return Command(rip)
        .ValidParams(OLESTR("SelectSystem: Invalid TavInParams"))
        .Require(ValidSystemName(name), E_INVALIDARG, OLESTR("SelectSystem: Invalid system-name"))
        .Initialised(OLESTR("SelectSystem. TavController used before Initialized"))
        .Set(OLESTR("SelectSystem"), text::Format(OLESTR("-Name \"%s\""), ViewOf(name)))
        .StatusOnly();
}

HRESULT ControllerObject::DeselectSystem(TavInParams* rip) {
    return Command(rip)
        .ValidParams(OLESTR("DeselectSystem: Invalid TavInParams"))
        .Initialised(OLESTR("DeselectSystem. TavController used before Initialized"))
        .Set(OLESTR("DeselectSystem"))
        .StatusOnly();
}

HRESULT ControllerObject::GetSelectedSystem(TavInParams* rip, BSTR* name) {
    return Command(rip)
        .ValidParams(OLESTR("GetSelectedSystem: Invalid TavInParams"))
        .OutPointer(name, OLESTR("GetSelectedSystem: Invalid out-pointer"))
        .Initialised(OLESTR("GetSelectedSystem. TavController used before Initialized"))
        .Get(OLESTR("SelectSystem"))
        .Decode([&](VARIANT* reply) { return UnpackSelectedSystem(reply, name); });
}

HRESULT ControllerObject::UnpackSelectedSystem(VARIANT* data, BSTR* name) { return UnpackSystemName(data, name); }

HRESULT ControllerObject::GetSystemNameList(TavInParams* rip, TavRetrievalParams* retrieval, ITavEnumBSTR** names) {
    return Command(rip)
        .ValidParams(OLESTR("GetSystemNameList: Invalid TavInParams"))
        .OutPointers(OLESTR("GetSystemNameList: Invalid out-pointer"), retrieval, names)
        .OutPointer(names, OLESTR("GetSystemNameList. Invalid pointer"))
        .Initialised(OLESTR("GetSystemNameList. TavController used before Initialized"))
        .Get(OLESTR("SystemList"))
        .Decode([&](VARIANT* reply) { return UnpackSystemNameList(reply, retrieval, names); });
}

// "-NoOfElements <count> -Names <name>,<name>,...": the names are the
// comma-separated tokens as a tokeniser gives them (no empty ones), exactly
// count of them.
HRESULT ControllerObject::UnpackSystemNameList(VARIANT* data, TavRetrievalParams* retrieval, ITavEnumBSTR** names) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSystemNameList. NULL data-variant"))
        .OutPointer(retrieval, OLESTR("UnpackSystemNameList. Invalid pointer"))
        .OutPointer(names, OLESTR("UnpackSystemNameList. Invalid pointer"))
        .Do([&] {
            *names = nullptr;
            retrieval->noOfElts = 0;
        })
        .IsBstr(OLESTR("UnpackSystemNameList. Data-variant not of type VT_BSTR"))
        .Then([&](Reply& reply) {
            constexpr OleStringView kCount = OLESTR("-NoOfElements ");
            constexpr OleStringView kNames = OLESTR("-Names ");
            OleStringView text = reply.CText();
            if (text.substr(0, kCount.size()) != kCount) {
                return reply.Fail(E_FAIL, OLESTR("UnpackSystemNameList failed."));
            }
            const text::ParsedNumber<std::int32_t> count = text::StrToLong(text.substr(kCount.size()));
            text = text.substr(kCount.size() + count.end);
            text = text.substr(std::min(text.find_first_not_of(OLECHAR(u' ')), text.size()));
            if (text.substr(0, kNames.size()) != kNames) {
                return reply.Fail(E_FAIL, OLESTR("UnpackSystemNameList failed."));
            }
            if (count.value < 0) {
                // As many slots as that asks for cannot be had.
                return reply.Fail(E_OUTOFMEMORY, OLESTR("UnpackSystemNameList. Out of memory"));
            }
            text::Tokenizer tokens(text.substr(kNames.size()), OLESTR(","));
            const HRESULT hr = DecodeList<BstrTraits>(
                reply, kSystemListTexts, kSystemList, count.value, tokens.Rest(),
                [&](OleStringView, BSTR& name) {
                    const std::optional<OleStringView> token = tokens.Next();
                    if (!token) {
                        return ElementRead::Mismatch();
                    }
                    if (FAILED(reply.Allocate(*token, &name))) {
                        return ElementRead{reply.Result(), 0};
                    }
                    return ElementRead::Read(0);
                },
                [&](OleStringView) { return tokens.Next() ? S_FALSE : S_OK; }, names);
            if (SUCCEEDED(hr)) {
                SetRetrieved(retrieval, count.value);
                retrieval->mark = 0;
            }
            return hr;
        });
}

HRESULT ControllerObject::RemoveSystem(TavInParams* rip, BSTR name) {
    return Command(rip)
        .ValidParams(OLESTR("RemoveSystem: Invalid TavInParams"))
        .Require(ValidSystemName(name), E_INVALIDARG, OLESTR("RemoveSystem. Invalid system-name."))
        .Initialised(OLESTR("RemoveSystem. TavController used before Initialized"))
        .Set(OLESTR("RemoveSystem"), text::Format(OLESTR("-Name \"%s\""), ViewOf(name)))
        .StatusOnly();
}

HRESULT ControllerObject::SetBootDevice(TavInParams* rip, BSTR device) {
    return Command(rip)
        .ValidParams(OLESTR("SetBootDevice: Invalid TavInParams"))
        .Require(SysStringLen(device) > 0, E_INVALIDARG, OLESTR("SetBootDevice: Invalid bootDevice."))
        .Initialised(OLESTR("SetBootDevice. TavController used before Initialized"))
        .Set(OLESTR("BootDevice"), text::Format(OLESTR("-Name \"%s\""), ViewOf(device)))
        .StatusOnly();
}

HRESULT ControllerObject::GetBootDevice(TavInParams* rip, BSTR* device) {
    return Command(rip)
        .ValidParams(OLESTR("GetBootDevice: Invalid TavInParams"))
        .OutPointer(device, OLESTR("GetBootDevice: Invalid out-pointer"))
        .Initialised(OLESTR("GetBootDevice. TavController used before Initialized"))
        .Get(OLESTR("BootDevice"))
        .Decode([&](VARIANT* reply) { return UnpackBootDevice(reply, device); });
}

HRESULT ControllerObject::UnpackBootDevice(VARIANT* data, BSTR* device) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackBootDevice. NULL data-variant"))
        .OutPointers(OLESTR("UnpackBootDevice. Invalid pointer"), device)
        .IsBstr(OLESTR("UnpackBootDevice. Data-variant not of type VT_BSTR"))
        .AfterPrefix(OLESTR("-Name "), device, OLESTR("UnpackBootDevice failed."));
}

HRESULT ControllerObject::GetNoOfSpannedFiles(TavInParams* rip, ULONG* count) {
    return Command(rip)
        .ValidParams(OLESTR("GetNoOfSpannedFiles: Invalid TavInParams"))
        .OutPointer(count, OLESTR("GetNoOfSpannedFiles: Invalid out-pointer"))
        .Initialised(OLESTR("GetNoOfSpannedFiles. TavController used before Initialized"))
        .Get(OLESTR("SpannedFiles"))
        .Decode([&](VARIANT* reply) { return UnpackNoOfSpannedFiles(reply, count); });
}

HRESULT ControllerObject::UnpackNoOfSpannedFiles(VARIANT* data, ULONG* count) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackNoOfSpannedFiles. NULL data-variant"))
        .OutPointers(OLESTR("UnpackNoOfSpannedFiles. Invalid out pointer"), count)
        .IsBstr(OLESTR("UnpackNoOfSpannedFiles. Invalid argument."))
        .Fields<OLESTR("-FileCount %lu")>(OLESTR("UnpackNoOfSpannedFiles failed."), count);
}

HRESULT ControllerObject::LoadBootImage(TavInParams* rip, LONG* done) {
    return Command(rip)
        .ValidParams(OLESTR("LoadBootImage: Invalid TavInParams"))
        .OutPointer(done, OLESTR("LoadBootImage. Invalid out-pointer"))
        .Initialised(OLESTR("LoadBootImage. TavController used before Initialized"))
        .Set(OLESTR("LoadBootImage"))
        .Decode([&](VARIANT* reply) { return UnpackLoadBootImage(reply, done); });
}

// Done is exactly 1; any other number reads as not done.
HRESULT ControllerObject::UnpackLoadBootImage(VARIANT* data, LONG* done) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackLoadBootImage. NULL data-variant"))
        .OutPointers(OLESTR("UnpackLoadBootImage. Invalid out pointer"), done)
        .IsBstr(OLESTR("UnpackLoadBootImage. Invalid argument."))
        .Then([&](Reply& reply) {
            LONG value = 0;
            if (text::Scan<OLESTR("-IsDone %d")>(reply.Text(), &value) != 1) {
                return reply.Fail(E_FAIL, OLESTR("UnpackLoadBootImage failed."));
            }
            *done = value == 1 ? 1 : 0;
            return S_OK;
        });
}

HRESULT ControllerObject::UndoLoadBootImage(TavInParams* rip) {
    return Command(rip)
        .ValidParams(OLESTR("UndoLoadBootImage: Invalid TavInParams"))
        .Initialised(OLESTR("UndoLoadBootImage. TavController used before Initialized"))
        .Set(OLESTR("UndoLoadBootImage"))
        .StatusOnly();
}

}  // namespace tav
