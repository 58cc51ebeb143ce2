// The selections: membership and ranges, contiguity for Join, the time selection built from
// notes and notes taken from it, and the edit range a time command works on in each mode.
#include <gtest/gtest.h>

#include <vector>
#include <tuple>

#include "notes/noteFixtures.h"
#include "notes/selection.h"

// Six notes of half a second each, one per second from 1.0 s.
class SelectionTest : public NoteSongTest {
protected:
    void SetUp() override {
        NoteSongTest::SetUp();
        for (int i = 0; i < 6; i++) addNote(float(i + 1), float(i + 1) + 0.5f);
        for (int i = 0; i < 4; i++) ASSERT_EQ(appendBarline(float(i) * 2.0f + 0.75f), 1);
    }
    void select(std::initializer_list<int> notes) {
        for (int i : notes) ASSERT_EQ(selectNote(i), 1) << i;
    }
    void setTimeSelection(double start, double end) {
        selection.timeSelectionStart = float(start);
        selection.timeSelectionEnd = float(end);
    }
};

// ---- membership and ranges ----

class SelectionMembers : public SelectionTest {};

TEST_F(SelectionMembers, ASelectedNoteIsFoundWithItsPlaceInTheSelection) {
    select({4, 1, 3});
    int position = -7;
    EXPECT_EQ(isNoteSelected(3, &position), 1);
    EXPECT_EQ(position, 2);
    EXPECT_EQ(isNoteSelected(4), 1);
    position = -7;
    EXPECT_EQ(isNoteSelected(2, &position), 0);
    EXPECT_EQ(position, -7) << "left alone when the note is not selected";
    EXPECT_EQ(isNoteSelected(-1), 0);
}

TEST_F(SelectionMembers, SelectingTwiceKeepsOneEntryAndIndicesOutsideTheListAreRefused) {
    select({2, 2});
    EXPECT_EQ(selection.selectedNoteCount, 1);
    EXPECT_EQ((std::vector<int>{selectNote(6), selectNote(-1), selectBarline(4), selectBarline(1), selectBarline(1)}),
              (std::vector<int>{0, 0, 0, 1, 1}));
    EXPECT_EQ(std::tuple(selection.selectedNoteCount, selection.selectedBarlineCount), std::tuple(1, 1));
}

TEST_F(SelectionMembers, RangesGiveTheSmallestAndLargestIndexOrZerosWhenNothingIsSelected) {
    int lowest = -7, highest = -7;
    selectedNoteRange(lowest, highest);
    EXPECT_EQ(lowest, 0);
    EXPECT_EQ(highest, 0);
    select({3, 5, 1});
    selectedNoteRange(lowest, highest);
    EXPECT_EQ(lowest, 1);
    EXPECT_EQ(highest, 5);

    lowest = highest = -7;
    selectedBarlineRange(lowest, highest);
    EXPECT_EQ(lowest, 0);
    EXPECT_EQ(highest, 0);
    ASSERT_EQ(selectBarline(2), 1);
    ASSERT_EQ(selectBarline(0), 1);
    int position = -1;
    EXPECT_EQ(isBarlineSelected(0, &position), 1);
    EXPECT_EQ(position, 1);
    selectedBarlineRange(lowest, highest);
    EXPECT_EQ(lowest, 0);
    EXPECT_EQ(highest, 2);
}

TEST_F(SelectionMembers, OnlyTwoOrMoreNotesWithoutAGapAreContiguous) {
    EXPECT_EQ(isContiguousSelection(), 0);
    select({4});
    EXPECT_EQ(isContiguousSelection(), 0);
    // One note listed twice is still one note.
    selection.selectedNotes[1] = 4;
    selection.selectedNoteCount = 2;
    EXPECT_EQ(isContiguousSelection(), 0);
    resetSelection();
    select({3, 5});
    EXPECT_EQ(isContiguousSelection(), 0);
    select({4});
    EXPECT_EQ(isContiguousSelection(), 1);
}

TEST_F(SelectionMembers, ClosingTheSongClearsEverySelection) {
    select({1, 2});
    ASSERT_EQ(selectBarline(0), 1);
    setTimeSelection(1.0, 2.0);
    selection.pointerNote = 1;
    selection.pointerBarline = 0;
    resetSelection();
    const Selection& s = selection;
    EXPECT_EQ(std::tuple(s.selectedNoteCount, s.selectedBarlineCount, s.timeSelectionStart, s.timeSelectionEnd, s.pointerNote,
                         s.pointerBarline),
              std::tuple(0, 0, -1.0f, -1.0f, -1, -1));
}

// ---- the time selection and the notes ----

class SelectionTime : public SelectionTest {};

// Without a time selection (or with half of one) it becomes the selected notes' span; an
// existing one is only widened; a reset makes it cover exactly the selected notes, or nothing.
TEST_F(SelectionTime, TheTimeSelectionIsExtendedToTheSelectedNotes) {
    struct Case {
        std::vector<int> notes;
        double start, end;
        bool reset;
        float expectedStart, expectedEnd;
    } cases[] = {
        {{3, 1, 2}, -1.0, -1.0, false, 2.0f, 4.5f},
        {{4}, 1.0, -1.0, false, 5.0f, 5.5f},
        {{2}, 3.25, 5.0, false, 3.0f, 5.0f},   // already past the note's end
        {{2}, 0.5, 5.0, true, 3.0f, 3.5f},
        {{}, 0.5, 5.0, true, -1.0f, -1.0f},
    };
    for (const Case& c : cases) {
        resetSelection();
        for (int i : c.notes) ASSERT_EQ(selectNote(i), 1);
        setTimeSelection(c.start, c.end);
        extendTimeSelectionToNotes(c.reset);
        EXPECT_EQ(selection.timeSelectionStart, c.expectedStart) << c.start;
        EXPECT_EQ(selection.timeSelectionEnd, c.expectedEnd) << c.start;
    }
}

// Notes 1 (2.0 .. 2.5) and 2 (3.0 .. 3.5) are taken, in index order, with exactly half a block
// to spare at both ends; a note cut by more is left out; without a time selection none is.
TEST_F(SelectionTime, NotesWithinHalfABlockOfTheTimeSelectionAreTakenInIndexOrder) {
    struct Case {
        double start, end;
        std::vector<int> taken;
    } cases[] = {
        {2.0 + D / 2, 3.5 - D / 2, {1, 2}},
        {2.0 + D / 2 + D / 8, 3.5 - D / 2, {2}},
        {2.0, 3.5 - D / 2 - D / 8, {1}},
        {-1.0, 4.0, {}},
    };
    for (const Case& c : cases) {
        resetSelection();
        select({5, 1});
        setTimeSelection(c.start, c.end);
        selectNotesInTimeSelection();
        EXPECT_EQ(std::vector<int>(selection.selectedNotes, selection.selectedNotes + selection.selectedNoteCount),
                  c.taken)
            << c.start << " .. " << c.end;
    }
}

TEST_F(SelectionTime, InMidiModeANoteReachingHalfABlockIntoTheSelectionOccupiesIt) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    // Note 1 ends at 2.5 s.
    setTimeSelection(2.5 - D / 2, 2.75);
    EXPECT_EQ(timeSelectionFreeOfNotes(), 0);
    setTimeSelection(2.5 - D / 2 + D / 8, 2.75);
    EXPECT_EQ(timeSelectionFreeOfNotes(), 1);
    // Note 2 starts at 3.0 s.
    setTimeSelection(2.75, 3.0 + D / 2);
    EXPECT_EQ(timeSelectionFreeOfNotes(), 0);
    setTimeSelection(2.75, 3.0 + D / 2 - D / 8);
    EXPECT_EQ(timeSelectionFreeOfNotes(), 1);
}

TEST_F(SelectionTime, InWaveModeOrWhilePlacingNotesTheSelectionIsAlwaysFree) {
    setTimeSelection(1.0, 4.0);
    EXPECT_EQ(timeSelectionFreeOfNotes(), 1) << "Wave mode";
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    EXPECT_EQ(timeSelectionFreeOfNotes(), 0);
    displayModes.notePlacing = true;
    EXPECT_EQ(timeSelectionFreeOfNotes(), 1);
}

// ---- the edit range ----

// Wave mode uses the time selection even with notes selected, when longer than half a block
// (which gives no code but keeps the point); MIDI mode runs from the lowest to the highest
// selected note, gives the notes code without a range for barlines alone (no stretch from
// before the song's start to a barline), and drops a time selection that holds a note.
TEST_F(SelectionTest, TheEditRangeFollowsTheModeAndTheSelections) {
    struct Case {
        int mode;
        std::vector<int> notes, barlines;
        double start, end;
        int code;
        double rangeStart, rangeEnd;
    } cases[] = {
        {PLAYBACK_MODE_WAVE, {4}, {}, 1.25, 2.75, EDIT_RANGE_TIME, 1.25, 2.75},
        {PLAYBACK_MODE_WAVE, {}, {}, 2.75, 2.75 + D / 2, EDIT_RANGE_NONE, 2.75, 2.75 + D / 2},
        {PLAYBACK_MODE_WAVE, {}, {}, 2.75, 2.75 + D / 2 + D / 8, EDIT_RANGE_TIME, 2.75, 2.75 + D / 2 + D / 8},
        {PLAYBACK_MODE_WAVE, {}, {}, -1.0, -1.0, EDIT_RANGE_NONE, -1.0, -1.0},
        {PLAYBACK_MODE_MIDI, {4, 1, 2}, {}, 0.25, 0.5, EDIT_RANGE_NOTES, 2.0, 5.5},
        {PLAYBACK_MODE_MIDI, {}, {1, 2}, -1.0, -1.0, EDIT_RANGE_NOTES, -1.0, -1.0},
        {PLAYBACK_MODE_MIDI, {}, {}, 1.75, 3.25, EDIT_RANGE_NONE, -1.0, -1.0},
        {PLAYBACK_MODE_MIDI, {}, {}, 1.5, 2.0, EDIT_RANGE_TIME, 1.5, 2.0},   // the gap between two notes is free
    };
    int row = 0;
    for (const Case& c : cases) {
        resetSelection();
        displayModes.playbackMode = c.mode;
        for (int i : c.notes) ASSERT_EQ(selectNote(i), 1);
        for (int i : c.barlines) ASSERT_EQ(selectBarline(i), 1);
        setTimeSelection(c.start, c.end);
        double start = 99.0, end = 99.0;
        EXPECT_EQ(getEditRange(start, end), c.code) << "row " << row;
        EXPECT_EQ(float(start), float(c.rangeStart)) << "row " << row;   // the time selection is held in floats
        EXPECT_EQ(float(end), float(c.rangeEnd)) << "row " << row;
        row++;
    }
}
