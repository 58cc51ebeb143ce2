#pragma once
// Playback: hearing the song as it now stands. Wave mode cuts the requested range of CS.fw
// into the playback file CS.fp and plays it on a waveaudio device; MIDI mode writes the notes
// to "Temp0001.dat" and plays it on the sequencer. A 10 ms timer moves the play cursor across
// the song view and keeps it in view; the device's completion notice stops playback at the
// end. Everything here runs on the main thread. The state is playbackState (playbackState.h).

#include <cstdint>

constexpr const char* PLAYBACK_WAVE_FILE = "CS.fp";       // in the shared folder while Wave mode plays
constexpr int PLAYBACK_ROUTING_MARK = 2;                  // routingMark while MIDI playback owns the sequencer
// The cursor moves, and the song view repaints, once this many milliseconds have passed
// since it last moved: with the 10 ms timer a new picture every 30 ms, so that the cursor's
// movement looks smooth.
constexpr uint32_t PLAY_CURSOR_STEP_MS = 25;

constexpr const char* MIDI_DEVICE_NOT_OPENED_TEXT = "Could not play MIDI because the Sequencer device did not open";
constexpr const char* MIDI_NOT_PLAYED_TEXT =
    "Could not play MIDI.\n\nThis may be because the default MIDI device is in use by another application, or "
    "because the MIDI device is not set up properly or missing.";

// The Play button's two labels.
constexpr const char* PLAY_LABEL = "Play";
constexpr const char* STOP_LABEL = "Stop";

// Plays start .. end (seconds; start -1.0: from the time selection's start, else from the
// earliest selected note, else from the beginning; end -1.0: to the song's end) in the
// playback mode in force, or stops playback of that mode when it runs (the Play/Stop
// command). preview 1 plays a note alone and keeps its failures silent. Nothing happens
// while a recording or an opening runs, nor in MIDI mode for a song without notes.
void playSong(double start, double end, int preview);
// Stop and close the device of each mode, delete its playback file, give the Play button
// its label back and stop the cursor timer. Nothing happens when the device is not open.
void stopWavePlayback();
void stopMidiPlayback();
// Both of them: what a command that changes the song does first.
void stopPlayback();
// 1 while a device of either mode is open.
int isPlaying();
// Stops a note preview that is playing: 1 when one was stopped, else 0. Every editing
// command calls it first, so that a note never plays while it changes.
int stopPreview();
// Before a change of the note or playback mode: normal playback that has not reached its end
// stops and remembers its cursor; the next repaint resumes it (resumePlayback).
void pausePlayback();
// Called at the end of every repaint of the song view: plays from the remembered cursor to
// the end of the song, in the mode then in force, and forgets the position.
void resumePlayback();
// Plays note index alone (-1: the selected note when exactly one is selected), provided it is
// the note under the pointer. Any playback stops first.
void previewNote(int index);
// The 10 ms timer: follows the audio clock, keeps the cursor in view and moves it.
void playbackTick();
// A device's completion notice (posted to the main loop by the device).
void handleMediaNotification(int deviceId);
// "Stop" while playing, else "Play".
const char* playButtonLabel();
