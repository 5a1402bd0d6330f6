#include "registry_store.h"

#include <fcntl.h>
#include <pwd.h>
#include <sys/file.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>

#include "registry_text.h"

namespace tav::posix {
namespace {

std::string HomeDirectory() {
    const char* home = std::getenv("HOME");
    if (home != nullptr && *home != 0) return home;
    struct passwd entry;
    struct passwd* found = nullptr;
    char buffer[4096];
    if (getpwuid_r(getuid(), &entry, buffer, sizeof buffer, &found) == 0 && found != nullptr && found->pw_dir != nullptr)
        return found->pw_dir;
    return {};
}

bool CreateParentDirectories(const std::string& path) {
    for (std::size_t slash = path.find('/', 1); slash != std::string::npos; slash = path.find('/', slash + 1)) {
        std::string directory = path.substr(0, slash);
        if (mkdir(directory.c_str(), 0777) != 0 && errno != EEXIST) return false;
    }
    return true;
}

bool WriteAll(int descriptor, const std::string& text) {
    std::size_t written = 0;
    while (written < text.size()) {
        ssize_t count = write(descriptor, text.data() + written, text.size() - written);
        if (count < 0 && errno == EINTR) continue;
        if (count <= 0) return false;
        written += static_cast<std::size_t>(count);
    }
    return true;
}

// Reads the whole file with the stamp of what was read; a missing file is empty.
bool ReadFile(const std::string& path, std::string& text, struct stat& status, bool& exists) {
    text.clear();
    exists = false;
    int descriptor = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (descriptor < 0) return errno == ENOENT;
    bool ok = fstat(descriptor, &status) == 0;
    char buffer[65536];
    while (ok) {
        ssize_t count = read(descriptor, buffer, sizeof buffer);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) ok = false;
        if (count <= 0) break;
        text.append(buffer, static_cast<std::size_t>(count));
    }
    close(descriptor);
    exists = ok;
    return ok;
}

}  // namespace

bool RegistryStore::FileStamp::operator==(const FileStamp& other) const {
    if (exists != other.exists) return false;
    if (!exists) return true;
    return device == other.device && inode == other.inode && size == other.size &&
           modified.tv_sec == other.modified.tv_sec && modified.tv_nsec == other.modified.tv_nsec &&
           changed.tv_sec == other.changed.tv_sec && changed.tv_nsec == other.changed.tv_nsec;
}

RegistryStore::FileLock::~FileLock() { Release(); }

void RegistryStore::FileLock::Release() {
    if (descriptor_ >= 0) close(descriptor_);  // also releases the flock
    descriptor_ = -1;
}

bool RegistryStore::FileLock::Acquire(const std::string& lockPath) {
    descriptor_ = open(lockPath.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0666);
    if (descriptor_ < 0) return false;
    while (flock(descriptor_, LOCK_EX) != 0)
        if (errno != EINTR) return false;
    return true;
}

RegistryStore& RegistryStore::Instance() {
    static RegistryStore* store = new RegistryStore;  // stays usable during static destruction
    return *store;
}

void RegistryStore::UseFile(std::string path) {
    std::lock_guard lock(mutex_);
    configuredPath_ = std::move(path);
}

std::string RegistryStore::ResolvePath() const {
    if (!configuredPath_.empty()) return configuredPath_;
    const char* fromEnvironment = std::getenv("TAV_REGISTRY_FILE");
    if (fromEnvironment != nullptr && *fromEnvironment != 0) return fromEnvironment;
    std::string home = HomeDirectory();
    return home.empty() ? std::string() : home + "/.tavcontroller/registry";
}

RegistryStore::FileStamp RegistryStore::StampOf(const std::string& path) {
    struct stat status;
    if (stat(path.c_str(), &status) != 0) return {};
    return FileStamp{true, status.st_dev, status.st_ino, status.st_size, status.st_mtim, status.st_ctim};
}

LSTATUS RegistryStore::LoadText(const std::string& path, std::string text) {
    RegistryTree fresh;
    if (!ReadRegistryText(text, fresh)) {
        loaded_ = false;
        return ERROR_BADDB;
    }
    tree_ = std::move(fresh);
    path_ = path;
    content_ = std::move(text);
    loaded_ = true;
    return ERROR_SUCCESS;
}

LSTATUS RegistryStore::RefreshForRead() {
    std::string path = ResolvePath();
    if (path.empty()) return ERROR_REGISTRY_IO_FAILED;
    if (loaded_ && path == path_ && StampOf(path) == stamp_) return ERROR_SUCCESS;
    std::string text;
    struct stat status;
    bool exists;
    if (!ReadFile(path, text, status, exists)) return ERROR_REGISTRY_IO_FAILED;
    LSTATUS result = LoadText(path, std::move(text));
    stamp_ = exists ? FileStamp{true, status.st_dev, status.st_ino, status.st_size, status.st_mtim, status.st_ctim}
                    : FileStamp{};
    return result;
}

LSTATUS RegistryStore::RefreshForWrite(FileLock& fileLock) {
    std::string path = ResolvePath();
    if (path.empty() || !CreateParentDirectories(path) || !fileLock.Acquire(path + ".lock"))
        return ERROR_REGISTRY_IO_FAILED;
    std::string text;
    struct stat status;
    bool exists;
    if (!ReadFile(path, text, status, exists)) return ERROR_REGISTRY_IO_FAILED;
    stamp_ = exists ? FileStamp{true, status.st_dev, status.st_ino, status.st_size, status.st_mtim, status.st_ctim}
                    : FileStamp{};
    if (loaded_ && path == path_ && text == content_) return ERROR_SUCCESS;
    return LoadText(path, std::move(text));
}

void RegistryStore::BeginBatch() {
    std::lock_guard lock(mutex_);
    if (batchDepth_++ == 0) {
        batchHeld_ = RefreshForWrite(batchLock_) == ERROR_SUCCESS;
        if (!batchHeld_) batchLock_.Release();
        unsaved_ = false;
    }
}

LSTATUS RegistryStore::EndBatch() {
    std::lock_guard lock(mutex_);
    if (batchDepth_ == 0 || --batchDepth_ > 0) return ERROR_SUCCESS;
    LSTATUS status = batchHeld_ && unsaved_ ? Save() : ERROR_SUCCESS;
    batchHeld_ = false;
    unsaved_ = false;
    batchLock_.Release();
    return status;
}

LSTATUS RegistryStore::Save() {
    std::string text = WriteRegistryText(tree_);
    if (text == content_) return ERROR_SUCCESS;
    std::string temporary = path_ + ".tmp." + std::to_string(getpid());
    int descriptor = open(temporary.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
    bool ok = descriptor >= 0;
    if (ok && stamp_.exists) {
        struct stat status;
        if (stat(path_.c_str(), &status) == 0) fchmod(descriptor, status.st_mode & 07777);
    }
    // The rename makes each change atomic for every reader; durability across
    // a power cut is not worth a disk flush per value written.
    ok = ok && WriteAll(descriptor, text);
    if (descriptor >= 0) ok = close(descriptor) == 0 && ok;
    ok = ok && rename(temporary.c_str(), path_.c_str()) == 0;
    if (!ok) {
        unlink(temporary.c_str());
        loaded_ = false;  // the next access reads the file again, undoing the change in memory
        return ERROR_REGISTRY_IO_FAILED;
    }
    content_ = std::move(text);
    stamp_ = StampOf(path_);
    return ERROR_SUCCESS;
}

}  // namespace tav::posix
