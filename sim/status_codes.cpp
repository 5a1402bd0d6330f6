#include "sim/status_codes.h"

namespace tav::sim {

const char* StatusName(HRESULT status) {
    switch (status) {
        case kStatusUnknownCommand: return "SIM_UNKNOWN_COMMAND";
        case kStatusBadArgument: return "SIM_BAD_ARGUMENT";
        case kStatusNotAllowed: return "SIM_NOT_ALLOWED";
        case kStatusNotFound: return "SIM_NOT_FOUND";
        case kStatusTimedOut: return "SIM_TIMED_OUT";
        case kStatusLinkDown: return "SIM_LINK_DOWN";
        case kStatusSimulatedFailure: return "SIM_SIMULATED_FAILURE";
        case kStatusBusy: return "SIM_BUSY";
        default: return nullptr;
    }
}

}  // namespace tav::sim
