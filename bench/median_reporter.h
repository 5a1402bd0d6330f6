#pragma once
// A console reporter that keeps each benchmark's median CPU time, so that a
// benchmark can close with a table of ratios against its baseline, with or
// without repetitions, and when only aggregates are reported.
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
            Timings& timings = timings_[run.run_name.function_name + (args.empty() ? "" : "/" + args)];
            if (run.run_type == Run::RT_Iteration) {
                timings.repetitions.push_back(run.GetAdjustedCPUTime());
            } else if (run.aggregate_name == "median") {
                timings.median = run.GetAdjustedCPUTime();
            }
        }
    }

public:
    double Median(const std::string& name) {
        Timings& timings = timings_[name];
        if (timings.median > 0 || timings.repetitions.empty()) {
            return timings.median;
        }
        std::vector<double>& all = timings.repetitions;
        std::nth_element(all.begin(), all.begin() + all.size() / 2, all.end());
        return all[all.size() / 2];
    }

private:
    struct Timings {
        std::vector<double> repetitions;
        double median = 0;
    };
    std::map<std::string, Timings> timings_;
};

}  // namespace tav::bench
