// The program's folders: the initial directory, the resource path and the shared base path,
// resolved at start-up from the "DataPath" keys of the user's and the machine's roots.
// Start-up, the preferences, the song store and the instrument loader use them.
#include "shell/paths.h"

#include <filesystem>
#include <system_error>

#include "platform/registry.h"
#include "platform/ui.h"
#include "shell/quitFlag.h"
#include "shell/settings.h"

Paths paths;

static std::string withSlash(const std::string& path) {
    if (path.empty() || path.back() == '/') return path;
    return path + "/";
}

void setInitialDirectory(const std::string& dir) {
    paths.initialDirectory = withSlash(dir);
    paths.resourcePath = paths.initialDirectory;
    setSharedBasePath(paths.initialDirectory);
}

void setSharedBasePath(const std::string& base) {
    paths.sharedBasePath = withSlash(base);
    paths.sharedFolder = paths.sharedBasePath + "Torvellan Shared/";
}

// Reads a path value of an existing machine "DataPath" key into *path. A value that is
// empty, or missing altogether, is set to the initial directory and written back (a
// missing value is never an error); one that cannot be read otherwise keeps the initial
// directory and is reported.
static void readPathValue(RegistryKey key, const char* name, std::string* path) {
    std::string value;
    int result = regQueryString(key, name, &value);
    if (result == REG_OK && !value.empty()) {
        *path = withSlash(value);
        return;
    }
    *path = paths.initialDirectory;
    if (result == REG_OK || result == REG_NOT_FOUND) writeTextSetting(key, name, paths.initialDirectory);
    else showMessage(MESSAGE_ERROR, "Can't read registry");
}

int loadDataPaths() {
    paths.resourcePath = paths.initialDirectory;
    setSharedBasePath(paths.initialDirectory);
    std::string dataPath = std::string(SETTINGS_KEY_PATH) + "\\" + DATA_PATH_SECTION;

    // The user's own choice of shared folder comes first. Only an existing key is read: a
    // user without one has nothing to say, and nothing is created for them. An empty value
    // would put the shared folder in whatever the current directory is, so it counts as none.
    bool sharedFound = false;
    RegistryKey userKey = 0;
    if (regOpenKey(REG_ROOT_USER, dataPath, REG_ACCESS_READ, &userKey) == REG_OK) {
        std::string value;
        if (regQueryString(userKey, "TorvellanSharedPath", &value) == REG_OK && !value.empty()) {
            setSharedBasePath(value);
            sharedFound = true;
        }
        regCloseKey(userKey);
    }

    bool existed = false;
    RegistryKey machineKey = openSettingsSection(DATA_PATH_SECTION, REG_ROOT_MACHINE, &existed);
    if (!machineKey) {
        quitFlag = 1;
        return 0;
    }
    if (existed) {
        readPathValue(machineKey, "ResourcePath", &paths.resourcePath);
        if (!sharedFound) {
            std::string shared;
            readPathValue(machineKey, "TorvellanSharedPath", &shared);
            setSharedBasePath(shared);
        }
    } else {
        writeTextSetting(machineKey, "ResourcePath", paths.initialDirectory);
        writeTextSetting(machineKey, "TorvellanSharedPath", paths.initialDirectory);
    }
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int saveSharedPath(const std::string& path) {
    // An empty path would become the root folder "/" or the current directory; keep the old one.
    if (path.empty()) return 0;
    RegistryKey key = openSettingsSection(DATA_PATH_SECTION, REG_ROOT_USER);
    if (!key) return 0;
    int written = writeTextSetting(key, "TorvellanSharedPath", withSlash(path));
    openSettingsSection(nullptr, REG_ROOT_USER);
    return written;
}

std::string sharedFilePath(const std::string& name) {
    return paths.sharedFolder + name;
}

static bool holdsResources(const std::string& folder) {
    std::error_code error;
    return !folder.empty() && std::filesystem::is_directory(folder + "Resources", error);
}

// The folder that holds "Resources/": the configured resource path when it has one;
// otherwise the installed layout beside the running program (bin/../share/melodrift/),
// then the source tree the program was built from, so that neither an installed copy nor
// one run from its build folder needs any set-up.
static std::string effectiveResourcePath() {
    if (holdsResources(paths.resourcePath)) return paths.resourcePath;
    std::error_code error;
    std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", error);
    if (!error) {
        std::string installed =
            (program.parent_path().parent_path() / "share" / "melodrift").lexically_normal().string() + "/";
        if (holdsResources(installed)) return installed;
    }
#ifdef MELODRIFT_SOURCE_RESOURCES
    if (holdsResources(MELODRIFT_SOURCE_RESOURCES)) return MELODRIFT_SOURCE_RESOURCES;
#endif
    return paths.resourcePath;
}

std::string resourceFilePath(const std::string& name) {
    return effectiveResourcePath() + "Resources/" + name;
}
