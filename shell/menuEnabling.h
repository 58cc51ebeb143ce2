#pragma once
// The menus' enabling rules as one function of the song's state. The desktop program asks
// it for every item each time a menu opens; the command dispatch asks it again for commands
// that arrive through the keys, so a greyed command does nothing.

// What the rules look at.
struct MenuState {
    bool songOpen;            // the song's window is open (menu 108); else menu 109
    bool audio;               // the song holds at least one sampleBlock
    int noteCount;            // notes in the song
    int selectedNoteCount;    // notes selected
    bool timeSelection;       // a time range of positive length is selected
    bool joinable;            // the selected notes can be joined
    bool busy;                // a recording or an opening is in progress
    bool clipboardHoldsData;  // the time clipboard holds data
    bool canUndo;             // an undo step exists
    bool canRedo;             // a redo step exists
    int playbackMode;         // PLAYBACK_MODE_MIDI or PLAYBACK_MODE_WAVE
    int noteMode;             // NOTE_MODE_NOTE or NOTE_MODE_DETAIL
    int layout;               // LAYOUT_ bits ("CS Scale Mode")
};

// The state of the running program.
MenuState currentMenuState();

// 1 when the menu item of command (a CommandId) or popup (a PopupId) is enabled in state.
// Without a song every song item is grey; with one, the rules of the Edit and Notes items
// apply and the other items are enabled.
int commandEnabled(int id, const MenuState& state);
// 1 when the item carries a check mark: the current layout, note mode and playback mode.
int commandChecked(int id, const MenuState& state);
