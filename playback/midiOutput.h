#pragma once
// MIDI output: the note list written as a Standard MIDI File (format 1, 256 ticks per quarter
// note at 120 beats per minute), plain (one MIDI note per note) or in detail (legato notes
// joined, the sung pitch followed block by block with pitch bends). Saving calls saveMidiFile,
// MIDI-mode playback writes "Temp0001.dat" with writeNotesMidiFile, and the instrument window
// writes the chromatic scale a new instrument is learnt from with writeScaleMidiFile.

#include <string>

constexpr int MIDI_PAN = 61;                           // pan of every instrument track
constexpr int MIDI_DEFAULT_REVERB_DEPTH = 60;          // reverb depth while the option is untouched
constexpr int MIDI_PITCH_BEND_UNITS_PER_CENT = 40;     // 4000 per semitone
constexpr int MIDI_PITCH_BEND_LOW = -8192;             // bends are limited to this ...
constexpr int MIDI_PITCH_BEND_HIGH = 8191;             // ... and this before the centre is added
constexpr double MIDI_JOIN_SEMITONES = 1.5;            // detail mode joins notes this close in pitch
constexpr double MIDI_DETAIL_UPDATE_SECONDS = 0.03125; // detail mode updates pitch and volume this often
constexpr int MIDI_KEY_SEARCH = 2;                     // detail mode tries keys this far from the nearest
constexpr const char* MIDI_PLAYBACK_FILE = "Temp0001.dat";   // MIDI-mode playback's file in the shared folder
constexpr const char* GENERATING_MIDI_TEXT = "Generating MIDI...";
constexpr int MIDI_CREDIT_STRING = 10271;              // the credit line: notice text and the scale's tempo track name
constexpr double SCALE_MIDI_TICKS_PER_SECOND = 480.0;  // the instrument scale's time base
constexpr int SCALE_MIDI_DIVISION = 240;               // ticks per quarter note of the scale at MIDI_TEMPO

// How the instrument tracks are laid out; preferences of the MIDI output.
struct MidiOutputOptions {
    bool singleTrack = true;       // one instrument track whatever the song's part count (preferences)
    bool reverb = true;            // each instrument track opens with a reverb controller (preferences)
    int reverbDepth = MIDI_DEFAULT_REVERB_DEPTH;   // 0 .. 127 (preferences)
};
extern MidiOutputOptions midiOutputOptions;

// What the MIDI output keeps of the song.
struct MidiOutputSong {
    int partCount = 1;             // the song's parts; instrument tracks when singleTrack is off (recognition)
};
extern MidiOutputSong midiOutputSong;

// Both records back to their defaults (song close; tests between cases).
void resetMidiOutput();

// A level 0 .. 255 (any float) as a MIDI velocity 1 .. 127:
// truncation of 127 x (max(a, 1) / 255)^log10(2) + 0.5. Not a number counts as 1.
int velocityFromLevel(float level);

// Writes the notes from start to end (seconds; -1.0 for the song's start and end) to path,
// plain or in detail; forPlayback (MIDI-mode playback) changes nothing in the output. 1 when
// written; 0 while a recording or an opening runs (nothing is created), when path cannot be
// created (no message), or after a write failure was reported (the incomplete file removed).
// Shows the wait cursor and "Generating MIDI..." while it writes. Detail mode moves the
// FTBlockWindow along the notes; when it cannot be loaded (reported once by the FT store) the
// blocks it would hold count as unpitched, and stretches without a pitched block are left out.
int writeNotesMidiFile(const std::string& path, int detail, int forPlayback, double start, double end);

// Save and Save As in MIDI mode: the whole song, or with onlySelectedRange the time selection
// when it is longer than half a block. 1 when written (the caller remembers the name); 0 while
// a recording or opening runs, or after a message: "Cannot " and the path when the file cannot
// be created, or a write failure's own.
int saveMidiFile(const std::string& path, int detail, int onlySelectedRange);

// The name a new instrument's scale is offered under: "%s_%d_%d_%.1f_%d.mid" of name, the two
// semitones, the note duration and the level (the decimal point is always ".").
std::string scaleMidiFileName(const std::string& name, int lowSemitone, int highSemitone, double noteDuration,
                              int level);
// Writes a chromatic scale from lowSemitone to highSemitone (0 .. 127) as a two-track file at
// 480 ticks per second: a tempo track named by string 10271 and a track named name playing
// name's General MIDI program, each note noteDuration seconds long at the velocity of level and
// followed by a rest as long, so that the recording of it falls apart into single notes.
// 1 when written; 0 for a range or duration (0 .. 30 s) it cannot play, or after a message:
// "Cannot " and the path, or a write failure's own (the incomplete file removed).
int writeScaleMidiFile(const std::string& path, const std::string& name, int lowSemitone, int highSemitone,
                       double noteDuration, int level);
