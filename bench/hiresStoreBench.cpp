// Throughput of the Hires FT block store at the default geometry (44,100 Hz, "Low to Mid":
// blocks of 512 samples, 86.13 per second, 6 levels, so N = 512 x 32 = 16,384 bins of
// 43.07 Hz / 32 from F = 43.07 Hz, 3683 of them below 5000 Hz): ten minutes of blocks of a
// sung tone (harmonics with vibrato over noise) compressed and written as the analysis
// writes them, then read back and expanded one after another as resynthesis reads them.
// Run a Release build: build/bench/hiresStoreBench. The files go to a temporary shared
// folder, removed at the end.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <random>
#include <string>
#include <vector>

#include "benchFolder.h"
#include "platform/files.h"
#include "shell/paths.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

static const double SAMPLE_RATE = 44100.0;
static const uint32_t BLOCK_SAMPLES = 512;                                      // N0
static const uint32_t GROUP = 32;                                               // G, 6 levels
static const double SAMPLE_BLOCK_DURATION = BLOCK_SAMPLES / SAMPLE_RATE;        // seconds
static const uint32_t SONG_BLOCKS = uint32_t(600.0 / SAMPLE_BLOCK_DURATION);    // ten minutes
static const uint32_t BINS = BLOCK_SAMPLES * GROUP;
static const double BIN_SPACING = SAMPLE_RATE / 2 / BLOCK_SAMPLES;              // Hz
// The analysis' Hires rows are written a window at a time; a window of this many blocks
// keeps the benchmark's memory small (the full 30-second window would take 677 MB).
static const uint32_t WINDOW_BLOCKS = 64;

static std::string benchFolder;   // the temporary shared base path, made on first use

// Power spectrum of one block of a sung tone around 220 Hz with a 5.5 Hz vibrato of half a
// semitone: twelve harmonics falling 6 dB each, every peak spread over a Hann main lobe of
// a few fine bins, over exponentially distributed noise below the 16-bit threshold.
static void fillBlock(double* bins, uint32_t block, std::mt19937& random) {
    std::exponential_distribution<double> noise(1.0 / 2000.0);
    for (uint32_t i = 0; i < BINS; i++) {
        bins[2 * size_t(i)] = noise(random);
        bins[2 * size_t(i) + 1] = 0.0;
    }
    double t = block * SAMPLE_BLOCK_DURATION;
    double fundamental = 220.0 * std::pow(2.0, 0.5 / 12 * std::sin(2 * M_PI * 5.5 * t));
    double binsPerHz = GROUP / BIN_SPACING;
    for (int h = 1; h <= 12; h++) {
        double centre = (h * fundamental - BIN_SPACING) * binsPerHz;   // fine bin of the harmonic
        double peak = 4e9 / (h * h);
        for (int k = -4; k <= 4; k++) {
            int64_t i = int64_t(std::lround(centre)) + k;
            if (i < 0 || i >= int64_t(BINS)) continue;
            double x = (double(i) - centre) / 4.0;
            if (std::fabs(x) < 1.0) bins[2 * size_t(i)] += peak * std::pow(std::cos(M_PI * x / 2), 4);
        }
    }
}

static void setUpSong() {
    if (benchFolder.empty()) {
        benchFolder = makeBenchFolder("hiresStoreBench");
        setSharedBasePath(benchFolder);
        makeFolder(paths.sharedFolder);
    }
    closeHiresFTFile(0);
    freeHiresBuffers();
    song.blockCount = SONG_BLOCKS;
    song.waveFormat.bitsPerSample = 16;
    hiresGeometry = HiresGeometry{BINS, BIN_SPACING, double(GROUP), 0.03125};
    ftBlockWindow.capacity = WINDOW_BLOCKS;
    if (!allocHiresBuffer()) std::exit(1);
    std::mt19937 random(11);
    for (uint32_t b = 0; b < WINDOW_BLOCKS; b++) fillBlock(hiresBuffer.bins + size_t(b) * BINS * 2, b, random);
}

// Writes the whole song from empty files, the window's rows standing in for every window.
static int writeSong() {
    fileDelete(sharedFilePath("CS.ft+"));
    fileDelete(sharedFilePath("CS.fi+"));
    if (!openHiresFTFile(FT_UPDATE)) return 0;
    int written = 1;
    for (uint32_t first = 0; written && first < SONG_BLOCKS; first += WINDOW_BLOCKS) {
        ftBlockWindow.firstBlock = first;
        ftBlockWindow.endBlock = std::min(SONG_BLOCKS, first + WINDOW_BLOCKS);
        written = writeHiresFTBlocks(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, first, ftBlockWindow.endBlock);
    }
    return closeHiresFTFile(1) && written;
}

static void reportThroughput(benchmark::State& state) {
    int64_t bytes = fileSize(sharedFilePath("CS.ft+"));
    state.SetBytesProcessed(int64_t(state.iterations()) * bytes);
    state.SetItemsProcessed(int64_t(state.iterations()) * SONG_BLOCKS);
    state.counters["blocks"] = SONG_BLOCKS;
    state.counters["bytes/block"] = double(bytes) / SONG_BLOCKS;
}

static void HiresWriteTenMinutes(benchmark::State& state) {
    setUpSong();
    for (auto _ : state)
        if (!writeSong()) state.SkipWithError("writing failed");
    reportThroughput(state);
}

static void HiresReadTenMinutes(benchmark::State& state) {
    setUpSong();
    if (!writeSong()) {
        state.SkipWithError("writing failed");
        return;
    }
    std::vector<double> bins(2 * size_t(BINS));
    std::vector<float> deviations(BINS);
    for (auto _ : state) {
        if (!openHiresFTFile(FT_READ)) {
            state.SkipWithError("opening failed");
            break;
        }
        int ok = 0;
        seekToFTBlock(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, 0, 0, 0, &ok);
        for (uint32_t b = 0; ok && b < SONG_BLOCKS; b++)
            ok = readHiresFTBlock(hiresFiles.hiresFile, 0, b, bins.data(), deviations.data()) != 0;
        benchmark::DoNotOptimize(bins.data());
        closeHiresFTFile(0);
        if (!ok) state.SkipWithError("reading failed");
    }
    reportThroughput(state);
}

BENCHMARK(HiresWriteTenMinutes)->Unit(benchmark::kMillisecond)->UseRealTime()->MinTime(2.0);
BENCHMARK(HiresReadTenMinutes)->Unit(benchmark::kMillisecond)->UseRealTime()->MinTime(2.0);

BENCHMARK_MAIN();
