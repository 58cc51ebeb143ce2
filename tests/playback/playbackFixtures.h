#pragma once
// A song with audio for the playback suites: its 16-bit mono samples stored in CS.fw (masked,
// as at rest) and its time axis of equal blocks, so that a played range can be compared with
// the samples it came from.

#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "audio/waveWorkingFile.h"
#include "platform/files.h"
#include "shell/paths.h"
#include "store/song.h"
#include "support/testSupport.h"

// Makes the song samples.size() / framesPerBlock blocks long at rate Hz with those samples in CS.fw.
inline void storeSongAudio(uint32_t rate, uint32_t framesPerBlock, const std::vector<int16_t>& samples) {
    song.waveFormat = SongWaveFormat{1, 1, rate, rate * 2, 2, 16};
    song.sampleBlockDuration = double(framesPerBlock) / rate;
    song.blockCount = uint32_t(samples.size() / framesPerBlock);
    song.sampleBlockDurations.assign(song.blockCount, song.sampleBlockDuration);
    std::vector<uint8_t> bytes;
    for (int16_t s : samples) putU16(bytes, uint16_t(s));
    ASSERT_EQ(createWaveWorkingFile(), 0);
    WaveReadInfo layout{};
    ASSERT_EQ(wioFileOpen(&layout, sharedFilePath("CS.fw"), 0), WIO_OPENED);
    wioFileClose(&layout);
    FILE* file = fileOpen(sharedFilePath("CS.fw"), "r+b");
    ASSERT_NE(file, nullptr);
    ASSERT_EQ(fileSeek(file, layout.dataOffset, SEEK_SET), 0);
    ASSERT_EQ(fileWrite(bytes.data(), bytes.size(), file), bytes.size());
    ASSERT_EQ(patchWaveHeader(file, layout, uint32_t(bytes.size()), 16), 1);
    ASSERT_EQ(fileClose(file), 0);
    ASSERT_EQ(maskWaveWorkingFile(), 1);
    song.workingWaveBytes = uint32_t(bytes.size());
}

// The samples of a 16-bit mono wave file written by writeWaveSegment.
inline std::vector<int16_t> segmentSamples(const std::string& path) {
    std::vector<uint8_t> bytes = readFileBytes(path);
    std::vector<int16_t> samples;
    for (size_t i = WAVE_SEGMENT_HEADER_BYTES; i + 1 < bytes.size(); i += 2) samples.push_back(int16_t(getU16(bytes, i)));
    return samples;
}
