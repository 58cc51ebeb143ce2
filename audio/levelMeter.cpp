// The level meter's values.
#include "audio/levelMeter.h"

#include <algorithm>
#include <cmath>

LevelMeter levelMeter;

// Reference levels of the meter: the rms that fills it, for 8- and 16-bit samples.
static const double METER_REFERENCE_8_BIT = 89.789;
static const double METER_REFERENCE_16_BIT = 23166.269;

int levelMeterValue(const uint8_t* samples, uint32_t count, int bitsPerSample) {
    if (count == 0) return 0;
    double sum = 0;
    for (uint32_t i = 0; i < count; i++) {
        double x;
        if (bitsPerSample == 16) x = double(int16_t(uint16_t(samples[2 * i] | samples[2 * i + 1] << 8)));
        else x = double(samples[i]) - 128.0;
        sum += x * x;
    }
    double rms = std::sqrt(sum / count);
    double r = bitsPerSample == 16 ? METER_REFERENCE_16_BIT : METER_REFERENCE_8_BIT;
    double value = LEVEL_METER_FULL_SCALE * std::log10(std::max(0.0, rms - r / 32) + 1) /
                   std::log10(std::max(0.0, r - r / 32) + 1);
    // Above the reference the rule gives more than the meter can draw.
    return std::min(int(value), LEVEL_METER_FULL_SCALE);
}

void pushLevelMeterValue(int value) {
    std::lock_guard<std::mutex> guard(levelMeter.lock);
    std::copy(levelMeter.levels + 1, levelMeter.levels + LEVEL_METER_BARS, levelMeter.levels);
    levelMeter.levels[LEVEL_METER_BARS - 1] = value;
}
