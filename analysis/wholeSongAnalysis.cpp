// Whole-song analysis. The FT window holds 30 s and the spectrogram a few seconds, so a song
// is analysed chunk by chunk with recognition following the newest blocks, as when a file is
// opened; a song whose tables already exist is recognised window by window.
#include "analysis/wholeSongAnalysis.h"

#include <algorithm>
#include <cmath>
#include <ctime>
#include <mutex>

#include "analysis/analysisGeometry.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/noteBuilding.h"
#include "analysis/noteRecognition.h"
#include "analysis/recognitionOptions.h"
#include "analysis/spectrogram.h"
#include "audio/audioActivity.h"
#include "audio/waveFile.h"
#include "audio/waveWorkingFile.h"
#include "notes/noteList.h"
#include "platform/files.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/undo.h"

static uint32_t samplePosition(double seconds) {
    double s = seconds * song.waveFormat.samplesPerSec;
    return s > 0.0 ? uint32_t(std::trunc(s)) : 0;
}

RecognitionRhythm startRecognitionRhythm(bool storeBlocks) {
    uint32_t start = uint32_t(std::trunc(songDuration() * song.waveFormat.samplesPerSec + 0.5));
    return RecognitionRhythm{start, start, song.blockCount, false, storeBlocks};
}

int recogniseAfterChunk(RecognitionRhythm& rhythm) {
    double rate = song.waveFormat.samplesPerSec;
    if (rate <= 0.0 || song.blockCount == 0) return 1;
    const FTBlockWindow& w = ftBlockWindow;
    double takeStart = rhythm.takeStart / rate;
    double stable = std::max(rhythm.lastBuilt / rate - 2.0, takeStart);
    double halfBlock = song.sampleBlockDuration / 2;
    int drop = 0;
    while (drop < noteList.count && noteList.notes[noteList.count - 1 - drop].waveEnd - halfBlock > stable) drop++;
    if (drop > 0 && !rhythm.liveCapture) {
        int firstDropped = noteList.count - drop;
        stable = std::max(double(noteList.notes[firstDropped].waveStart) - 0.5, takeStart);
        if (firstDropped > 0) stable = std::max(stable, double(noteList.notes[firstDropped - 1].waveEnd));
    }
    uint32_t notesFrom = std::max(rhythm.takeStart, samplePosition(stable));
    uint32_t recognitionFrom = std::max(rhythm.takeStart, samplePosition(std::max(stable - 1.0, takeStart)));
    uint32_t windowStart = samplePosition(songTimeOfBlock(w.firstBlock));
    recognitionFrom = std::max(recognitionFrom, windowStart);
    if (magnitudeSpectrogram.rowCount) recognitionFrom = std::max(recognitionFrom, magnitudeSpectrogram.firstRowPosition);
    uint32_t to = std::max(windowStart, notesFrom);
    recognisePitchTrack(std::max(windowStart, recognitionFrom), to);
    if (rhythm.storeBlocks && ftFiles.ftFile && recognitionPass.finalBlock < recognitionPass.endBlock &&
        !rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, recognitionPass.finalBlock, recognitionPass.endBlock))
        return 0;
    rhythm.lastBuilt = buildNotes(to, drop);
    rhythm.recognisedBlocks = song.blockCount;
    return 1;
}

struct FollowingPass {
    RecognitionRhythm rhythm;      // recognition's state within the pass
    bool recognise;                // recognition follows the analysis
    uint32_t stepBlocks;           // blocks between two recognition runs
    AnalysisChunkDone done;        // the caller's own callback
    void* doneContext;
    double recognitionSeconds;     // processor time spent recognising
};

static double processorSeconds() { return double(std::clock()) / CLOCKS_PER_SEC; }

static int recogniseTimed(FollowingPass& f) {
    double start = processorSeconds();
    int ok = recogniseAfterChunk(f.rhythm);
    f.recognitionSeconds += processorSeconds() - start;
    return ok;
}

static int followChunk(void* context, uint32_t firstBlock, uint32_t endBlock) {
    FollowingPass& f = *static_cast<FollowingPass*>(context);
    if (f.recognise && song.blockCount - f.rhythm.recognisedBlocks >= f.stepBlocks && !recogniseTimed(f)) return 0;
    return f.done ? f.done(f.doneContext, firstBlock, endBlock) : 1;
}

int analyseWithRecognition(AnalysisSampleSource source, void* sourceContext, AnalysisChunkDone done,
                           void* doneContext, ChunkedAnalysisTimes* times, double* recognitionSeconds) {
    const RecognitionOptions& o = recognitionOptions;
    FollowingPass f{startRecognitionRhythm(true), o.removeLowAmplitudes && o.analyseScore,
                    uint32_t(std::max(1, blocksForSeconds(RECOGNITION_STEP_SECONDS))), done, doneContext, 0.0};
    if (recognitionSeconds) *recognitionSeconds = 0.0;
    int analysed = analyseSource(source, sourceContext, followChunk, &f, times);
    // The last blocks are recognised once the source has ended.
    if (analysed && f.recognise && song.blockCount > f.rhythm.recognisedBlocks) analysed = recogniseTimed(f);
    if (recognitionSeconds) *recognitionSeconds = f.recognitionSeconds;
    return analysed;
}

// ---- whole-song analysis ----

// CS.fw read piece by piece, each under the wave file's mutex.
struct WorkingWaveSource {
    uint32_t nextSample;   // song sample position of the next read
    uint32_t samples;      // samples CS.fw holds
};

static uint32_t readWorkingWave(void* context, uint8_t* destination, uint32_t count) {
    WorkingWaveSource& s = *static_cast<WorkingWaveSource*>(context);
    uint32_t n = std::min(count, s.samples - std::min(s.samples, s.nextSample));
    if (n == 0) return 0;
    uint32_t bytesPerSample = song.waveFormat.bitsPerSample / 8;
    waitForUndoSnapshotWriter();
    std::lock_guard<std::mutex> access(CSAccessWaveFileMutex);
    unmaskWaveWorkingFile();
    struct MaskAgain {
        ~MaskAgain() { maskWaveWorkingFile(); }
    } maskAgain;
    WaveReadInfo reader{};
    if (wioFileOpen(&reader, sharedFilePath("CS.fw"), 0) != WIO_OPENED) return 0;
    uint32_t got = 0;
    if (fileSeek(reader.file, int64_t(reader.dataOffset) + int64_t(s.nextSample) * bytesPerSample, SEEK_SET) == 0)
        got = uint32_t(fileRead(destination, size_t(n) * bytesPerSample, reader.file) / bytesPerSample);
    wioFileClose(&reader);
    s.nextSample += got;
    return got;
}

struct ProgressGuard {
    ~ProgressGuard() { endProgress(); }
};

static int stepAnalysisProgress(void*, uint32_t, uint32_t endBlock) {
    stepProgress(int(endBlock));
    return 1;
}

static void emptyNoteList() {
    while (noteList.count > 0) removeNote(noteList.count - 1);
}

// Tables and recognition together, from CS.fw.
static int analyseWorkingWave() {
    uint32_t bytesPerSample = song.waveFormat.bitsPerSample / 8;
    WorkingWaveSource source{0, bytesPerSample ? song.workingWaveBytes / bytesPerSample : 0};
    double seconds = double(source.samples) / song.waveFormat.samplesPerSec;
    emptyNoteList();
    resetSongInstruments();
    if (!setupFrequencyAnalysis()) return 0;
    struct Release {
        ~Release() { releaseFrequencyAnalysis(); }
    } release;
    beginProgress(resourceString(ANALYSING_WAVE_STRING), int(seconds / song.sampleBlockDuration));
    ProgressGuard progress;
    if (!openFTFile(FT_UPDATE)) return 0;
    struct CloseFT {
        ~CloseFT() { closeFTFile(1); }
    } closeFT;
    if (!openHiresFTFile(FT_UPDATE)) return 0;
    struct CloseHires {
        ~CloseHires() { closeHiresFTFile(1); }
    } closeHires;
    return analyseWithRecognition(readWorkingWave, &source, stepAnalysisProgress, nullptr);
}

// Recognition over tables already stored, one window after another. Only the last window,
// which reaches the song's end, is written back: rewriting a block drops every later block
// from the index, and the earlier windows' blocks hold the recognition made while they were
// analysed.
static int recogniseStoredBlocks() {
    emptyNoteList();
    resetSongInstruments();
    uint32_t capacity = ftBlockWindow.capacity;
    if (capacity == 0) {
        setFTBlockWindowCapacity(song.sampleBlockDuration);
        capacity = ftBlockWindow.capacity;
    }
    if (capacity == 0 || !growFTBlockWindow()) return 0;
    beginProgress(resourceString(ANALYSING_WAVE_STRING), int(song.blockCount));
    ProgressGuard progress;
    if (!analysisGeometry.sampleRate &&
        !deriveAnalysisGeometry(song.waveFormat.samplesPerSec, song.waveFormat.bitsPerSample, recognitionOptions, 0,
                                &analysisGeometry))
        return 0;
    RecognitionRhythm rhythm{0, 0, 0, false, false};
    uint32_t from = 0;
    while (true) {
        if (!loadFTBlockWindow(from, from + capacity) && !(ftBlockWindow.firstBlock == from && ftBlockWindow.endBlock > from))
            return 0;
        bool last = ftBlockWindow.endBlock >= song.blockCount;
        if (last && !openFTFile(FT_UPDATE)) return 0;
        rhythm.storeBlocks = last;
        int ok = recogniseAfterChunk(rhythm);
        if (last) {
            if (!closeFTFile(1)) ok = 0;
            return ok;
        }
        if (!ok) return 0;
        stepProgress(int(ftBlockWindow.endBlock));
        // The next window starts half a window back, so that the notes the next run drops
        // and the second before them are still held.
        uint32_t next = ftBlockWindow.endBlock - capacity / 2;
        from = std::max(next, from + 1);
    }
}

int analyseSong() {
    if (!song.waveFormat.samplesPerSec || (song.blockCount == 0 && song.workingWaveBytes == 0)) return 0;
    if (recordingOrOpeningActive()) return 0;
    const RecognitionOptions& o = recognitionOptions;
    bool hadBlocks = song.blockCount > 0;
    if (!hadBlocks) return analyseWorkingWave();
    if (!o.removeLowAmplitudes || !o.monophonicRecognition) return 0;
    return recogniseStoredBlocks();
}
