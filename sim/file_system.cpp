#include "sim/file_system.h"

namespace tav::sim {

FileSystem::FileSystem() {
    nodes_[Text()] = Node{true, {}};
    for (const OLECHAR* folder :
         {OLESTR("hd0a/MainSystem/HOME"), OLESTR("hd0a/MainSystem/SYSPAR"), OLESTR("hd0a/MainSystem/TavOS-7.4.2"),
          OLESTR("hd0a/ServiceSystem/HOME"), OLESTR("hd0a/ServiceSystem/TavOS-7.3.0"), OLESTR("hd0a/temp"),
          OLESTR("hd0a/backups"), OLESTR("hd0a/diagnostics")}) {
        MakeFolders(folder);
    }
    Write(OLESTR("hd0a/MainSystem/SYSPAR/MOC.cfg"), "# motion configuration\nMOTION_SYSTEM: -name \"system_1\"\n");
    Write(OLESTR("hd0a/MainSystem/SYSPAR/SIO.cfg"), "# I/O configuration\nEIO_BUS: -Name \"Local\"\n");
    Write(OLESTR("hd0a/MainSystem/HOME/main.mod"), "MODULE main\n  PROC main()\n  ENDPROC\nENDMODULE\n");
}

std::optional<Text> FileSystem::Normalise(TextView path) {
    Text key;
    std::size_t at = 0;
    while (at <= path.size()) {
        std::size_t end = path.find(OLECHAR('/'), at);
        if (end == TextView::npos) {
            end = path.size();
        }
        const TextView part = path.substr(at, end - at);
        if (part.find(OLECHAR('\\')) != TextView::npos || part == OLESTR(".") || part == OLESTR("..")) {
            return std::nullopt;
        }
        if (!part.empty()) {
            if (!key.empty()) {
                key += OLECHAR('/');
            }
            key += part;
        }
        at = end + 1;
    }
    return key;
}

const FileSystem::Node* FileSystem::Find(const Text& key) const {
    const auto found = nodes_.find(key);
    return found == nodes_.end() ? nullptr : &found->second;
}

// Everything below a folder: the keys that begin with its path and a slash
// (every key, but the root's own, for the root).
std::pair<FileSystem::Nodes::const_iterator, FileSystem::Nodes::const_iterator> FileSystem::Below(
    const Text& key) const {
    if (key.empty()) {
        return {std::next(nodes_.begin()), nodes_.end()};
    }
    const Text prefix = key + OLECHAR('/');
    auto last = nodes_.lower_bound(prefix);
    const auto first = last;
    while (last != nodes_.end() && last->first.compare(0, prefix.size(), prefix) == 0) {
        ++last;
    }
    return {first, last};
}

Text FileSystem::ParentOf(const Text& key) {
    const std::size_t slash = key.rfind(OLECHAR('/'));
    return slash == Text::npos ? Text() : key.substr(0, slash);
}

bool FileSystem::Exists(TextView path) const {
    const auto key = Normalise(path);
    return key && Find(*key) != nullptr;
}

bool FileSystem::IsFolder(TextView path) const {
    const auto key = Normalise(path);
    const Node* node = key ? Find(*key) : nullptr;
    return node != nullptr && node->folder;
}

std::optional<std::uint64_t> FileSystem::Size(TextView path) const {
    const auto key = Normalise(path);
    const Node* node = key ? Find(*key) : nullptr;
    if (node == nullptr || node->folder) {
        return std::nullopt;
    }
    return node->data.size();
}

const std::string* FileSystem::Read(TextView path) const {
    const auto key = Normalise(path);
    const Node* node = key ? Find(*key) : nullptr;
    return node == nullptr || node->folder ? nullptr : &node->data;
}

FileSystem::Result FileSystem::MakeFolders(TextView path) {
    const auto key = Normalise(path);
    if (!key) {
        return Result::BadPath;
    }
    std::size_t at = 0;
    for (;;) {
        const std::size_t slash = key->find(OLECHAR('/'), at);
        const Text prefix = key->substr(0, slash);
        if (const Node* node = Find(prefix)) {
            if (!node->folder) {
                return Result::NotAFolder;
            }
        } else {
            nodes_[prefix] = Node{true, {}};
        }
        if (slash == Text::npos) {
            return Result::Done;
        }
        at = slash + 1;
    }
}

FileSystem::Result FileSystem::Write(TextView path, std::string bytes) {
    const auto key = Normalise(path);
    if (!key || key->empty()) {
        return Result::BadPath;
    }
    const Node* parent = Find(ParentOf(*key));
    if (parent == nullptr) {
        return Result::NoParent;
    }
    if (!parent->folder) {
        return Result::NotAFolder;
    }
    Node& node = nodes_[*key];
    if (node.folder) {
        return Result::IsAFolder;
    }
    node.data = std::move(bytes);
    return Result::Done;
}

FileSystem::Result FileSystem::Remove(TextView path) {
    const auto key = Normalise(path);
    if (!key || key->empty()) {
        return Result::BadPath;
    }
    const auto found = nodes_.find(*key);
    if (found == nodes_.end()) {
        return Result::NotFound;
    }
    const auto [first, last] = Below(*key);
    nodes_.erase(first, last);
    nodes_.erase(found);
    return Result::Done;
}

FileSystem::Result FileSystem::Copy(TextView from, TextView to) {
    const auto source = Normalise(from);
    const auto target = Normalise(to);
    if (!source || !target || source->empty() || target->empty()) {
        return Result::BadPath;
    }
    const Node* node = Find(*source);
    if (node == nullptr) {
        return Result::NotFound;
    }
    if (Find(*target) != nullptr) {
        return Result::AlreadyThere;
    }
    const Node* parent = Find(ParentOf(*target));
    if (parent == nullptr || !parent->folder) {
        return Result::NoParent;
    }
    if (target->compare(0, source->size() + 1, *source + OLECHAR('/')) == 0) {
        return Result::BadPath;  // into itself
    }
    std::vector<std::pair<Text, Node>> copies{{*target, *node}};
    const auto [first, last] = Below(*source);
    for (auto at = first; at != last; ++at) {
        copies.emplace_back(*target + at->first.substr(source->size()), at->second);
    }
    for (auto& [key, copy] : copies) {
        nodes_[key] = std::move(copy);
    }
    return Result::Done;
}

std::optional<std::vector<FileSystem::Entry>> FileSystem::List(TextView path) const {
    const auto key = Normalise(path);
    const Node* node = key ? Find(*key) : nullptr;
    if (node == nullptr || !node->folder) {
        return std::nullopt;
    }
    std::vector<Entry> entries;
    const std::size_t skip = key->empty() ? 0 : key->size() + 1;
    const auto [first, last] = Below(*key);
    for (auto at = first; at != last; ++at) {
        const Text name = at->first.substr(skip);
        if (name.find(OLECHAR('/')) != Text::npos) {
            continue;
        }
        entries.push_back({name, at->second.folder, at->second.folder ? UsedBelow(at->first) : at->second.data.size()});
    }
    return entries;
}

void FileSystem::Plug(TextView device) {
    if (const auto key = Normalise(device); key && !key->empty() && key->find(OLECHAR('/')) == Text::npos) {
        MakeFolders(*key);
    }
}

void FileSystem::Unplug(TextView device) {
    if (const auto key = Normalise(device); key && !key->empty() && key->find(OLECHAR('/')) == Text::npos) {
        Remove(*key);
    }
}

std::vector<Text> FileSystem::Devices() const {
    std::vector<Text> devices;
    if (const auto root = List(Text())) {
        for (const Entry& entry : *root) {
            devices.push_back(entry.name);
        }
    }
    return devices;
}

std::uint64_t FileSystem::UsedBelow(TextView path) const {
    const auto key = Normalise(path);
    if (!key) {
        return 0;
    }
    const Node* node = Find(*key);
    std::uint64_t used = node == nullptr ? 0 : node->data.size();
    const auto [first, last] = Below(*key);
    for (auto at = first; at != last; ++at) {
        used += at->second.data.size();
    }
    return used;
}

TextView ResultText(FileSystem::Result result) {
    switch (result) {
        case FileSystem::Result::Done: return OLESTR("done");
        case FileSystem::Result::NotFound: return OLESTR("no such file or folder");
        case FileSystem::Result::NotAFolder: return OLESTR("not a folder");
        case FileSystem::Result::IsAFolder: return OLESTR("is a folder");
        case FileSystem::Result::AlreadyThere: return OLESTR("already exists");
        case FileSystem::Result::NoParent: return OLESTR("the folder does not exist");
        case FileSystem::Result::BadPath: break;
    }
    return OLESTR("not a valid path");
}

}  // namespace tav::sim
