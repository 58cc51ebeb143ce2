// The selections and their helpers. Half a nominal block is the tolerance everywhere: a note
// counts as inside a stretch of time when it misses it by less than that.
#include "notes/selection.h"

#include <algorithm>
#include <bitset>

#include "notes/displayModes.h"
#include "store/song.h"

Selection selection;

void resetSelection() {
    selection.selectedNoteCount = 0;
    selection.selectedBarlineCount = 0;
    selection.timeSelectionStart = NO_TIME_SELECTION;
    selection.timeSelectionEnd = NO_TIME_SELECTION;
    selection.pointerNote = -1;
    selection.pointerBarline = -1;
    selection.anchorNote = -1;
    selection.anchorBarline = -1;
}

static double halfBlock() { return song.sampleBlockDuration / 2; }

static bool hasTimeSelection() {
    return selection.timeSelectionStart >= 0.0f && selection.timeSelectionEnd >= 0.0f;
}

static int findIndex(const int* list, int count, int i, int* position) {
    if (i < 0) return 0;
    for (int k = 0; k < count; k++) {
        if (list[k] != i) continue;
        if (position) *position = k;
        return 1;
    }
    return 0;
}

static void indexRange(const int* list, int count, int& lowest, int& highest) {
    if (count <= 0) {
        lowest = highest = 0;
        return;
    }
    lowest = highest = list[0];
    for (int k = 1; k < count; k++) {
        lowest = std::min(lowest, list[k]);
        highest = std::max(highest, list[k]);
    }
}

int selectNote(int i) {
    if (i < 0 || i >= noteList.count) return 0;
    if (isNoteSelected(i)) return 1;
    if (selection.selectedNoteCount >= MAX_CS_NOTES) return 0;
    selection.selectedNotes[selection.selectedNoteCount++] = i;
    return 1;
}

int selectBarline(int i) {
    if (i < 0 || i >= barlineList.count) return 0;
    if (isBarlineSelected(i)) return 1;
    if (selection.selectedBarlineCount >= MAX_CS_BARLINES) return 0;
    selection.selectedBarlines[selection.selectedBarlineCount++] = i;
    return 1;
}

// Drops i from list and lowers the entries above it.
static void dropIndex(int* list, int& count, int i) {
    int kept = 0;
    for (int k = 0; k < count; k++) {
        if (list[k] == i) continue;
        list[kept++] = list[k] > i ? list[k] - 1 : list[k];
    }
    count = kept;
}

static void raiseIndices(int* list, int count, int i) {
    for (int k = 0; k < count; k++)
        if (list[k] >= i) list[k]++;
}

static void followRemoval(int& index, int i) {
    if (index == i) index = -1;
    else if (index > i) index--;
}

void noteRemoved(int i) {
    dropIndex(selection.selectedNotes, selection.selectedNoteCount, i);
    followRemoval(selection.pointerNote, i);
    followRemoval(selection.anchorNote, i);
}

void barlineRemoved(int i) {
    dropIndex(selection.selectedBarlines, selection.selectedBarlineCount, i);
    followRemoval(selection.pointerBarline, i);
    followRemoval(selection.anchorBarline, i);
}

void noteInserted(int i) {
    raiseIndices(selection.selectedNotes, selection.selectedNoteCount, i);
    if (selection.pointerNote >= i) selection.pointerNote++;
    if (selection.anchorNote >= i) selection.anchorNote++;
}

void barlineInserted(int i) {
    raiseIndices(selection.selectedBarlines, selection.selectedBarlineCount, i);
    if (selection.pointerBarline >= i) selection.pointerBarline++;
    if (selection.anchorBarline >= i) selection.anchorBarline++;
}

int isNoteSelected(int i, int* position) {
    return findIndex(selection.selectedNotes, selection.selectedNoteCount, i, position);
}

int isBarlineSelected(int i, int* position) {
    return findIndex(selection.selectedBarlines, selection.selectedBarlineCount, i, position);
}

void selectedNoteRange(int& lowest, int& highest) {
    indexRange(selection.selectedNotes, selection.selectedNoteCount, lowest, highest);
}

void selectedBarlineRange(int& lowest, int& highest) {
    indexRange(selection.selectedBarlines, selection.selectedBarlineCount, lowest, highest);
}

int isContiguousSelection() {
    if (selection.selectedNoteCount < 2) return 0;
    int lowest, highest;
    selectedNoteRange(lowest, highest);
    // The same note listed twice is still one note, and Join needs two.
    if (lowest < 0 || highest >= MAX_CS_NOTES || highest == lowest) return 0;
    std::bitset<MAX_CS_NOTES> selected;
    for (int k = 0; k < selection.selectedNoteCount; k++) selected.set(selection.selectedNotes[k]);
    for (int i = lowest + 1; i < highest; i++)
        if (!selected.test(i)) return 0;
    return 1;
}

void selectNotesInTimeSelection() {
    selection.selectedNoteCount = 0;
    // Either end negative means there is no time selection; half of one selects nothing.
    if (!hasTimeSelection()) return;
    double half = halfBlock();
    for (int i = 0; i < noteList.count; i++) {
        const Note& note = noteList.notes[i];
        if (selection.timeSelectionStart <= note.waveStart + half && selection.timeSelectionEnd >= note.waveEnd - half)
            selection.selectedNotes[selection.selectedNoteCount++] = i;
    }
}

void extendTimeSelectionToNotes(bool reset) {
    if (reset) {
        selection.timeSelectionStart = NO_TIME_SELECTION;
        selection.timeSelectionEnd = NO_TIME_SELECTION;
    }
    bool started = hasTimeSelection();
    for (int k = 0; k < selection.selectedNoteCount; k++) {
        int i = selection.selectedNotes[k];
        if (i < 0 || i >= noteList.count) continue;
        const Note& note = noteList.notes[i];
        if (!started) {
            selection.timeSelectionStart = note.waveStart;
            selection.timeSelectionEnd = note.waveEnd;
            started = true;
        }
        selection.timeSelectionStart = std::min(selection.timeSelectionStart, note.waveStart);
        selection.timeSelectionEnd = std::max(selection.timeSelectionEnd, note.waveEnd);
    }
}

int timeSelectionFreeOfNotes() {
    // In Wave mode time edits carry the notes along; while placing notes the user means to
    // put notes over existing ones.
    if (displayModes.playbackMode != PLAYBACK_MODE_MIDI || displayModes.notePlacing) return 1;
    double half = halfBlock();
    for (int i = 0; i < noteList.count; i++) {
        const Note& note = noteList.notes[i];
        if (note.waveEnd - half >= selection.timeSelectionStart && note.waveStart <= selection.timeSelectionEnd - half)
            return 0;
    }
    return 1;
}

int getEditRange(double& start, double& end) {
    start = NO_TIME_SELECTION;
    end = NO_TIME_SELECTION;
    bool notesOrBarlines = selection.selectedNoteCount > 0 || selection.selectedBarlineCount > 0;
    if (displayModes.playbackMode != PLAYBACK_MODE_WAVE && notesOrBarlines) {
        if (displayModes.playbackMode != PLAYBACK_MODE_MIDI) return EDIT_RANGE_NONE;
        // Barlines alone give no range: a range running from -1.0 to the last selected
        // barline would make Copy take time from before the song's start, and one spanning
        // the barlines would make Delete cut the time between them. Delete, Copy and Paste
        // then behave as with a start below 0: no time is removed, nothing is copied and
        // Paste waits for a click.
        if (selection.selectedNoteCount > 0) {
            int lowest, highest;
            selectedNoteRange(lowest, highest);
            if (lowest >= 0 && highest < noteList.count) {
                start = noteList.notes[lowest].waveStart;
                end = noteList.notes[highest].waveEnd;
            }
        }
        return EDIT_RANGE_NOTES;
    }
    if (!hasTimeSelection()) return EDIT_RANGE_NONE;
    if (!timeSelectionFreeOfNotes()) return EDIT_RANGE_NONE;
    start = selection.timeSelectionStart;
    end = selection.timeSelectionEnd;
    return end - start > halfBlock() ? EDIT_RANGE_TIME : EDIT_RANGE_NONE;
}
