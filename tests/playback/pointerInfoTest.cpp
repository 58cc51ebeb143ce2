// The pointer info: the time and frequency formats, which kind word the pointer gets over a
// selection, a note, a barline or empty space and while the program is busy, the recording
// load text and the tuning indicator's segments.
#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <tuple>

#include "analysis/recognitionOptions.h"
#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "playback/playbackState.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "shell/settings.h"
#include "shell/zoom.h"
#include "store/song.h"

class PointerInfoTest : public ::testing::Test {
protected:
    void SetUp() override {
        resetRecognitionOptions();
        globalSettings = GlobalSettings{};
        resetZoom();
        resetPlaybackState();
        resetSongViewGeometry();
        resetNoteList();
        resetSelection();
        resetDisplayModes();
        resetPointerInfo();
        audioActivity = AudioActivity{};
        resetSong();
        song.sampleBlockDuration = 1.0 / 128;
        song.blockCount = 128 * 10;
        song.sampleBlockDurations.assign(song.blockCount, 1.0 / 128);
        layoutSongView(LABEL_COLUMN_WIDTH + 1000, 630);   // chromatic, H = 600, 128 px/s
        Note note{};
        note.midiNote = 60;
        note.pitch = 261.63f;
        note.midiStart = note.waveStart = 0.25f;
        note.midiEnd = note.waveEnd = 0.5f;
        appendNote(note);
    }
    void TearDown() override {
        resetNoteList();
        resetSelection();
        resetSong();
        resetDisplayModes();
        audioActivity = AudioActivity{};
        resetPlaybackState();
    }
    static int xOf(double t) { return timeToX(t); }
};

// The texts the strip shows: kind, the two times, pitch name and frequency.
struct InfoTexts {
    std::string kind, firstTime, secondTime, pitchName, frequencyText;
};

void expectInfo(const InfoTexts& expected) {
    const PointerInfo& p = pointerInfo;
    EXPECT_EQ(std::tuple(p.kind, p.firstTime, p.secondTime, p.pitchName, p.frequencyText),
              std::tuple(expected.kind, expected.firstTime, expected.secondTime, expected.pitchName, expected.frequencyText));
}

TEST(PointerInfoFormats, TimesShowMinutesAndHundredthsFrequenciesWholeHertz) {
    const std::pair<double, const char*> times[] = {
        {75.5, "1:15.50"}, {3.25, "0:03.25"}, {0.0, "0:00.00"}, {-3.0, "0:00.00"}, {600.0, "10:00.00"}};
    for (auto [t, text] : times) EXPECT_EQ(formatSongTime(t), text) << t;
    EXPECT_EQ(formatFrequencyText(440.4), "440Hz");
    EXPECT_EQ(formatFrequencyText(261.63), "262Hz");
    EXPECT_EQ(recordingLoadText(0.3, 37.4), "Latency 0.3s  Processor 37%");
}

using PointerInfoKinds = PointerInfoTest;

// Over the selection, a note (its pitch only in Note mode), a barline or empty space (the
// pitch under the pointer, spelled diatonically), left of the song.
TEST_F(PointerInfoKinds, ThePointerGetsTheKindOfWhatLiesUnderIt) {
    barlineList.times[0] = 2.5f;
    barlineList.count = 1;
    selection.timeSelectionStart = 1.0f;
    selection.timeSelectionEnd = 2.0f;
    updatePointerInfo(xOf(1.5), 300);
    expectInfo({"SELECTION", "0:01.00", "0:02.00", "", ""});
    updatePointerInfo(xOf(3.0), plotBottom());
    expectInfo({"POINTER", "0:03.00", "", "B0", "31Hz"});
    updatePointerInfo(xOf(3.0), semitoneLineY(70) - 1);
    expectInfo({"POINTER", "0:03.00", "", "Bb4", "469Hz"});   // a pixel above the line
    updatePointerInfo(10, plotBottom());
    expectInfo({"POINTER", "0:00.00", "", "B0", "31Hz"});
    selection.pointerNote = 0;
    updatePointerInfo(xOf(0.3), 300);
    expectInfo({"NOTE", "0:00.25", "0:00.50", "", ""});
    displayModes.noteMode = NOTE_MODE_NOTE;
    refreshPointerInfo();
    expectInfo({"NOTE", "0:00.25", "0:00.50", "C4", "262Hz"});
    selection.pointerNote = -1;
    selection.pointerBarline = 0;
    updatePointerInfo(xOf(2.5), 300);
    expectInfo({"BARLINE", "0:02.50", "", "", ""});
}

TEST_F(PointerInfoKinds, BusyStatesShowTheirWordsAndSeparators) {
    EXPECT_STREQ(infoTimeSeparator(), "-");
    audioActivity.opening = true;
    audioActivity.openingSeconds = 75.5;
    updatePointerInfo(xOf(1.0), 300);
    expectInfo({"OPENING", "0:10.00", "1:15.50", "", ""});
    EXPECT_STREQ(infoTimeSeparator(), "/");
    audioActivity = AudioActivity{true, false, 0.0};
    updatePointerInfo(xOf(1.0), 300);
    expectInfo({"RECORDING", "0:10.00", "", "", ""});
    EXPECT_STREQ(infoTimeSeparator(), "/");
    audioActivity.recording = false;
    pointerInfo.finishing = true;
    refreshPointerInfo();
    expectInfo({"FINISHING...", "0:10.00", "", "", ""});
}

TEST_F(PointerInfoKinds, PlaybackShowsTheCursorAndTheNoteItPlays) {
    playbackState.waveDevice = 1;
    playbackState.cursor = 30;
    playbackState.end = 1000;
    selection.pointerNote = 0;
    updatePointerInfo(xOf(5.0), 300);
    expectInfo({"PLAYBACK", "0:00.30", "0:10.00", "C4", "262Hz"});
    EXPECT_GT(pointerInfo.tuningKey, 261.0);
}

using PointerInfoTuning = PointerInfoTest;

TEST_F(PointerInfoTuning, SegmentsSitEitherSideOfTheCentreMark) {
    EXPECT_EQ(tuningSegmentLeft(0), 450);
    EXPECT_EQ(tuningSegmentLeft(4), 498);
    EXPECT_EQ(tuningSegmentLeft(5), 514);
    EXPECT_EQ(tuningSegmentLeft(9), 562);
    // The centre mark lies in the gap between the fifth and the sixth segment.
    EXPECT_GT(TUNING_CENTRE_X, tuningSegmentLeft(4) + TUNING_SEGMENT_WIDTH);
    EXPECT_LT(TUNING_CENTRE_X + TUNING_CENTRE_WIDTH, tuningSegmentLeft(5));
}

TEST_F(PointerInfoTuning, AFlatNoteLightsLeftwardsASharpOneRightwardsAndNoneWithinTheTolerance) {
    EXPECT_EQ(tuningDeviationSegments(440.0, 440.0), 0);
    EXPECT_EQ(tuningDeviationSegments(440.0 * std::pow(2.0, 5.0 / 1200), 440.0), 0);
    EXPECT_EQ(tuningDeviationSegments(0.0, 440.0), 0);
    for (int i = 0; i < TUNING_SEGMENTS; i++) EXPECT_EQ(tuningSegmentLit(i, 0), 0);
    int flat = tuningDeviationSegments(440.0 * std::pow(2.0, -25.0 / 1200), 440.0);
    EXPECT_EQ(flat, -2);
    EXPECT_EQ(tuningSegmentLit(4, flat), 1);
    EXPECT_EQ(tuningSegmentLit(3, flat), 1);
    EXPECT_EQ(tuningSegmentLit(2, flat), 0);
    EXPECT_EQ(tuningSegmentLit(5, flat), 0);
    int sharp = tuningDeviationSegments(440.0 * std::pow(2.0, 15.0 / 1200), 440.0);
    EXPECT_EQ(sharp, 1);
    EXPECT_EQ(tuningSegmentLit(5, sharp), 1);
    EXPECT_EQ(tuningSegmentLit(6, sharp), 0);
    EXPECT_EQ(tuningDeviationSegments(440.0 * std::pow(2.0, 200.0 / 1200), 440.0), 5);
    EXPECT_EQ(tuningSegmentLit(9, 5), 1);
}
