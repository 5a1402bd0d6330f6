#pragma once
#include <utility>

#include "tav/platform.h"

namespace tav {

// An open registry key, closed when it goes out of scope. Predefined roots
// (HKEY_CLASSES_ROOT ...) are never wrapped, as they must not be closed.
class RegistryKey {
public:
    RegistryKey() = default;
    ~RegistryKey() { Close(); }
    RegistryKey(RegistryKey&& other) noexcept : key_(std::exchange(other.key_, nullptr)) {}
    RegistryKey& operator=(RegistryKey&& other) noexcept {
        if (this != &other) {
            Close();
            key_ = std::exchange(other.key_, nullptr);
        }
        return *this;
    }
    RegistryKey(const RegistryKey&) = delete;
    RegistryKey& operator=(const RegistryKey&) = delete;

    // Win32 error codes, as the registry functions return them.
    LONG Create(HKEY parent, const WCHAR* name) {
        Close();
        HKEY created = nullptr;
        const LONG status = RegCreateKeyExW(parent, name, 0, nullptr, REG_OPTION_NON_VOLATILE, KEY_READ | KEY_WRITE,
                                            nullptr, &created, nullptr);
        key_ = status == ERROR_SUCCESS ? created : nullptr;
        return status;
    }
    LONG Open(HKEY parent, const WCHAR* name, REGSAM access = KEY_READ | KEY_WRITE) {
        Close();
        HKEY opened = nullptr;
        const LONG status = RegOpenKeyExW(parent, name, 0, access, &opened);
        key_ = status == ERROR_SUCCESS ? opened : nullptr;
        return status;
    }
    void Close() {
        if (key_ != nullptr) {
            RegCloseKey(std::exchange(key_, nullptr));
        }
    }

    HKEY Get() const { return key_; }
    explicit operator bool() const { return key_ != nullptr; }

private:
    HKEY key_ = nullptr;
};

}  // namespace tav
