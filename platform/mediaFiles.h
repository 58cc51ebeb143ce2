#pragma once
// What the playback devices need to know of the files they play: the format and data chunk
// of a wave file, and how long a Standard MIDI File lasts. Both readers take any bytes: a
// file that is not what it claims is refused, never read past its end.

#include <cstddef>
#include <cstdint>
#include <string>

struct MediaWaveInfo {
    uint16_t channels;     // interleaved channels, 1 .. 16
    uint32_t rate;         // frames per second
    uint16_t bits;         // 8 (unsigned) or 16 (signed)
    uint32_t dataOffset;   // file offset of the first sample
    uint32_t dataBytes;    // whole frames of sample data the file holds
};

// Only this much of a wave file's head is searched for its "fmt " and "data" chunks.
constexpr size_t MEDIA_WAVE_HEAD_BYTES = 65536;

// 1 when head (the first bytes of a file of fileSize bytes) is a RIFF WAVE file with a PCM
// "fmt " chunk of 8- or 16-bit samples and a "data" chunk within the head; the data size
// is limited to what the file holds and cut to whole frames. 0 otherwise.
int parseMediaWaveInfo(const uint8_t* head, size_t headSize, uint64_t fileSize, MediaWaveInfo* info);
int readMediaWaveInfo(const std::string& path, MediaWaveInfo* info);
// Milliseconds a wave's data lasts.
uint32_t mediaWaveMilliseconds(const MediaWaveInfo& info);

// 1 with *milliseconds the time of the last event of a Standard MIDI File (any format,
// metrical or SMPTE division, tempo changes followed); 0 for a file that is not one.
int parseMidiFileDuration(const uint8_t* data, size_t size, uint32_t* milliseconds);
int readMidiFileDuration(const std::string& path, uint32_t* milliseconds);
