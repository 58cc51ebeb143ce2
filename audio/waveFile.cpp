// The RIFF WAVE reader: a chunk walk of our own over a buffered stdio file, bounded by the
// file's real length so that no header, however wrong, makes it read past the end or run
// for ever; and the downmix of interleaved frames to one channel.
#include "audio/waveFile.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <new>

#include "platform/files.h"
#include "platform/ui.h"

static uint16_t littleU16(const uint8_t* bytes) { return uint16_t(bytes[0] | bytes[1] << 8); }

static uint32_t littleU32(const uint8_t* bytes) {
    return uint32_t(bytes[0]) | uint32_t(bytes[1]) << 8 | uint32_t(bytes[2]) << 16 | uint32_t(bytes[3]) << 24;
}

static bool isTag(const uint8_t* bytes, const char* fourCC) { return std::memcmp(bytes, fourCC, 4) == 0; }

// 1 when count bytes could be read at offset.
static int readAt(FILE* file, uint64_t offset, void* bytes, size_t count) {
    if (fileSeek(file, int64_t(offset), SEEK_SET) != 0) return 0;
    return fileRead(bytes, count, file) == count ? 1 : 0;
}

// Chunk bodies are padded to an even length; the pad byte is not counted in the size.
static uint64_t nextChunk(uint64_t dataAt, uint32_t size) { return dataAt + size + (size & 1); }

// Asks whether to load a file whose chunk reaches past the RIFF chunk; 1 for Yes.
static int askToLoadOverlongChunk(uint32_t id, uint32_t dataAt, uint32_t size, uint32_t riffSize) {
    char text[320];
    std::snprintf(text, sizeof text,
                  "This wave file might be corrupt. The RIFF chunk.ckid '%.08lX' (data offset at %lu) specifies a "
                  "cksize of %lu that extends beyond what the RIFF header cksize of %lu allows. Attempt to load?",
                  (unsigned long)id, (unsigned long)dataAt, (unsigned long)size, (unsigned long)riffSize);
    return messageBox("wioFileOpen", text, MESSAGE_WARNING, BUTTONS_YES_NO) == ANSWER_YES ? 1 : 0;
}

// Reads the first "fmt " chunk into a newly allocated record.
static uint32_t readFormatChunk(WaveReadInfo* info, uint64_t dataAt, uint32_t size, uint64_t fileLength) {
    if (size > MAX_WAVE_FORMAT_BYTES || dataAt + size > fileLength) return WIO_CANNOT_READ;
    // Never shorter than 18 bytes, so that extraSize reads 0 from a 16-byte PCM record.
    size_t allocated = std::max<size_t>(size, 18);
    std::unique_ptr<uint8_t[]> body(new (std::nothrow) uint8_t[allocated]);
    if (!body) return WIO_NO_MEMORY;
    std::memset(body.get(), 0, allocated);
    if (!readAt(info->file, dataAt, body.get(), size)) return WIO_CANNOT_READ;
    WaveFormatRecord* format = new (std::nothrow) WaveFormatRecord;
    if (!format) return WIO_NO_MEMORY;
    const uint8_t* b = body.get();
    *format = WaveFormatRecord{littleU16(b), littleU16(b + 2), littleU32(b + 4), littleU32(b + 8),
                               littleU16(b + 12), littleU16(b + 14), littleU16(b + 16)};
    info->format = format;
    return WIO_OPENED;
}

uint32_t wioFileOpen(WaveReadInfo* info, const std::string& path, uint32_t flags) {
    if (!info) return WIO_NO_RECORD;
    *info = WaveReadInfo{};
    info->flags = flags;
    info->dataSamples = WAVE_UNKNOWN;
    info->dataSizeOffset = WAVE_UNKNOWN;
    info->factValueOffset = WAVE_UNKNOWN;
    info->file = fileOpen(path, "rb");
    if (!info->file) return WIO_CANNOT_READ;

    struct CloseOnFailure {
        WaveReadInfo* info;
        bool opened = false;
        ~CloseOnFailure() {
            if (!opened) wioFileClose(info);
        }
    } closeOnFailure{info};

    if (fileSeek(info->file, 0, SEEK_END) != 0) return WIO_CANNOT_READ;
    int64_t length = fileTell(info->file);
    if (length < 0) return WIO_CANNOT_READ;
    // Offsets are 32-bit in a RIFF file: what lies beyond 4 GiB cannot be addressed.
    uint64_t fileLength = std::min<uint64_t>(uint64_t(length), 0xFFFFFFFFu);

    // The outermost RIFF chunk of form "WAVE"; other top-level chunks are stepped over.
    uint64_t riffDataAt = 0;
    uint32_t riffSize = 0;
    bool found = false;
    for (uint64_t at = 0; at + 12 <= fileLength; at = nextChunk(at + 8, riffSize)) {
        uint8_t header[12];
        if (!readAt(info->file, at, header, sizeof header)) return WIO_CANNOT_READ;
        riffSize = littleU32(header + 4);
        if (isTag(header, "RIFF") && isTag(header + 8, "WAVE")) {
            riffDataAt = at + 8;
            found = true;
            break;
        }
    }
    if (!found) return WIO_CANNOT_READ;
    uint64_t riffEnd = riffDataAt + riffSize;

    // Subchunks follow the form type. The walk goes on to the end of the file, as a chunk
    // beyond a too small RIFF size may still be wanted (the user is asked about it); each
    // step moves at least 8 bytes forward, so any input ends the walk.
    for (uint64_t at = riffDataAt + 4; at + 8 <= fileLength;) {
        uint8_t header[8];
        if (!readAt(info->file, at, header, sizeof header)) return WIO_CANNOT_READ;
        uint32_t id = littleU32(header);
        uint32_t size = littleU32(header + 4);
        uint64_t dataAt = at + 8;
        if (dataAt + size > riffEnd && !askToLoadOverlongChunk(id, uint32_t(dataAt), size, riffSize))
            return WIO_DECLINED;
        if (isTag(header, "fmt ")) {
            if (!info->format) {
                uint32_t code = readFormatChunk(info, dataAt, size, fileLength);
                if (code != WIO_OPENED) return code;
            }
        } else if (isTag(header, "data")) {
            if (info->dataBytes == 0) {
                // A truncated file holds less than its data chunk claims: take what is there.
                info->dataBytes = uint32_t(std::min<uint64_t>(size, fileLength - dataAt));
                info->dataOffset = uint32_t(dataAt);
                info->dataSizeOffset = uint32_t(dataAt - 4);
            }
        } else if (isTag(header, "fact")) {
            // A fact chunk too short for its count, or cut off by the end of the file, has none.
            if (info->dataSamples == WAVE_UNKNOWN && size >= 4 && dataAt + 4 <= fileLength) {
                uint8_t value[4];
                if (!readAt(info->file, dataAt, value, sizeof value)) return WIO_CANNOT_READ;
                info->factValueOffset = uint32_t(dataAt);
                info->dataSamples = littleU32(value);
            }
        }
        at = nextChunk(dataAt, size);
    }

    if (!info->format) return WIO_NO_FORMAT;
    uint32_t blockAlign = info->format->blockAlign;
    // No more frames than the data holds, whatever the fact chunk says, so that a reader
    // going by the sample count never reads beyond the data; a record without a frame size
    // has no whole frame.
    uint32_t framesHeld = blockAlign ? info->dataBytes / blockAlign : 0;
    if (info->dataSamples != WAVE_UNKNOWN) {
        info->dataSamples = std::min(info->dataSamples, framesHeld);
    } else {
        if (info->format->formatTag != WAVE_FORMAT_PCM) return WIO_NOT_PCM;
        info->dataSamples = framesHeld;
    }
    closeOnFailure.opened = true;
    return WIO_OPENED;
}

uint32_t wioFileClose(WaveReadInfo* info) {
    if (!info) return WIO_NO_RECORD;
    if (info->file) fileClose(info->file);
    info->file = nullptr;
    delete info->format;
    info->format = nullptr;
    return 0;
}

uint32_t checkWaveFileFormat(const WaveReadInfo& info) {
    const WaveFormatRecord* format = info.format;
    if (!format) return WIO_NO_FORMAT;
    if (format->formatTag != WAVE_FORMAT_PCM) return WIO_NOT_PCM;
    if (format->bitsPerSample != 8 && format->bitsPerSample != 16) return WIO_NOT_PCM;
    if (format->channels == 0 || format->samplesPerSec == 0) return WIO_NOT_PCM;
    if (format->blockAlign != uint32_t(format->channels) * format->bitsPerSample / 8) return WIO_NOT_PCM;
    if (format->channels > MAX_WAVE_CHANNELS) return WAVE_TOO_MANY_CHANNELS;
    return WIO_OPENED;
}

uint32_t openCheckedWaveFile(WaveReadInfo* info, const std::string& path) {
    uint32_t code = wioFileOpen(info, path, 0);
    if (code == WIO_OPENED) code = checkWaveFileFormat(*info);
    if (code == WIO_OPENED) return code;
    if (info->file) wioFileClose(info);
    // A declined file was the user's own choice; anything else gets the opening message.
    if (code != WIO_DECLINED) showMessage(MESSAGE_ERROR, waveOpenMessage(code));
    return code;
}

std::string waveOpenMessage(uint32_t code) {
    switch (code) {
    case WIO_OPENED:
        return "";
    case WIO_NOT_PCM:
        return "Sorry - this wave file contains audio in a unsupported format.\n\nPlease note that 32-bit audio is "
               "not supported by this product.";
    case WAVE_TOO_MANY_CHANNELS:
        return "This waveform contains too many channels and cannot be loaded.";
    default:
        return "This file cannot be opened. Please check it is not open in another application.";
    }
}

uint32_t downmixFrames(FILE* file, const WaveFormatRecord& format, void* destination, uint32_t outputBytes) {
    uint8_t* out = static_cast<uint8_t*>(destination);
    unsigned channels = format.channels;
    unsigned bits = format.bitsPerSample;
    uint8_t silence = bits == 8 ? 0x80 : 0;
    if (channels < 2) {
        size_t got = file ? fileRead(out, outputBytes, file) : 0;
        if (got < outputBytes) std::memset(out + got, silence, outputBytes - got);
        return uint32_t(got);
    }
    if (bits != 8 && bits != 16) return 0;

    size_t sampleBytes = bits / 8;
    size_t frameBytes = channels * sampleBytes;
    uint32_t samples = uint32_t(outputBytes / sampleBytes);
    // Frames are read in pieces of about 64 KiB rather than one call each.
    size_t pieceFrames = std::max<size_t>(1, 65536 / frameBytes);
    std::unique_ptr<uint8_t[]> piece(new (std::nothrow) uint8_t[pieceFrames * frameBytes]);
    uint32_t done = 0;
    while (piece && file && done < samples) {
        size_t wanted = std::min<size_t>(pieceFrames, samples - done);
        size_t frames = fileRead(piece.get(), wanted * frameBytes, file) / frameBytes;
        for (size_t f = 0; f < frames; f++) {
            const uint8_t* frame = piece.get() + f * frameBytes;
            uint8_t* sample = out + size_t(done + f) * sampleBytes;
            if (bits == 8) {
                uint32_t sum = 0;
                for (unsigned c = 0; c < channels; c++) sum += frame[c];
                sample[0] = uint8_t(sum / channels);
            } else {
                int64_t sum = 0;
                for (unsigned c = 0; c < channels; c++) sum += int16_t(littleU16(frame + 2 * c));
                uint16_t mean = uint16_t(int16_t(sum / int64_t(channels)));
                sample[0] = uint8_t(mean);
                sample[1] = uint8_t(mean >> 8);
            }
        }
        done += uint32_t(frames);
        if (frames < wanted) break;
    }
    uint32_t filled = uint32_t(done * sampleBytes);
    if (filled < outputBytes) std::memset(out + filled, silence, outputBytes - filled);
    return filled;
}

uint32_t readWaveFrameSource(void* context, uint8_t* destination, uint32_t count) {
    WaveFrameSource& s = *static_cast<WaveFrameSource*>(context);
    uint32_t bytesPerSample = s.info->format->bitsPerSample / 8u;
    uint32_t wanted = std::min(count, s.samplesLeft);
    if (wanted == 0) return 0;
    uint32_t got = downmixFrames(s.info->file, *s.info->format, destination, wanted * bytesPerSample) / bytesPerSample;
    s.samplesLeft = got < wanted ? 0 : s.samplesLeft - got;
    return got;
}
