// The weight tables: equal-loudness weights at and between the rows, the loudness weight,
// the fade towards high frequencies with its boost below 38 Hz, and the table's ends.
#include <gtest/gtest.h>

#include "analysis/weightTables.h"

// Weights are compared to a thousandth of their size.
static const double RELATIVE = 1e-3;

TEST(WeightTable, ASeventyDecibelToneAtOneKilohertzIsTheReference) {
    const WeightTables& w = weightTables();
    EXPECT_NEAR(loudnessLevelOf70dBTone(1000), 70.0, 1e-9);
    EXPECT_NEAR(w.equalLoudnessWeight[1000], 1.0, 1e-9);
    EXPECT_NEAR(w.loudnessWeight[1000], 1.0, 1e-9) << "(2^3 / 8)^2";
}

TEST(WeightTable, LowTonesWeighLessByTheirLoudnessLevel) {
    const WeightTables& w = weightTables();
    // 100 Hz row: -33.5 + 70 x 1.570 - 4900 x 0.00268 = 63.268 phon.
    EXPECT_NEAR(loudnessLevelOf70dBTone(100), 63.268, 1e-9);
    EXPECT_NEAR(w.equalLoudnessWeight[100], 0.212227, 0.212227 * RELATIVE);
    EXPECT_NEAR(w.loudnessWeight[100], 0.393272, 0.393272 * RELATIVE);
    // 20 Hz row: -5.793 phon.
    EXPECT_NEAR(w.equalLoudnessWeight[20], 2.63451e-8, 2.63451e-8 * RELATIVE);
}

TEST(WeightTable, BetweenRowsTheCoefficientsAreInterpolatedLinearly) {
    // Half-way from 1000 to 1500 Hz: a = 0.7, b = 0.972, c = 0.0003: 70.21 phon.
    EXPECT_NEAR(loudnessLevelOf70dBTone(1250), 70.21, 1e-9);
    EXPECT_NEAR(weightTables().equalLoudnessWeight[1250], 1.049542, 1.049542 * RELATIVE);
}

TEST(WeightTable, TheFadeIsOneAtTheStartingHighestFrequencyAndFavoursLowPartials) {
    const WeightTables& w = weightTables();
    EXPECT_NEAR(w.highFrequencyFade[4300], 1.0, 1e-9);
    EXPECT_NEAR(w.highFrequencyFade[1000], 126.196, 126.196 * RELATIVE);
    for (int f = 39; f < 4300; f += 97) EXPECT_GT(w.highFrequencyFade[f], w.highFrequencyFade[f + 1]) << f << " Hz";
}

TEST(WeightTable, BelowThirtyEightHertzTheFadeIsBoosted) {
    const WeightTables& w = weightTables();
    EXPECT_NEAR(w.highFrequencyFade[38] / w.highFrequencyFade[39], 1.04204, 1.04204 * RELATIVE) << "no boost yet";
    EXPECT_NEAR(w.highFrequencyFade[37] / w.highFrequencyFade[38], 2.08574, 2.08574 * RELATIVE)
        << "2^(40 - 37) x 0.25 = 2 times the curve";
}

TEST(WeightTable, TheTablesReachTheFullBandLimitAndHoldTheirEndsBeyond) {
    const WeightTables& w = weightTables();
    EXPECT_EQ(weightIndex(4999.7), 4999);
    EXPECT_EQ(weightIndex(7000.0), WEIGHT_TABLE_HIGHEST);
    EXPECT_EQ(weightIndex(-3.0), 0);
    // Above the last row (4500 Hz, 78.43 phon) that row holds.
    EXPECT_NEAR(w.equalLoudnessWeight[4800], 6.96627, 6.96627 * RELATIVE);
    EXPECT_EQ(w.equalLoudnessWeight[4800], w.equalLoudnessWeight[4500]);
    EXPECT_EQ(w.loudnessWeight[5], w.loudnessWeight[20]);
    EXPECT_EQ(w.highFrequencyFade[0], w.highFrequencyFade[20]);
}
