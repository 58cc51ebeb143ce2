// The song view's key table.
#include "notes/songViewKeys.h"

struct SongViewKeyEntry {
    int virtualKey;   // SongViewVirtualKey
    int code;         // without modifiers
};

static const SongViewKeyEntry songViewKeys[] = {
    {VKEY_BACKSPACE, CODE_BACKSPACE}, {VKEY_TAB, CODE_SELECT_NEXT},  {VKEY_ENTER, CODE_ENTER},
    {VKEY_ESCAPE, CODE_ESCAPE},       {VKEY_SPACE, CODE_SPACE},      {VKEY_PAGE_UP, CODE_PAGE_UP},
    {VKEY_PAGE_DOWN, CODE_PAGE_DOWN}, {VKEY_END, CODE_END},          {VKEY_HOME, CODE_HOME},
    {VKEY_LEFT, CODE_NUDGE_LEFT},     {VKEY_UP, CODE_TRANSPOSE_UP},  {VKEY_RIGHT, CODE_NUDGE_RIGHT},
    {VKEY_DOWN, CODE_TRANSPOSE_DOWN}, {VKEY_INSERT, CODE_INSERT},    {VKEY_DELETE, CODE_DELETE},
};

int songViewKeyCode(int virtualKey, int modifiers) {
    bool ctrl = modifiers & KEY_MODIFIER_CTRL, shift = modifiers & KEY_MODIFIER_SHIFT,
         alt = modifiers & KEY_MODIFIER_ALT;
    if ((virtualKey >= 'A' && virtualKey <= 'Z') || (virtualKey >= '0' && virtualKey <= '9'))
        return virtualKey + (ctrl ? CODE_CTRL_OFFSET : 0) + (shift ? CODE_SHIFT_OFFSET : 0) + (alt ? CODE_ALT_OFFSET : 0);
    if (virtualKey >= VKEY_F1 && virtualKey <= VKEY_F12) {
        int n = virtualKey - VKEY_F1;
        return n < 9 ? CODE_F1 + n : CODE_F10 + (n - 9);
    }
    if (shift && virtualKey == VKEY_TAB) return CODE_SELECT_PREVIOUS;
    if (shift && virtualKey == VKEY_LEFT) return CODE_ADD_PREVIOUS;
    if (shift && virtualKey == VKEY_RIGHT) return CODE_ADD_NEXT;
    if (ctrl && virtualKey == VKEY_HOME) return CODE_CTRL_HOME;
    for (const SongViewKeyEntry& entry : songViewKeys)
        if (entry.virtualKey == virtualKey) return entry.code;
    return 0;
}
