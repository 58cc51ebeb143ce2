#pragma once
// The main frame's commands: their ids, menu texts and keys, the menu bar (menu 108 while a
// song is open, 109 with the song items greyed while none is), the accelerator table 130 and
// the tips of the mode commands. The desktop program builds its menus and shortcuts from
// these tables; the command dispatch and the enabling rules go by the ids.

#include <string>

// Command ids, as the menus, the accelerators and the toolbar send them.
enum CommandId {
    CMD_OPEN = 40017,
    CMD_CLOSE = 40039,
    CMD_SAVE = 42002,
    CMD_SAVE_AS = 40011,
    CMD_RECORDING_SOURCE = 42119,
    CMD_RECORD = 42120,
    CMD_PREFERENCES = 42088,
    CMD_EXIT = 40012,
    CMD_UNDO = 57643,
    CMD_REDO = 57644,
    CMD_CUT = 57635,
    CMD_COPY = 57634,
    CMD_PASTE = 57637,
    CMD_DELETE = 42012,
    CMD_SELECT_ALL = 42013,
    CMD_DESELECT_ALL = 42014,
    CMD_CHROMATIC = 42111,
    CMD_DIATONIC = 42110,
    CMD_ZOOM_50 = 42083,
    CMD_ZOOM_100 = 42084,
    CMD_ZOOM_200 = 42085,
    CMD_ZOOM_IN = 42075,
    CMD_ZOOM_OUT = 42074,
    CMD_SPLIT_NOTE = 42116,
    CMD_JOIN_NOTES = 42134,
    CMD_QUANTIZE = 42164,
    CMD_FLATTEN = 42165,
    CMD_SLIDE_UP = 42167,
    CMD_SLIDE_DOWN = 42168,
    CMD_ADD_VIBRATO = 42166,
    CMD_SPEED_UP = 42181,
    CMD_SLOW_DOWN = 42182,
    CMD_DOUBLE_SPEED = 42183,
    CMD_HALVE_SPEED = 42184,
    CMD_ORIGINAL_SPEED = 42185,
    CMD_ACCELERANDO = 42186,
    CMD_DECELERANDO = 42187,
    CMD_RITENUTO = 42190,
    CMD_VOLUME_INCREASE = 42139,
    CMD_VOLUME_DECREASE = 42140,
    CMD_VOLUME_DOUBLE = 42141,
    CMD_VOLUME_HALVE = 42142,
    CMD_VOLUME_25 = 42135,
    CMD_VOLUME_50 = 42136,
    CMD_VOLUME_75 = 42137,
    CMD_VOLUME_100 = 42138,
    CMD_STRIP_ENDS = 42122,
    CMD_PLAY_STOP = 42028,
    CMD_NOTE_MODE = 42103,
    CMD_DETAIL_MODE = 42106,
    CMD_MIDI_MODE = 42095,
    CMD_WAVE_MODE = 42096,
    CMD_CASCADE = 40028,
    CMD_TILE_HORIZONTALLY = 40004,
    CMD_TILE_VERTICALLY = 40005,
    CMD_CLOSE_ALL = 40006,
    CMD_HELP = 42005,
    CMD_RECORDING_TIPS = 42064,
    CMD_ABOUT = 40002,
    // The instrument window, which the desktop program offers in its Window menu.
    CMD_INSTRUMENTS = 42201,
    // Reached only through the accelerator table: commands of the score scanning code, which
    // do nothing for a song. Named by their keys.
    CMD_SCANNING_CTRL_P = 57607,
    CMD_SCANNING_CTRL_G = 42069,
    CMD_SCANNING_CTRL_D = 42068,
    CMD_SCANNING_SHIFT_T = 42072,
    CMD_SCANNING_CTRL_H = 42061,
    CMD_SCANNING_CTRL_N = 40082
};

// The popup menus of the menu bar. Pitch, Timing and Volume have enabling rules of their own.
enum PopupId {
    POPUP_FILE = 1,
    POPUP_EDIT = 2,
    POPUP_VIEW = 3,
    POPUP_NOTES = 4,
    POPUP_PITCH = 5,
    POPUP_TIMING = 6,
    POPUP_VOLUME = 7,
    POPUP_PLAY = 8,
    POPUP_MODE = 9,
    POPUP_WINDOW = 10,
    POPUP_HELP = 11
};

// One row of the command table.
struct CommandEntry {
    int id;                 // CommandId
    const char* menuText;   // as the menu shows it; the key it names follows a "\t"
    int songViewCode;       // edit commands: the code the song view's edit operation takes; else 0
    bool songItem;          // greyed in menu 109, while no song is open
    const char* scriptName; // the command's name in melodrift-cli scripts: the menu text in lower
                            // case, words joined by hyphens, a value in brackets left to the
                            // statement ("speed-up 10"); "" for commands scripts do not reach
};

// Every menu command, in menu order. The scanning commands are not in it.
extern const CommandEntry commandTable[];
extern const int commandTableCount;
// The row of id; nullptr for an id the menus do not hold.
const CommandEntry* findCommand(int id);
// The first row whose scriptName is name; nullptr for none.
const CommandEntry* findScriptCommand(const std::string& name);
// The menu text before its "\t" ("&Open..." for "&Open...\tCtrl+O"); "" for an unknown id.
std::string commandLabel(int id);
// The key named after the "\t" ("Ctrl+O"); "" when the text names none.
std::string commandKeyText(int id);
// The label as a sentence names it: no "&", no trailing "..." ("Save As" for "Save &As...").
std::string commandName(int id);

// The menu bar, as a flat list: a popup opens with MENU_POPUP and closes with MENU_END.
enum MenuItemKind { MENU_POPUP = 0, MENU_END = 1, MENU_COMMAND = 2, MENU_SEPARATOR = 3 };
struct MenuItem {
    int kind;            // MenuItemKind
    int id;              // PopupId for MENU_POPUP, CommandId for MENU_COMMAND, else 0
    const char* text;    // the popup's title; nullptr for the others (commands take the table's text)
};
extern const MenuItem menuBar[];
extern const int menuBarCount;

// Accelerator table 130. Every key is a virtual key; the modifiers are the table's flags.
constexpr int ACCEL_SHIFT = 0x04;
constexpr int ACCEL_CONTROL = 0x08;
constexpr int ACCEL_ALT = 0x10;
// The virtual keys the table uses besides the letters ('A' .. 'Z').
constexpr int KEY_SPACE = 0x20;
constexpr int KEY_NUMPAD_ADD = 0x6B;
constexpr int KEY_NUMPAD_SUBTRACT = 0x6D;
constexpr int KEY_F1 = 0x70;
constexpr int KEY_F4 = 0x73;

struct Accelerator {
    int virtualKey;   // a letter's upper-case code or one of the KEY_ values
    int modifiers;    // ACCEL_ flags
    int command;      // CommandId
};
extern const Accelerator acceleratorTable[];
extern const int acceleratorTableCount;

// The tips the mode commands and the toolbar's mode buttons show.
constexpr const char* LAYOUT_TIP = "Tip: Hold Q to temporarily toggle between Diatonic and Chromatic layouts";
constexpr const char* NOTE_MODE_TIP = "Tip: Hold W to temporarily toggle between Note and Detail editing/playback";
constexpr const char* PLAYBACK_MODE_TIP = "Tip: Hold E to temporarily toggle between MIDI and Wave editing/playback";

// The filter name of the Open dialog and of the Save dialog in Wave mode (string 183).
constexpr const char* WAVE_FILES_FILTER_NAME = "Wave audio files";
// The filter name of the Save dialog in MIDI mode.
constexpr const char* MIDI_FILES_FILTER_NAME = "MIDI files";
