#include "registry_tree.h"

#include <iterator>

namespace tav::posix {

std::u16string FoldCase(std::u16string_view name) {
    std::u16string folded(name);
    for (char16_t& c : folded) {
        bool lowerAscii = c >= u'a' && c <= u'z';
        bool lowerLatin1 = c >= 0xE0 && c <= 0xFE && c != 0xF7;
        if (lowerAscii || lowerLatin1) c = static_cast<char16_t>(c - 0x20);
    }
    return folded;
}

RegistryKey* RegistryKey::Subkey(std::u16string_view name) {
    auto found = subkeys_.find(FoldCase(name));
    return found == subkeys_.end() ? nullptr : found->second.get();
}

const RegistryKey* RegistryKey::Subkey(std::u16string_view name) const {
    return const_cast<RegistryKey*>(this)->Subkey(name);
}

RegistryKey& RegistryKey::AddSubkey(std::u16string_view name, bool& created) {
    auto& slot = subkeys_[FoldCase(name)];
    created = slot == nullptr;
    if (created) slot = std::make_unique<RegistryKey>(std::u16string(name));
    return *slot;
}

bool RegistryKey::RemoveSubkey(std::u16string_view name) { return subkeys_.erase(FoldCase(name)) != 0; }

const RegistryKey& RegistryKey::SubkeyAt(std::size_t index) const {
    return *std::next(subkeys_.begin(), static_cast<std::ptrdiff_t>(index))->second;
}

const RegistryValue* RegistryKey::Value(std::u16string_view name) const {
    std::u16string folded = FoldCase(name);
    for (const RegistryValue& value : values_)
        if (FoldCase(value.name) == folded) return &value;
    return nullptr;
}

bool RegistryKey::SetValue(std::u16string_view name, DWORD type, std::vector<BYTE> data) {
    auto* existing = const_cast<RegistryValue*>(Value(name));
    if (existing == nullptr) {
        values_.push_back(RegistryValue{std::u16string(name), type, std::move(data)});
        return true;
    }
    if (existing->type == type && existing->data == data) return false;
    existing->type = type;
    existing->data = std::move(data);
    return true;
}

bool RegistryKey::RemoveValue(std::u16string_view name) {
    const RegistryValue* found = Value(name);
    if (found == nullptr) return false;
    values_.erase(values_.begin() + (found - values_.data()));
    return true;
}

bool RegistryKey::Clear() {
    bool hadContent = !subkeys_.empty() || !values_.empty();
    subkeys_.clear();
    values_.clear();
    return hadContent;
}

RegistryTree::RegistryTree() { EnsureStandardKeys(); }

void RegistryTree::EnsureStandardKeys() {
    bool created;
    currentUser_.AddSubkey(u"Software", created).AddSubkey(u"Classes", created);
    localMachine_.AddSubkey(u"SOFTWARE", created).AddSubkey(u"Classes", created);
}

void RegistryTree::Clear() {
    currentUser_.Clear();
    localMachine_.Clear();
    EnsureStandardKeys();
}

}  // namespace tav::posix
