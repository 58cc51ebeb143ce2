// Note building from a decided pitch track: the notes' times, pitches, semitones and volumes,
// the voice-dependent duration limits, the syllable splits, the dropped notes, a full list, the
// instrument match, and the note pitch.
#include <gtest/gtest.h>

#include <tuple>

#include "analysis/recognitionFixtures.h"

class NoteBuilding : public RecognitionTest {
protected:
    double blockTime(uint32_t b) const { return b * song.sampleBlockDuration; }
    // What a built note must be: its semitone (0: any) and the blocks it starts and ends at
    // (-1: any).
    struct ExpectedNote {
        int midiNote;
        int first = -1, end = -1;
    };
    // Builds the notes of the whole song and compares them with expected.
    void expectNotes(const std::vector<ExpectedNote>& expected, const char* what = "") {
        resetNoteList();
        buildNotes(0, 0);
        ASSERT_EQ(noteList.count, int(expected.size())) << what;
        for (size_t i = 0; i < expected.size(); i++) {
            const Note& n = noteList.notes[i];
            if (expected[i].midiNote) { EXPECT_EQ(n.midiNote, expected[i].midiNote) << what << " note " << i; }
            if (expected[i].first >= 0) { EXPECT_NEAR(n.waveStart, blockTime(expected[i].first), 1e-6) << what << " note " << i; }
            if (expected[i].end >= 0) { EXPECT_NEAR(n.waveEnd, blockTime(expected[i].end), 1e-6) << what << " note " << i; }
        }
    }
    // A definition of one sine harmonic per semitone, as the program generates for most names.
    static InstrumentDefinition sineDefinition(const char* name, int voice, int low, int high) {
        InstrumentDefinition d{name, "Sine", "Generated", uint8_t(voice), 1, {70.0f, 30.0f, 10.0f}, 440.0f,
                               uint8_t(low), uint8_t(high), {}};
        for (int s = low; s <= high; s++) {
            NoteSampleSet set{};
            set.sampleCount = 1;
            set.samples[0].duration = 1.0f;
            set.samples[0].level = 200;
            set.samples[0].harmonicCount = 1;
            set.samples[0].harmonics[0].frequency = float(pitchToFrequency(s));
            set.samples[0].harmonics[0].meanAmplitude = 200;
            d.semitones.push_back(set);
        }
        return d;
    }
};

TEST_F(NoteBuilding, RunsOnOneSemitoneBecomeNotesInTimeOrder) {
    makeSong(90);
    setPitches(10, 40, 220.0, 100);
    setPitches(50, 90, 329.63, 150);
    uint32_t next = buildNotes(0, 0);
    EXPECT_EQ(next, 90u * 512u) << "the end of the blocks worked on";
    ASSERT_EQ(noteList.count, 2);
    const Note& a = noteList.notes[0];
    const Note& b = noteList.notes[1];
    EXPECT_NEAR(a.waveStart, blockTime(10), 1e-6);
    EXPECT_NEAR(a.waveEnd, blockTime(40), 1e-6);
    EXPECT_NEAR(a.pitch, 220.0, 0.01);
    EXPECT_NEAR(b.waveStart, blockTime(50), 1e-6);
    EXPECT_EQ(std::tuple(a.midiStart, a.midiEnd, a.midiNote, a.volumeSum, a.recognitionWeight, b.midiNote, b.volumeSum),
              std::tuple(a.waveStart, a.waveEnd, 57, 30u * 100u, 100.0f, 64, 40u * 150u));
}

TEST_F(NoteBuilding, ASemitoneHoldsThroughSmallWaversAndShortRunsAreDroppedOrJoined) {
    makeSong(80);
    setPitches(10, 50, 440.0 * std::exp2(0.2 / 12.0));
    expectNotes({{69, 10, 50}}, "twenty cents sharp");
    makeSong(80);
    for (uint32_t b = 10; b < 70; b++) setPitch(b, pitchToFrequency(b % 2 ? 60.45 : 60.6));
    expectNotes({{0, 10, 70}}, "wavering across a semitone boundary");
    makeSong(80);
    setPitches(10, 14, 220.0);   // 0.046 s: under a voice's shortest note
    setPitches(30, 35, 220.0);   // 0.058 s
    expectNotes({{57, 30, 35}}, "short runs");
    makeSong(80);
    setPitches(10, 70, 220.0);
    setPitches(40, 42, 440.0);
    expectNotes({{57, 10, 70}}, "a sliver between two runs of one semitone");
    EXPECT_NEAR(noteList.notes[0].pitch, 220.0, 0.01) << "the sliver does not pull the pitch";
}

// A glide from 57 (blocks 40..47) up to 64: 57.78, 58.56, 59.33, 60.11, 60.89, ... 63.22.
static double glideUp(uint32_t b) { return 57.0 + 7.0 * (double(b) - 39.0) / 9.0; }

TEST_F(NoteBuilding, AGlideBetweenTwoNotesIsSplitWhereItPassesTheMiddle) {
    makeSong(90);
    setPitches(10, 40, pitchToFrequency(57));
    for (uint32_t b = 40; b < 48; b++) setPitch(b, pitchToFrequency(glideUp(b)));
    setPitches(48, 80, pitchToFrequency(64));
    // 60.11 at block 43 lies nearer 57, 60.89 at block 44 nearer 64.
    expectNotes({{57, 10, 44}, {64, 44, 80}});
    // Rebuilt from the second note on, as the opening path does after the next chunk: the
    // first note (built before) still decides where the glide is split.
    buildNotes(sampleOf(44), 1);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_NEAR(noteList.notes[1].waveStart, blockTime(44), 1e-6);
    EXPECT_EQ(noteList.notes[1].midiNote, 64);
}

// What lies between two notes: a slow glide dwelling on a semitone is no note, but a short
// steady note is; a short silence after a glide belongs to the note the glide reached; a long
// silence keeps two notes apart.
TEST_F(NoteBuilding, WhatLiesBetweenTwoNotesGoesToTheOneItLeansTo) {
    makeSong(100);
    setPitches(10, 40, pitchToFrequency(57));
    // 0.093 s around 60, wandering from 59.6 up to 60.4 on the way to 64.
    for (uint32_t b = 40; b < 48; b++) setPitch(b, pitchToFrequency(59.6 + 0.8 * double(b - 40) / 7.0));
    setPitches(48, 80, pitchToFrequency(64));
    expectNotes({{57, 10, 48}, {64, 48, 80}}, "every block of the slow glide lies nearer 57");
    setPitches(40, 48, pitchToFrequency(60));
    expectNotes({{57}, {60}, {64}}, "a short steady note");
    const double way[] = {58.5, 60.0, 61.5, 63.0};
    for (uint32_t b = 40; b < 44; b++) setPitch(b, pitchToFrequency(way[b - 40]));
    setPitches(44, 48, 0.0);   // 0.046 s of nothing: the consonant of the next syllable
    expectNotes({{57, 10, 42}, {64, 42, 80}}, "61.5 lies nearer 64; the silence joins it");
    setPitches(40, 42, pitchToFrequency(61.5));   // a sliver leaning towards the next note
    setPitches(42, 50, 0.0);                      // 0.093 s of silence: longer than a glide's gap
    setPitches(50, 80, pitchToFrequency(64));
    expectNotes({{57}, {64, 50, 80}}, "a long silence");
}

TEST_F(NoteBuilding, ANoteStartsWhereItsPartialRoseButNotInTheFaintNoiseBeforeIt) {
    makeSong(90);
    // The track takes the note at block 20; its partial was there, rising, from block 16.
    setBlocks(20, 60, {{220.0, 200}}, 200);
    for (uint32_t b = 16; b < 20; b++) setBlock(b, {{220.0, int(40 * (b - 15))}}, 100);
    setPitches(16, 20, 0.0);
    setPitches(20, 60, 220.0);
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_NEAR(noteList.notes[0].waveStart, blockTime(16), 1e-6);

    // A partial at 5 % of the note's level is breath before it, not its start.
    resetNoteList();
    setBlocks(14, 20, {{220.0, 10}}, 20);
    setPitches(14, 20, 0.0);
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_NEAR(noteList.notes[0].waveStart, blockTime(20), 1e-6);
}

TEST_F(NoteBuilding, ABoundaryMovesForwardToASyllableStartJustAfterIt) {
    makeSong(100);
    setPitches(10, 40, pitchToFrequency(57));
    setPitches(40, 80, pitchToFrequency(64));
    blockData(46).blockFlags |= BLOCK_SYLLABLE_START;   // 0.07 s into the second note
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_NEAR(noteList.notes[0].waveEnd, blockTime(46), 1e-6);
    EXPECT_NEAR(noteList.notes[1].waveStart, blockTime(46), 1e-6);
    EXPECT_EQ(noteList.notes[1].midiNote, 64);

    // Further on (0.093 s) it is the new note's business, and the boundary stays.
    resetNoteList();
    blockData(46).blockFlags = 0;
    blockData(48).blockFlags |= BLOCK_SYLLABLE_START;
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_NEAR(noteList.notes[1].waveStart, blockTime(40), 1e-6);
}

TEST_F(NoteBuilding, AFaintStartOutOfSilenceIsLeftOut) {
    makeSong(100);
    setPitches(20, 23, 220.0, 10);
    setPitches(23, 60, 220.0, 200);
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_NEAR(noteList.notes[0].waveStart, blockTime(23), 1e-6);

    // After another note and a one-block dropout the quiet blocks are the new note's attack.
    resetNoteList();
    setPitches(5, 19, 330.0, 200);
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_NEAR(noteList.notes[1].waveStart, blockTime(20), 1e-6);
}

TEST_F(NoteBuilding, ANoteOutOfSilenceStartsWhereTheLoudnessLeaptUp) {
    auto onsetAfter = [&](int silence, int attack) {
        resetNoteList();
        for (uint32_t b = 0; b < 20; b++) blockData(b).blockLoudness = uint8_t(silence);
        for (uint32_t b = 20; b < 23; b++) blockData(b).blockLoudness = uint8_t(attack);   // no pitch yet
        setPitches(23, 60, 220.0);
        for (uint32_t b = 23; b < 60; b++) blockData(b).blockLoudness = 240;
        buildNotes(0, 0);
        EXPECT_EQ(noteList.count, 1);
        return noteList.count ? noteList.notes[0].waveStart : -1.0f;
    };
    makeSong(80);
    EXPECT_NEAR(onsetAfter(0, 80), blockTime(20), 1e-6) << "a slow attack out of silence";
    EXPECT_NEAR(onsetAfter(0, 40), blockTime(23), 1e-6) << "too faint to be the note yet";
    EXPECT_NEAR(onsetAfter(50, 80), blockTime(23), 1e-6) << "out of noise, not silence";
}

TEST_F(NoteBuilding, AnOctaveSlipAtANotesStartJoinsItButAShortLeapStays) {
    // 0.093 s on 56 (the second harmonic of 44, its fundamental faintly there), then 44.
    auto build = [&](bool fundamentalHeard) {
        resetNoteList();
        for (uint32_t b = 30; b < 38; b++)
            setBlock(b, fundamentalHeard ? std::vector<TestEntry>{{pitchToFrequency(44), 2}, {pitchToFrequency(56), 60}}
                                         : std::vector<TestEntry>{{pitchToFrequency(56), 60}}, 150);
        setBlocks(38, 80, {{pitchToFrequency(44), 200}}, 150);
        setPitches(30, 38, pitchToFrequency(56));
        setPitches(38, 80, pitchToFrequency(44));
        buildNotes(0, 0);
    };
    makeSong(90);
    build(true);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_EQ(noteList.notes[0].midiNote, 44);
    EXPECT_NEAR(noteList.notes[0].waveStart, blockTime(30), 1e-6);

    build(false);
    ASSERT_EQ(noteList.count, 2) << "a short note an octave above the next is a leap";
    EXPECT_EQ(noteList.notes[0].midiNote, 56);
}

TEST_F(NoteBuilding, ANoteSplitsAtASyllableStartWellInsideItWhenSyllablesAreFound) {
    makeSong(120);
    setPitches(0, 100, 220.0, 100);
    blockData(50).blockFlags |= BLOCK_SYLLABLE_START;
    blockData(5).blockFlags |= BLOCK_SYLLABLE_START;    // 0.058 s from the start: too close
    expectNotes({{57, 0, 50}, {57, 50, 100}});
    EXPECT_EQ(noteList.notes[0].volumeSum, 5000u);
    EXPECT_EQ(noteList.notes[1].volumeSum, 5000u);
    EXPECT_TRUE(noteList.notes[0].recognitionCode & NOTE_SPLIT_AT_SYLLABLE);
    recognitionOptions.findSyllables = false;
    expectNotes({{57, 0, 100}}, "without find syllables");
}

TEST_F(NoteBuilding, EachPartOfASplitNoteSoundsItsOwnPitch) {
    instrumentDefinitions.definitions.push_back(sineDefinition("Flute", 73, 60, 96));
    globalSettings.defaultInstrument = "Flute";
    makeSong(90);
    // A short last note (0.08 s, under a flute's shortest note) joins the note before as its
    // end; the syllable start parts them again, and the part shows the pitch its blocks hold.
    setPitches(0, 61, 740.0);
    setPitches(61, 68, 784.0);
    blockData(59).blockFlags |= BLOCK_SYLLABLE_START;
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_NEAR(noteList.notes[0].pitch, 740.0, 0.01);
    EXPECT_NEAR(noteList.notes[1].waveStart, blockTime(59), 1e-6);
    EXPECT_NEAR(noteList.notes[1].pitch, 784.0, 0.01);
    EXPECT_EQ(std::tuple(noteList.notes[0].midiNote, noteList.notes[1].midiNote), std::tuple(78, 79));
}

TEST_F(NoteBuilding, TheNotesToDropAreRemovedBeforeTheNewOnesAreAppended) {
    makeSong(120);
    setPitches(10, 40, 220.0);
    setPitches(50, 80, 330.0);
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 2);
    setPitches(50, 80, 0.0);
    setPitches(60, 110, 392.0);
    buildNotes(sampleOf(45), 1);
    ASSERT_EQ(noteList.count, 2);
    EXPECT_EQ(noteList.notes[0].midiNote, 57);
    EXPECT_EQ(noteList.notes[1].midiNote, 67);
}

TEST_F(NoteBuilding, AFullNoteListTakesNoMoreNotes) {
    makeSong(120);
    setPitches(10, 40, 220.0);
    setPitches(50, 80, 330.0);
    Note early{};
    early.waveEnd = early.midiEnd = 0.01f;
    while (noteList.count < MAX_CS_NOTES - 1) ASSERT_EQ(appendNote(early), 1);
    buildNotes(0, 0);
    EXPECT_EQ(noteList.count, MAX_CS_NOTES);
    EXPECT_EQ(noteList.notes[MAX_CS_NOTES - 1].midiNote, 57);
}

TEST_F(NoteBuilding, WithoutDefinitionsANoteIsTheBuiltInVoice) {
    makeSong(60);
    setPitches(10, 50, 220.0);
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_EQ(noteList.notes[0].instrument, 0);
    EXPECT_EQ(noteList.notes[0].group, VOICE_OOHS_VOICE);
    EXPECT_EQ(noteList.notes[0].recognitionCode & NOTE_OUTSIDE_DEFINITIONS, NOTE_OUTSIDE_DEFINITIONS);
}

TEST_F(NoteBuilding, TheSongsInstrumentIsSettledByItsNotesAndHoldsEveryNote) {
    instrumentDefinitions.definitions.push_back(sineDefinition("Flute", 73, 60, 96));
    instrumentDefinitions.definitions.push_back(sineDefinition("Voice", 53, 36, 84));
    makeSong(200);
    setPitches(10, 40, 220.0);
    setPitches(50, 80, 246.94);
    setPitches(90, 120, 261.63);
    setPitches(130, 160, 1567.98);   // note 91: only the flute reaches it
    buildNotes(0, 0);
    ASSERT_EQ(noteList.count, 4);
    EXPECT_EQ(songInstruments.settledVoice, 53);
    for (int i = 0; i < 4; i++) {
        EXPECT_EQ(noteList.notes[i].instrument, 1) << "note " << i;
        EXPECT_EQ(noteList.notes[i].group, 53);
        EXPECT_EQ(noteList.notes[i].sourceIndex, 0u);
    }
    EXPECT_EQ(noteList.notes[0].recognitionCode & NOTE_MATCHED_IN_RANGE, NOTE_MATCHED_IN_RANGE);
    EXPECT_EQ(noteList.notes[3].recognitionCode & NOTE_OUTSIDE_DEFINITIONS, NOTE_OUTSIDE_DEFINITIONS);
    EXPECT_EQ(noteList.notes[3].midiNote, 91);
}

TEST_F(NoteBuilding, NotePitchLeavesOutTheStartAndWhatLiesASemitoneAway) {
    makeSong(60);
    setPitches(0, 8, 392.0);
    setPitches(8, 50, 440.0);
    setPitches(30, 32, 880.0);
    FTDataBuffer before = blockData(31);
    EXPECT_NEAR(notePitch(0, 50), 440.0, 0.01);
    EXPECT_NEAR(blockData(31).entries[0].frequency, before.entries[0].frequency, 1e-6) << "the blocks are put back";
    EXPECT_EQ(blockData(31).nEntries, before.nEntries);
    EXPECT_NEAR(notePitch(0, 50, 392.0), 392.0, 0.01) << "a given mean starts the count";
}

TEST(NoteBuildingDurations, ShortestNoteAndLongestSustainByVoiceAndPitch) {
    const std::tuple<int, double, double> shortest[] = {{53, 30.0, 0.05},      {52, 90.0, 0.05},     {78, 10.0, 0.05},
                                                        {0, 24.0, 0.25},       {40, 60.0, 1.0 / 12}, {40, 42.0, 1.0 / 6},
                                                        {40, 100.0, 1.0 / 12}};
    for (auto [voice, pitch, seconds] : shortest) EXPECT_NEAR(shortestNoteSeconds(voice, pitch), seconds, 1e-12) << voice;
    const std::tuple<int, double, double> longest[] = {{0, 20.0, 10.0}, {5, 46.0, 7.5},     {3, 80.0, 5.0},
                                                       {24, 24.0, 5.0}, {39, 68.0, 3.0},    {6, 24.0, 1000.0},
                                                       {53, 60.0, 1000.0}};
    for (auto [voice, pitch, seconds] : longest) EXPECT_DOUBLE_EQ(longestSustainSeconds(voice, pitch), seconds) << voice;
}

TEST_F(NoteBuilding, APianoNoteLongerThanItsSustainIsNoNote) {
    instrumentDefinitions.definitions.push_back(sineDefinition("Piano", 0, 21, 108));
    globalSettings.defaultInstrument = "Piano";
    makeSong(900);
    setPitches(0, 900, 880.0);   // 10.4 s at note 81: a piano sustains 5 s
    buildNotes(0, 0);
    EXPECT_EQ(noteList.count, 0);
}
