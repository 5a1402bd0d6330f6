// The virtual controller's command parsing and dispatch with hostile
// commands. The first byte chooses the verb (bit 0: "Set"), the service
// (bit 1: the URL's "/DHROOT") and a fresh controller state (bit 2); the rest
// is "<command name>\n<argument text>", one character per byte, except that
// 0xFF and the two bytes after it make one 16-bit character. Every command
// must be answered, a failure with a text that says why.
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>

#include "fuzz_text.h"
#include "sim/arguments.h"
#include "sim/command_runner.h"

namespace tav::sim {
namespace {

[[noreturn]] void Fault(const char* what) {
    std::fprintf(stderr, "%s\n", what);
    std::abort();
}

// What every parse must give: a key found is found again with the same value,
// and numbers read from a value agree with the whole-text parsers.
void CheckArguments(TextView args) {
    const auto parsed = Arguments::Parse(args);
    if (!parsed) return;
    for (TextView key : {TextView(OLESTR("-Name")), TextView(OLESTR("-SlotId")), TextView(OLESTR("Value")),
                         TextView(OLESTR("-")), TextView()}) {
        const auto value = parsed->Find(key);
        if (!value) {
            if (parsed->Unsigned(key) || parsed->Signed(key)) Fault("a number read for a key that is not there");
            continue;
        }
        if (parsed->Unsigned(key) != ParseUnsigned(*value) || parsed->Signed(key) != ParseSigned(*value)) {
            Fault("a key's number differs from its value's");
        }
    }
    if (parsed->Empty() != Trim(args).empty()) Fault("pairs found in a blank text, or none in a text with keys");
}

}  // namespace
}  // namespace tav::sim

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using namespace tav::sim;
    static ControllerModel* const controller = new ControllerModel(OLESTR("/fuzz"));
    if (size == 0) return 0;
    const std::uint8_t flags = data[0];
    const Text text = tav::fuzz::OleTextOf(data + 1, size - 1);
    const std::size_t split = text.find(OLECHAR('\n'));
    const TextView name = TextView(text).substr(0, split);
    const TextView args = split == Text::npos ? TextView() : TextView(text).substr(split + 1);

    CheckArguments(args);

    if (flags & 4) controller->Reset();
    Command command;
    command.verb = (flags & 1) ? TextView(OLESTR("Set")) : TextView(OLESTR("Get"));
    command.name = name;
    command.args = args;
    command.url = (flags & 2) ? TextView(OLESTR("/fuzz/DHROOT")) : TextView(OLESTR("/fuzz"));
    command.caller.clientId = 1;
    const auto reply = RunCommand(*controller, command, 0, [](std::chrono::milliseconds) { return true; });
    if (!reply) Fault("a command went unanswered");
    if (FAILED(reply->status) && (!reply->hasText || reply->text.empty())) Fault("a refusal without a text");
    return 0;
}
