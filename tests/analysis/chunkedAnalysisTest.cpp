// Analysing chunk by chunk gives the same blocks as the reference chunking (the whole signal
// held in one buffer, one group of blocks per call): FT blocks byte for byte, Hires spectra
// value for value, spectrogram rows when the silence gate has nothing to gate. A different
// chunk size keeps the Hires spectra and the entries' frequencies but not the level bytes,
// which are normalised per segment and cut off per chunk.
#include <gtest/gtest.h>

#include "analysis/analysisFixtures.h"

static const uint32_t RATE = 44100;

class FrequencyTableChunks : public AnalysisTest {
protected:
    std::vector<uint8_t> melody(double seconds) {
        MelodyGenerator generator;
        std::vector<uint8_t> bytes(size_t(seconds * RATE) * 2);
        generator.fill16(bytes.data(), uint32_t(bytes.size() / 2));
        return bytes;
    }
};

TEST_F(FrequencyTableChunks, ChunkedAnalysisGivesTheReferenceBlocksByteForByte) {
    setSongFormat(RATE, 16);
    std::vector<uint8_t> bytes = melody(4.3);
    uint32_t samples = uint32_t(bytes.size() / 2);
    std::vector<AnalysedBlock> reference = analyseWholeSignal(bytes, samples);
    emptyAnalysisState();
    setSongFormat(RATE, 16);
    std::vector<AnalysedBlock> chunked = analyseInChunks(bytes, 16);
    ASSERT_EQ(reference.size(), samples / 512);
    ASSERT_EQ(chunked.size(), reference.size());
    size_t withEntries = 0;
    for (size_t b = 0; b < reference.size(); b++) {
        ASSERT_EQ(blockBytes(chunked[b]), blockBytes(reference[b])) << "block " << b;
        ASSERT_EQ(chunked[b].hires, reference[b].hires) << "block " << b;
        withEntries += reference[b].data.nEntries > 0;
    }
    EXPECT_GT(withEntries, reference.size() / 2) << "the melody is heard";
}

TEST_F(FrequencyTableChunks, SpectrogramRowsAreTheSameWhenNothingIsGated) {
    setSongFormat(RATE, 16);
    // A steady loud tone: no chunk of rows is quiet enough to be gated.
    std::vector<uint8_t> bytes = toSampleBytes(toneSignal(330.0, 8000.0, 3.0, RATE, {1.0, 0.5}), 16);
    uint32_t samples = uint32_t(bytes.size() / 2);
    analyseWholeSignal(bytes, samples);
    std::vector<uint32_t> whole = magnitudeSpectrogram.magnitudes;
    uint32_t wholeRows = magnitudeSpectrogram.rowCount;
    emptyAnalysisState();
    setSongFormat(RATE, 16);
    analyseInChunks(bytes, 16);
    ASSERT_EQ(magnitudeSpectrogram.firstRowPosition, 0u) << "three seconds are all kept";
    ASSERT_EQ(magnitudeSpectrogram.rowCount, wholeRows);
    EXPECT_TRUE(std::equal(whole.begin(), whole.begin() + ptrdiff_t(size_t(wholeRows) * magnitudeSpectrogram.binsPerRow),
                           magnitudeSpectrogram.magnitudes.begin()));
}

TEST_F(FrequencyTableChunks, LargerChunksKeepTheSpectraAndFrequenciesButNotTheLevels) {
    setSongFormat(RATE, 16);
    std::vector<uint8_t> bytes = melody(4.3);
    uint32_t samples = uint32_t(bytes.size() / 2);
    std::vector<AnalysedBlock> groups = analyseWholeSignal(bytes, samples);
    emptyAnalysisState();
    setSongFormat(RATE, 16);
    // A buffer of 3 top frames in view at setup: chunks of 64 blocks, segments of 64.
    std::vector<AnalysedBlock> larger = analyseWholeSignal(bytes, samples, 3 * 16384);
    ASSERT_EQ(analysisGeometry.chunkBlocks, 64u);
    ASSERT_EQ(larger.size(), groups.size());
    size_t sameBins = 0, differentLevels = 0;
    for (size_t b = 0; b < groups.size(); b++) {
        ASSERT_EQ(larger[b].hires, groups[b].hires) << "block " << b;
        const FTDataBuffer& x = groups[b].data;
        const FTDataBuffer& y = larger[b].data;
        for (uint32_t i = 0, j = 0; i < x.nEntries && j < y.nEntries;) {
            if (x.entries[i].frequency < y.entries[j].frequency - 1.0f) i++;
            else if (y.entries[j].frequency < x.entries[i].frequency - 1.0f) j++;
            else {
                EXPECT_EQ(x.entries[i].frequency, y.entries[j].frequency) << "block " << b;
                sameBins++;
                differentLevels += x.entries[i].amplitude != y.entries[j].amplitude;
                i++;
                j++;
            }
        }
    }
    EXPECT_GT(sameBins, groups.size());
    EXPECT_GT(differentLevels, 0u) << "levels depend on the segments and so on the chunk size";
}
