// The registry in memory: keys with case-insensitive names, each holding
// subkeys (enumerated in name order) and values (in the order first set).
#pragma once
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "tav/com_types.h"

namespace tav::posix {

// Windows' own limits: a key name of 255 characters, 512 levels of keys. A
// file that goes past them is refused rather than nested without end.
constexpr std::size_t kLongestKeyName = 255;
constexpr std::size_t kDeepestKey = 512;

// Upper-cases ASCII and Latin-1 letters, which is as far as our names go.
std::u16string FoldCase(std::u16string_view name);

struct RegistryValue {
    std::u16string name;  // empty: the key's default value
    DWORD type = REG_NONE;
    std::vector<BYTE> data;
};

class RegistryKey {
public:
    explicit RegistryKey(std::u16string name) : name_(std::move(name)) {}

    const std::u16string& Name() const { return name_; }

    RegistryKey* Subkey(std::u16string_view name);
    const RegistryKey* Subkey(std::u16string_view name) const;
    // The subkey of that name, made when there is none yet.
    RegistryKey& AddSubkey(std::u16string_view name, bool& created);
    bool RemoveSubkey(std::u16string_view name);
    std::size_t SubkeyCount() const { return subkeys_.size(); }
    const RegistryKey& SubkeyAt(std::size_t index) const;
    template <typename Visit> void ForEachSubkey(Visit&& visit) const {
        for (const auto& entry : subkeys_) visit(*entry.second);
    }

    const RegistryValue* Value(std::u16string_view name) const;
    // False when the value already held exactly this.
    bool SetValue(std::u16string_view name, DWORD type, std::vector<BYTE> data);
    bool RemoveValue(std::u16string_view name);
    const std::vector<RegistryValue>& Values() const { return values_; }

    // Removes every subkey and value; false when there were none.
    bool Clear();

private:
    std::u16string name_;
    std::map<std::u16string, std::unique_ptr<RegistryKey>> subkeys_;  // by folded name
    std::vector<RegistryValue> values_;
};

enum class RegistryRoot { CurrentUser, LocalMachine };

class RegistryTree {
public:
    RegistryTree();

    RegistryKey& Root(RegistryRoot root) { return root == RegistryRoot::CurrentUser ? currentUser_ : localMachine_; }
    const RegistryKey& Root(RegistryRoot root) const {
        return root == RegistryRoot::CurrentUser ? currentUser_ : localMachine_;
    }

    // The keys that exist on every system, so that HKEY_CLASSES_ROOT always has a home.
    void EnsureStandardKeys();
    void Clear();

private:
    RegistryKey currentUser_{u"HKEY_CURRENT_USER"};
    RegistryKey localMachine_{u"HKEY_LOCAL_MACHINE"};
};

}  // namespace tav::posix
