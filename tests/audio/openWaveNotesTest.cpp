// The notes an opening recognises: the worker's chunk-by-chunk notes against the whole-song
// analysis of the same audio, and a second file's notes appended after the first file's.
// The program's clock is stopped, so that recognition runs after every chunk and the notes
// do not depend on how fast the machine is.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "analysis/frequencyAnalysis.h"
#include "analysis/noteRecognition.h"
#include "analysis/wholeSongAnalysis.h"
#include "analysis/recognitionOptions.h"
#include "analysis/signalGenerator.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/openingFixtures.h"
#include "notes/noteList.h"
#include "platform/clock.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/workingFiles.h"
#include "support/testSupport.h"

namespace {

const uint32_t RATE = OPENING_RATE;
const double SAME_TIME = 1e-4;   // seconds: note times both analyses place on the same block

// The program's clock stands still, so that recognition runs after every chunk.
class OpenWaveNotes : public OpeningTest {
protected:
    void SetUp() override {
        OpeningTest::SetUp();
        setManualClock(true);
    }
    void TearDown() override {
        setManualClock(false);
        resetNoteRecognition();
        OpeningTest::TearDown();
    }
    void openAndWait(const std::string& path) {
        OpeningTest::openAndWait(path);
        ASSERT_EQ(messageCount(), 0) << lastMessageText();
    }
};

std::vector<Note> songNotes() { return std::vector<Note>(noteList.notes, noteList.notes + noteList.count); }

bool sameNote(const Note& a, const Note& b) {
    return a.midiNote == b.midiNote && std::fabs(a.waveStart - b.waveStart) < SAME_TIME &&
           std::fabs(a.waveEnd - b.waveEnd) < SAME_TIME;
}

// Notes of one list that stand in the other with the same semitone and the same times.
int notesInBoth(const std::vector<Note>& a, const std::vector<Note>& b) {
    int same = 0;
    for (const Note& n : a)
        for (const Note& m : b)
            if (sameNote(n, m)) {
                same++;
                break;
            }
    return same;
}

// Both analyses cut the song into the same chunks and the same blocks; they differ only in
// when recognition follows the analysis: the worker after every chunk (as often as its share
// of the time allows, which the stopped clock makes every chunk), whole-song analysis after
// every second of audio. A note still growing when recognition runs is dropped and rebuilt
// at the next run, so a note near such a point may end, or split, a few blocks differently;
// every other note is the same.
TEST_F(OpenWaveNotes, TheWorkersNotesAreTheWholeSongAnalysisNotes) {
    openAndWait(writeMono("melody.wav", melodyBytes(8.0)));
    std::vector<Note> chunked = songNotes();
    uint32_t blocks = song.blockCount;
    ASSERT_GE(chunked.size(), 16u) << "the melody has twenty notes";

    // The same CS.fw analysed as a whole: no blocks, no notes, the audio kept.
    uint32_t audioBytes = song.workingWaveBytes;
    SongWaveFormat format = song.waveFormat;
    closeFTStore();
    freeHiresBuffers();
    resetNoteList();
    resetNoteRecognition();
    song.sampleBlockDurations.clear();
    song.waveFormat = format;
    song.workingWaveBytes = audioBytes;
    ASSERT_EQ(analyseSong(), 1);
    std::vector<Note> whole = songNotes();
    EXPECT_EQ(song.blockCount, blocks);

    EXPECT_LE(std::abs(int(whole.size()) - int(chunked.size())), 2);
    int same = notesInBoth(whole, chunked);
    EXPECT_GE(same, int(whole.size()) * 9 / 10) << same << " of " << whole.size();
    // Where they differ, the note is there all the same: its semitone, starting within 0.03 s.
    for (const Note& n : whole) {
        bool near = false;
        for (const Note& m : chunked) near = near || (m.midiNote == n.midiNote && std::fabs(m.waveStart - n.waveStart) < 0.03);
        EXPECT_TRUE(near) << "note " << int(n.midiNote) << " at " << n.waveStart;
    }
}

TEST_F(OpenWaveNotes, ASecondFilesNotesFollowTheFirstFilesNotesUnchanged) {
    openAndWait(writeMono("melody.wav", melodyBytes(3.0)));
    std::vector<Note> first = songNotes();
    double firstEnd = songDuration();
    ASSERT_GT(first.size(), 4u);
    // E4 (329.63 Hz), held for 1.5 s.
    openAndWait(writeMono("tone.wav", toSampleBytes(toneSignal(329.63, 8000.0, 1.5, RATE, {1.0, 0.6, 0.3}), 16)));
    ASSERT_GT(noteList.count, int(first.size()));
    for (size_t i = 0; i < first.size(); i++) EXPECT_TRUE(sameNote(noteList.notes[i], first[i])) << "note " << i;
    for (int i = int(first.size()); i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        EXPECT_GE(n.waveStart, firstEnd - SAME_TIME);
        EXPECT_LE(n.waveEnd, songDuration() + SAME_TIME);
        EXPECT_EQ(n.midiNote, 64);
    }
}

}  // namespace
