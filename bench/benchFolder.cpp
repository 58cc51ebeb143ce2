// The benchmarks' temporary folder and their generated melody.
#include "benchFolder.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <vector>

#include "tests/analysis/signalGenerator.h"

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

static void putLittle(std::vector<uint8_t>& b, uint32_t v, int bytes) {
    for (int i = 0; i < bytes; i++) b.push_back(uint8_t(v >> (8 * i)));
}

bool writeMelodyWave(const std::string& path, double seconds) {
    uint32_t samples = uint32_t(seconds * 44100);
    std::vector<uint8_t> file;
    file.insert(file.end(), {'R', 'I', 'F', 'F'});
    putLittle(file, 36 + samples * 2, 4);
    file.insert(file.end(), {'W', 'A', 'V', 'E', 'f', 'm', 't', ' '});
    putLittle(file, 16, 4);
    putLittle(file, 1, 2);
    putLittle(file, 1, 2);
    putLittle(file, 44100, 4);
    putLittle(file, 88200, 4);
    putLittle(file, 2, 2);
    putLittle(file, 16, 2);
    file.insert(file.end(), {'d', 'a', 't', 'a'});
    putLittle(file, samples * 2, 4);
    size_t header = file.size();
    file.resize(header + size_t(samples) * 2);
    MelodyGenerator generator;
    generator.fill16(file.data() + header, samples);
    FILE* out = std::fopen(path.c_str(), "wb");
    if (!out) return false;
    bool written = std::fwrite(file.data(), 1, file.size(), out) == file.size();
    return std::fclose(out) == 0 && written;
}
