// The playback devices' readers: a wave file's format and data chunk (and what is refused),
// and the length of a MIDI file with tempo changes, running status and SMPTE time.
#include <gtest/gtest.h>

#include <vector>

#include "../audio/waveFixtures.h"
#include "platform/mediaFiles.h"

namespace {

using Bytes = std::vector<uint8_t>;

int parseWave(const Bytes& file, MediaWaveInfo* info, uint64_t fileSize = 0) {
    return parseMediaWaveInfo(file.data(), file.size(), fileSize ? fileSize : file.size(), info);
}

// A MIDI file: the header with division, then each track's events as given (without the
// end of track, which is appended).
Bytes midiFile(uint16_t division, const std::vector<Bytes>& tracks) {
    Bytes b = {'M', 'T', 'h', 'd', 0, 0, 0, 6, 0, 1, 0, uint8_t(tracks.size()), uint8_t(division >> 8), uint8_t(division)};
    for (Bytes events : tracks) {
        events.insert(events.end(), {0x00, 0xFF, 0x2F, 0x00});
        b.insert(b.end(), {'M', 'T', 'r', 'k', 0, 0, uint8_t(events.size() >> 8), uint8_t(events.size())});
        b.insert(b.end(), events.begin(), events.end());
    }
    return b;
}

uint32_t midiMilliseconds(const Bytes& file) {
    uint32_t ms = 0xFFFFFFFF;
    return parseMidiFileDuration(file.data(), file.size(), &ms) ? ms : 0xFFFFFFFF;
}

}  // namespace

TEST(MediaWaveInfo, APcmFileGivesItsFormatAndWholeFramesOfData) {
    MediaWaveInfo info{};
    ASSERT_EQ(parseWave(pcmWave(2, 22050, 16, Bytes(4002, 1)), &info), 1);
    EXPECT_EQ(info.channels, 2);
    EXPECT_EQ(info.rate, 22050u);
    EXPECT_EQ(info.bits, 16);
    EXPECT_EQ(info.dataOffset, 44u);
    EXPECT_EQ(info.dataBytes, 4000u);   // 1000 frames; the odd bytes are no frame
    EXPECT_EQ(mediaWaveMilliseconds(info), 45u);

    // A chunk before "fmt " is passed over (with its pad byte); a data chunk claiming more than
    // the file holds plays what is there.
    Bytes file = riffWave({{"LIST", Bytes(5, 'x')}, {"fmt ", formatBody(1, 1, 8000, 8)}, {"data", Bytes(100, 0x80), 1000}});
    ASSERT_EQ(parseWave(file, &info), 1);
    EXPECT_EQ(info.dataOffset, 12u + 14 + 24 + 8);
    EXPECT_EQ(info.dataBytes, 100u);
}

TEST(MediaWaveInfo, WhatTheDeviceCannotPlayIsRefused) {
    MediaWaveInfo info{};
    const Bytes refused[] = {
        Bytes{'R', 'I', 'F', 'F'},
        riffWave({{"data", Bytes(8, 0)}, {"fmt ", formatBody(1, 1, 8000, 16)}}),   // data before its format
        riffWave({{"fmt ", formatBody(3, 1, 8000, 32)}, {"data", Bytes(8, 0)}}),   // float
        riffWave({{"fmt ", formatBody(1, 1, 8000, 24)}, {"data", Bytes(9, 0)}}),   // 24-bit
        riffWave({{"fmt ", formatBody(1, 0, 8000, 16)}, {"data", Bytes(8, 0)}}),   // no channels
        riffWave({{"fmt ", formatBody(1, 1, 0, 16)}, {"data", Bytes(8, 0)}}),      // rate 0
        riffWave({{"fmt ", formatBody(1, 2, 8000, 16, 3)}, {"data", Bytes(8, 0)}}),   // block align lies
        riffWave({{"fmt ", Bytes(12, 1)}, {"data", Bytes(8, 0)}}),                 // short format
        riffWave({{"fmt ", formatBody(1, 1, 8000, 16)}}),                          // no data
    };
    for (const Bytes& file : refused) EXPECT_EQ(parseWave(file, &info), 0);
}

TEST(MidiFileDuration, TheLastEventsTimeFollowsTheTempoMap) {
    // 120 beats per minute by default: 480 ticks at 480 per quarter are half a second.
    EXPECT_EQ(midiMilliseconds(midiFile(480, {{0x83, 0x60, 0x90, 60, 100}})), 500u);
    // A tempo change to 60 beats per minute after one quarter: 500 ms + 1000 ms.
    Bytes tempo = {0x00, 0xFF, 0x51, 0x03, 0x0F, 0x42, 0x40, 0x83, 0x60, 0xFF, 0x51, 0x03, 0x0F, 0x42, 0x40};
    Bytes notes = {0x00, 0x90, 60, 100, 0x87, 0x40, 60, 0};   // running status: the note-off is 960 ticks later
    EXPECT_EQ(midiMilliseconds(midiFile(480, {{0x00, 0xFF, 0x51, 0x03, 0x07, 0xA1, 0x20, 0x83, 0x60, 0xFF, 0x51, 0x03,
                                               0x0F, 0x42, 0x40},
                                              notes})),
              1500u);
    EXPECT_EQ(midiMilliseconds(midiFile(480, {tempo, notes})), 2000u);
    // SMPTE: 25 frames per second of 40 ticks; 1000 ticks are a second.
    EXPECT_EQ(midiMilliseconds(midiFile(0xE728, {{0x87, 0x68, 0x90, 60, 100}})), 1000u);
    // Sysex and program changes (one data byte) are walked over.
    EXPECT_EQ(midiMilliseconds(midiFile(256, {{0x00, 0xF0, 0x02, 0x7E, 0xF7, 0x00, 0xC0, 5, 0x82, 0x00, 0x80, 60, 0}})),
              500u);
}

TEST(MidiFileDuration, AFileThatIsNoMidiFileIsRefused) {
    Bytes good = midiFile(480, {{0x83, 0x60, 0x90, 60, 100}});
    const Bytes refused[] = {
        Bytes(good.begin(), good.begin() + 13),                  // header cut short
        Bytes(good.begin(), good.end() - 3),                     // track cut short
        midiFile(0, {{0x00, 0x90, 60, 100}}),                    // division 0
        midiFile(480, {{0x00, 60, 100}}),                        // running status with no status before
        midiFile(480, {{0x00, 0xFF, 0x01, 0x7F, 'a'}}),         // meta text longer than the track
        midiFile(480, {{0x8F, 0xFF, 0xFF, 0xFF, 0x7F, 0x90, 60, 100}}),   // a delta of five bytes
    };
    uint32_t ms = 0;
    for (const Bytes& file : refused) EXPECT_EQ(parseMidiFileDuration(file.data(), file.size(), &ms), 0);
}
