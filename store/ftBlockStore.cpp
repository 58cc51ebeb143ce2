// The FT files and their index, the reading and writing of single FT blocks, and the
// window's memory. Every count, offset and size read from CS.fi or CS.ft is checked against
// the file and the buffers before anything is read or allocated for it.
#include "store/ftBlockStore.h"

#include <cerrno>
#include <cstring>
#include <memory>
#include <new>
#include <string>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/song.h"

FTFiles ftFiles;
FTBlockWindow ftBlockWindow;

static const uint32_t INDEX_HEAD_BYTES = 4;    // the stored count
static const uint32_t INDEX_ENTRY_BYTES = 8;   // offset and size of one block

static int flushReported(FILE* f) {
    if (fileFlush(f) != 0) {
        showMessage(MESSAGE_ERROR, resourceString(10232));
        return 0;
    }
    return 1;
}

// Bytes in f; the position is left at the end. -1 after "File could not be seeked".
static int64_t streamLength(FILE* f) {
    int64_t length = -1;
    if (fileSeek(f, 0, SEEK_END) == 0) length = fileTell(f);
    if (length < 0) showMessage(MESSAGE_ERROR, resourceString(10231));
    return length;
}

static int writeWordsAt(FILE* f, int64_t offset, const uint32_t* words, size_t count) {
    return seekReportedFile(f, offset) && writeReportedBytes(f, words, count * sizeof *words);
}

static int writeWordAt(FILE* f, int64_t offset, uint32_t word) { return writeWordsAt(f, offset, &word, 1); }

static int64_t indexEntryOffset(uint32_t block) { return INDEX_HEAD_BYTES + int64_t(INDEX_ENTRY_BYTES) * block; }

struct FTIndexEntry {
    uint32_t offset;   // bytes from the start of the data file
    uint32_t size;     // bytes of the stored block
};

// Entry block of an index whose count is known to include it.
static int readIndexEntry(FILE* indexFile, uint32_t block, FTIndexEntry* entry) {
    uint32_t words[2];
    if (!seekReportedFile(indexFile, indexEntryOffset(block)) || !readReportedBytes(indexFile, words, sizeof words))
        return 0;
    entry->offset = words[0];
    entry->size = words[1];
    return 1;
}

// The count as it lies in the file, with the bytes the file holds. An empty index holds no
// count and counts 0 blocks; 1 to 3 bytes cannot be read.
static int readStoredCount(FILE* indexFile, uint32_t* stored, int64_t* length) {
    *length = streamLength(indexFile);
    if (*length < 0) return 0;
    *stored = 0;
    if (*length == 0) return 1;
    if (*length < int64_t(INDEX_HEAD_BYTES)) return 0;
    return seekReportedFile(indexFile, 0) && readReportedBytes(indexFile, stored, sizeof *stored);
}

int getFTIndexCount(FILE* indexFile, uint32_t* count) {
    uint32_t stored;
    int64_t length;
    if (!indexFile || !readStoredCount(indexFile, &stored, &length)) return 0;
    int64_t room = length >= int64_t(INDEX_HEAD_BYTES) ? (length - INDEX_HEAD_BYTES) / INDEX_ENTRY_BYTES : 0;
    int64_t held = stored;
    if (held > song.blockCount) held = song.blockCount;
    if (held > room) held = room;
    *count = uint32_t(held);
    return 1;
}

int checkFTIndexCount(FILE* indexFile, int writable) {
    uint32_t stored;
    int64_t length;
    if (!indexFile || !readStoredCount(indexFile, &stored, &length)) return 0;
    if (stored <= song.blockCount) return 1;
    if (!writable) return 1;
    return writeWordAt(indexFile, 0, song.blockCount) && flushReported(indexFile);
}

// ---- the open files ----

// Opens name in the shared folder; an update open creates the file empty first when it is missing.
static FILE* openFTStream(const char* name, int mode) {
    std::string path = sharedFilePath(name);
    if (mode == FT_UPDATE && !fileExists(path)) {
        FILE* created = fileOpen(path, "wb");
        if (!created) return nullptr;
        fileClose(created);
    }
    return fileOpen(path, mode == FT_UPDATE ? "rb+" : "rb");
}

int openFTFile(int mode) {
    if (ftFiles.ftFile || ftFiles.ftIndexFile) {
        showMessage(MESSAGE_ERROR, "FT File(s) already open - openFTFile (1)");
        return 0;
    }
    FILE* ftFile = openFTStream("CS.ft", mode);
    if (!ftFile) {
        showMessage(MESSAGE_ERROR, "Could not open FT file - openFTFile (2)");
        return 0;
    }
    FILE* indexFile = openFTStream("CS.fi", mode);
    if (!indexFile) {
        fileClose(ftFile);
        showMessage(MESSAGE_ERROR, "Could not open FT index file - openFTFile (3)");
        return 0;
    }
    ftFiles.ftFile = ftFile;
    ftFiles.ftIndexFile = indexFile;
    ftFiles.mode = mode;
    // An index of 1 to 3 bytes keeps its count here; every reader refuses it with its own message.
    checkFTIndexCount(indexFile, mode == FT_UPDATE);
    return 1;
}

int closeFTFile(int check) {
    if (check && ftFiles.ftIndexFile) checkFTIndexCount(ftFiles.ftIndexFile, ftFiles.mode == FT_UPDATE);
    int closed = 1;
    if (ftFiles.ftFile && !closeReportedFile(ftFiles.ftFile)) closed = 0;
    if (ftFiles.ftIndexFile && !closeReportedFile(ftFiles.ftIndexFile)) closed = 0;
    ftFiles.ftFile = nullptr;
    ftFiles.ftIndexFile = nullptr;
    ftFiles.mode = FT_READ;
    return closed;
}

int ftFilesOpen() { return ftFiles.ftFile || ftFiles.ftIndexFile ? 1 : 0; }

// ---- the index ----

static const char* const INDEX_NOT_STORED = "Index for FT block is not stored - getFTBlockIndex (1).";
static const char* const SEEK_PAST_END =
    "Attempting to seeking past end of file in seekToFTBlock (2). Data will probably be corrupted.";
static const char* const CANNOT_WRITE_BLOCK =
    "Frequency data cannot be written to FT file in seekToFTBlock (1). Data will probably be corrupted.";

static void setOk(int* ok, int value) {
    if (ok) *ok = value;
}

// The end of the last of count blocks (offset + size of entry count-1), where the next one
// goes; 0 when count is 0. Fails when the end does not fit an offset.
static int endOfBlocks(FILE* indexFile, uint32_t count, uint32_t* end) {
    *end = 0;
    if (count == 0) return 1;
    FTIndexEntry last;
    if (!readIndexEntry(indexFile, count - 1, &last)) return 0;
    uint64_t sum = uint64_t(last.offset) + last.size;
    if (sum > UINT32_MAX) return 0;
    *end = uint32_t(sum);
    return 1;
}

uint32_t getFTBlockIndex(FILE* indexFile, uint32_t block, int* ok) {
    setOk(ok, 0);
    uint32_t count;
    if (getFTIndexCount(indexFile, &count)) {
        FTIndexEntry entry;
        if (block < count && readIndexEntry(indexFile, block, &entry)) {
            setOk(ok, 1);
            return entry.offset;
        }
        uint32_t end;
        if (block == count && count > 0 && endOfBlocks(indexFile, count, &end)) {
            setOk(ok, 1);
            return end;
        }
    }
    showMessage(MESSAGE_ERROR, INDEX_NOT_STORED);
    return 0;
}

uint32_t seekToFTBlock(FILE* ftFile, FILE* indexFile, uint32_t block, int forWrite, int truncate, int* ok) {
    setOk(ok, 0);
    if (!ftFile || !indexFile) {
        showMessage(MESSAGE_ERROR, "File handle(s) not valid so cannot seek - seekToFTBlock (1)");
        return 0;
    }
    uint32_t count;
    int counted = getFTIndexCount(indexFile, &count);
    if (forWrite) {
        if (!counted || block > count) {
            showMessage(MESSAGE_ERROR, CANNOT_WRITE_BLOCK);
            return 0;
        }
        if (block == count) {
            uint32_t end;
            if (!endOfBlocks(indexFile, count, &end) || count == UINT32_MAX) {
                showMessage(MESSAGE_ERROR, CANNOT_WRITE_BLOCK);
                return 0;
            }
            const uint32_t appended[2] = {end, 0};
            if (!writeWordsAt(indexFile, indexEntryOffset(block), appended, 2) || !writeWordAt(indexFile, 0, count + 1))
                return 0;
            count++;
        } else if (truncate) {
            if (!writeWordAt(indexFile, 0, block + 1)) return 0;
            count = block + 1;
        }
        if (!flushReported(indexFile)) return 0;
    }
    // An entry that is not stored, or that reaches past the data file, would have us read or
    // write somewhere no block lies: both count as seeking past the end.
    FTIndexEntry entry{0, 0};
    int64_t length = -1;
    if (counted && block < count) {
        if (!readIndexEntry(indexFile, block, &entry)) {
            showMessage(MESSAGE_ERROR, SEEK_PAST_END);
            return 0;
        }
        length = streamLength(ftFile);
        if (length < 0) return 0;
    }
    if (length < 0 || int64_t(entry.offset) + entry.size > length) {
        showMessage(MESSAGE_ERROR, SEEK_PAST_END);
        return 0;
    }
    if (!seekReportedFile(ftFile, entry.offset)) return 0;
    setOk(ok, 1);
    return entry.size;
}

int setFTBlockSize(FILE* indexFile, uint32_t block, uint32_t size) {
    uint32_t count;
    if (!getFTIndexCount(indexFile, &count) || block >= count) return 0;
    return writeWordAt(indexFile, indexEntryOffset(block) + 4, size) && flushReported(indexFile);
}

// ---- blocks ----

// The three buffers a block read or write works on: the caller's, or the window's for block.
struct FTBlockBuffers {
    FTDataBuffer* data;
    FTDataBuffer* orig;
    FTDetectedBuffer* detected;
};

static int windowBuffers(uint32_t block, FTBlockBuffers* buffers) {
    const FTBlockWindow& w = ftBlockWindow;
    if (block < w.firstBlock || block >= w.endBlock) return 0;
    size_t slot = block - w.firstBlock;
    if (slot >= w.dataBuffers.size() || slot >= w.origDataBuffers.size() || slot >= w.detectedFrequenciesBuffers.size())
        return 0;
    buffers->data = &ftBlockWindow.dataBuffers[slot];
    buffers->orig = &ftBlockWindow.origDataBuffers[slot];
    buffers->detected = &ftBlockWindow.detectedFrequenciesBuffers[slot];
    return 1;
}

static std::unique_ptr<uint8_t[]> allocContinuousDataBuffer(size_t bytes) {
    if (!allocationAllowed()) return nullptr;
    return std::unique_ptr<uint8_t[]>(new (std::nothrow) uint8_t[bytes]);
}

// One buffer's count and entries. The buffer takes them only when both were read whole, and
// a count is checked before anything is allocated or read for it.
static int readBufferEntries(FILE* file, FrequencyEntry* entries, uint32_t* nEntries, uint32_t room,
                             const char* corruptText, const char* memoryText, uint32_t* bytes) {
    uint32_t count;
    if (!readReportedBytes(file, &count, sizeof count) || count >= room) {
        showMessage(MESSAGE_ERROR, corruptText);
        return 0;
    }
    size_t entryBytes = size_t(count) * sizeof(FrequencyEntry);
    if (count > 0) {
        std::unique_ptr<uint8_t[]> continuousDataBuffer = allocContinuousDataBuffer(entryBytes);
        if (!continuousDataBuffer) {
            showMessage(MESSAGE_ERROR, memoryText);
            return 0;
        }
        // Entries cut off by the file's end mean the count was wrong.
        if (!readReportedBytes(file, continuousDataBuffer.get(), entryBytes)) {
            showMessage(MESSAGE_ERROR, corruptText);
            return 0;
        }
        std::memcpy(entries, continuousDataBuffer.get(), entryBytes);
    }
    *nEntries = count;
    *bytes += uint32_t(sizeof count + entryBytes);
    return 1;
}

uint32_t readFTBlock(FILE* file, uint32_t block, FTDataBuffer* data, FTDataBuffer* orig, FTDetectedBuffer* detected) {
    if (!file) {
        showMessage(MESSAGE_ERROR, "File handle not valid so cannot read data - readFTBlock (1)");
        return 0;
    }
    FTBlockBuffers to{data, orig, detected};
    if ((!data || !orig || !detected) && !windowBuffers(block, &to)) {
        showMessage(MESSAGE_ERROR, "Block to read not in memory so cannot read data - readFTBlock (2)");
        return 0;
    }
    uint32_t bytes = 0;
    if (!readBufferEntries(file, to.data->entries, &to.data->nEntries, FT_DATA_ENTRIES,
                           "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)",
                           "Could not allocate continuousDataBuffer so data could not be read - readFTBlock (4)",
                           &bytes) ||
        !readBufferEntries(file, to.orig->entries, &to.orig->nEntries, FT_DATA_ENTRIES,
                           "origDataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (5)",
                           "Could not allocate continuousDataBuffer so data could not be read - readFTBlock (6)",
                           &bytes) ||
        !readBufferEntries(file, to.detected->entries, &to.detected->nEntries, FT_DETECTED_ENTRIES,
                           "detectedFrequenciesBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (7)",
                           "Could not allocate continuousDataBuffer so data could not be read - readFTBlock (8)",
                           &bytes))
        return 0;
    return bytes;
}

// One buffer on its way out: its count and its entries gathered into one continuousDataBuffer.
struct OutgoingEntries {
    const FrequencyEntry* entries;                       // the buffer's entries
    uint32_t count;                                      // its nEntries, checked
    std::unique_ptr<uint8_t[]> continuousDataBuffer;     // count x 12 bytes; none for 0 entries
};

uint32_t writeFTBlock(FILE* file, uint32_t block, const FTDataBuffer* data, const FTDataBuffer* orig,
                      const FTDetectedBuffer* detected) {
    if (!file) {
        showMessage(MESSAGE_ERROR, "File handle not valid so cannot write data - writeFTBlock (1)");
        return 0;
    }
    if (!data || !orig || !detected) {
        FTBlockBuffers window;
        if (!windowBuffers(block, &window)) {
            showMessage(MESSAGE_ERROR, "Block to write not in memory so cannot write data - writeFTBlock (2)");
            return 0;
        }
        data = window.data;
        orig = window.orig;
        detected = window.detected;
    }
    OutgoingEntries out[3] = {{data->entries, data->nEntries, nullptr},
                              {orig->entries, orig->nEntries, nullptr},
                              {detected->entries, detected->nEntries, nullptr}};
    static const uint32_t room[3] = {FT_DATA_ENTRIES, FT_DATA_ENTRIES, FT_DETECTED_ENTRIES};
    static const char* const corruptText[3] = {
        "dataBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (3)",
        "origDataBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (5)",
        "detectedFrequenciesBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (7)"};
    static const char* const memoryText[3] = {
        "Could not allocate continuousDataBuffer so data could not be written - writeFTBlock (4)",
        "Could not allocate continuousDataBuffer so data could not be written - writeFTBlock (6)",
        "Could not allocate continuousDataBuffer so data could not be written - writeFTBlock (8)"};
    // Every count is checked and every buffer allocated before the first byte goes out, so a
    // refused block never leaves half a block in the file.
    for (int i = 0; i < 3; i++) {
        if (out[i].count >= room[i]) {
            showMessage(MESSAGE_ERROR, corruptText[i]);
            return 0;
        }
    }
    for (int i = 0; i < 3; i++) {
        if (out[i].count == 0) continue;
        out[i].continuousDataBuffer = allocContinuousDataBuffer(out[i].count * sizeof(FrequencyEntry));
        if (!out[i].continuousDataBuffer) {
            showMessage(MESSAGE_ERROR, memoryText[i]);
            return 0;
        }
    }
    uint32_t bytes = 0;
    for (OutgoingEntries& o : out) {
        size_t entryBytes = o.count * sizeof(FrequencyEntry);
        if (!writeReportedBytes(file, &o.count, sizeof o.count)) return 0;
        if (entryBytes > 0) {
            std::memcpy(o.continuousDataBuffer.get(), o.entries, entryBytes);
            if (!writeReportedBytes(file, o.continuousDataBuffer.get(), entryBytes)) return 0;
        }
        bytes += uint32_t(sizeof o.count + entryBytes);
    }
    if (!flushReported(file)) return 0;
    return bytes;
}

// ---- the window's memory ----

void setFTBlockWindowCapacity(double sampleBlockDuration) {
    double blocks = sampleBlockDuration > 0.0 ? FT_WINDOW_SECONDS / sampleBlockDuration : 0.0;
    // A duration too short for the count to be held is no duration anyone can analyse; the
    // largest count still fails cleanly as memory that cannot be had.
    if (!(blocks < double(UINT32_MAX))) blocks = double(UINT32_MAX);
    ftBlockWindow.capacity = uint32_t(blocks);
}

int growFTBlockWindow() {
    FTBlockWindow& w = ftBlockWindow;
    size_t blocks = w.capacity;
    if (w.dataBuffers.size() >= blocks && w.origDataBuffers.size() >= blocks &&
        w.detectedFrequenciesBuffers.size() >= blocks)
        return 1;
    // All three arrays get their room before any of them grows, so a failure leaves them as they were.
    errno = 0;
    if (!tryAllocate([&] {
            w.dataBuffers.reserve(blocks);
            w.origDataBuffers.reserve(blocks);
            w.detectedFrequenciesBuffers.reserve(blocks);
        })) {
        showMessage(MESSAGE_ERROR, resourceString(10401) + "\n" + std::strerror(errno ? errno : ENOMEM));
        return 0;
    }
    if (w.dataBuffers.size() < blocks) w.dataBuffers.resize(blocks);
    if (w.origDataBuffers.size() < blocks) w.origDataBuffers.resize(blocks);
    if (w.detectedFrequenciesBuffers.size() < blocks) w.detectedFrequenciesBuffers.resize(blocks);
    return 1;
}

void freeFTBlockWindow() {
    std::vector<FTDataBuffer>().swap(ftBlockWindow.dataBuffers);
    std::vector<FTDataBuffer>().swap(ftBlockWindow.origDataBuffers);
    std::vector<FTDetectedBuffer>().swap(ftBlockWindow.detectedFrequenciesBuffers);
    ftBlockWindow.firstBlock = 0;
    ftBlockWindow.endBlock = 0;
    ftBlockWindow.capacity = 0;
}
