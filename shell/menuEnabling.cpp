// The enabling rules of the Edit and Notes menus, the greying of the song items while no
// song is open, and the check marks of the mode items.
#include "shell/menuEnabling.h"

#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "shell/commandOperations.h"
#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "shell/settings.h"
#include "store/song.h"

MenuState currentMenuState() {
    MenuState state{};
    state.songOpen = frameState.songWindowOpen;
    state.audio = song.blockCount >= 1;
    state.noteCount = noteList.count;
    state.selectedNoteCount = selection.selectedNoteCount;
    state.timeSelection = selection.timeSelectionStart >= 0 && selection.timeSelectionEnd > selection.timeSelectionStart;
    state.joinable = isContiguousSelection() == 1;
    state.busy = recordingOrOpeningActive();
    state.clipboardHoldsData = commandOperations.clipboardKind && commandOperations.clipboardKind() != 0;
    state.canUndo = commandOperations.canUndo && commandOperations.canUndo();
    state.canRedo = commandOperations.canRedo && commandOperations.canRedo();
    state.playbackMode = displayModes.playbackMode;
    state.noteMode = displayModes.noteMode;
    state.layout = globalSettings.scaleMode;
    return state;
}

int commandEnabled(int id, const MenuState& s) {
    const CommandEntry* entry = findCommand(id);
    if (entry && entry->songItem && !s.songOpen) return 0;

    bool selected = s.selectedNoteCount >= 1;
    bool anySelection = selected || s.timeSelection;
    bool wave = s.playbackMode == PLAYBACK_MODE_WAVE;
    bool detail = s.noteMode == NOTE_MODE_DETAIL;
    bool result = true;
    switch (id) {
    case CMD_CUT:
    case CMD_COPY:
    case CMD_DELETE: result = s.audio && anySelection && !s.busy; break;
    case CMD_SELECT_ALL: result = s.audio; break;
    case CMD_DESELECT_ALL: result = s.audio && anySelection; break;
    case CMD_PASTE: result = s.audio && s.clipboardHoldsData && !s.busy; break;
    case CMD_UNDO: result = s.canUndo && !s.busy; break;
    case CMD_REDO: result = s.canRedo && !s.busy; break;
    case CMD_SPLIT_NOTE: result = s.selectedNoteCount == 1 && s.noteCount < MAX_CS_NOTES && !s.busy; break;
    case CMD_JOIN_NOTES: result = s.joinable && !s.busy; break;
    case POPUP_PITCH:
    case CMD_QUANTIZE:
    case POPUP_VOLUME:
    case CMD_VOLUME_INCREASE:
    case CMD_VOLUME_DECREASE:
    case CMD_VOLUME_DOUBLE:
    case CMD_VOLUME_HALVE: result = selected && !s.busy; break;
    case CMD_FLATTEN:
    case CMD_ADD_VIBRATO:
    case CMD_SLIDE_UP:
    case CMD_SLIDE_DOWN: result = selected && !s.busy && detail; break;
    case POPUP_TIMING:
    case CMD_SPEED_UP:
    case CMD_SLOW_DOWN:
    case CMD_DOUBLE_SPEED:
    case CMD_HALVE_SPEED:
    case CMD_ORIGINAL_SPEED:
    case CMD_ACCELERANDO:
    case CMD_DECELERANDO:
    case CMD_RITENUTO: result = selected && !s.busy && wave; break;
    case CMD_VOLUME_25:
    case CMD_VOLUME_50:
    case CMD_VOLUME_75:
    case CMD_VOLUME_100: result = selected && !s.busy && !wave; break;
    case CMD_STRIP_ENDS: result = s.noteCount >= 1 && !s.busy; break;
    default: break;
    }
    // The submenus sit inside the Notes menu, which is a song item as a whole.
    if ((id == POPUP_PITCH || id == POPUP_TIMING || id == POPUP_VOLUME) && !s.songOpen) result = false;
    return result ? 1 : 0;
}

int commandChecked(int id, const MenuState& s) {
    switch (id) {
    case CMD_CHROMATIC: return (s.layout & LAYOUT_CHROMATIC) ? 1 : 0;
    case CMD_DIATONIC: return (s.layout & LAYOUT_DIATONIC) ? 1 : 0;
    case CMD_NOTE_MODE: return s.noteMode == NOTE_MODE_NOTE ? 1 : 0;
    case CMD_DETAIL_MODE: return s.noteMode == NOTE_MODE_DETAIL ? 1 : 0;
    case CMD_MIDI_MODE: return s.playbackMode == PLAYBACK_MODE_MIDI ? 1 : 0;
    case CMD_WAVE_MODE: return s.playbackMode == PLAYBACK_MODE_WAVE ? 1 : 0;
    default: return 0;
    }
}
