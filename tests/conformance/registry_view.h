// Reading (and, for planted leftovers, writing) the registry from outside the
// module, through the system's registry API only.
#pragma once
#include <optional>
#include <string>
#include <utility>

#include "tav/platform.h"

namespace tav::conformance {

class RegistryKey {
public:
    RegistryKey() noexcept = default;
    RegistryKey(const RegistryKey&) = delete;
    RegistryKey& operator=(const RegistryKey&) = delete;
    RegistryKey(RegistryKey&& other) noexcept : key_(std::exchange(other.key_, nullptr)) {}
    RegistryKey& operator=(RegistryKey&& other) noexcept {
        if (this != &other) {
            Close();
            key_ = std::exchange(other.key_, nullptr);
        }
        return *this;
    }
    ~RegistryKey() { Close(); }

    static RegistryKey Open(HKEY parent, const std::wstring& path, REGSAM access = KEY_READ);
    static RegistryKey Create(HKEY parent, const std::wstring& path);

    HKEY Get() const noexcept { return key_; }
    explicit operator bool() const noexcept { return key_ != nullptr; }

private:
    void Close() noexcept {
        if (key_ != nullptr) RegCloseKey(std::exchange(key_, nullptr));
    }

    HKEY key_ = nullptr;
};

// The roots that registration writes to: the machine's classes and the
// user's own (HKCU\Software\Classes), opened for reading and writing.
RegistryKey MachineClasses();
RegistryKey UserClasses();

bool KeyExists(HKEY root, const std::wstring& path);
// A REG_SZ value (the default value when `name` is null); nothing when the
// key or the value is missing or the value is not REG_SZ.
std::optional<std::wstring> ReadString(HKEY root, const std::wstring& path, const wchar_t* name = nullptr);
bool WriteString(HKEY root, const std::wstring& path, const wchar_t* name, const std::wstring& value);
// Deletes a key with its subtree; a missing key is no failure.
bool DeleteTree(HKEY root, const std::wstring& path);

// Every key, value name, type and datum beneath `path`, one line each, in a
// fixed order; "(missing)" for a missing key. Two equal dumps mean equal trees.
std::wstring DumpTree(HKEY root, const std::wstring& path);

}  // namespace tav::conformance
