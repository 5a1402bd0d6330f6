// Subscriptions to controller events. The object keeps no table of its own:
// it names the controller event, checks that its class is recent enough for
// the type, and hands the subscription to the command component, which
// delivers every event straight to the client's sink.
#include <optional>

#include "core/controller_object.h"

namespace tav {
namespace {

// Every subscription type: its controller event (none for the connection's
// own events), arguments, kind, whether the poll time is forced, and the
// lowest class version that knows it.
struct SubscriptionType {
    ULONG type;
    const OLECHAR* eventName;
    const OLECHAR* eventArgs;
    LONG kind;
    bool forcedPollTime;
    LONG sinceVersion;
};

constexpr ULONG kForcedPollTime = 2147483647;

constexpr SubscriptionType kSubscriptionTypes[] = {
    {state, OLESTR("State"), nullptr, 1, false, 1},
    {mode, OLESTR("Mode"), nullptr, 1, false, 1},
    {MasterKESTO, OLESTR("CurrentMasterUid"), OLESTR("-Domain KESTO"), 4, false, 1},
    {SpeedRatio, OLESTR("SpeedAdjust"), nullptr, 1, false, 1},
    {ConnectionEvents, nullptr, nullptr, 0, true, 1},
    {MasterCFG, OLESTR("CurrentMasterUid"), OLESTR("-Domain CFG"), 4, false, 1},
    {MasterMotion, OLESTR("CurrentMasterUid"), OLESTR("-Domain MOTION"), 4, false, 1},
    {ManualModePrivRequestEvent, OLESTR("RMMPRequest"), nullptr, 2, true, 1},
    {ManualModePrivilegesState, OLESTR("RMMPStateUid"), nullptr, 1, false, 1},
    {BackupEvents, OLESTR("BackupSub"), nullptr, 2, true, 1},
    {AutoConditionEvent, OLESTR("AutoCondSub"), nullptr, 1, true, 1},
    {SystemDiagnosticsInfoEvent, OLESTR("SystemDiagnostics"), nullptr, 1, false, 4},
    {DorvelScreenDumpEvent, OLESTR("TavDorvel"), nullptr, 1, false, 6},
    {SysEnergyState, OLESTR("SysEnergyStateSub"), nullptr, 1, false, 12},
    {OPModePinCodeLockState, OLESTR("OPModePinCodeLockState"), nullptr, 1, false, 13},
    {SafetyModeStatus, OLESTR("SafetyModeStatus"), nullptr, 1, false, 15},
};

std::optional<SubscriptionType> FindSubscriptionType(ULONG type, LONG classVersion) {
    for (const SubscriptionType& entry : kSubscriptionTypes) {
        if (entry.type == type) {
            return entry.sinceVersion <= classVersion ? std::optional(entry) : std::nullopt;
        }
    }
    return std::nullopt;
}

}  // namespace

HRESULT ControllerObject::Subscribe(TavInParams* rip, TavEventParams* params, ULONG* cookie) {
    if (!ValidInParams(rip)) {
        return errors_.Set(E_INVALIDARG, ErrorSite::Here(), OLESTR("Subscribe: Invalid TavInParams"));
    }
    if (params == nullptr) {
        return errors_.Set(E_INVALIDARG, ErrorSite::Here(), OLESTR("Subscribe: Invalid TavEventParams"));
    }
    if (cookie == nullptr) {
        return errors_.Set(E_POINTER, ErrorSite::Here(), OLESTR("Subscribe: Invalid out-pointer"));
    }
    if (!Initialised()) {
        return errors_.Set(E_ABORT, ErrorSite::Here(), OLESTR("Subscribe - Helper used before initialized"));
    }
    const std::optional<SubscriptionType> type = FindSubscriptionType(params->subscriptionType, version_);
    if (!type) {
        return errors_.SetWithShortSuffix(E_INVALIDARG, ErrorSite::Here(),
                                          OLESTR("Subscribe. Unknown subscription type."));
    }

    TavEventParams handedOn = *params;
    if (type->forcedPollTime) {
        handedOn.pollTime = kForcedPollTime;
    }
    HRESULT hr;
    if (type->eventName == nullptr) {
        hr = command_->SubscribeConnectionEvents(rip, &handedOn, cookie);
    } else {
        Bstr eventName(type->eventName);
        Bstr eventArgs;
        if (type->eventArgs != nullptr) {
            eventArgs.Attach(SysAllocString(type->eventArgs));
        }
        if (eventName.IsNull() || (type->eventArgs != nullptr && eventArgs.IsNull())) {
            return errors_.Set(E_OUTOFMEMORY, ErrorSite::Here(), OLESTR("SysAllocString failed"));
        }
        hr = command_->Subscribe(rip, &handedOn, user_.Get(), eventName.Get(), eventArgs.Get(), type->kind,
                                 cookie);
    }
    if (FAILED(hr)) {
        return errors_.AdoptFromComponent(hr, command_.Get(), ErrorSite::Here());
    }
    return S_OK;
}

HRESULT ControllerObject::Unsubscribe(TavInParams* rip, ULONG cookie) {
    if (!ValidInParams(rip)) {
        return errors_.Set(E_INVALIDARG, ErrorSite::Here(), OLESTR("Unsubscribe. Invalid TavInParams."));
    }
    if (!Initialised()) {
        return errors_.Set(E_ABORT, ErrorSite::Here(), OLESTR("Unsubscribe() - Helper isn't initialized"));
    }
    const HRESULT hr = command_->Unsubscribe(rip, cookie);
    if (FAILED(hr)) {
        return errors_.AdoptFromComponent(hr, command_.Get(), ErrorSite::Here());
    }
    return hr;
}

}  // namespace tav
