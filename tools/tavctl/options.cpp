#include "tavctl/options.h"

#include <cerrno>
#include <cstdlib>
#include <iostream>
#include <sstream>

#include "tavctl/commands.h"

namespace tavctl {
namespace {

// A 32-bit unsigned number, decimal or 0x-hexadecimal, and nothing else.
std::optional<unsigned long> Number(const std::string& text) {
    if (text.empty() || text[0] == '-' || text[0] == '+' || text[0] == ' ') {
        return std::nullopt;
    }
    errno = 0;
    char* end = nullptr;
    const unsigned long long value = std::strtoull(text.c_str(), &end, 0);
    if (*end != '\0' || errno == ERANGE || value > 0xFFFFFFFFull) {
        return std::nullopt;
    }
    return static_cast<unsigned long>(value);
}

bool Usage(const std::string& message) {
    std::cerr << "tavctl: " << message << "\n(tavctl --help shows the usage)\n";
    return false;
}

}  // namespace

std::optional<unsigned> ClientNumber(const std::string& text) {
    if (text.empty() || text.find_first_not_of("0123456789") != std::string::npos || text.size() > 3) {
        return std::nullopt;
    }
    const unsigned long number = std::strtoul(text.c_str(), nullptr, 10);
    if (number < 1 || number > kMaxClients) {
        return std::nullopt;
    }
    return static_cast<unsigned>(number);
}

std::optional<GlobalOptions> ParseGlobalOptions(const std::vector<std::string>& args, std::size_t& next,
                                                bool& helpWanted) {
    GlobalOptions options;
    bool simWanted = false;
    helpWanted = false;
    std::size_t i = 0;
    auto value = [&](const std::string& option) -> std::optional<std::string> {
        if (i + 1 >= args.size()) {
            Usage(option + " needs a value");
            return std::nullopt;
        }
        return args[++i];
    };
    for (; i < args.size(); ++i) {
        const std::string& arg = args[i];
        if (arg.empty() || arg[0] != '-') {
            break;
        }
        if (arg == "-h" || arg == "--help") {
            helpWanted = true;
        } else if (arg == "--module") {
            const auto path = value(arg);
            if (!path) return std::nullopt;
            options.module = std::filesystem::path(*path);
        } else if (arg == "--class") {
            const auto name = value(arg);
            if (!name) return std::nullopt;
            options.className = *name;
        } else if (arg == "--url") {
            const auto url = value(arg);
            if (!url) return std::nullopt;
            options.url = *url;
        } else if (arg == "--sim") {
            simWanted = true;
        } else if (arg == "--async") {
            options.async = true;
        } else if (arg == "--timeout") {
            const auto text = value(arg);
            if (!text) return std::nullopt;
            const auto ms = Number(*text);
            if (!ms) {
                Usage("--timeout wants milliseconds, not " + *text);
                return std::nullopt;
            }
            options.timeoutMs = static_cast<ULONG>(*ms);
        } else if (arg == "--json") {
            options.json = true;
        } else if (arg == "--trace") {
            options.trace = true;
        } else if (arg == "--client") {
            const auto text = value(arg);
            if (!text) return std::nullopt;
            const auto number = ClientNumber(*text);
            if (!number) {
                Usage("--client wants a number from 1 to " + std::to_string(kMaxClients) + ", not " + *text);
                return std::nullopt;
            }
            options.client = *number;
        } else if (arg == "--echo") {
            options.echo = true;
        } else if (arg == "--keep-going") {
            options.keepGoing = true;
        } else if (arg == "--sim-delay") {
            const auto text = value(arg);
            if (!text) return std::nullopt;
            const std::size_t equals = text->find('=');
            const auto ms = equals == std::string::npos ? std::nullopt : Number(text->substr(equals + 1));
            if (!ms) {
                Usage("--sim-delay wants COMMAND=MILLISECONDS, not " + *text);
                return std::nullopt;
            }
            options.simDelays.emplace_back(text->substr(0, equals), std::chrono::milliseconds(*ms));
        } else if (arg == "--sim-fail") {
            const auto text = value(arg);
            if (!text) return std::nullopt;
            const std::size_t equals = text->find('=');
            HRESULT status = static_cast<HRESULT>(0xC0049007u);
            if (equals != std::string::npos) {
                const auto code = Number(text->substr(equals + 1));
                if (!code) {
                    Usage("--sim-fail wants COMMAND[=HRESULT], not " + *text);
                    return std::nullopt;
                }
                status = static_cast<HRESULT>(static_cast<std::uint32_t>(*code));
            }
            options.simFailures.emplace_back(text->substr(0, equals), status);
        } else if (arg == "--sim-garble") {
            const auto command = value(arg);
            if (!command) return std::nullopt;
            options.simGarbled.push_back(*command);
        } else if (arg == "--sim-link-down") {
            options.simLinkDown = true;
        } else if (arg == "--sim-plug") {
            const auto name = value(arg);
            if (!name) return std::nullopt;
            options.simPlugged.push_back(*name);
        } else {
            Usage("unknown option " + arg);
            return std::nullopt;
        }
    }
    next = i;
    options.embedded = options.url.empty() || simWanted;
    if (options.url.empty()) {
        options.url = "/sim";
    }
    const bool faults = !options.simDelays.empty() || !options.simFailures.empty() || !options.simGarbled.empty() ||
                        options.simLinkDown ||
                        !options.simPlugged.empty();
    if (faults && !options.embedded) {
        Usage("the --sim-... switches need the embedded virtual controller (no --url, or --sim)");
        return std::nullopt;
    }
    return options;
}

std::string GeneralHelp() {
    std::ostringstream help;
    help << "Usage: tavctl [OPTIONS] GROUP VERB [ARGS...]\n"
            "       tavctl [OPTIONS] batch [FILE]\n"
            "\n"
            "Talks to a robot controller through the TavController module: loads the\n"
            "module, creates a controller object, calls Init with the URL and runs one\n"
            "operation per command. Without --url it talks to the embedded virtual\n"
            "controller at /sim.\n"
            "\n"
            "Options:\n"
            "  --module PATH        the TavController module (default: next to tavctl,\n"
            "                       then the build tree's module folder)\n"
            "  --class NAME         the class to create (default TavController17)\n"
            "  --url URL            the controller's URL; the command component comes\n"
            "                       from the registry\n"
            "  --sim                use the embedded virtual controller also with --url\n"
            "  --async              call asynchronously and print the reply that arrives\n"
            "                       at the callback, decoded\n"
            "  --timeout MS         time-out handed to the command component (default 5000)\n"
            "  --json               print values as JSON (also after any command)\n"
            "  --trace              print every command the embedded virtual controller\n"
            "                       receives, with its reply and the time it took (other\n"
            "                       programs: TAV_SIM_TRACE=stderr or =FILE)\n"
            "  --client N           run the command on controller object N (1 to 16, each\n"
            "                       made and initialised on first use; in a batch a line\n"
            "                       may start with --client N)\n"
            "  --echo               batch: print each command before running it\n"
            "  --keep-going         batch: go on after a failing command\n"
            "  --sim-delay CMD=MS   virtual controller: answer controller command CMD\n"
            "                       (e.g. SystemClock) after MS milliseconds\n"
            "  --sim-fail CMD[=HR]  virtual controller: answer CMD with failure status HR\n"
            "  --sim-garble CMD     virtual controller: CMD's replies arrive cut short\n"
            "  --sim-link-down      virtual controller: the transport fails\n"
            "  --sim-plug DEVICE    virtual controller: plug in a removable storage\n"
            "                       device (e.g. usb1) holding a boot image and packages\n"
            "  -h, --help           this text; GROUP --help and GROUP VERB --help describe\n"
            "                       a group and a verb\n"
            "\n"
            "Groups:\n";
    for (const GroupEntry& group : Groups()) {
        const std::string name = group.name;
        help << "  " << name << std::string(name.size() < 12 ? 12 - name.size() : 1, ' ') << group.summary << "\n";
    }
    help << "  batch       run commands from FILE (or standard input), one per line\n"
            "\n"
            "Enums print and parse by their type-library names (MotorsOn, AutoChange, ...),\n"
            "times as ISO-8601 UTC (2026-11-21T02:30:00Z). Exit status: 0 done; 1 an\n"
            "operation failed (tavctl prints the HRESULT, its name and the module's\n"
            "last-error text); 2 the command line is wrong; 3 the module, class or Init\n"
            "failed.\n";
    return help.str();
}

}  // namespace tavctl
