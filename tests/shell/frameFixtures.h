#pragma once
// The main frame's state for the frame, command and menu suites: everything the commands
// read is emptied before and after each test, and songs with notes are built in a line.

#include <gtest/gtest.h>

#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/clock.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/appTimers.h"
#include "shell/commandDispatch.h"
#include "shell/mainFrame.h"
#include "shell/openQueue.h"
#include "shell/saveSong.h"
#include "shell/settings.h"
#include "shell/zoom.h"
#include "store/song.h"

inline void resetFrameTestState() {
    resetFrameState();
    resetZoom();
    resetAppTimers();
    resetOpenQueue();
    resetMainLoop();
    setManualClock(false);
    commandOperations = CommandOperations{};
    resetSongNames();
    resetNoteList();
    resetSelection();
    resetSong();
    resetDisplayModes();
    audioActivity = AudioActivity{};
    globalSettings = GlobalSettings{};
    clearUiCalls();
}

class FrameTest : public ::testing::Test {
protected:
    void SetUp() override { resetFrameTestState(); }
    void TearDown() override { resetFrameTestState(); }

    // An open song of blocks blocks of 1/128 s with notes notes of 0.25 s, one after another.
    void openSong(uint32_t blocks, int notes) {
        song.sampleBlockDuration = 1.0 / 128;
        song.sampleBlockDurations.assign(blocks, 1.0 / 128);
        song.blockCount = blocks;
        for (int i = 0; i < notes; i++) {
            Note note{};
            note.pitch = 440.0f;
            note.midiNote = 69;
            note.midiStart = note.waveStart = 0.25f * float(i);
            note.midiEnd = note.waveEnd = 0.25f * float(i) + 0.25f;
            ASSERT_EQ(appendNote(note), 1);
        }
        showSongView();
    }
};
