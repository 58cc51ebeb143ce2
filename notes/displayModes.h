#pragma once
// The display modes the note commands read: MIDI or Wave playback, Note or Detail editing,
// and the song view's note-placing state. The main frame will own them; until then they are
// plain state here, set from "CS Playback Mode" and "CS Note Mode" and by the mode commands.

// Playback modes ("CS Playback Mode").
constexpr int PLAYBACK_MODE_MIDI = 1;   // the note list is played as MIDI
constexpr int PLAYBACK_MODE_WAVE = 2;   // the corrected recording is played

// Note modes ("CS Note Mode").
constexpr int NOTE_MODE_NOTE = 4;       // whole notes are edited
constexpr int NOTE_MODE_DETAIL = 8;     // the pitch is edited block by block

struct DisplayModes {
    int playbackMode = PLAYBACK_MODE_WAVE;   // PLAYBACK_MODE_MIDI or PLAYBACK_MODE_WAVE (mode commands, settings)
    int noteMode = NOTE_MODE_DETAIL;         // NOTE_MODE_NOTE or NOTE_MODE_DETAIL (mode commands, settings)
    bool notePlacing = false;                // the song view is placing notes: time selections may hold notes (song view)
};
extern DisplayModes displayModes;

// Back to the settings' defaults: Wave mode, Detail mode, not placing notes.
void resetDisplayModes();
