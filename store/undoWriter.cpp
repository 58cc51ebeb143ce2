// The undo snapshot writer's thread and its busy state.
#include "store/undoWriter.h"

#include <chrono>
#include <mutex>
#include <system_error>
#include <thread>

#include "platform/sync.h"
#include "platform/ui.h"
#include "resources/strings.h"

UndoWriterState undoWriterState;

// The writer thread; one copy job at a time.
static SuspendableWorker undoWriter;

static void setWriterBusy(bool busy) {
    std::lock_guard<std::mutex> guard(CSAccessHiresFTFileMutex);
    undoWriterState.snapshotCopyBusy = busy;
}

int undoWriterBusy() {
    std::lock_guard<std::mutex> guard(CSAccessHiresFTFileMutex);
    return undoWriterState.snapshotCopyBusy ? 1 : 0;
}

void waitForUndoSnapshotWriter() {
    while (undoWriterBusy()) std::this_thread::sleep_for(std::chrono::milliseconds(2));
}

void endUndoWriter() {
    waitForUndoSnapshotWriter();
    joinWorker(undoWriter);
}

void waitForUndoSnapshotCopy() {
    if (!undoWriterBusy()) {
        joinWorker(undoWriter);
        return;
    }
    setWaitCursor(true);
    setStatusText(resourceString(10353));
    setWorkerPriority(undoWriter, WORKER_PRIORITY_ABOVE_NORMAL);
    endUndoWriter();
    setWaitCursor(false);
    setStatusText("");
}

void startUndoWriter(std::function<void()> job) {
    setWriterBusy(true);
    auto body = [job] {
        suspendWorker(undoWriter);
        job();
        setWriterBusy(false);
    };
    try {
        startWorker(undoWriter, body);
    } catch (const std::system_error&) {
        job();
        setWriterBusy(false);
        return;
    }
    setWorkerPriority(undoWriter, WORKER_PRIORITY_BELOW_NORMAL);
    resumeWorker(undoWriter);
}
