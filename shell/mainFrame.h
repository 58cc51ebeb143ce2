#pragma once
// The main frame as the engine sees it: whether the song's window is open, the modal state
// that filters commands, the three display modes with their tips, the close guards, the
// frame's stored placement and the song's close. The desktop program installs the window
// functions; without them (tests, the command-line tool) the state is kept all the same.

#include <cstdint>
#include <string>

struct FrameState {
    bool songWindowOpen;          // the song's child window exists (menu 108; else menu 109)
    int modalDepth;               // > 0 while a progress or dialog state holds the frame (setFrameModal)
    bool onlySaveSelectedRange;   // the Save dialog's check box; kept while the program runs
    std::string lastTip;          // the tip the last mode command showed
};
extern FrameState frameState;

// What the desktop program does for the engine's requests. A null entry is skipped.
struct FrameWindowFunctions {
    void (*showSongWindow)();     // create (or activate) the song's child window
    void (*redrawSongWindow)();   // repaint it after the song or the view changed
    void (*showTip)(const std::string& text);
    void (*updateFrame)();        // toolbar and status bar follow the modes and zoom
};
void setFrameWindowFunctions(const FrameWindowFunctions* functions);   // nullptr: none

// Back to the start state: no song window, not modal, check box off, no tip.
void resetFrameState();

// Opens the song's window (opening and recording call it); redraws it.
void showSongView();
void redrawSongView();
// Asks the frame to show the current modes and zoom again.
void updateFrameDisplay();
// The desktop program reports its song window's creation; the song is then open.
void songWindowOpened();

// Sets (on) or releases the modal state; calls nest.
void setFrameModal(bool on);
// 1 when command may run while the frame is modal: About, Help, Recording Tips, Cascade,
// Tile Horizontally, Tile Vertically, Close and Exit.
int commandAllowedWhileModal(int command);

// The layouts ("CS Scale Mode" bits) and the mode setters. Each sets the live mode and its
// setting, shows the mode's tip and asks the frame to follow; a change of playback or note
// mode pauses playback first.
constexpr int LAYOUT_DIATONIC = 16;
constexpr int LAYOUT_CHROMATIC = 32;
void setPlaybackMode(int mode);   // PLAYBACK_MODE_MIDI or PLAYBACK_MODE_WAVE
void setNoteMode(int mode);       // NOTE_MODE_NOTE or NOTE_MODE_DETAIL
void setLayout(int layout);       // LAYOUT_DIATONIC or LAYOUT_CHROMATIC
// The live modes from the settings, after the global settings were read. A damaged value
// takes the setting's default (Wave, Detail, Chromatic).
void applyDisplayModeSettings();


// The guard of closing the frame and of the end of the session: 0 after "Sorry - this cannot
// be done whilst recording audio." or "... whilst opening audio.", else 1.
int frameMayClose();
// The song window's answer when it is asked to close: the same guard, since the worker
// writes the song's working files while a recording or an opening runs.
int songWindowMayClose();
// The song's window was closed: the song closes (working files, notes, selection, names).
void songWindowClosed();

// "Main window position": the 44-byte window placement record.
struct WindowPlacement {
    int32_t showState;                 // 1 normal, 2 minimized, 3 maximized
    int32_t minX, minY;                // minimized position (unused here, kept)
    int32_t maxX, maxY;                // maximized position (unused here, kept)
    int32_t left, top, right, bottom;  // the normal (restored) rectangle, pixels
};
constexpr int SHOW_NORMAL = 1;
constexpr int SHOW_MINIMIZED = 2;
constexpr int SHOW_MAXIMIZED = 3;
// The stored placement: 1 with *placement filled and a show state other than normal or
// maximized replaced by maximized; 0 when none is stored (the frame opens maximized).
int readMainWindowPlacement(WindowPlacement* placement);
// Keeps placement for "Main window position" (written with the global settings).
void storeMainWindowPlacement(const WindowPlacement& placement);
