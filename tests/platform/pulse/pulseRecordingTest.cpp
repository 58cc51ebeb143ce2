// Recording through a real sound server: a melody played into the test daemon's null sink is
// recorded from its default source (the sink's monitor), as a singer would be from a
// microphone. The song holds what was played, its notes are those of opening the melody's
// file, and the working file is finalised.
#include <gtest/gtest.h>
#include <pulse/error.h>
#include <pulse/simple.h>

#include <chrono>
#include <cmath>
#include <thread>
#include <vector>

#include "../../audio/waveFixtures.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/noteRecognition.h"
#include "analysis/signalGenerator.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/recording.h"
#include "audio/waveWorkingFile.h"
#include "monitorCapture.h"
#include "notes/noteList.h"
#include "platform/capture.h"
#include "platform/clock.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/media.h"
#include "platform/pulse/pulseBackends.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "shell/startup.h"
#include "store/song.h"
#include "support/testSupport.h"

namespace {

const uint32_t RATE = 44100;

class PulseRecording : public ::testing::Test {
protected:
    void SetUp() override {
        savedPaths = paths;
        setSharedBasePath(folder.path());
        makeFolder(paths.sharedFolder);
        resetSettings();
        closeSong();
        clearUiCalls();
        setFreeDiskSpaceOverride(int64_t(1) << 40);
        setManualClock(true);   // recognition after every chunk, as in an opening under test
        setCaptureEventHandler([] { handleCaptureNotification(); });
        installPulseMedia();
        installPulseCapture();
        appState.directSoundAvailable = createCaptureObject();
    }
    void TearDown() override {
        resetRecordingState();
        resetOpeningState();
        releaseCaptureObject();
        setCaptureBackend(nullptr);
        setMediaBackend(nullptr);
        appState.directSoundAvailable = false;
        setCaptureEventHandler(nullptr);
        setManualClock(false);
        closeSong();
        resetMainLoop();
        paths = savedPaths;
        setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
    }
    template <class Pred> bool serveUntil(Pred pred, int seconds) {
        auto end = std::chrono::steady_clock::now() + std::chrono::seconds(seconds);
        while (!pred() && std::chrono::steady_clock::now() < end)
            if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        return pred();
    }
    TempFolder folder;
    Paths savedPaths;
};

std::vector<int16_t> samplesOf(const std::vector<uint8_t>& bytes, size_t from) {
    std::vector<int16_t> samples;
    for (size_t i = from; i + 1 < bytes.size(); i += 2) samples.push_back(int16_t(bytes[i] | bytes[i + 1] << 8));
    return samples;
}

}  // namespace

TEST_F(PulseRecording, AMelodyPlayedIntoTheSinkIsRecordedWithItsSamplesAndNotes) {
    MelodyGenerator generator;
    std::vector<uint8_t> melody(size_t(5.0 * RATE) * 2);
    generator.fill16(melody.data(), uint32_t(melody.size() / 2));
    std::string melodyPath = folder.file("melody.wav");
    writeFileBytes(melodyPath, pcmWave(1, RATE, 16, melody));
    ASSERT_EQ(openWaveFile(melodyPath), 1);
    waitForOpeningToEnd();
    std::vector<Note> opened(noteList.notes, noteList.notes + noteList.count);
    closeSong();
    resetNoteRecognition();
    ASSERT_GE(opened.size(), 10u);

    ASSERT_TRUE(appState.directSoundAvailable) << "no sound server: run the test through tools/with-pulse.sh";
    ASSERT_EQ(startRecording(), 0) << lastMessageText();
    // The melody goes to the sink in one piece, in a stream whose buffer holds all of it: the
    // daemon then plays it without a gap however late this busy process is scheduled, so the
    // recording can be compared sample for sample (playback's own devices have their tests).
    pa_sample_spec spec = {PA_SAMPLE_S16LE, RATE, 1};
    uint32_t bytes = uint32_t(melody.size());
    pa_buffer_attr whole = {bytes, bytes, bytes, uint32_t(-1), uint32_t(-1)};
    int error = 0;
    pa_simple* player =
        pa_simple_new(nullptr, "melodrift-test", PA_STREAM_PLAYBACK, "md_sink", "melody", &spec, nullptr, &whole, &error);
    ASSERT_NE(player, nullptr) << pa_strerror(error);
    ASSERT_EQ(pa_simple_write(player, melody.data(), melody.size(), &error), 0) << pa_strerror(error);
    // Five seconds of melody and the sink's latency; the drain then has nothing left to wait for.
    auto played = std::chrono::steady_clock::now() + std::chrono::milliseconds(5500);
    serveUntil([&] { return std::chrono::steady_clock::now() > played; }, 15);
    EXPECT_EQ(pa_simple_drain(player, &error), 0) << pa_strerror(error);
    pa_simple_free(player);
    std::this_thread::sleep_for(std::chrono::milliseconds(300));
    advanceManualClock(1000);
    ASSERT_EQ(startRecording(), 0);   // stop
    ASSERT_TRUE(serveUntil([] { return !audioActivity.recording; }, 30));
    EXPECT_EQ(messageCount(), 0) << lastMessageText();

    // The working file, finalised: its length is its header and the song's samples.
    std::string copy = folder.file("recorded.wav");
    writeFileBytes(copy, readFileBytes(sharedFilePath("CS.fw")));
    applyWaveMask(copy, WAVE_PLAIN);
    std::vector<uint8_t> file = readFileBytes(copy);
    uint32_t frames = uint32_t(std::llround(songDuration() * RATE));
    EXPECT_EQ(file.size(), WORKING_WAVE_HEADER_BYTES + frames * 2);
    EXPECT_EQ(getU32(file, 52), frames * 2);

    // The played melody stands in the recording: found by its first samples, then compared whole.
    std::vector<int16_t> recorded = samplesOf(file, WORKING_WAVE_HEADER_BYTES);
    std::vector<int16_t> played16 = samplesOf(melody, 0);
    size_t firstSound = 0;
    while (firstSound < played16.size() && played16[firstSound] == 0) firstSound++;
    std::vector<int16_t> probe(played16.begin() + long(firstSound), played16.begin() + long(firstSound) + 2048);
    long at = findExactly(recorded, probe, probe.size());
    ASSERT_GE(at, 0) << "the melody was not found in the recording";
    long shift = at - long(firstSound);
    ASSERT_GE(shift, 0);
    ASSERT_LE(size_t(shift) + played16.size(), recorded.size());
    EXPECT_GT(correlation(&recorded[size_t(shift)], played16.data(), played16.size()), 0.999);

    // The notes are the opening's, shifted by where the melody began. The recording's blocks
    // fall at another phase of the melody than the file's (the silence before it is any length),
    // so a note or two may start a block apart or split differently.
    double offset = double(shift) / RATE;
    int matched = 0;
    for (const Note& n : opened)
        for (int i = 0; i < noteList.count; i++) {
            const Note& m = noteList.notes[i];
            if (m.midiNote == n.midiNote && std::fabs(m.waveStart - offset - n.waveStart) < 0.05) {
                matched++;
                break;
            }
        }
    double precision = double(matched) / noteList.count, recall = double(matched) / double(opened.size());
    EXPECT_GE(2 * precision * recall / (precision + recall), 0.85) << matched << " of " << opened.size() << " and "
                                                                    << noteList.count;
}
