#pragma once
// The undo snapshot writer: the thread that copies CS.fw and the Hires FT files into the undo
// folder for a snapshot (and back for a restore) at below-normal priority, and the waits for
// it that every user of those files performs first. Lock order: wait for the writer before
// taking CSAccessWaveFileMutex, never while holding it.

#include <functional>

struct UndoWriterState {
    bool snapshotCopyBusy;   // the writer copies files (guarded by CSAccessHiresFTFileMutex)
};
extern UndoWriterState undoWriterState;

// 1 while the writer copies files.
int undoWriterBusy();
// Runs job on the writer's thread, created suspended, given below-normal priority and then
// started; the busy flag is set until the job has ended. Without a thread the job runs here.
// Call only when no copy runs (after waitForUndoSnapshotCopy).
void startUndoWriter(std::function<void()> job);
// Returns at once when no copy runs; otherwise shows the wait cursor and "Updating undo
// buffer...", raises the writer's priority and waits for it. User interface thread only.
void waitForUndoSnapshotCopy();
// Waits, saying nothing, until no copy runs. Any thread.
void waitForUndoSnapshotWriter();
// Waits for the writer and ends its thread (song close, shut-down).
void endUndoWriter();
