#pragma once
// The blocks recognition works on: the flags its passes set, the extent of a pass, and the
// helpers every pass uses to reach a block's buffers and to turn seconds into blocks.
// Blocks are song blocks that lie in the FTBlockWindow.

#include <cstdint>
#include <vector>

#include "store/ftBlockStore.h"

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
