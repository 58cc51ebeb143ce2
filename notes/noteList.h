#pragma once
// The song's notes and barlines: one flat, time-ordered array of 72-byte Note records and a
// list of barline times, with the checks that keep a note's or barline's times valid.
// Recognition and MIDI import fill the list; editing, the song view, time editing, MIDI
// output and resynthesis read it. Closing the song empties both lists (resetNoteList).

#include <cstddef>
#include <cstdint>

// The note list holds at most this many notes; an add beyond it is refused.
constexpr int MAX_CS_NOTES = 16384;
// The barline list holds at most this many barlines.
constexpr int MAX_CS_BARLINES = 2048;
// Longest a note may last on either of its spans, seconds.
constexpr double MAX_NOTE_DURATION = 30.0;
// Shortest a note may last on either span, in nominal block durations.
constexpr double MIN_NOTE_BLOCKS = 1.5;
// Length given to a note squeezed below MIN_NOTE_BLOCKS by its neighbour, in block durations.
constexpr double SQUEEZED_NOTE_BLOCKS = 2.0;
// Closest two barlines may be, in nominal block durations.
constexpr double BARLINE_SPACING_BLOCKS = 2.0;

// One note: eighteen 32-bit slots. Editing copies records whole and changes only pitch,
// midiNote, the four times and volumeSum; the recognition fields are carried untouched.
struct Note {
    float pitch;                     // current pitch, Hz; quantize puts it on a semitone, fine dragging may not
    float midiStart;                 // start as played in MIDI mode and written to MIDI files, seconds
    float midiEnd;                   // end of the MIDI span, seconds
    float waveStart;                 // start of the recording's stretch that belongs to the note, seconds
    float waveEnd;                   // end of that stretch, seconds
    float recognitionValues[3];      // set by recognition; a MIDI-imported note holds its velocity in all three
    float recognitionWeight;         // set by recognition; 100.0 for a MIDI-imported note
    uint8_t midiNote;                // nearest semitone to pitch, 69 = A at 440 Hz
    uint8_t midiNotePad[3];          // padding of midiNote's slot, kept 0
    uint32_t recognitionCode;        // set by recognition
    uint32_t recognitionExtra[2];    // written by recognition (and by MIDI import for the score)
    int32_t instrument;              // InstrumentDefinition index; -1 for a MIDI-imported note
    uint32_t sourceIndex;            // set by recognition and MIDI import (the part number)
    uint8_t group;                   // set by recognition, compared between neighbours there
    uint8_t groupPad[3];             // padding of group's slot, kept 0
    uint32_t volumeSum;              // sum of per-block amplitudes 0..255 over midiStart..midiEnd
    uint32_t recognitionTail;        // used by recognition only
};
static_assert(sizeof(Note) == 72, "a Note is eighteen 32-bit slots");
static_assert(offsetof(Note, pitch) == 0);
static_assert(offsetof(Note, midiStart) == 4);
static_assert(offsetof(Note, midiEnd) == 8);
static_assert(offsetof(Note, waveStart) == 12);
static_assert(offsetof(Note, waveEnd) == 16);
static_assert(offsetof(Note, recognitionValues) == 20);
static_assert(offsetof(Note, recognitionWeight) == 32);
static_assert(offsetof(Note, midiNote) == 36);
static_assert(offsetof(Note, midiNotePad) == 37);
static_assert(offsetof(Note, recognitionCode) == 40);
static_assert(offsetof(Note, recognitionExtra) == 44);
static_assert(offsetof(Note, instrument) == 52);
static_assert(offsetof(Note, sourceIndex) == 56);
static_assert(offsetof(Note, group) == 60);
static_assert(offsetof(Note, groupPad) == 61);
static_assert(offsetof(Note, volumeSum) == 64);
static_assert(offsetof(Note, recognitionTail) == 68);

// In time order, not overlapping: for i > 0, midiStart(i) >= midiEnd(i-1) and
// waveStart(i) >= waveEnd(i-1).
struct NoteList {
    Note notes[MAX_CS_NOTES];   // notes[0 .. count-1] are the song's notes
    int count;                  // number of notes, 0 .. MAX_CS_NOTES
};
extern NoteList noteList;

// Ascending, each at least BARLINE_SPACING_BLOCKS from its neighbours (validateBarlineTime).
struct BarlineList {
    float times[MAX_CS_BARLINES];   // barline times, seconds; times[0 .. count-1] are in use
    int count;                      // number of barlines, 0 .. MAX_CS_BARLINES
};
extern BarlineList barlineList;

// Empties the note list and the barline list (song close).
void resetNoteList();

// Adds note at the end. 1 when added; 0 when the list already holds MAX_CS_NOTES notes.
int appendNote(const Note& note);
// Inserts note before index at (0 .. count); later notes move up one place.
// 1 when inserted; 0 when the list is full or at is out of range.
int insertNote(int at, const Note& note);
// Removes note i; later notes move down one place. 1 when removed; 0 when i is not a note.
int removeNote(int i);

// Adds a barline at the end. 1 when added; 0 when the list already holds MAX_CS_BARLINES.
int appendBarline(float time);
// Inserts a barline before index at (0 .. count). 1 when inserted; 0 when full or out of range.
int insertBarline(int at, float time);
// Removes barline i; later barlines move down. 1 when removed; 0 when i is not a barline.
int removeBarline(int i);

// Brings note i's four times into the song and, unless alone is set, clear of its neighbours,
// snapping moved times to block boundaries. 1 when the note may stand; 0 when either span is
// shorter than MIN_NOTE_BLOCKS blocks or longer than MAX_NOTE_DURATION, or i is not a note.
int validateNoteTimes(int i, bool alone);
// Brings barline i into the song and at least BARLINE_SPACING_BLOCKS from its neighbours,
// snapping a moved time to a block boundary. Nothing happens when i is not a barline.
void validateBarlineTime(int i);
