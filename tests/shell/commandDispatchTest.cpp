// The command dispatch: the modal filter, the guards each command repeats, the plain report
// of an operation this build does not have, and the mode commands with their tips.
#include <gtest/gtest.h>

#include <vector>

#include "frameFixtures.h"
#include "shell/commandTable.h"

namespace {

std::vector<int> operationCalls;   // what the stand-in operations were called with
double playStart, playEnd;
int playPreview;

class CommandTableDispatch : public FrameTest {
protected:
    void SetUp() override {
        FrameTest::SetUp();
        operationCalls.clear();
        playStart = playEnd = 0;
        playPreview = -1;
    }
    void installStandIns() {
        commandOperations.runNoteCommand = [](int command) {
            operationCalls.push_back(command);
            return 1;
        };
        commandOperations.handleSongViewCode = [](int code) {
            operationCalls.push_back(code);
            return 0;
        };
        commandOperations.toggleRecording = [] {
            operationCalls.push_back(CMD_RECORD);
            return 1;
        };
        commandOperations.playSong = [](double start, double end, int preview) {
            playStart = start;
            playEnd = end;
            playPreview = preview;
        };
        commandOperations.pausePlayback = [] { operationCalls.push_back(-1); };
    }
};

}  // namespace

TEST_F(CommandTableDispatch, WhileModalOnlyTheWindowAndHelpCommandsCloseAndExitPass) {
    openSong(256, 3);
    selectNote(0);
    installStandIns();
    setFrameModal(true);
    for (int id : {CMD_ABOUT, CMD_HELP, CMD_RECORDING_TIPS, CMD_CASCADE, CMD_TILE_HORIZONTALLY, CMD_TILE_VERTICALLY,
                   CMD_CLOSE, CMD_EXIT})
        EXPECT_EQ(dispatchCommand(id), COMMAND_FOR_FRAME) << id;
    for (int id : {CMD_OPEN, CMD_SAVE, CMD_CLOSE_ALL, CMD_QUANTIZE, CMD_CUT, CMD_MIDI_MODE, CMD_ZOOM_IN, CMD_RECORD})
        EXPECT_EQ(dispatchCommand(id), COMMAND_FILTERED) << id;
    EXPECT_TRUE(operationCalls.empty());
    EXPECT_EQ(displayModes.playbackMode, PLAYBACK_MODE_WAVE);
    EXPECT_EQ(zoomState.zoomFactor, ZOOM_DEFAULT);

    setFrameModal(true);
    setFrameModal(false);
    EXPECT_EQ(dispatchCommand(CMD_QUANTIZE), COMMAND_FILTERED);
    setFrameModal(false);
    EXPECT_EQ(dispatchCommand(CMD_QUANTIZE), COMMAND_DONE);
    EXPECT_EQ(operationCalls, std::vector<int>({CMD_QUANTIZE}));
}

TEST_F(CommandTableDispatch, ANoteCommandWithoutItsOperationSaysSoPlainly) {
    openSong(256, 3);
    selectNote(1);
    EXPECT_EQ(dispatchCommand(CMD_QUANTIZE), COMMAND_DONE);
    EXPECT_EQ(lastMessageText(), "Quantize is not available in this version of Torvellan Melodrift.");
    EXPECT_EQ(uiCalls().back().kind, MESSAGE_INFORMATION);
    dispatchCommand(CMD_RITENUTO);
    EXPECT_EQ(lastMessageText(), "Ritenuto (hold back) is not available in this version of Torvellan Melodrift.");
}

TEST_F(CommandTableDispatch, AGreyedCommandArrivingByKeyDoesNothing) {
    openSong(256, 3);
    installStandIns();
    dispatchCommand(CMD_QUANTIZE);            // nothing selected
    displayModes.noteMode = NOTE_MODE_NOTE;
    selectNote(0);
    dispatchCommand(CMD_FLATTEN);             // Detail mode only
    dispatchCommand(CMD_ADD_VIBRATO);
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    dispatchCommand(CMD_RITENUTO);            // Wave mode only
    audioActivity.opening = true;
    dispatchCommand(CMD_QUANTIZE);
    dispatchCommand(CMD_STRIP_ENDS);
    EXPECT_TRUE(operationCalls.empty());
    EXPECT_EQ(messageCount(), 0);

    audioActivity.opening = false;
    dispatchCommand(CMD_QUANTIZE);
    dispatchCommand(CMD_VOLUME_25);
    EXPECT_EQ(operationCalls, std::vector<int>({CMD_QUANTIZE, CMD_VOLUME_25}));
}

TEST_F(CommandTableDispatch, EditCommandsGoToTheSongViewWithTheirCodes) {
    installStandIns();
    dispatchCommand(CMD_SELECT_ALL);          // no song window
    EXPECT_TRUE(operationCalls.empty());
    openSong(256, 3);
    selectNote(2);
    for (int id : {CMD_CUT, CMD_COPY, CMD_DELETE, CMD_SELECT_ALL, CMD_DESELECT_ALL, CMD_PASTE, CMD_UNDO})
        dispatchCommand(id);
    // Paste and Undo are grey: nothing on the clipboard, no undo step.
    EXPECT_EQ(operationCalls, std::vector<int>({600, 579, 127, 577, 27}));
    commandOperations.handleSongViewCode = nullptr;
    dispatchCommand(CMD_CUT);
    EXPECT_EQ(lastMessageText(), "Cut is not available in this version of Torvellan Melodrift.");
}

TEST_F(CommandTableDispatch, RecordIsRefusedWhileOpeningAndOtherwiseStartsOrStops) {
    audioActivity.opening = true;
    dispatchCommand(CMD_RECORD);
    EXPECT_EQ(lastMessageText(), "Sorry - this cannot be done whilst opening audio.");
    audioActivity.opening = false;
    dispatchCommand(CMD_RECORD);
    EXPECT_EQ(lastMessageText(), "Record Audio is not available in this version of Torvellan Melodrift.");
    installStandIns();
    clearUiCalls();
    dispatchCommand(CMD_RECORD);
    audioActivity.recording = true;
    dispatchCommand(CMD_RECORD);
    EXPECT_EQ(operationCalls, std::vector<int>({CMD_RECORD, CMD_RECORD}));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(CommandTableDispatch, PlayStopPlaysTheDefaultRangeOfAnOpenQuietSong) {
    installStandIns();
    dispatchCommand(CMD_PLAY_STOP);
    EXPECT_EQ(playPreview, -1);
    openSong(256, 2);
    audioActivity.recording = true;
    dispatchCommand(CMD_PLAY_STOP);
    EXPECT_EQ(playPreview, -1);
    audioActivity.recording = false;
    dispatchCommand(CMD_PLAY_STOP);
    EXPECT_EQ(playStart, -1.0);
    EXPECT_EQ(playEnd, -1.0);
    EXPECT_EQ(playPreview, 0);
    commandOperations.playSong = nullptr;
    dispatchCommand(CMD_PLAY_STOP);
    EXPECT_EQ(lastMessageText(), "Play/Stop is not available in this version of Torvellan Melodrift.");
}

TEST_F(CommandTableDispatch, ModeCommandsSetTheModeAndItsSettingAndShowTheirTip) {
    installStandIns();
    dispatchCommand(CMD_MIDI_MODE);
    EXPECT_EQ(displayModes.playbackMode, PLAYBACK_MODE_MIDI);
    EXPECT_EQ(globalSettings.playbackMode, PLAYBACK_MODE_MIDI);
    EXPECT_EQ(frameState.lastTip, "Tip: Hold E to temporarily toggle between MIDI and Wave editing/playback");
    dispatchCommand(CMD_NOTE_MODE);
    EXPECT_EQ(displayModes.noteMode, NOTE_MODE_NOTE);
    EXPECT_EQ(globalSettings.noteMode, NOTE_MODE_NOTE);
    EXPECT_EQ(frameState.lastTip, "Tip: Hold W to temporarily toggle between Note and Detail editing/playback");
    dispatchCommand(CMD_DIATONIC);
    EXPECT_EQ(globalSettings.scaleMode, LAYOUT_DIATONIC);
    EXPECT_EQ(frameState.lastTip, "Tip: Hold Q to temporarily toggle between Diatonic and Chromatic layouts");
    // Playback pauses for a change of mode only, not for choosing the mode in force.
    dispatchCommand(CMD_NOTE_MODE);
    dispatchCommand(CMD_CHROMATIC);
    EXPECT_EQ(operationCalls, std::vector<int>({-1, -1}));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(CommandTableDispatch, TheScanningKeysDoNothingAndUnknownIdsAreNotCommands) {
    openSong(256, 1);
    for (int id : {CMD_SCANNING_CTRL_P, CMD_SCANNING_CTRL_G, CMD_SCANNING_CTRL_D, CMD_SCANNING_SHIFT_T,
                   CMD_SCANNING_CTRL_H, CMD_SCANNING_CTRL_N})
        EXPECT_EQ(dispatchCommand(id), COMMAND_DONE) << id;
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(dispatchCommand(12345), COMMAND_FILTERED);
}

TEST_F(CommandTableDispatch, ARecordingOverASongOfNotesOnlyStartsASongOfItsOwn) {
    static int notesAtStart;
    openSong(256, 3);
    commandOperations.toggleRecording = [] {
        notesAtStart = noteList.count;
        return 1;
    };
    song.notesOnly = true;
    EXPECT_EQ(dispatchCommand(CMD_RECORD), COMMAND_DONE);
    EXPECT_EQ(notesAtStart, 0);
    EXPECT_EQ(song.blockCount, 0u);
    // A song with a recording is recorded onto.
    openSong(256, 3);
    EXPECT_EQ(dispatchCommand(CMD_RECORD), COMMAND_DONE);
    EXPECT_EQ(notesAtStart, 3);
}
