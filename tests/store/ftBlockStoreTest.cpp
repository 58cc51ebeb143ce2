// The FT files and their index, and single FT blocks: the exact bytes of stored blocks and
// index entries, the index's upkeep (appending, truncating, the count cut down to the song),
// opening and closing, and every message a corrupt or hostile file gives.
#include <gtest/gtest.h>

#include <tuple>

#include "store/ftBlockStoreFixtures.h"

namespace {

class FTBlockFormat : public FTBlockStoreTest {};
class FTBlockRead : public FTBlockStoreTest {};
class FTBlockIndex : public FTBlockStoreTest {};
class FTBlockFiles : public FTBlockStoreTest {};

const char* const INDEX_NOT_STORED = "Index for FT block is not stored - getFTBlockIndex (1).";
const char* const SEEK_PAST_END =
    "Attempting to seeking past end of file in seekToFTBlock (2). Data will probably be corrupted.";
const char* const CANNOT_WRITE =
    "Frequency data cannot be written to FT file in seekToFTBlock (1). Data will probably be corrupted.";
const char* const DATA_CORRUPT = "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)";
const char* const ORIG_CORRUPT = "origDataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (5)";
const char* const DETECTED_CORRUPT =
    "detectedFrequenciesBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (7)";

// A stream on a scratch file in the shared folder, closed with the test.
struct ScratchFile {
    std::string path;
    FILE* f;
    ScratchFile(const std::vector<uint8_t>& bytes, const char* mode = "rb") : path(sharedFilePath("ftScratch")) {
        writeFileBytes(path, bytes);
        f = fileOpen(path, mode);
    }
    ~ScratchFile() {
        if (f) fileClose(f);
        fileDelete(path);
    }
    std::vector<uint8_t> bytes() {
        fileFlush(f);
        return readFileBytes(path);
    }
};

// Sentinel contents, so that a buffer left alone can be told from one that was read.
TestBlock sentinelBlock() {
    TestBlock b = makeBlock(77, 3, 3, 3);
    b.data.blockLoudness = 201;
    b.data.blockFlags = 9;
    b.orig.blockLoudness = 202;
    return b;
}

int seek(uint32_t block, int forWrite, int truncate, int* ok) {
    return int(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, block, forWrite, truncate, ok));
}

// ---- stored bytes ----

TEST_F(FTBlockFormat, ABlockWithNoEntriesIsStoredAsTwelveZeroBytes) {
    song.blockCount = 1;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    TestBlock empty = makeBlock(0, 0, 0, 0);
    int ok = 0;
    EXPECT_EQ(std::tuple(seek(0, 1, 1, &ok), ok), std::tuple(0, 1));
    EXPECT_EQ(writeFTBlock(ftFiles.ftFile, 0, &empty.data, &empty.orig, &empty.detected), 12u);
    EXPECT_EQ(setFTBlockSize(ftFiles.ftIndexFile, 0, 12), 1);
    ASSERT_EQ(closeFTFile(1), 1);
    EXPECT_EQ(readFileBytes(ftPath()), std::vector<uint8_t>(12, 0));
    EXPECT_EQ(readFileBytes(fiPath()), (std::vector<uint8_t>{1, 0, 0, 0, 0, 0, 0, 0, 12, 0, 0, 0}));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(FTBlockFormat, EachBufferIsStoredAsItsCountThenItsEntries) {
    TestBlock b = makeBlock(0, 0, 0, 0);
    b.data.entries[0] = {440.0f, 11.0f, 200, 180, 45, 0};
    b.data.entries[1] = {880.0f, 22.0f, 100, 90, 45, 1};
    b.data.nEntries = 2;
    b.orig.entries[0] = {440.5f, 11.0f, 7, 8, 9, 10};
    b.orig.nEntries = 1;
    b.detected.entries[0] = {440.0f, 0.0f, 0, 0, 0, 0};
    b.detected.nEntries = 1;
    b.data.blockLoudness = 99;   // lives in memory only
    ScratchFile out({}, "wb");
    ASSERT_EQ(writeFTBlock(out.f, 0, &b.data, &b.orig, &b.detected), 60u);
    const std::vector<uint8_t> expected = {
        2, 0, 0, 0,                                     // dataBuffer count
        0x00, 0x00, 0xDC, 0x43, 0x00, 0x00, 0x30, 0x41, 200, 180, 45, 0,   // 440 Hz, width 11
        0x00, 0x00, 0x5C, 0x44, 0x00, 0x00, 0xB0, 0x41, 100, 90, 45, 1,    // 880 Hz, width 22
        1, 0, 0, 0,                                     // origDataBuffer count
        0x00, 0x40, 0xDC, 0x43, 0x00, 0x00, 0x30, 0x41, 7, 8, 9, 10,       // 440.5 Hz
        1, 0, 0, 0,                                     // detectedFrequenciesBuffer count
        0x00, 0x00, 0xDC, 0x43, 0x00, 0x00, 0x00, 0x00, 0, 0, 0, 0};
    EXPECT_EQ(out.bytes(), expected);
}

TEST_F(FTBlockFormat, FullBlocksReadBackAsWrittenOneAfterAnotherAndLeaveTheMemoryOnlyBytesAlone) {
    std::vector<TestBlock> blocks = makeBlocks(6);
    blocks[2] = makeBlock(5, 255, 255, 15);
    ScratchFile out({}, "wb");
    for (TestBlock& b : blocks)
        ASSERT_EQ(writeFTBlock(out.f, 0, &b.data, &b.orig, &b.detected),
                  ftBlockBytes(b.data.nEntries, b.orig.nEntries, b.detected.nEntries));
    EXPECT_EQ(ftBlockBytes(255, 255, 15), 6312u);
    std::vector<uint8_t> stored = out.bytes();
    EXPECT_EQ(stored, modelFiles(blocks).ft);
    ScratchFile in(stored);
    for (const TestBlock& expected : blocks) {
        TestBlock back = sentinelBlock();
        EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), uint32_t(blockBytes(expected).size()));
        EXPECT_TRUE(sameBlock(back, expected));
        EXPECT_EQ(back.data.blockLoudness, 201);
        EXPECT_EQ(back.data.blockFlags, 9);
        EXPECT_EQ(back.orig.blockLoudness, 202);
    }
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(FTBlockFormat, AWriteRefusedForItsCountsOrItsMemoryWritesNothing) {
    std::string memory = "Could not allocate continuousDataBuffer so data could not be written - writeFTBlock (";
    struct Case {
        uint32_t nData, nOrig, nDetected;
        int failingAllocation;
        std::string text;
    } cases[] = {
        {256, 0, 0, 0, "dataBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (3)"},
        {3, 256, 0, 0, "origDataBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (5)"},
        {3, 3, 16, 0, "detectedFrequenciesBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (7)"},
        {2, 2, 2, 1, memory + "4)"},
        {2, 2, 2, 2, memory + "6)"},
        {2, 2, 2, 3, memory + "8)"},
    };
    for (const Case& c : cases) {
        TestBlock b = makeBlock(1, 3, 3, 3);
        b.data.nEntries = c.nData;
        b.orig.nEntries = c.nOrig;
        b.detected.nEntries = c.nDetected;
        ScratchFile out({}, "wb");
        failAllocation(c.failingAllocation);
        EXPECT_EQ(writeFTBlock(out.f, 0, &b.data, &b.orig, &b.detected), 0u);
        EXPECT_EQ(lastMessageText(), c.text);
        EXPECT_TRUE(out.bytes().empty()) << c.text;
    }
}

TEST_F(FTBlockFormat, ReadingAndWritingNeedAFileAndABlockInTheWindow) {
    TestBlock b = makeBlock(1, 1, 1, 1);
    EXPECT_EQ(writeFTBlock(nullptr, 0, &b.data, &b.orig, &b.detected), 0u);
    EXPECT_EQ(lastMessageText(), "File handle not valid so cannot write data - writeFTBlock (1)");
    EXPECT_EQ(readFTBlock(nullptr, 0, &b.data, &b.orig, &b.detected), 0u);
    EXPECT_EQ(lastMessageText(), "File handle not valid so cannot read data - readFTBlock (1)");

    ScratchFile in(blockBytes(b));
    EXPECT_EQ(readFTBlock(in.f, 0, &b.data, nullptr, &b.detected), 0u);
    EXPECT_EQ(lastMessageText(), "Block to read not in memory so cannot read data - readFTBlock (2)");
    EXPECT_EQ(writeFTBlock(in.f, 0, nullptr, &b.orig, &b.detected), 0u);
    EXPECT_EQ(lastMessageText(), "Block to write not in memory so cannot write data - writeFTBlock (2)");
    for (const UiCall& call : uiCalls()) EXPECT_EQ(call.kind, MESSAGE_ERROR);
}

// ---- blocks that cannot be read ----

// A corrupt count, a block cut short or memory that cannot be had stops the read at that
// buffer: the buffers before it keep their new contents, the others are left as they were.
TEST_F(FTBlockRead, AFailedReadKeepsTheBuffersReadBeforeItAndLeavesTheRest) {
    TestBlock good = makeBlock(4, 5, 5, 2);
    std::vector<uint8_t> whole = blockBytes(good);
    auto cut = [&](size_t keep) { return std::vector<uint8_t>(whole.begin(), whole.begin() + long(keep)); };
    // The block with the count of buffer n replaced by count, and room for what it claims.
    auto withCount = [&](int n, uint32_t count) {
        std::vector<uint8_t> b;
        if (n > 0) putEntries(b, good.data.entries, good.data.nEntries);
        if (n > 1) putEntries(b, good.orig.entries, good.orig.nEntries);
        putU32(b, count);
        b.resize(b.size() + 4000, 0);
        return b;
    };
    const char* memory = "Could not allocate continuousDataBuffer so data could not be read - readFTBlock (";
    struct Case {
        std::vector<uint8_t> bytes;
        int failingAllocation;
        std::string text;
        int buffersRead;   // buffers that take new contents before the failure
    } cases[] = {
        {withCount(0, 256), 0, DATA_CORRUPT, 0},
        {withCount(1, 300), 0, ORIG_CORRUPT, 1},
        {withCount(2, 16), 0, DETECTED_CORRUPT, 2},
        {cut(0), 0, DATA_CORRUPT, 0},
        {cut(2), 0, DATA_CORRUPT, 0},
        {cut(4 + 12 * 5 - 1), 0, DATA_CORRUPT, 0},
        {cut(4 + 12 * 5 + 4 + 30), 0, ORIG_CORRUPT, 1},
        {cut(whole.size() - 1), 0, DETECTED_CORRUPT, 2},
        {whole, 1, std::string(memory) + "4)", 0},
        {whole, 2, std::string(memory) + "6)", 1},
        {whole, 3, std::string(memory) + "8)", 2},
    };
    for (const Case& c : cases) {
        ScratchFile in(c.bytes);
        TestBlock back = sentinelBlock();
        failAllocation(c.failingAllocation);
        EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), 0u) << c.text;
        EXPECT_EQ(lastMessageText(), c.text);
        TestBlock expected = sentinelBlock();
        if (c.buffersRead >= 1) expected.data = good.data;
        if (c.buffersRead >= 2) expected.orig = good.orig;
        EXPECT_TRUE(sameBlock(back, expected)) << c.text << " after " << c.bytes.size() << " bytes";
    }
}

// ---- the index ----

TEST_F(FTBlockIndex, AppendingWritesTheNewEntryWhereTheLastBlockEndsAndFlushesTheCount) {
    song.blockCount = 1;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 0;
    EXPECT_EQ(seek(0, 1, 0, &ok), 0);
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(readFileBytes(fiPath()), (std::vector<uint8_t>{1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0}))
        << "the index is flushed as soon as the entry is appended";
    closeFTFile(1);

    std::vector<TestBlock> blocks = makeBlocks(3);
    storeModel(blocks);
    song.blockCount = 10;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(std::tuple(seek(4, 1, 1, &ok), ok), std::tuple(0, 0)) << "more than one past the count";
    EXPECT_EQ(lastMessageText(), CANNOT_WRITE);
    EXPECT_EQ(std::tuple(seek(3, 1, 1, &ok), ok), std::tuple(0, 1));
    EXPECT_EQ(fileTell(ftFiles.ftFile), int64_t(modelFiles(blocks).ft.size()));
    closeFTFile(1);
    std::vector<uint8_t> fi = readFileBytes(fiPath());
    ASSERT_EQ(fi.size(), 4u + 8 * 4);
    EXPECT_EQ(std::tuple(getU32(fi, 0), getU32(fi, 4 + 8 * 3), getU32(fi, 8 + 8 * 3)),
              std::tuple(4u, uint32_t(modelFiles(blocks).ft.size()), 0u));
}

TEST_F(FTBlockIndex, RewritingWithTruncateDropsEveryLaterBlock) {
    std::vector<TestBlock> blocks = makeBlocks(5);
    ModelFiles m = modelFiles(blocks);
    storeModel(blocks);
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 0;
    EXPECT_EQ(std::tuple(seek(2, 1, 0, &ok), ok), std::tuple(int(getU32(m.fi, 8 + 16)), 1));
    EXPECT_EQ(readFileBytes(fiPath()), m.fi) << "without truncate the index stays as it is";
    EXPECT_EQ(std::tuple(seek(2, 1, 1, &ok), ok), std::tuple(int(getU32(m.fi, 8 + 16)), 1));
    EXPECT_EQ(fileTell(ftFiles.ftFile), int64_t(getU32(m.fi, 4 + 16)));
    closeFTFile(1);
    std::vector<uint8_t> expected = m.fi;
    expected[0] = 3;
    EXPECT_EQ(readFileBytes(fiPath()), expected);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(FTBlockIndex, TheBlockAfterTheLastIsWhereTheDataEndsAndTheOneAfterThatIsRefused) {
    std::vector<TestBlock> blocks = makeBlocks(4);
    ModelFiles m = modelFiles(blocks);
    storeModel(blocks);
    ASSERT_EQ(openFTFile(FT_READ), 1);
    int ok = 0;
    auto indexOf = [&](uint32_t block) { uint32_t at = getFTBlockIndex(ftFiles.ftIndexFile, block, &ok); return std::tuple(at, ok); };
    EXPECT_EQ(indexOf(2), std::tuple(getU32(m.fi, 4 + 16), 1));
    EXPECT_EQ(indexOf(4), std::tuple(uint32_t(m.ft.size()), 1));
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(indexOf(5), std::tuple(0u, 0));
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    EXPECT_EQ(std::tuple(seek(4, 0, 0, &ok), ok), std::tuple(0, 0)) << "reading a block the index does not hold";
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    closeFTFile(0);

    // Block 0 of an empty index is not stored either.
    song.blockCount = 5;
    writeFileBytes(fiPath(), {});
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    clearUiCalls();
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    EXPECT_EQ(messageCount(), 1);
    closeFTFile(1);
}

TEST_F(FTBlockIndex, ACountAboveTheSongsIsCutDownOnOpenAndOnCloseButNotInAFileOpenForReading) {
    std::vector<TestBlock> blocks = makeBlocks(5);
    ModelFiles m = modelFiles(blocks);
    storeModel(blocks);
    song.blockCount = 3;
    ASSERT_EQ(openFTFile(FT_READ), 1);
    int ok = 0;
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 3, &ok), getU32(m.fi, 4 + 24)) << "the end of block 2";
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 4, &ok), 0u);
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    clearUiCalls();
    EXPECT_EQ(closeFTFile(1), 1);
    EXPECT_EQ(readFileBytes(fiPath()), m.fi);

    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(getU32(readFileBytes(fiPath()), 0), 3u);
    song.blockCount = 2;   // a cut while the files are open
    ASSERT_EQ(closeFTFile(1), 1);
    std::vector<uint8_t> fi = readFileBytes(fiPath());
    EXPECT_EQ(getU32(fi, 0), 2u);
    EXPECT_EQ(fi.size(), 4u + 8 * 5) << "only the count changes";
    song.blockCount = 1;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    closeFTFile(0);
    EXPECT_EQ(getU32(readFileBytes(fiPath()), 0), 1u);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(FTBlockIndex, AHostileCountIsCappedByTheEntriesTheFileHolds) {
    std::vector<TestBlock> blocks = makeBlocks(2);
    ModelFiles m = modelFiles(blocks);
    m.fi[0] = 0xE8;
    m.fi[1] = 0x03;   // claims 1000 blocks
    writeFileBytes(ftPath(), m.ft);
    writeFileBytes(fiPath(), m.fi);
    song.blockCount = 1000;
    ASSERT_EQ(openFTFile(FT_READ), 1);
    int ok = 0;
    EXPECT_EQ(std::tuple(getFTBlockIndex(ftFiles.ftIndexFile, 2, &ok), ok), std::tuple(uint32_t(m.ft.size()), 1));
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 3, &ok), 0u);
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    EXPECT_EQ(std::tuple(seek(2, 0, 0, &ok), ok), std::tuple(0, 0));
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    closeFTFile(1);
}

TEST_F(FTBlockIndex, AnEntryReachingPastTheDataFileIsSeekingPastTheEnd) {
    std::vector<TestBlock> blocks = makeBlocks(3);
    ModelFiles m = modelFiles(blocks);
    storeModel(blocks);
    writeFileBytes(ftPath(), std::vector<uint8_t>(m.ft.begin(), m.ft.end() - 1));   // last block one byte short
    ASSERT_EQ(openFTFile(FT_READ), 1);
    int ok = 0;
    EXPECT_EQ(std::tuple(seek(1, 0, 0, &ok), ok), std::tuple(int(getU32(m.fi, 8 + 8)), 1));
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(std::tuple(seek(2, 0, 0, &ok), ok), std::tuple(0, 0));
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    closeFTFile(0);

    // An offset far beyond the file, and a size that wraps 32 bits.
    std::vector<uint8_t> fi = m.fi;
    fi[4 + 8 + 3] = 0x7F;
    for (int i = 0; i < 4; i++) fi[8 + 16 + i] = 0xFF;
    writeFileBytes(ftPath(), m.ft);
    writeFileBytes(fiPath(), fi);
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(seek(1, 1, 0, &ok), 0);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    clearUiCalls();
    EXPECT_EQ(seek(2, 0, 0, &ok), 0);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    clearUiCalls();
    EXPECT_EQ(seek(3, 1, 0, &ok), 0) << "appending after block 2";
    EXPECT_EQ(lastMessageText(), CANNOT_WRITE);
    closeFTFile(0);
}

TEST_F(FTBlockIndex, AnIndexTooShortForItsCountOrMissingIsRefusedByEveryReader) {
    writeFileBytes(ftPath(), std::vector<uint8_t>(12, 0));
    writeFileBytes(fiPath(), {1, 0});
    song.blockCount = 1;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 1;
    EXPECT_EQ(std::tuple(getFTBlockIndex(ftFiles.ftIndexFile, 0, &ok), ok), std::tuple(0u, 0));
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    EXPECT_EQ(seek(0, 1, 1, &ok), 0);
    EXPECT_EQ(lastMessageText(), CANNOT_WRITE);
    EXPECT_EQ(seek(0, 0, 0, &ok), 0);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, nullptr, 0, 0, 0, &ok), 0u);
    EXPECT_EQ(lastMessageText(), "File handle(s) not valid so cannot seek - seekToFTBlock (1)");
    closeFTFile(1);
    EXPECT_EQ(readFileBytes(fiPath()), (std::vector<uint8_t>{1, 0}));
}

TEST_F(FTBlockIndex, ABlockSizeIsWrittenOnlyIntoAStoredEntry) {
    std::vector<TestBlock> blocks = makeBlocks(3);
    ModelFiles m = modelFiles(blocks);
    storeModel(blocks);
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(setFTBlockSize(ftFiles.ftIndexFile, 1, 0x01020304), 1);
    EXPECT_EQ(setFTBlockSize(ftFiles.ftIndexFile, 3, 99), 0);
    closeFTFile(1);
    std::vector<uint8_t> expected = m.fi;
    for (int i = 0; i < 4; i++) expected[16 + i] = uint8_t(4 - i);
    EXPECT_EQ(readFileBytes(fiPath()), expected);
}

// ---- opening and closing ----

TEST_F(FTBlockFiles, AnUpdateOpenCreatesBothFilesEmptyAndASecondOpenIsRefused) {
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(ftFilesOpen(), 1);
    FILE* open = ftFiles.ftFile;
    EXPECT_EQ(openFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "FT File(s) already open - openFTFile (1)");
    EXPECT_EQ(ftFiles.ftFile, open);
    EXPECT_EQ(closeFTFile(1), 1);
    EXPECT_EQ(std::tuple(ftFilesOpen(), ftFiles.ftFile, ftFiles.ftIndexFile), std::tuple(0, nullptr, nullptr));
    EXPECT_EQ(std::tuple(fileSize(ftPath()), fileSize(fiPath())), std::tuple(0, 0));
    EXPECT_EQ(closeFTFile(1), 1) << "closing with nothing open does nothing";
}

TEST_F(FTBlockFiles, AFileThatCannotBeOpenedLeavesNothingOpen) {
    struct Case {
        bool stored;     // CS.ft and CS.fi exist
        int failingOpen;
        int mode;
        const char* text;
    } cases[] = {
        {false, 0, FT_READ, "Could not open FT file - openFTFile (2)"},
        {true, 1, FT_UPDATE, "Could not open FT file - openFTFile (2)"},
        {true, 2, FT_READ, "Could not open FT index file - openFTFile (3)"},
    };
    for (const Case& c : cases) {
        if (c.stored) storeModel(makeBlocks(2));
        clearUiCalls();
        failFileCall(FILE_OP_OPEN, c.failingOpen);
        EXPECT_EQ(openFTFile(c.mode), 0);
        EXPECT_EQ(lastMessageText(), c.text);
        EXPECT_EQ(messageCount(), 1);
        EXPECT_EQ(ftFilesOpen(), 0);
        EXPECT_EQ(fileExists(ftPath()), c.stored) << "reading creates nothing";
    }
    EXPECT_EQ(openFTFile(FT_READ), 1) << "nothing is left open to refuse the next open";
    closeFTFile(0);
}

}  // namespace
