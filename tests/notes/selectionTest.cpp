// The selections: membership and ranges, contiguity for Join, the time selection built from
// notes and notes taken from it, and the edit range a time command works on in each mode.
#include <gtest/gtest.h>

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
    EXPECT_EQ(selectNote(6), 0);
    EXPECT_EQ(selectNote(-1), 0);
    EXPECT_EQ(selectBarline(4), 0);
    EXPECT_EQ(selectBarline(1), 1);
    EXPECT_EQ(selectBarline(1), 1);
    EXPECT_EQ(selection.selectedNoteCount, 1);
    EXPECT_EQ(selection.selectedBarlineCount, 1);
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

TEST_F(SelectionMembers, NotesThreeFiveAndFourAreContiguous) {
    select({3, 5, 4});
    EXPECT_EQ(isContiguousSelection(), 1);
}

TEST_F(SelectionMembers, NotesThreeAndFiveAloneAreNotContiguous) {
    select({3, 5});
    EXPECT_EQ(isContiguousSelection(), 0);
}

TEST_F(SelectionMembers, OneNoteOrNoneIsNeverContiguous) {
    EXPECT_EQ(isContiguousSelection(), 0);
    select({4});
    EXPECT_EQ(isContiguousSelection(), 0);
    // One note listed twice is still one note.
    selection.selectedNotes[1] = 4;
    selection.selectedNoteCount = 2;
    EXPECT_EQ(isContiguousSelection(), 0);
}

TEST_F(SelectionMembers, ClosingTheSongClearsEverySelection) {
    select({1, 2});
    ASSERT_EQ(selectBarline(0), 1);
    setTimeSelection(1.0, 2.0);
    selection.pointerNote = 1;
    selection.pointerBarline = 0;
    resetSelection();
    EXPECT_EQ(selection.selectedNoteCount, 0);
    EXPECT_EQ(selection.selectedBarlineCount, 0);
    EXPECT_EQ(selection.timeSelectionStart, -1.0f);
    EXPECT_EQ(selection.timeSelectionEnd, -1.0f);
    EXPECT_EQ(selection.pointerNote, -1);
    EXPECT_EQ(selection.pointerBarline, -1);
}

// ---- the time selection and the notes ----

class SelectionTime : public SelectionTest {};

TEST_F(SelectionTime, WithoutATimeSelectionItBecomesExactlyTheSelectedNotesSpan) {
    select({3, 1, 2});
    extendTimeSelectionToNotes(false);
    EXPECT_EQ(selection.timeSelectionStart, 2.0f);
    EXPECT_EQ(selection.timeSelectionEnd, 4.5f);
}

TEST_F(SelectionTime, AnExistingTimeSelectionIsOnlyWidened) {
    select({2});
    setTimeSelection(3.25, 5.0);
    extendTimeSelectionToNotes(false);
    EXPECT_EQ(selection.timeSelectionStart, 3.0f);
    EXPECT_EQ(selection.timeSelectionEnd, 5.0f) << "already past the note's end";
}

TEST_F(SelectionTime, ResetMakesItCoverExactlyTheSelectedNotesOrNothing) {
    select({2});
    setTimeSelection(0.5, 5.0);
    extendTimeSelectionToNotes(true);
    EXPECT_EQ(selection.timeSelectionStart, 3.0f);
    EXPECT_EQ(selection.timeSelectionEnd, 3.5f);

    selection.selectedNoteCount = 0;
    extendTimeSelectionToNotes(true);
    EXPECT_EQ(selection.timeSelectionStart, -1.0f);
    EXPECT_EQ(selection.timeSelectionEnd, -1.0f);
}

TEST_F(SelectionTime, AHalfTimeSelectionCountsAsNoneAndIsReplaced) {
    select({4});
    setTimeSelection(1.0, -1.0);
    extendTimeSelectionToNotes(false);
    EXPECT_EQ(selection.timeSelectionStart, 5.0f);
    EXPECT_EQ(selection.timeSelectionEnd, 5.5f);
}

TEST_F(SelectionTime, NotesWithinHalfABlockOfTheTimeSelectionAreTakenInIndexOrder) {
    select({5});
    // Notes 1 (2.0 .. 2.5) and 2 (3.0 .. 3.5), with exactly half a block to spare at both ends.
    setTimeSelection(2.0 + D / 2, 3.5 - D / 2);
    selectNotesInTimeSelection();
    ASSERT_EQ(selection.selectedNoteCount, 2);
    EXPECT_EQ(selection.selectedNotes[0], 1);
    EXPECT_EQ(selection.selectedNotes[1], 2);
}

TEST_F(SelectionTime, ANoteCutByMoreThanHalfABlockIsLeftOut) {
    setTimeSelection(2.0 + D / 2 + D / 8, 3.5 - D / 2);
    selectNotesInTimeSelection();
    ASSERT_EQ(selection.selectedNoteCount, 1);
    EXPECT_EQ(selection.selectedNotes[0], 2);

    setTimeSelection(2.0, 3.5 - D / 2 - D / 8);
    selectNotesInTimeSelection();
    ASSERT_EQ(selection.selectedNoteCount, 1);
    EXPECT_EQ(selection.selectedNotes[0], 1);
}

TEST_F(SelectionTime, WithoutATimeSelectionNoNoteIsTaken) {
    select({1, 2});
    setTimeSelection(-1.0, 4.0);
    selectNotesInTimeSelection();
    EXPECT_EQ(selection.selectedNoteCount, 0);
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

class SelectionEditRange : public SelectionTest {
protected:
    double start = 99.0, end = 99.0;
};

TEST_F(SelectionEditRange, WaveModeUsesTheTimeSelectionEvenWithNotesSelected) {
    select({4});
    setTimeSelection(1.25, 2.75);
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_TIME);
    EXPECT_EQ(start, 1.25);
    EXPECT_EQ(end, 2.75);
}

TEST_F(SelectionEditRange, HalfABlockOrLessGivesNoCodeButKeepsThePoint) {
    setTimeSelection(2.75, 2.75 + D / 2);
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_NONE);
    EXPECT_EQ(start, 2.75);
    EXPECT_EQ(end, 2.75 + D / 2);
    setTimeSelection(2.75, 2.75 + D / 2 + D / 8);
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_TIME);
}

TEST_F(SelectionEditRange, NoSelectionGivesNoRange) {
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_NONE);
    EXPECT_EQ(start, -1.0);
    EXPECT_EQ(end, -1.0);
}

TEST_F(SelectionEditRange, MidiModeWithNotesSelectedRunsFromTheLowestToTheHighestNote) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    select({4, 1, 2});
    setTimeSelection(0.25, 0.5);
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_NOTES);
    EXPECT_EQ(start, 2.0);
    EXPECT_EQ(end, 5.5);
}

TEST_F(SelectionEditRange, MidiModeWithOnlyBarlinesSelectedGivesTheNotesCodeWithoutARange) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    ASSERT_EQ(selectBarline(1), 1);
    ASSERT_EQ(selectBarline(2), 1);
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_NOTES);
    EXPECT_EQ(start, -1.0);
    EXPECT_EQ(end, -1.0) << "no stretch from before the song's start to a barline";
}

TEST_F(SelectionEditRange, MidiModeDropsATimeSelectionThatHoldsANote) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    setTimeSelection(1.75, 3.25);
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_NONE);
    EXPECT_EQ(start, -1.0);
    EXPECT_EQ(end, -1.0);
    setTimeSelection(1.5, 2.0);
    EXPECT_EQ(getEditRange(start, end), EDIT_RANGE_TIME) << "the gap between two notes is free";
    EXPECT_EQ(start, 1.5);
    EXPECT_EQ(end, 2.0);
}
