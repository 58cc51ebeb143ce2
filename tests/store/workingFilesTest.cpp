// Closing a song: every working file goes, and nothing of the song stays in memory.
#include <gtest/gtest.h>

#include <tuple>

#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/paths.h"
#include "store/ftBlockStore.h"
#include "store/song.h"
#include "shell/settings.h"
#include "store/workingFiles.h"
#include "support/testSupport.h"

class SongClose : public SharedFolderTest {
protected:
    void TearDown() override {
        closeSong();
        SharedFolderTest::TearDown();
    }
};

TEST_F(SongClose, DeletesEveryWorkingFileAndEmptiesTheUndoFolder) {
    makeFolder(sharedFilePath("CSUndo"));
    for (const char* name : WORKING_FILE_NAMES) writeFileText(sharedFilePath(name), "x");
    writeFileText(sharedFilePath("CSUndo/Undo1"), "x");
    EXPECT_EQ(closeSong(), 1);
    for (const char* name : WORKING_FILE_NAMES) EXPECT_FALSE(fileExists(sharedFilePath(name))) << name;
    EXPECT_FALSE(fileExists(sharedFilePath("CSUndo/Undo1")));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(SongClose, LeavesNoBlocksNotesInstrumentOrSelectionBehind) {
    song.sampleBlockDuration = 1.0 / 128;
    ASSERT_EQ(growSampleBlockDurations(10), 1);
    song.blockCount = 10;
    Note note{};
    note.waveEnd = note.midiEnd = 0.5f;
    ASSERT_EQ(appendNote(note), 1);
    ASSERT_EQ(selectNote(0), 1);
    selection.timeSelectionStart = 0.1f;
    selection.timeSelectionEnd = 0.2f;
    setFTBlockWindowCapacity(song.sampleBlockDuration);
    song.instrumentName = "Flute";

    closeSong();
    EXPECT_EQ(songInstrumentName(), globalSettings.defaultInstrument);
    EXPECT_EQ(song.blockCount, 0u);
    EXPECT_TRUE(song.sampleBlockDurations.empty());
    EXPECT_EQ(std::tuple(noteList.count, selection.selectedNoteCount, selection.timeSelectionStart, selection.timeSelectionEnd),
              std::tuple(0, 0, -1.0f, -1.0f));
    EXPECT_EQ(std::tuple(ftBlockWindow.firstBlock, ftBlockWindow.endBlock), std::tuple(0u, 0u));
}

TEST_F(SongClose, AFileThatCannotBeDeletedIsReported) {
    writeFileText(sharedFilePath("CS.ft"), "x");
    failFileCall(FILE_OP_DELETE, 1);
    EXPECT_EQ(closeSong(), 0);
    clearFileFailures();
    EXPECT_EQ(lastMessageText(), "File could not be deleted");
}
