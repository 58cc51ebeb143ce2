#pragma once
// Songs and notes for the note list and selection suites: a song of equal blocks of 1/128 s
// (binary fractions, so boundaries and half blocks are exact) and notes built in one line.

#include <gtest/gtest.h>

#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "store/song.h"

// One block, seconds.
static const double D = 1.0 / 128;

// Empties the song, the lists, the selections and the modes, then makes a song of count
// blocks of D seconds.
inline void makeSongOfBlocks(uint32_t count) {
    resetSong();
    resetNoteList();
    resetSelection();
    resetDisplayModes();
    song.sampleBlockDuration = D;
    ASSERT_EQ(growSampleBlockDurations(count), 1);
    for (uint32_t k = 0; k < count; k++) song.sampleBlockDurations[k] = D;
    song.blockCount = count;
}

// A drawn note whose MIDI and wave spans are both start .. end.
inline Note noteSpanning(float start, float end) {
    Note note{};
    note.pitch = 440.0f;
    note.midiNote = 69;
    note.midiStart = note.waveStart = start;
    note.midiEnd = note.waveEnd = end;
    return note;
}

// Base for the suites: a 10-second song, emptied again after each test.
class NoteSongTest : public ::testing::Test {
protected:
    void SetUp() override { makeSongOfBlocks(1280); }
    void TearDown() override {
        resetNoteList();
        resetSelection();
        resetDisplayModes();
        resetSong();
    }
    void addNote(float start, float end) { ASSERT_EQ(appendNote(noteSpanning(start, end)), 1); }
};
