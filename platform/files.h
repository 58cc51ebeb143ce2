#pragma once
// Files as the engine sees them: thin wrappers over stdio that tests can make fail on the
// Nth call, the free space available to the user on a folder, folders, and the
// single-instance lock "!InUse".

#include <cstdint>
#include <cstdio>
#include <string>

// ---- stdio wrappers; each returns what its stdio counterpart returns ----
FILE* fileOpen(const std::string& path, const char* mode);   // nullptr on failure
int fileClose(FILE* f);                                       // 0 on success
int fileSeek(FILE* f, int64_t offset, int whence);            // 0 on success
int64_t fileTell(FILE* f);                                    // -1 on failure
size_t fileRead(void* buffer, size_t bytes, FILE* f);         // bytes read
size_t fileWrite(const void* buffer, size_t bytes, FILE* f);  // bytes written
int fileFlush(FILE* f);                                       // 0 on success
int fileDelete(const std::string& path);                      // 0 on success
int fileTruncate(const std::string& path, int64_t length);    // 0 on success
int64_t fileSize(const std::string& path);                    // -1 when it cannot be read
bool fileExists(const std::string& path);
bool folderExists(const std::string& path);
int makeFolder(const std::string& path);                      // 0 when it exists afterwards
int renameFile(const std::string& from, const std::string& to);  // 0 on success

// Failure injection for tests: the nth call of op from now fails (1 = the next call);
// 0 switches it off. Every injection is cleared by clearFileFailures().
enum FileOp { FILE_OP_OPEN, FILE_OP_CLOSE, FILE_OP_SEEK, FILE_OP_READ, FILE_OP_WRITE, FILE_OP_DELETE, FILE_OP_COUNT };
void failFileCall(int op, int n);
void clearFileFailures();

// ---- free disk space ----
// Bytes available to the user on the file system holding folder; -1 when unknown.
int64_t freeDiskSpace(const std::string& folder);
// The figure the disk checks use when the free space is unknown (or, at start-up, beyond 32 bits).
constexpr int64_t DISK_SPACE_UNKNOWN = 2147483648;
// Tests set the figure freeDiskSpace reports; a negative value other than -1 removes it.
void setFreeDiskSpaceOverride(int64_t bytes);
constexpr int64_t NO_FREE_SPACE_OVERRIDE = -2;

// ---- the single-instance lock ----
// A running copy keeps "!InUse" open with an exclusive flock. A copy that finds the lock
// held refuses to start; a file left by a crash is not held and is simply taken over.
enum InstanceLockResult {
    INSTANCE_LOCK_TAKEN = 0,     // this process now holds the lock
    INSTANCE_LOCK_HELD = 1,      // another running copy holds it
    INSTANCE_LOCK_FAILED = 2     // the file cannot be created (folder missing, no permission)
};
int takeInstanceLock(const std::string& path);
// Deletes the lock file and closes it; does nothing when the lock is not held.
void releaseInstanceLock();
bool instanceLockHeld();
