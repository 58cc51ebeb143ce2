// The command table, the menu bar and accelerator table 130. Texts are the menus' own, word
// for word; the key after "\t" is what the menu shows, the accelerator table is what the
// frame's keys send.
#include "shell/commandTable.h"

const CommandEntry commandTable[] = {
    {CMD_OPEN, "&Open...\tCtrl+O", 0, false, ""},
    {CMD_CLOSE, "&Close", 0, true, ""},
    {CMD_SAVE, "&Save\tCtrl+S", 0, true, ""},
    {CMD_SAVE_AS, "Save &As...", 0, true, ""},
    {CMD_RECORDING_SOURCE, "Select Recor&ding Source...", 0, false, ""},
    {CMD_RECORD, "&Record Audio...\tSpace", 0, false, ""},
    {CMD_PREFERENCES, "Pre&ferences...", 0, false, ""},
    {CMD_EXIT, "E&xit\tAlt+F4", 0, false, ""},
    {CMD_UNDO, "&Undo\tCtrl+Z", 602, true, "undo"},
    {CMD_REDO, "&Redo\tCtrl+Y", 601, true, "redo"},
    {CMD_CUT, "Cu&t\tCtrl+X", 600, true, "cut"},
    {CMD_COPY, "&Copy\tCtrl+C", 579, true, "copy"},
    {CMD_PASTE, "&Paste\tCtrl+V", 598, true, "paste"},
    {CMD_DELETE, "&Delete\tDelete", 127, true, "delete"},
    {CMD_SELECT_ALL, "Select &All\tCtrl+A", 577, true, "select-all"},
    {CMD_DESELECT_ALL, "D&eselect All\tEsc", 27, true, "deselect-all"},
    {CMD_CHROMATIC, "&Chromatic", 0, false, "chromatic"},
    {CMD_DIATONIC, "&Diatonic", 0, false, "diatonic"},
    {CMD_ZOOM_50, "Zoom to &50%", 0, true, "zoom-to-50"},
    {CMD_ZOOM_100, "Zoom to &100%", 0, true, "zoom-to-100"},
    {CMD_ZOOM_200, "Zoom to &200%", 0, true, "zoom-to-200"},
    {CMD_ZOOM_IN, "Zoom &In\tCtrl+NUM+", 0, true, "zoom-in"},
    {CMD_ZOOM_OUT, "Zoom &Out\tCtrl+NUM-", 0, true, "zoom-out"},
    {CMD_SPLIT_NOTE, "&Split Note\tCtrl+L", 0, true, "split-note"},
    {CMD_JOIN_NOTES, "&Join Notes\tCtrl+J", 0, true, "join-notes"},
    {CMD_QUANTIZE, "&Quantize\tCtrl+Q", 0, true, "quantize"},
    {CMD_FLATTEN, "&Flatten\tCtrl+F", 0, true, "flatten"},
    {CMD_SLIDE_UP, "Slide &up", 0, true, "slide-up"},
    {CMD_SLIDE_DOWN, "Slide &down", 0, true, "slide-down"},
    {CMD_ADD_VIBRATO, "Add &vibrato\tCtrl+B", 0, true, "add-vibrato"},
    {CMD_SPEED_UP, "Speed &up (10%)", 0, true, "speed-up"},
    {CMD_SLOW_DOWN, "Slow &down (10%)", 0, true, "slow-down"},
    {CMD_DOUBLE_SPEED, "D&ouble speed", 0, true, "double-speed"},
    {CMD_HALVE_SPEED, "&Halve speed", 0, true, "halve-speed"},
    {CMD_ORIGINAL_SPEED, "O&riginal speed", 0, true, "original-speed"},
    {CMD_ACCELERANDO, "&Accelerando", 0, true, "accelerando"},
    {CMD_DECELERANDO, "D&ecelerando", 0, true, "decelerando"},
    {CMD_RITENUTO, "&Ritenuto (hold back)\tCtrl+R", 0, true, "ritenuto"},
    {CMD_VOLUME_INCREASE, "&Increase (3dB Boost)", 0, true, "increase"},
    {CMD_VOLUME_DECREASE, "&Decrease (3dB Cut)", 0, true, "decrease"},
    {CMD_VOLUME_DOUBLE, "D&ouble (10dB Boost)", 0, true, "double"},
    {CMD_VOLUME_HALVE, "&Halve (10dB Cut)", 0, true, "halve"},
    {CMD_VOLUME_25, "Set to &25%", 0, true, "set-volume"},
    {CMD_VOLUME_50, "Set to &50%", 0, true, "set-volume"},
    {CMD_VOLUME_75, "Set to &75%", 0, true, "set-volume"},
    {CMD_VOLUME_100, "Set to &100%", 0, true, "set-volume"},
    {CMD_STRIP_ENDS, "Strip &Ends of Song\tCtrl+E", 0, true, "strip-ends-of-song"},
    {CMD_PLAY_STOP, "&Play/Stop\tP", 0, true, ""},
    {CMD_NOTE_MODE, "&Note", 0, false, "note"},
    {CMD_DETAIL_MODE, "&Detail", 0, false, "detail"},
    {CMD_MIDI_MODE, "&MIDI", 0, false, "midi"},
    {CMD_WAVE_MODE, "&Wave", 0, false, "wave"},
    {CMD_CASCADE, "&Cascade", 0, true, ""},
    {CMD_TILE_HORIZONTALLY, "Tile &Horizontally", 0, true, ""},
    {CMD_TILE_VERTICALLY, "Tile &Vertically", 0, true, ""},
    {CMD_CLOSE_ALL, "Close &All", 0, true, ""},
    {CMD_INSTRUMENTS, "&Instrument Definitions...", 0, false, ""},
    {CMD_HELP, "Torvellan Melodrift &Help...\tF1", 0, false, ""},
    {CMD_RECORDING_TIPS, "R&ecording Tips...", 0, false, ""},
    {CMD_ABOUT, "&About Torvellan Melodrift...", 0, false, ""},
};
const int commandTableCount = int(sizeof commandTable / sizeof commandTable[0]);

const MenuItem menuBar[] = {
    {MENU_POPUP, POPUP_FILE, "&File"},
    {MENU_COMMAND, CMD_OPEN, nullptr},
    {MENU_COMMAND, CMD_CLOSE, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_SAVE, nullptr},
    {MENU_COMMAND, CMD_SAVE_AS, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_RECORDING_SOURCE, nullptr},
    {MENU_COMMAND, CMD_RECORD, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_PREFERENCES, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_EXIT, nullptr},
    {MENU_END, 0, nullptr},

    {MENU_POPUP, POPUP_EDIT, "&Edit"},
    {MENU_COMMAND, CMD_UNDO, nullptr},
    {MENU_COMMAND, CMD_REDO, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_CUT, nullptr},
    {MENU_COMMAND, CMD_COPY, nullptr},
    {MENU_COMMAND, CMD_PASTE, nullptr},
    {MENU_COMMAND, CMD_DELETE, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_SELECT_ALL, nullptr},
    {MENU_COMMAND, CMD_DESELECT_ALL, nullptr},
    {MENU_END, 0, nullptr},

    {MENU_POPUP, POPUP_VIEW, "&View"},
    {MENU_COMMAND, CMD_CHROMATIC, nullptr},
    {MENU_COMMAND, CMD_DIATONIC, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_ZOOM_50, nullptr},
    {MENU_COMMAND, CMD_ZOOM_100, nullptr},
    {MENU_COMMAND, CMD_ZOOM_200, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_ZOOM_IN, nullptr},
    {MENU_COMMAND, CMD_ZOOM_OUT, nullptr},
    {MENU_END, 0, nullptr},

    {MENU_POPUP, POPUP_NOTES, "&Notes"},
    {MENU_COMMAND, CMD_SPLIT_NOTE, nullptr},
    {MENU_COMMAND, CMD_JOIN_NOTES, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_POPUP, POPUP_PITCH, "&Pitch"},
    {MENU_COMMAND, CMD_QUANTIZE, nullptr},
    {MENU_COMMAND, CMD_FLATTEN, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_SLIDE_UP, nullptr},
    {MENU_COMMAND, CMD_SLIDE_DOWN, nullptr},
    {MENU_COMMAND, CMD_ADD_VIBRATO, nullptr},
    {MENU_END, 0, nullptr},
    {MENU_POPUP, POPUP_TIMING, "&Timing"},
    {MENU_COMMAND, CMD_SPEED_UP, nullptr},
    {MENU_COMMAND, CMD_SLOW_DOWN, nullptr},
    {MENU_COMMAND, CMD_DOUBLE_SPEED, nullptr},
    {MENU_COMMAND, CMD_HALVE_SPEED, nullptr},
    {MENU_COMMAND, CMD_ORIGINAL_SPEED, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_ACCELERANDO, nullptr},
    {MENU_COMMAND, CMD_DECELERANDO, nullptr},
    {MENU_COMMAND, CMD_RITENUTO, nullptr},
    {MENU_END, 0, nullptr},
    {MENU_POPUP, POPUP_VOLUME, "&Volume"},
    {MENU_COMMAND, CMD_VOLUME_INCREASE, nullptr},
    {MENU_COMMAND, CMD_VOLUME_DECREASE, nullptr},
    {MENU_COMMAND, CMD_VOLUME_DOUBLE, nullptr},
    {MENU_COMMAND, CMD_VOLUME_HALVE, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_VOLUME_25, nullptr},
    {MENU_COMMAND, CMD_VOLUME_50, nullptr},
    {MENU_COMMAND, CMD_VOLUME_75, nullptr},
    {MENU_COMMAND, CMD_VOLUME_100, nullptr},
    {MENU_END, 0, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_STRIP_ENDS, nullptr},
    {MENU_END, 0, nullptr},

    {MENU_POPUP, POPUP_PLAY, "&Play"},
    {MENU_COMMAND, CMD_PLAY_STOP, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_POPUP, POPUP_MODE, "&Mode"},
    {MENU_COMMAND, CMD_NOTE_MODE, nullptr},
    {MENU_COMMAND, CMD_DETAIL_MODE, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_MIDI_MODE, nullptr},
    {MENU_COMMAND, CMD_WAVE_MODE, nullptr},
    {MENU_END, 0, nullptr},
    {MENU_END, 0, nullptr},

    {MENU_POPUP, POPUP_WINDOW, "&Window"},
    {MENU_COMMAND, CMD_CASCADE, nullptr},
    {MENU_COMMAND, CMD_TILE_HORIZONTALLY, nullptr},
    {MENU_COMMAND, CMD_TILE_VERTICALLY, nullptr},
    {MENU_COMMAND, CMD_CLOSE_ALL, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_INSTRUMENTS, nullptr},
    {MENU_END, 0, nullptr},

    {MENU_POPUP, POPUP_HELP, "&Help"},
    {MENU_COMMAND, CMD_HELP, nullptr},
    {MENU_COMMAND, CMD_RECORDING_TIPS, nullptr},
    {MENU_SEPARATOR, 0, nullptr},
    {MENU_COMMAND, CMD_ABOUT, nullptr},
    {MENU_END, 0, nullptr},
};
const int menuBarCount = int(sizeof menuBar / sizeof menuBar[0]);

const Accelerator acceleratorTable[] = {
    {KEY_F4, ACCEL_ALT, CMD_EXIT},
    {'O', ACCEL_CONTROL, CMD_OPEN},
    {'P', ACCEL_CONTROL, CMD_SCANNING_CTRL_P},
    {KEY_SPACE, 0, CMD_RECORD},
    {'S', ACCEL_CONTROL, CMD_SAVE},
    {'G', ACCEL_CONTROL, CMD_SCANNING_CTRL_G},
    {'D', ACCEL_CONTROL, CMD_SCANNING_CTRL_D},
    {KEY_F1, 0, CMD_HELP},
    {'J', ACCEL_CONTROL, CMD_JOIN_NOTES},
    {'B', ACCEL_CONTROL, CMD_ADD_VIBRATO},
    {'F', ACCEL_CONTROL, CMD_FLATTEN},
    {'Q', ACCEL_CONTROL, CMD_QUANTIZE},
    {'E', ACCEL_CONTROL, CMD_STRIP_ENDS},
    {'L', ACCEL_CONTROL, CMD_SPLIT_NOTE},
    {'T', ACCEL_SHIFT, CMD_SCANNING_SHIFT_T},
    {'H', ACCEL_CONTROL, CMD_SCANNING_CTRL_H},
    {'N', ACCEL_CONTROL, CMD_SCANNING_CTRL_N},
    {KEY_NUMPAD_ADD, ACCEL_CONTROL, CMD_ZOOM_IN},
    {KEY_NUMPAD_SUBTRACT, ACCEL_CONTROL, CMD_ZOOM_OUT},
    {'R', ACCEL_CONTROL, CMD_RITENUTO},
};
const int acceleratorTableCount = int(sizeof acceleratorTable / sizeof acceleratorTable[0]);

const CommandEntry* findCommand(int id) {
    for (const CommandEntry& entry : commandTable)
        if (entry.id == id) return &entry;
    return nullptr;
}

const CommandEntry* findScriptCommand(const std::string& name) {
    if (name.empty()) return nullptr;
    for (const CommandEntry& entry : commandTable)
        if (name == entry.scriptName) return &entry;
    return nullptr;
}

std::string commandLabel(int id) {
    const CommandEntry* entry = findCommand(id);
    if (!entry) return "";
    std::string text = entry->menuText;
    size_t tab = text.find('\t');
    return tab == std::string::npos ? text : text.substr(0, tab);
}

std::string commandKeyText(int id) {
    const CommandEntry* entry = findCommand(id);
    if (!entry) return "";
    std::string text = entry->menuText;
    size_t tab = text.find('\t');
    return tab == std::string::npos ? "" : text.substr(tab + 1);
}

std::string commandName(int id) {
    std::string name;
    for (char c : commandLabel(id))
        if (c != '&') name += c;
    if (name.size() >= 3 && name.compare(name.size() - 3, 3, "...") == 0) name.erase(name.size() - 3);
    return name;
}
