// Frequency tables of signals made in code: steady sines and harmonic tones land in the pitch
// bin that holds their frequency, within 10 cents; silence and sound below the noise floor
// give empty but timed blocks; loudness follows the level; the entries' fields; the Hires
// spectrum's peak and energy and its round trip through the Hires store; the window's
// housekeeping against a plain model; a song that already has blocks; and the failures.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include "analysis/analysisFixtures.h"
#include "analysis/pitchScale.h"
#include "platform/files.h"
#include "shell/paths.h"

static const double CENTS_TOLERANCE = 10.0;
static const uint32_t RATE = 44100;
static const double BLOCK_SECONDS = 512.0 / 44100.0;   // pitch range 1 without boost

static double centsBetween(double f, double reference) { return 1200.0 * std::log2(f / reference); }

// The pitch bin (index into the geometry) whose range holds frequency.
static int pitchBinHolding(double frequency) {
    for (int p = 0; p < analysisGeometry.pitchBins; p++)
        if (pitchBinLowerEdge(analysisGeometry, p) < frequency && frequency <= pitchBinUpperEdge(analysisGeometry, p))
            return p;
    return -1;
}

static int pitchBinOfEntry(const FrequencyEntry& e) {
    // An entry's frequency is the mean of its bin's energy, so it lies inside the bin.
    return pitchBinHolding(e.frequency);
}

class FrequencyTableTest : public AnalysisTest {
protected:
    std::vector<uint8_t> bytes;
    std::vector<AnalysedBlock> analyse(const std::vector<double>& x, int bits = 16) {
        setSongFormat(RATE, bits);
        bytes = toSampleBytes(x, bits);
        return analyseWholeSignal(bytes, uint32_t(x.size()));
    }
    void expectToneAt(double frequency, const std::vector<double>& harmonics) {
        SCOPED_TRACE(::testing::Message() << frequency << " Hz with " << harmonics.size() << " harmonics");
        emptyAnalysisState();
        std::vector<AnalysedBlock> blocks = analyse(toneSignal(frequency, 8000.0, 1.5, RATE, harmonics));
        ASSERT_EQ(blocks.size(), 129u);
        int bin = pitchBinHolding(frequency);
        // The steady part: after the first segment's glide, before the fade of the last frames.
        for (size_t b = 40; b < 120; b++) {
            const FrequencyEntry* top = strongestEntry(blocks[b].data);
            ASSERT_NE(top, nullptr) << "block " << b;
            EXPECT_EQ(pitchBinOfEntry(*top), bin) << "block " << b;
            EXPECT_NEAR(centsBetween(top->frequency, frequency), 0.0, CENTS_TOLERANCE) << "block " << b;
        }
    }
};

TEST_F(FrequencyTableTest, SteadySinesAndHarmonicTonesLandInTheirFundamentalsPitchBinWithinTenCents) {
    for (double f : {110.0, 220.0, 440.0, 880.0}) {
        expectToneAt(f, {1.0});
        expectToneAt(f, {1.0, 0.6, 0.4, 0.25});
    }
}

TEST_F(FrequencyTableTest, EntriesCarryTheirBinsFrequencyWidthLevelAndTheChunksCutOff) {
    std::vector<AnalysedBlock> blocks = analyse(toneSignal(220.0, 8000.0, 1.0, RATE, {1.0, 0.5, 0.3}));
    ASSERT_EQ(blocks.size(), 86u) << "44100 / 512 whole blocks";
    float step = float(analysisGeometry.pitchStep);
    for (size_t b = 0; b < blocks.size(); b++) {
        const FTDataBuffer& data = blocks[b].data;
        for (uint32_t i = 0; i < data.nEntries; i++) {
            const FrequencyEntry& e = data.entries[i];
            if (i > 0) {
                EXPECT_GT(e.frequency, data.entries[i - 1].frequency) << "ascending";
            }
            EXPECT_GE(e.frequency, analysisGeometry.lowestAnalysed * 0.97);
            EXPECT_LE(e.frequency, analysisGeometry.highestAnalysed * 1.03);
            EXPECT_FLOAT_EQ(e.frequencyWidth, e.frequency * step);
            EXPECT_GT(e.amplitude, 0);
            EXPECT_EQ(e.initialAmplitude, e.amplitude);
            EXPECT_EQ(e.cutOffLevel, blocks[b / 32 * 32].data.entries[0].cutOffLevel) << "one cut-off per chunk";
            EXPECT_EQ(e.entryFlags, 0);
        }
        EXPECT_EQ(data.blockFlags, 0);
        EXPECT_EQ(blockBytes(blocks[b]), blockBytes(AnalysedBlock{blocks[b].orig, blocks[b].orig, blocks[b].detected, {}}))
            << "in monophonic recognition origDataBuffer equals dataBuffer";
        ASSERT_EQ(blocks[b].detected.nEntries, 1u);
        EXPECT_EQ(blocks[b].detected.entries[0].frequency, 440.0f);
        EXPECT_EQ(blocks[b].detected.entries[0].amplitude, 0);
    }
}

TEST_F(FrequencyTableTest, SilenceAndSoundBelowTheNoiseFloorGiveEmptyBlocksThatAreStillAppendedAndTimed) {
    std::vector<AnalysedBlock> blocks = analyse(silenceSignal(1.0, RATE));
    ASSERT_EQ(blocks.size(), 86u);
    for (const AnalysedBlock& b : blocks) {
        EXPECT_EQ(b.data.nEntries, 0u);
        EXPECT_EQ(b.orig.nEntries, 0u);
        EXPECT_EQ(b.data.blockLoudness, 0);
    }
    EXPECT_EQ(song.blockCount, 86u);
    EXPECT_EQ(ftBlockWindow.firstBlock, 0u);
    EXPECT_EQ(ftBlockWindow.endBlock, 86u);
    for (uint32_t b = 0; b < 86; b++) EXPECT_DOUBLE_EQ(blockDuration(b), BLOCK_SECONDS);
    EXPECT_NEAR(songDuration(), 86 * BLOCK_SECONDS, 1e-9);
    // Sound below the noise floor, noise peaking at 150 (RMS about 87, far below 1.5 % of full
    // scale) with a faint tone, gives no entries and no loudness either.
    std::vector<double> x = noiseSignal(150.0, 1.0, RATE);
    std::vector<double> tone = toneSignal(330.0, 100.0, 1.0, RATE);
    for (size_t i = 0; i < x.size(); i++) x[i] += tone[i];
    emptyAnalysisState();
    blocks = analyse(x);
    ASSERT_EQ(blocks.size(), 86u);
    for (const AnalysedBlock& b : blocks) {
        EXPECT_EQ(b.data.nEntries, 0u);
        EXPECT_EQ(b.data.blockLoudness, 0);
    }
}

TEST_F(FrequencyTableTest, SilenceBetweenNotesEmptiesItsSegmentsOnly) {
    std::vector<AnalysedBlock> blocks =
        analyse(concatenate({toneSignal(330.0, 8000.0, 1.1, RATE), silenceSignal(1.5, RATE), toneSignal(330.0, 8000.0, 1.1, RATE)}));
    // Chunks of 32 blocks: blocks 128 .. 191 lie wholly in the silence, frames included.
    for (size_t b = 128; b < 192; b++) {
        EXPECT_EQ(blocks[b].data.nEntries, 0u) << b;
        EXPECT_EQ(blocks[b].data.blockLoudness, 0) << b;
    }
    EXPECT_GT(blocks[60].data.nEntries, 0u);
    EXPECT_GT(blocks[260].data.nEntries, 0u);
}

TEST_F(FrequencyTableTest, ALouderStretchGetsAHigherBlockLoudnessThanAQuieterOne) {
    // Loud for 144 blocks, then a quarter of the amplitude: the step lies in the middle of a segment.
    std::vector<AnalysedBlock> blocks = analyse(
        concatenate({toneSignal(330.0, 12000.0, 144 * BLOCK_SECONDS, RATE), toneSignal(330.0, 3000.0, 1.0, RATE)}));
    // Blocks 128 .. 159 form one segment: 0 .. 15 of it loud, 16 .. 31 quiet.
    double loud = 0, quiet = 0;
    for (size_t b = 130; b < 142; b++) loud += blocks[b].data.blockLoudness;
    for (size_t b = 148; b < 160; b++) quiet += blocks[b].data.blockLoudness;
    EXPECT_GT(loud / 12, 200.0);
    EXPECT_LT(quiet / 12, 0.6 * loud / 12);
}

TEST_F(FrequencyTableTest, TheHiresSpectrumOfAToneHoldsTheBlocksEnergyAtTheTonesBin) {
    const double amplitude = 8000.0;
    std::vector<AnalysedBlock> blocks = analyse(toneSignal(440.0, amplitude, 1.5, RATE));
    ASSERT_FALSE(blocks[64].hires.empty());
    for (size_t b = 40; b < 120; b += 7) {
        const std::vector<double>& h = blocks[b].hires;
        size_t peak = size_t(std::max_element(h.begin(), h.end()) - h.begin());
        EXPECT_NEAR(fineBinFrequency(analysisGeometry, uint32_t(peak)), 440.0, analysisGeometry.binSpacing / 32)
            << "block " << b;
        // The fine bins of a block hold its energy: 512 samples of a sine, 512 x A^2 / 2.
        double energy = 0;
        for (double v : h) energy += v;
        EXPECT_NEAR(energy, 512 * amplitude * amplitude / 2, 0.05 * 512 * amplitude * amplitude / 2) << "block " << b;
    }
}

TEST_F(FrequencyTableTest, HiresSpectraGoThroughTheHiresStoreWithinQuantisation) {
    std::vector<AnalysedBlock> blocks = analyse(toneSignal(440.0, 8000.0, 1.0, RATE, {1.0, 0.5}));
    ASSERT_EQ(openHiresFTFile(FT_UPDATE), 1);
    EXPECT_EQ(writeHiresFTBlocks(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, 0, song.blockCount), 1);
    ASSERT_EQ(closeHiresFTFile(1), 1);
    ASSERT_EQ(openHiresFTFile(FT_READ), 1);
    int ok;
    seekToFTBlock(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, 0, 0, 0, &ok);
    ASSERT_EQ(ok, 1);
    std::vector<double> bins(size_t(hiresGeometry.bins) * 2);
    const double threshold = 32768.0;   // the store keeps 16-bit audio's bins at or above this
    for (uint32_t b = 0; b < song.blockCount; b++) {
        ASSERT_GT(readHiresFTBlock(hiresFiles.hiresFile, 0, b, bins.data(), nullptr), 0u);
        const std::vector<double>& h = blocks[b].hires;
        double largest = *std::max_element(h.begin(), h.end());
        double step = std::expm1(std::log1p(largest) / 65535.0);   // one quantisation step, relative
        size_t peak = size_t(std::max_element(h.begin(), h.end()) - h.begin());
        EXPECT_NEAR(bins[2 * peak], h[peak], (h[peak] + 1) * step) << "block " << b;
        for (size_t j = 0; j < h.size(); j += 3) {
            if (h[j] >= threshold) {
                ASSERT_NEAR(bins[2 * j], h[j], (h[j] + 1) * step) << "block " << b << " bin " << j;
            }
        }
    }
    closeHiresFTFile(0);
}

TEST_F(FrequencyTableTest, WithWaveEditingDisabledTheEntriesStayAndNoHiresSpectrumIsKept) {
    std::vector<double> x = toneSignal(220.0, 8000.0, 1.0, RATE, {1.0, 0.5});
    std::vector<AnalysedBlock> withWaveEditing = analyse(x);
    emptyAnalysisState();
    generalSettings.disableWaveEditing = true;
    std::vector<AnalysedBlock> without = analyse(x);
    EXPECT_EQ(hiresBuffer.bins, nullptr);
    ASSERT_EQ(without.size(), withWaveEditing.size());
    for (size_t b = 0; b < without.size(); b++) {
        EXPECT_TRUE(without[b].hires.empty());
        ASSERT_EQ(without[b].data.nEntries, withWaveEditing[b].data.nEntries) << b;
        for (uint32_t i = 0; i < without[b].data.nEntries; i++)
            EXPECT_EQ(without[b].data.entries[i].frequency, withWaveEditing[b].data.entries[i].frequency);
    }
    EXPECT_EQ(writeHiresFTBlocks(nullptr, nullptr, 0, song.blockCount), 1) << "nothing to store";
}

TEST_F(FrequencyTableTest, EachCallReturnsWhereTheNextChunkStarts) {
    setSongFormat(RATE, 16);
    bytes = toSampleBytes(toneSignal(220.0, 8000.0, 2.0, RATE), 16);
    ASSERT_EQ(setupFrequencyAnalysis(), 1);
    setAnalysisSampleBuffer(bytes.data(), 88200, 0);
    EXPECT_EQ(createFrequencyTable(0), 16384);
    EXPECT_EQ(song.blockCount, 32u);
    EXPECT_EQ(createFrequencyTable(16384), 32768);
    EXPECT_EQ(createFrequencyTable(32768 + 200), 32768 + 16384) << "a start inside a block begins at its nearest boundary";
    EXPECT_EQ(song.blockCount, 96u);
    // The song's last partial block is not analysed.
    emptyAnalysisState();
    std::vector<AnalysedBlock> blocks = analyse(toneSignal(220.0, 8000.0, 1.0 + 300.0 / RATE, RATE));
    EXPECT_EQ(blocks.size(), 86u) << "44400 samples hold 86 whole blocks of 512";
    EXPECT_EQ(song.blockCount, 86u);
}

TEST_F(FrequencyTableTest, WindowArraysThatCannotBeHadOnTheFirstChunkGiveTheMemoryMessage) {
    setSongFormat(RATE, 16);
    bytes = toSampleBytes(silenceSignal(1.0, RATE), 16);
    ASSERT_EQ(setupFrequencyAnalysis(), 1);
    setAnalysisSampleBuffer(bytes.data(), 44100, 0);
    failAllocation(1);
    EXPECT_EQ(createFrequencyTable(0), -1);
    failAllocation(0);
    EXPECT_EQ(lastMessageText().rfind("Sorry - there is insufficient memory available to continue.", 0), 0u);
    EXPECT_EQ(song.blockCount, 0u);
}

// The window against a plain model: a song of 3000 stored blocks, each marked with its
// number, then new chunks appended at its end.
class FrequencyTableWindow : public FrequencyTableTest {
protected:
    static constexpr uint32_t STORED = 3000;
    void storeMarkedBlocks() {
        setSongFormat(RATE, 16);
        song.sampleBlockDuration = BLOCK_SECONDS;
        ASSERT_EQ(growSampleBlockDurations(STORED), 1);
        for (uint32_t b = 0; b < STORED; b++) song.sampleBlockDurations[b] = BLOCK_SECONDS;
        song.blockCount = STORED;
        ASSERT_EQ(openFTFile(FT_UPDATE), 1);
        AnalysedBlock block;
        std::memset(&block.data, 0, sizeof block.data);
        std::memset(&block.orig, 0, sizeof block.orig);
        std::memset(&block.detected, 0, sizeof block.detected);
        for (uint32_t b = 0; b < STORED; b++) {
            block.data.nEntries = 1;
            block.data.entries[0] = FrequencyEntry{float(b), 0, 1, 1, 0, 0};
            int ok;
            seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, b, 1, 1, &ok);
            ASSERT_EQ(ok, 1);
            uint32_t written = writeFTBlock(ftFiles.ftFile, b, &block.data, &block.orig, &block.detected);
            ASSERT_EQ(setFTBlockSize(ftFiles.ftIndexFile, b, written), 1);
        }
        ASSERT_EQ(closeFTFile(1), 1);
    }
    void TearDown() override {
        fileDelete(sharedFilePath("CS.ft"));
        fileDelete(sharedFilePath("CS.fi"));
        FrequencyTableTest::TearDown();
    }
};

TEST_F(FrequencyTableWindow, SetupForASongWithBlocksLoadsTheNewestWindow) {
    storeMarkedBlocks();
    recognitionOptions.blockDuration = 1.0f / 64;
    recognitionOptions.lowestFrequency = 41.3f;
    recognitionOptions.highestFrequency = 2155.2f;
    ASSERT_EQ(setupFrequencyAnalysis(), 1);
    EXPECT_EQ(ftBlockWindow.firstBlock, STORED - 2583);
    EXPECT_EQ(ftBlockWindow.endBlock, STORED);
    for (uint32_t b = ftBlockWindow.firstBlock; b < STORED; b += 101)
        EXPECT_EQ(ftBlockWindow.dataBuffers[b - ftBlockWindow.firstBlock].entries[0].frequency, float(b));
}

TEST_F(FrequencyTableWindow, NewChunksMoveTheWindowSoThatItEndsAtItsCapacity) {
    storeMarkedBlocks();
    recognitionOptions.blockDuration = 1.0f / 64;
    recognitionOptions.lowestFrequency = 41.3f;
    recognitionOptions.highestFrequency = 2155.2f;
    generalSettings.disableWaveEditing = true;   // kept from the song's first analysis below
    recognitionOptions.disableWaveEditing = true;
    ASSERT_EQ(setupFrequencyAnalysis(), 1);
    bytes = toSampleBytes(toneSignal(220.0, 8000.0, 2.0, RATE), 16);
    uint32_t start = STORED * 512;
    setAnalysisSampleBuffer(bytes.data(), uint32_t(bytes.size() / 2), start);
    int64_t next = createFrequencyTable(start);
    EXPECT_EQ(next, int64_t(start) + 16384);
    next = createFrequencyTable(uint32_t(next));
    EXPECT_EQ(song.blockCount, STORED + 64);
    EXPECT_EQ(ftBlockWindow.endBlock, STORED + 64);
    EXPECT_EQ(ftBlockWindow.firstBlock, STORED + 64 - 2583);
    // The model: every old block still held is block b, at slot b - first.
    for (uint32_t b = ftBlockWindow.firstBlock; b < STORED; b++)
        ASSERT_EQ(ftBlockWindow.dataBuffers[b - ftBlockWindow.firstBlock].entries[0].frequency, float(b)) << b;
    const FTDataBuffer& newest = ftBlockWindow.dataBuffers[STORED + 50 - ftBlockWindow.firstBlock];
    ASSERT_GT(newest.nEntries, 0u);
    EXPECT_NEAR(centsBetween(strongestEntry(newest)->frequency, 220.0), 0.0, CENTS_TOLERANCE);
}

TEST_F(FrequencyTableWindow, NineLevelsShowTheirMessageAndTheAnalysisGoesOn) {
    storeMarkedBlocks();
    recognitionOptions.blockDuration = 1.0f / 128;
    recognitionOptions.lowestFrequency = 10.0f;
    recognitionOptions.highestFrequency = 2000.0f;
    ASSERT_EQ(setupFrequencyAnalysis(), 1) << "a song with blocks keeps its options";
    EXPECT_EQ(analysisGeometry.levels, 9);
    EXPECT_EQ(lastMessageText(),
              "Max number of FFTs reached - cannot do more due to loss of accuracy multipling this many small numbers "
              "together");
    EXPECT_EQ(analysisBuffersReady(), 1);
}
