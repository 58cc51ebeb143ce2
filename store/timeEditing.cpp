// Removing, copying and pasting time: the order of the workers, the block durations, and how
// the notes and barlines follow a cut or a paste. d is the nominal block duration throughout;
// the margins of half and one and a half blocks decide what counts as lying in a range.
#include "store/timeEditing.h"

#include <algorithm>

#include "audio/audioActivity.h"
#include "notes/selection.h"
#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/songWindowHooks.h"
#include "store/undo.h"

TimeClipboard timeClipboard;

void resetTimeClipboard() { timeClipboard = TimeClipboard{}; }

// The wait cursor and the operation's status text, restored on every path.
struct TimeEditDisplay {
    explicit TimeEditDisplay(int textId) {
        setWaitCursor(true);
        setStatusText(resourceString(textId));
    }
    ~TimeEditDisplay() {
        setWaitCursor(false);
        setStatusText("");
    }
};

int timeRangeToBlocks(double start, double length, uint32_t* first, uint32_t* count) {
    uint32_t from = blockAtTime(start);
    uint32_t to = blockAtTime(start + length);
    if (to < from) return 0;
    *first = from;
    *count = std::min(to, song.blockCount) - std::min(from, song.blockCount);
    return 1;
}

// A long song has many notes to move: they snap to a grid summed once per operation.
static float snap(const BlockGrid& grid, double t) { return float(grid.snap(t)); }

static void songChanged() {
    loadFTBlockWindow(0, 0);
    if (songWindowHooks.redrawSongView) songWindowHooks.redrawSongView();
}

// ---- removing ----

// Notes and barlines after a cut of [t, t + L): those in it go, later ones move back by L.
static void followRemoval(double t, double L) {
    double d = song.sampleBlockDuration;
    BlockGrid grid = makeBlockGrid();
    for (int i = 0; i < noteList.count;) {
        Note& n = noteList.notes[i];
        if (n.waveStart + 1.5 * d >= t && n.waveEnd - 1.5 * d < t + L) {
            removeNote(i);
            noteRemoved(i);
            continue;
        }
        if (n.waveStart + 0.5 * d >= t) n.waveStart = snap(grid, std::max(t, n.waveStart - L));
        if (n.midiStart + 0.5 * d >= t) n.midiStart = snap(grid, std::max(t, n.midiStart - L));
        if (n.waveEnd + 0.5 * d >= t) n.waveEnd = snap(grid, std::max({t, n.waveStart + 2 * d, n.waveEnd - L}));
        if (n.midiEnd + 0.5 * d >= t) n.midiEnd = snap(grid, std::max({t, n.midiStart + 2 * d, n.midiEnd - L}));
        i++;
    }
    for (int i = 0; i < barlineList.count;) {
        float& b = barlineList.times[i];
        if (b + 0.5 * d >= t && b - 0.5 * d < t + L) {
            removeBarline(i);
            barlineRemoved(i);
            continue;
        }
        if (b + 0.5 * d >= t) b = snap(grid, std::max(t, b - L));
        i++;
    }
}

int removeTimeFromSong(double start, double length) {
    if (recordingOrOpeningActive()) return 0;
    uint32_t first, count;
    if (!timeRangeToBlocks(start, length, &first, &count)) return 0;
    // The song always keeps its first block.
    if (first == 0 && count == song.blockCount && count > 0) {
        first = 1;
        count--;
    }
    if (count == 0) return 0;
    double t = songTimeOfBlock(first);
    double L = songTimeOfBlock(first + count) - t;

    waitForUndoSnapshotCopy();
    TimeEditDisplay display(DELETING_TEXT);
    if (!removeWavesFromSong(first, count)) {
        showMessage(MESSAGE_ERROR, "There was a problem removing waves - removeTimeFromSong (1). Data may be corrupted.");
        return 0;
    }
    if (!removeFTBlocksFromSong(first, count)) {
        showMessage(MESSAGE_ERROR,
                    "There was a problem removing FT blocks - removeTimeFromSong (2). Data may be corrupted.");
        return 0;
    }
    if (!generalSettings.disableWaveEditing && !removeHiresFTBlocksFromSong(first, count)) {
        showMessage(MESSAGE_ERROR,
                    "There was a problem removing Hires FT blocks - removeTimeFromSong (3). Data may be corrupted.");
        return 0;
    }
    std::vector<double>& D = song.sampleBlockDurations;
    uint32_t end = std::min<uint32_t>(song.blockCount, uint32_t(D.size()));
    if (first + count < end) std::copy(D.begin() + first + count, D.begin() + end, D.begin() + first);
    // Entries past the last block stay 0.
    std::fill(D.begin() + std::max(first, end - std::min(end, count)), D.begin() + end, 0.0);
    song.blockCount -= count;

    followRemoval(t, L);
    songChanged();
    return 1;
}

// ---- copying ----

// Keeps durations [first, first + count) as the clipboard's. 1; 0 after the message.
static int copyDurationsToClipboard(uint32_t first, uint32_t count) {
    TimeClipboard& c = timeClipboard;
    bool firstAllocation = c.durations.empty();
    if (c.durations.size() < count && !tryResize(c.durations, count, 0.0)) {
        showMessage(MESSAGE_ERROR, firstAllocation ? "There was a problem adding sampleBlock durations to the "
                                                     "clipboard - copyTimeToClipboard (3)."
                                                   : "There was a problem adding sampleBlock durations to the "
                                                     "clipboard - copyTimeToClipboard (4).");
        return 0;
    }
    for (uint32_t k = 0; k < count; k++) c.durations[k] = blockDuration(first + k);
    c.durationCount = count;
    return 1;
}

int copyNotesAndBarlinesToClipboard(double start, double length) {
    TimeClipboard& c = timeClipboard;
    double d = song.sampleBlockDuration;
    c.notes.clear();
    c.barlines.clear();
    BlockGrid grid = makeBlockGrid();
    float from = snap(grid, start), to = snap(grid, start + length);
    // In the order of the list, so that pasting meets them in time order.
    for (int i = 0; i < noteList.count && c.notes.size() < size_t(MAX_CS_NOTES); i++) {
        if (!isNoteSelected(i)) continue;
        Note n = noteList.notes[i];
        if (!(start <= n.midiEnd - 0.5 * d && start + length >= n.midiStart + 0.5 * d)) continue;
        n.waveStart = std::max(n.waveStart, from);
        n.midiStart = std::max(n.midiStart, from);
        n.waveEnd = std::min(n.waveEnd, to);
        n.midiEnd = std::min(n.midiEnd, to);
        for (float* time : {&n.waveStart, &n.waveEnd, &n.midiStart, &n.midiEnd}) *time = snap(grid, *time - start);
        if (!tryAllocate([&] { c.notes.push_back(n); })) return 0;
    }
    for (int i = 0; i < barlineList.count && c.barlines.size() < size_t(MAX_CS_BARLINES); i++) {
        float b = barlineList.times[i];
        if (start <= b - 0.5 * d && start + length >= b + 0.5 * d)
            if (!tryAllocate([&] { c.barlines.push_back(snap(grid, b - start)); })) return 0;
    }
    return 1;
}

int copyTimeToClipboard(double start, double length) {
    if (recordingOrOpeningActive()) return 0;
    uint32_t first, count;
    if (!timeRangeToBlocks(start, length, &first, &count)) return 0;
    start = songTimeOfBlock(first);
    length = songTimeOfBlock(first + count) - start;

    waitForUndoSnapshotCopy();
    TimeEditDisplay display(COPYING_TEXT);
    if (timeClipboard.kind == EDIT_RANGE_TIME) {
        if (!copyWavesToClipboard(first, count)) {
            showMessage(MESSAGE_ERROR, "There was a problem adding waves to the clipboard - copyTimeToClipboard (1).");
            return 0;
        }
        if (!generalSettings.disableWaveEditing && !copyHiresFTBlocksToClipboard(first, count)) {
            showMessage(MESSAGE_ERROR,
                        "There was a problem adding Hires FT blocks to the clipboard- copyTimeToClipboard (2).");
            return 0;
        }
    }
    // Notes copied in MIDI mode keep their durations too: the time selection a paste leaves
    // covers the pasted blocks.
    if (!copyDurationsToClipboard(first, count)) return 0;
    if (!copyFTBlocksToClipboard(first, count)) {
        showMessage(MESSAGE_ERROR, "There was a problem adding FT blocks to the clipboard - copyTimeToClipboard (5).");
        return 0;
    }
    if (!copyNotesAndBarlinesToClipboard(start, length)) {
        showMessage(MESSAGE_ERROR,
                    "There was a problem adding notes and barlines to the clipboard - copyTimeToClipboard (6).");
        return 0;
    }
    return 1;
}

// ---- pasting ----

// The song's notes and barlines around a paste of P seconds at t over [t, t + L).
static void followPaste(double t, double L, double P, bool inserting) {
    double d = song.sampleBlockDuration;
    BlockGrid grid = makeBlockGrid();
    for (int i = 0; i < noteList.count;) {
        Note& n = noteList.notes[i];
        if (n.waveStart + 1.5 * d >= t && t + L > n.waveEnd - 1.5 * d) {
            removeNote(i);
            noteRemoved(i);
            continue;
        }
        if (!inserting) {
            i++;
            continue;
        }
        Note before = n;
        bool straddles = n.waveStart < t - 0.5 * d && n.waveEnd > t + L + 0.5 * d;
        if (t <= n.waveStart + 0.5 * d) n.waveStart = snap(grid, std::max(t + P, n.waveStart + P - L));
        if (t <= n.midiStart + 0.5 * d) n.midiStart = snap(grid, std::max(t + P, n.midiStart + P - L));
        if (t < n.waveEnd - 0.5 * d) n.waveEnd = snap(grid, std::max({t + P, n.waveStart + 2 * d, n.waveEnd + P - L}));
        if (t < n.midiEnd - 0.5 * d) n.midiEnd = snap(grid, std::max({t + P, n.midiStart + 2 * d, n.midiEnd + P - L}));
        if (straddles && noteList.count < MAX_CS_NOTES) {
            // The note is cut at the paste point; its second part follows the pasted stretch.
            Note second = n;
            second.waveStart = snap(grid, t + P);
            second.midiStart = std::max(second.midiStart, second.waveStart);
            n = before;
            n.waveEnd = snap(grid, t);
            n.midiEnd = std::min(n.midiEnd, n.waveEnd);
            insertNote(i + 1, second);
            noteInserted(i + 1);
            i += 2;
            continue;
        }
        i++;
    }
    for (int i = 0; i < barlineList.count;) {
        float& b = barlineList.times[i];
        if (b + 0.5 * d >= t && b - 0.5 * d < t + L) {
            removeBarline(i);
            barlineRemoved(i);
            continue;
        }
        if (inserting && b >= t - 0.5 * d) b = snap(grid, std::max(t + P, b + P - L));
        i++;
    }
}

int pasteNotesAndBarlines(double at) {
    double d = song.sampleBlockDuration;
    double T = songDuration();
    selection.selectedNoteCount = 0;
    selection.selectedBarlineCount = 0;
    for (const Note& copied : timeClipboard.notes) {
        if (noteList.count >= MAX_CS_NOTES) break;
        double s = at + copied.waveStart;
        int place = 0;
        while (place < noteList.count && noteList.notes[place].waveStart <= s) place++;
        if (place > 0 && noteList.notes[place - 1].waveEnd > s + 0.5 * d) continue;
        if (place < noteList.count && noteList.notes[place].waveStart - 1.5 * d <= s) continue;
        if (s > T - 1.5 * d) continue;
        Note n = copied;
        n.waveStart = float(n.waveStart + at);
        n.waveEnd = float(n.waveEnd + at);
        n.midiStart = float(n.midiStart + at);
        n.midiEnd = float(n.midiEnd + at);
        insertNote(place, n);
        noteInserted(place);
        validateNoteTimes(place, false);
        selectNote(place);
    }
    for (float copied : timeClipboard.barlines) {
        if (barlineList.count >= MAX_CS_BARLINES) break;
        double x = at + copied;
        int place = 0;
        while (place < barlineList.count && barlineList.times[place] <= x) place++;
        if (place > 0 && barlineList.times[place - 1] > x - d) continue;
        if (place < barlineList.count && barlineList.times[place] - 1.5 * d <= x) continue;
        if (x > T - 1.5 * d) continue;
        insertBarline(place, float(x));
        barlineInserted(place);
        selectBarline(place);
    }
    return 1;
}

// Inserts the clipboard's n durations at first in place of replaced ones. 1; 0 after the message.
static int pasteDurations(uint32_t first, uint32_t replaced, uint32_t n, uint32_t oldCount) {
    std::vector<double>& D = song.sampleBlockDurations;
    bool firstAllocation = D.empty();
    uint32_t newCount = oldCount - replaced + n;
    if (!growSampleBlockDurations(std::max(newCount, oldCount))) {
        showMessage(MESSAGE_ERROR, firstAllocation ? "There was a problem pasting sampleBlock durations from the "
                                                     "clipboard - pasteTimeFromClipboard (4)."
                                                   : "There was a problem pasting sampleBlock durations from the "
                                                     "clipboard - pasteTimeFromClipboard (5).");
        return 0;
    }
    uint32_t from = first + replaced, to = first + n;
    if (to > from) std::copy_backward(D.begin() + from, D.begin() + oldCount, D.begin() + oldCount + (to - from));
    else std::copy(D.begin() + from, D.begin() + oldCount, D.begin() + to);
    for (uint32_t k = 0; k < n; k++) D[first + k] = k < timeClipboard.durationCount ? timeClipboard.durations[k] : 0.0;
    std::fill(D.begin() + newCount, D.end(), 0.0);
    song.blockCount = newCount;
    return 1;
}

int pasteTimeFromClipboard(double at, double length) {
    TimeClipboard& c = timeClipboard;
    if (recordingOrOpeningActive() || c.kind == 0) return 0;
    int64_t freeBytes = freeDiskSpace(paths.sharedFolder);
    if (freeBytes < 0) freeBytes = DISK_SPACE_UNKNOWN;
    if (freeBytes < PASTE_SPACE_MINIMUM) {
        showMessage(MESSAGE_INFORMATION, resourceString(10352));
        return 0;
    }
    if (freeBytes < PASTE_SPACE_LOW) showMessage(MESSAGE_INFORMATION, resourceString(10351));

    uint32_t first, replaced;
    if (!timeRangeToBlocks(at, length, &first, &replaced)) return 0;
    at = songTimeOfBlock(first);
    length = songTimeOfBlock(first + replaced) - at;
    uint32_t n = 0;
    FILE* clip = fileOpen(sharedFilePath("_CS.ft"), "rb");
    bool counted = clip && fileRead(&n, 4, clip) == 4;
    if (clip) fileClose(clip);
    if (!counted) return 0;
    double P = 0.0;
    for (uint32_t k = 0; k < n && k < c.durationCount && k < c.durations.size(); k++) P += c.durations[k];
    bool inserting = c.kind == EDIT_RANGE_TIME;

    waitForUndoSnapshotCopy();
    TimeEditDisplay display(PASTING_TEXT);
    uint32_t oldCount = song.blockCount;
    // The block files' indexes are read up to the song's block count, which must already take
    // in the blocks a paste adds.
    if (inserting) song.blockCount = std::max(oldCount, oldCount - replaced + n);
    if (!pasteFTBlocks(first, inserting ? replaced : n)) {
        song.blockCount = oldCount;
        showMessage(MESSAGE_ERROR, "There was a problem pasting FT blocks from the clipboard - pasteTimeFromClipboard (1).");
        return 0;
    }
    if (inserting) {
        if (!pasteWaves(first, replaced)) {
            song.blockCount = oldCount;
            showMessage(MESSAGE_ERROR, "There was a problem pasting waves from the clipboard - pasteTimeFromClipboard (2).");
            return 0;
        }
        if (!generalSettings.disableWaveEditing && !pasteHiresFTBlocks(first, replaced)) {
            song.blockCount = oldCount;
            showMessage(MESSAGE_ERROR,
                        "There was a problem pasting Hires FT blocks from the clipboard - pasteTimeFromClipboard (3).");
            return 0;
        }
        if (!pasteDurations(first, replaced, n, oldCount)) {
            song.blockCount = oldCount;
            return 0;
        }
    }
    followPaste(at, length, P, inserting);
    if (!pasteNotesAndBarlines(at)) {
        showMessage(MESSAGE_ERROR,
                    "There was a problem pasting notes and barlines from the clipboard - pasteTimeFromClipboard (6).");
        return 0;
    }
    selection.timeSelectionStart = float(at);
    selection.timeSelectionEnd = float(std::min(at + P, songDuration()));
    songChanged();
    return 1;
}
