#pragma once
// Crafted RIFF WAVE files for the wave suites: chunk lists whose sizes, padding and RIFF
// size can each be made to lie, and the format bodies that go in them.

#include <cstdint>
#include <string>
#include <vector>

#include "support/testSupport.h"

struct WaveChunk {
    std::string id;               // four characters
    std::vector<uint8_t> body;    // bytes actually written (an odd length gets a pad byte)
    int64_t claimedSize = -1;     // size field to write; -1: the body's length
};

inline std::vector<uint8_t> formatBody(uint16_t tag, uint16_t channels, uint32_t rate, uint16_t bits,
                                       int blockAlign = -1) {
    uint16_t align = blockAlign < 0 ? uint16_t(channels * bits / 8) : uint16_t(blockAlign);
    std::vector<uint8_t> body;
    putU16(body, tag);
    putU16(body, channels);
    putU32(body, rate);
    putU32(body, rate * align);
    putU16(body, align);
    putU16(body, bits);
    return body;
}

inline std::vector<uint8_t> u32Body(uint32_t value) {
    std::vector<uint8_t> body;
    putU32(body, value);
    return body;
}

// "RIFF", its size (the true one unless riffSize is given), "WAVE" and the chunks.
inline std::vector<uint8_t> riffWave(const std::vector<WaveChunk>& chunks, int64_t riffSize = -1) {
    std::vector<uint8_t> inner;
    putTag(inner, "WAVE");
    for (const WaveChunk& chunk : chunks) {
        putTag(inner, chunk.id.c_str());
        putU32(inner, uint32_t(chunk.claimedSize < 0 ? int64_t(chunk.body.size()) : chunk.claimedSize));
        inner.insert(inner.end(), chunk.body.begin(), chunk.body.end());
        if (chunk.body.size() & 1) inner.push_back(0);
    }
    std::vector<uint8_t> file;
    putTag(file, "RIFF");
    putU32(file, uint32_t(riffSize < 0 ? int64_t(inner.size()) : riffSize));
    file.insert(file.end(), inner.begin(), inner.end());
    return file;
}

// A plain PCM file: "fmt " (16 bytes) then "data", header 44 bytes.
inline std::vector<uint8_t> pcmWave(uint16_t channels, uint32_t rate, uint16_t bits, const std::vector<uint8_t>& data) {
    return riffWave({{"fmt ", formatBody(1, channels, rate, bits)}, {"data", data}});
}
