#pragma once
// What the LAN adaptor's replies hold: a method word and dotted addresses.
#include "core/reply.h"

namespace tav::network {

inline constexpr WordValue<IPMethod> kMethodWords[] = {
    {OLESTR("NONE"), NONE}, {OLESTR("FIXIP"), FIXIP}, {OLESTR("DHCP"), DHCP}};

// An address, mask or gateway field of a reply: at most 19 characters (a
// longer one refuses the reply rather than being cut), and "unspec", a value
// that is not set, handed out as an empty string.
struct AddressField {
    static constexpr std::size_t kRoom = 20;
    BSTR* out;
    HRESULT Commit(Reply& reply, OleStringView value) const {
        return reply.Allocate(value == OLESTR("unspec") ? OleStringView() : value, out);
    }
};

// The MAC address: the same room, never replaced.
using MacField = fields::Bounded<20>;

// The method word; decoders other than the method's own report with its text.
inline fields::Mapped<IPMethod> MethodField(IPMethod* out) {
    return {out, kMethodWords, OLESTR("UnpackLANAdaptorIPMethod received unexpected IP method.")};
}

}  // namespace tav::network
