// Helpers shared by the platform tests.
#pragma once
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

#include "tav/platform.h"

namespace tav::test {

using OleString = std::basic_string<OLECHAR>;

inline OleString Widen(std::string_view ascii) { return OleString(ascii.begin(), ascii.end()); }

inline OleString GuidText(REFGUID guid) {
    OLECHAR text[39];
    StringFromGUID2(guid, text, 39);
    return OleString(text);
}

// The folder of the test executable, with its trailing separator.
inline OleString ExecutableFolder() {
    OLECHAR path[4096];
    DWORD length = GetModuleFileNameW(nullptr, path, 4096);
    OleString folder(path, length);
    return folder.substr(0, folder.find_last_of(Widen("/\\")) + 1);
}

// A private registry for one test. On our own layer that is a fresh registry
// file; on Windows it is the real registry, so the test works below
// HKCU\Software\TavPlatformTests\{guid} (Key()) and the tree goes afterwards.
class RegistrySandbox {
public:
    RegistrySandbox() {
#ifdef _WIN32
        GUID id;
        CoCreateGuid(&id);
        keyPath_ = Widen("Software\\TavPlatformTests\\") + GuidText(id);
        RegCreateKeyExW(HKEY_CURRENT_USER, keyPath_.c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key_, nullptr);
#else
        GUID id;
        CoCreateGuid(&id);
        std::string name = "tav-platform-test-" + std::to_string(id.Data1) + "-" + std::to_string(id.Data2);
        folder_ = std::filesystem::temp_directory_path() / name;
        file_ = folder_ / "registry";
        TavSetRegistryFile(file_.c_str());
        RegCreateKeyExW(HKEY_CURRENT_USER, u"Software\\TavPlatformTests", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key_,
                        nullptr);
#endif
    }
    RegistrySandbox(const RegistrySandbox&) = delete;
    RegistrySandbox& operator=(const RegistrySandbox&) = delete;
    ~RegistrySandbox() {
        RegCloseKey(key_);
#ifdef _WIN32
        RegDeleteTreeW(HKEY_CURRENT_USER, keyPath_.c_str());
        for (const OleString& path : classKeys_) {
            RegDeleteTreeW(HKEY_CURRENT_USER, path.c_str());
            RegDeleteTreeW(HKEY_CLASSES_ROOT, path.c_str() + 17);  // without "Software\Classes\"
        }
#else
        TavSetRegistryFile(nullptr);
        std::error_code ignored;
        std::filesystem::remove_all(folder_, ignored);
#endif
    }

    // A key of the test's own, open with all access.
    HKEY Key() const { return key_; }
    const std::filesystem::path& File() const { return file_; }

    // Remembers a key below Software\Classes to be removed afterwards from
    // HKCU and HKCR alike (only Windows needs it).
    void RemoveClassKeyLater(const OleString& subkeyBelowSoftwareClasses) {
        classKeys_.push_back(Widen("Software\\Classes\\") + subkeyBelowSoftwareClasses);
    }

private:
    HKEY key_ = nullptr;
    OleString keyPath_;
    std::filesystem::path folder_;
    std::filesystem::path file_;
    std::vector<OleString> classKeys_;
};

}  // namespace tav::test
