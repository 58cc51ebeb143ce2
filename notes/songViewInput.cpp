// The song view's edit operations by code. Every edit takes its undo snapshot before it
// changes anything and marks afterwards what the ring no longer holds.
#include "notes/songViewInput.h"

#include <algorithm>
#include <iterator>

#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "notes/displayModes.h"
#include "notes/selection.h"
#include "notes/songViewKeys.h"
#include "playback/playback.h"
#include "playback/songViewGeometry.h"
#include "resources/strings.h"
#include "store/song.h"
#include "store/songWindowHooks.h"
#include "store/timeEditing.h"
#include "store/undo.h"

SongViewInput songViewInput;

void resetSongViewInput() { songViewInput = SongViewInput{}; }

static void repaint() {
    if (songWindowHooks.redrawSongView) songWindowHooks.redrawSongView();
}

static void songEdited() {
    song.changed = true;
    repaint();
}

const char* pasteTip(int kind) {
    static std::string insertTip = resourceString(10402), placeTip = resourceString(10403);
    return kind == EDIT_RANGE_NOTES ? insertTip.c_str() : placeTip.c_str();
}

void selectionChanged() {
    extendTimeSelectionToNotes(true);
    if (selection.selectedNoteCount > 0) {
        int lowest, highest;
        selectedNoteRange(lowest, highest);
        scrollToShowTimes(noteList.notes[lowest].waveStart, noteList.notes[highest].waveEnd);
    }
    repaint();
}

static bool anythingSelected() {
    return selection.selectedNoteCount > 0 || selection.selectedBarlineCount > 0 || selection.timeSelectionStart >= 0 ||
           selection.timeSelectionEnd >= 0 || selection.anchorNote >= 0 || selection.anchorBarline >= 0;
}

static void clearSelections() {
    selection.selectedNoteCount = 0;
    selection.selectedBarlineCount = 0;
    selection.timeSelectionStart = NO_TIME_SELECTION;
    selection.timeSelectionEnd = NO_TIME_SELECTION;
    selection.anchorNote = -1;
    selection.anchorBarline = -1;
}

static void selectOnly(int note) {
    selection.selectedNoteCount = 0;
    selectNote(note);
    selection.anchorNote = note;
}

// ---- delete, cut, copy, paste ----

static void deleteSelection(int code) {
    double start, end;
    getEditRange(start, end);
    if (songViewInput.dragKind != 0) return;
    double half = song.sampleBlockDuration / 2;
    bool notesSelected = selection.selectedNoteCount > 0;
    if (notesSelected || (start >= 0 && end - start > half)) {
        takeUndoSnapshot();
        int lo, hi;
        selectedNoteRange(lo, hi);
        if (displayModes.playbackMode == PLAYBACK_MODE_MIDI && notesSelected) {
            // In selection order; each removal lowers the later entries above it.
            while (selection.selectedNoteCount > 0) {
                int i = selection.selectedNotes[0];
                removeNote(i);
                noteRemoved(i);
            }
            markUndoStale(0);
        } else {
            removeTimeFromSong(selection.timeSelectionStart, selection.timeSelectionEnd - selection.timeSelectionStart);
            markUndoStale(UNDO_FT_CHANGED | UNDO_WAVE_CHANGED);
        }
        // The note next to the deleted ones takes over the selection, so that a key held down
        // deletes one note after the other. A stretch of time alone leaves nothing selected.
        clearSelections();
        if (notesSelected && noteList.count > 0) {
            int next = code == CODE_BACKSPACE ? std::max(0, lo - 1) : std::min(lo, noteList.count - 1);
            selectOnly(next);
        }
        extendTimeSelectionToNotes(true);
        songEdited();
    }
    if (selection.selectedBarlineCount > 0) {
        takeUndoSnapshot();
        while (selection.selectedBarlineCount > 0) {
            int i = selection.selectedBarlines[0];
            removeBarline(i);
            barlineRemoved(i);
        }
        markUndoStale(0);
        songEdited();
    }
}

static void copySelection() {
    double start, end;
    int kind = getEditRange(start, end);
    timeClipboard.kind = kind;
    if (end - start > song.sampleBlockDuration / 2 && start >= 0) {
        copyTimeToClipboard(start, end - start);
        songViewInput.pasteArmed = 0;
    }
}

static void showViewTip(int kind) {
    songViewInput.hintShown = true;
    if (songWindowHooks.showTip) songWindowHooks.showTip(pasteTip(kind));
}

static void paste() {
    int kind = timeClipboard.kind;
    if (kind == 0) return;
    double start, end;
    getEditRange(start, end);
    if (start >= 0) {
        takeUndoSnapshot();
        // A paste that stops half-way has changed files all the same: the next snapshot copies them.
        pasteTimeFromClipboard(start, std::max(0.0, end - start));
        markUndoStale(UNDO_FT_CHANGED | (kind == EDIT_RANGE_TIME ? UNDO_WAVE_CHANGED : 0));
        song.changed = true;
    } else {
        songViewInput.pasteArmed = kind;
    }
    showViewTip(kind);
    repaint();
}

// ---- selecting ----

static void selectAll() {
    if (displayModes.playbackMode == PLAYBACK_MODE_WAVE) {
        selection.timeSelectionStart = 0.0f;
        selection.timeSelectionEnd = float(songDuration());
    } else {
        selection.timeSelectionStart = NO_TIME_SELECTION;
        selection.timeSelectionEnd = NO_TIME_SELECTION;
    }
    selection.selectedNoteCount = 0;
    for (int i = 0; i < noteList.count; i++) selectNote(i);
    selection.selectedBarlineCount = 0;
    for (int i = 0; i < barlineList.count; i++) selectBarline(i);
    repaint();
}

static void escape() {
    if (recordingOrOpeningActive()) {
        if (audioActivity.opening) requestOpeningStop();
        return;
    }
    if (songViewInput.hintShown) {
        songViewInput.hintShown = false;
        clearSelections();
        repaint();
        return;
    }
    if (songViewInput.pasteArmed) {
        songViewInput.pasteArmed = 0;
        repaint();
        return;
    }
    if (anythingSelected()) {
        clearSelections();
        repaint();
    }
}

// Tab and Shift+Tab: the note after the highest (before the lowest) selected one alone.
static void selectStep(int code) {
    if (noteList.count == 0) return;
    int target;
    if (selection.selectedNoteCount == 0) {
        target = code == CODE_SELECT_NEXT ? 0 : noteList.count - 1;
    } else {
        int lo, hi;
        selectedNoteRange(lo, hi);
        target = code == CODE_SELECT_NEXT ? hi + 1 : lo - 1;
        if (target < 0 || target >= noteList.count) return;
    }
    selectOnly(target);
    selectionChanged();
}

// Shift+Left and Shift+Right: the note before the lowest (after the highest) joins the selection.
static void extendSelection(int code) {
    if (noteList.count == 0) return;
    int target;
    if (selection.selectedNoteCount == 0) {
        target = code == CODE_ADD_PREVIOUS ? noteList.count - 1 : 0;
        selection.anchorNote = target;
    } else {
        int lo, hi;
        selectedNoteRange(lo, hi);
        target = code == CODE_ADD_PREVIOUS ? lo - 1 : hi + 1;
        if (target < 0 || target >= noteList.count) return;
    }
    selectNote(target);
    selectionChanged();
}

static void scrollTo(int x) {
    setSongViewScroll(x, songViewGeometry.scrollY);
    repaint();
}

// ---- clicking ----

static void pasteAtClick(double time) {
    int kind = songViewInput.pasteArmed;
    double at, length;
    if (selection.pointerNote >= 0 && selection.pointerNote < noteList.count) {
        const Note& n = noteList.notes[selection.pointerNote];
        at = n.waveStart;
        length = n.waveEnd - n.waveStart;
    } else if (selection.pointerBarline < 0) {
        at = time;
        length = 0.0;
    } else {
        return;   // a barline under the pointer: the paste stays armed
    }
    takeUndoSnapshot();
    timeClipboard.kind = kind;
    pasteTimeFromClipboard(at, length);
    markUndoStale(UNDO_FT_CHANGED | (kind == EDIT_RANGE_TIME ? UNDO_WAVE_CHANGED : 0));
    song.changed = true;
    songViewInput.pasteArmed = 0;
    repaint();
}

// Removes entry position of a selection list of count entries.
static void dropSelected(int* list, int& count, int position) {
    std::copy(list + position + 1, list + count, list + position);
    count--;
}

// The unbroken run of notes from the anchor (or, without one, the selected note farthest from
// the clicked one) to note i becomes the selection.
static void selectNoteRun(int i) {
    int from = selection.anchorNote;
    if (from < 0 || from >= noteList.count) {
        from = i;
        if (selection.selectedNoteCount > 0) {
            int lo, hi;
            selectedNoteRange(lo, hi);
            from = i - lo > hi - i ? lo : hi;
        }
    }
    int lo = std::min(from, i), hi = std::max(from, i);
    selection.selectedNoteCount = 0;
    for (int k = lo; k <= hi; k++) selectNote(k);
    selection.anchorNote = from;
}

static void clickNote(int i, int modifiers) {
    int position;
    if (modifiers & KEY_MODIFIER_SHIFT) {
        selectNoteRun(i);
    } else if (modifiers & KEY_MODIFIER_CTRL) {
        if (isNoteSelected(i, &position)) dropSelected(selection.selectedNotes, selection.selectedNoteCount, position);
        else selectNote(i);
        selection.anchorNote = i;
    } else {
        selectOnly(i);
    }
}

static void clickBarline(int i, int modifiers) {
    int position;
    if (modifiers & KEY_MODIFIER_SHIFT) {
        int from = selection.anchorBarline >= 0 && selection.anchorBarline < barlineList.count ? selection.anchorBarline : i;
        selection.selectedBarlineCount = 0;
        for (int k = std::min(from, i); k <= std::max(from, i); k++) selectBarline(k);
        selection.anchorBarline = from;
    } else if (modifiers & KEY_MODIFIER_CTRL) {
        if (isBarlineSelected(i, &position))
            dropSelected(selection.selectedBarlines, selection.selectedBarlineCount, position);
        else selectBarline(i);
        selection.anchorBarline = i;
    } else {
        selection.selectedBarlineCount = 0;
        selectBarline(i);
        selection.anchorBarline = i;
    }
}

void songViewClick(double time, int modifiers) {
    if (songViewInput.dragKind != 0 || recordingOrOpeningActive()) return;
    if (songViewInput.pasteArmed && time >= 0) {
        pasteAtClick(time);
        return;
    }
    int note = selection.pointerNote, barline = selection.pointerBarline;
    if (note >= 0 && note < noteList.count) {
        clickNote(note, modifiers);
    } else {
        selection.selectedNoteCount = 0;
        selection.anchorNote = -1;
    }
    if (barline >= 0 && barline < barlineList.count) {
        clickBarline(barline, modifiers);
    } else {
        selection.selectedBarlineCount = 0;
        selection.anchorBarline = -1;
    }
    // The old stretch goes; the time selection covers the clicked notes, as after the
    // selection keys, so that Delete, Cut and Copy in Wave mode act on the notes' time.
    extendTimeSelectionToNotes(true);
    repaint();
}

int handleSongViewCode(int code) {
    bool busy = recordingOrOpeningActive();
    // What plays must not go on over a song that changes under it.
    static const int changing[] = {CODE_BACKSPACE, CODE_DELETE, CODE_CUT, CODE_PASTE, CODE_UNDO, CODE_REDO, CODE_SELECT_ALL};
    if (!busy && std::find(std::begin(changing), std::end(changing), code) != std::end(changing)) stopPlayback();
    switch (code) {
    case CODE_BACKSPACE:
    case CODE_DELETE:
        if (!busy) deleteSelection(code);
        return 0;
    case CODE_ESCAPE: escape(); return 0;
    case CODE_HOME:
    case CODE_CTRL_HOME: scrollTo(0); return 1;
    case CODE_END: scrollTo(maxScrollX()); return 1;
    case CODE_SELECT_NEXT:
    case CODE_SELECT_PREVIOUS: selectStep(code); return 0;
    case CODE_ADD_PREVIOUS:
    case CODE_ADD_NEXT: extendSelection(code); return 0;
    case CODE_SELECT_ALL: selectAll(); return 0;
    case CODE_COPY:
        if (!busy) copySelection();
        return 0;
    case CODE_CUT:
        if (busy) return 0;
        copySelection();
        deleteSelection(CODE_DELETE);
        return 0;
    case CODE_PASTE:
        if (!busy) paste();
        return 0;
    case CODE_UNDO:
    case CODE_REDO:
        if (busy) return 0;
        if (code == CODE_UNDO ? undo() : redo()) song.changed = true;
        repaint();
        return 0;
    default: return 0;
    }
}
