#pragma once
// CSOpenWaveFileDataThread, the opening's worker: it reads the file chunk by chunk into the
// opening state's chunk buffer, reduces each chunk to one channel, hands it on with
// cantoscopeWaveformData (spectrogram, frequency tables, Hires FT blocks, CS.fw, note
// recognition) and finishes the opening. Started by openWaveFile; never touches a window:
// redraws are posted to the main loop.

#include <atomic>
#include <cstdint>

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
