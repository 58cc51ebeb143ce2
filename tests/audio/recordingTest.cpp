// Live recording from the wave-file feeder, as fast as the analysis takes it, with the clock
// stopped so that recognition runs after every chunk: the recording's samples and notes against
// an opening of the same file, the finalised working file, the format a recording takes, the
// presses, the refusals, the end of a full disk or a failed input, and what is kept of a
// recording the program did not finish.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "analysis/frequencyAnalysis.h"
#include "analysis/noteRecognition.h"
#include "analysis/recognitionOptions.h"
#include "analysis/signalGenerator.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/recording.h"
#include "audio/waveFixtures.h"
#include "audio/waveWorkingFile.h"
#include "notes/noteList.h"
#include "platform/capture.h"
#include "platform/clock.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "playback/pointerInfo.h"
#include "shell/closeSong.h"
#include "shell/paths.h"
#include "shell/recordingView.h"
#include "shell/settings.h"
#include "shell/startup.h"
#include "store/song.h"
#include "support/testSupport.h"

namespace {

const uint32_t RATE = 44100;

std::vector<uint8_t> melodyBytes(double seconds, uint32_t rate = RATE) {
    MelodyGenerator generator;
    generator.rate = rate;
    std::vector<uint8_t> bytes(size_t(seconds * rate) * 2);
    generator.fill16(bytes.data(), uint32_t(bytes.size() / 2));
    return bytes;
}

std::vector<int16_t> samplesOf(const std::vector<uint8_t>& bytes, size_t from = 0) {
    std::vector<int16_t> samples;
    for (size_t i = from; i + 1 < bytes.size(); i += 2) samples.push_back(int16_t(bytes[i] | bytes[i + 1] << 8));
    return samples;
}

int speedWarnings = 0;


class Recording : public ::testing::Test {
protected:
    void SetUp() override {
        savedPaths = paths;
        setSharedBasePath(folder.path());
        makeFolder(paths.sharedFolder);
        clean();
        setManualClock(true);
        setCaptureEventHandler([] { handleCaptureNotification(); });
    }
    void TearDown() override {
        clean();
        recordingHooks = RecordingHooks{};
        setCaptureEventHandler(nullptr);
        setManualClock(false);
        paths = savedPaths;
        setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
    }
    void clean() {
        resetRecordingState();
        resetOpeningState();
        resetMainLoop();
        releaseFrequencyAnalysis();
        closeSong();
        resetNoteRecognition();
        resetSettings();
        resetRecognitionOptions();
        setCaptureBackend(nullptr);
        releaseCaptureObject();
        appState.directSoundAvailable = false;
        recordingHooks = RecordingHooks{nullptr, nullptr, recordingStateChanged, nullptr};
        setFreeDiskSpaceOverride(int64_t(1) << 40);
        audioActivity = AudioActivity{};
        clearUiCalls();
        speedWarnings = 0;
    }
    std::string writeMelody(const std::string& name, double seconds, uint32_t rate = RATE) {
        std::string path = folder.file(name);
        writeFileBytes(path, pcmWave(1, rate, 16, melodyBytes(seconds, rate)));
        return path;
    }
    void useFeeder(const std::string& path) {
        ASSERT_EQ(installCaptureFeeder(path, 0.0), 1);
        appState.directSoundAvailable = createCaptureObject();
    }
    double secondsStored() {
        return double(recordedBytesStored() - recordingState.startBytes) / (song.waveFormat.samplesPerSec * 2.0);
    }
    // Serves the main loop until pred holds (or ten seconds of real time have passed).
    template <class Pred> bool serveUntil(Pred pred) {
        auto end = std::chrono::steady_clock::now() + std::chrono::seconds(10);
        while (!pred() && std::chrono::steady_clock::now() < end)
            if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::microseconds(500));
        return pred();
    }
    // Records until seconds are stored, stops as the user does, and waits for the end.
    void recordFor(double seconds) {
        ASSERT_EQ(startRecording(), 0) << lastMessageText();
        ASSERT_TRUE(audioActivity.recording);
        ASSERT_TRUE(serveUntil([&] { return secondsStored() >= seconds; }));
        advanceManualClock(1000);   // the stop is no bounce of the start
        ASSERT_EQ(startRecording(), 0);
        ASSERT_TRUE(serveUntil([] { return !audioActivity.recording; }));
    }
    std::vector<uint8_t> workingFile() {
        std::string copy = folder.file("working copy");
        writeFileBytes(copy, readFileBytes(sharedFilePath("CS.fw")));
        applyWaveMask(copy, WAVE_PLAIN);
        return readFileBytes(copy);
    }
    TempFolder folder;
    Paths savedPaths;
};

}  // namespace

TEST_F(Recording, ARecordingHoldsWhatWasCapturedAndTheNotesOfAnOpeningOfIt) {
    std::string melody = writeMelody("melody.wav", 6.0);
    ASSERT_EQ(openWaveFile(melody), 1);
    waitForOpeningToEnd();
    std::vector<Note> opened(noteList.notes, noteList.notes + noteList.count);
    closeSong();
    resetNoteRecognition();
    ASSERT_GE(opened.size(), 12u);

    useFeeder(melody);
    recordFor(6.0);
    EXPECT_EQ(messageCount(), 0) << lastMessageText();
    EXPECT_EQ(recordLabel(), std::string("&Record Audio..."));
    // Sample for sample what was fed, then the silence that followed it.
    std::vector<int16_t> fed = samplesOf(melodyBytes(6.0));
    std::vector<int16_t> recorded = samplesOf(workingFile(), WORKING_WAVE_HEADER_BYTES);
    ASSERT_GE(recorded.size(), fed.size());
    EXPECT_TRUE(std::equal(fed.begin(), fed.end(), recorded.begin()));
    EXPECT_TRUE(std::all_of(recorded.begin() + long(fed.size()), recorded.end(), [](int16_t s) { return s == 0; }));
    // The notes are the opening's, but for the last, which the silence after it may lengthen.
    ASSERT_GE(size_t(noteList.count), opened.size());
    for (size_t i = 0; i + 1 < opened.size(); i++) {
        EXPECT_EQ(noteList.notes[i].midiNote, opened[i].midiNote) << "note " << i;
        EXPECT_NEAR(noteList.notes[i].waveStart, opened[i].waveStart, 1e-4) << "note " << i;
        EXPECT_NEAR(noteList.notes[i].waveEnd, opened[i].waveEnd, 1e-4) << "note " << i;
    }
}

TEST_F(Recording, TheWorkingFileIsFinalisedToTheSongsLength) {
    useFeeder(writeMelody("melody.wav", 3.0));
    recordFor(2.0);
    std::vector<uint8_t> file = workingFile();
    uint32_t frames = uint32_t(std::llround(songDuration() * RATE));
    ASSERT_GT(frames, uint32_t(2.0 * RATE));
    EXPECT_EQ(file.size(), WORKING_WAVE_HEADER_BYTES + frames * 2);
    EXPECT_EQ(getU32(file, 52), frames * 2);                     // data bytes
    EXPECT_EQ(getU32(file, WORKING_WAVE_FACT_OFFSET), frames);   // samples
    EXPECT_EQ(getU32(file, 4), file.size() - 8);                 // RIFF size
    EXPECT_FALSE(fileExists(sharedFilePath(RECORDING_MARKER_FILE)));
    // At rest the working file is masked again.
    EXPECT_NE(readFileBytes(sharedFilePath("CS.fw"))[0], 'R');
}

TEST_F(Recording, TheQualitySettingChoosesTheFormatOfANewSongButTheSongsFormatWinsWhenAppending) {
    useFeeder(writeMelody("melody.wav", 3.0));
    globalSettings.inputWaveQuality = 9;   // "Medium": 22,050 Hz 16-bit
    recordFor(1.0);
    std::vector<uint8_t> file = workingFile();
    EXPECT_EQ(getU16(file, 22), 1);          // channels
    EXPECT_EQ(getU32(file, 24), 22050u);     // rate
    EXPECT_EQ(getU16(file, 34), 16);         // bits
    EXPECT_EQ(song.waveFormat.samplesPerSec, 22050u);

    double first = songDuration();
    globalSettings.inputWaveQuality = 5;   // "High" is chosen now, but the song is 22,050 Hz
    recordFor(1.0);
    EXPECT_EQ(recordingState.captureFormat.rate, 22050u);
    EXPECT_EQ(getU32(workingFile(), 24), 22050u);
    EXPECT_GT(songDuration(), first + 0.9);
}

TEST_F(Recording, APressSoonAfterTheStopIsIgnoredAndALaterOneEndsTheFinishingAtOnce) {
    useFeeder(writeMelody("melody.wav", 10.0));
    ASSERT_EQ(startRecording(), 0);
    ASSERT_TRUE(serveUntil([&] { return secondsStored() >= 4.0; }));
    advanceManualClock(1000);
    // Hold the worker back so that the finishing lasts: it cannot take a chunk.
    std::unique_lock<std::mutex> processing(CSWaveProcessingMutex);
    ASSERT_EQ(startRecording(), 0);   // stop
    EXPECT_EQ(recordingState.stopPending, 1);
    EXPECT_EQ(recordLabel(), std::string("Finishing..."));
    EXPECT_TRUE(pointerInfo.finishing);
    advanceManualClock(50);
    ASSERT_EQ(startRecording(), 0);   // 0.05 s later: its bounce
    processing.unlock();
    ASSERT_TRUE(serveUntil([] { return !audioActivity.recording; }));
    double drained = songDuration();
    EXPECT_GE(drained, 4.0);   // everything stored was analysed

    closeSong();
    ASSERT_EQ(startRecording(), 0);
    ASSERT_TRUE(serveUntil([&] { return secondsStored() >= 2.0; }));
    processing.lock();   // the worker cannot follow what is stored from now on
    double held = secondsStored();
    ASSERT_TRUE(serveUntil([&] { return secondsStored() >= held + 1.0; }));
    advanceManualClock(1000);
    ASSERT_EQ(startRecording(), 0);   // stop
    advanceManualClock(200);
    ASSERT_EQ(startRecording(), 0);   // 0.2 s later: the finishing ends without analysing the rest
    processing.unlock();
    ASSERT_TRUE(serveUntil([] { return !audioActivity.recording; }));
    EXPECT_LT(songDuration(), held + 0.5);
    std::vector<uint8_t> file = workingFile();
    EXPECT_EQ(file.size(), WORKING_WAVE_HEADER_BYTES + getU32(file, 52));
}

TEST_F(Recording, FreeSpaceBelow20MiBStopsTheRecordingAndKeepsWhatWasRecorded) {
    useFeeder(writeMelody("melody.wav", 10.0));
    ASSERT_EQ(startRecording(), 0);
    ASSERT_TRUE(serveUntil([&] { return secondsStored() >= 2.0; }));
    setFreeDiskSpaceOverride(RECORDING_DISK_SPACE_STOP - 1);
    ASSERT_TRUE(serveUntil([] { return !audioActivity.recording; }));
    EXPECT_EQ(lastMessageText(), RECORDING_DISK_VERY_LOW_TEXT);
    EXPECT_GE(songDuration(), 2.0);
    std::vector<uint8_t> file = workingFile();
    EXPECT_EQ(getU32(file, 52), uint32_t(std::llround(songDuration() * RATE)) * 2);
}

TEST_F(Recording, AnInputThatFailsEndsTheRecordingWithWhatItHadCaptured) {
    useFeeder(writeMelody("melody.wav", 10.0));
    ASSERT_EQ(startRecording(), 0);
    ASSERT_TRUE(serveUntil([&] { return secondsStored() >= 2.0; }));
    reportCaptureFailure();
    ASSERT_TRUE(serveUntil([] { return !audioActivity.recording; }));
    EXPECT_GE(songDuration(), 2.0);
    EXPECT_EQ(getU32(workingFile(), 52), uint32_t(std::llround(songDuration() * RATE)) * 2);
}

TEST_F(Recording, RefusalsLeaveTheSongAsItWas) {
    struct Case {
        const char* what;
        bool captureObject;
        int64_t freeSpace;
        int quality;
        bool opening;
        const char* message;
    };
    const Case cases[] = {
        {"no capture object", false, int64_t(1) << 40, 5, false, NO_DIRECTSOUND_TEXT},
        {"less than 100 MiB free", true, RECORDING_DISK_SPACE_MINIMUM - 1, 5, false, RECORDING_DISK_LOW_TEXT},
        {"a quality the input cannot give", true, int64_t(1) << 40, 20, false, QUALITY_NOT_AVAILABLE_TEXT},
        {"an opening runs", true, int64_t(1) << 40, 5, true, "Sorry - this cannot be done whilst opening audio."},
    };
    std::string melody = writeMelody("melody.wav", 1.0);
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        clean();
        if (c.captureObject) useFeeder(melody);
        setFreeDiskSpaceOverride(c.freeSpace);
        globalSettings.inputWaveQuality = c.quality;
        audioActivity.opening = c.opening;
        EXPECT_EQ(startRecording(), 1);
        EXPECT_EQ(lastMessageText(), c.message);
        EXPECT_FALSE(audioActivity.recording);
        EXPECT_FALSE(captureBufferCreated());
        EXPECT_FALSE(fileExists(sharedFilePath("CS.fw")));
        audioActivity.opening = false;
    }
}

TEST_F(Recording, TheInformationBoxComesOnceWhenTheAnalysisFallsFiveSecondsBehind) {
    recordingHooks.showSpeedWarning = [] { speedWarnings++; };
    song.waveFormat = SongWaveFormat{1, 1, RATE, RATE * 2, 2, 16};
    analysisGeometry.sampleRate = RATE;
    openingState.recordedBytes = 10 * RATE * 2;
    recordingChunkDone(uint32_t(5.5 * RATE));   // 4.5 s behind
    serveMainLoopOnce();
    EXPECT_EQ(speedWarnings, 0);
    recordingChunkDone(4 * RATE);   // 6 s behind
    recordingChunkDone(3 * RATE);
    serveMainLoopOnce();
    EXPECT_EQ(speedWarnings, 1);
    EXPECT_DOUBLE_EQ(recordingState.processingLag, 7.0);

    recordingState.speedWarningShown = false;
    maximizeRecordingSpeed();   // boost on and "Low" quality: the box is not needed again
    EXPECT_EQ(lastMessageText(), SPEED_CHANGES_LATER_TEXT);
    EXPECT_EQ(globalSettings.inputWaveQuality, 8);
    recordingChunkDone(0);
    setShowSpeedWarning(false);
    globalSettings.boostSpeed = false;
    recordingChunkDone(0);
    serveMainLoopOnce();
    EXPECT_EQ(speedWarnings, 1);
}

TEST_F(Recording, CompandingBringsEachSecondToOneLevelAndRefusesSilence) {
    const uint32_t rate = 320;   // segments of 10 samples, windows of 32 segments
    std::vector<uint8_t> wave(rate * 2, 128);
    for (uint32_t i = 0; i < rate; i++) wave[i] = uint8_t(i % 2 ? 128 + 8 : 128 - 8);                 // quiet second
    for (uint32_t i = rate; i < 2 * rate; i++) wave[i] = uint8_t(i % 2 ? 128 + 100 : 128 - 100);       // loud second
    ASSERT_EQ(compandWave(wave.data(), uint32_t(wave.size()), rate), 1);
    EXPECT_EQ(wave[1], 128 + 24);            // the first window only: 8 x 48 / (8 + 8)
    EXPECT_EQ(wave[0], 128 - 24);
    EXPECT_EQ(wave[rate + 161], 128 + 44);   // the second window only: 100 x 48 / (100 + 8), truncated
    EXPECT_EQ(wave[rate + 1], 128 + 56);     // both: clipped to 127 by the first, then 127 x 48 / 108
    EXPECT_EQ(messageCount(), 0);

    std::vector<uint8_t> silence(rate * 2, 128);
    std::vector<uint8_t> tooShort(5, 200);
    EXPECT_EQ(compandWave(silence.data(), uint32_t(silence.size()), rate), 0);
    EXPECT_EQ(lastMessageText(), COMPAND_TOO_LOW_TEXT);
    clearUiCalls();
    EXPECT_EQ(compandWave(tooShort.data(), uint32_t(tooShort.size()), rate), 0);
    EXPECT_EQ(lastMessageText(), COMPAND_TOO_LOW_TEXT);
    EXPECT_EQ(tooShort[0], 200);
}

TEST_F(Recording, ARecordingThatWasNeverFinishedIsKeptAtTheNextStart) {
    std::vector<uint8_t> take = pcmWave(1, RATE, 16, melodyBytes(0.5));
    writeFileBytes(sharedFilePath("CS.fw"), take);
    EXPECT_EQ(recoverUnfinishedRecording(), "");   // no marker: an ordinary working file
    EXPECT_TRUE(fileExists(sharedFilePath("CS.fw")));

    writeFileBytes(sharedFilePath(RECORDING_MARKER_FILE), {});
    std::string kept = recoverUnfinishedRecording();
    ASSERT_NE(kept, "");
    EXPECT_EQ(kept.rfind(sharedFilePath("Recovered recording "), 0), 0u);
    EXPECT_EQ(readFileBytes(kept), take);
    EXPECT_FALSE(fileExists(sharedFilePath("CS.fw")));
    EXPECT_FALSE(fileExists(sharedFilePath(RECORDING_MARKER_FILE)));
    EXPECT_NE(lastMessageText().find(kept), std::string::npos);
    fileDelete(kept);
}

TEST_F(Recording, BeforeARecordingTheMeterShowsTheInputWithoutKeepingAnything) {
    useFeeder(writeMelody("melody.wav", 3.0));
    ASSERT_EQ(startLevelMonitor(), 1);
    auto levelsShown = [] {
        std::lock_guard<std::mutex> guard(levelMeter.lock);
        return std::count_if(std::begin(levelMeter.levels), std::end(levelMeter.levels), [](int v) { return v > 0; });
    };
    ASSERT_TRUE(serveUntil([&] { return levelsShown() >= 10; }));
    EXPECT_EQ(song.blockCount, 0u);
    EXPECT_FALSE(fileExists(sharedFilePath("CS.fw")));
    EXPECT_FALSE(audioActivity.recording);
    // Record takes the input over from the monitor.
    ASSERT_EQ(startRecording(), 0);
    EXPECT_FALSE(levelMonitorRunning());
    EXPECT_TRUE(audioActivity.recording);
    advanceManualClock(1000);
    startRecording();
    ASSERT_TRUE(serveUntil([] { return !audioActivity.recording; }));
}
