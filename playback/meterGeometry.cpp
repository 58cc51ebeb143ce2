// The level meter's bars, colours, hint and window placement.
#include "playback/meterGeometry.h"

#include <algorithm>

#include "shell/settings.h"

MeterState meterState;

void resetMeterState(uint32_t now) { meterState.lastGoodLevelTime = now; }

MeterColour meterBarColour(int v) {
    const int a = METER_LEVEL_A, b = METER_LEVEL_B, c = METER_LEVEL_C, d = METER_LEVEL_D, f = METER_FULL_SCALE;
    v = std::clamp(v, 0, f);
    if (v < a) return {255, v * 255 / a, 0};
    if (v < b) return {255 - (v - a) * 255 / (b - a), 255, 0};
    if (v < c) return {0, 255, 0};
    if (v < d) return {(v - c) * 255 / (d - c), 255, 0};
    return {255, 255 - (v - d) * 255 / (f - d), 0};
}

int meterBar(int i, int level, int width, int height, MeterBar* bar) {
    if (level <= 0) return 0;
    level = std::min(level, METER_FULL_SCALE);
    int inner = width - 2 * METER_MARGIN;
    int left = METER_MARGIN + i * inner / METER_BAR_COUNT;
    int right = METER_MARGIN + (i + 1) * inner / METER_BAR_COUNT;
    int bottom = height - METER_MARGIN;
    int top = METER_MARGIN + (METER_FULL_SCALE - level) * (height - 2 * METER_MARGIN) / METER_FULL_SCALE;
    bar->left = left;
    bar->width = std::max(1, right - left);
    bar->top = std::min(top, bottom - 1);
    bar->height = std::max(1, bottom - bar->top);
    return 1;
}

void meterLevelsDrawn(const int* levels, int count, uint32_t now) {
    for (int i = 0; i < count; i++)
        if (levels[i] >= METER_LEVEL_B) {
            meterState.lastGoodLevelTime = now;
            return;
        }
}

int meterHintShown(bool recording, uint32_t now) {
    return recording && now > meterState.lastGoodLevelTime + METER_HINT_DELAY;
}

void meterHintPlace(int width, int height, int* x, int* baseline, int* fontSize) {
    *x = width / 16;
    *baseline = height / 5;
    *fontSize = width / 4;
}

MeterRect meterWindowRect(const MeterRect& owner, int captionHeight) {
    const GlobalSettings& s = globalSettings;
    MeterRect r;
    r.width = std::max(1, s.meterWidth) + METER_FRAME;
    r.height = std::max(1, s.meterHeight) + captionHeight + METER_FRAME;
    bool right = s.meterAnchor == 1 || s.meterAnchor == 3;
    bool top = s.meterAnchor == 0 || s.meterAnchor == 1;
    r.x = right ? owner.x + owner.width - s.meterXOffset - r.width : owner.x + s.meterXOffset;
    r.y = top ? owner.y + s.meterYOffset : owner.y + owner.height + s.meterYOffset - r.height;
    return r;
}

void storeMeterSize(int outerWidth, int outerHeight, int captionHeight) {
    globalSettings.meterWidth = std::max(1, outerWidth - METER_FRAME);
    globalSettings.meterHeight = std::max(1, outerHeight - captionHeight - METER_FRAME);
}
