#pragma once
// The fixture of the opening suites: a fresh shared folder, no opening, song or analysis left
// from the test before, plenty of free space, and wave files of the test's own to open.

#include <gtest/gtest.h>

#include "analysis/frequencyAnalysis.h"
#include "analysis/noteRecognition.h"
#include "analysis/recognitionOptions.h"
#include "analysis/signalGenerator.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/waveFixtures.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/mainFrame.h"
#include "shell/settings.h"
#include "store/song.h"

constexpr uint32_t OPENING_RATE = 44100;

class OpeningTest : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        clean();
    }
    void TearDown() override {
        clean();
        setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
        SharedFolderTest::TearDown();
    }
    void clean() {
        resetOpeningState();
        resetMainLoop();
        setFrameWindowFunctions(nullptr);
        resetFrameState();
        releaseFrequencyAnalysis();
        closeSong();
        resetSongNames();
        resetSettings();
        resetRecognitionOptions();
        clearFileFailures();
        setFreeDiskSpaceOverride(int64_t(1) << 40);
        audioActivity = AudioActivity{};
        openingState.quickPreferences = nullptr;
        clearUiCalls();
    }
    std::string writeWave(const std::string& name, const std::vector<uint8_t>& file) {
        std::string path = folder.file(name);
        writeFileBytes(path, file);
        return path;
    }
    std::string writeMono(const std::string& name, const std::vector<uint8_t>& samples, int bits = 16,
                          uint32_t rate = OPENING_RATE) {
        return writeWave(name, pcmWave(1, rate, uint16_t(bits), samples));
    }
    // Opens path and waits for the worker to end, serving the main loop as the program does.
    void openAndWait(const std::string& path) {
        ASSERT_EQ(openWaveFile(path), 1);
        ASSERT_TRUE(audioActivity.opening) << lastMessageText();
        waitForOpeningToEnd();
        ASSERT_FALSE(audioActivity.opening);
    }
    // seconds of MelodyGenerator's melody, 16-bit mono.
    static std::vector<uint8_t> melodyBytes(double seconds) {
        MelodyGenerator generator;
        std::vector<uint8_t> bytes(size_t(seconds * OPENING_RATE) * 2);
        generator.fill16(bytes.data(), uint32_t(bytes.size() / 2));
        return bytes;
    }
};
