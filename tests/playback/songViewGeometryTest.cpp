// The song view's geometry: pitch labels, the Chromatic and Diatonic layouts and their
// inverse, the y cache, the plot's minimum height, time to x at the menu zooms, zooming about
// an anchor, fitting the song and the auto-scroll during playback.
#include <gtest/gtest.h>

#include <cmath>
#include <tuple>

#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "playback/playbackState.h"
#include "playback/songViewGeometry.h"
#include "shell/commandTable.h"
#include "shell/settings.h"
#include "shell/zoom.h"
#include "store/song.h"

// A song of seconds at 1/128 s per block.
static void makeSongOfSeconds(int seconds) {
    resetSong();
    song.sampleBlockDuration = 1.0 / 128;
    song.blockCount = uint32_t(seconds * 128);
    song.sampleBlockDurations.assign(song.blockCount, 1.0 / 128);
}

class SongViewGeometryTest : public ::testing::Test {
protected:
    void SetUp() override {
        resetRecognitionOptions();   // pitch range 1: semitones 23 .. 97
        globalSettings = GlobalSettings{};
        resetZoom();
        resetPlaybackState();
        resetSongViewGeometry();
        makeSongOfSeconds(60);
    }
    void TearDown() override {
        resetSong();
        resetZoom();
        globalSettings = GlobalSettings{};
    }
    // A drawing window whose plot is 600 pixels high and 1000 wide right of the labels.
    void layout(int scaleMode) {
        globalSettings.scaleMode = scaleMode;
        layoutSongView(LABEL_COLUMN_WIDTH + 1000, 630);
    }
};

using SongViewPitchNames = SongViewGeometryTest;

TEST_F(SongViewPitchNames, MiddleAAndMiddleCCarryOctaveFourAndSharpsAreSpelledByTheChosenNames) {
    const std::tuple<int, bool, int, const char*> cases[] = {
        {69, true, PITCH_NAMES_CHROMATIC, "A4"},     {60, true, PITCH_NAMES_CHROMATIC, "C4"},
        {59, true, PITCH_NAMES_DIATONIC, "B3"},      {61, true, PITCH_NAMES_CHROMATIC, "C#/Db4"},
        {61, true, PITCH_NAMES_DIATONIC, "C#4"},     {70, true, PITCH_NAMES_DIATONIC, "Bb4"},
        {63, false, PITCH_NAMES_DIATONIC, "Eb"},     {66, false, PITCH_NAMES_CHROMATIC, "F#/Gb"}};
    for (auto [semitone, octave, names, text] : cases) EXPECT_EQ(pitchName(semitone, octave, names), text) << semitone;
}

using SongViewPitchRange = SongViewGeometryTest;

TEST_F(SongViewPitchRange, EachPitchRangeSnapsToItsSemitones) {
    const int expected[3][2] = {{35, 109}, {23, 97}, {20, 85}};
    for (int range = 0; range < 3; range++) {
        generalSettings.pitchRange = range;
        applyAnalysisPreferences();
        layout(SCALE_MODE_CHROMATIC);
        EXPECT_EQ(songViewGeometry.lowSemitone, expected[range][0]) << range;
        EXPECT_EQ(songViewGeometry.highSemitone, expected[range][1]) << range;
    }
    EXPECT_NEAR(songViewGeometry.lowFrequency, 25.96, 0.01);
    EXPECT_NEAR(songViewGeometry.highFrequency, 1108.73, 0.01);
    generalSettings = GeneralSettings{};
}

using SongViewChromatic = SongViewGeometryTest;

TEST_F(SongViewChromatic, TheRangeEndsAreThePlotEdgesAndSemitonesAreEven) {
    layout(SCALE_MODE_CHROMATIC);
    ASSERT_EQ(songViewGeometry.plotHeight, 600);
    EXPECT_EQ(plotBottom(), 602);
    EXPECT_EQ(pitchToY(pitchToFrequency(23)), 602);
    EXPECT_EQ(pitchToY(pitchToFrequency(97)), 2);
    // 46 of 74 semitones up: 372.97 pixels, truncated.
    EXPECT_EQ(pitchToY(440.0), 230);
    EXPECT_NEAR(chromaticPixelsPerSemitone(), 600.0 / 74, 1e-9);
}

TEST_F(SongViewChromatic, YToPitchInvertsTheLayout) {
    layout(SCALE_MODE_CHROMATIC);
    EXPECT_NEAR(yToPitch(602), 30.87, 0.01);
    EXPECT_NEAR(yToPitch(2), 2217.46, 0.01);
    for (int y = 10; y < 600; y += 37) EXPECT_EQ(pitchToY(yToPitch(y) * 1.0001), y) << y;
}

using SongViewDiatonic = SongViewGeometryTest;

TEST_F(SongViewDiatonic, EveryPairOfLettersIsOneStepApart) {
    layout(SCALE_MODE_DIATONIC);
    double step = diatonicPixelsPerStep();   // 600 / 43
    EXPECT_NEAR(semitoneLineY(64) - semitoneLineY(65), step, 1.0);   // E4 - F4
    EXPECT_NEAR(semitoneLineY(59) - semitoneLineY(60), step, 1.0);   // B3 - C4
    EXPECT_NEAR(semitoneLineY(60) - semitoneLineY(62), step, 1.0);   // C4 - D4, two semitones
    EXPECT_EQ(semitoneLineY(64), 268);
    EXPECT_EQ(semitoneLineY(65), 254);
}

TEST_F(SongViewDiatonic, ASharpSharesItsLettersLineButItsFrequencySitsHalfAStepAbove) {
    layout(SCALE_MODE_DIATONIC);
    EXPECT_EQ(semitoneLineY(61), semitoneLineY(60));
    EXPECT_EQ(semitoneLineY(60), 296);
    EXPECT_EQ(pitchToY(pitchToFrequency(61)), 289);   // 22.5 steps above B1
    EXPECT_EQ(pitchToY(pitchToFrequency(60)), 296);
    // A quarter tone above C lies between the C line and the C# place.
    int y = pitchToY(pitchToFrequency(60.5));
    EXPECT_LT(y, 296);
    EXPECT_GT(y, 289);
}

TEST_F(SongViewDiatonic, TheBisectionFindsTheFrequencyOfAPixel) {
    layout(SCALE_MODE_DIATONIC);
    EXPECT_NEAR(frequencyToPitch(yToPitch(semitoneLineY(69))), 69.0, 0.5);
    for (int y = 20; y < 600; y += 53) EXPECT_NEAR(pitchToY(yToPitch(y)), y, 1) << y;
}

TEST_F(SongViewDiatonic, BothBitsDrawAtTheMeanOfTheTwoLayoutsAndNoBitAtZero) {
    layout(SCALE_MODE_CHROMATIC | SCALE_MODE_DIATONIC);
    EXPECT_EQ(chromaticY(440.0), 230);
    EXPECT_EQ(diatonicY(440.0), 226);
    EXPECT_EQ(pitchToY(440.0), 228);
    EXPECT_NEAR(pitchToY(yToPitch(300)), 300, 1);
    layout(0);   // no layout bit puts everything at 0
    EXPECT_EQ(pitchToY(440.0), 0);
    EXPECT_EQ(yToPitch(300), 0.0);
}

TEST_F(SongViewDiatonic, TheCacheIsClearedWhenThePlotHeightOrRangeChanges) {
    layout(SCALE_MODE_DIATONIC);
    EXPECT_EQ(diatonicY(440.0), 226);
    layoutSongView(LABEL_COLUMN_WIDTH + 1000, 830);   // H = 800: 27 of 43 steps is 502 pixels
    EXPECT_EQ(diatonicY(440.0), 300);
    generalSettings.pitchRange = 0;                     // semitones 35 .. 109: P 20 .. 63
    applyAnalysisPreferences();
    layoutSongView(LABEL_COLUMN_WIDTH + 1000, 830);
    EXPECT_EQ(diatonicY(440.0), 802 - 372);            // 20 of 43 steps
    generalSettings = GeneralSettings{};
    // Scrolling moves cached pitches with the plot.
    layoutSongView(LABEL_COLUMN_WIDTH + 1000, 200);
    int before = diatonicY(440.0);
    setSongViewScroll(0, 100);
    EXPECT_EQ(diatonicY(440.0), before - 100);
}

using SongViewLayout = SongViewGeometryTest;

TEST_F(SongViewLayout, AShortWindowScrollsInsteadOfCompressing) {
    globalSettings.scaleMode = SCALE_MODE_CHROMATIC;
    layoutSongView(800, 200);
    EXPECT_EQ(songViewGeometry.plotHeight, 380);
    EXPECT_EQ(maxScrollY(), 380 + 30 - 200);
    double tall = chromaticPixelsPerSemitone();
    layoutSongView(800, 410);
    EXPECT_EQ(songViewGeometry.plotHeight, 380);
    EXPECT_EQ(maxScrollY(), 0);
    EXPECT_EQ(chromaticPixelsPerSemitone(), tall);
    layoutSongView(800, 1000);
    EXPECT_EQ(songViewGeometry.plotHeight, 970);
}

TEST_F(SongViewLayout, OneSecondIs128PixelsAt100PercentHalvedAndDoubled) {
    layout(SCALE_MODE_CHROMATIC);
    EXPECT_EQ(timeToX(0.0), LABEL_COLUMN_WIDTH);
    EXPECT_EQ(timeToX(1.0) - timeToX(0.0), 128);
    zoomCommand(CMD_ZOOM_50);
    layout(SCALE_MODE_CHROMATIC);
    EXPECT_EQ(timeToX(1.0) - timeToX(0.0), 64);
    zoomCommand(CMD_ZOOM_200);
    layout(SCALE_MODE_CHROMATIC);
    EXPECT_EQ(timeToX(1.0) - timeToX(0.0), 256);
    EXPECT_EQ(plotWidth(), 60 * 256);
}

TEST_F(SongViewLayout, ScrollingIsLimitedToTheSong) {
    layout(SCALE_MODE_CHROMATIC);
    setSongViewScroll(100000, -5);
    EXPECT_EQ(songViewGeometry.scrollX, 60 * 128 - 1000);
    EXPECT_EQ(songViewGeometry.scrollY, 0);
    EXPECT_EQ(timeToX(60.0), LABEL_COLUMN_WIDTH + 1000);
    EXPECT_NEAR(xToTime(LABEL_COLUMN_WIDTH + 1000), 60.0, 1e-9);
}

using SongViewZoom = SongViewGeometryTest;

TEST_F(SongViewZoom, SetZoomKeepsTheTimeUnderTheAnchorPut) {
    layout(SCALE_MODE_CHROMATIC);
    setSongViewScroll(1000, 0);
    double t = xToTime(564);   // 11.71875 s
    setZoom(8.0, 564);
    EXPECT_EQ(zoomState.zoomFactor, 8.0);
    EXPECT_EQ(songViewGeometry.scrollX, 2500);
    EXPECT_EQ(timeToX(t), 564);
    setZoom(2.0, 564);
    EXPECT_EQ(timeToX(t), 564);
    // Zooming out at the end stays within the scroll range.
    setSongViewScroll(maxScrollX(), 0);
    setZoom(2.0, LABEL_COLUMN_WIDTH + 1000);
    EXPECT_EQ(songViewGeometry.scrollX, 60 * 64 - 1000);
}

TEST_F(SongViewZoom, AMenuZoomIsAppliedAboutTheMiddleAtTheNextLayout) {
    layout(SCALE_MODE_CHROMATIC);
    setSongViewScroll(1000, 0);
    double middle = xToTime(LABEL_COLUMN_WIDTH + 500);
    zoomCommand(CMD_ZOOM_IN);
    layout(SCALE_MODE_CHROMATIC);
    EXPECT_EQ(timeToX(1.0) - timeToX(0.0), 192);
    EXPECT_NEAR(timeToX(middle), LABEL_COLUMN_WIDTH + 500, 1);
}

TEST_F(SongViewZoom, FitToWindowShowsTheWholeSongWithinTheLimits) {
    makeSongOfSeconds(10);
    layout(SCALE_MODE_CHROMATIC);
    EXPECT_EQ(fitZoomToWindow(), 1);
    EXPECT_DOUBLE_EQ(zoomState.zoomFactor, 3.125);
    EXPECT_EQ(timeToX(10.0), LABEL_COLUMN_WIDTH + 1000);
    EXPECT_EQ(fitZoomToWindow(), 0);
    makeSongOfSeconds(100);
    EXPECT_EQ(fitZoomToWindow(), 1);
    EXPECT_DOUBLE_EQ(zoomState.zoomFactor, ZOOM_MINIMUM);
    resetSong();
    EXPECT_EQ(fitZoomToWindow(), 0);
}

using SongViewAutoScroll = SongViewGeometryTest;

// A cursor within the band leaves the view; one past seven eighths is brought to the left edge,
// unless the end time stops it at seven eighths; one left of the view scrolls back, not below 0.
TEST_F(SongViewAutoScroll, TheViewFollowsTheCursor) {
    layout(SCALE_MODE_CHROMATIC);
    struct Case {
        int scrollX;
        double cursor, end;
        int scrolled, expectedScrollX;
    } cases[] = {{0, 3.0, 60.0, 0, 0}, {0, 8.0, 60.0, 1, 8 * 128 - 6}, {0, 45.0, 50.0, 1, 50 * 128 - 875},
                 {3000, 1.0, 60.0, 1, 122}, {3000, 0.01, 60.0, 1, 0}};
    for (const Case& c : cases) {
        setSongViewScroll(c.scrollX, 0);
        EXPECT_EQ(autoScrollSongView(c.cursor, c.end), c.scrolled) << c.cursor;
        EXPECT_EQ(songViewGeometry.scrollX, c.expectedScrollX) << c.cursor;
    }
    setSongViewScroll(0, 0);
    EXPECT_EQ(scrollToSongEnd(), 1);
    EXPECT_EQ(timeToX(songDuration()), LABEL_COLUMN_WIDTH + 1000);
    EXPECT_EQ(scrollToSongEnd(), 0);
}
