// The undo folder and the wait for the undo snapshot writer.
#include "store/undo.h"

#include <chrono>
#include <filesystem>
#include <mutex>
#include <thread>

#include "platform/sync.h"
#include "shell/paths.h"

UndoState undoState;

static bool snapshotWriterBusy() {
    std::lock_guard<std::mutex> guard(CSAccessHiresFTFileMutex);
    return undoState.snapshotWriterBusy;
}

void waitForUndoSnapshotWriter() {
    while (snapshotWriterBusy()) std::this_thread::sleep_for(std::chrono::milliseconds(10));
}

int emptyUndoFolder() {
    std::error_code error;
    std::filesystem::path folder(sharedFilePath("CSUndo"));
    if (!std::filesystem::exists(folder, error)) return 1;
    int emptied = 1;
    for (const auto& entry : std::filesystem::directory_iterator(folder, error)) {
        std::error_code removeError;
        std::filesystem::remove_all(entry.path(), removeError);
        if (removeError) emptied = 0;
    }
    return error ? 0 : emptied;
}
