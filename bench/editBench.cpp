// Editing a long song: a generated melody (44,100 Hz, 16-bit, mono) opened the way the program
// opens a file, then
//  - takeUndoSnapshot on a 5-minute song with every file changed (the first snapshot of a
//    song copies them all): the time it holds the user-interface thread, and the snapshot
//    writer's total until its copies of CS.fw and the Hires FT files are done;
//  - removing 10 s from the middle of a 10-minute song, after its snapshot;
//  - the undo of that removal, until the writer has put CS.fw and the Hires files back.
// Each figure is the median of five runs. Run a Release build: build/bench/editBench.
//
//   editBench [SNAPSHOT_SECONDS] [REMOVE_SECONDS]
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "benchFolder.h"
#include "audio/openWaveFile.h"
#include "notes/noteList.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/startup.h"
#include "store/song.h"
#include "store/timeEditing.h"
#include "store/undo.h"

static const int RUNS = 5;

static double wallSeconds() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

// Opens a melody of seconds as the program does; false when the song is not there.
static bool openMelody(const std::string& folder, double seconds) {
    std::string path = folder + "/melody" + std::to_string(int(seconds)) + ".wav";
    if (!writeMelodyWave(path, seconds)) return false;
    closeSong();
    clearUndo();
    openWaveFile(path);
    waitForOpeningToEnd();
    return song.blockCount > 0;
}

static double median(std::vector<double> v) {
    std::sort(v.begin(), v.end());
    return v[v.size() / 2];
}

int main(int argc, char** argv) {
    double snapshotSeconds = argc > 1 ? std::atof(argv[1]) : 300.0;
    double removeSeconds = argc > 2 ? std::atof(argv[2]) : 600.0;
    std::string folder = makeBenchFolder("editBench");
    std::string config = folder + "/config";
    setenv("MELODRIFT_CONFIG_DIR", config.c_str(), 1);
    StartupOptions options{};
    options.sharedBasePath = folder.c_str();
    setUiEcho(true);   // a message during the run is a failure worth seeing
    if (!startUp(options)) return 1;

    if (!openMelody(folder, snapshotSeconds)) return 1;
    std::vector<double> held, total;
    for (int r = 0; r < RUNS; r++) {
        clearUndo();   // the first snapshot of a song copies every file
        double start = wallSeconds();
        if (!takeUndoSnapshot()) return 1;
        held.push_back(wallSeconds() - start);
        waitForUndoSnapshotCopy();
        total.push_back(wallSeconds() - start);
    }
    std::printf("takeUndoSnapshot, %.0f s song (%u blocks), every file copied:\n", snapshotSeconds, song.blockCount);
    std::printf("  user-interface thread %7.1f ms   until the writer is done %7.1f ms\n", median(held) * 1000,
                median(total) * 1000);

    if (!openMelody(folder, removeSeconds)) return 1;
    int notesOpened = noteList.count;
    double middle = songDuration() / 2 - 5.0;
    std::vector<double> removing, undoing;
    for (int r = 0; r < RUNS; r++) {
        takeUndoSnapshot();
        waitForUndoSnapshotCopy();
        double start = wallSeconds();
        if (!removeTimeFromSong(middle, 10.0)) return 1;
        markUndoStale(UNDO_FT_CHANGED | UNDO_WAVE_CHANGED);
        removing.push_back(wallSeconds() - start);
        start = wallSeconds();
        if (!undo()) return 1;
        waitForUndoSnapshotCopy();
        undoing.push_back(wallSeconds() - start);
        clearUndo();
    }
    std::printf("removing 10 s from the middle of a %.0f s song (%u blocks, %d notes; %d after the undos):\n",
                removeSeconds, song.blockCount, notesOpened, noteList.count);
    std::printf("  removeTimeFromSong %7.1f ms   undo of it, files back %7.1f ms\n", median(removing) * 1000,
                median(undoing) * 1000);
    closeSong();
    shutDown(0);
    return 0;
}
