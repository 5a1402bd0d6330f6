// UnpackSafetyViolationStatus (ITavSafety) on a reply whose arrays are all
// full (each as long as the caller's capacity: 6 axis positions and speeds,
// 3 TCP and flange values, 4 orientation values, 16 flags in each of the
// eight flag arrays) against scanning alone: the same head format, each key
// found in the text and its array read by the decoder's own array readers,
// into arrays allocated before timing. The reply is built once, outside the
// timed loop.
#include <benchmark/benchmark.h>

#include <array>
#include <cstdio>
#include <span>

#include "TavController.h"
#include "bench_support.h"
#include "core/keyed_text.h"
#include "core/text/format.h"
#include "core/text/scan.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/variant.h"

namespace {

using tav::Bstr;
using tav::ComPtr;
using tav::OleString;
using tav::OleStringView;

constexpr int kNumberArrays = 5;
constexpr int kFlagArrays = 8;
constexpr int kFlagCount = 16;
constexpr std::array<LONG, kNumberArrays> kNumberCounts = {6, 6, 3, 3, 4};
constexpr std::array<const OLECHAR*, kNumberArrays> kNumberKeys = {OLESTR("-axes"), OLESTR("-speed"), OLESTR("-tcp"),
                                                                   OLESTR("-fpos"), OLESTR("-forient")};
// In the reply's own order.
constexpr std::array<const OLECHAR*, kFlagArrays> kFlagKeys = {
    OLESTR("-ssv"),         OLESTR("-toolposvs"),   OLESTR("-toolposas"),   OLESTR("-uarmvs"),
    OLESTR("-toolspeedvs"), OLESTR("-toolspeedas"), OLESTR("-axisrangevs"), OLESTR("-axisrangeas")};
// The decoder's parameters take the flag arrays in the type library's order.
constexpr std::array<int, kFlagArrays> kFlagParameterOrder = {0, 3, 1, 2, 4, 5, 6, 7};

// ITavSafety comes with the fifteenth class; the last one answers all.
class Client : public tav::bench::Client {
public:
    Client() : tav::bench::Client(CLSID_TavController17) {
        if (Failure() == nullptr && FAILED(QueryTo(Controller(), safety_))) {
            Fail("cannot reach the controller's ITavSafety");
        }
    }
    ITavSafety* Safety() const { return safety_.Get(); }

private:
    ComPtr<ITavSafety> safety_;
};

Client* TheClient = nullptr;

double NumberAt(int array, int i) { return (array + 1) * 100.0 + i * 12.345678 - 250.5; }
LONG FlagAt(int array, int i) { return (array * 7 + i * 3) % 5 == 0 ? 1 : 0; }

OleString ReplyText() {
    OleString text = OLESTR("-vnumber 4711 -violationtype red_tool_speed -instanceid 3 -isunsync 0 -tool 2 -drive 1");
    for (int a = 0; a < kNumberArrays; ++a) {
        text += tav::text::Format(OLESTR("\t%s %d["), kNumberKeys[a], kNumberCounts[a]);
        for (int i = 0; i < kNumberCounts[a]; ++i) {
            char number[32];
            const int length = std::snprintf(number, sizeof number, "%.6f,", NumberAt(a, i));
            text.append(number, number + length);
        }
        text += u']';
    }
    for (int a = 0; a < kFlagArrays; ++a) {
        text += tav::text::Format(OLESTR("\t%s %d["), kFlagKeys[a], kFlagCount);
        for (int i = 0; i < kFlagCount; ++i) {
            text += FlagAt(a, i) != 0 ? u'1' : u'0';
        }
        text += u']';
    }
    text += u'\t';
    return text;
}

// Every out-value of the decoder, or of the baseline.
struct Violation {
    std::array<std::array<double, 6>, kNumberArrays> numbers{};
    std::array<LONG, kNumberArrays> numberCounts{};
    std::array<std::array<LONG, kFlagCount>, kFlagArrays> flags{};  // in the reply's order
    std::array<LONG, kFlagArrays> flagCounts{};
    ULONG number = 0;
    TavVantorViolationType type{};
    OleStringView typeWord;
    ULONG instance = 0;
    LONG synchronized = 0;
    short tool = 0;
    short drive = 0;

    bool SameArraysAs(const Violation& other) const {
        return numbers == other.numbers && numberCounts == other.numberCounts && flags == other.flags &&
               flagCounts == other.flagCounts && number == other.number && instance == other.instance &&
               synchronized == other.synchronized && tool == other.tool && drive == other.drive;
    }
};

HRESULT Unpack(ITavSafety* safety, VARIANT* reply, Violation& v) {
    auto n = [&](int a) { return v.numbers[a].data(); };
    auto f = [&](int parameter) { return v.flags[kFlagParameterOrder[parameter]].data(); };
    auto fc = [&](int parameter) { return &v.flagCounts[kFlagParameterOrder[parameter]]; };
    const LONG c = kFlagCount;
    return safety->UnpackSafetyViolationStatus(
        reply, kNumberCounts[0], &v.numberCounts[0], n(0), kNumberCounts[1], &v.numberCounts[1], n(1),
        kNumberCounts[2], &v.numberCounts[2], n(2), kNumberCounts[3], &v.numberCounts[3], n(3), kNumberCounts[4],
        &v.numberCounts[4], n(4), &v.number, &v.type, &v.instance, &v.synchronized, &v.tool, &v.drive, c, fc(0), f(0),
        c, fc(1), f(1), c, fc(2), f(2), c, fc(3), f(3), c, fc(4), f(4), c, fc(5), f(5), c, fc(6), f(6), c, fc(7),
        f(7));
}

// The head, then each array found by its key and read; false when anything
// does not read.
bool ScanOnly(OleStringView text, Violation& v) {
    std::int32_t number = 0;
    std::int32_t instance = 0;
    std::int32_t synchronized = 0;
    std::int32_t tool = 0;
    std::int32_t drive = 0;
    if (tav::text::Scan<OLESTR("-vnumber %d -violationtype %s -instanceid %d -isunsync %d -tool %d -drive %d")>(
            text, &number, tav::text::FieldView{&v.typeWord}, &instance, &synchronized, &tool, &drive) != 6) {
        return false;
    }
    v.number = static_cast<ULONG>(number);
    v.instance = static_cast<ULONG>(instance);
    v.synchronized = synchronized;
    v.tool = static_cast<short>(tool);
    v.drive = static_cast<short>(drive);
    for (int a = 0; a < kNumberArrays; ++a) {
        const std::size_t at = text.find(tav::ViewOf(kNumberKeys[a]));
        const std::optional<tav::ArrayRead> read =
            at == OleStringView::npos
                ? std::nullopt
                : tav::ReadNumberArray(text.substr(at), std::span<double>(v.numbers[a].data(), kNumberCounts[a]));
        if (!read) {
            return false;
        }
        v.numberCounts[a] = read->count;
    }
    for (int a = 0; a < kFlagArrays; ++a) {
        const std::size_t at = text.find(tav::ViewOf(kFlagKeys[a]));
        const std::optional<tav::ArrayRead> read =
            at == OleStringView::npos ? std::nullopt
                                      : tav::ReadFlagArray(text.substr(at), std::span<LONG>(v.flags[a]));
        if (!read) {
            return false;
        }
        v.flagCounts[a] = read->count;
    }
    return true;
}

const char* DecoderAgrees(VARIANT* reply, OleStringView text) {
    Violation scanned;
    Violation decoded;
    if (!ScanOnly(text, scanned)) {
        return "the baseline does not read the reply";
    }
    if (FAILED(Unpack(TheClient->Safety(), reply, decoded))) {
        return "UnpackSafetyViolationStatus refuses the reply";
    }
    if (!decoded.SameArraysAs(scanned) || decoded.type != TavVantorViolationTypeReducedToolSpeed ||
        scanned.typeWord != OleStringView(OLESTR("red_tool_speed"))) {
        return "UnpackSafetyViolationStatus does not give what the baseline scans";
    }
    for (int a = 0; a < kNumberArrays; ++a) {
        for (int i = 0; i < kNumberCounts[a]; ++i) {
            // Both read the text that "%.6f" wrote; it is the value to six places.
            const double written = scanned.numbers[a][static_cast<size_t>(i)];
            if (written < NumberAt(a, i) - 1e-6 || written > NumberAt(a, i) + 1e-6) {
                return "the numbers read are not those written";
            }
        }
    }
    for (int a = 0; a < kFlagArrays; ++a) {
        for (int i = 0; i < kFlagCount; ++i) {
            if (scanned.flags[a][static_cast<size_t>(i)] != FlagAt(a, i)) {
                return "the flags read are not those written";
            }
        }
    }
    return nullptr;
}

void Subject(benchmark::State& state) {
    if (TheClient->Failure() != nullptr) {
        state.SkipWithError(TheClient->Failure());
        return;
    }
    tav::Variant reply;
    reply.SetBstr(Bstr(ReplyText()));
    if (const char* why = DecoderAgrees(reply.Get(), reply.StringView())) {
        state.SkipWithError(why);
        return;
    }
    ITavSafety* safety = TheClient->Safety();
    Violation violation;
    for (auto _ : state) {
        benchmark::DoNotOptimize(Unpack(safety, reply.Get(), violation));
        benchmark::ClobberMemory();
    }
}

void Baseline(benchmark::State& state) {
    const Bstr text(ReplyText());
    const OleStringView view = text.View();
    Violation violation;
    for (auto _ : state) {
        benchmark::DoNotOptimize(ScanOnly(view, violation));
        benchmark::ClobberMemory();
    }
}

class RatioReporter : public tav::bench::MedianReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        const double unpack = Median("UnpackSafetyViolationStatus");
        const double scan = Median("ScanOnly");
        if (unpack <= 0 || scan <= 0) {
            return;
        }
        char line[200];
        std::snprintf(line, sizeof line,
                      "\nUnpackSafetyViolationStatus, full arrays / scanning alone, CPU time, same process: %.2f "
                      "(%.0f ns / %.0f ns)\n",
                      unpack / scan, unpack, scan);
        GetOutputStream() << line;
    }
};

}  // namespace

int main(int argc, char** argv) {
    return tav::bench::RunWithClient<Client, RatioReporter>(argc, argv, TheClient, [](Client&) {
        benchmark::RegisterBenchmark("UnpackSafetyViolationStatus", Subject);
        benchmark::RegisterBenchmark("ScanOnly", Baseline);
    });
}
