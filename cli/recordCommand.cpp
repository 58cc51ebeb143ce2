// melodrift-cli record OUT.wav --seconds N [--from-file FILE [--fast]] [--notes-csv FILE]
// [--midi FILE]: records N seconds through the same path as the desktop program's Record (the
// capture buffer, CS.fw, the worker analysing as it goes), from the sound server's default
// input or from a wave file fed in its place (at real-time pace, or with --fast as fast as the
// analysis takes it), then saves the song's audio and, when asked, its notes. Ctrl+C stops the
// recording early; what was recorded is kept.
#include "cli/cliCommands.h"

#include <chrono>
#include <csignal>
#include <cstdio>
#include <thread>

#include "audio/audioActivity.h"
#include "audio/recording.h"
#include "audio/waveWorkingFile.h"
#include "notes/noteList.h"
#include "platform/capture.h"
#include "platform/mainloop.h"
#include "platform/pulse/pulseBackends.h"
#include "playback/midiOutput.h"
#include "shell/closeSong.h"
#include "shell/startup.h"
#include "store/song.h"

static const int EXIT_FAILED = 1;
static const int EXIT_USAGE = 2;

static volatile std::sig_atomic_t interrupted = 0;
static void onInterrupt(int) { interrupted = 1; }

struct RecordRequest {
    std::string output;      // the song's audio
    double seconds = -1;     // how long to record
    std::string feedPath;    // a wave file instead of the input; "" for the input
    bool fast = false;       // the file as fast as the analysis takes it
    std::string notesPath;   // "" for no notes table
    std::string midiPath;    // "" for no MIDI file
};

static bool parseRecordRequest(const std::vector<std::string>& arguments, RecordRequest* request) {
    for (size_t i = 0; i < arguments.size(); i++) {
        const std::string& word = arguments[i];
        bool hasValue = i + 1 < arguments.size();
        if (word == "--seconds" && hasValue && parseSeconds(arguments[i + 1], &request->seconds)) i++;
        else if (word == "--from-file" && hasValue) request->feedPath = arguments[++i];
        else if (word == "--fast") request->fast = true;
        else if (word == "--notes-csv" && hasValue) request->notesPath = arguments[++i];
        else if (word == "--midi" && hasValue) request->midiPath = arguments[++i];
        else if (word.rfind("--", 0) != 0 && request->output.empty()) request->output = word;
        else {
            std::fprintf(stderr, "melodrift-cli: record: not understood: %s\n", word.c_str());
            return false;
        }
    }
    if (request->output.empty() || !(request->seconds > 0)) {
        std::fprintf(stderr, "melodrift-cli: record: name the output and --seconds N (more than 0)\n");
        return false;
    }
    if (request->fast && request->feedPath.empty()) {
        std::fprintf(stderr, "melodrift-cli: record: --fast goes with --from-file FILE\n");
        return false;
    }
    return true;
}

static double secondsRecorded() {
    uint32_t byteRate = song.waveFormat.samplesPerSec * (song.waveFormat.bitsPerSample / 8);
    uint32_t bytes = recordedBytesStored() - recordingState.startBytes;
    return byteRate ? double(bytes) / byteRate : 0.0;
}

// Serves the main loop (the capture events, the worker's redraws and its end) until the
// recording has lasted seconds, stops it, and serves on until it has been finished.
static void recordFor(double seconds) {
    interrupted = 0;
    auto previous = std::signal(SIGINT, onInterrupt);
    bool stopped = false;
    while (audioActivity.recording) {
        if (!stopped && (interrupted || secondsRecorded() >= seconds)) {
            stopRecording();
            stopped = true;
        }
        if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    std::signal(SIGINT, previous);
}

int runRecordCommand(const std::vector<std::string>& arguments) {
    RecordRequest request;
    if (!parseRecordRequest(arguments, &request)) return EXIT_USAGE;
    if (!request.feedPath.empty()) {
        if (!installCaptureFeeder(request.feedPath, request.fast ? 0.0 : 1.0)) {
            std::fprintf(stderr, "melodrift-cli: record: %s is no wave file that can be fed in\n",
                         request.feedPath.c_str());
            return EXIT_FAILED;
        }
    } else {
        installPulseCapture();
    }
    appState.directSoundAvailable = createCaptureObject();
    struct ReleaseCapture {
        ~ReleaseCapture() {
            releaseCaptureObject();
            setCaptureBackend(nullptr);
            appState.directSoundAvailable = false;
        }
    } releaseCapture;

    if (startRecording() != 0 || !audioActivity.recording) {
        closeSong();
        return EXIT_FAILED;   // refused; the message is on stderr
    }
    std::printf("Recording %s at %u Hz, %d-bit for %.1f s\n",
                request.feedPath.empty() ? "the default input" : request.feedPath.c_str(), recordingState.captureFormat.rate,
                recordingState.captureFormat.bits, request.seconds);
    std::fflush(stdout);
    recordFor(request.seconds);
    std::printf("Recorded %.3f s in %u blocks; %d notes\n", songDuration(), song.blockCount, noteList.count);

    int result = 0;
    if (song.blockCount == 0) {
        std::fprintf(stderr, "melodrift-cli: record: less than one block was recorded\n");
        result = EXIT_FAILED;
    } else {
        if (writeWaveSegment(request.output, -1.0, -1.0)) std::printf("Wave file: %s\n", request.output.c_str());
        else result = EXIT_FAILED;
        if (!request.notesPath.empty()) {
            if (writeSongNotesCsv(request.notesPath)) std::printf("Notes table: %s\n", request.notesPath.c_str());
            else result = EXIT_FAILED;
        }
        if (!request.midiPath.empty()) {
            if (saveMidiFile(request.midiPath, 0, 0)) std::printf("MIDI file: %s\n", request.midiPath.c_str());
            else result = EXIT_FAILED;
        }
    }
    closeSong();
    return result;
}
