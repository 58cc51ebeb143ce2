// The undo ring over a song whose working files hold plain marker texts: each edit changes
// the notes and, as it says, the FT files or the audio and Hires files; undo and redo must
// bring back exactly the notes, selections and file bytes of the state they name. The
// "Undo" and "FrDr" files are checked byte for byte and against damage.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "notes/noteFixtures.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "store/undo.h"
#include "store/undoFiles.h"
#include "support/testSupport.h"

static const char* const FT_FILES[] = {"CS.ft", "CS.fi"};
static const char* const WAVE_FILES[] = {"CS.fw", "CS.ft+", "CS.fi+"};

class UndoRingTest : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        clearUndo();
        clearUiCalls();
        setFreeDiskSpaceOverride(int64_t(1) << 40);
        makeSongOfBlocks(1000);
        writeFiles(FT_FILES, "ft 0");
        writeFiles(WAVE_FILES, "wave 0");
    }
    void TearDown() override {
        clearUndo();
        resetSong();
        resetNoteList();
        resetSelection();
        setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
        SharedFolderTest::TearDown();
    }
    template <size_t N>
    void writeFiles(const char* const (&names)[N], const std::string& text) {
        for (const char* name : names) writeFileText(shared(name), text + " " + name);
    }
    template <size_t N>
    std::string fileState(const char* const (&names)[N]) {
        std::string state;
        for (const char* name : names) state += readFileText(shared(name)) + "|";
        return state;
    }
    // Edit k: a snapshot, then note k appended, the files named in changes rewritten. Like
    // every user of the working files it waits for the snapshot's copies first.
    void edit(int k, int changes) {
        takeUndoSnapshot();
        waitForUndoSnapshotCopy();
        ASSERT_EQ(appendNote(noteSpanning(float(k) * 0.1f, float(k) * 0.1f + 0.05f)), 1);
        if (changes & UNDO_FT_CHANGED) writeFiles(FT_FILES, "ft " + std::to_string(k));
        if (changes & UNDO_WAVE_CHANGED) writeFiles(WAVE_FILES, "wave " + std::to_string(k));
        markUndoStale(changes);
    }
    static int beeps() {
        int n = 0;
        for (const UiCall& call : uiCalls()) n += call.call == UI_BEEP;
        return n;
    }
    static bool levelHolds(const char* prefix, int level) { return fileExists(undoFilePath(prefix, level)); }
};

static const int ALL_FILES = UNDO_FT_CHANGED | UNDO_WAVE_CHANGED;

TEST_F(UndoRingTest, EighteenEditsAllowSixteenUndosTheLastBringingBackTheSecondEdit) {
    for (int k = 1; k <= 18; k++) edit(k, ALL_FILES);
    for (int u = 1; u <= 16; u++) {
        ASSERT_EQ(undo(), 1) << "undo " << u;
        waitForUndoSnapshotCopy();
        EXPECT_EQ(noteList.count, 18 - u) << "undo " << u;
    }
    EXPECT_EQ(fileState(FT_FILES), "ft 2 CS.ft|ft 2 CS.fi|");
    EXPECT_EQ(fileState(WAVE_FILES), "wave 2 CS.fw|wave 2 CS.ft+|wave 2 CS.fi+|");
    EXPECT_EQ(canUndo(), 0);
    EXPECT_EQ(undo(), 0);
    EXPECT_EQ(beeps(), 1);
    EXPECT_EQ(noteList.count, 2);
}

TEST_F(UndoRingTest, RedoReturnsToTheLastStateWithItsSelectionsAndFiles) {
    edit(1, ALL_FILES);
    edit(2, UNDO_FT_CHANGED);
    selectNote(1);
    selectNote(0);
    selection.timeSelectionStart = 0.125f;
    selection.timeSelectionEnd = 0.25f;
    selection.anchorNote = 1;
    ASSERT_EQ(undo(), 1);
    EXPECT_EQ(noteList.count, 1);
    EXPECT_EQ(fileState(FT_FILES), "ft 1 CS.ft|ft 1 CS.fi|");
    EXPECT_EQ(canRedo(), 1);
    ASSERT_EQ(redo(), 1);
    waitForUndoSnapshotCopy();
    EXPECT_EQ(noteList.count, 2);
    ASSERT_EQ(selection.selectedNoteCount, 2);
    EXPECT_EQ(selection.selectedNotes[0], 1);
    EXPECT_EQ(selection.selectedNotes[1], 0);
    EXPECT_EQ(selection.timeSelectionStart, 0.125f);
    EXPECT_EQ(selection.timeSelectionEnd, 0.25f);
    EXPECT_EQ(selection.anchorNote, 1);
    EXPECT_EQ(fileState(FT_FILES), "ft 2 CS.ft|ft 2 CS.fi|");
    EXPECT_EQ(fileState(WAVE_FILES), "wave 1 CS.fw|wave 1 CS.ft+|wave 1 CS.fi+|");
    EXPECT_EQ(canRedo(), 0);
    EXPECT_EQ(redo(), 0);
    EXPECT_EQ(beeps(), 1);
}

TEST_F(UndoRingTest, ALevelCopiesOnlyTheFilesThatChangedSinceTheSnapshotBefore) {
    // Edit k's snapshot is level k - 1 and holds what edit k - 1 changed.
    edit(1, 0);                  // level 0: the first snapshot copies everything
    edit(2, UNDO_FT_CHANGED);    // level 1: nothing changed since level 0
    edit(3, 0);                  // level 2: the FT files changed (a pitch edit in MIDI mode)
    waitForUndoSnapshotCopy();
    for (const char* prefix : {"Freq", "FrIn", "FrSd", "HrFq", "HrIn", "Undo", "FrDr"}) EXPECT_TRUE(levelHolds(prefix, 0));
    for (const char* prefix : {"Freq", "FrIn", "FrSd", "HrFq", "HrIn"}) EXPECT_FALSE(levelHolds(prefix, 1)) << prefix;
    EXPECT_TRUE(levelHolds("Freq", 2));
    EXPECT_TRUE(levelHolds("FrIn", 2));
    EXPECT_FALSE(levelHolds("FrSd", 2));
    EXPECT_FALSE(levelHolds("HrFq", 2));
}

TEST_F(UndoRingTest, UndoTakesEachFileFromTheLatestLevelHoldingACopy) {
    edit(1, ALL_FILES);
    edit(2, 0);
    edit(3, 0);
    edit(4, UNDO_FT_CHANGED);   // levels 2 and 3 hold no copies; the FT files changed after level 3
    ASSERT_EQ(undo(), 1);
    waitForUndoSnapshotCopy();
    EXPECT_EQ(noteList.count, 3);
    EXPECT_EQ(fileState(FT_FILES), "ft 1 CS.ft|ft 1 CS.fi|");
    EXPECT_EQ(fileState(WAVE_FILES), "wave 1 CS.fw|wave 1 CS.ft+|wave 1 CS.fi+|");
    for (int k = 0; k < 3; k++) ASSERT_EQ(undo(), 1);
    waitForUndoSnapshotCopy();
    EXPECT_EQ(noteList.count, 0);
    EXPECT_EQ(fileState(FT_FILES), "ft 0 CS.ft|ft 0 CS.fi|");
    EXPECT_EQ(fileState(WAVE_FILES), "wave 0 CS.fw|wave 0 CS.ft+|wave 0 CS.fi+|");
}

TEST_F(UndoRingTest, AnEditAfterUndoDropsTheLevelsThatCouldBeRedone) {
    edit(1, ALL_FILES);
    edit(2, ALL_FILES);
    ASSERT_EQ(undo(), 1);
    edit(3, UNDO_FT_CHANGED);
    EXPECT_EQ(canRedo(), 0);
    ASSERT_EQ(undo(), 1);
    waitForUndoSnapshotCopy();
    EXPECT_EQ(noteList.count, 1);
    EXPECT_EQ(fileState(FT_FILES), "ft 1 CS.ft|ft 1 CS.fi|");
}

TEST_F(UndoRingTest, DiskSpaceDecidesWhetherASnapshotIsTaken) {
    setFreeDiskSpaceOverride(50 << 20);
    edit(1, ALL_FILES);
    EXPECT_EQ(lastMessageText(),
              "Disk space is low on the 'Torvellan Shared' drive which could cause future editing and recording "
              "operations to fail. It is recommended that you choose a folder from recording preferences on a drive "
              "with more than 250Mb free space.");
    EXPECT_EQ(canUndo(), 1);
    clearUiCalls();
    setFreeDiskSpaceOverride(15 << 20);
    edit(2, ALL_FILES);
    EXPECT_EQ(noteList.count, 2);
    EXPECT_EQ(canUndo(), 0);
    EXPECT_EQ(undo(), 0);
    EXPECT_EQ(beeps(), 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_FALSE(fileExists(undoFilePath("Undo", 0)));
}

TEST_F(UndoRingTest, ASnapshotShowsItsStatusTextAndClearsIt) {
    edit(1, ALL_FILES);
    std::vector<std::string> texts;
    for (const UiCall& call : uiCalls())
        if (call.call == UI_STATUS_TEXT) texts.push_back(call.text);
    ASSERT_GE(texts.size(), 2u);
    EXPECT_EQ(texts.front(), "Updating undo buffer...");
    EXPECT_EQ(texts.back(), "");
}

TEST_F(UndoRingTest, ADamagedLevelRestoresNothingAndSaysSo) {
    edit(1, ALL_FILES);
    edit(2, ALL_FILES);
    writeFileBytes(undoFilePath("Undo", 1), {'V', 0, 'o'});   // cut inside the name
    int level = undoState.currentLevel;
    EXPECT_EQ(undo(), 0);
    EXPECT_EQ(lastMessageText(), UNDO_LEVEL_DAMAGED_TEXT);
    EXPECT_EQ(noteList.count, 2);
    EXPECT_EQ(fileState(FT_FILES), "ft 2 CS.ft|ft 2 CS.fi|");
    EXPECT_EQ(undoState.currentLevel, level);
    EXPECT_EQ(undo(), 0) << "the ring stays where it was";
}

// ---- the level files ----

class UndoFileTest : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        makeSongOfBlocks(4);
        makeFolder(shared("CSUndo"));
    }
    void TearDown() override {
        resetSong();
        resetNoteList();
        SharedFolderTest::TearDown();
    }
    // An "Undo" file built field by field: name units, the signature, notes, barlines.
    static std::vector<uint8_t> undoBytes(const std::u16string& name, uint32_t noteCount,
                                          const std::vector<Note>& notes, uint32_t barlineCount,
                                          const std::vector<float>& barlines) {
        std::vector<uint8_t> b;
        for (char16_t u : name) putU16(b, u);
        putU16(b, 0);
        putU32(b, 3);
        putU32(b, 8);
        putU32(b, 0);
        putU32(b, noteCount);
        for (const Note& n : notes) {
            const uint8_t* p = reinterpret_cast<const uint8_t*>(&n);
            b.insert(b.end(), p, p + sizeof n);
        }
        putU32(b, barlineCount);
        for (float t : barlines) {
            uint32_t bits;
            std::memcpy(&bits, &t, 4);
            putU32(b, bits);
        }
        return b;
    }
};

TEST_F(UndoFileTest, TheSongFileHoldsNameSignatureNotesAndBarlinesInOrder) {
    song.instrumentName = "Flöte";
    song.timeSignatureBeats = 3;
    song.timeSignatureUnit = 8;
    song.timeSignatureSymbol = 0;
    Note a = noteSpanning(0.0f, 0.25f), b = noteSpanning(0.5f, 1.0f);
    b.volumeSum = 1234;
    appendNote(a);
    appendNote(b);
    appendBarline(0.75f);
    std::string path = undoFilePath("Undo", 7);
    EXPECT_EQ(path, shared("CSUndo/Undo7"));
    ASSERT_EQ(writeUndoSongFile(path), 1);
    EXPECT_EQ(readFileBytes(path), undoBytes(u"Flöte", 2, {a, b}, 1, {0.75f}));

    UndoSongFile read{};
    ASSERT_EQ(readUndoSongFile(path, &read), UNDO_FILE_READ);
    EXPECT_EQ(read.instrumentName, "Flöte");
    EXPECT_EQ(read.timeSignatureBeats, 3u);
    EXPECT_EQ(read.timeSignatureUnit, 8u);
    ASSERT_EQ(read.notes.size(), 2u);
    EXPECT_EQ(std::memcmp(&read.notes[1], &b, sizeof b), 0);
    EXPECT_EQ(read.barlines, std::vector<float>{0.75f});
}

TEST_F(UndoFileTest, AStoredNoteCountAboveTheListIsReadAsAFullList) {
    std::vector<Note> notes(20000, noteSpanning(0.0f, 0.5f));
    notes[16383].volumeSum = 77;
    std::string path = undoFilePath("Undo", 0);
    writeFileBytes(path, undoBytes(u"Voice", 20000, notes, 1, {2.5f}));
    UndoSongFile read{};
    ASSERT_EQ(readUndoSongFile(path, &read), UNDO_FILE_READ);
    ASSERT_EQ(read.notes.size(), 16384u);
    EXPECT_EQ(read.notes.back().volumeSum, 77u);
    EXPECT_EQ(read.barlines, std::vector<float>{2.5f}) << "the barlines after the notes beyond the list";
}

TEST_F(UndoFileTest, DamagedSongFilesAreRefusedWhole) {
    std::vector<Note> two(2, noteSpanning(0.0f, 0.5f));
    std::vector<uint8_t> sound = undoBytes(u"Voice", 2, two, 1, {1.0f});
    Note notANumber = noteSpanning(0.0f, 0.5f);
    notANumber.waveEnd = std::nanf("");
    struct Case {
        const char* what;
        std::vector<uint8_t> bytes;
    } cases[] = {
        {"empty", {}},
        {"a name without its end", {'V', 0, 'o', 0}},
        {"cut in the signature", std::vector<uint8_t>(sound.begin(), sound.begin() + 16)},
        {"cut inside the notes", std::vector<uint8_t>(sound.begin(), sound.end() - 80)},
        {"no barline count", std::vector<uint8_t>(sound.begin(), sound.end() - 8)},
        {"one byte too many", [&] { auto b = sound; b.push_back(0); return b; }()},
        {"more notes counted than held", undoBytes(u"Voice", 3, two, 1, {1.0f})},
        {"a hostile note count", undoBytes(u"Voice", 0xFFFFFFFF, two, 1, {1.0f})},
        {"a hostile barline count", undoBytes(u"Voice", 2, two, 0x40000000, {1.0f})},
        {"a time that is no number", undoBytes(u"Voice", 1, {notANumber}, 0, {})},
        {"a name longer than any", undoBytes(std::u16string(UNDO_INSTRUMENT_NAME_UNITS + 1, u'x'), 0, {}, 0, {})},
    };
    std::string path = undoFilePath("Undo", 3);
    for (const Case& c : cases) {
        writeFileBytes(path, c.bytes);
        UndoSongFile read{};
        read.instrumentName = "untouched";
        EXPECT_EQ(readUndoSongFile(path, &read), UNDO_FILE_DAMAGED) << c.what;
        EXPECT_EQ(read.instrumentName, "untouched") << c.what;
    }
    writeFileBytes(path, sound);
    UndoSongFile read{};
    EXPECT_EQ(readUndoSongFile(path, &read), UNDO_FILE_READ);
    EXPECT_EQ(readUndoSongFile(undoFilePath("Undo", 4), &read), UNDO_FILE_MISSING);
}

TEST_F(UndoFileTest, DurationsRoundTripAndDamagedOnesAreRefused) {
    song.sampleBlockDurations[2] = 0.5;
    std::string path = undoFilePath("FrDr", 5);
    ASSERT_EQ(writeUndoDurationsFile(path), 1);
    std::vector<uint8_t> bytes = readFileBytes(path);
    ASSERT_EQ(bytes.size(), 4 + 8 * song.sampleBlockDurations.size());
    EXPECT_EQ(getU32(bytes, 0), song.sampleBlockDurations.size());
    std::vector<double> read;
    ASSERT_EQ(readUndoDurationsFile(path, &read), UNDO_FILE_READ);
    EXPECT_EQ(read, song.sampleBlockDurations);

    std::vector<uint8_t> negative = {1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xF0, 0xBF};   // -1.0
    for (const std::vector<uint8_t>& damaged :
         {std::vector<uint8_t>(bytes.begin(), bytes.end() - 1), std::vector<uint8_t>{2, 0, 0, 0}, negative}) {
        writeFileBytes(path, damaged);
        EXPECT_EQ(readUndoDurationsFile(path, &read), UNDO_FILE_DAMAGED);
    }
}
