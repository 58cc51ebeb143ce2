#pragma once
// Helpers shared by the suites: a fresh temporary folder per test, a fixture with a fresh
// shared folder, the source tree, whole-file reads and writes, little-endian builders for
// crafted files.

#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "shell/paths.h"

// A new empty folder under the test run's temporary root, removed with its contents when
// the object goes out of scope. path() ends in "/".
class TempFolder {
public:
    TempFolder();
    ~TempFolder();
    TempFolder(const TempFolder&) = delete;
    TempFolder& operator=(const TempFolder&) = delete;
    const std::string& path() const { return folder; }
    std::string file(const std::string& name) const { return folder + name; }
private:
    std::string folder;
};

// A test whose shared folder is a fresh temporary one; the paths come back afterwards, and
// no message, file failure or allocation failure carries over from one test to the next.
class SharedFolderTest : public ::testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;
    std::string shared(const std::string& name) const { return sharedFilePath(name); }
    TempFolder folder;
    Paths savedPaths;
};

// The same with the settings files in a fresh folder, config (MELODRIFT_CONFIG_DIR), and the
// settings, the registry's cache and the quit flag back at their start.
class ConfigFolderTest : public SharedFolderTest {
protected:
    void SetUp() override;
    void TearDown() override;
    std::string machineFile() const { return config + "machine.reg"; }
    std::string userFile() const { return config + "user.reg"; }
    std::string config = folder.file("config/");
    std::string savedConfig;
};

// The source tree, ending in "/" (for the shipped Resources/).
std::string sourceRoot();

std::vector<uint8_t> readFileBytes(const std::string& path);
void writeFileBytes(const std::string& path, const std::vector<uint8_t>& bytes);
void writeFileText(const std::string& path, const std::string& text);
std::string readFileText(const std::string& path);

// Appends little-endian values and four-character codes to a byte vector.
void putU16(std::vector<uint8_t>& b, uint16_t v);
void putU32(std::vector<uint8_t>& b, uint32_t v);
void putTag(std::vector<uint8_t>& b, const char* fourCC);
uint16_t getU16(const std::vector<uint8_t>& b, size_t offset);
uint32_t getU32(const std::vector<uint8_t>& b, size_t offset);

// Points the shared base path, the resource path and MELODRIFT_CONFIG_DIR into folder,
// creates the shared folder and forgets the registry's cached roots.
void useTestFolders(const TempFolder& folder);
