// The pitch scale: frequencies to semitone numbers and back, the nearest semitone that
// becomes a note's midiNote, half-semitones for recognition, their limits and bad input.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <tuple>

#include "analysis/pitchScale.h"

static const double NOT_A_NUMBER = std::numeric_limits<double>::quiet_NaN();
static const double INFINITE = std::numeric_limits<double>::infinity();
// Semitone numbers are compared to a thousandth of a semitone (a tenth of a cent).
static const double SEMITONE_TOLERANCE = 1e-3;
// Frequencies are compared to a millionth of their size.
static const double RELATIVE_TOLERANCE = 1e-6;

// Middle A is 69 and octaves are twelve semitones (an instrument's own middle A moves the
// scale); pitches below the scale give 0 and above it 255, as do zero, negative and undefined
// frequencies (0) and an infinite one (255). The nearest semitone is a note's midiNote.
TEST(PitchScaleConversions, FrequenciesGiveTheirSemitoneNumbersWithinTheScale) {
    const std::tuple<double, double, double, int> cases[] = {
        // frequency, middle A, semitone number, nearest semitone
        {440.0, 440.0, 69.0, 69},      {880.0, 440.0, 81.0, 81},       {220.0, 440.0, 57.0, 57},
        {13.75, 440.0, 9.0, 9},        {450.0, 440.0, 69.389, 69},     {432.0, 432.0, 69.0, 69},
        {440.0, 432.0, 69.318, 69},    {445.0, 432.0, 69.513, 70},     {445.0, 440.0, 69.196, 69},
        {466.16, 440.0, 69.99986, 70}, {452.8, 440.0, 69.4964, 69},    {453.0, 440.0, 69.5041, 70},
        {8.0, 440.0, 0.0, 0},          {8.5, 440.0, 0.673, 1},         {2.0e7, 440.0, 254.666, 255},
        {3.0e7, 440.0, 255.0, 255},    {0.0, 440.0, 0.0, 0},           {-440.0, 440.0, 0.0, 0},
        {NOT_A_NUMBER, 440.0, 0.0, 0}, {INFINITE, 440.0, 255.0, 255}};
    for (auto [frequency, middleA, pitch, semitone] : cases) {
        EXPECT_NEAR(frequencyToPitch(frequency, middleA), pitch, SEMITONE_TOLERANCE) << frequency;
        EXPECT_EQ(frequencyToSemitone(frequency, middleA), semitone) << frequency;
    }
}

TEST(PitchScaleConversions, SemitoneNumbersGoBackToFrequenciesFractionsIncluded) {
    const std::tuple<double, double, double> cases[] = {{69.0, 440.0, 440.0},   {81.0, 440.0, 880.0},
                                                        {9.0, 440.0, 13.75},    {69.5, 440.0, 452.893},
                                                        {-3.0, 440.0, 6.875},   {69.0, 432.0, 432.0}};
    for (auto [pitch, middleA, frequency] : cases)
        EXPECT_NEAR(pitchToFrequency(pitch, middleA), frequency, frequency * RELATIVE_TOLERANCE) << pitch;
}

// An exact half rounds up, just below a half down; rounded pitches are limited to 0 .. 255
// and undefined ones give 0.
TEST(PitchScaleSemitone, PitchesRoundToTheNearestSemitoneWithinTheScale) {
    const std::pair<double, int> cases[] = {{69.5, 70},    {68.5, 69},  {0.5, 1},      {254.5, 255},
                                            {69.499, 69},  {69.0, 69},  {68.999, 69},  {0.49, 0},
                                            {255.0, 255},  {300.0, 255}, {-2.0, 0},    {NOT_A_NUMBER, 0},
                                            {INFINITE, 255}};
    for (auto [pitch, semitone] : cases) EXPECT_EQ(roundSemitone(pitch), semitone) << pitch;
}

// Frequencies give twice their semitone number, not limited below or above the scale; zero,
// negative and undefined frequencies, or no middle A, give 0.
TEST(PitchScaleHalfSemitone, FrequenciesGiveTwiceTheirSemitoneNumber) {
    const std::tuple<double, double, int> cases[] = {
        {440.0, 440.0, 138}, {880.0, 440.0, 162},  {13.75, 440.0, 18},        {452.893, 440.0, 139},
        {432.0, 432.0, 138}, {1.71875, 440.0, -54}, {4.0e7, 440.0, 534},      {0.0, 440.0, 0},
        {-440.0, 440.0, 0},  {NOT_A_NUMBER, 440.0, 0}, {INFINITE, 440.0, 0}, {440.0, 0.0, 0}};
    for (auto [frequency, middleA, half] : cases) EXPECT_EQ(frequencyToHalfSemitone(frequency, middleA), half) << frequency;
}

// Quarters round to even, then odd values halve upwards, negative ones too.
TEST(PitchScaleHalfSemitone, QuartersRoundToEvenThenOddValuesHalveUpwards) {
    const std::pair<double, int> cases[] = {
        {69.0, 138},   {69.1, 138},   // 276.4 quarters
        {69.125, 138},                 // 276.5 quarters: the tie goes to 276
        {69.2, 139},                   // 276.8 quarters round to 277, halved upwards
        {69.375, 139},                 // 277.5 quarters: the tie goes to 278
        {69.5, 139},   {69.75, 140},  {-1.0, -2},   {-0.75, -1},   // -3 quarters
        {-0.625, -1},                  // -2.5 quarters: the tie goes to -2
        {NOT_A_NUMBER, 0}};
    for (auto [pitch, half] : cases) EXPECT_EQ(roundHalfSemitone(pitch), half) << pitch;
}
