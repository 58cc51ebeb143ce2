// Syllable starts from the spectrogram: loudness dips between two loud stretches, consonants
// (a brightening that interrupts the voice) only with "CS Detect syllables", the brightness
// ratio, and the blocks and flags they are marked on.
#include <gtest/gtest.h>

#include "analysis/recognitionFixtures.h"

class SyllableStarts : public RecognitionTest {
protected:
    static constexpr uint32_t BLOCKS = 200;   // 400 rows of 256 samples
    // A voiced row: its fundamental at 200 Hz carries level; brightness above 400 Hz adds bright.
    void voicedRow(uint32_t* row, uint32_t level, uint32_t bright) {
        row[binOf(200.0)] = level;
        row[binOf(2000.0)] = bright;
    }
};

TEST_F(SyllableStarts, ADeepLoudnessDipBetweenTwoLoudStretchesStartsASyllable) {
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 200.0);
    // Rows 200 .. 207 (blocks 100 .. 103) are a quarter as loud.
    makeRows(2 * BLOCKS, [&](uint32_t r, uint32_t* row) { voicedRow(row, r >= 200 && r < 208 ? 25000u : 100000u, 1000); });
    findSyllables(0, BLOCKS);
    ASSERT_EQ(syllables.startBlocks.size(), 1u);
    uint32_t start = syllables.startBlocks[0];
    EXPECT_GE(start, 99u);
    EXPECT_LE(start, 100u) << "the syllable starts where the loudness fell, not at the valley's quietest row";
    EXPECT_TRUE(blockData(start).blockFlags & BLOCK_SYLLABLE_START);
    EXPECT_TRUE(blockOrigData(start).blockFlags & BLOCK_SYLLABLE_START);
    int marked = 0;
    for (uint32_t b = 0; b < BLOCKS; b++) marked += (blockData(b).blockFlags & BLOCK_SYLLABLE_START) != 0;
    EXPECT_EQ(marked, 1);
}

TEST_F(SyllableStarts, HissAboveTheVoiceDoesNotFillADip) {
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 200.0);
    // Steady hiss from 6 kHz up, twice the voice's loud rows in all: over the whole row the dip
    // would be 300000 to 225000.
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    uint32_t hissFrom = binOf(6000.0), hissBins = s.binsPerRow - hissFrom;
    ASSERT_GT(hissBins, 100u);
    makeRows(2 * BLOCKS, [&](uint32_t r, uint32_t* row) {
        voicedRow(row, r >= 200 && r < 208 ? 25000u : 100000u, 1000);
        for (uint32_t i = hissFrom; i < s.binsPerRow; i++) row[i] = 200000u / hissBins;
    });
    findSyllables(0, BLOCKS);
    ASSERT_EQ(syllables.startBlocks.size(), 1u);
    EXPECT_GE(syllables.startBlocks[0], 99u);
    EXPECT_LE(syllables.startBlocks[0], 100u);
}

TEST_F(SyllableStarts, TwoStartsLessThanFifteenHundredthsApartKeepTheEarlier) {
    // Dips at rows 200, 220 (0.116 s later: a consonant and the vowel it opens) and 260.
    auto quiet = [](uint32_t r) { return (r >= 200 && r < 206) || (r >= 220 && r < 226) || (r >= 260 && r < 266); };
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 200.0);
    makeRows(2 * BLOCKS, [&](uint32_t r, uint32_t* row) { voicedRow(row, quiet(r) ? 20000u : 100000u, 1000); });
    findSyllables(0, BLOCKS);
    ASSERT_EQ(syllables.startBlocks.size(), 2u);
    EXPECT_LE(syllables.startBlocks[0], 100u);
    EXPECT_GE(syllables.startBlocks[1], 129u);
    EXPECT_LE(syllables.startBlocks[1], 130u);
}

TEST_F(SyllableStarts, AShallowDipIsNoSyllable) {
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 200.0);
    makeRows(2 * BLOCKS, [&](uint32_t r, uint32_t* row) { voicedRow(row, r >= 200 && r < 208 ? 60000u : 100000u, 1000); });
    findSyllables(0, BLOCKS);
    EXPECT_TRUE(syllables.startBlocks.empty());
}

TEST_F(SyllableStarts, AConsonantStartsASyllableOnlyWithDetectSyllablesOn) {
    // Two rows before 200 brighten (share above the split from 0.01 to 0.6) and lose loudness
    // to 0.45 of the vowels: too short a valley for a dip once the totals are smoothed over
    // three rows, a consonant all the same.
    auto consonant = [&](uint32_t r, uint32_t* row) {
        bool inside = r >= 198 && r < 200;
        voicedRow(row, inside ? 18000u : 100000u, inside ? 27000u : 1000u);
    };
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 200.0);
    makeRows(2 * BLOCKS, consonant);
    generalSettings.detectSyllables = true;
    findSyllables(0, BLOCKS);
    ASSERT_EQ(syllables.startBlocks.size(), 1u);
    EXPECT_GE(syllables.startBlocks[0], 100u);
    EXPECT_LE(syllables.startBlocks[0], 103u) << "where the brightness has fallen back";

    generalSettings.detectSyllables = false;
    findSyllables(0, BLOCKS);
    EXPECT_TRUE(syllables.startBlocks.empty());
    EXPECT_FALSE(blockData(102).blockFlags & BLOCK_SYLLABLE_START) << "the earlier start is cleared";
}

TEST_F(SyllableStarts, AVowelChangeAcrossAShallowDipStartsASyllableOnlyWithDetectSyllablesOn) {
    // "la" then "lee" on one pitch: the second formant moves from 700 Hz to 2500 Hz at row 200,
    // and the l between them takes 3 dB off rows 198 .. 201, far less than a dip needs.
    auto vowels = [&](bool dip) {
        return [&, dip](uint32_t r, uint32_t* row) {
            double scale = dip && r >= 198 && r < 202 ? 0.7 : 1.0;
            row[binOf(300.0)] = uint32_t(100000 * scale);
            row[binOf(r < 200 ? 700.0 : 2500.0)] = uint32_t(50000 * scale);
        };
    };
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 150.0);
    makeRows(2 * BLOCKS, vowels(true));
    generalSettings.detectSyllables = true;
    findSyllables(0, BLOCKS);
    ASSERT_EQ(syllables.startBlocks.size(), 1u);
    EXPECT_EQ(syllables.startBlocks[0], 100u);

    generalSettings.detectSyllables = false;
    findSyllables(0, BLOCKS);
    EXPECT_TRUE(syllables.startBlocks.empty()) << "the dip alone is too shallow";

    // The same change without the consonant's dip: a diphthong, not a new syllable.
    generalSettings.detectSyllables = true;
    makeRows(2 * BLOCKS, vowels(false));
    findSyllables(0, BLOCKS);
    EXPECT_TRUE(syllables.startBlocks.empty());
}

TEST_F(SyllableStarts, ARowsColourIsItsThirdOctaveLevelsAboutTheirMean) {
    makeSong(10);
    std::vector<uint32_t> row(magnitudeSpectrogram.binsPerRow, 0u);
    row[binOf(160.0)] = 999;     // band 0 (150 .. 189 Hz)
    row[binOf(4700.0)] = 9999;   // band 14 (4762 Hz and up lies beyond it)
    row[binOf(100.0)] = 50000;   // below the lowest band: not counted
    double loudness = 0.0;
    std::vector<double> colour = rowColour(row.data(), uint32_t(row.size()), magnitudeSpectrogram.binWidth, &loudness);
    ASSERT_EQ(colour.size(), size_t(VOWEL_BANDS));
    double mean = (60.0 + 80.0) / VOWEL_BANDS;   // 20 log10(1000) and 20 log10(10000); empty bands are 0 dB
    EXPECT_NEAR(colour[0], 60.0 - mean, 1e-9);
    EXPECT_NEAR(colour[14], 80.0 - mean, 1e-9);
    EXPECT_NEAR(colour[7], -mean, 1e-9);
    EXPECT_NEAR(loudness, 10.0 * std::log10(1000.0 * 1000.0 + 10000.0 * 10000.0 + 13.0), 1e-9);
}

TEST_F(SyllableStarts, ABrightFadeIntoAQuieterSoundIsNoConsonant) {
    // The rows 198 .. 203 brighten as in a consonant, but what follows stays no louder than
    // they are: the voice was not interrupted, a bright attack faded.
    auto fade = [&](uint32_t r, uint32_t* row) {
        if (r < 198) voicedRow(row, 100000u, 1000u);
        else if (r < 204) voicedRow(row, 18000u, 27000u);
        else voicedRow(row, 30000u, 300u);
    };
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 200.0);
    makeRows(2 * BLOCKS, fade);
    generalSettings.detectSyllables = true;
    findSyllables(0, BLOCKS);
    for (uint32_t b : syllables.startBlocks) EXPECT_FALSE(b >= 98 && b <= 103) << "block " << b;
}

TEST_F(SyllableStarts, BlocksTheSpectrogramNoLongerCoversKeepTheirStarts) {
    makeSong(BLOCKS);
    setPitches(0, BLOCKS, 200.0);
    blockData(20).blockFlags |= BLOCK_SYLLABLE_START;
    blockOrigData(20).blockFlags |= BLOCK_SYLLABLE_START;
    blockData(150).blockFlags |= BLOCK_SYLLABLE_START;
    // The rows begin at block 100.
    makeRows(200, [&](uint32_t, uint32_t* row) { voicedRow(row, 100000u, 1000); });
    magnitudeSpectrogram.firstRowPosition = sampleOf(100);
    findSyllables(0, BLOCKS);
    EXPECT_TRUE(blockData(20).blockFlags & BLOCK_SYLLABLE_START);
    EXPECT_TRUE(blockOrigData(20).blockFlags & BLOCK_SYLLABLE_START);
    EXPECT_FALSE(blockData(150).blockFlags & BLOCK_SYLLABLE_START);
}

TEST_F(SyllableStarts, TheBrightnessRatioSplitsAtTwiceTheFundamental) {
    makeSong(10);
    std::vector<uint32_t> row(magnitudeSpectrogram.binsPerRow, 0u);
    double width = magnitudeSpectrogram.binWidth;
    uint32_t count = uint32_t(row.size());
    row[binOf(300.0)] = 100;
    row[binOf(1000.0)] = 50;
    EXPECT_DOUBLE_EQ(brightnessRatio(row.data(), count, width, 200.0), 0.5);
    // A fundamental of 1048 Hz splits at 2096 Hz and halves the ratio.
    row[binOf(2500.0)] = 60;
    EXPECT_DOUBLE_EQ(brightnessRatio(row.data(), count, width, 1048.0), 0.2);
    // The split stops at 3000 Hz.
    row[binOf(2500.0)] = 0;
    row[binOf(3500.0)] = 75;
    EXPECT_DOUBLE_EQ(brightnessRatio(row.data(), count, width, 2000.0), 75.0 / 150.0 / (2000.0 / 524.0));
    // Nothing below the split: the magnitude above alone.
    std::fill(row.begin(), row.end(), 0u);
    row[binOf(1000.0)] = 40;
    row[1] = 999;   // below the fourth bin: never counted
    EXPECT_DOUBLE_EQ(brightnessRatio(row.data(), count, width, 200.0), 40.0);
}
