#pragma once
// The Hires FT block store: every sampleBlock's fine magnitude spectrum up to 5000 Hz, kept
// compressed in "CS.ft+" with its index "CS.fi+" (the FT index layout, kept up by the FT
// store's seekToFTBlock and getFTBlockIndex). The analysis writes the blocks as it makes
// them, resynthesis reads, edits and rewrites them, time editing cuts and copies them as
// stored, and the undo snapshot writer copies both files on its own thread.

#include <cstdint>
#include <cstdio>

#include "store/ftBlockStore.h"

// Bins up to this frequency are stored; the ones above are never kept.
constexpr double HIRES_FULL_BAND_LIMIT = 5000.0;   // Hz
// A stored bin is forced at least every this many bins, so that every gap fits in a byte.
constexpr uint32_t HIRES_FORCED_ENTRY_STEP = 256;
// Quantised log magnitudes run from 0 to this value (the block's loudest bin).
constexpr uint32_t HIRES_QUANTISATION_STEPS = 65535;
// Bytes of a stored block: the head (count u16, scale f32, offset f32) and per stored bin.
constexpr uint32_t HIRES_BLOCK_HEAD_BYTES = 10;
constexpr uint32_t HIRES_BYTES_PER_ENTRY = 3;

// The layout of the expanded blocks, set by the analysis when a song's analysis starts.
// Bin i is centred on lowestFrequency x (1 + i / binsPerStep).
struct HiresGeometry {
    uint32_t bins;            // N: bins per expanded block (the analysis' hires bins, N0 x G)
    double lowestFrequency;   // F: the analysis' bin spacing, Hz; the step of the centre frequencies
    double binsPerStep;       // M: bins per step of F (the analysis' group G)
    double hopFraction;       // the analysis' hop fraction (0.03125 by default); only the compressor's
                              // threshold search would read it, and that is not built
};
extern HiresGeometry hiresGeometry;

// The module's own open Hires FT files, between openHiresFTFile and closeHiresFTFile.
struct HiresFiles {
    FILE* hiresFile;        // "CS.ft+" while open, else nullptr
    FILE* hiresIndexFile;   // "CS.fi+" while open, else nullptr
    int mode;               // FTFileMode they were opened with
};
extern HiresFiles hiresFiles;

// The resynthesis' Hires buffer: the expanded blocks of the FTBlockWindow, block b (counted
// from the firstBlock its caller names) at (b - firstBlock) x N bins, two doubles per bin:
// the magnitude and a second value that reading sets to 0. Allocated when first needed.
struct HiresBuffer {
    double* bins;      // blocks x binCount x 2 doubles; nullptr until allocHiresBuffer
    uint32_t blocks;   // blocks it holds: the window capacity when it was allocated
    uint32_t binCount; // N when it was allocated
};
extern HiresBuffer hiresBuffer;

// One block in compressed form, as stored (plus the deviations, which only live in memory).
struct CompressedHiresBuffer {
    uint16_t* magnitudes;   // capacity entries: quantised log magnitudes of the stored bins
    uint8_t* gaps;          // capacity entries: bins skipped since the previous stored bin
    float* deviations;      // capacity entries: per stored bin frequency deviation, Hz; never stored
    float offset;           // frequency shift, natural-log ratio: a stored bin lies at its centre x e^offset
                            // (set by its callers: resynthesis after a pitch edit)
    float scale;            // ln(1 + the largest magnitude of the block)
    uint16_t count;         // stored bins
    uint32_t capacity;      // entries each array holds
};

// Opens "CS.ft+" and then "CS.fi+" in the shared folder into hiresFiles, with the modes of
// openFTFile (FT_READ "rb", FT_UPDATE "rb+", each file created empty first when missing),
// and runs checkFTIndexCount on the index. An update open first waits for a running undo
// snapshot copy, so call it holding no mutex. 1 on success; 0 after a message, nothing left open.
int openHiresFTFile(int mode);
// With check set, runs checkFTIndexCount on the index first; closes both files and clears
// both handles (either may already be clear). 1 when every close succeeded, else 0 (no message).
int closeHiresFTFile(int check);
// 1 while either Hires FT file is open: resynthesis gives up rather than share them.
int hiresFilesOpen();

// Allocates a buffer and its three arrays for capacity entries (N when capacity is 0).
// nullptr after a message; what was allocated is freed again.
CompressedHiresBuffer* allocCompressedHiresBuffer(uint32_t capacity);
void freeCompressedHiresBuffer(CompressedHiresBuffer* buffer);   // nullptr is allowed

// Makes hiresBuffer hold the FTBlockWindow's capacity of blocks of N bins (kept when it
// already does; contents are not preserved otherwise). 1 on success; 0 after a message.
int allocHiresBuffer();
// Releases the Hires buffer (the song is closing).
void freeHiresBuffers();

// Reads one stored block from the file's current position and expands it into destination
// (N bins of two doubles), filling deviations (N floats) when given. Without a destination
// the block must lie in the FTBlockWindow and goes into hiresBuffer at block - firstBlock.
// All N bins (and deviations) are cleared first. Returns the bytes consumed (10 + 3 x count),
// or 0 after a message; a corrupt or truncated block leaves the bins cleared.
uint32_t readHiresFTBlock(FILE* file, uint32_t firstBlock, uint32_t block, double* destination, float* deviations);
// Reads one stored block into buffer as stored (deviations set to 0). Returns the bytes
// consumed, or 0 after a message with buffer->count set to 0.
uint32_t readCompressedHiresBlock(FILE* file, CompressedHiresBuffer* buffer);
// Writes buffer as a stored block and flushes. Returns 10 + 3 x count, or 0 after a message.
uint32_t writeCompressedHiresBlock(FILE* file, const CompressedHiresBuffer* buffer);
// Compresses an expanded block (N bins of two doubles from source, or without a source
// from hiresBuffer, which needs the block in the FTBlockWindow) into buffer, taking the
// deviations (N floats) when given, and writes it. buffer->offset is written as it stands.
// Returns the bytes written, or 0 after a message.
uint32_t writeHiresFTBlock(FILE* file, uint32_t firstBlock, uint32_t block, CompressedHiresBuffer* buffer,
                           const double* source, const float* deviations);
// Positions the files at block (seekToFTBlock for writing) and writes it from hiresBuffer.
// With truncate set a changed size goes into the index (and later blocks leave it); without
// it a changed size shows its message, closes both files and returns 0, before anything is
// written. Returns the bytes written, or 0 after a message.
uint32_t storeHiresFTBlock(FILE* ftFile, FILE* indexFile, uint32_t firstBlock, CompressedHiresBuffer* buffer,
                           uint32_t block, int truncate);
// The analysis' store of blocks [from, to) from hiresBuffer (block b at b minus the
// window's first block), in ascending order with truncate set. Does nothing (returns 1) when
// "CS Disable wave editing" is on. 1 on success; 0 after a message.
int writeHiresFTBlocks(FILE* ftFile, FILE* indexFile, uint32_t from, uint32_t to);
// Cuts blocks [first, first + count) out of "CS.ft+" and "CS.fi+", moving the later blocks
// down as stored (no re-quantising) through "CS.tw", and cuts both files behind their data.
// Opens and closes the files itself, waiting for a running undo snapshot copy. 1 on success
// (count 0 does nothing); 0 on failure, after a message unless the index count itself could
// not be read. The files are unchanged when the failure came before the blocks were moved
// (a damaged index entry or block, no "CS.tw"); "CS.tw" never stays behind. The song's block
// count is left to the caller.
int removeHiresFTBlocksFromSong(uint32_t first, uint32_t count);
