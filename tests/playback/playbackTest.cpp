// Playback on the null device with the clock stopped: where Play starts and ends, the
// toggle, the end notice, the playback files, the failures and their messages, the pause
// for a mode change and the resume at the next repaint, the note preview and the cursor.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "../shell/frameFixtures.h"
#include "platform/files.h"
#include "shell/commandTable.h"
#include "platform/media.h"
#include "playback/midiOutput.h"
#include "playback/playback.h"
#include "playback/playbackState.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "playbackFixtures.h"

namespace {

int redraws = 0;
const FrameWindowFunctions countingWindows = {nullptr, [] { redraws++; }, nullptr, nullptr};

// A 2-second song at 8192 Hz in 256 blocks of 1/128 s whose sample n is n - 8192, with
// eight notes of 0.25 s one after another.
class Playback : public FrameTest {
protected:
    void SetUp() override {
        FrameTest::SetUp();
        resetPlaybackState();
        resetNullMedia();
        resetPointerInfo();
        commandOperations.playSong = playSong;
        commandOperations.pausePlayback = pausePlayback;
        setManualClock(true);
        for (int n = 0; n < 16384; n++) samples.push_back(int16_t(n - 8192));
        storeSongAudio(8192, 64, samples);
        openSong(256, 8);
        resetSongViewGeometry();
        layoutSongView(LABEL_COLUMN_WIDTH + 1000, 630);   // the whole song in sight: no scrolling
        redraws = 0;
        setFrameWindowFunctions(&countingWindows);
        clearUiCalls();
    }
    void TearDown() override {
        stopPlayback();
        setFrameWindowFunctions(nullptr);
        fileDelete(sharedFilePath("CS.fw"));
        resetNullMedia();
        resetPlaybackState();
        FrameTest::TearDown();
    }
    static std::string playbackFile() { return sharedFilePath(PLAYBACK_WAVE_FILE); }
    static std::string midiFile() { return sharedFilePath(MIDI_PLAYBACK_FILE); }
    // Lets the clock run ms milliseconds in 10 ms steps, serving the main loop at each.
    static void run(int ms) {
        for (int t = 0; t < ms; t += 10) {
            advanceManualClock(10);
            serveMainLoopOnce();
        }
    }
    std::vector<int16_t> samples;
};

}  // namespace

TEST_F(Playback, PlayStartsAtTheSelectionsStartAndRunsToTheSongsEnd) {
    struct Case {
        const char* what;
        float selectionStart, selectionEnd;   // the time selection; -1 none
        std::vector<int> selectedNotes;
        int start;                            // hundredths of a second
    };
    const Case cases[] = {
        {"nothing selected: from the beginning", -1, -1, {}, 0},
        {"a time selection: from its start, not to its end", 0.5f, 0.75f, {}, 50},
        {"notes selected: the earliest one's start", -1, -1, {5, 3, 6}, 75},
        {"the time selection wins over the notes", 1.5f, 1.75f, {2}, 150},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        resetSelection();
        selection.timeSelectionStart = c.selectionStart;
        selection.timeSelectionEnd = c.selectionEnd;
        for (int i : c.selectedNotes) selectNote(i);
        playSong(-1.0, -1.0, 0);
        ASSERT_EQ(isPlaying(), 1);
        EXPECT_EQ(playbackState.startCopy, c.start);
        EXPECT_EQ(playbackState.cursor, c.start);
        EXPECT_EQ(playbackState.end, 200);
        EXPECT_EQ(std::string(playButtonLabel()), "Stop");
        EXPECT_EQ(appTimers.count, 1);
        std::vector<int16_t> expected(samples.begin() + c.start * 8192 / 100, samples.end());
        EXPECT_EQ(segmentSamples(playbackFile()), expected);
        stopPlayback();
        EXPECT_EQ(messageCount(), 0);
    }
}

TEST_F(Playback, PlayAgainStopsDeletesThePlaybackFileAndGivesThePlayLabelBack) {
    dispatchCommand(CMD_PLAY_STOP);
    ASSERT_TRUE(fileExists(playbackFile()));
    dispatchCommand(CMD_PLAY_STOP);
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_FALSE(fileExists(playbackFile()));
    EXPECT_EQ(std::string(playButtonLabel()), "Play");
    EXPECT_EQ(appTimers.count, 0);
    EXPECT_EQ(openNullMediaDevices(), 0);
    EXPECT_GT(redraws, 0);
}

TEST_F(Playback, AnEndBeyondTheSongIsCutToItsDuration) {
    playSong(0.5, 60.0, 0);
    EXPECT_EQ(playbackState.end, 200);
    EXPECT_EQ(segmentSamples(playbackFile()).size(), 12288u);
    stopPlayback();
    playSong(0.5, 1.0, 0);
    EXPECT_EQ(playbackState.end, 100);
    EXPECT_EQ(segmentSamples(playbackFile()).size(), 4096u);
}

TEST_F(Playback, TheDevicesEndNoticeStopsPlaybackAndAStaleNoticeIsIgnored) {
    playSong(1.5, -1.0, 0);
    int device = playbackState.waveDevice;
    handleMediaNotification(device + 100);
    EXPECT_EQ(isPlaying(), 1);
    run(490);
    EXPECT_EQ(isPlaying(), 1);
    run(20);
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_FALSE(fileExists(playbackFile()));
    EXPECT_EQ(pointerInfo.kind, POINTER_KIND_POINTER);
    handleMediaNotification(device);   // a notice after the stop changes nothing
    EXPECT_EQ(isPlaying(), 0);
}

TEST_F(Playback, FailuresShowTheirTextExceptDuringAPreview) {
    struct Case {
        const char* what;
        int mode;
        bool failOpen;
        int preview;
        std::string message;   // "" for none
    };
    const std::string noServer = mediaErrorString(MEDIA_ERROR_NO_SERVER);
    const Case cases[] = {
        {"wave open", PLAYBACK_MODE_WAVE, true, 0, noServer},
        {"wave play", PLAYBACK_MODE_WAVE, false, 0, noServer},
        {"wave open, preview", PLAYBACK_MODE_WAVE, true, 1, ""},
        {"MIDI open", PLAYBACK_MODE_MIDI, true, 0,
         "Could not play MIDI because the Sequencer device did not open\n\n" + noServer},
        {"MIDI play", PLAYBACK_MODE_MIDI, false, 0,
         "Could not play MIDI.\n\nThis may be because the default MIDI device is in use by another application, or "
         "because the MIDI device is not set up properly or missing."},
        {"MIDI play, preview", PLAYBACK_MODE_MIDI, false, 1, ""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        clearUiCalls();
        displayModes.playbackMode = c.mode;
        if (c.failOpen) failNextNullMediaOpen(MEDIA_ERROR_NO_SERVER);
        else failNextNullMediaPlay(MEDIA_ERROR_NO_SERVER);
        playSong(0.25, 0.5, c.preview);
        EXPECT_EQ(lastMessageText(), c.message);
        if (!c.message.empty()) {
            EXPECT_EQ(uiCalls().back().kind, MESSAGE_ERROR);
        }
        // Nothing stays open or behind, and the next Play plays at once.
        EXPECT_EQ(isPlaying(), 0);
        EXPECT_EQ(openNullMediaDevices(), 0);
        EXPECT_FALSE(fileExists(playbackFile()));
        EXPECT_FALSE(fileExists(midiFile()));
        playSong(0.25, 0.5, 0);
        EXPECT_EQ(isPlaying(), 1);
        stopPlayback();
    }
}

TEST_F(Playback, APlaybackFileThatCannotBeWrittenIsReportedByTheOpen) {
    fileDelete(sharedFilePath("CS.fw"));
    playSong(-1.0, -1.0, 0);
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_EQ(lastMessageText(), mediaErrorString(MEDIA_ERROR_FILE));
}

TEST_F(Playback, MidiModePlaysTheNotesFileAndASongWithoutNotesDoesNotPlay) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    playSong(-1.0, -1.0, 0);
    ASSERT_EQ(isPlaying(), 1);
    EXPECT_NE(playbackState.midiDevice, -1);
    EXPECT_EQ(playbackState.routingMark, PLAYBACK_ROUTING_MARK);
    EXPECT_TRUE(fileExists(midiFile()));
    EXPECT_FALSE(fileExists(playbackFile()));
    run(2010);   // the eight notes end at 2 s; the end notice stops playback
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_FALSE(fileExists(midiFile()));

    resetNoteList();
    playSong(-1.0, -1.0, 0);
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_FALSE(fileExists(midiFile()));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(Playback, NothingPlaysWhileRecordingOrOpening) {
    for (bool recording : {true, false}) {
        audioActivity.recording = recording;
        audioActivity.opening = !recording;
        playSong(-1.0, -1.0, 0);
        selection.pointerNote = 1;
        previewNote(1);
        EXPECT_EQ(isPlaying(), 0);
    }
}

TEST_F(Playback, AModeChangePausesAndTheNextRepaintResumesFromTheCursorInTheNewMode) {
    playSong(-1.0, -1.0, 0);
    run(500);
    int cursor = playbackState.cursor;
    EXPECT_GE(cursor, 47);
    setNoteMode(NOTE_MODE_NOTE);
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_EQ(playbackState.resumePosition, cursor);
    resumePlayback();
    EXPECT_NE(playbackState.waveDevice, -1);
    EXPECT_NEAR(playbackState.startCopy, cursor, 1);   // hundredths to seconds and back may lose one
    EXPECT_EQ(playbackState.resumePosition, -1);

    setPlaybackMode(PLAYBACK_MODE_MIDI);
    resumePlayback();
    EXPECT_EQ(playbackState.waveDevice, -1);
    EXPECT_NE(playbackState.midiDevice, -1);
    EXPECT_NEAR(playbackState.startCopy, cursor, 2);
    resumePlayback();   // nothing more to resume
    EXPECT_NE(playbackState.midiDevice, -1);
}

TEST_F(Playback, APreviewIsNotPausedButEveryEditingCommandStopsIt) {
    selectNote(2);
    selection.pointerNote = 2;
    previewNote(-1);
    ASSERT_EQ(isPlaying(), 1);
    EXPECT_EQ(playbackState.preview, 1);
    EXPECT_EQ(playbackState.startCopy, 50);
    EXPECT_EQ(playbackState.end, 75);
    setNoteMode(NOTE_MODE_NOTE);
    EXPECT_EQ(isPlaying(), 1);
    EXPECT_EQ(playbackState.resumePosition, -1);
    dispatchCommand(CMD_QUANTIZE);
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_EQ(stopPreview(), 0);

    playSong(-1.0, -1.0, 0);   // normal playback is not a preview
    EXPECT_EQ(stopPreview(), 0);
    EXPECT_EQ(isPlaying(), 1);
}

TEST_F(Playback, APreviewPlaysOnlyTheNoteUnderThePointer) {
    selection.pointerNote = 4;
    previewNote(3);   // not the pointer's note
    EXPECT_EQ(isPlaying(), 0);
    selectNote(3);
    selectNote(4);
    previewNote(-1);   // two notes selected
    EXPECT_EQ(isPlaying(), 0);
    previewNote(8);   // no such note
    EXPECT_EQ(isPlaying(), 0);

    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    playSong(-1.0, -1.0, 0);
    previewNote(4);   // stops the MIDI playback and plays the note
    EXPECT_EQ(isPlaying(), 1);
    EXPECT_EQ(playbackState.preview, 1);
    EXPECT_EQ(playbackState.startCopy, 100);
}

TEST_F(Playback, ClosingTheSongStopsPlaybackAndRemovesItsFile) {
    playSong(-1.0, -1.0, 0);
    songWindowClosed();
    EXPECT_EQ(isPlaying(), 0);
    EXPECT_FALSE(fileExists(playbackFile()));
}

TEST_F(Playback, TheCursorFollowsTheDevicesClockInStepsAndShowsPlayback) {
    playSong(1.0, -1.0, 0);
    redraws = 0;
    std::vector<int> cursors;
    for (int t = 0; t < 150; t += 10) {
        advanceManualClock(10);
        serveMainLoopOnce();
        cursors.push_back(playbackState.cursor);
    }
    EXPECT_EQ(cursors, (std::vector<int>{100, 100, 103, 103, 103, 106, 106, 106, 109, 109, 109, 112, 112, 112, 115}));

    EXPECT_EQ(redraws, 5);
    EXPECT_EQ(pointerInfo.kind, POINTER_KIND_PLAYBACK);
    EXPECT_EQ(pointerInfo.firstTime, "0:01.15");
    EXPECT_EQ(pointerInfo.secondTime, "0:02.00");
}

TEST_F(Playback, TheViewScrollsToKeepTheCursorInSight) {
    song.sampleBlockDurations.assign(128 * 20, 1.0 / 128);
    song.blockCount = 128 * 20;   // 20 s, longer than the audio: the scroll only needs the time axis
    layoutSongView(LABEL_COLUMN_WIDTH + 128, 630);   // 128 px/s: one second in sight
    playSong(3.5, 10.0, 0);
    run(20);
    EXPECT_GT(songViewGeometry.scrollX, 0);
    EXPECT_GE(timeToX(playbackState.cursor / 100.0), songViewGeometry.plotLeft);
    EXPECT_LE(timeToX(playbackState.cursor / 100.0), songViewGeometry.plotLeft + 128);
}
