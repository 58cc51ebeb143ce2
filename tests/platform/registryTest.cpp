// The settings store's files: the exact text written, round trips of every value type,
// atomic rewrites, damaged files set aside with their report, folders that cannot be used,
// concurrent writers, and mutated files fed to the parser.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <thread>
#include <tuple>

#include "platform/registry.h"
#include "platform/ui.h"
#include "support/testSupport.h"

namespace fs = std::filesystem;

class RegistryTest : public ConfigFolderTest {
protected:
    RegistryKey create(int root, const std::string& path) {
        RegistryKey key = 0;
        bool existed = true;
        EXPECT_EQ(regCreateKey(root, path, REG_ACCESS_WRITE, &key, &existed), REG_OK) << path;
        return key;
    }
    RegistryKey openRead(const std::string& path) {
        RegistryKey key = 0;
        EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, path, REG_ACCESS_READ, &key), REG_OK) << path;
        return key;
    }
    std::vector<std::string> configEntries() const {
        std::vector<std::string> names;
        for (const auto& entry : fs::directory_iterator(config)) names.push_back(entry.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }
};

const char* const HEADER = "Melodrift Settings Version 1\n"
                           "; The installation's settings of Torvellan Melodrift.\n"
                           "; The program rewrites this file whenever a setting changes.\n";

// ---- the file's text ----

using RegistryFile = RegistryTest;

TEST_F(RegistryFile, HoldsEveryKeyAndValueInTheDocumentedText) {
    RegistryKey key = create(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan\\Test");
    ASSERT_EQ(regSetDword(key, "Count", 0xffffffb2u), REG_OK);
    ASSERT_EQ(regSetString(key, "Name", "a\"b\\c\nd\te\x01"), REG_OK);
    ASSERT_EQ(regSetBinary(key, "Blob", {0x2c, 0x00, 0xff}), REG_OK);
    ASSERT_EQ(regSetBinary(key, "Nothing", {}), REG_OK);
    create(REG_ROOT_MACHINE, "SOFTWARE\\Empty");

    EXPECT_EQ(readFileText(machineFile()), std::string(HEADER) +
                                               "\n[SOFTWARE]\n"
                                               "\n[SOFTWARE\\Torvellan]\n"
                                               "\n[SOFTWARE\\Torvellan\\Test]\n"
                                               "\"Count\"=dword:ffffffb2\n"
                                               "\"Name\"=\"a\\\"b\\\\c\\nd\\te\\x01\"\n"
                                               "\"Blob\"=hex:2c,00,ff\n"
                                               "\"Nothing\"=hex:\n"
                                               "\n[SOFTWARE\\Empty]\n");
    EXPECT_FALSE(fs::exists(userFile()));

    // The user's root is its own file.
    std::string machine = readFileText(machineFile());
    key = create(REG_ROOT_USER, "SOFTWARE\\Mine");
    ASSERT_EQ(regSetDword(key, "One", 1), REG_OK);
    EXPECT_EQ(readFileText(machineFile()), machine);
    EXPECT_NE(readFileText(userFile()).find("\"One\"=dword:00000001"), std::string::npos);
    RegistryKey machineKey = 0;
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE\\Mine", REG_ACCESS_READ, &machineKey), REG_NOT_FOUND);
    EXPECT_EQ(machineKey, 0);
}

TEST_F(RegistryFile, EveryChangeReplacesTheFileAndLeavesNoTemporaryFile) {
    RegistryKey key = create(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan");
    std::string before = readFileText(machineFile());
    // A second name for the old file: were the file written over in place, it would change too.
    fs::create_hard_link(machineFile(), folder.file("old.reg"));
    for (int i = 0; i < 20; i++) ASSERT_EQ(regSetDword(key, "Value " + std::to_string(i), uint32_t(i)), REG_OK);
    EXPECT_EQ(readFileText(folder.file("old.reg")), before);
    EXPECT_NE(readFileText(machineFile()).find("\"Value 19\"=dword:00000013"), std::string::npos);
    EXPECT_EQ(configEntries(), std::vector<std::string>{"machine.reg"});

    // Setting an unchanged value does not rewrite the file.
    fs::remove(folder.file("old.reg"));
    ASSERT_EQ(regSetString(key, "Name", "same"), REG_OK);
    fs::create_hard_link(machineFile(), folder.file("old.reg"));
    ASSERT_EQ(regSetString(key, "Name", "same"), REG_OK);
    EXPECT_TRUE(fs::equivalent(machineFile(), folder.file("old.reg")));
    ASSERT_EQ(regSetDword(key, "Name", 0), REG_OK);   // same name, other type: a change
    EXPECT_FALSE(fs::equivalent(machineFile(), folder.file("old.reg")));
}

// ---- values ----

using RegistryValues = RegistryTest;

TEST_F(RegistryValues, TextWithQuotesBackslashesNewlinesAndControlBytesRoundTrips) {
    std::string controls;
    for (int c = 1; c < 32; c++) controls += char(c);
    controls += '\x7f';
    const std::vector<std::string> texts = {"",
                                            "plain",
                                            "say \"hello\"",
                                            "C:\\Program Files\\\\x41",
                                            "line one\nline two\r\n",
                                            "  spaces at both ends  ",
                                            "\xc3\xa9t\xc3\xa9 \xe2\x99\xaa",
                                            std::string("zero\0inside", 11),
                                            controls,
                                            "\\x41 \\n \\\""};
    RegistryKey key = create(REG_ROOT_MACHINE, "SOFTWARE\\Texts");
    for (size_t i = 0; i < texts.size(); i++) {
        ASSERT_EQ(regSetString(key, "v" + std::to_string(i), texts[i]), REG_OK);
        ASSERT_EQ(regSetString(key, "name \"" + texts[i] + "\"", "x"), REG_OK);
    }
    resetRegistry();
    RegistryKey again = openRead("SOFTWARE\\Texts");
    for (size_t i = 0; i < texts.size(); i++) {
        std::string value;
        ASSERT_EQ(regQueryString(again, "v" + std::to_string(i), &value), REG_OK) << i;
        EXPECT_EQ(value, texts[i]) << i;
        EXPECT_EQ(regQueryString(again, "name \"" + texts[i] + "\"", &value), REG_OK) << i;
    }
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(RegistryValues, BinaryAndDwordValuesRoundTrip) {
    std::vector<uint8_t> placement;
    for (int i = 0; i < 44; i++) placement.push_back(uint8_t(i * 37));   // 0x00 and values above 0x7f
    placement.push_back(0xff);
    RegistryKey key = create(REG_ROOT_MACHINE, "SOFTWARE\\Binary");
    ASSERT_EQ(regSetBinary(key, "Placement", placement), REG_OK);
    ASSERT_EQ(regSetBinary(key, "Empty", {}), REG_OK);
    ASSERT_EQ(regSetDword(key, "Max", 0xffffffffu), REG_OK);
    ASSERT_EQ(regSetDword(key, "Zero", 0), REG_OK);
    resetRegistry();
    RegistryKey again = openRead("SOFTWARE\\Binary");
    std::vector<uint8_t> bytes = {1};
    ASSERT_EQ(regQueryBinary(again, "Placement", &bytes), REG_OK);
    EXPECT_EQ(bytes, placement);
    ASSERT_EQ(regQueryBinary(again, "Empty", &bytes), REG_OK);
    EXPECT_TRUE(bytes.empty());
    uint32_t value = 7;
    ASSERT_EQ(regQueryDword(again, "Max", &value), REG_OK);
    EXPECT_EQ(value, 0xffffffffu);
    ASSERT_EQ(regQueryDword(again, "Zero", &value), REG_OK);
    EXPECT_EQ(value, 0u);

    // A key without values still exists after reloading.
    create(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan\\Melodrift\\1.0\\DataPath");
    resetRegistry();
    bool existed = false;
    ASSERT_EQ(regCreateKey(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan\\Melodrift\\1.0\\DataPath", REG_ACCESS_WRITE, &key,
                           &existed),
              REG_OK);
    EXPECT_TRUE(existed);
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan\\Melodrift", REG_ACCESS_READ, &key), REG_OK);
}

TEST_F(RegistryValues, NamesAreFoundWithoutRegardToCaseAndKeepTheirFirstSpelling) {
    RegistryKey key = create(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan");
    ASSERT_EQ(regSetDword(key, "CS Pitch range", 1), REG_OK);
    create(REG_ROOT_MACHINE, "software\\TORVELLAN\\Sub");
    ASSERT_EQ(regSetDword(key, "cs pitch RANGE", 2), REG_OK);
    uint32_t value = 0;
    ASSERT_EQ(regQueryDword(openRead("Software\\torvellan"), "CS PITCH RANGE", &value), REG_OK);
    EXPECT_EQ(value, 2u);
    std::string text = readFileText(machineFile());
    EXPECT_NE(text.find("[SOFTWARE\\Torvellan\\Sub]"), std::string::npos);
    EXPECT_NE(text.find("\"CS Pitch range\"=dword:00000002"), std::string::npos);
}

TEST_F(RegistryValues, MissingWrongTypeReadOnlyAndStaleKeysAreRefused) {
    RegistryKey key = create(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan");
    ASSERT_EQ(regSetString(key, "Text", "True"), REG_OK);
    uint32_t number = 0;
    std::string text;
    std::vector<uint8_t> bytes;
    EXPECT_EQ(regQueryDword(key, "Text", &number), REG_WRONG_TYPE);
    EXPECT_EQ(regQueryBinary(key, "Text", &bytes), REG_WRONG_TYPE);
    EXPECT_EQ(regQueryString(key, "Absent", &text), REG_NOT_FOUND);
    EXPECT_EQ(regDeleteValue(key, "Absent"), REG_NOT_FOUND);
    ASSERT_EQ(regSetDword(key, "Drop", 2), REG_OK);
    ASSERT_EQ(regDeleteValue(key, "drop"), REG_OK);
    EXPECT_EQ(readFileText(machineFile()).find("Drop"), std::string::npos) << "a deleted value is gone from the file";

    std::string before = readFileText(machineFile());
    RegistryKey readOnly = openRead("SOFTWARE\\Torvellan");
    EXPECT_EQ(regSetString(readOnly, "Text", "False"), REG_ACCESS_DENIED);
    EXPECT_EQ(regDeleteValue(readOnly, "Text"), REG_ACCESS_DENIED);
    EXPECT_EQ(readFileText(machineFile()), before);

    regCloseKey(readOnly);
    EXPECT_EQ(regQueryString(readOnly, "Text", &text), REG_INVALID_HANDLE);
    resetRegistry();
    EXPECT_EQ(regSetString(key, "Text", "False"), REG_INVALID_HANDLE);
    EXPECT_EQ(readFileText(machineFile()), before);
}

TEST_F(RegistryValues, ConcurrentWritersLoseNothing) {
    std::vector<std::thread> writers;
    for (int t = 0; t < 4; t++)
        writers.emplace_back([t] {
            RegistryKey key = 0;
            bool existed = false;
            if (regCreateKey(REG_ROOT_MACHINE, "SOFTWARE\\Thread " + std::to_string(t), REG_ACCESS_WRITE, &key,
                             &existed) != REG_OK)
                return;
            for (int i = 0; i < 25; i++) regSetDword(key, "Value " + std::to_string(i), uint32_t(t * 100 + i));
            regCloseKey(key);
        });
    for (std::thread& writer : writers) writer.join();
    resetRegistry();
    for (int t = 0; t < 4; t++) {
        RegistryKey key = openRead("SOFTWARE\\Thread " + std::to_string(t));
        for (int i = 0; i < 25; i++) {
            uint32_t value = 0;
            ASSERT_EQ(regQueryDword(key, "Value " + std::to_string(i), &value), REG_OK);
            EXPECT_EQ(value, uint32_t(t * 100 + i));
        }
    }
    EXPECT_EQ(configEntries(), std::vector<std::string>{"machine.reg"});
}

// ---- damaged files ----

struct DamagedCase {
    const char* what;
    std::string text;
    std::string reason;
};

static std::vector<DamagedCase> damagedCases() {
    const std::string sig = "Melodrift Settings Version 1\n[SOFTWARE\\Torvellan]\n";
    return {
        {"unreadable line", sig + "Count=5\n", "an unreadable line in line 3"},
        {"bad hex", sig + "\"Blob\"=hex:2c,0g\n", "a bad hex byte in line 3"},
        {"hex with a trailing comma", sig + "\"Blob\"=hex:2c,\n", "a bad hex byte in line 3"},
        {"bad escape", sig + "\"Name\"=\"a\\qb\"\n", "an unknown escape in line 3"},
        {"bad \\x escape", sig + "\"Name\"=\"a\\x4\"\n", "a bad \\x escape in line 3"},
        {"zero byte", sig + std::string("\"Name\"=\"a\0b\"\n", 13), "it contains a zero byte"},
        {"unterminated text", sig + "\"Name\"=\"abc\n", "a missing closing quote in line 3"},
        {"dword too long", sig + "\"Count\"=dword:123456789\n", "a bad dword in line 3"},
        {"unknown type", sig + "\"Count\"=qword:1\n", "an unknown value type in line 3"},
        {"value before a key", "Melodrift Settings Version 1\n\"Count\"=dword:1\n", "a value before any key in line 2"},
        {"bad key name", "Melodrift Settings Version 1\n[SOFTWARE\\\\Torvellan]\n", "a bad key name in line 2"},
        {"no signature", "[SOFTWARE]\n", "it does not begin with \"Melodrift Settings Version 1\" in line 1"},
        {"larger than 1 MiB", "Melodrift Settings Version 1\n;" + std::string(1024 * 1024, 'x') + "\n",
         "it is larger than 1 MiB"},
    };
}

using RegistryDamage = RegistryTest;

TEST_F(RegistryDamage, ADamagedFileIsReportedOnceKeptAsideAndTheRootStartsEmpty) {
    for (const DamagedCase& c : damagedCases()) {
        SCOPED_TRACE(c.what);
        fs::create_directories(config);
        writeFileText(machineFile(), c.text);
        resetRegistry();
        clearUiCalls();

        RegistryKey key = 0;
        EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan", REG_ACCESS_READ, &key), REG_NOT_FOUND);
        ASSERT_EQ(messageCount(), 1);
        EXPECT_EQ(uiCalls().back().kind, MESSAGE_ERROR);
        EXPECT_EQ(lastMessageText(), "The settings file " + machineFile() + " is damaged (" + c.reason +
                                         "). It has been kept as " + machineFile() +
                                         ".damaged and the default settings are used.");
        EXPECT_EQ(readFileText(machineFile() + ".damaged"), c.text);
        EXPECT_FALSE(fs::exists(machineFile()));

        // The empty root is usable and is not reported again.
        key = create(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan");
        EXPECT_EQ(regSetDword(key, "Fresh", 1), REG_OK);
        EXPECT_EQ(messageCount(), 1);
        resetRegistry();
        uint32_t value = 0;
        EXPECT_EQ(regQueryDword(openRead("SOFTWARE\\Torvellan"), "Fresh", &value), REG_OK);
        EXPECT_EQ(messageCount(), 1);
        fs::remove(machineFile() + ".damaged");
    }
}

TEST_F(RegistryDamage, AnEarlierDamagedCopyIsNeverOverwritten) {
    fs::create_directories(config);
    writeFileText(machineFile() + ".damaged", "first");
    writeFileText(machineFile(), "second");
    RegistryKey key = 0;
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE", REG_ACCESS_READ, &key), REG_OK);
    EXPECT_EQ(readFileText(machineFile() + ".damaged"), "first");
    EXPECT_EQ(readFileText(machineFile() + ".damaged.2"), "second");
    EXPECT_NE(lastMessageText().find("kept as " + machineFile() + ".damaged.2 "), std::string::npos);
}

TEST_F(RegistryDamage, HandWrittenFilesWithAByteOrderMarkCommentsAndWindowsLineEndsAreRead) {
    fs::create_directories(config);
    writeFileText(machineFile(), "\xEF\xBB\xBF\r\nMelodrift Settings Version 1\r\n; note\r\n\r\n  [SOFTWARE\\Torvellan]  \r\n"
                                 "\"A\"=dword:1f\r\n\"A\"=dword:20\r\n\"B\"=\"x y\"\t\r\n\"C\"=hex:AB,cd\r\n");
    RegistryKey key = openRead("SOFTWARE\\Torvellan");
    uint32_t a = 0;
    std::string b;
    std::vector<uint8_t> c;
    // A repeated value: the later line wins.
    EXPECT_EQ((std::vector<int>{regQueryDword(key, "A", &a), regQueryString(key, "B", &b), regQueryBinary(key, "C", &c)}),
              std::vector<int>(3, REG_OK));
    EXPECT_EQ(std::tuple(a, b, c), std::tuple(0x20u, "x y", std::vector<uint8_t>{0xab, 0xcd}));
    // A file of exactly one mebibyte is accepted.
    std::string text = "Melodrift Settings Version 1\n[SOFTWARE\\Big]\n;";
    text += std::string(1024 * 1024 - text.size() - 1, 'x') + "\n";
    ASSERT_EQ(text.size(), 1024u * 1024u);
    writeFileText(machineFile(), text);
    resetRegistry();
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE\\Big", REG_ACCESS_READ, &key), REG_OK);
    EXPECT_EQ(messageCount(), 0);
}

// ---- folders and files that cannot be used ----

using RegistryFailures = RegistryTest;

TEST_F(RegistryFailures, AConfigFolderThatIsAFileRefusesWritesButReadsAsEmpty) {
    writeFileText(folder.file("config"), "not a folder");
    RegistryKey key = 0;
    bool existed = true;
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE", REG_ACCESS_READ, &key), REG_OK);
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE", REG_ACCESS_WRITE, &key), REG_IO_ERROR);
    EXPECT_EQ(regCreateKey(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan", REG_ACCESS_READ, &key, &existed), REG_IO_ERROR);
    EXPECT_EQ(key, 0);
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan", REG_ACCESS_READ, &key), REG_NOT_FOUND);
    EXPECT_EQ(readFileText(folder.file("config")), "not a folder");
    EXPECT_EQ(messageCount(), 0);

    // A root file that cannot be read is neither replaced nor set aside.
    fs::remove(folder.file("config"));
    fs::create_directories(machineFile());   // a folder where the file should be
    resetRegistry();
    EXPECT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE", REG_ACCESS_READ, &key), REG_IO_ERROR);
    EXPECT_EQ(regCreateKey(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan", REG_ACCESS_WRITE, &key, &existed), REG_IO_ERROR);
    EXPECT_TRUE(fs::is_directory(machineFile()));
    EXPECT_FALSE(fs::exists(machineFile() + ".damaged"));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(RegistryFailures, AFailedWriteLeavesTheOldValue) {
    RegistryKey key = create(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan");
    ASSERT_EQ(regSetString(key, "Name", "old"), REG_OK);
    fs::remove_all(config);
    writeFileText(folder.file("config"), "in the way");
    EXPECT_EQ(regSetString(key, "Name", "new"), REG_IO_ERROR);
    std::string value;
    ASSERT_EQ(regQueryString(key, "Name", &value), REG_OK);
    EXPECT_EQ(value, "old");
}

TEST_F(RegistryFailures, TheFolderFollowsTheEnvironment) {
    EXPECT_EQ(registryFolder(), config);
    setenv("MELODRIFT_CONFIG_DIR", "", 1);
    std::string xdg = std::getenv("XDG_CONFIG_HOME") ? std::getenv("XDG_CONFIG_HOME") : "";
    setenv("XDG_CONFIG_HOME", "/somewhere/cfg", 1);
    EXPECT_EQ(registryFolder(), "/somewhere/cfg/torvellan-melodrift/");
    setenv("XDG_CONFIG_HOME", "relative/cfg", 1);   // ignored: only absolute paths count
    std::string home = std::getenv("HOME") ? std::getenv("HOME") : "";
    setenv("HOME", "/home/someone", 1);
    EXPECT_EQ(registryFolder(), "/home/someone/.config/torvellan-melodrift/");
    if (home.empty()) unsetenv("HOME");
    else setenv("HOME", home.c_str(), 1);
    if (xdg.empty()) unsetenv("XDG_CONFIG_HOME");
    else setenv("XDG_CONFIG_HOME", xdg.c_str(), 1);
}

// ---- mutated files ----

// Deterministic mutations of a sound file: every result is either read as it stands or set
// aside with one report; the parser never crashes, and what the writer makes of an accepted
// file reads back without a report.
TEST_F(RegistryFailures, MutatedFilesAreEitherReadOrSetAsideWithOneReport) {
    const std::string sound = std::string("Melodrift Settings Version 1\n; comment\n\n[SOFTWARE]\n\n") +
                              "[SOFTWARE\\Torvellan\\Melodrift\\1.0\\General settings]\n"
                              "\"CS Pitch range\"=dword:00000001\n"
                              "\"Splash screen\"=\"True\"\n"
                              "\"Open Directory\"=\"/home/a \\\"b\\\"\\\\c\\nd\\x01\"\n"
                              "\"Main window position\"=hex:2c,00,00,00,02,00\n"
                              "\n[SOFTWARE\\Empty]\n";
    uint32_t seed = 12345;
    auto next = [&seed](uint32_t range) {
        seed = seed * 1664525u + 1013904223u;
        return (seed >> 8) % range;
    };
    const char* alphabet = "\"\\[]=:,;x0fg\n\r\t \x01\x7f\xff";
    int accepted = 0, setAside = 0;
    fs::create_directories(config);
    for (int round = 0; round < 300; round++) {
        std::string text = sound;
        int kind = int(next(5));
        int edits = 1 + int(next(4));
        for (int e = 0; e < edits && !text.empty(); e++) {
            size_t at = next(uint32_t(text.size()));
            if (kind == 0) text[at] = char(next(256));
            else if (kind == 1) text.insert(at, 1, alphabet[next(uint32_t(std::strlen(alphabet)))]);
            else if (kind == 2) text.erase(at, 1 + next(8));
            else if (kind == 3) text.resize(at);
            else {
                text.clear();
                for (uint32_t n = next(200); n > 0; n--) text += char(next(256));
            }
        }
        SCOPED_TRACE("round " + std::to_string(round));
        writeFileText(machineFile(), text);
        resetRegistry();
        clearUiCalls();
        RegistryKey key = 0;
        ASSERT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE", REG_ACCESS_READ, &key), REG_OK);
        if (messageCount() == 1) {
            setAside++;
            EXPECT_EQ(lastMessageText().rfind("The settings file " + machineFile() + " is damaged (", 0), 0u);
            EXPECT_EQ(readFileText(machineFile() + ".damaged"), text);
            EXPECT_FALSE(fs::exists(machineFile()));
            fs::remove(machineFile() + ".damaged");
            continue;
        }
        ASSERT_EQ(messageCount(), 0);
        accepted++;
        EXPECT_EQ(readFileText(machineFile()), text);
        RegistryKey fuzz = create(REG_ROOT_MACHINE, "SOFTWARE\\Fuzz");
        ASSERT_EQ(regSetDword(fuzz, "Round", uint32_t(round)), REG_OK);
        resetRegistry();
        uint32_t value = 0;
        EXPECT_EQ(regQueryDword(openRead("SOFTWARE\\Fuzz"), "Round", &value), REG_OK);
        EXPECT_EQ(value, uint32_t(round));
        EXPECT_EQ(messageCount(), 0);
    }
    EXPECT_GT(accepted, 20);
    EXPECT_GT(setAside, 20);
}
