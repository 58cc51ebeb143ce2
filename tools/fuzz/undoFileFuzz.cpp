// Fuzz target for the undo level files: each input is read as an "Undo" file and as a "FrDr"
// file. A file the reader takes must hold a sound level (the lists within their limits, every
// time a number, the name within its length) that writes back and reads again to the same
// level; a refused file must leave the reader's output as it was. Built for libFuzzer with
// sanitizers, and with UNDO_FILE_FUZZ_REPLAY into the replay driver that the tests run.
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "fuzzSupport.h"
#include "notes/noteList.h"
#include "platform/ui.h"
#include "store/song.h"
#include "store/undoFiles.h"

static void expect(bool holds, const char* what) { fuzzExpect(holds, "undoFileFuzz", what); }

static bool sameLevel(const UndoSongFile& a, const UndoSongFile& b) {
    return a.instrumentName == b.instrumentName && a.timeSignatureBeats == b.timeSignatureBeats &&
           a.timeSignatureUnit == b.timeSignatureUnit && a.timeSignatureSymbol == b.timeSignatureSymbol &&
           a.notes.size() == b.notes.size() &&
           (a.notes.empty() || std::memcmp(a.notes.data(), b.notes.data(), a.notes.size() * sizeof(Note)) == 0) &&
           a.barlines.size() == b.barlines.size() &&
           (a.barlines.empty() || std::memcmp(a.barlines.data(), b.barlines.data(), a.barlines.size() * 4) == 0);
}

static void checkSongFile(const std::string& input, const std::string& saved) {
    UndoSongFile level;
    level.instrumentName = "unread";
    int result = readUndoSongFile(input, &level);
    if (result != UNDO_FILE_READ) {
        expect(result == UNDO_FILE_DAMAGED, "an existing file read as missing");
        expect(level.instrumentName == "unread" && level.notes.empty(), "a refused file changed the output");
        return;
    }
    expect(level.notes.size() <= size_t(MAX_CS_NOTES), "more notes than the list holds");
    expect(level.barlines.size() <= size_t(MAX_CS_BARLINES), "more barlines than the list holds");
    for (const Note& n : level.notes)
        expect(std::isfinite(n.waveStart) && std::isfinite(n.waveEnd) && std::isfinite(n.midiStart) &&
                   std::isfinite(n.midiEnd) && std::isfinite(n.pitch),
               "a note time that is no number");
    for (float b : level.barlines) expect(std::isfinite(b), "a barline that is no number");

    // Written back from the song's lists, the level reads again the same.
    song.instrumentName = level.instrumentName;
    song.timeSignatureBeats = level.timeSignatureBeats;
    song.timeSignatureUnit = level.timeSignatureUnit;
    song.timeSignatureSymbol = level.timeSignatureSymbol;
    noteList.count = int(level.notes.size());
    std::copy(level.notes.begin(), level.notes.end(), noteList.notes);
    barlineList.count = int(level.barlines.size());
    std::copy(level.barlines.begin(), level.barlines.end(), barlineList.times);
    expect(writeUndoSongFile(saved) == 1, "a level read cannot be written");
    UndoSongFile again;
    expect(readUndoSongFile(saved, &again) == UNDO_FILE_READ, "a level written cannot be read");
    expect(sameLevel(level, again), "a level changed on its way through the file");
}

static void checkDurationsFile(const std::string& input) {
    std::vector<double> durations = {1.5};
    int result = readUndoDurationsFile(input, &durations);
    if (result != UNDO_FILE_READ) {
        expect(durations.size() == 1 && durations[0] == 1.5, "refused durations changed the output");
        return;
    }
    for (double d : durations) expect(std::isfinite(d) && d >= 0.0, "a duration that is no length");
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const std::string folder = [] {
        setUiEcho(false);
        return fuzzFolder("undoFileFuzz");
    }();
    std::string input = folder + "Undo0", saved = folder + "Undo1";
    FILE* f = std::fopen(input.c_str(), "wb");
    if (!f) return 0;
    size_t written = size ? std::fwrite(data, 1, size, f) : 0;
    if (std::fclose(f) != 0 || written != size) return 0;
    checkSongFile(input, saved);
    checkDurationsFile(input);
    clearUiCalls();
    return 0;
}

#ifdef UNDO_FILE_FUZZ_REPLAY
// The seeds for the shared replay driver: undoFileFuzzReplay [runs] | --write-seeds DIR | FILE...
#include "fuzzReplay.h"

using Bytes = std::vector<uint8_t>;

// A level of count notes (of which stored are in the file) and the barlines.
static Bytes level(const char* name, uint32_t count, uint32_t stored, const std::vector<float>& barlines) {
    Bytes b;
    for (const char* c = name; *c; c++) fuzzPut16(b, uint8_t(*c));
    fuzzPut16(b, 0);
    fuzzPut32(b, 4);
    fuzzPut32(b, 4);
    fuzzPut32(b, 1);
    fuzzPut32(b, count);
    for (uint32_t i = 0; i < stored; i++) {
        Note n{};
        n.pitch = 220.0f * float(i + 1);
        n.midiStart = n.waveStart = 0.5f * float(i);
        n.midiEnd = n.waveEnd = 0.5f * float(i) + 0.25f;
        n.midiNote = uint8_t(57 + i);
        n.volumeSum = 100 * i;
        const uint8_t* p = reinterpret_cast<const uint8_t*>(&n);
        b.insert(b.end(), p, p + sizeof n);
    }
    fuzzPut32(b, uint32_t(barlines.size()));
    for (float t : barlines) fuzzPutFloat(b, t);
    return b;
}

static Bytes durations(const std::vector<double>& d) {
    Bytes b;
    fuzzPut32(b, uint32_t(d.size()));
    for (double x : d) {
        const uint8_t* p = reinterpret_cast<const uint8_t*>(&x);
        b.insert(b.end(), p, p + 8);
    }
    return b;
}

static std::vector<Bytes> seeds() {
    return {level("Voice", 0, 0, {}),
            level("Flute", 3, 3, {0.5f, 2.0f}),
            level("Piano", 2, 1, {}),
            level("", 1, 1, {1.0f}),
            durations({0.0116, 0.0116, 0.0232}),
            durations({}),
            Bytes{}};
}

int main(int argc, char** argv) { return runFuzzReplay(argc, argv, seeds(), LLVMFuzzerTestOneInput, 10000); }
#endif
