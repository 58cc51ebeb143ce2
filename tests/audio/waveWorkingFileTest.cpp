// CS.fw and the files written from it: the exact bytes of a new working file and of a
// written segment, masking round trips, header patches and the end of a recording, the
// song's format, and the failures the user is told about.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <mutex>

#include "audio/audioActivity.h"
#include "audio/waveFixtures.h"
#include "audio/waveWorkingFile.h"
#include "platform/files.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/song.h"
#include "support/testSupport.h"

namespace {

std::string workingPath() { return sharedFilePath("CS.fw"); }

bool workingFileMutexFree() {
    if (!CSAccessWaveFileMutex.try_lock()) return false;
    CSAccessWaveFileMutex.unlock();
    return true;
}

// The header of CS.fw as it must lie on disk, for a one-channel song of rate and bits; without
// the fact chunk, that of a written segment.
std::vector<uint8_t> waveHeader(uint32_t rate, uint16_t bits, uint32_t frames, uint32_t dataBytes, bool fact = true) {
    std::vector<uint8_t> b;
    putTag(b, "RIFF");
    putU32(b, (fact ? 48 : 36) + dataBytes);
    putTag(b, "WAVE");
    putTag(b, "fmt ");
    putU32(b, 16);
    putU16(b, 1);
    putU16(b, 1);
    putU32(b, rate);
    putU32(b, rate * (bits / 8));
    putU16(b, bits / 8);
    putU16(b, bits);
    if (fact) {
        putTag(b, "fact");
        putU32(b, 4);
        putU32(b, frames);
    }
    putTag(b, "data");
    putU32(b, dataBytes);
    return b;
}

class WaveWorkingFile : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        resetSong();
        audioActivity = AudioActivity{};
    }
    void TearDown() override {
        resetSong();
        audioActivity = AudioActivity{};
        SharedFolderTest::TearDown();
    }
    // A song of blocks x blockSeconds whose source had channels; no audio stored yet.
    void setSong(uint32_t rate, uint16_t bits, uint32_t blocks, double blockSeconds, uint16_t channels = 1) {
        uint16_t align = uint16_t(channels * bits / 8);
        song.waveFormat = SongWaveFormat{1, channels, rate, rate * align, align, bits};
        song.sampleBlockDuration = blockSeconds;
        song.sampleBlockDurations.assign(blocks, blockSeconds);
        song.blockCount = blocks;
    }
    // Creates CS.fw, appends samples, patches the header and masks it, as an opening would.
    void storeSamples(const std::vector<uint8_t>& samples) {
        ASSERT_EQ(createWaveWorkingFile(), 0);
        WaveReadInfo layout{};
        ASSERT_EQ(wioFileOpen(&layout, workingPath(), 0), WIO_OPENED);
        wioFileClose(&layout);
        FILE* file = fileOpen(workingPath(), "r+b");
        ASSERT_NE(file, nullptr);
        ASSERT_EQ(fileSeek(file, layout.dataOffset, SEEK_SET), 0);
        ASSERT_EQ(fileWrite(samples.data(), samples.size(), file), samples.size());
        ASSERT_EQ(patchWaveHeader(file, layout, uint32_t(samples.size()), song.waveFormat.bitsPerSample), 1);
        ASSERT_EQ(fileClose(file), 0);
        ASSERT_EQ(maskWaveWorkingFile(), 1);
        clearUiCalls();
    }
};

TEST_F(WaveWorkingFile, NewFileHasTheExact56ByteHeaderForOneChannel) {
    setSong(22050, 16, 0, 0.0, 2);
    song.workingWaveBytes = 1234;
    ASSERT_EQ(createWaveWorkingFile(), 0);
    EXPECT_EQ(readFileBytes(workingPath()), waveHeader(22050, 16, 0, 0));
    EXPECT_EQ(song.workingWaveBytes, 0u);
    EXPECT_TRUE(workingFileMutexFree());

    setSong(8000, 8, 0, 0.0, 3);
    ASSERT_EQ(createWaveWorkingFile(), 0);
    std::vector<uint8_t> expected = waveHeader(8000, 8, 0, 0);
    EXPECT_EQ(readFileBytes(workingPath()), expected);
    EXPECT_EQ(getU32(expected, 28), 8000u);   // byte rate of one 8-bit channel
}

TEST_F(WaveWorkingFile, FileThatCannotBeCreatedShowsCannotAndThePath) {
    setSong(8000, 8, 0, 0.0);
    failFileCall(FILE_OP_OPEN, 1);
    EXPECT_EQ(createWaveWorkingFile(), 1);
    EXPECT_EQ(lastMessageText(), "Cannot " + workingPath());
    EXPECT_EQ(uiCalls().back().kind, MESSAGE_ERROR);
    EXPECT_TRUE(workingFileMutexFree());

    failFileCall(FILE_OP_WRITE, 1);
    EXPECT_EQ(createWaveWorkingFile(), 1);
    EXPECT_EQ(lastMessageText(), "Bytes were not stored properly");
    EXPECT_TRUE(workingFileMutexFree());
}

TEST_F(WaveWorkingFile, AnEmptySongAdoptsTheIncomingFormatAndOneWithBlocksRefusesAnotherRateOrSampleSize) {
    EXPECT_EQ(acceptWaveFormat(WaveFormatRecord{1, 2, 32000, 128000, 4, 16, 0}), 1);
    SongWaveFormat adopted{1, 2, 32000, 128000, 4, 16};
    EXPECT_EQ(std::memcmp(&song.waveFormat, &adopted, sizeof adopted), 0);
    setSong(22050, 16, 10, 0.01);
    EXPECT_EQ(acceptWaveFormat(WaveFormatRecord{1, 1, 44100, 88200, 2, 16, 0}), 0);
    EXPECT_EQ(acceptWaveFormat(WaveFormatRecord{1, 1, 22050, 22050, 1, 8, 0}), 0);
    EXPECT_EQ(song.waveFormat.samplesPerSec, 22050u);
    EXPECT_EQ(song.waveFormat.bitsPerSample, 16);
    // The channel count may differ: every source becomes one channel.
    EXPECT_EQ(acceptWaveFormat(WaveFormatRecord{1, 4, 22050, 176400, 8, 16, 0}), 1);
    EXPECT_EQ(song.waveFormat.channels, 4);
}

class WaveMask : public WaveWorkingFile {
protected:
    std::vector<uint8_t> plainFile(size_t length) {
        std::vector<uint8_t> bytes = waveHeader(8000, 8, 0, 0);
        bytes.resize(length);
        for (size_t i = 56; i < length; i++) bytes[i] = uint8_t(i * 7);
        return bytes;
    }
    std::string path = folder.file("masked.fw");
};

// Masking xors the header (or as much of it as a short file has) with the mask text;
// unmasking restores it; masking twice or unmasking a plain file changes nothing.
TEST_F(WaveMask, MaskingXorsTheHeaderWithTheMaskTextOnceAndUnmaskingRestoresIt) {
    for (size_t length : {size_t(300), size_t(20)}) {
        std::vector<uint8_t> plain = plainFile(length);
        writeFileBytes(path, plain);
        EXPECT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
        EXPECT_EQ(readFileBytes(path), plain);
        for (int twice = 0; twice < 2; twice++) ASSERT_EQ(applyWaveMask(path, WAVE_MASKED), 1);
        std::vector<uint8_t> masked = readFileBytes(path);
        ASSERT_EQ(masked.size(), plain.size());
        for (size_t i = 0; i < std::min<size_t>(56, length); i++)
            EXPECT_EQ(masked[i], plain[i] ^ uint8_t(waveMaskText[i])) << i;
        EXPECT_TRUE(std::equal(plain.begin() + std::min<size_t>(56, length), plain.end(), masked.begin() + std::min<size_t>(56, length)));
        EXPECT_NE(std::string(masked.begin(), masked.begin() + 4), "RIFF");
        for (int twice = 0; twice < 2; twice++) ASSERT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
        EXPECT_EQ(readFileBytes(path), plain);
    }
}

TEST_F(WaveMask, FilesWithoutAStateToTestOrThatCannotBeRewrittenAreLeftAlone) {
    EXPECT_EQ(applyWaveMask(folder.file("absent.fw"), WAVE_PLAIN), 0);
    EXPECT_FALSE(fileExists(folder.file("absent.fw")));
    // Three bytes cannot say whether they begin with "RIFF": toggling them would lose them.
    writeFileBytes(path, {'R', 'I', 'F'});
    EXPECT_EQ(applyWaveMask(path, WAVE_MASKED), 1);
    EXPECT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
    EXPECT_EQ(readFileBytes(path), (std::vector<uint8_t>{'R', 'I', 'F'}));
    std::vector<uint8_t> plain = plainFile(100);
    writeFileBytes(path, plain);
    failFileCall(FILE_OP_OPEN, 2);   // the reopening for update
    EXPECT_EQ(applyWaveMask(path, WAVE_MASKED), 0);
    EXPECT_EQ(readFileBytes(path), plain);
}

class WaveHeaderPatch : public WaveWorkingFile {};

TEST_F(WaveHeaderPatch, AppendedDataSetTheDataSizeFactAndRiffSize) {
    setSong(8000, 16, 0, 0.0);
    std::vector<uint8_t> samples(1000, 0x21);
    storeSamples(samples);
    ASSERT_EQ(unmaskWaveWorkingFile(), 1);
    std::vector<uint8_t> bytes = readFileBytes(workingPath());
    ASSERT_EQ(bytes.size(), 1056u);
    EXPECT_EQ(std::vector<uint8_t>(bytes.begin(), bytes.begin() + 56), waveHeader(8000, 16, 500, 1000));

    WaveReadInfo info{};
    ASSERT_EQ(wioFileOpen(&info, workingPath(), 0), WIO_OPENED);
    EXPECT_EQ(info.dataBytes, 1000u);
    EXPECT_EQ(info.dataSamples, 500u);
    wioFileClose(&info);
}

// Finalising gives the file the song's length, its frames rounded to the nearest: cut when it
// holds more, padded with silence when it holds less.
TEST_F(WaveHeaderPatch, FinalisingGivesTheFileTheSongsLength) {
    struct Case {
        uint16_t bits;
        uint32_t blocks;
        double blockSeconds;
        size_t stored;
        uint32_t frames;
        uint8_t fill, silence;
    } cases[] = {
        {16, 10, 0.01, 2000, 800, 0x33, 0},       // 10 blocks of 10 ms at 8000 Hz, the file holds 2000 bytes
        {8, 1, 0.100075, 900, 801, 0x44, 0},      // 800.6 frames: 801, where truncation would give 800
        {8, 10, 0.01, 600, 800, 0x10, 0x80},      // 800 frames, 600 stored
    };
    for (const Case& c : cases) {
        setSong(8000, c.bits, c.blocks, c.blockSeconds);
        storeSamples(std::vector<uint8_t>(c.stored, c.fill));
        ASSERT_EQ(unmaskWaveWorkingFile(), 1);
        EXPECT_EQ(finaliseWaveWorkingFile(), WAVE_FINALISED);
        std::vector<uint8_t> bytes = readFileBytes(workingPath());
        uint32_t dataBytes = c.frames * c.bits / 8;
        ASSERT_EQ(bytes.size(), 56u + dataBytes);
        EXPECT_EQ(std::vector<uint8_t>(bytes.begin(), bytes.begin() + 56), waveHeader(8000, c.bits, c.frames, dataBytes));
        size_t kept = std::min<size_t>(c.stored, dataBytes);
        EXPECT_EQ(std::vector<uint8_t>(bytes.begin() + 56, bytes.begin() + 56 + long(kept)), std::vector<uint8_t>(kept, c.fill));
        EXPECT_EQ(std::vector<uint8_t>(bytes.begin() + 56 + long(kept), bytes.end()), std::vector<uint8_t>(dataBytes - kept, c.silence));
    }
    fileDelete(workingPath());
    EXPECT_EQ(finaliseWaveWorkingFile(), WAVE_NOT_OPENED);
    EXPECT_EQ(messageCount(), 0) << "without a working file nothing is shown";
}

class WaveSegment : public WaveWorkingFile {
protected:
    // A 16-bit song of 0.5 s at 8000 Hz whose frame n holds the value n.
    void makeRampSong() {
        setSong(8000, 16, 50, 0.01, 2);
        for (int n = 0; n < 4000; n++) putU16(ramp, uint16_t(n));
        storeSamples(ramp);
    }
    static std::vector<uint8_t> segmentHeader(uint32_t rate, uint16_t bits, uint32_t dataBytes) {
        return waveHeader(rate, bits, 0, dataBytes, false);
    }
    void expectWorkingFileAtRest() {
        EXPECT_EQ(readFileBytes(workingPath()), maskedBefore);
        EXPECT_TRUE(workingFileMutexFree());
    }
    void SetUp() override {
        WaveWorkingFile::SetUp();
        makeRampSong();
        maskedBefore = readFileBytes(workingPath());
    }
    std::vector<uint8_t> ramp;
    std::vector<uint8_t> maskedBefore;
    std::string out = folder.file("segment.wav");
};

// Both bounds -1 write the whole song; a range starts and ends at truncated frames (0.0101 s is
// frame 80.8 -> 80, 0.05 s frame 400); a start beyond the end or an end before the start
// writes a header with no data.
TEST_F(WaveSegment, TheRangeWrittenRunsFromItsTruncatedStartFrameToItsEnd) {
    struct Case {
        double start, end;
        uint32_t first, last;   // frames written
    } cases[] = {{-1.0, -1.0, 0, 4000}, {0.0101, 0.05, 80, 400}, {5.0, -1.0, 0, 0}, {0.3, 0.1, 0, 0}};
    for (const Case& c : cases) {
        ASSERT_EQ(writeWaveSegment(out, c.start, c.end), 1);
        std::vector<uint8_t> expected = segmentHeader(8000, 16, 2 * (c.last - c.first));
        expected.insert(expected.end(), ramp.begin() + 2 * c.first, ramp.begin() + 2 * c.last);
        EXPECT_EQ(readFileBytes(out), expected) << c.start << " " << c.end;
        expectWorkingFileAtRest();
    }
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(WaveSegment, SongLongerThanItsStoredAudioEndsInSilence) {
    fileDelete(workingPath());
    setSong(8000, 8, 10, 0.01);   // 800 frames, 500 stored
    std::vector<uint8_t> stored(500, 0x20);
    storeSamples(stored);
    ASSERT_EQ(writeWaveSegment(out, 0.05, -1.0), 1);
    std::vector<uint8_t> expected = segmentHeader(8000, 8, 400);
    expected.insert(expected.end(), 100, 0x20);
    expected.insert(expected.end(), 300, 0x80);
    EXPECT_EQ(readFileBytes(out), expected);
}

// An output that cannot be created, a failed copy, a running recording or opening: nothing
// (or nothing whole) is written and CS.fw is at rest again.
TEST_F(WaveSegment, AFailedOrRefusedWriteLeavesTheWorkingFileAtRest) {
    std::string nowhere = folder.file("no such folder/out.wav");
    struct Case {
        std::string path;
        int failingWrite;   // unmasking, header, the samples
        AudioActivity activity;
        std::string text;
    } cases[] = {
        {nowhere, 0, {}, "Cannot " + nowhere},
        {out, 0, {false, true, 0.0}, ""},
        {out, 0, {true, false, 0.0}, ""},
        {out, 3, {}, "Bytes were not stored properly"},
    };
    for (const Case& c : cases) {
        clearUiCalls();
        failFileCall(FILE_OP_WRITE, c.failingWrite);
        audioActivity = c.activity;
        EXPECT_EQ(writeWaveSegment(c.path, -1.0, -1.0), 0);
        EXPECT_EQ(messageCount(), c.text.empty() ? 0 : 1);
        if (!c.text.empty()) {
            EXPECT_EQ(lastMessageText(), c.text);
        }
        expectWorkingFileAtRest();
        if (c.failingWrite == 0) {
            EXPECT_FALSE(fileExists(c.path));
        }
    }
    audioActivity = AudioActivity{};
    fileDelete(workingPath());
    EXPECT_EQ(writeWaveSegment(out, -1.0, -1.0), 0) << "without a working file";
    EXPECT_TRUE(workingFileMutexFree());
}

}  // namespace
