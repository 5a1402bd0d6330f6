#pragma once
#include <chrono>
#include <filesystem>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "tav/platform.h"

namespace tavctl {

// What the options before the command say.
struct GlobalOptions {
    std::optional<std::filesystem::path> module;
    std::string className = "TavController17";
    std::string url;              // empty: the embedded virtual controller
    bool embedded = true;         // register the virtual controller in-process
    bool async = false;
    ULONG timeoutMs = 5000;
    bool echo = false;            // batch: print each command before running it
    bool keepGoing = false;       // batch: go on after a failing command
    bool json = false;            // values as JSON
    bool trace = false;           // print what the virtual controller receives
    unsigned client = 1;          // which controller object runs the command
    // Fault switches of the embedded virtual controller.
    std::vector<std::pair<std::string, std::chrono::milliseconds>> simDelays;
    std::vector<std::pair<std::string, HRESULT>> simFailures;
    std::vector<std::string> simGarbled;  // commands whose replies arrive mangled
    bool simLinkDown = false;
    std::vector<std::string> simPlugged;  // removable devices plugged in
};

// Exit statuses.
inline constexpr int kExitOk = 0;
inline constexpr int kExitFailed = 1;   // an operation failed
inline constexpr int kExitUsage = 2;    // the command line is wrong
inline constexpr int kExitSetup = 3;    // module, class or Init failed

// The most controller objects one run may make with --client.
inline constexpr unsigned kMaxClients = 16;

// "--client N": the client number, or empty when the text is none.
std::optional<unsigned> ClientNumber(const std::string& text);

// Parses the options in front of the command; `next` is left at the
// command's first word. Empty (with the message printed) on a usage error;
// `helpWanted` when --help came before any command.
std::optional<GlobalOptions> ParseGlobalOptions(const std::vector<std::string>& args, std::size_t& next,
                                                bool& helpWanted);

// The text of tavctl --help.
std::string GeneralHelp();

}  // namespace tavctl
