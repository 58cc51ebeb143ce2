// The FT files and their index, and single FT blocks: the exact bytes of stored blocks and
// index entries, the index's upkeep (appending, truncating, the count cut down to the song),
// opening and closing, and every message a corrupt or hostile file gives.
#include <gtest/gtest.h>

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

// ---- stored bytes ----

TEST_F(FTBlockFormat, ABlockWithNoEntriesIsStoredAsTwelveZeroBytes) {
    song.blockCount = 1;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    TestBlock empty = makeBlock(0, 0, 0, 0);
    int ok = 0;
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 0, 1, 1, &ok), 0u);
    EXPECT_EQ(ok, 1);
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

TEST_F(FTBlockFormat, AFullBlockReadsBackAsWrittenAndLeavesTheMemoryOnlyBytesAlone) {
    TestBlock full = makeBlock(5, 255, 255, 15);
    ScratchFile out({}, "wb");
    ASSERT_EQ(writeFTBlock(out.f, 0, &full.data, &full.orig, &full.detected), ftBlockBytes(255, 255, 15));
    std::vector<uint8_t> stored = out.bytes();
    EXPECT_EQ(stored, blockBytes(full));
    ScratchFile in(stored);
    TestBlock back = sentinelBlock();
    EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), 6312u);
    EXPECT_TRUE(sameBlock(back, full));
    EXPECT_EQ(back.data.blockLoudness, 201);
    EXPECT_EQ(back.data.blockFlags, 9);
    EXPECT_EQ(back.orig.blockLoudness, 202);
}

TEST_F(FTBlockFormat, CountsBeyondTheBuffersAreRefusedBeforeAnythingIsWritten) {
    struct Case {
        uint32_t nData, nOrig, nDetected;
        const char* text;
    } cases[] = {
        {256, 0, 0, "dataBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (3)"},
        {3, 256, 0, "origDataBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (5)"},
        {3, 3, 16, "detectedFrequenciesBuffer->nEntries is corrupt so cannot write FT block - writeFTBlock (7)"},
    };
    for (const Case& c : cases) {
        TestBlock b = makeBlock(1, 3, 3, 3);
        b.data.nEntries = c.nData;
        b.orig.nEntries = c.nOrig;
        b.detected.nEntries = c.nDetected;
        ScratchFile out({}, "wb");
        EXPECT_EQ(writeFTBlock(out.f, 0, &b.data, &b.orig, &b.detected), 0u);
        EXPECT_EQ(lastMessageText(), c.text);
        EXPECT_TRUE(out.bytes().empty()) << c.text;
    }
}

TEST_F(FTBlockFormat, AWriteThatCannotGetItsMemoryWritesNothing) {
    const char* texts[] = {"Could not allocate continuousDataBuffer so data could not be written - writeFTBlock (4)",
                           "Could not allocate continuousDataBuffer so data could not be written - writeFTBlock (6)",
                           "Could not allocate continuousDataBuffer so data could not be written - writeFTBlock (8)"};
    TestBlock b = makeBlock(1, 2, 2, 2);
    for (int n = 1; n <= 3; n++) {
        ScratchFile out({}, "wb");
        failAllocation(n);
        EXPECT_EQ(writeFTBlock(out.f, 0, &b.data, &b.orig, &b.detected), 0u);
        EXPECT_EQ(lastMessageText(), texts[n - 1]);
        EXPECT_TRUE(out.bytes().empty());
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

// ---- corrupt blocks ----

TEST_F(FTBlockRead, ACorruptDataCountLeavesEveryBufferAsItWas) {
    std::vector<uint8_t> bytes;
    putU32(bytes, 256);
    bytes.resize(4000, 0);
    ScratchFile in(bytes);
    TestBlock back = sentinelBlock();
    EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), 0u);
    EXPECT_EQ(lastMessageText(), "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)");
    EXPECT_TRUE(sameBlock(back, sentinelBlock()));
}

TEST_F(FTBlockRead, BuffersReadBeforeACorruptCountKeepTheirNewContents) {
    TestBlock good = makeBlock(4, 2, 3, 1);
    std::vector<uint8_t> origCorrupt;
    putEntries(origCorrupt, good.data.entries, 2);
    putU32(origCorrupt, 300);
    origCorrupt.resize(origCorrupt.size() + 4000, 0);
    {
        ScratchFile in(origCorrupt);
        TestBlock back = sentinelBlock();
        EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), 0u);
        EXPECT_EQ(lastMessageText(), "origDataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (5)");
        TestBlock expected = sentinelBlock();
        expected.data = good.data;
        EXPECT_TRUE(sameBlock(back, expected));
    }
    std::vector<uint8_t> detectedCorrupt;
    putEntries(detectedCorrupt, good.data.entries, 2);
    putEntries(detectedCorrupt, good.orig.entries, 3);
    putU32(detectedCorrupt, 16);
    detectedCorrupt.resize(detectedCorrupt.size() + 400, 0);
    {
        ScratchFile in(detectedCorrupt);
        TestBlock back = sentinelBlock();
        EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), 0u);
        EXPECT_EQ(lastMessageText(),
                  "detectedFrequenciesBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (7)");
        TestBlock expected = sentinelBlock();
        expected.data = good.data;
        expected.orig = good.orig;
        EXPECT_TRUE(sameBlock(back, expected));
    }
}

TEST_F(FTBlockRead, ABlockCutShortIsACorruptCountNotGarbage) {
    TestBlock good = makeBlock(4, 5, 5, 2);
    std::vector<uint8_t> whole = blockBytes(good);
    struct Case {
        size_t keep;          // bytes of the block left in the file
        const char* text;
        int buffersRead;      // buffers that take new contents before the failure
    } cases[] = {
        {0, "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)", 0},
        {2, "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)", 0},
        {4 + 12 * 5 - 1, "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)", 0},
        {4 + 12 * 5 + 4 + 30, "origDataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (5)", 1},
        {whole.size() - 1, "detectedFrequenciesBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (7)", 2},
    };
    for (const Case& c : cases) {
        ScratchFile in(std::vector<uint8_t>(whole.begin(), whole.begin() + long(c.keep)));
        TestBlock back = sentinelBlock();
        EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), 0u) << c.keep;
        EXPECT_EQ(lastMessageText(), c.text) << c.keep;
        TestBlock expected = sentinelBlock();
        if (c.buffersRead >= 1) expected.data = good.data;
        if (c.buffersRead >= 2) expected.orig = good.orig;
        EXPECT_TRUE(sameBlock(back, expected)) << c.keep;
    }
}

TEST_F(FTBlockRead, AReadThatCannotGetItsMemoryStopsAtThatBuffer) {
    const char* texts[] = {"Could not allocate continuousDataBuffer so data could not be read - readFTBlock (4)",
                           "Could not allocate continuousDataBuffer so data could not be read - readFTBlock (6)",
                           "Could not allocate continuousDataBuffer so data could not be read - readFTBlock (8)"};
    TestBlock good = makeBlock(8, 4, 4, 4);
    for (int n = 1; n <= 3; n++) {
        ScratchFile in(blockBytes(good));
        TestBlock back = sentinelBlock();
        failAllocation(n);
        EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), 0u);
        EXPECT_EQ(lastMessageText(), texts[n - 1]);
        TestBlock expected = sentinelBlock();
        if (n >= 2) expected.data = good.data;
        if (n >= 3) expected.orig = good.orig;
        EXPECT_TRUE(sameBlock(back, expected)) << n;
    }
}

TEST_F(FTBlockRead, BlocksFollowOneAnotherWithoutSeeking) {
    std::vector<TestBlock> blocks = makeBlocks(6);
    ScratchFile in(modelFiles(blocks).ft);
    for (const TestBlock& expected : blocks) {
        TestBlock back = sentinelBlock();
        EXPECT_EQ(readFTBlock(in.f, 0, &back.data, &back.orig, &back.detected), uint32_t(blockBytes(expected).size()));
        EXPECT_TRUE(sameBlock(back, expected));
    }
    EXPECT_EQ(messageCount(), 0);
}

// ---- the index ----

TEST_F(FTBlockIndex, AppendingToAnEmptyIndexWritesEntryZeroAndACountOfOne) {
    song.blockCount = 1;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 0;
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 0, 1, 0, &ok), 0u);
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(readFileBytes(fiPath()), (std::vector<uint8_t>{1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0}))
        << "the index is flushed as soon as the entry is appended";
    closeFTFile(1);
}

TEST_F(FTBlockIndex, AnAppendedBlockStartsWhereTheLastOneEnds) {
    std::vector<TestBlock> blocks = makeBlocks(3);
    storeModel(blocks);
    song.blockCount = 4;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 0;
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 3, 1, 1, &ok), 0u);
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(fileTell(ftFiles.ftFile), int64_t(modelFiles(blocks).ft.size()));
    closeFTFile(1);
    std::vector<uint8_t> fi = readFileBytes(fiPath());
    ASSERT_EQ(fi.size(), 4u + 8 * 4);
    EXPECT_EQ(getU32(fi, 0), 4u);
    EXPECT_EQ(getU32(fi, 4 + 8 * 3), uint32_t(modelFiles(blocks).ft.size()));
    EXPECT_EQ(getU32(fi, 8 + 8 * 3), 0u);
}

TEST_F(FTBlockIndex, WritingMoreThanOnePastTheCountIsRefused) {
    std::vector<TestBlock> blocks = makeBlocks(3);
    storeModel(blocks);
    song.blockCount = 10;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 1;
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 4, 1, 1, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), CANNOT_WRITE);
    closeFTFile(1);
    EXPECT_EQ(readFileBytes(fiPath()), modelFiles(blocks).fi);
}

TEST_F(FTBlockIndex, RewritingWithTruncateDropsEveryLaterBlock) {
    std::vector<TestBlock> blocks = makeBlocks(5);
    ModelFiles m = modelFiles(blocks);
    storeModel(blocks);
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 0;
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 2, 1, 0, &ok), getU32(m.fi, 8 + 16));
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(readFileBytes(fiPath()), m.fi) << "without truncate the index stays as it is";
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 2, 1, 1, &ok), getU32(m.fi, 8 + 16));
    EXPECT_EQ(ok, 1);
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
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 2, &ok), getU32(m.fi, 4 + 16));
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 4, &ok), uint32_t(m.ft.size()));
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 5, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    closeFTFile(0);
}

TEST_F(FTBlockIndex, BlockZeroOfAnEmptyIndexIsNotStored) {
    song.blockCount = 5;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 1;
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    EXPECT_EQ(messageCount(), 1);
    closeFTFile(1);
}

TEST_F(FTBlockIndex, ACountAboveTheSongsIsCutDownOnOpenAndOnClose) {
    std::vector<TestBlock> blocks = makeBlocks(5);
    storeModel(blocks);
    song.blockCount = 3;
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

TEST_F(FTBlockIndex, AnIndexOpenedForReadingIsCappedButNotWritten) {
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
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 2, &ok), uint32_t(m.ft.size()));
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 3, &ok), 0u);
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 2, 0, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
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
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 1, 0, 0, &ok), getU32(m.fi, 8 + 8));
    EXPECT_EQ(ok, 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 2, 0, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    closeFTFile(0);

    // An offset far beyond the file, and a size that wraps 32 bits.
    std::vector<uint8_t> fi = m.fi;
    fi[4 + 8 + 3] = 0x7F;
    for (int i = 0; i < 4; i++) fi[8 + 16 + i] = 0xFF;
    writeFileBytes(ftPath(), m.ft);
    writeFileBytes(fiPath(), fi);
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 1, 1, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    clearUiCalls();
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 2, 0, 0, &ok), 0u);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    clearUiCalls();
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 3, 1, 0, &ok), 0u) << "appending after block 2";
    EXPECT_EQ(lastMessageText(), CANNOT_WRITE);
    closeFTFile(0);
}

TEST_F(FTBlockIndex, ReadingABlockTheIndexDoesNotHoldIsSeekingPastTheEnd) {
    storeModel(makeBlocks(2));
    ASSERT_EQ(openFTFile(FT_READ), 1);
    int ok = 1;
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 2, 0, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    closeFTFile(0);
}

TEST_F(FTBlockIndex, AnIndexTooShortForItsCountIsRefusedByEveryReader) {
    writeFileBytes(ftPath(), std::vector<uint8_t>(12, 0));
    writeFileBytes(fiPath(), {1, 0});
    song.blockCount = 1;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    int ok = 1;
    EXPECT_EQ(getFTBlockIndex(ftFiles.ftIndexFile, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), INDEX_NOT_STORED);
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 0, 1, 1, &ok), 0u);
    EXPECT_EQ(lastMessageText(), CANNOT_WRITE);
    EXPECT_EQ(seekToFTBlock(ftFiles.ftFile, ftFiles.ftIndexFile, 0, 0, 0, &ok), 0u);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
    closeFTFile(1);
    EXPECT_EQ(readFileBytes(fiPath()), (std::vector<uint8_t>{1, 0}));
}

TEST_F(FTBlockIndex, SeekingWithoutBothFilesIsRefused) {
    ScratchFile f({});
    int ok = 1;
    EXPECT_EQ(seekToFTBlock(f.f, nullptr, 0, 0, 0, &ok), 0u);
    EXPECT_EQ(ok, 0);
    EXPECT_EQ(lastMessageText(), "File handle(s) not valid so cannot seek - seekToFTBlock (1)");
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
    expected[16] = 4;
    expected[17] = 3;
    expected[18] = 2;
    expected[19] = 1;
    EXPECT_EQ(readFileBytes(fiPath()), expected);
}

// ---- opening and closing ----

TEST_F(FTBlockFiles, AnUpdateOpenCreatesBothFilesEmpty) {
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(ftFilesOpen(), 1);
    EXPECT_TRUE(fileExists(ftPath()));
    EXPECT_TRUE(fileExists(fiPath()));
    EXPECT_EQ(closeFTFile(1), 1);
    EXPECT_EQ(ftFilesOpen(), 0);
    EXPECT_EQ(ftFiles.ftFile, nullptr);
    EXPECT_EQ(ftFiles.ftIndexFile, nullptr);
    EXPECT_EQ(fileSize(ftPath()), 0);
    EXPECT_EQ(fileSize(fiPath()), 0);
    EXPECT_EQ(closeFTFile(1), 1) << "closing with nothing open does nothing";
}

TEST_F(FTBlockFiles, OpeningTwiceIsRefusedAndKeepsTheOpenFiles) {
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    FILE* open = ftFiles.ftFile;
    EXPECT_EQ(openFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "FT File(s) already open - openFTFile (1)");
    EXPECT_EQ(ftFiles.ftFile, open);
    closeFTFile(1);
}

TEST_F(FTBlockFiles, ReadingAMissingFTFileFails) {
    EXPECT_EQ(openFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "Could not open FT file - openFTFile (2)");
    EXPECT_EQ(ftFilesOpen(), 0);
    EXPECT_FALSE(fileExists(ftPath())) << "reading creates nothing";
}

TEST_F(FTBlockFiles, AnFTFileThatCannotBeOpenedLeavesNothingOpen) {
    storeModel(makeBlocks(2));
    failFileCall(FILE_OP_OPEN, 1);
    EXPECT_EQ(openFTFile(FT_UPDATE), 0);
    EXPECT_EQ(lastMessageText(), "Could not open FT file - openFTFile (2)");
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(ftFilesOpen(), 0);
}

TEST_F(FTBlockFiles, AnIndexThatCannotBeOpenedClosesTheFTFileAgain) {
    storeModel(makeBlocks(2));
    failFileCall(FILE_OP_OPEN, 2);
    EXPECT_EQ(openFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "Could not open FT index file - openFTFile (3)");
    EXPECT_EQ(ftFilesOpen(), 0);
    EXPECT_EQ(openFTFile(FT_READ), 1) << "nothing is left open to refuse the next open";
    closeFTFile(0);
}

}  // namespace
