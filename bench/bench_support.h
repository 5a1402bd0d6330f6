#pragma once
// What the end-to-end benchmarks share: a client process set up as a real
// one is (COM, the virtual controller registered in-process, a controller
// object from the module's class object, initialised). The class decides
// which interfaces the object answers: the later ones need a later class.
#include "TavController.h"
#include "median_reporter.h"
#include "module/server_exports.h"
#include "sim/virtual_controller.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/com_scope.h"

namespace tav::bench {

class Client {
public:
    explicit Client(const CLSID& classId = CLSID_TavController) {
        simulator_ = sim::RegisterInProcess();
        if (!simulator_) {
            failure_ = "cannot register the virtual controller";
            return;
        }
        ComPtr<IClassFactory> factory;
        if (FAILED(DllGetClassObject(classId, IID_PPV_ARGS(&factory))) ||
            FAILED(factory->CreateInstance(nullptr, IID_PPV_ARGS(&controller_)))) {
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
    }

    ITavController* Controller() const { return controller_.Get(); }
    const char* Failure() const { return failure_; }
    void Fail(const char* why) { failure_ = why; }

private:
    ComScope com_;
    sim::InProcessRegistration simulator_;
    ComPtr<ITavController> controller_;
    const char* failure_ = nullptr;
};

// The main of a benchmark run against a client: reads the benchmark switches
// (an unknown one ends the run with 1), makes the client, which the
// benchmarks reach through `current`, lets `registerBenchmarks` add them, and
// runs them with a Reporter.
template <typename ClientType, typename Reporter, typename Register>
int RunWithClient(int argc, char** argv, ClientType*& current, Register&& registerBenchmarks) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    ClientType client;
    current = &client;
    registerBenchmarks(client);
    Reporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    current = nullptr;
    return 0;
}

}  // namespace tav::bench
