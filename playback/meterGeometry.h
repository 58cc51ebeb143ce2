#pragma once
// The level meter's drawing rule: where each of its 32 bars stands and in which colour, the
// last time a good level was drawn and when the low-level hint shows, and the window's size
// and place from its settings. The desktop program's meter window draws by these; the levels
// themselves are the history that opening and recording feed (audio/openWaveFile.h).

#include <cstdint>

constexpr int METER_BAR_COUNT = 32;
constexpr int METER_FULL_SCALE = 255;                          // F
constexpr int METER_LEVEL_A = (METER_FULL_SCALE * 2) >> 3;     // 63: below it red to yellow
constexpr int METER_LEVEL_B = (METER_FULL_SCALE * 3) >> 3;     // 95: from it green, and a good level
constexpr int METER_LEVEL_C = (METER_FULL_SCALE * 6) >> 3;     // 191: from it green to yellow
constexpr int METER_LEVEL_D = (METER_FULL_SCALE * 7) >> 3;     // 223: from it yellow to red
constexpr int METER_MARGIN = 8;                                // pixels around the bars
constexpr int METER_HINT_DELAY = 400;                          // hundredths of a second of low level
constexpr int METER_FRAME = 6;                                 // the frame adds this to width and height
constexpr int METER_OPACITY = 200;                             // of 255, where the window system allows
constexpr int METER_BACKGROUND = 32;                           // grey level of the background

struct MeterColour {
    int red, green, blue;   // 0 .. 255
};
struct MeterBar {
    int left, top, width, height;   // pixels in the meter's client area
};

struct MeterState {
    uint32_t lastGoodLevelTime;   // time counter of the last repaint that drew a bar at or above METER_LEVEL_B
};
extern MeterState meterState;

// The last good level time becomes now (a new meter, a recording that starts).
void resetMeterState(uint32_t now);

// The colour of a bar of level v (1 .. F): red to yellow, yellow to green, green, green to
// yellow, yellow to red, by the thresholds above, in integer arithmetic.
MeterColour meterBarColour(int level);
// Bar i (0 .. 31) of level in a client area width x height: 1 with *bar filled, at least one
// pixel wide and high; 0 when level is 0 or less (no bar).
int meterBar(int i, int level, int width, int height, MeterBar* bar);
// A repaint drew levels at time counter now: a level at or above METER_LEVEL_B renews the
// last good level time.
void meterLevelsDrawn(const int* levels, int count, uint32_t now);
// 1 when the hint shows: a recording runs and now is more than METER_HINT_DELAY past the
// last good level time.
int meterHintShown(bool recording, uint32_t now);
// The hint's place and font size for a client area width x height: size W / 4, base line at
// (W / 16, H / 5).
void meterHintPlace(int width, int height, int* x, int* baseline, int* fontSize);

// The meter window's outer rectangle from the settings: (width + 6) x (height + caption + 6),
// placed by the anchor corner of the owner's rectangle (0 top left, 1 top right, 2 bottom
// left, 3 bottom right; another value counts as 2) moved by the offsets, the x-offset inward
// from the corner's side and the y-offset downward.
struct MeterRect {
    int x, y, width, height;
};
MeterRect meterWindowRect(const MeterRect& owner, int captionHeight);
// The window was resized to an outer outerWidth x outerHeight: its client size goes back
// into "CS Meter width" and "CS Meter height", so the next start reproduces the outer size.
void storeMeterSize(int outerWidth, int outerHeight, int captionHeight);
