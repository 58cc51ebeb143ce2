// Fuzz target for MIDI file import: each input becomes a .mid file in a folder of its own and
// is read into an empty song as Open does. A refused file must say so in exactly one message; a
// file read must give a sound song (notes in start order, keys and parts in range, times inside
// the song's time axis), which the program's own writer saves and the reader takes back whole.
// Built for libFuzzer with sanitizers, and with MIDI_FILE_FUZZ_REPLAY into the replay driver
// that the tests run.
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

#include "fuzzSupport.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "resources/generalMidi.h"
#include "shell/paths.h"
#include "shell/saveSong.h"
#include "store/song.h"

static std::string folder;   // the target's own temporary folder, ending in "/"

// A broken promise of the reader is a finding: stop here so the fuzzer keeps the input.
static void expect(bool holds, const char* what) { fuzzExpect(holds, "midiFileFuzz", what); }

static void useOwnFolder() {
    if (!folder.empty()) return;
    folder = fuzzFolder("midiFileFuzz");
    setSharedBasePath(folder);
    makeFolder(paths.sharedFolder);
    // Parts are named from a General MIDI list of the target's own.
    paths.resourcePath = folder;
    makeFolder(folder + "Resources");
    FILE* list = std::fopen((folder + "Resources/" + GENERAL_MIDI_FILE).c_str(), "w");
    if (list) {
        std::fputs("1 \"Grand Piano\" \"Piano\"\n41 \"Violin\"\n74 \"Flute\"\n", list);
        std::fclose(list);
    }
    setUiEcho(false);
}

static void emptySong() {
    resetSong();
    resetNoteList();
    resetSelection();
    resetMidiImport();
    resetMidiOutput();
    resetSongNames();
    resetDisplayModes();
}

static void expectSoundSong() {
    expect(noteList.count >= 0 && noteList.count <= MAX_CS_NOTES, "a note count beyond the list");
    expect(midiImport.partCount >= 0 && midiImport.partCount <= MAX_MIDI_PARTS, "a part count beyond the parts");
    double songEnd = songDuration();
    for (int i = 0; i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        expect(n.midiNote < 128, "a key above 127");
        expect(std::isfinite(n.midiStart) && std::isfinite(n.midiEnd), "a time that is not a number");
        expect(n.midiStart >= 0.0f && n.midiStart <= n.midiEnd, "a note that ends before it starts");
        expect(double(n.midiEnd) <= MAX_IMPORTED_SONG_SECONDS + 1.0, "a note later than the longest song");
        expect(i == 0 || noteList.notes[i - 1].midiStart <= n.midiStart, "notes out of start order");
        expect(n.sourceIndex < 16, "a part number beyond the channels");
        expect(!song.notesOnly || double(n.midiEnd) <= songEnd + song.sampleBlockDuration,
               "a note beyond the song's time axis");
    }
    for (int p = 0; p < midiImport.partCount; p++) expect(!midiImport.parts[p].name.empty(), "a part without a name");
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    useOwnFolder();
    std::string input = folder + "input.mid";
    std::string saved = folder + "saved.mid";
    if (!fuzzWriteFile(input, data, size)) return 0;

    emptySong();
    clearUiCalls();
    int read = importMidiFile(input);
    expect(messageCount() == (read ? 0 : 1), "a file read with a message, or refused without exactly one");
    expectSoundSong();
    if (!read) {
        emptySong();
        return 0;
    }
    int notes = noteList.count;
    expect(writeNotesMidiFile(saved, 0, 0, -1.0, -1.0) == 1, "a song read that cannot be written");
    emptySong();
    clearUiCalls();
    expect(importMidiFile(saved) == 1 && messageCount() == 0, "the program's own file refused");
    expectSoundSong();
    // Notes of one key that overlap become one on the way through a single channel, and the
    // writer leaves out a note that ends within half a block of the song's start.
    expect(noteList.count <= notes, "more notes read back than were written");
    emptySong();
    return 0;
}

#ifdef MIDI_FILE_FUZZ_REPLAY
// The seeds for the shared replay driver: midiFileFuzzReplay [runs] | --write-seeds DIR | FILE...
#include "fuzzReplay.h"

using Bytes = std::vector<uint8_t>;

static void putBig(Bytes& b, uint32_t v, int bytes) {
    for (int i = bytes - 1; i >= 0; i--) b.push_back(uint8_t(v >> (8 * i)));
}

static Bytes fileOf(int format, uint16_t division, const std::vector<Bytes>& tracks) {
    Bytes b = {'M', 'T', 'h', 'd'};
    putBig(b, 6, 4);
    putBig(b, uint32_t(format), 2);
    putBig(b, uint32_t(tracks.size()), 2);
    putBig(b, division, 2);
    for (const Bytes& events : tracks) {
        b.insert(b.end(), {'M', 'T', 'r', 'k'});
        putBig(b, uint32_t(events.size() + 4), 4);
        b.insert(b.end(), events.begin(), events.end());
        b.insert(b.end(), {0x00, 0xFF, 0x2F, 0x00});
    }
    return b;
}

static std::vector<Bytes> seeds() {
    // A tempo track with a name, a time signature and two tempo changes.
    Bytes tempoTrack = {0x00, 0xFF, 0x03, 0x04, 'S', 'o', 'n', 'g', 0x00, 0xFF, 0x58, 0x04, 4, 2, 24, 8,
                        0x00, 0xFF, 0x51, 0x03, 0x07, 0xA1, 0x20, 0x83, 0x60, 0xFF, 0x51, 0x03, 0x09, 0x27, 0xC0};
    // A melody with a program change, controllers and explicit note-offs.
    Bytes melody = {0x00, 0xC0, 40,   0x00, 0xB0, 7,    100,  0x00, 0x90, 60, 90, 0x83, 0x60, 0x80, 60, 0,
                    0x00, 0x90, 62,   80,   0x81, 0x70, 0x80, 62,   0,    0x00, 0x90, 64, 70, 0x83, 0x60,
                    0x80, 64,   0};
    // Running status throughout, note-ons of velocity 0 as note-offs, a pitch bend.
    Bytes running = {0x00, 0x91, 67, 100, 0x60, 67, 0, 0x00, 69, 90, 0x60, 69, 0, 0x00, 0xE1, 0x00, 0x40,
                     0x00, 0x91, 71, 80, 0x83, 0x00, 71, 0};
    // System exclusive, an escape, and a chord on two channels.
    Bytes system = {0x00, 0xF0, 0x05, 0x7E, 0x7F, 0x09, 0x01, 0xF7, 0x00, 0xF7, 0x02, 0x12, 0x34,
                    0x00, 0x92, 48,   60,   0x00, 0x93, 52,   60,   0x87, 0x40, 0x82, 48,   0,
                    0x00, 0x83, 52,   0};
    std::vector<Bytes> all;
    all.push_back(fileOf(1, 480, {tempoTrack, melody, running}));
    all.push_back(fileOf(0, 96, {running}));
    all.push_back(fileOf(2, 240, {melody, system}));
    all.push_back(fileOf(1, 0xE728, {system, melody}));   // 25 frames per second of 40 ticks
    all.push_back(fileOf(1, 480, {}));                      // no tracks
    all.push_back(Bytes{'M', 'T', 'h', 'd', 0, 0, 0, 6, 0, 1});
    all.push_back(Bytes{'R', 'I', 'F', 'F'});
    return all;
}

int main(int argc, char** argv) { return runFuzzReplay(argc, argv, seeds(), LLVMFuzzerTestOneInput, 5000, ".mid"); }
#endif
