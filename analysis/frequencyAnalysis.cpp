// Starting and ending an analysis pass: the geometry, the working buffers and the tables that
// depend on the geometry, and the newest window of a song that already has blocks.
#include "analysis/frequencyAnalysis.h"

#include <algorithm>
#include <cmath>

#include "analysis/analysisSampleBuffer.h"
#include "analysis/spectrogram.h"
#include "analysis/vector/window.h"
#include "analysis/weightTables.h"
#include "platform/allocation.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

FrequencyAnalysisState frequencyAnalysis;

template <class T>
static void release(std::vector<T>& v) {
    std::vector<T>().swap(v);
}

void releaseFrequencyAnalysis() {
    FrequencyAnalysisState& a = frequencyAnalysis;
    release(a.levelPowers);
    release(a.levelPhases);
    release(a.pitchLevels);
    release(a.pitchFrequencies);
    release(a.pitchSpare);
    release(a.pitchEnergy);
    release(a.hiresSpectrum);
    release(a.segmentTotals);
    release(a.segmentLoudness);
    release(a.hannWindows);
    release(a.hannOffsets);
    release(a.frame);
    release(a.frameSamples);
    release(a.combination);
    release(a.coarseBinLive);
    release(a.fineWeight);
    release(a.fineWeightLog);
    release(a.fineLoudnessWeight);
    release(a.pitchBinFine);
    a.ready = false;
    freeMagnitudeSpectrogram();
}

int analysisBuffersReady() { return frequencyAnalysis.ready ? 1 : 0; }

// Sizes one working buffer, all of it zero; false when the memory cannot be had.
template <class T>
static bool allocate(std::vector<T>& v, size_t count) {
    return tryAllocate([&] { v.assign(count, T{}); });
}

static bool allocateWorkingBuffers(const AnalysisGeometry& g) {
    FrequencyAnalysisState& a = frequencyAnalysis;
    size_t levelValues = size_t(g.group) * g.levels * g.blockSamples;
    size_t pitchValues = size_t(g.chunkBlocks) * g.pitchBins;
    size_t windowValues = 0;
    for (int l = 0; l < g.levels; l++) windowValues += size_t(2) * (g.blockSamples << l);
    return allocate(a.levelPowers, levelValues) && (!g.keepPhases || allocate(a.levelPhases, levelValues)) &&
           allocate(a.pitchLevels, pitchValues) && allocate(a.pitchFrequencies, pitchValues) &&
           allocate(a.pitchSpare, pitchValues) && allocate(a.pitchEnergy, pitchValues) && allocate(a.hiresSpectrum, size_t(g.chunkBlocks) * g.hiresBins) &&
           allocate(a.segmentTotals, size_t(g.chunkBlocks)) && allocate(a.segmentLoudness, size_t(g.chunkBlocks)) &&
           allocate(a.hannWindows, windowValues) && allocate(a.hannOffsets, size_t(g.levels)) &&
           allocate(a.frame, size_t(2) * g.topFrame) && allocate(a.frameSamples, size_t(2) * g.topFrame) &&
           allocate(a.combination, size_t(g.group) * g.group) && allocate(a.coarseBinLive, size_t(g.blockSamples)) &&
           allocate(a.fineWeight, size_t(g.hiresBins)) && allocate(a.fineWeightLog, size_t(g.hiresBins)) &&
           allocate(a.fineLoudnessWeight, size_t(g.hiresBins)) && allocate(a.pitchBinFine, size_t(g.pitchBins) + 1);
}

// The tables that follow from the geometry: the Hann windows of the levels, the weights
// of the fine bins, and which fine bins each pitch bin gathers.
static void buildGeometryTables(const AnalysisGeometry& g) {
    FrequencyAnalysisState& a = frequencyAnalysis;
    uint32_t offset = 0;
    for (int l = 0; l < g.levels; l++) {
        a.hannOffsets[l] = offset;
        VD_Hann(a.hannWindows.data() + offset, 2 * (g.blockSamples << l));
        offset += 2 * (g.blockSamples << l);
    }
    const WeightTables& w = weightTables();
    for (uint32_t j = 0; j < g.hiresBins; j++) {
        double f = fineBinFrequency(g, j);
        int i = weightIndex(f);
        a.fineWeight[j] = w.equalLoudnessWeight[i] * w.highFrequencyFade[i];
        a.fineWeightLog[j] = a.fineWeight[j] * std::log(f);
        a.fineLoudnessWeight[j] = w.loudnessWeight[i];
    }
    // Pitch bin p gathers the fine bins above its lower edge up to its upper edge; the edges
    // are shared, so every fine bin belongs to one pitch bin. Only fine bins from the lowest
    // to the highest analysed frequency take part, and the pitch bins from the first one that
    // reaches past the highest frequency on are left out.
    uint32_t lowest = std::min(g.hiresBins, fineBinIndex(g, g.lowestAnalysed));
    uint32_t highest = std::min(g.hiresBins, fineBinIndex(g, g.highestAnalysed) + 1);
    a.activePitchBins = g.pitchBins;
    for (int p = 0; p <= g.pitchBins; p++) {
        uint32_t edge = fineBinIndex(g, pitchBinLowerEdge(g, p)) + 1;
        if (p > 0 && edge > highest && a.activePitchBins == g.pitchBins) a.activePitchBins = p - 1;
        a.pitchBinFine[p] = std::clamp(edge, lowest, highest);
    }
    pitchBinsInRange(g, &a.firstBinInRange, &a.endBinInRange);
    a.loudnessFineStart = lowest;
    a.loudnessFineEnd = std::min(g.hiresBins, fineBinIndex(g, recognitionOptions.fullBandLimit) + 1);
    a.hiresStoredBins = std::min(g.hiresBins, fineBinIndex(g, HIRES_FULL_BAND_LIMIT) + 1);
}

int setupFrequencyAnalysis() {
    releaseFrequencyAnalysis();
    uint32_t rate = song.waveFormat.samplesPerSec;
    int bits = song.waveFormat.bitsPerSample;
    if (song.blockCount == 0) applyAnalysisPreferences();
    bool capped = false;
    if (!deriveAnalysisGeometry(rate, bits, recognitionOptions, analysisSampleBuffer.sampleCount, &analysisGeometry,
                                &capped))
        return 0;
    const AnalysisGeometry& g = analysisGeometry;
    if (capped) showMessage(MESSAGE_INFORMATION, MAX_LEVELS_TEXT);
    if (song.blockCount == 0) song.sampleBlockDuration = g.sampleBlockDuration;
    setFTBlockWindowCapacity(g.sampleBlockDuration);
    if (song.blockCount > 0) {
        uint32_t count = song.blockCount, capacity = ftBlockWindow.capacity;
        loadFTBlockWindow(count > capacity ? count - capacity : 0, count);
    }
    hiresGeometry = HiresGeometry{g.hiresBins, g.binSpacing, double(g.group), 1.0 / g.group};

    if (!allocateWorkingBuffers(g)) {
        releaseFrequencyAnalysis();
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    buildGeometryTables(g);
    if (!resetMagnitudeSpectrogram(rate, bits)) {
        releaseFrequencyAnalysis();
        return 0;
    }
    FrequencyAnalysisState& a = frequencyAnalysis;
    a.pitchNormaliser = 0;
    a.previousUmax = 0;
    a.loudnessNormaliser = 0;
    a.chunkStartSample = 0;
    a.chunkFirstBlock = 0;
    a.chunkBlocks = 0;
    a.chunkCutOffLevel = 0;
    a.ready = true;
    return 1;
}
