// What the fuzz targets share.
#include "fuzzSupport.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <vector>

static std::string folder;   // the target's temporary folder, "" until made

static void removeFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(folder, ignored);
}

void fuzzExpect(bool holds, const char* target, const char* what) {
    if (holds) return;
    std::fprintf(stderr, "%s: %s\n", target, what);
    std::abort();
}

const std::string& fuzzFolder(const char* target) {
    if (!folder.empty()) return folder;
    std::string pattern = (std::filesystem::temp_directory_path() / (std::string(target) + "-XXXXXX")).string();
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    if (!mkdtemp(name.data())) {
        std::fprintf(stderr, "%s: cannot make a temporary folder\n", target);
        std::abort();
    }
    folder = std::string(name.data()) + "/";
    std::atexit(removeFolder);
    return folder;
}
