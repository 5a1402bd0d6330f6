#pragma once
// The virtual controller as a host sees it: registering its two components
// in-process, reaching a controller's model and fault switches.
#include <memory>

#include "sim/controller_model.h"
#include "sim/controller_registry.h"
#include "sim/status_codes.h"
#include "tav/platform.h"

namespace tav::sim {

// The controller a host reaches when it names no other.
inline constexpr const OLECHAR* kDefaultUrl = OLESTR("/sim");

// Keeps the class objects of TavComCtrl and TavUser registered in the process
// (CoRegisterClassObject), so that CoCreateInstance, and with it Init, finds
// the virtual controller; revoked when it goes. COM must be initialised on
// the registering thread where the platform asks for it (Windows).
class InProcessRegistration {
public:
    InProcessRegistration() = default;
    InProcessRegistration(InProcessRegistration&& other) noexcept;
    InProcessRegistration& operator=(InProcessRegistration&& other) noexcept;
    InProcessRegistration(const InProcessRegistration&) = delete;
    InProcessRegistration& operator=(const InProcessRegistration&) = delete;
    ~InProcessRegistration();

    // S_OK when both classes are registered, else the first failure.
    HRESULT Result() const { return result_; }
    explicit operator bool() const { return SUCCEEDED(result_); }

    void Revoke();

private:
    friend InProcessRegistration RegisterInProcess();

    HRESULT result_ = E_UNEXPECTED;
    DWORD commandCookie_ = 0;
    DWORD userCookie_ = 0;
};

[[nodiscard]] InProcessRegistration RegisterInProcess();

}  // namespace tav::sim
