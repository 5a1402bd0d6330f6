// Writes the seeds of the decoder and command targets: each decoder's seed is
// what the virtual controller answers to its command, or, where it gives no
// answer (an event's text, a command it does not serve yet), a reply written
// from the decoder's grammar. Run by record_seeds.sh.
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <map>
#include <string>

#include "sim/command_table.h"
#include "unpack/decoder_table.h"

namespace {

using tav::sim::Text;
using tav::sim::TextView;

// One byte per character, 0xFF and two bytes for anything else: the targets'
// own encoding.
std::string Bytes(TextView text) {
    std::string bytes;
    for (OLECHAR c : text) {
        if (c < 0xFF) {
            bytes += static_cast<char>(c);
        } else {
            bytes += '\xFF';
            bytes += static_cast<char>(c >> 8);
            bytes += static_cast<char>(c & 0xFF);
        }
    }
    return bytes;
}

void Write(const std::filesystem::path& file, const std::string& bytes) {
    std::ofstream out(file, std::ios::binary | std::ios::trunc);
    out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
}

Text Widen(const char* text) { return text == nullptr ? Text() : tav::sim::Widen(text); }

}  // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: %s SEEDS_DIR\n", argv[0]);
        return 2;
    }
    const std::filesystem::path seeds(argv[1]);
    std::filesystem::create_directories(seeds / "unpack");
    std::filesystem::create_directories(seeds / "command");

    tav::sim::ControllerModel controller(OLESTR("/seeds"));
    const auto rows = tav::fuzz::DecoderRows();
    std::map<Text, Text> argsOf;  // command name: the arguments its decoder's row sends
    int recorded = 0, written = 0;
    for (std::size_t i = 0; i < rows.size(); ++i) {
        const auto& row = rows[i];
        Text reply;
        if (row.command != nullptr) {
            const Text verb = Widen(row.verb), name = Widen(row.command), args = Widen(row.args);
            argsOf.emplace(name, args);
            const Text url = name == OLESTR("EnvironmentVar") ? Text(OLESTR("/seeds/DHROOT")) : Text(OLESTR("/seeds"));
            const tav::sim::Reply answer = tav::sim::Dispatch(controller, {verb, name, args, url});
            if (SUCCEEDED(answer.status) && answer.hasText) reply = answer.text;
        }
        if (!reply.empty()) {
            ++recorded;
        } else if (*row.example != '\0') {
            reply = Widen(row.example);
            ++written;
        } else {
            std::fprintf(stderr, "no seed for %s\n", row.name);
            continue;
        }
        Write(seeds / "unpack" / row.name, std::string(1, static_cast<char>(i)) + Bytes(reply));
        // A seed that its own decoder refuses starts the search off the grammar.
        VARIANT data;
        VariantInit(&data);
        data.vt = VT_BSTR;
        data.bstrVal = SysAllocStringLen(reply.data(), static_cast<UINT>(reply.size()));
        tav::robustness::OutValues out(false, row.quirks);
        const HRESULT hr = row.decode(&data, out);
        const std::string fault = out.Check(hr);
        VariantClear(&data);
        if (hr != S_OK || !fault.empty()) {
            std::fprintf(stderr, "the seed of %s does not decode: 0x%08X %s\n", row.name, static_cast<unsigned>(hr),
                         fault.c_str());
        }
    }

    int commands = 0;
    for (const tav::sim::Subsystem* subsystem : tav::sim::Subsystems()) {
        for (const tav::sim::CommandRow& command : subsystem->commands) {
            const bool set = command.verb == OLESTR("Set");
            const char flags = static_cast<char>((set ? 1 : 0) | (command.service == tav::sim::Service::DhRoot ? 2 : 0));
            const auto args = argsOf.find(Text(command.name));
            const Text line = Text(command.name) + OLESTR("\n") + (args == argsOf.end() ? Text() : args->second);
            Write(seeds / "command" / (tav::sim::Narrow(command.verb) + "-" + tav::sim::Narrow(command.name)),
                  std::string(1, flags) + Bytes(line));
            ++commands;
        }
    }
    std::printf("decoder seeds: %d recorded from the virtual controller, %d from the grammars; %d command seeds\n",
                recorded, written, commands);
    return 0;
}
