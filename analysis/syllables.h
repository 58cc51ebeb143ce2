#pragma once
// Syllable starts: where a sung line re-articulates, found from the magnitude spectrogram and
// marked in the blocks' flags (BLOCK_SYLLABLE_START), so that the cleaning passes end runs there
// and note building splits notes there. The recognition pass calls findSyllables; the
// syllable list of the last pass is kept until the next one or until released.

#include <cstdint>
#include <vector>

// Syllable cues of the spectrogram rows.
constexpr double SYLLABLE_SPLIT_LIMIT_HZ = 3000.0;      // the brightness split: twice the fundamental, at most this
constexpr double SYLLABLE_BRIGHT_PITCH_HZ = 524.0;      // fundamentals above it scale the ratio down
constexpr double SYLLABLE_ESTIMATE_SECONDS = 0.02;      // the fundamental estimate is refreshed at most this often
constexpr double SYLLABLE_DEFAULT_PITCH_HZ = 200.0;     // estimate before any pitch is known
constexpr float SYLLABLE_SPIKE_THRESHOLD = 0.6666667f;  // the robust maximum of the row totals
// A row's loudness: its magnitudes from the fourth bin up to SYLLABLE_LOUDNESS_LIMIT_HZ, where
// a voice has its harmonics and formants. Hiss spreads evenly up to half the sample rate, and
// summed over the whole row it fills in the dips the voice makes.
constexpr double SYLLABLE_LOUDNESS_LIMIT_HZ = 5000.0;
// Energy dips: a valley of the row totals (smoothed over three rows) whose loudness on both
// sides, within DIP_REACH_SECONDS, is at least DIP_DEPTH times the valley (6 dB: a voiced
// consonant such as l, m or n between two vowels, or a re-attacked note) and at least
// DIP_MIN_LEVEL of the robust maximum starts a syllable where the loudness fell through the
// middle (in level) between the loudness before and the valley: the singer starts the new
// syllable as the old vowel ends, not at the quietest point of the consonant.
constexpr double DIP_REACH_SECONDS = 0.15;
constexpr double DIP_DEPTH = 2.0;
constexpr double DIP_MIN_LEVEL = 0.1;
// Consonants ("CS Detect syllables"): a peak of the brightness ratio of at least 0.3, reached
// from a ratio 0.1 lower within 0.2 s before it (or 0.07 lower after a stretch flat to within
// 0.01 for 0.03 s) and falling away the same way after it, starts a syllable where the ratio
// has fallen back.
constexpr double CONSONANT_MIN_RATIO = 0.3;
constexpr double CONSONANT_RISE = 0.1;
constexpr double CONSONANT_FLAT_RISE = 0.07;
constexpr double CONSONANT_FLAT_CHANGE = 0.01;
constexpr double CONSONANT_FLAT_SECONDS = 0.03;
constexpr double CONSONANT_REACH_SECONDS = 0.2;
// ... and whose row is at most CONSONANT_QUIETER of the loudest row within
// CONSONANT_LOUDNESS_SECONDS before it and of the loudest within as long after it.
constexpr double CONSONANT_QUIETER = 0.5;
constexpr double CONSONANT_LOUDNESS_SECONDS = 0.1;
// Vowel changes ("CS Detect syllables"): a voiced consonant (l, m, n) between two vowels barely
// dips the loudness, but the vowels on its two sides differ. Each row's spectrum is summed
// into third-octave bands from VOWEL_LOWEST_BAND_HZ up (VOWEL_BANDS of them) and taken in dB
// relative to the row's mean band level: the row's colour. A row where the mean colour over
// VOWEL_SIDE_SECONDS after it differs from the mean colour over as long before it by at least
// VOWEL_CHANGE_DB (averaged over the bands), more than at the rows beside it, while the
// loudness there lies at least VOWEL_DIP_DB below the loudest row on each side, starts a
// syllable.
constexpr double VOWEL_LOWEST_BAND_HZ = 150.0;
constexpr int VOWEL_BANDS = 15;
constexpr double VOWEL_SIDE_SECONDS = 0.05;
constexpr double VOWEL_CHANGE_DB = 5.0;
constexpr double VOWEL_DIP_DB = 1.0;
// Two syllable starts are at least this far apart; the earlier one stands. A syllable opening
// on a voiced consonant changes colour twice, into the consonant and out of it into the vowel
// some 0.1 s later; only the first is the syllable's start.
constexpr double SYLLABLE_MIN_SPACING_SECONDS = 0.15;

struct Syllables {
    std::vector<uint32_t> startBlocks;   // blocks where the last pass found a syllable start, ascending
};
extern Syllables syllables;

// Clears BLOCK_SYLLABLE_START over the blocks of [from, end) the spectrogram covers (in the
// dataBuffers and the origDataBuffers), finds the syllable starts there and sets the bit on
// their blocks. Blocks the spectrogram no longer covers keep the starts found before.
void findSyllables(uint32_t from, uint32_t end);
// Forgets the syllable list.
void releaseSyllables();

// The brightness ratio of one row: the magnitude above the split (twice fundamental, at most
// SYLLABLE_SPLIT_LIMIT_HZ) over the magnitude below it, or the magnitude above alone when
// nothing lies below, divided by fundamental / 524 when fundamental is 524 Hz or more. The
// first three magnitudes are left out; magnitude i lies at (i + 1) x binWidth Hz.
double brightnessRatio(const uint32_t* magnitudes, uint32_t count, double binWidth, double fundamental);
// One row's colour: its level in each of the VOWEL_BANDS third-octave bands, dB (20 log10 of the
// band's summed magnitude + 1), less the mean of those levels; *loudness (when given) gets the
// row's level over all the bands, dB.
std::vector<double> rowColour(const uint32_t* magnitudes, uint32_t count, double binWidth, double* loudness = nullptr);
