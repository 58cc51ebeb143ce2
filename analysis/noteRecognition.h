#pragma once
// Note recognition: deciding the pitch track of a run of FT blocks and building the song's
// notes from it. The opening worker and the recorder call both after every chunk's frequency
// tables; whole-song analysis calls them once over the song. This unit keeps the extent of
// the pass in progress and the helpers every recognition pass shares (mainsHum, pitchDecision,
// pitchTrackCleaning, pitchFlattening, syllables and noteBuilding do the work).

#include <cstdint>
#include <vector>

#include "store/ftBlockStore.h"

// Runs the recognition passes on the blocks from the block of fromSample (never before the
// window's first block) to the song's end; toSample bounds the part of the track that is
// final. Monophonic recognition only.
void recognisePitchTrack(uint32_t fromSample, uint32_t toSample);
// Removes the last notesToDrop notes, then appends the notes found from the block of
// fromSample to the song's end. Returns the sample position the next chunk's caller keeps.
uint32_t buildNotes(uint32_t fromSample, int notesToDrop);
// Whole-song analysis: frequency tables when the song has none yet (from CS.fw, chunk by chunk,
// with recognition following), else recognition over the stored tables, window by window; the
// note list and the song's instrument list are built afresh. 1 when the pass ran to the song's
// end; 0 without a wave format or samples, while a recording or an opening runs, when the song
// has tables and "Remove Low Amplitudes" or monophonic recognition is off, or after a step's message.
int analyseSong();

// blockFlags bits recognition sets in the dataBuffers (bit 3 also in the origDataBuffers).
constexpr uint8_t BLOCK_GLISSANDO = 1;         // the block's pitch is a flattened glissando
constexpr uint8_t BLOCK_LONG_GLISSANDO = 2;    // ... of a glissando that lasted more than 0.2 s
constexpr uint8_t BLOCK_VIBRATO = 4;           // the block's pitch is a flattened vibrato
constexpr uint8_t BLOCK_SYLLABLE_START = 8;    // a syllable starts at the block

// The blocks a pass works on. Blocks before finalBlock were decided by earlier passes and
// their notes may already stand: the pass reads them (the run before a jump, the last pitch
// held) but changes only [finalBlock, endBlock), which is what the caller writes back.
struct RecognitionPass {
    uint32_t firstBlock;   // first block looked at: the block of fromSample, within the window
    uint32_t finalBlock;   // first block the pass decides afresh: the block of toSample, at least firstBlock
    uint32_t endBlock;     // one past the last block: the song's end (the window's end)
    std::vector<FrequencyEntry> keptPitches;   // [finalBlock, endBlock): the pitch entries kept before the
                                               // cleaning passes (frequency 0: none), put back after syllables
};
extern RecognitionPass recognitionPass;

// Forgets the pass, the hum table, the syllables and the song's instrument list (a song is
// closing or a new analysis starts). The note list itself is the note list's.
void resetNoteRecognition();

// ---- helpers of the passes; blocks are song blocks that lie in the FTBlockWindow ----

FTDataBuffer& blockData(uint32_t block);
FTDataBuffer& blockOrigData(uint32_t block);
FTDetectedBuffer& blockDetected(uint32_t block);
// The block's pitch: its dataBuffer's first entry's frequency when that entry has a non-zero
// amplitude, else 0 (no entry, or a zero-amplitude stand-in across a short dropout).
double blockPitch(uint32_t block);
// A whole number of nominal blocks for a length in seconds, rounded (lengths of windows and
// runs; times on the song's axis go through the time axis).
int blocksForSeconds(double seconds);
// The same length truncated, at least 1 (sampling steps).
int wholeBlocksIn(double seconds);
// f lies within g / divisor of g.
inline bool nearFrequency(double f, double g, double divisor) {
    double d = f - g;
    return (d < 0 ? -d : d) <= g / divisor;
}
// The song block that holds sample position sample (the nearest block boundary).
uint32_t blockOfSample(uint32_t sample);

// Band energy at frequency around block: over the blocks within +-halfWidthSeconds of it
// (rounded to whole blocks, clipped to the window and to endBlock), each block's summed
// amplitude of the non-hum dataBuffer entries within one semitone of frequency, divided by
// twice the semitone divisions; returns the average over those blocks (0 when none), and
// the largest single amplitude seen in *largestAmplitude when given.
double noteStrengthAt(uint32_t block, uint32_t endBlock, double frequency, double halfWidthSeconds,
                      int* largestAmplitude = nullptr);
// The same over the blocks' origDataBuffers (the entries as the analysis made them), which the
// pitch decision reads while it rewrites the dataBuffers.
double originalStrengthAt(uint32_t block, uint32_t endBlock, double frequency, double halfWidthSeconds,
                          int* largestAmplitude = nullptr);
// One block's band energy at frequency (the summed non-hum amplitudes within one semitone,
// divided by twice the semitone divisions) in dataBuffer, or in origDataBuffer with original set.
double blockBandEnergy(uint32_t block, double frequency, bool original);
