// The enabling rules, row by row: each item is enabled in a state that meets its rule and
// grey as soon as one of its conditions fails; without a song every song item is grey.
#include <gtest/gtest.h>

#include <vector>

#include "frameFixtures.h"
#include "shell/commandTable.h"
#include "shell/menuEnabling.h"

namespace {

// A song with audio, five notes, note 1 selected, Wave and Detail mode, nothing running.
MenuState songWithOneSelectedNote() {
    MenuState s{};
    s.songOpen = true;
    s.audio = true;
    s.noteCount = 5;
    s.selectedNoteCount = 1;
    s.playbackMode = PLAYBACK_MODE_WAVE;
    s.noteMode = NOTE_MODE_DETAIL;
    s.layout = LAYOUT_CHROMATIC;
    return s;
}

std::vector<int> enabledOf(const std::vector<int>& ids, const MenuState& s) {
    std::vector<int> result;
    for (int id : ids) result.push_back(commandEnabled(id, s));
    return result;
}

const std::vector<int> TIMING_ITEMS = {POPUP_TIMING,       CMD_SPEED_UP,      CMD_SLOW_DOWN,
                                       CMD_DOUBLE_SPEED,   CMD_HALVE_SPEED,   CMD_ORIGINAL_SPEED,
                                       CMD_ACCELERANDO,    CMD_DECELERANDO,   CMD_RITENUTO};
const std::vector<int> SET_VOLUME_ITEMS = {CMD_VOLUME_25, CMD_VOLUME_50, CMD_VOLUME_75, CMD_VOLUME_100};
const std::vector<int> DETAIL_ITEMS = {CMD_FLATTEN, CMD_ADD_VIBRATO, CMD_SLIDE_UP, CMD_SLIDE_DOWN};
const std::vector<int> SELECTED_NOTE_ITEMS = {POPUP_PITCH,         CMD_QUANTIZE,        POPUP_VOLUME,
                                              CMD_VOLUME_INCREASE, CMD_VOLUME_DECREASE, CMD_VOLUME_DOUBLE,
                                              CMD_VOLUME_HALVE};

}  // namespace

TEST(MenuEnabling, WithoutASongEverySongItemIsGreyAndTheRestEnabled) {
    MenuState s = songWithOneSelectedNote();
    s.songOpen = false;
    for (int i = 0; i < commandTableCount; i++) {
        const CommandEntry& entry = commandTable[i];
        EXPECT_EQ(commandEnabled(entry.id, s), entry.songItem ? 0 : 1) << entry.menuText;
    }
    for (int id : {POPUP_PITCH, POPUP_TIMING, POPUP_VOLUME}) EXPECT_EQ(commandEnabled(id, s), 0) << id;
    for (int id : {CMD_OPEN, CMD_RECORD, CMD_PREFERENCES, CMD_EXIT, CMD_WAVE_MODE, CMD_CHROMATIC, CMD_HELP})
        EXPECT_EQ(commandEnabled(id, s), 1) << id;
    for (int id : {CMD_CLOSE, CMD_SAVE, CMD_SELECT_ALL, CMD_ZOOM_IN, CMD_QUANTIZE, CMD_PLAY_STOP, CMD_CASCADE})
        EXPECT_EQ(commandEnabled(id, s), 0) << id;
}

TEST(MenuEnabling, AnEmptySongGreysEveryNoteEditAndTimingItemAndSelectAll) {
    MenuState s{};
    s.songOpen = true;
    s.playbackMode = PLAYBACK_MODE_WAVE;
    s.noteMode = NOTE_MODE_DETAIL;
    for (int id : std::vector<int>{CMD_UNDO, CMD_REDO, CMD_CUT, CMD_COPY, CMD_PASTE, CMD_DELETE, CMD_SELECT_ALL, CMD_DESELECT_ALL,
                   CMD_SPLIT_NOTE, CMD_JOIN_NOTES, CMD_STRIP_ENDS, POPUP_PITCH, POPUP_TIMING, POPUP_VOLUME})
        EXPECT_EQ(commandEnabled(id, s), 0) << id;
    for (const std::vector<int>* group : {&TIMING_ITEMS, &SET_VOLUME_ITEMS, &DETAIL_ITEMS, &SELECTED_NOTE_ITEMS})
        for (int id : *group) EXPECT_EQ(commandEnabled(id, s), 0) << id;
    for (int id : {CMD_SAVE, CMD_CLOSE, CMD_ZOOM_IN, CMD_PLAY_STOP}) EXPECT_EQ(commandEnabled(id, s), 1) << id;
}

TEST(MenuEnabling, CutCopyAndDeleteNeedAudioASelectionAndQuiet) {
    const std::vector<int> items = {CMD_CUT, CMD_COPY, CMD_DELETE};
    MenuState s = songWithOneSelectedNote();
    EXPECT_EQ(enabledOf(items, s), std::vector<int>({1, 1, 1}));
    MenuState timeOnly = s;
    timeOnly.selectedNoteCount = 0;
    timeOnly.timeSelection = true;
    EXPECT_EQ(enabledOf(items, timeOnly), std::vector<int>({1, 1, 1}));
    MenuState none = s;
    none.selectedNoteCount = 0;
    EXPECT_EQ(enabledOf(items, none), std::vector<int>({0, 0, 0}));
    MenuState noAudio = s;
    noAudio.audio = false;
    EXPECT_EQ(enabledOf(items, noAudio), std::vector<int>({0, 0, 0}));
    MenuState busy = s;
    busy.busy = true;
    EXPECT_EQ(enabledOf(items, busy), std::vector<int>({0, 0, 0}));
}

TEST(MenuEnabling, SelectAllNeedsAudioOnlyAndDeselectAllASelectionToo) {
    MenuState s = songWithOneSelectedNote();
    s.busy = true;
    EXPECT_EQ(commandEnabled(CMD_SELECT_ALL, s), 1);
    EXPECT_EQ(commandEnabled(CMD_DESELECT_ALL, s), 1);
    s.selectedNoteCount = 0;
    EXPECT_EQ(commandEnabled(CMD_SELECT_ALL, s), 1);
    EXPECT_EQ(commandEnabled(CMD_DESELECT_ALL, s), 0);
    s.timeSelection = true;
    EXPECT_EQ(commandEnabled(CMD_DESELECT_ALL, s), 1);
    s.audio = false;
    EXPECT_EQ(commandEnabled(CMD_SELECT_ALL, s), 0);
    EXPECT_EQ(commandEnabled(CMD_DESELECT_ALL, s), 0);
}

TEST(MenuEnabling, PasteNeedsAudioTheClipboardAndQuiet) {
    MenuState s = songWithOneSelectedNote();
    s.selectedNoteCount = 0;
    EXPECT_EQ(commandEnabled(CMD_PASTE, s), 0);
    s.clipboardHoldsData = true;
    EXPECT_EQ(commandEnabled(CMD_PASTE, s), 1);
    s.busy = true;
    EXPECT_EQ(commandEnabled(CMD_PASTE, s), 0);
    s.busy = false;
    s.audio = false;
    EXPECT_EQ(commandEnabled(CMD_PASTE, s), 0);
}

TEST(MenuEnabling, UndoAndRedoFollowTheirStepsAndAreGreyWhileBusy) {
    MenuState s = songWithOneSelectedNote();
    EXPECT_EQ(enabledOf({CMD_UNDO, CMD_REDO}, s), std::vector<int>({0, 0}));
    s.canUndo = true;
    EXPECT_EQ(enabledOf({CMD_UNDO, CMD_REDO}, s), std::vector<int>({1, 0}));
    s.canRedo = true;
    s.canUndo = false;
    EXPECT_EQ(enabledOf({CMD_UNDO, CMD_REDO}, s), std::vector<int>({0, 1}));
    s.canUndo = true;
    s.busy = true;
    EXPECT_EQ(enabledOf({CMD_UNDO, CMD_REDO}, s), std::vector<int>({0, 0}));
}

TEST(MenuEnabling, SplitNoteWantsExactlyOneSelectedNoteAndRoomForAnother) {
    MenuState s = songWithOneSelectedNote();
    EXPECT_EQ(commandEnabled(CMD_SPLIT_NOTE, s), 1);
    s.selectedNoteCount = 2;
    EXPECT_EQ(commandEnabled(CMD_SPLIT_NOTE, s), 0);
    s.selectedNoteCount = 1;
    s.noteCount = 16383;
    EXPECT_EQ(commandEnabled(CMD_SPLIT_NOTE, s), 1);
    s.noteCount = 16384;
    EXPECT_EQ(commandEnabled(CMD_SPLIT_NOTE, s), 0);
    s.noteCount = 5;
    s.busy = true;
    EXPECT_EQ(commandEnabled(CMD_SPLIT_NOTE, s), 0);
}

TEST(MenuEnabling, JoinNotesFollowsWhetherTheSelectionCanBeJoined) {
    MenuState s = songWithOneSelectedNote();
    EXPECT_EQ(commandEnabled(CMD_JOIN_NOTES, s), 0);
    s.joinable = true;
    s.selectedNoteCount = 2;
    EXPECT_EQ(commandEnabled(CMD_JOIN_NOTES, s), 1);
    s.busy = true;
    EXPECT_EQ(commandEnabled(CMD_JOIN_NOTES, s), 0);
}

TEST(MenuEnabling, PitchAndVolumeItemsNeedASelectedNoteAndQuiet) {
    MenuState s = songWithOneSelectedNote();
    EXPECT_EQ(enabledOf(SELECTED_NOTE_ITEMS, s), std::vector<int>(SELECTED_NOTE_ITEMS.size(), 1));
    MenuState timeOnly = s;
    timeOnly.selectedNoteCount = 0;
    timeOnly.timeSelection = true;
    EXPECT_EQ(enabledOf(SELECTED_NOTE_ITEMS, timeOnly), std::vector<int>(SELECTED_NOTE_ITEMS.size(), 0));
    MenuState busy = s;
    busy.busy = true;
    EXPECT_EQ(enabledOf(SELECTED_NOTE_ITEMS, busy), std::vector<int>(SELECTED_NOTE_ITEMS.size(), 0));
}

TEST(MenuEnabling, InNoteModeFlattenVibratoAndTheSlidesAreGreyWhileQuantizeStays) {
    MenuState s = songWithOneSelectedNote();
    EXPECT_EQ(enabledOf(DETAIL_ITEMS, s), std::vector<int>(DETAIL_ITEMS.size(), 1));
    s.noteMode = NOTE_MODE_NOTE;
    EXPECT_EQ(enabledOf(DETAIL_ITEMS, s), std::vector<int>(DETAIL_ITEMS.size(), 0));
    EXPECT_EQ(commandEnabled(CMD_QUANTIZE, s), 1);
    EXPECT_EQ(commandEnabled(POPUP_PITCH, s), 1);
    s.noteMode = NOTE_MODE_DETAIL;
    s.busy = true;
    EXPECT_EQ(enabledOf(DETAIL_ITEMS, s), std::vector<int>(DETAIL_ITEMS.size(), 0));
}

TEST(MenuEnabling, InMidiModeTheTimingItemsAreGreyAndTheSetToItemsEnabledInWaveModeTheReverse) {
    MenuState s = songWithOneSelectedNote();
    s.playbackMode = PLAYBACK_MODE_MIDI;
    EXPECT_EQ(enabledOf(TIMING_ITEMS, s), std::vector<int>(TIMING_ITEMS.size(), 0));
    EXPECT_EQ(enabledOf(SET_VOLUME_ITEMS, s), std::vector<int>(SET_VOLUME_ITEMS.size(), 1));
    s.playbackMode = PLAYBACK_MODE_WAVE;
    EXPECT_EQ(enabledOf(TIMING_ITEMS, s), std::vector<int>(TIMING_ITEMS.size(), 1));
    EXPECT_EQ(enabledOf(SET_VOLUME_ITEMS, s), std::vector<int>(SET_VOLUME_ITEMS.size(), 0));
    s.selectedNoteCount = 0;
    EXPECT_EQ(enabledOf(TIMING_ITEMS, s), std::vector<int>(TIMING_ITEMS.size(), 0));
    s.selectedNoteCount = 1;
    s.playbackMode = PLAYBACK_MODE_MIDI;
    s.busy = true;
    EXPECT_EQ(enabledOf(SET_VOLUME_ITEMS, s), std::vector<int>(SET_VOLUME_ITEMS.size(), 0));
}

TEST(MenuEnabling, StripEndsNeedsANoteButNoSelection) {
    MenuState s = songWithOneSelectedNote();
    s.selectedNoteCount = 0;
    EXPECT_EQ(commandEnabled(CMD_STRIP_ENDS, s), 1);
    s.busy = true;
    EXPECT_EQ(commandEnabled(CMD_STRIP_ENDS, s), 0);
    s.busy = false;
    s.noteCount = 0;
    EXPECT_EQ(commandEnabled(CMD_STRIP_ENDS, s), 0);
}

TEST(MenuEnabling, ModeItemsAreCheckedForTheCurrentModes) {
    MenuState s = songWithOneSelectedNote();
    std::vector<int> checks;
    for (int id : {CMD_CHROMATIC, CMD_DIATONIC, CMD_NOTE_MODE, CMD_DETAIL_MODE, CMD_MIDI_MODE, CMD_WAVE_MODE})
        checks.push_back(commandChecked(id, s));
    EXPECT_EQ(checks, std::vector<int>({1, 0, 0, 1, 0, 1}));
    s.layout = LAYOUT_DIATONIC | LAYOUT_CHROMATIC;
    s.noteMode = NOTE_MODE_NOTE;
    s.playbackMode = PLAYBACK_MODE_MIDI;
    checks.clear();
    for (int id : {CMD_CHROMATIC, CMD_DIATONIC, CMD_NOTE_MODE, CMD_DETAIL_MODE, CMD_MIDI_MODE, CMD_WAVE_MODE})
        checks.push_back(commandChecked(id, s));
    EXPECT_EQ(checks, std::vector<int>({1, 1, 1, 0, 1, 0}));
}

class MenuEnablingState : public FrameTest {};

TEST_F(MenuEnablingState, TheStateIsReadFromTheSongTheSelectionAndTheModes) {
    MenuState empty = currentMenuState();
    EXPECT_FALSE(empty.songOpen);
    EXPECT_FALSE(empty.audio);
    EXPECT_EQ(empty.noteCount, 0);

    openSong(256, 4);
    ASSERT_EQ(selectNote(1), 1);
    ASSERT_EQ(selectNote(2), 1);
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    displayModes.noteMode = NOTE_MODE_NOTE;
    globalSettings.scaleMode = LAYOUT_DIATONIC;
    audioActivity.opening = true;
    MenuState s = currentMenuState();
    EXPECT_TRUE(s.songOpen);
    EXPECT_TRUE(s.audio);
    EXPECT_EQ(s.noteCount, 4);
    EXPECT_EQ(s.selectedNoteCount, 2);
    EXPECT_TRUE(s.joinable);
    EXPECT_TRUE(s.busy);
    EXPECT_FALSE(s.timeSelection);
    EXPECT_EQ(s.playbackMode, PLAYBACK_MODE_MIDI);
    EXPECT_EQ(s.noteMode, NOTE_MODE_NOTE);
    EXPECT_EQ(s.layout, LAYOUT_DIATONIC);
}

TEST_F(MenuEnablingState, OnlyATimeSelectionOfPositiveLengthCounts) {
    openSong(256, 0);
    selection.timeSelectionStart = 0.5f;
    selection.timeSelectionEnd = 0.5f;
    EXPECT_FALSE(currentMenuState().timeSelection);
    selection.timeSelectionEnd = 0.75f;
    EXPECT_TRUE(currentMenuState().timeSelection);
    selection.timeSelectionStart = NO_TIME_SELECTION;
    EXPECT_FALSE(currentMenuState().timeSelection);
}

TEST_F(MenuEnablingState, UndoRedoAndTheClipboardAreAskedOfTheirOwners) {
    openSong(256, 1);
    EXPECT_FALSE(currentMenuState().canUndo);
    EXPECT_FALSE(currentMenuState().clipboardHoldsData);
    commandOperations.canUndo = [] { return 1; };
    commandOperations.canRedo = [] { return 0; };
    commandOperations.clipboardKind = [] { return 3; };
    MenuState s = currentMenuState();
    EXPECT_TRUE(s.canUndo);
    EXPECT_FALSE(s.canRedo);
    EXPECT_TRUE(s.clipboardHoldsData);
    EXPECT_EQ(commandEnabled(CMD_PASTE, s), 1);
}
