#pragma once
// The preferences as the dialog edits them, and its recording page: the recording source and
// its level through the mixer (platform/mixer.h), the recording quality with the formats the
// input offers, and the shared folder with the recording time it allows. The desktop program
// shows the pages and calls these; the engine keeps what the pages show, so that the rules are
// the same with or without a window. Also the level text of the level meter's caption.

#include <cstdint>
#include <string>
#include <vector>

#include "shell/settings.h"

// Which pages the dialog shows.
enum PreferencesPageSet {
    PAGE_SET_ALL = 0,          // the Preferences command: all four pages, "&OK"
    PAGE_SET_OPENING = 5,      // before opening into an empty song: " Accuracy / Speed ", "&Open"
    PAGE_SET_RECORDING = 6,    // before recording into an empty song: " Accuracy / Speed ", "Rec&ord"
    PAGE_SET_SOURCE = 10       // Select Recording Source: " Recording ", "&OK"
};
constexpr int MICROPHONE_SOURCE = 1024;   // setRecordingSource's index for "the microphone"
constexpr int SOURCE_SLIDER_TOP = 255;    // the level slider's loudest position is its top, 0
constexpr int SOURCE_SLIDER_TICKS = 43;
constexpr int64_t FOLDER_SPACE_ADVICE = 262144000;      // bytes: less free on a chosen folder's drive is advised against
constexpr int64_t RECORDING_TIME_RESERVE = 20971520;    // bytes kept free when the recording time is worked out

constexpr const char* PREFERENCES_TITLE = "Torvellan Melodrift preferences";
constexpr const char* NO_SOURCES_TEXT = "No sources available";
constexpr const char* SOURCE_GROUP_TITLE = "Source and level - ";
constexpr const char* MICROPHONE_BUTTON_TEXT = "Set up to record from microphone";
constexpr const char* NO_QUALITY_TEXT = "No options available - is DirectX 8.1 installed?";
constexpr const char* FOLDER_SPACE_LOW_TEXT =
    "Disk space is low on the drive containing the selected folder. It is recommended that you choose a folder on a "
    "drive with more than 250Mb free space.";
constexpr const char* QUICK_PREFERENCES_CHECK_TEXT = "D&isplay these options before recording";

// What the dialog edits: the settings' copies and the flags read when it is confirmed.
struct PreferencesState {
    bool shown = false;                 // the dialog is up; another request is ignored
    int pageSet = PAGE_SET_ALL;         // PreferencesPageSet
    GeneralSettings general;            // the pages' values of "General settings"
    GlobalSettings global;              // the pages' values of "Global settings"
    std::string sharedFolder;           // the folder field: the shared base path
    bool sharedFolderChanged = false;   // a folder was chosen
};
extern PreferencesState preferencesState;

// What the recording page shows.
struct RecordingPage {
    bool mixerOpen = false;             // the mixer is open while the page is
    std::string groupTitle;             // "Source and level - " and the mixer's name
    std::vector<std::string> sources;   // the source list, or NO_SOURCES_TEXT alone
    int selectedSource = -1;            // the list's selection; -1 none
    bool sourcesEnabled = false;        // the list, the level slider and the microphone button
    int levelMinimum = 0, levelMaximum = 0, level = 0;   // the selected source's volume control
    int sliderMinimum = 0;              // the slider's range: [minimum x 255 / maximum, 255]
    int sliderPosition = 0;             // 255 - level x 255 / maximum (top is loudest)
    int initialSource = -1;             // the selection when first filled: cancelling puts it back
    std::vector<int> initialLevels;     // each source's level before the page first changed it; -1 untouched
    std::vector<int> qualities;         // the quality list's entries: indexes 8, 9, 5 where available
    std::vector<std::string> qualityLabels;   // "Low (22050Hz, 8-bit)", ...; or NO_QUALITY_TEXT alone
    bool qualityEnabled = false;        // the list (and, with the folder, greyed while a recording runs)
    bool folderEnabled = true;          // the folder field, the time and "Ch&oose..."
    std::string recordingTime;          // "Recording time: 12h 5m"
};
extern RecordingPage recordingPage;

// Starts editing: the settings copied, the recording page filled (sources, qualities, time).
// 0 when the dialog is already up (the request is ignored), else 1.
int beginPreferences(int pageSet);
// OK: the pages' values become the settings and are saved; a new folder and analysis options
// changed while a song holds audio each get their note. The mixer is closed.
void confirmPreferences();
// Cancel: the source and level the page found are put back; nothing else changes.
void cancelPreferences();

// Before opening (5) or recording (6) into an empty song, with "Quick Prefs" on; and for Select
// Recording Source (10), always. 1 when the user cancelled; 0 otherwise (also when not shown).
int showQuickPreferences(int pageSet);
// The desktop program's parts, installed by it; null without a window. The dialog (1 confirmed,
// 0 cancelled); the page shown again after the mixer changed; the level meter's caption shown
// again after the level or source changed.
extern int (*preferencesDialog)(int pageSet);
extern void (*recordingPageChanged)();
extern void (*meterCaptionChanged)();

// The recording page's source and level: sourceIndex -1 keeps the selection, MICROPHONE_SOURCE
// selects the (last) microphone, another index selects that source; level -1 keeps the level.
// refill builds the list and title anew. A mixer call that fails ends the fill silently.
void setRecordingSource(int sourceIndex, int level, bool refill);
// The level slider moved to position (0 top .. 255 bottom).
void setRecordingLevelFromSlider(int position);
// "Set up to record from microphone": the microphone at three quarters of its range.
void setUpMicrophone();
// The quality list from the formats the input offers; a stored quality not among them becomes the first.
void fillQualityList();
// The quality list's entry chosen.
void chooseRecordingQuality(int entry);
// A folder chosen for the shared folder: the recording time follows, and a drive with less than
// 250 MiB free is advised against (the folder is kept).
void chooseSharedFolder(const std::string& folder);
// The recording time the folder's free space allows with the chosen quality and options.
void updateRecordingTime();
std::string recordingTimeText(int64_t freeBytes, int quality, const GeneralSettings& general,
                              const GlobalSettings& global);
// The shortest time from a sound to its notes with these options, seconds, and its text
// "Minimum latency for these settings: 0.3 secs".
double minimumLatency(const GeneralSettings& general, const GlobalSettings& global);
std::string minimumLatencyText(const GeneralSettings& general, const GlobalSettings& global);

// The level meter's caption: "Sound level on <source> (at <n>%)", switching the source on when
// it is off; "No sources available" without a mixer.
std::string meterLevelText();

// Back to nothing edited, the mixer closed (tests, shut-down).
void resetPreferences();
