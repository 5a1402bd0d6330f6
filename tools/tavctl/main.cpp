// tavctl: one controller operation per command, from the command line or a
// batch, through the TavController module.
#include <fstream>
#include <iostream>
#include <optional>
#include <string>
#include <vector>

#include "sim/subsystems/devices.h"
#include "sim/trace.h"
#include "sim/virtual_controller.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/com_scope.h"
#include "tavctl/arguments.h"
#include "tavctl/commands.h"
#include "tavctl/module_loader.h"
#include "tavctl/names.h"
#include "tavctl/options.h"
#include "tavctl/output.h"
#include "tavctl/session.h"
#include "tavctl/text.h"

namespace tavctl {
namespace {

constexpr const char* kBatchHelp =
    "Usage: tavctl [OPTIONS] batch [FILE]\n"
    "Runs the commands in FILE (standard input when FILE is - or missing), one\n"
    "per line, against the same controller objects. Words are separated by\n"
    "blanks; double quotes group words (\\\" is a quote), # starts a comment. A\n"
    "line may start with --client N (run on object N) and --json. Stops at the\n"
    "first failing command unless --keep-going; --echo prints each command.\n";

void ApplySimulatorFaults(const GlobalOptions& options) {
    const auto controller = tav::sim::ControllerAt(ToOle(options.url));
    if (!controller) {
        return;
    }
    for (const auto& [command, delay] : options.simDelays) {
        controller->Faults().SetDelay(ToOle(command), delay);
    }
    for (const auto& [command, status] : options.simFailures) {
        controller->Faults().FailCommand(ToOle(command), status);
    }
    for (const auto& command : options.simGarbled) {
        controller->Faults().GarbleReplies(ToOle(command));
    }
    if (options.simLinkDown) {
        controller->Faults().FailTransport();
    }
    for (const auto& device : options.simPlugged) {
        if (!tav::sim::PlugDevice(*controller, ToOle(device))) {
            std::cerr << "tavctl: --sim-plug: cannot plug in \"" << device << "\" (1 to 30 characters, not plugged yet)\n";
        }
    }
}

std::optional<ControllerModule> LoadModule(const GlobalOptions& options) {
    std::string error;
    if (options.module) {
        auto module = ControllerModule::Load(*options.module, error);
        if (!module) {
            std::cerr << "tavctl: " << error << "\n";
        }
        return module;
    }
    std::string reasons;
    for (const auto& path : DefaultModulePaths()) {
        if (!std::filesystem::exists(path)) {
            reasons += "\n  " + path.string() + ": not found";
            continue;
        }
        if (auto module = ControllerModule::Load(path, error)) {
            return module;
        }
        reasons += "\n  " + error;
    }
    std::cerr << "tavctl: cannot load the TavController module (--module PATH names it):" << reasons << "\n";
    return std::nullopt;
}

int RunBatch(Session& session, std::istream& input) {
    int result = kExitOk;
    std::string line;
    for (std::size_t number = 1; std::getline(input, line); ++number) {
        std::string error;
        auto words = SplitLine(line, error);
        if (!words) {
            session.Error("batch line " + std::to_string(number) + ": " + error);
            return kExitUsage;
        }
        if (words->empty()) {
            continue;
        }
        if (session.Options().echo) {
            const std::size_t first = line.find_first_not_of(" \t");
            session.Print("tavctl> " + line.substr(first));
        }
        const int status = RunCommand(session, std::move(*words));
        if (status != kExitOk) {
            if (!session.Options().keepGoing) {
                session.Error("batch stopped at line " + std::to_string(number));
                return status;
            }
            result = result == kExitOk ? status : result;
        }
    }
    return result;
}

// Ends the wire trace before the session it prints through goes.
struct TraceScope {
    explicit TraceScope(Session* session) : active(session != nullptr) {
        if (active) {
            tav::sim::SetTraceSink(
                [session](const tav::sim::TraceRecord& record) { session->Diagnostic("trace: " + tav::sim::TraceLine(record)); });
        }
    }
    ~TraceScope() {
        if (active) {
            tav::sim::SetTraceSink({});
        }
    }
    TraceScope(const TraceScope&) = delete;
    TraceScope& operator=(const TraceScope&) = delete;
    bool active;
};

int Run(const std::vector<std::string>& args) {
    std::size_t next = 0;
    bool helpWanted = false;
    auto options = ParseGlobalOptions(args, next, helpWanted);
    if (!options) {
        return kExitUsage;
    }
    const std::vector<std::string> words(args.begin() + static_cast<std::ptrdiff_t>(next), args.end());
    if (!words.empty() && words.front() == "batch" && (words.size() == 2 && (words[1] == "--help" || words[1] == "-h"))) {
        std::cout << kBatchHelp;
        return kExitOk;
    }
    if (auto help = HelpFor(words)) {
        std::cout << *help;
        return kExitOk;
    }
    if (helpWanted || (!words.empty() && (words.front() == "help"))) {
        std::cout << GeneralHelp();
        return kExitOk;
    }
    if (words.empty()) {
        std::cerr << "tavctl: no command given\n(tavctl --help lists the groups)\n";
        return kExitUsage;
    }
    if (words.front() != "batch" && words.front() != "--client" && words.front() != "--json" &&
        FindGroup(words.front()) == nullptr) {
        std::cerr << "tavctl: unknown group " << Quote(words.front()) << "\n(tavctl --help lists the groups)\n";
        return kExitUsage;
    }
    const CLSID* clsid = ClassByName(options->className);
    if (clsid == nullptr) {
        std::cerr << "tavctl: unknown class " << Quote(options->className)
                  << " (TavController, TavController2 ... TavController17)\n";
        return kExitUsage;
    }

    tav::sim::InProcessRegistration simulator;
    if (options->embedded) {
        simulator = tav::sim::RegisterInProcess();
        if (!simulator) {
            std::cerr << "tavctl: cannot register the virtual controller: " << DescribeHresult(simulator.Result())
                      << "\n";
            return kExitSetup;
        }
        ApplySimulatorFaults(*options);
    }
    const auto module = LoadModule(*options);
    if (!module) {
        return kExitSetup;
    }
    const std::string className = options->className;
    const std::string url = options->url;
    auto factory = [&](tav::ComPtr<ITavController>& client, std::string& error) {
        HRESULT hr = module->CreateInstance(*clsid, IID_ITavController, reinterpret_cast<void**>(&client));
        if (FAILED(hr)) {
            error = "cannot create " + className + " from " + module->Path().string() + ": " + DescribeHresult(hr);
            return hr;
        }
        const tav::Bstr text(tav::OleStringView(ToOle(url)));
        hr = client->Init(text.Get());
        if (FAILED(hr)) {
            tav::ComPtr<ITavHelperBase> helper;
            tav::Bstr lastError;
            if (SUCCEEDED(client->QueryInterface(IID_ITavHelperBase, reinterpret_cast<void**>(&helper)))) {
                helper->GetLastErrorInfo(lastError.Receive());
            }
            error = "Init(" + Quote(url) + ") failed: " + DescribeHresult(hr) +
                    "; last error: " + (lastError.IsNull() ? std::string("(none)") : ToUtf8(lastError.View()));
            client = nullptr;
        }
        return hr;
    };
    const unsigned firstClient = options->client;
    Session session(*options, factory);
    session.SelectClient(firstClient);
    TraceScope trace(options->trace ? &session : nullptr);
    // The object is made and bound before the first command, so that a bad
    // URL is a setup failure rather than the command's.
    if (session.Controller() == nullptr) {
        return kExitSetup;
    }

    if (words.front() == "batch") {
        if (words.size() > 2) {
            session.Error("batch: expected at most one file, not " + Quote(words[2]) + "\nUsage: tavctl batch [FILE]");
            return kExitUsage;
        }
        if (words.size() == 1 || words[1] == "-") {
            return RunBatch(session, std::cin);
        }
        std::ifstream file(words[1]);
        if (!file) {
            session.Error("batch: cannot read " + Quote(words[1]));
            return kExitUsage;
        }
        return RunBatch(session, file);
    }
    return RunCommand(session, words);
}

}  // namespace
}  // namespace tavctl

int main(int argc, char** argv) {
    const tav::ComScope com;
    int status = tavctl::kExitFailed;
    try {
        status = tavctl::Run(std::vector<std::string>(argv + 1, argv + argc));
    } catch (const std::exception& error) {
        std::cerr << "tavctl: " << error.what() << "\n";
    }
    return status;
}
