// The playback devices' readers: a wave file's format and data, a MIDI file's length. Every
// count read from a file is checked against the bytes that are really there.
#include "platform/mediaFiles.h"

#include <algorithm>
#include <cstdio>
#include <vector>

static uint32_t le32(const uint8_t* p) { return uint32_t(p[0]) | uint32_t(p[1]) << 8 | uint32_t(p[2]) << 16 | uint32_t(p[3]) << 24; }
static uint16_t le16(const uint8_t* p) { return uint16_t(p[0] | p[1] << 8); }
static uint32_t be32(const uint8_t* p) { return uint32_t(p[0]) << 24 | uint32_t(p[1]) << 16 | uint32_t(p[2]) << 8 | uint32_t(p[3]); }
static uint16_t be16(const uint8_t* p) { return uint16_t(p[0] << 8 | p[1]); }

static bool tagIs(const uint8_t* p, const char* tag) {
    return p[0] == uint8_t(tag[0]) && p[1] == uint8_t(tag[1]) && p[2] == uint8_t(tag[2]) && p[3] == uint8_t(tag[3]);
}

static std::vector<uint8_t> readHead(const std::string& path, size_t limit, uint64_t* fileSize) {
    std::vector<uint8_t> bytes;
    FILE* file = std::fopen(path.c_str(), "rb");
    if (!file) return bytes;
    if (std::fseek(file, 0, SEEK_END) == 0) {
        long size = std::ftell(file);
        *fileSize = size < 0 ? 0 : uint64_t(size);
        std::rewind(file);
        bytes.resize(std::min<uint64_t>(*fileSize, limit));
        bytes.resize(std::fread(bytes.data(), 1, bytes.size(), file));
    }
    std::fclose(file);
    return bytes;
}

int parseMediaWaveInfo(const uint8_t* head, size_t headSize, uint64_t fileSize, MediaWaveInfo* info) {
    if (headSize < 12 || !tagIs(head, "RIFF") || !tagIs(head + 8, "WAVE")) return 0;
    bool haveFormat = false;
    uint16_t blockAlign = 0;
    size_t at = 12;
    while (at + 8 <= headSize) {
        const uint8_t* chunk = head + at;
        uint64_t size = le32(chunk + 4);
        uint64_t body = at + 8;
        if (tagIs(chunk, "fmt ") && !haveFormat) {
            if (size < 16 || body + 16 > headSize) return 0;
            const uint8_t* f = head + body;
            uint16_t tag = le16(f);
            info->channels = le16(f + 2);
            info->rate = le32(f + 4);
            blockAlign = le16(f + 12);
            info->bits = le16(f + 14);
            if (tag != 1 || (info->bits != 8 && info->bits != 16) || info->channels < 1 || info->channels > 16 ||
                info->rate == 0 || blockAlign != info->channels * info->bits / 8)
                return 0;
            haveFormat = true;
        } else if (tagIs(chunk, "data")) {
            if (!haveFormat || body > fileSize) return 0;
            uint64_t held = std::min<uint64_t>(size, fileSize - body);
            info->dataOffset = uint32_t(body);
            info->dataBytes = uint32_t(held - held % blockAlign);
            return 1;
        }
        at = size_t(body + size + (size & 1));
        if (body + size + (size & 1) > headSize) break;
    }
    return 0;
}

int readMediaWaveInfo(const std::string& path, MediaWaveInfo* info) {
    uint64_t fileSize = 0;
    std::vector<uint8_t> head = readHead(path, MEDIA_WAVE_HEAD_BYTES, &fileSize);
    return parseMediaWaveInfo(head.data(), head.size(), fileSize, info);
}

uint32_t mediaWaveMilliseconds(const MediaWaveInfo& info) {
    uint64_t frameBytes = uint64_t(info.channels) * info.bits / 8;
    if (frameBytes == 0 || info.rate == 0) return 0;
    return uint32_t(uint64_t(info.dataBytes) / frameBytes * 1000 / info.rate);
}

// A variable-length quantity of at most four bytes; false when it runs past end.
static bool readVariable(const uint8_t*& p, const uint8_t* end, uint32_t* value) {
    *value = 0;
    for (int i = 0; i < 4; i++) {
        if (p >= end) return false;
        uint8_t b = *p++;
        *value = *value << 7 | (b & 0x7F);
        if (!(b & 0x80)) return true;
    }
    return false;
}

struct TempoChange {
    uint64_t tick;
    uint32_t microsecondsPerQuarter;
};

// Walks one track's events; the tick of its last event in *lastTick and its tempo changes
// appended. False when an event runs past the track's end.
static bool walkTrack(const uint8_t* p, const uint8_t* end, uint64_t* lastTick, std::vector<TempoChange>* tempos) {
    uint64_t tick = 0;
    uint8_t status = 0;
    while (p < end) {
        uint32_t delta;
        if (!readVariable(p, end, &delta)) return false;
        tick += delta;
        if (p >= end) return false;
        if (*p & 0x80) status = *p++;
        else if (status == 0 || status >= 0xF0) return false;   // running status needs a channel event before it
        if (status == 0xFF) {
            if (p >= end) return false;
            uint8_t type = *p++;
            uint32_t length;
            if (!readVariable(p, end, &length) || length > uint64_t(end - p)) return false;
            if (type == 0x51 && length == 3)
                tempos->push_back({tick, uint32_t(p[0]) << 16 | uint32_t(p[1]) << 8 | p[2]});
            p += length;
            *lastTick = tick;
            if (type == 0x2F) return true;
            status = 0;
        } else if (status == 0xF0 || status == 0xF7) {
            uint32_t length;
            if (!readVariable(p, end, &length) || length > uint64_t(end - p)) return false;
            p += length;
            status = 0;
        } else {
            int dataBytes = (status & 0xF0) == 0xC0 || (status & 0xF0) == 0xD0 ? 1 : 2;
            if (end - p < dataBytes) return false;
            p += dataBytes;
        }
        *lastTick = tick;
    }
    return true;
}

int parseMidiFileDuration(const uint8_t* data, size_t size, uint32_t* milliseconds) {
    if (size < 14 || !tagIs(data, "MThd") || be32(data + 4) < 6) return 0;
    uint64_t headerEnd = 8 + uint64_t(be32(data + 4));
    if (headerEnd > size) return 0;
    uint16_t tracks = be16(data + 10);
    uint16_t division = be16(data + 12);
    if (division == 0) return 0;
    const uint8_t* p = data + headerEnd;
    const uint8_t* end = data + size;
    uint64_t lastTick = 0;
    std::vector<TempoChange> tempos;
    for (int t = 0; t < tracks; t++) {
        if (end - p < 8 || !tagIs(p, "MTrk")) return 0;
        uint32_t length = be32(p + 4);
        p += 8;
        if (length > uint64_t(end - p)) return 0;
        uint64_t trackLast = 0;
        if (!walkTrack(p, p + length, &trackLast, &tempos)) return 0;
        lastTick = std::max(lastTick, trackLast);
        p += length;
    }
    double seconds;
    if (division & 0x8000) {
        // SMPTE: frames per second in the high byte (negative), ticks per frame in the low one.
        int framesPerSecond = -int(int8_t(division >> 8));
        int ticksPerFrame = division & 0xFF;
        if (framesPerSecond <= 0 || ticksPerFrame == 0) return 0;
        seconds = double(lastTick) / (double(framesPerSecond) * ticksPerFrame);
    } else {
        std::stable_sort(tempos.begin(), tempos.end(), [](const TempoChange& a, const TempoChange& b) { return a.tick < b.tick; });
        seconds = 0;
        uint64_t tick = 0;
        double tempo = 500000;   // 120 beats per minute until the file says otherwise
        for (const TempoChange& change : tempos) {
            if (change.tick >= lastTick) break;
            seconds += double(change.tick - tick) * tempo / 1e6 / division;
            tick = change.tick;
            tempo = change.microsecondsPerQuarter;
        }
        seconds += double(lastTick - tick) * tempo / 1e6 / division;
    }
    if (!(seconds < 4e6)) return 0;   // beyond 46 days it is no song
    *milliseconds = uint32_t(seconds * 1000);
    return 1;
}

int readMidiFileDuration(const std::string& path, uint32_t* milliseconds) {
    uint64_t fileSize = 0;
    std::vector<uint8_t> bytes = readHead(path, 64u << 20, &fileSize);
    if (bytes.size() != fileSize) return 0;
    return parseMidiFileDuration(bytes.data(), bytes.size(), milliseconds);
}
