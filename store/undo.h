#pragma once
// Undo and redo: a ring of 18 level slots in the undo folder "CSUndo", at most 17 in use.
// Every editing command takes a snapshot of the whole song before it changes anything:
// notes, barlines, selections and block durations always, and copies of the FT files, the
// Hires FT files and CS.fw when they changed since the snapshot before. The large copies
// (CS.fw and the Hires FT files) are made by the snapshot writer on its own thread at
// below-normal priority; everything that touches those files waits for it first.
// Lock order: wait for the writer before taking CSAccessWaveFileMutex, never while holding it.

#include <cstdint>

#include "store/undoWriter.h"

constexpr int UNDO_LEVELS = 18;                        // level slots of the ring
constexpr int64_t UNDO_SPACE_MINIMUM = 20971520;       // below this the ring is cleared and no snapshot taken
constexpr int64_t UNDO_SPACE_LOW = 104857600;          // below this the low-space warning is shown

struct UndoState {
    int oldestLevel;            // the oldest level still held, 0..17
    int currentLevel;           // the level the next snapshot goes to; after an undo, the level shown
    int levelCount;             // levels held from oldestLevel on; 0 when the ring is empty
    bool stateInRing;           // the present state was saved as a level by Undo and has not changed since
    bool ftCopyCurrent;         // CS.ft and CS.fi have not changed since the last snapshot
    bool waveCopyCurrent;       // CS.fw and the Hires FT files have not changed since the last snapshot
};
extern UndoState undoState;

// What an edit changed, for markUndoStale: the notes always, these copies besides.
constexpr int UNDO_FT_CHANGED = 1;     // the FT files (pitch and volume edits, time edits)
constexpr int UNDO_WAVE_CHANGED = 2;   // CS.fw and the Hires FT files (Wave-mode edits, time edits)

// Takes a snapshot of the present song into the level currentLevel. 1 when a level was
// written; 0 when none was: the song has no blocks (the ring is cleared), or less than
// UNDO_SPACE_MINIMUM bytes are free on the shared folder's drive (the ring is cleared: no
// undo until space is freed). Below UNDO_SPACE_LOW the low-space message is shown first.
int takeUndoSnapshot();
// After an edit: the ring no longer holds the present state, and the copies named in changes
// (UNDO_FT_CHANGED, UNDO_WAVE_CHANGED) are out of date. Recording and opening pass both.
void markUndoStale(int changes);

// 1 when there is a level to go back to (Undo is enabled), and one to go forward to (Redo).
int canUndo();
int canRedo();
// Edit > Undo and Redo: step back (or forward) one level and restore it. Beep and do nothing
// (0) when there is none; 1 when a level was restored, 0 when it was damaged.
int undo();
int redo();
// Restores level currentLevel: its durations, notes, barlines, instrument name and time
// signature at once, its file copies (FT files here, CS.fw and the Hires FT files by the
// writer), and its selections, scroll position, block count and wave size. With searchBack set
// (undo) each kind of copy is taken from the latest level at or before it that holds one.
// 1 when restored; 0 when the level's "Undo" or "FrDr" file is damaged: then nothing at all
// is restored and UNDO_LEVEL_DAMAGED_TEXT says so (undo and redo then stay where they were).
int restoreUndoLevel(int searchBack);

// Empties the ring: waits for the writer, counts and flags to 0 and every file of the undo
// folder deleted (left with keepFiles). Start-up and song close. 1 when the folder is empty (or
// absent, or kept) afterwards.
int clearUndo(bool keepFiles = false);
// Deletes every file in the undo folder; 1 when it is empty (or absent) afterwards.
int emptyUndoFolder();

// Text the user reads when a level's own file cannot be read.
constexpr const char* UNDO_LEVEL_DAMAGED_TEXT =
    "The undo buffer is damaged and could not be read - restoreUndoLevel (1). The song was left as it is.";
