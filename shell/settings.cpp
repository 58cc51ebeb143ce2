// SettingsStore: opening a settings section, reading values with their defaults, and the
// loads and saves of "General settings" and "Global settings" used by start-up, the
// preferences and shut-down.
#include "shell/settings.h"

#include <cstdio>
#include <variant>
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

// One named value of a section and the field of the settings record that holds it. The kind
// of value follows from the field's type; its default is the field's initial value.
template <class Record>
struct SettingValue {
    const char* name;   // the value's name in the section
    // An int or a byte (stored as a DWORD; a byte field keeps the low byte), a boolean
    // ("True" or "False") or a text.
    std::variant<int Record::*, uint8_t Record::*, bool Record::*, std::string Record::*> field;
    int characters = 0;   // a text of at most this many characters is read and written; 0: any
};

static void readValue(RegistryKey key, const char* name, int, int& value, int defaultValue) {
    value = readIntSetting(key, name, defaultValue);
}
static void readValue(RegistryKey key, const char* name, int, uint8_t& value, uint8_t defaultValue) {
    value = uint8_t(readIntSetting(key, name, defaultValue));
}
static void readValue(RegistryKey key, const char* name, int, bool& value, bool defaultValue) {
    value = readBoolSetting(key, name, defaultValue);
}
static void readValue(RegistryKey key, const char* name, int characters, std::string& value,
                      const std::string& defaultValue) {
    value = readTextSetting(key, name, defaultValue);
    if (characters) value = firstCharacters(value, characters);
}

static void writeValue(RegistryKey key, const char* name, int, int value) { writeIntSetting(key, name, value); }
static void writeValue(RegistryKey key, const char* name, int, uint8_t value) { writeIntSetting(key, name, value); }
static void writeValue(RegistryKey key, const char* name, int, bool value) { writeBoolSetting(key, name, value); }
static void writeValue(RegistryKey key, const char* name, int characters, const std::string& value) {
    writeTextSetting(key, name, characters ? firstCharacters(value, characters) : value);
}

// The values of each set in the order they are read and written.
static const SettingValue<GeneralSettings> GENERAL_VALUES[] = {
    {"Splash screen", &GeneralSettings::splashScreen},
    {"Quick Prefs", &GeneralSettings::quickPrefs},
};
static const SettingValue<GeneralSettings> AUDIO_GENERAL_VALUES[] = {
    {"CS Pitch range", &GeneralSettings::pitchRange},
    {"CS Enhanced pitch accuracy", &GeneralSettings::enhancedPitchAccuracy},
    {"CS Detect syllables", &GeneralSettings::detectSyllables},
    {"CS Disable wave editing", &GeneralSettings::disableWaveEditing},
    {"CS Draw smooth lines", &GeneralSettings::drawSmoothLines},
    {"CS Draw transparencies", &GeneralSettings::drawTransparencies},
    {"CS Draw gradients", &GeneralSettings::drawGradients},
};
// Followed by "Main window position" and the recent files, which are not single values.
static const SettingValue<GlobalSettings> GLOBAL_VALUES[] = {
    {"Translucent Windows", &GlobalSettings::translucentWindows},
    {"Open Filter", &GlobalSettings::openFilter},
    {"Save Filter", &GlobalSettings::saveFilter},
    {"Open Directory", &GlobalSettings::openDirectory},
    {"Save Directory", &GlobalSettings::saveDirectory},
};
static const SettingValue<GlobalSettings> AUDIO_GLOBAL_VALUES[] = {
    {"CS Playback Mode", &GlobalSettings::playbackMode},
    {"CS Note Mode", &GlobalSettings::noteMode},
    {"CS Scale Mode", &GlobalSettings::scaleMode},
    {"CS Meter width", &GlobalSettings::meterWidth},
    {"CS Meter height", &GlobalSettings::meterHeight},
    {"CS Meter x-offset", &GlobalSettings::meterXOffset},
    {"CS Meter y-offset", &GlobalSettings::meterYOffset},
    {"CS Meter anchor", &GlobalSettings::meterAnchor},
    {"CS Default Instrument", &GlobalSettings::defaultInstrument, MAX_DEFAULT_INSTRUMENT_CHARACTERS},
    {"Show CSSpeedWarning dialog", &GlobalSettings::showSpeedWarning},
    {"CS Boost speed", &GlobalSettings::boostSpeed},
    {"CS Input wave quality", &GlobalSettings::inputWaveQuality},
};

template <class Record, size_t N>
static void readValues(RegistryKey key, const SettingValue<Record> (&values)[N], Record& s) {
    const Record defaults;
    for (const SettingValue<Record>& v : values)
        std::visit([&](auto field) { readValue(key, v.name, v.characters, s.*field, defaults.*field); }, v.field);
}

template <class Record, size_t N>
static void writeValues(RegistryKey key, const SettingValue<Record> (&values)[N], const Record& s) {
    for (const SettingValue<Record>& v : values)
        std::visit([&](auto field) { writeValue(key, v.name, v.characters, s.*field); }, v.field);
}

// "Recent file %d".
static std::string recentFileName(int i) {
    char name[32];
    std::snprintf(name, sizeof name, "Recent file %d", i);
    return name;
}

static int clampedRecentFileCount(int count) { return count < 0 ? 0 : count > MAX_RECENT_FILES ? MAX_RECENT_FILES : count; }

static void readPlacementAndRecentFiles(RegistryKey key, GlobalSettings& s) {
    // The placement has no default: when it is absent (or not a placement) nothing is
    // written and the frame opens maximized.
    std::vector<uint8_t> placement;
    s.hasMainWindowPosition = regQueryBinary(key, "Main window position", &placement) == REG_OK &&
                              placement.size() == size_t(WINDOW_PLACEMENT_SIZE);
    if (s.hasMainWindowPosition)
        for (int i = 0; i < WINDOW_PLACEMENT_SIZE; i++) s.mainWindowPosition[i] = placement[i];
    s.recentFileCount = clampedRecentFileCount(readIntSetting(key, "Number of recent files", GlobalSettings().recentFileCount));
    for (int i = 0; i < MAX_RECENT_FILES; i++) s.recentFiles[i].clear();
    for (int i = 0; i < s.recentFileCount; i++) s.recentFiles[i] = readTextSetting(key, recentFileName(i), "");
}

static void writePlacementAndRecentFiles(RegistryKey key, const GlobalSettings& s) {
    if (s.hasMainWindowPosition)
        writeBinarySetting(key, "Main window position", s.mainWindowPosition, WINDOW_PLACEMENT_SIZE);
    int count = clampedRecentFileCount(s.recentFileCount);
    writeIntSetting(key, "Number of recent files", count);
    for (int i = 0; i < count; i++) writeTextSetting(key, recentFileName(i), s.recentFiles[i]);
}

// Reads a set of values of section (and, when given, what follows them); a section that
// cannot be opened ends start-up.
template <class Record, size_t N>
static int loadValues(const char* section, const SettingValue<Record> (&values)[N], Record& s,
                      void (*readMore)(RegistryKey, Record&) = nullptr) {
    RegistryKey key = openSettingsSection(section, REG_ROOT_MACHINE);
    if (!key) {
        quitFlag = 1;
        return 0;
    }
    readValues(key, values, s);
    if (readMore) readMore(key, s);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

template <class Record, size_t N>
static int saveValues(const char* section, const SettingValue<Record> (&values)[N], const Record& s,
                      void (*writeMore)(RegistryKey, const Record&) = nullptr) {
    RegistryKey key = openSettingsSection(section, REG_ROOT_MACHINE);
    if (!key) return 0;
    writeValues(key, values, s);
    if (writeMore) writeMore(key, s);
    openSettingsSection(nullptr, REG_ROOT_MACHINE);
    return 1;
}

int loadGeneralSettings() { return loadValues(GENERAL_SETTINGS_SECTION, GENERAL_VALUES, generalSettings); }
int loadAudioGeneralSettings() { return loadValues(GENERAL_SETTINGS_SECTION, AUDIO_GENERAL_VALUES, generalSettings); }
int loadGlobalSettings() {
    return loadValues(GLOBAL_SETTINGS_SECTION, GLOBAL_VALUES, globalSettings, readPlacementAndRecentFiles);
}
int loadAudioGlobalSettings() { return loadValues(GLOBAL_SETTINGS_SECTION, AUDIO_GLOBAL_VALUES, globalSettings); }

int saveGeneralSettings() { return saveValues(GENERAL_SETTINGS_SECTION, GENERAL_VALUES, generalSettings); }
int saveAudioGeneralSettings() { return saveValues(GENERAL_SETTINGS_SECTION, AUDIO_GENERAL_VALUES, generalSettings); }
int saveGlobalSettings() {
    return saveValues(GLOBAL_SETTINGS_SECTION, GLOBAL_VALUES, globalSettings, writePlacementAndRecentFiles);
}
int saveAudioGlobalSettings() { return saveValues(GLOBAL_SETTINGS_SECTION, AUDIO_GLOBAL_VALUES, globalSettings); }

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
