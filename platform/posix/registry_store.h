// The registry as the process sees it: one tree, loaded from the registry
// file and written back after every change.
//
// A change is made under an exclusive lock on "<file>.lock": the file is read
// again if another process replaced it since we last saw it, the change is
// applied, and the whole tree is written to a temporary file that is then
// renamed over the registry file. So two processes never lose each other's
// changes and a reader never sees half a file. Reads take no file lock; they
// reload when the file looks different from the one last read or written.
//
// A batch holds the file lock from its start to its end: changes are made in
// memory only, and the tree is saved once at the end. While it runs, the
// tree in memory is the registry (no other process can change the file).
#pragma once
#include <sys/stat.h>

#include <mutex>
#include <optional>
#include <string>

#include "registry_tree.h"

namespace tav::posix {

class RegistryStore {
public:
    static RegistryStore& Instance();

    // An empty path goes back to the environment's choice.
    void UseFile(std::string path);

    // Runs `read` on the current tree; its result is returned, unless the
    // file could not be read (ERROR_BADDB, ERROR_REGISTRY_IO_FAILED).
    template <typename Reader> LSTATUS Read(Reader&& read) {
        std::lock_guard lock(mutex_);
        LSTATUS status = batchHeld_ ? ERROR_SUCCESS : RefreshForRead();
        return status != ERROR_SUCCESS ? status : read(static_cast<const RegistryTree&>(tree_));
    }

    // Runs `change(tree, changed)` on the current tree and saves the tree
    // when it returns ERROR_SUCCESS with `changed` set. A change that fails
    // must leave the tree as it found it.
    template <typename Changer> LSTATUS Write(Changer&& change) {
        std::lock_guard lock(mutex_);
        FileLock fileLock;
        LSTATUS status = batchHeld_ ? ERROR_SUCCESS : RefreshForWrite(fileLock);
        if (status != ERROR_SUCCESS) return status;
        bool changed = false;
        status = change(tree_, changed);
        if (status != ERROR_SUCCESS || !changed) return status;
        tree_.EnsureStandardKeys();
        if (batchHeld_) {
            unsaved_ = true;
            return ERROR_SUCCESS;
        }
        return Save();
    }

    // Batches nest; only the outermost one locks and saves. A batch whose
    // start could not lock or read the file leaves every change to save
    // itself, as outside a batch.
    void BeginBatch();
    LSTATUS EndBatch();

private:
    struct FileStamp {
        bool exists = false;
        dev_t device = 0;
        ino_t inode = 0;
        off_t size = 0;
        timespec modified{};
        timespec changed{};
        bool operator==(const FileStamp& other) const;
    };

    class FileLock {
    public:
        FileLock() = default;
        FileLock(const FileLock&) = delete;
        FileLock& operator=(const FileLock&) = delete;
        ~FileLock();
        bool Acquire(const std::string& lockPath);
        void Release();

    private:
        int descriptor_ = -1;
    };

    RegistryStore() = default;

    std::string ResolvePath() const;
    LSTATUS RefreshForRead();
    LSTATUS RefreshForWrite(FileLock& fileLock);
    LSTATUS LoadText(const std::string& path, std::string text);
    LSTATUS Save();
    static FileStamp StampOf(const std::string& path);

    std::mutex mutex_;
    std::string configuredPath_;
    std::string path_;        // the file that tree_ belongs to
    bool loaded_ = false;     // tree_ holds the content of path_
    std::string content_;     // the text tree_ was read from or written as
    FileStamp stamp_;
    RegistryTree tree_;
    int batchDepth_ = 0;
    bool batchHeld_ = false;  // the outermost batch holds batchLock_
    bool unsaved_ = false;    // the batch changed the tree
    FileLock batchLock_;
};

}  // namespace tav::posix
