// CS.fw and the files written from it: the exact bytes of a new working file and of a
// written segment, masking round trips, header patches and the end of a recording, the
// song's format, and the failures the user is told about.
#include <gtest/gtest.h>

#include <algorithm>
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

// The header of CS.fw as it must lie on disk, for a one-channel song of rate and bits.
std::vector<uint8_t> workingHeader(uint32_t rate, uint16_t bits, uint32_t frames, uint32_t dataBytes) {
    std::vector<uint8_t> b;
    putTag(b, "RIFF");
    putU32(b, 48 + dataBytes);
    putTag(b, "WAVE");
    putTag(b, "fmt ");
    putU32(b, 16);
    putU16(b, 1);
    putU16(b, 1);
    putU32(b, rate);
    putU32(b, rate * (bits / 8));
    putU16(b, bits / 8);
    putU16(b, bits);
    putTag(b, "fact");
    putU32(b, 4);
    putU32(b, frames);
    putTag(b, "data");
    putU32(b, dataBytes);
    return b;
}

class WaveWorkingFile : public ::testing::Test {
protected:
    // CS.fw lives in a shared folder of this test's own; the run's paths come back after.
    void SetUp() override {
        savedPaths = paths;
        setSharedBasePath(folder.path());
        makeFolder(paths.sharedFolder);
        clean();
    }
    void TearDown() override {
        clean();
        paths = savedPaths;
    }
    void clean() {
        clearUiCalls();
        clearFileFailures();
        resetSong();
        audioActivity = AudioActivity{};
        fileDelete(workingPath());
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
    TempFolder folder;
    Paths savedPaths;
};

TEST_F(WaveWorkingFile, NewFileHasTheExact56ByteHeaderForOneChannel) {
    setSong(22050, 16, 0, 0.0, 2);
    song.workingWaveBytes = 1234;
    ASSERT_EQ(createWaveWorkingFile(), 0);
    EXPECT_EQ(readFileBytes(workingPath()), workingHeader(22050, 16, 0, 0));
    EXPECT_EQ(song.workingWaveBytes, 0u);
    EXPECT_TRUE(workingFileMutexFree());

    setSong(8000, 8, 0, 0.0, 3);
    ASSERT_EQ(createWaveWorkingFile(), 0);
    std::vector<uint8_t> expected = workingHeader(8000, 8, 0, 0);
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

TEST_F(WaveWorkingFile, EmptySongAdoptsTheIncomingFormat) {
    WaveFormatRecord format{1, 2, 32000, 128000, 4, 16, 0};
    EXPECT_EQ(acceptWaveFormat(format), 1);
    EXPECT_EQ(song.waveFormat.formatTag, 1);
    EXPECT_EQ(song.waveFormat.channels, 2);
    EXPECT_EQ(song.waveFormat.samplesPerSec, 32000u);
    EXPECT_EQ(song.waveFormat.avgBytesPerSec, 128000u);
    EXPECT_EQ(song.waveFormat.blockAlign, 4);
    EXPECT_EQ(song.waveFormat.bitsPerSample, 16);
}

TEST_F(WaveWorkingFile, SongWithBlocksRefusesAnotherRateOrSampleSize) {
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
        std::vector<uint8_t> bytes = workingHeader(8000, 8, 0, 0);
        bytes.resize(length);
        for (size_t i = 56; i < length; i++) bytes[i] = uint8_t(i * 7);
        return bytes;
    }
    std::string path = folder.file("masked.fw");
};

TEST_F(WaveMask, MaskingXorsTheHeaderWithTheMaskTextAndUnmaskingRestoresIt) {
    std::vector<uint8_t> plain = plainFile(300);
    writeFileBytes(path, plain);
    ASSERT_EQ(applyWaveMask(path, WAVE_MASKED), 1);
    std::vector<uint8_t> masked = readFileBytes(path);
    ASSERT_EQ(masked.size(), plain.size());
    for (size_t i = 0; i < 56; i++) EXPECT_EQ(masked[i], plain[i] ^ uint8_t(waveMaskText[i])) << i;
    EXPECT_TRUE(std::equal(plain.begin() + 56, plain.end(), masked.begin() + 56));
    EXPECT_NE(std::string(masked.begin(), masked.begin() + 4), "RIFF");

    ASSERT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
    EXPECT_EQ(readFileBytes(path), plain);
}

TEST_F(WaveMask, MaskingTwiceOrUnmaskingAPlainFileChangesNothing) {
    std::vector<uint8_t> plain = plainFile(100);
    writeFileBytes(path, plain);
    EXPECT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
    EXPECT_EQ(readFileBytes(path), plain);
    ASSERT_EQ(applyWaveMask(path, WAVE_MASKED), 1);
    std::vector<uint8_t> once = readFileBytes(path);
    EXPECT_EQ(applyWaveMask(path, WAVE_MASKED), 1);
    EXPECT_EQ(readFileBytes(path), once);
    EXPECT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
    EXPECT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
    EXPECT_EQ(readFileBytes(path), plain);
}

TEST_F(WaveMask, FileShorterThanTheHeaderHasOnlyItsOwnBytesMasked) {
    std::vector<uint8_t> plain = plainFile(20);
    writeFileBytes(path, plain);
    ASSERT_EQ(applyWaveMask(path, WAVE_MASKED), 1);
    std::vector<uint8_t> masked = readFileBytes(path);
    ASSERT_EQ(masked.size(), 20u);
    for (size_t i = 0; i < 20; i++) EXPECT_EQ(masked[i], plain[i] ^ uint8_t(waveMaskText[i])) << i;
    ASSERT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
    EXPECT_EQ(readFileBytes(path), plain);
}

TEST_F(WaveMask, FilesWithoutAStateToTestAreLeftAlone) {
    EXPECT_EQ(applyWaveMask(folder.file("absent.fw"), WAVE_PLAIN), 0);
    EXPECT_FALSE(fileExists(folder.file("absent.fw")));
    // Three bytes cannot say whether they begin with "RIFF": toggling them would lose them.
    writeFileBytes(path, {'R', 'I', 'F'});
    EXPECT_EQ(applyWaveMask(path, WAVE_MASKED), 1);
    EXPECT_EQ(applyWaveMask(path, WAVE_PLAIN), 1);
    EXPECT_EQ(readFileBytes(path), (std::vector<uint8_t>{'R', 'I', 'F'}));
}

TEST_F(WaveMask, FailedRewriteGives0AndLeavesTheFilePlain) {
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
    EXPECT_EQ(std::vector<uint8_t>(bytes.begin(), bytes.begin() + 56), workingHeader(8000, 16, 500, 1000));

    WaveReadInfo info{};
    ASSERT_EQ(wioFileOpen(&info, workingPath(), 0), WIO_OPENED);
    EXPECT_EQ(info.dataBytes, 1000u);
    EXPECT_EQ(info.dataSamples, 500u);
    wioFileClose(&info);
}

TEST_F(WaveHeaderPatch, FinalisingCutsTheFileToTheSongsLength) {
    // 10 blocks of 10 ms at 8000 Hz: 800 frames, 1600 bytes; the file holds 2000.
    setSong(8000, 16, 10, 0.01);
    storeSamples(std::vector<uint8_t>(2000, 0x33));
    ASSERT_EQ(unmaskWaveWorkingFile(), 1);
    EXPECT_EQ(finaliseWaveWorkingFile(), WAVE_FINALISED);
    std::vector<uint8_t> bytes = readFileBytes(workingPath());
    ASSERT_EQ(bytes.size(), 56u + 1600u);
    EXPECT_EQ(getU32(bytes, 4), bytes.size() - 8);
    EXPECT_EQ(std::vector<uint8_t>(bytes.begin(), bytes.begin() + 56), workingHeader(8000, 16, 800, 1600));
    EXPECT_EQ(bytes.back(), 0x33);
}

TEST_F(WaveHeaderPatch, FinalisingRoundsTheFrameCountToTheNearestFrame) {
    // 0.100075 s at 8000 Hz is 800.6 frames: 801, where truncation would give 800.
    setSong(8000, 8, 1, 0.100075);
    storeSamples(std::vector<uint8_t>(900, 0x44));
    ASSERT_EQ(unmaskWaveWorkingFile(), 1);
    EXPECT_EQ(finaliseWaveWorkingFile(), WAVE_FINALISED);
    std::vector<uint8_t> bytes = readFileBytes(workingPath());
    EXPECT_EQ(bytes.size(), 56u + 801u);
    EXPECT_EQ(getU32(bytes, 44), 801u);
    EXPECT_EQ(getU32(bytes, 52), 801u);
    EXPECT_EQ(getU32(bytes, 4), bytes.size() - 8);
}

TEST_F(WaveHeaderPatch, FinalisingASongLongerThanItsAudioAddsSilence) {
    setSong(8000, 8, 10, 0.01);   // 800 frames, 600 stored
    storeSamples(std::vector<uint8_t>(600, 0x10));
    ASSERT_EQ(unmaskWaveWorkingFile(), 1);
    EXPECT_EQ(finaliseWaveWorkingFile(), WAVE_FINALISED);
    std::vector<uint8_t> bytes = readFileBytes(workingPath());
    ASSERT_EQ(bytes.size(), 856u);
    EXPECT_EQ(getU32(bytes, 4), 848u);
    EXPECT_EQ(bytes[56 + 599], 0x10);
    EXPECT_EQ(std::vector<uint8_t>(bytes.begin() + 656, bytes.end()), std::vector<uint8_t>(200, 0x80));
}

TEST_F(WaveHeaderPatch, FinalisingWithoutAWorkingFileSaysSoAndShowsNothing) {
    setSong(8000, 8, 10, 0.01);
    EXPECT_EQ(finaliseWaveWorkingFile(), WAVE_NOT_OPENED);
    EXPECT_EQ(messageCount(), 0);
}

class WaveSegment : public WaveWorkingFile {
protected:
    // A 16-bit song of 0.5 s at 8000 Hz whose frame n holds the value n.
    void makeRampSong() {
        setSong(8000, 16, 50, 0.01, 2);
        for (int n = 0; n < 4000; n++) putU16(ramp, uint16_t(n));
        storeSamples(ramp);
    }
    std::vector<uint8_t> segmentHeader(uint32_t rate, uint16_t bits, uint32_t dataBytes) {
        std::vector<uint8_t> b;
        putTag(b, "RIFF");
        putU32(b, 36 + dataBytes);
        putTag(b, "WAVE");
        putTag(b, "fmt ");
        putU32(b, 16);
        putU16(b, 1);
        putU16(b, 1);
        putU32(b, rate);
        putU32(b, rate * (bits / 8));
        putU16(b, bits / 8);
        putU16(b, bits);
        putTag(b, "data");
        putU32(b, dataBytes);
        return b;
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

TEST_F(WaveSegment, BothBoundsMinusOneWriteTheWholeSong) {
    ASSERT_EQ(writeWaveSegment(out, -1.0, -1.0), 1);
    std::vector<uint8_t> bytes = readFileBytes(out);
    std::vector<uint8_t> expected = segmentHeader(8000, 16, 8000);
    expected.insert(expected.end(), ramp.begin(), ramp.end());
    EXPECT_EQ(bytes, expected);
    expectWorkingFileAtRest();
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(WaveSegment, RangeStartsAndEndsAtTruncatedFrames) {
    // 0.0101 s is frame 80.8 -> 80; 0.05 s is frame 400.
    ASSERT_EQ(writeWaveSegment(out, 0.0101, 0.05), 1);
    std::vector<uint8_t> bytes = readFileBytes(out);
    std::vector<uint8_t> expected = segmentHeader(8000, 16, 640);
    expected.insert(expected.end(), ramp.begin() + 160, ramp.begin() + 800);
    EXPECT_EQ(bytes, expected);
    expectWorkingFileAtRest();
}

TEST_F(WaveSegment, StartBeyondTheEndWritesAHeaderWithNoData) {
    ASSERT_EQ(writeWaveSegment(out, 5.0, -1.0), 1);
    EXPECT_EQ(readFileBytes(out), segmentHeader(8000, 16, 0));
    expectWorkingFileAtRest();
}

TEST_F(WaveSegment, EndBeforeTheStartWritesNoData) {
    ASSERT_EQ(writeWaveSegment(out, 0.3, 0.1), 1);
    EXPECT_EQ(readFileBytes(out), segmentHeader(8000, 16, 0));
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

TEST_F(WaveSegment, OutputThatCannotBeCreatedShowsCannotAndThePath) {
    std::string path = folder.file("no such folder/out.wav");
    EXPECT_EQ(writeWaveSegment(path, -1.0, -1.0), 0);
    EXPECT_EQ(lastMessageText(), "Cannot " + path);
    EXPECT_EQ(messageCount(), 1);
    expectWorkingFileAtRest();
}

TEST_F(WaveSegment, FailedCopyIsReportedAndTheWorkingFileMaskedAgain) {
    failFileCall(FILE_OP_WRITE, 3);   // unmasking, header, the samples
    EXPECT_EQ(writeWaveSegment(out, -1.0, -1.0), 0);
    EXPECT_EQ(lastMessageText(), "Bytes were not stored properly");
    expectWorkingFileAtRest();
}

TEST_F(WaveSegment, NothingIsWrittenWhileRecordingOrOpening) {
    audioActivity.opening = true;
    EXPECT_EQ(writeWaveSegment(out, -1.0, -1.0), 0);
    audioActivity = AudioActivity{};
    audioActivity.recording = true;
    EXPECT_EQ(writeWaveSegment(out, -1.0, -1.0), 0);
    EXPECT_FALSE(fileExists(out));
    expectWorkingFileAtRest();
}

TEST_F(WaveSegment, MissingWorkingFileWritesNothing) {
    fileDelete(workingPath());
    EXPECT_EQ(writeWaveSegment(out, -1.0, -1.0), 0);
    EXPECT_FALSE(fileExists(out));
    EXPECT_TRUE(workingFileMutexFree());
}

}  // namespace
