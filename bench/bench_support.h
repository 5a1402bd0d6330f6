#pragma once
// What the end-to-end benchmarks share: a client process set up as a real
// one is (COM, the virtual controller registered in-process, a controller
// object from the module's class object, initialised), and a console
// reporter that keeps each benchmark's median CPU time for a closing table.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <map>
#include <string>
#include <vector>

#include "TavController.h"
#include "module/server_exports.h"
#include "sim/virtual_controller.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"

namespace tav::bench {

class Client {
public:
    Client() {
        comInitialised_ = SUCCEEDED(CoInitializeEx(nullptr, COINIT_MULTITHREADED));
        simulator_ = sim::RegisterInProcess();
        if (!simulator_) {
            failure_ = "cannot register the virtual controller";
            return;
        }
        ComPtr<IClassFactory> factory;
        if (FAILED(DllGetClassObject(CLSID_TavController, IID_IClassFactory, reinterpret_cast<void**>(&factory))) ||
            FAILED(factory->CreateInstance(nullptr, IID_ITavController, reinterpret_cast<void**>(&controller_)))) {
            failure_ = "cannot create a TavController object";
            return;
        }
        const Bstr url(sim::kDefaultUrl);
        if (FAILED(controller_->Init(url.Get()))) {
            failure_ = "cannot initialise the controller";
            controller_ = nullptr;
        }
    }
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;

    ~Client() {
        controller_ = nullptr;
        simulator_.Revoke();
        if (comInitialised_) {
            CoUninitialize();
        }
    }

    ITavController* Controller() const { return controller_.Get(); }
    const char* Failure() const { return failure_; }
    void Fail(const char* why) { failure_ = why; }

private:
    bool comInitialised_ = false;
    sim::InProcessRegistration simulator_;
    ComPtr<ITavController> controller_;
    const char* failure_ = nullptr;
};

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

protected:
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
