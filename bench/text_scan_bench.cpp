// Scan against the C library's sscanf on the reply grammars of the system,
// both on the same ASCII text in the same process. Each grammar runs three
// ways: "Scan/<name>" with the format compiled (as the decoders use it),
// "ScanRuntime/<name>" with the format read at run time, and
// "sscanf/<name>". The table printed at the end gives each Scan's time as a
// share of sscanf's, from the medians when there are repetitions.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <iostream>
#include <string>
#include <vector>

#include "core/text/convert.h"
#include "core/text/scan.h"
#include "median_reporter.h"

namespace {

using tav::OleString;
using tav::OleStringView;
using tav::text::Scan;

std::vector<std::string>& Names() {
    static std::vector<std::string> names;
    return names;
}

// Registers one grammar: the compiled and the run-time Scan read OLECHAR
// text, sscanf the same text in ASCII. Each returns the number of fields;
// all three must agree before anything is timed.
template <typename Compiled, typename Runtime, typename Theirs>
void Register(const std::string& name, const char* format, const char* input, Compiled compiled, Runtime runtime,
              Theirs theirs) {
    const OleString wideFormat = tav::text::Widen(format);
    const OleString wideInput = tav::text::Widen(input);
    const int expected = theirs(input, format);
    Names().push_back(name);
    benchmark::RegisterBenchmark(("Scan/" + name).c_str(), [=](benchmark::State& state) {
        if (compiled(wideInput) != expected || runtime(wideInput, wideFormat) != expected) {
            state.SkipWithError("Scan and sscanf disagree");
        }
        for (auto _ : state) {
            benchmark::DoNotOptimize(compiled(wideInput));
        }
    });
    benchmark::RegisterBenchmark(("ScanRuntime/" + name).c_str(), [=](benchmark::State& state) {
        for (auto _ : state) {
            benchmark::DoNotOptimize(runtime(wideInput, wideFormat));
        }
    });
    benchmark::RegisterBenchmark(("sscanf/" + name).c_str(), [=](benchmark::State& state) {
        for (auto _ : state) {
            benchmark::DoNotOptimize(theirs(input, format));
        }
    });
}

// Makes every target's contents observable, so that no store is elided.
template <typename... Targets>
void Keep(Targets&&... targets) {
    (benchmark::DoNotOptimize(targets), ...);
}

// One grammar's three ways from one list of targets, declared once.
#define TAV_SCAN_GRAMMAR(name, format, input, OURS, THEIRS, ...)                       \
    Register(                                                                          \
        name, format, input,                                                           \
        [](OleStringView in) {                                                         \
            OURS;                                                                      \
            const int r = Scan<OLESTR(format)>(in, __VA_ARGS__);                       \
            Keep(__VA_ARGS__);                                                         \
            return r;                                                                  \
        },                                                                             \
        [](OleStringView in, OleStringView f) {                                        \
            OURS;                                                                      \
            const int r = Scan(in, f, __VA_ARGS__);                                    \
            Keep(__VA_ARGS__);                                                         \
            return r;                                                                  \
        },                                                                             \
        [](const char* in, const char* f) {                                            \
            THEIRS;                                                                    \
            const int r = std::sscanf(in, f, __VA_ARGS__);                             \
            Keep(__VA_ARGS__);                                                         \
            return r;                                                                  \
        })

void RegisterReplyGrammars() {
    TAV_SCAN_GRAMMAR("time_t", "-time_t %lu", "-time_t 1700000000", std::uint32_t v, unsigned long v, &v);
    TAV_SCAN_GRAMMAR("quoted_name", "-Name \"%256[^\"]", "-Name \"Robot cell 1 of the east wing\"",
                     OLECHAR name[257], char name[257], name);
    TAV_SCAN_GRAMMAR("auto_condition_head", "-auto_ch %d -noelts %d\t%n", "-auto_ch 1 -noelts 12\tMotorOn;1;100\t",
                     int a; int b; int n, int a; int b; int n, &a, &b, &n);
    TAV_SCAN_GRAMMAR("auto_condition_element", "%10[^;];%d;%lu\t%n", "MotorOn;1;4294967295\tRunMode;0;1\t",
                     OLECHAR name[11]; int keep; std::uint32_t value; int n,
                     char name[11]; int keep; unsigned long value; int n, name, &keep, &value, &n);
    TAV_SCAN_GRAMMAR("storage_device", "%30[^;];%20[^;];%d;%d\t%n", "HD0:/internal;flash disk;1;0\tUSB1;usb;0;1\t",
                     OLECHAR name[31]; OLECHAR type[21]; int enabled; int readOnly; int n,
                     char name[31]; char type[21]; int enabled; int readOnly; int n, name, type, &enabled,
                     &readOnly, &n);
    TAV_SCAN_GRAMMAR("slot_head", "-noelts,all,mark,cc %ld,%ld,%lu,%lu\t%n",
                     "-noelts,all,mark,cc 17,1,0,4294967295\tslot",
                     std::int32_t count; std::int32_t all; std::uint32_t mark; std::uint32_t cursor; int n,
                     long count; long all; unsigned long mark; unsigned long cursor; int n, &count, &all, &mark,
                     &cursor, &n);
    TAV_SCAN_GRAMMAR("number_array_element", "%lf,%n", "-1234.5625e-3,17.25,", double v; int n, double v; int n,
                     &v, &n);
    TAV_SCAN_GRAMMAR("flag_array_element", "%c%n", "1011", OLECHAR c; int n, char c; int n, &c, &n);
    TAV_SCAN_GRAMMAR("ip_address", "%lu.%lu.%lu.%lu", "192.168.100.254",
                     std::uint32_t a; std::uint32_t b; std::uint32_t c; std::uint32_t d,
                     unsigned long a; unsigned long b; unsigned long c; unsigned long d, &a, &b, &c, &d);
    TAV_SCAN_GRAMMAR(
        "camera_info2",
        "-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
        "-currDNSServer\"%40s -currDNSSuffix \"%40s -currIsDHCPEnabled %d -confIPAddress \"%40s "
        "-confSubnetMask \"%40s -confDefaultGateway \"%40s -confHostName \"%40s -confDNSServer \"%40s "
        "-ConfDNSSuffix \"%40s -confIsDHCPEnabled %d -confCameraName \"%40s -cameraIdx %d -macAddress\"%40s  "
        "-Status \"%20s  -username \"%40[^\"]",
        "-currIPAddress \"192.168.1.20\" -currSubnetMask \"255.255.255.0\" -currDefaultGateway \"192.168.1.1\" "
        "-currHostName \"cam-7\" -currDNSServer\"192.168.1.2\" -currDNSSuffix \"cell.local\" -currIsDHCPEnabled 0 "
        "-confIPAddress \"192.168.1.20\" -confSubnetMask \"255.255.255.0\" -confDefaultGateway \"192.168.1.1\" "
        "-confHostName \"cam-7\" -confDNSServer \"192.168.1.2\" -ConfDNSSuffix \"cell.local\" "
        "-confIsDHCPEnabled 0 -confCameraName \"Gripper\" -cameraIdx 2 -macAddress\"00:1A:2B:3C:4D:5E\" "
        "-Status \"Running\" -username \"operator\"",
        OLECHAR f1[41]; OLECHAR f2[41]; OLECHAR f3[41]; OLECHAR f4[41]; OLECHAR f5[41]; OLECHAR f6[41]; int d1;
        OLECHAR f7[41]; OLECHAR f8[41]; OLECHAR f9[41]; OLECHAR f10[41]; OLECHAR f11[41]; OLECHAR f12[41];
        int d2; OLECHAR f13[41]; int idx; OLECHAR f14[41]; OLECHAR status[21]; OLECHAR user[41],
        char f1[41]; char f2[41]; char f3[41]; char f4[41]; char f5[41]; char f6[41]; int d1; char f7[41];
        char f8[41]; char f9[41]; char f10[41]; char f11[41]; char f12[41]; int d2; char f13[41]; int idx;
        char f14[41]; char status[21]; char user[41],
        f1, f2, f3, f4, f5, f6, &d1, f7, f8, f9, f10, f11, f12, &d2, f13, &idx, f14, status, user);
}

#undef TAV_SCAN_GRAMMAR

void PrintRatios(tav::bench::MedianReporter& reporter, std::ostream& out) {
    out << "\nScan time / sscanf time, same text, same process (compiled format; read at run time):\n";
    double logCompiled = 0;
    double logRuntime = 0;
    int count = 0;
    for (const std::string& name : Names()) {
        const double compiled = reporter.Median("Scan/" + name);
        const double runtime = reporter.Median("ScanRuntime/" + name);
        const double theirs = reporter.Median("sscanf/" + name);
        if (compiled <= 0 || runtime <= 0 || theirs <= 0) {
            continue;
        }
        char line[160];
        std::snprintf(line, sizeof line, "  %-24s %6.3f  %6.3f\n", name.c_str(), compiled / theirs, runtime / theirs);
        out << line;
        logCompiled += std::log(compiled / theirs);
        logRuntime += std::log(runtime / theirs);
        ++count;
    }
    if (count > 0) {
        char line[160];
        std::snprintf(line, sizeof line, "  %-24s %6.3f  %6.3f\n", "geometric mean", std::exp(logCompiled / count),
                      std::exp(logRuntime / count));
        out << line;
    }
}

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    RegisterReplyGrammars();
    tav::bench::MedianReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    PrintRatios(reporter, std::cout);
    benchmark::Shutdown();
    return 0;
}
