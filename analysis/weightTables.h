#pragma once
// The frequency weights of frequency table creation, indexed by whole Hz: an equal-loudness
// estimate (a 70 dB tone's loudness level relative to 1 kHz) that weighs the pitch map, the
// loudness weight of the block loudness, and the fade that favours low partials over their
// harmonics. Built once, on first use, and shared by every analysis.

constexpr int WEIGHT_TABLE_LOWEST = 20;     // Hz: lower frequencies take this entry
constexpr int WEIGHT_TABLE_HIGHEST = 5000;  // Hz: the full-band limit, up to which block loudness sums
constexpr double HIGH_FREQUENCY_FADE_TOP = 4300.0;   // Hz: the highest frequency the program starts with

struct WeightTables {
    double equalLoudnessWeight[WEIGHT_TABLE_HIGHEST + 1];   // 10^((phon - 70) / 10)
    double loudnessWeight[WEIGHT_TABLE_HIGHEST + 1];        // (2^((phon - 40) / 10) / 8)^2
    double highFrequencyFade[WEIGHT_TABLE_HIGHEST + 1];     // 10^(0.5 log10(4300)^2) / 10^(0.5 log10(f)^2), boosted below 38 Hz
};

// The tables, built on first use (thread safe).
const WeightTables& weightTables();

// The loudness level, phon, of a 70 dB tone at frequency (the equal-loudness rows
// interpolated linearly; outside 20..4500 Hz the end rows hold).
double loudnessLevelOf70dBTone(double frequency);

// The table index of a frequency: its whole Hz, kept within 0..WEIGHT_TABLE_HIGHEST.
int weightIndex(double frequency);
