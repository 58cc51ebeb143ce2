// CS.fw and the wave files written from it. Every operation here that touches CS.fw waits
// for the undo snapshot writer, then holds CSAccessWaveFileMutex while the file is plain,
// and masks it again on every path before the mutex is released.
#include "audio/waveWorkingFile.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <memory>
#include <mutex>

#include "audio/audioActivity.h"
#include "platform/files.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/song.h"
#include "store/undo.h"

static std::string workingWavePath() { return sharedFilePath("CS.fw"); }

static void putLittle16(uint8_t* at, uint16_t value) {
    at[0] = uint8_t(value);
    at[1] = uint8_t(value >> 8);
}

static void putLittle32(uint8_t* at, uint32_t value) {
    for (int i = 0; i < 4; i++) at[i] = uint8_t(value >> (8 * i));
}

static void putTag(uint8_t* at, const char* fourCC) { std::memcpy(at, fourCC, 4); }

// The song's length in frames: total block duration x rate, rounded to the nearest frame.
static uint32_t songFrames() {
    double frames = std::round(songDuration() * song.waveFormat.samplesPerSec);
    if (!(frames > 0.0)) return 0;
    return frames >= 4294967295.0 ? 0xFFFFFFFFu : uint32_t(frames);
}

// The frame at seconds (truncated), kept within 0 .. limit.
static uint32_t frameAt(double seconds, uint32_t limit) {
    double frame = seconds * song.waveFormat.samplesPerSec;
    if (!(frame > 0.0)) return 0;
    return frame >= double(limit) ? limit : uint32_t(frame);
}

// Silence of the song's sample size: 8-bit samples are unsigned.
static uint8_t silenceByte() { return song.waveFormat.bitsPerSample == 8 ? 0x80 : 0; }

struct CloseStream {
    void operator()(FILE* f) const { fileClose(f); }
};
using StreamGuard = std::unique_ptr<FILE, CloseStream>;   // closes on early exits only

int acceptWaveFormat(const WaveFormatRecord& format) {
    if (song.blockCount != 0 && (format.samplesPerSec != song.waveFormat.samplesPerSec ||
                                 format.bitsPerSample != song.waveFormat.bitsPerSample))
        return 0;
    song.waveFormat = SongWaveFormat{format.formatTag,      format.channels,   format.samplesPerSec,
                                     format.avgBytesPerSec, format.blockAlign, format.bitsPerSample};
    return 1;
}

int createWaveWorkingFile() {
    // The working file always holds one channel of PCM, whatever the source had.
    uint16_t bits = song.waveFormat.bitsPerSample;
    uint32_t rate = song.waveFormat.samplesPerSec;
    uint16_t blockAlign = uint16_t(bits / 8);
    uint8_t header[WORKING_WAVE_HEADER_BYTES];
    putTag(header, "RIFF");
    putLittle32(header + 4, WORKING_WAVE_HEADER_BYTES - 8);
    putTag(header + 8, "WAVE");
    putTag(header + 12, "fmt ");
    putLittle32(header + 16, 16);
    putLittle16(header + 20, WAVE_FORMAT_PCM);
    putLittle16(header + 22, 1);
    putLittle32(header + 24, rate);
    putLittle32(header + 28, rate * blockAlign);
    putLittle16(header + 32, blockAlign);
    putLittle16(header + 34, bits);
    putTag(header + 36, "fact");
    putLittle32(header + 40, 4);
    putLittle32(header + WORKING_WAVE_FACT_OFFSET, 0);
    putTag(header + 48, "data");
    putLittle32(header + 52, 0);

    int failed = 1;
    waitForUndoSnapshotWriter();
    {
        std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
        FILE* file = openReportedFile(workingWavePath(), "wb");
        if (file) {
            int written = writeReportedBytes(file, header, sizeof header);
            int closed = closeReportedFile(file);
            failed = written && closed ? 0 : 1;
        }
    }
    song.workingWaveBytes = 0;
    return failed;
}

int applyWaveMask(const std::string& path, int wanted) {
    int64_t length = fileSize(path);
    if (length < 0) return 0;
    size_t count = size_t(std::min<int64_t>(length, WORKING_WAVE_HEADER_BYTES));
    if (count < 4) return 1;
    uint8_t head[WORKING_WAVE_HEADER_BYTES];
    FILE* reading = fileOpen(path, "rb");
    if (!reading) return 0;
    size_t got = fileRead(head, count, reading);
    fileClose(reading);
    if (got != count) return 0;

    bool plain = std::memcmp(head, "RIFF", 4) == 0;
    if (plain == (wanted == WAVE_PLAIN)) return 1;
    for (size_t i = 0; i < count; i++) head[i] ^= uint8_t(waveMaskText[i]);
    FILE* writing = fileOpen(path, "r+b");
    if (!writing) return 0;
    int written = fileWrite(head, count, writing) == count ? 1 : 0;
    int closed = fileClose(writing) == 0 ? 1 : 0;
    return written && closed;
}

int maskWaveWorkingFile() { return applyWaveMask(workingWavePath(), WAVE_MASKED); }

int unmaskWaveWorkingFile() { return applyWaveMask(workingWavePath(), WAVE_PLAIN); }

int patchWaveHeader(FILE* file, const WaveReadInfo& layout, uint32_t dataBytes, uint16_t bits) {
    // Without a data chunk there is nothing the new bytes could belong to.
    if (layout.dataSizeOffset == WAVE_UNKNOWN) return 1;
    uint8_t value[4];
    putLittle32(value, dataBytes);
    if (!seekReportedFile(file, layout.dataSizeOffset) || !writeReportedBytes(file, value, 4)) return 0;
    if (layout.factValueOffset != WAVE_UNKNOWN) {
        putLittle32(value, bits ? uint32_t(uint64_t(dataBytes) * 8 / bits) : 0);
        if (!seekReportedFile(file, layout.factValueOffset) || !writeReportedBytes(file, value, 4)) return 0;
    }
    uint64_t riffSize = uint64_t(layout.dataOffset) + dataBytes - 8;
    putLittle32(value, uint32_t(std::min<uint64_t>(riffSize, 0xFFFFFFFFu)));
    if (!seekReportedFile(file, 4) || !writeReportedBytes(file, value, 4)) return 0;
    return 1;
}

int appendToWaveWorkingFile(uint32_t storedBytes, const uint8_t* samples, size_t count, const char* openFailureText) {
    std::string path = workingWavePath();
    waitForUndoSnapshotWriter();
    std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
    unmaskWaveWorkingFile();
    WaveReadInfo layout{};
    if (wioFileOpen(&layout, path, 0) != WIO_OPENED) {
        showMessage(MESSAGE_ERROR, openFailureText);
        return 0;
    }
    wioFileClose(&layout);
    StreamGuard file(openReportedFile(path, "r+b"));
    if (!file) return 0;
    if (!seekReportedFile(file.get(), int64_t(layout.dataOffset) + storedBytes) ||
        !writeReportedBytes(file.get(), samples, count) ||
        !patchWaveHeader(file.get(), layout, uint32_t(storedBytes + count), song.waveFormat.bitsPerSample))
        return 0;
    return closeReportedFile(file.release());
}

int finaliseWaveWorkingFile() {
    std::string path = workingWavePath();
    WaveReadInfo layout{};
    if (wioFileOpen(&layout, path, 0) != WIO_OPENED) return WAVE_NOT_OPENED;
    wioFileClose(&layout);

    uint16_t bits = song.waveFormat.bitsPerSample;
    uint64_t wanted = uint64_t(songFrames()) * bits / 8;
    uint32_t dataBytes = uint32_t(std::min<uint64_t>(wanted, 0xFFFFFFFFu - layout.dataOffset));
    uint64_t finalLength = uint64_t(layout.dataOffset) + dataBytes;
    int64_t length = fileSize(path);
    if (length < 0) return WAVE_NOT_OPENED;

    StreamGuard file(openReportedFile(path, "r+b"));
    if (!file) return WAVE_NOT_FINALISED;
    if (!patchWaveHeader(file.get(), layout, dataBytes, bits)) return WAVE_NOT_FINALISED;
    // The blocks may cover a little more than was captured; the rest is silence, not the
    // zero bytes a longer truncate would give (full-scale negative for 8-bit audio).
    if (uint64_t(length) < finalLength) {
        if (!seekReportedFile(file.get(), length)) return WAVE_NOT_FINALISED;
        uint8_t silence[4096];
        std::memset(silence, silenceByte(), sizeof silence);
        for (uint64_t at = uint64_t(length); at < finalLength;) {
            size_t piece = size_t(std::min<uint64_t>(sizeof silence, finalLength - at));
            if (!writeReportedBytes(file.get(), silence, piece)) return WAVE_NOT_FINALISED;
            at += piece;
        }
    }
    if (!closeReportedFile(file.release())) return WAVE_NOT_FINALISED;
    if (fileTruncate(path, int64_t(finalLength)) != 0) return WAVE_NOT_FINALISED;
    return WAVE_FINALISED;
}

int writeWaveSegment(const std::string& path, double start, double end) {
    if (recordingOrOpeningActive()) return 0;
    uint16_t bits = song.waveFormat.bitsPerSample;
    uint32_t rate = song.waveFormat.samplesPerSec;
    uint16_t blockAlign = uint16_t(bits / 8);
    uint32_t endFrame = songFrames();
    uint32_t startFrame = start == -1.0 ? 0 : frameAt(start, endFrame);
    if (end != -1.0) endFrame = frameAt(end, endFrame);
    // An end before the start gives an empty file, not a negative byte count.
    endFrame = std::max(endFrame, startFrame);
    uint64_t from = uint64_t(startFrame) * bits / 8;
    uint64_t dataBytes = uint64_t(endFrame) * bits / 8 - from;
    dataBytes = std::min<uint64_t>(dataBytes, 0xFFFFFFFFu - (WAVE_SEGMENT_HEADER_BYTES - 8));

    waitForUndoSnapshotWriter();
    std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
    unmaskWaveWorkingFile();
    struct MaskAgain {
        ~MaskAgain() { maskWaveWorkingFile(); }
    } maskAgain;
    WaveReadInfo reader{};
    if (wioFileOpen(&reader, workingWavePath(), 0) != WIO_OPENED) return 0;
    struct CloseReader {
        WaveReadInfo* reader;
        ~CloseReader() { wioFileClose(reader); }
    } closeReader{&reader};

    StreamGuard output(openReportedFile(path, "wb"));
    if (!output) return 0;
    uint8_t header[WAVE_SEGMENT_HEADER_BYTES];
    putTag(header, "RIFF");
    putLittle32(header + 4, uint32_t(36 + dataBytes));
    putTag(header + 8, "WAVE");
    putTag(header + 12, "fmt ");
    putLittle32(header + 16, 16);
    putLittle16(header + 20, song.waveFormat.formatTag);
    putLittle16(header + 22, 1);
    putLittle32(header + 24, rate);
    putLittle32(header + 28, rate * blockAlign);
    putLittle16(header + 32, blockAlign);
    putLittle16(header + 34, bits);
    putTag(header + 36, "data");
    putLittle32(header + 40, uint32_t(dataBytes));
    if (!writeReportedBytes(output.get(), header, sizeof header)) return 0;

    // The header promises dataBytes: what CS.fw does not hold (a song whose blocks reach a
    // little past its stored audio) is written as silence rather than left out.
    uint64_t held = reader.dataBytes > from ? reader.dataBytes - from : 0;
    // Pieces of 64 KiB rather than 4 KiB: Play cuts the whole song into CS.fp before the first
    // sample sounds, and the number of system calls, not the bytes, is what takes the time.
    static thread_local uint8_t piece[65536];
    for (uint64_t done = 0; done < dataBytes;) {
        size_t count = size_t(std::min<uint64_t>(sizeof piece, dataBytes - done));
        size_t got = 0;
        if (done < held) {
            if (!seekReportedFile(reader.file, reader.dataOffset + from + done)) return 0;
            got = fileRead(piece, size_t(std::min<uint64_t>(count, held - done)), reader.file);
        }
        if (got < count) std::memset(piece + got, silenceByte(), count - got);
        if (!writeReportedBytes(output.get(), piece, count)) return 0;
        done += count;
    }
    return closeReportedFile(output.release());
}
