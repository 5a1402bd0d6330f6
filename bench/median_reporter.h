#pragma once
// A console reporter that keeps each benchmark's median CPU and real time,
// so that a benchmark can close with a table of ratios against its baseline,
// with or without repetitions, and when only aggregates are reported.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <map>
#include <string>
#include <vector>

namespace tav::bench {

// The usual console output; Median("name" or "name/arg") then gives a
// benchmark's CPU time, the median of its repetitions when there are several.
class MedianReporter : public benchmark::ConsoleReporter {
public:
    // Plain text, so that the figures can be pasted as they are.
    MedianReporter() : ConsoleReporter(OO_Tabular) {}

    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            if (run.error_occurred) {
                continue;
            }
            const std::string& args = run.run_name.args;
            const std::string name = run.run_name.function_name + (args.empty() ? "" : "/" + args);
            Timings& cpu = cpu_[name];
            Timings& real = real_[name];
            if (run.run_type == Run::RT_Iteration) {
                cpu.repetitions.push_back(run.GetAdjustedCPUTime());
                real.repetitions.push_back(run.GetAdjustedRealTime());
            } else if (run.aggregate_name == "median") {
                cpu.median = run.GetAdjustedCPUTime();
                real.median = run.GetAdjustedRealTime();
            }
        }
    }

public:
    double Median(const std::string& name) { return MedianOf(cpu_[name]); }

    // The same for wall-clock time, for work spread over several threads,
    // which the calling thread's CPU time does not cover.
    double MedianRealTime(const std::string& name) { return MedianOf(real_[name]); }

private:
    struct Timings {
        std::vector<double> repetitions;
        double median = 0;
    };

    static double MedianOf(Timings& timings) {
        if (timings.median > 0 || timings.repetitions.empty()) {
            return timings.median;
        }
        std::vector<double>& all = timings.repetitions;
        std::nth_element(all.begin(), all.begin() + all.size() / 2, all.end());
        return all[all.size() / 2];
    }

    std::map<std::string, Timings> cpu_;
    std::map<std::string, Timings> real_;
};

}  // namespace tav::bench
