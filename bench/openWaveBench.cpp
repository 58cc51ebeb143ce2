// Opening a generated melody (44,100 Hz, 16-bit, mono; 60 s by default) the way the program
// opens a file: start-up, openWaveFile on the main loop, CSOpenWaveFileDataThread reading,
// analysing, storing and recognising chunk by chunk, the worker's end served by the loop.
// Reported: the real-time factor from openWaveFile to the worker's end (seconds of audio per
// second of wall time), the processor time, and the user-interface thread's longest stall while
// the opening runs: how late a 10 ms timer on the headless main loop came at worst, and how long
// openWaveFile itself held the thread.
//
//   openWaveBench [SECONDS] [--boost] [--enhanced]
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <string>
#include <vector>

#include "benchFolder.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/openWaveWorker.h"
#include "notes/noteList.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/mainFrame.h"
#include "shell/settings.h"
#include "shell/startup.h"
#include "store/song.h"
#include "tests/analysis/signalGenerator.h"

static const int TICK_TIMER_ID = 0x0B0001;
static const int TICK_MS = 10;

static double wallSeconds() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

static double processorSeconds() {
    timespec t;
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &t);
    return double(t.tv_sec) + double(t.tv_nsec) * 1e-9;
}

struct BenchRun {
    std::string path;          // the wave file
    double openStart;          // wall time openWaveFile was called
    double openCall;           // seconds openWaveFile held the main thread
    double end;                // wall time the worker's end was served
    double lastTick;           // wall time of the previous timer call
    double longestGap;         // seconds between two timer calls at worst
    int ticks;                 // timer calls while the opening ran
    bool started;              // the opening was started
};
static BenchRun run;

static void tick() {
    double now = wallSeconds();
    if (run.lastTick > 0) run.longestGap = std::max(run.longestGap, now - run.lastTick);
    run.lastTick = now;
    run.ticks++;
}

// openingEnded clears the flag and then redraws: the first redraw without the flag is the end.
static const FrameWindowFunctions windowFunctions = {
    nullptr,
    [] {
        if (!run.started || audioActivity.opening || run.end > 0) return;
        run.end = wallSeconds();
        postQuit(0);
    },
    nullptr, nullptr};

int main(int argc, char** argv) {
    double seconds = 60.0;
    bool boost = false, enhanced = false;
    for (int i = 1; i < argc; i++) {
        if (std::strcmp(argv[i], "--boost") == 0) boost = true;
        else if (std::strcmp(argv[i], "--enhanced") == 0) enhanced = true;
        else seconds = std::atof(argv[i]);
    }
    std::string benchFolder = makeBenchFolder("openWaveBench");
    const char* folder = benchFolder.c_str();
    if (seconds <= 0) return 1;
    std::string config = std::string(folder) + "/config";
    setenv("MELODRIFT_CONFIG_DIR", config.c_str(), 1);
    run.path = std::string(folder) + "/melody.wav";
    if (!writeMelodyWave(run.path, seconds)) return 1;

    StartupOptions options{};
    options.sharedBasePath = folder;
    setUiEcho(true);   // a message during the run is a failure worth seeing
    if (!startUp(options)) return 1;
    generalSettings.enhancedPitchAccuracy = enhanced;
    globalSettings.boostSpeed = boost;
    setFrameWindowFunctions(&windowFunctions);
    double processorStart = processorSeconds();
    postToMainLoop([] {
        startTimer(TICK_TIMER_ID, TICK_MS, tick);
        run.openStart = wallSeconds();
        openWaveFile(run.path);
        run.openCall = wallSeconds() - run.openStart;
        run.started = audioActivity.opening;
        run.lastTick = wallSeconds();
        if (!run.started) postQuit(1);
    });
    int exitCode = runMessageLoop();
    double processor = processorSeconds() - processorStart;
    stopTimer(TICK_TIMER_ID);
    uint32_t blocks = song.blockCount;
    int notes = noteList.count;
    closeSong();
    shutDown(0);
    if (exitCode != 0 || run.end <= 0) {
        std::printf("the opening did not run\n");
        return 1;
    }
    double wall = run.end - run.openStart;
    double stall = std::max(run.openCall, run.longestGap - TICK_MS / 1000.0);
    std::printf("%s%s %4.0f s melody: %u blocks, %d notes\n", boost ? "boost" : "default", enhanced ? "+enhanced" : "",
                seconds, blocks, notes);
    std::printf("  openWaveFile to the worker's end: %6.2f s wall  %6.1fx real time  (%.2f s processor, both threads)\n",
                wall, seconds / wall, processor);
    std::printf("  user-interface thread: openWaveFile held it %.1f ms; 10 ms timer: %d calls, longest gap %.1f ms; "
                "longest stall %.1f ms\n",
                run.openCall * 1000, run.ticks, run.longestGap * 1000, stall * 1000);
    return 0;
}
