// The benchmarks' temporary folder.
#include "benchFolder.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <vector>

static std::vector<std::string> benchFolders;   // removed at exit

static void removeBenchFolders() {
    for (const std::string& folder : benchFolders) {
        std::error_code ignored;
        std::filesystem::remove_all(folder, ignored);
    }
}

std::string makeBenchFolder(const char* benchmark) {
    std::string pattern = (std::filesystem::temp_directory_path() / (std::string(benchmark) + "-XXXXXX")).string();
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    if (!mkdtemp(name.data())) {
        std::fprintf(stderr, "%s: cannot make a temporary folder\n", benchmark);
        std::exit(1);
    }
    if (benchFolders.empty()) std::atexit(removeBenchFolders);
    benchFolders.push_back(name.data());
    return benchFolders.back();
}
