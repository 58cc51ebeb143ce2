// The General MIDI instrument list: reading "Resources/General MIDI.txt" line by line, and the
// two lookups, name to program and program to name. The file comes with the installation but
// may have been edited, so every line is checked and a bad one is left out, never trusted.
#include "resources/generalMidi.h"

#include <memory>

#include "platform/files.h"
#include "platform/ui.h"
#include "shell/paths.h"

GeneralMidiTable generalMidiTable;

// A program number has at most this many characters (leading zeros included).
static const size_t MAX_PROGRAM_DIGITS = 9;

void resetGeneralMidiTable() {
    generalMidiTable.names.clear();
    generalMidiTable.loadedPath.clear();
    generalMidiTable.loaded = 0;
}

static bool isControl(unsigned char c) { return c < 0x20 || c == 0x7F; }
static bool isBlank(unsigned char c) { return c == ' ' || c == '\t'; }
static bool isDigit(unsigned char c) { return c >= '0' && c <= '9'; }

int parseGeneralMidiLine(const std::string& text, std::vector<GeneralMidiName>& names) {
    std::string line = text;
    if (!line.empty() && line.back() == '\r') line.pop_back();
    size_t i = 0;
    while (i < line.size() && isBlank(uint8_t(line[i]))) i++;
    if (i == line.size()) return GENERAL_MIDI_LINE_BLANK;
    if (i > 0) return GENERAL_MIDI_LINE_BAD;   // the number opens the line

    size_t numberEnd = 0;
    while (numberEnd < line.size() && line[numberEnd] != ' ' && !isControl(uint8_t(line[numberEnd]))) numberEnd++;
    if (numberEnd == 0 || numberEnd > MAX_PROGRAM_DIGITS) return GENERAL_MIDI_LINE_BAD;
    int program = 0;
    for (size_t k = 0; k < numberEnd; k++) {
        if (!isDigit(uint8_t(line[k]))) return GENERAL_MIDI_LINE_BAD;
        program = program * 10 + (line[k] - '0');
    }
    if (program < 1 || program > GENERAL_MIDI_PROGRAMS) return GENERAL_MIDI_LINE_BAD;

    std::vector<GeneralMidiName> found;
    i = numberEnd;
    while (true) {
        // Names are separated by blanks, or follow one another directly.
        while (i < line.size() && isBlank(uint8_t(line[i]))) i++;
        if (i == line.size()) break;
        if (line[i] != '"') return GENERAL_MIDI_LINE_BAD;
        size_t close = line.find('"', i + 1);
        if (close == std::string::npos || close == i + 1) return GENERAL_MIDI_LINE_BAD;
        GeneralMidiName entry{program, line.substr(i + 1, close - i - 1), 0};
        for (unsigned char c : entry.name)
            if (isControl(c)) return GENERAL_MIDI_LINE_BAD;
        i = close + 1;
        if (i < line.size() && line[i] == ':') {
            if (i + 2 >= line.size() || (line[i + 1] != '+' && line[i + 1] != '-')) return GENERAL_MIDI_LINE_BAD;
            int sign = line[i + 1] == '-' ? -1 : 1;
            size_t digits = i + 2;
            int value = 0;
            while (digits < line.size() && isDigit(uint8_t(line[digits])) && digits - (i + 2) < 3) {
                value = value * 10 + (line[digits] - '0');
                digits++;
            }
            size_t count = digits - (i + 2);
            if (count == 0 || count > 2) return GENERAL_MIDI_LINE_BAD;
            entry.transpose = sign * value;
            i = digits;
            if (i < line.size() && !isBlank(uint8_t(line[i])) && line[i] != '"') return GENERAL_MIDI_LINE_BAD;
        }
        found.push_back(entry);
    }
    if (found.empty()) return GENERAL_MIDI_LINE_BAD;
    names.insert(names.end(), found.begin(), found.end());
    return GENERAL_MIDI_LINE_READ;
}

// The whole file, or 0 when it cannot be read whole.
static int readWholeFile(const std::string& path, std::string& text) {
    int64_t size = fileSize(path);
    if (size < 0 || size > MAX_GENERAL_MIDI_FILE_BYTES) return 0;
    auto closeFile = [](FILE* f) { fileClose(f); };
    std::unique_ptr<FILE, decltype(closeFile)> file(fileOpen(path, "rb"), closeFile);
    if (!file) return 0;
    text.assign(size_t(size), '\0');
    return size == 0 || fileRead(text.data(), size_t(size), file.get()) == size_t(size) ? 1 : 0;
}

int loadGeneralMidiTable() {
    std::string path = resourceFilePath(GENERAL_MIDI_FILE);
    generalMidiTable.names.clear();
    generalMidiTable.loadedPath = path;
    generalMidiTable.loaded = 1;

    std::string text;
    if (!readWholeFile(path, text)) {
        showMessage(MESSAGE_ERROR, "The General MIDI instrument list '" + path +
                                       "' could not be read, so instrument names cannot be matched to General "
                                       "MIDI programs.");
        return 0;
    }
    // An editor may have saved it with a byte order mark.
    if (text.compare(0, 3, "\xEF\xBB\xBF") == 0) text.erase(0, 3);

    int firstBad = 0;
    int lineNumber = 0;
    size_t start = 0;
    while (start < text.size()) {
        size_t end = text.find('\n', start);
        if (end == std::string::npos) end = text.size();
        lineNumber++;
        if (parseGeneralMidiLine(text.substr(start, end - start), generalMidiTable.names) == GENERAL_MIDI_LINE_BAD &&
            firstBad == 0)
            firstBad = lineNumber;
        start = end + 1;
    }
    if (firstBad)
        showMessage(MESSAGE_ERROR, "Line " + std::to_string(firstBad) + " of the General MIDI instrument list '" +
                                       path + "' cannot be read; it and any other unreadable lines have been ignored.");
    return 1;
}

// Reads the list when the resource folder's copy has not been tried yet.
static void useGeneralMidiTable() {
    if (!generalMidiTable.loaded || generalMidiTable.loadedPath != resourceFilePath(GENERAL_MIDI_FILE))
        loadGeneralMidiTable();
}

static char lowerAscii(char c) { return c >= 'A' && c <= 'Z' ? char(c - 'A' + 'a') : c; }

// a[at .. at + b.size()) equals b, ignoring the case of ASCII letters.
static bool equalsAt(const std::string& a, size_t at, const std::string& b) {
    if (at > a.size() || a.size() - at < b.size()) return false;
    for (size_t k = 0; k < b.size(); k++)
        if (lowerAscii(a[at + k]) != lowerAscii(b[k])) return false;
    return true;
}

// Letters and digits; bytes of non-ASCII characters count as letters, so "Flûte" is one word.
static bool isWordCharacter(unsigned char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || isDigit(c) || c >= 0x80;
}

int generalMidiProgram(const std::string& name, int* transpose, int track) {
    (void)track;
    if (transpose) *transpose = 0;
    if (name.empty()) return 1;
    useGeneralMidiTable();
    const std::vector<GeneralMidiName>& names = generalMidiTable.names;

    for (const GeneralMidiName& entry : names) {
        if (entry.name.size() == name.size() && equalsAt(name, 0, entry.name)) {
            if (transpose) *transpose = entry.transpose;
            return entry.program;
        }
    }
    const GeneralMidiName* best = nullptr;
    for (const GeneralMidiName& entry : names) {
        if (best && entry.name.size() <= best->name.size()) continue;
        for (size_t i = 0; i < name.size(); i++) {
            bool wordStart = isWordCharacter(uint8_t(name[i])) && (i == 0 || !isWordCharacter(uint8_t(name[i - 1])));
            if (wordStart && equalsAt(name, i, entry.name)) {
                best = &entry;
                break;
            }
        }
    }
    if (!best) return 1;
    if (transpose) *transpose = best->transpose;
    return best->program;
}

std::string generalMidiName(int program) {
    if (program < 1 || program > GENERAL_MIDI_PROGRAMS) return "Unknown";
    useGeneralMidiTable();
    for (const GeneralMidiName& entry : generalMidiTable.names)
        if (entry.program == program) return entry.name;
    return "Unknown";
}
