// Fuzz target for the Hires FT block readers: each input becomes a CS.ft+ / CS.fi+ pair in a
// private shared folder, with N from its first byte, and every block the index offers is
// read and expanded (into a caller's bins and into the Hires buffer), read as stored and
// copied back out; some inputs also have a stretch of blocks cut out. Built for libFuzzer
// with sanitizers, and, with HIRES_BLOCK_FUZZ_REPLAY defined, into the replay driver that the
// tests run.
//
// Input: N (u8), the song's block count (u8), flags (u8: bit 0 cut blocks, bits 1-7 the
// capacity of the compressed buffer), the cut's first block and count (u8 each), the index
// length (u16), the index bytes, then the data file's bytes.
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <unistd.h>
#include <vector>

#include "fuzzSupport.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

using Bytes = std::vector<uint8_t>;

static const size_t INPUT_HEAD_BYTES = 7;
static const uint32_t MAX_BLOCKS_READ = 64;
static const uint32_t WINDOW_BLOCKS = 8;
static const size_t GUARD_VALUES = 8;
static const double GUARD = -12345.0;

static void useFuzzFolder() {
    static bool ready = false;
    if (ready) return;
    setSharedBasePath(fuzzFolder("hiresBlockFuzz"));
    makeFolder(paths.sharedFolder);
    ready = true;
}

// A broken promise of the store is a finding: stop here so the fuzzer keeps the input.
static void expect(bool holds, const char* what) { fuzzExpect(holds, "hiresBlockFuzz", what); }

// Expanded bins are magnitudes (finite, not negative) with second values of 0, and
// deviations are finite; nothing is written past the N bins.
static void checkExpanded(const std::vector<double>& bins, const std::vector<float>& deviations, uint32_t n) {
    for (uint32_t i = 0; i < n; i++) {
        expect(std::isfinite(bins[2 * size_t(i)]) && bins[2 * size_t(i)] >= 0.0, "a magnitude is negative or not finite");
        expect(bins[2 * size_t(i) + 1] == 0.0, "a second value is not 0");
        expect(std::isfinite(deviations[i]), "a deviation is not finite");
    }
    for (size_t k = 0; k < GUARD_VALUES; k++) {
        expect(bins[2 * size_t(n) + k] == GUARD, "bins written past N");
        expect(deviations[n + k] == float(GUARD), "deviations written past N");
    }
}

// Reads the blocks the index offers, each after its own seek, and then one after another
// from the first, as resynthesis does.
static void readBlocks(uint32_t bins, uint32_t capacity, int64_t dataLength) {
    FILE* data = hiresFiles.hiresFile;
    FILE* index = hiresFiles.hiresIndexFile;
    uint32_t held = 0;
    if (!getFTIndexCount(index, &held)) return;
    held = std::min(held, MAX_BLOCKS_READ);
    std::vector<double> expanded(2 * size_t(bins) + GUARD_VALUES);
    std::vector<float> deviations(bins + GUARD_VALUES);
    CompressedHiresBuffer* buffer = allocCompressedHiresBuffer(capacity);
    expect(buffer != nullptr, "no compressed buffer");
    std::string copyPath = paths.sharedFolder + "copy";

    for (uint32_t block = 0; block < held; block++) {
        int ok = 0;
        uint32_t size = seekToFTBlock(data, index, block, 0, 0, &ok);
        if (!ok) continue;
        int64_t at = fileTell(data);
        expect(at >= 0 && at + int64_t(size) <= dataLength, "a block was positioned past the data");

        std::fill(expanded.begin(), expanded.end(), GUARD);
        std::fill(deviations.begin(), deviations.end(), float(GUARD));
        uint32_t consumed = readHiresFTBlock(data, 0, block, expanded.data(), deviations.data());
        if (consumed) {
            expect(consumed >= 10 && (consumed - 10) % 3 == 0 && (consumed - 10) / 3 < bins, "a count not below N was read");
            expect(at + int64_t(consumed) <= dataLength, "a block was read past the data");
            expect(fileTell(data) == at + int64_t(consumed), "the bytes consumed are not those read");
        }
        checkExpanded(expanded, deviations, bins);

        if (block < ftBlockWindow.endBlock && fileSeek(data, at, SEEK_SET) == 0) {
            uint32_t again = readHiresFTBlock(data, 0, block, nullptr, nullptr);
            expect(again == consumed, "the Hires buffer read differs from the caller's");
        }

        if (fileSeek(data, at, SEEK_SET) != 0) continue;
        uint32_t stored = readCompressedHiresBlock(data, buffer);
        expect(stored == 0 || stored == consumed, "the two readers disagree");
        if (!stored) {
            expect(buffer->count == 0, "a refused block left a count");
            continue;
        }
        expect(buffer->count <= buffer->capacity, "more entries than the buffer holds");
        FILE* copy = fileOpen(copyPath, "wb");
        expect(copy != nullptr, "cannot write the copy");
        expect(writeCompressedHiresBlock(copy, buffer) == stored, "a copied block changed its size");
        fileClose(copy);
        Bytes original = fuzzReadFile(paths.sharedFolder + "CS.ft+");
        Bytes copied = fuzzReadFile(copyPath);
        expect(Bytes(original.begin() + at, original.begin() + at + stored) == copied, "a copied block changed its bytes");
    }

    int ok = 0;
    seekToFTBlock(data, index, 0, 0, 0, &ok);
    for (uint32_t block = 0; ok && block < held; block++) {
        std::fill(expanded.begin(), expanded.end(), GUARD);
        std::fill(deviations.begin(), deviations.end(), float(GUARD));
        uint32_t consumed = readHiresFTBlock(data, 0, block, expanded.data(), deviations.data());
        checkExpanded(expanded, deviations, bins);
        if (!consumed) break;
    }
    freeCompressedHiresBuffer(buffer);
}

// After a successful cut the entries from first on describe the moved blocks: one after
// another, each of its stored size with a count below N, the last ending where the data file
// now ends; the index ends behind its entries. (Entries before first are the input's own.)
static void checkCutFiles(uint32_t first, uint32_t bins) {
    Bytes data = fuzzReadFile(paths.sharedFolder + "CS.ft+");
    Bytes index = fuzzReadFile(paths.sharedFolder + "CS.fi+");
    expect(index.size() >= 4, "the cut left no count");
    auto word = [&](size_t at) {
        return uint32_t(index[at]) | uint32_t(index[at + 1]) << 8 | uint32_t(index[at + 2]) << 16 |
               uint32_t(index[at + 3]) << 24;
    };
    uint32_t count = word(0);
    expect(index.size() == 4 + 8 * size_t(count), "the index was not cut behind its entries");
    for (uint32_t i = first; i < count; i++) {
        uint32_t offset = word(4 + 8 * size_t(i)), size = word(8 + 8 * size_t(i));
        expect(size >= 10 && offset + uint64_t(size) <= data.size(), "a moved block lies past the data");
        uint32_t stored = uint32_t(data[offset]) | uint32_t(data[offset + 1]) << 8;
        expect(size == 10 + 3 * stored && stored < bins, "a moved block's size is not its count's");
        if (i + 1 < count) expect(word(4 + 8 * size_t(i + 1)) == offset + size, "a moved block does not follow the one before");
        else expect(offset + uint64_t(size) == data.size(), "the data file was not cut behind its blocks");
    }
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* input, size_t size) {
    if (size < INPUT_HEAD_BYTES) return 0;
    useFuzzFolder();
    clearUiCalls();
    uint32_t bins = input[0];
    uint32_t blocks = input[1];
    bool cut = input[2] & 1;
    uint32_t capacity = input[2] >> 1;   // 0: N
    uint32_t cutFirst = input[3], cutCount = input[4];
    size_t indexLength = std::min<size_t>(size_t(input[5]) | size_t(input[6]) << 8, size - INPUT_HEAD_BYTES);
    const uint8_t* indexBytes = input + INPUT_HEAD_BYTES;
    const uint8_t* dataBytes = indexBytes + indexLength;
    size_t dataLength = size - INPUT_HEAD_BYTES - indexLength;

    resetSong();
    song.blockCount = blocks;
    song.waveFormat.bitsPerSample = 16;
    hiresGeometry = HiresGeometry{bins, 44100.0 / 1024, 32.0, 0.03125};
    ftBlockWindow.firstBlock = 0;
    ftBlockWindow.endBlock = std::min(blocks, WINDOW_BLOCKS);
    ftBlockWindow.capacity = WINDOW_BLOCKS;
    expect(fuzzWriteFile(paths.sharedFolder + "CS.fi+", indexBytes, indexLength) &&
               fuzzWriteFile(paths.sharedFolder + "CS.ft+", dataBytes, dataLength),
           "cannot write an input file");

    expect(openHiresFTFile(FT_READ) == 1, "the crafted files do not open");
    readBlocks(bins, capacity, int64_t(dataLength));
    expect(closeHiresFTFile(0) == 1, "the files do not close");

    if (cut && cutCount > 0) {
        if (removeHiresFTBlocksFromSong(cutFirst, cutCount)) checkCutFiles(cutFirst, bins);
        expect(!hiresFilesOpen(), "a cut left the files open");
        expect(!fileExists(paths.sharedFolder + "CS.tw"), "a cut left CS.tw behind");
    }
    freeHiresBuffers();
    return 0;
}

#ifdef HIRES_BLOCK_FUZZ_REPLAY
// The seeds for the shared replay driver: hiresBlockFuzzReplay [runs] | --write-seeds DIR | FILE...
#include <cstring>

#include "fuzzReplay.h"

// A stored block of count entries spread over the bins by gap.
static Bytes block(uint32_t count, float scale, float offset, uint8_t gap) {
    Bytes b;
    fuzzPut16(b, count);
    fuzzPutFloat(b, scale);
    fuzzPutFloat(b, offset);
    for (uint32_t j = 0; j < count; j++) fuzzPut16(b, (j * 7919u + 65535u) & 0xFFFF);
    for (uint32_t j = 0; j < count; j++) b.push_back(gap);
    return b;
}

// An input: the head, then an index for the blocks laid one after another, then the blocks.
static Bytes input(uint8_t bins, uint8_t songBlocks, uint8_t flags, uint8_t first, uint8_t count,
                   const std::vector<Bytes>& blocks) {
    Bytes index, data;
    fuzzPut32(index, uint32_t(blocks.size()));
    for (const Bytes& b : blocks) {
        fuzzPut32(index, uint32_t(data.size()));
        fuzzPut32(index, uint32_t(b.size()));
        data.insert(data.end(), b.begin(), b.end());
    }
    Bytes in = {bins, songBlocks, flags, first, count};
    fuzzPut16(in, uint32_t(index.size()));
    in.insert(in.end(), index.begin(), index.end());
    in.insert(in.end(), data.begin(), data.end());
    return in;
}

static std::vector<Bytes> seeds() {
    std::vector<Bytes> all;
    all.push_back(input(200, 3, 0, 0, 0, {block(0, 1.0f, 0.0f, 0), block(5, 12.5f, 0.1f, 30), block(2, 0.4f, -0.2f, 255)}));
    all.push_back(input(255, 4, 1, 1, 2,
                        {block(3, 11.0f, 0.0f, 1), block(1, 3.0f, 0.0f, 0), block(254, 9.0f, 0.5f, 0), block(4, 2.0f, 0.0f, 60)}));
    all.push_back(input(16, 2, 1 | (4 << 1), 0, 1, {block(15, 20.0f, 0.0f, 0), block(16, 20.0f, 0.0f, 0)}));
    all.push_back(input(1, 1, 0, 0, 0, {block(0, 0.0f, 0.0f, 0)}));
    all.push_back(input(0, 2, 1, 0, 1, {block(0, 1.0f, 0.0f, 0), block(0, 1.0f, 0.0f, 0)}));
    all.push_back(input(100, 6, 1, 4, 2,
                        {block(2, 5.0f, 0.0f, 10), block(2, 5.0f, 0.0f, 10), block(2, 5.0f, 0.0f, 10),
                         block(2, 5.0f, 0.0f, 10), block(2, 5.0f, 0.0f, 10), block(2, 5.0f, 0.0f, 10)}));
    return all;
}

int main(int argc, char** argv) { return runFuzzReplay(argc, argv, seeds(), LLVMFuzzerTestOneInput, 20000); }
#endif
