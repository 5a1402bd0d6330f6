// The operating panel: motors state, operation mode with its auto
// conditions, collision detection and acknowledgements.
#include <cstdlib>
#include <vector>

#include "tavctl/command_support.h"
#include "tavctl/commands.h"
#include "tavctl/names.h"

namespace tavctl {
namespace {

// A known name, or else a number passed on as it is for the module to judge.
std::optional<long> EnumArgument(std::span<const EnumName> names, std::span<const EnumName> aliases,
                                 const std::string& word) {
    if (auto value = ValueOf(names, word)) {
        return value;
    }
    if (auto value = ValueOf(aliases, word)) {
        return value;
    }
    char* end = nullptr;
    const long number = std::strtol(word.c_str(), &end, 10);
    if (end == word.c_str() || *end != '\0') {
        return std::nullopt;
    }
    return number;
}

const EnumName kStateAliases[] = {{MotorsOn, "on"}, {MotorsOff, "off"}};
const EnumName kAcknowledgements[] = {{AutoAck, "auto"}, {ManfAck, "manf"}, {ColDetAck, "coldet"},
                                      {AutoAck, "AutoAck"}, {ManfAck, "ManfAck"}, {ColDetAck, "ColDetAck"}};
const EnumName kConditionAnswers[] = {{AutoConditionAck_Reset, "reset"}, {AutoConditionAck_Keep, "keep"},
                                      {AutoConditionAck_Reset, "AutoConditionAck_Reset"},
                                      {AutoConditionAck_Keep, "AutoConditionAck_Keep"}};

int State(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const bool keyless = args.Flag("--keyless");
    const auto verb = Required(session, args, "state", "get or set", status);
    if (!verb) {
        return status;
    }
    if (*verb == "get") {
        if (!NoMore(session, args, "state", status)) {
            return status;
        }
        const auto panel = session.Interface<ITavPanel>("ITavPanel");
        if (!panel) {
            return kExitFailed;
        }
        TavControllerState state = InitState;
        return session.Read(
            "GetControllerState", [&](TavInParams* rip) { return panel->GetControllerState(rip, &state); },
            [&](VARIANT* data) { return panel->UnpackControllerState(data, &state); },
            [&] { session.Print(NameOf(ControllerStateNames(), state)); });
    }
    if (*verb != "set") {
        return session.Usage("state", "expected get or set, not " + *verb);
    }
    const auto word = Required(session, args, "state", "the state", status);
    if (!word || !NoMore(session, args, "state", status)) {
        return status;
    }
    const auto value = EnumArgument(ControllerStateNames(), kStateAliases, *word);
    if (!value) {
        return session.Usage("state", "unknown state " + *word);
    }
    const auto state = static_cast<TavControllerState>(*value);
    if (keyless) {
        const auto panel3 = session.Interface<ITavPanel3>("ITavPanel3");
        if (!panel3) {
            return kExitFailed;
        }
        return session.Write("SetControllerStateKeyLess",
                             [&](TavInParams* rip) { return panel3->SetControllerStateKeyLess(rip, state); });
    }
    const auto panel = session.Interface<ITavPanel>("ITavPanel");
    if (!panel) {
        return kExitFailed;
    }
    return session.Write("SetControllerState", [&](TavInParams* rip) { return panel->SetControllerState(rip, state); });
}

// Prints the pending conditions of an AUTO_CH reply. The version-2 decoder
// knows every condition type; only the version-1 decoder hands out the IDs
// that an acknowledgement needs, so both read the same reply, element by
// element.
void PrintConditions(Session& session, ITavPanel* panel, IEnumAutoCondition2* conditions, VARIANT* reply) {
    std::vector<TavAutoCondition2> typed;
    TavAutoCondition2 element{};
    ULONG fetched = 0;
    while (conditions != nullptr && conditions->RemNext(1, &element, &fetched) == S_OK && fetched == 1) {
        typed.push_back(element);
    }
    std::vector<TavAutoCondition> withIds;
    LONG changing = 0;
    tav::ComPtr<IEnumAutoCondition> identified;
    const HRESULT hr = panel->UnpackAutoConditions(reply, &changing, &identified);
    if (FAILED(hr)) {
        session.Fail("UnpackAutoConditions", hr);
    }
    TavAutoCondition withId{};
    while (identified && identified->RemNext(1, &withId, &fetched) == S_OK && fetched == 1) {
        withIds.push_back(withId);
    }
    const std::size_t count = std::max(typed.size(), withIds.size());
    for (std::size_t i = 0; i < count; ++i) {
        std::string line = "  ";
        line += i < withIds.size() ? "ID " + std::to_string(withIds[i].ConditionID) : std::string("ID ?");
        line += "  ";
        line += i < typed.size() ? NameOf(AutoConditionNames(), typed[i].Condition)
                                 : NameOf(AutoConditionNames(), withIds[i].Condition);
        if (i < withIds.size()) {
            line += withIds[i].KeepIsAllowed != 0 ? "  (Keep allowed)" : "  (Reset only)";
        }
        session.Print(line);
    }
}

int ModeGet(Session& session) {
    const auto panel2 = session.Interface<ITavPanel2>("ITavPanel2");
    if (!panel2) {
        return kExitFailed;
    }
    TavOperationMode mode = UndefinedMode;
    int status = kExitOk;
    auto reply = session.CallThroughCallback(
        "GetOperationMode2",
        [&](TavInParams* rip) { return panel2->GetOperationMode2(rip, &mode, nullptr, nullptr); }, status);
    if (!reply) {
        return status;
    }
    tav::ComPtr<IEnumAutoCondition2> conditions;
    ULONG cycle = 0;
    HRESULT hr = panel2->UnpackOperationMode2(reply->data.Get(), &mode, nullptr, &cycle);
    if (FAILED(hr)) {
        return session.Fail("UnpackOperationMode2", hr);
    }
    session.Print(NameOf(OperationModeNames(), mode));
    if (mode != AutoChange) {
        return kExitOk;
    }
    hr = panel2->UnpackOperationMode2(reply->data.Get(), &mode, &conditions, &cycle);
    if (FAILED(hr)) {
        return session.Fail("UnpackOperationMode2 (the condition list)", hr);
    }
    PrintConditions(session, panel2.Get(), conditions.Get(), reply->data.Get());
    if (cycle != 0) {
        session.Print("  cycle " + std::to_string(cycle));
    }
    return kExitOk;
}

int Mode(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto verb = Required(session, args, "mode", "get or set", status);
    if (!verb) {
        return status;
    }
    if (*verb == "get") {
        return NoMore(session, args, "mode", status) ? ModeGet(session) : status;
    }
    if (*verb != "set") {
        return session.Usage("mode", "expected get or set, not " + *verb);
    }
    const auto word = Required(session, args, "mode", "the mode", status);
    if (!word || !NoMore(session, args, "mode", status)) {
        return status;
    }
    const auto value = EnumArgument(OperationModeNames(), std::span<const EnumName>(), *word);
    if (!value) {
        return session.Usage("mode", "unknown mode " + *word);
    }
    const auto panel3 = session.Interface<ITavPanel3>("ITavPanel3");
    if (!panel3) {
        return kExitFailed;
    }
    return session.Write("SetOPMode", [&](TavInParams* rip) {
        return panel3->SetOPMode(rip, static_cast<TavOperationMode>(*value));
    });
}

int Collision(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto rest = args.Rest();
    if (!rest.empty() && rest != std::vector<std::string>{"get"} && rest != std::vector<std::string>{"state"}) {
        return session.Usage("collision", "expected no argument, get or state");
    }
    const auto panel = session.Interface<ITavPanel>("ITavPanel");
    if (!panel) {
        return kExitFailed;
    }
    TavCollisionDetectState state = CollisionDetect_Init;
    status = session.Read(
        "GetCollisionDetectState", [&](TavInParams* rip) { return panel->GetCollisionDetectState(rip, &state); },
        [&](VARIANT* data) { return panel->UnpackCollisionDetectState(data, &state); },
        [&] { session.Print(NameOf(CollisionStateNames(), state)); });
    return status;
}

int Acknowledge(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto word = Required(session, args, "ack", "auto, manf or coldet", status);
    if (!word || !NoMore(session, args, "ack", status)) {
        return status;
    }
    const auto value = EnumArgument(kAcknowledgements, std::span<const EnumName>(), *word);
    if (!value) {
        return session.Usage("ack", "expected auto, manf or coldet, not " + *word);
    }
    const auto panel = session.Interface<ITavPanel>("ITavPanel");
    if (!panel) {
        return kExitFailed;
    }
    return session.Write("Acknowledge", [&](TavInParams* rip) {
        return panel->Acknowledge(rip, static_cast<TavAcknowledge>(*value));
    });
}

int AutoCondition(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto verb = Required(session, args, "autocond", "ack", status);
    if (!verb) {
        return status;
    }
    if (*verb != "ack") {
        return session.Usage("autocond", "expected ack, not " + *verb);
    }
    const auto idText = Required(session, args, "autocond", "the condition ID", status);
    const auto answerText = idText ? Required(session, args, "autocond", "reset or keep", status) : std::nullopt;
    if (!answerText || !NoMore(session, args, "autocond", status)) {
        return status;
    }
    char* end = nullptr;
    const unsigned long id = std::strtoul(idText->c_str(), &end, 10);
    if (end == idText->c_str() || *end != '\0') {
        return session.Usage("autocond", "the condition ID is a number, not " + *idText);
    }
    const auto answer = EnumArgument(kConditionAnswers, std::span<const EnumName>(), *answerText);
    if (!answer) {
        return session.Usage("autocond", "expected reset or keep, not " + *answerText);
    }
    const auto panel = session.Interface<ITavPanel>("ITavPanel");
    if (!panel) {
        return kExitFailed;
    }
    return session.Write("AcknowledgeAutoCondition", [&](TavInParams* rip) {
        return panel->AcknowledgeAutoCondition(rip, static_cast<TavAutoConditionAck>(*answer), static_cast<ULONG>(id));
    });
}

constexpr CommandSpec kCommands[] = {
    {"state", "read or set the controller (motors) state",
     "Usage: tavctl state get\n"
     "       tavctl state set STATE [--keyless]\n"
     "GetControllerState / SetControllerState (SetControllerStateKeyLess of\n"
     "ITavPanel3 with --keyless). STATE: MotorsOn (on), MotorsOff (off), or any\n"
     "other TavControllerState name or number, for the module to refuse.\n",
     State},
    {"mode", "read or set the operation mode",
     "Usage: tavctl mode get\n"
     "       tavctl mode set MODE\n"
     "get: GetOperationMode2 (ITavPanel2). The reply is taken through the callback\n"
     "so that, in AutoChange, the pending auto conditions can be listed with the\n"
     "IDs that autocond ack needs (UnpackOperationMode2 and UnpackAutoConditions).\n"
     "set: SetOPMode (ITavPanel3). MODE: Auto, Manr, Manf (or another\n"
     "TavOperationMode name or number, for the module to refuse).\n",
     Mode},
    {"collision", "print the collision detection state",
     "Usage: tavctl collision [get|state]\n"
     "GetCollisionDetectState.\n",
     Collision},
    {"ack", "acknowledge a mode change or a collision",
     "Usage: tavctl ack auto|manf|coldet\n"
     "Acknowledge with AutoAck, ManfAck or ColDetAck.\n",
     Acknowledge},
    {"autocond", "answer a pending auto condition",
     "Usage: tavctl autocond ack ID reset|keep\n"
     "AcknowledgeAutoCondition; mode get lists the IDs.\n",
     AutoCondition},
};

}  // namespace

std::span<const CommandSpec> PanelCommands() { return kCommands; }

}  // namespace tavctl
