// Opening a wave file: the checks and the set-up on the main thread, the hand-over to the
// worker, and the waits and resets around a running opening.
#include "audio/openWaveFile.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <filesystem>
#include <thread>

#include "analysis/analysisSampleBuffer.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/recognitionOptions.h"
#include "audio/audioActivity.h"
#include "audio/levelMeter.h"
#include "audio/openWaveWorker.h"
#include "audio/waveWorkingFile.h"
#include "platform/clock.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/songWindowHooks.h"
#include "store/undo.h"


// The source format while no file is open.
static const WaveFormatRecord DEFAULT_SOURCE_FORMAT = {WAVE_FORMAT_PCM, 1, 44100, 88200, 2, 16, 0};

static void releaseChunkBuffer() {
    OpeningState& o = openingState;
    std::vector<uint8_t>().swap(o.chunkBuffer);
    o.bufferBytes = 0;
    o.bufferSamples = 0;
    o.bufferFirstSample = 0;
}

// The song's length in samples, as its blocks place them.
static uint32_t songSamples() {
    return uint32_t(std::trunc(songDuration() * song.waveFormat.samplesPerSec + 0.5));
}

static std::string fullPath(const std::string& path) {
    std::error_code error;
    std::filesystem::path full = std::filesystem::absolute(path, error);
    return error ? path : full.string();
}

// Brings CS.fw back to rest after a set-up step failed.
static void maskWorkingFileAgain() {
    waitForUndoSnapshotWriter();
    std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
    maskWaveWorkingFile();
}

int openWaveFile(const std::string& path) {
    OpeningState& o = openingState;
    // The refusal comes before the preferences: while a worker fills the song, the song's
    // block count is the worker's to change, and no preferences can apply to this opening.
    if (refuseWhileBusy()) return 1;
    if (song.blockCount == 0 && generalSettings.quickPrefs && o.quickPreferences && !o.quickPreferences()) return 0;
    int64_t freeBytes = freeDiskSpace(paths.sharedFolder);
    if (freeBytes < 0) freeBytes = DISK_SPACE_UNKNOWN;
    if (freeBytes < OPENING_DISK_SPACE_MINIMUM) {
        showMessage(MESSAGE_ERROR, OPENING_DISK_LOW_TEXT);
        return 1;
    }
    releaseChunkBuffer();
    o.sourceFormat = DEFAULT_SOURCE_FORMAT;

    WaveReadInfo info{};
    uint32_t code = wioFileOpen(&info, path, 0);
    if (code != WIO_OPENED) {
        showMessage(MESSAGE_ERROR, waveOpenMessage(code));
        return 1;
    }
    struct CloseReader {
        WaveReadInfo* info;
        ~CloseReader() { wioFileClose(info); }
    } closeReader{&info};
    const WaveFormatRecord& format = *info.format;
    if (format.samplesPerSec > HIGHEST_OPENING_RATE) {
        showMessage(MESSAGE_ERROR, RATE_TOO_HIGH_TEXT);
        return 1;
    }
    o.sourceFormat = format;
    o.sourceDuration = format.samplesPerSec ? float(double(info.dataSamples) / format.samplesPerSec) : 0.0f;
    if (format.channels > MAX_WAVE_CHANNELS) {
        showMessage(MESSAGE_ERROR, TOO_MANY_CHANNELS_TEXT);
        return 1;
    }
    // The reader lets through compressed or float data that carries a fact chunk, and PCM of
    // other sizes than 8 and 16 bits; read as 8- or 16-bit PCM they would become noise in the
    // song and its analysis, so they get the unsupported-format message here.
    if (checkWaveFileFormat(info) != WIO_OPENED) {
        showMessage(MESSAGE_ERROR, waveOpenMessage(WIO_NOT_PCM));
        return 1;
    }
    if (!acceptWaveFormat(format)) {
        showMessage(MESSAGE_ERROR, CANNOT_APPEND_TEXT);
        return 1;
    }
    wioFileClose(&info);

    // The set-up below is the processing of this opening until the worker takes it over.
    std::unique_lock<std::mutex> processing(CSWaveProcessingMutex);
    bool appending = song.blockCount > 0;
    if (!beginSongAnalysis()) return 1;

    // Every later failure leaves the song as it was: no analysis, no open FT files, CS.fw at rest.
    struct Unwind {
        bool armed = true;
        ~Unwind() {
            if (!armed) return;
            releaseFrequencyAnalysis();
            if (ftFilesOpen()) closeFTFile(1);
            closeHiresFTFile(1);
            maskWorkingFileAgain();
        }
    } unwind;
    if (appending) {
        waitForUndoSnapshotWriter();
        std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
        // Nothing could be appended to a working file that cannot be brought back to plain.
        if (!unmaskWaveWorkingFile()) {
            showMessage(MESSAGE_ERROR, "Cannot " + sharedFilePath("CS.fw"));
            return 1;
        }
    } else if (createWaveWorkingFile() != 0) {
        return 1;
    }
    if (!openFTFile(FT_UPDATE) || !openHiresFTFile(FT_UPDATE)) return 1;
    unwind.armed = false;

    songWindowHooks.showSongView();
    prepareSongWorker(fullPath(path), false);
    processing.unlock();
    audioActivity.opening = true;
    audioActivity.openingSeconds =
        o.sourceDuration + (song.waveFormat.samplesPerSec ? double(o.samplesBefore) / song.waveFormat.samplesPerSec : 0.0);
    // An opening that appends to a song can be undone: the snapshot holds the song before it.
    takeUndoSnapshot();
    markUndoStale(UNDO_FT_CHANGED | UNDO_WAVE_CHANGED);
    startWorker(o.worker, CSOpenWaveFileDataThread);
    if (!appending) setSongNamesFromFile(path);
    return 1;
}

int beginSongAnalysis() {
    OpeningState& o = openingState;
    recognitionOptions.learningInstruments = false;
    releaseFrequencyAnalysis();
    clearAnalysisSampleBuffer();   // no buffer in view: a chunk is one group of blocks
    o.startTime = timeCounter();
    o.samplesBefore = songSamples();
    return setupFrequencyAnalysis();
}

void prepareSongWorker(const std::string& sourcePath, bool recording) {
    OpeningState& o = openingState;
    o.samplesDone = o.samplesBefore;
    o.storedSamples = o.samplesBefore;
    o.samplesRead = 0;
    // A recording's samples follow the song's own in CS.fw; a file is read from its start.
    o.sourceBytesRead = recording ? o.samplesBefore * uint32_t(song.waveFormat.bitsPerSample / 8) : 0;
    o.endOfSource = -1;
    o.recognitionShare = globalSettings.boostSpeed ? 0.1 : 0.2;
    o.displayShare = globalSettings.boostSpeed ? 0.05 : 0.1;
    resetOpeningProgress();
    openingProgress.notesPosition = 0;
    openingProgress.recognisedTo = o.samplesBefore;
    openingProgress.blocksWrittenBack = song.blockCount;
    openingProgress.hiresBlocksStored = song.blockCount;
    o.sourcePath = sourcePath;
    o.recording = recording;
    o.recordedBytes = o.samplesBefore * uint32_t(song.waveFormat.bitsPerSample / 8);
    o.recordingComplete = false;
}

void requestOpeningStop() {
    if (openingState.worker.thread.joinable()) requestWorkerStop(openingState.worker);
}

void waitForOpeningToEnd() {
    // The flag stays set until openingEnded runs here, so the worker's last call is served too.
    while (audioActivity.opening && openingState.worker.thread.joinable()) {
        if (serveMainLoopOnce() == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}

void resetOpeningState() {
    OpeningState& o = openingState;
    requestWorkerStop(o.worker);
    joinWorker(o.worker);
    audioActivity.opening = false;
    audioActivity.openingSeconds = 0;
    releaseChunkBuffer();
    o.sourcePath.clear();
    o.sourceFormat = DEFAULT_SOURCE_FORMAT;
    o.sourceDuration = 0;
    o.samplesBefore = 0;
    o.samplesDone = 0;
    o.samplesRead = 0;
    o.sourceBytesRead = 0;
    o.storedSamples = 0;
    o.endOfSource = -1;
    o.recognitionShare = 0.2;
    o.displayShare = 0.1;
    o.startTime = 0;
    o.recording = false;
    o.recordedBytes = 0;
    o.recordingComplete = false;
    resetOpeningProgress();
    std::lock_guard<std::mutex> guard(levelMeter.lock);
    std::fill(std::begin(levelMeter.levels), std::end(levelMeter.levels), 0);
}
