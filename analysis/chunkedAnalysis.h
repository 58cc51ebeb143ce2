#pragma once
// A whole analysis pass over a source of samples on the calling thread, chunk by chunk the
// way the opening worker hands chunks on: one top frame of new samples at a time, the
// spectrogram and then as many frequency tables as the held samples allow, the blocks stored
// when the FT and Hires FT files are open, and only as much audio and spectrogram kept as the
// next chunks need, so memory does not grow with the source's length. The command-line tool,
// the benchmark and the tests use it; the opening worker keeps the same rhythm on its own thread.

#include <cstdint>

// Fills destination with up to count samples of the song's size (one channel) and returns
// how many it gave; fewer than count only when the source has ended.
typedef uint32_t (*AnalysisSampleSource)(void* context, uint8_t* destination, uint32_t count);
// Called after each chunk with the blocks [firstBlock, endBlock) it appended (stored, when
// the files are open). Returning 0 stops the pass.
typedef int (*AnalysisChunkDone)(void* context, uint32_t firstBlock, uint32_t endBlock);

// Spectrogram rows kept behind the analysis: what recognition looks back over.
constexpr double SPECTROGRAM_KEEP_SECONDS = 3.0;

// Processor time the pass spent in each stage, seconds.
struct ChunkedAnalysisTimes {
    double spectrogram;   // createMagnitudeSpectrogram
    double tables;        // createFrequencyTable
    double storing;       // rewriteFTBlocks and writeHiresFTBlocks
};

// Runs the pass from the song's end (after setupFrequencyAnalysis, with no analysis sample
// buffer set, so that a chunk is one group of blocks). 1 when the source was analysed to its
// end; 0 when a step failed (after its message) or done stopped the pass. The analysis
// sample buffer is cleared on return; times, when given, receives the stage times.
int analyseSource(AnalysisSampleSource source, void* sourceContext, AnalysisChunkDone done, void* doneContext,
                  ChunkedAnalysisTimes* times = nullptr);
