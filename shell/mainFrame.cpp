// The engine's side of the main frame: its state, the modes, the guards, the song's close
// and the stored placement.
#include "shell/mainFrame.h"

#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "playback/playback.h"
#include "platform/ui.h"
#include "playback/songViewGeometry.h"
#include "shell/closeSong.h"
#include "shell/commandOperations.h"
#include "shell/commandTable.h"
#include "shell/settings.h"
#include "store/song.h"
#include "store/songWindowHooks.h"

FrameState frameState;

static const FrameWindowFunctions* windowFunctions = nullptr;

void setFrameWindowFunctions(const FrameWindowFunctions* functions) { windowFunctions = functions; }

void resetFrameState() { frameState = FrameState{}; }

void showSongView() {
    if (windowFunctions && windowFunctions->showSongWindow) windowFunctions->showSongWindow();
    else songWindowOpened();
}

void redrawSongView() {
    if (windowFunctions && windowFunctions->redrawSongWindow) windowFunctions->redrawSongWindow();
}

void songWindowOpened() { frameState.songWindowOpen = true; }

static int songViewScrollX() { return songViewGeometry.scrollX; }

static void scrollSongView(int x) {
    setSongViewScroll(x, songViewGeometry.scrollY);
    redrawSongView();
}

static void showTip(const char* tip);

const SongWindowHooks songWindowHooks = {
    .showSongView = showSongView,
    .redrawSongView = redrawSongView,
    .updateFrameDisplay = updateFrameDisplay,
    .songViewScrollX = songViewScrollX,
    .scrollSongView = scrollSongView,
    .showTip = showTip,
};

void setFrameModal(bool on) {
    if (on) frameState.modalDepth++;
    else if (frameState.modalDepth > 0) frameState.modalDepth--;
}

int commandAllowedWhileModal(int command) {
    switch (command) {
    case CMD_ABOUT:
    case CMD_HELP:
    case CMD_RECORDING_TIPS:
    case CMD_CASCADE:
    case CMD_TILE_HORIZONTALLY:
    case CMD_TILE_VERTICALLY:
    case CMD_CLOSE:
    case CMD_EXIT: return 1;
    default: return 0;
    }
}

static void showTip(const char* tip) {
    frameState.lastTip = tip;
    if (windowFunctions && windowFunctions->showTip) windowFunctions->showTip(tip);
}

void updateFrameDisplay() {
    if (windowFunctions && windowFunctions->updateFrame) windowFunctions->updateFrame();
}

static void pauseForModeChange() {
    if (commandOperations.pausePlayback) commandOperations.pausePlayback();
}

void setPlaybackMode(int mode) {
    if (mode != PLAYBACK_MODE_MIDI && mode != PLAYBACK_MODE_WAVE) return;
    if (mode != displayModes.playbackMode) pauseForModeChange();
    displayModes.playbackMode = mode;
    globalSettings.playbackMode = mode;
    showTip(PLAYBACK_MODE_TIP);
    updateFrameDisplay();
    redrawSongView();
}

void setNoteMode(int mode) {
    if (mode != NOTE_MODE_NOTE && mode != NOTE_MODE_DETAIL) return;
    if (mode != displayModes.noteMode) pauseForModeChange();
    displayModes.noteMode = mode;
    globalSettings.noteMode = mode;
    showTip(NOTE_MODE_TIP);
    updateFrameDisplay();
    redrawSongView();
}

void setLayout(int layout) {
    if (layout != LAYOUT_DIATONIC && layout != LAYOUT_CHROMATIC) return;
    globalSettings.scaleMode = layout;
    showTip(LAYOUT_TIP);
    updateFrameDisplay();
    redrawSongView();
}

void applyDisplayModeSettings() {
    GlobalSettings defaults;
    GlobalSettings& s = globalSettings;
    if (s.playbackMode != PLAYBACK_MODE_MIDI && s.playbackMode != PLAYBACK_MODE_WAVE) s.playbackMode = defaults.playbackMode;
    if (s.noteMode != NOTE_MODE_NOTE && s.noteMode != NOTE_MODE_DETAIL) s.noteMode = defaults.noteMode;
    // Both layout bits together are a layout of its own (the mean of the two); no bit at all
    // would leave the song view without a pitch axis.
    if ((s.scaleMode & (LAYOUT_DIATONIC | LAYOUT_CHROMATIC)) == 0 || (s.scaleMode & ~(LAYOUT_DIATONIC | LAYOUT_CHROMATIC)))
        s.scaleMode = defaults.scaleMode;
    displayModes.playbackMode = s.playbackMode;
    displayModes.noteMode = s.noteMode;
}

int frameMayClose() { return refuseWhileBusy() ? 0 : 1; }

int songWindowMayClose() { return refuseWhileBusy() ? 0 : 1; }

void songWindowClosed() {
    frameState.songWindowOpen = false;
    // The playback files are the song's working files, and nothing of it may sound on.
    stopPlayback();
    closeSong();
    // The next song must not be saved over this one's file without a dialog.
    resetSongNames();
}

// The record's eleven little-endian 32-bit fields: length, flags, show state, minimized x
// and y, maximized x and y, normal left, top, right, bottom.
static int32_t field(const uint8_t* bytes, int index) {
    const uint8_t* b = bytes + 4 * index;
    return int32_t(uint32_t(b[0]) | uint32_t(b[1]) << 8 | uint32_t(b[2]) << 16 | uint32_t(b[3]) << 24);
}

static void putField(uint8_t* bytes, int index, int32_t value) {
    uint8_t* b = bytes + 4 * index;
    for (int i = 0; i < 4; i++) b[i] = uint8_t(uint32_t(value) >> (8 * i));
}

int readMainWindowPlacement(WindowPlacement* p) {
    if (!globalSettings.hasMainWindowPosition) return 0;
    const uint8_t* bytes = globalSettings.mainWindowPosition;
    *p = WindowPlacement{field(bytes, 2), field(bytes, 3), field(bytes, 4), field(bytes, 5),
                         field(bytes, 6), field(bytes, 7), field(bytes, 8), field(bytes, 9), field(bytes, 10)};
    if (p->showState != SHOW_NORMAL && p->showState != SHOW_MAXIMIZED) p->showState = SHOW_MAXIMIZED;
    return 1;
}

void storeMainWindowPlacement(const WindowPlacement& p) {
    uint8_t* bytes = globalSettings.mainWindowPosition;
    const int32_t fields[11] = {WINDOW_PLACEMENT_SIZE, 0, p.showState, p.minX, p.minY, p.maxX, p.maxY,
                                p.left, p.top, p.right, p.bottom};
    for (int i = 0; i < 11; i++) putField(bytes, i, fields[i]);
    globalSettings.hasMainWindowPosition = true;
}
