// Fuzz target for the FT block store: each input becomes a CS.fi and a CS.ft in a shared
// folder of its own, with the song's block count and the window's capacity taken from its
// head; the blocks are then read one by one, loaded into the window, written back and cut, as
// the program would do with files left by a crash or changed by hand. Built for libFuzzer with
// sanitizers, and with FT_BLOCK_FUZZ_REPLAY into the replay driver that the tests run.
//
// Input: [blockCount u8] [capacity u8] [jobs u8] [index bytes u16] CS.fi bytes, then CS.ft bytes.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "fuzzSupport.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/ftBlockStore.h"
#include "store/song.h"

static const size_t HEAD_BYTES = 5;

// A broken promise of the store is a finding: stop here so the fuzzer keeps the input.
static void expect(bool holds, const char* what) { fuzzExpect(holds, "ftBlockFuzz", what); }

static void useOwnSharedFolder() {
    static bool ready = false;
    if (ready) return;
    setSharedBasePath(fuzzFolder("ftBlockFuzz"));
    makeFolder(paths.sharedFolder);
    setUiEcho(false);
    ready = true;
}

static void expectSoundBlock(const FTDataBuffer& data, const FTDataBuffer& orig, const FTDetectedBuffer& detected) {
    expect(data.nEntries < FT_DATA_ENTRIES && orig.nEntries < FT_DATA_ENTRIES &&
               detected.nEntries < FT_DETECTED_ENTRIES,
           "a block with counts beyond its buffers");
}

// What the window holds lies inside the song and the capacity, and every block in it is sound.
static void expectSoundWindow() {
    const FTBlockWindow& w = ftBlockWindow;
    if (w.endBlock == w.firstBlock) return;
    expect(w.firstBlock < w.endBlock, "a window that ends before it starts");
    expect(w.endBlock <= song.blockCount, "a window past the song's end");
    expect(w.endBlock - w.firstBlock <= w.capacity, "a window beyond its capacity");
    expect(w.dataBuffers.size() >= w.endBlock - w.firstBlock, "a window larger than its arrays");
    for (uint32_t slot = 0; slot < w.endBlock - w.firstBlock; slot++)
        expectSoundBlock(w.dataBuffers[slot], w.origDataBuffers[slot], w.detectedFrequenciesBuffers[slot]);
}

static void resetStore() {
    closeFTFile(0);
    freeFTBlockWindow();
    resetSong();
    clearUiCalls();
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < HEAD_BYTES) return 0;
    useOwnSharedFolder();
    resetStore();
    uint32_t blockCount = data[0];
    uint32_t capacityBlocks = 1 + (data[1] & 63);
    uint8_t jobs = data[2];
    size_t indexBytes = std::min<size_t>(size - HEAD_BYTES, size_t(data[3]) | size_t(data[4]) << 8);
    const uint8_t* index = data + HEAD_BYTES;
    if (!fuzzWriteFile(sharedFilePath("CS.fi"), index, indexBytes) ||
        !fuzzWriteFile(sharedFilePath("CS.ft"), index + indexBytes, size - HEAD_BYTES - indexBytes))
        return 0;
    fileDelete(sharedFilePath("CS.tw"));
    song.blockCount = blockCount;
    setFTBlockWindowCapacity(FT_WINDOW_SECONDS / capacityBlocks);

    // Block by block, as the MIDI writer and recognition read them.
    if (openFTFile(FT_READ)) {
        uint32_t count = 0;
        if (getFTIndexCount(ftFiles.ftIndexFile, &count)) {
            expect(count <= blockCount, "an index count above the song's");
            expect(count == 0 || 4 + 8 * uint64_t(count) <= indexBytes, "an index count beyond the index file");
        }
        static FTDataBuffer d, o;
        static FTDetectedBuffer det;
        for (uint32_t block = 0; block < std::min<uint32_t>(count + 1, 8); block++) {
            clearUiCalls();
            int ok = 0;
            uint32_t stored = seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, block, 0, 0, &ok);
            expect(ok || messageCount() > 0, "a refused seek without a message");
            if (!ok) continue;
            expect(fileTell(ftFiles.ftFile) + int64_t(stored) <= int64_t(size - HEAD_BYTES - indexBytes),
                   "a block positioned past the data file");
            uint32_t bytes = readFTBlock(ftFiles.ftFile, block, &d, &o, &det);
            expect(bytes > 0 || messageCount() > 0, "a failed read without a message");
            expectSoundBlock(d, o, det);
            if (bytes) expect(bytes == ftBlockBytes(d.nEntries, o.nEntries, det.nEntries), "a block size that lies");
        }
        closeFTFile(1);
    }

    // The window, as note editing moves it, then written back and reloaded.
    uint32_t from = blockCount ? (jobs >> 4) % blockCount : 0;
    clearUiCalls();
    int loaded = loadFTBlockWindow(from, from + 1);
    expectSoundWindow();
    if (loaded) expect(ftBlockWindow.firstBlock == from, "a window that does not start where asked");
    if (jobs & 1) {
        for (uint32_t slot = 0; slot < ftBlockWindow.endBlock - ftBlockWindow.firstBlock; slot++)
            ftBlockWindow.origDataBuffers[slot].entries[0].frequency *= 1.5f;
        saveFTBlocks(ftBlockWindow.firstBlock, ftBlockWindow.endBlock);
        expect(!ftFilesOpen(), "files left open by a save");
    }
    loadFTBlockWindow(0, 0);
    expectSoundWindow();

    // The analysis rewriting the window's blocks from its first one.
    if ((jobs & 2) && ftBlockWindow.endBlock > ftBlockWindow.firstBlock && openFTFile(FT_UPDATE)) {
        rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, ftBlockWindow.firstBlock, ftBlockWindow.endBlock);
        closeFTFile(1);
    }

    // A cut, as time editing makes it.
    if (jobs & 4) {
        uint32_t first = blockCount ? (jobs >> 3 & 7) % blockCount : 0;
        uint32_t count = (jobs >> 6) + 1;
        clearUiCalls();
        int cut = removeFTBlocksFromSong(first, count);
        expect(cut || messageCount() > 0, "a refused cut without a message");
        expect(!ftFilesOpen(), "files left open by a cut");
        expect(!fileExists(sharedFilePath("CS.tw")), "CS.tw left behind");
        if (cut) {
            int64_t indexLength = fileSize(sharedFilePath("CS.fi"));
            std::vector<uint8_t> head(4, 0);
            FILE* f = std::fopen(sharedFilePath("CS.fi").c_str(), "rb");
            expect(f && std::fread(head.data(), 1, 4, f) == 4, "an index without a count after a cut");
            std::fclose(f);
            uint32_t newCount = uint32_t(head[0]) | uint32_t(head[1]) << 8 | uint32_t(head[2]) << 16 |
                                uint32_t(head[3]) << 24;
            expect(indexLength == 4 + 8 * int64_t(newCount), "an index not cut to its count");
            song.blockCount -= std::min(song.blockCount, count);
            loadFTBlockWindow(0, 0);
            expectSoundWindow();
        }
    }
    resetStore();
    return 0;
}

#ifdef FT_BLOCK_FUZZ_REPLAY
// The seeds for the shared replay driver: ftBlockFuzzReplay [runs] | --write-seeds DIR | FILE...
#include "fuzzReplay.h"

using Bytes = std::vector<uint8_t>;

// A song of blocks with the given counts, laid out as the store writes it.
static Bytes seed(uint8_t blockCount, uint8_t capacity, uint8_t jobs, const std::vector<uint32_t>& counts) {
    Bytes index, ft;
    size_t blocks = counts.size() / 3;
    fuzzPut32(index, uint32_t(blocks));
    for (size_t b = 0; b < blocks; b++) {
        size_t start = ft.size();
        for (int buffer = 0; buffer < 3; buffer++) {
            uint32_t n = counts[b * 3 + buffer];
            fuzzPut32(ft, n);
            for (uint32_t i = 0; i < n; i++) {
                float frequency = 100.0f + float(b * 7 + i);
                uint32_t bits;
                std::memcpy(&bits, &frequency, 4);
                fuzzPut32(ft, bits);
                fuzzPut32(ft, 0x3F800000);
                fuzzPut32(ft, uint32_t(i * 0x01010101u));
            }
        }
        fuzzPut32(index, uint32_t(start));
        fuzzPut32(index, uint32_t(ft.size() - start));
    }
    Bytes input = {blockCount, capacity, jobs, uint8_t(index.size()), uint8_t(index.size() >> 8)};
    input.insert(input.end(), index.begin(), index.end());
    input.insert(input.end(), ft.begin(), ft.end());
    return input;
}

static std::vector<Bytes> seeds() {
    std::vector<Bytes> all;
    all.push_back(seed(0, 0, 0, {}));
    all.push_back(seed(1, 3, 0x07, {0, 0, 0}));
    all.push_back(seed(4, 2, 0x15, {1, 1, 1, 3, 2, 1, 0, 0, 0, 5, 5, 2}));
    all.push_back(seed(6, 3, 0x2E, {2, 2, 1, 0, 1, 0, 4, 4, 1, 1, 0, 0, 3, 3, 2, 2, 2, 2}));
    all.push_back(seed(3, 10, 0xC7, {255, 255, 15, 0, 0, 1, 7, 7, 3}));
    all.push_back(seed(9, 1, 0x5B, {1, 1, 1, 2, 2, 2, 3, 3, 3, 4, 4, 4, 5, 5, 5, 6, 6, 6, 0, 0, 0, 1, 0, 1, 2, 0, 2}));
    all.push_back(seed(200, 63, 0x03, {3, 3, 1, 3, 3, 1}));   // the song claims more than the index holds
    return all;
}

int main(int argc, char** argv) { return runFuzzReplay(argc, argv, seeds(), LLVMFuzzerTestOneInput, 20000); }
#endif
