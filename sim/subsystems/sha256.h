#pragma once
#include <array>
#include <cstdint>
#include <string_view>

namespace tav::sim {

// The SHA-256 digest of the bytes: what the safety controller keeps as a
// configuration's checksum.
std::array<std::uint8_t, 32> Sha256(std::string_view bytes);

}  // namespace tav::sim
