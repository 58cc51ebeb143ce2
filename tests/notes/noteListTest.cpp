// The note list and barline list: the Note record's bytes, the list limits, and the checks
// that keep note and barline times inside the song and clear of their neighbours.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <vector>
#include <tuple>

#include "notes/noteList.h"
#include "notes/noteFixtures.h"

// ---- the record ----

TEST(NoteListLayout, EveryFieldSitsInItsSlotOfTheSeventyTwoByteRecord) {
    Note note{};
    note.pitch = 440.0f;
    note.midiStart = 1.0f;
    note.midiEnd = 2.0f;
    note.waveStart = 3.0f;
    note.waveEnd = 4.0f;
    note.recognitionValues[0] = 5.0f;
    note.recognitionValues[2] = 6.0f;
    note.recognitionWeight = 100.0f;
    note.midiNote = 69;
    note.recognitionCode = 0x11223344;
    note.recognitionExtra[1] = 0x55667788;
    note.instrument = -1;
    note.sourceIndex = 9;
    note.group = 7;
    note.volumeSum = 0x01020304;
    note.recognitionTail = 0xA1B2C3D4;
    unsigned char bytes[72];
    ASSERT_EQ(sizeof(Note), sizeof(bytes));
    std::memcpy(bytes, &note, sizeof(bytes));

    auto f32At = [&](int offset) { float v; std::memcpy(&v, bytes + offset, 4); return v; };
    auto u32At = [&](int offset) { uint32_t v; std::memcpy(&v, bytes + offset, 4); return v; };
    const std::pair<int, float> floats[] = {{0, 440.0f}, {4, 1.0f}, {8, 2.0f},   {12, 3.0f},
                                            {16, 4.0f},  {20, 5.0f}, {28, 6.0f}, {32, 100.0f}};
    for (auto [offset, value] : floats) EXPECT_EQ(f32At(offset), value) << offset;
    EXPECT_EQ(bytes[36], 69);
    EXPECT_EQ(bytes[37] | bytes[38] | bytes[39], 0) << "midiNote's slot is padded with zeros";
    // Instrument -1 at 52.
    EXPECT_EQ(std::tuple(u32At(40), u32At(48), u32At(52), u32At(56)), std::tuple(0x11223344u, 0x55667788u, 0xFFFFFFFFu, 9u));
    EXPECT_EQ(bytes[60], 7);
    EXPECT_EQ(bytes[61] | bytes[62] | bytes[63], 0) << "group's slot is padded with zeros";
    EXPECT_EQ(std::tuple(u32At(64), u32At(68)), std::tuple(0x01020304u, 0xA1B2C3D4u));
}

// ---- limits and order ----

class NoteListLimits : public NoteSongTest {};

TEST_F(NoteListLimits, TheListTakesSixteenThousandThreeHundredEightyFourNotesAndRefusesMore) {
    for (int i = 0; i < MAX_CS_NOTES; i++) ASSERT_EQ(appendNote(noteSpanning(float(i), float(i) + 0.5f)), 1) << i;
    EXPECT_EQ(noteList.count, 16384);
    EXPECT_EQ(appendNote(noteSpanning(20000.0f, 20001.0f)), 0);
    EXPECT_EQ(insertNote(0, noteSpanning(-5.0f, -4.0f)), 0);
    EXPECT_EQ(noteList.count, 16384);
    EXPECT_EQ(noteList.notes[0].waveStart, 0.0f) << "a refused insert moves nothing";
    EXPECT_EQ(noteList.notes[16383].waveStart, 16383.0f);
}

TEST_F(NoteListLimits, TheBarlineListTakesTwoThousandFortyEightAndRefusesMore) {
    for (int i = 0; i < MAX_CS_BARLINES; i++) ASSERT_EQ(appendBarline(float(i)), 1) << i;
    EXPECT_EQ(barlineList.count, 2048);
    EXPECT_EQ(appendBarline(5000.0f), 0);
    EXPECT_EQ(insertBarline(3, 2.5f), 0);
    EXPECT_EQ(barlineList.count, 2048);
    EXPECT_EQ(barlineList.times[3], 3.0f);
}

TEST_F(NoteListLimits, InsertAndRemoveKeepTheOtherNotesInOrder) {
    addNote(1.0f, 1.5f);
    addNote(3.0f, 3.5f);
    ASSERT_EQ(insertNote(1, noteSpanning(2.0f, 2.5f)), 1);
    auto starts = [] {
        std::vector<float> s;
        for (int i = 0; i < noteList.count; i++) s.push_back(noteList.notes[i].waveStart);
        return s;
    };
    EXPECT_EQ(starts(), (std::vector<float>{1.0f, 2.0f, 3.0f}));
    ASSERT_EQ(removeNote(0), 1);
    EXPECT_EQ(starts(), (std::vector<float>{2.0f, 3.0f}));
}

TEST_F(NoteListLimits, IndicesOutsideTheListsAreRefused) {
    addNote(1.0f, 1.5f);
    ASSERT_EQ(appendBarline(1.0f), 1);
    // Every call is refused (a braced list runs them in order).
    EXPECT_EQ((std::vector<int>{insertNote(2, noteSpanning(2.0f, 2.5f)), insertNote(-1, noteSpanning(0.0f, 0.5f)), removeNote(1),
                                removeNote(-1), insertBarline(2, 2.0f), removeBarline(1), removeBarline(-1),
                                validateNoteTimes(1, false), validateNoteTimes(-1, true)}),
              std::vector<int>(9, 0));
    validateBarlineTime(1);
    validateBarlineTime(-1);
    EXPECT_EQ(noteList.count, 1);
    EXPECT_EQ(barlineList.count, 1);
    resetNoteList();   // the song closes
    EXPECT_EQ(noteList.count, 0);
    EXPECT_EQ(barlineList.count, 0);
}

// ---- note times ----

class NoteListTimes : public NoteSongTest {};

TEST_F(NoteListTimes, AnEndReachingIntoTheNextNoteIsCutBackToItsStartOnABlockBoundary) {
    // The next note starts three quarters of a block after 2.0 s; the nearest boundary is 2.0 + D.
    const float nextStart = float(2.0 + 0.75 * D);
    addNote(1.0f, 2.0f);
    addNote(nextStart, 3.0f);
    noteList.notes[0].waveEnd = float(nextStart + 0.2);
    EXPECT_EQ(validateNoteTimes(0, false), 1);
    EXPECT_DOUBLE_EQ(noteList.notes[0].waveEnd, 2.0 + D);
    EXPECT_EQ(noteList.notes[0].waveStart, 1.0f);
    EXPECT_EQ(noteList.notes[0].midiEnd, 2.0f) << "the MIDI span did not overlap and stays";
}

TEST_F(NoteListTimes, ANoteSqueezedBelowOneAndAHalfBlocksGetsTwoBlocksWithItsStartMovedBack) {
    addNote(1.0f, 1.5f);
    addNote(2.0f, 3.0f);
    Note& note = noteList.notes[0];
    note.waveStart = float(2.0 - D);   // one block before the next note
    note.waveEnd = 2.2f;
    EXPECT_EQ(validateNoteTimes(0, false), 1);
    EXPECT_DOUBLE_EQ(note.waveEnd, 2.0);
    EXPECT_DOUBLE_EQ(note.waveStart, 2.0 - 2 * D);
}

TEST_F(NoteListTimes, AStartInsideThePreviousNoteMovesToItsEndAndASqueezedNoteGrowsForward) {
    addNote(1.0f, 2.0f);
    addNote(3.0f, 4.0f);
    Note& note = noteList.notes[1];
    note.midiStart = 1.9f;                 // inside note 0's MIDI span
    note.waveStart = 1.95f;                // inside note 0's wave span
    note.waveEnd = float(2.0 + D);         // one block past note 0's end
    EXPECT_EQ(validateNoteTimes(1, false), 1);
    EXPECT_DOUBLE_EQ(note.midiStart, 2.0);
    EXPECT_DOUBLE_EQ(note.midiEnd, 4.0) << "still long enough: its end stays";
    EXPECT_DOUBLE_EQ(note.waveStart, 2.0);
    EXPECT_DOUBLE_EQ(note.waveEnd, 2.0 + 2 * D);
}

TEST_F(NoteListTimes, ANoteLastsFromOneAndAHalfBlocksToThirtySeconds) {
    makeSongOfBlocks(40 * 128);
    addNote(1.0f, 31.0f);
    EXPECT_EQ(validateNoteTimes(0, false), 1);
    noteList.notes[0].waveEnd = 31.01f;
    EXPECT_EQ(validateNoteTimes(0, false), 0);
    noteList.notes[0].waveEnd = 31.0f;
    noteList.notes[0].midiEnd = 31.01f;
    EXPECT_EQ(validateNoteTimes(0, false), 0) << "the MIDI span counts as well";
    noteList.notes[0] = noteSpanning(1.0f, float(1.0 + 1.5 * D));
    EXPECT_EQ(validateNoteTimes(0, false), 1);
    noteList.notes[0].waveEnd = float(1.0 + 1.25 * D);
    EXPECT_EQ(validateNoteTimes(0, false), 0);
    EXPECT_DOUBLE_EQ(noteList.notes[0].waveEnd, 1.0 + 1.25 * D) << "a short note alone is refused, not lengthened";
}

TEST_F(NoteListTimes, NegativeTimesAndTimesThatAreNotNumbersBecomeZero) {
    addNote(-0.5f, 1.0f);
    noteList.notes[0].waveStart = -0.25f;
    EXPECT_EQ(validateNoteTimes(0, false), 1);
    EXPECT_EQ(noteList.notes[0].midiStart, 0.0f);
    EXPECT_EQ(noteList.notes[0].waveStart, 0.0f);
    noteList.notes[0] = noteSpanning(1.0f, 2.0f);
    noteList.notes[0].waveEnd = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(validateNoteTimes(0, false), 0) << "the wave span now ends at 0, before it starts";
    EXPECT_EQ(noteList.notes[0].waveEnd, 0.0f);
    noteList.notes[0].waveStart = std::numeric_limits<float>::quiet_NaN();
    noteList.notes[0].waveEnd = 1.0f;
    EXPECT_EQ(validateNoteTimes(0, false), 1);
    EXPECT_EQ(noteList.notes[0].waveStart, 0.0f);
}

TEST_F(NoteListTimes, TimesBeyondTheSongComeBackToItsEndUnlessTheNoteStandsAlone) {
    addNote(9.5f, 12.0f);
    EXPECT_EQ(validateNoteTimes(0, false), 1);
    EXPECT_EQ(noteList.notes[0].midiEnd, 10.0f);
    EXPECT_EQ(noteList.notes[0].waveEnd, 10.0f);

    noteList.notes[0] = noteSpanning(9.5f, 12.0f);
    EXPECT_EQ(validateNoteTimes(0, true), 1);
    EXPECT_EQ(noteList.notes[0].waveEnd, 12.0f);
}

TEST_F(NoteListTimes, ANoteStandingAloneIgnoresItsNeighbours) {
    addNote(1.0f, 2.0f);
    addNote(1.5f, 3.0f);
    noteList.notes[1].waveStart = -1.0f;
    EXPECT_EQ(validateNoteTimes(1, true), 1);
    EXPECT_EQ(noteList.notes[1].midiStart, 1.5f);
    EXPECT_EQ(noteList.notes[1].waveStart, 0.0f) << "negatives still become 0";
}

// ---- barline times ----

using NoteListBarlines = NoteSongTest;

// Negative times become 0 and times past the end the end; a barline keeps two blocks from its
// neighbours, landing on the nearest block boundary when moved; one far from them stays.
TEST_F(NoteListBarlines, ABarlineStaysInTheSongAndTwoBlocksFromItsNeighbours) {
    struct Case {
        std::vector<float> times;
        int index;
        double expected;
    } cases[] = {
        {{-0.5f}, 0, 0.0},
        {{12.0f}, 0, 10.0},
        {{1.0f, 1.01f}, 1, 1.0 + 2 * D},
        {{1.995f, 2.0f}, 0, 2.0 - 2 * D},
        {{1.995f, float(2.0 + 0.75 * D)}, 0, 2.0 - D},   // two blocks before the next is 2.0 - 1.25 D
        // Two blocks after 1.0 + 0.75 D is 1.0 + 2.75 D; the nearest boundary is 1.0 + 3 D.
        {{float(1.0 + 0.75 * D), 1.0f}, 1, 1.0 + 3 * D},
        {{1.0f, float(1.0 + 2.3 * D), 3.0f}, 1, float(1.0 + 2.3 * D)},   // not snapped when not moved
    };
    for (const Case& c : cases) {
        resetNoteList();
        for (float t : c.times) ASSERT_EQ(appendBarline(t), 1);
        validateBarlineTime(c.index);
        EXPECT_DOUBLE_EQ(barlineList.times[c.index], c.expected) << c.times[0];
    }
}
