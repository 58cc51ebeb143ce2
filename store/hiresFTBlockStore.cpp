// The Hires FT block store: compression of expanded blocks, the stored layout, expansion,
// the resynthesis' Hires buffer and the cutting of blocks for time editing. Stored blocks
// come from files that may be damaged, so every count, scale and offset read from them is
// checked before it is used.
#include "store/hiresFTBlockStore.h"

#include <algorithm>
#include <cassert>
#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <new>
#include <string>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/fileRoutines.h"
#include "store/ftBlockStore.h"
#include "store/song.h"
#include "store/undo.h"

HiresGeometry hiresGeometry;
HiresFiles hiresFiles;
HiresBuffer hiresBuffer;


static const char* const WRITE_NO_FILE_TEXT = "File handle not valid so cannot write data - writeHiresFTBlock (1)";
static const char* const WRITE_NOT_IN_MEMORY_TEXT =
    "Block to write not in memory so cannot write data - writeHiresFTBlock (2)";
static const char* const STORE_SIZE_CHANGED_TEXT =
    "Data size written to Hires FT file is inconsistent with current value - writeHiresFTBlock (1)";
static const char* const READ_NO_FILE_TEXT = "File handle not valid so cannot read data - readHiresFTBlock (1)";
static const char* const READ_NOT_IN_MEMORY_TEXT =
    "Block to read not in memory so cannot read data - readHiresFTBlock (2)";
static const char* const READ_CORRUPT_TEXT =
    "Number of freqBlock entries is corrupt so cannot read Hires FT block - readHiresFTBlock (3)";
static const char* const ALLOC_RECORD_TEXT =
    "Could not allocate compressed hires buffer - allocCompressedHiresBuffer (1)";
static const char* const ALLOC_ARRAY_TEXT = "Could not allocate compressed hires buffer - allocCompressedHiresBuffer (2)";
static const char* const OPEN_ALREADY_TEXT = "Hires FT File(s) already open - openHiresFTFile (1)";
static const char* const OPEN_DATA_TEXT = "Could not open Hires FT file - openHiresFTFile (2)";
static const char* const OPEN_INDEX_TEXT = "Could not open Hires FT index file - openHiresFTFile (3)";
static const char* const REMOVE_SIZE_TEXT =
    "bytesWritten does not equal bytesRead - removeHiresFTBlocksFromSong (1). Data may be corrupted.";
static const char* const HIRES_BUFFER_TEXT = "Could not allocate Hires buffer - allocHiresBuffer (1)";
// The FT store's text for an index entry that lies past the data, shown when a cut meets one.
static const char* const SEEK_PAST_END_TEXT =
    "Attempting to seeking past end of file in seekToFTBlock (2). Data will probably be corrupted.";

static const char* const HIRES_FILE_NAME = "CS.ft+";
static const char* const HIRES_INDEX_FILE_NAME = "CS.fi+";
static const char* const TEMPORARY_FILE_NAME = "CS.tw";

// ---- allocation ----

template <typename T>
static T* allocateArray(uint32_t count) {
    if (!allocationAllowed()) return nullptr;
    return new (std::nothrow) T[count == 0 ? 1 : count];
}

CompressedHiresBuffer* allocCompressedHiresBuffer(uint32_t capacity) {
    if (capacity == 0) capacity = hiresGeometry.bins;
    CompressedHiresBuffer* buffer = allocationAllowed() ? new (std::nothrow) CompressedHiresBuffer{} : nullptr;
    if (!buffer) {
        showMessage(MESSAGE_ERROR, ALLOC_RECORD_TEXT);
        return nullptr;
    }
    buffer->capacity = capacity;
    buffer->magnitudes = allocateArray<uint16_t>(capacity);
    if (buffer->magnitudes) buffer->gaps = allocateArray<uint8_t>(capacity);
    if (buffer->gaps) buffer->deviations = allocateArray<float>(capacity);
    if (!buffer->deviations) {
        freeCompressedHiresBuffer(buffer);
        showMessage(MESSAGE_ERROR, ALLOC_ARRAY_TEXT);
        return nullptr;
    }
    return buffer;
}

void freeCompressedHiresBuffer(CompressedHiresBuffer* buffer) {
    if (!buffer) return;
    delete[] buffer->magnitudes;
    delete[] buffer->gaps;
    delete[] buffer->deviations;
    delete buffer;
}

struct FreeCompressed {
    void operator()(CompressedHiresBuffer* buffer) const { freeCompressedHiresBuffer(buffer); }
};
using CompressedHiresBufferHolder = std::unique_ptr<CompressedHiresBuffer, FreeCompressed>;

int allocHiresBuffer() {
    uint32_t blocks = ftBlockWindow.capacity;
    uint32_t bins = hiresGeometry.bins;
    if (hiresBuffer.bins && hiresBuffer.blocks >= blocks && hiresBuffer.binCount == bins) return 1;
    freeHiresBuffers();
    size_t pairs = size_t(blocks) * bins;
    if (pairs == 0) return 1;   // nothing to hold yet: no window, or no geometry
    // calloc: the pages of a buffer this large are zeroed lazily by the system, so blocks
    // never read come out silent, and a request too large fails here instead of throwing.
    double* bytes = nullptr;
    if (allocationAllowed() && pairs <= SIZE_MAX / (2 * sizeof(double)))
        bytes = static_cast<double*>(std::calloc(pairs * 2, sizeof(double)));
    if (!bytes) {
        showMessage(MESSAGE_ERROR, HIRES_BUFFER_TEXT);
        return 0;
    }
    hiresBuffer.bins = bytes;
    hiresBuffer.blocks = blocks;
    hiresBuffer.binCount = bins;
    return 1;
}

void freeHiresBuffers() {
    std::free(hiresBuffer.bins);
    hiresBuffer = HiresBuffer{};
}

// The block's N bins in the Hires buffer, or nullptr when the block is outside the window
// or the buffer does not hold it. The buffer is indexed from the caller's firstBlock, so
// that must not lie after the block nor so far before it that the index leaves the buffer.
static double* windowBlockBins(uint32_t firstBlock, uint32_t block) {
    if (block < ftBlockWindow.firstBlock || block >= ftBlockWindow.endBlock || block < firstBlock) return nullptr;
    if (!hiresBuffer.bins || hiresBuffer.binCount != hiresGeometry.bins || block - firstBlock >= hiresBuffer.blocks)
        return nullptr;
    return hiresBuffer.bins + size_t(block - firstBlock) * hiresBuffer.binCount * 2;
}

// ---- the stored layout ----

struct StoredHead {
    uint16_t count;   // stored bins
    float scale;      // ln(1 + the largest magnitude)
    float offset;     // frequency shift, natural-log ratio
};

static uint32_t storedBlockBytes(uint32_t count) { return HIRES_BLOCK_HEAD_BYTES + HIRES_BYTES_PER_ENTRY * count; }

static void putFloat(uint8_t* at, float value) {
    uint32_t bits;
    std::memcpy(&bits, &value, 4);
    for (int i = 0; i < 4; i++) at[i] = uint8_t(bits >> (8 * i));
}

static float getFloat(const uint8_t* at) {
    uint32_t bits = uint32_t(at[0]) | uint32_t(at[1]) << 8 | uint32_t(at[2]) << 16 | uint32_t(at[3]) << 24;
    float value;
    std::memcpy(&value, &bits, 4);
    return value;
}

// 1 when the whole head was read; a short read is a damaged block.
static int readStoredHead(FILE* file, StoredHead* head) {
    uint8_t bytes[HIRES_BLOCK_HEAD_BYTES];
    if (!readReportedBytes(file, bytes, sizeof bytes)) return 0;
    head->count = uint16_t(bytes[0] | bytes[1] << 8);
    head->scale = getFloat(bytes + 2);
    head->offset = getFloat(bytes + 6);
    return 1;
}

// A head that can be expanded: fewer bins than the block has, and a finite scale and offset.
// A NaN or infinite value, or a negative scale (which would give negative magnitudes), only
// comes from a damaged file, so such a block counts as corrupt rather than being clamped
// into something that looks like sound. (Finite values too large for a double's range are
// clamped when the block is expanded.)
static bool headIsSound(const StoredHead& head) {
    return head.count < hiresGeometry.bins && std::isfinite(head.scale) && head.scale >= 0.0f &&
           std::isfinite(head.offset);
}

// Reads count magnitudes and count gaps; 1 when all were there.
static int readStoredEntries(FILE* file, uint32_t count, uint16_t* magnitudes, uint8_t* gaps) {
    if (!readReportedBytes(file, magnitudes, size_t(count) * 2)) return 0;
    // Stored little-endian: put each value together from its bytes, in place.
    const uint8_t* raw = reinterpret_cast<const uint8_t*>(magnitudes);
    for (uint32_t j = 0; j < count; j++) magnitudes[j] = uint16_t(raw[2 * j] | raw[2 * j + 1] << 8);
    return readReportedBytes(file, gaps, count);
}

// ---- compression and expansion ----

// A magnitude the compressor can take a logarithm of: NaN and negative values count as 0,
// infinity as the largest double, so that the scale stays finite.
static double usableMagnitude(double m) { return m > 0.0 ? std::min(m, DBL_MAX) : 0.0; }

// Bins the compressor considers: those up to 5000 Hz, n = min(N, trunc(M x (5000 - F) / F)).
// Two limits are added to that rule. n stays below N: a block storing all N bins would have
// count N, which every reader refuses as corrupt (possible when the sample rate puts the
// last bin under 5000 Hz, as at 8000 Hz, and 8-bit audio's threshold of 0.5 passes every
// bin). And count is stored in 16 bits, so no more than 65535 bins can be kept.
static uint32_t consideredBins(uint32_t capacity) {
    uint32_t bins = hiresGeometry.bins;
    double f = hiresGeometry.lowestFrequency;
    double m = hiresGeometry.binsPerStep;
    if (bins == 0 || !(f > 0.0) || !(m > 0.0)) return 0;
    double limit = m * (HIRES_FULL_BAND_LIMIT - f) / f;
    uint32_t n = !(limit > 0.0) ? 0 : limit >= double(bins) ? bins : uint32_t(limit);
    n = std::min(n, bins - 1);
    n = std::min(n, HIRES_QUANTISATION_STEPS);
    return std::min(n, capacity);
}

// T = 0.5 x (2^(b - 8))^2 for the song's b bits per sample: 32768 for 16-bit, 0.5 for 8-bit.
static double storageThreshold() { return std::ldexp(0.5, 2 * (int(song.waveFormat.bitsPerSample) - 8)); }

// Fills buffer's count, scale, magnitudes, gaps and deviations from N expanded bins.
//
// The threshold is used as it stands. A search could raise it for blocks that pass too many
// bins, but it would compare linear magnitudes with a bound in log units (ln(mmax + 1), at
// most about 710): it never runs for 16-bit audio (T = 32768), and for 8-bit audio only
// where more than its target of 4096 bins lie below 5000 Hz, which the default geometry
// (3683 bins) never has. The stored format does not depend on it, so it is left out.
static void compressHiresBlock(const double* bins, const float* deviations, CompressedHiresBuffer* buffer) {
    uint32_t n = consideredBins(buffer->capacity);
    double mmax = 0.5;
    for (uint32_t i = 0; i < n; i++) mmax = std::max(mmax, usableMagnitude(bins[2 * i]));
    double scale = std::log(mmax + 1.0);
    double threshold = storageThreshold();
    int64_t last = -1;
    uint32_t count = 0;
    for (uint32_t i = 0; i < n; i++) {
        double m = usableMagnitude(bins[2 * i]);
        if (m < threshold && int64_t(i) - last < int64_t(HIRES_FORCED_ENTRY_STEP)) continue;
        // Divided before multiplying, so that the loudest bin comes out as exactly 65535.
        double ratio = std::log(m + 1.0) / scale;
        buffer->magnitudes[count] =
            ratio >= 1.0 ? uint16_t(HIRES_QUANTISATION_STEPS) : uint16_t(ratio * double(HIRES_QUANTISATION_STEPS));
        buffer->gaps[count] = uint8_t(int64_t(i) - last - 1);
        buffer->deviations[count] = deviations ? deviations[i] : 0.0f;
        count++;
        last = i;
    }
    buffer->count = uint16_t(count);
    buffer->scale = float(scale);
}

// Expands stored entries into the N bins (already cleared) and their deviations.
static void expandHiresBlock(const StoredHead& head, const uint16_t* magnitudes, const uint8_t* gaps, double* bins,
                             float* deviations) {
    uint32_t binCount = hiresGeometry.bins;
    double shift = std::expm1(double(head.offset));   // e^offset - 1
    int64_t index = -1;
    for (uint32_t j = 0; j < head.count; j++) {
        index += int64_t(gaps[j]) + 1;
        if (index >= int64_t(binCount)) break;   // the index only grows: the rest lie outside too
        double m = std::expm1(double(magnitudes[j]) * double(head.scale) / double(HIRES_QUANTISATION_STEPS));
        bins[2 * index] = std::min(m, DBL_MAX);
        bins[2 * index + 1] = 0.0;
        if (deviations) {
            double centre = hiresGeometry.lowestFrequency * (1.0 + double(index) / hiresGeometry.binsPerStep);
            deviations[index] = float(std::clamp(centre * shift, -double(FLT_MAX), double(FLT_MAX)));
        }
    }
}

// ---- reading and writing blocks ----

// A flush that fails leaves bytes unstored; reported like a short write.
static int flushReported(FILE* file) {
    if (fileFlush(file) == 0) return 1;
    showMessage(MESSAGE_ERROR, resourceString(10232));
    return 0;
}

uint32_t readHiresFTBlock(FILE* file, uint32_t firstBlock, uint32_t block, double* destination, float* deviations) {
    if (!file) {
        showMessage(MESSAGE_ERROR, READ_NO_FILE_TEXT);
        return 0;
    }
    uint32_t binCount = hiresGeometry.bins;
    double* bins = destination;
    if (!bins) {
        bool inWindow = block >= ftBlockWindow.firstBlock && block < ftBlockWindow.endBlock;
        if (inWindow && !allocHiresBuffer()) return 0;
        bins = windowBlockBins(firstBlock, block);
        if (!bins) {
            showMessage(MESSAGE_ERROR, READ_NOT_IN_MEMORY_TEXT);
            return 0;
        }
    }
    std::fill(bins, bins + size_t(binCount) * 2, 0.0);
    if (deviations) std::fill(deviations, deviations + binCount, 0.0f);

    StoredHead head;
    if (!readStoredHead(file, &head) || !headIsSound(head)) {
        showMessage(MESSAGE_ERROR, READ_CORRUPT_TEXT);
        return 0;
    }
    if (head.count > 0) {
        CompressedHiresBufferHolder entries(allocCompressedHiresBuffer(head.count));
        if (!entries) return 0;
        if (!readStoredEntries(file, head.count, entries->magnitudes, entries->gaps)) {
            showMessage(MESSAGE_ERROR, READ_CORRUPT_TEXT);
            return 0;
        }
        expandHiresBlock(head, entries->magnitudes, entries->gaps, bins, deviations);
    }
    return storedBlockBytes(head.count);
}

uint32_t readCompressedHiresBlock(FILE* file, CompressedHiresBuffer* buffer) {
    if (!file) {
        showMessage(MESSAGE_ERROR, READ_NO_FILE_TEXT);
        return 0;
    }
    assert(buffer);
    if (!buffer) return 0;
    buffer->count = 0;
    StoredHead head;
    // A count the buffer cannot hold is refused like a count not below N: reading it would
    // run past the arrays.
    if (!readStoredHead(file, &head) || !headIsSound(head) || head.count > buffer->capacity ||
        !readStoredEntries(file, head.count, buffer->magnitudes, buffer->gaps)) {
        showMessage(MESSAGE_ERROR, READ_CORRUPT_TEXT);
        return 0;
    }
    std::fill(buffer->deviations, buffer->deviations + head.count, 0.0f);
    buffer->scale = head.scale;
    buffer->offset = head.offset;
    buffer->count = head.count;
    return storedBlockBytes(head.count);
}

uint32_t writeCompressedHiresBlock(FILE* file, const CompressedHiresBuffer* buffer) {
    if (!file) {
        showMessage(MESSAGE_ERROR, WRITE_NO_FILE_TEXT);
        return 0;
    }
    assert(buffer && buffer->count <= buffer->capacity);
    if (!buffer || buffer->count > buffer->capacity) return 0;
    uint32_t count = buffer->count;
    uint8_t head[HIRES_BLOCK_HEAD_BYTES];
    head[0] = uint8_t(count);
    head[1] = uint8_t(count >> 8);
    putFloat(head + 2, buffer->scale);
    putFloat(head + 6, buffer->offset);
    if (!writeReportedBytes(file, head, sizeof head)) return 0;
    // The magnitudes go out little-endian, a stack-sized piece at a time.
    uint8_t piece[4096];
    for (uint32_t j = 0; j < count;) {
        uint32_t n = std::min<uint32_t>(count - j, sizeof piece / 2);
        for (uint32_t k = 0; k < n; k++) {
            piece[2 * k] = uint8_t(buffer->magnitudes[j + k]);
            piece[2 * k + 1] = uint8_t(buffer->magnitudes[j + k] >> 8);
        }
        if (!writeReportedBytes(file, piece, size_t(n) * 2)) return 0;
        j += n;
    }
    if (count > 0 && !writeReportedBytes(file, buffer->gaps, count)) return 0;
    if (!flushReported(file)) return 0;
    return storedBlockBytes(count);
}

uint32_t writeHiresFTBlock(FILE* file, uint32_t firstBlock, uint32_t block, CompressedHiresBuffer* buffer,
                           const double* source, const float* deviations) {
    if (!file) {
        showMessage(MESSAGE_ERROR, WRITE_NO_FILE_TEXT);
        return 0;
    }
    const double* bins = source ? source : windowBlockBins(firstBlock, block);
    if (!bins) {
        showMessage(MESSAGE_ERROR, WRITE_NOT_IN_MEMORY_TEXT);
        return 0;
    }
    assert(buffer);
    if (!buffer) return 0;
    compressHiresBlock(bins, deviations, buffer);
    return writeCompressedHiresBlock(file, buffer);
}

uint32_t storeHiresFTBlock(FILE* ftFile, FILE* indexFile, uint32_t firstBlock, CompressedHiresBuffer* buffer,
                           uint32_t block, int truncate) {
    int seeked = 0;
    uint32_t size = seekToFTBlock(ftFile, indexFile, block, 1, truncate, &seeked);
    if (!seeked) return 0;
    const double* bins = windowBlockBins(firstBlock, block);
    if (!bins) {
        showMessage(MESSAGE_ERROR, WRITE_NOT_IN_MEMORY_TEXT);
        return 0;
    }
    assert(buffer);
    if (!buffer) return 0;
    compressHiresBlock(bins, nullptr, buffer);
    // The size is compared before writing: a rewrite in place that came out longer would
    // overwrite the start of the next block.
    if (!truncate && storedBlockBytes(buffer->count) != size) {
        showMessage(MESSAGE_ERROR, STORE_SIZE_CHANGED_TEXT);
        if (ftFile == hiresFiles.hiresFile && indexFile == hiresFiles.hiresIndexFile) {
            closeHiresFTFile(0);
        } else {
            fileClose(ftFile);
            fileClose(indexFile);
        }
        return 0;
    }
    uint32_t written = writeCompressedHiresBlock(ftFile, buffer);
    if (written == 0) return 0;
    if (written != size && !setFTBlockSize(indexFile, block, written)) return 0;
    return written;
}

int writeHiresFTBlocks(FILE* ftFile, FILE* indexFile, uint32_t from, uint32_t to) {
    if (generalSettings.disableWaveEditing) return 1;
    if (from >= to) return 1;
    CompressedHiresBufferHolder buffer(allocCompressedHiresBuffer(0));
    if (!buffer) return 0;
    for (uint32_t block = from; block < to; block++)
        if (!storeHiresFTBlock(ftFile, indexFile, ftBlockWindow.firstBlock, buffer.get(), block, 1)) return 0;
    return 1;
}

// ---- the files ----

// Opens name for reading, or for update ("rb+", creating it empty first when missing).
static FILE* openHiresStream(const char* name, int mode) {
    std::string path = sharedFilePath(name);
    if (mode != FT_UPDATE) return fileOpen(path, "rb");
    if (!fileExists(path)) {
        FILE* created = fileOpen(path, "wb");
        if (!created) return nullptr;
        fileClose(created);
    }
    return fileOpen(path, "rb+");
}

int openHiresFTFile(int mode) {
    if (hiresFiles.hiresFile || hiresFiles.hiresIndexFile) {
        showMessage(MESSAGE_ERROR, OPEN_ALREADY_TEXT);
        return 0;
    }
    // The undo snapshot writer copies these files on its own thread.
    if (mode == FT_UPDATE) waitForUndoSnapshotWriter();
    FILE* data = openHiresStream(HIRES_FILE_NAME, mode);
    if (!data) {
        showMessage(MESSAGE_ERROR, OPEN_DATA_TEXT);
        return 0;
    }
    FILE* index = openHiresStream(HIRES_INDEX_FILE_NAME, mode);
    if (!index) {
        fileClose(data);
        showMessage(MESSAGE_ERROR, OPEN_INDEX_TEXT);
        return 0;
    }
    hiresFiles.hiresFile = data;
    hiresFiles.hiresIndexFile = index;
    hiresFiles.mode = mode;
    checkFTIndexCount(index, mode == FT_UPDATE);
    return 1;
}

int closeHiresFTFile(int check) {
    if (check && hiresFiles.hiresIndexFile) checkFTIndexCount(hiresFiles.hiresIndexFile, hiresFiles.mode == FT_UPDATE);
    int closed = 1;
    if (hiresFiles.hiresFile && fileClose(hiresFiles.hiresFile) != 0) closed = 0;
    if (hiresFiles.hiresIndexFile && fileClose(hiresFiles.hiresIndexFile) != 0) closed = 0;
    hiresFiles.hiresFile = nullptr;
    hiresFiles.hiresIndexFile = nullptr;
    return closed;
}

int hiresFilesOpen() { return hiresFiles.hiresFile || hiresFiles.hiresIndexFile ? 1 : 0; }

// ---- cutting blocks ----

static int truncateReported(const std::string& path, int64_t length) {
    if (fileTruncate(path, length) != 0) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    return 1;
}

static void putU32(uint8_t* at, uint32_t value) {
    for (int i = 0; i < 4; i++) at[i] = uint8_t(value >> (8 * i));
}

// "CS.tw" while a cut uses it: closed and deleted again on every early return.
struct TemporaryFile {
    std::string path;        // where it lies in the shared folder
    FILE* file = nullptr;    // open stream, or nullptr
    bool exists = false;     // created and not yet deleted
    ~TemporaryFile() {
        if (file) fileClose(file);
        if (exists) fileDelete(path);
    }
};

// Copies blocks one after another from one file's position to another's as stored; 1 when
// every block was read and written whole.
static int copyStoredBlocks(FILE* from, FILE* to, uint32_t blocks, CompressedHiresBuffer* buffer) {
    for (uint32_t k = 0; k < blocks; k++) {
        uint32_t bytesRead = readCompressedHiresBlock(from, buffer);
        if (bytesRead == 0) return 0;
        if (writeCompressedHiresBlock(to, buffer) != bytesRead) {
            showMessage(MESSAGE_ERROR, REMOVE_SIZE_TEXT);
            return 0;
        }
    }
    return 1;
}

int removeHiresFTBlocksFromSong(uint32_t first, uint32_t count) {
    if (count == 0) return 1;
    if (count > UINT32_MAX - first) return 0;
    if (!openHiresFTFile(FT_UPDATE)) return 0;
    struct CloseHires {
        bool armed = true;   // the files are still open
        ~CloseHires() {
            if (armed) closeHiresFTFile(0);
        }
    } closeHires;
    FILE* data = hiresFiles.hiresFile;
    FILE* index = hiresFiles.hiresIndexFile;

    int ok = 0;
    uint32_t a = getFTBlockIndex(index, first, &ok);
    if (!ok) return 0;
    uint32_t b = getFTBlockIndex(index, first + count, &ok);
    if (!ok) return 0;
    uint32_t stored = 0;
    if (!getFTIndexCount(index, &stored) || stored < first + count) return 0;
    // Offsets from a damaged index must neither run backwards nor lie past the data: the cut
    // would copy from, or truncate to, places where no block lies.
    int64_t dataLength = -1;
    if (fileSeek(data, 0, SEEK_END) == 0) dataLength = fileTell(data);
    if (dataLength < 0 || a > b || int64_t(b) > dataLength) {
        showMessage(MESSAGE_ERROR, SEEK_PAST_END_TEXT);
        return 0;
    }
    // Only the blocks the index holds are moved: a Hires store shorter than the song has no
    // blocks to copy after its end.
    uint32_t moved = stored - first - count;

    CompressedHiresBufferHolder buffer(allocCompressedHiresBuffer(0));
    if (!buffer) return 0;
    TemporaryFile temporary;
    temporary.path = sharedFilePath(TEMPORARY_FILE_NAME);
    temporary.file = openReportedFile(temporary.path, "wb");
    if (!temporary.file) return 0;
    temporary.exists = true;
    if (!seekReportedFile(data, b) || !copyStoredBlocks(data, temporary.file, moved, buffer.get())) return 0;
    FILE* written = temporary.file;
    temporary.file = nullptr;
    if (!closeReportedFile(written)) return 0;
    temporary.file = openReportedFile(temporary.path, "rb");
    if (!temporary.file) return 0;

    // Back from "CS.tw" to where the cut starts, each block with its new index entry.
    if (!seekReportedFile(data, a) || !seekReportedFile(index, 4 + 8 * int64_t(first))) return 0;
    uint64_t offset = a;
    for (uint32_t k = 0; k < moved; k++) {
        uint32_t bytesRead = readCompressedHiresBlock(temporary.file, buffer.get());
        if (bytesRead == 0 || offset + bytesRead > UINT32_MAX) return 0;
        if (writeCompressedHiresBlock(data, buffer.get()) != bytesRead) {
            showMessage(MESSAGE_ERROR, REMOVE_SIZE_TEXT);
            return 0;
        }
        uint8_t entry[8];
        putU32(entry, uint32_t(offset));
        putU32(entry + 4, bytesRead);
        if (!writeReportedBytes(index, entry, sizeof entry) || !flushReported(index)) return 0;
        offset += bytesRead;
    }
    FILE* reread = temporary.file;
    temporary.file = nullptr;
    closeReportedFile(reread);
    if (deleteReportedFile(temporary.path)) temporary.exists = false;

    uint32_t newCount = stored - count;
    uint8_t countBytes[4];
    putU32(countBytes, newCount);
    if (!seekReportedFile(index, 0) || !writeReportedBytes(index, countBytes, 4) || !flushReported(index)) return 0;
    closeHires.armed = false;
    if (!closeHiresFTFile(0)) return 0;

    // Cut both files behind their data. A file that cannot be cut is reported without undoing
    // the cut: the bytes left past the new ends are never reached through the index.
    truncateReported(sharedFilePath(HIRES_FILE_NAME), int64_t(offset));
    truncateReported(sharedFilePath(HIRES_INDEX_FILE_NAME), 4 + 8 * int64_t(newCount));
    return 1;
}
