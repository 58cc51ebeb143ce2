// The wave reader on crafted files: every result code of wioFileOpen, the over-long chunk
// question, truncated and odd-sized chunks, the format check with its messages, and the
// downmix of frames to one channel.
#include <gtest/gtest.h>

#include <filesystem>

#include "audio/waveFile.h"
#include "audio/waveFixtures.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "support/testSupport.h"

namespace {

int openDescriptors() {
    int count = 0;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
        (void)entry;
        count++;
    }
    return count;
}

class WaveFileOpen : public ::testing::Test {
protected:
    void SetUp() override {
        clearUiCalls();
        clearFileFailures();
    }
    void TearDown() override {
        wioFileClose(&info);
        clearFileFailures();
        clearUiCalls();
    }
    uint32_t open(const std::vector<uint8_t>& bytes) {
        writeFileBytes(path, bytes);
        return wioFileOpen(&info, path, 0);
    }
    TempFolder folder;
    std::string path = folder.file("input.wav");
    WaveReadInfo info{};
};

const std::vector<uint8_t> hundredBytes(100, 0x41);

TEST_F(WaveFileOpen, PcmWithoutFactCountsFramesFromTheDataBytes) {
    ASSERT_EQ(open(pcmWave(2, 22050, 16, std::vector<uint8_t>(400, 1))), WIO_OPENED);
    ASSERT_NE(info.format, nullptr);
    EXPECT_NE(info.file, nullptr);
    EXPECT_EQ(info.format->formatTag, 1);
    EXPECT_EQ(info.format->channels, 2);
    EXPECT_EQ(info.format->samplesPerSec, 22050u);
    EXPECT_EQ(info.format->avgBytesPerSec, 88200u);
    EXPECT_EQ(info.format->blockAlign, 4);
    EXPECT_EQ(info.format->bitsPerSample, 16);
    EXPECT_EQ(info.format->extraSize, 0);   // read from the 18 bytes held, not beyond a 16-byte chunk
    EXPECT_EQ(info.dataOffset, 44u);
    EXPECT_EQ(info.dataSizeOffset, 40u);
    EXPECT_EQ(info.dataBytes, 400u);
    EXPECT_EQ(info.dataSamples, 100u);
    EXPECT_EQ(info.factValueOffset, WAVE_UNKNOWN);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(wioFileClose(&info), 0u);
    EXPECT_EQ(info.file, nullptr);
    EXPECT_EQ(info.format, nullptr);
    EXPECT_EQ(info.dataOffset, 44u);   // the offsets stay known after closing
}

TEST_F(WaveFileOpen, FactValueIsTakenEvenForPcm) {
    ASSERT_EQ(open(riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"fact", u32Body(60)}, {"data", hundredBytes}})),
              WIO_OPENED);
    EXPECT_EQ(info.dataSamples, 60u);
    EXPECT_EQ(info.factValueOffset, 44u);
    EXPECT_EQ(info.dataOffset, 56u);
}

TEST_F(WaveFileOpen, FactCountBeyondTheDataIsCutToTheFramesHeld) {
    ASSERT_EQ(open(riffWave({{"fmt ", formatBody(1, 2, 8000, 16)}, {"fact", u32Body(5000)}, {"data", hundredBytes}})),
              WIO_OPENED);
    EXPECT_EQ(info.dataSamples, 25u);
}

TEST_F(WaveFileOpen, FirstDataChunkOfNonZeroSizeIsUsed) {
    std::vector<uint8_t> second = {1, 2, 3, 4, 5, 6};
    ASSERT_EQ(open(riffWave({{"fmt ", formatBody(1, 1, 8000, 8)},
                             {"data", {}},
                             {"data", second},
                             {"data", hundredBytes}})),
              WIO_OPENED);
    EXPECT_EQ(info.dataBytes, 6u);
    EXPECT_EQ(info.dataOffset, 52u);
    EXPECT_EQ(info.dataSizeOffset, 48u);
    EXPECT_EQ(info.dataSamples, 6u);
}

TEST_F(WaveFileOpen, OddSizedChunksArePaddedToAnEvenLength) {
    ASSERT_EQ(open(riffWave({{"LIST", {'a', 'b', 'c'}}, {"fmt ", formatBody(1, 1, 8000, 8)}, {"data", {9, 8, 7}},
                             {"junk", {1}}})),
              WIO_OPENED);
    // "LIST" at 12 holds 3 bytes and a pad byte, so "fmt " starts at 24 and "data" at 48.
    EXPECT_EQ(info.format->samplesPerSec, 8000u);
    EXPECT_EQ(info.dataOffset, 56u);
    EXPECT_EQ(info.dataBytes, 3u);
}

TEST_F(WaveFileOpen, TruncatedDataIsCutToWhatTheFileHolds) {
    // The header was written for 1000 bytes but the download stopped after 100.
    std::vector<uint8_t> bytes =
        riffWave({{"fmt ", formatBody(1, 2, 8000, 16)}, {"data", hundredBytes, 1000}}, 4 + 24 + 8 + 1000);
    ASSERT_EQ(open(bytes), WIO_OPENED);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(info.dataBytes, 100u);
    EXPECT_EQ(info.dataSamples, 25u);
}

TEST_F(WaveFileOpen, OverlongChunkAsksWithTheWarningIconAndYesGoesOn) {
    std::vector<uint8_t> bytes = riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"data", hundredBytes, 200}});
    presetAnswers({ANSWER_YES});
    ASSERT_EQ(open(bytes), WIO_OPENED);
    ASSERT_EQ(messageCount(), 1);
    const UiCall& box = uiCalls().back();
    EXPECT_EQ(box.title, "wioFileOpen");
    EXPECT_EQ(box.kind, MESSAGE_WARNING);
    EXPECT_EQ(box.buttons, BUTTONS_YES_NO);
    EXPECT_EQ(box.text,
              "This wave file might be corrupt. The RIFF chunk.ckid '61746164' (data offset at 44) specifies a cksize "
              "of 200 that extends beyond what the RIFF header cksize of 136 allows. Attempt to load?");
    // Yes loads the chunk, but only as far as the file goes.
    EXPECT_EQ(info.dataBytes, 100u);
    EXPECT_EQ(info.dataSamples, 100u);
}

TEST_F(WaveFileOpen, NoToTheQuestionGives8AndLeavesNothingOpen) {
    std::vector<uint8_t> bytes = riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"data", hundredBytes, 200}});
    writeFileBytes(path, bytes);
    int before = openDescriptors();
    presetAnswers({ANSWER_NO});
    EXPECT_EQ(wioFileOpen(&info, path, 0), WIO_DECLINED);
    EXPECT_EQ(info.file, nullptr);
    EXPECT_EQ(info.format, nullptr);
    EXPECT_EQ(openDescriptors(), before);
    EXPECT_EQ(messageCount(), 1);
}

TEST_F(WaveFileOpen, EveryChunkBeyondATooSmallRiffSizeIsAskedAbout) {
    // A streamed file whose RIFF size was never filled in: each chunk is asked about.
    presetAnswers({ANSWER_YES, ANSWER_YES});
    ASSERT_EQ(open(riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"data", hundredBytes}}, 0)), WIO_OPENED);
    EXPECT_EQ(messageCount(), 2);
    EXPECT_EQ(info.dataBytes, 100u);
    presetAnswers({ANSWER_YES, ANSWER_NO});
    wioFileClose(&info);
    EXPECT_EQ(wioFileOpen(&info, path, 0), WIO_DECLINED);
}

TEST_F(WaveFileOpen, WithoutFmtChunkGives1) {
    EXPECT_EQ(open(riffWave({{"data", hundredBytes}})), WIO_NO_FORMAT);
    EXPECT_EQ(info.file, nullptr);
}

TEST_F(WaveFileOpen, NullRecordGives4) {
    writeFileBytes(path, pcmWave(1, 8000, 8, hundredBytes));
    EXPECT_EQ(wioFileOpen(nullptr, path, 0), WIO_NO_RECORD);
    EXPECT_EQ(wioFileClose(nullptr), WIO_NO_RECORD);
}

TEST_F(WaveFileOpen, UnreadableOrForeignFilesGive6) {
    EXPECT_EQ(wioFileOpen(&info, folder.file("missing.wav"), 0), WIO_CANNOT_READ);
    EXPECT_EQ(open({}), WIO_CANNOT_READ);
    EXPECT_EQ(open(std::vector<uint8_t>{'R', 'I', 'F', 'F', 4, 0, 0, 0, 'W', 'A', 'V'}), WIO_CANNOT_READ);
    std::vector<uint8_t> avi = pcmWave(1, 8000, 8, hundredBytes);
    avi[8] = 'A', avi[9] = 'V', avi[10] = 'I', avi[11] = ' ';
    EXPECT_EQ(open(avi), WIO_CANNOT_READ);
    std::vector<uint8_t> text(200, 'x');
    EXPECT_EQ(open(text), WIO_CANNOT_READ);

    failFileCall(FILE_OP_OPEN, 1);
    EXPECT_EQ(open(pcmWave(1, 8000, 8, hundredBytes)), WIO_CANNOT_READ);
    // Reads: RIFF header, "fmt " header, "fmt " body.
    failFileCall(FILE_OP_READ, 3);
    EXPECT_EQ(open(pcmWave(1, 8000, 8, hundredBytes)), WIO_CANNOT_READ);
    EXPECT_EQ(info.file, nullptr);
    EXPECT_EQ(info.format, nullptr);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(WaveFileOpen, FormatChunkBeyondTheFileOrOver64KiBGives6) {
    std::vector<uint8_t> cut = riffWave({{"fmt ", formatBody(1, 1, 8000, 8), 40}});
    presetAnswers({ANSWER_YES});
    EXPECT_EQ(open(cut), WIO_CANNOT_READ);
    EXPECT_EQ(info.format, nullptr);

    std::vector<uint8_t> body = formatBody(1, 1, 8000, 8);
    body.resize(65537, 0);
    EXPECT_EQ(open(riffWave({{"fmt ", body}, {"data", hundredBytes}})), WIO_CANNOT_READ);
    body.resize(65536);
    EXPECT_EQ(open(riffWave({{"fmt ", body}, {"data", hundredBytes}})), WIO_OPENED);
    EXPECT_EQ(info.format->samplesPerSec, 8000u);
}

TEST_F(WaveFileOpen, NonPcmWithoutFactGives12AndWithFactOpens) {
    EXPECT_EQ(open(riffWave({{"fmt ", formatBody(3, 1, 8000, 32)}, {"data", hundredBytes}})), WIO_NOT_PCM);
    EXPECT_EQ(info.file, nullptr);
    EXPECT_EQ(info.format, nullptr);

    ASSERT_EQ(open(riffWave({{"fmt ", formatBody(3, 1, 8000, 32)}, {"fact", u32Body(25)}, {"data", hundredBytes}})),
              WIO_OPENED);
    EXPECT_EQ(info.dataSamples, 25u);
    EXPECT_EQ(checkWaveFileFormat(info), WIO_NOT_PCM);
}

TEST_F(WaveFileOpen, HugeAndEmptyChunkSizesEndTheWalk) {
    std::vector<WaveChunk> chunks = {{"fmt ", formatBody(1, 1, 8000, 8)}};
    for (int i = 0; i < 50; i++) chunks.push_back({"zero", {}});
    chunks.push_back({"data", hundredBytes});
    chunks.push_back({"huge", {1, 2, 3, 4}, 0xFFFFFFFF});
    presetAnswers({ANSWER_YES});
    ASSERT_EQ(open(riffWave(chunks)), WIO_OPENED);
    EXPECT_EQ(info.dataBytes, 100u);
    ASSERT_EQ(messageCount(), 1);
    EXPECT_NE(lastMessageText().find("cksize of 4294967295"), std::string::npos);

    presetAnswers({ANSWER_YES});
    EXPECT_EQ(open(riffWave({{"huge", {}, 0xFFFFFFFE}, {"fmt ", formatBody(1, 1, 8000, 8)}})), WIO_NO_FORMAT);
}

TEST_F(WaveFileOpen, ShortFactChunkGivesNoSampleCount) {
    ASSERT_EQ(open(riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"fact", {7, 0}}, {"data", hundredBytes}})),
              WIO_OPENED);
    EXPECT_EQ(info.factValueOffset, WAVE_UNKNOWN);
    EXPECT_EQ(info.dataSamples, 100u);
}

class WaveFormatCheck : public WaveFileOpen {};

const std::string UNSUPPORTED = "Sorry - this wave file contains audio in a unsupported format.\n\nPlease note that "
                                "32-bit audio is not supported by this product.";
const std::string CANNOT_OPEN = "This file cannot be opened. Please check it is not open in another application.";

TEST_F(WaveFormatCheck, EightAndSixteenBitPcmUpTo16ChannelsAreTaken) {
    ASSERT_EQ(open(pcmWave(1, 8000, 8, hundredBytes)), WIO_OPENED);
    EXPECT_EQ(checkWaveFileFormat(info), WIO_OPENED);
    wioFileClose(&info);
    ASSERT_EQ(open(pcmWave(16, 44100, 16, std::vector<uint8_t>(64, 0))), WIO_OPENED);
    EXPECT_EQ(checkWaveFileFormat(info), WIO_OPENED);
}

TEST_F(WaveFormatCheck, OtherSampleSizesAndBrokenRecordsAreUnsupported) {
    struct Case {
        std::vector<uint8_t> format;
        const char* what;
    };
    std::vector<Case> cases = {
        {formatBody(1, 2, 44100, 24), "24-bit PCM"},
        {formatBody(1, 1, 44100, 32), "32-bit PCM"},
        {formatBody(1, 0, 44100, 16, 2), "no channels"},
        {formatBody(1, 2, 44100, 16, 2), "block align of one channel"},
        {formatBody(1, 1, 0, 16), "rate 0"},
    };
    for (const Case& c : cases) {
        ASSERT_EQ(open(riffWave({{"fmt ", c.format}, {"data", hundredBytes}})), WIO_OPENED) << c.what;
        EXPECT_EQ(checkWaveFileFormat(info), WIO_NOT_PCM) << c.what;
        wioFileClose(&info);
    }
    EXPECT_EQ(waveOpenMessage(WIO_NOT_PCM), UNSUPPORTED);
}

TEST_F(WaveFormatCheck, MoreThan16ChannelsHaveTheirOwnMessage) {
    ASSERT_EQ(open(pcmWave(17, 8000, 8, std::vector<uint8_t>(34, 0x80))), WIO_OPENED);
    EXPECT_EQ(checkWaveFileFormat(info), WAVE_TOO_MANY_CHANNELS);
    EXPECT_EQ(waveOpenMessage(WAVE_TOO_MANY_CHANNELS), "This waveform contains too many channels and cannot be loaded.");
}

TEST_F(WaveFormatCheck, EveryOtherRefusalAsksToCloseOtherApplications) {
    for (uint32_t code : {WIO_NO_FORMAT, WIO_NO_RECORD, WIO_CANNOT_READ, WIO_NO_MEMORY, WIO_DECLINED})
        EXPECT_EQ(waveOpenMessage(code), CANNOT_OPEN) << code;
    EXPECT_EQ(waveOpenMessage(WIO_OPENED), "");
}

class WaveDownmix : public ::testing::Test {
protected:
    void SetUp() override { clearFileFailures(); }
    // Downmixes outputBytes from a file holding bytes, into a buffer with sentinels after it.
    std::vector<uint8_t> downmix(const std::vector<uint8_t>& bytes, uint16_t channels, uint16_t bits,
                                 uint32_t outputBytes, uint8_t fill = 0xEE) {
        std::string path = folder.file("frames.raw");
        writeFileBytes(path, bytes);
        FILE* file = fileOpen(path, "rb");
        WaveFormatRecord format{1, channels, 8000, 0, uint16_t(channels * bits / 8), bits, 0};
        std::vector<uint8_t> out(outputBytes + SENTINELS, fill);
        returned = downmixFrames(file, format, out.data(), outputBytes);
        fileClose(file);
        for (size_t i = outputBytes; i < out.size(); i++) EXPECT_EQ(out[i], fill) << "written past the end at " << i;
        out.resize(outputBytes);
        return out;
    }
    static constexpr size_t SENTINELS = 8;
    TempFolder folder;
    uint32_t returned = 0;
};

std::vector<uint8_t> samples16(std::initializer_list<int16_t> values) {
    std::vector<uint8_t> bytes;
    for (int16_t v : values) putU16(bytes, uint16_t(v));
    return bytes;
}

TEST_F(WaveDownmix, StereoSixteenBitMeanTruncatesTowardsZero) {
    std::vector<uint8_t> out = downmix(samples16({-3, 4, -3, -4, 32767, 32767, -32768, -32768}), 2, 16, 8);
    EXPECT_EQ(out, samples16({0, -3, 32767, -32768}));
    EXPECT_EQ(returned, 8u);
}

TEST_F(WaveDownmix, StereoEightBitMeanTruncates) {
    std::vector<uint8_t> out = downmix({255, 0, 128, 129, 0, 0, 255, 255}, 2, 8, 4);
    EXPECT_EQ(out, (std::vector<uint8_t>{127, 128, 0, 255}));
}

TEST_F(WaveDownmix, FourChannelsAverageAllFour) {
    std::vector<uint8_t> out = downmix(samples16({100, 200, 300, -601}), 4, 16, 2);
    EXPECT_EQ(out, samples16({0}));
    out = downmix({10, 20, 30, 41}, 4, 8, 1);
    EXPECT_EQ(out, (std::vector<uint8_t>{25}));
}

TEST_F(WaveDownmix, ShortReadAtTheEndIsFilledWithSilence) {
    std::vector<uint8_t> out = downmix({10, 20, 30, 40, 50}, 2, 8, 6);
    // Two whole frames; the half frame and what the file lacks are silence.
    EXPECT_EQ(out, (std::vector<uint8_t>{15, 35, 0x80, 0x80, 0x80, 0x80}));
    EXPECT_EQ(returned, 2u);

    out = downmix(samples16({1000, 3000, 7}), 2, 16, 8);
    EXPECT_EQ(out, samples16({2000, 0, 0, 0}));
    EXPECT_EQ(returned, 2u);

    out = downmix({1, 2, 3}, 1, 8, 6);
    EXPECT_EQ(out, (std::vector<uint8_t>{1, 2, 3, 0x80, 0x80, 0x80}));
    EXPECT_EQ(returned, 3u);
}

TEST_F(WaveDownmix, LongReadsCrossThePieceBoundary) {
    // 40000 stereo frames are read in more than one piece; frame i is (i, -i) -> 0 and
    // (i, i) -> i.
    std::vector<uint8_t> bytes;
    std::vector<uint8_t> expected;
    for (int i = 0; i < 40000; i++) {
        int16_t v = int16_t(i % 30000);
        putU16(bytes, uint16_t(v));
        putU16(bytes, uint16_t(i % 2 ? -v : v));
        putU16(expected, uint16_t(i % 2 ? 0 : v));
    }
    std::vector<uint8_t> out = downmix(bytes, 2, 16, uint32_t(expected.size()));
    EXPECT_EQ(out, expected);
}

TEST_F(WaveDownmix, OtherSampleSizesLeaveTheDestinationAsItWas) {
    std::vector<uint8_t> out = downmix(std::vector<uint8_t>(12, 0x11), 2, 24, 6, 0x5A);
    EXPECT_EQ(out, std::vector<uint8_t>(6, 0x5A));
    EXPECT_EQ(returned, 0u);
}

TEST_F(WaveDownmix, TruncatedFileReadsOnlyToItsEnd) {
    // A data chunk claiming 1000 bytes of which 10 arrived: the reader's counts and the
    // downmix both stop at the file's end.
    std::string path = folder.file("cut.wav");
    std::vector<uint8_t> data = {10, 30, 20, 40, 0, 255, 7, 9, 100, 200};
    writeFileBytes(path, riffWave({{"fmt ", formatBody(1, 2, 8000, 8)}, {"data", data, 1000}}, 1036));
    WaveReadInfo info{};
    ASSERT_EQ(wioFileOpen(&info, path, 0), WIO_OPENED);
    EXPECT_EQ(info.dataSamples, 5u);
    ASSERT_EQ(fileSeek(info.file, info.dataOffset, SEEK_SET), 0);
    std::vector<uint8_t> out(8, 0xEE);
    EXPECT_EQ(downmixFrames(info.file, *info.format, out.data(), 8), 5u);
    EXPECT_EQ(out, (std::vector<uint8_t>{20, 30, 127, 8, 150, 0x80, 0x80, 0x80}));
    wioFileClose(&info);
}

}  // namespace

TEST_F(WaveFormatCheck, OpeningACheckedFileRefusesWithTheMessageAndLeavesNothingOpen) {
    writeFileBytes(path, riffWave({{"fmt ", formatBody(1, 1, 44100, 24)}, {"data", hundredBytes}}));
    int before = openDescriptors();
    EXPECT_EQ(openCheckedWaveFile(&info, path), WIO_NOT_PCM);
    EXPECT_EQ(info.file, nullptr);
    EXPECT_EQ(openDescriptors(), before);
    EXPECT_EQ(lastMessageText(), UNSUPPORTED);

    clearUiCalls();
    writeFileBytes(path, riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"data", hundredBytes, 200}}));
    presetAnswers({ANSWER_NO});
    EXPECT_EQ(openCheckedWaveFile(&info, path), WIO_DECLINED);
    EXPECT_EQ(messageCount(), 1) << "only the question: a declined file gets no second message";

    writeFileBytes(path, pcmWave(1, 8000, 16, hundredBytes));
    EXPECT_EQ(openCheckedWaveFile(&info, path), WIO_OPENED);
    EXPECT_NE(info.file, nullptr);
}
