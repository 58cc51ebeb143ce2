// The audio side of time editing: cutting samples out of CS.fw, copying them to "_CS.fw" and
// to the system clipboard, and splicing them back in. The samples behind a cut or paste point
// wait in "CS.tw" while the file is rewritten; audio moves in pieces of one second.
#include "store/timeEditing.h"

#include <algorithm>
#include <memory>
#include <mutex>
#include <new>
#include <string>

#include "audio/waveFile.h"
#include "audio/waveWorkingFile.h"
#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/song.h"

static const char* const TEMPORARY_FILE = "CS.tw";
static const char* const CLIPBOARD_WAVE_FILE = "_CS.fw";

struct TimeEditStreamCloser {
    void operator()(FILE* f) const {
        if (f) fileClose(f);
    }
};
using TimeEditStream = std::unique_ptr<FILE, TimeEditStreamCloser>;

// CS.fw plain for one job, under CSAccessWaveFileMutex, with the offsets of its header; masked
// again and the mutex released when the job ends, on every path. The caller has waited for
// the undo snapshot writer.
struct PlainWorkingWave {
    std::lock_guard<std::mutex> access{CSAccessWaveFileMutex};
    WaveReadInfo layout{};
    bool readable = false;
    PlainWorkingWave() {
        unmaskWaveWorkingFile();
        readable = wioFileOpen(&layout, path(), 0) == WIO_OPENED;
        if (readable) wioFileClose(&layout);
    }
    ~PlainWorkingWave() { maskWaveWorkingFile(); }
    static std::string path() { return sharedFilePath("CS.fw"); }
    uint32_t bytesPerSample() const { return song.waveFormat.bitsPerSample / 8u; }
    uint32_t samplesHeld() const { return bytesPerSample() ? layout.dataBytes / bytesPerSample() : 0; }
};

// One second of samples, the piece audio moves in; nullptr when the memory cannot be had.
static std::unique_ptr<uint8_t[]> secondBuffer(size_t* bytes) {
    *bytes = size_t(std::max(1u, song.waveFormat.samplesPerSec)) * std::max(1u, song.waveFormat.bitsPerSample / 8u);
    if (!allocationAllowed()) return nullptr;
    return std::unique_ptr<uint8_t[]>(new (std::nothrow) uint8_t[*bytes]);
}

// Copies count bytes from in's position to out's position in pieces of the buffer's size.
static int copyBytes(FILE* in, FILE* out, uint64_t count, uint8_t* buffer, size_t bufferBytes) {
    while (count > 0) {
        size_t piece = size_t(std::min<uint64_t>(count, bufferBytes));
        if (fileRead(buffer, piece, in) != piece) return 0;
        if (!writeReportedBytes(out, buffer, piece)) return 0;
        count -= piece;
    }
    return 1;
}

// "CS.tw" while a job uses it: closed and deleted on every return.
struct TemporaryWave {
    std::string path = sharedFilePath(TEMPORARY_FILE);
    TimeEditStream file;
    ~TemporaryWave() {
        file.reset();
        if (fileExists(path)) fileDelete(path);
    }
    // Saves bytes [from, from + count) of source into a fresh "CS.tw" and opens it for reading.
    int save(FILE* source, uint64_t from, uint64_t count, uint8_t* buffer, size_t bufferBytes) {
        file.reset(openReportedFile(path, "wb"));
        if (!file) return 0;
        if (!seekReportedFile(source, int64_t(from)) || !copyBytes(source, file.get(), count, buffer, bufferBytes))
            return 0;
        if (!closeReportedFile(file.release())) return 0;
        file.reset(openReportedFile(path, "rb"));
        return file ? 1 : 0;
    }
};

// Rewrites the header for dataBytes of samples and cuts the file behind them.
static int finishWorkingWave(TimeEditStream& file, const PlainWorkingWave& wave, uint32_t dataBytes) {
    if (!patchWaveHeader(file.get(), wave.layout, dataBytes, song.waveFormat.bitsPerSample)) return 0;
    if (!closeReportedFile(file.release())) return 0;
    if (fileTruncate(PlainWorkingWave::path(), int64_t(wave.layout.dataOffset) + dataBytes) != 0) {
        showMessage(MESSAGE_ERROR, "Cannot " + PlainWorkingWave::path());
        return 0;
    }
    song.workingWaveBytes = dataBytes;
    return 1;
}

int removeWavesFromSong(uint32_t first, uint32_t count) {
    PlainWorkingWave wave;
    if (!wave.readable) return 0;
    uint32_t b = wave.bytesPerSample();
    uint32_t held = wave.samplesHeld();
    uint32_t s0 = std::min(sampleOfBlock(first), held);
    uint32_t s1 = std::min(sampleOfBlock(first + count), held);
    size_t bufferBytes;
    std::unique_ptr<uint8_t[]> buffer = secondBuffer(&bufferBytes);
    if (!buffer) return 0;
    TimeEditStream file(openReportedFile(PlainWorkingWave::path(), "r+b"));
    if (!file) return 0;
    uint64_t offset = wave.layout.dataOffset;
    TemporaryWave tail;
    if (!tail.save(file.get(), offset + uint64_t(s1) * b, uint64_t(held - s1) * b, buffer.get(), bufferBytes))
        return 0;
    if (!seekReportedFile(file.get(), int64_t(offset + uint64_t(s0) * b)) ||
        !copyBytes(tail.file.get(), file.get(), uint64_t(held - s1) * b, buffer.get(), bufferBytes))
        return 0;
    return finishWorkingWave(file, wave, wave.layout.dataBytes - (s1 - s0) * b);
}

uint32_t clipboardSamples() {
    // The running sum is rounded once, as block positions are, so that a pasted stretch fills
    // exactly the samples its blocks claim.
    double seconds = 0.0;
    for (uint32_t k = 0; k < timeClipboard.durationCount && k < timeClipboard.durations.size(); k++)
        seconds += timeClipboard.durations[k];
    double samples = seconds * song.waveFormat.samplesPerSec + 0.5;
    return samples > 0.0 && samples < 4294967295.0 ? uint32_t(samples) : 0;
}

static void putLittle32(uint8_t* at, uint32_t value) {
    for (int i = 0; i < 4; i++) at[i] = uint8_t(value >> (8 * i));
}

int copyWavesToClipboard(uint32_t first, uint32_t count) {
    PlainWorkingWave wave;
    if (!wave.readable) return 0;
    uint32_t b = wave.bytesPerSample();
    uint32_t held = wave.samplesHeld();
    uint32_t s0 = std::min(sampleOfBlock(first), held);
    uint32_t s1 = std::min(sampleOfBlock(first + count), held);
    uint32_t length = (s1 - s0) * b;
    uint32_t headerBytes = wave.layout.dataOffset;
    TimeEditStream file(openReportedFile(PlainWorkingWave::path(), "rb"));
    if (!file) return 0;

    // The system clipboard gets a whole RIFF WAVE file: CS.fw's header with the sizes of the
    // range, then its samples. Without the memory only the system clipboard goes without.
    std::vector<uint8_t> riff;
    if (tryAllocate([&] { riff.resize(size_t(headerBytes) + length); })) {
        if (!seekReportedFile(file.get(), 0) || fileRead(riff.data(), headerBytes, file.get()) != headerBytes ||
            !seekReportedFile(file.get(), int64_t(headerBytes) + int64_t(s0) * b) ||
            fileRead(riff.data() + headerBytes, length, file.get()) != length)
            return 0;
        if (wave.layout.dataSizeOffset + 4 <= headerBytes) putLittle32(&riff[wave.layout.dataSizeOffset], length);
        if (wave.layout.factValueOffset != WAVE_UNKNOWN && wave.layout.factValueOffset + 4 <= headerBytes)
            putLittle32(&riff[wave.layout.factValueOffset], b ? length / b : 0);
        putLittle32(&riff[4], length + headerBytes - 8);
        setClipboardWave(riff);
    } else {
        riff.clear();
    }

    TimeEditStream clip(openReportedFile(sharedFilePath(CLIPBOARD_WAVE_FILE), "wb"));
    if (!clip || !writeReportedBytes(clip.get(), &count, 4)) return 0;
    if (!riff.empty()) {
        if (length > 0 && !writeReportedBytes(clip.get(), riff.data() + headerBytes, length)) return 0;
    } else {
        size_t bufferBytes;
        std::unique_ptr<uint8_t[]> buffer = secondBuffer(&bufferBytes);
        if (!buffer || !seekReportedFile(file.get(), int64_t(headerBytes) + int64_t(s0) * b) ||
            !copyBytes(file.get(), clip.get(), length, buffer.get(), bufferBytes))
            return 0;
    }
    return closeReportedFile(clip.release());
}

int pasteWaves(uint32_t first, uint32_t replaced) {
    PlainWorkingWave wave;
    if (!wave.readable) return 0;
    uint32_t b = wave.bytesPerSample();
    uint32_t held = wave.samplesHeld();
    uint32_t s0 = std::min(sampleOfBlock(first), held);
    uint32_t s1 = std::min(sampleOfBlock(first + replaced), held);
    uint32_t pasted = clipboardSamples();
    uint64_t newBytes = uint64_t(wave.layout.dataBytes) - uint64_t(s1 - s0) * b + uint64_t(pasted) * b;
    if (newBytes + wave.layout.dataOffset > 0xFFFFFFFFu) return 0;

    // The clipboard must hold every sample its durations claim.
    std::string clipPath = sharedFilePath(CLIPBOARD_WAVE_FILE);
    int64_t clipLength = fileSize(clipPath);
    if (clipLength < 4 + int64_t(pasted) * b) return 0;
    TimeEditStream clip(openReportedFile(clipPath, "rb"));
    if (!clip) return 0;

    size_t bufferBytes;
    std::unique_ptr<uint8_t[]> buffer = secondBuffer(&bufferBytes);
    if (!buffer) return 0;
    TimeEditStream file(openReportedFile(PlainWorkingWave::path(), "r+b"));
    if (!file) return 0;
    uint64_t offset = wave.layout.dataOffset;
    TemporaryWave tail;
    if (!tail.save(file.get(), offset + uint64_t(s1) * b, uint64_t(held - s1) * b, buffer.get(), bufferBytes))
        return 0;
    if (!seekReportedFile(file.get(), int64_t(offset + uint64_t(s0) * b)) || !seekReportedFile(clip.get(), 4) ||
        !copyBytes(clip.get(), file.get(), uint64_t(pasted) * b, buffer.get(), bufferBytes) ||
        !copyBytes(tail.file.get(), file.get(), uint64_t(held - s1) * b, buffer.get(), bufferBytes))
        return 0;
    return finishWorkingWave(file, wave, uint32_t(newBytes));
}
