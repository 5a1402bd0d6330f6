// Scan against the C library's sscanf on the reply formats of the system,
// both on the same ASCII text in the same process. Each format runs twice,
// as "Scan/<name>" and "sscanf/<name>"; the table printed at the end gives
// the time of Scan as a share of the time of sscanf.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <iostream>
#include <map>
#include <string>

#include "core/text/convert.h"
#include "core/text/scan.h"

namespace {

using tav::OleString;
using tav::OleStringView;
using tav::text::Scan;

// Registers one format: ours reads OLECHAR text, theirs the same text in
// ASCII. Each returns the number of fields, checked once before timing.
template <typename Ours, typename Theirs>
void Register(const std::string& name, const char* format, const char* input, Ours ours, Theirs theirs) {
    const OleString wideFormat = tav::text::Widen(format);
    const OleString wideInput = tav::text::Widen(input);
    const int expected = theirs(input, format);
    benchmark::RegisterBenchmark(("Scan/" + name).c_str(), [=](benchmark::State& state) {
        if (ours(wideInput, wideFormat) != expected) {
            state.SkipWithError("Scan and sscanf disagree");
        }
        for (auto _ : state) {
            benchmark::DoNotOptimize(ours(wideInput, wideFormat));
        }
    });
    benchmark::RegisterBenchmark(("sscanf/" + name).c_str(), [=](benchmark::State& state) {
        for (auto _ : state) {
            benchmark::DoNotOptimize(theirs(input, format));
        }
    });
}

void RegisterReplyFormats() {
    Register(
        "time_t", "-time_t %lu", "-time_t 1700000000",
        [](OleStringView in, OleStringView f) {
            std::uint32_t v;
            const int r = Scan(in, f, &v);
            benchmark::DoNotOptimize(v);
            return r;
        },
        [](const char* in, const char* f) {
            unsigned long v;
            const int r = std::sscanf(in, f, &v);
            benchmark::DoNotOptimize(v);
            return r;
        });
    Register(
        "quoted_name", "-Name \"%256[^\"]", "-Name \"Robot cell 1 of the east wing\"",
        [](OleStringView in, OleStringView f) {
            OLECHAR name[257];
            const int r = Scan(in, f, name);
            benchmark::DoNotOptimize(name);
            return r;
        },
        [](const char* in, const char* f) {
            char name[257];
            const int r = std::sscanf(in, f, name);
            benchmark::DoNotOptimize(name);
            return r;
        });
    Register(
        "auto_condition_head", "-auto_ch %d -noelts %d\t%n", "-auto_ch 1 -noelts 12\tMotorOn;1;100\t",
        [](OleStringView in, OleStringView f) {
            int a, b, n;
            const int r = Scan(in, f, &a, &b, &n);
            benchmark::DoNotOptimize(n);
            return r;
        },
        [](const char* in, const char* f) {
            int a, b, n;
            const int r = std::sscanf(in, f, &a, &b, &n);
            benchmark::DoNotOptimize(n);
            return r;
        });
    Register(
        "auto_condition_element", "%10[^;];%d;%lu\t%n", "MotorOn;1;4294967295\tRunMode;0;1\t",
        [](OleStringView in, OleStringView f) {
            OLECHAR name[11];
            int keep, n;
            std::uint32_t value;
            const int r = Scan(in, f, name, &keep, &value, &n);
            benchmark::DoNotOptimize(n);
            return r;
        },
        [](const char* in, const char* f) {
            char name[11];
            int keep, n;
            unsigned long value;
            const int r = std::sscanf(in, f, name, &keep, &value, &n);
            benchmark::DoNotOptimize(n);
            return r;
        });
    Register(
        "storage_device", "%30[^;];%20[^;];%d;%d\t%n", "HD0:/internal;flash disk;1;0\tUSB1;usb;0;1\t",
        [](OleStringView in, OleStringView f) {
            OLECHAR name[31], type[21];
            int enabled, readOnly, n;
            const int r = Scan(in, f, name, type, &enabled, &readOnly, &n);
            benchmark::DoNotOptimize(n);
            return r;
        },
        [](const char* in, const char* f) {
            char name[31], type[21];
            int enabled, readOnly, n;
            const int r = std::sscanf(in, f, name, type, &enabled, &readOnly, &n);
            benchmark::DoNotOptimize(n);
            return r;
        });
    Register(
        "slot_head", "-noelts,all,mark,cc %ld,%ld,%lu,%lu\t%n", "-noelts,all,mark,cc 17,1,0,4294967295\tslot",
        [](OleStringView in, OleStringView f) {
            std::int32_t count, all;
            std::uint32_t mark, cursor;
            int n;
            const int r = Scan(in, f, &count, &all, &mark, &cursor, &n);
            benchmark::DoNotOptimize(n);
            return r;
        },
        [](const char* in, const char* f) {
            long count, all;
            unsigned long mark, cursor;
            int n;
            const int r = std::sscanf(in, f, &count, &all, &mark, &cursor, &n);
            benchmark::DoNotOptimize(n);
            return r;
        });
    Register(
        "number_array_element", "%lf,%n", "-1234.5625e-3,17.25,",
        [](OleStringView in, OleStringView f) {
            double v;
            int n;
            const int r = Scan(in, f, &v, &n);
            benchmark::DoNotOptimize(v);
            return r;
        },
        [](const char* in, const char* f) {
            double v;
            int n;
            const int r = std::sscanf(in, f, &v, &n);
            benchmark::DoNotOptimize(v);
            return r;
        });
    Register(
        "flag_array_element", "%c%n", "1011",
        [](OleStringView in, OleStringView f) {
            OLECHAR c;
            int n;
            const int r = Scan(in, f, &c, &n);
            benchmark::DoNotOptimize(c);
            return r;
        },
        [](const char* in, const char* f) {
            char c;
            int n;
            const int r = std::sscanf(in, f, &c, &n);
            benchmark::DoNotOptimize(c);
            return r;
        });
    Register(
        "ip_address", "%lu.%lu.%lu.%lu", "192.168.100.254",
        [](OleStringView in, OleStringView f) {
            std::uint32_t a, b, c, d;
            const int r = Scan(in, f, &a, &b, &c, &d);
            benchmark::DoNotOptimize(d);
            return r;
        },
        [](const char* in, const char* f) {
            unsigned long a, b, c, d;
            const int r = std::sscanf(in, f, &a, &b, &c, &d);
            benchmark::DoNotOptimize(d);
            return r;
        });
    Register(
        "camera_info",
        "-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
        "-currIsDHCPEnabled %d -cameraName \"%40s -Status \"%20[^\"]",
        "-currIPAddress \"192.168.1.20\" -currSubnetMask \"255.255.255.0\" -currDefaultGateway \"192.168.1.1\" "
        "-currHostName \"cam-7\" -currIsDHCPEnabled 1 -cameraName \"Gripper camera\" -Status \"Running fine\"",
        [](OleStringView in, OleStringView f) {
            OLECHAR ip[41], mask[41], gateway[41], host[41], name[41], status[21];
            int dhcp;
            const int r = Scan(in, f, ip, mask, gateway, host, &dhcp, name, status);
            benchmark::DoNotOptimize(status);
            return r;
        },
        [](const char* in, const char* f) {
            char ip[41], mask[41], gateway[41], host[41], name[41], status[21];
            int dhcp;
            const int r = std::sscanf(in, f, ip, mask, gateway, host, &dhcp, name, status);
            benchmark::DoNotOptimize(status);
            return r;
        });
}

// The usual console output, then Scan's time as a share of sscanf's.
class RatioReporter : public benchmark::ConsoleReporter {
public:
    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            if (run.run_type != Run::RT_Iteration || run.error_occurred) {
                continue;
            }
            const std::string name = run.benchmark_name();
            const auto slash = name.find('/');
            Timing& timing = timings_[name.substr(slash + 1)];
            (name.compare(0, slash, "Scan") == 0 ? timing.ours : timing.theirs) = run.GetAdjustedCPUTime();
        }
    }

    void Finalize() override {
        ConsoleReporter::Finalize();
        std::ostream& out = GetOutputStream();
        out << "\nScan time / sscanf time, same text, same process:\n";
        double logSum = 0;
        int count = 0;
        for (const auto& [name, timing] : timings_) {
            if (timing.ours <= 0 || timing.theirs <= 0) {
                continue;
            }
            const double ratio = timing.ours / timing.theirs;
            char line[128];
            std::snprintf(line, sizeof line, "  %-24s %6.3f\n", name.c_str(), ratio);
            out << line;
            logSum += std::log(ratio);
            ++count;
        }
        if (count > 0) {
            char line[128];
            std::snprintf(line, sizeof line, "  %-24s %6.3f\n", "geometric mean", std::exp(logSum / count));
            out << line;
        }
    }

private:
    struct Timing {
        double ours = 0;
        double theirs = 0;
    };
    std::map<std::string, Timing> timings_;
};

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    RegisterReplyFormats();
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    return 0;
}
