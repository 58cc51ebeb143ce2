// The jobs of the FT block store that span many blocks: filling the FTBlockWindow from CS.ft,
// writing window blocks back (the analysis as it produces them, note editing in place), and
// cutting a run of blocks out of both files through CS.tw for time editing.
#include "store/ftBlockStore.h"

#include <memory>
#include <string>

#include "platform/files.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/song.h"

static const char* const BLOCK_NOT_IN_MEMORY = "Block to write not in memory so cannot write data - writeFTBlock (2)";
static const char* const SIZE_INCONSISTENT =
    "Data size written to FT file is inconsistent with current value - writeFTBlock (1)";
static const char* const SEEK_PAST_END =
    "Attempting to seeking past end of file in seekToFTBlock (2). Data will probably be corrupted.";

static int windowHolds(uint32_t block) {
    const FTBlockWindow& w = ftBlockWindow;
    if (block < w.firstBlock || block >= w.endBlock) return 0;
    size_t slot = block - w.firstBlock;
    return slot < w.dataBuffers.size() && slot < w.origDataBuffers.size() && slot < w.detectedFrequenciesBuffers.size();
}

int loadFTBlockWindow(uint32_t from, uint32_t to) {
    FTBlockWindow& w = ftBlockWindow;
    // Blocks a cut has taken off the song's end are no longer held, whatever becomes of this
    // load: saved back, they would land on whatever comes to lie there.
    uint32_t blockCount = song.blockCount;
    if (w.endBlock > blockCount) {
        w.endBlock = w.firstBlock < blockCount ? blockCount : 0;
        if (w.endBlock == 0) w.firstBlock = 0;
    }
    uint64_t widest = uint64_t(from) + w.capacity;
    if (from == 0 && to == 0) {
        from = w.firstBlock;
        to = w.endBlock;
        widest = uint64_t(from) + w.capacity;
    } else {
        if (to > widest) to = uint32_t(widest);
        if (from >= w.firstBlock && to <= w.endBlock) return 0;
    }
    if (!growFTBlockWindow()) return 0;
    // The window is always filled as far as the capacity allows, and never past the song's
    // last block.
    to = uint32_t(widest < blockCount ? widest : blockCount);
    if (to <= from) {
        // Nothing to hold there.
        w.firstBlock = 0;
        w.endBlock = 0;
        return 0;
    }
    // The window keeps its range until the files are open and positioned, so a failure there
    // leaves it as it was.
    if (!openFTFile(FT_READ)) return 0;
    int ok;
    seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, from, 0, 0, &ok);
    if (!ok) {
        closeFTFile(1);
        return 0;
    }
    // Bytes past the last block the index holds are no block, even where they parse as one.
    uint32_t held;
    if (getFTIndexCount(ftFiles.ftIndexFile, &held) && held < to) to = held;
    w.firstBlock = from;
    w.endBlock = to;
    for (uint32_t block = from; block < to; block++) {
        if (!readFTBlock(ftFiles.ftFile, block, nullptr, nullptr, nullptr)) {
            // The window ends after the last block read whole: the rest of its buffers hold
            // other blocks' data and must not be taken, or saved, for these.
            w.endBlock = block;
            closeFTFile(1);
            return 0;
        }
    }
    closeFTFile(1);
    return 1;
}

int rewriteFTBlocks(FILE* ftFile, FILE* indexFile, uint32_t from, uint32_t to) {
    for (uint32_t block = from; block < to; block++) {
        // Refused before the seek: seeking to write truncates the index after the block.
        if (!windowHolds(block)) {
            showMessage(MESSAGE_ERROR, BLOCK_NOT_IN_MEMORY);
            return 0;
        }
        int ok;
        uint32_t size = seekToFTBlock(ftFile, indexFile, block, 1, 1, &ok);
        if (!ok) return 0;
        uint32_t written = writeFTBlock(ftFile, block, nullptr, nullptr, nullptr);
        if (written == 0) return 0;
        if (written != size && !setFTBlockSize(indexFile, block, written)) return 0;
    }
    return 1;
}

int saveFTBlocks(uint32_t from, uint32_t to) {
    if (!openFTFile(FT_UPDATE)) return 0;
    struct CloseFT {
        ~CloseFT() { closeFTFile(1); }
    } closeFT;   // the FT files close on every return
    for (uint32_t block = from; block < to; block++) {
        if (!windowHolds(block)) {
            showMessage(MESSAGE_ERROR, BLOCK_NOT_IN_MEMORY);
            return 0;
        }
        // A block is saved only over its own stored copy of the same size. A larger one would
        // overwrite the start of the next block, and a block the index does not hold would be
        // appended as an empty entry, so both are refused before anything is written.
        uint32_t count;
        if (!getFTIndexCount(ftFiles.ftIndexFile, &count) || block >= count) {
            showMessage(MESSAGE_ERROR, SIZE_INCONSISTENT);
            return 0;
        }
        int ok;
        uint32_t size = seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, block, 1, 0, &ok);
        if (!ok) return 0;
        size_t slot = block - ftBlockWindow.firstBlock;
        uint32_t nData = ftBlockWindow.dataBuffers[slot].nEntries;
        uint32_t nOrig = ftBlockWindow.origDataBuffers[slot].nEntries;
        uint32_t nDetected = ftBlockWindow.detectedFrequenciesBuffers[slot].nEntries;
        int countsValid = nData < FT_DATA_ENTRIES && nOrig < FT_DATA_ENTRIES && nDetected < FT_DETECTED_ENTRIES;
        if (countsValid && ftBlockBytes(nData, nOrig, nDetected) != size) {
            showMessage(MESSAGE_ERROR, SIZE_INCONSISTENT);
            return 0;
        }
        // Counts out of range are refused here with writeFTBlock's own message.
        uint32_t written = writeFTBlock(ftFiles.ftFile, block, nullptr, nullptr, nullptr);
        if (written == 0) return 0;
    }
    return 1;
}

// ---- cutting blocks ----

// One block on its way through CS.tw.
struct FTBlockCopy {
    FTDataBuffer data;
    FTDataBuffer orig;
    FTDetectedBuffer detected;
};

static int truncateReported(const std::string& path, int64_t length) {
    if (fileTruncate(path, length) != 0) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    return 1;
}

int removeFTBlocksFromSong(uint32_t first, uint32_t count) {
    if (!openFTFile(FT_UPDATE)) return 0;
    struct CloseFT {
        ~CloseFT() { closeFTFile(1); }
    } closeFT;   // the FT files close on every return
    FILE* ftFile = ftFiles.ftFile;
    FILE* indexFile = ftFiles.ftIndexFile;

    uint64_t end = uint64_t(first) + count;
    uint32_t after = end > UINT32_MAX ? UINT32_MAX : uint32_t(end);   // beyond any index: refused below
    int ok;
    uint32_t cutStart = getFTBlockIndex(indexFile, first, &ok);
    if (!ok) return 0;
    uint32_t cutEnd = getFTBlockIndex(indexFile, after, &ok);
    if (!ok) return 0;
    uint32_t held;
    if (!getFTIndexCount(indexFile, &held)) return 0;
    // Offsets from a hostile index must neither run backwards nor lie past the data: the cut
    // would copy from, or truncate to, places where no block lies.
    int64_t ftLength = -1;
    if (fileSeek(ftFile, 0, SEEK_END) == 0) ftLength = fileTell(ftFile);
    if (ftLength < 0 || cutStart > cutEnd || int64_t(cutEnd) > ftLength) {
        showMessage(MESSAGE_ERROR, SEEK_PAST_END);
        return 0;
    }
    // The blocks the index holds after the cut; with a sound index these are the song's.
    uint32_t moved = held - after;

    std::string twPath = sharedFilePath("CS.tw");
    struct DeleteTw {
        const std::string& path;
        bool keep;
        ~DeleteTw() {
            if (!keep && fileExists(path)) fileDelete(path);
        }
    } deleteTw{twPath, false};   // a failed cut leaves no CS.tw behind (closed first: declared after)
    auto closeFile = [](FILE* f) {
        if (f) fileClose(f);
    };
    std::unique_ptr<FILE, decltype(closeFile)> tw(openReportedFile(twPath, "wb"), closeFile);
    if (!tw) return 0;

    FTBlockCopy copy;
    if (!seekReportedFile(ftFile, cutEnd)) return 0;
    for (uint32_t i = 0; i < moved; i++) {
        if (!readFTBlock(ftFile, after + i, &copy.data, &copy.orig, &copy.detected) ||
            !writeFTBlock(tw.get(), after + i, &copy.data, &copy.orig, &copy.detected))
            return 0;
    }
    if (!closeReportedFile(tw.release())) return 0;
    tw.reset(openReportedFile(twPath, "rb"));
    if (!tw) return 0;

    // From here on the files change: the blocks move down and their entries follow them.
    if (!seekReportedFile(ftFile, cutStart) || !seekReportedFile(indexFile, 4 + 8 * int64_t(first))) return 0;
    uint32_t offset = cutStart;
    for (uint32_t i = 0; i < moved; i++) {
        if (!readFTBlock(tw.get(), first + i, &copy.data, &copy.orig, &copy.detected)) return 0;
        uint32_t size = writeFTBlock(ftFile, first + i, &copy.data, &copy.orig, &copy.detected);
        if (size == 0) return 0;
        const uint32_t entry[2] = {offset, size};
        if (!writeReportedBytes(indexFile, entry, sizeof entry)) return 0;
        if (fileFlush(indexFile) != 0) {
            showMessage(MESSAGE_ERROR, resourceString(10232));
            return 0;
        }
        offset += size;
    }
    closeReportedFile(tw.release());
    deleteTw.keep = true;
    // A CS.tw that cannot be deleted is reported and left; the cut itself goes on.
    deleteReportedFile(twPath);

    uint32_t newCount = held - count;
    if (!seekReportedFile(indexFile, 0) || !writeReportedBytes(indexFile, &newCount, sizeof newCount)) return 0;
    if (fileFlush(indexFile) != 0) {
        showMessage(MESSAGE_ERROR, resourceString(10232));
        return 0;
    }
    // The count is flushed: a close reported now loses nothing of the cut.
    closeFTFile(1);
    // Bytes left past the new ends are never reached through the index, so a file that cannot
    // be cut is reported without undoing the cut.
    truncateReported(sharedFilePath("CS.ft"), offset);
    truncateReported(sharedFilePath("CS.fi"), 4 + 8 * int64_t(newCount));
    return 1;
}
