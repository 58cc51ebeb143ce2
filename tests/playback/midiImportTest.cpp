// MIDI file import: the refusals with their exact texts, parts by channel and their removal and
// names, the pending-note rules, the time base (fixed, stated tempo, frames), running status,
// the bounds of lengths against the track, the song a file becomes, and files written by the
// program's own MIDI writer read back to the same notes.
#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "analysis/pitchScale.h"
#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/ui.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "playback/midiTestReader.h"
#include "resources/generalMidi.h"
#include "shell/commandDispatch.h"
#include "shell/openQueue.h"
#include "shell/paths.h"
#include "shell/saveSong.h"
#include "shell/settings.h"
#include "store/song.h"
#include "support/testSupport.h"

using Bytes = std::vector<uint8_t>;

static const double TICK_SECONDS = 1.0 / 512;   // one tick of the program's own files

// ---- building files ----

static Bytes variableLength(uint32_t v) {
    Bytes out = {uint8_t(v & 0x7F)};
    while (v >>= 7) out.insert(out.begin(), uint8_t(0x80 | (v & 0x7F)));
    return out;
}

// An event: its delta time, then its bytes as given (a status byte or, for running status, none).
static Bytes event(uint32_t delta, Bytes bytes) {
    Bytes out = variableLength(delta);
    out.insert(out.end(), bytes.begin(), bytes.end());
    return out;
}

static Bytes join(const std::vector<Bytes>& parts) {
    Bytes out;
    for (const Bytes& p : parts) out.insert(out.end(), p.begin(), p.end());
    return out;
}

static void putBig32(Bytes& b, uint32_t v) {
    for (int shift = 24; shift >= 0; shift -= 8) b.push_back(uint8_t(v >> shift));
}

static Bytes chunk(const char* id, const Bytes& body, uint32_t declared = UINT32_MAX) {
    Bytes out(id, id + 4);
    putBig32(out, declared == UINT32_MAX ? uint32_t(body.size()) : declared);
    out.insert(out.end(), body.begin(), body.end());
    return out;
}

static const Bytes END_OF_TRACK = event(0, {0xFF, 0x2F, 0x00});

// A track chunk of the events, closed by an end-of-track event.
static Bytes track(const std::vector<Bytes>& events) {
    std::vector<Bytes> all = events;
    all.push_back(END_OF_TRACK);
    return chunk("MTrk", join(all));
}

static Bytes header(int format, int tracks, uint8_t divisionHigh, uint8_t divisionLow, uint32_t length = 6) {
    Bytes out = {'M', 'T', 'h', 'd'};
    putBig32(out, length);
    out.insert(out.end(), {uint8_t(format >> 8), uint8_t(format), uint8_t(tracks >> 8), uint8_t(tracks), divisionHigh,
                           divisionLow});
    return out;
}

// A format-1 file at 480 ticks per quarter note holding the tracks.
static Bytes midiFile(const std::vector<Bytes>& tracks, int format = 1) {
    return join({header(format, int(tracks.size()), 480 >> 8, 480 & 0xFF), join(tracks)});
}

static Bytes on(uint32_t delta, int channel, int key, int velocity = 100) {
    return event(delta, {uint8_t(0x90 | channel), uint8_t(key), uint8_t(velocity)});
}
static Bytes off(uint32_t delta, int channel, int key) {
    return event(delta, {uint8_t(0x80 | channel), uint8_t(key), 64});
}
static Bytes program(int channel, int number) { return event(0, {uint8_t(0xC0 | channel), uint8_t(number)}); }
static Bytes tempo(uint32_t delta, uint32_t microseconds) {
    return event(delta, {0xFF, 0x51, 0x03, uint8_t(microseconds >> 16), uint8_t(microseconds >> 8),
                         uint8_t(microseconds)});
}

class MidiImportTest : public ::testing::Test {
protected:
    void SetUp() override {
        savedPaths = paths;
        setSharedBasePath(folder.path());
        // The shipped General MIDI list of this source tree.
        paths.resourcePath = sourceRoot();
        clean();
    }
    void TearDown() override {
        clean();
        paths = savedPaths;
    }
    void clean() {
        resetSong();
        resetNoteList();
        resetSelection();
        resetMidiImport();
        resetMidiOutput();
        resetGeneralMidiTable();
        resetSongNames();
        resetDisplayModes();
        resetOpenQueue();
        commandOperations = CommandOperations{};
        globalSettings = GlobalSettings{};
        generalSettings = GeneralSettings{};
        audioActivity = AudioActivity{};
        clearUiCalls();
    }
    // Writes bytes as file.mid and imports it.
    int import(const Bytes& bytes, const std::string& name = "file.mid") {
        path = folder.file(name);
        writeFileBytes(path, bytes);
        return importMidiFile(path);
    }
    std::string refusal(const char* text, const std::string& reason) {
        return std::string(text) + "\n\n" + path + ": " + reason + ".";
    }
    // A song with a recording's time axis: count blocks of 1/64 s.
    void makeRecordedSong(uint32_t count) {
        song.sampleBlockDuration = 1.0 / 64;
        ASSERT_EQ(growSampleBlockDurations(count), 1);
        for (uint32_t k = 0; k < count; k++) song.sampleBlockDurations[k] = 1.0 / 64;
        song.blockCount = count;
        song.waveFormat = SongWaveFormat{1, 1, 44100, 88200, 2, 16};
    }
    void addNote(double start, double end, int key, uint32_t volumeSum) {
        Note note{};
        note.pitch = float(pitchToFrequency(key));
        note.midiNote = uint8_t(key);
        note.midiStart = note.waveStart = float(start);
        note.midiEnd = note.waveEnd = float(end);
        note.volumeSum = volumeSum;
        ASSERT_EQ(appendNote(note), 1);
    }
    const Note& note(int i) { return noteList.notes[i]; }

    TempFolder folder;
    Paths savedPaths;
    std::string path;
};

// ---- refusals ----

TEST_F(MidiImportTest, AFileWithoutMThdIsNotAMidiFileAndTheSongStaysAsItWas) {
    makeRecordedSong(200);
    addNote(0.5, 1.0, 60, 100);
    EXPECT_EQ(import({'R', 'I', 'F', 'F', 0, 0, 0, 0}), 0);
    EXPECT_EQ(lastMessageText(), refusal(NOT_A_MIDI_FILE_TEXT, "it does not begin with \"MThd\""));
    EXPECT_EQ(noteList.count, 1);
    EXPECT_EQ(song.blockCount, 200u);
}

TEST_F(MidiImportTest, BadHeadersAreRefusedWithTheirReasonAndTheNotesKept) {
    const Bytes body = track({on(0, 0, 60), off(480, 0, 60)});
    struct Case {
        Bytes file;
        std::string reason;
    } cases[] = {
        {join({header(1, 1, 1, 0xE0, 8), {0, 0}, body}), "its header is 8 bytes long, not 6"},
        {join({header(1, 0, 1, 0xE0), body}), "it holds no tracks"},
        {join({header(3, 1, 1, 0xE0), body}), "its format is 3, not 0, 1 or 2"},
        {join({header(0, 1, 0, 0), body}), "its time division is 0"},
        {join({header(0, 1, 0xE7, 0), body}), "its time division has 0 ticks per frame"},
        {Bytes{'M', 'T', 'h', 'd', 0, 0, 0, 6, 0}, "its header is cut short"},
    };
    addNote(0.5, 1.0, 60, 100);
    for (const Case& c : cases) {
        EXPECT_EQ(import(c.file), 0) << c.reason;
        EXPECT_EQ(lastMessageText(), refusal(MIDI_FILE_UNREADABLE_TEXT, c.reason));
        EXPECT_EQ(noteList.count, 1) << c.reason;
    }
}

TEST_F(MidiImportTest, AFileThatCannotBeReadSaysWhichAndWhy) {
    path = folder.file("missing.mid");
    EXPECT_EQ(importMidiFile(path), 0);
    EXPECT_EQ(lastMessageText(), "Cannot " + path + "\n\nNo such file or directory.");
    EXPECT_EQ(importMidiFile(folder.path()), 0);
    EXPECT_EQ(lastMessageText(), "Cannot " + folder.path() + "\n\nIs a directory.");
}

TEST_F(MidiImportTest, NothingIsReadWhileAnOpeningOrARecordingFillsTheNoteList) {
    audioActivity.opening = true;
    EXPECT_EQ(import(midiFile({track({on(0, 0, 60), off(480, 0, 60)})})), 0);
    EXPECT_EQ(lastMessageText(), WHILST_OPENING_TEXT);
    audioActivity = AudioActivity{};
    audioActivity.recording = true;
    EXPECT_EQ(importMidiFile(path), 0);
    EXPECT_EQ(lastMessageText(), WHILST_RECORDING_TEXT);
    EXPECT_EQ(noteList.count, 0);
}

// ---- parts ----

TEST_F(MidiImportTest, AFormat0FileHasNoPartsAndItsNotesKeepTheirChannels) {
    ASSERT_EQ(import(midiFile({track({on(0, 0, 60), on(0, 2, 64), off(480, 0, 60), off(0, 2, 64)})}, 0)), 1);
    EXPECT_EQ(midiImport.partCount, 0);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_EQ(note(0).sourceIndex, 0u);
    EXPECT_EQ(note(1).sourceIndex, 2u);
}

TEST_F(MidiImportTest, EmptyPartsAreRemovedAndTheOthersNamedByTheirProgram) {
    // Four tracks: three parts. Channel 0 plays a violin, channel 1 nothing, channel 2 a flute.
    Bytes file = midiFile({track({tempo(0, 600000)}), track({program(0, 40), on(0, 0, 67), off(480, 0, 67)}),
                           track({program(1, 10)}), track({program(2, 73), on(0, 2, 72), off(240, 2, 72)})});
    ASSERT_EQ(import(file), 1);
    ASSERT_EQ(midiImport.partCount, 2);
    EXPECT_EQ(midiImport.parts[0].name, "Violin");
    EXPECT_EQ(midiImport.parts[0].program, 40);
    EXPECT_EQ(midiImport.parts[1].name, "Flute");
    EXPECT_EQ(midiImport.parts[1].program, 73);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_EQ(note(0).sourceIndex, 0u);   // channel 0
    EXPECT_EQ(note(1).sourceIndex, 1u);   // channel 2, moved down past the empty part
    // The song's instrument is the first part's: saving gives its program.
    EXPECT_EQ(song.instrumentName, "Violin");
    EXPECT_EQ(midiOutputSong.partCount, 2);
}

TEST_F(MidiImportTest, APartWithoutProgramChangeIsAPiano) {
    ASSERT_EQ(import(midiFile({track({}), track({on(0, 0, 60), off(480, 0, 60)})})), 1);
    ASSERT_EQ(midiImport.partCount, 1);
    EXPECT_EQ(midiImport.parts[0].name, "Grand Piano");
}

// ---- notes ----

TEST_F(MidiImportTest, AnImportedNoteCarriesItsKeyVelocityAndScoreLengths) {
    // A quarter note of key 69 at velocity 90, then after a quarter's rest a half note.
    ASSERT_EQ(import(midiFile({track({on(0, 3, 69, 90), off(480, 3, 69), on(480, 3, 72, 40), off(960, 3, 72)})}, 0)), 1);
    ASSERT_EQ(noteList.count, 2);
    const Note& a = note(0);
    EXPECT_FLOAT_EQ(a.pitch, 440.0f);
    EXPECT_EQ(a.midiNote, 69);
    EXPECT_FLOAT_EQ(a.midiStart, 0.0f);
    EXPECT_FLOAT_EQ(a.midiEnd, 0.6f);
    EXPECT_FLOAT_EQ(a.waveStart, a.midiStart);
    EXPECT_FLOAT_EQ(a.waveEnd, a.midiEnd);
    for (float v : a.recognitionValues) EXPECT_FLOAT_EQ(v, 90.0f);
    EXPECT_FLOAT_EQ(a.recognitionWeight, 100.0f);
    EXPECT_EQ(a.instrument, -1);
    EXPECT_EQ(a.sourceIndex, 3u);
    EXPECT_EQ(a.recognitionCode, 0u);
    EXPECT_EQ(a.group, 0);
    EXPECT_EQ(a.recognitionTail, 0u);
    // One beat is 256 / 0.875 = 292.57 units.
    EXPECT_EQ(a.recognitionExtra[0], 292u);
    EXPECT_EQ(a.recognitionExtra[1], 0u);
    EXPECT_EQ(note(1).recognitionExtra[0], 585u);
    EXPECT_EQ(note(1).recognitionExtra[1], 292u);
    // Written again, each note keeps its velocity.
    ASSERT_EQ(writeNotesMidiFile(folder.file("again.mid"), 0, 0, -1.0, -1.0), 1);
    std::vector<ReadNote> written = notesOf(readMidiBytes(readFileBytes(folder.file("again.mid"))));
    ASSERT_EQ(written.size(), 2u);
    EXPECT_EQ(written[0].velocity, 90);
    EXPECT_EQ(written[1].velocity, 40);
}

TEST_F(MidiImportTest, ARepeatedNoteOnLosesTheFirstStartAndANoteOffAloneAddsNothing) {
    ASSERT_EQ(import(midiFile({track({off(0, 0, 50), on(0, 0, 60), on(240, 0, 60), off(240, 0, 60), off(0, 0, 60),
                                      on(0, 0, 62, 0)})})),
              1);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_FLOAT_EQ(note(0).midiStart, 0.3f);
    EXPECT_FLOAT_EQ(note(0).midiEnd, 0.6f);
}

TEST_F(MidiImportTest, NotesAreInTheOrderOfTheirStartsAcrossTracks) {
    // The second track's note ends first but starts later.
    ASSERT_EQ(import(midiFile({track({on(0, 0, 60), off(1920, 0, 60)}), track({on(480, 1, 64), off(480, 1, 64)})})), 1);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_EQ(note(0).midiNote, 60);
    EXPECT_EQ(note(1).midiNote, 64);
}

TEST_F(MidiImportTest, AFullNoteListDropsFurtherNotesSilently) {
    std::vector<Bytes> events;
    for (int i = 0; i < MAX_CS_NOTES + 5; i++) {
        events.push_back(on(0, 0, 60));
        events.push_back(off(10, 0, 60));
    }
    ASSERT_EQ(import(midiFile({track(events)})), 1);
    EXPECT_EQ(noteList.count, MAX_CS_NOTES);
    EXPECT_EQ(messageCount(), 0);
}

// ---- time ----

TEST_F(MidiImportTest, TimeRunsAt100QuartersPerMinuteUntilTheFileStatesATempo) {
    struct Case {
        Bytes file;
        double start, end;   // seconds of a note from tick 480 to tick 960
    } cases[] = {
        {midiFile({track({on(480, 0, 60), off(480, 0, 60)})}), 0.6, 1.2},
        // 120 beats per minute from tick 0: 0.5 s per quarter.
        {midiFile({track({tempo(0, 500000)}), track({on(480, 0, 60), off(480, 0, 60)})}), 0.5, 1.0},
        // The change at tick 720 halves the speed for the rest.
        {midiFile({track({tempo(0, 500000), tempo(720, 1000000)}), track({on(480, 0, 60), off(480, 0, 60)})}), 0.5,
         0.75 + 0.5},
        // 25 frames per second of 40 ticks: 1000 ticks a second, whatever the tempo.
        {join({header(1, 1, uint8_t(-25), 40), track({tempo(0, 500000), on(480, 0, 60), off(480, 0, 60)})}), 0.48,
         0.96},
    };
    for (const Case& c : cases) {
        clean();
        ASSERT_EQ(import(c.file), 1);
        ASSERT_EQ(noteList.count, 1);
        EXPECT_NEAR(note(0).midiStart, c.start, 1e-6);
        EXPECT_NEAR(note(0).midiEnd, c.end, 1e-6);
    }
}

TEST_F(MidiImportTest, AFormat2TrackKeepsItsOwnTempo) {
    Bytes file = join({header(2, 2, 480 >> 8, 480 & 0xFF), track({tempo(0, 300000), on(480, 0, 60), off(480, 0, 60)}),
                       track({on(480, 1, 64), off(480, 1, 64)})});
    ASSERT_EQ(import(file), 1);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_NEAR(note(0).midiStart, 0.3, 1e-6);
    EXPECT_NEAR(note(1).midiStart, 0.6, 1e-6);
}

// ---- the bytes of a track ----

TEST_F(MidiImportTest, RunningStatusIsRead) {
    // One note-on status for three events, two of them ending notes with velocity 0; a
    // note-off in running status too.
    Bytes events = join({on(0, 0, 60), event(0, {64, 90}), event(240, {60, 0}), event(240, {64, 0}),
                         event(0, {0xB0, 7, 100}), event(0, {10, 64}), on(0, 0, 67), off(480, 0, 67),
                         event(0, {67, 0})});
    ASSERT_EQ(import(midiFile({track({events})})), 1);
    ASSERT_EQ(noteList.count, 3);
    EXPECT_EQ(note(0).midiNote, 60);
    EXPECT_FLOAT_EQ(note(0).midiEnd, 0.3f);
    EXPECT_EQ(note(1).midiNote, 64);
    EXPECT_FLOAT_EQ(note(1).midiEnd, 0.6f);
    EXPECT_FLOAT_EQ(note(1).recognitionValues[0], 90.0f);
    EXPECT_EQ(note(2).midiNote, 67);
}

TEST_F(MidiImportTest, DamagedTracksAreRefusedAndTheNotesBeforeStay) {
    const Bytes first = join({on(0, 0, 60), off(480, 0, 60)});
    // Offsets: header 14, chunk head 8, the first note's 9 bytes: the damage begins at byte 31.
    struct Case {
        Bytes damage;
        std::string reason;
    } cases[] = {
        {event(0, {0x90, 60}), "track 1 ends inside the event at byte 31"},
        {Bytes{0x81, 0x80, 0x80, 0x80, 0x00, 0x90, 60, 1}, "a delta time longer than four bytes at byte 31"},
        {event(0, {0xFF, 0x01, 0x8F, 0xFF, 0xFF, 0xFF, 0x7F}), "a length longer than four bytes in the event at byte 31"},
        {event(0, {0x90, 200, 10}), "a note key of 200 in the event at byte 31"},
        {event(0, {0xF0, 0x20, 1, 2}), "the event at byte 31 is longer than its track"},
        {event(0, {0xFF, 0x01, 0x05, 'a'}), "the event at byte 31 is longer than its track"},
        // A data byte right after a meta event: no status runs on.
        {join({event(0, {0xFF, 0x06, 0x01, 'x'}), event(0, {60, 10})}), "a data byte where an event should begin at byte 37"},
    };
    for (const Case& c : cases) {
        clean();
        Bytes body = join({first, c.damage});
        // The damaged event is the track's last: its chunk ends where the bytes given end.
        Bytes file = join({header(0, 1, 480 >> 8, 480 & 0xFF), chunk("MTrk", body),
                           track({on(0, 0, 70), off(480, 0, 70)})});
        EXPECT_EQ(import(file), 0) << c.reason;
        EXPECT_EQ(lastMessageText(), refusal(MIDI_FILE_UNREADABLE_TEXT, c.reason));
        ASSERT_EQ(noteList.count, 1) << c.reason;
        EXPECT_EQ(note(0).midiNote, 60);
        EXPECT_TRUE(song.notesOnly);
    }
}

TEST_F(MidiImportTest, TheEndOfTheFileEndsTheReadingWithWhatWasRead) {
    // The track says it is longer than the file, which ends inside a note's event.
    Bytes body = join({on(0, 0, 60), off(480, 0, 60), on(0, 0, 62), Bytes{0x83, 0x60, 0x80}});
    ASSERT_EQ(import(join({header(1, 1, 480 >> 8, 480 & 0xFF), chunk("MTrk", body, 1000)})), 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(noteList.count, 1);
}

TEST_F(MidiImportTest, OtherChunksAndSystemEventsArePassedOver) {
    Bytes sysex = event(0, {0xF0, 0x05, 0x7E, 0x7F, 0x09, 0x01, 0xF7});
    Bytes escape = event(0, {0xF7, 0x02, 0x12, 0x34});   // no 0xF7 at its end
    Bytes stray = event(0, {0xF2, 0x01, 0x02, 0xF7});
    Bytes file = join({header(1, 1, 480 >> 8, 480 & 0xFF), chunk("XFIH", {1, 2, 3}),
                       track({sysex, escape, stray, on(0, 0, 60), off(480, 0, 60)}),
                       chunk("XFKM", Bytes(4), 4000)});   // runs past the end: the reading ends
    ASSERT_EQ(import(file), 1);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_FLOAT_EQ(note(0).midiEnd, 0.6f);
}

TEST_F(MidiImportTest, BytesAfterTheEndOfTrackEventAreNotRead) {
    Bytes body = join({on(0, 0, 60), off(480, 0, 60), END_OF_TRACK, Bytes{0, 0, 0, 0}});
    ASSERT_EQ(import(join({header(0, 1, 480 >> 8, 480 & 0xFF), chunk("MTrk", body)})), 1);
    EXPECT_EQ(noteList.count, 1);
}

TEST_F(MidiImportTest, ANoteLaterThanTheLongestSongIsRefused) {
    // At 16.7 s per quarter note (the largest tempo), 10,000 quarters are 46 hours.
    Bytes file = midiFile({track({tempo(0, 0xFFFFFF), on(0, 0, 60), off(480, 0, 60), on(0, 0, 62),
                                  off(480 * 10000, 0, 62)})});
    EXPECT_EQ(import(file), 0);
    EXPECT_EQ(lastMessageText(),
              refusal(MIDI_FILE_UNREADABLE_TEXT, "the note ending at byte 42 lies later than the longest song (27 hours)"));
    EXPECT_EQ(noteList.count, 1);
}

// ---- the song ----

TEST_F(MidiImportTest, AnEmptySongBecomesASongOfNotesInMidiMode) {
    displayModes.playbackMode = PLAYBACK_MODE_WAVE;
    ASSERT_EQ(import(midiFile({track({on(480, 0, 60), off(480, 0, 60)})}), "Song.mid"), 1);
    EXPECT_TRUE(song.notesOnly);
    EXPECT_DOUBLE_EQ(song.sampleBlockDuration, 1.0 / 64);   // the default pitch range's blocks
    EXPECT_EQ(song.blockCount, 77u);                        // 1.2 s, to the next whole block
    EXPECT_EQ(displayModes.playbackMode, PLAYBACK_MODE_MIDI);
    EXPECT_EQ(songNames.remembered[OUTPUT_MIDI], folder.file("Song"));
    EXPECT_EQ(midiImport.sourcePath, path);
    // There is no recording to save as a wave.
    displayModes.playbackMode = PLAYBACK_MODE_WAVE;
    EXPECT_EQ(saveAllowed(), 0);
    EXPECT_EQ(lastMessageText(), NO_RECORDING_TO_SAVE_TEXT);
}

TEST_F(MidiImportTest, ASongWithARecordingKeepsItAndTakesTheFilesNotes) {
    makeRecordedSong(640);
    addNote(1.0, 2.0, 50, 100);
    barlineList.count = 1;
    barlineList.times[0] = 2.0f;
    ASSERT_EQ(import(midiFile({track({on(0, 0, 60), off(480, 0, 60)})})), 1);
    EXPECT_FALSE(song.notesOnly);
    EXPECT_EQ(song.blockCount, 640u);
    EXPECT_EQ(barlineList.count, 1);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_EQ(note(0).midiNote, 60);
    // A second file replaces the notes again.
    ASSERT_EQ(import(midiFile({track({on(0, 0, 62), off(480, 0, 62), on(0, 0, 64), off(480, 0, 64)})})), 1);
    EXPECT_EQ(noteList.count, 2);
}

TEST_F(MidiImportTest, AWaveOpenedAfterASongOfNotesStartsASongOfItsOwn) {
    static int notesSeen;
    static bool notesOnlySeen;
    commandOperations.readMidiFile = importMidiFile;
    commandOperations.openWaveFile = [](const std::string&) {
        notesSeen = noteList.count;
        notesOnlySeen = song.notesOnly;
        return 1;
    };
    writeFileBytes(folder.file("a.mid"), midiFile({track({on(0, 0, 60), off(480, 0, 60)})}));
    queueFilesToOpen({folder.file("a.mid"), folder.file("b.wav")});
    workOffOpenQueue();
    EXPECT_EQ(notesSeen, 0);
    EXPECT_FALSE(notesOnlySeen);
    EXPECT_EQ(song.instrumentName, "");
}

// ---- round trips through the program's own writer ----

TEST_F(MidiImportTest, TheProgramsOwnFilesReadBackToTheSameKeysAndTimes) {
    makeRecordedSong(64 * 20);
    const double starts[] = {0.0, 0.3137, 1.0, 2.71828, 5.5, 9.99};
    const int keys[] = {60, 61, 72, 45, 96, 21};
    for (int i = 0; i < 6; i++) addNote(starts[i], starts[i] + 0.25 + 0.1 * i, keys[i], 3000);
    std::vector<Note> written(noteList.notes, noteList.notes + noteList.count);
    std::string saved = folder.file("own.mid");
    ASSERT_EQ(writeNotesMidiFile(saved, 0, 0, -1.0, -1.0), 1);
    resetSong();
    resetNoteList();
    path = saved;
    ASSERT_EQ(importMidiFile(saved), 1);
    ASSERT_EQ(noteList.count, 6);
    for (int i = 0; i < 6; i++) {
        EXPECT_EQ(note(i).midiNote, written[i].midiNote);
        EXPECT_NEAR(note(i).midiStart, written[i].midiStart, TICK_SECONDS);
        EXPECT_NEAR(note(i).midiEnd, written[i].midiEnd, TICK_SECONDS);
    }
    // And the notes read back are written again as the same MIDI notes, velocities included.
    std::vector<ReadNote> first = notesOf(readMidiBytes(readFileBytes(saved)));
    ASSERT_EQ(writeNotesMidiFile(saved, 0, 0, -1.0, -1.0), 1);
    std::vector<ReadNote> again = notesOf(readMidiBytes(readFileBytes(saved)));
    ASSERT_EQ(again.size(), first.size());
    for (size_t i = 0; i < first.size(); i++) {
        EXPECT_EQ(again[i].key, first[i].key);
        EXPECT_EQ(again[i].velocity, first[i].velocity);
        EXPECT_EQ(again[i].onTick, first[i].onTick);
        EXPECT_EQ(again[i].offTick, first[i].offTick);
    }
}

TEST_F(MidiImportTest, AChordIsWrittenBackAsAChord) {
    // Two tracks sounding together: the writer's events must keep to their times.
    ASSERT_EQ(import(midiFile({track({on(0, 0, 60), off(960, 0, 60)}), track({on(480, 1, 64), off(960, 1, 64)})})), 1);
    std::string saved = folder.file("chord.mid");
    ASSERT_EQ(writeNotesMidiFile(saved, 1, 0, -1.0, -1.0), 1);   // detail falls back to plain
    ReadMidiFile file = readMidiBytes(readFileBytes(saved));
    ASSERT_EQ(file.error, "");
    std::vector<ReadNote> notes = notesOf(file);
    ASSERT_EQ(notes.size(), 2u);
    EXPECT_NEAR(notes[0].onSeconds, 0.0, TICK_SECONDS);
    EXPECT_NEAR(notes[0].offSeconds, 1.2, TICK_SECONDS);
    EXPECT_NEAR(notes[1].onSeconds, 0.6, TICK_SECONDS);
    EXPECT_NEAR(notes[1].offSeconds, 1.8, TICK_SECONDS);
}

TEST(MidiFileNames, MidAndMidiInAnyCaseAreMidiFiles) {
    EXPECT_TRUE(isMidiFileName("a/b/Song.MID"));
    EXPECT_TRUE(isMidiFileName("x.midi"));
    EXPECT_FALSE(isMidiFileName("song.wav"));
    EXPECT_FALSE(isMidiFileName("mid"));
}
