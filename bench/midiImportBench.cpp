// MIDI file import and the song written back as MIDI, for two files: a five-minute melody of
// 1,000 notes with a tempo track, and the worst a file of a few kilobytes can ask for, 2,048
// notes (every key of every channel) held together for 26 hours. Run a Release build:
// build/bench/midiImportBench. The files go to a temporary folder, removed at the end.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "benchFolder.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "shell/paths.h"
#include "store/song.h"

using Bytes = std::vector<uint8_t>;

static std::string folder;   // the temporary folder, made on first use

static void put(Bytes& b, std::initializer_list<uint8_t> bytes) { b.insert(b.end(), bytes); }

static void putDelta(Bytes& b, uint32_t v) {
    Bytes out = {uint8_t(v & 0x7F)};
    while (v >>= 7) out.insert(out.begin(), uint8_t(0x80 | (v & 0x7F)));
    b.insert(b.end(), out.begin(), out.end());
}

static void putBig32(Bytes& b, uint32_t v) { put(b, {uint8_t(v >> 24), uint8_t(v >> 16), uint8_t(v >> 8), uint8_t(v)}); }

// A format-0 file at 480 ticks per quarter note of one track of these events.
static std::string writeMidi(const char* name, Bytes events) {
    put(events, {0x00, 0xFF, 0x2F, 0x00});
    Bytes file = {'M', 'T', 'h', 'd', 0, 0, 0, 6, 0, 0, 0, 1, 480 >> 8, 480 & 0xFF, 'M', 'T', 'r', 'k'};
    putBig32(file, uint32_t(events.size()));
    file.insert(file.end(), events.begin(), events.end());
    std::string path = folder + "/" + name;
    FILE* f = std::fopen(path.c_str(), "wb");
    if (!f || std::fwrite(file.data(), 1, file.size(), f) != file.size() || std::fclose(f) != 0) std::exit(1);
    return path;
}

// 1,000 notes of an eighth each at 100 quarter notes per minute, rising and falling.
static std::string melodyFile() {
    Bytes e;
    put(e, {0x00, 0xFF, 0x51, 0x03, 0x09, 0x27, 0xC0});
    for (int i = 0; i < 1000; i++) {
        uint8_t key = uint8_t(60 + (i % 24 < 12 ? i % 12 : 12 - i % 12));
        putDelta(e, i == 0 ? 0 : 60);
        put(e, {0x90, key, 90});
        putDelta(e, 180);
        put(e, {0x80, key, 0});
    }
    return writeMidi("melody.mid", e);
}

// Every key of every channel struck at once and released after 26 hours (the slowest tempo).
static std::string heldFile() {
    Bytes e;
    put(e, {0x00, 0xFF, 0x51, 0x03, 0xFF, 0xFF, 0xFF});
    for (int c = 0; c < 16; c++)
        for (int k = 0; k < 128; k++) put(e, {0x00, uint8_t(0x90 | c), uint8_t(k), 100});
    for (int c = 0; c < 16; c++)
        for (int k = 0; k < 128; k++) {
            putDelta(e, c == 0 && k == 0 ? 5580 * 480 : 0);
            put(e, {uint8_t(0x80 | c), uint8_t(k), 0});
        }
    return writeMidi("held.mid", e);
}

static void emptySong() {
    resetSong();
    resetNoteList();
    resetSelection();
    resetMidiImport();
}

static void setUp() {
    if (!folder.empty()) return;
    folder = makeBenchFolder("midiImportBench");
    setSharedBasePath(folder);
    makeFolder(paths.sharedFolder);
    setUiEcho(false);
}

static void importFile(benchmark::State& state, const std::string& path) {
    for (auto _ : state) {
        emptySong();
        if (importMidiFile(path) != 1) state.SkipWithError("the file was refused");
    }
    state.counters["notes"] = noteList.count;
    state.counters["blocks"] = song.blockCount;
}

static void writeBack(benchmark::State& state, const std::string& path) {
    emptySong();
    if (importMidiFile(path) != 1) state.SkipWithError("the file was refused");
    std::string out = folder + "/written.mid";
    for (auto _ : state)
        if (writeNotesMidiFile(out, 0, 0, -1.0, -1.0) != 1) state.SkipWithError("the file was not written");
}

static void BM_ImportMelody(benchmark::State& state) {
    setUp();
    importFile(state, melodyFile());
}
static void BM_ImportHeldNotes(benchmark::State& state) {
    setUp();
    importFile(state, heldFile());
}
static void BM_WriteMelody(benchmark::State& state) {
    setUp();
    writeBack(state, melodyFile());
}
static void BM_WriteHeldNotes(benchmark::State& state) {
    setUp();
    writeBack(state, heldFile());
}
BENCHMARK(BM_ImportMelody)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_ImportHeldNotes)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_WriteMelody)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_WriteHeldNotes)->Unit(benchmark::kMillisecond);

BENCHMARK_MAIN();
