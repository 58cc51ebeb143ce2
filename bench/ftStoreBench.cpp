// Throughput of the FT block store at the default geometry (44,100 Hz, "Low to Mid": blocks of
// 512 samples, 86.13 per second, a window of 2583 blocks): ten minutes of full FT blocks
// (255 + 255 + 15 entries, 6312 bytes each) written as the analysis writes them and read back
// window by window, and the reload of one full 30-second window. Run a Release build:
// build/bench/ftStoreBench. The files go to a temporary shared folder, removed at the end.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "benchFolder.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/ftBlockStore.h"
#include "store/song.h"

static const double SAMPLE_BLOCK_DURATION = 512.0 / 44100.0;                  // seconds
static const uint32_t SONG_BLOCKS = uint32_t(600.0 / SAMPLE_BLOCK_DURATION);  // ten minutes
static const uint32_t FULL_BLOCK_BYTES = ftBlockBytes(255, 255, 15);

static std::string benchFolder;   // the temporary shared base path, made on first use

static void fillEntries(FrequencyEntry* entries, uint32_t count, uint32_t seed) {
    for (uint32_t i = 0; i < count; i++) {
        float frequency = 41.3f * float(1 + i) + float(seed % 7);
        entries[i] = FrequencyEntry{frequency, frequency * 0.0250858f, uint8_t(i), uint8_t(i), 45, 0};
    }
}

// A song of SONG_BLOCKS blocks and a window filled with full blocks, as the analysis leaves it.
static void setUpSong() {
    if (benchFolder.empty()) {
        benchFolder = makeBenchFolder("ftStoreBench");
        setSharedBasePath(benchFolder);
        makeFolder(paths.sharedFolder);
    }
    closeFTFile(0);
    freeFTBlockWindow();
    song.blockCount = SONG_BLOCKS;
    setFTBlockWindowCapacity(SAMPLE_BLOCK_DURATION);
    if (!growFTBlockWindow()) std::exit(1);
    for (uint32_t slot = 0; slot < ftBlockWindow.capacity; slot++) {
        fillEntries(ftBlockWindow.dataBuffers[slot].entries, 255, slot);
        ftBlockWindow.dataBuffers[slot].nEntries = 255;
        fillEntries(ftBlockWindow.origDataBuffers[slot].entries, 255, slot + 1);
        ftBlockWindow.origDataBuffers[slot].nEntries = 255;
        fillEntries(ftBlockWindow.detectedFrequenciesBuffers[slot].entries, 15, slot + 2);
        ftBlockWindow.detectedFrequenciesBuffers[slot].nEntries = 15;
    }
}

// Writes the whole song from empty files, one window of blocks at a time, as the analysis does.
static int writeSong() {
    fileDelete(sharedFilePath("CS.ft"));
    fileDelete(sharedFilePath("CS.fi"));
    if (!openFTFile(FT_UPDATE)) return 0;
    int written = 1;
    for (uint32_t first = 0; written && first < SONG_BLOCKS; first += ftBlockWindow.capacity) {
        ftBlockWindow.firstBlock = first;
        ftBlockWindow.endBlock = std::min(SONG_BLOCKS, first + ftBlockWindow.capacity);
        written = rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, first, ftBlockWindow.endBlock);
    }
    return closeFTFile(1) && written;
}

static void setRates(benchmark::State& state, uint32_t blocks) {
    state.SetBytesProcessed(int64_t(state.iterations()) * blocks * FULL_BLOCK_BYTES);
    state.counters["blocks/s"] = benchmark::Counter(double(state.iterations()) * blocks, benchmark::Counter::kIsRate);
    state.counters["blocks"] = blocks;
}

static void FTStore_writeTenMinutes(benchmark::State& state) {
    setUpSong();
    for (auto _ : state) {
        if (!writeSong()) state.SkipWithError(lastMessageText().c_str());
    }
    setRates(state, SONG_BLOCKS);
}

static void FTStore_readTenMinutes(benchmark::State& state) {
    setUpSong();
    if (!writeSong()) state.SkipWithError(lastMessageText().c_str());
    for (auto _ : state) {
        for (uint32_t first = 0; first < SONG_BLOCKS; first += ftBlockWindow.capacity) {
            if (!loadFTBlockWindow(first, first + 1)) {
                state.SkipWithError(lastMessageText().c_str());
                break;
            }
        }
        // The next pass starts from an empty window, so its first load is not already held.
        ftBlockWindow.firstBlock = ftBlockWindow.endBlock = 0;
    }
    setRates(state, SONG_BLOCKS);
}

static void FTStore_reloadThirtySecondWindow(benchmark::State& state) {
    setUpSong();
    if (!writeSong() || !loadFTBlockWindow(SONG_BLOCKS / 2, SONG_BLOCKS / 2 + 1))
        state.SkipWithError(lastMessageText().c_str());
    for (auto _ : state) {
        if (!loadFTBlockWindow(0, 0)) state.SkipWithError(lastMessageText().c_str());
    }
    setRates(state, ftBlockWindow.endBlock - ftBlockWindow.firstBlock);
}

BENCHMARK(FTStore_writeTenMinutes)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(FTStore_readTenMinutes)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(FTStore_reloadThirtySecondWindow)->Unit(benchmark::kMillisecond);

BENCHMARK_MAIN();
