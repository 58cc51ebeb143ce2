// Files for the engine: stdio wrappers that tests can make fail, free space through
// statvfs, folders, and the single-instance lock held with flock.
#include "platform/files.h"

#include <atomic>
#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

static std::atomic<int> failAt[FILE_OP_COUNT];       // calls left until the injected failure; 0 = none
static std::atomic<int64_t> freeSpaceOverride{NO_FREE_SPACE_OVERRIDE};

// True when this call of op is the one a test asked to fail.
static bool injectedFailure(int op) {
    int left = failAt[op].load();
    while (left > 0) {
        if (failAt[op].compare_exchange_weak(left, left - 1)) return left == 1;
    }
    return false;
}

void failFileCall(int op, int n) {
    if (op >= 0 && op < FILE_OP_COUNT) failAt[op] = n > 0 ? n : 0;
}

void clearFileFailures() {
    for (auto& counter : failAt) counter = 0;
}

FILE* fileOpen(const std::string& path, const char* mode) {
    if (injectedFailure(FILE_OP_OPEN)) {
        errno = EIO;
        return nullptr;
    }
    return std::fopen(path.c_str(), mode);
}

int fileClose(FILE* f) {
    if (!f) return EOF;
    if (injectedFailure(FILE_OP_CLOSE)) {
        std::fclose(f);   // the stream is gone either way; only the report differs
        return EOF;
    }
    return std::fclose(f);
}

int fileSeek(FILE* f, int64_t offset, int whence) {
    if (injectedFailure(FILE_OP_SEEK)) return -1;
    return fseeko(f, off_t(offset), whence);
}

int64_t fileTell(FILE* f) { return int64_t(ftello(f)); }

size_t fileRead(void* buffer, size_t bytes, FILE* f) {
    if (injectedFailure(FILE_OP_READ)) return 0;
    return std::fread(buffer, 1, bytes, f);
}

size_t fileWrite(const void* buffer, size_t bytes, FILE* f) {
    if (injectedFailure(FILE_OP_WRITE)) return 0;
    return std::fwrite(buffer, 1, bytes, f);
}

int fileFlush(FILE* f) { return std::fflush(f); }

int fileDelete(const std::string& path) {
    if (injectedFailure(FILE_OP_DELETE)) return -1;
    return std::remove(path.c_str());
}

int fileTruncate(const std::string& path, int64_t length) { return truncate(path.c_str(), off_t(length)); }

int64_t fileSize(const std::string& path) {
    struct stat info;
    if (stat(path.c_str(), &info) != 0 || !S_ISREG(info.st_mode)) return -1;
    return int64_t(info.st_size);
}

bool fileExists(const std::string& path) {
    struct stat info;
    return stat(path.c_str(), &info) == 0 && S_ISREG(info.st_mode);
}

bool folderExists(const std::string& path) {
    struct stat info;
    return stat(path.c_str(), &info) == 0 && S_ISDIR(info.st_mode);
}

int makeFolder(const std::string& path) {
    if (folderExists(path)) return 0;
    // Parents first, so that a fresh shared base path works without set-up.
    std::string trimmed = path;
    while (trimmed.size() > 1 && trimmed.back() == '/') trimmed.pop_back();
    size_t slash = trimmed.rfind('/');
    if (slash != std::string::npos && slash > 0) makeFolder(trimmed.substr(0, slash));
    if (mkdir(trimmed.c_str(), 0777) != 0 && errno != EEXIST) return -1;
    return folderExists(trimmed) ? 0 : -1;
}

int renameFile(const std::string& from, const std::string& to) { return std::rename(from.c_str(), to.c_str()); }

FILE* createFileBeside(const std::string& target, std::string* temporaryPath) {
    temporaryPath->clear();
    if (injectedFailure(FILE_OP_OPEN)) {
        errno = EIO;
        return nullptr;
    }
    size_t slash = target.rfind('/');
    std::string folder = slash == std::string::npos ? "" : target.substr(0, slash + 1);
    std::string name = slash == std::string::npos ? target : target.substr(slash + 1);
    // O_EXCL makes a name that is taken fail rather than open another file, and mode 0666
    // lets the umask decide the permissions, as for any file the user creates.
    static std::atomic<unsigned> counter{0};
    for (int attempt = 0; attempt < 100; attempt++) {
        std::string path = folder + "." + name + "." + std::to_string(getpid()) + "-" +
                           std::to_string(counter.fetch_add(1)) + ".part";
        int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
        if (fd < 0) {
            if (errno == EEXIST) continue;
            return nullptr;
        }
        FILE* f = fdopen(fd, "wb");
        if (!f) {
            int error = errno;
            close(fd);
            unlink(path.c_str());
            errno = error;
            return nullptr;
        }
        *temporaryPath = path;
        return f;
    }
    errno = EEXIST;
    return nullptr;
}

int64_t freeDiskSpace(const std::string& folder) {
    int64_t forced = freeSpaceOverride.load();
    if (forced >= 0 || forced == -1) return forced;
    struct statvfs info;
    if (statvfs(folder.c_str(), &info) != 0) return -1;
    return int64_t(info.f_bavail) * int64_t(info.f_frsize);
}

void setFreeDiskSpaceOverride(int64_t bytes) { freeSpaceOverride = bytes; }

// A class name is shared by the whole program: one used again elsewhere (a test fixture) would
// share this one's inline constructor, so the state classes of this layer end in "State".
struct InstanceLockState {
    int descriptor = -1;    // "!InUse", open and flocked while this copy runs
    std::string path;       // where it lies, for the removal at shut-down
    pid_t owner = 0;        // the process that took it; a forked child is another copy
};
static InstanceLockState instanceLock;

int takeInstanceLock(const std::string& path) {
    if (instanceLockHeld()) return INSTANCE_LOCK_TAKEN;
    for (int attempt = 0; attempt < 8; attempt++) {
        int fd = open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
        if (fd < 0) return INSTANCE_LOCK_FAILED;
        if (flock(fd, LOCK_EX | LOCK_NB) != 0) {
            int error = errno;
            close(fd);
            return error == EWOULDBLOCK ? INSTANCE_LOCK_HELD : INSTANCE_LOCK_FAILED;
        }
        // A copy that was shutting down may have removed the file between our open and our
        // lock; then we hold a lock on a file nobody else will find, so try again.
        struct stat held, named;
        if (fstat(fd, &held) == 0 && stat(path.c_str(), &named) == 0 && held.st_ino == named.st_ino &&
            held.st_dev == named.st_dev) {
            // A file left behind by a crash is not locked by anyone: it is simply taken over.
            instanceLock.descriptor = fd;
            instanceLock.path = path;
            instanceLock.owner = getpid();
            return INSTANCE_LOCK_TAKEN;
        }
        close(fd);
    }
    return INSTANCE_LOCK_FAILED;
}

void releaseInstanceLock() {
    if (!instanceLockHeld()) return;
    // Removed while still locked, so a copy starting now cannot lock the old file in between.
    unlink(instanceLock.path.c_str());
    close(instanceLock.descriptor);
    instanceLock.descriptor = -1;
    instanceLock.path.clear();
}

// A child forked from a running copy shares the parent's open lock file, but it is not the
// copy that holds the lock: it must neither pass for it nor remove the file.
bool instanceLockHeld() { return instanceLock.descriptor >= 0 && instanceLock.owner == getpid(); }
