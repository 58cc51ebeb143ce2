// Playback through a real sound server (the private daemon of tools/with-pulse.sh), heard at
// its null sink's monitor: Wave mode plays the range sample for sample and ends when the last
// sample has been heard; the cursor follows what is heard; a stop silences at once; MIDI mode
// sounds each note at its pitch and time.
#include <gtest/gtest.h>

#include <chrono>
#include <algorithm>
#include <cmath>
#include <thread>
#include <vector>

#include "../../playback/playbackFixtures.h"
#include "../../shell/frameFixtures.h"
#include "monitorCapture.h"
#include "platform/media.h"
#include "shell/commandTable.h"
#include "platform/pulse/pulseBackends.h"
#include "playback/midiOutput.h"
#include "playback/playback.h"
#include "playback/playbackState.h"

namespace {

const uint32_t RATE = 44100;
const uint32_t BLOCK = 512;

// 258 blocks (about 3 s) of noise bursts: 0.1 s of noise at the start of every quarter second,
// silence between, so that every moment of the song can be found in what is heard.
std::vector<int16_t> burstSong() {
    std::vector<int16_t> samples(258 * BLOCK);
    uint32_t seed = 12345;
    for (size_t n = 0; n < samples.size(); n++) {
        seed = seed * 1664525u + 1013904223u;
        bool burst = n % (RATE / 4) < RATE / 10;
        samples[n] = burst ? int16_t(int32_t(seed >> 16) % 16000 - 8000) : 0;
    }
    return samples;
}

class PulsePlayback : public FrameTest {
protected:
    void SetUp() override {
        FrameTest::SetUp();
        resetPlaybackState();
        installPulseMedia();
        commandOperations.playSong = playSong;
        ASSERT_TRUE(monitor.start()) << "no sound server: run the test through tools/with-pulse.sh";
    }
    void TearDown() override {
        stopPlayback();
        monitor.stop();
        setMediaBackend(nullptr);
        fileDelete(sharedFilePath("CS.fw"));
        resetPlaybackState();
        FrameTest::TearDown();
    }
    // Serves the main loop until playback has ended (or timeoutMs), noting each cursor move;
    // returns the clock reading at which it ended.
    uint32_t serveUntilStopped(int timeoutMs) {
        uint32_t begun = clockMilliseconds();
        int lastCursor = -1;
        while (isPlaying() && clockMilliseconds() - begun < uint32_t(timeoutMs)) {
            if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
            if (playbackState.cursor != lastCursor && isPlaying()) {
                lastCursor = playbackState.cursor;
                cursorMoves.push_back({clockMilliseconds(), lastCursor});
            }
        }
        return clockMilliseconds();
    }
    static void pause(int ms) { std::this_thread::sleep_for(std::chrono::milliseconds(ms)); }

    struct CursorMove {
        uint32_t clockMs;
        int cursor;   // hundredths of a second
    };
    std::vector<CursorMove> cursorMoves;
    MonitorCapture monitor;
};

}  // namespace

TEST_F(PulsePlayback, WaveModePlaysTheRangeSampleForSampleWithTheCursorOnTheSound) {
    std::vector<int16_t> samples = burstSong();
    storeSongAudio(RATE, BLOCK, samples);
    showSongView();
    pause(200);
    playSong(0.5, 2.5, 0);
    ASSERT_EQ(isPlaying(), 1) << lastMessageText();
    uint32_t ended = serveUntilStopped(6000);
    EXPECT_FALSE(isPlaying());
    EXPECT_FALSE(fileExists(sharedFilePath(PLAYBACK_WAVE_FILE)));
    pause(300);
    monitor.stop();

    std::vector<int16_t> played(samples.begin() + RATE / 2, samples.begin() + RATE * 5 / 2);
    const std::vector<int16_t>& heard = monitor.samples();
    long k = findExactly(heard, played, 256);
    ASSERT_GE(k, 0) << "the range's first samples were never heard";
    ASSERT_LE(size_t(k) + played.size(), heard.size());
    EXPECT_EQ(correlation(&heard[k], played.data(), played.size()), 1.0);
    EXPECT_TRUE(std::equal(played.begin(), played.end(), heard.begin() + k));
    // Nothing before the range's start nor after its end.
    EXPECT_TRUE(std::all_of(heard.begin(), heard.begin() + k, [](int16_t s) { return s == 0; }));
    EXPECT_TRUE(std::all_of(heard.begin() + k + long(played.size()), heard.end(), [](int16_t s) { return s == 0; }));

    // The end notice comes when the last sample is heard, not when it was handed over.
    double lastHeard = monitor.heardAt(size_t(k) + played.size() - 1);
    EXPECT_GE(double(ended), lastHeard - 30);
    EXPECT_LE(double(ended), lastHeard + 150);

    // Each cursor position is the song time being heard when it was set, within 30 ms.
    int compared = 0;
    for (const CursorMove& move : cursorMoves) {
        double index = monitor.sampleAt(move.clockMs);
        if (index < k || index >= k + double(played.size())) continue;
        double heardTime = 0.5 + (index - k) / RATE;
        EXPECT_NEAR(move.cursor / 100.0, heardTime, 0.030) << "at clock " << move.clockMs;
        compared++;
    }
    EXPECT_GE(compared, 40);
}

TEST_F(PulsePlayback, StoppingSilencesThePlaybackAtOnceAndNoEndNoticeFollows) {
    std::vector<int16_t> samples = burstSong();
    storeSongAudio(RATE, BLOCK, samples);
    showSongView();
    playSong(-1.0, -1.0, 0);
    ASSERT_EQ(isPlaying(), 1) << lastMessageText();
    uint32_t begun = clockMilliseconds();
    while (clockMilliseconds() - begun < 700) serveMainLoopOnce();
    dispatchCommand(CMD_PLAY_STOP);
    uint32_t stopped = clockMilliseconds();
    EXPECT_FALSE(isPlaying());
    EXPECT_FALSE(fileExists(sharedFilePath(PLAYBACK_WAVE_FILE)));
    pause(500);
    EXPECT_EQ(serveMainLoopOnce(), 0);   // no notice of the closed device waits
    monitor.stop();
    const std::vector<int16_t>& heard = monitor.samples();
    size_t firstSilent = 0;
    while (firstSilent < heard.size() && monitor.heardAt(firstSilent) < stopped + 50.0) firstSilent++;
    ASSERT_LT(firstSilent, heard.size());
    EXPECT_TRUE(std::all_of(heard.begin() + long(firstSilent), heard.end(), [](int16_t s) { return s == 0; }));
    EXPECT_TRUE(std::any_of(heard.begin(), heard.begin() + long(firstSilent), [](int16_t s) { return s != 0; }));
}

TEST_F(PulsePlayback, MidiModeSoundsEachNoteAtItsPitchAndTime) {
    const int keys[4] = {69, 72, 76, 67};   // A4, C5, E5, G4
    openSong(320, 0);   // 2.5 s; the MIDI output needs no audio
    for (int i = 0; i < 4; i++) {
        Note note{};
        note.midiNote = uint8_t(keys[i]);
        note.pitch = float(440.0 * std::pow(2.0, (keys[i] - 69) / 12.0));
        note.midiStart = note.waveStart = 0.25f + 0.5f * float(i);
        note.midiEnd = note.waveEnd = note.midiStart + 0.5f;
        note.volumeSum = 200u * 43u;
        ASSERT_EQ(appendNote(note), 1);
    }
    displayModes.playbackMode = PLAYBACK_MODE_MIDI;
    displayModes.noteMode = NOTE_MODE_NOTE;
    playSong(-1.0, -1.0, 0);
    ASSERT_EQ(isPlaying(), 1) << lastMessageText();
    serveUntilStopped(8000);
    EXPECT_FALSE(isPlaying());
    EXPECT_FALSE(fileExists(sharedFilePath("Temp0001.dat")));
    monitor.stop();

    const std::vector<int16_t>& heard = monitor.samples();
    size_t onset = 0;
    while (onset < heard.size() && std::abs(int(heard[onset])) < 300) onset++;
    ASSERT_LT(onset, heard.size()) << "nothing was heard";
    for (int i = 0; i < 4; i++) {
        SCOPED_TRACE(keys[i]);
        size_t from = onset + size_t((0.5 * i + 0.15) * RATE);
        size_t n = size_t(0.25 * RATE);
        double own = tonePower(heard, from, n, 440.0 * std::pow(2.0, (keys[i] - 69) / 12.0));
        for (int j = 0; j < 4; j++) {
            if (j == i) continue;
            double other = tonePower(heard, from, n, 440.0 * std::pow(2.0, (keys[j] - 69) / 12.0));
            EXPECT_GT(own, 10 * other) << "against " << keys[j];
        }
    }
}

TEST_F(PulsePlayback, ADeviceNoticesItsEndOnceAndRefusesWhatItCannotPlay) {
    static int notices = 0;
    notices = 0;
    std::vector<int16_t> samples = burstSong();
    storeSongAudio(RATE, BLOCK, samples);
    ASSERT_EQ(writeWaveSegment(sharedFilePath("probe.wav"), 0.0, 0.3), 1);
    int device = -1;
    ASSERT_EQ(mediaOpen(MEDIA_TYPE_WAVEAUDIO, sharedFilePath("probe.wav"), &device), MEDIA_OK);
    ASSERT_EQ(mediaPlay(device, [](int) { notices++; }), MEDIA_OK);
    uint32_t begun = clockMilliseconds();
    while (notices == 0 && clockMilliseconds() - begun < 3000) serveMainLoopOnce();
    EXPECT_EQ(notices, 1);
    EXPECT_GE(clockMilliseconds() - begun, 280u);
    EXPECT_EQ(mediaClose(device), MEDIA_OK);
    EXPECT_EQ(mediaClose(device), MEDIA_ERROR_DEVICE);

    ASSERT_EQ(writeNotesMidiFile(sharedFilePath("notes.mid"), 0, 1, -1.0, -1.0), 1);
    setenv("MELODRIFT_SOUNDFONT", sharedFilePath("missing.sf2").c_str(), 1);
    EXPECT_EQ(mediaOpen(MEDIA_TYPE_SEQUENCER, sharedFilePath("notes.mid"), &device), MEDIA_ERROR_NO_SOUNDFONT);
    unsetenv("MELODRIFT_SOUNDFONT");
    ASSERT_EQ(mediaOpen(MEDIA_TYPE_SEQUENCER, sharedFilePath("notes.mid"), &device), MEDIA_OK);
    int second = -1;
    EXPECT_EQ(mediaOpen(MEDIA_TYPE_SEQUENCER, sharedFilePath("notes.mid"), &second), MEDIA_ERROR_IN_USE);
    EXPECT_EQ(mediaClose(device), MEDIA_OK);

    writeFileText(sharedFilePath("not.mid"), "MThd and then nothing of use");
    EXPECT_EQ(mediaOpen(MEDIA_TYPE_SEQUENCER, sharedFilePath("not.mid"), &device), MEDIA_ERROR_FILE);
    EXPECT_EQ(mediaOpen(MEDIA_TYPE_WAVEAUDIO, sharedFilePath("not.mid"), &device), MEDIA_ERROR_FILE);
    fileDelete(sharedFilePath("probe.wav"));
    fileDelete(sharedFilePath("not.mid"));
    fileDelete(sharedFilePath("notes.mid"));
}
