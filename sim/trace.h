#pragma once
// What went over the wire: every command the virtual controller receives,
// with its reply and the time it took, for whoever wants to see it.
#include <chrono>
#include <cstdint>
#include <functional>

#include "sim/text.h"

namespace tav::sim {

// One command as the controller received and answered it. The views are
// valid only during the call to the sink.
struct TraceRecord {
    std::uint32_t client = 0;  // the sending client's id (0: not known)
    TextView url;
    TextView verb;
    TextView command;
    TextView args;
    HRESULT status = S_OK;
    bool hasText = false;  // the reply carried a text (a failure's text included)
    TextView text;
    std::chrono::nanoseconds took{0};
};

using TraceSink = std::function<void(const TraceRecord& record)>;

// Process-wide: replaces the sink (an empty function ends tracing). Without a
// sink of its own a process traces to where the environment variable
// TAV_SIM_TRACE says: "stderr", or the path of a file to append to.
void SetTraceSink(TraceSink sink);

// True when a sink is set; the fast path costs one atomic load.
bool Tracing() noexcept;

// Hands the record to the sink, if any.
void Trace(const TraceRecord& record);

// "client 3 Get CtrlName \"\" -> S_OK \"-Name \\\"sim\\\"\" (12 us)": the
// line the environment's trace writes.
std::string TraceLine(const TraceRecord& record);

}  // namespace tav::sim
