#pragma once
// SettingsStore: the program's options in the settings store, in the sections "General
// settings" and "Global settings" below SOFTWARE\Torvellan\Melodrift\1.0 of the machine's
// root. Start-up loads them, the preferences save the general ones, shut-down saves the
// global ones. Integers are DWORD values, booleans the texts "True" and "False"; a value
// that is missing is written with its default when first read.

#include <cstdint>
#include <string>

#include "platform/registry.h"

// The product's key; the fixed fourth-level subkey is ours to name.
constexpr const char* SETTINGS_KEY_PATH = "SOFTWARE\\Torvellan\\Melodrift\\1.0";
constexpr const char* GENERAL_SETTINGS_SECTION = "General settings";
constexpr const char* GLOBAL_SETTINGS_SECTION = "Global settings";
constexpr const char* DATA_PATH_SECTION = "DataPath";

// Shown by the preferences when a new shared folder is confirmed.
constexpr const char* SHARED_FOLDER_RESTART_TEXT =
    "Please note the new 'Torvellan Shared' folder will not come into effect until this program is restarted.";
// Shown by the preferences when analysis options change while a song is open.
constexpr const char* PREFERENCES_AFTER_CLOSE_TEXT =
    "Please note, some preference changes will not take effect until the current song is closed.\n\n"
    "These include the pitch range, enhanced pitch accuracy and boost speed options.";

// Size of "Main window position": a window placement record of eleven 32-bit fields
// (length, flags, show state, minimized x and y, maximized x and y, normal left, top,
// right, bottom).
constexpr int WINDOW_PLACEMENT_SIZE = 44;
// "CS Default Instrument" keeps at most this many characters.
constexpr int MAX_DEFAULT_INSTRUMENT_CHARACTERS = 32;
// "Number of recent files" is clamped to this, so a damaged count cannot make start-up
// read and write millions of "Recent file %d" values.
constexpr int MAX_RECENT_FILES = 16;

// The open keys of the section being read or written.
struct SettingsStore {
    RegistryKey softwareKey = 0;     // root \ SOFTWARE, for querying
    RegistryKey torvellanKey = 0;    // ... \ Torvellan, for querying
    RegistryKey melodriftKey = 0;    // ... \ Melodrift, for querying
    RegistryKey sectionKey = 0;      // ... \ 1.0 \ section, read-write unless that was refused
    bool sectionReadOnly = false;    // the section was opened for reading only
};
extern SettingsStore settingsStore;

// "General settings". The fields begin with the defaults.
struct GeneralSettings {
    int pitchRange = 1;                     // "CS Pitch range": 0 E3-C8, 1 E2-E6, 2 A0-E5
    bool enhancedPitchAccuracy = false;     // "CS Enhanced pitch accuracy": finer pitch analysis
    bool detectSyllables = true;            // "CS Detect syllables": split notes at syllables
    bool disableWaveEditing = false;        // "CS Disable wave editing": no Wave-mode editing, faster recognition
    bool drawSmoothLines = true;            // "CS Draw smooth lines": song view antialiasing
    bool drawTransparencies = true;         // "CS Draw transparencies": song view translucent brushes
    bool drawGradients = true;              // "CS Draw gradients": song view gradients
    bool splashScreen = true;               // "Splash screen": show the splash window at start
    bool quickPrefs = true;                 // "Quick Prefs": preferences before opening or recording into an empty song
    bool operator==(const GeneralSettings&) const = default;
};
extern GeneralSettings generalSettings;

// "Global settings". The fields begin with the defaults.
struct GlobalSettings {
    int playbackMode = 2;                   // "CS Playback Mode": 1 MIDI, 2 Wave
    int noteMode = 8;                       // "CS Note Mode": 4 Note mode, 8 Detail mode
    int scaleMode = 32;                     // "CS Scale Mode": 16 Diatonic, 32 Chromatic
    int meterWidth = 400;                   // "CS Meter width": level meter width, pixels
    int meterHeight = 256;                  // "CS Meter height": level meter height, pixels
    int meterXOffset = 200;                 // "CS Meter x-offset": from the anchor corner, pixels
    int meterYOffset = -78;                 // "CS Meter y-offset": from the anchor corner, pixels
    uint8_t meterAnchor = 2;                // "CS Meter anchor": the frame corner the meter keeps to
    std::string defaultInstrument = "Voice";   // "CS Default Instrument": a new song's instrument, at most 32 characters
    bool showSpeedWarning = true;           // "Show CSSpeedWarning dialog": the real-time recording information box
    bool boostSpeed = false;                // "CS Boost speed": faster, coarser analysis
    int inputWaveQuality = 5;               // "CS Input wave quality": recording format index
    bool translucentWindows = true;         // "Translucent Windows": layered translucent windows
    int openFilter = 0;                     // "Open Filter": last file-type filter of the Open dialog
    int saveFilter = 0;                     // "Save Filter": last file-type filter of the Save dialog
    std::string openDirectory;              // "Open Directory": last folder of the Open dialog
    std::string saveDirectory;              // "Save Directory": last folder of the Save dialog
    bool hasMainWindowPosition = false;     // "Main window position" was found (or set by the frame on closing)
    uint8_t mainWindowPosition[WINDOW_PLACEMENT_SIZE] = {};   // the frame's placement when hasMainWindowPosition
    int recentFileCount = 0;                // "Number of recent files", 0 to MAX_RECENT_FILES
    std::string recentFiles[MAX_RECENT_FILES];   // "Recent file %d", numbered from 0
    bool operator==(const GlobalSettings&) const = default;
};
extern GlobalSettings globalSettings;

// Opens root (0 machine, 1 user) \ SOFTWARE for querying, creates or opens Torvellan and
// Melodrift below it, then the subkey and the section, read-write or, when that is refused,
// read-only. Returns the section's key, or 0 after showing "Can't open registry - Err %d"
// or "Can't access registry properly" (the keys opened so far are closed again).
// *existed tells whether the section was there before. Called with no section name
// (nullptr or "") it closes the keys it opened.
RegistryKey openSettingsSection(const char* section, int root, bool* existed = nullptr);

// A DWORD value; when it cannot be read, the default is written and returned.
int readIntSetting(RegistryKey key, const std::string& name, int defaultValue);
// A text value; when it cannot be read, the default is written and returned.
std::string readTextSetting(RegistryKey key, const std::string& name, const std::string& defaultValue);
// A boolean stored as text: true only when it is exactly "True".
bool readBoolSetting(RegistryKey key, const std::string& name, bool defaultValue);
// Each sets one value of its type; 1 when stored, 0 when not (read-only key, write failed).
int writeIntSetting(RegistryKey key, const std::string& name, int value);
int writeTextSetting(RegistryKey key, const std::string& name, const std::string& value);
int writeBinarySetting(RegistryKey key, const std::string& name, const uint8_t* bytes, int count);
int writeBoolSetting(RegistryKey key, const std::string& name, bool value);   // "True" or "False"

// Read the values of one section into generalSettings or globalSettings, in the order the
// table lists them: the "CS" (audio) sets and the rest. 1 when read; 0 when the section
// could not be opened, after its message, with the quit flag set.
int loadGeneralSettings();
int loadAudioGeneralSettings();
int loadGlobalSettings();
int loadAudioGlobalSettings();
// Write them back. 1 when written; 0 when the section could not be opened (its message
// has been shown). A failed save leaves the quit flag alone: it comes while the program
// runs, and quitting then would throw away the open song.
int saveGeneralSettings();
int saveAudioGeneralSettings();
int saveGlobalSettings();
int saveAudioGlobalSettings();

// Closes any open section and puts every setting back to its default.
void resetSettings();

// The recording format named by an "CS Input wave quality" index: samples per second from
// 48000, 44100, 22050, 11025, 8000 by index / 4; the layout by index % 4 (0 8-bit mono,
// 1 16-bit mono, 2 8-bit stereo, 3 16-bit stereo).
struct RecordingFormat {
    uint32_t samplesPerSecond;   // frames per second
    int bitsPerSample;           // 8 or 16
    int channels;                // 1 or 2
};
// 1 when index names a format (0 to 19). 0 otherwise, with *format set to that of the
// default index 5 (44100 Hz 16-bit mono), so a damaged setting still records.
int decodeRecordingFormat(int index, RecordingFormat* format);
