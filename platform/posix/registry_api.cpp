// The Win32 registry functions over RegistryStore. An open HKEY remembers the
// path of its key rather than the key itself, so a key deleted or reloaded
// underneath it gives ERROR_KEY_DELETED instead of a dangling pointer.
#include <cstring>
#include <memory>
#include <mutex>
#include <new>
#include <optional>
#include <type_traits>
#include <unordered_map>
#include <vector>

#include "registry_store.h"
#include "tav/com_api.h"
#include "tav/registry_file.h"

namespace tav::posix {
namespace {


struct KeyLocation {
    RegistryRoot root = RegistryRoot::LocalMachine;
    std::vector<std::u16string> path;
    REGSAM access = KEY_ALL_ACCESS;

    // As Windows does, the rights asked for at opening limit what the handle may do.
    bool Allows(REGSAM right) const { return (access & right) == right; }
};

REGSAM SpecificRights(REGSAM desired) {
    if (desired & (MAXIMUM_ALLOWED | GENERIC_ALL)) return KEY_ALL_ACCESS;
    REGSAM rights = desired & KEY_ALL_ACCESS;
    if (desired & GENERIC_READ) rights |= KEY_READ;
    if (desired & GENERIC_WRITE) rights |= KEY_WRITE;
    if (desired & GENERIC_EXECUTE) rights |= KEY_EXECUTE;
    return rights;
}

class OpenKeys {
public:
    static OpenKeys& Instance() {
        static OpenKeys* keys = new OpenKeys;
        return *keys;
    }

    HKEY Add(KeyLocation location) {
        auto entry = std::make_unique<KeyLocation>(std::move(location));
        HKEY handle = entry.get();
        std::lock_guard lock(mutex_);
        keys_.emplace(handle, std::move(entry));
        return handle;
    }

    // The predefined roots, or a copy of what an open handle names.
    std::optional<KeyLocation> Find(HKEY handle) {
        if (handle == HKEY_CLASSES_ROOT) return KeyLocation{RegistryRoot::LocalMachine, {u"SOFTWARE", u"Classes"}};
        if (handle == HKEY_CURRENT_USER) return KeyLocation{RegistryRoot::CurrentUser, {}};
        if (handle == HKEY_LOCAL_MACHINE) return KeyLocation{RegistryRoot::LocalMachine, {}};
        std::lock_guard lock(mutex_);
        auto found = keys_.find(handle);
        if (found == keys_.end()) return std::nullopt;
        return *found->second;
    }

    bool Remove(HKEY handle) {
        std::unique_ptr<KeyLocation> entry;
        std::lock_guard lock(mutex_);
        auto found = keys_.find(handle);
        if (found == keys_.end()) return false;
        entry = std::move(found->second);
        keys_.erase(found);
        return true;
    }

private:
    std::mutex mutex_;
    std::unordered_map<HKEY, std::unique_ptr<KeyLocation>> keys_;
};

bool IsPredefined(HKEY handle) {
    return handle == HKEY_CLASSES_ROOT || handle == HKEY_CURRENT_USER || handle == HKEY_LOCAL_MACHINE;
}

// Splits "a\b\c" into its names; NULL and "" give none, a trailing backslash is ignored.
LSTATUS SplitSubkey(LPCWSTR subkey, std::vector<std::u16string>& names) {
    if (subkey == nullptr || *subkey == 0) return ERROR_SUCCESS;
    std::u16string_view rest(subkey);
    if (rest.back() == u'\\') rest.remove_suffix(1);
    for (;;) {
        std::size_t separator = rest.find(u'\\');
        std::u16string_view name = rest.substr(0, separator);
        if (name.empty()) return ERROR_BAD_PATHNAME;
        if (name.size() > kLongestKeyName) return ERROR_INVALID_PARAMETER;
        names.emplace_back(name);
        if (separator == std::u16string_view::npos) return ERROR_SUCCESS;
        rest.remove_prefix(separator + 1);
    }
}

template <typename Tree, typename Key = std::conditional_t<std::is_const_v<Tree>, const RegistryKey, RegistryKey>>
Key* Locate(Tree& tree, RegistryRoot root, const std::vector<std::u16string>& path, std::size_t depth) {
    Key* key = &tree.Root(root);
    for (std::size_t i = 0; i < depth && key != nullptr; ++i) key = key->Subkey(path[i]);
    return key;
}

template <typename Tree> auto Locate(Tree& tree, const KeyLocation& location) {
    return Locate(tree, location.root, location.path, location.path.size());
}

std::u16string NameOf(LPCWSTR valueName) { return valueName == nullptr ? std::u16string() : std::u16string(valueName); }

// Hands data to a caller's buffer the way RegQueryValueEx does.
LSTATUS CopyData(const RegistryValue& value, LPDWORD type, LPBYTE data, LPDWORD dataSize) {
    if (type != nullptr) *type = value.type;
    if (dataSize == nullptr) return data == nullptr ? ERROR_SUCCESS : ERROR_INVALID_PARAMETER;
    auto needed = static_cast<DWORD>(value.data.size());
    if (data != nullptr && *dataSize < needed) {
        *dataSize = needed;
        return ERROR_MORE_DATA;
    }
    if (data != nullptr && needed != 0) std::memcpy(data, value.data.data(), needed);
    *dataSize = needed;
    return ERROR_SUCCESS;
}

// Copies a name into a buffer of `*capacity` characters, the terminator included.
LSTATUS CopyName(const std::u16string& name, LPWSTR buffer, LPDWORD capacity) {
    if (name.size() >= *capacity) return ERROR_MORE_DATA;
    std::memcpy(buffer, name.c_str(), (name.size() + 1) * sizeof(WCHAR));
    *capacity = static_cast<DWORD>(name.size());
    return ERROR_SUCCESS;
}

// Runs a registry call, turning a failed allocation into its Win32 code.
template <typename Body> LSTATUS Guarded(Body&& body) {
    try {
        return body();
    } catch (const std::bad_alloc&) {
        return ERROR_OUTOFMEMORY;
    }
}

LSTATUS OpenOrCreate(HKEY hKey, LPCWSTR lpSubKey, bool create, REGSAM access, PHKEY phkResult,
                     LPDWORD lpdwDisposition) {
    if (phkResult == nullptr) return ERROR_INVALID_PARAMETER;
    *phkResult = nullptr;
    auto base = OpenKeys::Instance().Find(hKey);
    if (!base) return ERROR_INVALID_HANDLE;
    std::vector<std::u16string> names;
    LSTATUS status = SplitSubkey(lpSubKey, names);
    if (status != ERROR_SUCCESS) return status;
    KeyLocation target = *base;
    target.path.insert(target.path.end(), names.begin(), names.end());
    if (target.path.size() > kDeepestKey) return ERROR_INVALID_PARAMETER;
    target.access = SpecificRights(access);
    bool createdLast = false;
    auto& store = RegistryStore::Instance();
    if (create) {
        status = store.Write([&](RegistryTree& tree, bool& changed) -> LSTATUS {
            RegistryKey* key = Locate(tree, *base);
            if (key == nullptr) return ERROR_KEY_DELETED;
            for (const auto& name : names) {
                key = &key->AddSubkey(name, createdLast);
                changed = changed || createdLast;
            }
            return ERROR_SUCCESS;
        });
    } else {
        status = store.Read([&](const RegistryTree& tree) -> LSTATUS {
            if (Locate(tree, *base) == nullptr) return ERROR_KEY_DELETED;
            return Locate(tree, target) == nullptr ? ERROR_FILE_NOT_FOUND : ERROR_SUCCESS;
        });
    }
    if (status != ERROR_SUCCESS) return status;
    *phkResult = OpenKeys::Instance().Add(std::move(target));
    if (lpdwDisposition != nullptr) *lpdwDisposition = createdLast ? REG_CREATED_NEW_KEY : REG_OPENED_EXISTING_KEY;
    return ERROR_SUCCESS;
}

// Deletes the key `lpSubKey` below hKey: only when it has no subkeys, or with
// its whole tree. An empty subkey names hKey itself; the roots stay.
LSTATUS DeleteKey(HKEY hKey, LPCWSTR lpSubKey, bool wholeTree) {
    auto location = OpenKeys::Instance().Find(hKey);
    if (!location) return ERROR_INVALID_HANDLE;
    std::vector<std::u16string> names;
    LSTATUS status = SplitSubkey(lpSubKey, names);
    if (status != ERROR_SUCCESS) return status;
    location->path.insert(location->path.end(), names.begin(), names.end());
    if (location->path.empty()) return ERROR_ACCESS_DENIED;
    return RegistryStore::Instance().Write([&](RegistryTree& tree, bool& changed) -> LSTATUS {
        const auto& path = location->path;
        if (Locate(tree, location->root, path, path.size() - names.size()) == nullptr) return ERROR_KEY_DELETED;
        RegistryKey* parent = Locate(tree, location->root, path, path.size() - 1);
        RegistryKey* key = parent == nullptr ? nullptr : parent->Subkey(path.back());
        if (key == nullptr) return ERROR_FILE_NOT_FOUND;
        if (!wholeTree && key->SubkeyCount() != 0) return ERROR_ACCESS_DENIED;
        changed = parent->RemoveSubkey(path.back());
        return ERROR_SUCCESS;
    });
}

}  // namespace
}  // namespace tav::posix

using namespace tav::posix;

extern "C" {

void TavSetRegistryFile(const char* path) { RegistryStore::Instance().UseFile(path == nullptr ? "" : path); }

void TavBeginRegistryBatch(void) {
    Guarded([] {
        RegistryStore::Instance().BeginBatch();
        return ERROR_SUCCESS;
    });
}

LONG TavEndRegistryBatch(void) {
    return Guarded([] { return RegistryStore::Instance().EndBatch(); });
}

LSTATUS RegCreateKeyExW(HKEY hKey, LPCWSTR lpSubKey, DWORD, LPWSTR, DWORD, REGSAM samDesired,
                        const LPSECURITY_ATTRIBUTES, PHKEY phkResult, LPDWORD lpdwDisposition) {
    return Guarded([&] { return OpenOrCreate(hKey, lpSubKey, true, samDesired, phkResult, lpdwDisposition); });
}

LSTATUS RegOpenKeyExW(HKEY hKey, LPCWSTR lpSubKey, DWORD, REGSAM samDesired, PHKEY phkResult) {
    return Guarded([&] { return OpenOrCreate(hKey, lpSubKey, false, samDesired, phkResult, nullptr); });
}

LSTATUS RegCloseKey(HKEY hKey) {
    if (IsPredefined(hKey)) return ERROR_SUCCESS;
    return OpenKeys::Instance().Remove(hKey) ? ERROR_SUCCESS : ERROR_INVALID_HANDLE;
}

LSTATUS RegSetValueExW(HKEY hKey, LPCWSTR lpValueName, DWORD, DWORD dwType, const BYTE* lpData, DWORD cbData) {
    return Guarded([&]() -> LSTATUS {
        if (lpData == nullptr && cbData != 0) return ERROR_INVALID_PARAMETER;
        auto location = OpenKeys::Instance().Find(hKey);
        if (!location) return ERROR_INVALID_HANDLE;
        if (!location->Allows(KEY_SET_VALUE)) return ERROR_ACCESS_DENIED;
        std::vector<BYTE> data(lpData, lpData + cbData);
        return RegistryStore::Instance().Write([&](RegistryTree& tree, bool& changed) -> LSTATUS {
            RegistryKey* key = Locate(tree, *location);
            if (key == nullptr) return ERROR_KEY_DELETED;
            changed = key->SetValue(NameOf(lpValueName), dwType, std::move(data));
            return ERROR_SUCCESS;
        });
    });
}

LSTATUS RegQueryValueExW(HKEY hKey, LPCWSTR lpValueName, LPDWORD, LPDWORD lpType, LPBYTE lpData, LPDWORD lpcbData) {
    return Guarded([&]() -> LSTATUS {
        auto location = OpenKeys::Instance().Find(hKey);
        if (!location) return ERROR_INVALID_HANDLE;
        if (!location->Allows(KEY_QUERY_VALUE)) return ERROR_ACCESS_DENIED;
        return RegistryStore::Instance().Read([&](const RegistryTree& tree) -> LSTATUS {
            const RegistryKey* key = Locate(tree, *location);
            if (key == nullptr) return ERROR_KEY_DELETED;
            const RegistryValue* value = key->Value(NameOf(lpValueName));
            if (value == nullptr) return ERROR_FILE_NOT_FOUND;
            return CopyData(*value, lpType, lpData, lpcbData);
        });
    });
}

LSTATUS RegDeleteValueW(HKEY hKey, LPCWSTR lpValueName) {
    return Guarded([&]() -> LSTATUS {
        auto location = OpenKeys::Instance().Find(hKey);
        if (!location) return ERROR_INVALID_HANDLE;
        if (!location->Allows(KEY_SET_VALUE)) return ERROR_ACCESS_DENIED;
        return RegistryStore::Instance().Write([&](RegistryTree& tree, bool& changed) -> LSTATUS {
            RegistryKey* key = Locate(tree, *location);
            if (key == nullptr) return ERROR_KEY_DELETED;
            changed = key->RemoveValue(NameOf(lpValueName));
            return changed ? ERROR_SUCCESS : ERROR_FILE_NOT_FOUND;
        });
    });
}

LSTATUS RegDeleteKeyW(HKEY hKey, LPCWSTR lpSubKey) {
    if (lpSubKey == nullptr) return ERROR_INVALID_PARAMETER;
    return Guarded([&] { return DeleteKey(hKey, lpSubKey, false); });
}

LSTATUS RegDeleteTreeW(HKEY hKey, LPCWSTR lpSubKey) {
    return Guarded([&]() -> LSTATUS {
        if (lpSubKey != nullptr && *lpSubKey != 0) return DeleteKey(hKey, lpSubKey, true);
        auto location = OpenKeys::Instance().Find(hKey);
        if (!location) return ERROR_INVALID_HANDLE;
        return RegistryStore::Instance().Write([&](RegistryTree& tree, bool& changed) -> LSTATUS {
            RegistryKey* key = Locate(tree, *location);
            if (key == nullptr) return ERROR_KEY_DELETED;
            changed = key->Clear();
            return ERROR_SUCCESS;
        });
    });
}

LSTATUS RegEnumKeyExW(HKEY hKey, DWORD dwIndex, LPWSTR lpName, LPDWORD lpcchName, LPDWORD, LPWSTR lpClass,
                      LPDWORD lpcchClass, PFILETIME lpftLastWriteTime) {
    if (lpName == nullptr || lpcchName == nullptr) return ERROR_INVALID_PARAMETER;
    return Guarded([&]() -> LSTATUS {
        auto location = OpenKeys::Instance().Find(hKey);
        if (!location) return ERROR_INVALID_HANDLE;
        if (!location->Allows(KEY_ENUMERATE_SUB_KEYS)) return ERROR_ACCESS_DENIED;
        return RegistryStore::Instance().Read([&](const RegistryTree& tree) -> LSTATUS {
            const RegistryKey* key = Locate(tree, *location);
            if (key == nullptr) return ERROR_KEY_DELETED;
            if (dwIndex >= key->SubkeyCount()) return ERROR_NO_MORE_ITEMS;
            LSTATUS status = CopyName(key->SubkeyAt(dwIndex).Name(), lpName, lpcchName);
            if (status != ERROR_SUCCESS) return status;
            if (lpClass != nullptr && lpcchClass != nullptr && *lpcchClass > 0) lpClass[0] = 0;
            if (lpcchClass != nullptr) *lpcchClass = 0;
            if (lpftLastWriteTime != nullptr) *lpftLastWriteTime = FILETIME{};
            return ERROR_SUCCESS;
        });
    });
}

LSTATUS RegEnumValueW(HKEY hKey, DWORD dwIndex, LPWSTR lpValueName, LPDWORD lpcchValueName, LPDWORD,
                      LPDWORD lpType, LPBYTE lpData, LPDWORD lpcbData) {
    if (lpValueName == nullptr || lpcchValueName == nullptr) return ERROR_INVALID_PARAMETER;
    return Guarded([&]() -> LSTATUS {
        auto location = OpenKeys::Instance().Find(hKey);
        if (!location) return ERROR_INVALID_HANDLE;
        if (!location->Allows(KEY_QUERY_VALUE)) return ERROR_ACCESS_DENIED;
        return RegistryStore::Instance().Read([&](const RegistryTree& tree) -> LSTATUS {
            const RegistryKey* key = Locate(tree, *location);
            if (key == nullptr) return ERROR_KEY_DELETED;
            if (dwIndex >= key->Values().size()) return ERROR_NO_MORE_ITEMS;
            const RegistryValue& value = key->Values()[dwIndex];
            LSTATUS status = CopyName(value.name, lpValueName, lpcchValueName);
            if (status != ERROR_SUCCESS) return status;
            return CopyData(value, lpType, lpData, lpcbData);
        });
    });
}

}  // extern "C"
