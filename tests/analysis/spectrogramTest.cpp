// The magnitude spectrogram: its geometry per sample rate, hand-known spectra of sines and a
// click, rows appended chunk by chunk, the silence gate, dropping old rows, the power
// spectrum method and a failed growth; and the two histogram rules the analysis shares.
#include <gtest/gtest.h>

#include <algorithm>
#include <numeric>
#include <tuple>

#include "analysis/amplitudeHistogram.h"
#include "analysis/analysisFixtures.h"
#include "analysis/spectrogram.h"

// Magnitudes are compared to half a percent.
static const double MAGNITUDE_TOLERANCE = 0.005;
static const double BIN_WIDTH_44100 = 22050.0 / 2048;   // Hz

class SpectrogramTest : public AnalysisTest {
protected:
    std::vector<uint8_t> bytes;

    // A new song at 44,100 Hz holding x whole, its end known.
    void holdWholeSignal(const std::vector<double>& x, int bits = 16) {
        setSongFormat(44100, bits);
        ASSERT_EQ(setupFrequencyAnalysis(), 1);
        bytes = toSampleBytes(x, bits);
        setAnalysisSampleBuffer(bytes.data(), uint32_t(x.size()), 0, int64_t(x.size()));
    }
    uint32_t largestIn(uint32_t row, uint32_t* index = nullptr) {
        const uint32_t* r = spectrogramRow(row);
        const uint32_t* top = std::max_element(r, r + magnitudeSpectrogram.binsPerRow);
        if (index) *index = uint32_t(top - r);
        return *top;
    }
};

TEST(SpectrogramGeometry, BinsAndHopFollowTheSampleRate) {
    const std::tuple<uint32_t, uint32_t, uint32_t> cases[] = {
        {8000, 512, 64},    {11025, 512, 64},   {16537, 512, 128},   {16538, 1024, 128}, {22050, 1024, 128},
        {32000, 1024, 256}, {33074, 1024, 256}, {33075, 2048, 256},  {44100, 2048, 256}, {48000, 2048, 256},
        {66149, 2048, 512}, {66150, 4096, 512}, {96000, 4096, 512},  {100, 512, 4}};   // a hop of at least 4
    for (auto [rate, bins, hop] : cases) {
        EXPECT_EQ(spectrogramBinsForRate(rate), bins) << rate;
        EXPECT_EQ(spectrogramHopForRate(rate), hop) << rate;
    }
}

TEST_F(SpectrogramTest, ASineOnABinPeaksThereWithHalfTheWindowsSum) {
    holdWholeSignal(toneSignal(41 * BIN_WIDTH_44100, 10000.0, 2.0, 44100));
    EXPECT_EQ(createMagnitudeSpectrogram(0), 0);
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 344u) << "88200 samples in hops of 256";
    EXPECT_FLOAT_EQ(magnitudeSpectrogram.binWidth, float(BIN_WIDTH_44100));
    uint32_t index;
    uint32_t peak = largestIn(200, &index);
    EXPECT_EQ(index, 40u) << "magnitude i is bin i + 1";
    // A x (sum of the 4096-point window) / 2 = 10000 x 2047.5 / 2.
    EXPECT_NEAR(peak, 10237500.0, 10237500.0 * MAGNITUDE_TOLERANCE);
}

TEST_F(SpectrogramTest, EachRowsFrameIsCentredOnItsHop) {
    // A burst of 100 samples around sample 22050, loud enough to pass the silence gate.
    std::vector<double> x = silenceSignal(1.0, 44100);
    for (int i = -50; i < 50; i++) x[size_t(22050 + i)] = 30000.0 * std::sin(TWO_PI * 1000.0 * i / 44100);
    holdWholeSignal(x);
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    std::vector<uint64_t> totals;
    for (uint32_t r = 0; r < magnitudeSpectrogram.rowCount; r++) {
        const uint32_t* row = spectrogramRow(r);
        totals.push_back(std::accumulate(row, row + magnitudeSpectrogram.binsPerRow, uint64_t(0)));
    }
    size_t loudest = size_t(std::max_element(totals.begin(), totals.end()) - totals.begin());
    EXPECT_EQ(loudest, 86u) << "sample 22050 lies in row 86's hop (22016 .. 22271)";
}

TEST_F(SpectrogramTest, RowsAreAppendedFromTheEndAsTheBufferGrows) {
    std::vector<double> x = toneSignal(440.0, 8000.0, 2.0, 44100);
    setSongFormat(44100, 16);
    ASSERT_EQ(setupFrequencyAnalysis(), 1);
    bytes = toSampleBytes(x, 16);
    // One second held, more to come: rows stop a lookahead (8192 samples) short of its end.
    setAnalysisSampleBuffer(bytes.data(), 44100, 0);
    EXPECT_EQ(createMagnitudeSpectrogram(0), 0);
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 140u) << "(44100 - 8192) / 256";
    setAnalysisSampleBuffer(bytes.data(), 88200, 0);
    EXPECT_EQ(createMagnitudeSpectrogram(12345), 140) << "the first sample only counts for an empty spectrogram";
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 312u);
    EXPECT_EQ(magnitudeSpectrogram.firstRowPosition, 0u);
    EXPECT_EQ(createMagnitudeSpectrogram(0), 312) << "nothing new to add";
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 312u);
}

TEST_F(SpectrogramTest, AQuietChunkIsGatedToSilenceUnlessTheBoostLiftsIt) {
    holdWholeSignal(toneSignal(440.0, 100.0, 1.0, 44100));
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    ASSERT_GT(magnitudeSpectrogram.rowCount, 0u);
    for (uint32_t r = 0; r < magnitudeSpectrogram.rowCount; r++) EXPECT_EQ(largestIn(r), 0u) << "row " << r;

    emptyAnalysisState();
    holdWholeSignal(toneSignal(440.0, 1000.0, 1.0, 44100));
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    EXPECT_GT(largestIn(80), 262144u);

    emptyAnalysisState();
    holdWholeSignal(toneSignal(440.0, 100.0, 1.0, 44100));
    recognitionOptions.amplitudeBoost = 0.25f;
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    EXPECT_GT(largestIn(80), 90000u) << "a boost of 4 lifts the chunk over the silence level";
    // 8-bit silence is gated against its own level.
    emptyAnalysisState();
    holdWholeSignal(toneSignal(440.0, 0.6, 1.0, 44100), 8);
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    EXPECT_EQ(largestIn(80), 0u);
    emptyAnalysisState();
    holdWholeSignal(toneSignal(440.0, 20.0, 1.0, 44100), 8);
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    EXPECT_GT(largestIn(80), 1024u);
}

TEST_F(SpectrogramTest, DroppingRowsKeepsTheNewerOnesAndAdvancesTheFirstPosition) {
    holdWholeSignal(toneSignal(440.0, 8000.0, 2.0, 44100));
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    std::vector<uint32_t> row3(spectrogramRow(3), spectrogramRow(3) + magnitudeSpectrogram.binsPerRow);
    dropSpectrogramRowsBefore(1000);
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 341u) << "(1000 - 0) / 256 = 3 rows go";
    EXPECT_EQ(magnitudeSpectrogram.firstRowPosition, 768u);
    EXPECT_TRUE(std::equal(row3.begin(), row3.end(), spectrogramRow(0)));
    dropSpectrogramRowsBefore(700);
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 341u) << "a position before the first row drops nothing";
    dropSpectrogramRowsBefore(1000000);
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 0u);
    EXPECT_EQ(magnitudeSpectrogram.firstRowPosition, 768u + 341u * 256u);
}

TEST_F(SpectrogramTest, PowerSpectrumRowsShareThePlainTransformsScale) {
    holdWholeSignal(toneSignal(41 * BIN_WIDTH_44100, 10000.0, 2.0, 44100));
    recognitionOptions.powerSpectrumAnalysis = true;
    ASSERT_EQ(createMagnitudeSpectrogram(0), 0);
    uint32_t index;
    uint32_t peak = largestIn(200, &index);
    EXPECT_EQ(index, 41u) << "the averaged spectrum starts at bin 0";
    EXPECT_NEAR(peak, 10237500.0, 10237500.0 * MAGNITUDE_TOLERANCE) << "on the plain transform's scale";
}

TEST_F(SpectrogramTest, RowsThatCannotBeGrownGiveTheMemoryMessage) {
    holdWholeSignal(toneSignal(440.0, 8000.0, 1.0, 44100));
    failAllocation(1);
    EXPECT_EQ(createMagnitudeSpectrogram(0), -1);
    EXPECT_EQ(lastMessageText(),
              "Sorry - there is insufficient memory available to continue. Please try freeing up some memory from "
              "other applications.");
    EXPECT_EQ(magnitudeSpectrogram.rowCount, 0u);
}

TEST(AnalysisHistogram, TheSpikeRuleTakesTheHighestBinAmongTheMostPopulated) {
    uint32_t counts[SPIKE_HISTOGRAM_BINS] = {};
    counts[0] = 5;
    counts[3] = 7;
    counts[15] = 1;
    EXPECT_EQ(spikeHistogramTop(counts, 1.0f / 16), 3) << "only the most populated bin";
    EXPECT_EQ(spikeHistogramTop(counts, 2.0f / 16), 3) << "bins 3 and 0";
    EXPECT_EQ(spikeHistogramTop(counts, 3.0f / 16), 15) << "bins 3, 0 and the spike's bin 15";
    EXPECT_EQ(spikeHistogramTop(counts, 0.01f), 3) << "at least one bin is taken";
}

TEST(AnalysisHistogram, EqualCountsKeepTheirOrder) {
    uint32_t counts[SPIKE_HISTOGRAM_BINS] = {};
    EXPECT_EQ(spikeHistogramTop(counts, 0.6666667f), 9) << "ten empty bins: 0 .. 9";
    for (uint32_t& c : counts) c = 4;
    counts[12] = 9;
    EXPECT_EQ(spikeHistogramTop(counts, 0.6666667f), 12) << "bin 12, then bins 0 .. 8";
    EXPECT_EQ(spikeHistogramBin(uint64_t(99), uint64_t(100)), 14);
    EXPECT_EQ(spikeHistogramBin(uint64_t(100), uint64_t(100)), 15);
    EXPECT_EQ(spikeHistogramBin(5.0, 0.0), 0);
}

TEST(AnalysisHistogram, TheCutOffSplitsTwoClustersAtTheFirstCleanSplit) {
    double relative[LEVEL_HISTOGRAM_BINS] = {};
    relative[10] = 0.5;
    relative[20] = 0.5;
    EXPECT_EQ(histogramThreshold(relative), 11) << "every split from 11 to 20 separates them cleanly";
    std::fill(relative, relative + LEVEL_HISTOGRAM_BINS, 0.0);
    relative[0] = 0.8;
    relative[200] = 0.1;
    relative[210] = 0.1;
    EXPECT_EQ(histogramThreshold(relative), 1) << "silence against two loud levels";
    std::fill(relative, relative + LEVEL_HISTOGRAM_BINS, 0.0);
    relative[0] = 0.5;
    relative[2] = 0.25;
    relative[3] = 0.25;
    EXPECT_EQ(histogramThreshold(relative), 1);
}
