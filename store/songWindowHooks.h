#pragma once
// The song's window as the layers below the shell reach it: the opening (and the recorder)
// show it when a song starts, redraw it while the song grows and ask the frame to show its
// status again when they end; undo and time editing read and set its scroll position and
// show their tips through it. The shell's main frame defines the hooks with its own functions
// (shell/mainFrame.cpp), which call the desktop program's window when one is installed.

struct SongWindowHooks {
    void (*showSongView)();         // open (or activate) the song's window
    void (*redrawSongView)();       // repaint it after the song changed
    void (*updateFrameDisplay)();   // the toolbar and status bar follow the song's state
    int (*songViewScrollX)();       // the view's horizontal scroll position, pixels
    void (*scrollSongView)(int x);  // scrolls the view to x (kept within its range) and repaints it
    void (*showTip)(const char* tip);   // a tip in the frame's status bar
};
extern const SongWindowHooks songWindowHooks;
