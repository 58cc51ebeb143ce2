// The block side of time editing: copying FT and Hires FT blocks to the clipboard files and
// splicing them back into the song's files. Blocks are moved as they are stored; the blocks
// from the paste point on wait in "CS.tw" while the files are rewritten, and every block
// written goes through the index (seekToFTBlock with truncation), so the index always ends
// with the last block written.
#include "store/timeEditing.h"

#include <algorithm>
#include <memory>
#include <string>

#include "notes/noteList.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "store/fileRoutines.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

static const char* const HIRES_PASTE_SIZE_TEXT =
    "bytesWritten does not equal bytesRead - pasteHiresFTBlocksFromClipboard (1). Data may be corrupted.";
static const char* const HIRES_TAIL_SIZE_TEXT =
    "bytesWritten does not equal bytesRead - pasteHiresFTBlocksFromClipboard (2). Data may be corrupted.";

// One FT block on its way through a file.
struct FTBlockInTransit {
    FTDataBuffer data;
    FTDataBuffer orig;
    FTDetectedBuffer detected;
    uint32_t read(FILE* f) { return readFTBlock(f, 0, &data, &orig, &detected); }
    uint32_t write(FILE* f) { return writeFTBlock(f, 0, &data, &orig, &detected); }
};

// One Hires FT block, as stored.
struct HiresBlockInTransit {
    CompressedHiresBuffer* buffer;
    uint32_t read(FILE* f) { return readCompressedHiresBlock(f, buffer); }
    uint32_t write(FILE* f) { return writeCompressedHiresBlock(f, buffer); }
};

struct BlockFileCloser {
    void operator()(FILE* f) const {
        if (f) fileClose(f);
    }
};
using BlockFile = std::unique_ptr<FILE, BlockFileCloser>;

struct HiresBufferFreer {
    void operator()(CompressedHiresBuffer* b) const { freeCompressedHiresBuffer(b); }
};

// ---- copying ----

// Copies count blocks from first of the open data and index files into the clipboard's data
// file (the count, then the blocks) and index file (each block's offset from the first).
template <class Transit>
static int copyBlocksToClipboard(FILE* data, FILE* index, uint32_t first, uint32_t count, Transit& transit,
                                 const char* clipData, const char* clipIndex) {
    BlockFile clip(openReportedFile(sharedFilePath(clipData), "wb"));
    if (!clip || !writeReportedBytes(clip.get(), &count, 4)) return 0;
    std::vector<uint32_t> offsets;
    if (count > 0) {
        int ok;
        seekToFTBlock(data, index, first, 0, 0, &ok);
        if (!ok) return 0;
        uint32_t offset = 0;
        for (uint32_t k = 0; k < count; k++) {
            uint32_t bytes = transit.read(data);
            if (bytes == 0 || transit.write(clip.get()) != bytes) return 0;
            offsets.push_back(offset);
            offset += bytes;
        }
    }
    if (!closeReportedFile(clip.release())) return 0;
    BlockFile offsetsFile(openReportedFile(sharedFilePath(clipIndex), "wb"));
    if (!offsetsFile || (!offsets.empty() && !writeReportedBytes(offsetsFile.get(), offsets.data(), 4 * offsets.size())))
        return 0;
    return closeReportedFile(offsetsFile.release());
}

int copyFTBlocksToClipboard(uint32_t first, uint32_t count) {
    if (!openFTFile(FT_READ)) return 0;
    struct CloseFT {
        ~CloseFT() { closeFTFile(0); }
    } closeFT;
    auto transit = std::make_unique<FTBlockInTransit>();
    return copyBlocksToClipboard(ftFiles.ftFile, ftFiles.ftIndexFile, first, count, *transit, "_CS.ft", "_CS.fi");
}

int copyHiresFTBlocksToClipboard(uint32_t first, uint32_t count) {
    std::unique_ptr<CompressedHiresBuffer, HiresBufferFreer> buffer(allocCompressedHiresBuffer(0));
    if (!buffer || !openHiresFTFile(FT_READ)) return 0;
    struct CloseHires {
        ~CloseHires() { closeHiresFTFile(0); }
    } closeHires;
    HiresBlockInTransit transit{buffer.get()};
    return copyBlocksToClipboard(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, first, count, transit, "_CS.ft+",
                                 "_CS.fi+");
}

// ---- pasting ----

// The block count the clipboard's data file starts with; 0 when it cannot be read.
static int clipboardBlockCount(const char* clipData, uint32_t* count) {
    BlockFile clip(fileOpen(sharedFilePath(clipData), "rb"));
    return clip && readReportedBytes(clip.get(), count, 4) ? 1 : 0;
}

// Writes the block in transit as block of the open files, truncating the index after it.
template <class Transit>
static int writeBlockAt(FILE* data, FILE* index, uint32_t block, Transit& transit, uint32_t* written) {
    int ok;
    uint32_t size = seekToFTBlock(data, index, block, 1, 1, &ok);
    if (!ok) return 0;
    *written = transit.write(data);
    if (*written == 0) return 0;
    return *written == size || setFTBlockSize(index, block, *written);
}

// "CS.tw" holding the song's blocks from the paste point on; deleted on every return.
struct SavedBlocks {
    std::string path = sharedFilePath("CS.tw");
    BlockFile file;
    ~SavedBlocks() {
        file.reset();
        if (fileExists(path)) fileDelete(path);
    }
    // Saves blocks [from, held) of the open files and opens "CS.tw" for reading them back.
    template <class Transit>
    int save(FILE* data, FILE* index, uint32_t from, uint32_t held, Transit& transit, const char* sizeText) {
        file.reset(openReportedFile(path, "wb"));
        if (!file) return 0;
        if (from < held) {
            int ok;
            seekToFTBlock(data, index, from, 0, 0, &ok);
            if (!ok) return 0;
            for (uint32_t b = from; b < held; b++) {
                uint32_t bytes = transit.read(data);
                if (bytes == 0) return 0;
                if (transit.write(file.get()) != bytes) {
                    if (sizeText) showMessage(MESSAGE_ERROR, sizeText);
                    return 0;
                }
            }
        }
        if (!closeReportedFile(file.release())) return 0;
        file.reset(openReportedFile(path, "rb"));
        return file ? 1 : 0;
    }
};

// Cuts the data and index files behind the last block the index holds (the files are closed).
static void cutBehindBlocks(const char* dataName, const char* indexName, uint32_t count, uint32_t end) {
    if (fileTruncate(sharedFilePath(dataName), end) != 0) showMessage(MESSAGE_ERROR, "Cannot " + sharedFilePath(dataName));
    if (fileTruncate(sharedFilePath(indexName), 4 + 8 * int64_t(count)) != 0)
        showMessage(MESSAGE_ERROR, "Cannot " + sharedFilePath(indexName));
}

// The end of the blocks the index holds, with their count.
static int indexEnd(FILE* index, uint32_t* count, uint32_t* end) {
    if (!getFTIndexCount(index, count)) return 0;
    int ok = 1;
    *end = *count ? getFTBlockIndex(index, *count, &ok) : 0;
    return ok;
}

// Whether the song's time t lies inside one of the existing notes' wave spans.
static bool insideSomeNote(double t) {
    for (int i = 0; i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        if (n.waveStart > t) break;
        if (n.waveStart <= t && t < n.waveEnd) return true;
    }
    return false;
}

int pasteFTBlocks(uint32_t first, uint32_t replaced) {
    int kind = timeClipboard.kind;
    if (first > song.blockCount) return 1;
    if (kind == 4) replaced = std::min(replaced, song.blockCount - first);
    uint32_t n = 0;
    if (!clipboardBlockCount("_CS.ft", &n)) return 0;
    if (kind == 4) replaced = std::min(replaced, n);

    if (!openFTFile(FT_UPDATE)) return 0;
    struct CloseFT {
        bool armed = true;
        ~CloseFT() {
            if (armed) closeFTFile(1);
        }
    } closeFT;
    FILE* data = ftFiles.ftFile;
    FILE* index = ftFiles.ftIndexFile;
    uint32_t held = 0;
    if (!getFTIndexCount(index, &held) || first > held) return 0;
    replaced = std::min(replaced, held - first);

    auto own = std::make_unique<FTBlockInTransit>();
    auto pasted = std::make_unique<FTBlockInTransit>();
    SavedBlocks saved;
    if (!saved.save(data, index, first, held, *own, nullptr)) return 0;
    BlockFile clip(openReportedFile(sharedFilePath("_CS.ft"), "rb"));
    if (!clip || !seekReportedFile(clip.get(), 4)) return 0;

    uint32_t block = first;
    uint32_t written;
    if (kind == 4) {
        // Placed notes bring their pitch only where the song has no note of its own; the
        // song's spectra stay.
        for (uint32_t i = 0; i < replaced; i++, block++) {
            if (own->read(saved.file.get()) == 0 || pasted->read(clip.get()) == 0) return 0;
            if (!insideSomeNote(songTimeOfBlock(block))) own->detected = pasted->detected;
            if (!writeBlockAt(data, index, block, *own, &written)) return 0;
        }
    } else {
        for (uint32_t i = 0; i < n; i++, block++)
            if (pasted->read(clip.get()) == 0 || !writeBlockAt(data, index, block, *pasted, &written)) return 0;
        for (uint32_t i = 0; i < replaced; i++)
            if (own->read(saved.file.get()) == 0) return 0;
    }
    for (uint32_t b = first + replaced; b < held; b++, block++)
        if (own->read(saved.file.get()) == 0 || !writeBlockAt(data, index, block, *own, &written)) return 0;

    uint32_t count, end;
    if (!indexEnd(index, &count, &end)) return 0;
    closeFT.armed = false;
    if (!closeFTFile(1)) return 0;
    cutBehindBlocks("CS.ft", "CS.fi", count, end);
    return 1;
}

int pasteHiresFTBlocks(uint32_t first, uint32_t replaced) {
    uint32_t n = 0;
    if (!clipboardBlockCount("_CS.ft+", &n)) return 0;
    std::unique_ptr<CompressedHiresBuffer, HiresBufferFreer> buffer(allocCompressedHiresBuffer(0));
    if (!buffer || !openHiresFTFile(FT_UPDATE)) return 0;
    struct CloseHires {
        bool armed = true;
        ~CloseHires() {
            if (armed) closeHiresFTFile(1);
        }
    } closeHires;
    FILE* data = hiresFiles.hiresFile;
    FILE* index = hiresFiles.hiresIndexFile;
    uint32_t held = 0;
    if (!getFTIndexCount(index, &held) || first > held) return 0;
    replaced = std::min(replaced, held - first);

    HiresBlockInTransit transit{buffer.get()};
    SavedBlocks saved;
    if (!saved.save(data, index, first, held, transit, HIRES_TAIL_SIZE_TEXT)) return 0;
    BlockFile clip(openReportedFile(sharedFilePath("_CS.ft+"), "rb"));
    if (!clip || !seekReportedFile(clip.get(), 4)) return 0;

    uint32_t block = first;
    uint32_t written;
    for (uint32_t i = 0; i < n; i++, block++) {
        uint32_t bytes = transit.read(clip.get());
        if (bytes == 0 || !writeBlockAt(data, index, block, transit, &written)) return 0;
        if (written != bytes) {
            showMessage(MESSAGE_ERROR, HIRES_PASTE_SIZE_TEXT);
            return 0;
        }
    }
    for (uint32_t i = 0; i < replaced; i++)
        if (transit.read(saved.file.get()) == 0) return 0;
    for (uint32_t b = first + replaced; b < held; b++, block++) {
        uint32_t bytes = transit.read(saved.file.get());
        if (bytes == 0 || !writeBlockAt(data, index, block, transit, &written)) return 0;
        if (written != bytes) {
            showMessage(MESSAGE_ERROR, HIRES_TAIL_SIZE_TEXT);
            return 0;
        }
    }

    uint32_t count, end;
    if (!indexEnd(index, &count, &end)) return 0;
    closeHires.armed = false;
    if (!closeHiresFTFile(1)) return 0;
    cutBehindBlocks("CS.ft+", "CS.fi+", count, end);
    return 1;
}
