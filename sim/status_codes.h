#pragma once
#include "tav/platform.h"

// Failure statuses of the virtual controller: what it puts into
// TavCommandReply.status (and, for the transport, what Execute returns).
// Error severity, customer bit and interface facility, like the controller's
// own codes, in a range of their own.
namespace tav::sim {

inline constexpr HRESULT kStatusUnknownCommand = static_cast<HRESULT>(0xC0049001u);
inline constexpr HRESULT kStatusBadArgument = static_cast<HRESULT>(0xC0049002u);
inline constexpr HRESULT kStatusNotAllowed = static_cast<HRESULT>(0xC0049003u);
inline constexpr HRESULT kStatusNotFound = static_cast<HRESULT>(0xC0049004u);
inline constexpr HRESULT kStatusTimedOut = static_cast<HRESULT>(0xC0049005u);
inline constexpr HRESULT kStatusLinkDown = static_cast<HRESULT>(0xC0049006u);
inline constexpr HRESULT kStatusSimulatedFailure = static_cast<HRESULT>(0xC0049007u);
inline constexpr HRESULT kStatusBusy = static_cast<HRESULT>(0xC0049008u);

// The symbolic name of one of the codes above, or nullptr.
const char* StatusName(HRESULT status);

}  // namespace tav::sim
