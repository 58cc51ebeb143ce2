// Helpers shared by the suites.
#include "support/testSupport.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <unistd.h>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/registry.h"
#include "platform/ui.h"
#include "shell/quitFlag.h"
#include "shell/settings.h"

namespace fs = std::filesystem;

TempFolder::TempFolder() {
    std::string pattern = (fs::temp_directory_path() / "melodrift-test-XXXXXX").string();
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    if (!mkdtemp(name.data())) throw std::runtime_error("cannot make a temporary folder");
    folder = std::string(name.data()) + "/";
}

TempFolder::~TempFolder() {
    std::error_code ignored;
    fs::remove_all(folder, ignored);
}

static void clearInjectedFailures() {
    clearUiCalls();
    clearFileFailures();
    failAllocation(0);
}

void SharedFolderTest::SetUp() {
    savedPaths = paths;
    setSharedBasePath(folder.path());
    makeFolder(paths.sharedFolder);
    clearInjectedFailures();
}

void SharedFolderTest::TearDown() {
    paths = savedPaths;
    clearInjectedFailures();
}

static void resetConfiguration() {
    resetRegistry();
    resetSettings();
    quitFlag = 0;
}

void ConfigFolderTest::SetUp() {
    SharedFolderTest::SetUp();
    const char* old = std::getenv("MELODRIFT_CONFIG_DIR");
    savedConfig = old ? old : "";
    setenv("MELODRIFT_CONFIG_DIR", config.c_str(), 1);
    resetConfiguration();
}

void ConfigFolderTest::TearDown() {
    setenv("MELODRIFT_CONFIG_DIR", savedConfig.c_str(), 1);
    resetConfiguration();
    SharedFolderTest::TearDown();
}

std::string sourceRoot() { return MELODRIFT_TEST_SOURCE_ROOT "/"; }

std::vector<uint8_t> readFileBytes(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::vector<uint8_t>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void writeFileBytes(const std::string& path, const std::vector<uint8_t>& bytes) {
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out.write(reinterpret_cast<const char*>(bytes.data()), std::streamsize(bytes.size()));
}

void writeFileText(const std::string& path, const std::string& text) {
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out << text;
}

std::string readFileText(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void putU16(std::vector<uint8_t>& b, uint16_t v) {
    b.push_back(uint8_t(v));
    b.push_back(uint8_t(v >> 8));
}

void putU32(std::vector<uint8_t>& b, uint32_t v) {
    for (int i = 0; i < 4; i++) b.push_back(uint8_t(v >> (8 * i)));
}

void putTag(std::vector<uint8_t>& b, const char* fourCC) {
    for (int i = 0; i < 4; i++) b.push_back(uint8_t(fourCC[i]));
}

uint16_t getU16(const std::vector<uint8_t>& b, size_t offset) {
    return uint16_t(b.at(offset) | (b.at(offset + 1) << 8));
}

uint32_t getU32(const std::vector<uint8_t>& b, size_t offset) {
    return uint32_t(b.at(offset)) | uint32_t(b.at(offset + 1)) << 8 | uint32_t(b.at(offset + 2)) << 16 |
           uint32_t(b.at(offset + 3)) << 24;
}

void useTestFolders(const TempFolder& folder) {
    setenv("MELODRIFT_CONFIG_DIR", folder.file("config").c_str(), 1);
    resetRegistry();
    setInitialDirectory(folder.path());
    setSharedBasePath(folder.path());
    makeFolder(paths.sharedFolder);
}
