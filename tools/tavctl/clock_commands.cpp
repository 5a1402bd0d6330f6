// The controller clock and restart.
#include <chrono>
#include <cstdlib>

#include "tavctl/command_support.h"
#include "tavctl/commands.h"
#include "tavctl/iso_time.h"
#include "tavctl/names.h"

namespace tavctl {
namespace {

FILETIME HostNow() {
    const auto seconds =
        std::chrono::duration_cast<std::chrono::seconds>(std::chrono::system_clock::now().time_since_epoch()).count();
    const auto ticks = static_cast<std::uint64_t>(seconds + 11644473600LL) * 10000000ULL;
    FILETIME time;
    time.dwLowDateTime = static_cast<DWORD>(ticks & 0xFFFFFFFFu);
    time.dwHighDateTime = static_cast<DWORD>(ticks >> 32);
    return time;
}

int Clock(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto verb = Required(session, args, "clock", "get, set or startup", status);
    if (!verb) {
        return status;
    }
    ITavController* controller = session.Controller();
    FILETIME time{};
    auto print = [&] { session.Print(FormatIsoUtc(time)); };
    if (*verb == "get") {
        if (!NoMore(session, args, "clock", status)) {
            return status;
        }
        return session.Read(
            "GetSystemClock", [&](TavInParams* rip) { return controller->GetSystemClock(rip, &time); },
            [&](VARIANT* data) { return controller->UnpackSystemClock(data, &time); }, print);
    }
    if (*verb == "startup") {
        if (!NoMore(session, args, "clock", status)) {
            return status;
        }
        const auto controller3 = session.Interface<ITavController3>("ITavController3");
        if (!controller3) {
            return kExitFailed;
        }
        return session.Read(
            "GetSystemStartupClock",
            [&](TavInParams* rip) { return controller3->GetSystemStartupClock(rip, &time); },
            [&](VARIANT* data) { return controller3->UnpackSystemClock(data, &time); }, print);
    }
    if (*verb == "set") {
        const auto text = Required(session, args, "clock", "the time", status);
        if (!text || !NoMore(session, args, "clock", status)) {
            return status;
        }
        const auto parsed = *text == "now" ? std::optional<FILETIME>(HostNow()) : ParseIsoUtc(*text);
        if (!parsed) {
            return session.Usage("clock", "expected a UTC time such as 2026-11-21T02:30:00Z, not " + *text);
        }
        return session.Write("SetSystemClock",
                             [&](TavInParams* rip) { return controller->SetSystemClock(rip, *parsed); });
    }
    return session.Usage("clock", "expected get, set or startup, not " + *verb);
}

// Short words for the modes, next to their type-library names.
const EnumName kRestartWords[] = {
    {WarmStart, "warm"}, {ColdStart, "cold"}, {PStart, "p"}, {IStart, "i"},
    {XStart, "x"},       {SStart, "s"},       {BStart, "b"},
};

int Restart(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto word = Required(session, args, "restart", "the mode", status);
    if (!word || !NoMore(session, args, "restart", status)) {
        return status;
    }
    auto mode = ValueOf(RestartModeNames(), *word);
    if (!mode) {
        mode = ValueOf(kRestartWords, *word);
    }
    if (!mode) {
        char* end = nullptr;
        const long number = std::strtol(word->c_str(), &end, 10);
        if (end == word->c_str() || *end != '\0') {
            return session.Usage("restart", "unknown mode " + *word);
        }
        mode = number;  // passed on as it is, for the module to judge
    }
    ITavController* controller = session.Controller();
    return session.Write("Restart", [&](TavInParams* rip) {
        return controller->Restart(rip, static_cast<TavRestartMode>(*mode));
    });
}

constexpr CommandSpec kCommands[] = {
    {"clock", "read or set the controller clock (UTC)",
     "Usage: tavctl clock get\n"
     "       tavctl clock set TIME\n"
     "       tavctl clock startup\n"
     "GetSystemClock / SetSystemClock, GetSystemStartupClock (ITavController3).\n"
     "TIME is ISO-8601 UTC to the second, e.g. 2026-11-21T02:30:00Z, or now.\n",
     Clock},
    {"restart", "restart the controller",
     "Usage: tavctl restart MODE\n"
     "Restart. MODE: WarmStart ColdStart PStart IStart XStart SStart BStart\n"
     "(or warm cold p i x s b; a number is passed on as it is).\n",
     Restart},
};

}  // namespace

std::span<const CommandSpec> ClockCommands() { return kCommands; }

}  // namespace tavctl
