// The FTBlockWindow against a plain list of every block, the analysis' and note editing's
// writing of window blocks, and the cutting of blocks out of CS.ft and CS.fi, each checked
// against the bytes the files must hold.
#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <tuple>

#include "store/ftBlockStoreFixtures.h"

namespace {

// Blocks of 2 s: the window holds exactly 15 of them.
const double BLOCK_SECONDS = 2.0;
const uint32_t CAPACITY = 15;

class FTBlockWindowLoad : public FTBlockStoreTest {
protected:
    void SetUp() override {
        FTBlockStoreTest::SetUp();
        setFTBlockWindowCapacity(BLOCK_SECONDS);
    }
    // Every block the window holds agrees with the plain list of all blocks.
    void expectWindowMatches(const std::vector<TestBlock>& all) {
        for (uint32_t b = ftBlockWindow.firstBlock; b < ftBlockWindow.endBlock; b++)
            EXPECT_TRUE(windowBlockIs(b, all[b]));
    }
};
class FTBlockSave : public FTBlockWindowLoad {};
class FTBlockRewrite : public FTBlockWindowLoad {};
class FTBlockRemove : public FTBlockStoreTest {};

const char* const SEEK_PAST_END =
    "Attempting to seeking past end of file in seekToFTBlock (2). Data will probably be corrupted.";
const char* const SIZE_INCONSISTENT =
    "Data size written to FT file is inconsistent with current value - writeFTBlock (1)";

FTDataBuffer& windowData(uint32_t b) { return ftBlockWindow.dataBuffers[b - ftBlockWindow.firstBlock]; }
FTDataBuffer& windowOrig(uint32_t b) { return ftBlockWindow.origDataBuffers[b - ftBlockWindow.firstBlock]; }
FTDetectedBuffer& windowDetected(uint32_t b) { return ftBlockWindow.detectedFrequenciesBuffers[b - ftBlockWindow.firstBlock]; }

// ---- filling the window ----

TEST_F(FTBlockWindowLoad, TheCapacityIsTheWholeBlocksInThirtySeconds) {
    setFTBlockWindowCapacity(512.0 / 44100.0);
    EXPECT_EQ(ftBlockWindow.capacity, 2583u) << "30 s of 512-sample blocks at 44.1 kHz is 2583.98 blocks";
    setFTBlockWindowCapacity(1.0 / 128);
    EXPECT_EQ(ftBlockWindow.capacity, 3840u);
    setFTBlockWindowCapacity(0.0);
    EXPECT_EQ(ftBlockWindow.capacity, 0u);
}

TEST_F(FTBlockWindowLoad, TheWindowHoldsWhatAPlainListOfBlocksHolds) {
    std::vector<TestBlock> all = makeBlocks(50);
    storeModel(all);
    struct Case {
        uint32_t from, to;            // requested
        uint32_t first, end;          // held afterwards
    } cases[] = {
        {0, 5, 0, 15},     // widened to the capacity
        {20, 100, 20, 35}, // cut down to the capacity
        {10, 12, 10, 25},
        {49, 50, 49, 50},  // near the end: short
        {44, 45, 44, 50},
        {3, 4, 3, 18},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(loadFTBlockWindow(c.from, c.to), 1) << c.from;
        EXPECT_EQ(ftBlockWindow.firstBlock, c.first);
        EXPECT_EQ(ftBlockWindow.endBlock, c.end);
        expectWindowMatches(all);
    }
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(ftFilesOpen(), 0) << "the files are closed after each load";
}

TEST_F(FTBlockWindowLoad, ARangeInsideTheWindowReadsNothing) {
    std::vector<TestBlock> all = makeBlocks(40);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(5, 6), 1);
    // Every count in CS.ft now reads as corrupt: any read would fail with a message.
    writeFileBytes(ftPath(), std::vector<uint8_t>(readFileBytes(ftPath()).size(), 0xFF));
    EXPECT_EQ((std::vector<int>{loadFTBlockWindow(5, 20), loadFTBlockWindow(12, 14), loadFTBlockWindow(19, 19)}), std::vector<int>(3, 0));
    EXPECT_EQ(std::tuple(messageCount(), ftBlockWindow.firstBlock, ftBlockWindow.endBlock), std::tuple(0, 5u, 20u));
    expectWindowMatches(all);
    // The same files do fail a load that has to read.
    EXPECT_EQ(loadFTBlockWindow(4, 5), 0);
    EXPECT_EQ(lastMessageText(), "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)");
}

TEST_F(FTBlockWindowLoad, ZeroZeroReloadsTheWindowDiscardingChangesOrLoadsAnEmptyOneFromTheStart) {
    std::vector<TestBlock> all = makeBlocks(40);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(5, 6), 1);
    windowOrig(7).entries[0].frequency = 1234.5f;
    windowDetected(8).nEntries = 0;
    EXPECT_EQ(loadFTBlockWindow(0, 0), 1);
    EXPECT_EQ(ftBlockWindow.firstBlock, 5u);
    EXPECT_EQ(ftBlockWindow.endBlock, 20u);
    expectWindowMatches(all);
    freeFTBlockWindow();
    EXPECT_TRUE(ftBlockWindow.dataBuffers.empty() && ftBlockWindow.origDataBuffers.empty() &&
                ftBlockWindow.detectedFrequenciesBuffers.empty());
    EXPECT_EQ(ftBlockWindow.endBlock, 0u);
    EXPECT_EQ(ftBlockWindow.capacity, 0u);
    setFTBlockWindowCapacity(BLOCK_SECONDS);
    EXPECT_EQ(loadFTBlockWindow(0, 0), 1);
    EXPECT_EQ(ftBlockWindow.firstBlock, 0u);
    EXPECT_EQ(ftBlockWindow.endBlock, CAPACITY);
    expectWindowMatches(all);
}

TEST_F(FTBlockWindowLoad, AfterTheSongGotShorterAReloadEndsAtItsLastBlock) {
    std::vector<TestBlock> all = makeBlocks(30);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(10, 11), 1);
    ASSERT_EQ(removeFTBlocksFromSong(18, 12), 1);
    song.blockCount = 18;
    EXPECT_EQ(loadFTBlockWindow(0, 0), 1);
    EXPECT_EQ(ftBlockWindow.firstBlock, 10u);
    EXPECT_EQ(ftBlockWindow.endBlock, 18u);
    expectWindowMatches(all);
    EXPECT_EQ(messageCount(), 0);
    // A window wholly past the new end is dropped, and the reload starts again at block 0, as
    // it does on an empty window.
    song.blockCount = 8;
    EXPECT_EQ(loadFTBlockWindow(0, 0), 1);
    EXPECT_EQ(ftBlockWindow.firstBlock, 0u);
    EXPECT_EQ(ftBlockWindow.endBlock, 8u);
    expectWindowMatches(all);
    // A request past the end loads nothing and leaves the window empty.
    EXPECT_EQ(loadFTBlockWindow(9, 10), 0);
    EXPECT_EQ(ftBlockWindow.firstBlock, ftBlockWindow.endBlock);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(FTBlockWindowLoad, AReloadThatFailsAfterACutStillDropsTheBlocksCutOff) {
    std::vector<TestBlock> all = makeBlocks(30);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(10, 11), 1);
    ASSERT_EQ(removeFTBlocksFromSong(20, 10), 1);
    song.blockCount = 20;
    failFileCall(FILE_OP_OPEN, 1);
    EXPECT_EQ(loadFTBlockWindow(0, 0), 0);
    EXPECT_EQ(lastMessageText(), "Could not open FT file - openFTFile (2)");
    EXPECT_EQ(ftBlockWindow.firstBlock, 10u);
    EXPECT_EQ(ftBlockWindow.endBlock, 20u);
    expectWindowMatches(all);
}

TEST_F(FTBlockWindowLoad, TheWindowEndsWithTheLastBlockTheIndexHolds) {
    std::vector<TestBlock> all = makeBlocks(30);
    storeModel(all);
    std::vector<uint8_t> fi = readFileBytes(fiPath());
    fi[0] = 12;   // the later blocks still lie in CS.ft, but the index no longer counts them
    writeFileBytes(fiPath(), fi);
    EXPECT_EQ(loadFTBlockWindow(5, 6), 1);
    EXPECT_EQ(ftBlockWindow.firstBlock, 5u);
    EXPECT_EQ(ftBlockWindow.endBlock, 12u);
    expectWindowMatches(all);
    EXPECT_EQ(loadFTBlockWindow(12, 13), 0);
    EXPECT_EQ(lastMessageText(), SEEK_PAST_END);
}

TEST_F(FTBlockWindowLoad, ACorruptBlockEndsTheWindowBeforeIt) {
    std::vector<TestBlock> all = makeBlocks(30);
    ModelFiles m = modelFiles(all);
    uint32_t block8 = getU32(m.fi, 4 + 8 * 8);
    uint32_t origCount = block8 + 4 + 12 * all[8].data.nEntries;
    m.ft[origCount + 1] = 0x01;   // origDataBuffer count of block 8 becomes 256 or more
    writeFileBytes(ftPath(), m.ft);
    writeFileBytes(fiPath(), m.fi);
    song.blockCount = 30;
    EXPECT_EQ(loadFTBlockWindow(2, 3), 0);
    EXPECT_EQ(lastMessageText(), "origDataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (5)");
    EXPECT_EQ(ftBlockWindow.firstBlock, 2u);
    EXPECT_EQ(ftBlockWindow.endBlock, 8u);
    expectWindowMatches(all);
    EXPECT_EQ(ftFilesOpen(), 0);
}

TEST_F(FTBlockWindowLoad, AWindowThatCannotGetItsMemoryShowsTheMemoryMessage) {
    storeModel(makeBlocks(20));
    failAllocation(1);
    EXPECT_EQ(loadFTBlockWindow(0, 1), 0);
    EXPECT_EQ(lastMessageText(),
              std::string("Sorry - there is insufficient memory available to continue. Please try freeing up some "
                          "memory from other applications.\n") +
                  std::strerror(ENOMEM));
    EXPECT_EQ(uiCalls().back().kind, MESSAGE_ERROR);
    EXPECT_TRUE(ftBlockWindow.dataBuffers.empty());
    EXPECT_EQ(ftBlockWindow.endBlock, 0u);
    EXPECT_EQ(ftFilesOpen(), 0) << "the files are not opened";
    EXPECT_EQ(loadFTBlockWindow(0, 1), 1) << "the next attempt gets its memory";
}

TEST_F(FTBlockWindowLoad, AFailedOpenLeavesTheWindowAsItWas) {
    std::vector<TestBlock> all = makeBlocks(40);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(0, 1), 1);
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);   // the analysis holds the files
    EXPECT_EQ(loadFTBlockWindow(20, 21), 0);
    EXPECT_EQ(lastMessageText(), "FT File(s) already open - openFTFile (1)");
    closeFTFile(1);
    EXPECT_EQ(ftBlockWindow.firstBlock, 0u);
    EXPECT_EQ(ftBlockWindow.endBlock, CAPACITY);
    expectWindowMatches(all);
}

// ---- writing window blocks back ----

TEST_F(FTBlockSave, EditedBlocksAreWrittenBackInPlace) {
    std::vector<TestBlock> all = makeBlocks(30);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(4, 5), 1);
    // A pitch edit: origDataBuffer frequencies and the detected pitch and amplitude.
    for (uint32_t b : {6u, 7u}) {
        for (uint32_t i = 0; i < windowOrig(b).nEntries; i++) windowOrig(b).entries[i].frequency *= 1.5f;
        if (windowDetected(b).nEntries > 0) {
            windowDetected(b).entries[0].frequency = 523.25f;
            windowDetected(b).entries[0].amplitude = 17;
        }
        all[b].orig = windowOrig(b);
        all[b].detected = windowDetected(b);
    }
    windowData(8).entries[0].frequency = 1.0f;   // changed but not saved
    EXPECT_EQ(saveFTBlocks(6, 8), 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(ftFilesOpen(), 0);
    ModelFiles m = modelFiles(all);
    EXPECT_EQ(readFileBytes(ftPath()), m.ft);
    EXPECT_EQ(readFileBytes(fiPath()), m.fi);
}

TEST_F(FTBlockSave, ABlockWhoseSizeChangedIsRefusedAndTheRestAreNotWritten) {
    std::vector<TestBlock> all = makeBlocks(30);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(4, 5), 1);
    windowOrig(6).entries[0].frequency = 999.0f;
    all[6].orig = windowOrig(6);
    windowDetected(7).nEntries = all[7].detected.nEntries + 1;   // one entry more than stored
    windowOrig(8).entries[0].frequency = 999.0f;
    EXPECT_EQ(saveFTBlocks(6, 9), 0);
    EXPECT_EQ(lastMessageText(), SIZE_INCONSISTENT);
    EXPECT_EQ(ftFilesOpen(), 0) << "both files are closed after the message";
    ModelFiles m = modelFiles(all);
    EXPECT_EQ(readFileBytes(ftPath()), m.ft) << "block 6 is saved, blocks 7 and 8 are not";
    EXPECT_EQ(readFileBytes(fiPath()), m.fi);
}

TEST_F(FTBlockSave, BlocksOutsideTheWindowOrTheIndexAreRefused) {
    std::vector<TestBlock> all = makeBlocks(20);
    storeModel(all);
    ASSERT_EQ(loadFTBlockWindow(0, 1), 1);
    EXPECT_EQ(saveFTBlocks(14, 16), 0);
    EXPECT_EQ(lastMessageText(), "Block to write not in memory so cannot write data - writeFTBlock (2)");
    // The song knows more blocks than the index holds: the block is not appended.
    ModelFiles m = modelFiles(std::vector<TestBlock>(all.begin(), all.begin() + 12));
    writeFileBytes(ftPath(), m.ft);
    writeFileBytes(fiPath(), m.fi);
    EXPECT_EQ(saveFTBlocks(12, 13), 0);
    EXPECT_EQ(lastMessageText(), SIZE_INCONSISTENT);
    EXPECT_EQ(readFileBytes(fiPath()), m.fi);
    EXPECT_EQ(readFileBytes(ftPath()), m.ft);
}

// The analysis' way: blocks made in the window, then written as they are produced.
void putInWindow(const std::vector<TestBlock>& blocks, uint32_t first) {
    ASSERT_EQ(growFTBlockWindow(), 1);
    ftBlockWindow.firstBlock = first;
    ftBlockWindow.endBlock = first + uint32_t(blocks.size());
    for (uint32_t i = 0; i < blocks.size(); i++) {
        ftBlockWindow.dataBuffers[i] = blocks[i].data;
        ftBlockWindow.origDataBuffers[i] = blocks[i].orig;
        ftBlockWindow.detectedFrequenciesBuffers[i] = blocks[i].detected;
    }
}

TEST_F(FTBlockRewrite, BlocksProducedByTheAnalysisAreStoredOneAfterAnother) {
    std::vector<TestBlock> all = makeBlocks(12);
    putInWindow(all, 0);
    song.blockCount = 12;
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, 0, 5), 1);
    EXPECT_EQ(rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, 5, 12), 1);
    ASSERT_EQ(closeFTFile(1), 1);
    ModelFiles m = modelFiles(all);
    EXPECT_EQ(readFileBytes(ftPath()), m.ft);
    EXPECT_EQ(readFileBytes(fiPath()), m.fi);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(FTBlockRewrite, RewritingABlockDropsTheLaterOnesUntilTheyAreWrittenAgain) {
    std::vector<TestBlock> all = makeBlocks(12);
    storeModel(all);
    all[4] = makeBlock(90, 200, 200, 15);   // recognition rebuilt block 4: larger
    all[5] = makeBlock(91, 0, 0, 0);        // and block 5: smaller
    putInWindow(std::vector<TestBlock>(all.begin(), all.begin() + 8), 0);
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, 9, 10), 0);
    EXPECT_EQ(lastMessageText(), "Block to write not in memory so cannot write data - writeFTBlock (2)");
    EXPECT_EQ(readFileBytes(fiPath()), modelFiles(makeBlocks(12)).fi) << "a block outside the window leaves the index";
    putInWindow(all, 0);
    EXPECT_EQ(rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, 4, 6), 1);
    ASSERT_EQ(closeFTFile(1), 1);
    std::vector<uint8_t> fi = readFileBytes(fiPath());
    EXPECT_EQ(getU32(fi, 0), 6u) << "blocks 6 .. 11 have left the index";
    ASSERT_EQ(openFTFile(FT_UPDATE), 1);
    EXPECT_EQ(rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, 6, 12), 1);
    ASSERT_EQ(closeFTFile(1), 1);
    ModelFiles m = modelFiles(all);
    EXPECT_EQ(readFileBytes(fiPath()), m.fi);
    EXPECT_EQ(readFileBytes(ftPath()), m.ft);
}

// ---- cutting blocks ----

TEST_F(FTBlockRemove, CutsAtTheStartInTheMiddleAndAtTheEndLeaveExactlyTheOtherBlocks) {
    struct Case {
        uint32_t first, count;
    } cases[] = {{0, 3}, {4, 3}, {7, 3}, {0, 10}, {5, 1}, {2, 0}};
    for (const Case& c : cases) {
        std::vector<TestBlock> all = makeBlocks(10);
        storeModel(all);
        EXPECT_EQ(removeFTBlocksFromSong(c.first, c.count), 1) << c.first << "+" << c.count;
        std::vector<TestBlock> left = all;
        left.erase(left.begin() + c.first, left.begin() + c.first + c.count);
        ModelFiles m = modelFiles(left);
        EXPECT_EQ(readFileBytes(ftPath()), m.ft) << c.first << "+" << c.count;
        EXPECT_EQ(readFileBytes(fiPath()), m.fi) << c.first << "+" << c.count;
        EXPECT_FALSE(fileExists(sharedFilePath("CS.tw")));
        EXPECT_EQ(ftFilesOpen(), 0);
        EXPECT_EQ(messageCount(), 0);
    }
}

TEST_F(FTBlockRemove, ARefusedCutChangesNothing) {
    ModelFiles m = modelFiles(makeBlocks(10));
    ModelFiles corrupt = m;
    corrupt.ft[getU32(m.fi, 4 + 8 * 7) + 1] = 0x01;   // dataBuffer count of block 7: 256 or more
    ModelFiles pastTheData = m;
    pastTheData.fi[4 + 8 * 5 + 3] = 0x40;           // block 5 "starts" a gigabyte in
    struct Case {
        const ModelFiles& files;
        uint32_t first, count;
        int failingOpen;
        std::string text;
    } cases[] = {
        {m, 8, 3, 0, "Index for FT block is not stored - getFTBlockIndex (1)."},
        {m, 2, 3, 3, "Cannot " + sharedFilePath("CS.tw")},   // CS.ft, CS.fi, then CS.tw
        {corrupt, 2, 3, 0, "dataBuffer->nEntries is corrupt so cannot read FT block - readFTBlock (3)"},
        {pastTheData, 2, 3, 0, SEEK_PAST_END},
    };
    for (const Case& c : cases) {
        writeFileBytes(ftPath(), c.files.ft);
        writeFileBytes(fiPath(), c.files.fi);
        song.blockCount = 10;
        failFileCall(FILE_OP_OPEN, c.failingOpen);
        EXPECT_EQ(removeFTBlocksFromSong(c.first, c.count), 0);
        EXPECT_EQ(lastMessageText(), c.text);
        EXPECT_EQ(readFileBytes(ftPath()), c.files.ft) << c.text;
        EXPECT_EQ(readFileBytes(fiPath()), c.files.fi) << c.text;
        EXPECT_FALSE(fileExists(sharedFilePath("CS.tw")));
        EXPECT_EQ(ftFilesOpen(), 0);
    }
}

}  // namespace
