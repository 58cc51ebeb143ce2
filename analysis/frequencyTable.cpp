// One chunk of frequency table creation: the window's housekeeping, the resolution levels of
// each group of blocks, the pitch map with its normalisers, the block loudness, the
// automatic cut-off, the FT entries and the hand-over of the Hires spectra.
#include "analysis/frequencyTable.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <new>
#include <stdexcept>

#include "analysis/amplitudeHistogram.h"
#include "analysis/analysisGeometry.h"
#include "analysis/analysisSampleBuffer.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/polyphonicFilters.h"
#include "analysis/recognitionOptions.h"
#include "analysis/resolutionLevels.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

static const float DETECTED_PLACEHOLDER = 440.0f;   // Hz: the detected pitch until recognition decides

static uint32_t positionOfBlock(uint32_t block) {
    return uint32_t(std::trunc(songTimeOfBlock(block) * analysisGeometry.sampleRate + 0.5));
}

void frequencyTableInput(uint32_t startSample, int64_t* first, int64_t* end) {
    const AnalysisGeometry& g = analysisGeometry;
    uint32_t start = g.sampleRate ? positionOfBlock(blockAtTime(double(startSample) / g.sampleRate)) : startSample;
    int64_t half = g.topFrame / 2;
    *first = int64_t(start) - half;
    *end = int64_t(start) + int64_t(g.chunkBlocks) * g.blockSamples + half;
    if (analysisSampleBuffer.endOfSong >= 0) *end = std::min(*end, analysisSampleBuffer.endOfSong);
}

// Only the entries and the per-block bytes of a buffer are live; moving a whole buffer of
// 256 entries for every block the window shifts would dominate a chunk's time.
static void moveDataBuffer(FTDataBuffer& to, const FTDataBuffer& from) {
    uint32_t n = std::min(from.nEntries, FT_DATA_ENTRIES);
    std::memmove(to.entries, from.entries, n * sizeof(FrequencyEntry));
    to.nEntries = from.nEntries;
    to.blockLoudness = from.blockLoudness;
    to.blockFlags = from.blockFlags;
    std::memcpy(to.spare, from.spare, sizeof to.spare);
}

// The first block whose Hires spectrum the store does not hold yet: those still wait in the
// Hires buffer. Without open Hires files nothing is known to be stored.
static uint32_t firstUnstoredHiresBlock(uint32_t windowFirst) {
    uint32_t stored = 0;
    if (hiresFiles.hiresIndexFile && getFTIndexCount(hiresFiles.hiresIndexFile, &stored)) return std::max(stored, windowFirst);
    return windowFirst;
}

// Makes room for count blocks from b0 on: the window ends at b0 + count and holds at most
// its capacity, so when it would grow past that its newest blocks move down and its first
// block advances. The Hires spectra that still wait for the store move with their blocks.
static void makeWindowRoom(uint32_t b0, uint32_t count) {
    FTBlockWindow& w = ftBlockWindow;
    if (b0 < w.firstBlock || b0 > w.endBlock) {
        // The window lies elsewhere (it was moved away from the song's end): the new blocks
        // start a window of their own; the blocks before them are on file.
        w.firstBlock = b0;
        w.endBlock = b0;
    }
    w.endBlock = b0;
    uint32_t held = b0 - w.firstBlock;
    if (held + count <= w.capacity) return;
    uint32_t drop = std::min(held, held + count - w.capacity);
    uint32_t moveFrom = w.firstBlock + drop;
    for (uint32_t b = moveFrom; b < b0; b++) {
        size_t to = b - moveFrom, from = b - w.firstBlock;
        moveDataBuffer(w.dataBuffers[to], w.dataBuffers[from]);
        moveDataBuffer(w.origDataBuffers[to], w.origDataBuffers[from]);
        w.detectedFrequenciesBuffers[to] = w.detectedFrequenciesBuffers[from];
    }
    if (analysisGeometry.keepPhases && hiresBuffer.bins) {
        size_t blockValues = size_t(hiresBuffer.binCount) * 2;
        size_t liveValues = size_t(frequencyAnalysis.hiresStoredBins) * 2;
        for (uint32_t b = std::max(moveFrom, firstUnstoredHiresBlock(moveFrom)); b < b0; b++) {
            double* to = hiresBuffer.bins + size_t(b - moveFrom) * blockValues;
            const double* from = hiresBuffer.bins + size_t(b - w.firstBlock) * blockValues;
            std::memmove(to, from, liveValues * sizeof(double));
        }
    }
    w.firstBlock = moveFrom;
}

static void startBlock(uint32_t slot) {
    FTBlockWindow& w = ftBlockWindow;
    FTDataBuffer& data = w.dataBuffers[slot];
    FTDataBuffer& orig = w.origDataBuffers[slot];
    data.nEntries = 0;
    data.blockLoudness = 0;
    data.blockFlags = 0;
    orig.nEntries = 0;
    orig.blockLoudness = 0;
    orig.blockFlags = 0;
    FTDetectedBuffer& detected = w.detectedFrequenciesBuffers[slot];
    detected.nEntries = 1;
    detected.entries[0] = FrequencyEntry{DETECTED_PLACEHOLDER, 0.0f, 0, 0, 0, 0};
}

// The change limiter: between segments a normaliser may move by at most a factor e^lambda,
// lambda = ln(max(m, previous)) x limiter % x (top frame / rate) x 0.01, while both segments
// carry sound. With the limiter switch off it does not move at all.
static double limitChange(double m, double previous, bool bothSounding) {
    const AnalysisGeometry& g = analysisGeometry;
    if (!bothSounding) return m;
    if (!recognitionOptions.groupLimiter) return previous;
    if (!(m > 0) || !(previous > 0)) return m;
    double lambda = std::log(std::max(m, previous)) * recognitionOptions.changeLimiter *
                    (double(g.topFrame) / g.sampleRate) * 0.01;
    // A normaliser below 1 would give a negative step and turn the limit round.
    if (lambda < 0) lambda = 0;
    if (m > previous) return std::min(m, std::exp(std::log(previous) + lambda));
    return std::max(m, std::exp(std::log(previous) - lambda));
}

// A byte of value against a normaliser gliding from previous to m over the segment's n
// blocks: w_i = ((n - 1 - i) previous + (i + 1) m) / n.
static uint8_t glidedByte(double value, double previous, double m, uint32_t i, uint32_t n) {
    double w = ((double(n) - 1 - i) * previous + (double(i) + 1) * m) / n;
    if (!(w > 0)) return value > 0 ? 255 : 0;
    double level = std::min(255.0, value * 255.0 / w);
    return level > 0 ? uint8_t(level) : 0;
}

// The pitch map and block loudness of one segment: blocks first .. first + n - 1 of the chunk.
static void mapSegment(uint32_t first, uint32_t n, uint32_t slot0) {
    FrequencyAnalysisState& a = frequencyAnalysis;
    const AnalysisGeometry& g = analysisGeometry;
    const RecognitionOptions& o = recognitionOptions;
    int P = g.pitchBins, active = a.activePitchBins;
    double tMax = 0, uMax = 0, loudMax = 0;
    double* totals = a.segmentTotals.data();
    double* loudness = a.segmentLoudness.data();
    for (uint32_t i = 0; i < n; i++) {
        const double* h = a.hiresSpectrum.data() + size_t(first + i) * g.hiresBins;
        double* energy = a.pitchEnergy.data() + size_t(first + i) * P;
        float* frequency = a.pitchFrequencies.data() + size_t(first + i) * P;
        double t = 0;
        for (int p = 0; p < active; p++) {
            double s = 0, sLog = 0;
            for (uint32_t j = a.pitchBinFine[p]; j < a.pitchBinFine[p + 1]; j++) {
                s += a.fineWeight[j] * h[j];
                sLog += a.fineWeightLog[j] * h[j];
            }
            energy[p] = s;
            frequency[p] = s != 0 ? float(std::exp(sLog / s)) : 0.0f;
            t += s;
        }
        double u = 0;
        for (uint32_t j = a.pitchBinFine[0]; j < a.pitchBinFine[active]; j++) u += h[j];
        double lb = 0;
        for (uint32_t j = a.loudnessFineStart; j < a.loudnessFineEnd; j++) lb += std::sqrt(h[j]) * a.fineLoudnessWeight[j];
        totals[i] = t;
        loudness[i] = lb;
        tMax = std::max(tMax, t);
        uMax = std::max(uMax, u);
        loudMax = std::max(loudMax, lb);
    }
    // The robust maximum: the 16-bin rule ignores a few blocks far louder than the rest.
    double m = tMax;
    if (o.spikeThreshold < 1.0f) {
        uint32_t counts[SPIKE_HISTOGRAM_BINS] = {};
        for (uint32_t i = 0; i < n; i++) counts[spikeHistogramBin(totals[i], tMax)]++;
        m = tMax * spikeHistogramTop(counts, o.spikeThreshold) * 0.0625;
    }
    m /= g.semitoneDivisions;
    bool sounding = uMax > g.noiseFloor;
    bool bothSounding = sounding && a.previousUmax > g.noiseFloor;
    m = limitChange(m, a.pitchNormaliser, bothSounding);
    double loudnessM = limitChange(loudMax, a.loudnessNormaliser, bothSounding);
    FTBlockWindow& w = ftBlockWindow;
    for (uint32_t i = 0; i < n; i++) {
        uint8_t* level = a.pitchLevels.data() + size_t(first + i) * P;
        const double* energy = a.pitchEnergy.data() + size_t(first + i) * P;
        uint8_t blockLoudness = 0;
        if (sounding) {
            for (int p = 0; p < active; p++) level[p] = glidedByte(energy[p], a.pitchNormaliser, m, i, n);
            blockLoudness = glidedByte(loudness[i], a.loudnessNormaliser, loudnessM, i, n);
        }
        w.dataBuffers[slot0 + first + i].blockLoudness = blockLoudness;
        w.origDataBuffers[slot0 + first + i].blockLoudness = blockLoudness;
    }
    a.pitchNormaliser = m;
    a.previousUmax = uMax;
    a.loudnessNormaliser = loudnessM;
}

// The chunk's automatic cut-off: the two-class split of its level bytes over the pitch bins
// whose centre lies within the analysed range, zeros included.
static uint8_t chunkCutOffLevel(uint32_t blocks) {
    const FrequencyAnalysisState& a = frequencyAnalysis;
    int P = analysisGeometry.pitchBins;
    uint64_t counts[LEVEL_HISTOGRAM_BINS] = {};
    uint64_t total = 0;
    for (uint32_t i = 0; i < blocks; i++) {
        const uint8_t* level = a.pitchLevels.data() + size_t(i) * P;
        for (int p = a.firstBinInRange; p < a.endBinInRange; p++) counts[level[p]]++;
        total += uint64_t(a.endBinInRange - a.firstBinInRange);
    }
    double relative[LEVEL_HISTOGRAM_BINS] = {};
    if (total > 0)
        for (int i = 0; i < LEVEL_HISTOGRAM_BINS; i++) relative[i] = double(counts[i]) / double(total);
    return uint8_t(histogramThreshold(relative));
}

// The entries of one buffer from the levels: one per pitch bin in range with a level, in
// ascending pitch order.
static void fillEntries(FTDataBuffer& buffer, const uint8_t* level, const float* frequency, uint8_t cutOff) {
    const FrequencyAnalysisState& a = frequencyAnalysis;
    float step = float(analysisGeometry.pitchStep);
    uint32_t n = 0;
    for (int p = a.firstBinInRange; p < a.endBinInRange && n < FT_DATA_ENTRIES - 1; p++) {
        if (level[p] == 0) continue;
        if (n == 0) buffer.blockFlags = 0;
        buffer.entries[n++] = FrequencyEntry{frequency[p], frequency[p] * step, level[p], level[p], cutOff, 0};
    }
    buffer.nEntries = n;
}

static void fillBuffers(uint32_t blocks, uint32_t slot0, bool orig, bool data) {
    const FrequencyAnalysisState& a = frequencyAnalysis;
    int P = analysisGeometry.pitchBins;
    FTBlockWindow& w = ftBlockWindow;
    for (uint32_t i = 0; i < blocks; i++) {
        const uint8_t* level = a.pitchLevels.data() + size_t(i) * P;
        const float* frequency = a.pitchFrequencies.data() + size_t(i) * P;
        if (orig) fillEntries(w.origDataBuffers[slot0 + i], level, frequency, a.chunkCutOffLevel);
        if (data) fillEntries(w.dataBuffers[slot0 + i], level, frequency, a.chunkCutOffLevel);
    }
}

// The pitch bins whose centre lies below the bass limit.
static int bassPitchBins() {
    int bins = 0;
    while (bins < analysisGeometry.pitchBins && pitchBinCentre(analysisGeometry, bins) < BASS_NOISE_LIMIT) bins++;
    return bins;
}

int64_t createFrequencyTable(uint32_t startSample) {
    FrequencyAnalysisState& a = frequencyAnalysis;
    const AnalysisGeometry& g = analysisGeometry;
    if (!a.ready) return -1;
    FTBlockWindow& w = ftBlockWindow;
    uint32_t b0 = blockAtTime(double(startSample) / g.sampleRate);
    if (song.blockCount == 0 && b0 == 0) {
        // The song's first chunk: the window starts empty.
        w.firstBlock = 0;
        w.endBlock = 0;
    }
    if (!growFTBlockWindow()) return -1;
    if (g.chunkBlocks > w.capacity) return -1;
    if (g.keepPhases && !allocHiresBuffer()) return -1;

    uint32_t chunkStart = positionOfBlock(b0);
    uint32_t blocks = g.chunkBlocks;
    int64_t end = analysisSampleBuffer.endOfSong;
    if (end >= 0) {
        // The song's last partial block is not analysed.
        int64_t left = end > int64_t(chunkStart) ? (end - chunkStart) / g.blockSamples : 0;
        blocks = uint32_t(std::min<int64_t>(blocks, left));
        if (blocks == 0) return chunkStart;
    }
    if (!growSampleBlockDurations(b0 + blocks)) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return -1;
    }
    makeWindowRoom(b0, blocks);
    uint32_t slot0 = b0 - w.firstBlock;
    a.chunkStartSample = chunkStart;
    a.chunkFirstBlock = b0;
    a.chunkBlocks = blocks;

    for (uint32_t i = 0; i < blocks; i++) startBlock(slot0 + i);
    size_t pitchValues = size_t(blocks) * g.pitchBins;
    std::fill(a.pitchLevels.begin(), a.pitchLevels.begin() + ptrdiff_t(pitchValues), uint8_t(0));
    std::fill(a.pitchFrequencies.begin(), a.pitchFrequencies.begin() + ptrdiff_t(pitchValues), 0.0f);
    for (uint32_t group = 0; group < blocks; group += g.group) analyseBlockGroup(group);

    for (uint32_t first = 0; first < blocks; first += g.blocksPerSecond)
        mapSegment(first, std::min(g.blocksPerSecond, blocks - first), slot0);
    a.chunkCutOffLevel = chunkCutOffLevel(blocks);

    if (recognitionOptions.monophonicRecognition) {
        fillBuffers(blocks, slot0, true, true);
    } else {
        PitchMapView map{a.pitchLevels.data(), a.pitchSpare.data(), blocks, g.pitchBins};
        runCleanUpFiltersBeforeOrig(map, a.chunkCutOffLevel, bassPitchBins());
        fillBuffers(blocks, slot0, true, false);
        runCleanUpFiltersAfterOrig(map, a.chunkCutOffLevel, a.endBinInRange);
        fillBuffers(blocks, slot0, false, true);
    }

    if (g.keepPhases) {
        // The Hires store takes the blocks' spectra from its buffer, at their window slots,
        // as (energy, 0) pairs; it keeps nothing above the full-band limit, so those bins are
        // not handed over.
        size_t blockValues = size_t(hiresBuffer.binCount) * 2;
        for (uint32_t i = 0; i < blocks; i++) {
            const double* h = a.hiresSpectrum.data() + size_t(i) * g.hiresBins;
            double* to = hiresBuffer.bins + size_t(slot0 + i) * blockValues;
            for (uint32_t j = 0; j < a.hiresStoredBins; j++) {
                to[2 * j] = h[j];
                to[2 * j + 1] = 0.0;
            }
        }
    }

    for (uint32_t b = b0; b < b0 + blocks; b++) song.sampleBlockDurations[b] = g.sampleBlockDuration;
    song.blockCount = b0 + blocks;
    w.endBlock = b0 + blocks;
    return positionOfBlock(b0 + blocks);
}
