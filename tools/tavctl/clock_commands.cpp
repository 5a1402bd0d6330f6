// The controller clock and restart.
#include <chrono>

#include "tavctl/iso_time.h"
#include "tavctl/verb.h"

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

int ClockGet(Verb& v) {
    v.End();
    return v.Get("GetSystemClock", &ITavController::GetSystemClock, &ITavController::UnpackSystemClock);
}

int ClockStartup(Verb& v) {
    v.End();
    return v.Get("GetSystemStartupClock", &ITavController3::GetSystemStartupClock,
                 &ITavController3::UnpackSystemClock);
}

int ClockSet(Verb& v) {
    const std::string text = v.Word("TIME");
    v.End();
    const auto time = text == "now" ? std::optional<FILETIME>(HostNow()) : ParseIsoUtc(text);
    if (!time) {
        throw UsageError{"expected a UTC time such as 2026-11-21T02:30:00Z, not " + Quote(text)};
    }
    return v.Set("SetSystemClock", &ITavController::SetSystemClock, *time);
}

// Short words for the modes, next to their type-library names.
constexpr EnumName kRestartWords[] = {
    {WarmStart, "warm"}, {ColdStart, "cold"}, {PStart, "p"}, {IStart, "i"},
    {XStart, "x"},       {SStart, "s"},       {BStart, "b"},
};

int Restart(Verb& v) {
    const auto mode = v.Enum<TavRestartMode>("MODE", kRestartWords);
    v.End();
    return v.Set("Restart", &ITavController::Restart, mode);
}

constexpr VerbEntry kClock[] = {
    {"get", "", "print the controller clock (GetSystemClock)", ClockGet},
    {"set", "TIME", "set the controller clock (SetSystemClock)", ClockSet,
     "TIME is ISO-8601 UTC to the second, e.g. 2026-11-21T02:30:00Z, or now.\n"},
    {"startup", "", "print when the controller started (GetSystemStartupClock)", ClockStartup},
};
constexpr VerbEntry kRestart[] = {
    {"", "MODE", "restart the controller (Restart)", Restart,
     "MODE: WarmStart ColdStart PStart IStart XStart SStart BStart (or warm cold\n"
     "p i x s b); a number is passed on as it is.\n"},
};

}  // namespace

std::span<const GroupEntry> ClockGroups() {
    static constexpr GroupEntry kGroups[] = {
        {"clock", "The controller clock, in UTC", kClock},
        {"restart", "Restarting the controller", kRestart},
    };
    return kGroups;
}

}  // namespace tavctl
