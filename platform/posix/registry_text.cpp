#include "registry_text.h"

#include <cstdio>
#include <cstring>

#include "utf.h"

namespace tav::posix {
namespace {

constexpr std::string_view header = "; TavController registry 1";

bool NeedsEscape(unsigned char byte) { return byte < 0x20 || byte == 0x7F || byte == '%' || byte == '"'; }

std::string Escape(std::u16string_view text) {
    static constexpr char hex[] = "0123456789ABCDEF";
    std::string escaped;
    for (char byte : ToUtf8(text)) {
        auto b = static_cast<unsigned char>(byte);
        if (NeedsEscape(b)) {
            escaped += '%';
            escaped += hex[b >> 4];
            escaped += hex[b & 0xF];
        } else {
            escaped += byte;
        }
    }
    return escaped;
}

int HexDigit(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
}

bool Unescape(std::string_view text, std::u16string& out) {
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '%') {
            bytes += text[i];
            continue;
        }
        if (i + 2 >= text.size() || HexDigit(text[i + 1]) < 0 || HexDigit(text[i + 2]) < 0) return false;
        bytes += static_cast<char>(HexDigit(text[i + 1]) << 4 | HexDigit(text[i + 2]));
        i += 2;
    }
    bool valid = true;
    out = FromUtf8(bytes, &valid);
    return valid;
}

// REG_SZ data that reads back as the same bytes: whole characters, one terminator at the end.
bool IsPlainString(const RegistryValue& value) {
    const auto& data = value.data;
    if (value.type != REG_SZ || data.size() < 2 || data.size() % 2 != 0) return false;
    for (std::size_t i = 0; i < data.size(); i += 2) {
        bool isNull = data[i] == 0 && data[i + 1] == 0;
        if (isNull != (i + 2 == data.size())) return false;
    }
    return true;
}

std::u16string StringOf(const std::vector<BYTE>& data) {
    std::u16string text(data.size() / 2 - 1, u'\0');
    std::memcpy(text.data(), data.data(), text.size() * 2);
    return text;
}

void WriteValue(std::string& out, const RegistryValue& value) {
    out += value.name.empty() ? std::string("@") : '"' + Escape(value.name) + '"';
    out += '=';
    char buffer[32];
    if (IsPlainString(value)) {
        out += '"' + Escape(StringOf(value.data)) + '"';
    } else if (value.type == REG_DWORD && value.data.size() == 4) {
        DWORD number;
        std::memcpy(&number, value.data.data(), 4);
        std::snprintf(buffer, sizeof buffer, "dword:%08x", static_cast<unsigned>(number));
        out += buffer;
    } else {
        std::snprintf(buffer, sizeof buffer, "hex(%u):", static_cast<unsigned>(value.type));
        out += buffer;
        for (std::size_t i = 0; i < value.data.size(); ++i) {
            std::snprintf(buffer, sizeof buffer, i == 0 ? "%02x" : ",%02x", value.data[i]);
            out += buffer;
        }
    }
    out += '\n';
}

void WriteKey(std::string& out, const RegistryKey& key, const std::string& path) {
    out += '[' + path + "]\n";
    for (const RegistryValue& value : key.Values()) WriteValue(out, value);
    key.ForEachSubkey([&](const RegistryKey& subkey) { WriteKey(out, subkey, path + '\\' + Escape(subkey.Name())); });
}

RegistryKey* ReadKeyLine(std::string_view path, RegistryTree& tree) {
    std::size_t separator = path.find('\\');
    std::string_view rootName = path.substr(0, separator);
    RegistryKey* key = rootName == "HKEY_CURRENT_USER"    ? &tree.Root(RegistryRoot::CurrentUser)
                       : rootName == "HKEY_LOCAL_MACHINE" ? &tree.Root(RegistryRoot::LocalMachine)
                                                          : nullptr;
    for (std::size_t depth = 1; key != nullptr && separator != std::string_view::npos; ++depth) {
        path.remove_prefix(separator + 1);
        separator = path.find('\\');
        std::u16string name;
        // Windows allows no backslash in a key name; an escaped one would split the key when written back.
        if (depth > kDeepestKey || !Unescape(path.substr(0, separator), name) || name.empty() ||
            name.size() > kLongestKeyName || name.find(u'\\') != std::u16string::npos) {
            return nullptr;
        }
        bool created;
        key = &key->AddSubkey(name, created);
    }
    return key;
}

bool ReadHexBytes(std::string_view text, std::vector<BYTE>& data) {
    for (std::size_t i = 0; i < text.size(); i += 3) {
        if (i + 2 > text.size() || HexDigit(text[i]) < 0 || HexDigit(text[i + 1]) < 0) return false;
        if (i + 2 < text.size() && text[i + 2] != ',') return false;
        data.push_back(static_cast<BYTE>(HexDigit(text[i]) << 4 | HexDigit(text[i + 1])));
    }
    return true;
}

bool ReadValueLine(std::string_view line, RegistryKey& key) {
    std::u16string name;
    if (line.starts_with("@=")) {
        line.remove_prefix(2);
    } else {
        if (!line.starts_with('"')) return false;
        std::size_t close = line.find('"', 1);
        if (close == std::string_view::npos || line.substr(close + 1, 1) != "=") return false;
        if (!Unescape(line.substr(1, close - 1), name)) return false;
        line.remove_prefix(close + 2);
    }
    DWORD type;
    std::vector<BYTE> data;
    if (line.size() >= 2 && line.front() == '"' && line.back() == '"') {
        std::u16string text;
        if (!Unescape(line.substr(1, line.size() - 2), text)) return false;
        type = REG_SZ;
        data.resize((text.size() + 1) * 2);
        std::memcpy(data.data(), text.c_str(), data.size());
    } else if (line.starts_with("dword:") && line.size() == 14) {
        DWORD number = 0;
        for (char c : line.substr(6)) {
            if (HexDigit(c) < 0) return false;
            number = number << 4 | static_cast<DWORD>(HexDigit(c));
        }
        type = REG_DWORD;
        data.resize(4);
        std::memcpy(data.data(), &number, 4);
    } else if (line.starts_with("hex(")) {
        std::size_t close = line.find("):");
        if (close == std::string_view::npos || close == 4) return false;
        type = 0;
        for (char c : line.substr(4, close - 4)) {
            if (c < '0' || c > '9' || type > 0x0FFFFFFF) return false;
            type = type * 10 + static_cast<DWORD>(c - '0');
        }
        if (!ReadHexBytes(line.substr(close + 2), data)) return false;
    } else {
        return false;
    }
    key.SetValue(name, type, std::move(data));
    return true;
}

}  // namespace

std::string WriteRegistryText(const RegistryTree& tree) {
    std::string out(header);
    out += '\n';
    WriteKey(out, tree.Root(RegistryRoot::CurrentUser), "HKEY_CURRENT_USER");
    WriteKey(out, tree.Root(RegistryRoot::LocalMachine), "HKEY_LOCAL_MACHINE");
    return out;
}

bool ReadRegistryText(std::string_view text, RegistryTree& tree) {
    tree.Clear();
    if (text.empty()) return true;
    RegistryKey* current = nullptr;
    bool first = true;
    while (!text.empty()) {
        std::size_t end = text.find('\n');
        std::string_view line = text.substr(0, end);
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
        if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
        if (first) {
            if (line != header) return false;
            first = false;
            continue;
        }
        if (line.empty() || line.front() == ';') continue;
        if (line.front() == '[') {
            if (line.back() != ']') return false;
            current = ReadKeyLine(line.substr(1, line.size() - 2), tree);
            if (current == nullptr) return false;
        } else if (current == nullptr || !ReadValueLine(line, *current)) {
            return false;
        }
    }
    tree.EnsureStandardKeys();
    return true;
}

}  // namespace tav::posix
