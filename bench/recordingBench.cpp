// Recording a generated melody (60 s by default) in real time: the wave-file feeder stands in
// for a microphone and delivers the melody at its own pace, through the capture buffer, CS.fw
// and the worker's analysis, with the default settings and the real clock.
// Reported: the processing lag (seconds captured but not yet analysed) at its worst and when the
// last second has been captured, the time from the stop to the end of the finishing, and the
// user-interface thread's longest gap between two 10 ms timer calls.
//
//   recordingBench [SECONDS]
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>

#include "audio/audioActivity.h"
#include "audio/recording.h"
#include "benchFolder.h"
#include "notes/noteList.h"
#include "platform/capture.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/startup.h"
#include "store/song.h"

static const int TICK_TIMER_ID = 0x0B0002;

static double wallSeconds() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

struct BenchRun {
    double lastTick = 0;       // wall time of the previous timer call
    double longestGap = 0;     // seconds between two timer calls at worst
    double worstLag = 0;       // seconds
    double longestStore = 0;   // seconds one capture event took on the user-interface thread
};
static BenchRun run;

static double secondsCaptured() {
    uint32_t byteRate = song.waveFormat.samplesPerSec * (song.waveFormat.bitsPerSample / 8);
    return byteRate ? double(recordedBytesStored() - recordingState.startBytes) / byteRate : 0.0;
}

int main(int argc, char** argv) {
    double seconds = argc > 1 ? std::atof(argv[1]) : 60.0;
    if (seconds <= 0) return 1;
    std::string folder = makeBenchFolder("recordingBench");
    setenv("MELODRIFT_CONFIG_DIR", (folder + "/config").c_str(), 1);
    std::string wave = folder + "/melody.wav";
    if (!writeMelodyWave(wave, seconds)) return 1;

    StartupOptions options{};
    options.sharedBasePath = folder;
    setUiEcho(true);
    if (!startUp(options)) return 1;
    if (!installCaptureFeeder(wave, 1.0)) return 1;
    appState.directSoundAvailable = createCaptureObject();
    setCaptureEventHandler([] {
        double begun = wallSeconds();
        handleCaptureNotification();
        run.longestStore = std::max(run.longestStore, wallSeconds() - begun);
    });
    int result = 1;
    postToMainLoop([&] {
        startTimer(TICK_TIMER_ID, 10, [] {
            double now = wallSeconds();
            if (run.lastTick > 0) run.longestGap = std::max(run.longestGap, now - run.lastTick);
            run.lastTick = now;
            run.worstLag = std::max(run.worstLag, double(recordingState.processingLag));
        });
        double begun = wallSeconds();
        if (startRecording() != 0 || !audioActivity.recording) {
            postQuit(1);
            return;
        }
        double started = wallSeconds() - begun;
        run.lastTick = 0;   // the gaps are those while the recording runs
        while (secondsCaptured() < seconds)
            if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        double lagAtEnd = recordingState.processingLag;
        double stopped = wallSeconds();
        stopRecording();
        while (audioActivity.recording)
            if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        double finished = wallSeconds();
        stopTimer(TICK_TIMER_ID);
        std::printf("%.0f s melody recorded in real time (%.1f s): %u blocks, %d notes\n", seconds, stopped - begun,
                    song.blockCount, noteList.count);
        std::printf("  processing lag: %.2f s when the last second was captured, %.2f s at worst\n", lagAtEnd,
                    run.worstLag);
        std::printf("  Record took %.1f ms; from the stop to the end of the finishing: %.2f s\n", started * 1000,
                    finished - stopped);
        std::printf("  user-interface thread: longest gap between two 10 ms timer calls %.1f ms; longest capture "
                    "event %.1f ms\n",
                    run.longestGap * 1000, run.longestStore * 1000);
        closeSong();
        result = 0;
        postQuit(0);
    });
    int exitCode = runMessageLoop();
    releaseCaptureObject();
    return shutDown(exitCode != 0 ? exitCode : result);
}
