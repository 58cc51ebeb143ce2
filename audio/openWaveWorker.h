#pragma once
// CSOpenWaveFileDataThread, the opening's worker: it reads the file chunk by chunk into the
// opening state's chunk buffer, reduces each chunk to one channel, hands it on with
// cantoscopeWaveformData (spectrogram, frequency tables, Hires FT blocks, CS.fw, note
// recognition) and finishes the opening. Started by openWaveFile (audio/openWaveFile.h), which
// fills the opening state first; never touches a window: redraws are posted to the main loop.

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "audio/waveFile.h"
#include "platform/sync.h"

// The opening in progress (one song, one opening at a time). The main thread fills it in
// openWaveFile before the worker starts; from then on the worker owns every field but the
// worker handle, and the main thread reads them again once the worker has ended.
struct OpeningState {
    std::string sourcePath;         // full path of the file being opened
    WaveFormatRecord sourceFormat;  // copy of the file's format; the default record (PCM) when none is open
    float sourceDuration;           // data samples / samples per second of the file, seconds
    uint32_t samplesBefore;         // song samples that existed when the opening started (0 for a new song)
    uint32_t samplesDone;           // song samples handed to analysis: where the next frequency table starts
    uint32_t samplesRead;           // frames of the file read so far
    uint32_t sourceBytesRead;       // bytes of the file's data chunk consumed so far
    uint32_t storedSamples;         // song samples CS.fw holds
    std::vector<uint8_t> chunkBuffer;   // the song's sample size: history (a silent lead-in at first), then a chunk
    uint32_t bufferBytes;           // valid bytes in chunkBuffer
    uint32_t bufferSamples;         // valid samples in chunkBuffer
    int64_t bufferFirstSample;      // song position of chunkBuffer's first sample (negative in a new song's lead-in)
    int64_t endOfSource;            // song position after the file's last whole block once it is all read, else -1
    double recognitionShare;        // of the time since recognition last started that it may take (0.2, 0.1 with boost)
    double displayShare;            // the same for redrawing the song view (0.1, 0.05 with boost)
    uint32_t startTime;             // time counter when the opening started, hundredths of a second
    int (*quickPreferences)();      // installed by the desktop program: the accuracy/speed preferences before
                                    // opening into an empty song; 1 confirmed, 0 cancelled; null: not offered
    bool recording;                 // the worker reads a recording from CS.fw rather than a file (recorder)
    std::atomic<uint32_t> recordedBytes;    // while recording: CS.fw's data bytes stored so far (recorder)
    std::atomic<bool> recordingComplete;    // while recording: the last stretch is stored, no more comes (recorder)
    // The recorder's part at a recording's moments (audio/recording.h fills them): after each
    // chunk, with the samples analysed; as the worker finishes (CS.fw finalised); and posted as
    // the worker's last act, in place of openingEnded.
    void (*recordingChunkDone)(uint32_t samplesAnalysed);
    void (*finishRecording)();
    void (*recordingEnded)();
    SuspendableWorker worker;       // CSOpenWaveFileDataThread; its stop request is the user's stop
};
extern OpeningState openingState;

// The redraw hand-shake: the song view reads the song only between chunks, so the worker
// waits while its posted redraw runs, and withdraws one the main loop is slow to serve.
enum RedrawState {
    REDRAW_IDLE = 0,      // none posted
    REDRAW_POSTED = 1,    // posted; the worker waits for it
    REDRAW_RUNNING = 2    // running on the main thread
};

// What the worker carries from chunk to chunk besides the opening state.
struct OpeningProgress {
    uint32_t notesPosition;          // P: the sample position the last buildNotes returned (0 at first)
    int notesToDrop;                 // trailing notes the next recognition rebuilds
    uint32_t recognitionStart;       // sample from which notes are rebuilt after this chunk
    uint32_t analysisRestart;        // sample from which the pitch track is recognised again
    uint32_t recognisedTo;           // the recognitionStart of the last recognition run
    uint32_t blocksWrittenBack;      // blocks of CS.ft written since recognition last ran (all below are on file)
    uint32_t hiresBlocksStored;      // blocks whose Hires FT block is on file
    bool recognised;                 // recognition has run in this opening
    uint32_t recognitionStartedAt;   // clock, milliseconds, when recognition last started
    uint32_t recognitionTook;        // milliseconds the last recognition run took
    uint32_t chunkStartedAt;         // clock, milliseconds, when this chunk's work started
    uint32_t chunkEndedAt;           // clock, milliseconds, when the previous chunk's work ended
    int chunks;                      // chunks handed on in this opening
    float processingLoad;            // busy / cycle + 0.05, at most 1; shown as "Processor" while recording
    double recordedSeconds;          // CS.fw's audio, seconds
    std::atomic<int> redrawState;            // RedrawState of the hand-shake with the posted redraw
    std::atomic<uint32_t> redrawStartedAt;   // clock, milliseconds, of the last redraw (main thread)
    std::atomic<uint32_t> redrawTook;        // milliseconds it took (main thread)
};
extern OpeningProgress openingProgress;

// The worker's body; no argument, no result, ends by itself (posting openingEnded).
void CSOpenWaveFileDataThread();

// Hands the chunk buffer on: recognition range, spectrogram, frequency tables and Hires FT
// blocks as far as the buffer reaches, the new samples appended to CS.fw, and recognition
// unless it is throttled. 1 to go on; 0 when the opening must stop (after a message).
int cantoscopeWaveformData();

// Empties the progress (a new opening, tests).
void resetOpeningProgress();

// Posted to the main loop by the worker as its last act: joins the thread, clears the
// opening flag and redraws the song view, the meter and the frame's status.
void openingEnded();

