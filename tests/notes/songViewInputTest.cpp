// The song view's key translation and its edit codes on an opened song: delete in both
// modes, paste arming, Escape, select next/previous/extend and select all.
#include <gtest/gtest.h>

#include "audio/openingFixtures.h"
#include "notes/displayModes.h"
#include "notes/selection.h"
#include "notes/songViewInput.h"
#include "notes/songViewKeys.h"
#include "store/timeEditing.h"
#include "store/undo.h"

TEST(SongViewKeys, KeysBecomeTheViewsCodes) {
    struct Case {
        int key;
        int modifiers;
        int code;
    } cases[] = {
        {VKEY_BACKSPACE, 0, 8},
        {VKEY_DELETE, 0, 127},
        {VKEY_ESCAPE, 0, 27},
        {VKEY_ENTER, 0, 13},
        {VKEY_TAB, 0, 394},
        {VKEY_TAB, KEY_MODIFIER_SHIFT, 410},
        {VKEY_LEFT, KEY_MODIFIER_SHIFT, 412},
        {VKEY_RIGHT, KEY_MODIFIER_SHIFT, 413},
        {VKEY_LEFT, 0, 396},
        {VKEY_RIGHT, 0, 397},
        {VKEY_DOWN, 0, 398},
        {VKEY_UP, 0, 399},
        {VKEY_PAGE_DOWN, 0, 414},
        {VKEY_PAGE_UP, 0, 415},
        {VKEY_HOME, 0, 30},
        {VKEY_HOME, KEY_MODIFIER_CTRL, 62},
        {VKEY_END, 0, 395},
        {VKEY_INSERT, 0, 461},
        {VKEY_F1, 0, 385},
        {VKEY_F1 + 8, 0, 393},
        {VKEY_F1 + 9, 0, 458},
        {VKEY_F12, 0, 460},
        {'P', 0, 80},
        {'A', KEY_MODIFIER_CTRL, 577},
        {'C', KEY_MODIFIER_CTRL, 579},
        {'X', KEY_MODIFIER_CTRL, 600},
        {'V', KEY_MODIFIER_CTRL, 598},
        {'Z', KEY_MODIFIER_CTRL, 602},
        {'Y', KEY_MODIFIER_CTRL, 601},
        {'7', KEY_MODIFIER_SHIFT | KEY_MODIFIER_ALT, '7' + 1024 + 2048},
        {0x91, 0, 0},   // a key the view does not take
    };
    for (const Case& c : cases) EXPECT_EQ(songViewKeyCode(c.key, c.modifiers), c.code) << c.key << "+" << c.modifiers;
}

class SongViewCodeTest : public OpeningTest {
protected:
    void SetUp() override {
        OpeningTest::SetUp();
        openAndWait(writeMono("melody.wav", melodyBytes(3.0)));
        resetSongViewInput();
        resetTimeClipboard();
        resetNoteList();
        resetSelection();
        for (int k = 0; k < 6; k++) {
            Note n{};
            n.pitch = 440.0f;
            n.midiNote = uint8_t(60 + k);
            n.waveStart = n.midiStart = float(snapTimeToBlock(0.2 + 0.4 * k));
            n.waveEnd = n.midiEnd = float(snapTimeToBlock(0.5 + 0.4 * k));
            appendNote(n);
        }
        clearUiCalls();
    }
    void TearDown() override {
        resetSongViewInput();
        resetTimeClipboard();
        OpeningTest::TearDown();
    }
    static std::vector<int> selected() {
        return std::vector<int>(selection.selectedNotes, selection.selectedNotes + selection.selectedNoteCount);
    }
    static std::vector<int> pitches() {
        std::vector<int> p;
        for (int i = 0; i < noteList.count; i++) p.push_back(noteList.notes[i].midiNote);
        return p;
    }
};

TEST_F(SongViewCodeTest, DeleteInMidiModeRemovesTheSelectedNotesAndSelectsTheNextOne) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    uint32_t blocks = song.blockCount;
    selectNote(2);
    selectNote(5);
    handleSongViewCode(CODE_DELETE);
    EXPECT_EQ(pitches(), (std::vector<int>{60, 61, 63, 64}));
    EXPECT_EQ(selected(), std::vector<int>{2});
    EXPECT_EQ(song.blockCount, blocks) << "no time goes in MIDI mode";
    EXPECT_TRUE(song.changed);
    handleSongViewCode(CODE_UNDO);
    EXPECT_EQ(pitches(), (std::vector<int>{60, 61, 62, 63, 64, 65}));
}

TEST_F(SongViewCodeTest, BackspaceOnTheFirstNoteSelectsTheFirstNoteLeft) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    selectNote(0);
    handleSongViewCode(CODE_BACKSPACE);
    EXPECT_EQ(pitches().front(), 61);
    EXPECT_EQ(selected(), std::vector<int>{0});
    selection.selectedNoteCount = 0;
    selectNote(3);
    handleSongViewCode(CODE_BACKSPACE);
    EXPECT_EQ(selected(), std::vector<int>{2}) << "the note before the deleted one";
}

TEST_F(SongViewCodeTest, DeleteInWaveModeCutsTheTimeSelectionBlockAligned) {
    displayModes.playbackMode = PLAYBACK_MODE_WAVE;
    selection.timeSelectionStart = 0.9f;
    selection.timeSelectionEnd = 1.9f;
    double length = songDuration();
    double cut = snapTimeToBlock(1.9) - snapTimeToBlock(0.9);
    handleSongViewCode(CODE_DELETE);
    EXPECT_NEAR(songDuration(), length - cut, 1e-9);
    EXPECT_EQ(selection.selectedNoteCount, 0);
    handleSongViewCode(CODE_UNDO);
    EXPECT_NEAR(songDuration(), length, 1e-9);
}

TEST_F(SongViewCodeTest, CutThenPasteMovesTheSelectedNotesTime) {
    displayModes.playbackMode = PLAYBACK_MODE_WAVE;
    selectNote(1);
    selectionChanged();
    double length = songDuration();
    handleSongViewCode(CODE_CUT);
    EXPECT_EQ(noteList.count, 5);
    EXPECT_EQ(timeClipboard.kind, EDIT_RANGE_TIME);
    EXPECT_LT(songDuration(), length);
    selection.selectedNoteCount = 0;
    selection.timeSelectionStart = selection.timeSelectionEnd = float(snapTimeToBlock(0.1));
    handleSongViewCode(CODE_PASTE);
    EXPECT_NEAR(songDuration(), length, 1e-9);
    EXPECT_EQ(pitches(), (std::vector<int>{61, 60, 62, 63, 64, 65}));
    EXPECT_EQ(lastMessageText(), "") << "no message for a paste that worked";
}

TEST_F(SongViewCodeTest, PasteWithoutASelectionArmsAndEscapeDisarms) {
    selectNote(1);
    selectionChanged();
    handleSongViewCode(CODE_COPY);
    resetSelection();
    songViewInput.hintShown = false;
    uint32_t blocks = song.blockCount;
    handleSongViewCode(CODE_PASTE);
    EXPECT_EQ(songViewInput.pasteArmed, EDIT_RANGE_TIME);
    EXPECT_EQ(song.blockCount, blocks);
    EXPECT_EQ(frameState.lastTip, "Tip: To place notes without inserting, copy and paste in MIDI mode");
    handleSongViewCode(CODE_ESCAPE);
    EXPECT_FALSE(songViewInput.hintShown) << "the first Escape takes the tip away";
    EXPECT_EQ(songViewInput.pasteArmed, EDIT_RANGE_TIME);
    handleSongViewCode(CODE_ESCAPE);
    EXPECT_EQ(songViewInput.pasteArmed, 0);
}

TEST_F(SongViewCodeTest, ClicksSelectAloneToggleWithCtrlAndTakeARunWithShift) {
    selection.timeSelectionStart = 0.1f;
    selection.timeSelectionEnd = 0.3f;
    struct Case {
        int note;        // under the pointer; -1 none
        int modifiers;
        std::vector<int> selected;
    } cases[] = {
        {2, 0, {2}},
        {4, KEY_MODIFIER_CTRL, {2, 4}},
        {2, KEY_MODIFIER_CTRL, {4}},
        {1, KEY_MODIFIER_SHIFT, {1, 2}},   // from the anchor, the note Ctrl last touched
        {5, KEY_MODIFIER_SHIFT, {2, 3, 4, 5}},
        {-1, 0, {}},
    };
    for (const Case& c : cases) {
        selection.pointerNote = c.note;
        songViewClick(1.0, c.modifiers);
        EXPECT_EQ(selected(), c.selected) << "note " << c.note << " modifiers " << c.modifiers;
        // The time selection covers exactly the selected notes, or nothing.
        float start = c.selected.empty() ? NO_TIME_SELECTION : noteList.notes[c.selected.front()].waveStart;
        float end = c.selected.empty() ? NO_TIME_SELECTION : noteList.notes[c.selected.back()].waveEnd;
        EXPECT_EQ(selection.timeSelectionStart, start) << "note " << c.note;
        EXPECT_EQ(selection.timeSelectionEnd, end) << "note " << c.note;
    }
}

TEST_F(SongViewCodeTest, AClickedNoteIsDeletedWithItsTimeInWaveMode) {
    displayModes.playbackMode = PLAYBACK_MODE_WAVE;
    uint32_t blocks = song.blockCount;
    uint32_t noteBlocks = blockAtTime(noteList.notes[2].waveEnd) - blockAtTime(noteList.notes[2].waveStart);
    selection.pointerNote = 2;
    songViewClick(1.0, 0);
    handleSongViewCode(CODE_DELETE);
    EXPECT_EQ(song.blockCount, blocks - noteBlocks);
    EXPECT_EQ(noteList.count, 5);
}

TEST_F(SongViewCodeTest, AnArmedPasteGoesWhereTheViewIsClickedAndUndoTakesItBack) {
    selectNote(1);
    selectionChanged();
    handleSongViewCode(CODE_COPY);
    resetSelection();
    uint32_t blocks = song.blockCount;
    handleSongViewCode(CODE_PASTE);
    ASSERT_EQ(songViewInput.pasteArmed, EDIT_RANGE_TIME);
    selection.pointerBarline = -1;
    songViewClick(-1.0, 0);
    EXPECT_EQ(song.blockCount, blocks) << "left of the notes nothing is pasted";
    songViewClick(snapTimeToBlock(2.9), 0);
    EXPECT_EQ(songViewInput.pasteArmed, 0);
    EXPECT_EQ(song.blockCount, blocks + timeClipboard.durationCount);
    EXPECT_NEAR(selection.timeSelectionStart, snapTimeToBlock(2.9), 1e-5) << "the pasted time is selected";
    handleSongViewCode(CODE_UNDO);
    waitForUndoSnapshotCopy();
    EXPECT_EQ(song.blockCount, blocks);
}

TEST_F(SongViewCodeTest, EscapeClearsTheSelectionAndTheTip) {
    selectNote(2);
    selectionChanged();
    songViewInput.hintShown = true;
    handleSongViewCode(CODE_ESCAPE);
    EXPECT_FALSE(songViewInput.hintShown);
    EXPECT_EQ(selection.selectedNoteCount, 0);
    EXPECT_LT(selection.timeSelectionStart, 0.0f);
    selectNote(2);
    selection.anchorNote = 2;
    handleSongViewCode(CODE_ESCAPE);
    EXPECT_EQ(selection.selectedNoteCount, 0);
    EXPECT_EQ(selection.anchorNote, -1);
}

TEST_F(SongViewCodeTest, TabShiftTabAndTheExtendKeysWalkTheNotes) {
    struct Step {
        int code;
        std::vector<int> selected;
    } steps[] = {
        {CODE_SELECT_NEXT, {0}},        {CODE_SELECT_NEXT, {1}},      {CODE_ADD_NEXT, {1, 2}},
        {CODE_ADD_PREVIOUS, {1, 2, 0}}, {CODE_ADD_PREVIOUS, {1, 2, 0}}, {CODE_SELECT_NEXT, {3}},
        {CODE_SELECT_PREVIOUS, {2}},    {CODE_SELECT_NEXT, {3}},      {CODE_SELECT_NEXT, {4}},
        {CODE_SELECT_NEXT, {5}},        {CODE_SELECT_NEXT, {5}},
    };
    for (const Step& step : steps) {
        handleSongViewCode(step.code);
        EXPECT_EQ(selected(), step.selected) << "after code " << step.code;
    }
    EXPECT_FLOAT_EQ(selection.timeSelectionStart, noteList.notes[5].waveStart) << "the time selection follows";
    resetSelection();
    handleSongViewCode(CODE_SELECT_PREVIOUS);
    EXPECT_EQ(selected(), std::vector<int>{5});
    resetSelection();
    handleSongViewCode(CODE_ADD_NEXT);
    EXPECT_EQ(selected(), std::vector<int>{0});
}

TEST_F(SongViewCodeTest, SelectAllTakesTheWholeSongInWaveModeOnly) {
    appendBarline(1.0f);
    handleSongViewCode(CODE_SELECT_ALL);
    EXPECT_EQ(selected(), (std::vector<int>{0, 1, 2, 3, 4, 5}));
    EXPECT_EQ(selection.selectedBarlineCount, 1);
    EXPECT_EQ(selection.timeSelectionStart, 0.0f);
    EXPECT_FLOAT_EQ(selection.timeSelectionEnd, float(songDuration()));
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    handleSongViewCode(CODE_SELECT_ALL);
    EXPECT_LT(selection.timeSelectionStart, 0.0f);
}

TEST_F(SongViewCodeTest, EditCodesDoNothingWhileAFileIsBeingOpened) {
    selectNote(0);
    audioActivity.opening = true;
    for (int code : {CODE_DELETE, CODE_CUT, CODE_PASTE, CODE_UNDO}) handleSongViewCode(code);
    audioActivity.opening = false;
    EXPECT_EQ(noteList.count, 6);
    EXPECT_EQ(canUndo(), 0);
}
