// Removal of the song's working files, at start-up (what an earlier run left) and when the
// song closes.
#include "store/workingFiles.h"

#include <mutex>

#include "platform/sync.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/undo.h"

const char* const WORKING_FILE_NAMES[11] = {"CS.fw",  "CS.fp",  "CS.ft",   "CS.fi",   "CS.ft+", "CS.fi+",
                                            "_CS.fw", "_CS.ft", "_CS.fi", "_CS.ft+", "_CS.fi+"};

int deleteWorkingFiles() {
    int deleted = 1;
    for (const char* name : WORKING_FILE_NAMES)
        if (!deleteReportedFile(sharedFilePath(name))) deleted = 0;
    return deleted;
}

int closeFTStore() {
    song.blockCount = 0;
    freeFTBlockWindow();
    int deleted = 1;
    // Files still open belong to a job that is running; it closes them itself.
    if (!ftFilesOpen()) {
        for (const char* name : {"CS.ft", "CS.fi"})
            if (!deleteReportedFile(sharedFilePath(name))) deleted = 0;
    }
    if (!hiresFilesOpen()) {
        for (const char* name : {"CS.ft+", "CS.fi+"})
            if (!deleteReportedFile(sharedFilePath(name))) deleted = 0;
    }
    return deleted;
}

int closeSongStores(bool keepFiles) {
    waitForUndoSnapshotWriter();
    if (keepFiles) {
        // The files stay for inspection; the next start-up clears them as usual.
        closeFTFile(1);
        freeFTBlockWindow();
        freeHiresBuffers();
        resetSong();
        return clearUndo(true);
    }
    int closed = 1;
    {
        std::lock_guard<std::mutex> guard(CSAccessWaveFileMutex);
        if (!deleteReportedFile(sharedFilePath("CS.fw"))) closed = 0;
    }
    if (!closeFTStore()) closed = 0;
    freeHiresBuffers();
    resetSong();
    if (!clearUndo()) closed = 0;
    if (!deleteWorkingFiles()) closed = 0;
    return closed;
}
