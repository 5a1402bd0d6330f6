#include "registry_view.h"

#include <algorithm>
#include <vector>

namespace tav::conformance {
namespace {

std::vector<std::wstring> SubkeyNames(HKEY key) {
    std::vector<std::wstring> names;
    for (DWORD index = 0;; ++index) {
        wchar_t name[256] = {};
        DWORD length = 256;
        if (RegEnumKeyExW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr) != ERROR_SUCCESS) {
            break;
        }
        names.emplace_back(name, length);
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::wstring ValueText(DWORD type, const std::vector<BYTE>& data, DWORD size) {
    if (type == REG_SZ || type == REG_EXPAND_SZ) {
        std::wstring text(reinterpret_cast<const wchar_t*>(data.data()), size / sizeof(wchar_t));
        while (!text.empty() && text.back() == L'\0') text.pop_back();
        return text;
    }
    std::wstring hex;
    for (DWORD i = 0; i < size; ++i) {
        wchar_t byte[4] = {};
        wsprintfW(byte, L"%02x", data[i]);
        hex += byte;
    }
    return hex;
}

std::vector<std::wstring> ValueLines(HKEY key) {
    std::vector<std::wstring> lines;
    for (DWORD index = 0;; ++index) {
        wchar_t name[256] = {};
        DWORD nameLength = 256;
        std::vector<BYTE> data(4096);
        DWORD size = static_cast<DWORD>(data.size());
        DWORD type = 0;
        if (RegEnumValueW(key, index, name, &nameLength, nullptr, &type, data.data(), &size) != ERROR_SUCCESS) {
            break;
        }
        lines.push_back(std::wstring(name, nameLength) + L" = [" + std::to_wstring(type) + L"] " +
                        ValueText(type, data, size));
    }
    std::sort(lines.begin(), lines.end());
    return lines;
}

void Dump(HKEY key, const std::wstring& path, std::wstring& out) {
    out += path + L"\n";
    for (const std::wstring& line : ValueLines(key)) {
        out += L"    " + line + L"\n";
    }
    for (const std::wstring& name : SubkeyNames(key)) {
        const RegistryKey child = RegistryKey::Open(key, name);
        if (child) Dump(child.Get(), path + L"\\" + name, out);
    }
}

}  // namespace

RegistryKey RegistryKey::Open(HKEY parent, const std::wstring& path, REGSAM access) {
    RegistryKey key;
    if (RegOpenKeyExW(parent, path.c_str(), 0, access, &key.key_) != ERROR_SUCCESS) {
        key.key_ = nullptr;
    }
    return key;
}

RegistryKey RegistryKey::Create(HKEY parent, const std::wstring& path) {
    RegistryKey key;
    if (RegCreateKeyExW(parent, path.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE, KEY_READ | KEY_WRITE, nullptr,
                        &key.key_, nullptr) != ERROR_SUCCESS) {
        key.key_ = nullptr;
    }
    return key;
}

RegistryKey MachineClasses() {
    return RegistryKey::Open(HKEY_LOCAL_MACHINE, L"Software\\Classes", KEY_READ | KEY_WRITE);
}

RegistryKey UserClasses() { return RegistryKey::Create(HKEY_CURRENT_USER, L"Software\\Classes"); }

bool KeyExists(HKEY root, const std::wstring& path) { return static_cast<bool>(RegistryKey::Open(root, path)); }

std::optional<std::wstring> ReadString(HKEY root, const std::wstring& path, const wchar_t* name) {
    const RegistryKey key = RegistryKey::Open(root, path);
    if (!key) {
        return std::nullopt;
    }
    std::vector<BYTE> data(4096);
    DWORD size = static_cast<DWORD>(data.size());
    DWORD type = 0;
    if (RegQueryValueExW(key.Get(), name, nullptr, &type, data.data(), &size) != ERROR_SUCCESS || type != REG_SZ) {
        return std::nullopt;
    }
    return ValueText(type, data, size);
}

bool WriteString(HKEY root, const std::wstring& path, const wchar_t* name, const std::wstring& value) {
    const RegistryKey key = RegistryKey::Create(root, path);
    return key && RegSetValueExW(key.Get(), name, 0, REG_SZ, reinterpret_cast<const BYTE*>(value.c_str()),
                                 static_cast<DWORD>((value.size() + 1) * sizeof(wchar_t))) == ERROR_SUCCESS;
}

bool DeleteTree(HKEY root, const std::wstring& path) {
    const LSTATUS status = RegDeleteTreeW(root, path.c_str());
    return status == ERROR_SUCCESS || status == ERROR_FILE_NOT_FOUND;
}

std::wstring DumpTree(HKEY root, const std::wstring& path) {
    const RegistryKey key = RegistryKey::Open(root, path);
    if (!key) {
        return path + L" (missing)\n";
    }
    std::wstring out;
    Dump(key.Get(), path, out);
    return out;
}

}  // namespace tav::conformance
