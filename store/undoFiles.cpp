// The undo level files. Everything is little-endian; the notes are the 72-byte records as
// they lie in memory.
#include "store/undoFiles.h"

#include <cmath>
#include <cstring>
#include <memory>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/text.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/song.h"

std::string undoFilePath(const char* prefix, int level) {
    return sharedFilePath(std::string(UNDO_FOLDER_NAME) + "/" + prefix + std::to_string(level));
}

static void putU32(std::vector<uint8_t>& b, uint32_t v) {
    for (int i = 0; i < 4; i++) b.push_back(uint8_t(v >> (8 * i)));
}

static void putBytes(std::vector<uint8_t>& b, const void* p, size_t n) {
    const uint8_t* bytes = static_cast<const uint8_t*>(p);
    b.insert(b.end(), bytes, bytes + n);
}

// Writes bytes as the whole file at path.
static int writeWholeFile(const std::string& path, const std::vector<uint8_t>& bytes) {
    FILE* f = openReportedFile(path, "wb");
    if (!f) return 0;
    int written = bytes.empty() || writeReportedBytes(f, bytes.data(), bytes.size());
    int closed = closeReportedFile(f);
    return written && closed;
}

int writeUndoSongFile(const std::string& path) {
    std::vector<uint8_t> b;
    if (!tryAllocate([&] {
            b.reserve(2 * UNDO_INSTRUMENT_NAME_UNITS + 24 + size_t(noteList.count) * sizeof(Note) +
                      size_t(barlineList.count) * sizeof(float));
        }))
        return 0;
    std::u16string name = cutUtf16(utf8ToUtf16(song.instrumentName), UNDO_INSTRUMENT_NAME_UNITS);
    // A 0 inside the name would end it early on reading: the name stops there.
    name = name.substr(0, name.find(u'\0'));
    for (char16_t unit : name) {
        b.push_back(uint8_t(unit));
        b.push_back(uint8_t(unit >> 8));
    }
    b.push_back(0);
    b.push_back(0);
    putU32(b, song.timeSignatureBeats);
    putU32(b, song.timeSignatureUnit);
    putU32(b, song.timeSignatureSymbol);
    putU32(b, uint32_t(noteList.count));
    putBytes(b, noteList.notes, size_t(noteList.count) * sizeof(Note));
    putU32(b, uint32_t(barlineList.count));
    putBytes(b, barlineList.times, size_t(barlineList.count) * sizeof(float));
    return writeWholeFile(path, b);
}

// Reads a file field by field, refusing a read the file cannot satisfy.
struct UndoFileReader {
    FILE* file;         // open for reading
    int64_t left;       // bytes not read yet
    bool read(void* p, size_t n) {
        if (int64_t(n) > left || !readReportedBytes(file, p, n)) return false;
        left -= int64_t(n);
        return true;
    }
    bool skip(int64_t n) {
        if (n > left || fileSeek(file, n, SEEK_CUR) != 0) return false;
        left -= n;
        return true;
    }
    bool readU32(uint32_t* v) {
        uint8_t b[4];
        if (!read(b, 4)) return false;
        *v = uint32_t(b[0]) | uint32_t(b[1]) << 8 | uint32_t(b[2]) << 16 | uint32_t(b[3]) << 24;
        return true;
    }
};

struct CloseFile {
    void operator()(FILE* f) const { fileClose(f); }
};

// Opens path for reading with its length; UNDO_FILE_MISSING when it is not there.
static int openForReading(const std::string& path, std::unique_ptr<FILE, CloseFile>* file, int64_t* length) {
    if (!fileExists(path)) return UNDO_FILE_MISSING;
    *length = fileSize(path);
    file->reset(fileOpen(path, "rb"));
    return *file && *length >= 0 ? UNDO_FILE_READ : UNDO_FILE_DAMAGED;
}

static bool finiteTimes(const Note& n) {
    return std::isfinite(n.pitch) && std::isfinite(n.midiStart) && std::isfinite(n.midiEnd) &&
           std::isfinite(n.waveStart) && std::isfinite(n.waveEnd);
}

int readUndoSongFile(const std::string& path, UndoSongFile* contents) {
    std::unique_ptr<FILE, CloseFile> file;
    int64_t length = 0;
    int opened = openForReading(path, &file, &length);
    if (opened != UNDO_FILE_READ) return opened;
    UndoFileReader r{file.get(), length};

    std::u16string name;
    for (;;) {
        uint8_t unit[2];
        if (!r.read(unit, 2)) return UNDO_FILE_DAMAGED;
        char16_t u = char16_t(unit[0] | unit[1] << 8);
        if (u == 0) break;
        if (name.size() >= UNDO_INSTRUMENT_NAME_UNITS) return UNDO_FILE_DAMAGED;
        name += u;
    }
    UndoSongFile c;
    c.instrumentName = utf16ToUtf8(name);
    uint32_t noteCount = 0;
    if (!r.readU32(&c.timeSignatureBeats) || !r.readU32(&c.timeSignatureUnit) || !r.readU32(&c.timeSignatureSymbol) ||
        !r.readU32(&noteCount))
        return UNDO_FILE_DAMAGED;
    // Every counted note must be in the file, also those beyond what the list holds.
    if (int64_t(noteCount) * int64_t(sizeof(Note)) > r.left) return UNDO_FILE_DAMAGED;
    uint32_t kept = noteCount < uint32_t(MAX_CS_NOTES) ? noteCount : uint32_t(MAX_CS_NOTES);
    if (!tryResize(c.notes, kept)) return UNDO_FILE_DAMAGED;
    if (kept > 0 && !r.read(c.notes.data(), size_t(kept) * sizeof(Note))) return UNDO_FILE_DAMAGED;
    if (!r.skip(int64_t(noteCount - kept) * int64_t(sizeof(Note)))) return UNDO_FILE_DAMAGED;
    for (const Note& n : c.notes)
        if (!finiteTimes(n)) return UNDO_FILE_DAMAGED;

    uint32_t barlineCount = 0;
    if (!r.readU32(&barlineCount)) return UNDO_FILE_DAMAGED;
    if (int64_t(barlineCount) * int64_t(sizeof(float)) != r.left) return UNDO_FILE_DAMAGED;
    uint32_t keptBarlines = barlineCount < uint32_t(MAX_CS_BARLINES) ? barlineCount : uint32_t(MAX_CS_BARLINES);
    if (!tryResize(c.barlines, keptBarlines)) return UNDO_FILE_DAMAGED;
    if (keptBarlines > 0 && !r.read(c.barlines.data(), size_t(keptBarlines) * sizeof(float))) return UNDO_FILE_DAMAGED;
    for (float b : c.barlines)
        if (!std::isfinite(b)) return UNDO_FILE_DAMAGED;
    *contents = std::move(c);
    return UNDO_FILE_READ;
}

int writeUndoDurationsFile(const std::string& path) {
    const std::vector<double>& d = song.sampleBlockDurations;
    std::vector<uint8_t> b;
    if (!tryAllocate([&] { b.reserve(4 + d.size() * sizeof(double)); })) return 0;
    putU32(b, uint32_t(d.size()));
    putBytes(b, d.data(), d.size() * sizeof(double));
    return writeWholeFile(path, b);
}

int readUndoDurationsFile(const std::string& path, std::vector<double>* durations) {
    std::unique_ptr<FILE, CloseFile> file;
    int64_t length = 0;
    int opened = openForReading(path, &file, &length);
    if (opened != UNDO_FILE_READ) return opened;
    UndoFileReader r{file.get(), length};
    uint32_t count = 0;
    if (!r.readU32(&count) || int64_t(count) * int64_t(sizeof(double)) != r.left) return UNDO_FILE_DAMAGED;
    std::vector<double> d;
    if (!tryResize(d, count)) return UNDO_FILE_DAMAGED;
    if (count > 0 && !r.read(d.data(), size_t(count) * sizeof(double))) return UNDO_FILE_DAMAGED;
    for (double x : d)
        if (!std::isfinite(x) || x < 0.0) return UNDO_FILE_DAMAGED;
    *durations = std::move(d);
    return UNDO_FILE_READ;
}
