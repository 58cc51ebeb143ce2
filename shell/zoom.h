#pragma once
// The song view's horizontal zoom factor and the zoom commands of the View menu. The song
// view draws at zoomState.zoomFactor; the commands keep it within the limits below.

// Limits and start value of the zoom factor (4.0 shows 128 pixels per second).
constexpr double ZOOM_MINIMUM = 1.7391305;
constexpr double ZOOM_MAXIMUM = 40.0;
constexpr double ZOOM_DEFAULT = 4.0;
// What Zoom In and Zoom Out multiply the factor by.
constexpr double ZOOM_IN_STEP = 1.5;
constexpr double ZOOM_OUT_STEP = 0.6666666666666666;

struct ZoomState {
    double zoomFactor = ZOOM_DEFAULT;   // horizontal scale of the song view (zoom commands, song view)
};
extern ZoomState zoomState;

// Back to ZOOM_DEFAULT.
void resetZoom();
// Runs a zoom command (CMD_ZOOM_50, _100, _200, _IN, _OUT). The fixed zooms set 2.0, 4.0 or
// 8.0; Zoom In and Out multiply the factor and keep the result only when it lies within
// [ZOOM_MINIMUM, ZOOM_MAXIMUM]. 1 when the factor was set, 0 when the step was ignored or
// command is no zoom command.
int zoomCommand(int command);
// The factor as the per cent the View menu names (4.0 is 100%), rounded.
int zoomPercent();
