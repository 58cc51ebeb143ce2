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

// Each row: the items, a change to a song with audio, five notes, one of them selected, Wave
// and Detail mode and nothing running, and whether the items are then enabled.
TEST(MenuEnabling, EachItemFollowsItsRule) {
    using Change = void (*)(MenuState&);
    const std::vector<int> CUT_COPY_DELETE = {CMD_CUT, CMD_COPY, CMD_DELETE};
    const std::vector<int> UNDO = {CMD_UNDO}, REDO = {CMD_REDO}, PASTE = {CMD_PASTE}, SELECT_ALL = {CMD_SELECT_ALL};
    const std::vector<int> DESELECT_ALL = {CMD_DESELECT_ALL}, SPLIT = {CMD_SPLIT_NOTE}, JOIN = {CMD_JOIN_NOTES};
    const std::vector<int> STRIP = {CMD_STRIP_ENDS}, QUANTIZE = {CMD_QUANTIZE, POPUP_PITCH};
    struct Row {
        const std::vector<int>& items;
        Change change;
        int enabled;
    } rows[] = {
        // cut, copy and delete need audio, a selection and quiet
        {CUT_COPY_DELETE, [](MenuState&) {}, 1},
        {CUT_COPY_DELETE, [](MenuState& s) { s.selectedNoteCount = 0, s.timeSelection = true; }, 1},
        {CUT_COPY_DELETE, [](MenuState& s) { s.selectedNoteCount = 0; }, 0},
        {CUT_COPY_DELETE, [](MenuState& s) { s.audio = false; }, 0},
        {CUT_COPY_DELETE, [](MenuState& s) { s.busy = true; }, 0},
        // select all needs audio only, deselect all a selection too
        {SELECT_ALL, [](MenuState& s) { s.busy = true, s.selectedNoteCount = 0; }, 1},
        {DESELECT_ALL, [](MenuState& s) { s.busy = true; }, 1},
        {DESELECT_ALL, [](MenuState& s) { s.selectedNoteCount = 0; }, 0},
        {DESELECT_ALL, [](MenuState& s) { s.selectedNoteCount = 0, s.timeSelection = true; }, 1},
        {SELECT_ALL, [](MenuState& s) { s.audio = false; }, 0},
        {DESELECT_ALL, [](MenuState& s) { s.audio = false, s.timeSelection = true; }, 0},
        // paste needs audio, the clipboard and quiet
        {PASTE, [](MenuState& s) { s.selectedNoteCount = 0; }, 0},
        {PASTE, [](MenuState& s) { s.clipboardHoldsData = true; }, 1},
        {PASTE, [](MenuState& s) { s.clipboardHoldsData = true, s.busy = true; }, 0},
        {PASTE, [](MenuState& s) { s.clipboardHoldsData = true, s.audio = false; }, 0},
        // undo and redo follow their steps and are grey while busy
        {UNDO, [](MenuState&) {}, 0},
        {REDO, [](MenuState&) {}, 0},
        {UNDO, [](MenuState& s) { s.canUndo = true; }, 1},
        {REDO, [](MenuState& s) { s.canUndo = true; }, 0},
        {REDO, [](MenuState& s) { s.canRedo = true; }, 1},
        {UNDO, [](MenuState& s) { s.canUndo = true, s.busy = true; }, 0},
        {REDO, [](MenuState& s) { s.canRedo = true, s.busy = true; }, 0},
        // split wants exactly one selected note and room for another
        {SPLIT, [](MenuState&) {}, 1},
        {SPLIT, [](MenuState& s) { s.selectedNoteCount = 2; }, 0},
        {SPLIT, [](MenuState& s) { s.noteCount = 16383; }, 1},
        {SPLIT, [](MenuState& s) { s.noteCount = 16384; }, 0},
        {SPLIT, [](MenuState& s) { s.busy = true; }, 0},
        // join follows whether the selection can be joined
        {JOIN, [](MenuState&) {}, 0},
        {JOIN, [](MenuState& s) { s.joinable = true, s.selectedNoteCount = 2; }, 1},
        {JOIN, [](MenuState& s) { s.joinable = true, s.selectedNoteCount = 2, s.busy = true; }, 0},
        // pitch and volume items need a selected note and quiet
        {SELECTED_NOTE_ITEMS, [](MenuState&) {}, 1},
        {SELECTED_NOTE_ITEMS, [](MenuState& s) { s.selectedNoteCount = 0, s.timeSelection = true; }, 0},
        {SELECTED_NOTE_ITEMS, [](MenuState& s) { s.busy = true; }, 0},
        // in Note mode flatten, vibrato and the slides are grey while quantize stays
        {DETAIL_ITEMS, [](MenuState&) {}, 1},
        {DETAIL_ITEMS, [](MenuState& s) { s.noteMode = NOTE_MODE_NOTE; }, 0},
        {QUANTIZE, [](MenuState& s) { s.noteMode = NOTE_MODE_NOTE; }, 1},
        {DETAIL_ITEMS, [](MenuState& s) { s.busy = true; }, 0},
        // in MIDI mode the timing items are grey and the set-to items enabled; in Wave mode the reverse
        {TIMING_ITEMS, [](MenuState& s) { s.playbackMode = PLAYBACK_MODE_MIDI; }, 0},
        {SET_VOLUME_ITEMS, [](MenuState& s) { s.playbackMode = PLAYBACK_MODE_MIDI; }, 1},
        {TIMING_ITEMS, [](MenuState&) {}, 1},
        {SET_VOLUME_ITEMS, [](MenuState&) {}, 0},
        {TIMING_ITEMS, [](MenuState& s) { s.selectedNoteCount = 0; }, 0},
        {SET_VOLUME_ITEMS, [](MenuState& s) { s.playbackMode = PLAYBACK_MODE_MIDI, s.busy = true; }, 0},
        // strip ends needs a note but no selection
        {STRIP, [](MenuState& s) { s.selectedNoteCount = 0; }, 1},
        {STRIP, [](MenuState& s) { s.selectedNoteCount = 0, s.busy = true; }, 0},
        {STRIP, [](MenuState& s) { s.selectedNoteCount = 0, s.noteCount = 0; }, 0},
    };
    int row = 0;
    for (const Row& r : rows) {
        MenuState s = songWithOneSelectedNote();
        r.change(s);
        EXPECT_EQ(enabledOf(r.items, s), std::vector<int>(r.items.size(), r.enabled)) << "row " << row;
        row++;
    }
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
