#pragma once
// The per-block pitch decision of monophonic recognition: the fundamental and its band in
// each block, the smoothing of short octave slips in the bands, and the merge that leaves
// each block's dataBuffer with one entry holding the pitch. The recognition pass calls it
// after the hum scan; the bands live only while it runs.

#include <cstdint>

#include "analysis/recognitionBlocks.h"

// Level limits from a chunk's automatic cut-off level.
constexpr int ENTRY_LEVEL_LIMIT = 40;        // the entry test: a strong candidate reaches max(40, cut-off),
                                             // or half the block's strongest entry in a quieter block
constexpr int BAND_LEVEL_LIMIT = 5;          // band tests: max(5, cut-off / 8)
constexpr double CARRIED_BAND_LIMIT = 0.5;   // band tests of a weak entry its harmonics carry: present at all
// A weak entry with a strong octave is a fundamental when its band holds entries in at least
// 3/5 of the blocks within +-OCTAVE_PRESENCE_SECONDS.
constexpr double OCTAVE_PRESENCE_SECONDS = 0.05;
constexpr uint32_t OCTAVE_PRESENCE_SHARE_MULTIPLE = 3;
constexpr uint32_t OCTAVE_PRESENCE_SHARE_DIVISOR = 5;
// Times of the decision, seconds.
constexpr double CANDIDATE_STRENGTH_SECONDS = 0.02;   // +- span of a candidate's band energy
constexpr double ONSET_AHEAD_SECONDS = 0.2;
constexpr double ONSET_BEHIND_SECONDS = 0.1;
constexpr double ONSET_SECONDS = 0.06;                // dominance this long is an onset
constexpr double ONSET_QUIET_SECONDS = 0.05;          // this long below the band limit ends a look
constexpr double ONSET_DOMINANCE = 1.5;               // over the band energy below the candidate
constexpr double BAND_SMOOTHING_SECONDS = 0.05;       // longest run the smoothing replaces
constexpr int BAND_SMOOTHING_ROUNDS = 4;
constexpr double DROPOUT_BRIDGE_SECONDS = 0.06;       // empty blocks keep the last pitch at amplitude 0
// The reference pitch range of the octave check: the pitches decided over the last
// REFERENCE_SECONDS, from the 5th to the 95th percentile, once REFERENCE_MIN_SECONDS of them exist.
constexpr double REFERENCE_SECONDS = 5.0;
constexpr double REFERENCE_MIN_SECONDS = 0.25;
constexpr double OCTAVE_CHECK_SEMITONES = 12.0;

// A candidate within half a semitone of the last strong one's third harmonic (19.02 semitones
// above) counts for it, like one 10 to 14 semitones above (its octave), when the strong one
// is at least 1/TWELFTH_SHARE as loud.
constexpr double TWELFTH_LOW_SEMITONES = 18.5;
constexpr double TWELFTH_HIGH_SEMITONES = 19.5;
constexpr int TWELFTH_SHARE = 32;
// A step by a factor between r and 2.2 (or the inverse) is an octave slip, r being
// OCTAVE_STEP_RATIO, or LOW_OCTAVE_STEP_RATIO when a frequency is below the low-pitch limit.
constexpr double OCTAVE_STEP_RATIO = 1.8;
constexpr double LOW_OCTAVE_STEP_RATIO = 1.4;
constexpr double OCTAVE_STEP_LIMIT = 2.2;
// 1 when going from frequency a to b is such a step.
int isOctaveStep(double a, double b);

// Decides the pitch of every block of [pass.finalBlock, pass.endBlock): the fundamental and
// its band, the smoothing of the bands, and the merge into one dataBuffer entry (or none, or
// a zero-amplitude stand-in across a dropout of at most DROPOUT_BRIDGE_SECONDS). The blocks'
// dataBuffers must hold the analysis' entries (the pass restores them first).
void decideBlockPitches(const RecognitionPass& pass);
