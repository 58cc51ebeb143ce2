#pragma once
// Frequency table creation, chunk by chunk: each call turns C sampleBlocks of the analysis
// sample buffer into FT blocks in the FTBlockWindow (pitch-bin entries with their frequency
// and level, and the block's loudness), expanded Hires spectra in the Hires store's buffer,
// and the blocks' durations on the song's time axis. The opening worker and the recorder call
// it after createMagnitudeSpectrogram, each chunk starting where the last one ended.

#include <cstdint>

// Analyses C new sampleBlocks from the block at startSample / sample rate seconds of song
// time and appends them to the song (at the song's known end, only the whole blocks left).
// The window keeps its last 30 s, the Hires buffer of the blocks not yet stored moves with
// it. Returns samplePositionAfterChunk, where the next chunk starts (trunc(time of the end
// of the last new block x rate + 0.5)); -1 when no pass is set up, or after a message when
// the window arrays, the Hires buffer or the time axis cannot be had.
int64_t createFrequencyTable(uint32_t startSample);

// The song positions createFrequencyTable(startSample) reads, [*first, *end): half a top
// frame before the chunk's first block to half a top frame after its last. The caller holds
// them in the analysis sample buffer; positions before the song or past its known end need
// not be held. With them held, the call's blocks are the same whatever else the buffer holds.
//
// What does not depend on how a song is cut into chunks, and what does:
// - Frames are placed on song positions from the start of their group of G blocks, and groups
//   start at whole multiples of G blocks, so the resolution levels, the Hires spectra and the
//   frequency of every pitch bin depend on the samples alone: any chunk size, any buffer.
// - Level bytes and block loudness are normalised per segment (at most a second of blocks,
//   and never more than the chunk), and the cut-off level and the clean-up filters work per
//   chunk: they are the same for the same chunk size (C blocks from the song's start), and
//   differ when C differs. The opening worker and the recorder use one group per chunk (setup
//   with no buffer in view, or a buffer of two top frames), and so does every reference.
// - The normalisers carry from chunk to chunk in order, so chunks must come in order, each
//   starting where the last one ended.
// - The spectrogram's rows depend on the samples alone, but its silence gate judges the rows
//   of one call together: rows appended in other portions can be gated differently.
void frequencyTableInput(uint32_t startSample, int64_t* first, int64_t* end);
