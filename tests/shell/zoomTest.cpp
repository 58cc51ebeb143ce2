// The zoom commands: the fixed zooms, Zoom In and Zoom Out and the limits they keep.
#include <gtest/gtest.h>

#include <vector>

#include "frameFixtures.h"
#include "shell/commandTable.h"

class CommandTableZoom : public FrameTest {
protected:
    void SetUp() override {
        FrameTest::SetUp();
        openSong(128, 1);
    }
};

TEST_F(CommandTableZoom, TheFixedZoomsSetTheirFactors) {
    EXPECT_EQ(zoomState.zoomFactor, 4.0);
    dispatchCommand(CMD_ZOOM_50);
    EXPECT_EQ(zoomState.zoomFactor, 2.0);
    EXPECT_EQ(zoomPercent(), 50);
    dispatchCommand(CMD_ZOOM_200);
    EXPECT_EQ(zoomState.zoomFactor, 8.0);
    EXPECT_EQ(zoomPercent(), 200);
    dispatchCommand(CMD_ZOOM_100);
    EXPECT_EQ(zoomState.zoomFactor, 4.0);
    EXPECT_EQ(zoomPercent(), 100);
}

TEST_F(CommandTableZoom, ZoomInFrom26Point67Gives40AndAFurtherZoomInIsIgnored) {
    zoomState.zoomFactor = 40.0 / 1.5;
    EXPECT_EQ(zoomCommand(CMD_ZOOM_IN), 1);
    EXPECT_EQ(zoomState.zoomFactor, 40.0);
    EXPECT_EQ(zoomCommand(CMD_ZOOM_IN), 0);
    EXPECT_EQ(zoomState.zoomFactor, 40.0);
}

TEST_F(CommandTableZoom, ZoomOutFrom2IsIgnoredBecause1Point333IsBelowTheLimit) {
    dispatchCommand(CMD_ZOOM_50);
    dispatchCommand(CMD_ZOOM_OUT);
    EXPECT_EQ(zoomState.zoomFactor, 2.0);
}

TEST_F(CommandTableZoom, ZoomOutMayLandExactlyOnTheLowerLimit) {
    zoomState.zoomFactor = 2.60869575;
    EXPECT_EQ(zoomCommand(CMD_ZOOM_OUT), 1);
    EXPECT_DOUBLE_EQ(zoomState.zoomFactor, ZOOM_MINIMUM);
    EXPECT_EQ(zoomCommand(CMD_ZOOM_OUT), 0);
}

TEST_F(CommandTableZoom, RepeatedZoomInFrom100PercentStopsAt30Point375) {
    std::vector<double> factors;
    for (int i = 0; i < 7; i++) {
        dispatchCommand(CMD_ZOOM_IN);
        factors.push_back(zoomState.zoomFactor);
    }
    EXPECT_EQ(factors, std::vector<double>({6.0, 9.0, 13.5, 20.25, 30.375, 30.375, 30.375}));
    for (int i = 0; i < 9; i++) dispatchCommand(CMD_ZOOM_OUT);
    EXPECT_GE(zoomState.zoomFactor, ZOOM_MINIMUM);
    EXPECT_LT(zoomState.zoomFactor * ZOOM_OUT_STEP, ZOOM_MINIMUM);
}

TEST_F(CommandTableZoom, WithoutTheSongWindowTheZoomCommandsDoNothing) {
    songWindowClosed();
    dispatchCommand(CMD_ZOOM_IN);
    dispatchCommand(CMD_ZOOM_200);
    EXPECT_EQ(zoomState.zoomFactor, 4.0);
}
