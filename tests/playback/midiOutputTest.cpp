// MIDI output: the exact bytes of a song without notes, the tracks and channels, velocities,
// plain notes with their bends and the written range, detail mode's joining, key choice, bends
// and volumes from the FT blocks, the Save path, failures, and round trips through the tests'
// own reader; and the instrument scale file.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "analysis/pitchScale.h"
#include "audio/audioActivity.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "playback/midiOutput.h"
#include "playback/midiTestReader.h"
#include "resources/generalMidi.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/song.h"
#include "support/testSupport.h"

using Bytes = std::vector<uint8_t>;

static const char* const CREDIT_LINE = "Made with Torvellan Melodrift";
// One MIDI tick, seconds: the most a truncated time may lie early.
static const double TICK_SECONDS = 1.0 / 512;

// A block of the FT store as detail mode reads it: its detected pitch, 0 Hz for none.
struct DetailBlock {
    float frequency;
    uint8_t amplitude;
};

class MidiOutputTest : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        paths.resourcePath = sourceRoot();   // the shipped General MIDI list
        clean();
    }
    void TearDown() override {
        clean();
        SharedFolderTest::TearDown();
    }
    void clean() {
        closeFTFile(0);
        freeFTBlockWindow();
        resetSong();
        resetNoteList();
        resetSelection();
        resetMidiOutput();
        resetGeneralMidiTable();
        midiOutputOptions = MidiOutputOptions{};
        globalSettings.defaultInstrument = "Voice";
        audioActivity = AudioActivity{};
    }
    // A song of count blocks of d seconds each.
    void makeSong(uint32_t count, double d) {
        song.sampleBlockDuration = d;
        ASSERT_EQ(growSampleBlockDurations(count), 1);
        for (uint32_t k = 0; k < count; k++) song.sampleBlockDurations[k] = d;
        song.blockCount = count;
    }
    // A note from start to end at pitch with its nearest key, of average level per block.
    void addNote(double start, double end, double pitch, uint32_t level = 128) {
        Note note{};
        note.pitch = float(pitch);
        note.midiNote = uint8_t(frequencyToSemitone(pitch));
        note.midiStart = note.waveStart = float(start);
        note.midiEnd = note.waveEnd = float(end);
        uint32_t blocks = blockAtTime(end) - blockAtTime(start);
        note.volumeSum = level * blocks;
        ASSERT_EQ(appendNote(note), 1);
    }
    // CS.ft and CS.fi holding blocks with one detected entry each (none for 0 Hz), and the
    // song's window sized for them.
    void storeDetailBlocks(const std::vector<DetailBlock>& blocks) {
        Bytes ft, fi;
        auto putF = [](Bytes& b, float v) {
            uint32_t bits;
            std::memcpy(&bits, &v, 4);
            putU32(b, bits);
        };
        putU32(fi, uint32_t(blocks.size()));
        for (const DetailBlock& block : blocks) {
            size_t offset = ft.size();
            putU32(ft, 0);   // dataBuffer
            putU32(ft, 0);   // origDataBuffer
            if (block.frequency > 0) {
                putU32(ft, 1);
                putF(ft, block.frequency);
                putF(ft, block.frequency * 0.025f);
                ft.insert(ft.end(), {block.amplitude, block.amplitude, 40, 0});
            } else {
                putU32(ft, 0);
            }
            putU32(fi, uint32_t(offset));
            putU32(fi, uint32_t(ft.size() - offset));
        }
        writeFileBytes(sharedFilePath("CS.ft"), ft);
        writeFileBytes(sharedFilePath("CS.fi"), fi);
        setFTBlockWindowCapacity(song.sampleBlockDuration);
    }
    ReadMidiFile writeAndRead(int detail, double start = -1.0, double end = -1.0) {
        EXPECT_EQ(writeNotesMidiFile(path, detail, 0, start, end), 1);
        ReadMidiFile file = readMidiBytes(readFileBytes(path));
        EXPECT_EQ(file.error, "");
        return file;
    }
    std::string path = folder.file("song.mid");
};

static void append(Bytes& to, const Bytes& more) { to.insert(to.end(), more.begin(), more.end()); }

static Bytes trackChunk(const Bytes& body) {
    uint32_t n = uint32_t(body.size());
    Bytes b{'M', 'T', 'r', 'k', uint8_t(n >> 24), uint8_t(n >> 16), uint8_t(n >> 8), uint8_t(n)};
    append(b, body);
    return b;
}

static Bytes textBytes(const std::string& text) { return Bytes(text.begin(), text.end()); }

// ---- the file's frame ----

using MidiOutputFile = MidiOutputTest;

TEST_F(MidiOutputFile, ASongWithoutNotesGivesTheTempoTrackAndOneInstrumentTrackWithItsOpening) {
    makeSong(640, 1.0 / 64);
    ASSERT_EQ(writeNotesMidiFile(path, 0, 0, -1.0, -1.0), 1);

    Bytes expected{'M', 'T', 'h', 'd', 0, 0, 0, 6, 0, 1, 0, 2, 0x01, 0x00};
    Bytes tempo{0x00, 0xFF, 0x02, uint8_t(std::strlen(CREDIT_LINE))};
    append(tempo, textBytes(CREDIT_LINE));
    append(tempo, {0x00, 0xFF, 0x51, 0x03, 0x07, 0xA1, 0x20, 0x00, 0xFF, 0x2F, 0x00});
    append(expected, trackChunk(tempo));
    Bytes voice{0x00, 0xFF, 0x03, 0x05, 'V', 'o', 'i', 'c', 'e'};
    append(voice, {0x00, 0xB0, 0x5B, 0x3C,                 // reverb 60
                   0x00, 0xB0, 0x0A, 0x3D,                 // pan 61
                   0x00, 0xB0, 0x00, 0x00,                 // bank select 0
                   0x00, 0xB0, 0x20, 0x00,                 // bank select fine 0
                   0x00, 0xC0, 0x35,                       // program 53: "Voice"
                   0x00, 0xFF, 0x59, 0x02, 0x00, 0x00,     // C major
                   0x01, 0xFF, 0x2F, 0x00});               // end of track one tick on
    append(expected, trackChunk(voice));
    EXPECT_EQ(readFileBytes(path), expected);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(MidiOutputFile, TheTrackCarriesTheSongsInstrumentItsProgramAndTheReverbOption) {
    makeSong(640, 1.0 / 64);
    song.instrumentName = "Fl\xC3\xBBte";   // matched by word, written in Latin-1
    midiOutputOptions.reverb = false;
    ReadMidiFile file = writeAndRead(0);
    ASSERT_EQ(file.tracks.size(), 2u);
    const ReadMidiTrack& track = file.tracks[1];
    ASSERT_FALSE(track.events.empty());
    EXPECT_EQ(track.events[0].metaType, 0x03);
    EXPECT_EQ(track.events[0].metaData, (Bytes{'F', 'l', 0xFB, 't', 'e'}));
    std::vector<ReadMidiEvent> controls = eventsOfKind(track, 0xB0);
    ASSERT_EQ(controls.size(), 3u) << "no reverb controller";
    EXPECT_EQ(controls[0].data1, 10);
    std::vector<ReadMidiEvent> programs = eventsOfKind(track, 0xC0);
    ASSERT_EQ(programs.size(), 1u);
    EXPECT_EQ(programs[0].data1, 1 - 1) << "an unknown name plays the first program";

    song.instrumentName = "Flute";
    midiOutputOptions.reverb = true;
    midiOutputOptions.reverbDepth = 90;
    file = writeAndRead(0);
    EXPECT_EQ(eventsOfKind(file.tracks[1], 0xC0)[0].data1, 73);
    EXPECT_EQ(eventsOfKind(file.tracks[1], 0xB0)[0].data1, 91);
    EXPECT_EQ(eventsOfKind(file.tracks[1], 0xB0)[0].data2, 90);
}

TEST_F(MidiOutputFile, SeveralPartsGetATrackEachAndTheTenthChannelIsSkipped) {
    makeSong(640, 1.0 / 64);
    addNote(0.5, 1.0, 440.0);
    midiOutputOptions.singleTrack = false;
    midiOutputSong.partCount = 12;
    ReadMidiFile file = writeAndRead(0);
    ASSERT_EQ(file.trackCount, 13);
    std::vector<int> channels;
    for (size_t t = 1; t < file.tracks.size(); t++) {
        std::vector<ReadMidiEvent> ons = eventsOfKind(file.tracks[t], 0x90);
        ASSERT_EQ(ons.size(), 1u) << "every track has every note";
        channels.push_back(ons[0].status & 0x0F);
        EXPECT_EQ(eventsOfKind(file.tracks[t], 0xC0)[0].status & 0x0F, channels.back());
    }
    EXPECT_EQ(channels, (std::vector<int>{0, 1, 2, 3, 4, 5, 6, 7, 8, 10, 11, 12}));

    midiOutputSong.partCount = 20;
    file = writeAndRead(0);
    EXPECT_EQ(file.trackCount, 16) << "one tempo track and at most 15 instrument tracks";
    EXPECT_EQ(eventsOfKind(file.tracks[15], 0x90)[0].status & 0x0F, 15);

    midiOutputOptions.singleTrack = true;
    file = writeAndRead(0);
    EXPECT_EQ(file.trackCount, 2) << "the single-track preference ignores the parts";
}

// ---- velocities ----

TEST(MidiOutputVelocity, LevelsGiveTheVelocitiesOfTheirCurveWithinOneTo127) {
    const float nan = std::numeric_limits<float>::quiet_NaN(), inf = std::numeric_limits<float>::infinity();
    const std::pair<float, int> cases[] = {{0.0f, 24},  {1.0f, 24},    {50.0f, 78},   {128.0f, 103}, {255.0f, 127},
                                           {-40.0f, 24}, {nan, 24},    {1.0e6f, 127}, {inf, 127}};
    for (auto [level, velocity] : cases) EXPECT_EQ(velocityFromLevel(level), velocity) << level;
}

// ---- plain notes ----

using MidiOutputPlain = MidiOutputTest;

TEST_F(MidiOutputPlain, ANoteIsOnAtItsStartAndOffAtItsEndWithItsAverageLevel) {
    makeSong(640, 1.0 / 64);
    addNote(0.5, 1.0, 440.0, 128);
    addNote(1.25, 2.0, 261.6256, 50);
    ReadMidiFile file = writeAndRead(0);
    int unmatched = 0;
    std::vector<ReadNote> notes = notesOf(file, &unmatched);
    EXPECT_EQ(unmatched, 0);
    EXPECT_EQ(ticksOf(notes), (std::vector<NoteTicks>{{69, 256, 512}, {60, 640, 1024}}));
    ASSERT_EQ(notes.size(), 2u);
    EXPECT_EQ(notes[0].velocity, 103);
    EXPECT_EQ(notes[1].velocity, 78);
    // Note-offs carry velocity 0; the track ends one tick after its last event.
    std::vector<ReadMidiEvent> offs = eventsOfKind(file.tracks[1], 0x80);
    ASSERT_EQ(offs.size(), 2u);
    EXPECT_EQ(offs[1].data2, 0);
    EXPECT_EQ(file.tracks[1].endTick, 1025u);
}

TEST_F(MidiOutputPlain, ANoteOnItsKeyWritesNoBendUnlessTheTrackWasLeftBentAndBendsAndKeysAreLimited) {
    makeSong(640, 1.0 / 64);
    addNote(0.5, 1.0, 440.0);
    addNote(1.5, 2.0, 450.0);    // 38.9 cents sharp of A
    addNote(2.5, 3.0, 440.0);
    addNote(3.5, 4.0, 440.0);
    addNote(4.5, 5.0, 440.0);
    noteList.notes[4].pitch = 600.0f;   // five semitones above its key
    addNote(5.5, 6.0, 440.0);
    noteList.notes[5].pitch = 300.0f;
    addNote(6.5, 7.0, 440.0);
    noteList.notes[6].midiNote = 200;
    ReadMidiFile file = writeAndRead(0);   // the reader refuses any data byte of 128 or more
    std::vector<ReadMidiEvent> bends = eventsOfKind(file.tracks[1], 0xE0);
    auto value = [](const ReadMidiEvent& e) { return e.data1 | e.data2 << 7; };
    ASSERT_EQ(bends.size(), 4u) << "the top key's bend is the one the track was left with";
    // The next note on the first bent key bends back at 1280.
    EXPECT_EQ(std::tuple(bends[0].tick, value(bends[0]), bends[1].tick, value(bends[1]), value(bends[2]), value(bends[3])),
              std::tuple(768u, 8192 + 1556, 1280u, 8192, 16383, 0));
    std::vector<ReadNote> notes = notesOf(file);
    ASSERT_EQ(notes.size(), 7u);
    EXPECT_EQ(notes[6].key, 127) << "keys above the MIDI range play at the top key";
}

// ---- the range ----

using MidiOutputRange = MidiOutputTest;

TEST_F(MidiOutputRange, TheRangeStartIsTickZeroAndNotesKeepTheirOwnEndsAndMinusOneIsTheSongsEnd) {
    makeSong(640, 1.0 / 64);
    addNote(0.5, 1.0, 440.0);    // before the range
    addNote(1.5, 2.5, 440.0);    // starts before it
    addNote(3.0, 3.5, 440.0);    // ends after it
    addNote(4.0, 4.5, 440.0);    // after it
    ReadMidiFile file = writeAndRead(0, 2.0, 3.25);
    std::vector<ReadNote> notes = notesOf(file);
    EXPECT_EQ(ticksOf(notes), (std::vector<NoteTicks>{{69, 0, 256}, {69, 512, 768}}));
    // The whole note's level sum over the 32 blocks written: 256 a block.
    EXPECT_EQ(notes.at(0).velocity, 127);
    // At -1 the range is the whole song.
    addNote(9.5, 10.0, 440.0);
    EXPECT_EQ(notesOf(writeAndRead(0, -1.0, -1.0)).size(), 5u);
    EXPECT_EQ(notesOf(writeAndRead(0, -1.0, 3.25)).size(), 3u);
    std::vector<ReadNote> late = notesOf(writeAndRead(0, 9.0, -1.0));
    ASSERT_EQ(late.size(), 1u);
    EXPECT_EQ(late[0].onTick, 256u);
}

// ---- detail mode ----

class MidiOutputDetail : public MidiOutputTest {
protected:
    static constexpr double D = 1.0 / 32;   // one block; detail mode then updates every block
    void SetUp() override {
        MidiOutputTest::SetUp();
        makeSong(64, D);
    }
    void steadyBlocks(float frequency, uint8_t amplitude = 128) {
        storeDetailBlocks(std::vector<DetailBlock>(64, DetailBlock{frequency, amplitude}));
    }
};

TEST_F(MidiOutputDetail, NotesAtMostHalfABlockApartAreJoinedIntoOne) {
    steadyBlocks(440.0f);
    for (double gap : {0.4, 0.5, 0.6}) {
        resetNoteList();
        addNote(0.0, 10 * D, 440.0);
        addNote((10 + gap) * D, 20 * D, 440.0);
        std::vector<ReadNote> notes = notesOf(writeAndRead(1));
        std::vector<NoteTicks> expected{{69, 0, 320}};
        if (gap > 0.5) expected = {{69, 0, 160}, {69, uint32_t((10 + gap) * D * 512), 320}};
        EXPECT_EQ(ticksOf(notes), expected) << gap;
        EXPECT_EQ(notes.at(0).velocity, 103);
    }
}

TEST_F(MidiOutputDetail, NotesAreJoinedOnlyWhenBothSidesArePitchedAndClose) {
    std::vector<DetailBlock> blocks(64, DetailBlock{440.0f, 128});
    for (int b = 10; b < 20; b++) blocks[b].frequency = float(pitchToFrequency(69 + 1.4));
    for (int b = 20; b < 30; b++) blocks[b].frequency = float(pitchToFrequency(69 + 1.4 + 1.6));
    blocks[39].frequency = 0.0f;   // the last block of the fourth note is unpitched
    storeDetailBlocks(blocks);
    addNote(0.0, 10 * D, 440.0);
    addNote(10 * D, 20 * D, 440.0);   // 1.4 semitones up: joined
    addNote(20 * D, 30 * D, 440.0);   // 1.6 further: a new note
    addNote(30 * D, 40 * D, 440.0);   // 3 down: a new note
    addNote(40 * D, 50 * D, 440.0);   // its predecessor's last block has no pitch: a new note
    EXPECT_EQ(ticksOf(notesOf(writeAndRead(1))),
              (std::vector<NoteTicks>{{69, 0, 320}, {72, 320, 480}, {69, 480, 640}, {69, 640, 800}}));
}

TEST_F(MidiOutputDetail, AGlideBeyondTheBendRangeIsRekeyedWhereTheBendWouldLeaveIt) {
    // A quarter semitone up per block from middle C: 60 .. 67.75 over 32 blocks.
    std::vector<DetailBlock> blocks(64, DetailBlock{0.0f, 128});
    for (int b = 0; b < 32; b++) blocks[b].frequency = float(pitchToFrequency(60 + 0.25 * b));
    storeDetailBlocks(blocks);
    addNote(0.0, 32 * D, pitchToFrequency(60));
    ReadMidiFile file = writeAndRead(1);
    int unmatched = 0;
    std::vector<ReadNote> notes = notesOf(file, &unmatched);
    EXPECT_EQ(unmatched, 0);
    // Key 62 holds blocks 0 .. 16 within two semitones, further than 60 or 61 would; at
    // block 17 (64.25) key 66 reaches the stretch's end.
    EXPECT_EQ(ticksOf(notes), (std::vector<NoteTicks>{{62, 0, 17 * 16}, {66, 17 * 16, 512}}));

    std::vector<ReadMidiEvent> bends = eventsOfKind(file.tracks[1], 0xE0);
    ASSERT_EQ(bends.size(), 32u) << "every block bends a little further";
    auto value = [](const ReadMidiEvent& e) { return e.data1 | e.data2 << 7; };
    EXPECT_NEAR(value(bends[0]), 8192 - 8000, 1);
    EXPECT_NEAR(value(bends[16]), 8192 + 8000, 1);
    EXPECT_EQ(bends[17].tick, 17u * 16);
    EXPECT_NEAR(value(bends[17]), 8192 - 7000, 1);
    EXPECT_NEAR(value(bends[31]), 8192 + 7000, 1);
}

TEST_F(MidiOutputDetail, EveryBlockWritesItsVolumeWhenItChanges) {
    std::vector<DetailBlock> blocks(64, DetailBlock{440.0f, 128});
    for (int b = 10; b < 20; b++) blocks[b].amplitude = 50;
    for (int b = 20; b < 64; b++) blocks[b].amplitude = 255;
    storeDetailBlocks(blocks);
    addNote(0.0, 30 * D, 440.0, 128);
    ReadMidiFile file = writeAndRead(1);
    std::vector<ReadMidiEvent> volumes = eventsOfKind(file.tracks[1], 0xB0);
    volumes.erase(volumes.begin(), volumes.begin() + 4);   // the track's opening controllers
    std::vector<std::tuple<int, int, uint32_t>> written;   // controller, value, tick
    for (const ReadMidiEvent& e : volumes) written.emplace_back(e.data1, e.data2, e.tick);
    EXPECT_EQ(written, (std::vector<std::tuple<int, int, uint32_t>>{{7, 78, 160}, {7, 127, 320}}));
    std::vector<ReadMidiEvent> bends = eventsOfKind(file.tracks[1], 0xE0);
    ASSERT_EQ(bends.size(), 1u) << "a steady pitch bends once, at the start";
    EXPECT_EQ(bends[0].data1 | bends[0].data2 << 7, 8192);
}

TEST_F(MidiOutputDetail, ANoteWithoutPitchedBlocksOrWithoutAnFTFileIsLeftOut) {
    addNote(0.0, 10 * D, 440.0);
    addNote(20 * D, 30 * D, 440.0);
    setFTBlockWindowCapacity(D);
    EXPECT_EQ(notesOf(writeAndRead(1)).size(), 0u) << "no FT file";
    EXPECT_EQ(messageCount(), 1) << "reported once, not for every block";
    EXPECT_EQ(lastMessageText(), "Could not open FT file - openFTFile (2)");
    std::vector<DetailBlock> blocks(64, DetailBlock{440.0f, 128});
    for (int b = 20; b < 30; b++) blocks[b].frequency = 0.0f;
    storeDetailBlocks(blocks);
    EXPECT_EQ(notesOf(writeAndRead(1)).size(), 1u);
    EXPECT_EQ(notesOf(writeAndRead(0)).size(), 2u) << "plain mode does not look at the blocks";
}

TEST_F(MidiOutputDetail, ShortBlocksAreFollowedEveryThirtySecondOfASecond) {
    resetSong();
    makeSong(256, 1.0 / 128);
    std::vector<DetailBlock> blocks(256, DetailBlock{0.0f, 128});
    for (int b = 0; b < 64; b++) blocks[b].frequency = float(pitchToFrequency(69 + 0.01 * b));
    storeDetailBlocks(blocks);
    addNote(0.0, 0.5, 440.0);
    std::vector<ReadMidiEvent> bends = eventsOfKind(writeAndRead(1).tracks[1], 0xE0);
    ASSERT_EQ(bends.size(), 16u);
    for (size_t i = 0; i < bends.size(); i++) EXPECT_EQ(bends[i].tick, 16u * i);
}

TEST_F(MidiOutputDetail, AStretchLongerThanTheBlockWindowIsFollowedToItsEnd) {
    resetSong();
    makeSong(1400, D);   // 43.75 s; the window holds 30 s
    std::vector<DetailBlock> blocks(1400, DetailBlock{440.0f, 128});
    for (int b = 1200; b < 1280; b++) blocks[b].frequency = 450.0f;
    storeDetailBlocks(blocks);
    addNote(0.0, 640 * D, 440.0);
    addNote(640 * D, 1280 * D, 440.0);
    ReadMidiFile file = writeAndRead(1);
    EXPECT_EQ(ticksOf(notesOf(file)), (std::vector<NoteTicks>{{69, 0, 1280 * 16}}));
    std::vector<ReadMidiEvent> bends = eventsOfKind(file.tracks[1], 0xE0);
    ASSERT_EQ(bends.size(), 2u);
    EXPECT_EQ(bends[1].tick, 1200u * 16);
    EXPECT_EQ(bends[1].data1 | bends[1].data2 << 7, 8192 + 1556);
    EXPECT_EQ(messageCount(), 0);
}

// ---- the writer's run ----

using MidiOutputRun = MidiOutputTest;

TEST_F(MidiOutputRun, TheWaitCursorAndStatusTextShowWhileWritingAndAreTakenBackAfterAFailureToo) {
    makeSong(640, 1.0 / 64);
    addNote(0.5, 1.0, 440.0);
    ASSERT_EQ(writeNotesMidiFile(path, 0, 1, -1.0, -1.0), 1);
    std::vector<std::pair<int, std::string>> seen;
    for (const UiCall& call : uiCalls()) {
        if (call.call == UI_WAIT_CURSOR) seen.push_back({UI_WAIT_CURSOR, call.value ? "on" : "off"});
        if (call.call == UI_STATUS_TEXT) seen.push_back({UI_STATUS_TEXT, call.text});
    }
    EXPECT_EQ(seen, (std::vector<std::pair<int, std::string>>{{UI_WAIT_CURSOR, "on"},
                                                                 {UI_STATUS_TEXT, "Generating MIDI..."},
                                                                 {UI_WAIT_CURSOR, "off"},
                                                                 {UI_STATUS_TEXT, ""}}));
    // A write that fails is reported and leaves neither the file nor the status text.
    clearUiCalls();
    failFileCall(FILE_OP_WRITE, 20);
    EXPECT_EQ(writeNotesMidiFile(path, 0, 0, -1.0, -1.0), 0);
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(lastMessageText(), "Bytes were not stored properly");
    EXPECT_FALSE(fileExists(path));
    EXPECT_EQ(uiCalls().back().call, UI_STATUS_TEXT);
    EXPECT_EQ(uiCalls().back().text, "");
}

TEST_F(MidiOutputRun, NothingIsWrittenWhileARecordingOrAnOpeningRunsOrWhenTheFileCannotBeCreated) {
    makeSong(640, 1.0 / 64);
    addNote(0.5, 1.0, 440.0);
    audioActivity.recording = true;
    EXPECT_EQ(writeNotesMidiFile(path, 0, 0, -1.0, -1.0), 0);
    audioActivity = AudioActivity{false, true};
    EXPECT_EQ(writeNotesMidiFile(path, 1, 1, -1.0, -1.0), 0);
    EXPECT_EQ(saveMidiFile(path, 0, 0), 0);
    EXPECT_FALSE(fileExists(path));
    audioActivity = AudioActivity{};
    EXPECT_EQ(writeNotesMidiFile(folder.file("missing folder/Temp0001.dat"), 0, 1, -1.0, -1.0), 0);
    EXPECT_TRUE(uiCalls().empty()) << "no message, and no status text for a file never begun";
    std::string nowhere = folder.file("missing folder/song.mid");
    EXPECT_EQ(saveMidiFile(nowhere, 0, 0), 0);
    EXPECT_EQ(lastMessageText(), "Cannot " + nowhere) << "saving reports it";
}

// ---- saving ----

using MidiOutputSave = MidiOutputTest;

TEST_F(MidiOutputSave, OnlyTheSelectedRangeIsSavedWhenAskedAndLongerThanHalfABlock) {
    makeSong(640, 1.0 / 64);
    addNote(0.5, 1.0, 440.0);
    addNote(1.5, 2.5, 440.0);
    addNote(3.0, 3.5, 440.0);
    selection.timeSelectionStart = 2.0f;
    selection.timeSelectionEnd = 3.25f;
    ASSERT_EQ(saveMidiFile(path, 0, 1), 1);
    std::vector<ReadNote> notes = notesOf(readMidiBytes(readFileBytes(path)));
    ASSERT_EQ(notes.size(), 2u);
    EXPECT_EQ(notes[0].onTick, 0u);

    ASSERT_EQ(saveMidiFile(path, 0, 0), 1);
    EXPECT_EQ(notesOf(readMidiBytes(readFileBytes(path))).size(), 3u) << "the check box is off";

    selection.timeSelectionEnd = 2.0f + 1.0f / 128;   // exactly half a block
    ASSERT_EQ(saveMidiFile(path, 0, 1), 1);
    EXPECT_EQ(notesOf(readMidiBytes(readFileBytes(path))).size(), 3u);
    // A detail save follows the blocks.
    resetNoteList();
    addNote(0.5, 1.0, 440.0);
    std::vector<DetailBlock> blocks(640, DetailBlock{440.0f, 128});
    for (int b = 48; b < 64; b++) blocks[b].frequency = 450.0f;
    storeDetailBlocks(blocks);
    ASSERT_EQ(saveMidiFile(path, 1, 0), 1);
    ReadMidiFile file = readMidiBytes(readFileBytes(path));
    EXPECT_EQ(notesOf(file).size(), 1u);
    EXPECT_EQ(eventsOfKind(file.tracks[1], 0xE0).size(), 2u);
    ASSERT_EQ(saveMidiFile(path, 0, 0), 1);
    EXPECT_EQ(eventsOfKind(readMidiBytes(readFileBytes(path)).tracks[1], 0xE0).size(), 0u) << "a plain save does not";
}

// ---- round trips ----

using MidiOutputRoundTrip = MidiOutputTest;

TEST_F(MidiOutputRoundTrip, EveryNoteComesBackWithItsKeyAndTimes) {
    makeSong(6400, 1.0 / 64);
    // Unequal blocks, as timing edits leave them: about 100 s in all.
    for (uint32_t k = 0; k < 6400; k++) song.sampleBlockDurations[k] = (1 + k % 3) / 128.0;
    uint32_t seed = 99;
    auto next = [&seed]() {
        seed = seed * 1103515245u + 12345u;
        return (seed >> 8) & 0xFFFF;
    };
    double t = 0.1;
    while (noteList.count < 200) {
        double length = 0.05 + (next() % 1000) / 1000.0 * 0.6;
        double pitch = pitchToFrequency(40 + (next() % 4500) / 100.0);
        addNote(t, t + length, pitch, 1 + next() % 255);
        t += length + (next() % 300) / 1000.0;
    }
    for (double start : {-1.0, 17.3}) {
        double end = start < 0 ? -1.0 : 61.7;
        ReadMidiFile file = writeAndRead(0, start, end);
        EXPECT_EQ(file.division, 256);
        int unmatched = 0;
        std::vector<ReadNote> notes = notesOf(file, &unmatched);
        EXPECT_EQ(unmatched, 0);
        double s = start < 0 ? 0.0 : start;
        uint32_t firstBlock = blockAtTime(s);
        uint32_t endBlock = blockAtTime(start < 0 ? songDuration() : end);
        size_t k = 0;
        for (int i = 0; i < noteList.count; i++) {
            const Note& note = noteList.notes[i];
            if (!(blockAtTime(note.midiStart) < endBlock && firstBlock < blockAtTime(note.midiEnd))) continue;
            ASSERT_LT(k, notes.size());
            EXPECT_EQ(notes[k].key, note.midiNote) << i;
            double on = std::max(double(note.midiStart), s) - s;
            EXPECT_LE(notes[k].onSeconds, on + 1e-9) << i;
            EXPECT_GT(notes[k].onSeconds, on - TICK_SECONDS) << i;
            EXPECT_LE(notes[k].offSeconds, note.midiEnd - s + 1e-9) << i;
            EXPECT_GT(notes[k].offSeconds, note.midiEnd - s - TICK_SECONDS) << i;
            EXPECT_GE(notes[k].velocity, 1);
            k++;
        }
        EXPECT_EQ(k, notes.size());
        EXPECT_GT(k, 50u);
    }
}

TEST_F(MidiOutputRoundTrip, DetailStretchesComeBackAsOneNoteEachOnTheSungKey) {
    resetSong();
    makeSong(320, 1.0 / 32);
    std::vector<DetailBlock> blocks(320, DetailBlock{0.0f, 128});
    const double keys[] = {57, 60.2, 64.9, 55, 71.3};
    for (int n = 0; n < 5; n++) {
        for (int b = n * 60; b < n * 60 + 40; b++) blocks[b].frequency = float(pitchToFrequency(keys[n]));
        addNote(n * 60 / 32.0, (n * 60 + 40) / 32.0, pitchToFrequency(keys[n]));
    }
    storeDetailBlocks(blocks);
    std::vector<ReadNote> notes = notesOf(writeAndRead(1));
    ASSERT_EQ(notes.size(), 5u);
    for (int n = 0; n < 5; n++) {
        EXPECT_EQ(notes[n].key, roundSemitone(keys[n])) << n;
        EXPECT_NEAR(notes[n].onSeconds, n * 60 / 32.0, 1e-9) << n;
        EXPECT_NEAR(notes[n].offSeconds, (n * 60 + 40) / 32.0, 1e-9) << n;
    }
}

// ---- the instrument scale ----

using MidiOutputScale = MidiOutputTest;

TEST_F(MidiOutputScale, AChromaticScaleOfSeparateNotesIsWrittenAtItsTimesUnderItsParametersName) {
    EXPECT_EQ(scaleMidiFileName("Flute", 60, 71, 1.0, 128), "Flute_60_71_1.0_128.mid");
    EXPECT_EQ(scaleMidiFileName("Alto sax", 49, 80, 0.26, 90), "Alto sax_49_80_0.3_90.mid");
    ASSERT_EQ(writeScaleMidiFile(path, "Flute", 60, 64, 0.5, 128), 1);
    ReadMidiFile file = readMidiBytes(readFileBytes(path));
    ASSERT_EQ(file.error, "");
    EXPECT_EQ(file.format, 1);
    ASSERT_EQ(file.trackCount, 2);
    EXPECT_EQ(file.division, 240);
    ASSERT_FALSE(file.tracks[0].events.empty());
    EXPECT_EQ(file.tracks[0].events[0].metaType, 0x03);
    EXPECT_EQ(file.tracks[0].events[0].metaData, textBytes(CREDIT_LINE));
    EXPECT_EQ(file.tracks[1].events[0].metaData, textBytes("Flute"));
    EXPECT_EQ(eventsOfKind(file.tracks[1], 0xC0)[0].data1, 73);
    std::vector<ReadNote> notes = notesOf(file);
    ASSERT_EQ(notes.size(), 5u);
    for (int k = 0; k < 5; k++) {
        EXPECT_EQ(std::tuple(notes[k].key, notes[k].velocity, notes[k].onTick), std::tuple(60 + k, 103, 480u * k));
        EXPECT_NEAR(notes[k].onSeconds, 1.0 * k, 1e-9);
        EXPECT_NEAR(notes[k].offSeconds, 1.0 * k + 0.5, 1e-9);
    }
}

TEST_F(MidiOutputScale, ARangeOrDurationItCannotPlayWritesNothing) {
    EXPECT_EQ(writeScaleMidiFile(path, "Flute", 64, 60, 0.5, 128), 0);
    EXPECT_EQ(writeScaleMidiFile(path, "Flute", 60, 128, 0.5, 128), 0);
    EXPECT_EQ(writeScaleMidiFile(path, "Flute", -1, 60, 0.5, 128), 0);
    EXPECT_EQ(writeScaleMidiFile(path, "Flute", 60, 64, 0.0, 128), 0);
    EXPECT_EQ(writeScaleMidiFile(path, "Flute", 60, 64, std::nan(""), 128), 0);
    EXPECT_FALSE(fileExists(path));
    std::string nowhere = folder.file("missing folder/scale.mid");
    EXPECT_EQ(writeScaleMidiFile(nowhere, "Flute", 60, 64, 0.5, 128), 0);
    EXPECT_EQ(lastMessageText(), "Cannot " + nowhere);
}
