// watch: subscriptions to controller events, each printed as it arrives,
// decoded with the Unpack operation of its interface.
#include <chrono>
#include <sstream>

#include "tavctl/iso_time.h"
#include "tavctl/login_info.h"
#include "tavctl/verb.h"

namespace tavctl {
namespace {

// The lowest class version that knows each subscription type (the class
// whose interfaces brought it); types not listed are not defined.
struct TypeInfo {
    TavControllerSubscriptions type;
    unsigned fromClass;
};
constexpr TypeInfo kTypes[] = {
    {state, 1},
    {mode, 1},
    {MasterKESTO, 1},
    {SpeedRatio, 1},
    {ConnectionEvents, 1},
    {MasterCFG, 1},
    {MasterMotion, 1},
    {ManualModePrivRequestEvent, 1},
    {ManualModePrivilegesState, 1},
    {BackupEvents, 1},
    {AutoConditionEvent, 1},
    {SystemDiagnosticsInfoEvent, 4},
    {DorvelScreenDumpEvent, 6},
    {SysEnergyState, 12},
    {OPModePinCodeLockState, 13},
    {SafetyModeStatus, 15},
};

// The event's data decoded into named values by the matching Unpack
// operation; a failure to decode is shown with the raw text.
Record Decode(ITavController* object, ULONG type, VARIANT* data) {
    Record record;
    HRESULT hr = S_OK;
    // The class may lack the interface of a type it lets one subscribe to.
    auto as = [&](auto pointer) {
        using I = std::remove_reference_t<decltype(*pointer.Get())>;
        if (FAILED(object->QueryInterface(__uuidof(I), reinterpret_cast<void**>(&pointer)))) {
            throw HRESULT{E_NOINTERFACE};
        }
        return pointer;
    };
    try {
    switch (type) {
        case state: {
            TavControllerState value = InitState;
            hr = as(tav::ComPtr<ITavPanel>())->UnpackControllerState(data, &value);
            record.emplace_back("state", Show(value));
            break;
        }
        case mode: {
            // Only the second decoder reads a change to automatic.
            TavOperationMode value = UndefinedMode;
            tav::ComPtr<ITavPanel2> panel2;
            hr = SUCCEEDED(object->QueryInterface(IID_ITavPanel2, reinterpret_cast<void**>(&panel2)))
                     ? panel2->UnpackOperationMode2(data, &value, nullptr, nullptr)
                     : as(tav::ComPtr<ITavPanel>())->UnpackOperationMode(data, &value);
            record.emplace_back("mode", Show(value));
            break;
        }
        case SpeedRatio: {
            short value = 0;
            hr = as(tav::ComPtr<ITavPanel>())->UnpackSpeedRatio(data, &value);
            record.emplace_back("ratio", Show(value));
            break;
        }
        case MasterKESTO:
        case MasterCFG:
        case MasterMotion: {
            TavMastershipStatus status = TavMastershipStatus_None;
            LoginInfo user;
            LONG me = 0;
            hr = as(tav::ComPtr<ITavMastership>())->UnpackCurrentMaster(data, 0, &status, user.Out(), &me);
            record.emplace_back("status", Show(status));
            user.AppendTo(record);
            break;
        }
        case ManualModePrivRequestEvent: {
            LoginInfo user;
            ULONG userId = 0;
            TavManualModePrivileges privileges = TavManualModePrivileges_None;
            hr = as(tav::ComPtr<ITavUser>())->UnpackManualModePrivRequestEvent(data, user.Out(), &userId, &privileges);
            record.emplace_back("userId", Show(userId));
            record.emplace_back("privileges", Show(privileges));
            user.AppendTo(record);
            break;
        }
        case ManualModePrivilegesState: {
            TavManualModePrivilegesState privileges = TavManualModePrivilegesState_None;
            LoginInfo user;
            LONG me = 0;
            hr = as(tav::ComPtr<ITavUser>())->UnpackManualModePrivilegesState(data, 0, &privileges, user.Out(), &me);
            record.emplace_back("state", Show(privileges));
            user.AppendTo(record);
            break;
        }
        case BackupEvents: {
            TavBackupEvent event = BackupEvent_Finished;
            ULONG sequence = 0;
            hr = as(tav::ComPtr<ITavBackupRestore>())->UnpackBackupEvent(data, &event, &sequence);
            record.emplace_back("event", Show(event));
            record.emplace_back("sequence", Show(sequence));
            break;
        }
        case AutoConditionEvent: {
            LONG changing = 0;
            tav::ComPtr<IEnumAutoCondition> conditions;
            hr = as(tav::ComPtr<ITavPanel>())->UnpackAutoConditions(data, &changing, &conditions);
            record.emplace_back("autoChange", AsBoolean(changing));
            TavAutoCondition element{};
            ULONG fetched = 0;
            std::string list;
            while (conditions && conditions->RemNext(1, &element, &fetched) == S_OK && fetched == 1) {
                list += (list.empty() ? "" : ",") + std::to_string(element.ConditionID) + ":" + NameOf(element.Condition);
            }
            record.emplace_back("conditions", Value::Text(list));
            break;
        }
        case SystemDiagnosticsInfoEvent: {
            HRESULT result = S_OK;
            hr = as(tav::ComPtr<ITavSystemDiagnostics>())->UnpackDiagnosticsInfoStatus(data, &result);
            record.emplace_back("result", AsHresult(result));
            break;
        }
        case DorvelScreenDumpEvent: {
            HRESULT result = S_OK;
            hr = as(tav::ComPtr<ITavDorvel>())->UnpackDorvelScreenDump(data, &result);
            record.emplace_back("result", AsHresult(result));
            break;
        }
        case SysEnergyState: {
            TavSysEnergyState value = TavSysEnergyStateNotPaused;
            hr = as(tav::ComPtr<ITavController4>())->UnpackSysEnergyState(data, &value);
            record.emplace_back("energy", Show(value));
            break;
        }
        case OPModePinCodeLockState: {
            TavOPModeLockState value = OPModeLockStateUndefined;
            hr = as(tav::ComPtr<ITavPanel3>())->UnpackOPModePinCodeLockState(data, &value);
            record.emplace_back("lock", Show(value));
            break;
        }
        case SafetyModeStatus: {
            TavVantorSafetyMode value = VantorSafetyModeError;
            hr = as(tav::ComPtr<ITavSafety>())->UnpackSafetyModeStatus(data, &value);
            record.emplace_back("safetyMode", Show(value));
            break;
        }
        default:
            record.emplace_back("data", data->vt == VT_BSTR ? TextValue(data->bstrVal) : Value::Null());
            return record;
    }
    } catch (HRESULT missing) {
        hr = missing;
    }
    if (FAILED(hr)) {
        record.clear();
        record.emplace_back("undecoded", HresultValue(hr));
        record.emplace_back("data", data->vt == VT_BSTR ? TextValue(data->bstrVal) : Value::Null());
    }
    return record;
}

// "state,mode": the types by name; empty: all that the class allows.
std::vector<ULONG> Types(Verb& v, const std::optional<std::string>& list, bool& allByDefault) {
    std::vector<ULONG> types;
    allByDefault = !list;
    if (!list) {
        for (const TypeInfo& info : kTypes) {
            if (info.fromClass <= v.session.ClassVersion()) {
                types.push_back(info.type);
            }
        }
        return types;
    }
    std::stringstream names(*list);
    for (std::string name; std::getline(names, name, ',');) {
        const auto value = ValueOf(NamesOf<TavControllerSubscriptions>(), name);
        if (!value) {
            throw UsageError{"unknown event type " + Quote(name) + " (" +
                             NameList(NamesOf<TavControllerSubscriptions>()) + ")"};
        }
        types.push_back(static_cast<ULONG>(*value));
    }
    if (types.empty()) {
        throw UsageError{"--type names no event type"};
    }
    return types;
}

std::string TypeName(ULONG type) { return NameOf(NamesOf<TavControllerSubscriptions>(), static_cast<long>(type)); }

int Start(Verb& v, const std::optional<std::string>& list) {
    Session& session = v.session;
    bool allByDefault = false;
    const std::vector<ULONG> types = Types(v, list, allByDefault);
    if (!session.Watch().cookies.empty()) {
        throw UsageError{"already watching; watch stop first"};
    }
    const auto subscribe = v.Interface<ITavSubscribe>();
    tav::ComPtr<ITavController> object(session.Controller());
    WatchState& watch = session.Watch();
    watch.subscribe = subscribe;
    watch.printer.Attach(EventPrinter::New(
        [object, &session](ULONG type, VARIANT* data, const FILETIME& time) {
            Record record = Decode(object.Get(), type, data);
            if (session.Options().json) {
                record.insert(record.begin(), {{"time", TimeValue(time)}, {"type", Value::Text(TypeName(type))}});
                return Json(record);
            }
            std::string line = FormatIsoUtc(time) + " " + TypeName(type);
            if (record.size() == 1 && record.front().first != "undecoded") {
                return line + " " + PlainText(record.front().second);
            }
            for (const auto& [name, value] : record) {
                line += " " + name + "=" + PlainText(value);
            }
            return line;
        },
        [&session](const std::string& line) { session.Print(line); }));
    for (const ULONG type : types) {
        TavEventParams params{};
        params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
        params.pSink = watch.printer.Get();
        params.subscriptionType = type;
        params.pollTime = 1000;
        params.userDef = type;
        params.containData = Data;
        TavInParams rip = session.SyncParams();
        ULONG cookie = 0;
        const HRESULT hr = subscribe->Subscribe(&rip, &params, &cookie);
        if (FAILED(hr)) {
            // Without --type, what this controller does not offer is left out.
            if (allByDefault) {
                session.Error("watch: " + TypeName(type) + " left out: " + DescribeHresult(hr));
                continue;
            }
            const int status = session.Fail("Subscribe(" + TypeName(type) + ")", hr);
            session.StopWatch();
            return status;
        }
        watch.cookies.push_back(cookie);
    }
    return kExitOk;
}

struct Limits {
    std::size_t count = 0;  // 0: no limit
    double seconds = 0;     // 0: no limit
};

Limits ReadLimits(Verb& v, Limits limits) {
    if (const auto count = v.NumberOption<ULONG>("--count")) {
        limits.count = *count;
    }
    if (const auto timeout = v.Option("--timeout")) {
        char* end = nullptr;
        limits.seconds = std::strtod(timeout->c_str(), &end);
        if (timeout->empty() || *end != '\0' || !(limits.seconds >= 0) || limits.seconds > 1e6) {
            throw UsageError{"--timeout wants seconds, not " + Quote(*timeout)};
        }
    }
    return limits;
}

int Wait(Verb& v, const Limits& limits) {
    WatchState& watch = v.session.Watch();
    if (!watch.printer) {
        throw UsageError{"not watching; watch start first"};
    }
    const auto deadline = limits.seconds > 0
                              ? std::chrono::steady_clock::now() +
                                    std::chrono::duration_cast<std::chrono::steady_clock::duration>(
                                        std::chrono::duration<double>(limits.seconds))
                              : std::chrono::steady_clock::time_point::max();
    const std::size_t wanted = limits.count == 0 ? static_cast<std::size_t>(-1) : limits.count;
    const std::size_t arrived = watch.printer->WaitFor(wanted, deadline);
    if (limits.count != 0 && arrived < limits.count) {
        v.session.Error("watch: " + std::to_string(arrived) + " of " + std::to_string(limits.count) +
                        " events arrived within the time limit");
        return kExitFailed;
    }
    return kExitOk;
}

std::optional<std::string> TypeOption(Verb& v) {
    auto list = v.Option("--type");
    if (auto older = v.Option("--events")) {  // the name it had first
        list = older;
    }
    return list;
}

int WatchStart(Verb& v) {
    const auto list = TypeOption(v);
    v.End();
    return Start(v, list);
}

int WatchWait(Verb& v) {
    const Limits limits = ReadLimits(v, {1, 10});
    v.End();
    return Wait(v, limits);
}

int WatchStop(Verb& v) {
    v.End();
    v.session.StopWatch();
    return kExitOk;
}

int WatchRun(Verb& v) {
    const Limits limits = ReadLimits(v, {});
    const auto list = TypeOption(v);
    v.End();
    int status = Start(v, list);
    if (status == kExitOk) {
        status = Wait(v, limits);
    }
    v.session.StopWatch();
    return status;
}

constexpr VerbEntry kWatch[] = {
    {"", "[--type T1,T2...] [--count N] [--timeout SECONDS]", "print events as they arrive", WatchRun,
     "Subscribes (ITavSubscribe) and prints each event, time-stamped and decoded\n"
     "with its Unpack operation, as it arrives; ends after N events or the time\n"
     "limit (without either, it runs until interrupted). --type names the types\n"
     "(state, mode, MasterKESTO, SpeedRatio, ConnectionEvents, MasterCFG,\n"
     "MasterMotion, ManualModePrivRequestEvent, ManualModePrivilegesState,\n"
     "BackupEvents, AutoConditionEvent, SystemDiagnosticsInfoEvent,\n"
     "DorvelScreenDumpEvent, SysEnergyState, OPModePinCodeLockState,\n"
     "SafetyModeStatus); without it, every type the class allows, leaving out\n"
     "those the controller refuses. Fewer events than --count is a failure.\n"},
    {"start", "[--type T1,T2...]", "subscribe and return, for a batch", WatchStart,
     "The following commands of the batch can then cause events.\n"},
    {"wait", "[--count N] [--timeout SECONDS]", "wait for events since start (1 within 10 s)", WatchWait},
    {"stop", "", "unsubscribe", WatchStop},
};

}  // namespace

std::span<const GroupEntry> EventGroups() {
    static constexpr GroupEntry kGroups[] = {{"watch", "Controller events", kWatch}};
    return kGroups;
}

}  // namespace tavctl
