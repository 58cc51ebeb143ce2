// The wave reader on crafted files: every result code of wioFileOpen, the over-long chunk
// question, truncated and odd-sized chunks, the format check with its messages, and the
// downmix of frames to one channel.
#include <gtest/gtest.h>

#include <filesystem>
#include <tuple>

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
    const auto& f = *info.format;   // extraSize is read from the 18 bytes held, not beyond a 16-byte chunk
    EXPECT_EQ(std::tuple(f.formatTag, f.channels, f.samplesPerSec, f.avgBytesPerSec, f.blockAlign, f.bitsPerSample, f.extraSize),
              std::tuple(1, 2, 22050u, 88200u, 4, 16, 0));
    EXPECT_EQ(std::tuple(info.dataOffset, info.dataSizeOffset, info.dataBytes, info.dataSamples, info.factValueOffset),
              std::tuple(44u, 40u, 400u, 100u, WAVE_UNKNOWN));
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(wioFileClose(&info), 0u);
    EXPECT_EQ(info.file, nullptr);
    EXPECT_EQ(info.format, nullptr);
    EXPECT_EQ(info.dataOffset, 44u);   // the offsets stay known after closing
}

// Where the data lies and how many frames it holds: a fact value is taken even for PCM, but
// cut to the frames held (a short fact chunk gives none); the first data chunk of non-zero size
// is used; odd-sized chunks are padded; truncated data is cut to what the file holds.
TEST_F(WaveFileOpen, TheDataChunkAndTheFrameCountAreFoundAsTheFileHoldsThem) {
    const uint32_t NONE = WAVE_UNKNOWN;
    struct Case {
        const char* what;
        std::vector<uint8_t> bytes;
        uint32_t dataOffset, dataBytes, dataSamples, factValueOffset;
    } cases[] = {
        {"fact for PCM", riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"fact", u32Body(60)}, {"data", hundredBytes}}),
         56, 100, 60, 44},
        {"fact beyond the data",
         riffWave({{"fmt ", formatBody(1, 2, 8000, 16)}, {"fact", u32Body(5000)}, {"data", hundredBytes}}), 56, 100, 25, 44},
        {"short fact", riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"fact", {7, 0}}, {"data", hundredBytes}}), 54, 100,
         100, NONE},
        {"empty data first",
         riffWave({{"fmt ", formatBody(1, 1, 8000, 8)}, {"data", {}}, {"data", {1, 2, 3, 4, 5, 6}}, {"data", hundredBytes}}),
         52, 6, 6, NONE},
        // "LIST" at 12 holds 3 bytes and a pad byte, so "fmt " starts at 24 and "data" at 48.
        {"odd sizes",
         riffWave({{"LIST", {'a', 'b', 'c'}}, {"fmt ", formatBody(1, 1, 8000, 8)}, {"data", {9, 8, 7}}, {"junk", {1}}}),
         56, 3, 3, NONE},
        // The header was written for 1000 bytes but the download stopped after 100.
        {"truncated", riffWave({{"fmt ", formatBody(1, 2, 8000, 16)}, {"data", hundredBytes, 1000}}, 4 + 24 + 8 + 1000),
         44, 100, 25, NONE},
    };
    for (const Case& c : cases) {
        ASSERT_EQ(open(c.bytes), WIO_OPENED) << c.what;
        EXPECT_EQ(std::tuple(info.dataOffset, info.dataSizeOffset, info.dataBytes, info.dataSamples, info.factValueOffset),
                  std::tuple(c.dataOffset, c.dataOffset - 4, c.dataBytes, c.dataSamples, c.factValueOffset))
            << c.what;
        wioFileClose(&info);
    }
    EXPECT_EQ(messageCount(), 0);
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

// No "fmt " chunk gives 1; files that cannot be read or are no wave files, a format chunk
// beyond the file or over 64 KiB give 6; a non-PCM format without a fact chunk gives 12.
// Nothing is left open.
TEST_F(WaveFileOpen, FilesThatCannotBeTakenGiveTheirCodes) {
    std::vector<uint8_t> avi = pcmWave(1, 8000, 8, hundredBytes);
    avi[8] = 'A', avi[9] = 'V', avi[10] = 'I', avi[11] = ' ';
    std::vector<uint8_t> large = formatBody(1, 1, 8000, 8);
    large.resize(65537, 0);
    struct Case {
        std::vector<uint8_t> bytes;
        uint32_t code;
        FileOp failing = FILE_OP_COUNT;
        int failingCall = 0;
    } cases[] = {
        {riffWave({{"data", hundredBytes}}), WIO_NO_FORMAT},
        {{}, WIO_CANNOT_READ},
        {{'R', 'I', 'F', 'F', 4, 0, 0, 0, 'W', 'A', 'V'}, WIO_CANNOT_READ},
        {avi, WIO_CANNOT_READ},
        {std::vector<uint8_t>(200, 'x'), WIO_CANNOT_READ},
        {pcmWave(1, 8000, 8, hundredBytes), WIO_CANNOT_READ, FILE_OP_OPEN, 1},
        {pcmWave(1, 8000, 8, hundredBytes), WIO_CANNOT_READ, FILE_OP_READ, 3},   // RIFF header, "fmt " header, body
        {riffWave({{"fmt ", large}, {"data", hundredBytes}}), WIO_CANNOT_READ},
        {riffWave({{"fmt ", formatBody(3, 1, 8000, 32)}, {"data", hundredBytes}}), WIO_NOT_PCM},
    };
    for (const Case& c : cases) {
        failFileCall(c.failing, c.failingCall);
        EXPECT_EQ(open(c.bytes), c.code) << c.bytes.size() << " bytes";
        EXPECT_EQ(info.file, nullptr);
        EXPECT_EQ(info.format, nullptr);
    }
    EXPECT_EQ(wioFileOpen(&info, folder.file("missing.wav"), 0), WIO_CANNOT_READ);
    EXPECT_EQ(messageCount(), 0);
    presetAnswers({ANSWER_YES});   // to the question about the chunk past the end
    EXPECT_EQ(open(riffWave({{"fmt ", formatBody(1, 1, 8000, 8), 40}})), WIO_CANNOT_READ);
    EXPECT_EQ(info.format, nullptr);
    EXPECT_EQ(wioFileOpen(nullptr, path, 0), WIO_NO_RECORD);
    EXPECT_EQ(wioFileClose(nullptr), WIO_NO_RECORD);
    large.resize(65536);
    EXPECT_EQ(open(riffWave({{"fmt ", large}, {"data", hundredBytes}})), WIO_OPENED);
    EXPECT_EQ(info.format->samplesPerSec, 8000u);
    wioFileClose(&info);
    // With a fact chunk a non-PCM format opens; the format check refuses it.
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

class WaveFormatCheck : public WaveFileOpen {};

const std::string UNSUPPORTED = "Sorry - this wave file contains audio in a unsupported format.\n\nPlease note that "
                                "32-bit audio is not supported by this product.";
const std::string CANNOT_OPEN = "This file cannot be opened. Please check it is not open in another application.";

// 8- and 16-bit PCM of 1 to 16 channels is taken; other sample sizes and broken records are
// unsupported.
TEST_F(WaveFormatCheck, OnlyEightAndSixteenBitPcmUpTo16ChannelsIsTaken) {
    struct Case {
        std::vector<uint8_t> format;
        uint32_t code;
        const char* what;
    };
    std::vector<Case> cases = {
        {formatBody(1, 1, 8000, 8), WIO_OPENED, "8-bit mono"},
        {formatBody(1, 16, 44100, 16), WIO_OPENED, "16-bit, 16 channels"},
        {formatBody(1, 2, 44100, 24), WIO_NOT_PCM, "24-bit PCM"},
        {formatBody(1, 1, 44100, 32), WIO_NOT_PCM, "32-bit PCM"},
        {formatBody(1, 0, 44100, 16, 2), WIO_NOT_PCM, "no channels"},
        {formatBody(1, 2, 44100, 16, 2), WIO_NOT_PCM, "block align of one channel"},
        {formatBody(1, 1, 0, 16), WIO_NOT_PCM, "rate 0"},
    };
    for (const Case& c : cases) {
        ASSERT_EQ(open(riffWave({{"fmt ", c.format}, {"data", std::vector<uint8_t>(64, 0)}})), WIO_OPENED) << c.what;
        EXPECT_EQ(checkWaveFileFormat(info), c.code) << c.what;
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

// The mean of a frame's channels truncates towards zero; what the file lacks at its end (a
// half frame too) is silence.
TEST_F(WaveDownmix, EachFrameBecomesTheMeanOfItsChannels) {
    struct Case {
        std::vector<uint8_t> input;
        uint16_t channels, bits;
        std::vector<uint8_t> output;
        uint32_t filled;   // bytes of output from the file's frames
    } cases[] = {
        {samples16({-3, 4, -3, -4, 32767, 32767, -32768, -32768}), 2, 16, samples16({0, -3, 32767, -32768}), 8},
        {{255, 0, 128, 129, 0, 0, 255, 255}, 2, 8, {127, 128, 0, 255}, 4},
        {samples16({100, 200, 300, -601}), 4, 16, samples16({0}), 2},
        {{10, 20, 30, 41}, 4, 8, {25}, 1},
        {{10, 20, 30, 40, 50}, 2, 8, {15, 35, 0x80, 0x80, 0x80, 0x80}, 2},
        {samples16({1000, 3000, 7}), 2, 16, samples16({2000, 0, 0, 0}), 2},
        {{1, 2, 3}, 1, 8, {1, 2, 3, 0x80, 0x80, 0x80}, 3},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(downmix(c.input, c.channels, c.bits, uint32_t(c.output.size())), c.output);
        EXPECT_EQ(returned, c.filled);
    }
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
