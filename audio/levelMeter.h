#pragma once
// The level meter's history, which opening and recording feed with one value per chunk.

#include <cstdint>
#include <mutex>

// What the level meter draws: the newest levels, oldest first. Written by opening and
// recording on their worker, read by the meter's painting on the user interface thread.
constexpr int LEVEL_METER_BARS = 32;
constexpr int LEVEL_METER_FULL_SCALE = 255;   // the meter height the level rule scales to
struct LevelMeter {
    std::mutex lock;                  // guards levels
    int levels[LEVEL_METER_BARS];     // 0 .. LEVEL_METER_FULL_SCALE; 0 draws no bar
};
extern LevelMeter levelMeter;

// The level of count samples of the song's size (8-bit unsigned or 16-bit signed, one
// channel): rms against the format's reference level on a logarithmic scale of 0 ..
// LEVEL_METER_FULL_SCALE. Louder than the reference counts as full scale.
int levelMeterValue(const uint8_t* samples, uint32_t count, int bitsPerSample);
// Shifts the meter's history by one and appends value.
void pushLevelMeterValue(int value);
