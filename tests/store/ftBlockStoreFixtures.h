#pragma once
// Fixtures of the FT block store suites: FT blocks made in a few lines, their stored bytes
// and the bytes of CS.ft and CS.fi for a list of blocks, written here independently of the
// store, and a fixture that empties the store, the song and the working files around a test.

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "store/ftBlockStore.h"
#include "store/song.h"
#include "support/testSupport.h"

struct TestBlock {
    FTDataBuffer data;
    FTDataBuffer orig;
    FTDetectedBuffer detected;
};

inline FrequencyEntry testEntry(uint32_t seed, uint32_t i) {
    float frequency = 55.0f + float(seed) * 3.25f + float(i) * 0.5f;
    return FrequencyEntry{frequency, frequency * 0.025f, uint8_t(seed + i), uint8_t(seed * 3 + i), uint8_t(45 + i),
                          uint8_t(i & 3)};
}

// A block whose entries all differ with seed; the entries past the counts are left zero.
inline TestBlock makeBlock(uint32_t seed, uint32_t nData, uint32_t nOrig, uint32_t nDetected) {
    TestBlock b;
    std::memset(&b, 0, sizeof b);
    for (uint32_t i = 0; i < nData; i++) b.data.entries[i] = testEntry(seed, i);
    for (uint32_t i = 0; i < nOrig; i++) b.orig.entries[i] = testEntry(seed + 1000, i);
    for (uint32_t i = 0; i < nDetected; i++) b.detected.entries[i] = testEntry(seed + 2000, i);
    b.data.nEntries = nData;
    b.orig.nEntries = nOrig;
    b.detected.nEntries = nDetected;
    return b;
}

// Blocks of assorted sizes, empty ones and full ones among them.
inline std::vector<TestBlock> makeBlocks(uint32_t count) {
    std::vector<TestBlock> blocks;
    for (uint32_t i = 0; i < count; i++) {
        uint32_t nData = i % 7 == 3 ? 255 : (i * 37) % 41;
        uint32_t nOrig = i % 11 == 5 ? 0 : (i * 13) % 29;
        blocks.push_back(makeBlock(i, nData, nOrig, i % 16));
    }
    return blocks;
}

inline void putFloat(std::vector<uint8_t>& b, float v) {
    uint32_t bits;
    std::memcpy(&bits, &v, 4);
    putU32(b, bits);
}

inline void putEntries(std::vector<uint8_t>& b, const FrequencyEntry* entries, uint32_t count) {
    putU32(b, count);
    for (uint32_t i = 0; i < count; i++) {
        putFloat(b, entries[i].frequency);
        putFloat(b, entries[i].frequencyWidth);
        b.push_back(entries[i].amplitude);
        b.push_back(entries[i].initialAmplitude);
        b.push_back(entries[i].cutOffLevel);
        b.push_back(entries[i].entryFlags);
    }
}

// The stored form of a block: each buffer's count followed by its entries.
inline std::vector<uint8_t> blockBytes(const TestBlock& block) {
    std::vector<uint8_t> b;
    putEntries(b, block.data.entries, block.data.nEntries);
    putEntries(b, block.orig.entries, block.orig.nEntries);
    putEntries(b, block.detected.entries, block.detected.nEntries);
    return b;
}

struct ModelFiles {
    std::vector<uint8_t> ft;   // CS.ft: the blocks one after another
    std::vector<uint8_t> fi;   // CS.fi: the count, then offset and size per block
};

inline ModelFiles modelFiles(const std::vector<TestBlock>& blocks) {
    ModelFiles m;
    putU32(m.fi, uint32_t(blocks.size()));
    for (const TestBlock& block : blocks) {
        std::vector<uint8_t> bytes = blockBytes(block);
        putU32(m.fi, uint32_t(m.ft.size()));
        putU32(m.fi, uint32_t(bytes.size()));
        m.ft.insert(m.ft.end(), bytes.begin(), bytes.end());
    }
    return m;
}

inline std::string ftPath() { return sharedFilePath("CS.ft"); }
inline std::string fiPath() { return sharedFilePath("CS.fi"); }

// Writes CS.ft and CS.fi for blocks and gives the song as many blocks.
inline void storeModel(const std::vector<TestBlock>& blocks) {
    ModelFiles m = modelFiles(blocks);
    writeFileBytes(ftPath(), m.ft);
    writeFileBytes(fiPath(), m.fi);
    song.blockCount = uint32_t(blocks.size());
}

inline bool sameEntries(const FrequencyEntry* a, const FrequencyEntry* b, uint32_t count) {
    return std::memcmp(a, b, count * sizeof(FrequencyEntry)) == 0;
}

// Counts and valid entries of two blocks agree.
inline ::testing::AssertionResult sameBlock(const FTDataBuffer& data, const FTDataBuffer& orig,
                                            const FTDetectedBuffer& detected, const TestBlock& expected) {
    if (data.nEntries != expected.data.nEntries || !sameEntries(data.entries, expected.data.entries, data.nEntries))
        return ::testing::AssertionFailure() << "dataBuffer differs";
    if (orig.nEntries != expected.orig.nEntries || !sameEntries(orig.entries, expected.orig.entries, orig.nEntries))
        return ::testing::AssertionFailure() << "origDataBuffer differs";
    if (detected.nEntries != expected.detected.nEntries ||
        !sameEntries(detected.entries, expected.detected.entries, detected.nEntries))
        return ::testing::AssertionFailure() << "detectedFrequenciesBuffer differs";
    return ::testing::AssertionSuccess();
}

inline ::testing::AssertionResult sameBlock(const TestBlock& actual, const TestBlock& expected) {
    return sameBlock(actual.data, actual.orig, actual.detected, expected);
}

// The window's copy of block b agrees with expected.
inline ::testing::AssertionResult windowBlockIs(uint32_t b, const TestBlock& expected) {
    const FTBlockWindow& w = ftBlockWindow;
    if (b < w.firstBlock || b >= w.endBlock) return ::testing::AssertionFailure() << "block " << b << " not held";
    size_t slot = b - w.firstBlock;
    return sameBlock(w.dataBuffers[slot], w.origDataBuffers[slot], w.detectedFrequenciesBuffers[slot], expected)
           << " (block " << b << ")";
}

// Each test has a shared folder of its own and an empty store.
class FTBlockStoreTest : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        clean();
    }
    void TearDown() override {
        clean();
        SharedFolderTest::TearDown();
    }
    static void clean() {
        closeFTFile(0);
        freeFTBlockWindow();
        resetSong();
    }
};
