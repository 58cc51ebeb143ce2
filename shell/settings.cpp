// SettingsStore: opening a settings section, reading values with their defaults, and the
// loads and saves of "General settings" and "Global settings" used by start-up, the
// preferences and shut-down.
#include "shell/settings.h"

#include <cstdio>
#include <vector>

#include "platform/ui.h"
#include "shell/quitFlag.h"

SettingsStore settingsStore;
GeneralSettings generalSettings;
GlobalSettings globalSettings;

static void closeSettingsKeys() {
    RegistryKey* keys[] = {&settingsStore.sectionKey, &settingsStore.melodriftKey, &settingsStore.torvellanKey,
                           &settingsStore.softwareKey};
    for (RegistryKey* key : keys) {
        if (*key) regCloseKey(*key);
        *key = 0;
    }
    settingsStore.sectionReadOnly = false;
}

// Creates or opens a key, read-write first when asked and read-only when that is refused.
static int createSettingsKey(int root, const std::string& path, int access, RegistryKey* key, bool* existed) {
    if (access == REG_ACCESS_WRITE && regCreateKey(root, path, REG_ACCESS_WRITE, key, existed) == REG_OK) return 1;
    if (regCreateKey(root, path, REG_ACCESS_READ, key, existed) == REG_OK) {
        if (access == REG_ACCESS_WRITE) settingsStore.sectionReadOnly = true;
        return 1;
    }
    return 0;
}

RegistryKey openSettingsSection(const char* section, int root, bool* existed) {
    closeSettingsKeys();
    if (existed) *existed = false;
    if (!section || !*section) return 0;

    int result = regOpenKey(root, "SOFTWARE", REG_ACCESS_READ, &settingsStore.softwareKey);
    if (result != REG_OK) {
        char text[64];
        std::snprintf(text, sizeof text, "%s - Err %d", "Can't open registry", result);
        showMessage(MESSAGE_ERROR, text);
        return 0;
    }
    bool sectionExisted = false;
    if (!createSettingsKey(root, "SOFTWARE\\Torvellan", REG_ACCESS_READ, &settingsStore.torvellanKey, nullptr) ||
        !createSettingsKey(root, "SOFTWARE\\Torvellan\\Melodrift", REG_ACCESS_READ, &settingsStore.melodriftKey,
                           nullptr) ||
        !createSettingsKey(root, std::string(SETTINGS_KEY_PATH) + "\\" + section, REG_ACCESS_WRITE,
                           &settingsStore.sectionKey, &sectionExisted)) {
        closeSettingsKeys();
        showMessage(MESSAGE_ERROR, "Can't access registry properly");
        return 0;
    }
    if (existed) *existed = sectionExisted;
    return settingsStore.sectionKey;
}

int readIntSetting(RegistryKey key, const std::string& name, int defaultValue) {
    uint32_t value = 0;
    if (regQueryDword(key, name, &value) == REG_OK) return int(value);
    writeIntSetting(key, name, defaultValue);
    return defaultValue;
}

std::string readTextSetting(RegistryKey key, const std::string& name, const std::string& defaultValue) {
    std::string value;
    if (regQueryString(key, name, &value) == REG_OK) return value;
    writeTextSetting(key, name, defaultValue);
    return defaultValue;
}

bool readBoolSetting(RegistryKey key, const std::string& name, bool defaultValue) {
    return readTextSetting(key, name, defaultValue ? "True" : "False") == "True";
}

int writeIntSetting(RegistryKey key, const std::string& name, int value) {
    return regSetDword(key, name, uint32_t(value)) == REG_OK;
}

int writeTextSetting(RegistryKey key, const std::string& name, const std::string& value) {
    return regSetString(key, name, value) == REG_OK;
}

int writeBinarySetting(RegistryKey key, const std::string& name, const uint8_t* bytes, int count) {
    return regSetBinary(key, name, std::vector<uint8_t>(bytes, bytes + count)) == REG_OK;
}

int writeBoolSetting(RegistryKey key, const std::string& name, bool value) {
    return writeTextSetting(key, name, value ? "True" : "False");
}

// The first count characters of UTF-8 text; a character is never cut in two.
static std::string firstCharacters(const std::string& text, int count) {
    size_t end = 0;
    for (int n = 0; end < text.size(); end++) {
        if ((text[end] & 0xc0) == 0x80) continue;   // continuation byte of the character before
        if (n == count) break;
        n++;
    }
    return text.substr(0, end);
}

// Opens a section of the machine's root for a load; a failure ends start-up.
static RegistryKey openForLoad(const char* section) {
    RegistryKey key = openSettingsSection(section, REG_ROOT_MACHINE);
    if (!key) quitFlag = 1;
    return key;
}

int loadGeneralSettings() {
    RegistryKey key = openForLoad(GENERAL_SETTINGS_SECTION);
    if (!key) return 0;
    const GeneralSettings defaults;
    generalSettings.splashScreen = readBoolSetting(key, "Splash screen", defaults.splashScreen);
    generalSettings.quickPrefs = readBoolSetting(key, "Quick Prefs", defaults.quickPrefs);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int loadAudioGeneralSettings() {
    RegistryKey key = openForLoad(GENERAL_SETTINGS_SECTION);
    if (!key) return 0;
    const GeneralSettings defaults;
    GeneralSettings& s = generalSettings;
    s.pitchRange = readIntSetting(key, "CS Pitch range", defaults.pitchRange);
    s.enhancedPitchAccuracy = readBoolSetting(key, "CS Enhanced pitch accuracy", defaults.enhancedPitchAccuracy);
    s.detectSyllables = readBoolSetting(key, "CS Detect syllables", defaults.detectSyllables);
    s.disableWaveEditing = readBoolSetting(key, "CS Disable wave editing", defaults.disableWaveEditing);
    s.drawSmoothLines = readBoolSetting(key, "CS Draw smooth lines", defaults.drawSmoothLines);
    s.drawTransparencies = readBoolSetting(key, "CS Draw transparencies", defaults.drawTransparencies);
    s.drawGradients = readBoolSetting(key, "CS Draw gradients", defaults.drawGradients);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int loadGlobalSettings() {
    RegistryKey key = openForLoad(GLOBAL_SETTINGS_SECTION);
    if (!key) return 0;
    const GlobalSettings defaults;
    GlobalSettings& s = globalSettings;
    s.translucentWindows = readBoolSetting(key, "Translucent Windows", defaults.translucentWindows);
    s.openFilter = readIntSetting(key, "Open Filter", defaults.openFilter);
    s.saveFilter = readIntSetting(key, "Save Filter", defaults.saveFilter);
    s.openDirectory = readTextSetting(key, "Open Directory", defaults.openDirectory);
    s.saveDirectory = readTextSetting(key, "Save Directory", defaults.saveDirectory);
    // The placement has no default: when it is absent (or not a placement) nothing is
    // written and the frame opens maximized.
    std::vector<uint8_t> placement;
    s.hasMainWindowPosition = regQueryBinary(key, "Main window position", &placement) == REG_OK &&
                              placement.size() == size_t(WINDOW_PLACEMENT_SIZE);
    if (s.hasMainWindowPosition)
        for (int i = 0; i < WINDOW_PLACEMENT_SIZE; i++) s.mainWindowPosition[i] = placement[i];
    int count = readIntSetting(key, "Number of recent files", defaults.recentFileCount);
    s.recentFileCount = count < 0 ? 0 : count > MAX_RECENT_FILES ? MAX_RECENT_FILES : count;
    for (int i = 0; i < MAX_RECENT_FILES; i++) s.recentFiles[i].clear();
    for (int i = 0; i < s.recentFileCount; i++) {
        char name[32];
        std::snprintf(name, sizeof name, "Recent file %d", i);
        s.recentFiles[i] = readTextSetting(key, name, "");
    }
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int loadAudioGlobalSettings() {
    RegistryKey key = openForLoad(GLOBAL_SETTINGS_SECTION);
    if (!key) return 0;
    const GlobalSettings defaults;
    GlobalSettings& s = globalSettings;
    s.playbackMode = readIntSetting(key, "CS Playback Mode", defaults.playbackMode);
    s.noteMode = readIntSetting(key, "CS Note Mode", defaults.noteMode);
    s.scaleMode = readIntSetting(key, "CS Scale Mode", defaults.scaleMode);
    s.meterWidth = readIntSetting(key, "CS Meter width", defaults.meterWidth);
    s.meterHeight = readIntSetting(key, "CS Meter height", defaults.meterHeight);
    s.meterXOffset = readIntSetting(key, "CS Meter x-offset", defaults.meterXOffset);
    s.meterYOffset = readIntSetting(key, "CS Meter y-offset", defaults.meterYOffset);
    s.meterAnchor = uint8_t(readIntSetting(key, "CS Meter anchor", defaults.meterAnchor));
    s.defaultInstrument = firstCharacters(readTextSetting(key, "CS Default Instrument", defaults.defaultInstrument),
                                          MAX_DEFAULT_INSTRUMENT_CHARACTERS);
    s.showSpeedWarning = readBoolSetting(key, "Show CSSpeedWarning dialog", defaults.showSpeedWarning);
    s.boostSpeed = readBoolSetting(key, "CS Boost speed", defaults.boostSpeed);
    s.inputWaveQuality = readIntSetting(key, "CS Input wave quality", defaults.inputWaveQuality);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int saveGeneralSettings() {
    RegistryKey key = openSettingsSection(GENERAL_SETTINGS_SECTION, REG_ROOT_MACHINE);
    if (!key) return 0;
    writeBoolSetting(key, "Splash screen", generalSettings.splashScreen);
    writeBoolSetting(key, "Quick Prefs", generalSettings.quickPrefs);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int saveAudioGeneralSettings() {
    RegistryKey key = openSettingsSection(GENERAL_SETTINGS_SECTION, REG_ROOT_MACHINE);
    if (!key) return 0;
    const GeneralSettings& s = generalSettings;
    writeIntSetting(key, "CS Pitch range", s.pitchRange);
    writeBoolSetting(key, "CS Enhanced pitch accuracy", s.enhancedPitchAccuracy);
    writeBoolSetting(key, "CS Detect syllables", s.detectSyllables);
    writeBoolSetting(key, "CS Disable wave editing", s.disableWaveEditing);
    writeBoolSetting(key, "CS Draw smooth lines", s.drawSmoothLines);
    writeBoolSetting(key, "CS Draw transparencies", s.drawTransparencies);
    writeBoolSetting(key, "CS Draw gradients", s.drawGradients);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int saveGlobalSettings() {
    RegistryKey key = openSettingsSection(GLOBAL_SETTINGS_SECTION, REG_ROOT_MACHINE);
    if (!key) return 0;
    const GlobalSettings& s = globalSettings;
    writeBoolSetting(key, "Translucent Windows", s.translucentWindows);
    writeIntSetting(key, "Open Filter", s.openFilter);
    writeIntSetting(key, "Save Filter", s.saveFilter);
    writeTextSetting(key, "Open Directory", s.openDirectory);
    writeTextSetting(key, "Save Directory", s.saveDirectory);
    if (s.hasMainWindowPosition)
        writeBinarySetting(key, "Main window position", s.mainWindowPosition, WINDOW_PLACEMENT_SIZE);
    int count = s.recentFileCount < 0 ? 0 : s.recentFileCount > MAX_RECENT_FILES ? MAX_RECENT_FILES : s.recentFileCount;
    writeIntSetting(key, "Number of recent files", count);
    for (int i = 0; i < count; i++) {
        char name[32];
        std::snprintf(name, sizeof name, "Recent file %d", i);
        writeTextSetting(key, name, s.recentFiles[i]);
    }
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int saveAudioGlobalSettings() {
    RegistryKey key = openSettingsSection(GLOBAL_SETTINGS_SECTION, REG_ROOT_MACHINE);
    if (!key) return 0;
    const GlobalSettings& s = globalSettings;
    writeIntSetting(key, "CS Playback Mode", s.playbackMode);
    writeIntSetting(key, "CS Note Mode", s.noteMode);
    writeIntSetting(key, "CS Scale Mode", s.scaleMode);
    writeIntSetting(key, "CS Meter width", s.meterWidth);
    writeIntSetting(key, "CS Meter height", s.meterHeight);
    writeIntSetting(key, "CS Meter x-offset", s.meterXOffset);
    writeIntSetting(key, "CS Meter y-offset", s.meterYOffset);
    writeIntSetting(key, "CS Meter anchor", s.meterAnchor);
    writeTextSetting(key, "CS Default Instrument", firstCharacters(s.defaultInstrument, MAX_DEFAULT_INSTRUMENT_CHARACTERS));
    writeBoolSetting(key, "Show CSSpeedWarning dialog", s.showSpeedWarning);
    writeBoolSetting(key, "CS Boost speed", s.boostSpeed);
    writeIntSetting(key, "CS Input wave quality", s.inputWaveQuality);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

void resetSettings() {
    closeSettingsKeys();
    generalSettings = GeneralSettings();
    globalSettings = GlobalSettings();
}

int decodeRecordingFormat(int index, RecordingFormat* format) {
    static const uint32_t RATES[5] = {48000, 44100, 22050, 11025, 8000};
    // An index out of range (a hand-edited or damaged setting) would read past the rate list.
    int valid = index >= 0 && index < 20;
    if (!valid) index = GlobalSettings().inputWaveQuality;
    format->samplesPerSecond = RATES[index / 4];
    format->bitsPerSample = index % 2 ? 16 : 8;
    format->channels = index % 4 >= 2 ? 2 : 1;
    return valid;
}
