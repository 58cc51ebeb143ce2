#pragma once
// The playback state the song view reads: which devices are open, the play cursor and the
// played range. Playback owns and advances it; the song view draws the cursor from it and
// follows it with the auto-scroll. Closing the song empties it (resetPlaybackState).

#include <cstdint>

struct PlaybackState {
    int waveDevice = -1;        // the open wave playback device, -1 when none (playback)
    int midiDevice = -1;        // the open MIDI playback device, -1 when none (playback)
    uint32_t clockOrigin = 0;   // time counter minus the start position, hundredths of a second (playback)
    int cursor = 0;             // the play cursor, hundredths of a second (playback timer)
    uint32_t cursorMoved = 0;   // clock milliseconds when the cursor last moved (playback timer)
    int startCopy = 0;          // the start position as played, hundredths of a second (playback)
    int end = 0;                // the end position, hundredths of a second (playback)
    int preview = 0;            // 1 while a note preview plays (playback)
    int resumePosition = -1;    // hundredths of a second to resume from after a view change; -1 none
    int routingMark = 0;        // 2 once MIDI playback opened its device: the sequencer's completion stops it
};
extern PlaybackState playbackState;

// 1 while a wave or MIDI device is open (isPlaying of playback/playback.h).
inline int playbackRunning() { return playbackState.waveDevice != -1 || playbackState.midiDevice != -1; }

// No device, cursor 0, nothing to resume.
void resetPlaybackState();
