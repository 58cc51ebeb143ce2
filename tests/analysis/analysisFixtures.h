#pragma once
// Fixtures of the analysis suites: a song of a given format with the analysis state emptied
// around each test, and the analysis of a signal made in code, either over the whole signal
// held in one buffer (the reference chunking: one group of blocks per call) or through the
// chunked pass, with every new block's FT buffers and Hires spectrum kept for the checks.

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/analysisSampleBuffer.h"
#include "analysis/chunkedAnalysis.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/frequencyTable.h"
#include "analysis/recognitionOptions.h"
#include "analysis/spectrogram.h"
#include "analysis/signalGenerator.h"
#include "platform/allocation.h"
#include "platform/ui.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

// One analysed block as the analysis left it.
struct AnalysedBlock {
    FTDataBuffer data;
    FTDataBuffer orig;
    FTDetectedBuffer detected;
    std::vector<double> hires;   // the Hires buffer's energies up to the full-band limit (wave editing only)
};

inline void emptyAnalysisState() {
    releaseFrequencyAnalysis();
    clearAnalysisSampleBuffer();
    freeFTBlockWindow();
    freeHiresBuffers();
    resetSong();
    resetSettings();
    resetRecognitionOptions();
    failAllocation(0);
    clearUiCalls();
}

inline void setSongFormat(uint32_t rate, int bits) {
    song.waveFormat = SongWaveFormat{1, 1, rate, rate * uint32_t(bits / 8), uint16_t(bits / 8), uint16_t(bits)};
}

inline AnalysedBlock keepBlock(uint32_t block) {
    const FTBlockWindow& w = ftBlockWindow;
    size_t slot = block - w.firstBlock;
    AnalysedBlock kept;
    std::memset(&kept.data, 0, sizeof kept.data);
    std::memset(&kept.orig, 0, sizeof kept.orig);
    std::memset(&kept.detected, 0, sizeof kept.detected);
    const FTDataBuffer& data = w.dataBuffers[slot];
    const FTDataBuffer& orig = w.origDataBuffers[slot];
    kept.data.nEntries = data.nEntries;
    kept.data.blockLoudness = data.blockLoudness;
    kept.data.blockFlags = data.blockFlags;
    std::memcpy(kept.data.entries, data.entries, data.nEntries * sizeof(FrequencyEntry));
    kept.orig.nEntries = orig.nEntries;
    kept.orig.blockLoudness = orig.blockLoudness;
    kept.orig.blockFlags = orig.blockFlags;
    std::memcpy(kept.orig.entries, orig.entries, orig.nEntries * sizeof(FrequencyEntry));
    kept.detected = w.detectedFrequenciesBuffers[slot];
    if (analysisGeometry.keepPhases && hiresBuffer.bins) {
        const double* bins = hiresBuffer.bins + slot * size_t(hiresBuffer.binCount) * 2;
        for (uint32_t j = 0; j < frequencyAnalysis.hiresStoredBins; j++) kept.hires.push_back(bins[2 * j]);
    }
    return kept;
}

// The stored form of a block's three buffers and its loudness: what must come out the same.
inline std::vector<uint8_t> blockBytes(const AnalysedBlock& b) {
    std::vector<uint8_t> bytes;
    auto put = [&bytes](const void* p, size_t n) {
        const uint8_t* q = static_cast<const uint8_t*>(p);
        bytes.insert(bytes.end(), q, q + n);
    };
    put(&b.data.nEntries, 4);
    put(b.data.entries, b.data.nEntries * sizeof(FrequencyEntry));
    put(&b.orig.nEntries, 4);
    put(b.orig.entries, b.orig.nEntries * sizeof(FrequencyEntry));
    put(&b.detected.nEntries, 4);
    put(b.detected.entries, b.detected.nEntries * sizeof(FrequencyEntry));
    bytes.push_back(b.data.blockLoudness);
    bytes.push_back(b.orig.blockLoudness);
    return bytes;
}

// Analyses x held whole in one buffer, one createFrequencyTable call after another, each
// starting where the last ended, as far as the signal has whole blocks. Setup runs first
// (with bufferSamplesForSetup frames of buffer in view: 0 gives chunks of one group).
inline std::vector<AnalysedBlock> analyseWholeSignal(const std::vector<uint8_t>& bytes, uint32_t samples,
                                                     uint32_t bufferSamplesForSetup = 0) {
    std::vector<AnalysedBlock> blocks;
    clearAnalysisSampleBuffer();
    if (bufferSamplesForSetup) setAnalysisSampleBuffer(bytes.data(), bufferSamplesForSetup, 0);
    if (!setupFrequencyAnalysis()) return blocks;
    setAnalysisSampleBuffer(bytes.data(), samples, 0, samples);
    uint32_t position = 0;
    while (true) {
        if (createMagnitudeSpectrogram(position) < 0) break;
        uint32_t first = song.blockCount;
        int64_t next = createFrequencyTable(position);
        if (next < 0 || next == int64_t(position)) break;
        for (uint32_t b = first; b < song.blockCount; b++) blocks.push_back(keepBlock(b));
        position = uint32_t(next);
    }
    return blocks;
}

// A chunked pass over bytes, reading chunkSamples at a time.
struct ByteSource {
    const std::vector<uint8_t>* bytes;
    size_t next;          // byte offset
    uint32_t bytesPerSample;
};

inline uint32_t readByteSource(void* context, uint8_t* destination, uint32_t count) {
    ByteSource& s = *static_cast<ByteSource*>(context);
    size_t left = (s.bytes->size() - s.next) / s.bytesPerSample;
    uint32_t n = uint32_t(std::min<size_t>(count, left));
    std::memcpy(destination, s.bytes->data() + s.next, size_t(n) * s.bytesPerSample);
    s.next += size_t(n) * s.bytesPerSample;
    return n;
}

inline int keepChunkBlocks(void* context, uint32_t firstBlock, uint32_t endBlock) {
    auto* blocks = static_cast<std::vector<AnalysedBlock>*>(context);
    for (uint32_t b = firstBlock; b < endBlock; b++) blocks->push_back(keepBlock(b));
    return 1;
}

inline std::vector<AnalysedBlock> analyseInChunks(const std::vector<uint8_t>& bytes, int bits) {
    std::vector<AnalysedBlock> blocks;
    clearAnalysisSampleBuffer();
    if (!setupFrequencyAnalysis()) return blocks;
    ByteSource source{&bytes, 0, uint32_t(bits / 8)};
    analyseSource(readByteSource, &source, keepChunkBlocks, &blocks);
    return blocks;
}

// The entry with the largest amplitude (the first of equals); nullptr when there is none.
inline const FrequencyEntry* strongestEntry(const FTDataBuffer& buffer) {
    const FrequencyEntry* best = nullptr;
    for (uint32_t i = 0; i < buffer.nEntries; i++)
        if (!best || buffer.entries[i].amplitude > best->amplitude) best = &buffer.entries[i];
    return best;
}

class AnalysisTest : public ::testing::Test {
protected:
    void SetUp() override { emptyAnalysisState(); }
    void TearDown() override { emptyAnalysisState(); }
};
