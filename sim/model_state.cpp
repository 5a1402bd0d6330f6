#include "sim/model_state.h"

#include <array>
#include <cstdio>

namespace tav::sim {
namespace {

constexpr std::array kMotorsWords = {
    TextView(OLESTR("INIT")),         TextView(OLESTR("STAND_BY")),     TextView(OLESTR("POWER_ON")),
    TextView(OLESTR("RUN")),          TextView(OLESTR("POWER_OFF")),    TextView(OLESTR("GUARD_STOP")),
    TextView(OLESTR("EM_STOP")),      TextView(OLESTR("STB_EM_RESET")), TextView(OLESTR("GRD_EM_RESET")),
    TextView(OLESTR("SYS_FAIL")),
};

// A GUID that stays the same for a controller name from run to run, so that
// scripts and tests can rely on it.
Text GuidFor(TextView name) {
    std::uint64_t a = 14695981039346656037ull;
    std::uint64_t b = 1099511628211ull;
    for (OLECHAR c : name) {
        a = (a ^ static_cast<std::uint16_t>(c)) * 1099511628211ull;
        b = (b + static_cast<std::uint16_t>(c)) * 6364136223846793005ull + 1442695040888963407ull;
    }
    char buffer[40];
    std::snprintf(buffer, sizeof buffer, "{%08X-%04X-4%03X-%04X-%012llX}", static_cast<unsigned>(a >> 32),
                  static_cast<unsigned>((a >> 16) & 0xFFFF), static_cast<unsigned>(a & 0x0FFF),
                  static_cast<unsigned>(0x8000 | ((b >> 48) & 0x3FFF)),
                  static_cast<unsigned long long>(b & 0xFFFFFFFFFFFFull));
    return Widen(buffer);
}

}  // namespace

TextView ModeWord(OperationMode mode) {
    switch (mode) {
        case OperationMode::Init: return OLESTR("INIT");
        case OperationMode::Auto: return OLESTR("AUTO");
        case OperationMode::Manr: return OLESTR("MANR");
        case OperationMode::Manf: return OLESTR("MANF");
        case OperationMode::AutoChange: return OLESTR("AUTO_CH");
        case OperationMode::ManfChange: return OLESTR("MANF_CH");
        case OperationMode::Undefined: break;
    }
    return OLESTR("UNDEF");
}

TextView CollisionWord(CollisionState state) {
    switch (state) {
        case CollisionState::Init: break;
        case CollisionState::Triggered: return OLESTR("TRIGGERED");
        case CollisionState::Confirmed: return OLESTR("CONFIRMED");
        case CollisionState::TriggeredAck: return OLESTR("TRIGGERED_ACK");
    }
    return OLESTR("INIT");
}

bool IsMotorsStateWord(TextView word) {
    for (TextView known : kMotorsWords) {
        if (known == word) {
            return true;
        }
    }
    return false;
}

ModelState DefaultState(TextView controllerName, std::uint32_t startupTime) {
    ModelState state;
    state.name = Text(controllerName);
    state.controllerId = OLESTR("VC-") + Text(controllerName);
    state.systemGuid = GuidFor(controllerName);
    state.language = OLESTR("en");
    state.currentSystem = OLESTR("MainSystem");
    state.version = {OLESTR("TavOS 7.4.2 (virtual controller)"), OLESTR("TavOS release 7.4.2 build 2031")};
    state.systems[OLESTR("MainSystem")] = state.version;
    state.systems[OLESTR("ServiceSystem")] = {OLESTR("TavOS 7.3.0 (virtual controller)"),
                                              OLESTR("TavOS release 7.3.0 build 1877")};
    state.versionName = OLESTR("TavOS 7.4");
    state.productVersions[OLESTR("TavOS")] = OLESTR("7.4.2");
    state.productVersions[OLESTR("TavVision")] = OLESTR("2.1.0");
    state.productVersions[OLESTR("TavSafety")] = OLESTR("3.0.1");
    state.environment[OLESTR("SYSTEM")] = OLESTR("MainSystem");
    state.environment[OLESTR("HOME")] = OLESTR("/hd0a/MainSystem/HOME");
    state.environment[OLESTR("TEMP")] = OLESTR("/hd0a/temp");
    state.environment[OLESTR("RELEASE")] = OLESTR("/hd0a/MainSystem/TavOS-7.4.2");
    state.options = {OLESTR("Multitasking"), OLESTR("Collision Detection"), OLESTR("PC Interface"),
                     OLESTR("World Zones"), OLESTR("Virtual Time")};
    state.energy = OLESTR("notpaused");
    state.startupTime = startupTime;
    state.motors = OLESTR("STAND_BY");
    state.autoConditions = {{OLESTR("Blk"), 1, 1}, {OLESTR("SpeedOvr"), 1, 2}, {OLESTR("RunMode"), 0, 3}};
    return state;
}

}  // namespace tav::sim
