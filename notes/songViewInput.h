#pragma once
// The song view's edit operations: every key of the view and every Edit menu command arrives
// here as a code (notes/songViewKeys.h) and becomes an operation on the song: delete, cut,
// copy and paste, selecting, undo and redo, moving the selection from note to note, and
// scrolling. The desktop program's song view and the command-line tool's scripts call it.

// What the view keeps for its edit operations.
struct SongViewInput {
    int pasteArmed = 0;        // the clipboard kind waiting for a click in the view; 0 none
    int dragKind = 0;          // the drag running (DragKind of the song view's mouse handling); 0 none
    bool nudgeInWave = false;  // nudging and sideways dragging allowed in Wave mode
    bool hintShown = false;    // a paste tip is shown in the view; Escape takes it away with the selection
};
extern SongViewInput songViewInput;

// Back to no paste armed, no drag, no tip (song close, tests).
void resetSongViewInput();

// Runs the operation of code (a SongViewCode). 1 only for Home and End, which the caller then
// also passes on to the view's own scrolling; 0 otherwise. Codes that edit or play do nothing
// while a recording or an opening runs.
int handleSongViewCode(int code);

// A click in the note area at time (snapped to a block boundary; negative left of the notes),
// with the KEY_MODIFIER_* bits held, over what selection.pointerNote and pointerBarline name.
// With a paste armed it pastes there: over the pointed note's wave span, or at time when no
// note or barline is under the pointer. Otherwise it selects: a note alone, Ctrl adds or
// removes it, Shift takes the unbroken run from the selection's anchor to it; a click off the
// notes clears the note selection; the time selection then covers exactly the selected notes.
// Barlines follow the same rules. Nothing happens while a drag, a recording or an opening runs.
void songViewClick(double time, int modifiers);

// The view's tip after a paste of kind (3 or 4).
const char* pasteTip(int kind);

// After a selection change: the time selection covers exactly the selected notes, the view
// scrolls to show them and is repainted.
void selectionChanged();
