// The options of frequency table creation and the preference-derived values each new song's
// analysis starts from.
#include "analysis/recognitionOptions.h"

#include "shell/settings.h"

RecognitionOptions recognitionOptions;
SongViewPitchLimits songViewPitchLimits;

struct PitchRangeValues {
    float lowestFrequency;       // Hz
    float highestFrequency;      // Hz
    float blockDuration;         // seconds
    float boostedBlockDuration;  // seconds, with "CS Boost speed"
    SongViewPitchLimits view;    // the song view's limits for the range
};

static const PitchRangeValues PITCH_RANGES[3] = {
    {82.5f, 4310.0f, 1.0f / 128, 1.0f / 32, {61.0f, 4434.0f, 65.0f, 4186.0f, 32.0f}},
    {41.3f, 2155.2f, 1.0f / 64, 1.0f / 32, {30.0f, 2217.0f, 32.0f, 2093.0f, 32.0f}},
    {20.6f, 1077.6f, 1.0f / 32, 1.0f / 16, {26.0f, 1108.0f, 27.0f, 1046.0f, 32.0f}},
};

void applyAnalysisPreferences() {
    int range = generalSettings.pitchRange;
    if (range < PITCH_RANGE_MID_TO_HIGH || range > PITCH_RANGE_VERY_LOW) range = PITCH_RANGE_LOW_TO_MID;
    const PitchRangeValues& values = PITCH_RANGES[range];
    recognitionOptions.lowestFrequency = values.lowestFrequency;
    recognitionOptions.highestFrequency = values.highestFrequency;
    recognitionOptions.blockDuration = globalSettings.boostSpeed ? values.boostedBlockDuration : values.blockDuration;
    recognitionOptions.semitoneDivisions = generalSettings.enhancedPitchAccuracy ? 2.0f : 1.0f;
    recognitionOptions.disableWaveEditing = generalSettings.disableWaveEditing;
    songViewPitchLimits = values.view;
}

void resetRecognitionOptions() {
    recognitionOptions = RecognitionOptions{};
    songViewPitchLimits = SongViewPitchLimits{};
}
