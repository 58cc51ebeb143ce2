#pragma once
// The song's selections: selected notes and barlines (indices into the note and barline
// lists), the selected stretch of time and the note and barline under the pointer, with the
// helpers the editing commands, the song view and time editing use to read them.
// Closing the song clears it all (resetSelection).

#include "notes/noteList.h"

// A time selection end that marks "no time selection".
constexpr float NO_TIME_SELECTION = -1.0f;

struct Selection {
    int selectedNotes[MAX_CS_NOTES] = {};         // selected note indices, in the order they were selected
    int selectedNoteCount = 0;                    // entries in use in selectedNotes
    int selectedBarlines[MAX_CS_BARLINES] = {};   // selected barline indices, in the order they were selected
    int selectedBarlineCount = 0;                 // entries in use in selectedBarlines
    float timeSelectionStart = NO_TIME_SELECTION; // selected stretch's start, seconds; negative when none
    float timeSelectionEnd = NO_TIME_SELECTION;   // selected stretch's end, seconds; negative when none
    int pointerNote = -1;                         // note under the pointer or being dragged; -1 none (song view)
    int pointerBarline = -1;                      // barline under the pointer or being dragged; -1 none (song view)
    // The song view's two further selection words, saved and restored with each undo level:
    int anchorNote = -1;                          // the note a Shift-click extends the selection from; -1 none (song view)
    int anchorBarline = -1;                       // the barline a Shift-click extends it from; -1 none (song view)
};
extern Selection selection;

// Results of getEditRange; they are also the clipboard kinds of time editing.
constexpr int EDIT_RANGE_NONE = 0;    // no range a time command can use (or one of half a block or less)
constexpr int EDIT_RANGE_TIME = 3;    // a stretch of time (Wave mode, or a time selection free of notes)
constexpr int EDIT_RANGE_NOTES = 4;   // the selected notes or barlines in MIDI mode

// Clears both selections and the time selection and forgets the pointer note and barline.
void resetSelection();

// Adds note i to the end of selectedNotes unless it is there already. 1 when i is selected
// afterwards; 0 when i is not a note of the list.
int selectNote(int i);
// Adds barline i to selectedBarlines unless it is there already. 1 when selected afterwards;
// 0 when i is not a barline of the list.
int selectBarline(int i);

// Note i left the note list: it leaves the selection (and the pointer), and selected notes
// after it move down one place. The same for a barline.
void noteRemoved(int i);
void barlineRemoved(int i);
// A note was inserted at index i: selected notes from i on move up one place. The same for a
// barline.
void noteInserted(int i);
void barlineInserted(int i);

// 1 when note (barline) i is selected, with its place in the selection in *position when
// position is given; 0 otherwise (a negative i never is).
int isNoteSelected(int i, int* position = nullptr);
int isBarlineSelected(int i, int* position = nullptr);
// Smallest and largest selected index; both 0 when nothing is selected.
void selectedNoteRange(int& lowest, int& highest);
void selectedBarlineRange(int& lowest, int& highest);
// 1 when at least two notes are selected and they form one unbroken run of indices; else 0.
int isContiguousSelection();

// Rebuilds selectedNotes, in index order, from the notes whose wave span lies within the time
// selection give or take half a block. Without a time selection nothing is selected.
void selectNotesInTimeSelection();
// Widens the time selection to cover the wave spans of the selected notes; with reset it
// first clears it, so that it covers exactly the selected notes (or nothing when none are).
void extendTimeSelectionToNotes(bool reset);
// In MIDI mode, unless the view is placing notes: 0 when some note's wave span reaches at
// least half a block into the time selection. 1 otherwise, and always in Wave mode.
int timeSelectionFreeOfNotes();
// The stretch a time command works on, seconds; both -1.0 when there is none. Returns
// EDIT_RANGE_NOTES, EDIT_RANGE_TIME or EDIT_RANGE_NONE (the range may still be given with
// NONE when the time selection is half a block or shorter: a paste point).
int getEditRange(double& start, double& end);
