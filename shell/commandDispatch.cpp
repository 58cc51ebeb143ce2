// The command dispatch. A command whose menu item is greyed may still arrive through an
// accelerator, so each one repeats its guard here and does nothing when it does not hold.
#include "shell/commandDispatch.h"

#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/recording.h"
#include "notes/displayModes.h"
#include "playback/playback.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "shell/menuEnabling.h"
#include "shell/zoom.h"
#include "store/song.h"

std::string notAvailableText(const std::string& what) {
    return what + " is not available in this version of Torvellan Melodrift.";
}

void reportNotAvailable(int command) { showMessage(MESSAGE_INFORMATION, notAvailableText(commandName(command))); }

static void editCommand(int command) {
    // The Edit menu speaks to the song's window; without it there is nothing to edit.
    if (!commandEnabled(command, currentMenuState())) return;
    // A note preview never plays on while the song changes under it.
    stopPreview();
    if (!commandOperations.handleSongViewCode) {
        reportNotAvailable(command);
        return;
    }
    commandOperations.handleSongViewCode(findCommand(command)->songViewCode);
}

static void noteCommand(int command) {
    if (!commandEnabled(command, currentMenuState())) return;
    stopPreview();
    if (!commandOperations.runNoteCommand) {
        reportNotAvailable(command);
        return;
    }
    commandOperations.runNoteCommand(command);
}

static void recordCommand() {
    // Stopping a running recording must stay possible, so only a running opening refuses.
    if (audioActivity.opening) {
        showMessage(MESSAGE_INFORMATION, WHILST_OPENING_TEXT);
        return;
    }
    if (!commandOperations.toggleRecording) {
        reportNotAvailable(CMD_RECORD);
        return;
    }
    // What sounds from the speakers would be recorded with the voice.
    if (!audioActivity.recording) stopPlayback();
    // A song of notes read from a MIDI file has no recording to add to: a recording starts a
    // song of its own.
    if (!audioActivity.recording && song.notesOnly) {
        closeSong();
        resetSongNames();
    }
    commandOperations.toggleRecording();
}

static void playCommand() {
    if (!frameState.songWindowOpen || recordingOrOpeningActive()) return;
    if (!commandOperations.playSong) {
        reportNotAvailable(CMD_PLAY_STOP);
        return;
    }
    commandOperations.playSong(-1.0, -1.0, 0);
}

static void zoom(int command) {
    if (!frameState.songWindowOpen) return;
    if (!zoomCommand(command)) return;
    updateFrameDisplay();
    redrawSongView();
}

int dispatchCommand(int command) {
    if (frameState.modalDepth > 0 && !commandAllowedWhileModal(command)) return COMMAND_FILTERED;
    switch (command) {
    case CMD_OPEN:
    case CMD_CLOSE:
    case CMD_SAVE:
    case CMD_SAVE_AS:
    case CMD_RECORDING_SOURCE:
    case CMD_PREFERENCES:
    case CMD_EXIT:
    case CMD_CASCADE:
    case CMD_TILE_HORIZONTALLY:
    case CMD_TILE_VERTICALLY:
    case CMD_CLOSE_ALL:
    case CMD_HELP:
    case CMD_RECORDING_TIPS:
    case CMD_ABOUT:
    case CMD_INSTRUMENTS: return COMMAND_FOR_FRAME;

    case CMD_RECORD: recordCommand(); return COMMAND_DONE;
    case CMD_PLAY_STOP: playCommand(); return COMMAND_DONE;

    case CMD_UNDO:
    case CMD_REDO:
    case CMD_CUT:
    case CMD_COPY:
    case CMD_PASTE:
    case CMD_DELETE:
    case CMD_SELECT_ALL:
    case CMD_DESELECT_ALL: editCommand(command); return COMMAND_DONE;

    case CMD_CHROMATIC: setLayout(LAYOUT_CHROMATIC); return COMMAND_DONE;
    case CMD_DIATONIC: setLayout(LAYOUT_DIATONIC); return COMMAND_DONE;
    case CMD_NOTE_MODE: setNoteMode(NOTE_MODE_NOTE); return COMMAND_DONE;
    case CMD_DETAIL_MODE: setNoteMode(NOTE_MODE_DETAIL); return COMMAND_DONE;
    case CMD_MIDI_MODE: setPlaybackMode(PLAYBACK_MODE_MIDI); return COMMAND_DONE;
    case CMD_WAVE_MODE: setPlaybackMode(PLAYBACK_MODE_WAVE); return COMMAND_DONE;

    case CMD_ZOOM_50:
    case CMD_ZOOM_100:
    case CMD_ZOOM_200:
    case CMD_ZOOM_IN:
    case CMD_ZOOM_OUT: zoom(command); return COMMAND_DONE;

    case CMD_SPLIT_NOTE:
    case CMD_JOIN_NOTES:
    case CMD_QUANTIZE:
    case CMD_FLATTEN:
    case CMD_SLIDE_UP:
    case CMD_SLIDE_DOWN:
    case CMD_ADD_VIBRATO:
    case CMD_SPEED_UP:
    case CMD_SLOW_DOWN:
    case CMD_DOUBLE_SPEED:
    case CMD_HALVE_SPEED:
    case CMD_ORIGINAL_SPEED:
    case CMD_ACCELERANDO:
    case CMD_DECELERANDO:
    case CMD_RITENUTO:
    case CMD_VOLUME_INCREASE:
    case CMD_VOLUME_DECREASE:
    case CMD_VOLUME_DOUBLE:
    case CMD_VOLUME_HALVE:
    case CMD_VOLUME_25:
    case CMD_VOLUME_50:
    case CMD_VOLUME_75:
    case CMD_VOLUME_100:
    case CMD_STRIP_ENDS: noteCommand(command); return COMMAND_DONE;

    // The scanning code's keys do nothing for a song.
    case CMD_SCANNING_CTRL_P:
    case CMD_SCANNING_CTRL_G:
    case CMD_SCANNING_CTRL_D:
    case CMD_SCANNING_SHIFT_T:
    case CMD_SCANNING_CTRL_H:
    case CMD_SCANNING_CTRL_N: return COMMAND_DONE;

    default: return COMMAND_FILTERED;
    }
}
