// The operating panel: motors state, operation mode with its auto
// conditions, collision detection, acknowledgements, the speed ratio and the
// operator-mode PIN lock.
#include <algorithm>

#include "tavctl/verb.h"

namespace tavctl {
namespace {

constexpr EnumName kMotorsStateWords[] = {{MotorsOn, "on"}, {MotorsOff, "off"}};
constexpr EnumName kAcknowledgements[] = {{AutoAck, "auto"}, {ManfAck, "manf"}, {ColDetAck, "coldet"}};
constexpr EnumName kConditionAnswers[] = {{AutoConditionAck_Reset, "reset"}, {AutoConditionAck_Keep, "keep"}};

int StateGet(Verb& v) {
    v.End();
    return v.Get("GetControllerState", &ITavPanel::GetControllerState, &ITavPanel::UnpackControllerState);
}

int StateSet(Verb& v) {
    const bool keyless = v.Flag("--keyless");
    const std::string word = v.Word("STATE");
    v.End();
    const auto state = static_cast<TavControllerState>(v.EnumValue("STATE", word, NamesOf<TavControllerState>(),
                                                                   kMotorsStateWords));
    if (keyless) {
        return v.Set("SetControllerStateKeyLess", &ITavPanel3::SetControllerStateKeyLess, state);
    }
    return v.Set("SetControllerState", &ITavPanel::SetControllerState, state);
}

// The pending conditions of an AUTO_CH reply. The version-2 decoder knows
// every condition type; only the version-1 decoder hands out the IDs that an
// acknowledgement needs, so both read the same reply, element by element.
std::vector<Record> Conditions(Session& session, ITavPanel* panel, IEnumAutoCondition2* conditions, VARIANT* reply) {
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
    std::vector<Record> rows;
    for (std::size_t i = 0; i < std::max(typed.size(), withIds.size()); ++i) {
        const long condition = i < typed.size() ? typed[i].Condition : withIds[i].Condition;
        rows.push_back({{"id", i < withIds.size() ? Value::Unsigned(withIds[i].ConditionID) : Value::Null()},
                        {"condition", Value::Text(NameOf(NamesOf<TavAutoConditionType>(), condition))},
                        {"keep", i < withIds.size() ? Value::Boolean(withIds[i].KeepIsAllowed != 0) : Value::Null()}});
    }
    return rows;
}

int ModeGet(Verb& v) {
    v.End();
    Session& session = v.session;
    const auto panel2 = v.Interface<ITavPanel2>();
    TavOperationMode mode = UndefinedMode;
    int status = kExitOk;
    auto reply = session.CallThroughCallback(
        "GetOperationMode2", [&](TavInParams* rip) { return panel2->GetOperationMode2(rip, &mode, nullptr, nullptr); },
        status);
    if (!reply) {
        return status;
    }
    tav::ComPtr<IEnumAutoCondition2> conditions;
    ULONG cycle = 0;
    HRESULT hr = panel2->UnpackOperationMode2(reply->data.Get(), &mode, nullptr, &cycle);
    if (FAILED(hr)) {
        return session.Fail("UnpackOperationMode2", hr);
    }
    std::vector<Record> rows;
    if (mode == AutoChange) {
        hr = panel2->UnpackOperationMode2(reply->data.Get(), &mode, &conditions, &cycle);
        if (FAILED(hr)) {
            return session.Fail("UnpackOperationMode2 (the condition list)", hr);
        }
        rows = Conditions(session, panel2.Get(), conditions.Get(), reply->data.Get());
    }
    if (session.Options().json) {
        std::string conditionsJson = Json(rows);
        Record record{{"mode", Show(mode)}, {"cycle", Value::Unsigned(cycle)}};
        std::string json = Json(record);
        json.pop_back();
        session.Print(json + ", \"conditions\": " + conditionsJson + "}");
        return kExitOk;
    }
    session.Print(NameOf(mode));
    for (const Record& row : rows) {
        session.Print("  ID " + PlainText(row[0].second) + "  " + row[1].second.text +
                      (row[2].second.text == "true" ? "  (Keep allowed)" : "  (Reset only)"));
    }
    if (cycle != 0) {
        session.Print("  cycle " + std::to_string(cycle));
    }
    return kExitOk;
}

int ModeSet(Verb& v) {
    const auto mode = v.Enum<TavOperationMode>("MODE");
    v.End();
    return v.Set("SetOPMode", &ITavPanel3::SetOPMode, mode);
}

int Collision(Verb& v) {
    v.End();
    return v.Get("GetCollisionDetectState", &ITavPanel::GetCollisionDetectState,
                 &ITavPanel::UnpackCollisionDetectState);
}

int Acknowledge(Verb& v) {
    const auto what = v.Enum<TavAcknowledge>("WHAT", kAcknowledgements);
    v.End();
    return v.Set("Acknowledge", &ITavPanel::Acknowledge, what);
}

int AutoConditionAck(Verb& v) {
    const auto id = v.Number<ULONG>("ID");
    const auto answer = v.Enum<TavAutoConditionAck>("ANSWER", kConditionAnswers);
    v.End();
    return v.Set("AcknowledgeAutoCondition", &ITavPanel::AcknowledgeAutoCondition, answer, id);
}

int SpeedGet(Verb& v) {
    v.End();
    return v.Get("GetSpeedRatio", &ITavPanel::GetSpeedRatio, &ITavPanel::UnpackSpeedRatio);
}

int SpeedSet(Verb& v) {
    const auto ratio = v.Number<short>("RATIO");
    v.End();
    return v.Set("SetSpeedRatio", &ITavPanel::SetSpeedRatio, ratio);
}

int PinLock(Verb& v) {
    const bool permanent = v.Flag("--permanent");
    const auto pin = v.Number<ULONG>("PIN");
    v.End();
    if (permanent) {
        return v.Set("LockOPModePinCode2", &ITavPanel4::LockOPModePinCode2, pin, LONG{1});
    }
    return v.Set("LockOPModePinCode", &ITavPanel3::LockOPModePinCode, pin);
}

int PinUnlock(Verb& v) {
    const auto pin = v.Number<ULONG>("PIN");
    v.End();
    return v.Set("UnlockOPModePinCode", &ITavPanel3::UnlockOPModePinCode, pin);
}

int PinState(Verb& v) {
    v.End();
    return v.Get("GetOPModePinCodeLockState", &ITavPanel3::GetOPModePinCodeLockState,
                 &ITavPanel3::UnpackOPModePinCodeLockState);
}

constexpr VerbEntry kState[] = {
    {"get", "", "print the controller (motors) state (GetControllerState)", StateGet},
    {"set", "STATE [--keyless]", "set the controller state (SetControllerState)", StateSet,
     "STATE: MotorsOn (on), MotorsOff (off), or any other TavControllerState name\n"
     "or number, for the module to refuse. --keyless: SetControllerStateKeyLess.\n"},
};
constexpr VerbEntry kMode[] = {
    {"get", "", "print the operation mode and pending auto conditions (GetOperationMode2)", ModeGet,
     "The reply is taken through the callback so that, in AutoChange, the pending\n"
     "auto conditions are listed with the IDs that autocond ack needs.\n"},
    {"set", "MODE", "set the operation mode (SetOPMode)", ModeSet,
     "MODE: Auto, Manr, Manf (or another TavOperationMode name or number, for the\n"
     "module to refuse).\n"},
};
constexpr VerbEntry kCollision[] = {
    {"", "", "print the collision detection state (GetCollisionDetectState)", Collision},
    {"get", "", "the same", Collision},
    {"state", "", "the same", Collision},
};
constexpr VerbEntry kAck[] = {
    {"", "auto|manf|coldet", "acknowledge a mode change or a collision (Acknowledge)", Acknowledge}};
constexpr VerbEntry kAutoCondition[] = {
    {"ack", "ID reset|keep", "answer a pending auto condition (AcknowledgeAutoCondition)", AutoConditionAck,
     "mode get lists the IDs.\n"}};
constexpr VerbEntry kSpeed[] = {
    {"get", "", "print the speed ratio in percent (GetSpeedRatio)", SpeedGet},
    {"set", "RATIO", "set the speed ratio in percent (SetSpeedRatio)", SpeedSet},
};
constexpr VerbEntry kPin[] = {
    {"lock", "PIN [--permanent]", "lock the operation mode with a PIN (LockOPModePinCode)", PinLock,
     "--permanent: LockOPModePinCode2 with the permanent flag (ITavPanel4).\n"},
    {"unlock", "PIN", "unlock the operation mode (UnlockOPModePinCode)", PinUnlock},
    {"state", "", "print the PIN lock state (GetOPModePinCodeLockState)", PinState},
};

}  // namespace

std::span<const GroupEntry> PanelGroups() {
    static constexpr GroupEntry kGroups[] = {
        {"state", "The controller (motors) state", kState},
        {"mode", "The operation mode", kMode},
        {"collision", "Collision detection", kCollision},
        {"ack", "Acknowledgements", kAck},
        {"autocond", "Auto conditions", kAutoCondition},
        {"speed", "The speed ratio", kSpeed},
        {"pin", "The operator-mode PIN lock", kPin},
    };
    return kGroups;
}

}  // namespace tavctl
