// What the fuzz targets share.
#include "fuzzSupport.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
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

std::vector<uint8_t> fuzzReadFile(const std::string& path) {
    std::vector<uint8_t> bytes;
    FILE* f = std::fopen(path.c_str(), "rb");
    if (!f) return bytes;
    uint8_t piece[65536];
    size_t n;
    while ((n = std::fread(piece, 1, sizeof piece, f)) > 0) bytes.insert(bytes.end(), piece, piece + n);
    std::fclose(f);
    return bytes;
}

int fuzzWriteFile(const std::string& path, const uint8_t* bytes, size_t count) {
    FILE* f = std::fopen(path.c_str(), "wb");
    if (!f) return 0;
    size_t written = count ? std::fwrite(bytes, 1, count, f) : 0;
    return std::fclose(f) == 0 && written == count ? 1 : 0;
}

void fuzzPut16(std::vector<uint8_t>& b, uint32_t v) {
    b.push_back(uint8_t(v));
    b.push_back(uint8_t(v >> 8));
}

void fuzzPut32(std::vector<uint8_t>& b, uint32_t v) {
    for (int i = 0; i < 4; i++) b.push_back(uint8_t(v >> (8 * i)));
}

void fuzzPutFloat(std::vector<uint8_t>& b, float v) {
    uint32_t bits;
    std::memcpy(&bits, &v, 4);
    fuzzPut32(b, bits);
}
