#pragma once
// The geometry of frequency table creation for the song being analysed: block length, the
// resolution levels and their group, the pitch-bin grid, the window and chunk sizes and the
// noise floor. setupFrequencyAnalysis derives it from the sample rate, the bits per sample
// and the recognition options; the frequency tables, note recognition, the Hires store's
// geometry and the opening worker's chunk sizes read it.

#include <cstdint>

#include "analysis/recognitionOptions.h"

constexpr int MAX_RESOLUTION_LEVELS = 9;   // more levels multiply too many small numbers together
constexpr const char* MAX_LEVELS_TEXT =
    "Max number of FFTs reached - cannot do more due to loss of accuracy multipling this many small numbers together";

struct AnalysisGeometry {
    uint32_t sampleRate;          // Hz of the song
    int bitsPerSample;            // 8 or 16
    uint32_t blockSamples;        // N0: samples of one sampleBlock, a power of two
    double sampleBlockDuration;   // N0 / sample rate, seconds
    double binSpacing;            // (sample rate / 2) / N0 Hz: bin width of the shortest transform (2 N0 samples)
    double lowestAnalysed;        // Hz: the lowest frequency option
    double highestAnalysed;       // Hz: the highest frequency option, at most half the sample rate
    int levels;                   // L: resolution levels, 1..9, each transform twice the previous
    uint32_t group;               // G = 2^(L-1): blocks covered by one frame of the longest transform
    uint32_t topFrame;            // N0 x G samples: the hop of the longest transform
    uint32_t windowCapacity;      // blocks in 30.0 s: the FTBlockWindow's capacity
    uint32_t blocksPerSecond;     // whole blocks in a second rounded up to a multiple of G: the longest segment
    double semitoneDivisions;     // pitch bins per semitone, 1 or 2
    double pitchStep;             // s = log10(2) / 12 / semitone divisions
    int firstPitchIndex;          // k0: pitch bin 0 is centred on 10^(k0 s) Hz
    int pitchBins;                // P
    uint32_t hiresBins;           // H = N0 x G fine bins per block, fine bin j at binSpacing x (1 + j / G) Hz
    double noiseFloor;            // energy of a block at 1.5 % of full scale; quieter segments are silence
    uint32_t chunkBlocks;         // C: blocks one createFrequencyTable call appends (a multiple of G)
    uint32_t lookaheadSamples;    // top frame x (lookahead frames - 1) / 2: context a chunk reads on each side
    double combinationLimit;      // Hz: above it fine bins copy the shortest transform (full band, or the
                                  // highest frequency when wave editing is disabled)
    bool keepPhases;              // wave editing allowed: phases and the Hires spectrum are kept
};
extern AnalysisGeometry analysisGeometry;

// For the first note i (1..127) whose step up from note i-1, divided by divisions, is at
// least resolution Hz: the frequency of note i-1. 40000.0 when no step is that wide.
double lowestResolvableFrequency(double resolution, double divisions);

// Derives the geometry for sampleRate and bitsPerSample from options, with the chunk block
// count for an analysis buffer of bufferSamples frames (0: two top frames). *levelsCapped
// (when given) tells whether the levels ended at 9. 1; 0 for a rate of 0, bits other than
// 8 or 16, a lowest frequency not above 0 Hz or not below the highest, or a block duration
// not above 0 (geometry untouched).
int deriveAnalysisGeometry(uint32_t sampleRate, int bitsPerSample, const RecognitionOptions& options,
                           uint32_t bufferSamples, AnalysisGeometry* geometry, bool* levelsCapped = nullptr);

// The blocks one chunk appends for a buffer of bufferSamples frames: (buffer - top frame)
// in whole blocks, rounded up to a multiple of G; at least G (a buffer shorter than two top
// frames still gets one group) and at most the window capacity, so that a chunk always fits
// the window.
uint32_t chunkBlockCount(const AnalysisGeometry& geometry, uint32_t bufferSamples);

// Pitch bin p's centre and edges, Hz: 10^((k0 + p) s) and 10^((k0 + p -/+ 0.5) s).
double pitchBinCentre(const AnalysisGeometry& geometry, int p);
double pitchBinLowerEdge(const AnalysisGeometry& geometry, int p);
double pitchBinUpperEdge(const AnalysisGeometry& geometry, int p);
// The pitch bins whose centre lies within the analysed range: [*first, *end).
void pitchBinsInRange(const AnalysisGeometry& geometry, int* first, int* end);
// Fine bin j's frequency, Hz.
double fineBinFrequency(const AnalysisGeometry& geometry, uint32_t j);
// The fine bin index of a frequency: max(0, trunc(G (f - bin spacing) / bin spacing)).
uint32_t fineBinIndex(const AnalysisGeometry& geometry, double frequency);
