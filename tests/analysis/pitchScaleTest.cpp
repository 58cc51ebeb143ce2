// The pitch scale: frequencies to semitone numbers and back, the nearest semitone that
// becomes a note's midiNote, half-semitones for recognition, their limits and bad input.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "analysis/pitchScale.h"

static const double NOT_A_NUMBER = std::numeric_limits<double>::quiet_NaN();
static const double INFINITE = std::numeric_limits<double>::infinity();
// Semitone numbers are compared to a thousandth of a semitone (a tenth of a cent).
static const double SEMITONE_TOLERANCE = 1e-3;
// Frequencies are compared to a millionth of their size.
static const double RELATIVE_TOLERANCE = 1e-6;

TEST(PitchScaleConversions, MiddleAIsSixtyNineAndOctavesAreTwelveSemitones) {
    EXPECT_DOUBLE_EQ(frequencyToPitch(440.0), 69.0);
    EXPECT_DOUBLE_EQ(frequencyToPitch(880.0), 81.0);
    EXPECT_DOUBLE_EQ(frequencyToPitch(220.0), 57.0);
    EXPECT_DOUBLE_EQ(frequencyToPitch(13.75), 9.0);
    EXPECT_NEAR(frequencyToPitch(450.0), 69.389, SEMITONE_TOLERANCE);
}

TEST(PitchScaleConversions, AnInstrumentsOwnMiddleAMovesTheScale) {
    EXPECT_DOUBLE_EQ(frequencyToPitch(432.0, 432.0), 69.0);
    EXPECT_NEAR(frequencyToPitch(440.0, 432.0), 69.318, SEMITONE_TOLERANCE);
    EXPECT_NEAR(pitchToFrequency(69.0, 432.0), 432.0, 432.0 * RELATIVE_TOLERANCE);
    EXPECT_EQ(frequencyToSemitone(445.0, 432.0), 70) << "69.513 with A = 432 Hz";
    EXPECT_EQ(frequencyToSemitone(445.0), 69) << "69.196 with A = 440 Hz";
}

TEST(PitchScaleConversions, SemitoneNumbersGoBackToFrequenciesFractionsIncluded) {
    EXPECT_NEAR(pitchToFrequency(69.0), 440.0, 440.0 * RELATIVE_TOLERANCE);
    EXPECT_NEAR(pitchToFrequency(81.0), 880.0, 880.0 * RELATIVE_TOLERANCE);
    EXPECT_NEAR(pitchToFrequency(9.0), 13.75, 13.75 * RELATIVE_TOLERANCE);
    EXPECT_NEAR(pitchToFrequency(69.5), 452.893, 452.893 * RELATIVE_TOLERANCE);
    EXPECT_NEAR(pitchToFrequency(-3.0), 6.875, 6.875 * RELATIVE_TOLERANCE);
}

TEST(PitchScaleConversions, PitchesBelowTheScaleGiveZeroAndAboveItTwoFiftyFive) {
    EXPECT_EQ(frequencyToPitch(8.0), 0.0) << "semitone -0.376";
    EXPECT_NEAR(frequencyToPitch(8.5), 0.673, SEMITONE_TOLERANCE);
    EXPECT_NEAR(frequencyToPitch(2.0e7), 254.666, SEMITONE_TOLERANCE);
    EXPECT_EQ(frequencyToPitch(3.0e7), 255.0) << "semitone 261.7";
}

TEST(PitchScaleConversions, ZeroNegativeAndUndefinedFrequenciesGiveZero) {
    EXPECT_EQ(frequencyToPitch(0.0), 0.0);
    EXPECT_EQ(frequencyToPitch(-440.0), 0.0);
    EXPECT_EQ(frequencyToPitch(NOT_A_NUMBER), 0.0);
    EXPECT_EQ(frequencyToPitch(INFINITE), 255.0);
    EXPECT_EQ(frequencyToSemitone(0.0), 0);
    EXPECT_EQ(frequencyToSemitone(-440.0), 0);
    EXPECT_EQ(frequencyToSemitone(NOT_A_NUMBER), 0);
    EXPECT_EQ(frequencyToSemitone(INFINITE), 255);
}

TEST(PitchScaleSemitone, FrequenciesGoToTheNearestSemitone) {
    EXPECT_EQ(frequencyToSemitone(440.0), 69);
    EXPECT_EQ(frequencyToSemitone(466.16), 70) << "69.99986";
    EXPECT_EQ(frequencyToSemitone(450.0), 69) << "69.389";
    EXPECT_EQ(frequencyToSemitone(452.8), 69) << "69.4964";
    EXPECT_EQ(frequencyToSemitone(453.0), 70) << "69.5041";
    EXPECT_EQ(frequencyToSemitone(8.5), 1) << "0.673";
}

TEST(PitchScaleSemitone, SemitonesAreLimitedToZeroAndTwoFiftyFive) {
    EXPECT_EQ(frequencyToSemitone(8.0), 0);
    EXPECT_EQ(frequencyToSemitone(2.0e7), 255) << "254.666 rounds to the top";
    EXPECT_EQ(frequencyToSemitone(3.0e7), 255);
}

TEST(PitchScaleSemitone, AnExactHalfRoundsUp) {
    EXPECT_EQ(roundSemitone(69.5), 70);
    EXPECT_EQ(roundSemitone(68.5), 69);
    EXPECT_EQ(roundSemitone(0.5), 1);
    EXPECT_EQ(roundSemitone(254.5), 255);
}

TEST(PitchScaleSemitone, JustBelowAHalfRoundsDownAndJustBelowAWholeRoundsUp) {
    EXPECT_EQ(roundSemitone(69.499), 69);
    EXPECT_EQ(roundSemitone(69.0), 69);
    EXPECT_EQ(roundSemitone(68.999), 69);
    EXPECT_EQ(roundSemitone(0.49), 0);
}

TEST(PitchScaleSemitone, RoundedPitchesAreLimitedAndUndefinedOnesGiveZero) {
    EXPECT_EQ(roundSemitone(255.0), 255);
    EXPECT_EQ(roundSemitone(300.0), 255);
    EXPECT_EQ(roundSemitone(-2.0), 0);
    EXPECT_EQ(roundSemitone(NOT_A_NUMBER), 0);
    EXPECT_EQ(roundSemitone(INFINITE), 255);
}

TEST(PitchScaleHalfSemitone, FrequenciesGiveTwiceTheirSemitoneNumber) {
    EXPECT_EQ(frequencyToHalfSemitone(440.0), 138);
    EXPECT_EQ(frequencyToHalfSemitone(880.0), 162);
    EXPECT_EQ(frequencyToHalfSemitone(13.75), 18);
    EXPECT_EQ(frequencyToHalfSemitone(452.893), 139) << "semitone 69.5";
    EXPECT_EQ(frequencyToHalfSemitone(432.0, 432.0), 138);
}

TEST(PitchScaleHalfSemitone, PitchesBelowTheScaleAreNotLimited) {
    EXPECT_EQ(frequencyToHalfSemitone(1.71875), -54) << "three octaves below 13.75 Hz: semitone -27";
    EXPECT_EQ(frequencyToHalfSemitone(4.0e7), 534) << "semitone 266.67";
}

TEST(PitchScaleHalfSemitone, QuartersRoundToEvenThenOddValuesHalveUpwards) {
    EXPECT_EQ(roundHalfSemitone(69.0), 138);
    EXPECT_EQ(roundHalfSemitone(69.1), 138) << "276.4 quarters";
    EXPECT_EQ(roundHalfSemitone(69.125), 138) << "276.5 quarters: the tie goes to 276";
    EXPECT_EQ(roundHalfSemitone(69.2), 139) << "276.8 quarters round to 277, halved upwards";
    EXPECT_EQ(roundHalfSemitone(69.375), 139) << "277.5 quarters: the tie goes to 278";
    EXPECT_EQ(roundHalfSemitone(69.5), 139);
    EXPECT_EQ(roundHalfSemitone(69.75), 140);
}

TEST(PitchScaleHalfSemitone, NegativePitchesHalveUpwardsToo) {
    EXPECT_EQ(roundHalfSemitone(-1.0), -2);
    EXPECT_EQ(roundHalfSemitone(-0.75), -1) << "-3 quarters";
    EXPECT_EQ(roundHalfSemitone(-0.625), -1) << "-2.5 quarters: the tie goes to -2";
}

TEST(PitchScaleHalfSemitone, ZeroNegativeAndUndefinedFrequenciesGiveZero) {
    EXPECT_EQ(frequencyToHalfSemitone(0.0), 0);
    EXPECT_EQ(frequencyToHalfSemitone(-440.0), 0);
    EXPECT_EQ(frequencyToHalfSemitone(NOT_A_NUMBER), 0);
    EXPECT_EQ(frequencyToHalfSemitone(INFINITE), 0);
    EXPECT_EQ(frequencyToHalfSemitone(440.0, 0.0), 0) << "no middle A";
    EXPECT_EQ(roundHalfSemitone(NOT_A_NUMBER), 0);
}
