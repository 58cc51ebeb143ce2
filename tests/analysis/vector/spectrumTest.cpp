// The averaged power spectrum on signals whose spectra are known by hand: with a
// rectangular window of L = 16 ones, a segment of constant c has the power c^2 in bin 0
// (halved), a cosine of amplitude 1 on bin k puts 1/2 into bin k, and b * (-1)^j puts 2 b^2
// at Nyquist. The scale divides by sum(W^2) * M * specsiz.
#include "analysis/vector/spectrum.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>
#include <vector>

#include "analysis/vector/vectorTable.h"
#include "platform/ui.h"

static const unsigned SPEC_SIZE = 8;
static const unsigned SEGMENT = 2 * SPEC_SIZE;
static const float NOT_A_SAMPLE = std::numeric_limits<float>::quiet_NaN();

class PowerSpectrum : public ::testing::Test {
protected:
    void SetUp() override { clearUiCalls(); }
    void TearDown() override {
        EXPECT_EQ(vectorTable.count, 0) << "the working vector was not freed";
        EXPECT_EQ(messageCount(), 0);
    }
    // Room for the samples, then NaN: a read past xsiz shows up in the result.
    static std::vector<float> samples(unsigned xsiz) { return std::vector<float>(xsiz + SPEC_SIZE, NOT_A_SAMPLE); }
    std::vector<float> spectrum = std::vector<float>(SPEC_SIZE + 1, -1.0f);   // last one is a sentinel
    std::vector<float> ones = std::vector<float>(SEGMENT, 1.0f);
};

TEST_F(PowerSpectrum, OneSegmentWhenThereAreTwiceSpecsizSamples) {
    // 0.5 + cos(2 pi 2 j / 16) + 0.25 * (-1)^j
    std::vector<float> x = samples(SEGMENT);
    for (unsigned j = 0; j < SEGMENT; j++)
        x[j] = float(0.5 + std::cos(2 * std::numbers::pi * 2 * j / SEGMENT) + 0.25 * (j % 2 ? -1 : 1));
    float nyquist = VFp_spectrum(spectrum.data(), SPEC_SIZE, x.data(), SEGMENT, ones.data());
    EXPECT_NEAR(spectrum[0], 0.25, 1e-6);   // 0.5^2
    EXPECT_NEAR(spectrum[2], 0.5, 1e-6);
    for (unsigned k : {1u, 3u, 4u, 5u, 6u, 7u}) EXPECT_NEAR(spectrum[k], 0, 1e-6) << "k " << k;
    EXPECT_NEAR(nyquist, 0.125, 1e-6);      // 2 * 0.25^2
    EXPECT_EQ(spectrum[SPEC_SIZE], -1.0f);
}

TEST_F(PowerSpectrum, ThreeTimesSpecsizAveragesTwoOverlappingSegments) {
    // The window's first half is zero, so segment 0 sees only x[8..15] (all 1) and
    // segment 1 only x[16..23] (all 3). Per segment the DC power is c^2 * 8^2 / (8 * 8):
    // 1 and 9, averaged 5, halved in bin 0.
    std::vector<float> halfWindow(SEGMENT, 0.0f);
    for (unsigned j = SPEC_SIZE; j < SEGMENT; j++) halfWindow[j] = 1;
    std::vector<float> x = samples(3 * SPEC_SIZE);
    for (unsigned j = 0; j < 3 * SPEC_SIZE; j++) x[j] = j < 8 ? 100.0f : j < 16 ? 1.0f : 3.0f;
    float nyquist = VFp_spectrum(spectrum.data(), SPEC_SIZE, x.data(), 3 * SPEC_SIZE, halfWindow.data());
    EXPECT_NEAR(spectrum[0], 2.5, 1e-6);
    EXPECT_NEAR(nyquist, 0, 1e-6);
    // Even bins of a half-length constant vanish.
    for (unsigned k : {2u, 4u, 6u}) EXPECT_NEAR(spectrum[k], 0, 1e-6) << "k " << k;
}

TEST_F(PowerSpectrum, SamplesShortOfTheNextSegmentAreNotRead) {
    // 23 samples hold one segment of 16 and part of a second: only the first is used.
    std::vector<float> x = samples(23);
    for (unsigned j = 0; j < 23; j++) x[j] = 2.0f;
    float nyquist = VFp_spectrum(spectrum.data(), SPEC_SIZE, x.data(), 23, ones.data());
    EXPECT_NEAR(spectrum[0], 4.0, 1e-6);
    EXPECT_NEAR(nyquist, 0, 1e-6);
}

TEST_F(PowerSpectrum, FewerThanOneSegmentGivesAnEmptySpectrum) {
    std::vector<float> x = samples(SEGMENT - 1);
    for (unsigned j = 0; j < SEGMENT - 1; j++) x[j] = 1.0f;
    EXPECT_EQ(VFp_spectrum(spectrum.data(), SPEC_SIZE, x.data(), SEGMENT - 1, ones.data()), 0.0f);
    for (unsigned k = 0; k < SPEC_SIZE; k++) EXPECT_EQ(spectrum[k], 0.0f) << "k " << k;
    EXPECT_EQ(spectrum[SPEC_SIZE], -1.0f);
    EXPECT_EQ(VFp_spectrum(spectrum.data(), SPEC_SIZE, x.data(), 3, ones.data()), 0.0f);
}

TEST_F(PowerSpectrum, HannWindowedSineSpreadsOverThreeBinsScaledByTheWindowEnergy) {
    // sin on bin 4 of 64 points times the periodic Hann window 1/2 - 1/4 (e^{ib} + e^{-ib}):
    // |Y[4]| = 64/4 and |Y[3]| = |Y[5]| = 64/8. With sum W^2 = 64 * 3/8 = 24 and specsiz 32
    // the powers are 256/768 = 1/3 and 64/768 = 1/12; the one-sided total is 1.
    const unsigned specsiz = 32, length = 64;
    std::vector<float> window(length), x(length);
    for (unsigned j = 0; j < length; j++) {
        window[j] = float(0.5 * (1 - std::cos(2 * std::numbers::pi * j / length)));
        x[j] = float(std::sin(2 * std::numbers::pi * 4 * j / length));
    }
    std::vector<float> spc(specsiz);
    float nyquist = VFp_spectrum(spc.data(), specsiz, x.data(), length, window.data());
    EXPECT_NEAR(spc[4], 1.0 / 3, 1e-6);
    EXPECT_NEAR(spc[3], 1.0 / 12, 1e-6);
    EXPECT_NEAR(spc[5], 1.0 / 12, 1e-6);
    double total = 2 * spc[0] + nyquist;
    for (unsigned k = 1; k < specsiz; k++) {
        if (k < 3 || k > 5) {
            EXPECT_NEAR(spc[k], 0, 1e-6) << "k " << k;
        }
        total += 2 * spc[k];
    }
    EXPECT_NEAR(total, 1.0, 1e-5);
}
