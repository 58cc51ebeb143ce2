#pragma once
// The undo folder "CSUndo" in the shared folder, and the wait for the undo snapshot writer
// that every user of CS.fw performs before taking CSAccessWaveFileMutex.

struct UndoState {
    bool snapshotWriterBusy;   // set while the snapshot writer copies CS.fw (guarded by CSAccessHiresFTFileMutex)
};
extern UndoState undoState;

// Returns once no undo snapshot is being written. Never call it holding CSAccessWaveFileMutex.
void waitForUndoSnapshotWriter();
// Deletes every file in the undo folder; 1 when it is empty (or absent) afterwards.
int emptyUndoFolder();
