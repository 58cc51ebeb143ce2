// Playback in Wave and MIDI mode, the note preview, the pause for a view change and the play
// cursor's timer. The devices are the platform's (platform/media.h); their completion comes
// back through the main loop to handleMediaNotification.
#include "playback/playback.h"

#include <algorithm>
#include <string>

#include "audio/audioActivity.h"
#include "audio/waveWorkingFile.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/clock.h"
#include "platform/files.h"
#include "platform/media.h"
#include "platform/ui.h"
#include "playback/midiOutput.h"
#include "playback/playbackState.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "shell/appTimers.h"
#include "shell/paths.h"
#include "store/song.h"
#include "store/songWindowHooks.h"

static void playbackTimerCallback(int) { playbackTick(); }

// The playback files exist only while their device is open; a failed deletion is ignored.
static void deletePlaybackFile(const char* name) { fileDelete(sharedFilePath(name)); }

// What every stop does after closing its device.
static void afterStop() {
    if (isPlaying()) return;
    releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, EVENT_WILDCARD, playbackTimerCallback);
    refreshPointerInfo();
    songWindowHooks.updateFrameDisplay();
    songWindowHooks.redrawSongView();
}

// Stops and closes one mode's device and deletes its playback file.
static void stopDevice(int* device, const char* playbackFile) {
    if (*device == -1) return;
    mediaStop(*device);
    mediaClose(*device);
    *device = -1;
    deletePlaybackFile(playbackFile);
    afterStop();
}

void stopWavePlayback() { stopDevice(&playbackState.waveDevice, PLAYBACK_WAVE_FILE); }

void stopMidiPlayback() { stopDevice(&playbackState.midiDevice, MIDI_PLAYBACK_FILE); }

void stopPlayback() {
    stopWavePlayback();
    stopMidiPlayback();
}

int isPlaying() { return playbackRunning(); }

const char* playButtonLabel() { return isPlaying() ? STOP_LABEL : PLAY_LABEL; }

// Steps common to both modes once the device plays: the range in hundredths, the clock origin,
// the cursor timer and the Play button's label.
static void startCursor(double start, double end) {
    PlaybackState& p = playbackState;
    double duration = songDuration();
    p.cursor = p.startCopy = start == -1.0 ? 0 : int(start * 100);
    p.end = end == -1.0 ? int(duration * 100) : int(std::min(duration * 100, end * 100));
    p.clockOrigin = timeCounter() - uint32_t(p.cursor);
    p.cursorMoved = clockMilliseconds();
    // A full timer registry has said so; playback then runs without cursor updates.
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, EVENT_WILDCARD, playbackTimerCallback);
    refreshPointerInfo();
    songWindowHooks.updateFrameDisplay();
    songWindowHooks.redrawSongView();
}

static void playMidi(double start, double end, int preview) {
    PlaybackState& p = playbackState;
    if (noteList.count == 0) return;
    if (p.midiDevice != -1) {
        stopMidiPlayback();
        return;
    }
    // Two devices never sound at once: a preview may still play in the other mode.
    stopWavePlayback();
    std::string path = sharedFilePath(MIDI_PLAYBACK_FILE);
    if (!writeNotesMidiFile(path, displayModes.noteMode == NOTE_MODE_DETAIL, 1, start, end)) return;
    p.routingMark = PLAYBACK_ROUTING_MARK;
    int device = -1;
    int result = mediaOpen(MEDIA_TYPE_SEQUENCER, path, &device);
    if (result != MEDIA_OK) {
        if (!preview) showMessage(MESSAGE_ERROR, std::string(MIDI_DEVICE_NOT_OPENED_TEXT) + "\n\n" + mediaErrorString(result));
        deletePlaybackFile(MIDI_PLAYBACK_FILE);
        return;
    }
    p.midiDevice = device;
    if (mediaPlay(device, handleMediaNotification) != MEDIA_OK) {
        if (!preview) showMessage(MESSAGE_ERROR, MIDI_NOT_PLAYED_TEXT);
        stopMidiPlayback();
        return;
    }
    startCursor(start, end);
}

static void playWave(double start, double end, int preview) {
    PlaybackState& p = playbackState;
    if (p.waveDevice != -1) {
        stopWavePlayback();
        return;
    }
    stopMidiPlayback();
    std::string path = sharedFilePath(PLAYBACK_WAVE_FILE);
    // A playback file that cannot be written is reported by the open that follows.
    writeWaveSegment(path, start, end);
    int device = -1;
    int result = mediaOpen(MEDIA_TYPE_WAVEAUDIO, path, &device);
    if (result != MEDIA_OK) {
        if (!preview) showMessage(MESSAGE_ERROR, mediaErrorString(result));
        deletePlaybackFile(PLAYBACK_WAVE_FILE);
        return;
    }
    p.waveDevice = device;
    result = mediaPlay(device, handleMediaNotification);
    if (result != MEDIA_OK) {
        // The device is closed at once: kept open, it would show "PLAYBACK" and a cursor
        // while nothing plays, and the next Play would only close it.
        if (!preview) showMessage(MESSAGE_ERROR, mediaErrorString(result));
        stopWavePlayback();
        return;
    }
    startCursor(start, end);
}

void playSong(double start, double end, int preview) {
    if (recordingOrOpeningActive()) return;
    playbackState.preview = preview;
    if (start == -1.0) {
        if (selection.timeSelectionStart >= 0) {
            start = selection.timeSelectionStart;
        } else if (selection.selectedNoteCount > 0) {
            int lowest, highest;
            selectedNoteRange(lowest, highest);
            start = noteList.notes[lowest].waveStart;
        }
    }
    if (displayModes.playbackMode == PLAYBACK_MODE_MIDI) playMidi(start, end, preview);
    else playWave(start, end, preview);
}

int stopPreview() {
    if (!playbackState.preview || !isPlaying()) return 0;
    stopPlayback();
    return 1;
}

void pausePlayback() {
    PlaybackState& p = playbackState;
    if (!isPlaying() || p.preview || p.cursor >= p.end) return;
    p.resumePosition = p.cursor;
    stopPlayback();
}

void resumePlayback() {
    PlaybackState& p = playbackState;
    if (p.resumePosition == -1) return;
    int position = p.resumePosition;
    p.resumePosition = -1;
    playSong(position * 0.01, -1.0, 0);
}

void previewNote(int index) {
    if (recordingOrOpeningActive()) return;
    if (index == -1) {
        if (selection.selectedNoteCount != 1) return;
        index = selection.selectedNotes[0];
    }
    if (index < 0 || index >= noteList.count || index != selection.pointerNote) return;
    // Any device, not only the wave device: a MIDI playback left running would make the
    // preview's play command a stop.
    stopPlayback();
    const Note& note = noteList.notes[index];
    playSong(note.waveStart, note.waveEnd, 1);
}

void playbackTick() {
    PlaybackState& p = playbackState;
    if (!isPlaying()) return;
    // The device's own clock, where it has one, is what the listener hears: the origin
    // follows it, so the cursor neither runs ahead of the sound nor lags behind it.
    uint32_t played = 0;
    if (mediaPlayedMilliseconds(p.waveDevice != -1 ? p.waveDevice : p.midiDevice, &played))
        p.clockOrigin = timeCounter() - uint32_t(p.startCopy) - played / 10;
    int position = int(timeCounter() - p.clockOrigin);
    bool scrolled = !p.preview && autoScrollSongView((position + 1) * 0.01, (p.end + 1) * 0.01);
    uint32_t now = clockMilliseconds();
    if (now - p.cursorMoved < PLAY_CURSOR_STEP_MS) {
        if (scrolled) songWindowHooks.redrawSongView();
        return;
    }
    p.cursor = position;
    p.cursorMoved = now;
    refreshPointerInfo();
    songWindowHooks.redrawSongView();
}

void handleMediaNotification(int deviceId) {
    PlaybackState& p = playbackState;
    if (deviceId == p.waveDevice) stopWavePlayback();
    else if (deviceId == p.midiDevice && p.routingMark == PLAYBACK_ROUTING_MARK) stopMidiPlayback();
}
