// Reads class registrations the way COM does: a key under
// HKEY_CURRENT_USER\Software\Classes wins over the same key under
// HKEY_CLASSES_ROOT.
#pragma once
#include <string>
#include <string_view>

namespace tav::posix {

enum class ClassesEntry { KeyMissing, ValueMissing, Found };

// The default value of `subkey` (e.g. "CLSID\{...}\InprocServer32"), a
// REG_SZ or a REG_EXPAND_SZ with its %VARIABLES% expanded.
ClassesEntry ReadClassesDefaultValue(std::u16string_view subkey, std::u16string& value);

inline bool ReadClassesString(std::u16string_view subkey, std::u16string& value) {
    return ReadClassesDefaultValue(subkey, value) == ClassesEntry::Found;
}

}  // namespace tav::posix
