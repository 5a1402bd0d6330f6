#pragma once
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "sim/text.h"

namespace tav::sim {

// A controller's disks: folders and files in memory, reached by paths such
// as "/hd0a/backups/b1" (the leading slash, repeated slashes and a trailing
// one do not matter; names compare as written). The first component is a
// device ("hd0a", "usb1").
class FileSystem {
public:
    enum class Result { Done, NotFound, NotAFolder, IsAFolder, AlreadyThere, NoParent, BadPath };

    struct Entry {
        Text name;
        bool folder = false;
        std::uint64_t size = 0;
    };

    // A controller's disk as delivered: the system folders, a temporary
    // folder and a backup folder on "hd0a".
    FileSystem();

    // "a/b/c" for any spelling of the path; empty for the root; nothing for a
    // path with a backslash, an empty or a "." / ".." component.
    static std::optional<Text> Normalise(TextView path);

    bool Exists(TextView path) const;
    bool IsFolder(TextView path) const;
    std::optional<std::uint64_t> Size(TextView path) const;
    const std::string* Read(TextView path) const;

    // The folder and every missing folder above it.
    Result MakeFolders(TextView path);
    // A new or replaced file; its folder must exist.
    Result Write(TextView path, std::string bytes);
    // A file, or a folder with all it holds.
    Result Remove(TextView path);
    // A file or a whole folder to a place that does not exist yet, whose
    // folder does.
    Result Copy(TextView from, TextView to);
    // What a folder holds, in name order.
    std::optional<std::vector<Entry>> List(TextView path) const;

    // A device plugged in (with an empty root folder) or pulled out.
    void Plug(TextView device);
    void Unplug(TextView device);
    std::vector<Text> Devices() const;

    // Bytes used below a path (a file's own size for a file).
    std::uint64_t UsedBelow(TextView path) const;

private:
    struct Node {
        bool folder = false;
        std::string data;
    };
    using Nodes = std::map<Text, Node>;
    const Node* Find(const Text& key) const;
    std::pair<Nodes::const_iterator, Nodes::const_iterator> Below(const Text& key) const;
    static Text ParentOf(const Text& key);

    Nodes nodes_;  // by normalised path; the root is ""
};

// The text of a result, for the controller's error texts.
TextView ResultText(FileSystem::Result result);

}  // namespace tav::sim
