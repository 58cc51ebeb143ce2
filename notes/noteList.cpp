// The note list and the barline list, and the checks that keep their times inside the song
// and clear of their neighbours. Moved times are snapped to block boundaries through the
// song's time axis, because block durations may be unequal after timing edits.
#include "notes/noteList.h"

#include <algorithm>

#include "store/song.h"

NoteList noteList;
BarlineList barlineList;

void resetNoteList() {
    noteList.count = 0;
    barlineList.count = 0;
}

int appendNote(const Note& note) {
    return insertNote(noteList.count, note);
}

int insertNote(int at, const Note& note) {
    if (noteList.count >= MAX_CS_NOTES || at < 0 || at > noteList.count) return 0;
    Note* notes = noteList.notes;
    std::copy_backward(notes + at, notes + noteList.count, notes + noteList.count + 1);
    notes[at] = note;
    noteList.count++;
    return 1;
}

int removeNote(int i) {
    if (i < 0 || i >= noteList.count) return 0;
    Note* notes = noteList.notes;
    std::copy(notes + i + 1, notes + noteList.count, notes + i);
    noteList.count--;
    return 1;
}

int appendBarline(float time) {
    return insertBarline(barlineList.count, time);
}

int insertBarline(int at, float time) {
    if (barlineList.count >= MAX_CS_BARLINES || at < 0 || at > barlineList.count) return 0;
    float* times = barlineList.times;
    std::copy_backward(times + at, times + barlineList.count, times + barlineList.count + 1);
    times[at] = time;
    barlineList.count++;
    return 1;
}

int removeBarline(int i) {
    if (i < 0 || i >= barlineList.count) return 0;
    float* times = barlineList.times;
    std::copy(times + i + 1, times + barlineList.count, times + i);
    barlineList.count--;
    return 1;
}

// A time that is not a number counts as negative: left alone it would pass every length
// check below and a note with no place in the song would be declared valid.
static void raiseToZero(float& time) {
    if (!(time >= 0.0f)) time = 0.0f;
}

static void lowerToDuration(float& time, double duration) {
    if (time > duration) time = float(duration);
}

// One span against the end of the span before it: a start inside the previous note goes to
// that note's end, and a span squeezed too short by that gets its minimum length back at the
// end, where the note has room.
static void keepAfterPrevious(float& start, float& end, float previousEnd, double d) {
    if (start >= previousEnd) return;
    start = float(snapTimeToBlock(previousEnd));
    if (double(end) - start < MIN_NOTE_BLOCKS * d)
        end = float(snapTimeToBlock(start + SQUEEZED_NOTE_BLOCKS * d));
}

// The mirror image against the start of the following span: the start moves back instead.
static void keepBeforeNext(float& start, float& end, float nextStart, double d) {
    if (end <= nextStart) return;
    end = float(snapTimeToBlock(nextStart));
    if (double(end) - start < MIN_NOTE_BLOCKS * d)
        start = float(snapTimeToBlock(end - SQUEEZED_NOTE_BLOCKS * d));
}

static int spanLengthValid(float start, float end, double d) {
    double length = double(end) - double(start);
    return length >= MIN_NOTE_BLOCKS * d && length <= MAX_NOTE_DURATION;
}

int validateNoteTimes(int i, bool alone) {
    if (i < 0 || i >= noteList.count) return 0;
    Note& note = noteList.notes[i];
    double d = song.sampleBlockDuration;
    raiseToZero(note.midiStart);
    raiseToZero(note.midiEnd);
    raiseToZero(note.waveStart);
    raiseToZero(note.waveEnd);
    if (!alone) {
        double duration = songDuration();
        lowerToDuration(note.midiStart, duration);
        lowerToDuration(note.midiEnd, duration);
        lowerToDuration(note.waveStart, duration);
        lowerToDuration(note.waveEnd, duration);
        if (i > 0) {
            const Note& previous = noteList.notes[i - 1];
            keepAfterPrevious(note.midiStart, note.midiEnd, previous.midiEnd, d);
            keepAfterPrevious(note.waveStart, note.waveEnd, previous.waveEnd, d);
        }
        if (i < noteList.count - 1) {
            const Note& next = noteList.notes[i + 1];
            keepBeforeNext(note.midiStart, note.midiEnd, next.midiStart, d);
            keepBeforeNext(note.waveStart, note.waveEnd, next.waveStart, d);
        }
    }
    return spanLengthValid(note.midiStart, note.midiEnd, d) && spanLengthValid(note.waveStart, note.waveEnd, d);
}

void validateBarlineTime(int i) {
    if (i < 0 || i >= barlineList.count) return;
    float& time = barlineList.times[i];
    double spacing = BARLINE_SPACING_BLOCKS * song.sampleBlockDuration;
    raiseToZero(time);
    lowerToDuration(time, songDuration());
    if (i > 0) {
        double earliest = double(barlineList.times[i - 1]) + spacing;
        if (time < earliest) time = float(snapTimeToBlock(earliest));
    }
    if (i < barlineList.count - 1) {
        double latest = double(barlineList.times[i + 1]) - spacing;
        if (time > latest) time = float(snapTimeToBlock(latest));
    }
}
