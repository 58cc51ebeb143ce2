// The opening's worker and the hand-over of each chunk. The worker reads half a top frame
// (the lead-in) ahead of the analysis: a chunk's longest frames reach half a top frame past
// its last block, so a chunk is analysed only once that much beyond it has been read, and its
// blocks are then the same as when the whole file is held at once. The buffer keeps what the
// next chunk's frames, the spectrogram's next rows and CS.fw's next append reach back to.
#include "audio/openWaveWorker.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstring>
#include <memory>
#include <mutex>
#include <thread>

#include "analysis/analysisGeometry.h"
#include "analysis/analysisSampleBuffer.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/frequencyTable.h"
#include "analysis/noteBuilding.h"
#include "analysis/noteRecognition.h"
#include "analysis/recognitionOptions.h"
#include "analysis/spectrogram.h"
#include "audio/audioActivity.h"
#include "audio/levelMeter.h"
#include "audio/waveWorkingFile.h"
#include "notes/noteList.h"
#include "platform/allocation.h"
#include "platform/clock.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/songWindowHooks.h"
#include "store/undo.h"

OpeningState openingState;
OpeningProgress openingProgress;

static const char* const THREAD_OPEN_TEXT_1 = "Input Wave file could not be opened by CSOpenWaveFileDataThread (1)";
static const char* const THREAD_OPEN_TEXT_2 = "Input Wave file could not be opened by CSOpenWaveFileDataThread (2)";
static const char* const HAND_ON_OPEN_TEXT_1 = "Wave buffer file could not be opened by cantoscopeWaveformData (1)";
static const char* const HAND_ON_OPEN_TEXT_2 = "Input Wave file could not be opened by cantoscopeWaveformData (2)";
static const char* const EXCESS_NEGATIVE_TEXT =
    "excessBytes is negative in cantoscopeWaveformData() - data may be corrupted.";
static const char* const NEGATIVE_SAMPLE_TEXT = "Negative sample number";

static const double STABLE_SECONDS = 2.0;          // notes ending this long before P may still grow
static const double NOTE_LEAD_SECONDS = 0.5;       // rebuilt notes restart this long before the first dropped one
static const double RECOGNITION_LOOKBACK = 1.0;    // the pitch track is recognised again this long before the notes
static const uint32_t REDRAW_WAIT_MS = 100;        // longest the worker waits for a posted redraw to be served

void resetOpeningProgress() {
    OpeningProgress& p = openingProgress;
    p.notesPosition = 0;
    p.notesToDrop = 0;
    p.recognitionStart = 0;
    p.analysisRestart = 0;
    p.recognisedTo = 0;
    p.blocksWrittenBack = 0;
    p.hiresBlocksStored = 0;
    p.recognised = false;
    p.recognitionStartedAt = 0;
    p.recognitionTook = 0;
    p.chunkStartedAt = 0;
    p.chunkEndedAt = 0;
    p.chunks = 0;
    p.processingLoad = 0;
    p.recordedSeconds = 0;
    p.redrawStartedAt = 0;
    p.redrawTook = 0;
    p.redrawState = REDRAW_IDLE;
}

static uint32_t bytesPerSample() { return uint32_t(song.waveFormat.bitsPerSample / 8); }

static uint32_t positionOfBlock(uint32_t block) {
    return uint32_t(std::trunc(songTimeOfBlock(block) * analysisGeometry.sampleRate + 0.5));
}

// A run that took no measurable time is always due again; otherwise it is due when it took
// less than its share of the time since it started.
static bool shareAllows(uint32_t took, uint32_t startedAt, double share) {
    return took == 0 || double(took) < share * double(clockMilliseconds() - startedAt);
}

// ---- the chunk buffer ----

// The first song position the next chunk still needs: its frequency tables' frames, the
// spectrogram's next frames, and the samples not yet appended to CS.fw.
static int64_t firstPositionNeeded() {
    const OpeningState& o = openingState;
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    int64_t tablesFirst, tablesEnd;
    frequencyTableInput(o.samplesDone, &tablesFirst, &tablesEnd);
    int64_t spectrogramEnd = s.rowCount ? int64_t(s.firstRowPosition) + int64_t(s.rowCount) * s.hop : o.samplesDone;
    int64_t frameReach = int64_t(std::max(2u, recognitionOptions.lookaheadFrames)) * s.binsPerRow;
    return std::min({tablesFirst, spectrogramEnd - frameReach, int64_t(o.storedSamples)});
}

// Reads count frames of the open source from where the last chunk ended into the chunk buffer,
// one channel, after a silent lead-in (first chunk) or after the history the next chunk needs.
// 1; 0 after a message (no memory, a failed seek).
static int fillChunkBuffer(WaveReadInfo& info, uint32_t count, bool firstChunk, uint32_t leadIn) {
    OpeningState& o = openingState;
    uint32_t bps = bytesPerSample();
    size_t kept;
    if (firstChunk) {
        o.bufferFirstSample = int64_t(o.samplesBefore) - leadIn;
        kept = size_t(leadIn) * bps;
    } else {
        int64_t drop = std::clamp<int64_t>(firstPositionNeeded() - o.bufferFirstSample, 0, o.bufferSamples);
        kept = o.bufferBytes - size_t(drop) * bps;
        std::memmove(o.chunkBuffer.data(), o.chunkBuffer.data() + size_t(drop) * bps, kept);
        o.bufferFirstSample += drop;
    }
    size_t wanted = kept + size_t(count) * bps;
    if (o.chunkBuffer.size() < wanted && !tryResize(o.chunkBuffer, wanted)) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    if (firstChunk) std::memset(o.chunkBuffer.data(), bps == 1 ? 0x80 : 0, kept);
    if (!seekReportedFile(info.file, int64_t(info.dataOffset) + o.sourceBytesRead)) return 0;
    // What the file does not hold any more (it was cut while being read) comes back as silence.
    downmixFrames(info.file, *info.format, o.chunkBuffer.data() + kept, count * bps);
    o.sourceBytesRead += count * info.format->blockAlign;
    o.samplesRead += count;
    o.bufferBytes = uint32_t(wanted);
    o.bufferSamples = uint32_t(wanted / bps);
    return 1;
}

// ---- handing a chunk on ----

// Where recognition starts again after this chunk (computed before its tables): the notes
// that may still change are dropped and rebuilt, the pitch track a second earlier.
static void chooseRecognitionRange() {
    const OpeningState& o = openingState;
    OpeningProgress& p = openingProgress;
    double rate = analysisGeometry.sampleRate;
    double t0 = o.samplesBefore / rate;
    double t = std::max(t0, p.notesPosition / rate - STABLE_SECONDS);
    double halfBlock = song.sampleBlockDuration / 2;
    int drop = 0;
    for (int i = noteList.count - 1; i >= 0 && noteList.notes[i].waveEnd - halfBlock > t; i--) drop++;
    if (drop > 0) {
        int firstDropped = noteList.count - drop;
        t = std::max(t0, noteList.notes[firstDropped].waveStart - NOTE_LEAD_SECONDS);
        if (firstDropped > 0) t = std::max(t, double(noteList.notes[firstDropped - 1].waveEnd));
    }
    p.notesToDrop = drop;
    p.recognitionStart = std::max(o.samplesBefore, uint32_t(std::trunc(rate * t)));
    uint32_t restart =
        std::max(o.samplesBefore, uint32_t(std::trunc(rate * std::max(t0, t - RECOGNITION_LOOKBACK))));
    const FTBlockWindow& w = ftBlockWindow;
    if (w.endBlock > w.firstBlock && blockAtTime(restart / rate) < w.firstBlock) restart = positionOfBlock(w.firstBlock);
    // Recognition reads the spectrogram's rows, not the chunk buffer: it cannot go back
    // before the first row it holds.
    if (magnitudeSpectrogram.rowCount > 0) restart = std::max(restart, magnitudeSpectrogram.firstRowPosition);
    p.analysisRestart = restart;
}

// Appends the analysed samples CS.fw does not hold yet and patches its header. 1; 0 after a
// message (the opening stops; CS.fw keeps its earlier audio and header).
static int appendToWorkingFile() {
    OpeningState& o = openingState;
    if (o.samplesDone < o.storedSamples) {
        showMessage(MESSAGE_ERROR, NEGATIVE_SAMPLE_TEXT);
        return 1;
    }
    if (o.samplesDone == o.storedSamples) return 1;
    uint32_t bps = bytesPerSample();
    const uint8_t* samples = o.chunkBuffer.data() + size_t(int64_t(o.storedSamples) - o.bufferFirstSample) * bps;
    size_t bytes = size_t(o.samplesDone - o.storedSamples) * bps;
    uint32_t dataBytes = o.samplesDone * bps;
    if (!appendToWaveWorkingFile(o.storedSamples * bps, samples, bytes, HAND_ON_OPEN_TEXT_1)) return 0;
    o.storedSamples = o.samplesDone;
    song.workingWaveBytes = dataBytes;
    openingProgress.recordedSeconds = double(dataBytes) * 8 / song.waveFormat.bitsPerSample / analysisGeometry.sampleRate;
    return 1;
}

// The pitch track from the analysis restart and the notes from the recognition start, and
// the FT blocks recognition rewrote back on file. 1; 0 after a message.
static int recognise() {
    OpeningProgress& p = openingProgress;
    double rate = analysisGeometry.sampleRate;
    uint32_t w0 = positionOfBlock(ftBlockWindow.firstBlock);
    uint32_t from = std::max(w0, p.analysisRestart);
    uint32_t to = std::max(w0, p.recognitionStart);
    p.recognitionStartedAt = clockMilliseconds();
    if (recognitionOptions.monophonicRecognition) recognisePitchTrack(from, to);
    uint32_t firstBlock = std::min(blockAtTime(to / rate), p.blocksWrittenBack);
    if (ftFiles.ftFile && firstBlock < song.blockCount &&
        !rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, firstBlock, song.blockCount))
        return 0;
    p.blocksWrittenBack = song.blockCount;
    p.notesPosition = buildNotes(to, p.notesToDrop);
    p.recognisedTo = to;
    p.recognised = true;
    p.recognitionTook = clockMilliseconds() - p.recognitionStartedAt;
    return 1;
}

// Whether nothing of the file is left to read; *failed when it can no longer be opened.
static bool sourceExhausted(bool* failed) {
    const OpeningState& o = openingState;
    *failed = false;
    if (o.endOfSource >= 0) return true;
    WaveReadInfo info{};
    if (wioFileOpen(&info, o.sourcePath, 0) != WIO_OPENED) {
        showMessage(MESSAGE_ERROR, HAND_ON_OPEN_TEXT_2);
        *failed = true;
        return true;
    }
    uint32_t whole = info.dataSamples / analysisGeometry.blockSamples * analysisGeometry.blockSamples;
    wioFileClose(&info);
    return o.samplesRead >= whole;
}

int cantoscopeWaveformData() {
    OpeningState& o = openingState;
    OpeningProgress& p = openingProgress;
    setAnalysisSampleBuffer(o.chunkBuffer.data(), o.bufferSamples, o.bufferFirstSample, o.endOfSource);
    chooseRecognitionRange();
    // No note edit can run while the opening flag is set, so the rows always go.
    if (recognitionOptions.monophonicRecognition) dropSpectrogramRowsBefore(p.analysisRestart);
    if (createMagnitudeSpectrogram(o.samplesDone) < 0) return 0;
    while (true) {
        int64_t first, end;
        frequencyTableInput(o.samplesDone, &first, &end);
        if (end > analysisBufferEnd()) break;
        int64_t next = createFrequencyTable(o.samplesDone);
        if (next < 0) return 0;
        if (next == int64_t(o.samplesDone)) break;   // no whole block left at the file's end
        if (hiresFiles.hiresFile && !undoWriterBusy()) {
            if (!writeHiresFTBlocks(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, p.hiresBlocksStored,
                                    song.blockCount))
                return 0;
            p.hiresBlocksStored = song.blockCount;
        }
        o.samplesDone = uint32_t(next);
    }
    if (analysisBufferEnd() < int64_t(o.samplesDone)) showMessage(MESSAGE_ERROR, EXCESS_NEGATIVE_TEXT);
    // A recording's samples are in CS.fw already: the recorder put them there.
    if (o.recording) o.storedSamples = std::max(o.storedSamples, o.samplesDone);
    else if (!appendToWorkingFile()) return 0;

    bool failed = false;
    bool last = workerStopRequested(o.worker) || (o.recording ? o.endOfSource >= 0 : sourceExhausted(&failed));
    // Blocks leave the 30-second window as chunks arrive; recognition must run (and write its
    // blocks back) before the blocks it has not seen leave it, however it is throttled.
    uint32_t unrecognised = song.blockCount - std::min(song.blockCount, blockAtTime(p.recognisedTo / double(analysisGeometry.sampleRate)));
    bool windowFull = unrecognised + 2 * analysisGeometry.chunkBlocks >= ftBlockWindow.capacity;
    bool due = !p.recognised || shareAllows(p.recognitionTook, p.recognitionStartedAt, o.recognitionShare);
    if ((last || windowFull || due) && !recognise()) return 0;
    return failed ? 0 : 1;
}

// ---- the worker ----

// Posts a redraw of the song view when one is due and waits while it runs, so that the view
// never reads the song in the middle of a chunk.
static void redrawBetweenChunks() {
    OpeningProgress& p = openingProgress;
    if (!shareAllows(p.redrawTook, p.redrawStartedAt, openingState.displayShare)) return;
    p.redrawState = REDRAW_POSTED;
    postToMainLoop([] {
        OpeningProgress& p = openingProgress;
        int expected = REDRAW_POSTED;
        if (!p.redrawState.compare_exchange_strong(expected, REDRAW_RUNNING)) return;   // withdrawn
        uint32_t start = clockMilliseconds();
        songWindowHooks.redrawSongView();
        p.redrawTook = clockMilliseconds() - start;
        p.redrawStartedAt = start;
        p.redrawState = REDRAW_IDLE;
    });
    // Real time, not the program's clock, which tests may stop.
    auto waitFrom = std::chrono::steady_clock::now();
    while (p.redrawState != REDRAW_IDLE) {
        if (std::chrono::steady_clock::now() - waitFrom >= std::chrono::milliseconds(REDRAW_WAIT_MS)) {
            int expected = REDRAW_POSTED;
            if (p.redrawState.compare_exchange_strong(expected, REDRAW_IDLE)) break;
        }
        std::this_thread::sleep_for(std::chrono::microseconds(200));
    }
}

// Stores what is left, ends the analysis pass, closes the FT files and puts CS.fw to rest;
// the main loop then clears the opening flag.
static void finishOpening() {
    OpeningState& o = openingState;
    OpeningProgress& p = openingProgress;
    {
        std::lock_guard<std::mutex> processing(CSWaveProcessingMutex);
        // A stop or a failure between chunks can come before recognition has seen the last
        // blocks: their notes are built now.
        if (analysisBuffersReady() && p.blocksWrittenBack < song.blockCount) {
            chooseRecognitionRange();
            recognise();
        }
        if (ftFiles.ftFile && p.blocksWrittenBack < song.blockCount &&
            rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, p.blocksWrittenBack, song.blockCount))
            p.blocksWrittenBack = song.blockCount;
        if (hiresFiles.hiresFile && p.hiresBlocksStored < song.blockCount &&
            writeHiresFTBlocks(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, p.hiresBlocksStored, song.blockCount))
            p.hiresBlocksStored = song.blockCount;
        releaseFrequencyAnalysis();
        clearAnalysisSampleBuffer();
        closeFTFile(1);
        closeHiresFTFile(1);
    }
    if (o.recording && o.finishRecording) o.finishRecording();
    waitForUndoSnapshotWriter();
    {
        std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
        maskWaveWorkingFile();
    }
    std::vector<uint8_t>().swap(o.chunkBuffer);
    o.bufferBytes = 0;
    o.bufferSamples = 0;
    postToMainLoop(o.recording && o.recordingEnded ? o.recordingEnded : openingEnded);
}

// How far the source reaches, in samples of this pass in whole blocks: the file's length when
// opening; when recording, what the recorder has stored in CS.fw so far. *complete when no
// more will come (a file; a recording once its last stretch is stored).
static uint32_t sourceSamples(bool* complete, bool* failed) {
    OpeningState& o = openingState;
    uint32_t blockSamples = analysisGeometry.blockSamples;
    *failed = false;
    if (o.recording) {
        // The flag before the count: a count read after it includes the last stretch.
        *complete = o.recordingComplete;
        uint32_t stored = o.recordedBytes / bytesPerSample();
        uint32_t samples = stored > o.samplesBefore ? stored - o.samplesBefore : 0;
        return samples / blockSamples * blockSamples;
    }
    *complete = true;
    WaveReadInfo info{};
    if (wioFileOpen(&info, o.sourcePath, 0) != WIO_OPENED) {
        showMessage(MESSAGE_ERROR, THREAD_OPEN_TEXT_1);
        *failed = true;
        return 0;
    }
    // The trailing part of a block at the file's end is not analysed.
    uint32_t whole = info.dataSamples / blockSamples * blockSamples;
    wioFileClose(&info);
    return whole;
}

// The end of a recording that came right after a whole chunk: the blocks the last chunk could
// not finish for want of what follows them are analysed now, with silence after the end.
static void analyseRecordingTail() {
    OpeningState& o = openingState;
    if (o.endOfSource >= 0 || o.bufferSamples == 0) return;
    std::lock_guard<std::mutex> processing(CSWaveProcessingMutex);
    o.endOfSource = int64_t(o.samplesBefore) + o.samplesRead;
    cantoscopeWaveformData();
}

void CSOpenWaveFileDataThread() {
    OpeningState& o = openingState;
    OpeningProgress& p = openingProgress;
    // Without the analysis tables there is nothing to do, but the FT files and CS.fw that
    // openWaveFile prepared must still be closed and put to rest.
    if (!analysisBuffersReady()) {
        finishOpening();
        return;
    }
    const AnalysisGeometry& g = analysisGeometry;
    uint32_t blockSamples = g.blockSamples;
    uint32_t chunk = g.topFrame;
    uint32_t leadIn = chunk * (std::max(1u, recognitionOptions.lookaheadFrames) - 1) / 2;
    uint32_t bps = bytesPerSample();
    bool firstChunk = true;
    while (true) {
        if (workerStopRequested(o.worker)) break;
        bool complete = false, failed = false;
        uint32_t wholeSamples = sourceSamples(&complete, &failed);
        if (failed) break;
        uint32_t wanted = chunk + (firstChunk ? leadIn : 0);
        // A recording is read a whole chunk at a time until its last stretch is stored; the
        // worker sleeps until the recorder has stored more.
        if (o.recording && !complete && wholeSamples - std::min(wholeSamples, o.samplesRead) < wanted) {
            suspendWorker(o.worker);
            continue;
        }
        if (o.endOfSource >= 0) break;
        if (o.samplesRead >= wholeSamples) {
            if (o.recording) analyseRecordingTail();
            break;
        }
        uint32_t count = std::min(wanted, wholeSamples - o.samplesRead);
        count = count / blockSamples * blockSamples;
        if (count == 0) break;
        WaveReadInfo info{};

        p.chunkStartedAt = clockMilliseconds();
        std::unique_lock<std::mutex> processing(CSWaveProcessingMutex);
        waitForUndoSnapshotWriter();
        std::unique_lock<std::mutex> access(CSAccessWaveFileMutex);
        if (wioFileOpen(&info, o.sourcePath, 0) != WIO_OPENED) {
            showMessage(MESSAGE_ERROR, THREAD_OPEN_TEXT_2);
            break;
        }
        int filled = fillChunkBuffer(info, count, firstChunk, leadIn);
        wioFileClose(&info);
        access.unlock();
        if (!filled) break;
        if (o.samplesRead >= wholeSamples && complete) o.endOfSource = int64_t(o.samplesBefore) + o.samplesRead;
        // While recording the recorder shows the level of what it captures.
        if (!o.recording)
            pushLevelMeterValue(levelMeterValue(o.chunkBuffer.data() + o.bufferBytes - size_t(count) * bps, count,
                                                song.waveFormat.bitsPerSample));
        int handedOn = cantoscopeWaveformData();
        if (o.recording && o.recordingChunkDone) o.recordingChunkDone(o.samplesDone);
        processing.unlock();
        p.chunks++;
        if (!handedOn || workerStopRequested(o.worker)) break;
        uint32_t now = clockMilliseconds();
        if (p.chunks > 1) {
            uint32_t cycle = now - p.chunkEndedAt;
            p.processingLoad =
                cycle ? std::min(1.0f, float(now - p.chunkStartedAt) / float(cycle) + 0.05f) : 1.0f;
        }
        p.chunkEndedAt = now;
        firstChunk = false;
        redrawBetweenChunks();
    }
    finishOpening();
}

void openingEnded() {
    joinWorker(openingState.worker);
    audioActivity.opening = false;
    songWindowHooks.redrawSongView();
    songWindowHooks.updateFrameDisplay();   // the status bar no longer says the song is being opened
}
