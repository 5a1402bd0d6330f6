#include "module/registrar.h"

#include <utility>

#include "module/registry_key.h"

namespace tav {
namespace {

constexpr const WCHAR* kUserClasses = OLESTR("Software\\Classes");

HRESULT FromStatus(LONG status) { return status == ERROR_SUCCESS ? S_OK : HRESULT_FROM_WIN32(status); }

bool IsMissing(LONG status) { return status == ERROR_FILE_NOT_FOUND || status == ERROR_PATH_NOT_FOUND; }

HRESULT DeleteSubtree(HKEY parent, const OleString& name) {
    const LONG status = RegDeleteTreeW(parent, name.c_str());
    return IsMissing(status) ? S_OK : FromStatus(status);
}

HRESULT SetString(HKEY key, const WCHAR* name, const OleString& text) {
    const auto bytes = static_cast<DWORD>((text.size() + 1) * sizeof(WCHAR));
    return FromStatus(RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(text.c_str()), bytes));
}

bool HasSubkeys(HKEY key) {
    WCHAR name[256];
    DWORD length = 256;
    return RegEnumKeyExW(key, 0, name, &length, nullptr, nullptr, nullptr, nullptr) != ERROR_NO_MORE_ITEMS;
}

// A key that still holds subkeys belongs to others as well: it stays, and
// only the default value that the script gave it goes.
HRESULT RemoveKeyUnlessShared(HKEY parent, const ScriptEntry& entry, RegistryKey key) {
    LONG status = ERROR_SUCCESS;
    if (!HasSubkeys(key.Get())) {
        key.Close();
        status = RegDeleteKeyW(parent, entry.name.c_str());
    } else if (entry.value) {
        status = RegDeleteValueW(key.Get(), nullptr);
    }
    return IsMissing(status) ? S_OK : FromStatus(status);
}

HRESULT RegisterEntries(HKEY parent, const std::vector<ScriptEntry>& entries) {
    for (const ScriptEntry& entry : entries) {
        HRESULT hr = S_OK;
        if (entry.kind == ScriptEntry::Kind::NamedValue) {
            hr = SetString(parent, entry.name.c_str(), *entry.value);
        } else {
            if (entry.forceRemove || entry.deleteKey) {
                hr = DeleteSubtree(parent, entry.name);
            }
            if (SUCCEEDED(hr) && !entry.deleteKey) {
                RegistryKey key;
                hr = FromStatus(key.Create(parent, entry.name.c_str()));
                if (SUCCEEDED(hr) && entry.value) hr = SetString(key.Get(), nullptr, *entry.value);
                if (SUCCEEDED(hr)) hr = RegisterEntries(key.Get(), entry.children);
            }
        }
        if (FAILED(hr)) {
            return hr;
        }
    }
    return S_OK;
}

HRESULT UnregisterEntries(HKEY parent, const std::vector<ScriptEntry>& entries) {
    for (const ScriptEntry& entry : entries) {
        HRESULT hr = S_OK;
        if (entry.kind == ScriptEntry::Kind::NamedValue) {
            if (entry.noRemove) {
                continue;
            }
            const LONG status = RegDeleteValueW(parent, entry.name.c_str());
            hr = IsMissing(status) ? S_OK : FromStatus(status);
        } else if (entry.forceRemove) {
            hr = DeleteSubtree(parent, entry.name);
        } else if (!entry.deleteKey) {
            RegistryKey key;
            const LONG status = key.Open(parent, entry.name.c_str());
            if (IsMissing(status)) {
                continue;
            }
            hr = FromStatus(status);
            if (SUCCEEDED(hr)) hr = UnregisterEntries(key.Get(), entry.children);
            if (SUCCEEDED(hr) && !entry.noRemove) {
                hr = RemoveKeyUnlessShared(parent, entry, std::move(key));
            }
        }
        if (FAILED(hr)) {
            return hr;
        }
    }
    return S_OK;
}

}  // namespace

HRESULT Registrar::Register(std::string_view script) const { return Run(script, true); }

HRESULT Registrar::Unregister(std::string_view script) const { return Run(script, false); }

HRESULT Registrar::Run(std::string_view script, bool registering) const {
    std::vector<ScriptBlock> blocks;
    HRESULT hr = ParseRegistryScript(script, variables_, blocks);
    for (const ScriptBlock& block : blocks) {
        if (FAILED(hr)) {
            break;
        }
        HKEY root = block.root == ScriptRoot::ClassesRoot    ? HKEY_CLASSES_ROOT
                    : block.root == ScriptRoot::CurrentUser ? HKEY_CURRENT_USER
                                                            : HKEY_LOCAL_MACHINE;
        RegistryKey userClasses;
        if (block.root == ScriptRoot::ClassesRoot && scope_ == RegistrationScope::User) {
            const LONG status = registering ? userClasses.Create(HKEY_CURRENT_USER, kUserClasses)
                                            : userClasses.Open(HKEY_CURRENT_USER, kUserClasses);
            if (!registering && IsMissing(status)) {
                continue;
            }
            hr = FromStatus(status);
            root = userClasses.Get();
        }
        if (SUCCEEDED(hr)) {
            hr = registering ? RegisterEntries(root, block.entries) : UnregisterEntries(root, block.entries);
        }
    }
    return hr;
}

}  // namespace tav
