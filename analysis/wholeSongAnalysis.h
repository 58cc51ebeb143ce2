#pragma once
// Whole-song analysis and the rhythm in which recognition follows an analysis pass chunk by
// chunk: which notes the next chunk may change, where recognition restarts, and which blocks
// it rewrites. analyseSong runs after a recording made with the recorder dialog; the
// command-line tool's analyse command runs the same pass over a wave file.

#include <cstdint>

#include "analysis/chunkedAnalysis.h"

// Whole-song analysis: frequency tables when the song has none yet (from CS.fw, chunk by chunk,
// with recognition following), else recognition over the stored tables, window by window; the
// note list and the song's instrument list are built afresh. 1 when the pass ran to the song's
// end; 0 without a wave format or samples, while a recording or an opening runs, when the song
// has tables and "Remove Low Amplitudes" or monophonic recognition is off, or after a step's message.
int analyseSong();

// Recognition follows the analysis at least this much song apart, seconds; the last chunk is
// always recognised. Each run looks back about three seconds, so running after every chunk
// of a third of a second would decide most blocks nine times over.
constexpr double RECOGNITION_STEP_SECONDS = 1.0;
// The resource string of the progress window while the tables are made.
constexpr int ANALYSING_WAVE_STRING = 10297;

// What recognition carries from one run to the next within a pass.
struct RecognitionRhythm {
    uint32_t takeStart;        // sample position where the pass began
    uint32_t lastBuilt;        // P: the position buildNotes returned last (takeStart at first)
    uint32_t recognisedBlocks; // the song's block count at the last run
    bool liveCapture;          // a recording is being captured: dropped notes do not move the restart back
    bool storeBlocks;          // write the rewritten blocks to the open FT files
};

// Starts a rhythm at the song's present end.
RecognitionRhythm startRecognitionRhythm(bool storeBlocks);
// One recognition run after a chunk: the notes whose end lies after the stable time are
// dropped, the pitch track is decided again from a second before where they may change, the
// rewritten blocks are stored (when asked and the FT files are open), and the notes are built
// again. 1; 0 when storing the blocks failed (reported).
int recogniseAfterChunk(RecognitionRhythm& rhythm);

// Runs an analysis pass over source (after setupFrequencyAnalysis, with the FT files open or
// not) with recognition following it in the rhythm above when "Remove Low Amplitudes" and
// "Analyse score" are on; done, when given, is called after each chunk (and after the chunk's
// recognition run, when one was due) with the chunk's new blocks; the blocks recognition
// decided are recognitionPass's. The last run comes after the last chunk's done. 1 when the
// source was analysed and recognised to its end; 0 after a step's message or when done
// stopped the pass. recognitionSeconds, when given, receives the processor time recognition took.
int analyseWithRecognition(AnalysisSampleSource source, void* sourceContext, AnalysisChunkDone done = nullptr,
                           void* doneContext = nullptr, ChunkedAnalysisTimes* times = nullptr,
                           double* recognitionSeconds = nullptr);
