// tavctl: one controller operation per command, from the command line or a
// batch, through the TavController module.
#include <algorithm>
#include <fstream>
#include <iostream>
#include <optional>
#include <string>
#include <vector>

#include "sim/virtual_controller.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tavctl/command_support.h"
#include "tavctl/commands.h"
#include "tavctl/module_loader.h"
#include "tavctl/names.h"
#include "tavctl/options.h"
#include "tavctl/session.h"
#include "tavctl/text.h"

namespace tavctl {
namespace {

constexpr const char* kBatchHelp =
    "Usage: tavctl [OPTIONS] batch [FILE]\n"
    "Runs the commands in FILE (standard input when FILE is - or missing), one\n"
    "per line, against one controller object. Words are separated by blanks;\n"
    "double quotes group words (\\\" is a quote), # starts a comment. Stops at\n"
    "the first failing command unless --keep-going; --echo prints each command.\n";

// COMMAND --help needs neither the module nor a controller.
std::optional<int> HelpOnly(const std::vector<std::string>& words) {
    const bool asked = std::find_if(words.begin(), words.end(), [](const std::string& w) {
                           return w == "--help" || w == "-h";
                       }) != words.end();
    if (words.empty() || !asked) {
        return std::nullopt;
    }
    if (words.front() == "batch") {
        std::cout << kBatchHelp;
        return kExitOk;
    }
    for (const CommandSpec& command : Commands()) {
        if (words.front() == command.name) {
            std::cout << command.help;
            return kExitOk;
        }
    }
    return std::nullopt;
}

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
    if (options.simLinkDown) {
        controller->Faults().FailTransport();
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

int Run(const std::vector<std::string>& args) {
    std::size_t next = 0;
    bool helpWanted = false;
    auto options = ParseGlobalOptions(args, next, helpWanted);
    if (!options) {
        return kExitUsage;
    }
    const std::vector<std::string> words(args.begin() + static_cast<std::ptrdiff_t>(next), args.end());
    if (auto status = HelpOnly(words)) {
        return *status;
    }
    if (helpWanted) {
        std::cout << GeneralHelp();
        return kExitOk;
    }
    if (words.empty()) {
        std::cerr << "tavctl: no command given (tavctl --help lists them)\n";
        return kExitUsage;
    }
    const CLSID* clsid = ClassByName(options->className);
    if (clsid == nullptr) {
        std::cerr << "tavctl: unknown class " << options->className
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
    tav::ComPtr<ITavController> controller;
    HRESULT hr = module->CreateInstance(*clsid, IID_ITavController, reinterpret_cast<void**>(&controller));
    if (FAILED(hr)) {
        std::cerr << "tavctl: cannot create " << options->className << " from " << module->Path().string() << ": "
                  << DescribeHresult(hr) << "\n";
        return kExitSetup;
    }
    Session session(*options, controller);
    const tav::Bstr url = ToBstr(options->url);
    hr = controller->Init(url.Get());
    if (FAILED(hr)) {
        session.Fail("Init(" + options->url + ")", hr);
        return kExitSetup;
    }

    if (words.front() == "batch") {
        if (words.size() > 2) {
            return session.Usage("batch", "expected at most one file");
        }
        if (words.size() == 1 || words[1] == "-") {
            return RunBatch(session, std::cin);
        }
        std::ifstream file(words[1]);
        if (!file) {
            session.Error("cannot read " + words[1]);
            return kExitUsage;
        }
        return RunBatch(session, file);
    }
    return RunCommand(session, words);
}

}  // namespace
}  // namespace tavctl

int main(int argc, char** argv) {
    const bool comInitialised = SUCCEEDED(CoInitializeEx(nullptr, COINIT_MULTITHREADED));
    int status = tavctl::kExitFailed;
    try {
        status = tavctl::Run(std::vector<std::string>(argv + 1, argv + argc));
    } catch (const std::exception& error) {
        std::cerr << "tavctl: " << error.what() << "\n";
    }
    if (comInitialised) {
        CoUninitialize();
    }
    return status;
}
