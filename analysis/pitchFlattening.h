#pragma once
// Flattening the pitch track towards steady notes: vibrato (the half-cycles of a wavering
// pitch get a steady value) and glissando (a glide into a steady stretch takes the stretch's
// pitch). The recognition pass runs both over the blocks it decides; notePitch runs them over
// a note's blocks. Both rewrite the blocks' dataBuffer pitches and set their blockFlags bits.

#include <cstdint>

// Vibrato: a note is a run of pitched blocks within a semitone of its amplitude-weighted
// geometric mean. Its turning points are the extremes the pitch moves away from by more than
// VIBRATO_HYSTERESIS_SEMITONES; a half-cycle between two of them shorter than
// VIBRATO_HALF_CYCLE_SECONDS that swings by more than VIBRATO_MIN_SWING_SEMITONES is recorded.
constexpr double VIBRATO_HALF_CYCLE_SECONDS = 0.2;
constexpr double VIBRATO_HYSTERESIS_SEMITONES = 0.08;
constexpr double VIBRATO_MIN_SWING_SEMITONES = 0.15;
constexpr int MAX_VIBRATO_HALF_CYCLES = 1024;
// A note with more than two recorded half-cycles gives each of their blocks the half-cycle's
// steady value, the pitch midway (geometrically) between its two turning points, and
// BLOCK_VIBRATO. Blocks [from, end).
void flattenVibrato(uint32_t from, uint32_t end);

// Glissando, walking back from end: a steady stretch (pitches within a semitone of its
// amplitude-weighted geometric mean) and, before it, a glide moving one way from block to
// block with overlapping bands (pitch +- GLIDE_BAND_SHARE x width) and amplitudes above half
// its last one. A glide that spans at least max(2, (its blocks + 1) x block duration x 10)
// semitones into a stretch of at least GLIDE_STEADY_SECONDS takes the stretch's pitch and
// BLOCK_GLISSANDO, and BLOCK_LONG_GLISSANDO too when it lasts more than GLIDE_LONG_SECONDS.
constexpr double GLIDE_BAND_SHARE = 0.7;
constexpr double GLIDE_STEADY_SECONDS = 0.1;
constexpr double GLIDE_LONG_SECONDS = 0.2;
void flattenGlissando(uint32_t from, uint32_t end);
