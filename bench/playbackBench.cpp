// Playback of a long song through the sound server (run it through tools/with-pulse.sh, or on a
// desktop): a generated melody (5 minutes by default) is opened as the program opens a file,
// then played in Wave mode.
// Reported:
//   - from Play to the first samples handed to the sound server, over ten starts from the
//     beginning of the song (the whole song is cut into the playback file each time);
//   - while it plays, with the song view painted offscreen at 1280 x 720 at every redraw the
//     playback asks for (as the desktop program does): the longest and mean time between two
//     repaints, and the longest and mean time one picture takes, in Note and in Detail mode.
//
//   playbackBench [SECONDS]
#include <QApplication>
#include <QImage>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "app/songViewPainter.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "benchFolder.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "platform/clock.h"
#include "platform/mainloop.h"
#include "platform/pulse/pulseBackends.h"
#include "platform/ui.h"
#include "playback/playback.h"
#include "playback/songViewGeometry.h"
#include "shell/closeSong.h"
#include "shell/mainFrame.h"
#include "shell/startup.h"
#include "store/ftBlockStore.h"
#include "store/song.h"

static double wallMs() {
    return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

struct Repaints {
    QImage* image = nullptr;
    std::vector<double> at;       // wall ms of each repaint
    std::vector<double> took;     // ms each picture took
};
static Repaints repaints;

// The desktop program's song view loads the FT blocks it shows in Detail mode before painting.
static void loadVisibleBlocks() {
    if (displayModes.noteMode != NOTE_MODE_DETAIL || song.blockCount == 0) return;
    uint32_t from = blockAtTime(std::max(0.0, xToTime(songViewGeometry.plotLeft)));
    uint32_t to = std::min(song.blockCount, blockAtTime(std::max(0.0, xToTime(repaints.image->width()))) + 1);
    if (from < ftBlockWindow.firstBlock || to > ftBlockWindow.endBlock) loadFTBlockWindow(from, to);
}

static const FrameWindowFunctions windowFunctions = {
    nullptr,
    [] {
        if (!repaints.image || !isPlaying()) return;
        double begun = wallMs();
        loadVisibleBlocks();
        paintSongView(*repaints.image);
        repaints.at.push_back(begun);
        repaints.took.push_back(wallMs() - begun);
    },
    nullptr, nullptr};

static void serveFor(double ms) {
    double end = wallMs() + ms;
    while (wallMs() < end)
        if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
}

static bool measureFirstSample(std::vector<double>* latencies) {
    for (int i = 0; i < 10; i++) {
        uint32_t asked = clockMilliseconds();
        playSong(-1.0, -1.0, 0);
        if (!isPlaying()) return false;
        while (lastPulseMediaTimes().firstWrite == 0 && clockMilliseconds() - asked < 5000)
            std::this_thread::sleep_for(std::chrono::microseconds(200));
        latencies->push_back(double(lastPulseMediaTimes().firstWrite - asked));
        serveFor(100);
        stopPlayback();
    }
    return true;
}

static void summarise(const char* what, std::vector<double> values) {
    if (values.empty()) return;
    std::sort(values.begin(), values.end());
    double sum = 0;
    for (double v : values) sum += v;
    std::printf("  %-38s min %6.1f  median %6.1f  mean %6.1f  95%% %6.1f  max %6.1f ms  (%zu)\n", what,
                values.front(), values[values.size() / 2], sum / double(values.size()), values[values.size() * 95 / 100],
                values.back(), values.size());
}

static void measureRepaints(const char* mode) {
    repaints.at.clear();
    repaints.took.clear();
    playSong(30.0, -1.0, 0);
    serveFor(5000);
    stopPlayback();
    std::vector<double> gaps;
    for (size_t i = 1; i < repaints.at.size(); i++) gaps.push_back(repaints.at[i] - repaints.at[i - 1]);
    std::printf("%s mode, 5 s of playback from 0:30\n", mode);
    summarise("time between repaints", gaps);
    summarise("painting one picture", repaints.took);
}

int main(int argc, char** argv) {
    double seconds = argc > 1 ? std::atof(argv[1]) : 300.0;
    if (seconds <= 0) return 1;
    if (std::getenv("QT_QPA_PLATFORM") == nullptr) setenv("QT_QPA_PLATFORM", "offscreen", 1);
    int qtArgc = 1;
    QApplication application(qtArgc, argv);
    std::string folder = makeBenchFolder("playbackBench");
    setenv("MELODRIFT_CONFIG_DIR", (folder + "/config").c_str(), 1);
    std::string wave = folder + "/melody.wav";
    if (!writeMelodyWave(wave, seconds)) return 1;

    StartupOptions options{};
    options.sharedBasePath = folder;
    setUiEcho(true);
    if (!startUp(options)) return 1;
    installPulseMedia();
    int result = 1;
    postToMainLoop([&] {
        openWaveFile(wave);
        waitForOpeningToEnd();
        std::printf("%.0f s melody: %u blocks, %d notes\n", seconds, song.blockCount, noteList.count);
        showSongView();
        std::vector<double> latencies;
        if (measureFirstSample(&latencies)) {
            summarise("Play to first samples at the server", latencies);
            QImage image(1280, 720, QImage::Format_RGB32);
            repaints.image = &image;
            setFrameWindowFunctions(&windowFunctions);
            layoutSongView(image.width(), image.height());
            displayModes.noteMode = NOTE_MODE_NOTE;
            measureRepaints("Note");
            displayModes.noteMode = NOTE_MODE_DETAIL;
            measureRepaints("Detail");
            setFrameWindowFunctions(nullptr);
            repaints.image = nullptr;
            result = 0;
        } else {
            std::printf("nothing played: %s\n", lastMessageText().c_str());
        }
        closeSong();
        postQuit(result);
    });
    int exitCode = runMessageLoop();
    return shutDown(exitCode);
}
