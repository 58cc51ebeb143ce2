// The analysis geometry at 44,100 Hz for each pitch range, with and without enhanced accuracy
// and boost: block length, levels and group, window and chunk sizes, the pitch grid, the noise
// floor; the nine-level limit with its message; and the options each pitch range sets.
#include <gtest/gtest.h>

#include <tuple>
#include <utility>

#include "analysis/analysisFixtures.h"
#include "analysis/analysisGeometry.h"
#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "analysis/spectrogram.h"
#include "shell/settings.h"

static const double HZ_TOLERANCE = 0.01;

class AnalysisGeometrySetup : public AnalysisTest {
protected:
    // The geometry a new song at rate and bits gets from the preferences.
    AnalysisGeometry geometryFor(int pitchRange, bool enhanced, bool boost, uint32_t rate = 44100, int bits = 16) {
        generalSettings.pitchRange = pitchRange;
        generalSettings.enhancedPitchAccuracy = enhanced;
        globalSettings.boostSpeed = boost;
        setSongFormat(rate, bits);
        EXPECT_EQ(setupFrequencyAnalysis(), 1);
        return analysisGeometry;
    }
};

TEST_F(AnalysisGeometrySetup, LowToMidRangeAt44100HzHasBlocksOf512SamplesAndSixLevels) {
    AnalysisGeometry g = geometryFor(PITCH_RANGE_LOW_TO_MID, false, false);
    EXPECT_DOUBLE_EQ(g.sampleBlockDuration, 512.0 / 44100.0);
    EXPECT_DOUBLE_EQ(song.sampleBlockDuration, 512.0 / 44100.0);
    EXPECT_NEAR(g.binSpacing, 43.07, HZ_TOLERANCE);
    // A window of 30 s of 512-sample blocks; 86 blocks a second rounded up to a multiple of 32;
    // with no buffer in view a chunk is one group.
    EXPECT_EQ(std::tuple(g.blockSamples, g.levels, g.group, g.topFrame, g.hiresBins, g.windowCapacity, ftBlockWindow.capacity),
              std::tuple(512u, 6, 32u, 16384u, 16384u, 2583u, 2583u));
    EXPECT_EQ(std::tuple(g.blocksPerSecond, g.chunkBlocks, g.lookaheadSamples, g.firstPitchIndex, g.pitchBins),
              std::tuple(96u, 32u, 8192u, 64, 68));
    EXPECT_DOUBLE_EQ(g.lowestAnalysed, 41.3f);
    EXPECT_DOUBLE_EQ(g.highestAnalysed, 2155.2f);
    EXPECT_EQ(g.noiseFloor, 123695058.0) << "512 x (32768 x 0.015)^2";
    EXPECT_EQ(std::tuple(magnitudeSpectrogram.binsPerRow, magnitudeSpectrogram.hop, hiresGeometry.bins), std::tuple(2048u, 256u, 16384u));
    EXPECT_NEAR(hiresGeometry.lowestFrequency, 43.07, HZ_TOLERANCE);
    EXPECT_EQ(std::pair(hiresGeometry.binsPerStep, hiresGeometry.hopFraction), std::pair(32.0, 0.03125));
    EXPECT_EQ(messageCount(), 0);
}

// Enhanced accuracy halves the pitch step and adds a level; the mid-to-high range has blocks
// of 256 samples, the very low range of 1024; boost lengthens the blocks and needs fewer levels.
// 0: not checked for that row.
TEST_F(AnalysisGeometrySetup, EachRangeAndOptionGivesItsBlocksLevelsAndGrid) {
    struct Row {
        int range;
        bool enhanced, boost;
        uint32_t blockSamples;
        int levels;
        uint32_t group, blocksPerSecond, chunkBlocks, windowCapacity;
        int pitchBins;
    };
    const Row rows[] = {
        {PITCH_RANGE_LOW_TO_MID, true, false, 512, 7, 64, 128, 64, 0, 137},
        {PITCH_RANGE_MID_TO_HIGH, false, false, 256, 6, 32, 192, 0, 5167, 68},   // six levels resolve 82.5 Hz with 86 Hz bins
        {PITCH_RANGE_MID_TO_HIGH, true, false, 256, 7, 0, 0, 0, 0, 0},
        {PITCH_RANGE_VERY_LOW, false, false, 1024, 6, 32, 64, 0, 1291, 0},
        {PITCH_RANGE_VERY_LOW, true, false, 1024, 7, 0, 0, 0, 0, 0},
        {PITCH_RANGE_MID_TO_HIGH, false, true, 1024, 4, 8, 0, 0, 0, 0},
        {PITCH_RANGE_MID_TO_HIGH, true, true, 1024, 5, 0, 0, 0, 0, 0},
        {PITCH_RANGE_LOW_TO_MID, false, true, 1024, 5, 0, 0, 0, 0, 0},
        {PITCH_RANGE_VERY_LOW, false, true, 2048, 5, 0, 0, 0, 0, 0},
    };
    for (const Row& r : rows) {
        AnalysisGeometry g = geometryFor(r.range, r.enhanced, r.boost);
        SCOPED_TRACE(testing::Message() << "range " << r.range << " enhanced " << r.enhanced << " boost " << r.boost);
        EXPECT_EQ(std::tuple(g.blockSamples, g.levels), std::tuple(r.blockSamples, r.levels));
        EXPECT_DOUBLE_EQ(g.sampleBlockDuration, r.blockSamples / 44100.0);
        EXPECT_NEAR(g.binSpacing, 44100.0 / (2 * r.blockSamples), HZ_TOLERANCE);
        const std::pair<uint32_t, uint32_t> checked[] = {{r.group, g.group}, {r.blocksPerSecond, g.blocksPerSecond},
                                                         {r.chunkBlocks, g.chunkBlocks}, {r.windowCapacity, g.windowCapacity},
                                                         {uint32_t(r.pitchBins), uint32_t(g.pitchBins)}};
        for (auto [expected, actual] : checked)
            if (expected) { EXPECT_EQ(actual, expected); }
    }
    AnalysisGeometry g = geometryFor(PITCH_RANGE_LOW_TO_MID, true, false);
    EXPECT_EQ(g.hiresBins, 32768u);
    EXPECT_NEAR(g.pitchStep, 0.0250858 / 2, 1e-7);
    g = geometryFor(PITCH_RANGE_MID_TO_HIGH, false, false);
    EXPECT_DOUBLE_EQ(g.highestAnalysed, 4310.0);
    EXPECT_EQ(std::pair(magnitudeSpectrogram.binsPerRow, magnitudeSpectrogram.hop), std::pair(2048u, 256u));
    EXPECT_EQ(geometryFor(PITCH_RANGE_VERY_LOW, false, false).noiseFloor, 247390116.0);
}

TEST_F(AnalysisGeometrySetup, SlowRatesAndEightBitSongsAndADamagedRangeSettingGetTheirOwnGeometry) {
    EXPECT_EQ(geometryFor(PITCH_RANGE_LOW_TO_MID, false, false, 44100, 8).noiseFloor, 1887.0) << "a scaled noise floor";
    AnalysisGeometry g = geometryFor(PITCH_RANGE_MID_TO_HIGH, false, false, 8000);
    EXPECT_EQ(g.blockSamples, 32u) << "trunc(8000 / 128) + 1 = 63";
    EXPECT_DOUBLE_EQ(g.highestAnalysed, 4000.0);
    EXPECT_EQ(magnitudeSpectrogram.binsPerRow, 512u);
    EXPECT_EQ(magnitudeSpectrogram.hop, 64u);
    g = geometryFor(7, false, false);   // a damaged pitch range setting is the default range
    EXPECT_EQ(g.blockSamples, 512u);
    EXPECT_FLOAT_EQ(recognitionOptions.lowestFrequency, 41.3f);
}

TEST_F(AnalysisGeometrySetup, EachPitchRangeSetsTheSongViewsLimits) {
    geometryFor(PITCH_RANGE_MID_TO_HIGH, false, false);
    EXPECT_EQ(songViewPitchLimits.lowestFrequency, 61.0f);
    EXPECT_EQ(songViewPitchLimits.highestFrequency, 4434.0f);
    EXPECT_EQ(songViewPitchLimits.lowestNoteFrequency, 65.0f);
    EXPECT_EQ(songViewPitchLimits.highestNoteFrequency, 4186.0f);
    geometryFor(PITCH_RANGE_VERY_LOW, false, false);
    EXPECT_EQ(songViewPitchLimits.lowestFrequency, 26.0f);
    EXPECT_EQ(songViewPitchLimits.highestNoteFrequency, 1046.0f);
    EXPECT_EQ(songViewPitchLimits.viewScale, 32.0f);
}

TEST_F(AnalysisGeometrySetup, DisablingWaveEditingDropsThePhasesAndCombinesOnlyUpToTheHighestFrequency) {
    generalSettings.disableWaveEditing = true;
    AnalysisGeometry g = geometryFor(PITCH_RANGE_LOW_TO_MID, false, false);
    EXPECT_TRUE(recognitionOptions.disableWaveEditing);
    EXPECT_FALSE(g.keepPhases);
    EXPECT_DOUBLE_EQ(g.combinationLimit, 2155.2f);
    EXPECT_TRUE(frequencyAnalysis.levelPhases.empty());
    generalSettings.disableWaveEditing = false;
    g = geometryFor(PITCH_RANGE_LOW_TO_MID, false, false);
    EXPECT_TRUE(g.keepPhases);
    EXPECT_DOUBLE_EQ(g.combinationLimit, 5000.0);
    EXPECT_FALSE(frequencyAnalysis.levelPhases.empty());
}

TEST_F(AnalysisGeometrySetup, ASongWithoutAUsableFormatOrMemoryIsNotSetUp) {
    setSongFormat(0, 16);
    EXPECT_EQ(setupFrequencyAnalysis(), 0);
    setSongFormat(44100, 24);
    EXPECT_EQ(setupFrequencyAnalysis(), 0);
    EXPECT_EQ(analysisBuffersReady(), 0);
    EXPECT_EQ(createFrequencyTable(0), -1);
    // Working buffers that cannot be had are all released after the memory message.
    setSongFormat(44100, 16);
    failAllocation(5);
    EXPECT_EQ(setupFrequencyAnalysis(), 0);
    EXPECT_EQ(lastMessageText(),
              "Sorry - there is insufficient memory available to continue. Please try freeing up some memory from "
              "other applications.");
    EXPECT_EQ(analysisBuffersReady(), 0);
    EXPECT_TRUE(frequencyAnalysis.levelPowers.empty());
    EXPECT_TRUE(frequencyAnalysis.pitchLevels.empty());
    EXPECT_EQ(createFrequencyTable(0), -1);
}

TEST(AnalysisGeometry, ChunksGrowWithTheBufferInWholeGroupsAndStayWithinTheWindow) {
    RecognitionOptions options;
    options.blockDuration = 1.0f / 64;
    options.lowestFrequency = 41.3f;
    options.highestFrequency = 2155.2f;
    AnalysisGeometry g;
    ASSERT_EQ(deriveAnalysisGeometry(44100, 16, options, 88200, &g), 1);
    EXPECT_EQ(g.chunkBlocks, 160u) << "(88200 - 16384) / 512 = 140.3 blocks, rounded up to 5 groups";
    EXPECT_EQ(chunkBlockCount(g, 2 * 16384), 32u);
    EXPECT_EQ(chunkBlockCount(g, 100), 32u) << "at least one group";
    EXPECT_EQ(chunkBlockCount(g, 44100 * 600), 2560u) << "at most the window, in whole groups";
}

TEST(AnalysisGeometry, LevelsStopAtNineWithTheirMessageAndARangeNeedsAPitchGrid) {
    RecognitionOptions options;
    options.blockDuration = 1.0f / 128;
    options.lowestFrequency = 10.0f;
    options.highestFrequency = 2000.0f;
    AnalysisGeometry g;
    bool capped = false;
    ASSERT_EQ(deriveAnalysisGeometry(44100, 16, options, 0, &g, &capped), 1);
    EXPECT_EQ(g.levels, 9);
    EXPECT_EQ(g.group, 256u);
    EXPECT_TRUE(capped);
    options.lowestFrequency = 82.5f;
    ASSERT_EQ(deriveAnalysisGeometry(44100, 16, options, 0, &g, &capped), 1);
    EXPECT_EQ(g.levels, 6);
    EXPECT_FALSE(capped);
    // A range without a pitch grid is refused and the geometry left untouched.
    g = AnalysisGeometry{};
    options.lowestFrequency = 0.0f;
    EXPECT_EQ(deriveAnalysisGeometry(44100, 16, options, 0, &g), 0);
    options.lowestFrequency = 500.0f;
    options.highestFrequency = 400.0f;
    EXPECT_EQ(deriveAnalysisGeometry(44100, 16, options, 0, &g), 0);
    EXPECT_EQ(g.blockSamples, 0u) << "the geometry is left untouched";
}

TEST(AnalysisGeometry, TheLowestResolvableFrequencyIsTheNoteBelowTheFirstStepThatWideAtLeast) {
    EXPECT_NEAR(lowestResolvableFrequency(86.13, 1.0), 1479.98, HZ_TOLERANCE) << "F#6: the step to G6 is 88 Hz";
    EXPECT_NEAR(lowestResolvableFrequency(2.69, 1.0), 46.25, HZ_TOLERANCE);
    EXPECT_NEAR(lowestResolvableFrequency(2.69, 2.0), 92.50, HZ_TOLERANCE);
    EXPECT_NEAR(lowestResolvableFrequency(0.01, 1.0), 8.18, HZ_TOLERANCE) << "the first step is wide enough";
    EXPECT_EQ(lowestResolvableFrequency(1000.0, 1.0), 40000.0) << "no step is that wide";
}

TEST(AnalysisGeometry, PitchBinsAreAnchoredAtOneHertzAndShareTheirEdges) {
    RecognitionOptions options;
    options.blockDuration = 1.0f / 64;
    options.lowestFrequency = 41.3f;
    options.highestFrequency = 2155.2f;
    AnalysisGeometry g;
    ASSERT_EQ(deriveAnalysisGeometry(44100, 16, options, 0, &g), 1);
    EXPECT_NEAR(pitchBinCentre(g, 0), 40.32, HZ_TOLERANCE) << "2^(64/12): below the lowest frequency";
    EXPECT_NEAR(pitchBinCentre(g, 41), 430.54, HZ_TOLERANCE) << "2^(105/12): 440 Hz is not a centre";
    EXPECT_DOUBLE_EQ(pitchBinUpperEdge(g, 41), pitchBinLowerEdge(g, 42));
    EXPECT_NEAR(pitchBinUpperEdge(g, 41), 443.15, HZ_TOLERANCE) << "2^(105.5/12)";
    int first, end;
    pitchBinsInRange(g, &first, &end);
    EXPECT_EQ(first, 1);
    EXPECT_EQ(end, 68);
    EXPECT_NEAR(fineBinFrequency(g, 0), 43.07, HZ_TOLERANCE);
    EXPECT_NEAR(fineBinFrequency(g, 32), 86.13, HZ_TOLERANCE);
    EXPECT_EQ(fineBinIndex(g, 86.14), 32u);
    EXPECT_EQ(fineBinIndex(g, 20.0), 0u) << "below the first fine bin";
}

TEST(AnalysisGeometry, TheNoteTableRunsFromC_1ToG9AtA440) {
    const double* notes = noteFrequencyTable();
    EXPECT_NEAR(notes[0], 8.1758, 1e-4);
    EXPECT_NEAR(notes[57], 220.0, 1e-9);
    EXPECT_NEAR(notes[69], 440.0, 1e-9);
    EXPECT_NEAR(notes[127], 12543.85, 0.01);
}
