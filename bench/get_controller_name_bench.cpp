// A Sync GetControllerName as a client makes it, through the module and the
// virtual controller registered in-process, against a floor: the work that
// any implementation of that call has to do, in a plain loop. The table
// printed at the end gives the call's time as a multiple of the floor's.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdio>
#include <iostream>
#include <map>
#include <string>
#include <vector>

#include "TavController.h"
#include "core/text/format.h"
#include "core/text/scan.h"
#include "bench_support.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/variant.h"

namespace {

using tav::Bstr;
using tav::ComPtr;
using tav::OleString;
using tav::OleStringView;

// As long as a name gets on a real cell, well under the 256 the controller keeps.
constexpr OleStringView kName = OLESTR("Robot cell 1 of the east wing");

// The process as a client sets it up, with the controller named kName.
class Client : public tav::bench::Client {
public:
    Client() {
        if (Failure() != nullptr) {
            return;
        }
        const Bstr name(kName);
        TavInParams sync{};
        sync.callType = Sync;
        if (FAILED(Controller()->SetControllerName(&sync, name.Get()))) {
            Fail("cannot name the controller");
        }
    }
};

Client* TheClient = nullptr;

OleString NameFromCall() {
    TavInParams sync{};
    sync.callType = Sync;
    Bstr name;
    if (FAILED(TheClient->Controller()->GetControllerName(&sync, name.Receive()))) {
        return OLESTR("(failed)");
    }
    return OleString(name.View());
}

void Call(benchmark::State& state) {
    if (TheClient->Failure() != nullptr) {
        state.SkipWithError(TheClient->Failure());
        return;
    }
    if (NameFromCall() != kName) {
        state.SkipWithError("GetControllerName does not answer the name that was set");
        return;
    }
    ITavController* controller = TheClient->Controller();
    TavInParams sync{};
    sync.callType = Sync;
    for (auto _ : state) {
        BSTR name = nullptr;
        benchmark::DoNotOptimize(controller->GetControllerName(&sync, &name));
        benchmark::DoNotOptimize(name);
        SysFreeString(name);
    }
}

// One call's unavoidable work: the command's three strings as Execute takes
// them (a Get of CtrlName has no arguments to format), the reply text as the
// controller formats it from the name it keeps, in the BSTR of the reply's
// VARIANT, the scan of the quoted name out of it (in place, without a copy),
// and the caller's BSTR,
// returned as the call returns it (NULL when the scan fails).
BSTR FloorName() {
    const Bstr verb(OLESTR("Get"));
    const Bstr command(OLESTR("CtrlName"));
    const Bstr args(OLESTR(""));
    benchmark::DoNotOptimize(verb.Get());
    benchmark::DoNotOptimize(command.Get());
    benchmark::DoNotOptimize(args.Get());

    tav::Variant reply;
    reply.SetBstr(Bstr(tav::text::Format(OLESTR("-Name \"%s\""), kName)));
    const BSTR replyText = reply.Get()->bstrVal;
    benchmark::DoNotOptimize(replyText);

    OleStringView field;
    if (tav::text::Scan<OLESTR("-Name \"%256[^\"]")>(OleStringView(replyText, SysStringLen(replyText)),
                                                     tav::text::FieldView{&field}) != 1) {
        return nullptr;
    }
    return SysAllocStringLen(field.data(), static_cast<UINT>(field.size()));
}

void Floor(benchmark::State& state) {
    Bstr check;
    check.Attach(FloorName());
    if (check.View() != kName) {
        state.SkipWithError("the floor does not produce the name");
        return;
    }
    for (auto _ : state) {
        BSTR name = FloorName();
        benchmark::DoNotOptimize(name);
        SysFreeString(name);
    }
}

// The usual console output, then the call's CPU time as a multiple of the
// floor's: the median of the repetitions when there are several.
class RatioReporter : public tav::bench::MedianReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        const double call = Median("GetControllerName/call");
        const double floor = Median("GetControllerName/floor");
        if (call <= 0 || floor <= 0) {
            return;
        }
        char line[160];
        std::snprintf(line, sizeof line,
                      "\nSync GetControllerName / its floor, CPU time, same process: %.2f (%.0f ns / %.0f ns)\n",
                      call / floor, call, floor);
        GetOutputStream() << line;
    }

};

}  // namespace

int main(int argc, char** argv) {
    return tav::bench::RunWithClient<Client, RatioReporter>(argc, argv, TheClient, [](Client&) {
        benchmark::RegisterBenchmark("GetControllerName/call", Call);
        benchmark::RegisterBenchmark("GetControllerName/floor", Floor);
    });
}
