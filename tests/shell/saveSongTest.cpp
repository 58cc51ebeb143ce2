// Save and Save As without their dialog: the output type, the remembered names, writing the
// whole song or only the selected range, saving again without a dialog, and the refusals.
#include <gtest/gtest.h>

#include <string>
#include <vector>
#include <tuple>

#include "audio/waveWorkingFile.h"
#include "frameFixtures.h"
#include "platform/files.h"
#include "playback/midiOutput.h"
#include "shell/paths.h"
#include "support/testSupport.h"

namespace {

std::vector<std::string> midiWrites;   // "path detail range" for each stand-in MIDI write

class CommandTableSave : public FrameTest {
protected:
    // A song of 0.5 s at 8192 Hz, 16-bit, in 64 blocks of 1/128 s (times and frames are exact
    // in binary), with its audio in CS.fw.
    void SetUp() override {
        FrameTest::SetUp();
        midiWrites.clear();
        song.waveFormat = SongWaveFormat{1, 1, 8192, 16384, 2, 16};
        song.sampleBlockDuration = 1.0 / 128;
        song.sampleBlockDurations.assign(64, 1.0 / 128);
        song.blockCount = 64;
        std::vector<uint8_t> samples;
        for (int n = 0; n < 4096; n++) putU16(samples, uint16_t(n));
        ASSERT_EQ(createWaveWorkingFile(), 0);
        WaveReadInfo layout{};
        ASSERT_EQ(wioFileOpen(&layout, sharedFilePath("CS.fw"), 0), WIO_OPENED);
        wioFileClose(&layout);
        FILE* file = fileOpen(sharedFilePath("CS.fw"), "r+b");
        ASSERT_NE(file, nullptr);
        ASSERT_EQ(fileSeek(file, layout.dataOffset, SEEK_SET), 0);
        ASSERT_EQ(fileWrite(samples.data(), samples.size(), file), samples.size());
        ASSERT_EQ(patchWaveHeader(file, layout, uint32_t(samples.size()), 16), 1);
        ASSERT_EQ(fileClose(file), 0);
        ASSERT_EQ(maskWaveWorkingFile(), 1);
        showSongView();
        clearUiCalls();
    }
    void TearDown() override {
        fileDelete(sharedFilePath("CS.fw"));
        FrameTest::TearDown();
    }
    void installMidiWriter() {
        commandOperations.writeNotesMidiFile = [](const std::string& path, int detail, int onlySelectedRange) {
            midiWrites.push_back(path + " " + std::to_string(detail) + " " + std::to_string(onlySelectedRange));
            return 1;
        };
    }
    int64_t dataBytesOf(const std::string& path) { return fileSize(path) - WAVE_SEGMENT_HEADER_BYTES; }

    TempFolder folder;
};

}  // namespace

TEST_F(CommandTableSave, ANewSongIsNamedAfterItsFileWithoutTheExtension) {
    setSongNamesFromFile("/songs/take 1.wav");
    const SongNames& n = songNames;
    EXPECT_EQ(std::tuple(n.remembered[OUTPUT_WAVE], n.remembered[OUTPUT_MIDI], n.remembered[OUTPUT_DETAIL_MIDI], n.lastSaved[OUTPUT_WAVE]),
              std::tuple("/songs/take 1", "/songs/take 1", "/songs/take 1", ""));
    setSongNamesFromFile("/songs/v1.2/take.mpeg");   // the dot is five characters from the end
    EXPECT_EQ(songNames.remembered[OUTPUT_WAVE], "/songs/v1.2/take.mpeg");
    setSongNamesFromFile("/songs/take.ab");
    EXPECT_EQ(songNames.remembered[OUTPUT_WAVE], "/songs/take");
}

TEST_F(CommandTableSave, TheDialogOffersTheOutputsFilterAndProposesItsName) {
    const std::tuple<int, int, int> modes[] = {{NOTE_MODE_NOTE, PLAYBACK_MODE_WAVE, OUTPUT_WAVE},
                                               {NOTE_MODE_NOTE, PLAYBACK_MODE_MIDI, OUTPUT_MIDI},
                                               {NOTE_MODE_DETAIL, PLAYBACK_MODE_MIDI, OUTPUT_DETAIL_MIDI},
                                               {NOTE_MODE_DETAIL, PLAYBACK_MODE_WAVE, OUTPUT_WAVE}};
    for (auto [noteMode, playbackMode, output] : modes) {
        displayModes.noteMode = noteMode;
        displayModes.playbackMode = playbackMode;
        EXPECT_EQ(currentOutputType(), output) << noteMode << " " << playbackMode;
    }
    setSongNamesFromFile("/songs/take.wav");
    globalSettings.saveDirectory = "/exports";
    SaveDialogSetup wave = saveDialogSetup();
    EXPECT_EQ(std::tuple(wave.filterName, wave.pattern, wave.proposedName, wave.directory),
              std::tuple("Wave audio files", "*.wav", "/songs/take", "/exports"));
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    songNames.remembered[OUTPUT_DETAIL_MIDI] = "/songs/take detail";
    SaveDialogSetup midi = saveDialogSetup();
    EXPECT_EQ(std::tuple(midi.filterName, midi.pattern, midi.proposedName), std::tuple("MIDI files", "*.mid", "/songs/take detail"));
}

TEST_F(CommandTableSave, SaveAsWritesTheWholeSongAndSaveThenRewritesTheSameFileWithoutADialogUntilTheSongCloses) {
    EXPECT_EQ(saveSong(), SAVE_NEEDS_DIALOG) << "no name saved before";
    setSongNamesFromFile("/songs/take.wav");
    EXPECT_EQ(saveSong(), SAVE_NEEDS_DIALOG);
    std::string out = folder.file("take.wav");
    ASSERT_EQ(writeSongOutput(out, false), 1);
    EXPECT_EQ(std::tuple(dataBytesOf(out), songNames.remembered[OUTPUT_WAVE], songNames.lastSaved[OUTPUT_WAVE]), std::tuple(8192, out, out));
    ASSERT_EQ(fileDelete(out), 0);
    EXPECT_EQ(saveSong(), SAVE_WRITTEN);
    EXPECT_EQ(std::tuple(dataBytesOf(out), messageCount()), std::tuple(8192, 0));
    songWindowClosed();   // closing the song forgets its names
    EXPECT_EQ(songNames.remembered[OUTPUT_WAVE], "");
    EXPECT_EQ(songNames.lastSaved[OUTPUT_WAVE], "");
    EXPECT_EQ(saveSong(), SAVE_NEEDS_DIALOG);
}

TEST_F(CommandTableSave, OnlyTheSelectedRangeIsWrittenWhenTheBoxIsCheckedAndTheRangeLongEnough) {
    std::string out = folder.file("part.wav");
    selection.timeSelectionStart = 0.25f;
    selection.timeSelectionEnd = 0.5f;
    ASSERT_EQ(writeSongOutput(out, true), 1);
    EXPECT_EQ(dataBytesOf(out), 4096);
    ASSERT_EQ(writeSongOutput(out, false), 1);
    EXPECT_EQ(dataBytesOf(out), 8192);
    // Half a block (1/256 s, 32 frames) is long enough; less is not, and the whole song is written.
    selection.timeSelectionEnd = 0.25f + 1.0f / 256;
    ASSERT_EQ(writeSongOutput(out, true), 1);
    EXPECT_EQ(dataBytesOf(out), 64);
    selection.timeSelectionEnd = 0.25f + 1.0f / 512;
    ASSERT_EQ(writeSongOutput(out, true), 1);
    EXPECT_EQ(dataBytesOf(out), 8192);
    selection.timeSelectionStart = NO_TIME_SELECTION;
    ASSERT_EQ(writeSongOutput(out, true), 1);
    EXPECT_EQ(dataBytesOf(out), 8192);
}

TEST_F(CommandTableSave, NothingIsWrittenWhileRecordingOrOpeningAndTheUserIsTold) {
    std::string out = folder.file("busy.wav");
    audioActivity.opening = true;
    EXPECT_EQ(writeSongOutput(out, false), 0);
    EXPECT_EQ(lastMessageText(), "Sorry - this cannot be done whilst opening audio.");
    audioActivity.recording = true;
    EXPECT_EQ(saveAllowed(), 0);
    EXPECT_EQ(lastMessageText(), "Sorry - this cannot be done whilst recording audio.");
    EXPECT_FALSE(fileExists(out));
    EXPECT_EQ(songNames.lastSaved[OUTPUT_WAVE], "");
}

TEST_F(CommandTableSave, MidiOutputGoesToTheMidiWriterAndIsReportedWhenThereIsNone) {
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    std::string out = folder.file("take.mid");
    EXPECT_EQ(saveAllowed(), 0);
    EXPECT_EQ(lastMessageText(), "Saving MIDI files is not available in this version of Torvellan Melodrift.");
    EXPECT_EQ(writeSongOutput(out, false), 0);
    EXPECT_EQ(songNames.lastSaved[OUTPUT_DETAIL_MIDI], "");

    installMidiWriter();
    ASSERT_EQ(writeSongOutput(out, false), 1);
    displayModes.noteMode = NOTE_MODE_NOTE;
    EXPECT_EQ(saveSong(), SAVE_NEEDS_DIALOG);   // the plain MIDI name is a name of its own
    displayModes.noteMode = NOTE_MODE_DETAIL;
    EXPECT_EQ(saveSong(), SAVE_WRITTEN);
    ASSERT_EQ(writeSongOutput(out, true), 1);
    EXPECT_EQ(midiWrites, std::vector<std::string>({out + " 1 0", out + " 1 0", out + " 1 1"}));
    // The program's own MIDI writer.
    commandOperations.writeNotesMidiFile = saveMidiFile;
    ASSERT_EQ(writeSongOutput(out, false), 1);
    std::vector<uint8_t> bytes = readFileBytes(out);
    ASSERT_GE(bytes.size(), 14u);
    EXPECT_EQ(std::string(bytes.begin(), bytes.begin() + 4), "MThd");
}
