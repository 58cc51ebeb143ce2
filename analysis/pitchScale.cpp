// Conversions between frequencies and the pitch scale. The scale is anchored at the middle A
// (semitone 69), while the analysis's pitch bins are anchored at 1 Hz; only these functions
// relate the two.
#include "analysis/pitchScale.h"

#include <cmath>

// Beyond this many quarter-semitones a pitch is meaningless; the bound keeps the conversion
// to an integer defined for any finite input.
static const double QUARTER_SEMITONE_LIMIT = 1.0e9;

static double unlimitedPitch(double frequency, double middleA) {
    return 12.0 * std::log2(32.0 * frequency / middleA) + 9.0;
}

double frequencyToPitch(double frequency, double middleA) {
    double pitch = unlimitedPitch(frequency, middleA);
    // log2 of 0 is minus infinity and of a negative number not a number: both give 0.
    if (!(pitch >= 0.0)) return 0.0;
    if (pitch > MAX_SEMITONE) return MAX_SEMITONE;
    return pitch;
}

double pitchToFrequency(double pitch, double middleA) {
    return middleA / 32.0 * std::exp2((pitch - 9.0) / 12.0);
}

int roundSemitone(double pitch) {
    if (!(pitch >= 0.0)) return 0;
    if (pitch > MAX_SEMITONE) return MAX_SEMITONE;
    int twice = int(2.0 * pitch);
    if (twice % 2) twice++;
    return twice / 2;
}

int frequencyToSemitone(double frequency, double middleA) {
    return roundSemitone(frequencyToPitch(frequency, middleA));
}

// Nearest integer, an exact half going to the even neighbour; written out so that it does
// not depend on the floating-point rounding mode in force.
static double roundHalfEven(double x) {
    double below = std::floor(x);
    double fraction = x - below;
    if (fraction > 0.5) return below + 1.0;
    if (fraction < 0.5) return below;
    return std::fmod(below, 2.0) == 0.0 ? below : below + 1.0;
}

int roundHalfSemitone(double pitch) {
    if (!std::isfinite(pitch)) return 0;
    double quarters = 4.0 * pitch;
    if (quarters > QUARTER_SEMITONE_LIMIT) quarters = QUARTER_SEMITONE_LIMIT;
    if (quarters < -QUARTER_SEMITONE_LIMIT) quarters = -QUARTER_SEMITONE_LIMIT;
    int rounded = int(roundHalfEven(quarters));
    // Halved rounding up; for negative values too, -3 quarters halve to -1.
    return rounded % 2 ? (rounded + 1) / 2 : rounded / 2;
}

int frequencyToHalfSemitone(double frequency, double middleA) {
    if (!(frequency > 0.0)) return 0;
    return roundHalfSemitone(unlimitedPitch(frequency, middleA));
}

const double* noteFrequencyTable() {
    struct Table {
        double frequencies[NOTE_FREQUENCY_COUNT];   // Hz
        Table() {
            for (int i = 0; i < NOTE_FREQUENCY_COUNT; i++) frequencies[i] = 13.75 * std::exp2((i - 9) / 12.0);
        }
    };
    static const Table table;   // built on first use; thread safe
    return table.frequencies;
}
