// Save and Save As: the names, the output type and the writing.
#include "shell/saveSong.h"

#include "audio/audioActivity.h"
#include "audio/waveWorkingFile.h"
#include "notes/displayModes.h"
#include "notes/selection.h"
#include "platform/ui.h"
#include "shell/commandDispatch.h"
#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "shell/settings.h"
#include "store/song.h"

int currentOutputType() {
    if (displayModes.playbackMode == PLAYBACK_MODE_WAVE) return OUTPUT_WAVE;
    return displayModes.noteMode == NOTE_MODE_DETAIL ? OUTPUT_DETAIL_MIDI : OUTPUT_MIDI;
}

int saveAllowed() {
    // Writing the wave file reads CS.fw, which the worker is still writing.
    if (refuseWhileBusy()) return 0;
    if (currentOutputType() == OUTPUT_WAVE && song.notesOnly) {
        showMessage(MESSAGE_INFORMATION, NO_RECORDING_TO_SAVE_TEXT);
        return 0;
    }
    if (currentOutputType() != OUTPUT_WAVE && !commandOperations.writeNotesMidiFile) {
        showMessage(MESSAGE_INFORMATION, notAvailableText("Saving MIDI files"));
        return 0;
    }
    return 1;
}

int saveSong() {
    int type = currentOutputType();
    const std::string& name = songNames.remembered[type];
    if (name.empty() || name != songNames.lastSaved[type]) return SAVE_NEEDS_DIALOG;
    return writeSongOutput(name, frameState.onlySaveSelectedRange) ? SAVE_WRITTEN : SAVE_FAILED;
}

SaveDialogSetup saveDialogSetup() {
    int type = currentOutputType();
    SaveDialogSetup setup;
    setup.filterName = type == OUTPUT_WAVE ? WAVE_FILES_FILTER_NAME : MIDI_FILES_FILTER_NAME;
    setup.pattern = type == OUTPUT_WAVE ? "*.wav" : "*.mid";
    setup.proposedName = songNames.remembered[type];
    setup.directory = globalSettings.saveDirectory;
    return setup;
}

int writeSongOutput(const std::string& path, bool onlySelectedRange) {
    if (!saveAllowed()) return 0;
    int type = currentOutputType();
    int written;
    if (type == OUTPUT_WAVE) {
        double start = -1.0, end = -1.0;
        double from = selection.timeSelectionStart, to = selection.timeSelectionEnd;
        if (onlySelectedRange && from >= 0 && to - from >= 0.5 * song.sampleBlockDuration) {
            start = from;
            end = to;
        }
        written = writeWaveSegment(path, start, end);
    } else {
        written = commandOperations.writeNotesMidiFile(path, type == OUTPUT_DETAIL_MIDI ? 1 : 0, onlySelectedRange ? 1 : 0);
    }
    if (!written) return 0;
    songNames.remembered[type] = path;
    songNames.lastSaved[type] = path;
    // The whole song is on disk as it stands: the title no longer marks it as edited.
    if (!onlySelectedRange) song.changed = false;
    return 1;
}

void storeOpenDialogChoice(const std::string& folder, int filterIndex) {
    globalSettings.openDirectory = folder;
    globalSettings.openFilter = filterIndex;
}

void storeSaveDialogChoice(const std::string& folder, int filterIndex) {
    globalSettings.saveDirectory = folder;
    globalSettings.saveFilter = filterIndex;
}
