#include "registry_lookup.h"

#include <cstdlib>
#include <vector>

#include "tav/com_api.h"
#include "utf.h"

namespace tav::posix {
namespace {

std::u16string ExpandEnvironment(std::u16string_view text) {
    std::u16string expanded;
    for (std::size_t i = 0; i < text.size(); ++i) {
        std::size_t close = text[i] == u'%' ? text.find(u'%', i + 1) : std::u16string_view::npos;
        const char* value = close == std::u16string_view::npos
                                ? nullptr
                                : std::getenv(ToUtf8(text.substr(i + 1, close - i - 1)).c_str());
        if (value == nullptr) {
            expanded += text[i];
            continue;
        }
        expanded += FromUtf8(value);
        i = close;
    }
    return expanded;
}

ClassesEntry ReadDefaultValue(HKEY key, std::u16string& value) {
    DWORD type = REG_NONE;
    DWORD size = 0;
    if (RegQueryValueExW(key, nullptr, nullptr, &type, nullptr, &size) != ERROR_SUCCESS ||
        (type != REG_SZ && type != REG_EXPAND_SZ))
        return ClassesEntry::ValueMissing;
    std::vector<BYTE> data(size + sizeof(WCHAR));
    if (RegQueryValueExW(key, nullptr, nullptr, &type, data.data(), &size) != ERROR_SUCCESS)
        return ClassesEntry::ValueMissing;
    std::u16string text(reinterpret_cast<const char16_t*>(data.data()), size / sizeof(WCHAR));
    text.resize(std::u16string_view(text.c_str()).size());  // up to the first terminator
    value = type == REG_EXPAND_SZ ? ExpandEnvironment(text) : text;
    return value.empty() ? ClassesEntry::ValueMissing : ClassesEntry::Found;
}

}  // namespace

ClassesEntry ReadClassesDefaultValue(std::u16string_view subkey, std::u16string& value) {
    const std::u16string perUser = u"Software\\Classes\\" + std::u16string(subkey);
    const std::u16string machine(subkey);
    for (auto [root, path] : {std::pair{HKEY_CURRENT_USER, &perUser}, std::pair{HKEY_CLASSES_ROOT, &machine}}) {
        HKEY key = nullptr;
        if (RegOpenKeyExW(root, path->c_str(), 0, KEY_READ, &key) != ERROR_SUCCESS) continue;
        ClassesEntry entry = ReadDefaultValue(key, value);
        RegCloseKey(key);
        return entry;
    }
    return ClassesEntry::KeyMissing;
}

}  // namespace tav::posix
