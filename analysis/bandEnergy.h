#pragma once
// The band energy of a pitch around a block: how strongly the entries within a semitone of
// it sound, leaving out mains hum. The pitch decision and note building weigh candidates and
// notes with it.

#include <cstdint>

// Band energy at frequency around block: over the blocks within +-halfWidthSeconds of it
// (rounded to whole blocks, clipped to the window and to endBlock), each block's summed
// amplitude of the non-hum dataBuffer entries within one semitone of frequency, divided by
// twice the semitone divisions; returns the average over those blocks (0 when none), and
// the largest single amplitude seen in *largestAmplitude when given.
double noteStrengthAt(uint32_t block, uint32_t endBlock, double frequency, double halfWidthSeconds,
                      int* largestAmplitude = nullptr);
// The same over the blocks' origDataBuffers (the entries as the analysis made them), which the
// pitch decision reads while it rewrites the dataBuffers.
double originalStrengthAt(uint32_t block, uint32_t endBlock, double frequency, double halfWidthSeconds,
                          int* largestAmplitude = nullptr);
// One block's band energy at frequency (the summed non-hum amplitudes within one semitone,
// divided by twice the semitone divisions) in dataBuffer, or in origDataBuffer with original set.
double blockBandEnergy(uint32_t block, double frequency, bool original);
