#pragma once
// Fixtures of the recognition suites: a song of the default geometry (44,100 Hz, pitch range 1,
// blocks of 512 samples) whose FT blocks are written in code, entry by entry, into the
// FTBlockWindow, a pitch track written straight into the dataBuffers, and spectrogram rows made
// to order. The recognition state, the note list and the instrument table are emptied around
// each test.

#include <gtest/gtest.h>

#include <cmath>
#include <utility>
#include <vector>

#include "analysis/analysisFixtures.h"
#include "analysis/instrumentDefinitions.h"
#include "analysis/mainsHum.h"
#include "analysis/noteBuilding.h"
#include "analysis/noteRecognition.h"
#include "analysis/pitchScale.h"
#include "analysis/syllables.h"
#include "notes/noteList.h"

// An entry as the analysis makes it: frequency and level.
struct TestEntry {
    double frequency;   // Hz
    int amplitude;      // 1..255
};

constexpr uint32_t TEST_RATE = 44100;
constexpr uint8_t TEST_CUT_OFF = 40;   // the chunk's cut-off level the entries carry

class RecognitionTest : public AnalysisTest {
protected:
    void SetUp() override {
        AnalysisTest::SetUp();
        resetNoteRecognition();
        resetNoteList();
        freeInstrumentDefinitions();
    }
    void TearDown() override {
        resetNoteRecognition();
        resetNoteList();
        freeInstrumentDefinitions();
        AnalysisTest::TearDown();
    }

    // A song of blocks empty blocks, all in the window; the spectrogram is set up but empty.
    void makeSong(uint32_t blocks) {
        setSongFormat(TEST_RATE, 16);
        generalSettings.pitchRange = PITCH_RANGE_LOW_TO_MID;
        applyAnalysisPreferences();
        ASSERT_EQ(deriveAnalysisGeometry(TEST_RATE, 16, recognitionOptions, 0, &analysisGeometry), 1);
        song.sampleBlockDuration = analysisGeometry.sampleBlockDuration;
        song.sampleBlockDurations.assign(blocks, song.sampleBlockDuration);
        song.blockCount = blocks;
        setFTBlockWindowCapacity(song.sampleBlockDuration);
        ASSERT_GE(ftBlockWindow.capacity, blocks);
        ASSERT_EQ(growFTBlockWindow(), 1);
        ftBlockWindow.firstBlock = 0;
        ftBlockWindow.endBlock = blocks;
        for (uint32_t b = 0; b < blocks; b++) setBlock(b, {}, 0);
        ASSERT_EQ(resetMagnitudeSpectrogram(TEST_RATE, 16), 1);
    }

    // Block b as the analysis leaves it: the same entries in dataBuffer and origDataBuffer,
    // the detected buffer at its initial {440, 0}.
    void setBlock(uint32_t b, const std::vector<TestEntry>& entries, int loudness) {
        FTDataBuffer& data = blockData(b);
        data.nEntries = uint32_t(entries.size());
        data.blockLoudness = uint8_t(loudness);
        data.blockFlags = 0;
        for (size_t i = 0; i < entries.size(); i++) {
            uint8_t a = uint8_t(entries[i].amplitude);
            data.entries[i] = FrequencyEntry{float(entries[i].frequency),
                                             float(entries[i].frequency * analysisGeometry.pitchStep), a, a, TEST_CUT_OFF, 0};
        }
        blockOrigData(b) = data;
        FTDetectedBuffer& detected = blockDetected(b);
        detected.nEntries = 1;
        detected.entries[0] = FrequencyEntry{440.0f, 0.0f, 0, 0, 0, 0};
    }
    void setBlocks(uint32_t from, uint32_t to, const std::vector<TestEntry>& entries, int loudness) {
        for (uint32_t b = from; b < to; b++) setBlock(b, entries, loudness);
    }

    // A decided pitch track: one entry per block (frequency 0 leaves the block without one),
    // mirrored into the detected buffers as the recognition pass writes them.
    void setPitch(uint32_t b, double frequency, int amplitude = 200) {
        FTDataBuffer& data = blockData(b);
        data.nEntries = frequency > 0.0 ? 1 : 0;
        uint8_t a = uint8_t(amplitude);
        data.entries[0] = FrequencyEntry{float(frequency), float(frequency * analysisGeometry.pitchStep), a, a,
                                         TEST_CUT_OFF, 0};
        blockDetected(b).nEntries = data.nEntries;
        blockDetected(b).entries[0] = FrequencyEntry{float(frequency), 1.0f, a, a, TEST_CUT_OFF, 0};
    }
    void setPitches(uint32_t from, uint32_t to, double frequency, int amplitude = 200) {
        for (uint32_t b = from; b < to; b++) setPitch(b, frequency, amplitude);
    }

    // count spectrogram rows starting at song position 0, each filled by fill(row, magnitudes).
    template <typename Fill>
    void makeRows(uint32_t count, Fill fill) {
        MagnitudeSpectrogram& s = magnitudeSpectrogram;
        s.firstRowPosition = 0;
        s.rowCount = count;
        s.magnitudes.assign(size_t(count) * s.binsPerRow, 0u);
        for (uint32_t r = 0; r < count; r++) fill(r, s.magnitudes.data() + size_t(r) * s.binsPerRow);
    }

    // The spectrogram bin (index into a row) nearest to frequency.
    uint32_t binOf(double frequency) const {
        return uint32_t(std::lround(frequency / magnitudeSpectrogram.binWidth)) - 1;
    }

    // Cents between two frequencies.
    static double cents(double f, double g) { return 1200.0 * std::log2(f / g); }

    uint32_t blocksIn(double seconds) const { return uint32_t(std::lround(seconds / song.sampleBlockDuration)); }
    uint32_t sampleOf(uint32_t block) const { return uint32_t(std::lround(block * song.sampleBlockDuration * TEST_RATE)); }
};
