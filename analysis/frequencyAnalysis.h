#pragma once
// The state of one analysis pass: the working buffers of frequency table creation (the level
// powers and phases, the pitch map, the chunk's Hires spectrum), the tables derived from the
// geometry, and the normalisers that carry from chunk to chunk. setupFrequencyAnalysis
// starts a pass, createMagnitudeSpectrogram and createFrequencyTable run once per chunk, and
// releaseFrequencyAnalysis ends it. The opening worker, the recorder, whole-song analysis and
// instrument learning drive it; note recognition reads the geometry and the pitch map.

#include <cstdint>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/vector/vectorTypes.h"

struct FrequencyAnalysisState {
    // working buffers, one chunk's worth
    std::vector<double> levelPowers;          // L rows of G x N0 powers: level l holds G / 2^l frames of N0 x 2^l bins
    std::vector<dComplex> levelPhases;        // the same layout, (cos, sin) of each bin's centred phase; wave editing only
    std::vector<uint8_t> pitchLevels;         // C x P level bytes, block after block (the PitchMap)
    std::vector<float> pitchFrequencies;      // C x P frequencies, Hz, where the level's energy lies
    std::vector<uint8_t> pitchSpare;          // C x P bytes of scratch for the clean-up filters
    std::vector<double> pitchEnergy;          // C x P weighted energies S of the pitch bins
    std::vector<double> hiresSpectrum;        // C x H fine-bin energies, block after block
    std::vector<double> segmentTotals;        // C: each block's summed weighted energy T
    std::vector<double> segmentLoudness;      // C: each block's loudness sum Lb
    // per-geometry tables
    std::vector<double> hannWindows;          // the Hann window of 2 N0 2^l values for each level, one after another
    std::vector<uint32_t> hannOffsets;        // where level l's window starts in hannWindows
    std::vector<dComplex> frame;              // one frame of the longest transform
    std::vector<double> frameSamples;         // its samples
    std::vector<double> combination;          // G x G partial products of one coarse bin
    std::vector<uint8_t> coarseBinLive;       // N0 flags: every level has energy in coarse bin c this group
    std::vector<double> fineWeight;           // H: equalLoudnessWeight x highFrequencyFade of fine bin j
    std::vector<double> fineWeightLog;        // H: that weight x ln(frequency of j)
    std::vector<double> fineLoudnessWeight;   // H: loudnessWeight of fine bin j
    std::vector<uint32_t> pitchBinFine;       // P + 1: pitch bin p covers fine bins [pitchBinFine[p], pitchBinFine[p + 1])
    int activePitchBins;                      // pitch bins below the first that reaches past the highest frequency
    int firstBinInRange;                      // first pitch bin whose centre is within the analysed range
    int endBinInRange;                        // one past the last
    uint32_t loudnessFineStart;               // fine bins [start, end) summed for block loudness:
    uint32_t loudnessFineEnd;                 //   the lowest frequency up to the full-band limit
    uint32_t hiresStoredBins;                 // fine bins handed to the Hires store (up to the full-band limit)
    // carried from chunk to chunk, cleared by setup
    double pitchNormaliser;                   // R: the previous segment's normaliser of the levels
    double previousUmax;                      // the previous segment's largest unweighted block energy
    double loudnessNormaliser;                // the previous segment's normaliser of the block loudness
    // the chunk in progress
    uint32_t chunkStartSample;                // song sample position of the chunk's first block
    uint32_t chunkFirstBlock;                 // b0
    uint32_t chunkBlocks;                     // blocks this chunk appends (C, fewer at the song's known end)
    uint8_t chunkCutOffLevel;                 // the chunk's automatic cut-off level
    bool ready;                               // setup succeeded: the buffers exist
};
extern FrequencyAnalysisState frequencyAnalysis;

// Starts an analysis pass over the song. For a song without blocks it first applies the
// preference-derived options (pitch range, boost, enhanced accuracy, wave editing); then it
// derives the geometry (showing the nine-level message when the levels end at 9), sets the
// song's nominal block duration, the window's capacity and the Hires store's geometry,
// loads the newest window of a song that already has blocks, sizes the chunk from the
// analysis sample buffer, allocates the working buffers, resets the spectrogram and clears
// the normalisers. 1; 0 when the song has no usable wave format, or after the memory
// message (string 10401) with every working buffer released.
int setupFrequencyAnalysis();
// Releases the working buffers and the spectrogram (the pass has ended, or failed).
void releaseFrequencyAnalysis();
// 1 while a pass's working buffers exist; the callers' later steps stop without them.
int analysisBuffersReady();

// Frames of 2n samples with hop n, n = N0 x 2^level, frames firstFrame .. endFrame - 1
// counted from the chunk's first block: frame f starts n f - n/2 samples after it. Each
// frame's powers (n per frame: bin 0 is 0, bins 1 .. n-1 carry the energy of the frame's
// middle half, Et, spread by the windowed spectrum) go to powerOut, and when phaseOut is
// given, the (cos, sin) of each bin's phase taken about the frame's centre. Returns the
// summed power.
double analyseResolutionLevel(uint32_t n, double* powerOut, dComplex* phaseOut, uint32_t firstFrame,
                              uint32_t endFrame, int level);
