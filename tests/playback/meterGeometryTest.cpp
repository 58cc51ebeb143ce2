// The level meter: the colour of each level at and around the thresholds, where the bars
// stand (also in a very narrow window), the low-level hint after four seconds of recording,
// and the window's size going to the settings and back.
#include <gtest/gtest.h>

#include <tuple>

#include "playback/meterGeometry.h"
#include "shell/settings.h"

static void expectColour(int level, int red, int green, int blue) {
    MeterColour c = meterBarColour(level);
    EXPECT_EQ(c.red, red) << level;
    EXPECT_EQ(c.green, green) << level;
    EXPECT_EQ(c.blue, blue) << level;
}

TEST(MeterGeometryColours, GoodLevelsArePureGreenAndTheEdgesShadeThroughYellowToRed) {
    expectColour(95, 0, 255, 0);
    expectColour(94, 8, 255, 0);
    expectColour(255, 255, 0, 0);
    expectColour(1, 255, 4, 0);
    expectColour(63, 255, 255, 0);
    expectColour(190, 0, 255, 0);
    expectColour(191, 0, 255, 0);
    expectColour(223, 255, 255, 0);
    expectColour(207, 127, 255, 0);
}

TEST(MeterGeometryBars, BarsFillTheAreaInsideTheMargins) {
    MeterBar bar;
    ASSERT_EQ(meterBar(0, 255, 416, 271, &bar), 1);
    EXPECT_EQ(std::tuple(bar.left, bar.width, bar.top, bar.height), std::tuple(8, 12, 8, 255));
    ASSERT_EQ(meterBar(31, 1, 416, 271, &bar), 1);
    EXPECT_EQ(std::tuple(bar.left, bar.left + bar.width, bar.top + bar.height, bar.height), std::tuple(395, 408, 263, 1));
    bar = MeterBar{-1, -1, -1, -1};
    EXPECT_EQ(meterBar(5, 0, 416, 271, &bar), 0) << "a level of zero draws no bar";
    EXPECT_EQ(bar.left, -1);
}

TEST(MeterGeometryBars, ANarrowWindowStillDrawsEveryBarAPixelWide) {
    for (int width : {47, 40, 16, 1}) {
        for (int i = 0; i < METER_BAR_COUNT; i++) {
            MeterBar bar;
            ASSERT_EQ(meterBar(i, 100, width, 10, &bar), 1);
            EXPECT_GE(bar.width, 1) << width << " " << i;
            EXPECT_GE(bar.height, 1) << width << " " << i;
        }
    }
}

TEST(MeterGeometryHint, FourSecondsOfLowLevelWhileRecordingShowTheHint) {
    resetMeterState(1000);
    int low[METER_BAR_COUNT] = {};
    low[31] = 94;
    meterLevelsDrawn(low, METER_BAR_COUNT, 1400);
    EXPECT_EQ(meterHintShown(true, 1400), 0);
    EXPECT_EQ(meterHintShown(true, 1401), 1);
    EXPECT_EQ(meterHintShown(false, 5000), 0);
    // One good bar removes the hint at the next repaint.
    EXPECT_EQ(meterHintShown(true, 2000), 1);
    int levels[METER_BAR_COUNT] = {};
    levels[10] = 95;
    meterLevelsDrawn(levels, METER_BAR_COUNT, 2000);
    EXPECT_EQ(meterState.lastGoodLevelTime, 2000u);
    EXPECT_EQ(meterHintShown(true, 2001), 0);
}

TEST(MeterGeometryHint, TheHintScalesWithTheWindow) {
    int x, baseline, size;
    meterHintPlace(400, 256, &x, &baseline, &size);
    EXPECT_EQ(x, 25);
    EXPECT_EQ(baseline, 51);
    EXPECT_EQ(size, 100);
}

TEST(MeterGeometryWindow, TheDefaultsPlaceTheMeterNearTheOwnersBottomLeft) {
    globalSettings = GlobalSettings{};
    MeterRect r = meterWindowRect({0, 0, 1000, 800}, 20);
    EXPECT_EQ(std::tuple(r.width, r.height, r.x, r.y), std::tuple(406, 282, 200, 800 - 78 - 282));
}

TEST(MeterGeometryWindow, AResizedMeterComesBackAtTheSameOuterSize) {
    globalSettings = GlobalSettings{};
    storeMeterSize(506, 326, 20);
    EXPECT_EQ(globalSettings.meterWidth, 500);
    EXPECT_EQ(globalSettings.meterHeight, 300);
    MeterRect r = meterWindowRect({100, 50, 1000, 800}, 20);
    EXPECT_EQ(r.width, 506);
    EXPECT_EQ(r.height, 326);
    globalSettings.meterAnchor = 1;
    r = meterWindowRect({100, 50, 1000, 800}, 20);
    EXPECT_EQ(r.x, 100 + 1000 - 200 - 506);
    EXPECT_EQ(r.y, 50 - 78);
    globalSettings = GlobalSettings{};
}
