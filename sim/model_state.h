#pragma once
#include <cstdint>
#include <map>
#include <set>
#include <vector>

#include "sim/state_parts.h"
#include "sim/text.h"

namespace tav::sim {

enum class OperationMode { Init, Auto, Manr, Manf, AutoChange, ManfChange, Undefined };
enum class CollisionState { Init, Triggered, Confirmed, TriggeredAck };

// The controller's words for them, as its replies carry them.
TextView ModeWord(OperationMode mode);
TextView CollisionWord(CollisionState state);

// One setting that must be answered before automatic operation. keep is the
// element's second field: non-zero lets the operator keep the setting.
struct AutoCondition {
    Text name;
    std::int32_t keep = 0;
    std::uint32_t id = 0;
};

struct AutoConditionAnswer {
    std::uint32_t id = 0;
    Text name;
    bool kept = false;
};

struct VersionTexts {
    Text system;
    Text release;
};

struct ConnectedClient {
    std::uint32_t id = 0;
    Text application;
};

// Everything one controller knows. Plain data: the command handlers hold the
// rules, the model's lock guards it.
struct ModelState {
    // Identity and information.
    Text name;
    Text controllerId;
    Text systemGuid;  // in braces
    Text language;
    Text currentSystem;
    VersionTexts version;
    std::map<Text, VersionTexts> systems;
    Text versionName;
    std::map<Text, Text> productVersions;
    std::map<Text, Text> environment;
    std::set<Text> options;
    Text energy;
    std::vector<ConnectedClient> clients;
    std::uint32_t nextClientId = 1;

    // Clock, in seconds since 1970-01-01 UTC.
    std::int64_t clockOffset = 0;  // controller clock minus host clock
    std::uint32_t startupTime = 0;
    Text lastRestart;
    std::uint32_t restarts = 0;

    // Operating panel.
    Text motors;  // the state word: STAND_BY, RUN, GUARD_STOP, ...
    OperationMode mode = OperationMode::Manr;
    OperationMode modeBeforeChange = OperationMode::Manr;
    std::vector<AutoCondition> autoConditions;     // raised by every change to automatic
    std::vector<AutoCondition> pendingConditions;  // not answered yet
    std::vector<AutoConditionAnswer> answers;      // of the latest change to automatic
    CollisionState collision = CollisionState::Init;

    // The record of each subsystem that keeps its state next to its commands.
    template <typename T>
    T& Part() {
        return parts.Get<T>();
    }
    template <typename T>
    const T& Part() const {
        return parts.Get<T>();
    }
    StateParts parts;
};

// A freshly started controller called controllerName, booted at startupTime.
ModelState DefaultState(TextView controllerName, std::uint32_t startupTime);

// The state words the controller may be in; SetMotorsState accepts these.
bool IsMotorsStateWord(TextView word);

}  // namespace tav::sim
