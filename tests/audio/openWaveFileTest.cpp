// Opening a wave file: the refusals with their exact messages and the song left as it was,
// the worker's chunks (channels averaged, the partial last block dropped, CS.fw's samples and
// header, the block stores' counts), stopping part-way, appending a second file, the worker's
// own failures, the main thread as the only one that redraws, and the level meter's values.
#include <gtest/gtest.h>

#include <chrono>
#include <cstring>
#include <mutex>
#include <thread>
#include <tuple>

#include "analysis/frequencyAnalysis.h"
#include "analysis/recognitionOptions.h"
#include "analysis/signalGenerator.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/openingFixtures.h"
#include "audio/waveWorkingFile.h"
#include "notes/noteList.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/mainFrame.h"
#include "shell/paths.h"
#include "shell/saveSong.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "support/testSupport.h"

namespace {

const uint32_t RATE = OPENING_RATE;
const uint32_t BLOCK = 512;   // samples of a block at 44,100 Hz with the default pitch range

std::vector<uint8_t> toneBytes(double frequency, double seconds, int bits = 16, uint32_t rate = RATE) {
    return toSampleBytes(toneSignal(frequency, bits == 16 ? 8000.0 : 60.0, seconds, rate, {1.0, 0.5, 0.25}), bits);
}

// CS.fw as it would be read plain: its first 56 bytes unmasked when it is masked.
std::vector<uint8_t> plainWorkingFile() {
    std::vector<uint8_t> bytes = readFileBytes(sharedFilePath("CS.fw"));
    if (bytes.size() >= 4 && std::memcmp(bytes.data(), "RIFF", 4) != 0)
        for (size_t i = 0; i < bytes.size() && i < WORKING_WAVE_HEADER_BYTES; i++) bytes[i] ^= uint8_t(waveMaskText[i]);
    return bytes;
}

std::vector<uint8_t> workingSamples() {
    std::vector<uint8_t> bytes = plainWorkingFile();
    return std::vector<uint8_t>(bytes.begin() + WORKING_WAVE_HEADER_BYTES, bytes.end());
}

// The block count stored at the head of an index file.
uint32_t storedIndexCount(const char* name) {
    std::vector<uint8_t> bytes = readFileBytes(sharedFilePath(name));
    return bytes.size() >= 4 ? getU32(bytes, 0) : 0;
}

bool processingMutexFree() {
    if (!CSWaveProcessingMutex.try_lock()) return false;
    CSWaveProcessingMutex.unlock();
    return true;
}

using OpenWaveTest = OpeningTest;

// ---- refusals ----

using OpenWaveRefusals = OpenWaveTest;

// A file faster than 44,100 Hz, or one that does not match the song's rate and bits, is
// refused and the song keeps its audio, its notes and its files.
TEST_F(OpenWaveRefusals, AFileTheSongCannotTakeIsRefusedAndTheSongKeepsWhatItHas) {
    openAndWait(writeMono("first.wav", melodyBytes(1.5)));
    uint32_t blocks = song.blockCount;
    int notes = noteList.count;
    ASSERT_GT(blocks, 0u);
    std::vector<std::vector<uint8_t>> files;
    for (const char* name : {"CS.fw", "CS.ft", "CS.fi", "CS.fi+"}) files.push_back(readFileBytes(sharedFilePath(name)));
    const char* cannotAppend = "This waveform cannot be appended to the current document as it either has a "
                               "different sample rate, bit size or number of channels.";
    const std::pair<std::string, const char*> cases[] = {
        {writeMono("fast.wav", toneBytes(220, 1.0, 16, 48000), 16, 48000),
         "Sorry - this wave file cannot be opened.\n\n44100Hz is the highest sample rate supported by this product."},
        {writeMono("half.wav", toneBytes(220, 1.0, 16, 22050), 16, 22050), cannotAppend},
        {writeMono("eight.wav", toneBytes(220, 1.0, 8), 8), cannotAppend}};
    for (const auto& [path, text] : cases) {
        clearUiCalls();
        EXPECT_EQ(openWaveFile(path), 1);
        EXPECT_EQ(lastMessageText(), text);
        EXPECT_EQ(messageCount(), 1);
        EXPECT_EQ(uiCalls().back().kind, MESSAGE_ERROR);
        EXPECT_FALSE(audioActivity.opening);
        EXPECT_EQ(song.blockCount, blocks);
        EXPECT_EQ(song.waveFormat.samplesPerSec, RATE);
        EXPECT_EQ(noteList.count, notes);
        int i = 0;
        for (const char* name : {"CS.fw", "CS.ft", "CS.fi", "CS.fi+"})
            EXPECT_EQ(readFileBytes(sharedFilePath(name)), files[i++]) << name;
    }
}

TEST_F(OpenWaveRefusals, ASecondOpeningWhileOneRunsIsRefusedAndNotAppended) {
    std::string first = writeMono("first.wav", toneBytes(220, 2.0));
    std::string second = writeMono("second.wav", toneBytes(330, 2.0));
    ASSERT_EQ(openWaveFile(first), 1);
    // The flag stays set until the main loop has served the worker's end, which nothing
    // serves here, so the second opening meets the first whatever the worker has done.
    EXPECT_EQ(openWaveFile(second), 1);
    EXPECT_EQ(lastMessageText(), "Sorry - this cannot be done whilst opening audio.");
    waitForOpeningToEnd();
    EXPECT_EQ(song.blockCount, uint32_t(2.0 * RATE) / BLOCK);
    EXPECT_EQ(songNames.remembered[OUTPUT_WAVE], folder.file("first"));
}

// A file the program cannot read, one with too many channels or samples it cannot take, an
// opening while recording or with less than 100 MB free: refused before anything is created.
TEST_F(OpenWaveRefusals, FilesTheProgramCannotTakeGetTheirMessagesAndCreateNothing) {
    const std::string cannotOpen = "This file cannot be opened. Please check it is not open in another application.";
    const std::string unsupported =
        "Sorry - this wave file contains audio in a unsupported format.\n\nPlease note that 32-bit audio is not "
        "supported by this product.";
    const std::string diskLow = "Disk space is low on the Torvellan Shared drive so recording cannot begin. Please "
                                "free some space or choose an alternative drive from Preferences.";
    writeFileText(folder.file("text.wav"), "not a wave file at all");
    std::vector<uint8_t> data(4 * 4410, 0);
    std::string tone = writeMono("tone.wav", toneBytes(220, 0.5));
    enum Busy { IDLE, RECORDING, DISK_LOW };
    struct Case {
        std::string path;
        Busy busy;
        std::string text;
    } cases[] = {
        {folder.file("missing.wav"), IDLE, cannotOpen},
        {folder.file("text.wav"), IDLE, cannotOpen},
        {writeWave("many.wav", pcmWave(17, RATE, 16, std::vector<uint8_t>(17 * 2 * 4410, 0))), IDLE,
         "This waveform contains too many channels and cannot be loaded."},
        // Float samples without a fact chunk: the reader's code 12.
        {writeWave("float.wav", riffWave({{"fmt ", formatBody(3, 1, RATE, 32)}, {"data", data}})), IDLE, unsupported},
        // With a fact chunk the reader takes it, and so does 24-bit PCM; neither is 8- or 16-bit PCM.
        {writeWave("factfloat.wav",
                   riffWave({{"fmt ", formatBody(3, 1, RATE, 32)}, {"fact", u32Body(4410)}, {"data", data}})),
         IDLE, unsupported},
        {writeWave("deep.wav", pcmWave(1, RATE, 24, std::vector<uint8_t>(3 * 4410, 0))), IDLE, unsupported},
        {tone, RECORDING, "Sorry - this cannot be done whilst recording audio."},
        {tone, DISK_LOW, diskLow},
    };
    for (const Case& c : cases) {
        clearUiCalls();
        audioActivity.recording = c.busy == RECORDING;
        setFreeDiskSpaceOverride(c.busy == DISK_LOW ? 104857600 - 1 : 104857600);
        EXPECT_EQ(openWaveFile(c.path), 1);
        EXPECT_EQ(lastMessageText(), c.text) << c.path;
        EXPECT_EQ(messageCount(), 1);
        EXPECT_FALSE(audioActivity.opening);
        EXPECT_EQ(song.blockCount, 0u);
        EXPECT_FALSE(fileExists(sharedFilePath("CS.fw")));
        EXPECT_FALSE(fileExists(sharedFilePath("CS.ft")));
    }
    audioActivity.recording = false;
    setFreeDiskSpaceOverride(104857600);
    openAndWait(tone);   // exactly 100 MB free is enough
    EXPECT_GT(song.blockCount, 0u);
}

TEST_F(OpenWaveRefusals, CancellingTheQuickPreferencesDoesNothing) {
    std::string path = writeMono("tone.wav", toneBytes(220, 0.5));
    static int asked;
    asked = 0;
    openingState.quickPreferences = [] { return asked++, 0; };
    EXPECT_EQ(openWaveFile(path), 0);
    EXPECT_EQ(asked, 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_FALSE(audioActivity.opening);
    EXPECT_FALSE(fileExists(sharedFilePath("CS.fw")));
    // Not asked again when the song is no longer empty.
    openingState.quickPreferences = [] { return asked++, 1; };
    openAndWait(path);
    EXPECT_EQ(asked, 2);
    openAndWait(path);
    EXPECT_EQ(asked, 2);
}

// ---- the worker ----

using OpenWaveWorker = OpenWaveTest;

// The song is the file's whole blocks, its channels averaged into one: 16 channels whose
// offsets cancel, a partial last block (not analysed nor stored), 8-bit samples, a file
// shorter than a block.
TEST_F(OpenWaveWorker, EachFileIsStoredAsItsWholeBlocksOfOneChannel) {
    std::vector<uint8_t> melody = melodyBytes(1.2);
    std::vector<uint8_t> interleaved;
    for (size_t i = 0; i < melody.size() / 2; i++) {
        int16_t x;
        std::memcpy(&x, &melody[2 * i], 2);
        x = int16_t(std::clamp<int>(x, -30000, 30000));
        std::memcpy(&melody[2 * i], &x, 2);
        for (int c = 0; c < 16; c++) putU16(interleaved, uint16_t(int16_t(x + (c < 8 ? 100 * (c + 1) : -100 * (c - 7)))));
    }
    std::vector<uint8_t> partial = melodyBytes(2.0);
    partial.resize((20 * 512 * 8 + 300) * 2);   // 160 blocks and 300 samples
    std::vector<uint8_t> eight = toneBytes(196, 1.5, 8);
    struct Case {
        std::string path;
        const std::vector<uint8_t>& mono;
        int channels, bits;
        uint32_t blocks;
    } cases[] = {
        {writeWave("sixteen.wav", pcmWave(16, RATE, 16, interleaved)), melody, 16, 16, uint32_t(melody.size() / 2 / BLOCK)},
        {writeMono("partial.wav", partial), partial, 1, 16, 160},
        {writeMono("eight.wav", eight, 8), eight, 1, 8, uint32_t(eight.size() / BLOCK)},
        {writeMono("tiny.wav", toneBytes(220, 300.0 / RATE)), eight, 1, 16, 0},
    };
    for (const Case& c : cases) {
        closeSong();
        openAndWait(c.path);
        size_t bytes = size_t(c.blocks) * BLOCK * (c.bits / 8);
        EXPECT_EQ(song.blockCount, c.blocks) << c.path;
        EXPECT_EQ(song.waveFormat.channels, c.channels);
        EXPECT_EQ(song.waveFormat.bitsPerSample, c.bits);
        EXPECT_NEAR(songDuration(), double(c.blocks) * BLOCK / RATE, 1e-9);
        EXPECT_EQ(song.workingWaveBytes, bytes);
        std::vector<uint8_t> stored = workingSamples();
        ASSERT_EQ(stored.size(), bytes);
        EXPECT_TRUE(std::equal(stored.begin(), stored.end(), c.mono.begin())) << c.path;
        EXPECT_EQ(storedIndexCount("CS.fi"), c.blocks);
        EXPECT_EQ(storedIndexCount("CS.fi+"), c.blocks);
        EXPECT_FALSE(ftFilesOpen());
        EXPECT_FALSE(hiresFilesOpen());
        EXPECT_EQ(analysisBuffersReady(), 0);
        if (c.blocks == 0) { EXPECT_EQ(noteList.count, 0); }
    }
    // At rest CS.fw is masked, with a header that agrees with its data.
    std::vector<uint8_t> onDisk = readFileBytes(sharedFilePath("CS.fw"));
    EXPECT_NE(std::memcmp(onDisk.data(), "RIFF", 4), 0) << "CS.fw is masked at rest";
    closeSong();
    openAndWait(cases[1].path);
    std::vector<uint8_t> plain = plainWorkingFile();
    uint32_t dataBytes = 160 * BLOCK * 2;
    EXPECT_EQ(std::string(plain.begin(), plain.begin() + 4), "RIFF");
    EXPECT_EQ(std::string(plain.begin() + 48, plain.begin() + 52), "data");
    EXPECT_EQ(plain.size(), WORKING_WAVE_HEADER_BYTES + dataBytes);
    // The RIFF size, the data size, the fact count, one channel, the rate.
    EXPECT_EQ(std::tuple(getU32(plain, 4), getU32(plain, 52), getU32(plain, WORKING_WAVE_FACT_OFFSET), getU16(plain, 22), getU32(plain, 24)),
              std::tuple(uint32_t(plain.size()) - 8, dataBytes, dataBytes / 2, 1, RATE));
}

TEST_F(OpenWaveWorker, StoppingPartWayKeepsWhatWasAnalysed) {
    std::vector<uint8_t> samples = melodyBytes(20.0);
    uint32_t allBlocks = uint32_t(samples.size() / 2 / BLOCK);
    ASSERT_EQ(openWaveFile(writeMono("long.wav", samples)), 1);
    // Between chunks the worker gives up the processing mutex; stop once a chunk is in.
    while (true) {
        std::unique_lock<std::mutex> processing(CSWaveProcessingMutex);
        if (song.blockCount > 0) {
            requestOpeningStop();
            break;
        }
        processing.unlock();
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    waitForOpeningToEnd();
    uint32_t blocks = song.blockCount;
    EXPECT_GT(blocks, 0u);
    EXPECT_LT(blocks, allBlocks / 2);
    std::vector<uint8_t> stored = workingSamples();
    ASSERT_EQ(stored.size(), size_t(blocks) * BLOCK * 2);
    EXPECT_TRUE(std::equal(stored.begin(), stored.end(), samples.begin()));
    EXPECT_EQ(storedIndexCount("CS.fi"), blocks);
    EXPECT_EQ(storedIndexCount("CS.fi+"), blocks);
    for (int i = 0; i < noteList.count; i++) EXPECT_LE(noteList.notes[i].waveEnd, songDuration() + 1e-4);
    EXPECT_NE(readFileBytes(sharedFilePath("CS.fw"))[0], 'R') << "masked again";
    EXPECT_TRUE(processingMutexFree());
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(OpenWaveWorker, ASecondFileIsAppendedToTheOpenSong) {
    std::vector<uint8_t> first = toneBytes(220, 1.3);
    std::vector<uint8_t> second = toneBytes(330, 1.1);
    openAndWait(writeMono("first.wav", first));
    uint32_t firstBlocks = song.blockCount;
    ASSERT_EQ(firstBlocks, uint32_t(first.size() / 2 / BLOCK));
    openAndWait(writeMono("second.wav", second));
    uint32_t secondBlocks = uint32_t(second.size() / 2 / BLOCK);
    EXPECT_EQ(song.blockCount, firstBlocks + secondBlocks);
    std::vector<uint8_t> stored = workingSamples();
    ASSERT_EQ(stored.size(), size_t(firstBlocks + secondBlocks) * BLOCK * 2);
    size_t split = size_t(firstBlocks) * BLOCK * 2;
    EXPECT_TRUE(std::equal(stored.begin(), stored.begin() + ptrdiff_t(split), first.begin()));
    EXPECT_TRUE(std::equal(stored.begin() + ptrdiff_t(split), stored.end(), second.begin()));
    EXPECT_EQ(storedIndexCount("CS.fi"), song.blockCount);
    EXPECT_EQ(storedIndexCount("CS.fi+"), song.blockCount);
    // The song keeps the first file's name.
    EXPECT_EQ(songNames.remembered[OUTPUT_WAVE], folder.file("first"));
    EXPECT_EQ(messageCount(), 0);
}

// Blocks leave the 30-second window as the opening goes on, whenever recognition runs; each
// must be on file, recognised (its dataBuffer reduced to the one pitch entry, or none).
TEST_F(OpenWaveWorker, ASongLongerThanTheWindowIsRecognisedAndStoredThroughout) {
    openAndWait(writeMono("long.wav", melodyBytes(40.0)));
    ASSERT_EQ(song.blockCount, uint32_t(40.0 * RATE) / BLOCK);
    EXPECT_EQ(storedIndexCount("CS.fi"), song.blockCount);
    EXPECT_EQ(storedIndexCount("CS.fi+"), song.blockCount);
    uint32_t capacity = ftBlockWindow.capacity;
    ASSERT_LT(capacity, song.blockCount);
    uint32_t unrecognised = 0;
    for (uint32_t from = 0; from < song.blockCount; from += capacity) {
        loadFTBlockWindow(from, from + capacity);
        ASSERT_EQ(ftBlockWindow.firstBlock, from);
        for (uint32_t b = from; b < ftBlockWindow.endBlock; b++)
            unrecognised += ftBlockWindow.dataBuffers[b - from].nEntries > 1;
    }
    EXPECT_EQ(unrecognised, 0u);
    // The melody never pauses for a second: neither do its notes.
    ASSERT_GT(noteList.count, 0);
    double end = 0;
    for (int i = 0; i < noteList.count; i++) {
        EXPECT_LT(noteList.notes[i].waveStart - end, 1.0) << "before note " << i;
        end = noteList.notes[i].waveEnd;
    }
    EXPECT_GT(end, songDuration() - 1.0);
    EXPECT_EQ(messageCount(), 0);
}

// A file whose data chunk claims two bytes more than the RIFF size allows: every open asks
// whether to load it, and the answers decide which of the worker's opens fails.
std::vector<uint8_t> overlongWave(const std::vector<uint8_t>& samples) {
    return riffWave({{"fmt ", formatBody(1, 1, RATE, 16)}, {"data", samples, int64_t(samples.size()) + 2}});
}

TEST_F(OpenWaveWorker, ASourceTheWorkerCannotOpenEndsTheOpening) {
    std::string path = writeWave("overlong.wav", overlongWave(melodyBytes(2.0)));
    presetAnswers({ANSWER_YES, ANSWER_NO});   // openWaveFile's open, then the worker's first
    openAndWait(path);
    EXPECT_EQ(lastMessageText(), "Input Wave file could not be opened by CSOpenWaveFileDataThread (1)");
    EXPECT_EQ(song.blockCount, 0u);
    EXPECT_FALSE(ftFilesOpen());
    EXPECT_NE(readFileBytes(sharedFilePath("CS.fw"))[0], 'R') << "masked again";

    closeSong();
    clearUiCalls();
    presetAnswers({ANSWER_YES, ANSWER_YES, ANSWER_NO});   // the worker's open before reading fails
    openAndWait(path);
    EXPECT_EQ(lastMessageText(), "Input Wave file could not be opened by CSOpenWaveFileDataThread (2)");
    EXPECT_EQ(song.blockCount, 0u);
    EXPECT_TRUE(processingMutexFree());
}

TEST_F(OpenWaveWorker, ASourceThatCannotBeOpenedAfterAChunkKeepsThatChunk) {
    std::vector<uint8_t> samples = melodyBytes(2.0);
    std::string path = writeWave("overlong.wav", overlongWave(samples));
    // openWaveFile, the worker's two opens of the first chunk, then the check after it.
    presetAnswers({ANSWER_YES, ANSWER_YES, ANSWER_YES, ANSWER_NO});
    openAndWait(path);
    EXPECT_EQ(lastMessageText(), "Input Wave file could not be opened by cantoscopeWaveformData (2)");
    uint32_t blocks = song.blockCount;
    EXPECT_GT(blocks, 0u);
    EXPECT_LT(blocks, uint32_t(samples.size() / 2 / BLOCK));
    std::vector<uint8_t> stored = workingSamples();
    ASSERT_EQ(stored.size(), size_t(blocks) * BLOCK * 2);
    EXPECT_TRUE(std::equal(stored.begin(), stored.end(), samples.begin()));
    EXPECT_EQ(storedIndexCount("CS.fi"), blocks);
}

std::vector<std::thread::id> redrawThreads;   // threads the song view was redrawn on

TEST_F(OpenWaveWorker, OnlyTheMainThreadRedrawsTheSongView) {
    redrawThreads.clear();
    static const FrameWindowFunctions functions = {
        [] { songWindowOpened(); }, [] { redrawThreads.push_back(std::this_thread::get_id()); }, nullptr, nullptr};
    setFrameWindowFunctions(&functions);
    openAndWait(writeMono("melody.wav", melodyBytes(3.0)));
    EXPECT_TRUE(frameState.songWindowOpen);
    ASSERT_GE(redrawThreads.size(), 2u) << "during the opening and at its end";
    for (std::thread::id id : redrawThreads) EXPECT_EQ(id, std::this_thread::get_id());
}

// ---- the level meter ----

using OpenWaveLevelMeter = OpenWaveTest;

std::vector<uint8_t> constantSamples(int value, uint32_t count, int bits) {
    std::vector<double> x(count, bits == 16 ? double(value) : double(value) - 128.0);
    return toSampleBytes(x, bits);
}

TEST_F(OpenWaveLevelMeter, LevelsFollowTheLogarithmicRule) {
    // 16 bits: reference 23166.269; rms 2000 gives 255 x log10(1277.05) / log10(22443.32) = 182.04.
    EXPECT_EQ(levelMeterValue(constantSamples(-2000, 64, 16).data(), 64, 16), 182);
    EXPECT_EQ(levelMeterValue(constantSamples(0, 64, 16).data(), 64, 16), 0);
    // At or below a thirty-second of the reference there is no bar.
    EXPECT_EQ(levelMeterValue(constantSamples(723, 64, 16).data(), 64, 16), 0);
    EXPECT_EQ(levelMeterValue(constantSamples(23167, 64, 16).data(), 64, 16), 255);
    EXPECT_EQ(levelMeterValue(constantSamples(32767, 64, 16).data(), 64, 16), 255) << "louder is full scale";
    // 8 bits: reference 89.789; 128 + 40 gives 255 x log10(38.194) / log10(87.983) = 207.47.
    EXPECT_EQ(levelMeterValue(constantSamples(168, 64, 8).data(), 64, 8), 207);
    EXPECT_EQ(levelMeterValue(constantSamples(128, 64, 8).data(), 64, 8), 0);
    EXPECT_EQ(levelMeterValue(nullptr, 0, 16), 0);
}

TEST_F(OpenWaveLevelMeter, EachChunkPushesItsLevelIntoTheHistory) {
    for (int i = 1; i <= 40; i++) pushLevelMeterValue(i);
    EXPECT_EQ(levelMeter.levels[0], 9);
    EXPECT_EQ(levelMeter.levels[LEVEL_METER_BARS - 1], 40);

    resetOpeningState();
    std::vector<uint8_t> tone = toneBytes(220, 2.0);
    openAndWait(writeMono("tone.wav", tone));
    int expected = levelMeterValue(tone.data(), 16384, 16);
    ASSERT_GT(expected, 100);
    int filled = 0;
    for (int level : levelMeter.levels) {
        if (level == 0) continue;
        filled++;
        EXPECT_NEAR(level, expected, 1);
    }
    // The 172 whole blocks of 2.0 s arrive in five chunks: a top frame (16384 samples) and
    // its lead-in, three top frames, and the last 14336 samples.
    EXPECT_EQ(filled, 5);
}

}  // namespace
