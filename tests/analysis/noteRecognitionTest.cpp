// Recognition of analysed audio from end to end: a sung-like melody through the chunked
// analysis with recognition following it, and the whole-song analysis of a song's working
// wave file, once without tables and once over the tables it stored.
#include <gtest/gtest.h>

#include "analysis/recognitionFixtures.h"
#include "analysis/wholeSongAnalysis.h"
#include "audio/audioActivity.h"
#include "audio/waveWorkingFile.h"
#include "platform/files.h"
#include "resources/strings.h"
#include "shell/closeSong.h"
#include "shell/paths.h"
#include "support/testSupport.h"

class Recognition : public RecognitionTest {
protected:
    void SetUp() override {
        RecognitionTest::SetUp();
        savedPaths = paths;
        setSharedBasePath(folder.path());
        makeFolder(paths.sharedFolder);
    }
    void TearDown() override {
        closeSong();
        paths = savedPaths;
        RecognitionTest::TearDown();
    }
    // The onset, seconds, of MelodyGenerator's note k: notes of 0.4 s, each after a 0.05 s gap.
    static double melodyOnset(int k) { return 0.4 * k + 0.05; }
    static int melodySemitone(int k) { return frequencyToSemitone(MelodyGenerator::noteFrequency(uint64_t(k))); }
    // 2.45 s of MelodyGenerator's melody through the chunked analysis with recognition following it.
    void analyseMelody() {
        setSongFormat(TEST_RATE, 16);
        melodyBytes.assign(size_t(2.45 * TEST_RATE) * 2, 0);
        MelodyGenerator generator;
        generator.fill16(melodyBytes.data(), uint32_t(melodyBytes.size() / 2));
        ASSERT_EQ(setupFrequencyAnalysis(), 1);
        ByteSource source{&melodyBytes, 0, 2};
        ASSERT_EQ(analyseWithRecognition(readByteSource, &source), 1);
    }
    std::vector<uint8_t> melodyBytes;

    TempFolder folder;
    Paths savedPaths;
};

TEST_F(Recognition, ASungMelodyBecomesItsNotes) {
    analyseMelody();
    ASSERT_EQ(noteList.count, 6) << "six notes of 0.4 s";
    for (int k = 0; k < 6; k++) {
        const Note& n = noteList.notes[k];
        EXPECT_EQ(n.midiNote, melodySemitone(k)) << "note " << k;
        EXPECT_NEAR(n.waveStart, melodyOnset(k), 0.05) << "note " << k;
        EXPECT_NEAR(cents(n.pitch, MelodyGenerator::noteFrequency(uint64_t(k))), 0.0, 25.0) << "note " << k;
        EXPECT_GT(n.volumeSum, 0u);
        if (k > 0) {
            EXPECT_GE(n.waveStart, noteList.notes[k - 1].waveEnd);
        }
    }
    // Every block of a note holds its pitch; the gaps between notes hold none.
    EXPECT_NEAR(cents(blockPitch(blockAtTime(0.25)), 220.0), 0.0, 50.0);
    EXPECT_EQ(blockPitch(blockAtTime(0.82)), 0.0);
}

TEST_F(Recognition, NotesBuiltChunkByChunkAreTheNotesOfOnePassOverTheWholeSong) {
    analyseMelody();
    std::vector<Note> chunked(noteList.notes, noteList.notes + noteList.count);
    ASSERT_EQ(chunked.size(), 6u);

    // The same blocks, the notes built again in one call over all of them.
    buildNotes(0, noteList.count);
    ASSERT_EQ(size_t(noteList.count), chunked.size());
    for (size_t k = 0; k < chunked.size(); k++) {
        EXPECT_EQ(noteList.notes[k].midiNote, chunked[k].midiNote) << "note " << k;
        EXPECT_FLOAT_EQ(noteList.notes[k].waveStart, chunked[k].waveStart) << "note " << k;
        EXPECT_FLOAT_EQ(noteList.notes[k].waveEnd, chunked[k].waveEnd) << "note " << k;
        EXPECT_FLOAT_EQ(noteList.notes[k].pitch, chunked[k].pitch) << "note " << k;
    }
}

TEST_F(Recognition, WithoutAnalyseScoreTheTablesAreMadeButNoNotes) {
    setSongFormat(TEST_RATE, 16);
    recognitionOptions.analyseScore = false;
    std::vector<uint8_t> bytes(size_t(1.0 * TEST_RATE) * 2);
    MelodyGenerator generator;
    generator.fill16(bytes.data(), uint32_t(bytes.size() / 2));
    ASSERT_EQ(setupFrequencyAnalysis(), 1);
    ByteSource source{&bytes, 0, 2};
    ASSERT_EQ(analyseWithRecognition(readByteSource, &source), 1);
    EXPECT_GT(song.blockCount, 80u);
    EXPECT_EQ(noteList.count, 0);
}

TEST_F(Recognition, WholeSongAnalysisNeedsAWaveFormatAndSamples) {
    EXPECT_EQ(analyseSong(), 0);
    setSongFormat(TEST_RATE, 16);
    EXPECT_EQ(analyseSong(), 0) << "no samples";
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(Recognition, WholeSongAnalysisMakesTheTablesAndTheNotesOnceOnly) {
    setSongFormat(TEST_RATE, 16);
    // 1.5 s of silence, a 1.2 s tone of 330 Hz with two harmonics, 0.5 s of silence.
    std::vector<uint8_t> samples = toSampleBytes(concatenate({silenceSignal(0.3, TEST_RATE),
                                                              toneSignal(330.0, 8000.0, 1.2, TEST_RATE, {1.0, 0.5, 0.25}),
                                                              silenceSignal(0.5, TEST_RATE)}),
                                                 16);
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
    song.workingWaveBytes = uint32_t(samples.size());
    clearUiCalls();

    ASSERT_EQ(analyseSong(), 1);
    EXPECT_EQ(song.blockCount, uint32_t(samples.size() / 2 / 512));
    ASSERT_EQ(noteList.count, 1);
    EXPECT_EQ(noteList.notes[0].midiNote, 64);
    EXPECT_NEAR(noteList.notes[0].waveStart, 0.3, 0.05);
    EXPECT_NEAR(noteList.notes[0].waveEnd, 1.5, 0.05);
    bool progress = false;
    for (const UiCall& call : uiCalls())
        progress = progress || (call.call == UI_PROGRESS_BEGIN && call.title == resourceString(ANALYSING_WAVE_STRING));
    EXPECT_TRUE(progress) << "\"Analysing wave\"";
    EXPECT_EQ(resourceString(ANALYSING_WAVE_STRING), "Analysing wave");

    // Again, over the stored tables: the notes are built afresh, not added to the old ones.
    ASSERT_EQ(analyseSong(), 1);
    ASSERT_EQ(noteList.count, 1);
    EXPECT_EQ(noteList.notes[0].midiNote, 64);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(Recognition, NoWholeSongAnalysisWhileAnOpeningRuns) {
    setSongFormat(TEST_RATE, 16);
    song.workingWaveBytes = 1000;
    audioActivity.opening = true;
    EXPECT_EQ(analyseSong(), 0);
    audioActivity.opening = false;
}
