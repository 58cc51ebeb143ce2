#pragma once
// The shell's key translation for the song view: a key (a virtual key number, as the
// accelerator table names keys) with its modifiers becomes the code handleSongViewCode takes.
// Letters and digits carry their modifiers in the code; of the other keys Shift+Tab,
// Shift+Left and Shift+Right have codes of their own: select the previous note, and add the
// note before or after the selection.

// Virtual keys of the keys the song view knows besides the letters ('A'..'Z') and digits ('0'..'9').
enum SongViewVirtualKey {
    VKEY_BACKSPACE = 0x08,
    VKEY_TAB = 0x09,
    VKEY_ENTER = 0x0D,
    VKEY_ESCAPE = 0x1B,
    VKEY_SPACE = 0x20,
    VKEY_PAGE_UP = 0x21,
    VKEY_PAGE_DOWN = 0x22,
    VKEY_END = 0x23,
    VKEY_HOME = 0x24,
    VKEY_LEFT = 0x25,
    VKEY_UP = 0x26,
    VKEY_RIGHT = 0x27,
    VKEY_DOWN = 0x28,
    VKEY_INSERT = 0x2D,
    VKEY_DELETE = 0x2E,
    VKEY_F1 = 0x70,
    VKEY_F12 = 0x7B
};

// Modifier bits of a key press.
constexpr int KEY_MODIFIER_CTRL = 1;
constexpr int KEY_MODIFIER_SHIFT = 2;
constexpr int KEY_MODIFIER_ALT = 4;

// The song view's codes.
enum SongViewCode {
    CODE_BACKSPACE = 8,
    CODE_ENTER = 13,
    CODE_ESCAPE = 27,
    CODE_HOME = 30,
    CODE_SPACE = 32,
    CODE_CTRL_HOME = 62,
    CODE_PLAY = 80,               // P
    CODE_DELETE = 127,
    CODE_F1 = 385,                // F1 .. F9 are 385 .. 393
    CODE_SELECT_NEXT = 394,       // Tab
    CODE_END = 395,
    CODE_NUDGE_LEFT = 396,
    CODE_NUDGE_RIGHT = 397,
    CODE_TRANSPOSE_DOWN = 398,    // Down
    CODE_TRANSPOSE_UP = 399,      // Up
    CODE_SELECT_PREVIOUS = 410,   // Shift+Tab
    CODE_ADD_PREVIOUS = 412,      // Shift+Left
    CODE_ADD_NEXT = 413,          // Shift+Right
    CODE_PAGE_DOWN = 414,         // transposes down like Down
    CODE_PAGE_UP = 415,           // transposes up like Up
    CODE_F10 = 458,               // F10 .. F12 are 458 .. 460
    CODE_INSERT = 461,
    CODE_SELECT_ALL = 577,        // Ctrl+A
    CODE_COPY = 579,              // Ctrl+C
    CODE_PASTE = 598,             // Ctrl+V
    CODE_CUT = 600,               // Ctrl+X
    CODE_REDO = 601,              // Ctrl+Y
    CODE_UNDO = 602               // Ctrl+Z
};

// Letters and digits: the upper-case character + these for each modifier held.
constexpr int CODE_CTRL_OFFSET = 512;
constexpr int CODE_SHIFT_OFFSET = 1024;
constexpr int CODE_ALT_OFFSET = 2048;

// The code of virtualKey pressed with modifiers; 0 for a key the song view does not take.
int songViewKeyCode(int virtualKey, int modifiers);
