// The definition table, its file and the chord limits. The file is little-endian without
// padding; a Harmonic goes to and from it as its 56 bytes, so fields the program does not
// interpret survive a load and a save unchanged.
#include "analysis/instrumentDefinitions.h"

#include <algorithm>
#include <bit>
#include <charconv>
#include <cmath>
#include <cstring>
#include <memory>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/text.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"

static_assert(std::endian::native == std::endian::little, "instrument files are stored little-endian from memory");

InstrumentDefinitions instrumentDefinitions{};

static const char* const VERSION_TEXT =
    "The instrument definitions file cannot be used (it could be out of date) and will not be loaded.";
static const char* const CHORD_LIMIT_TEXT =
    "An instrument in 'maxNotesInChords()' has been defined with a higher value than 'MAX_CS_NOTESINCHORD'";

// Bytes of a definition's fixed part: three names, voice, chord limit, thresholds, middle A, range.
static const size_t DEFINITION_HEAD_BYTES = 3 * 2 * INSTRUMENT_NAME_UNITS + 2 + 3 * 4 + 4 + 2;

std::string instrumentDefinitionsPath() {
    const std::string& path = instrumentDefinitions.filePath;
    return path.empty() ? resourceFilePath(INSTRUMENT_FILE) : path;
}

void setInstrumentDefinitionsFile(const std::string& path) {
    instrumentDefinitions.filePath = path;
    instrumentDefinitions.refusedFile = 0;
}

void freeInstrumentDefinitions() {
    std::vector<InstrumentDefinition>().swap(instrumentDefinitions.definitions);
    instrumentDefinitions.current = 0;
}

// ---- names: UTF-8 in memory, 32 zero-padded UTF-16 units in the file ----

// The name's UTF-16 units, cut at a character boundary to what the field holds.
static void encodeName(const std::string& name, uint8_t out[2 * INSTRUMENT_NAME_UNITS]) {
    std::memset(out, 0, 2 * INSTRUMENT_NAME_UNITS);
    std::u16string units = cutUtf16(utf8ToUtf16(name), INSTRUMENT_NAME_UNITS);
    for (size_t i = 0; i < units.size(); i++) {
        out[2 * i] = uint8_t(units[i]);
        out[2 * i + 1] = uint8_t(units[i] >> 8);
    }
}

// The units up to the first zero (all 32 when there is none); a lone surrogate gives U+FFFD.
static std::string decodeName(const uint8_t in[2 * INSTRUMENT_NAME_UNITS]) {
    std::u16string units;
    for (int i = 0; i < INSTRUMENT_NAME_UNITS; i++) {
        char16_t u = char16_t(in[2 * i] | in[2 * i + 1] << 8);
        if (u == 0) break;
        units += u;
    }
    return utf16ToUtf8(units);
}

std::string fitInstrumentName(const std::string& name) {
    uint8_t units[2 * INSTRUMENT_NAME_UNITS];
    encodeName(name, units);
    return decodeName(units);
}

// ---- the file ----

static void putBytes(std::vector<uint8_t>& b, const void* p, size_t n) {
    const uint8_t* bytes = static_cast<const uint8_t*>(p);
    b.insert(b.end(), bytes, bytes + n);
}

static void appendDefinition(const InstrumentDefinition& d, std::vector<uint8_t>& b) {
    uint8_t name[2 * INSTRUMENT_NAME_UNITS];
    for (const std::string* text : {&d.name, &d.kind, &d.source}) {
        encodeName(*text, name);
        putBytes(b, name, sizeof name);
    }
    b.push_back(d.midiVoice);
    b.push_back(d.maxNotesInChord);
    putBytes(b, d.scoreThresholds, sizeof d.scoreThresholds);
    putBytes(b, &d.middleA, 4);
    b.push_back(d.lowSemitone);
    b.push_back(d.highSemitone);
    for (const NoteSampleSet& set : d.semitones) {
        b.push_back(set.sampleCount);
        for (int s = 0; s < set.sampleCount; s++) {
            const NoteSample& sample = set.samples[s];
            putBytes(b, &sample.duration, 4);
            putBytes(b, &sample.level, 4);
            b.push_back(sample.harmonicCount);
            putBytes(b, sample.harmonics, sizeof(Harmonic) * sample.harmonicCount);
        }
    }
}

// Reads the file field by field; the first short read or broken rule stops it with a reason.
struct InstrumentFileReader {
    FILE* file;            // open for reading
    const char* reason;    // why the file is refused; nullptr while it reads well
    int outOfMemory;       // an allocation failed

    bool read(void* p, size_t n) {
        if (reason) return false;
        if (!readReportedBytes(file, p, n)) reason = "it ends before its last definition";
        return !reason;
    }
    bool refuse(const char* why) {
        if (!reason) reason = why;
        return false;
    }
};

static bool readSample(InstrumentFileReader& r, NoteSample& sample) {
    uint8_t count = 0;
    if (!r.read(&sample.duration, 4) || !r.read(&sample.level, 4) || !r.read(&count, 1)) return false;
    if (count > MAX_CS_HARMONICS) return r.refuse("a note sample has more than 32 harmonics");
    sample.harmonicCount = count;
    return r.read(sample.harmonics, sizeof(Harmonic) * count);
}

static bool readDefinition(InstrumentFileReader& r, InstrumentDefinition& d) {
    uint8_t head[DEFINITION_HEAD_BYTES];
    if (!r.read(head, sizeof head)) return false;
    const uint8_t* p = head;
    d.name = decodeName(p);
    d.kind = decodeName(p + 2 * INSTRUMENT_NAME_UNITS);
    d.source = decodeName(p + 4 * INSTRUMENT_NAME_UNITS);
    p += 6 * INSTRUMENT_NAME_UNITS;
    d.midiVoice = *p++;
    d.maxNotesInChord = *p++;
    std::memcpy(d.scoreThresholds, p, sizeof d.scoreThresholds);
    p += sizeof d.scoreThresholds;
    std::memcpy(&d.middleA, p, 4);
    p += 4;
    d.lowSemitone = p[0];
    d.highSemitone = p[1];
    if (d.lowSemitone > d.highSemitone) return r.refuse("a semitone range has its low note above its high note");
    if (d.highSemitone > MAX_CS_SEMITONE) return r.refuse("a semitone range goes beyond note 127");
    size_t semitones = size_t(d.highSemitone - d.lowSemitone) + 1;
    if (!tryAllocate([&] { d.semitones.assign(semitones, NoteSampleSet{}); })) {
        r.outOfMemory = 1;
        return r.refuse("out of memory");
    }
    for (NoteSampleSet& set : d.semitones) {
        uint8_t count = 0;
        if (!r.read(&count, 1)) return false;
        if (count > MAX_CS_NOTESAMPLES) return r.refuse("a semitone has more than two note samples");
        set.sampleCount = count;
        for (int s = 0; s < count; s++)
            if (!readSample(r, set.samples[s])) return false;
    }
    return true;
}

int loadInstrumentDefinitions() {
    freeInstrumentDefinitions();
    instrumentDefinitions.refusedFile = 0;
    std::string path = instrumentDefinitionsPath();
    auto closeFile = [](FILE* f) { fileClose(f); };
    std::unique_ptr<FILE, decltype(closeFile)> file(fileOpen(path, "rb"), closeFile);
    if (!file) return 0;

    InstrumentFileReader r{file.get(), nullptr, 0};
    uint8_t version = 0;
    if (r.read(&version, 1) && version != INSTRUMENT_FILE_VERSION) {
        instrumentDefinitions.refusedFile = 1;
        showMessage(MESSAGE_ERROR, VERSION_TEXT);
        return 0;
    }
    uint32_t count = 0;
    if (r.read(&count, 4) && count > uint32_t(MAX_CS_INSTRUMENTS)) r.refuse("it holds more than 256 definitions");
    std::vector<InstrumentDefinition> definitions;
    if (!r.reason && !tryResize(definitions, count)) {
        r.outOfMemory = 1;
        r.refuse("out of memory");
    }
    for (uint32_t i = 0; i < count && !r.reason; i++) readDefinition(r, definitions[i]);
    uint8_t extra;
    if (!r.reason && readReportedBytes(file.get(), &extra, 1)) r.refuse("it has bytes after its last definition");
    if (r.reason) {
        if (r.outOfMemory) {
            showMessage(MESSAGE_ERROR, resourceString(10401));
        } else {
            instrumentDefinitions.refusedFile = 1;
            showMessage(MESSAGE_ERROR, "The instrument definitions file '" + path + "' cannot be used (" + r.reason +
                                           ") and will not be loaded.");
        }
        return 0;
    }
    instrumentDefinitions.definitions.swap(definitions);
    return 1;
}

int saveInstrumentDefinitions() {
    std::string path = instrumentDefinitionsPath();
    std::string newPath = path + ".new";
    FILE* file = fileOpen(newPath, "wb");
    if (!file) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    std::vector<uint8_t> bytes;
    bytes.push_back(INSTRUMENT_FILE_VERSION);
    uint32_t count = uint32_t(instrumentDefinitions.definitions.size());
    putBytes(bytes, &count, 4);
    int written = writeReportedBytes(file, bytes.data(), bytes.size());
    for (size_t i = 0; written && i < instrumentDefinitions.definitions.size(); i++) {
        bytes.clear();
        appendDefinition(instrumentDefinitions.definitions[i], bytes);
        written = writeReportedBytes(file, bytes.data(), bytes.size());
    }
    if (written && fileFlush(file) != 0) {
        showMessage(MESSAGE_ERROR, "Bytes were not stored properly");
        written = 0;
    }
    if (!written) {
        fileClose(file);
        fileDelete(newPath);
        return 0;
    }
    if (!closeReportedFile(file)) {
        fileDelete(newPath);
        return 0;
    }
    // A file the last load refused may be of another version or damaged: the user's
    // definitions in it are kept aside rather than overwritten.
    if (instrumentDefinitions.refusedFile && fileExists(path)) {
        if (renameFile(path, path + ".damaged") != 0) {
            showMessage(MESSAGE_ERROR, "Cannot " + path + ".damaged");
            fileDelete(newPath);
            return 0;
        }
    }
    instrumentDefinitions.refusedFile = 0;
    if (renameFile(newPath, path) != 0) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        fileDelete(newPath);
        return 0;
    }
    return 1;
}

int deleteInstrumentDefinition(int index) {
    InstrumentDefinitions& t = instrumentDefinitions;
    if (index < 0 || index >= int(t.definitions.size())) return 0;
    t.definitions.erase(t.definitions.begin() + index);
    int count = int(t.definitions.size());
    if (t.current >= count) t.current = count > 0 ? std::min(t.current - 1, count - 1) : 0;
    return saveInstrumentDefinitions();
}

// ---- chord limits, notes, the window's line ----

int limitNotesInChord(int notes) {
    if (notes > MAX_CS_NOTESINCHORD) {
        showMessage(MESSAGE_ERROR, CHORD_LIMIT_TEXT);
        return MAX_CS_NOTESINCHORD;
    }
    return notes;
}

int maxNotesInChords(int midiVoice) {
    struct ChordLimit {
        int firstVoice, lastVoice, notes;
    };
    static const ChordLimit limits[] = {
        {0, 5, 12},    // pianos
        {8, 8, 12},    // celesta
        {11, 11, 4},   // vibraphone
        {24, 31, 6},   // guitars
        {32, 39, 4},   // basses
        {40, 40, 2},   // violin
    };
    for (const ChordLimit& l : limits)
        if (midiVoice >= l.firstVoice && midiVoice <= l.lastVoice) return limitNotesInChord(l.notes);
    return 1;
}

float nearestNoteFrequency(double frequency, double middleA) {
    double best = 0, bestDistance = 0;
    for (int i = 0; i < 128; i++) {
        double note = std::exp2((i - 9) / 12.0) * middleA / 32.0;
        double distance = std::fabs(note - frequency);
        if (i == 0 || distance < bestDistance) {
            best = note;
            bestDistance = distance;
        }
    }
    return float(best);
}

// value with precision decimals and a "." whatever the locale (the desktop program sets one).
static std::string fixedText(double value, int precision) {
    char buffer[64];
    std::to_chars_result r = std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::fixed, precision);
    return r.ec == std::errc() ? std::string(buffer, r.ptr) : std::string("?");
}

std::string instrumentDefinitionText(const InstrumentDefinition& d) {
    return d.name + " (" + d.kind + ") - " + d.source + ". MIDI voice is " + std::to_string(d.midiVoice) +
           ". Max notes in chord is " + std::to_string(d.maxNotesInChord) + ". Middle A is " +
           fixedText(d.middleA, 2) + "Hz. Semitone range is " + std::to_string(d.lowSemitone) + " to " +
           std::to_string(d.highSemitone) + ". Score thresholds: " + fixedText(d.scoreThresholds[0], 1) + "%, " +
           fixedText(d.scoreThresholds[1], 1) + "%, " + fixedText(d.scoreThresholds[2], 1) + "%.";
}
