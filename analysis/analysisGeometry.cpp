// The analysis geometry: how long a block is, how many resolution levels the lowest
// frequency needs, and the grids of pitch bins and fine bins built on them.
#include "analysis/analysisGeometry.h"

#include <cmath>

#include "analysis/pitchScale.h"
#include "store/ftBlockStore.h"

AnalysisGeometry analysisGeometry;

static const int SMALLEST_BLOCK_POWER = 2;    // N0 is at least 2^2 ...
static const int LARGEST_BLOCK_POWER = 15;    // ... and at most 2^15 samples
static const uint32_t TINY_BLOCK = 2;         // N0 when the rate gives fewer than four samples
static const double NOISE_FLOOR_FRACTION = 0.015;   // of full scale

double lowestResolvableFrequency(double resolution, double divisions) {
    const double* notes = noteFrequencyTable();
    for (int i = 1; i < NOTE_FREQUENCY_COUNT; i++)
        if ((notes[i] - notes[i - 1]) / divisions >= resolution) return notes[i - 1];
    return 40000.0;
}

static uint32_t blockSamplesFor(uint32_t sampleRate, double blockDuration) {
    double limit = std::trunc(sampleRate * blockDuration) + 1;
    if (limit < 4) return TINY_BLOCK;
    uint32_t samples = 1u << SMALLEST_BLOCK_POWER;
    for (int k = SMALLEST_BLOCK_POWER + 1; k <= LARGEST_BLOCK_POWER; k++) {
        if (double(1u << k) > limit) break;
        samples = 1u << k;
    }
    return samples;
}

static uint32_t roundUpToMultiple(uint32_t value, uint32_t step) { return (value + step - 1) / step * step; }

uint32_t chunkBlockCount(const AnalysisGeometry& g, uint32_t bufferSamples) {
    double samples = bufferSamples ? double(bufferSamples) : 2.0 * g.topFrame;
    double seconds = samples / g.sampleRate - double(g.topFrame) / g.sampleRate;
    double blocks = std::trunc(seconds / g.sampleBlockDuration);
    uint32_t chunk = blocks > 0 ? roundUpToMultiple(uint32_t(std::fmin(blocks, 1e9)), g.group) : 0;
    // A chunk is at least one group (the unit of the multi-level analysis) and at most a
    // window: a whole-song buffer is analysed window by window, since the blocks of one call
    // must all fit in the FTBlockWindow and the Hires buffer behind it.
    uint32_t most = g.windowCapacity / g.group * g.group;
    if (most < g.group) most = g.group;
    if (chunk < g.group) chunk = g.group;
    if (chunk > most) chunk = most;
    return chunk;
}

int deriveAnalysisGeometry(uint32_t sampleRate, int bitsPerSample, const RecognitionOptions& options,
                           uint32_t bufferSamples, AnalysisGeometry* geometry, bool* levelsCapped) {
    if (sampleRate == 0 || (bitsPerSample != 8 && bitsPerSample != 16)) return 0;
    // The pitch grid is logarithmic: it has no place for 0 Hz or an empty range.
    if (!(options.lowestFrequency > 0) || !(options.highestFrequency > options.lowestFrequency)) return 0;
    if (!(options.blockDuration > 0)) return 0;
    AnalysisGeometry g{};
    g.sampleRate = sampleRate;
    g.bitsPerSample = bitsPerSample;
    g.blockSamples = blockSamplesFor(sampleRate, options.blockDuration);
    g.sampleBlockDuration = double(g.blockSamples) / sampleRate;
    g.binSpacing = (sampleRate / 2.0) / g.blockSamples;
    g.lowestAnalysed = options.lowestFrequency;
    g.highestAnalysed = std::fmin(double(options.highestFrequency), sampleRate / 2.0);
    double divisions = options.semitoneDivisions > 0 ? options.semitoneDivisions : 1.0;

    int levels = 1;
    double resolution = g.binSpacing;
    while (lowestResolvableFrequency(resolution, divisions) > g.lowestAnalysed) {
        if (levels == MAX_RESOLUTION_LEVELS) break;
        levels++;
        resolution /= 2;
    }
    g.levels = levels;
    if (levelsCapped) *levelsCapped = levels == MAX_RESOLUTION_LEVELS;
    g.group = 1u << (levels - 1);
    g.topFrame = g.blockSamples * g.group;
    g.windowCapacity = uint32_t(FT_WINDOW_SECONDS / g.sampleBlockDuration);
    g.blocksPerSecond = roundUpToMultiple(uint32_t(1.0 / g.sampleBlockDuration), g.group);
    if (g.blocksPerSecond == 0) g.blocksPerSecond = g.group;

    g.semitoneDivisions = divisions;
    g.pitchStep = std::log10(2.0) / 12.0 / divisions;
    g.firstPitchIndex = int(std::log10(g.lowestAnalysed) / g.pitchStep);
    g.pitchBins = int(std::log10(g.highestAnalysed) / g.pitchStep) - g.firstPitchIndex;
    if (g.pitchBins < 0) g.pitchBins = 0;
    g.hiresBins = g.blockSamples * g.group;
    double fullScale = std::ldexp(1.0, bitsPerSample - 1) * NOISE_FLOOR_FRACTION;
    g.noiseFloor = std::trunc(g.blockSamples * fullScale * fullScale);
    g.lookaheadSamples = uint32_t(uint64_t(g.topFrame) * (options.lookaheadFrames ? options.lookaheadFrames - 1 : 0) / 2);
    g.keepPhases = !options.disableWaveEditing;
    g.combinationLimit = options.disableWaveEditing ? double(options.highestFrequency) : double(options.fullBandLimit);
    g.chunkBlocks = chunkBlockCount(g, bufferSamples);
    *geometry = g;
    return 1;
}

double pitchBinCentre(const AnalysisGeometry& g, int p) { return std::pow(10.0, (g.firstPitchIndex + p) * g.pitchStep); }

double pitchBinLowerEdge(const AnalysisGeometry& g, int p) {
    return std::pow(10.0, (g.firstPitchIndex + p - 0.5) * g.pitchStep);
}

double pitchBinUpperEdge(const AnalysisGeometry& g, int p) {
    return std::pow(10.0, (g.firstPitchIndex + p + 0.5) * g.pitchStep);
}

void pitchBinsInRange(const AnalysisGeometry& g, int* first, int* end) {
    int p = 0;
    while (p < g.pitchBins && pitchBinCentre(g, p) < g.lowestAnalysed) p++;
    *first = p;
    while (p < g.pitchBins && pitchBinCentre(g, p) <= g.highestAnalysed) p++;
    *end = p;
}

double fineBinFrequency(const AnalysisGeometry& g, uint32_t j) { return g.binSpacing * (1.0 + double(j) / g.group); }

uint32_t fineBinIndex(const AnalysisGeometry& g, double frequency) {
    double j = std::trunc(g.group * (frequency - g.binSpacing) / g.binSpacing);
    if (!(j > 0)) return 0;
    return j >= 4e9 ? 4000000000u : uint32_t(j);
}
