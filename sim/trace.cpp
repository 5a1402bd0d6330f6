#include "sim/trace.h"

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <mutex>
#include <string>

#include "sim/status_codes.h"

namespace tav::sim {
namespace {

struct TraceState {
    std::mutex mutex;
    std::shared_ptr<const TraceSink> sink;
    std::atomic<bool> active{false};
};

// A sink that writes TraceLine to a C stream; the stream stays open for the
// life of the process.
TraceSink StreamSink(FILE* stream) {
    return [stream](const TraceRecord& record) {
        const std::string line = TraceLine(record) + "\n";
        std::fwrite(line.data(), 1, line.size(), stream);
        std::fflush(stream);
    };
}

TraceSink SinkFromEnvironment() {
    const char* where = std::getenv("TAV_SIM_TRACE");
    if (where == nullptr || *where == 0) {
        return {};
    }
    if (std::string(where) == "stderr") {
        return StreamSink(stderr);
    }
    FILE* file = std::fopen(where, "a");
    return file == nullptr ? TraceSink() : StreamSink(file);
}

TraceState& State() {
    static TraceState* state = [] {
        auto* created = new TraceState;  // never destroyed: commands may run during exit
        if (TraceSink sink = SinkFromEnvironment()) {
            created->sink = std::make_shared<const TraceSink>(std::move(sink));
            created->active = true;
        }
        return created;
    }();
    return *state;
}

std::string Quote(TextView text) {
    std::string out = "\"";
    for (char c : Narrow(text)) {
        if (c == '"' || c == '\\') {
            out += '\\';
            out += c;
        } else if (c == '\t') {
            out += "\\t";
        } else if (c == '\n') {
            out += "\\n";
        } else {
            out += c;
        }
    }
    return out + "\"";
}

std::string StatusLabel(HRESULT status) {
    if (status == S_OK) {
        return "S_OK";
    }
    if (const char* name = StatusName(status)) {
        return name;
    }
    char hex[16];
    std::snprintf(hex, sizeof hex, "0x%08X", static_cast<unsigned>(status));
    return hex;
}

}  // namespace

void SetTraceSink(TraceSink sink) {
    TraceState& state = State();
    std::lock_guard lock(state.mutex);
    state.sink = sink ? std::make_shared<const TraceSink>(std::move(sink)) : nullptr;
    state.active = static_cast<bool>(state.sink);
}

bool Tracing() noexcept { return State().active.load(std::memory_order_relaxed); }

void Trace(const TraceRecord& record) {
    TraceState& state = State();
    std::shared_ptr<const TraceSink> sink;
    {
        std::lock_guard lock(state.mutex);
        sink = state.sink;
    }
    if (sink) {
        (*sink)(record);
    }
}

std::string TraceLine(const TraceRecord& record) {
    const auto micros = std::chrono::duration_cast<std::chrono::microseconds>(record.took).count();
    std::string line = "client " + std::to_string(record.client) + " " + Narrow(record.verb) + " " +
                       Narrow(record.command) + " " + Quote(record.args) + " -> " + StatusLabel(record.status);
    if (record.hasText) {
        line += " " + Quote(record.text);
    }
    return line + " (" + std::to_string(micros) + " us)";
}

}  // namespace tav::sim
