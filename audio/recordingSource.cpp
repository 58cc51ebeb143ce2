// The preferences being edited and the recording page: source, level, quality, folder and the
// recording time, and the level meter's caption.
#include "audio/recordingSource.h"

#include <algorithm>
#include <cstdio>

#include "analysis/analysisGeometry.h"
#include "analysis/recognitionOptions.h"
#include "audio/audioActivity.h"
#include "audio/recording.h"
#include "platform/files.h"
#include "platform/mixer.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/song.h"

PreferencesState preferencesState;
RecordingPage recordingPage;
int (*preferencesDialog)(int pageSet) = nullptr;
void (*recordingPageChanged)() = nullptr;
void (*meterCaptionChanged)() = nullptr;

// The qualities the page offers, in order, with their names.
static const int OFFERED_QUALITIES[3] = {8, 9, 5};
static const char* const QUALITY_NAMES[3] = {"Low", "Medium", "High"};

static std::string mixerName;   // of the mixer the page opened

static void showNoSources() {
    RecordingPage& p = recordingPage;
    p.sources = {NO_SOURCES_TEXT};
    p.selectedSource = -1;
    p.sourcesEnabled = false;
}

// A change the mixer reports from outside: the page shows it.
static void mixerChanged() {
    if (!recordingPage.mixerOpen) return;
    setRecordingSource(-1, -1, false);
    if (recordingPageChanged) recordingPageChanged();
}

void setRecordingSource(int sourceIndex, int level, bool refill) {
    RecordingPage& p = recordingPage;
    if (!p.mixerOpen) {
        if (!mixerOpen(&mixerName)) {
            showNoSources();
            return;
        }
        p.mixerOpen = true;
        mixerWatch(mixerChanged);
        refill = true;
    }
    if (refill) p.groupTitle = SOURCE_GROUP_TITLE + mixerName;
    std::vector<MixerSource> sources;
    int selected = -1;
    if (!mixerSources(&sources, &selected)) return;
    int wanted = selected;
    if (sourceIndex == MICROPHONE_SOURCE) {
        for (int i = 0; i < int(sources.size()); i++)
            if (sources[size_t(i)].microphone) wanted = i;   // the last microphone wins
    } else if (sourceIndex >= 0 && sourceIndex < int(sources.size())) {
        wanted = sourceIndex;
    }
    if (wanted != selected && wanted >= 0) {
        if (!mixerSelectSource(wanted)) return;
        selected = wanted;
    }
    if (refill) {
        p.sources.clear();
        for (const MixerSource& source : sources) p.sources.push_back(source.name);
    }
    if (sources.empty() || selected < 0) {
        showNoSources();
        return;
    }
    int minimum = 0, maximum = 0, value = 0;
    if (!mixerLevel(&minimum, &maximum, &value)) return;
    if (level >= 0) {
        if (!mixerSetLevel(level)) return;
        // Cancelling puts back every level the page changed, not only the last source's.
        p.initialLevels.resize(sources.size(), -1);
        if (p.initialLevels[size_t(selected)] < 0) p.initialLevels[size_t(selected)] = value;
        value = level;
    }
    bool on = true;
    if (mixerSwitch(&on) && !on) mixerSwitchOn();
    p.selectedSource = selected;
    p.sourcesEnabled = true;
    p.levelMinimum = minimum;
    p.levelMaximum = maximum;
    p.level = value;
    if (maximum > 0) {
        p.sliderMinimum = minimum * SOURCE_SLIDER_TOP / maximum;
        p.sliderPosition = SOURCE_SLIDER_TOP - int(int64_t(value) * SOURCE_SLIDER_TOP / maximum);
    }
    if (meterCaptionChanged) meterCaptionChanged();
}

void setRecordingLevelFromSlider(int position) {
    const RecordingPage& p = recordingPage;
    position = std::clamp(position, 0, SOURCE_SLIDER_TOP);
    setRecordingSource(-1, int(int64_t(SOURCE_SLIDER_TOP - position) * p.levelMaximum / SOURCE_SLIDER_TOP), false);
}

void setUpMicrophone() {
    const RecordingPage& p = recordingPage;
    setRecordingSource(MICROPHONE_SOURCE, p.levelMinimum + (p.levelMaximum - p.levelMinimum) * 3 / 4, false);
}

void fillQualityList() {
    RecordingPage& p = recordingPage;
    p.qualities.clear();
    p.qualityLabels.clear();
    for (int i = 0; i < 3; i++) {
        int quality = OFFERED_QUALITIES[i];
        if (!recordingState.formatAvailable[quality]) continue;
        RecordingFormat format;
        decodeRecordingFormat(quality, &format);
        p.qualities.push_back(quality);
        p.qualityLabels.push_back(std::string(QUALITY_NAMES[i]) + " (" + std::to_string(format.samplesPerSecond) + "Hz, " +
                                  std::to_string(format.bitsPerSample) + "-bit" + ")");
    }
    if (p.qualities.empty()) {
        p.qualityLabels = {NO_QUALITY_TEXT};
        p.qualityEnabled = false;
        return;
    }
    p.qualityEnabled = !audioActivity.recording;
    int& chosen = preferencesState.global.inputWaveQuality;
    if (std::find(p.qualities.begin(), p.qualities.end(), chosen) == p.qualities.end()) chosen = p.qualities[0];
}

void chooseRecordingQuality(int entry) {
    const RecordingPage& p = recordingPage;
    if (entry < 0 || entry >= int(p.qualities.size())) return;
    preferencesState.global.inputWaveQuality = p.qualities[size_t(entry)];
    updateRecordingTime();
}

// The analysis geometry these settings would give at rate and bits: the options are worked
// out as the analysis works them out, then put back as they were.
static bool geometryFor(const GeneralSettings& general, const GlobalSettings& global, uint32_t rate, int bits,
                        AnalysisGeometry* geometry) {
    GeneralSettings savedGeneral = generalSettings;
    GlobalSettings savedGlobal = globalSettings;
    RecognitionOptions savedOptions = recognitionOptions;
    SongViewPitchLimits savedLimits = songViewPitchLimits;
    generalSettings = general;
    globalSettings = global;
    applyAnalysisPreferences();
    RecognitionOptions options = recognitionOptions;
    generalSettings = savedGeneral;
    globalSettings = savedGlobal;
    recognitionOptions = savedOptions;
    songViewPitchLimits = savedLimits;
    return deriveAnalysisGeometry(rate, bits, options, 0, geometry) == 1;
}

// The chosen quality's format, or 22,050 Hz 8-bit mono when the input does not offer it.
static RecordingFormat chosenFormat(int quality) {
    RecordingFormat format{22050, 8, 1};
    if (quality >= 0 && quality < RECORDING_FORMAT_COUNT && recordingState.formatAvailable[quality])
        decodeRecordingFormat(quality, &format);
    return format;
}

double minimumLatency(const GeneralSettings& general, const GlobalSettings& global) {
    RecordingFormat format = chosenFormat(global.inputWaveQuality);
    AnalysisGeometry geometry{};
    if (!geometryFor(general, global, format.samplesPerSecond, format.bitsPerSample, &geometry)) return 0.0;
    // A chunk is analysed once it and the lead-in after it have been captured.
    return double(geometry.topFrame + geometry.lookaheadSamples) / format.samplesPerSecond;
}

std::string minimumLatencyText(const GeneralSettings& general, const GlobalSettings& global) {
    char text[80];
    std::snprintf(text, sizeof text, "%s%.1f%s", "Minimum latency for these settings: ", minimumLatency(general, global),
                  " secs");
    return text;
}

std::string recordingTimeText(int64_t freeBytes, int quality, const GeneralSettings& general,
                              const GlobalSettings& global) {
    int64_t free = std::max<int64_t>(0, freeBytes - RECORDING_TIME_RESERVE);
    RecordingFormat format = chosenFormat(quality);
    int64_t wave = int64_t(format.bitsPerSample) * format.channels * format.samplesPerSecond / 8;
    AnalysisGeometry geometry{};
    int64_t blocksPerSecond = 0;
    if (geometryFor(general, global, format.samplesPerSecond, format.bitsPerSample, &geometry))
        blocksPerSecond = int64_t(1.0 / geometry.sampleBlockDuration);
    int64_t analysis = blocksPerSecond * (minimumLatency(general, global) > 2.0 ? 125 : 100);
    double hires = 300000;
    if (global.boostSpeed) {
        static const double boosted[3] = {150000, 210000, 240000};
        hires = boosted[std::clamp(general.pitchRange, 0, 2)];
    }
    if (general.enhancedPitchAccuracy) hires *= 1.5;
    int64_t seconds = int64_t(double(free) / (hires + double(analysis) + double(wave)));
    int64_t hours = seconds / 3600, minutes = seconds / 60 % 60;
    if (hours >= 100) return std::string("Recording time: ") + ">" + "100" + "h " + "0" + "m";
    return "Recording time: " + std::to_string(hours) + "h " + std::to_string(minutes) + "m";
}

void updateRecordingTime() {
    const PreferencesState& s = preferencesState;
    int64_t free = freeDiskSpace(s.sharedFolder);
    recordingPage.recordingTime = recordingTimeText(std::max<int64_t>(0, free), s.global.inputWaveQuality, s.general,
                                                    s.global);
}

void chooseSharedFolder(const std::string& folder) {
    preferencesState.sharedFolder = folder;
    preferencesState.sharedFolderChanged = true;
    updateRecordingTime();
    int64_t free = freeDiskSpace(folder);
    if (free >= 0 && free < FOLDER_SPACE_ADVICE) showMessage(MESSAGE_INFORMATION, FOLDER_SPACE_LOW_TEXT);
}

int beginPreferences(int pageSet) {
    PreferencesState& s = preferencesState;
    if (s.shown) return 0;
    s.shown = true;
    s.pageSet = pageSet;
    s.general = generalSettings;
    s.global = globalSettings;
    s.sharedFolder = paths.sharedBasePath;
    s.sharedFolderChanged = false;
    recordingPage = RecordingPage{};
    if (pageSet == PAGE_SET_ALL || pageSet == PAGE_SET_SOURCE) {
        probeRecordingFormats();
        fillQualityList();
        setRecordingSource(-1, -1, true);
        recordingPage.initialSource = recordingPage.selectedSource;
        recordingPage.folderEnabled = !audioActivity.recording;
        updateRecordingTime();
    }
    return 1;
}

static void endPreferences() {
    if (recordingPage.mixerOpen) {
        mixerWatch(nullptr);
        mixerClose();
    }
    recordingPage.mixerOpen = false;
    preferencesState.shown = false;
}

void confirmPreferences() {
    const PreferencesState& s = preferencesState;
    bool analysisChanged = song.blockCount > 0 && (s.general.pitchRange != generalSettings.pitchRange ||
                                                   s.general.enhancedPitchAccuracy != generalSettings.enhancedPitchAccuracy ||
                                                   s.global.boostSpeed != globalSettings.boostSpeed);
    generalSettings = s.general;
    // Only what the pages edit: the rest of "Global settings" belongs to the windows.
    globalSettings.inputWaveQuality = s.global.inputWaveQuality;
    globalSettings.boostSpeed = s.global.boostSpeed;
    globalSettings.defaultInstrument = s.global.defaultInstrument;
    globalSettings.translucentWindows = s.global.translucentWindows;
    globalSettings.showSpeedWarning = s.global.showSpeedWarning;
    saveAudioGeneralSettings();
    if (s.sharedFolderChanged) saveSharedPath(s.sharedFolder);
    saveGeneralSettings();
    bool folderChanged = s.sharedFolderChanged;
    endPreferences();
    if (folderChanged) showMessage(MESSAGE_INFORMATION, SHARED_FOLDER_RESTART_TEXT);
    if (analysisChanged) showMessage(MESSAGE_INFORMATION, PREFERENCES_AFTER_CLOSE_TEXT);
}

void cancelPreferences() {
    RecordingPage& p = recordingPage;
    if (p.mixerOpen) {
        std::vector<int> levels = p.initialLevels;
        for (size_t i = 0; i < levels.size(); i++)
            if (levels[i] >= 0) setRecordingSource(int(i), levels[i], false);
        if (p.initialSource >= 0) setRecordingSource(p.initialSource, -1, false);
    }
    endPreferences();
}

int showQuickPreferences(int pageSet) {
    if (pageSet < PAGE_SET_SOURCE && !generalSettings.quickPrefs) return 0;
    if (preferencesState.shown || !preferencesDialog) return 0;
    return preferencesDialog(pageSet) ? 0 : 1;
}

std::string meterLevelText() {
    std::string name;
    bool opened = !recordingPage.mixerOpen;
    if (opened && !mixerOpen(&name)) return NO_SOURCES_TEXT;
    std::string text = NO_SOURCES_TEXT;
    std::vector<MixerSource> sources;
    int selected = -1, minimum = 0, maximum = 0, value = 0;
    if (mixerSources(&sources, &selected) && selected >= 0 && selected < int(sources.size()) &&
        mixerLevel(&minimum, &maximum, &value)) {
        bool on = true;
        if (mixerSwitch(&on) && !on) mixerSwitchOn();
        int percent = maximum > 0 ? int(int64_t(value) * 100 / maximum) : 0;
        text = "Sound level on " + sources[size_t(selected)].name + " (at " + std::to_string(percent) + "%)";
    }
    if (opened) mixerClose();
    return text;
}

void resetPreferences() {
    endPreferences();
    preferencesState = PreferencesState{};
    recordingPage = RecordingPage{};
}
