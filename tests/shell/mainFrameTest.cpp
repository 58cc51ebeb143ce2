// The engine's side of the main frame: the close guards and their messages, the stored
// placement, the modes taken from the settings, and the song's window opening and closing.
#include <gtest/gtest.h>

#include <tuple>

#include "frameFixtures.h"

class CommandTableFrame : public FrameTest {};

TEST_F(CommandTableFrame, TheFrameClosesOnlyWhenNothingIsRecordedOrOpened) {
    EXPECT_EQ(frameMayClose(), 1);
    EXPECT_EQ(messageCount(), 0);
    audioActivity.opening = true;
    EXPECT_EQ(frameMayClose(), 0);
    EXPECT_EQ(lastMessageText(), "Sorry - this cannot be done whilst opening audio.");
    audioActivity.recording = true;
    EXPECT_EQ(frameMayClose(), 0);
    EXPECT_EQ(lastMessageText(), "Sorry - this cannot be done whilst recording audio.");
    EXPECT_EQ(messageCount(), 2);
    audioActivity = AudioActivity{};
    EXPECT_EQ(songWindowMayClose(), 1);
    audioActivity.recording = true;
    EXPECT_EQ(songWindowMayClose(), 0);
}

TEST_F(CommandTableFrame, WithoutAStoredPlacementTheFrameOpensMaximized) {
    WindowPlacement p{};
    EXPECT_EQ(readMainWindowPlacement(&p), 0);
}

TEST_F(CommandTableFrame, APlacementIsStoredAsTheElevenFieldRecordAndReadBack) {
    storeMainWindowPlacement(WindowPlacement{SHOW_NORMAL, -1, -1, -1, -1, 100, 50, 1124, 818});
    ASSERT_TRUE(globalSettings.hasMainWindowPosition);
    const uint8_t* b = globalSettings.mainWindowPosition;
    EXPECT_EQ(b[0], 44);                      // length
    EXPECT_EQ(b[8], 1);                       // show state
    EXPECT_EQ(b[12], 0xFF);                   // minimized x = -1
    EXPECT_EQ(b[28] | b[29] << 8, 100);       // left
    EXPECT_EQ(b[40] | b[41] << 8, 818);       // bottom
    WindowPlacement p{};
    ASSERT_EQ(readMainWindowPlacement(&p), 1);
    EXPECT_EQ(std::tuple(p.showState, p.left, p.top, p.right, p.bottom), std::tuple(SHOW_NORMAL, 100, 50, 1124, 818));
}

TEST_F(CommandTableFrame, AShowStateOtherThanNormalOrMaximizedOpensMaximized) {
    for (int state : {0, SHOW_MINIMIZED, 7, -3}) {
        storeMainWindowPlacement(WindowPlacement{state, 0, 0, 0, 0, 10, 10, 500, 400});
        WindowPlacement p{};
        ASSERT_EQ(readMainWindowPlacement(&p), 1);
        EXPECT_EQ(p.showState, SHOW_MAXIMIZED) << state;
    }
    storeMainWindowPlacement(WindowPlacement{SHOW_MAXIMIZED, 0, 0, 0, 0, 10, 10, 500, 400});
    WindowPlacement p{};
    readMainWindowPlacement(&p);
    EXPECT_EQ(p.showState, SHOW_MAXIMIZED);
}

TEST_F(CommandTableFrame, TheModesComeFromTheSettingsAndDamagedValuesTakeTheDefaults) {
    globalSettings.playbackMode = PLAYBACK_MODE_MIDI;
    globalSettings.noteMode = NOTE_MODE_NOTE;
    globalSettings.scaleMode = LAYOUT_DIATONIC | LAYOUT_CHROMATIC;
    applyDisplayModeSettings();
    EXPECT_EQ(displayModes.playbackMode, PLAYBACK_MODE_MIDI);
    EXPECT_EQ(displayModes.noteMode, NOTE_MODE_NOTE);
    EXPECT_EQ(globalSettings.scaleMode, 48);

    globalSettings.playbackMode = 3;
    globalSettings.noteMode = 0;
    globalSettings.scaleMode = 64;
    applyDisplayModeSettings();
    EXPECT_EQ(displayModes.playbackMode, PLAYBACK_MODE_WAVE);
    EXPECT_EQ(displayModes.noteMode, NOTE_MODE_DETAIL);
    EXPECT_EQ(globalSettings.playbackMode, PLAYBACK_MODE_WAVE);
    EXPECT_EQ(globalSettings.scaleMode, LAYOUT_CHROMATIC);
}

TEST_F(CommandTableFrame, ClosingTheSongWindowClosesTheSong) {
    openSong(256, 3);
    selectNote(0);
    EXPECT_TRUE(frameState.songWindowOpen);
    songWindowClosed();
    EXPECT_FALSE(frameState.songWindowOpen);
    EXPECT_EQ(song.blockCount, 0u);
    EXPECT_EQ(noteList.count, 0);
    EXPECT_EQ(selection.selectedNoteCount, 0);
}

namespace {
int shownWindows = 0;
std::string shownTip;
const FrameWindowFunctions countingWindows = {
    [] { shownWindows++; }, nullptr, [](const std::string& tip) { shownTip = tip; }, nullptr};
}  // namespace

TEST_F(CommandTableFrame, TheDesktopProgramsWindowFunctionsAreCalledWhenInstalled) {
    shownWindows = 0;
    shownTip.clear();
    setFrameWindowFunctions(&countingWindows);
    showSongView();
    setLayout(LAYOUT_DIATONIC);
    setFrameWindowFunctions(nullptr);
    EXPECT_EQ(shownWindows, 1);
    EXPECT_FALSE(frameState.songWindowOpen);   // the program reports its window itself
    EXPECT_EQ(shownTip, "Tip: Hold Q to temporarily toggle between Diatonic and Chromatic layouts");
}
