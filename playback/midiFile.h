#pragma once
// Standard MIDI File writing: variable-length quantities, the header chunk, track chunks whose
// lengths are filled in when the file is finished, and the meta and channel events of a track.
// The note writer and the instrument scale writer (playback/midiOutput.cpp) build their files
// with these; bytes go out through the song store's file routines, which report failures.

#include <cstdint>
#include <cstdio>
#include <string>

constexpr uint16_t MIDI_DIVISION = 256;           // ticks per quarter note of the note files
constexpr uint32_t MIDI_TEMPO = 500000;           // microseconds per quarter note: 120 beats per minute
constexpr double MIDI_TICKS_PER_SECOND = 512.0;   // MIDI_DIVISION at MIDI_TEMPO
constexpr int MIDI_MAX_TRACKS = 16;               // one tempo track and up to 15 instrument tracks
constexpr uint32_t MIDI_MAX_VARIABLE_LENGTH = 0x0FFFFFFF;   // largest value four bytes can carry
constexpr uint16_t MIDI_PITCH_BEND_CENTRE = 8192;  // the pitch bend value of no bend
constexpr uint16_t MIDI_PITCH_BEND_MAX = 16383;    // 14 bits

// Meta event types.
constexpr uint8_t MIDI_META_NOTICE = 0x02;          // copyright notice text
constexpr uint8_t MIDI_META_TRACK_NAME = 0x03;
constexpr uint8_t MIDI_META_END_OF_TRACK = 0x2F;
constexpr uint8_t MIDI_META_TEMPO = 0x51;
constexpr uint8_t MIDI_META_KEY_SIGNATURE = 0x59;

// Channel event kinds (the status byte's high half; the low half is the channel).
constexpr uint8_t MIDI_NOTE_OFF = 0x80;
constexpr uint8_t MIDI_NOTE_ON = 0x90;
constexpr uint8_t MIDI_CONTROL_CHANGE = 0xB0;
constexpr uint8_t MIDI_PROGRAM_CHANGE = 0xC0;
constexpr uint8_t MIDI_PITCH_BEND = 0xE0;

// Controllers.
constexpr uint8_t MIDI_CC_BANK_SELECT = 0;
constexpr uint8_t MIDI_CC_CHANNEL_VOLUME = 7;
constexpr uint8_t MIDI_CC_PAN = 10;
constexpr uint8_t MIDI_CC_BANK_SELECT_FINE = 32;
constexpr uint8_t MIDI_CC_REVERB = 91;

// One file being written. Events take absolute ticks; the writer turns them into deltas.
// After the first failed write (reported once by the file routine) every later write is
// skipped, so a caller writes on and learns the outcome from finishMidiFile.
struct MidiFileWriter {
    FILE* file = nullptr;                          // open for writing; nullptr when none
    std::string target;                            // the file asked for: replaced once the file is complete
    std::string path;                              // the file being written beside it, renamed over target
    int ok = 0;                                    // 1 while every write succeeded; a caller giving up sets 0
    uint32_t position = 0;                         // bytes written so far
    int declaredTracks = 0;                        // track count the header announced
    int trackCount = 0;                            // tracks begun
    int inTrack = 0;                               // a track is begun and not yet ended
    uint32_t lengthAt[MIDI_MAX_TRACKS] = {};       // file offset of each track's length field
    uint32_t length[MIDI_MAX_TRACKS] = {};         // each ended track's length
    uint32_t lastTick = 0;                         // tick of the current track's last event
};

// Writes value as a variable-length quantity into out (room for 4 bytes) and returns the byte
// count, 1 to 4. A value above MIDI_MAX_VARIABLE_LENGTH is written as that maximum.
int encodeVariableLength(uint32_t value, uint8_t* out);

// Starts a file for path: the bytes go to a new file beside it, which replaces path only
// when finishMidiFile has written it whole, so a failed write never leaves a damaged file
// where path was. 1 when started; 0 when the new file cannot be made, with no message
// (callers word it) and the writer left without a file.
int createMidiFile(MidiFileWriter& w, const std::string& path);
// "MThd", length 6, format, track count (at most MIDI_MAX_TRACKS), division.
void writeMidiHeader(MidiFileWriter& w, uint16_t format, uint16_t trackCount, uint16_t division);
// "MTrk" and a length of 0, filled in by finishMidiFile. The track's last event tick is 0.
void beginMidiTrack(MidiFileWriter& w);
// The end-of-track event, delta ticks after the track's last event.
void endMidiTrack(MidiFileWriter& w, uint32_t delta);

// Events at an absolute tick of the current track. A tick before the track's last event is
// written with delta 0: events never go back in time. Data bytes are limited to 0 .. 127, so
// that none can be read as a status byte; channels are 0 .. 15.
void writeMidiMetaEvent(MidiFileWriter& w, uint32_t tick, uint8_t type, const uint8_t* data, uint32_t count);
// A text meta event; the UTF-8 text is written in Latin-1, '?' for what Latin-1 cannot hold.
void writeMidiTextEvent(MidiFileWriter& w, uint32_t tick, uint8_t type, const std::string& text);
void writeMidiTempo(MidiFileWriter& w, uint32_t tick, uint32_t microsecondsPerQuarter);
void writeMidiKeySignature(MidiFileWriter& w, uint32_t tick, int sharps, int minor);
void writeMidiNoteOn(MidiFileWriter& w, uint32_t tick, int channel, int key, int velocity);
void writeMidiNoteOff(MidiFileWriter& w, uint32_t tick, int channel, int key);   // velocity 0
void writeMidiControlChange(MidiFileWriter& w, uint32_t tick, int channel, int controller, int value);
void writeMidiProgramChange(MidiFileWriter& w, uint32_t tick, int channel, int program);
// value 0 .. MIDI_PITCH_BEND_MAX, MIDI_PITCH_BEND_CENTRE for none; low 7 bits first.
void writeMidiPitchBend(MidiFileWriter& w, uint32_t tick, int channel, int value);

// Fills in every track's length, closes the file and puts it in place of the target. 1 when the
// whole file was written; 0 after a reported failure ("Bytes were not stored properly", "File
// could not be seeked", "File could not be closed", "Cannot " and the target when it cannot be
// replaced) or when the caller gave up: then the new file is removed and the target is as it was.
int finishMidiFile(MidiFileWriter& w);

// UTF-8 text in Latin-1: each character above U+00FF and each byte that is not valid UTF-8
// becomes '?'. MIDI text events are 8-bit text.
std::string latin1FromUtf8(const std::string& text);
