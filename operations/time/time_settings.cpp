// The controller's time zone and time server, and a test of a server.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

// The argument text of these commands has room for 255 characters: a value
// too long for it is refused rather than cut.
constexpr std::size_t kArgumentRoom = 255;

bool FitsArgument(OleStringView key, BSTR value, std::size_t quotes) {
    return key.size() + quotes + text::UpToNul(ViewOf(value)).size() <= kArgumentRoom;
}

bool ZoneFits(BSTR zone) { return FitsArgument(OLESTR("-timezone "), zone, 0); }
bool ServerFits(BSTR server) { return FitsArgument(OLESTR("-timeserver "), server, 2); }

}  // namespace

HRESULT ControllerObject::SetTimeZone(TavInParams* rip, BSTR zone) {
    return Command(rip)
        .ValidParams(OLESTR("SetTimeZone: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(ZoneFits(zone), E_INVALIDARG, OLESTR("SetTimeZone: Invalid argument"))
        .Set(OLESTR("TimeZone"), text::Format(OLESTR("-timezone %s"), ViewOf(zone)))
        .StatusOnly();
}

HRESULT ControllerObject::GetTimeZone(TavInParams* rip, BSTR* zone) {
    return Command(rip)
        .ValidParams(OLESTR("GetTimeZone: Invalid TavInParams"))
        .OutPointer(zone, OLESTR("GetTimeZone: Invalid out-pointer"))
        .Initialised(OLESTR("GetTimeZone. TavController used before Initialized"))
        .Get(OLESTR("TimeZone"))
        .Decode([&](VARIANT* reply) { return UnpackTimeZone(reply, zone); });
}

// The type is checked before the out-pointer here.
// The value after the key, up to the first blank and at most 254
// characters; a reply that does not match gives an empty value, not a
// failure, and a value that cannot be allocated gives none.
HRESULT ControllerObject::UnpackTimeZone(VARIANT* data, BSTR* zone) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackTimeZone. NULL variant"))
        .IsBstr(OLESTR("UnpackTimeZone. Non-BSTR variant."))
        .OutPointer(zone, OLESTR("pTimeZone == NULL"))
        .Then([&](Reply& reply) {
            OleStringView value;
            text::Scan<OLESTR("-timezone %254s")>(reply.Text(), text::FieldView{&value});
            *zone = SysAllocStringLen(value.data(), static_cast<UINT>(value.size()));
            return S_OK;
        });
}

HRESULT ControllerObject::SetTimeServer(TavInParams* rip, BSTR server) {
    return Command(rip)
        .ValidParams(OLESTR("SetTimeServer: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(ServerFits(server), E_INVALIDARG, OLESTR("SetTimeServer: Invalid argument"))
        .Set(OLESTR("TimeServer"), text::Format(OLESTR("-timeserver \"%s\""), ViewOf(server)))
        .StatusOnly();
}

HRESULT ControllerObject::GetTimeServer(TavInParams* rip, BSTR* server) {
    return Command(rip)
        .ValidParams(OLESTR("GetTimeServer: Invalid TavInParams"))
        .OutPointer(server, OLESTR("GetTimeServer: Invalid out-pointer"))
        .Initialised(OLESTR("GetTimeServer. TavController used before Initialized"))
        .Get(OLESTR("TimeServer"))
        .Decode([&](VARIANT* reply) { return UnpackTimeServer(reply, server); });
}

HRESULT ControllerObject::UnpackTimeServer(VARIANT* data, BSTR* server) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackTimeServer. NULL variant"))
        .IsBstr(OLESTR("UnpackTimeServer. Non-BSTR variant."))
        .OutPointer(server, OLESTR("ptmserver == NULL"))
        .Then([&](Reply& reply) {
            OleStringView value;
            text::Scan<OLESTR("-timeserver %254s")>(reply.Text(), text::FieldView{&value});
            *server = SysAllocStringLen(value.data(), static_cast<UINT>(value.size()));
            return S_OK;
        });
}

// A set command whose reply is the time the server gave.
HRESULT ControllerObject::TestTimeServer(TavInParams* rip, BSTR server, FILETIME* time) {
    return Command(rip)
        .ValidParams(OLESTR("TestTimeServer: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .OutPointer(time, OLESTR("TestTimeServer: Invalid out-pointer"))
        .Require(ServerFits(server), E_INVALIDARG, OLESTR("TestTimeServer: Invalid argument"))
        .Set(OLESTR("TestTimeServer"), text::Format(OLESTR("-timeserver \"%s\""), ViewOf(server)))
        .Decode([&](VARIANT* reply) { return UnpackTestTimeServer(reply, time); });
}

HRESULT ControllerObject::UnpackTestTimeServer(VARIANT* data, FILETIME* time) { return UnpackSystemClock(data, time); }

}  // namespace tav
