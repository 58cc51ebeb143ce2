// The undo ring, its snapshots and restores, and the snapshot writer thread. The FT files
// are copied on the user interface thread; CS.fw and the Hires FT files by the writer, at
// below-normal priority, so that the command that took the snapshot goes on at once.
#include "store/undo.h"

#include <filesystem>
#include <mutex>
#include <vector>

#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/files.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/ftBlockStore.h"
#include "store/song.h"
#include "store/songWindowHooks.h"
#include "store/undoFiles.h"

UndoState undoState;

// What a level keeps in memory: the selections and the view's place, which the files do not hold.
struct UndoLevelRecord {
    int selectedNotes[MAX_CS_NOTES];
    int selectedNoteCount;
    int selectedBarlines[MAX_CS_BARLINES];
    int selectedBarlineCount;
    float timeSelectionStart;       // seconds; -1.0 for none
    float timeSelectionEnd;
    int anchorNote;                 // the view's two further selection words
    int anchorBarline;
    int scrollX;                    // the view's horizontal scroll position, pixels
    uint32_t blockCount;
    uint32_t workingWaveBytes;      // CS.fw's data size
};
static UndoLevelRecord undoLevels[UNDO_LEVELS];

static int wrapLevel(int level) { return ((level % UNDO_LEVELS) + UNDO_LEVELS) % UNDO_LEVELS; }

int emptyUndoFolder() {
    std::error_code error;
    std::filesystem::path folder(sharedFilePath(UNDO_FOLDER_NAME));
    if (!std::filesystem::exists(folder, error)) return 1;
    int emptied = 1;
    for (const auto& entry : std::filesystem::directory_iterator(folder, error)) {
        std::error_code removeError;
        std::filesystem::remove_all(entry.path(), removeError);
        if (removeError) emptied = 0;
    }
    return error ? 0 : emptied;
}

int clearUndo(bool keepFiles) {
    endUndoWriter();
    undoState.levelCount = 0;
    undoState.oldestLevel = 0;
    undoState.currentLevel = 0;
    undoState.stateInRing = false;
    undoState.ftCopyCurrent = false;
    undoState.waveCopyCurrent = false;
    return keepFiles ? 1 : emptyUndoFolder();
}

void markUndoStale(int changes) {
    undoState.stateInRing = false;
    if (changes & UNDO_FT_CHANGED) undoState.ftCopyCurrent = false;
    if (changes & UNDO_WAVE_CHANGED) undoState.waveCopyCurrent = false;
}

int canUndo() { return undoState.levelCount != 0 && undoState.currentLevel != undoState.oldestLevel ? 1 : 0; }

int canRedo() {
    const UndoState& u = undoState;
    if (u.levelCount == 0) return 0;
    if (wrapLevel(u.currentLevel - u.oldestLevel + 1) >= u.levelCount) return 0;
    if (wrapLevel(u.currentLevel + 1) == u.oldestLevel) return 0;
    return u.oldestLevel == 0 && u.currentLevel == UNDO_LEVELS - 1 ? 0 : 1;
}

// The wait cursor and a status text for the length of an operation, restored on every path.
struct BusyDisplay {
    explicit BusyDisplay(int textId) {
        setWaitCursor(true);
        setStatusText(resourceString(textId));
    }
    ~BusyDisplay() {
        setWaitCursor(false);
        setStatusText("");
    }
};

// Whether some level held, from the oldest on, keeps a copy with prefix. The level being
// written (skip, when its copy is to be dropped) does not count; pending counts as held: the
// writer makes that level's copy.
static bool someLevelHolds(const char* prefix, int skip, int pending) {
    for (int k = 0; k < undoState.levelCount; k++) {
        int level = wrapLevel(undoState.oldestLevel + k);
        if (level == skip) continue;
        if (level == pending || fileExists(undoFilePath(prefix, level))) return true;
    }
    return false;
}

// The snapshot writer's job for level: CS.fw and the Hires FT files copied when they changed,
// else the level's old copies deleted.
static void writeWaveCopies(int level, bool copy) {
    {
        std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
        if (copy) copyReportedFile(sharedFilePath("CS.fw"), undoFilePath("FrSd", level));
        else deleteReportedFile(undoFilePath("FrSd", level));
    }
    const std::pair<const char*, const char*> hires[2] = {{"CS.ft+", "HrFq"}, {"CS.fi+", "HrIn"}};
    for (const auto& [name, prefix] : hires) {
        if (!fileExists(sharedFilePath(name))) continue;
        if (copy) copyReportedFile(sharedFilePath(name), undoFilePath(prefix, level));
        else deleteReportedFile(undoFilePath(prefix, level));
    }
}

int takeUndoSnapshot() {
    UndoState& u = undoState;
    waitForUndoSnapshotCopy();
    if (song.blockCount == 0) {
        clearUndo();
        return 0;
    }
    if (u.levelCount == 0) {
        u.oldestLevel = u.currentLevel = 0;
        u.stateInRing = u.ftCopyCurrent = u.waveCopyCurrent = false;
    }
    int level = u.currentLevel;

    UndoLevelRecord& r = undoLevels[level];
    std::copy(selection.selectedNotes, selection.selectedNotes + selection.selectedNoteCount, r.selectedNotes);
    r.selectedNoteCount = selection.selectedNoteCount;
    std::copy(selection.selectedBarlines, selection.selectedBarlines + selection.selectedBarlineCount,
              r.selectedBarlines);
    r.selectedBarlineCount = selection.selectedBarlineCount;
    r.timeSelectionStart = selection.timeSelectionStart;
    r.timeSelectionEnd = selection.timeSelectionEnd;
    r.anchorNote = selection.anchorNote;
    r.anchorBarline = selection.anchorBarline;
    r.scrollX = songWindowHooks.songViewScrollX ? songWindowHooks.songViewScrollX() : 0;
    r.blockCount = song.blockCount;
    r.workingWaveBytes = song.workingWaveBytes;

    int64_t freeBytes = freeDiskSpace(paths.sharedFolder);
    if (freeBytes < 0) freeBytes = DISK_SPACE_UNKNOWN;
    if (freeBytes < UNDO_SPACE_MINIMUM) {
        clearUndo();
        return 0;
    }
    if (freeBytes < UNDO_SPACE_LOW) showMessage(MESSAGE_INFORMATION, resourceString(10351));

    makeFolder(sharedFilePath(UNDO_FOLDER_NAME));
    BusyDisplay busy(10353);
    // A flag that claims "unchanged" is only trusted when some level holds a copy to restore.
    if (!someLevelHolds("HrFq", u.waveCopyCurrent ? level : -1, -1)) u.waveCopyCurrent = false;
    if (!someLevelHolds("Freq", u.ftCopyCurrent ? level : -1, -1)) u.ftCopyCurrent = false;

    writeUndoSongFile(undoFilePath("Undo", level));
    writeUndoDurationsFile(undoFilePath("FrDr", level));
    if (!u.ftCopyCurrent) {
        copyReportedFile(sharedFilePath("CS.ft"), undoFilePath("Freq", level));
        copyReportedFile(sharedFilePath("CS.fi"), undoFilePath("FrIn", level));
    } else {
        deleteReportedFile(undoFilePath("Freq", level));
        deleteReportedFile(undoFilePath("FrIn", level));
    }
    bool copyWave = !u.waveCopyCurrent;
    bool hiresCopied = copyWave && fileExists(sharedFilePath("CS.ft+"));
    startUndoWriter([level, copyWave] { writeWaveCopies(level, copyWave); });

    u.currentLevel = wrapLevel(u.currentLevel + 1);
    if (u.currentLevel == u.oldestLevel) u.oldestLevel = wrapLevel(u.oldestLevel + 1);
    u.levelCount = wrapLevel(u.currentLevel - u.oldestLevel);
    u.ftCopyCurrent = true;
    u.waveCopyCurrent = true;
    // The writer may still be copying this level's Hires files: it counts as holding them.
    if (!someLevelHolds("HrFq", -1, hiresCopied ? level : -1)) u.waveCopyCurrent = false;
    if (!someLevelHolds("Freq", -1, -1)) u.ftCopyCurrent = false;
    return 1;
}

// The level from which a restore takes its copies of prefix for level n: n itself without
// searchBack; with it, n + 1 when that level holds no copy (the files have not changed since
// n, and n + 1 restores nothing), else the latest level from n back to the oldest that holds one.
static int copyLevel(const char* prefix, int n, int searchBack) {
    if (!searchBack) return n;
    int next = wrapLevel(n + 1);
    if (!fileExists(undoFilePath(prefix, next))) return next;
    for (int level = n;; level = wrapLevel(level - 1)) {
        if (fileExists(undoFilePath(prefix, level))) return level;
        if (level == undoState.oldestLevel) return next;
    }
}

// Copies the level file over a working file when the level holds one; 1 when it did.
static int restoreCopy(const char* prefix, int level, const char* workingFile) {
    std::string copy = undoFilePath(prefix, level);
    if (!fileExists(copy)) return 0;
    return copyReportedFile(copy, sharedFilePath(workingFile));
}

int restoreUndoLevel(int searchBack) {
    int n = undoState.currentLevel;
    waitForUndoSnapshotCopy();
    BusyDisplay busy(10354);

    // Both files are read whole first: a damaged level changes nothing at all.
    UndoSongFile contents{};
    std::vector<double> durations;
    int songFile = readUndoSongFile(undoFilePath("Undo", n), &contents);
    int durationsFile = readUndoDurationsFile(undoFilePath("FrDr", n), &durations);
    if (songFile == UNDO_FILE_DAMAGED || durationsFile == UNDO_FILE_DAMAGED) {
        showMessage(MESSAGE_ERROR, UNDO_LEVEL_DAMAGED_TEXT);
        return 0;
    }

    int ftLevel = copyLevel("Freq", n, searchBack);
    int waveLevel = copyLevel("HrFq", n, searchBack);
    restoreCopy("Freq", ftLevel, "CS.ft");
    if (restoreCopy("FrIn", ftLevel, "CS.fi")) undoState.ftCopyCurrent = false;
    ftBlockWindow.firstBlock = 0;
    ftBlockWindow.endBlock = 0;

    if (durationsFile == UNDO_FILE_READ && growSampleBlockDurations(uint32_t(durations.size()))) {
        std::copy(durations.begin(), durations.end(), song.sampleBlockDurations.begin());
        // Entries past the restored ones belong to no block of that level.
        std::fill(song.sampleBlockDurations.begin() + long(durations.size()), song.sampleBlockDurations.end(), 0.0);
    }
    if (songFile == UNDO_FILE_READ) {
        std::copy(contents.notes.begin(), contents.notes.end(), noteList.notes);
        noteList.count = int(contents.notes.size());
        std::copy(contents.barlines.begin(), contents.barlines.end(), barlineList.times);
        barlineList.count = int(contents.barlines.size());
        if (contents.instrumentName != song.instrumentName) song.instrumentName = contents.instrumentName;
        song.timeSignatureBeats = contents.timeSignatureBeats;
        song.timeSignatureUnit = contents.timeSignatureUnit;
        song.timeSignatureSymbol = contents.timeSignatureSymbol;
    }

    // The wave and Hires copies go back on the writer's thread; what reads them waits for it.
    if (fileExists(undoFilePath("HrIn", waveLevel))) undoState.waveCopyCurrent = false;
    startUndoWriter([waveLevel] {
        {
            std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
            restoreCopy("FrSd", waveLevel, "CS.fw");
        }
        restoreCopy("HrFq", waveLevel, "CS.ft+");
        restoreCopy("HrIn", waveLevel, "CS.fi+");
    });

    const UndoLevelRecord& r = undoLevels[n];
    if (songWindowHooks.scrollSongView) songWindowHooks.scrollSongView(r.scrollX);
    // Indices the restored lists no longer hold are left out of the selections.
    selection.selectedNoteCount = 0;
    for (int k = 0; k < r.selectedNoteCount; k++)
        if (r.selectedNotes[k] < noteList.count) selection.selectedNotes[selection.selectedNoteCount++] = r.selectedNotes[k];
    selection.selectedBarlineCount = 0;
    for (int k = 0; k < r.selectedBarlineCount; k++)
        if (r.selectedBarlines[k] < barlineList.count)
            selection.selectedBarlines[selection.selectedBarlineCount++] = r.selectedBarlines[k];
    selection.timeSelectionStart = r.timeSelectionStart;
    selection.timeSelectionEnd = r.timeSelectionEnd;
    selection.anchorNote = r.anchorNote;
    selection.anchorBarline = r.anchorBarline;
    song.blockCount = r.blockCount;
    song.workingWaveBytes = r.workingWaveBytes;
    if (songWindowHooks.redrawSongView) songWindowHooks.redrawSongView();
    return 1;
}

int undo() {
    if (!canUndo()) {
        beep();
        return 0;
    }
    waitForUndoSnapshotCopy();
    UndoState& u = undoState;
    if (!u.stateInRing) {
        // The present state becomes a level of its own, so that Redo can come back to it.
        if (takeUndoSnapshot()) u.currentLevel = wrapLevel(u.currentLevel - 1);
        u.stateInRing = true;
        // Below the space minimum the snapshot emptied the ring: there is nothing to go back to.
        if (u.levelCount == 0) {
            beep();
            return 0;
        }
    }
    int shown = u.currentLevel;
    u.currentLevel = wrapLevel(u.currentLevel - 1);
    if (!restoreUndoLevel(1)) {
        u.currentLevel = shown;
        return 0;
    }
    return 1;
}

int redo() {
    if (!canRedo()) {
        beep();
        return 0;
    }
    waitForUndoSnapshotCopy();
    int shown = undoState.currentLevel;
    undoState.currentLevel = wrapLevel(undoState.currentLevel + 1);
    if (!restoreUndoLevel(0)) {
        undoState.currentLevel = shown;
        return 0;
    }
    return 1;
}
