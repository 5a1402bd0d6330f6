#pragma once
#include <utility>

#include "sim/text.h"

namespace tav::sim {

// What the controller answers to one command: the status that goes into
// TavCommandReply.status and the text that goes into its data BSTR (the
// reply on success, the controller's error text on failure).
// A reply without text (the answer to most Set commands) has no data.
struct Reply {
    HRESULT status = S_OK;
    Text text;
    bool hasText = false;
};

inline Reply Answer(Text text) { return Reply{S_OK, std::move(text), true}; }
inline Reply Done() { return Reply{}; }
inline Reply Refuse(HRESULT status, Text text) { return Reply{status, std::move(text), true}; }
// The refusal of a command the controller names in its error text:
// "COMMAND: WHY".
inline Reply Refused(TextView command, HRESULT status, TextView why) {
    return Refuse(status, Concat({command, OLESTR(": "), why}));
}

}  // namespace tav::sim
