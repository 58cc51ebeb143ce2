#pragma once
// The clean-up filters of polyphonic recognition: passes over a chunk's pitch map (level
// bytes, block after block) that take away what is not a note: weak levels, steady bass
// noise and hum, the noise and leftovers around attacks, the skirts around spectral peaks,
// one-block blips, fading tails and the overlap where one note hands over to the next.
// createFrequencyTable runs them only with monophonic recognition off, in a fixed order;
// each works on one chunk, so nothing reaches across a chunk's edge.

#include <cstdint>

// A chunk's levels: blocks rows of bins bytes, and a scratch row set of the same size.
struct PitchMapView {
    uint8_t* levels;    // blocks x bins level bytes, block after block
    uint8_t* scratch;   // blocks x bins bytes the filters may overwrite
    uint32_t blocks;    // rows
    int bins;           // pitch bins per row
};

// Pitch bins whose centre lies below this are bass for the bass noise and hum filter.
constexpr double BASS_NOISE_LIMIT = 250.0;   // Hz
// A block whose summed levels exceed this many times the previous block's is an attack.
constexpr int ATTACK_RISE = 2;
// Blocks after an attack in which a partial must go on to count as part of the note.
constexpr uint32_t ATTACK_CONFIRM_BLOCKS = 2;
// Blocks an old note may overlap a new one before the overlap counts as a join.
constexpr uint32_t NOTE_JOIN_BLOCKS = 2;

// Remove low amplitudes: a level below the cut-off, or below secondaryPercent % of the
// strongest level of its block, becomes 0.
void removeLowAmplitudes(const PitchMapView& map, uint8_t cutOff, unsigned secondaryPercent);

// Remove bass noise: over the bins below bassBins, the level every block has at least (the
// bin's minimum over the chunk) is steady noise and is subtracted, clamping at 0. With
// removeHum the level the bin holds in at least half the blocks (its median) is subtracted
// instead when larger: hum that stops now and then. The filters' runner repeats remove low
// amplitudes afterwards.
void removeBassNoise(const PitchMapView& map, int bassBins, bool removeHum);

// Remove excessive attack noise: in an attack block, a level whose bin (or a neighbour)
// is silent in each of the next ATTACK_CONFIRM_BLOCKS blocks is noise of the attack.
void removeExcessiveAttackNoise(const PitchMapView& map);

// Remove attack interference: in an attack block, a level whose bin sounded in the block
// before and is silent in the block after is the previous note dying under the attack.
void removeAttackInterference(const PitchMapView& map);

// Strip surrounding amplitudes: in every block only the peaks along the pitch axis stay (a
// level not below either neighbour); the skirts around them become 0.
void stripSurroundingAmplitudes(const PitchMapView& map);

// Remove amplitude blips: a level (in a bin below endBin) whose bin and both neighbours are
// silent in the blocks before and after is a one-block blip. The chunk's first and last
// blocks, whose other side is not seen, are left alone.
void removeAmplitudeBlips(const PitchMapView& map, int endBin);

// Remove weak note trails: after the peak of each run of blocks in a bin, the blocks that
// have fallen below secondaryPercent % of the peak are the note's fading trail.
void removeWeakNoteTrails(const PitchMapView& map, unsigned secondaryPercent);

// Remove note joins: where a run starts in one bin while a run in another bin (more than one
// bin away) ends within NOTE_JOIN_BLOCKS blocks after that start, the old run's overlap with
// the new note is cut away.
void removeNoteJoins(const PitchMapView& map);

// The filters before origDataBuffer is filled (remove low amplitudes, remove bass noise with
// bass hum) and those after it, in their order, each when its option is on.
void runCleanUpFiltersBeforeOrig(const PitchMapView& map, uint8_t cutOff, int bassBins);
void runCleanUpFiltersAfterOrig(const PitchMapView& map, uint8_t cutOff, int blipEndBin);
