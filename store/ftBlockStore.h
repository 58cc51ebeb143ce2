#pragma once
// The FT block store: one FT block (the frequency data of a sampleBlock) per block of the song,
// kept one after another in CS.ft with CS.fi giving each block's offset and size, and the
// FTBlockWindow, at most 30 seconds of blocks in memory, that the analysis fills, note editing
// changes and writes back. The Hires FT store keeps its index in the same layout and maintains
// it with seekToFTBlock, getFTBlockIndex and setFTBlockSize.

#include <bit>
#include <cstdint>
#include <cstdio>
#include <vector>

// One pitch bin of a block. Stored exactly as it lies in memory: three 32-bit words.
struct FrequencyEntry {
    float frequency;            // Hz
    float frequencyWidth;       // frequency x the pitch step; moves with frequency
    uint8_t amplitude;          // level 0..255 (pitch edits change it in detected buffers)
    uint8_t initialAmplitude;   // level as analysed
    uint8_t cutOffLevel;        // the chunk's automatic cut-off level
    uint8_t entryFlags;         // 0 as analysed
};
static_assert(sizeof(FrequencyEntry) == 12, "a FrequencyEntry is stored as 12 bytes");
static_assert(std::endian::native == std::endian::little,
              "FT blocks are stored little-endian straight from memory");

constexpr uint32_t FT_DATA_ENTRIES = 256;       // room of dataBuffer and origDataBuffer; a stored count is below it
constexpr uint32_t FT_DETECTED_ENTRIES = 16;    // room of detectedFrequenciesBuffer; a stored count is below it
constexpr uint32_t FT_BLOCK_HEAD_BYTES = 12;    // the three counts of a stored block
constexpr double FT_WINDOW_SECONDS = 30.0;      // song time the FTBlockWindow holds

// dataBuffer and origDataBuffer of a block. Only nEntries and the entries are stored; the
// four bytes after them live in memory only.
struct FTDataBuffer {
    FrequencyEntry entries[FT_DATA_ENTRIES];   // 0 .. nEntries-1 are valid
    uint32_t nEntries;                         // 0..255
    uint8_t blockLoudness;                     // 0..255, set by the analysis
    uint8_t blockFlags;                        // glissando, vibrato and syllable bits set by note recognition
    uint8_t spare[2];                          // unused
};

// detectedFrequenciesBuffer of a block: the pitch note recognition decided on.
struct FTDetectedBuffer {
    FrequencyEntry entries[FT_DETECTED_ENTRIES];   // 0 .. nEntries-1 are valid
    uint32_t nEntries;                             // 0..15
};

// A stored block: its size in CS.ft for these counts.
constexpr uint32_t ftBlockBytes(uint32_t nData, uint32_t nOrig, uint32_t nDetected) {
    return FT_BLOCK_HEAD_BYTES + uint32_t(sizeof(FrequencyEntry)) * (nData + nOrig + nDetected);
}

// ---- the open FT files ----

// How openFTFile opens both files.
enum FTFileMode {
    FT_READ = 0,     // "rb"
    FT_UPDATE = 1    // "rb+", each file created empty first when missing
};

struct FTFiles {
    FILE* ftFile;        // CS.ft while a job has it open, else nullptr
    FILE* ftIndexFile;   // CS.fi, opened and closed with CS.ft
    int mode;            // FTFileMode they were opened with
};
extern FTFiles ftFiles;

// Opens CS.ft and then CS.fi in the shared folder and cuts the index's stored count down to
// the song's block count (update only: a file opened for reading is not written). 1 when both
// are open; 0 after "FT File(s) already open - openFTFile (1)", "Could not open FT file -
// openFTFile (2)" or "Could not open FT index file - openFTFile (3)" (CS.ft closed again).
int openFTFile(int mode);
// With check set, cuts the stored count down first (as openFTFile). Closes whichever of the
// two files is open and clears both handles. 1, or 0 when a close failed (reported).
int closeFTFile(int check);
// 1 when either FT file is open.
int ftFilesOpen();

// Cuts the count stored at the start of an index (CS.fi or the Hires index) down to the
// song's block count when it is larger. writable 0 (an index opened for reading) only reads.
// 1 when the count is within the block count afterwards or the index is empty; 0 when it
// cannot be read (an index of 1 to 3 bytes) or, writable, was larger and could not be written.
int checkFTIndexCount(FILE* indexFile, int writable = 1);

// ---- the index ----
// The block count an index holds is its stored count capped by the song's block count and by
// the entries the file has room for, so a hostile count never makes a reader go past the file.
// ok, when given, receives 1 on success and 0 on failure: a valid answer can be 0.

// The block count indexFile holds, into *count. 1; 0 (no message: callers word it) when the
// count cannot be read: no file, an index of 1 to 3 bytes, a failed seek or read. An empty
// index holds 0 blocks.
int getFTIndexCount(FILE* indexFile, uint32_t* count);

// The offset in the data file of block: entry block's offset for a block below the count c;
// for block c (c > 0) the end of block c-1, where the next block goes. Otherwise 0 after
// "Index for FT block is not stored - getFTBlockIndex (1)." (also for block 0 of an empty
// index, an unreadable count, and an end that does not fit 32 bits).
uint32_t getFTBlockIndex(FILE* indexFile, uint32_t block, int* ok = nullptr);

// Positions ftFile at block and returns the block's stored size. With forWrite set the index
// is maintained first: block c appends the entry {end of block c-1 (0 for the first), 0} and
// raises the stored count to c+1; block < c with truncate set drops every later block
// (count = block+1); block > c is refused. Without forWrite the block must be below c.
// On failure 0 (and *ok 0) after "File handle(s) not valid so cannot seek - seekToFTBlock (1)",
// "Frequency data cannot be written to FT file in seekToFTBlock (1). Data will probably be
// corrupted." (a block beyond c, or an index count that cannot be read) or "Attempting to
// seeking past end of file in seekToFTBlock (2). Data will probably be corrupted." (an entry
// that is not stored, or whose offset + size lies beyond the data file), or after a file
// routine's own message. An appended entry legitimately has size 0: test ok, not the size.
uint32_t seekToFTBlock(FILE* ftFile, FILE* indexFile, uint32_t block, int forWrite, int truncate,
                       int* ok = nullptr);

// Writes size into entry block's size field and flushes. 1; 0 when block is not in the index
// (callers seek to the block first, so that is their mistake; nothing is written) or the
// write failed (reported by the file routine).
int setFTBlockSize(FILE* indexFile, uint32_t block, uint32_t size);

// ---- blocks ----
// With all three buffers given they take part; with any of them missing the FTBlockWindow's
// buffers of block take part, and block must lie in the window.

// Reads one stored block from file's current position (blocks follow one another, so a run
// is read after one seekToFTBlock). Returns the bytes consumed (ftBlockBytes of the counts),
// or 0 after a message: readFTBlock (1) no file, (2) block not in the window, (3) (5) (7) a
// count that is out of range or cannot be read whole, or entries cut off by the file's end,
// (4) (6) (8) no memory. A buffer takes its new count and entries only when both were
// read whole: on a failure the buffers before it keep their new contents, the later ones
// their old. blockLoudness, blockFlags and spare are never touched.
uint32_t readFTBlock(FILE* file, uint32_t block, FTDataBuffer* data, FTDataBuffer* orig,
                     FTDetectedBuffer* detected);
// Writes one block at file's current position and flushes. Returns the bytes written, or 0
// after a message: writeFTBlock (1) no file, (2) block not in the window, (3) (5) (7) a count
// out of range, (4) (6) (8) no memory, all found before anything is written; or a file
// routine's message for a short write.
uint32_t writeFTBlock(FILE* file, uint32_t block, const FTDataBuffer* data, const FTDataBuffer* orig,
                      const FTDetectedBuffer* detected);

// ---- the window ----

struct FTBlockWindow {
    std::vector<FTDataBuffer> dataBuffers;                  // block b at [b - firstBlock]; size() is the room
    std::vector<FTDataBuffer> origDataBuffers;              // the same blocks before the clean-up filters
    std::vector<FTDetectedBuffer> detectedFrequenciesBuffers;  // the same blocks' recognised pitch
    uint32_t firstBlock;                                    // first block held (the analysis moves it too)
    uint32_t endBlock;                                      // one past the last block held (the analysis grows it)
    uint32_t capacity;                                      // blocks in 30.0 s of song; set when the analysis starts
};
extern FTBlockWindow ftBlockWindow;

// The capacity for blocks of sampleBlockDuration seconds: the whole blocks in 30.0 s (0 for a
// duration that is not positive). Called when a song's analysis starts.
void setFTBlockWindowCapacity(double sampleBlockDuration);
// Makes room for capacity blocks in each of the three arrays; they never shrink while the song
// is open. 1; 0 after the memory message (string 10401 and the system's text), with the
// arrays as they were.
int growFTBlockWindow();
// Frees the three arrays and sets the range and the capacity to 0 (the song is closing).
void freeFTBlockWindow();

// Fills the window from CS.ft starting at from, as far as the capacity allows (to is cut down
// to from + capacity; a shorter range is widened), never past the song's last block nor the
// last block the index holds. (0, 0) reloads the present range, discarding unsaved changes.
// Blocks a cut took off the song's end are dropped from the window first. Opens and closes the
// FT files itself. 1 when (re)loaded; 0 when [from, to) is already held (the files are not
// touched), when from is at or past the song's end (the window is left empty), or on failure
// (reported): before the files are open and positioned the window stays as it was, after that
// it ends after the last block read whole, so a stale buffer is never taken for a block.
int loadFTBlockWindow(uint32_t from, uint32_t to);
// Used by the analysis while it produces blocks, with the files open for update: writes the
// window blocks [from, to) in ascending order, each one truncating the index after it, and
// corrects each entry's size. 1; 0 after a message (a block outside the window is refused
// before the index is touched).
int rewriteFTBlocks(FILE* ftFile, FILE* indexFile, uint32_t from, uint32_t to);
// Writes the window blocks [from, to) back in place after a note edit; opens and closes the
// files. A block whose size would differ from its stored size (its counts changed) gives "Data
// size written to FT file is inconsistent with current value - writeFTBlock (1)" before it is
// written; the files are closed and later blocks not written. 1; 0 after a message.
int saveFTBlocks(uint32_t from, uint32_t to);
// Cuts blocks [first, first + count) out of CS.ft and CS.fi through CS.tw, moving the later
// blocks down and cutting both files to their new length. The caller lowers the song's block
// count. 1; 0 after a message, with the files unchanged when the failure came before the
// blocks were moved (a file that cannot be truncated afterwards is reported but still gives 1:
// the index no longer reaches the bytes left behind).
int removeFTBlocksFromSong(uint32_t first, uint32_t count);
