// watch: subscriptions to the state and mode events, printed as they arrive.
#include <chrono>
#include <cstdlib>
#include <sstream>

#include "tavctl/command_support.h"
#include "tavctl/commands.h"
#include "tavctl/names.h"

namespace tavctl {
namespace {

struct WatchLimits {
    std::size_t count = 0;      // 0: no limit
    double seconds = 0;         // 0: no limit
};

std::optional<WatchLimits> ReadLimits(Session& session, CommandArguments& args, std::size_t defaultCount,
                                      double defaultSeconds, int& status) {
    WatchLimits limits{defaultCount, defaultSeconds};
    bool missing = false;
    if (const auto count = args.Option("--count", missing)) {
        char* end = nullptr;
        limits.count = std::strtoul(count->c_str(), &end, 10);
        if (end == count->c_str() || *end != '\0') {
            status = session.Usage("watch", "--count wants a number, not " + *count);
            return std::nullopt;
        }
    }
    if (missing) {
        status = session.Usage("watch", "--count needs a value");
        return std::nullopt;
    }
    if (const auto timeout = args.Option("--timeout", missing)) {
        char* end = nullptr;
        limits.seconds = std::strtod(timeout->c_str(), &end);
        if (end == timeout->c_str() || *end != '\0' || limits.seconds < 0) {
            status = session.Usage("watch", "--timeout wants seconds, not " + *timeout);
            return std::nullopt;
        }
    }
    if (missing) {
        status = session.Usage("watch", "--timeout needs a value");
        return std::nullopt;
    }
    return limits;
}

// The text after the time stamp: the subscription's name and the event
// decoded by the matching Unpack operation.
std::string Decode(ITavPanel* panel, ITavPanel2* panel2, ULONG subscription, VARIANT* data) {
    std::ostringstream line;
    HRESULT hr = S_OK;
    if (subscription == state) {
        TavControllerState value = InitState;
        hr = panel->UnpackControllerState(data, &value);
        line << "state " << (SUCCEEDED(hr) ? NameOf(ControllerStateNames(), value) : std::string("?"));
    } else {
        TavOperationMode value = UndefinedMode;
        hr = panel2 != nullptr ? panel2->UnpackOperationMode2(data, &value, nullptr, nullptr)
                               : panel->UnpackOperationMode(data, &value);
        line << "mode " << (SUCCEEDED(hr) ? NameOf(OperationModeNames(), value) : std::string("?"));
    }
    if (FAILED(hr)) {
        line << " (cannot decode: " << DescribeHresult(hr) << "; data "
             << (data->vt == VT_BSTR ? "\"" + ToUtf8(data->bstrVal) + "\"" : std::string("not a text")) << ")";
    }
    return line.str();
}

int Start(Session& session, CommandArguments& args) {
    int status = kExitOk;
    bool missing = false;
    const std::string events = args.Option("--events", missing).value_or("state,mode");
    if (missing) {
        return session.Usage("watch", "--events needs a value");
    }
    std::vector<ULONG> types;
    std::stringstream list(events);
    for (std::string name; std::getline(list, name, ',');) {
        if (name == "state") {
            types.push_back(state);
        } else if (name == "mode") {
            types.push_back(mode);
        } else {
            return session.Usage("watch", "--events lists state and mode, not " + name);
        }
    }
    if (!session.Watch().cookies.empty()) {
        return session.Usage("watch", "already watching; watch stop first");
    }
    auto subscribe = session.Interface<ITavSubscribe>("ITavSubscribe");
    auto panel = session.Interface<ITavPanel>("ITavPanel");
    if (!subscribe || !panel) {
        return kExitFailed;
    }
    tav::ComPtr<ITavPanel2> panel2;
    session.Controller()->QueryInterface(IID_ITavPanel2, reinterpret_cast<void**>(&panel2));

    WatchState& watch = session.Watch();
    watch.subscribe = subscribe;
    watch.printer.Attach(EventPrinter::New(
        [panel, panel2](ULONG subscription, VARIANT* data) {
            return Decode(panel.Get(), panel2.Get(), subscription, data);
        },
        [&session](const std::string& line) { session.Print(line); }));
    for (ULONG type : types) {
        TavEventParams params{};
        params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
        params.pSink = watch.printer.Get();
        params.subscriptionType = type;
        params.pollTime = 1000;
        params.userDef = type;
        params.containData = Data;
        TavInParams rip{};
        rip.callType = Sync;
        rip.timeOut = session.Options().timeoutMs;
        ULONG cookie = 0;
        const HRESULT hr = subscribe->Subscribe(&rip, &params, &cookie);
        if (FAILED(hr)) {
            status = session.Fail("Subscribe", hr);
            session.StopWatch();
            return status;
        }
        watch.cookies.push_back(cookie);
    }
    return kExitOk;
}

int Wait(Session& session, const WatchLimits& limits) {
    WatchState& watch = session.Watch();
    if (!watch.printer) {
        return session.Usage("watch", "not watching; watch start first");
    }
    const auto deadline =
        limits.seconds > 0
            ? std::chrono::steady_clock::now() +
                  std::chrono::duration_cast<std::chrono::steady_clock::duration>(std::chrono::duration<double>(limits.seconds))
            : std::chrono::steady_clock::time_point::max();
    const std::size_t wanted = limits.count == 0 ? static_cast<std::size_t>(-1) : limits.count;
    const std::size_t arrived = watch.printer->WaitFor(wanted, deadline);
    if (limits.count != 0 && arrived < limits.count) {
        session.Error("watch: " + std::to_string(arrived) + " of " + std::to_string(limits.count) +
                      " events arrived within the time limit");
        return kExitFailed;
    }
    return kExitOk;
}

// "watch [--count N] [--timeout S] [--events LIST]" is start, wait and stop
// in one.
int WatchCommand(Session& session, CommandArguments& args) {
    std::vector<std::string> words = args.Rest();
    std::string step;
    if (!words.empty() && (words.front() == "start" || words.front() == "wait" || words.front() == "stop")) {
        step = words.front();
        words.erase(words.begin());
    }
    CommandArguments rest(std::move(words));
    int status = kExitOk;
    if (step == "start") {
        status = Start(session, rest);
        if (status == kExitOk && !NoMore(session, rest, "watch", status)) {
            session.StopWatch();
        }
        return status;
    }
    if (step == "wait") {
        const auto limits = ReadLimits(session, rest, 1, 10, status);
        if (!limits || !NoMore(session, rest, "watch", status)) {
            return status;
        }
        return Wait(session, *limits);
    }
    if (step == "stop") {
        if (NoMore(session, rest, "watch", status)) {
            session.StopWatch();
        }
        return status;
    }
    const auto limits = ReadLimits(session, rest, 0, 0, status);
    if (!limits) {
        return status;
    }
    status = Start(session, rest);
    if (status != kExitOk) {
        return status;
    }
    if (NoMore(session, rest, "watch", status)) {
        status = Wait(session, *limits);
    }
    session.StopWatch();
    return status;
}

constexpr CommandSpec kCommands[] = {
    {"watch", "print state and mode events as they arrive",
     "Usage: tavctl watch [--count N] [--timeout SECONDS] [--events state,mode]\n"
     "       tavctl watch start [--events state,mode]\n"
     "       tavctl watch wait [--count N] [--timeout SECONDS]\n"
     "       tavctl watch stop\n"
     "Subscribes (ITavSubscribe) to the state and mode events and prints each one,\n"
     "time-stamped and decoded, as it arrives; ends after N events or the time\n"
     "limit (without either, it runs until interrupted). In a batch, start\n"
     "subscribes and returns, so that the following commands can cause events;\n"
     "wait (by default for 1 event within 10 s) counts the events since start;\n"
     "stop unsubscribes. Fewer events than --count asked for is a failure.\n",
     WatchCommand},
};

}  // namespace

std::span<const CommandSpec> EventCommands() { return kCommands; }

}  // namespace tavctl
