#pragma once
#include <cstdint>
#include <optional>

#include "sim/model_state.h"
#include "sim/text.h"

// IPv4 settings as the controller judges them, for its own LAN adaptor and
// for the cameras on its network.
namespace tav::sim {

struct Ipv4Settings {
    std::uint32_t address = 0;
    std::uint32_t mask = 0;
    std::optional<std::uint32_t> gateway;  // none set
};

// Four decimal numbers of 0 to 255 with dots between and nothing else: the
// controller takes no "1.2.3.4xyz" and no " 1.2.3.4", which a client lets by.
std::optional<std::uint32_t> ParseIpv4(TextView text);
Text Ipv4Text(std::uint32_t address);
// What the controller writes for an address, mask or gateway that is not set.
inline constexpr TextView kUnspecified = OLESTR("unspec");

// Why the settings cannot be used on a network (a mask with holes, an
// address that is the subnet's own or its broadcast, a gateway outside the
// subnet); nothing when they can.
std::optional<Text> Ipv4Refusal(const Ipv4Settings& settings);

// Whether the controller's LAN adaptor is on (its method is not NONE): what
// it asks of other hosts goes nowhere while it is off.
bool LanAdaptorUp(const ModelState& state);

}  // namespace tav::sim
