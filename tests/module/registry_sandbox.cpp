#include "registry_sandbox.h"

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <vector>

#include <gtest/gtest.h>

#include "module_test_support.h"

#ifndef _WIN32
#include <unistd.h>
#endif

namespace tav::test {
namespace {

std::atomic<int> sandboxCount{0};

std::string ProcessId() {
#ifdef _WIN32
    return std::to_string(GetCurrentProcessId());
#else
    return std::to_string(getpid());
#endif
}

struct OpenKey {
    HKEY key = nullptr;
    ~OpenKey() {
        if (key != nullptr) RegCloseKey(key);
    }
};

}  // namespace

#ifdef _WIN32

RegistrySandbox::RegistrySandbox() {
    location_ = "Software\\TavControllerTests\\" + ProcessId() + "-" + std::to_string(++sandboxCount);
    const auto base = Widen(location_);
    auto create = [](HKEY parent, const std::basic_string<OLECHAR>& name, HKEY* key) {
        return RegCreateKeyExW(parent, name.c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, key, nullptr) ==
               ERROR_SUCCESS;
    };
    ready_ = create(HKEY_CURRENT_USER, base + L"\\Machine", &machine_) &&
             create(HKEY_CURRENT_USER, base + L"\\User", &user_) &&
             create(machine_, L"Software\\Classes", &classes_) &&
             RegOverridePredefKey(HKEY_CLASSES_ROOT, classes_) == ERROR_SUCCESS &&
             RegOverridePredefKey(HKEY_LOCAL_MACHINE, machine_) == ERROR_SUCCESS &&
             RegOverridePredefKey(HKEY_CURRENT_USER, user_) == ERROR_SUCCESS;
}

RegistrySandbox::~RegistrySandbox() {
    RegOverridePredefKey(HKEY_CURRENT_USER, nullptr);
    RegOverridePredefKey(HKEY_LOCAL_MACHINE, nullptr);
    RegOverridePredefKey(HKEY_CLASSES_ROOT, nullptr);
    for (HKEY key : {classes_, user_, machine_}) {
        if (key != nullptr) RegCloseKey(key);
    }
    RegDeleteTreeW(HKEY_CURRENT_USER, Widen(location_).c_str());
    RegDeleteKeyW(HKEY_CURRENT_USER, L"Software\\TavControllerTests");  // only when no other sandbox is left
}

PerUserSwitch::PerUserSwitch(const char* value) { SetEnvironmentVariableA("TAVCONTROLLER_REGISTER_PER_USER", value); }
PerUserSwitch::~PerUserSwitch() { SetEnvironmentVariableA("TAVCONTROLLER_REGISTER_PER_USER", nullptr); }

#else

// The registry store syncs every change to disk; in memory that costs nothing.
std::string TemporaryFolder() {
    std::error_code ignored;
    return std::filesystem::is_directory("/dev/shm", ignored) ? std::string("/dev/shm/") : ::testing::TempDir();
}

RegistrySandbox::RegistrySandbox() {
    location_ = TemporaryFolder() + "tav_module_registry_" + ProcessId() + "_" + std::to_string(++sandboxCount);
    std::filesystem::remove(location_);
    TavSetRegistryFile(location_.c_str());
    ready_ = true;
}

RegistrySandbox::~RegistrySandbox() {
    TavSetRegistryFile(nullptr);
    std::error_code ignored;
    std::filesystem::remove(location_, ignored);
    std::filesystem::remove(location_ + ".lock", ignored);
}

PerUserSwitch::PerUserSwitch(const char* value) {
    if (value != nullptr) {
        setenv("TAVCONTROLLER_REGISTER_PER_USER", value, 1);
    } else {
        unsetenv("TAVCONTROLLER_REGISTER_PER_USER");
    }
}
PerUserSwitch::~PerUserSwitch() { unsetenv("TAVCONTROLLER_REGISTER_PER_USER"); }

#endif

namespace {

void Collect(HKEY key, const std::string& path, RegistrySnapshot& snapshot) {
    if (!path.empty()) {
        snapshot.insert(path);
    }
    const std::string prefix = path.empty() ? std::string() : path + "\\";
    for (DWORD i = 0;; ++i) {
        OLECHAR name[1024];
        DWORD nameLength = 1024;
        std::vector<BYTE> data(65536);
        DWORD dataSize = static_cast<DWORD>(data.size());
        DWORD type = 0;
        if (RegEnumValueW(key, i, name, &nameLength, nullptr, &type, data.data(), &dataSize) != ERROR_SUCCESS) {
            break;
        }
        std::string text = "<type " + std::to_string(type) + ">";
        if (type == REG_SZ) {
            const auto* chars = reinterpret_cast<const OLECHAR*>(data.data());
            size_t length = dataSize / sizeof(OLECHAR);
            while (length > 0 && chars[length - 1] == 0) --length;
            text = Narrow(OleStringView(chars, length));
        }
        const std::string valueName = nameLength == 0 ? std::string("@") : Narrow(OleStringView(name, nameLength));
        snapshot.insert(path + "|" + valueName + "=" + text);
    }
    for (DWORD i = 0;; ++i) {
        OLECHAR name[256];
        DWORD nameLength = 256;
        if (RegEnumKeyExW(key, i, name, &nameLength, nullptr, nullptr, nullptr, nullptr) != ERROR_SUCCESS) {
            break;
        }
        OpenKey sub;
        if (RegOpenKeyExW(key, std::basic_string<OLECHAR>(name, nameLength).c_str(), 0, KEY_READ, &sub.key) ==
            ERROR_SUCCESS) {
            Collect(sub.key, prefix + Narrow(OleStringView(name, nameLength)), snapshot);
        }
    }
}

}  // namespace

RegistrySnapshot TakeSnapshot(HKEY root, const std::string& path) {
    RegistrySnapshot snapshot;
    OpenKey key;
    if (RegOpenKeyExW(root, Widen(path).c_str(), 0, KEY_READ, &key.key) == ERROR_SUCCESS) {
        Collect(key.key, std::string(), snapshot);
    }
    return snapshot;
}

std::string ReadString(HKEY root, const std::string& key, const std::string& name) {
    const std::string prefix = "|" + (name.empty() ? std::string("@") : name) + "=";
    for (const std::string& entry : TakeSnapshot(root, key)) {
        if (entry.rfind(prefix, 0) == 0) return entry.substr(prefix.size());
    }
    return "<missing>";
}

void WriteString(HKEY root, const std::string& key, const std::string& name, const std::string& text) {
    OpenKey open;
    ASSERT_EQ(RegCreateKeyExW(root, Widen(key).c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &open.key, nullptr),
              ERROR_SUCCESS);
    const auto wide = Widen(text);
    const auto wideName = Widen(name);
    ASSERT_EQ(RegSetValueExW(open.key, name.empty() ? nullptr : wideName.c_str(), 0, REG_SZ,
                             reinterpret_cast<const BYTE*>(wide.c_str()),
                             static_cast<DWORD>((wide.size() + 1) * sizeof(OLECHAR))),
              ERROR_SUCCESS);
}

std::string ExecutablePath() {
    OLECHAR path[4096] = {};
    const DWORD length = GetModuleFileNameW(nullptr, path, 4096);
    return Narrow(OleStringView(path, length));
}

}  // namespace tav::test
