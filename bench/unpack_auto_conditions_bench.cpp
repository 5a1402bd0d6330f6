// UnpackAutoConditions (ITavPanel) of 10, 1,000 and 100,000 conditions,
// against a baseline that only scans the same elements with tav::text::Scan
// into a plain array. Each reply text is built once, outside the timed loop;
// the enumerator is released inside it, as a client releases it. Both report
// their time per element ("per_element"); the table printed at the end shows
// whether that time stays flat as the list grows, and the decoder's time as
// a multiple of the baseline's.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
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

constexpr std::int64_t kSizes[] = {10, 1'000, 100'000};

// The process as a client sets it up (Unpack operations refuse an object
// that was not initialised), seen through ITavPanel.
class Client : public tav::bench::Client {
public:
    Client() {
        if (Failure() == nullptr &&
            FAILED(QueryTo(Controller(), panel_))) {
            Fail("cannot reach the controller's ITavPanel");
        }
    }

    ITavPanel* Panel() const { return panel_.Get(); }

private:
    ComPtr<ITavPanel> panel_;
};

Client* TheClient = nullptr;

// A pending change to automatic with count conditions, the three kinds that
// ITavPanel knows in turn, every other one with keep allowed.
const tav::Variant& ReplyWith(std::int64_t count) {
    static std::map<std::int64_t, tav::Variant> replies;
    tav::Variant& reply = replies[count];
    if (reply.Type() == VT_BSTR) {
        return reply;
    }
    static constexpr const OLECHAR* kConditions[] = {OLESTR("Blk"), OLESTR("Deact"), OLESTR("CallChn")};
    OleString text = tav::text::Format(OLESTR("-auto_ch 1 -noelts %d\t"), count);
    for (std::int64_t i = 0; i < count; ++i) {
        text += tav::text::Format(OLESTR("%s;%d;%lu\t"), kConditions[i % 3], i % 2, 1000 + i);
    }
    reply.SetBstr(Bstr(text));
    return reply;
}

OleStringView TextOf(const tav::Variant& reply) {
    const BSTR text = reply.Get()->bstrVal;
    return OleStringView(text, SysStringLen(text));
}

// An element as the baseline keeps it.
struct ScannedElement {
    OLECHAR name[11];
    std::int32_t keep;
    std::uint32_t id;
};

// The header and every element scanned with the decoder's own formats, into
// elements (which has room for them all); the number scanned, -1 when the
// header does not scan.
std::int64_t ScanOnly(OleStringView text, std::vector<ScannedElement>& elements) {
    std::int32_t flag = 0;
    std::int32_t count = 0;
    std::int32_t consumed = 0;
    if (tav::text::Scan<OLESTR("-auto_ch %d -noelts %d\t%n")>(text, &flag, &count, &consumed) != 2) {
        return -1;
    }
    OleStringView rest = text.substr(static_cast<size_t>(consumed));
    std::int64_t scanned = 0;
    for (; scanned < count; ++scanned) {
        ScannedElement& element = elements[static_cast<size_t>(scanned)];
        if (tav::text::Scan<OLESTR("%10[^;];%d;%lu\t%n")>(rest, element.name, &element.keep, &element.id,
                                                           &consumed) != 3) {
            break;
        }
        rest = rest.substr(static_cast<size_t>(consumed));
    }
    return scanned;
}

void ReportPerElement(benchmark::State& state, std::int64_t count) {
    state.SetItemsProcessed(state.iterations() * count);
    state.counters["per_element"] = benchmark::Counter(
        static_cast<double>(count), benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

// True when the decoder's enumerator holds what the baseline scanned.
bool DecoderAgrees(std::int64_t count) {
    std::vector<ScannedElement> expected(static_cast<size_t>(count));
    if (ScanOnly(TextOf(ReplyWith(count)), expected) != count) {
        return false;
    }
    LONG change = 0;
    ComPtr<IEnumAutoCondition> conditions;
    if (FAILED(TheClient->Panel()->UnpackAutoConditions(const_cast<VARIANT*>(ReplyWith(count).Get()), &change,
                                                        &conditions))) {
        return false;
    }
    std::vector<TavAutoCondition> fetched(static_cast<size_t>(count) + 1);
    ULONG fetchedCount = 0;
    conditions->RemNext(static_cast<ULONG>(fetched.size()), fetched.data(), &fetchedCount);
    if (change != 1 || fetchedCount != static_cast<ULONG>(count)) {
        return false;
    }
    for (size_t i = 0; i < expected.size(); ++i) {
        if (fetched[i].KeepIsAllowed != expected[i].keep || fetched[i].ConditionID != expected[i].id) {
            return false;
        }
    }
    return true;
}

void Unpack(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    if (TheClient->Failure() != nullptr) {
        state.SkipWithError(TheClient->Failure());
        return;
    }
    if (!DecoderAgrees(count)) {
        state.SkipWithError("UnpackAutoConditions does not give the scanned elements");
        return;
    }
    ITavPanel* panel = TheClient->Panel();
    // The decoder only reads the reply.
    VARIANT* reply = const_cast<VARIANT*>(ReplyWith(count).Get());
    for (auto _ : state) {
        LONG change = 0;
        IEnumAutoCondition* conditions = nullptr;
        benchmark::DoNotOptimize(panel->UnpackAutoConditions(reply, &change, &conditions));
        benchmark::DoNotOptimize(change);
        conditions->Release();
    }
    ReportPerElement(state, count);
}

void Baseline(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    const OleStringView text = TextOf(ReplyWith(count));
    std::vector<ScannedElement> elements(static_cast<size_t>(count));
    if (ScanOnly(text, elements) != count) {
        state.SkipWithError("the baseline does not scan every element");
        return;
    }
    for (auto _ : state) {
        benchmark::DoNotOptimize(ScanOnly(text, elements));
        benchmark::ClobberMemory();
    }
    ReportPerElement(state, count);
}

// The usual console output, then per size the time per element of both and
// their ratio, from CPU time: the median of the repetitions when there are
// several.
class RatioReporter : public tav::bench::MedianReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        std::ostream& out = GetOutputStream();
        out << "\nUnpackAutoConditions against Scan alone, CPU time per element (ns), same process:\n"
            << "  elements      Unpack        Scan     Unpack/Scan\n";
        double unpackAt1000 = 0;
        double unpackAtLargest = 0;
        for (const std::int64_t count : kSizes) {
            const double unpack = Median("UnpackAutoConditions/" + std::to_string(count)) / count;
            const double scan = Median("ScanOnly/" + std::to_string(count)) / count;
            if (unpack <= 0 || scan <= 0) {
                continue;
            }
            char line[128];
            std::snprintf(line, sizeof line, "  %8lld  %10.1f  %10.1f  %14.2f\n", static_cast<long long>(count), unpack,
                          scan, unpack / scan);
            out << line;
            unpackAt1000 = count == 1'000 ? unpack : unpackAt1000;
            unpackAtLargest = count == kSizes[2] ? unpack : unpackAtLargest;
        }
        if (unpackAt1000 > 0 && unpackAtLargest > 0) {
            char line[128];
            std::snprintf(line, sizeof line, "Unpack per element at 100,000 / at 1,000: %.2f (flat is 1)\n",
                          unpackAtLargest / unpackAt1000);
            out << line;
        }
    }

};

}  // namespace

int main(int argc, char** argv) {
    return tav::bench::RunWithClient<Client, RatioReporter>(argc, argv, TheClient, [](Client&) {
        for (const std::int64_t count : kSizes) {
            benchmark::RegisterBenchmark("UnpackAutoConditions", Unpack)->Arg(count);
            benchmark::RegisterBenchmark("ScanOnly", Baseline)->Arg(count);
        }
    });
}
