// The registry stand-in: each root is held in memory as the list of its keys and values,
// read from its text file on first use and rewritten atomically after every change.
// Used by the settings and paths of shell/. One mutex guards everything here; a damaged
// file is reported after that mutex is released, so a message box that runs its own event
// loop can never deadlock a second registry call.
#include "platform/registry.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <map>
#include <mutex>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/ui.h"

// First line of every root file; a file that does not begin with it is not ours.
static const char* REGISTRY_SIGNATURE = "Melodrift Settings Version 1";
// A settings file is a few kilobytes; anything above this is damage, not settings.
static const size_t MAX_REGISTRY_FILE_SIZE = 1024 * 1024;
static const char* ROOT_FILE_NAMES[2] = {"machine.reg", "user.reg"};

struct RegistryValue {
    std::string name;   // as first written; compared without regard to ASCII case
    int type;           // RegistryValueType
    std::string data;   // DWORD: 4 bytes little-endian; SZ: the text; BINARY: the bytes
};

struct RegistryKeyData {
    std::string path;                     // backslash path from the root, as first created
    std::vector<RegistryValue> values;    // in the order they were first written
};

struct RegistryRootData {
    bool loaded = false;                  // keys hold the file's contents (or an empty root)
    bool writeBlocked = false;            // a damaged file could not be moved aside: never overwrite it
    std::string file;                     // the root's file, fixed when it was loaded
    std::vector<RegistryKeyData> keys;    // parents before children, in creation order
};

struct OpenKey {
    int root;           // RegistryRoot
    std::string path;   // the key's stored path
    int access;         // RegistryAccess
};

struct RegistryState {
    std::mutex lock;                          // guards everything below
    RegistryRootData roots[2];                // machine and user
    std::map<int, OpenKey> openKeys;          // handle -> key; emptied by resetRegistry
    int nextHandle = 1;                       // never reused, so a stale handle stays invalid
    std::vector<std::string> pendingMessages; // damage reports, shown once the lock is released
};
static RegistryState registryState;

// Holds the registry's mutex; on leaving it releases the mutex first and then shows the
// damage reports collected meanwhile.
struct RegistryLock {
    std::unique_lock<std::mutex> hold{registryState.lock};
    ~RegistryLock() {
        std::vector<std::string> messages;
        messages.swap(registryState.pendingMessages);
        hold.unlock();
        for (const std::string& text : messages) showMessage(MESSAGE_ERROR, text);
    }
};

// ---- names ----

static std::string lowerAscii(const std::string& s) {
    std::string out = s;
    for (char& c : out)
        if (c >= 'A' && c <= 'Z') c = char(c - 'A' + 'a');
    return out;
}

static bool sameName(const std::string& a, const std::string& b) {
    return a.size() == b.size() && lowerAscii(a) == lowerAscii(b);
}

// A key path is one or more non-empty names joined by backslashes, without control bytes
// (they could not stand in a file's bracketed key line).
static bool validKeyPath(const std::string& path) {
    if (path.empty() || path.front() == '\\' || path.back() == '\\') return false;
    for (size_t i = 0; i < path.size(); i++) {
        unsigned char c = (unsigned char)path[i];
        if (c < 0x20 || c == 0x7f) return false;
        if (c == '\\' && path[i + 1] == '\\') return false;
    }
    return true;
}

static RegistryKeyData* findKey(RegistryRootData& root, const std::string& path) {
    for (RegistryKeyData& key : root.keys)
        if (sameName(key.path, path)) return &key;
    return nullptr;
}

static RegistryValue* findValue(RegistryKeyData& key, const std::string& name) {
    for (RegistryValue& value : key.values)
        if (sameName(value.name, name)) return &value;
    return nullptr;
}

// Adds the key and any missing parents; returns the key.
static RegistryKeyData* addKey(RegistryRootData& root, const std::string& path) {
    std::string stored;
    RegistryKeyData* key = nullptr;
    size_t start = 0;
    while (start <= path.size()) {
        size_t end = path.find('\\', start);
        if (end == std::string::npos) end = path.size();
        std::string wanted = path.substr(0, end);
        key = findKey(root, wanted);
        if (!key) {
            // A new child keeps its parent's spelling of the names above it.
            std::string name = path.substr(start, end - start);
            root.keys.push_back({stored.empty() ? name : stored + "\\" + name, {}});
            key = &root.keys.back();
        }
        stored = key->path;
        start = end + 1;
    }
    return key;
}

// Every root holds "SOFTWARE", as the system's predefined roots do.
static void makeEmptyRoot(RegistryRootData& root) {
    root.keys.clear();
    addKey(root, "SOFTWARE");
}

// ---- the folder ----

std::string registryFolder() {
    const char* configured = std::getenv("MELODRIFT_CONFIG_DIR");
    std::string folder;
    if (configured && *configured) {
        folder = configured;
    } else {
        const char* xdg = std::getenv("XDG_CONFIG_HOME");
        // The XDG base directory rules ignore a relative XDG_CONFIG_HOME.
        if (xdg && xdg[0] == '/') {
            folder = std::string(xdg) + "/torvellan-melodrift";
        } else {
            std::string home;
            const char* env = std::getenv("HOME");
            if (env && *env) {
                home = env;
            } else {
                passwd* entry = getpwuid(getuid());
                if (entry && entry->pw_dir) home = entry->pw_dir;
            }
            folder = (home.empty() ? std::string(".") : home) + "/.config/torvellan-melodrift";
        }
    }
    if (folder.back() != '/') folder += '/';
    return folder;
}

static int resultOfErrno(int error) {
    if (error == EACCES || error == EPERM || error == EROFS) return REG_ACCESS_DENIED;
    return REG_IO_ERROR;
}

static std::string folderOf(const std::string& file) {
    size_t slash = file.rfind('/');
    return slash == std::string::npos ? std::string(".") : file.substr(0, slash + 1);
}

// Creates the folder (and its parents) when missing; REG_OK when it is a writable folder.
static int prepareFolder(const std::string& folder) {
    std::error_code error;
    std::filesystem::create_directories(folder, error);
    if (error) return resultOfErrno(error.value());
    struct stat info;
    if (stat(folder.c_str(), &info) != 0) return resultOfErrno(errno);
    if (!S_ISDIR(info.st_mode)) return REG_IO_ERROR;
    if (access(folder.c_str(), W_OK | X_OK) != 0) return resultOfErrno(errno);
    return REG_OK;
}

// ---- the file format ----
//
//   Melodrift Settings Version 1
//   ; comment
//   [SOFTWARE\Torvellan\Melodrift\1.0\General settings]
//   "CS Pitch range"=dword:00000001
//   "Open Directory"="/home/a \"b\"\\c\n"
//   "Main window position"=hex:2c,00,00,00
//
// Strings escape backslash, quote, \n, \r, \t and every other control byte as \xHH.

static void appendEscaped(std::string& out, const std::string& text) {
    static const char* HEX = "0123456789abcdef";
    out += '"';
    for (unsigned char c : text) {
        if (c == '\\') out += "\\\\";
        else if (c == '"') out += "\\\"";
        else if (c == '\n') out += "\\n";
        else if (c == '\r') out += "\\r";
        else if (c == '\t') out += "\\t";
        else if (c < 0x20 || c == 0x7f) {
            out += "\\x";
            out += HEX[c >> 4];
            out += HEX[c & 15];
        } else out += char(c);
    }
    out += '"';
}

static std::string serializeRoot(const RegistryRootData& root, int which) {
    static const char* HEX = "0123456789abcdef";
    std::string out = REGISTRY_SIGNATURE;
    out += which == REG_ROOT_MACHINE ? "\n; The installation's settings of Torvellan Melodrift.\n"
                                     : "\n; The user's settings of Torvellan Melodrift.\n";
    out += "; The program rewrites this file whenever a setting changes.\n";
    for (const RegistryKeyData& key : root.keys) {
        out += "\n[" + key.path + "]\n";
        for (const RegistryValue& value : key.values) {
            appendEscaped(out, value.name);
            out += '=';
            if (value.type == REG_TYPE_DWORD) {
                uint32_t v = 0;
                for (int i = 0; i < 4; i++) v |= uint32_t((unsigned char)value.data[i]) << (8 * i);
                char text[20];
                std::snprintf(text, sizeof text, "dword:%08x", v);
                out += text;
            } else if (value.type == REG_TYPE_SZ) {
                appendEscaped(out, value.data);
            } else {
                out += "hex:";
                for (size_t i = 0; i < value.data.size(); i++) {
                    unsigned char c = (unsigned char)value.data[i];
                    if (i) out += ',';
                    out += HEX[c >> 4];
                    out += HEX[c & 15];
                }
            }
            out += '\n';
        }
    }
    return out;
}

static int hexDigit(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
}

// Reads a quoted string starting at line[*pos] == '"'; leaves *pos after the closing quote.
// Returns "" on success, else what is wrong.
static std::string parseQuoted(const std::string& line, size_t* pos, std::string* out) {
    size_t i = *pos + 1;
    out->clear();
    while (i < line.size()) {
        unsigned char c = (unsigned char)line[i];
        if (c == '"') {
            *pos = i + 1;
            return "";
        }
        if (c < 0x20 || c == 0x7f) return "a control byte inside quotes";
        if (c != '\\') {
            *out += char(c);
            i++;
            continue;
        }
        if (i + 1 >= line.size()) break;
        char e = line[i + 1];
        if (e == '\\') *out += '\\';
        else if (e == '"') *out += '"';
        else if (e == 'n') *out += '\n';
        else if (e == 'r') *out += '\r';
        else if (e == 't') *out += '\t';
        else if (e == 'x') {
            int high = i + 2 < line.size() ? hexDigit(line[i + 2]) : -1;
            int low = i + 3 < line.size() ? hexDigit(line[i + 3]) : -1;
            if (high < 0 || low < 0) return "a bad \\x escape";
            *out += char(high * 16 + low);
            i += 4;
            continue;
        } else return "an unknown escape";
        i += 2;
    }
    return "a missing closing quote";
}

static std::string parseValueData(const std::string& line, size_t pos, RegistryValue* value) {
    if (pos < line.size() && line[pos] == '"') {
        value->type = REG_TYPE_SZ;
        std::string problem = parseQuoted(line, &pos, &value->data);
        if (!problem.empty()) return problem;
        if (pos != line.size()) return "text after the closing quote";
        return "";
    }
    if (line.compare(pos, 6, "dword:") == 0) {
        pos += 6;
        size_t digits = line.size() - pos;
        if (digits < 1 || digits > 8) return "a bad dword";
        uint32_t v = 0;
        for (; pos < line.size(); pos++) {
            int d = hexDigit(line[pos]);
            if (d < 0) return "a bad dword";
            v = v * 16 + uint32_t(d);
        }
        value->type = REG_TYPE_DWORD;
        value->data.clear();
        for (int i = 0; i < 4; i++) value->data += char((v >> (8 * i)) & 0xff);
        return "";
    }
    if (line.compare(pos, 4, "hex:") == 0) {
        pos += 4;
        value->type = REG_TYPE_BINARY;
        value->data.clear();
        if (pos == line.size()) return "";
        for (;;) {
            if (pos + 2 > line.size()) return "a bad hex byte";
            int high = hexDigit(line[pos]), low = hexDigit(line[pos + 1]);
            if (high < 0 || low < 0) return "a bad hex byte";
            value->data += char(high * 16 + low);
            pos += 2;
            if (pos == line.size()) return "";
            if (line[pos] != ',') return "a bad hex byte";
            pos++;
        }
    }
    return "an unknown value type";
}

// Fills root from the file's text; returns "" when the text is sound, else what is wrong.
// On failure root is left empty.
static std::string parseRoot(const std::string& text, RegistryRootData& root) {
    makeEmptyRoot(root);
    if (text.find('\0') != std::string::npos) return "it contains a zero byte";
    RegistryKeyData* current = nullptr;
    bool sawSignature = false;
    // Editors that save with a byte-order mark still leave a sound file.
    size_t start = text.compare(0, 3, "\xEF\xBB\xBF") == 0 ? 3 : 0;
    int lineNumber = 0;
    std::string problem;
    while (start < text.size() && problem.empty()) {
        size_t end = text.find('\n', start);
        if (end == std::string::npos) end = text.size();
        std::string line = text.substr(start, end - start);
        start = end + 1;
        lineNumber++;
        size_t first = line.find_first_not_of(" \t");
        size_t last = line.find_last_not_of(" \t\r");
        line = first == std::string::npos ? std::string() : line.substr(first, last - first + 1);
        if (!sawSignature) {
            if (line.empty()) continue;
            if (line != REGISTRY_SIGNATURE) problem = "it does not begin with \"" + std::string(REGISTRY_SIGNATURE) + "\"";
            sawSignature = true;
            continue;
        }
        if (line.empty() || line[0] == ';') continue;
        if (line[0] == '[') {
            std::string path = line.size() >= 2 && line.back() == ']' ? line.substr(1, line.size() - 2) : "";
            if (!validKeyPath(path)) problem = "a bad key name";
            else current = addKey(root, path);
            continue;
        }
        if (line[0] != '"') {
            problem = "an unreadable line";
            continue;
        }
        if (!current) {
            problem = "a value before any key";
            continue;
        }
        RegistryValue value;
        size_t pos = 0;
        problem = parseQuoted(line, &pos, &value.name);
        if (!problem.empty()) continue;
        if (pos >= line.size() || line[pos] != '=') {
            problem = "a value without \"=\"";
            continue;
        }
        problem = parseValueData(line, pos + 1, &value);
        if (!problem.empty()) continue;
        // A repeated value: the later line wins, as in an import.
        if (RegistryValue* old = findValue(*current, value.name)) *old = value;
        else current->values.push_back(value);
    }
    if (problem.empty()) return "";
    makeEmptyRoot(root);
    return problem + " in line " + std::to_string(lineNumber);
}

// ---- loading and saving a root ----

static std::string damagedName(const std::string& file) {
    std::string name = file + ".damaged";
    struct stat info;
    for (int n = 2; lstat(name.c_str(), &info) == 0 && n < 1000; n++)
        name = file + ".damaged." + std::to_string(n);
    return name;
}

// Moves a damaged file aside, starts the root empty and queues the report.
static void setAsideDamaged(RegistryRootData& root, const std::string& reason) {
    makeEmptyRoot(root);
    root.loaded = true;
    std::string aside = damagedName(root.file);
    if (std::rename(root.file.c_str(), aside.c_str()) == 0) {
        registryState.pendingMessages.push_back("The settings file " + root.file + " is damaged (" + reason +
                                                "). It has been kept as " + aside +
                                                " and the default settings are used.");
        return;
    }
    // Writing the root now would replace the only copy of the damaged file.
    root.writeBlocked = true;
    registryState.pendingMessages.push_back("The settings file " + root.file + " is damaged (" + reason +
                                            ") and could not be kept aside as " + aside +
                                            ". The default settings are used and changes will not be saved.");
}

// Reads the root's file on first use. A missing file (or a missing folder) is an empty root;
// a file that exists but cannot be read gives its code and is tried again next time.
static int loadRoot(int which) {
    RegistryRootData& root = registryState.roots[which];
    if (root.loaded) return REG_OK;
    root.file = registryFolder() + ROOT_FILE_NAMES[which];
    root.writeBlocked = false;
    int fd = open(root.file.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        if (errno != ENOENT && errno != ENOTDIR) return resultOfErrno(errno);
        makeEmptyRoot(root);
        root.loaded = true;
        return REG_OK;
    }
    struct CloseFd {
        int fd;
        ~CloseFd() { close(fd); }
    } closeFd{fd};
    struct stat info;
    if (fstat(fd, &info) != 0) return resultOfErrno(errno);
    if (!S_ISREG(info.st_mode)) return REG_IO_ERROR;
    if (size_t(info.st_size) > MAX_REGISTRY_FILE_SIZE) {
        setAsideDamaged(root, "it is larger than 1 MiB");
        return REG_OK;
    }
    std::string text;
    char buffer[16384];
    for (;;) {
        ssize_t got = read(fd, buffer, sizeof buffer);
        if (got < 0 && errno == EINTR) continue;
        if (got < 0) return resultOfErrno(errno);
        if (got == 0) break;
        text.append(buffer, size_t(got));
        // The file may have grown since fstat.
        if (text.size() > MAX_REGISTRY_FILE_SIZE) {
            setAsideDamaged(root, "it is larger than 1 MiB");
            return REG_OK;
        }
    }
    std::string problem = parseRoot(text, root);
    if (!problem.empty()) {
        setAsideDamaged(root, problem);
        return REG_OK;
    }
    root.loaded = true;
    return REG_OK;
}

// Writes the whole root to a temporary file beside its file, flushes it to the disk and
// renames it over the file, so that a crash leaves either the old or the new settings.
static int saveRoot(int which) {
    RegistryRootData& root = registryState.roots[which];
    if (root.writeBlocked) return REG_ACCESS_DENIED;
    std::string text = serializeRoot(root, which);
    if (text.size() > MAX_REGISTRY_FILE_SIZE) return REG_IO_ERROR;   // it would read back as damaged
    std::string folder = folderOf(root.file);
    int result = prepareFolder(folder);
    if (result != REG_OK) return result;
    std::string temporary = root.file + ".tmp-XXXXXX";
    std::vector<char> name(temporary.begin(), temporary.end());
    name.push_back('\0');
    int fd = mkstemp(name.data());
    if (fd < 0) return resultOfErrno(errno);
    temporary = name.data();
    size_t done = 0;
    int error = 0;
    while (done < text.size()) {
        ssize_t put = write(fd, text.data() + done, text.size() - done);
        if (put < 0 && errno == EINTR) continue;
        if (put <= 0) {
            error = put < 0 ? errno : ENOSPC;
            break;
        }
        done += size_t(put);
    }
    if (!error && fsync(fd) != 0) error = errno;
    if (close(fd) != 0 && !error) error = errno;
    if (!error && std::rename(temporary.c_str(), root.file.c_str()) != 0) error = errno;
    if (error) {
        unlink(temporary.c_str());
        return resultOfErrno(error);
    }
    // The rename itself is made durable by flushing the folder; failing that is not an error
    // of the settings, which are already in place.
    int folderFd = open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (folderFd >= 0) {
        fsync(folderFd);
        close(folderFd);
    }
    return REG_OK;
}

// Applies change to the root and saves it; when the save fails the root is put back as it
// was, so memory never claims a setting the file does not hold.
template <typename Change>
static int changeRoot(int which, Change change) {
    RegistryRootData& root = registryState.roots[which];
    std::vector<RegistryKeyData> before = root.keys;
    if (!change(root)) return REG_OK;   // nothing changed: no rewrite
    int result = saveRoot(which);
    if (result != REG_OK) root.keys.swap(before);
    return result;
}

// REG_OK when the root may be written now.
static int checkWritable(int which) {
    RegistryRootData& root = registryState.roots[which];
    if (root.writeBlocked) return REG_ACCESS_DENIED;
    return prepareFolder(folderOf(root.file));
}

static int newHandle(int root, const std::string& path, int access, RegistryKey* key) {
    int handle = registryState.nextHandle++;
    registryState.openKeys[handle] = {root, path, access};
    *key = handle;
    return REG_OK;
}

// ---- keys ----

int regOpenKey(int root, const std::string& path, int access, RegistryKey* key) {
    RegistryLock guard;
    *key = 0;
    if (root != REG_ROOT_MACHINE && root != REG_ROOT_USER) return REG_NOT_FOUND;
    int result = loadRoot(root);
    if (result != REG_OK) return result;
    if (!validKeyPath(path)) return REG_NOT_FOUND;
    RegistryKeyData* found = findKey(registryState.roots[root], path);
    if (!found) return REG_NOT_FOUND;
    if (access == REG_ACCESS_WRITE) {
        result = checkWritable(root);
        if (result != REG_OK) return result;
    }
    return newHandle(root, found->path, access, key);
}

int regCreateKey(int root, const std::string& path, int access, RegistryKey* key, bool* existed) {
    RegistryLock guard;
    *key = 0;
    if (existed) *existed = false;
    if (root != REG_ROOT_MACHINE && root != REG_ROOT_USER) return REG_NOT_FOUND;
    int result = loadRoot(root);
    if (result != REG_OK) return result;
    if (!validKeyPath(path)) return REG_NOT_FOUND;
    RegistryRootData& data = registryState.roots[root];
    if (RegistryKeyData* found = findKey(data, path)) {
        if (existed) *existed = true;
        if (access == REG_ACCESS_WRITE) {
            result = checkWritable(root);
            if (result != REG_OK) return result;
        }
        return newHandle(root, found->path, access, key);
    }
    // A new key is written at once, whatever the access asked for, as the system does.
    result = changeRoot(root, [&](RegistryRootData& r) {
        addKey(r, path);
        return true;
    });
    if (result != REG_OK) return result;
    return newHandle(root, findKey(data, path)->path, access, key);
}

void regCloseKey(RegistryKey key) {
    RegistryLock guard;
    registryState.openKeys.erase(key);
}

// ---- values ----

// The open key behind a handle, or nullptr (stale handle, or its root was forgotten).
static RegistryKeyData* keyOfHandle(RegistryKey key, OpenKey** open) {
    auto it = registryState.openKeys.find(key);
    if (it == registryState.openKeys.end()) return nullptr;
    RegistryRootData& root = registryState.roots[it->second.root];
    if (!root.loaded) return nullptr;
    *open = &it->second;
    return findKey(root, it->second.path);
}

static int queryValue(RegistryKey key, const std::string& name, int type, std::string* data) {
    OpenKey* open = nullptr;
    RegistryKeyData* found = keyOfHandle(key, &open);
    if (!found) return REG_INVALID_HANDLE;
    RegistryValue* value = findValue(*found, name);
    if (!value) return REG_NOT_FOUND;
    if (value->type != type) return REG_WRONG_TYPE;
    *data = value->data;
    return REG_OK;
}

static int setValue(RegistryKey key, const std::string& name, int type, const std::string& data) {
    OpenKey* open = nullptr;
    RegistryKeyData* found = keyOfHandle(key, &open);
    if (!found) return REG_INVALID_HANDLE;
    if (open->access != REG_ACCESS_WRITE) return REG_ACCESS_DENIED;
    std::string path = found->path;
    return changeRoot(open->root, [&](RegistryRootData& root) {
        RegistryKeyData* target = findKey(root, path);
        if (RegistryValue* value = findValue(*target, name)) {
            if (value->type == type && value->data == data) return false;
            value->type = type;
            value->data = data;
        } else {
            target->values.push_back({name, type, data});
        }
        return true;
    });
}

int regQueryDword(RegistryKey key, const std::string& name, uint32_t* value) {
    RegistryLock guard;
    std::string data;
    int result = queryValue(key, name, REG_TYPE_DWORD, &data);
    if (result != REG_OK) return result;
    uint32_t v = 0;
    for (int i = 0; i < 4; i++) v |= uint32_t((unsigned char)data[i]) << (8 * i);
    *value = v;
    return REG_OK;
}

int regQueryString(RegistryKey key, const std::string& name, std::string* value) {
    RegistryLock guard;
    return queryValue(key, name, REG_TYPE_SZ, value);
}

int regQueryBinary(RegistryKey key, const std::string& name, std::vector<uint8_t>* value) {
    RegistryLock guard;
    std::string data;
    int result = queryValue(key, name, REG_TYPE_BINARY, &data);
    if (result != REG_OK) return result;
    value->assign(data.begin(), data.end());
    return REG_OK;
}

int regSetDword(RegistryKey key, const std::string& name, uint32_t value) {
    RegistryLock guard;
    std::string data;
    for (int i = 0; i < 4; i++) data += char((value >> (8 * i)) & 0xff);
    return setValue(key, name, REG_TYPE_DWORD, data);
}

int regSetString(RegistryKey key, const std::string& name, const std::string& value) {
    RegistryLock guard;
    return setValue(key, name, REG_TYPE_SZ, value);
}

int regSetBinary(RegistryKey key, const std::string& name, const std::vector<uint8_t>& value) {
    RegistryLock guard;
    return setValue(key, name, REG_TYPE_BINARY, std::string(value.begin(), value.end()));
}

int regDeleteValue(RegistryKey key, const std::string& name) {
    RegistryLock guard;
    OpenKey* open = nullptr;
    RegistryKeyData* found = keyOfHandle(key, &open);
    if (!found) return REG_INVALID_HANDLE;
    if (open->access != REG_ACCESS_WRITE) return REG_ACCESS_DENIED;
    if (!findValue(*found, name)) return REG_NOT_FOUND;
    std::string path = found->path;
    return changeRoot(open->root, [&](RegistryRootData& root) {
        std::vector<RegistryValue>& values = findKey(root, path)->values;
        for (size_t i = 0; i < values.size(); i++)
            if (sameName(values[i].name, name)) {
                values.erase(values.begin() + long(i));
                break;
            }
        return true;
    });
}

void resetRegistry() {
    RegistryLock guard;
    for (RegistryRootData& root : registryState.roots) root = RegistryRootData();
    registryState.openKeys.clear();
}
