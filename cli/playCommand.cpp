// melodrift-cli play FILE [--midi] [--from S] [--to E]: opens a wave file the way the desktop
// program's Open does and plays the song through the sound server, as Play does: in Wave mode
// the song's audio, with --midi its notes on the General MIDI synthesizer (following the sung
// pitch in Detail mode, the note mode in force). --from and --to choose the stretch in
// seconds. Returns when the last sample has been played, or at Ctrl+C.
#include "cli/cliCommands.h"

#include <chrono>
#include <csignal>
#include <cstdio>
#include <thread>

#include "notes/displayModes.h"
#include "platform/mainloop.h"
#include "platform/pulse/pulseBackends.h"
#include "playback/playback.h"
#include "playback/playbackState.h"
#include "playback/pointerInfo.h"
#include "shell/closeSong.h"

static const int EXIT_FAILED = 1;
static const int EXIT_USAGE = 2;

static volatile std::sig_atomic_t interrupted = 0;
static void onInterrupt(int) { interrupted = 1; }

struct PlayRequest {
    std::string input;     // the wave file to open
    bool midi = false;     // MIDI mode for this run
    double from = -1.0;    // seconds; -1.0 for the song's start
    double to = -1.0;      // seconds; -1.0 for the song's end
};

static bool parsePlayRequest(const std::vector<std::string>& arguments, PlayRequest* request) {
    for (size_t i = 0; i < arguments.size(); i++) {
        const std::string& word = arguments[i];
        bool hasValue = i + 1 < arguments.size();
        if (word == "--midi") request->midi = true;
        else if (word == "--from" && hasValue && parseSeconds(arguments[i + 1], &request->from)) i++;
        else if (word == "--to" && hasValue && parseSeconds(arguments[i + 1], &request->to)) i++;
        else if (word.rfind("--", 0) != 0 && request->input.empty()) request->input = word;
        else {
            std::fprintf(stderr, "melodrift-cli: play: not understood: %s\n", word.c_str());
            return false;
        }
    }
    if (request->input.empty()) {
        std::fprintf(stderr, "melodrift-cli: play: no wave file named\n");
        return false;
    }
    if (request->to >= 0 && request->to <= std::max(request->from, 0.0)) {
        std::fprintf(stderr, "melodrift-cli: play: --to must lie after --from\n");
        return false;
    }
    return true;
}

// Serves the main loop (the cursor timer and the device's end notice) until playback ends.
static void waitForPlaybackToEnd() {
    interrupted = 0;
    auto previous = std::signal(SIGINT, onInterrupt);
    while (isPlaying()) {
        if (interrupted) {
            std::printf("Stopped at %s\n", formatSongTime(playbackState.cursor / 100.0).c_str());
            stopPlayback();
            break;
        }
        if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    std::signal(SIGINT, previous);
}

int runPlayCommand(const std::vector<std::string>& arguments) {
    PlayRequest request;
    if (!parsePlayRequest(arguments, &request)) return EXIT_USAGE;
    installPulseMedia();
    // The mode is this run's; the stored setting stays as it was.
    struct RestoreMode {
        int mode;
        ~RestoreMode() { displayModes.playbackMode = mode; }
    } restoreMode{displayModes.playbackMode};
    displayModes.playbackMode = request.midi ? PLAYBACK_MODE_MIDI : PLAYBACK_MODE_WAVE;

    if (!openSongFromCommandLine(request.input)) return EXIT_FAILED;
    int result = EXIT_FAILED;
    playSong(request.from, request.to, 0);
    if (isPlaying()) {
        std::printf("Playing %s in %s mode from %s to %s\n", request.input.c_str(), request.midi ? "MIDI" : "Wave",
                    formatSongTime(playbackState.startCopy / 100.0).c_str(),
                    formatSongTime(playbackState.end / 100.0).c_str());
        std::fflush(stdout);
        waitForPlaybackToEnd();
        result = 0;
    }
    closeSong();
    return result;
}
