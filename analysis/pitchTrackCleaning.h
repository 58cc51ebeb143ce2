#pragma once
// The passes that clean a decided pitch track (one dataBuffer entry per block): sibilants
// appended to the notes beside them, octave excursions folded back, the detected frequencies
// written, and the cleaning after the flattening: weak runs removed, phrases fitted to the
// semitone grid, short dropouts bridged. The recognition pass calls them in that order over the
// blocks it decides; each changes only the blocks [from, end) it is given.

#include <cstddef>
#include <cstdint>

// Sibilant rows: the magnitudes above this split and below twice it, against those below it.
constexpr double SIBILANT_SPLIT_HZ = 3300.0;
constexpr double SIBILANT_HIGH_LIMIT_HZ = 6600.0;
constexpr uint32_t SIBILANT_MIN_HIGH_BAND = 1024;
// A spectrogram row is a sibilant ("SSS") row: its high band is at least SIBILANT_MIN_HIGH_BAND
// and greater than its low band. magnitudes holds count values, magnitude i at (i + 1) x
// binWidth Hz; the first three are left out of both bands.
int isSibilantRow(const uint32_t* magnitudes, uint32_t count, double binWidth);
// Only rows whose high band is at least SIBILANT_FLOOR_FACTOR times the background's (the
// SIBILANT_FLOOR_PERCENT-th percentile of the pass's rows) count: steady hiss is no consonant.
constexpr uint64_t SIBILANT_FLOOR_FACTOR = 4;
constexpr size_t SIBILANT_FLOOR_PERCENT = 10;
// Runs of unpitched sibilant blocks right after a note take its pitch when as many blocks
// before the run hold that pitch within two semitones; failing that, runs right before a note
// take the pitch of the note after them on the same condition.
void appendSibilants(uint32_t from, uint32_t end);

// A run between two octave jumps shorter than OCTAVE_JUMP_SECONDS and than a third of the run
// before it, whose far side comes back within two semitones of the pitch before it, is moved
// by the ratio at its first jump. Runs are followed from first (the blocks before from are
// read, not changed); an unpitched stretch longer than DROPOUT_BRIDGE_SECONDS ends them.
constexpr double OCTAVE_JUMP_SECONDS = 0.25;
void correctOctaveJumps(uint32_t first, uint32_t from, uint32_t end);

// Writes each block's detectedFrequenciesBuffer: its pitch, the pitch spread in semitones of
// its width, its amplitude; a block without a pitch repeats the block before.
void writeDetectedFrequencies(uint32_t from, uint32_t end);

// Runs (pitches within a semitone of the run's mean, ended by an unpitched block, a pitch
// outside that window or a syllable start) whose largest amplitude is below half the cut-off
// level lose their entries.
void removeLowAmplitudeNotes(uint32_t from, uint32_t end);
// Each phrase (pitched blocks up to a gap of PHRASE_GAP_SECONDS) is moved by the multiple of a
// sixteenth semitone, -7/16 .. 7/16, that brings its pitches closest to the semitone grid
// (A = 440 Hz), sampled every PHRASE_SAMPLE_SECONDS.
constexpr double PHRASE_GAP_SECONDS = 0.1;
constexpr double PHRASE_SAMPLE_SECONDS = 0.02;
void fitPhrasesToSemitones(uint32_t from, uint32_t end);
// Where the track goes from one note (A) to another (B), directly or across a dropout of at
// most DROPOUT_FILL_SECONDS, the boundary moves to the first block from which B's partial is
// the stronger (in two blocks running), within TRANSITION_REACH_SECONDS of either side: the
// pitch decision keeps a fading lower note while it still dominates what lies below it.
// Notes a semitone apart or less, or whose pitches could be harmonics of each other, keep
// their boundary.
constexpr double TRANSITION_REACH_SECONDS = 0.06;
// ... moved back, over at most TRANSITION_RISE_SECONDS of A's end, across the blocks where B's
// partial already sounds while A's fades (lies below FADE_SHARE quarters of its peak over the
// TRANSITION_PEAK_SECONDS before), or sounds at least 1/TRANSITION_RISE_SHARE of A's.
constexpr int TRANSITION_RISE_SHARE = 2;
constexpr double TRANSITION_RISE_SECONDS = 0.1;
constexpr double TRANSITION_PEAK_SECONDS = 0.06;
constexpr double FADE_SHARE = 3.0;
void sharpenTransitions(uint32_t from, uint32_t end);
// A dropout of at most DROPOUT_FILL_SECONDS between two pitches within a semitone of each other,
// with no syllable starting in it or right after it, is filled with the pitch gliding between
// them at the quieter side's amplitude: the analysis loses a partial for a block or two at a
// quiet moment, and a note would otherwise fall apart there.
constexpr double DROPOUT_FILL_SECONDS = 0.035;
void bridgeShortDropouts(uint32_t from, uint32_t end);

// The spectrogram row whose hop holds the middle of each block of [from, end), -1 where the
// spectrogram holds none; rows has end - from values afterwards. The sibilant and syllable
// passes read the spectrogram through it.
void spectrogramRowsOfBlocks(uint32_t from, uint32_t end, int* rows);
