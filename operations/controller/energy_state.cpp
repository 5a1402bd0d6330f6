// The controller system's energy state (paused to save energy, or running).
#include <algorithm>
#include <iterator>

#include "core/controller_object.h"
#include "core/text/char_class.h"
#include "core/text/scan.h"

namespace tav {
namespace {

struct EnergyWord {
    const OLECHAR* word;
    TavSysEnergyState state;
};

const EnergyWord kEnergyWords[] = {
    {OLESTR("notpaused"), TavSysEnergyStateNotPaused}, {OLESTR("paused"), TavSysEnergyStatePaused},
    {OLESTR("blocked"), TavSysEnergyStateBlocked},     {OLESTR("resuming"), TavSysEnergyStateResuming},
    {OLESTR("pausing"), TavSysEnergyStatePausing},
};

bool SameIgnoringCase(OleStringView a, OleStringView b) {
    return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                      [](OLECHAR x, OLECHAR y) { return text::ToLowerAscii(x) == text::ToLowerAscii(y); });
}

}  // namespace

HRESULT ControllerObject::GetSysEnergyState(TavInParams* rip, TavSysEnergyState* state) {
    return Command(rip)
        .ValidParams(OLESTR("GetEnergyState: Invalid TavInParams"))
        .OutPointer(state, OLESTR("GetEnergyState: Invalid out-pointer"))
        .Initialised(OLESTR("GetEnergyState. TavController used before Initialized"))
        .Get(OLESTR("SysEnergyState"))
        .Decode([&](VARIANT* reply) { return UnpackSysEnergyState(reply, state); });
}

HRESULT ControllerObject::UnpackSysEnergyState(VARIANT* data, TavSysEnergyState* state) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackEnergyState. NULL data-variant"))
        .OutPointer(state, OLESTR(""))
        .IsBstr(OLESTR("UnpackEnergyState. Invalid argument."))
        .Then([&](Reply& reply) {
            OLECHAR word[16] = {};
            if (text::Scan<OLESTR("-sysenergy %15s")>(reply.Text(), word) != 1) {
                return reply.Fail(E_FAIL, OLESTR("UnpackEnergyState. Unsupported format."));
            }
            const auto known = std::find_if(std::begin(kEnergyWords), std::end(kEnergyWords),
                                            [&](const EnergyWord& e) { return SameIgnoringCase(word, e.word); });
            if (known == std::end(kEnergyWords)) {
                return reply.Fail(E_FAIL, OLESTR("UnpackEnergyState. Unsupported value."));
            }
            *state = known->state;
            return S_OK;
        });
}

}  // namespace tav
