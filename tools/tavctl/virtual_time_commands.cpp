// Virtual time: the controller's clock for simulation, stopped, running
// free or in slices.
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using VT = ITavVirtualTime;

constexpr EnumName kVtStateWords[] = {
    {VTStop, "stop"}, {VTFreeRun, "free"}, {VTRunSlice, "slice"}, {VTNextEvent, "next"}};

int VtStateGet(Verb& v) {
    v.End();
    return v.Get("VTGetState", &VT::VTGetState, &VT::UnpackVTState);
}
int VtStateSet(Verb& v) {
    const std::string word = v.Word("STATE");
    v.End();
    const auto state = static_cast<TavVTState>(v.EnumValue("STATE", word, NamesOf<TavVTState>(), kVtStateWords));
    return v.Set("VTSetState", &VT::VTSetState, state);
}
int VtState(Verb& v) { return v.Done() ? VtStateGet(v) : VtStateSet(v); }
int SliceGet(Verb& v) {
    v.End();
    return v.GetOnly("VTGetTimeSlice", &VT::VTGetTimeSlice);
}
int Slice(Verb& v) {
    if (v.Done()) {
        return SliceGet(v);
    }
    const auto slice = v.Number<ULONG>("MILLISECONDS");
    v.End();
    return v.Set("VTSetTimeSlice", &VT::VTSetTimeSlice, slice);
}
int Time(Verb& v) {
    v.End();
    return v.Get("VTGetTime", &VT::VTGetTime, &VT::UnpackVTTime);
}
int Run(Verb& v) {
    v.End();
    return v.Set("VTRun", &VT::VTRun);
}
int Speed(Verb& v) {
    if (v.Done()) {
        return v.Get("VTGetSpeed", &VT::VTGetSpeed, &VT::UnpackVTSpeed);
    }
    const auto speed = v.Number<ULONG>("SPEED");
    v.End();
    return v.Set("VTSetSpeed", &VT::VTSetSpeed, speed);
}

constexpr VerbEntry kVirtualTime[] = {
    {"state", "[STATE]", "print the virtual time state (VTGetState), or set it (VTSetState)", VtState,
     "STATE: VTStop (stop), VTFreeRun (free), VTRunSlice (slice), VTNextEvent (next).\n"},
    {"set", "STATE", "set the virtual time state (VTSetState)", VtStateSet},
    {"slice", "[MILLISECONDS]", "print the time slice (VTGetTimeSlice), or set it (VTSetTimeSlice)", Slice},
    {"time", "", "print the virtual time (VTGetTime)", Time},
    {"run", "", "run one slice (VTRun)", Run},
    {"speed", "[SPEED]", "print the speed (VTGetSpeed), or set it (VTSetSpeed)", Speed},
};

}  // namespace

std::span<const GroupEntry> VirtualTimeGroups() {
    static constexpr GroupEntry kGroups[] = {{"vt", "Virtual time", kVirtualTime}};
    return kGroups;
}

}  // namespace tavctl
