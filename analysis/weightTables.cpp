// The weight tables from the equal-loudness rows: the loudness level of a 70 dB tone is
// a + 70 b + 4900 c, with a, b and c taken between the two rows that bracket the frequency.
#include "analysis/weightTables.h"

#include <cmath>

struct EqualLoudnessRow {
    double frequency;   // Hz
    double a;           // phon
    double b;           // phon per dB
    double c;           // phon per dB^2
};

static const EqualLoudnessRow EQUAL_LOUDNESS_ROWS[] = {
    {20, -217.2, 3.669, -0.00927}, {25, -167.2, 3.145, -0.00782}, {30, -135.7, 2.801, -0.00677},
    {35, -113.2, 2.538, -0.00589}, {40, -96.3, 2.326, -0.00514},  {45, -83.2, 2.155, -0.00454},
    {50, -73.0, 2.021, -0.00408},  {55, -65.1, 1.917, -0.00371},  {60, -58.7, 1.835, -0.00343},
    {70, -49.1, 1.722, -0.00305},  {80, -42.5, 1.652, -0.00285},  {90, -37.4, 1.603, -0.00275},
    {100, -33.5, 1.570, -0.00268}, {120, -27.0, 1.512, -0.00260}, {140, -22.7, 1.473, -0.00255},
    {160, -19.4, 1.444, -0.00249}, {180, -16.9, 1.422, -0.00245}, {200, -14.7, 1.404, -0.00241},
    {250, -10.8, 1.362, -0.00230}, {300, -8.1, 1.325, -0.00218},  {350, -6.1, 1.290, -0.00204},
    {400, -4.7, 1.259, -0.00188},  {600, -1.8, 1.155, -0.00116},  {800, -0.5, 1.064, -0.00048},
    {1000, 0.0, 1.000, 0.0},       {1500, 1.4, 0.944, 0.00060},   {2000, 3.3, 0.924, 0.00100},
    {2500, 5.3, 0.928, 0.00118},   {3000, 6.9, 0.937, 0.00120},   {3500, 7.9, 0.946, 0.00113},
    {4000, 7.9, 0.954, 0.00098},   {4500, 7.1, 0.963, 0.00080},
};
static const int ROW_COUNT = sizeof EQUAL_LOUDNESS_ROWS / sizeof EQUAL_LOUDNESS_ROWS[0];

static const double TONE_LEVEL = 70.0;            // dB of the tone the rows describe
static const double LOW_BOOST_LIMIT = 38.0;       // Hz: below it the fade is boosted
static const double LOW_BOOST_CENTRE = 40.0;      // Hz: the boost is 2^(40 - f) x 0.25

double loudnessLevelOf70dBTone(double frequency) {
    const EqualLoudnessRow* low = &EQUAL_LOUDNESS_ROWS[0];
    const EqualLoudnessRow* high = low;
    if (frequency >= EQUAL_LOUDNESS_ROWS[ROW_COUNT - 1].frequency) {
        low = high = &EQUAL_LOUDNESS_ROWS[ROW_COUNT - 1];
    } else if (frequency > low->frequency) {
        int k = 0;
        while (EQUAL_LOUDNESS_ROWS[k + 1].frequency <= frequency) k++;
        low = &EQUAL_LOUDNESS_ROWS[k];
        high = &EQUAL_LOUDNESS_ROWS[k + 1];
    }
    double t = high == low ? 0.0 : (frequency - low->frequency) / (high->frequency - low->frequency);
    double a = low->a + t * (high->a - low->a);
    double b = low->b + t * (high->b - low->b);
    double c = low->c + t * (high->c - low->c);
    return a + TONE_LEVEL * b + TONE_LEVEL * TONE_LEVEL * c;
}

int weightIndex(double frequency) {
    if (!(frequency > 0)) return 0;
    if (frequency >= WEIGHT_TABLE_HIGHEST) return WEIGHT_TABLE_HIGHEST;
    return int(frequency);
}

static double fadeExponent(double frequency) {
    double decades = std::log10(frequency);
    return 0.5 * decades * decades;
}

// The tables run up to the full-band limit rather than stopping at 4449 Hz, because block
// loudness sums fine bins up to 5000 Hz; above the last equal-loudness row (4500 Hz) that
// row holds. Below 20 Hz the 20 Hz entry holds: no fine bin of any pitch range lies there.
static void buildWeightTables(WeightTables* t) {
    double top = fadeExponent(HIGH_FREQUENCY_FADE_TOP);
    for (int f = WEIGHT_TABLE_LOWEST; f <= WEIGHT_TABLE_HIGHEST; f++) {
        double phon = loudnessLevelOf70dBTone(f);
        t->equalLoudnessWeight[f] = std::pow(10.0, (phon - TONE_LEVEL) / 10.0);
        double loudness = std::exp2((phon - 40.0) / 10.0) / 8.0;
        t->loudnessWeight[f] = loudness * loudness;
        double fade = std::pow(10.0, top - fadeExponent(f));
        if (f < LOW_BOOST_LIMIT) fade *= std::exp2(LOW_BOOST_CENTRE - f) * 0.25;
        t->highFrequencyFade[f] = fade;
    }
    for (int f = 0; f < WEIGHT_TABLE_LOWEST; f++) {
        t->equalLoudnessWeight[f] = t->equalLoudnessWeight[WEIGHT_TABLE_LOWEST];
        t->loudnessWeight[f] = t->loudnessWeight[WEIGHT_TABLE_LOWEST];
        t->highFrequencyFade[f] = t->highFrequencyFade[WEIGHT_TABLE_LOWEST];
    }
}

const WeightTables& weightTables() {
    struct Built {
        WeightTables tables;
        Built() { buildWeightTables(&tables); }
    };
    static const Built built;
    return built.tables;
}
