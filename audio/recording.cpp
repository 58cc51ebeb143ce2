// Live recording: starting with every refusal, moving each captured stretch into CS.fw on the
// main thread, the user's stop, and the end of a recording, which the worker reaches when it
// has analysed everything CS.fw holds. CS.fw stays plain for the whole recording and its header
// is patched after every stretch, so that it is a valid wave file whenever the program stops.
#include "audio/recording.h"

#include <chrono>
#include <cmath>
#include <ctime>
#include <memory>
#include <mutex>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/frequencyAnalysis.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/openWaveWorker.h"
#include "audio/waveWorkingFile.h"
#include "platform/clock.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/fileRoutines.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/songWindowHooks.h"
#include "store/undo.h"

RecordingState recordingState;

RecordingHooks recordingHooks;

static uint32_t bytesPerSample() { return uint32_t(song.waveFormat.bitsPerSample / 8); }

static void setLabelState(int state) {
    recordingState.labelState = state;
    if (recordingHooks.stateChanged) recordingHooks.stateChanged();
    else songWindowHooks.updateFrameDisplay();
}

const char* recordLabel() {
    switch (recordingState.labelState) {
    case RECORD_LABEL_RECORDING: return "&Stop Recording";
    case RECORD_LABEL_FINISHING: return "Finishing...";
    default: return "&Record Audio...";
    }
}

static void showCaptureBufferError() {
    messageBox(CAPTURE_BUFFER_ERROR_TITLE, CAPTURE_BUFFER_ERROR_TEXT, MESSAGE_ERROR, BUTTONS_OK);
}

CaptureFormat captureFormatOfQuality(int index) {
    RecordingFormat format;
    decodeRecordingFormat(index, &format);
    return CaptureFormat{format.samplesPerSecond, uint16_t(format.bitsPerSample), 1};
}

void probeRecordingFormats() {
    setWaitCursor(true);
    for (int i = 0; i < RECORDING_FORMAT_COUNT; i++) {
        RecordingFormat format;
        decodeRecordingFormat(i, &format);
        CaptureFormat capture{format.samplesPerSecond, uint16_t(format.bitsPerSample), uint16_t(format.channels)};
        recordingState.formatAvailable[i] = captureObjectCreated() && captureFormatAvailable(capture);
    }
    setWaitCursor(false);
}

// The looping buffer of 16 notification stretches of half a chunk each, with a notification
// at the end of every stretch. 1; 0 after "Block alignment problem" or without a buffer.
static int makeCaptureBuffer(const CaptureFormat& format) {
    RecordingState& r = recordingState;
    releaseCaptureBuffer();
    if (format.channels * format.bits / 8 > 2) {
        showMessage(MESSAGE_ERROR, BLOCK_ALIGNMENT_TEXT);
        return 0;
    }
    uint32_t chunkBytes = analysisGeometry.topFrame * format.bits / 8;
    r.notificationSize = chunkBytes / 2;
    r.bufferSize = CAPTURE_NOTIFICATION_POSITIONS * r.notificationSize;
    if (createCaptureBuffer(format, r.bufferSize) != CAPTURE_OK) return 0;
    r.nextCaptureOffset = 0;
    {
        std::lock_guard<std::mutex> guard(levelMeter.lock);
        std::fill(std::begin(levelMeter.levels), std::end(levelMeter.levels), 0);
    }
    uint32_t positions[CAPTURE_NOTIFICATION_POSITIONS];
    for (int i = 0; i < CAPTURE_NOTIFICATION_POSITIONS; i++) positions[i] = uint32_t(i + 1) * r.notificationSize - 1;
    return setCaptureNotificationPositions(positions, CAPTURE_NOTIFICATION_POSITIONS) == CAPTURE_OK;
}

static void maskWorkingFileAtRest() {
    waitForUndoSnapshotWriter();
    std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
    maskWaveWorkingFile();
}

// What the marker names and the recovery keeps: the recording as a plain wave in CS.fw.
static std::string markerPath() { return sharedFilePath(RECORDING_MARKER_FILE); }

static void writeRecordingMarker() {
    if (FILE* marker = fileOpen(markerPath(), "wb")) fileClose(marker);
}

// The level monitor's stretches: a twentieth of a second.
static const uint32_t MONITOR_STRETCHES_PER_SECOND = 20;

int startLevelMonitor() {
    RecordingState& r = recordingState;
    if (r.monitoring) return 1;
    if (audioActivity.recording || !captureObjectCreated()) return 0;
    CaptureFormat format = song.blockCount > 0
                               ? CaptureFormat{song.waveFormat.samplesPerSec, song.waveFormat.bitsPerSample, 1}
                               : captureFormatOfQuality(globalSettings.inputWaveQuality);
    r.notificationSize = format.rate / MONITOR_STRETCHES_PER_SECOND * (format.bits / 8);
    r.bufferSize = CAPTURE_NOTIFICATION_POSITIONS * r.notificationSize;
    if (r.notificationSize == 0 || createCaptureBuffer(format, r.bufferSize) != CAPTURE_OK) return 0;
    uint32_t positions[CAPTURE_NOTIFICATION_POSITIONS];
    for (int i = 0; i < CAPTURE_NOTIFICATION_POSITIONS; i++) positions[i] = uint32_t(i + 1) * r.notificationSize - 1;
    setCaptureNotificationPositions(positions, CAPTURE_NOTIFICATION_POSITIONS);
    r.captureFormat = format;
    r.nextCaptureOffset = 0;
    if (startCaptureBuffer() != CAPTURE_OK) {
        releaseCaptureBuffer();
        return 0;
    }
    r.monitoring = true;
    return 1;
}

void stopLevelMonitor() {
    RecordingState& r = recordingState;
    if (!r.monitoring) return;
    r.monitoring = false;
    releaseCaptureBuffer();
}

bool levelMonitorRunning() { return recordingState.monitoring; }

// A stretch captured for the monitor: its level, and nothing kept.
static int showMonitoredLevel() {
    RecordingState& r = recordingState;
    uint32_t position = 0;
    if (captureReadPosition(&position) != CAPTURE_OK) {
        stopLevelMonitor();
        return 1;
    }
    uint32_t size = (position + r.bufferSize - r.nextCaptureOffset) % r.bufferSize;
    uint32_t sampleBytes = r.captureFormat.bits / 8;
    size -= size % sampleBytes;
    if (size == 0) return 0;
    const uint8_t *part1, *part2;
    uint32_t bytes1, bytes2;
    if (lockCaptureBuffer(r.nextCaptureOffset, size, &part1, &bytes1, &part2, &bytes2) != CAPTURE_OK) return 1;
    std::vector<uint8_t> both(part1, part1 + bytes1);
    if (part2) both.insert(both.end(), part2, part2 + bytes2);
    unlockCaptureBuffer();
    pushLevelMeterValue(levelMeterValue(both.data(), size / sampleBytes, r.captureFormat.bits));
    r.nextCaptureOffset = (r.nextCaptureOffset + size) % r.bufferSize;
    if (recordingHooks.levelChanged) recordingHooks.levelChanged();
    return 0;
}

int startRecording() {
    RecordingState& r = recordingState;
    bool busy = audioActivity.recording || r.stopPending == 1;
    if (!busy && song.blockCount == 0 && generalSettings.quickPrefs && recordingHooks.quickPreferences &&
        !recordingHooks.quickPreferences())
        return 0;
    if (audioActivity.opening) {
        showMessage(MESSAGE_INFORMATION, WHILST_OPENING_TEXT);
        return 1;
    }
    if (r.stopPending == 1) {
        // A second press while the recording is being finished ends the finishing at once;
        // one that follows the stop press too closely is its bounce and is ignored.
        if (timeCounter() - r.lastRecordPress < RECORD_PRESS_REPEAT) return 0;
        CSStopCapturingWave();
        return 0;
    }
    r.lastRecordPress = timeCounter();
    if (audioActivity.recording) return stopRecording();

    int64_t freeBytes = freeDiskSpace(paths.sharedFolder);
    if (freeBytes >= 0 && freeBytes < RECORDING_DISK_SPACE_MINIMUM) {
        showMessage(MESSAGE_ERROR, RECORDING_DISK_LOW_TEXT);
        return 1;
    }
    if (!captureObjectCreated()) {
        showMessage(MESSAGE_ERROR, NO_DIRECTSOUND_TEXT);
        return 1;
    }
    CaptureFormat format;
    if (song.blockCount > 0) {
        format = CaptureFormat{song.waveFormat.samplesPerSec, song.waveFormat.bitsPerSample, 1};
    } else {
        probeRecordingFormats();
        int quality = globalSettings.inputWaveQuality;
        if (quality < 0 || quality >= RECORDING_FORMAT_COUNT || !r.formatAvailable[quality]) {
            showMessage(MESSAGE_ERROR, QUALITY_NOT_AVAILABLE_TEXT);
            return 1;
        }
        format = captureFormatOfQuality(quality);
    }
    uint16_t align = uint16_t(format.channels * format.bits / 8);
    WaveFormatRecord record{WAVE_FORMAT_PCM, format.channels, format.rate, format.rate * align, align, format.bits, 0};
    if (!acceptWaveFormat(record)) {
        showMessage(MESSAGE_ERROR, CANNOT_APPEND_TEXT);
        return 1;
    }

    stopLevelMonitor();
    std::unique_lock<std::mutex> processing(CSWaveProcessingMutex);
    bool appending = song.blockCount > 0;
    if (!beginSongAnalysis() || !makeCaptureBuffer(format)) {
        releaseFrequencyAnalysis();
        releaseCaptureBuffer();
        return 1;
    }
    r.captureFormat = format;
    if (appending) {
        waitForUndoSnapshotWriter();
        std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
        unmaskWaveWorkingFile();
    } else if (createWaveWorkingFile() != 0) {
        releaseFrequencyAnalysis();
        releaseCaptureBuffer();
        return 1;
    }
    if (!openFTFile(FT_UPDATE) || !openHiresFTFile(FT_UPDATE)) {
        if (ftFilesOpen()) closeFTFile(1);
        closeHiresFTFile(1);
        releaseFrequencyAnalysis();
        releaseCaptureBuffer();
        maskWorkingFileAtRest();
        return 1;
    }
    audioActivity.recording = true;
    audioActivity.opening = false;
    r.captureStopped = false;
    r.stopPending = -1;
    r.startTime = timeCounter();
    r.recordedSeconds = 0;
    r.processingLag = 0;
    r.speedWarningShown = false;
    // The recording follows the song's last block; anything CS.fw holds beyond it is no part of
    // the song and is written over.
    song.workingWaveBytes = openingState.samplesBefore * bytesPerSample();
    r.startBytes = song.workingWaveBytes;
    writeRecordingMarker();

    songWindowHooks.showSongView();
    prepareSongWorker(sharedFilePath("CS.fw"), true);
    openingState.recordingChunkDone = recordingChunkDone;
    openingState.finishRecording = finishRecording;
    openingState.recordingEnded = recordingEnded;
    processing.unlock();
    if (startCaptureBuffer() != CAPTURE_OK) showCaptureBufferError();
    setLabelState(RECORD_LABEL_RECORDING);
    startWorker(openingState.worker, CSOpenWaveFileDataThread);
    if (!appending) setSongNamesFromFile(RECORDED_AUDIO_NAME);
    return 0;
}

// The input is gone, or the disk is full: no more is captured, and the worker analyses what
// CS.fw holds before the recording ends, so that nothing stored is cut off.
static void endCaptureAndDrain() {
    RecordingState& r = recordingState;
    if (captureRunning()) stopCaptureBuffer();
    r.captureStopped = true;
    r.stopPending = 1;
    openingState.recordingComplete = true;
    setLabelState(RECORD_LABEL_FINISHING);
    resumeWorker(openingState.worker);
}

// The levels of both parts of a stretch, as one.
static void pushStretchLevel(const uint8_t* part1, uint32_t bytes1, const uint8_t* part2, uint32_t bytes2) {
    std::vector<uint8_t> both(part1, part1 + bytes1);
    if (part2) both.insert(both.end(), part2, part2 + bytes2);
    uint32_t bps = bytesPerSample();
    pushLevelMeterValue(levelMeterValue(both.data(), uint32_t(both.size() / bps), song.waveFormat.bitsPerSample));
}

// Appends the stretch to CS.fw after the bytes it holds and patches its header. 1; 0 after a
// message.
static int storeStretch(const uint8_t* part1, uint32_t bytes1, const uint8_t* part2, uint32_t bytes2) {
    uint32_t stored = song.workingWaveBytes;
    std::vector<uint8_t> stretch(part1, part1 + bytes1);
    if (part2) stretch.insert(stretch.end(), part2, part2 + bytes2);
    if (!appendToWaveWorkingFile(stored, stretch.data(), stretch.size(), HANDLER_OPEN_TEXT)) return 0;
    song.workingWaveBytes = stored + uint32_t(stretch.size());
    openingState.recordedBytes = song.workingWaveBytes;
    recordingState.recordedSeconds =
        double(song.workingWaveBytes) * 8 / song.waveFormat.bitsPerSample / song.waveFormat.samplesPerSec;
    return 1;
}

int handleCaptureNotification() {
    RecordingState& r = recordingState;
    if (r.monitoring) return showMonitoredLevel();
    if (!captureBufferCreated() || !analysisBuffersReady() || !audioActivity.recording) return 1;
    uint32_t position = 0;
    if (captureReadPosition(&position) != CAPTURE_OK) {
        endCaptureAndDrain();
        return 1;
    }
    int64_t size = int64_t(position) - r.nextCaptureOffset;
    if (size < 0) size += r.bufferSize;
    uint32_t blockBytes = analysisGeometry.blockSamples * bytesPerSample();
    size = size / blockBytes * blockBytes;
    if (size < 1) return 0;
    const uint8_t *part1, *part2;
    uint32_t bytes1, bytes2;
    if (lockCaptureBuffer(r.nextCaptureOffset, uint32_t(size), &part1, &bytes1, &part2, &bytes2) != CAPTURE_OK) {
        CSStopCapturingWave();
        return 1;
    }
    pushStretchLevel(part1, bytes1, part2, bytes2);
    int64_t freeBytes = freeDiskSpace(paths.sharedFolder);
    if (freeBytes >= 0 && freeBytes < std::max<int64_t>(size, RECORDING_DISK_SPACE_STOP)) {
        unlockCaptureBuffer();
        endCaptureAndDrain();
        showMessage(MESSAGE_ERROR, RECORDING_DISK_VERY_LOW_TEXT);
        return 1;
    }
    int stored = storeStretch(part1, bytes1, part2, bytes2);
    unlockCaptureBuffer();
    if (!stored) {
        endCaptureAndDrain();
        return 1;
    }
    r.nextCaptureOffset = uint32_t((r.nextCaptureOffset + size) % r.bufferSize);
    resumeWorker(openingState.worker);
    return 0;
}

int stopRecording() {
    RecordingState& r = recordingState;
    if (!captureObjectCreated()) return 1;
    if (r.stopPending == 1) return CSStopCapturingWave();
    r.stopPending = 1;
    if (stopCaptureBuffer() != CAPTURE_OK) showCaptureBufferError();
    r.captureStopped = true;
    setLabelState(RECORD_LABEL_FINISHING);
    // The stretch captured since the last notification goes into CS.fw before the worker is
    // told that nothing more comes.
    handleCaptureNotification();
    openingState.recordingComplete = true;
    resumeWorker(openingState.worker);
    return 0;
}

int CSStopCapturingWave() {
    RecordingState& r = recordingState;
    if (captureRunning() && stopCaptureBuffer() != CAPTURE_OK) showCaptureBufferError();
    r.captureStopped = true;
    openingState.recordingComplete = true;
    // The worker finishes at its next chunk boundary and finalises the recording there.
    requestWorkerStop(openingState.worker);
    return 0;
}

void recordingChunkDone(uint32_t samplesAnalysed) {
    RecordingState& r = recordingState;
    uint32_t stored = openingState.recordedBytes / std::max(1u, bytesPerSample());
    double lag = stored > samplesAnalysed ? double(stored - samplesAnalysed) / analysisGeometry.sampleRate : 0.0;
    r.processingLag = lag;
    if (!globalSettings.showSpeedWarning || r.speedWarningShown || lag < SPEED_WARNING_LAG) return;
    if (globalSettings.boostSpeed && globalSettings.inputWaveQuality == 8) return;
    r.speedWarningShown = true;
    postToMainLoop([] {
        if (recordingHooks.showSpeedWarning) recordingHooks.showSpeedWarning();
    });
}

void recordingEnded() {
    RecordingState& r = recordingState;
    joinWorker(openingState.worker);
    releaseCaptureBuffer();
    audioActivity.recording = false;
    audioActivity.opening = false;
    r.stopPending = -1;
    r.processingLag = 0;
    fileDelete(markerPath());
    setLabelState(RECORD_LABEL_IDLE);
    songWindowHooks.redrawSongView();
}

void finishRecording() {
    if (captureRunning()) stopCaptureBuffer();
    recordingState.captureStopped = true;
    waitForUndoSnapshotWriter();
    {
        std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
        if (finaliseWaveWorkingFile() == WAVE_NOT_OPENED) showMessage(MESSAGE_ERROR, STOP_OPEN_TEXT);
        uint64_t frames = uint64_t(std::llround(songDuration() * song.waveFormat.samplesPerSec));
        song.workingWaveBytes = uint32_t(frames * bytesPerSample());
        recordingState.recordedSeconds = double(frames) / std::max(1u, song.waveFormat.samplesPerSec);
    }
}

uint32_t recordedBytesStored() { return openingState.recordedBytes; }

void maximizeRecordingSpeed() {
    globalSettings.boostSpeed = true;
    globalSettings.inputWaveQuality = 8;
    showMessage(MESSAGE_INFORMATION, SPEED_CHANGES_LATER_TEXT);
}

void setShowSpeedWarning(bool show) { globalSettings.showSpeedWarning = show; }

int compandWave(uint8_t* samples, uint32_t count, uint32_t rate) {
    uint32_t segment = rate / 32;
    if (segment == 0 || count < segment) {
        showMessage(MESSAGE_INFORMATION, COMPAND_TOO_LOW_TEXT);
        return 0;
    }
    uint32_t segments = count / segment;
    std::vector<int> levels(segments);
    for (uint32_t s = 0; s < segments; s++) {
        uint32_t sum = 0;
        for (uint32_t i = 0; i < segment; i++) sum += uint32_t(std::abs(int(samples[s * segment + i]) - 128));
        levels[s] = int(sum / segment);
    }
    uint32_t window = rate / segment;   // segments in about a second
    uint32_t windowSamples = window * segment;
    bool companded = false;
    for (uint32_t first = 0; first < segments; first += window) {
        int peak = 0;
        for (uint32_t s = first; s < std::min(segments, first + window); s++) peak = std::max(peak, levels[s]);
        if (peak <= 0) continue;
        companded = true;
        uint32_t start = first == 0 ? 0 : first * segment - windowSamples / 2;
        uint32_t end = std::min<uint64_t>(count, uint64_t(first + window) * segment + windowSamples / 2);
        double gain = 48.0 / (peak + 8);
        for (uint32_t i = start; i < end; i++) {
            double v = (int(samples[i]) - 128) * gain;
            v = std::max(-128.0, std::min(127.0, v));
            samples[i] = uint8_t(int(v + 128));
        }
    }
    if (!companded) showMessage(MESSAGE_INFORMATION, COMPAND_TOO_LOW_TEXT);
    return companded ? 1 : 0;
}

std::string recoverUnfinishedRecording() {
    std::string marker = markerPath();
    if (!fileExists(marker)) return "";
    fileDelete(marker);
    std::string working = sharedFilePath("CS.fw");
    WaveReadInfo info{};
    if (applyWaveMask(working, WAVE_PLAIN) != 1 || wioFileOpen(&info, working, 0) != WIO_OPENED) return "";
    uint32_t dataBytes = info.dataBytes;
    wioFileClose(&info);
    if (dataBytes == 0) return "";
    char stamp[32];
    std::time_t now = std::time(nullptr);
    std::strftime(stamp, sizeof stamp, "%Y-%m-%d %H.%M.%S", std::localtime(&now));
    std::string kept = sharedFilePath(std::string("Recovered recording ") + stamp + ".wav");
    if (renameFile(working, kept) != 0) return "";
    showMessage(MESSAGE_INFORMATION, "A recording that was not finished when Torvellan Melodrift stopped has been kept "
                                     "as\n\n" + kept);
    return kept;
}

void resetRecordingState() {
    stopLevelMonitor();
    releaseCaptureBuffer();
    RecordingState& r = recordingState;
    r.captureFormat = CaptureFormat{};
    std::fill(std::begin(r.formatAvailable), std::end(r.formatAvailable), false);
    r.notificationSize = r.bufferSize = r.nextCaptureOffset = r.startBytes = 0;
    r.recordedSeconds = 0;
    r.captureStopped = false;
    r.stopPending = -1;
    r.lastRecordPress = 0;
    r.processingLag = 0;
    r.speedWarningShown = false;
    r.startTime = 0;
    r.labelState = RECORD_LABEL_IDLE;
}
