// The settings sections: the defaults a first start writes, booleans that must be exactly
// "True", values kept within their limits, round trips through the file, damaged files,
// sections that cannot be opened, and the recording format index.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <tuple>

#include "platform/registry.h"
#include "platform/ui.h"
#include "shell/quitFlag.h"
#include "shell/settings.h"
#include "support/testSupport.h"

namespace fs = std::filesystem;

class SettingsTest : public ConfigFolderTest {
protected:
    void writeMachineFile(const std::string& body) {
        fs::create_directories(config);
        writeFileText(machineFile(), "Melodrift Settings Version 1\n" + body);
    }
    static int loadAll() {
        return loadGeneralSettings() + loadAudioGeneralSettings() + loadGlobalSettings() + loadAudioGlobalSettings();
    }
    std::string machineText() const { return readFileText(machineFile()); }
    bool hasLine(const std::string& line) const { return ("\n" + machineText()).find("\n" + line + "\n") != std::string::npos; }
};

// ---- the first start ----

using SettingsFirstStart = SettingsTest;

TEST_F(SettingsFirstStart, WritesEveryDefaultWithItsNameAndTypeInTheListedOrderAndTakesTheDefaults) {
    generalSettings.pitchRange = 7;
    generalSettings.splashScreen = false;
    globalSettings.defaultInstrument = "Flute";
    globalSettings.meterAnchor = 9;
    globalSettings.inputWaveQuality = 0;
    globalSettings.recentFileCount = 3;
    EXPECT_EQ(loadAll(), 4);
    EXPECT_EQ(readFileText(machineFile()),
              "Melodrift Settings Version 1\n"
              "; The installation's settings of Torvellan Melodrift.\n"
              "; The program rewrites this file whenever a setting changes.\n"
              "\n[SOFTWARE]\n"
              "\n[SOFTWARE\\Torvellan]\n"
              "\n[SOFTWARE\\Torvellan\\Melodrift]\n"
              "\n[SOFTWARE\\Torvellan\\Melodrift\\1.0]\n"
              "\n[SOFTWARE\\Torvellan\\Melodrift\\1.0\\General settings]\n"
              "\"Splash screen\"=\"True\"\n"
              "\"Quick Prefs\"=\"True\"\n"
              "\"CS Pitch range\"=dword:00000001\n"
              "\"CS Enhanced pitch accuracy\"=\"False\"\n"
              "\"CS Detect syllables\"=\"True\"\n"
              "\"CS Disable wave editing\"=\"False\"\n"
              "\"CS Draw smooth lines\"=\"True\"\n"
              "\"CS Draw transparencies\"=\"True\"\n"
              "\"CS Draw gradients\"=\"True\"\n"
              "\n[SOFTWARE\\Torvellan\\Melodrift\\1.0\\Global settings]\n"
              "\"Translucent Windows\"=\"True\"\n"
              "\"Open Filter\"=dword:00000000\n"
              "\"Save Filter\"=dword:00000000\n"
              "\"Open Directory\"=\"\"\n"
              "\"Save Directory\"=\"\"\n"
              "\"Number of recent files\"=dword:00000000\n"
              "\"CS Playback Mode\"=dword:00000002\n"
              "\"CS Note Mode\"=dword:00000008\n"
              "\"CS Scale Mode\"=dword:00000020\n"
              "\"CS Meter width\"=dword:00000190\n"
              "\"CS Meter height\"=dword:00000100\n"
              "\"CS Meter x-offset\"=dword:000000c8\n"
              "\"CS Meter y-offset\"=dword:ffffffb2\n"
              "\"CS Meter anchor\"=dword:00000002\n"
              "\"CS Default Instrument\"=\"Voice\"\n"
              "\"Show CSSpeedWarning dialog\"=\"True\"\n"
              "\"CS Boost speed\"=\"False\"\n"
              "\"CS Input wave quality\"=dword:00000005\n");
    EXPECT_FALSE(fs::exists(userFile()));
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(quitFlag, 0u);
    EXPECT_TRUE(generalSettings == GeneralSettings{});
    EXPECT_TRUE(globalSettings == GlobalSettings{});
}

TEST_F(SettingsFirstStart, ASecondStartChangesNothing) {
    ASSERT_EQ(loadAll(), 4);
    std::string first = machineText();
    fs::create_hard_link(machineFile(), folder.file("first.reg"));
    resetRegistry();
    resetSettings();
    ASSERT_EQ(loadAll(), 4);
    EXPECT_EQ(machineText(), first);
    EXPECT_TRUE(fs::equivalent(machineFile(), folder.file("first.reg")));   // not even rewritten
    ASSERT_EQ(saveGlobalSettings() + saveAudioGlobalSettings(), 2);           // shut-down with nothing changed
    EXPECT_TRUE(fs::equivalent(machineFile(), folder.file("first.reg")));
}

// ---- reading values ----

using SettingsValues = SettingsTest;

TEST_F(SettingsValues, OnlyTrueSpelledExactlyIsTrue) {
    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\General settings]\n"
                     "\"CS Detect syllables\"=\"true\"\n"
                     "\"CS Enhanced pitch accuracy\"=\"True\"\n"
                     "\"Splash screen\"=\"TRUE\"\n"
                     "\"Quick Prefs\"=\"True \"\n"
                     "\"CS Draw gradients\"=\"1\"\n");
    ASSERT_EQ(loadGeneralSettings() + loadAudioGeneralSettings(), 2);
    EXPECT_FALSE(generalSettings.detectSyllables);
    EXPECT_TRUE(generalSettings.enhancedPitchAccuracy);
    EXPECT_FALSE(generalSettings.splashScreen);
    EXPECT_FALSE(generalSettings.quickPrefs);
    EXPECT_FALSE(generalSettings.drawGradients);
    // The values were read, not replaced.
    EXPECT_TRUE(hasLine("\"CS Detect syllables\"=\"true\""));
    EXPECT_TRUE(hasLine("\"Quick Prefs\"=\"True \""));
}

TEST_F(SettingsValues, AMissingValueOrOneOfTheWrongTypeGetsItsDefaultWrittenAndTheOthersAreKept) {
    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\Global settings]\n"
                     "\"CS Playback Mode\"=dword:00000001\n"
                     "\"CS Default Instrument\"=\"Flute\"\n"
                     "[SOFTWARE\\Torvellan\\Melodrift\\1.0\\General settings]\n"
                     "\"CS Pitch range\"=\"2\"\n"
                     "\"Splash screen\"=dword:00000001\n");
    ASSERT_EQ(loadAll(), 4);
    EXPECT_EQ(globalSettings.playbackMode, 1);
    EXPECT_EQ(globalSettings.defaultInstrument, "Flute");
    EXPECT_EQ(globalSettings.noteMode, 8);
    EXPECT_EQ(generalSettings.pitchRange, 1);
    EXPECT_TRUE(generalSettings.splashScreen);
    for (const char* line : {"\"CS Playback Mode\"=dword:00000001", "\"CS Default Instrument\"=\"Flute\"",
                             "\"CS Note Mode\"=dword:00000008", "\"CS Input wave quality\"=dword:00000005",
                             "\"CS Pitch range\"=dword:00000001", "\"Splash screen\"=\"True\""})
        EXPECT_TRUE(hasLine(line)) << line;
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(SettingsValues, TheMeterAnchorIsKeptInOneByteAndTheInstrumentInThirtyTwoCharacters) {
    std::string accents;
    for (int i = 0; i < 40; i++) accents += "\xc3\xa9";   // e acute, two bytes each
    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\Global settings]\n"
                     "\"CS Meter anchor\"=dword:00000103\n"
                     "\"CS Default Instrument\"=\"" + accents + "\"\n");
    ASSERT_EQ(loadAudioGlobalSettings(), 1);
    EXPECT_EQ(globalSettings.meterAnchor, 3);
    EXPECT_EQ(globalSettings.defaultInstrument, accents.substr(0, 64));

    globalSettings.defaultInstrument = "ABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";
    ASSERT_EQ(saveAudioGlobalSettings(), 1);
    EXPECT_TRUE(hasLine("\"CS Default Instrument\"=\"ABCDEFGHIJKLMNOPQRSTUVWXYZ012345\""));
    EXPECT_TRUE(hasLine("\"CS Meter anchor\"=dword:00000003"));
}

TEST_F(SettingsValues, RecentFilesAreReadUpToTheirLimit) {
    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\Global settings]\n"
                     "\"Number of recent files\"=dword:00000002\n"
                     "\"Recent file 0\"=\"/songs/one.wav\"\n"
                     "\"Recent file 1\"=\"/songs/two.mid\"\n"
                     "\"Recent file 2\"=\"/songs/not counted.wav\"\n");
    ASSERT_EQ(loadGlobalSettings(), 1);
    const GlobalSettings& g = globalSettings;
    EXPECT_EQ(std::tuple(g.recentFileCount, g.recentFiles[0], g.recentFiles[1], g.recentFiles[2]),
              std::tuple(2, "/songs/one.wav", "/songs/two.mid", ""));

    // A damaged count neither hangs start-up nor fills the file with millions of values.
    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\Global settings]\n"
                     "\"Number of recent files\"=dword:7fffffff\n");
    resetRegistry();
    ASSERT_EQ(loadGlobalSettings(), 1);
    EXPECT_EQ(globalSettings.recentFileCount, MAX_RECENT_FILES);
    EXPECT_TRUE(hasLine("\"Recent file 15\"=\"\""));
    EXPECT_FALSE(hasLine("\"Recent file 16\"=\"\""));

    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\Global settings]\n"
                     "\"Number of recent files\"=dword:ffffffff\n");
    resetRegistry();
    ASSERT_EQ(loadGlobalSettings(), 1);
    EXPECT_EQ(globalSettings.recentFileCount, 0);
}

TEST_F(SettingsValues, TheWindowPlacementIsWrittenOnlyWhenThereIsOne) {
    ASSERT_EQ(loadGlobalSettings(), 1);
    EXPECT_FALSE(globalSettings.hasMainWindowPosition);
    ASSERT_EQ(saveGlobalSettings(), 1);
    EXPECT_EQ(machineText().find("Main window position"), std::string::npos);

    globalSettings.hasMainWindowPosition = true;
    for (int i = 0; i < WINDOW_PLACEMENT_SIZE; i++) globalSettings.mainWindowPosition[i] = uint8_t(250 + i);
    ASSERT_EQ(saveGlobalSettings(), 1);
    EXPECT_TRUE(hasLine("\"Main window position\"=hex:fa,fb,fc,fd,fe,ff,00,01,02,03,04,05,06,07,08,09,0a,0b,0c,0d,"
                        "0e,0f,10,11,12,13,14,15,16,17,18,19,1a,1b,1c,1d,1e,1f,20,21,22,23,24,25"));
    resetRegistry();
    resetSettings();
    ASSERT_EQ(loadGlobalSettings(), 1);
    ASSERT_TRUE(globalSettings.hasMainWindowPosition);
    for (int i = 0; i < WINDOW_PLACEMENT_SIZE; i++) EXPECT_EQ(globalSettings.mainWindowPosition[i], uint8_t(250 + i));

    // A placement of the wrong size counts as none.
    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\Global settings]\n"
                     "\"Main window position\"=hex:2c,00,00\n");
    resetRegistry();
    ASSERT_EQ(loadGlobalSettings(), 1);
    EXPECT_FALSE(globalSettings.hasMainWindowPosition);
    EXPECT_TRUE(hasLine("\"Main window position\"=hex:2c,00,00"));
}

TEST_F(SettingsValues, EverySavedValueComesBackOnTheNextStart) {
    GeneralSettings general;
    general.pitchRange = 2;
    general.enhancedPitchAccuracy = true;
    general.detectSyllables = false;
    general.disableWaveEditing = true;
    general.drawSmoothLines = false;
    general.drawTransparencies = false;
    general.drawGradients = false;
    general.splashScreen = false;
    general.quickPrefs = false;
    GlobalSettings global;
    global.playbackMode = 1;
    global.noteMode = 4;
    global.scaleMode = 16;
    global.meterWidth = 321;
    global.meterHeight = 123;
    global.meterXOffset = -5;
    global.meterYOffset = 77;
    global.meterAnchor = 255;
    global.defaultInstrument = "Alto \"sax\" \\ 2";
    global.showSpeedWarning = false;
    global.boostSpeed = true;
    global.inputWaveQuality = 9;
    global.translucentWindows = false;
    global.openFilter = 2;
    global.saveFilter = 1;
    global.openDirectory = "/home/singer/My \"Takes\"\\2024\n";
    global.saveDirectory = "/home/singer/out/";
    global.recentFileCount = 2;
    global.recentFiles[0] = "/a/b.wav";
    global.recentFiles[1] = "/c/d \"e\".mid";
    global.hasMainWindowPosition = true;
    for (int i = 0; i < WINDOW_PLACEMENT_SIZE; i++) global.mainWindowPosition[i] = uint8_t(7 * i);
    generalSettings = general;
    globalSettings = global;
    ASSERT_EQ(saveGeneralSettings() + saveAudioGeneralSettings() + saveGlobalSettings() + saveAudioGlobalSettings(), 4);

    resetRegistry();
    resetSettings();
    ASSERT_EQ(loadAll(), 4);
    EXPECT_TRUE(generalSettings == general);
    EXPECT_TRUE(globalSettings == global);
    EXPECT_TRUE(hasLine("\"CS Meter x-offset\"=dword:fffffffb"));
    EXPECT_TRUE(hasLine("\"Open Directory\"=\"/home/singer/My \\\"Takes\\\"\\\\2024\\n\""));
}

// ---- files and sections that cannot be used ----

using SettingsFailures = SettingsTest;

TEST_F(SettingsFailures, AConfigFolderThatCannotBeCreatedStopsStartUp) {
    // A file where the folder should be: creating it fails even for root.
    writeFileText(folder.file("config"), "in the way");
    EXPECT_EQ(loadGeneralSettings(), 0);
    EXPECT_EQ(std::tuple(lastMessageText(), uiCalls().back().kind, uiCalls().back().title, quitFlag),
              std::tuple("Can't access registry properly", MESSAGE_ERROR, "Message from Torvellan Melodrift", 1u));
    EXPECT_TRUE(generalSettings.splashScreen);
    EXPECT_EQ(readFileText(folder.file("config")), "in the way");

    // A save that cannot open its section is reported but does not quit.
    quitFlag = 0;
    clearUiCalls();
    EXPECT_EQ(saveGeneralSettings(), 0);
    EXPECT_EQ(lastMessageText(), "Can't access registry properly");
    EXPECT_EQ(saveAudioGlobalSettings(), 0);
    EXPECT_EQ(std::tuple(messageCount(), quitFlag), std::tuple(2, 0u));
}

TEST_F(SettingsFailures, ASettingsFileThatCannotBeReadStopsStartUpWithItsErrorNumber) {
    fs::create_directories(machineFile());   // a folder where the file should be
    EXPECT_EQ(loadAudioGlobalSettings(), 0);
    EXPECT_EQ(std::tuple(lastMessageText(), messageCount(), quitFlag, globalSettings.playbackMode),
              std::tuple("Can't open registry - Err 29", 1, 1u, 2));
}

TEST_F(SettingsFailures, ADamagedFileIsReportedKeptAsideAndTheDefaultsAreUsed) {
    const std::string damaged = "Melodrift Settings Version 1\n[SOFTWARE\\Torvellan\\Melodrift\\1.0\\General settings]\n"
                                "\"CS Pitch range\"=dword:00000002\n\"Splash screen\"=\"Tr";
    fs::create_directories(config);
    writeFileText(machineFile(), damaged);
    ASSERT_EQ(loadAll(), 4);
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(lastMessageText(), "The settings file " + machineFile() +
                                     " is damaged (a missing closing quote in line 4). It has been kept as " +
                                     machineFile() + ".damaged and the default settings are used.");
    EXPECT_EQ(readFileText(machineFile() + ".damaged"), damaged);
    EXPECT_EQ(generalSettings.pitchRange, 1);
    EXPECT_TRUE(hasLine("\"CS Pitch range\"=dword:00000001"));
    EXPECT_EQ(quitFlag, 0u);
}

TEST_F(SettingsFailures, AReadOnlySectionStillGivesTheDefaults) {
    writeMachineFile("[SOFTWARE\\Torvellan\\Melodrift\\1.0\\General settings]\n");
    RegistryKey key = 0;
    ASSERT_EQ(regOpenKey(REG_ROOT_MACHINE, "SOFTWARE\\Torvellan\\Melodrift\\1.0\\General settings", REG_ACCESS_READ,
                         &key),
              REG_OK);
    std::string before = machineText();
    EXPECT_EQ(readIntSetting(key, "CS Pitch range", 1), 1);
    EXPECT_EQ(readTextSetting(key, "CS Default Instrument", "Voice"), "Voice");
    EXPECT_TRUE(readBoolSetting(key, "Splash screen", true));
    EXPECT_EQ(writeIntSetting(key, "CS Pitch range", 2), 0);
    EXPECT_EQ(machineText(), before);
    regCloseKey(key);
}

// ---- the recording format index ----

TEST(SettingsRecordingFormat, TheIndexSelectsRateByQuarterAndLayoutByRemainderAndOutOfRangeGivesTheDefault) {
    struct Case {
        int index;
        uint32_t rate;
        int bits;
        int channels;
        int valid;
    };
    const Case cases[] = {{8, 22050, 8, 1, 1},   {9, 22050, 16, 1, 1},  {5, 44100, 16, 1, 1}, {0, 48000, 8, 1, 1},
                          {2, 48000, 8, 2, 1},   {3, 48000, 16, 2, 1},  {14, 11025, 8, 2, 1}, {19, 8000, 16, 2, 1},
                          {20, 44100, 16, 1, 0}, {-1, 44100, 16, 1, 0}, {1000000, 44100, 16, 1, 0}};
    for (const Case& c : cases) {
        RecordingFormat format{};
        EXPECT_EQ(decodeRecordingFormat(c.index, &format), c.valid) << c.index;
        EXPECT_EQ(format.samplesPerSecond, c.rate) << c.index;
        EXPECT_EQ(format.bitsPerSample, c.bits) << c.index;
        EXPECT_EQ(format.channels, c.channels) << c.index;
    }
}
