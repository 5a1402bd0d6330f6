#pragma once
#include "tav/platform.h"

namespace tav::sim {

// Private to the virtual controller's two components: the user component,
// which Init hands the controller URL and the command component, tells the
// command component which controller it serves, so that subscriptions made
// before any command still reach it.
// It also tells which client the controller knows the pair as, which the
// user component names its own ("this is me").
struct IControllerBinding : public IUnknown {
    virtual HRESULT STDMETHODCALLTYPE BindController(BSTR url) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetClientId(ULONG* clientId) = 0;
};

// {6F0C93E2-2B57-4D1A-9E7C-5D4A1B3C8F21}
inline constexpr GUID IID_IControllerBinding = {
    0x6F0C93E2, 0x2B57, 0x4D1A, {0x9E, 0x7C, 0x5D, 0x4A, 0x1B, 0x3C, 0x8F, 0x21}};

}  // namespace tav::sim
