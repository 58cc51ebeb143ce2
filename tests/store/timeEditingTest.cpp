// Time editing on a song opened through the program's own opening path: the samples of CS.fw
// after cuts and pastes equal a model made with plain array operations on the original
// samples, undo brings every working file back byte for byte, and notes and barlines follow
// cuts and pastes by the block-aligned lengths.
#include <gtest/gtest.h>

#include <map>

#include "audio/openingFixtures.h"
#include "audio/waveWorkingFile.h"
#include "notes/selection.h"
#include "store/ftBlockStore.h"
#include "store/timeEditing.h"
#include "store/undo.h"

static const char* const SONG_FILES[] = {"CS.fw", "CS.ft", "CS.fi", "CS.ft+", "CS.fi+"};

class TimeEditingTest : public OpeningTest {
protected:
    void SetUp() override {
        OpeningTest::SetUp();
        openAndWait(writeMono("melody.wav", melodyBytes(4.0)));
        ASSERT_GT(song.blockCount, 300u);
        resetTimeClipboard();
        clearUiCalls();
    }
    void TearDown() override {
        resetTimeClipboard();
        OpeningTest::TearDown();
    }
    // The samples of CS.fw, after its 56-byte header.
    std::vector<uint8_t> samples() {
        std::vector<uint8_t> bytes = readFileBytes(shared("CS.fw"));
        return std::vector<uint8_t>(bytes.begin() + WORKING_WAVE_HEADER_BYTES, bytes.end());
    }
    std::map<std::string, std::vector<uint8_t>> songFiles() {
        std::map<std::string, std::vector<uint8_t>> files;
        for (const char* name : SONG_FILES) files[name] = readFileBytes(shared(name));
        return files;
    }
    // Bytes of blocks [first, end) in the model's samples.
    static size_t byteOfBlock(uint32_t block) { return size_t(sampleOfBlock(block)) * 2; }
    // Replaces the recognised notes with notes of the given wave spans (block-aligned).
    static void useNotes(std::initializer_list<std::pair<double, double>> spans) {
        resetNoteList();
        resetSelection();
        for (auto [start, end] : spans) {
            Note n{};
            n.pitch = 440.0f;
            n.midiNote = 69;
            n.waveStart = n.midiStart = float(snapTimeToBlock(start));
            n.waveEnd = n.midiEnd = float(snapTimeToBlock(end));
            appendNote(n);
        }
    }
    static void copyRange(int kind, double start, double end) {
        timeClipboard.kind = kind;
        ASSERT_EQ(copyTimeToClipboard(start, end - start), 1) << lastMessageText();
    }
};

TEST_F(TimeEditingTest, CutsAndPastesMoveTheSamplesAsArrayOperationsAndUndoRestoresEveryFile) {
    std::map<std::string, std::vector<uint8_t>> original = songFiles();
    std::vector<double> durations = song.sampleBlockDurations;
    uint32_t blocks = song.blockCount;
    std::vector<uint8_t> model = samples();

    takeUndoSnapshot();
    size_t from = byteOfBlock(blockAtTime(1.0)), to = byteOfBlock(blockAtTime(1.5));
    ASSERT_EQ(removeTimeFromSong(1.0, 0.5), 1) << lastMessageText();
    markUndoStale(UNDO_FT_CHANGED | UNDO_WAVE_CHANGED);
    model.erase(model.begin() + long(from), model.begin() + long(to));
    ASSERT_EQ(samples(), model);
    EXPECT_EQ(song.workingWaveBytes, model.size());

    copyRange(EDIT_RANGE_TIME, 0.5, 1.0);
    std::vector<uint8_t> copied(model.begin() + long(byteOfBlock(blockAtTime(0.5))),
                                model.begin() + long(byteOfBlock(blockAtTime(1.0))));
    takeUndoSnapshot();
    size_t at = byteOfBlock(blockAtTime(2.0));
    ASSERT_EQ(pasteTimeFromClipboard(2.0, 0.0), 1) << lastMessageText();
    markUndoStale(UNDO_FT_CHANGED | UNDO_WAVE_CHANGED);
    model.insert(model.begin() + long(at), copied.begin(), copied.end());
    ASSERT_EQ(samples(), model);

    takeUndoSnapshot();
    from = byteOfBlock(blockAtTime(0.25));
    to = byteOfBlock(blockAtTime(0.75));
    ASSERT_EQ(pasteTimeFromClipboard(0.25, 0.5), 1) << lastMessageText();
    markUndoStale(UNDO_FT_CHANGED | UNDO_WAVE_CHANGED);
    model.erase(model.begin() + long(from), model.begin() + long(to));
    model.insert(model.begin() + long(from), copied.begin(), copied.end());
    ASSERT_EQ(samples(), model);
    // The four sequences stay in step: 512 samples, one FT and one Hires FT block per block.
    EXPECT_EQ(size_t(song.blockCount) * 1024, model.size());
    EXPECT_EQ(getU32(readFileBytes(shared("CS.fi")), 0), song.blockCount);
    EXPECT_EQ(getU32(readFileBytes(shared("CS.fi+")), 0), song.blockCount);
    EXPECT_EQ(readFileBytes(shared("CS.fi")).size(), 4 + 8 * size_t(song.blockCount));

    for (int u = 0; u < 3; u++) ASSERT_EQ(undo(), 1);
    waitForUndoSnapshotCopy();
    EXPECT_TRUE(songFiles() == original);
    EXPECT_EQ(song.sampleBlockDurations, durations);
    EXPECT_EQ(song.blockCount, blocks);
}

TEST_F(TimeEditingTest, RemovingTimeDropsTheNotesInItAndMovesTheLaterOnesByTheCut) {
    useNotes({{0.5, 0.9}, {1.1, 1.3}, {1.6, 2.4}, {3.0, 3.5}});
    appendBarline(float(snapTimeToBlock(1.2)));
    appendBarline(float(snapTimeToBlock(2.8)));
    double t = snapTimeToBlock(1.0), L = snapTimeToBlock(2.0) - t;
    double d = song.sampleBlockDuration;
    Note last = noteList.notes[3];
    ASSERT_EQ(removeTimeFromSong(1.0, 1.0), 1);
    ASSERT_EQ(noteList.count, 3);
    EXPECT_EQ(noteList.notes[0].waveEnd, float(snapTimeToBlock(0.9))) << "before the cut";
    // A note reaching past the cut keeps what lies behind it, at least 2 blocks.
    EXPECT_FLOAT_EQ(noteList.notes[1].waveStart, float(t));
    EXPECT_NEAR(noteList.notes[1].waveEnd, snapTimeToBlock(2.4) - L, 1e-5);
    EXPECT_NEAR(noteList.notes[2].waveStart, last.waveStart - L, 1e-5);
    EXPECT_NEAR(noteList.notes[2].midiEnd, last.midiEnd - L, 1e-5);
    ASSERT_EQ(barlineList.count, 1);
    EXPECT_NEAR(barlineList.times[0], snapTimeToBlock(2.8) - L, 1e-5);
    EXPECT_GE(noteList.notes[1].waveEnd - noteList.notes[1].waveStart, 2 * d - 1e-6);
}

TEST_F(TimeEditingTest, ACutInsideANoteLeavesItAtLeastTwoBlocks) {
    useNotes({{1.0, 2.0}});
    double d = song.sampleBlockDuration;
    ASSERT_EQ(removeTimeFromSong(1.0 + 2 * d, 1.0 - 4 * d), 1);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_NEAR(noteList.notes[0].waveEnd - noteList.notes[0].waveStart, 4 * d, 1e-5);
    // A cut from before the note to 2 blocks before its end: the last 2 blocks stay.
    useNotes({{1.0, 1.3}});
    double t = snapTimeToBlock(0.9);
    ASSERT_EQ(removeTimeFromSong(t, snapTimeToBlock(1.3) - 2 * d - t), 1);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_NEAR(noteList.notes[0].waveEnd - noteList.notes[0].waveStart, 2 * d, 1e-5);
}

TEST_F(TimeEditingTest, DeletingTheWholeSongKeepsItsFirstBlock) {
    ASSERT_EQ(removeTimeFromSong(0.0, songDuration()), 1);
    EXPECT_EQ(song.blockCount, 1u);
    EXPECT_EQ(samples().size(), 1024u);
    EXPECT_EQ(noteList.count, 0);
    EXPECT_EQ(uiCalls().back().call, UI_STATUS_TEXT);
    EXPECT_EQ(uiCalls().back().text, "") << "the status text goes when the cut is done";
}

TEST_F(TimeEditingTest, AWaveModeCopyPastedAtTwoSecondsMovesWhatFollowsByTheCopiedDuration) {
    useNotes({{0.5, 0.9}, {1.5, 1.9}, {2.2, 2.6}});
    appendBarline(float(snapTimeToBlock(2.4)));
    selectNote(0);
    copyRange(EDIT_RANGE_TIME, 0.5, 0.9);
    double P = snapTimeToBlock(0.9) - snapTimeToBlock(0.5);
    double length = songDuration();
    Note later = noteList.notes[2];
    ASSERT_EQ(pasteTimeFromClipboard(2.0, 0.0), 1);
    EXPECT_NEAR(songDuration(), length + P, 1e-9);
    ASSERT_EQ(noteList.count, 4);
    EXPECT_NEAR(noteList.notes[2].waveStart, snapTimeToBlock(2.0), 1e-5) << "the pasted note";
    EXPECT_NEAR(noteList.notes[3].waveStart, later.waveStart + P, 1e-5);
    EXPECT_NEAR(noteList.notes[3].waveEnd, later.waveEnd + P, 1e-5);
    EXPECT_NEAR(barlineList.times[0], snapTimeToBlock(2.4) + P, 1e-5);
    ASSERT_EQ(selection.selectedNoteCount, 1);
    EXPECT_EQ(selection.selectedNotes[0], 2);
    EXPECT_NEAR(selection.timeSelectionStart, snapTimeToBlock(2.0), 1e-5);
    EXPECT_NEAR(selection.timeSelectionEnd - selection.timeSelectionStart, P, 1e-5);
}

TEST_F(TimeEditingTest, AMidiModePasteKeepsTheSongsLengthAndAudio) {
    useNotes({{0.5, 0.9}, {2.2, 2.6}});
    selectNote(0);
    copyRange(EDIT_RANGE_NOTES, 0.5, 0.9);
    std::vector<uint8_t> audio = samples();
    uint32_t blocks = song.blockCount;
    ASSERT_EQ(pasteTimeFromClipboard(1.5, 0.0), 1);
    EXPECT_EQ(song.blockCount, blocks);
    EXPECT_EQ(samples(), audio);
    ASSERT_EQ(noteList.count, 3);
    EXPECT_NEAR(noteList.notes[1].waveStart, snapTimeToBlock(1.5), 1e-5);
    EXPECT_NEAR(noteList.notes[2].waveStart, snapTimeToBlock(2.2), 1e-5) << "later notes stay";
}

TEST_F(TimeEditingTest, CopyingALongAndThenAShortRangeLeavesTheShortOne) {
    copyRange(EDIT_RANGE_TIME, 0.0, 3.0);
    copyRange(EDIT_RANGE_TIME, 1.0, 1.25);
    uint32_t first = blockAtTime(1.0), count = blockAtTime(1.25) - first;
    EXPECT_EQ(timeClipboard.durationCount, count);
    EXPECT_EQ(readFileBytes(shared("_CS.fw")).size(), 4 + size_t(count) * 1024);
    std::vector<uint8_t> clip = readFileBytes(shared("_CS.ft"));
    EXPECT_EQ(getU32(clip, 0), count);
    EXPECT_EQ(readFileBytes(shared("_CS.fi")).size(), 4 * size_t(count));
}

TEST_F(TimeEditingTest, CopiedTimeGoesToTheSystemClipboardAsAWaveFile) {
    copyRange(EDIT_RANGE_TIME, 1.0, 1.5);
    std::vector<uint8_t> all = samples();
    std::vector<uint8_t> range(all.begin() + long(byteOfBlock(blockAtTime(1.0))),
                               all.begin() + long(byteOfBlock(blockAtTime(1.5))));
    const std::vector<uint8_t>& wave = clipboardWave();
    ASSERT_EQ(wave.size(), WORKING_WAVE_HEADER_BYTES + range.size());
    EXPECT_EQ(std::string(wave.begin(), wave.begin() + 4), "RIFF");
    EXPECT_EQ(getU32(wave, 4), wave.size() - 8);
    EXPECT_EQ(std::string(wave.begin() + 8, wave.begin() + 12), "WAVE");
    EXPECT_EQ(getU32(wave, WORKING_WAVE_FACT_OFFSET), range.size() / 2) << "the fact chunk counts samples";
    EXPECT_EQ(getU32(wave, 52), range.size());
    EXPECT_TRUE(std::equal(range.begin(), range.end(), wave.begin() + WORKING_WAVE_HEADER_BYTES));
}

TEST_F(TimeEditingTest, PasteRefusesOnAnAlmostFullDriveAndWarnsOnALowOne) {
    copyRange(EDIT_RANGE_TIME, 1.0, 1.5);
    uint32_t blocks = song.blockCount;
    setFreeDiskSpaceOverride(15 << 20);
    EXPECT_EQ(pasteTimeFromClipboard(2.0, 0.0), 0);
    EXPECT_EQ(lastMessageText(),
              "Sorry - disk space is very low on the 'Torvellan Shared' drive so this operation cannot be performed. "
              "It is recommended that you choose a folder from recording preferences on a drive with more than 250Mb "
              "free space.");
    EXPECT_EQ(song.blockCount, blocks);
    setFreeDiskSpaceOverride(50 << 20);
    clearUiCalls();
    EXPECT_EQ(pasteTimeFromClipboard(2.0, 0.0), 1);
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(lastMessageText().rfind("Disk space is low on the 'Torvellan Shared' drive", 0), 0u);
    EXPECT_GT(song.blockCount, blocks);
}

TEST_F(TimeEditingTest, AFileThatCannotBeReadStopsEachWorkerWithItsMessage) {
    auto garbleWave = [&] { writeFileText(shared("CS.fw"), "no wave at all"); };
    auto cutIndex = [&] { writeFileBytes(shared("CS.fi"), {1, 0}); };
    auto cutHiresIndex = [&] { writeFileBytes(shared("CS.fi+"), {1, 0}); };
    struct Case {
        const char* operation;   // remove, copy or paste
        std::function<void()> damage;
        const char* message;
    } cases[] = {
        {"remove", garbleWave, "There was a problem removing waves - removeTimeFromSong (1). Data may be corrupted."},
        {"remove", cutIndex, "There was a problem removing FT blocks - removeTimeFromSong (2). Data may be corrupted."},
        {"remove", cutHiresIndex,
         "There was a problem removing Hires FT blocks - removeTimeFromSong (3). Data may be corrupted."},
        {"copy", garbleWave, "There was a problem adding waves to the clipboard - copyTimeToClipboard (1)."},
        {"copy", cutHiresIndex, "There was a problem adding Hires FT blocks to the clipboard- copyTimeToClipboard (2)."},
        {"copy", cutIndex, "There was a problem adding FT blocks to the clipboard - copyTimeToClipboard (5)."},
        {"paste", cutIndex, "There was a problem pasting FT blocks from the clipboard - pasteTimeFromClipboard (1)."},
        {"paste", garbleWave, "There was a problem pasting waves from the clipboard - pasteTimeFromClipboard (2)."},
        {"paste", cutHiresIndex,
         "There was a problem pasting Hires FT blocks from the clipboard - pasteTimeFromClipboard (3)."},
    };
    std::map<std::string, std::vector<uint8_t>> sound = songFiles();
    for (const Case& c : cases) {
        for (const auto& [name, bytes] : sound) writeFileBytes(shared(name), bytes);
        std::string op = c.operation;
        if (op == "paste") copyRange(EDIT_RANGE_TIME, 1.0, 1.5);
        c.damage();
        timeClipboard.kind = EDIT_RANGE_TIME;
        int result = op == "remove" ? removeTimeFromSong(1.0, 0.5)
                     : op == "copy" ? copyTimeToClipboard(1.0, 0.5)
                                    : pasteTimeFromClipboard(2.0, 0.0);
        EXPECT_EQ(result, 0) << c.message;
        EXPECT_EQ(lastMessageText(), c.message);
        EXPECT_FALSE(fileExists(shared("CS.tw"))) << c.message;
    }
}
