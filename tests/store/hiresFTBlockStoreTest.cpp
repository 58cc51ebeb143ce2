// The Hires FT block store: the stored bytes of a block, compression and expansion round
// trips, damaged blocks, the files with their messages, and the cutting of blocks compared
// with a model of the expected files.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "support/testSupport.h"

using Bytes = std::vector<uint8_t>;

// N = 1024 bins centred on 1000 x (1 + i / 150) Hz: bins 0 .. 599 lie below 5000 Hz.
static const uint32_t N = 1024;
static const uint32_t CONSIDERED = 600;
static const double F = 1000.0;
static const double M = 150.0;

static const char* const CORRUPT_TEXT =
    "Number of freqBlock entries is corrupt so cannot read Hires FT block - readHiresFTBlock (3)";

static void putF32(Bytes& b, float v) {
    uint32_t bits;
    std::memcpy(&bits, &v, 4);
    putU32(b, bits);
}

// A stored block from its parts.
static Bytes storedBlock(uint16_t count, float scale, float offset, const std::vector<uint16_t>& magnitudes,
                         const Bytes& gaps) {
    Bytes b;
    putU16(b, count);
    putF32(b, scale);
    putF32(b, offset);
    for (uint16_t q : magnitudes) putU16(b, q);
    b.insert(b.end(), gaps.begin(), gaps.end());
    return b;
}

// An expanded block: N bins of (magnitude, second value).
struct Spectrum {
    std::vector<double> bins = std::vector<double>(2 * size_t(N), 0.0);
    void set(uint32_t i, double m) { bins[2 * size_t(i)] = m; }
    double at(uint32_t i) const { return bins[2 * size_t(i)]; }
};

class HiresFTFixture : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        resetSong();
        song.waveFormat.bitsPerSample = 16;
        hiresGeometry = HiresGeometry{N, F, M, 0.03125};
        generalSettings.disableWaveEditing = false;
        scratchPath = folder.file("block");
        scratch = fileOpen(scratchPath, "wb+");
        ASSERT_NE(scratch, nullptr);
        buffer = allocCompressedHiresBuffer(0);
        ASSERT_NE(buffer, nullptr);
    }
    void TearDown() override {
        freeCompressedHiresBuffer(buffer);
        if (scratch) fileClose(scratch);
        closeHiresFTFile(0);
        freeHiresBuffers();
        freeFTBlockWindow();
        generalSettings = GeneralSettings{};
        hiresGeometry = HiresGeometry{};
        resetSong();
        SharedFolderTest::TearDown();
    }
    // Compresses spectrum into the scratch file (replacing what it held); the bytes written.
    uint32_t writeScratch(const Spectrum& spectrum, float offset = 0.0f, const float* deviations = nullptr) {
        std::fclose(scratch);
        scratch = fileOpen(scratchPath, "wb+");
        buffer->offset = offset;
        return writeHiresFTBlock(scratch, 0, 0, buffer, spectrum.bins.data(), deviations);
    }
    Bytes scratchBytes() {
        std::fflush(scratch);
        return readFileBytes(scratchPath);
    }
    // Replaces the scratch file with bytes and positions it at the start.
    void craftScratch(const Bytes& bytes) {
        std::fclose(scratch);
        writeFileBytes(scratchPath, bytes);
        scratch = fileOpen(scratchPath, "rb");
        ASSERT_NE(scratch, nullptr);
    }
    // Reads the scratch file's block back from its start.
    uint32_t readScratch(Spectrum& out, float* deviations = nullptr) {
        std::rewind(scratch);
        return readHiresFTBlock(scratch, 0, 0, out.bins.data(), deviations);
    }

    std::string scratchPath;
    FILE* scratch = nullptr;
    CompressedHiresBuffer* buffer = nullptr;
};

// ---- the stored bytes ----

class HiresFTLayout : public HiresFTFixture {};

TEST_F(HiresFTLayout, ABlockIsStoredAsCountScaleOffsetMagnitudesAndGaps) {
    song.waveFormat.bitsPerSample = 8;   // threshold 0.5
    Spectrum s;
    s.set(10, 65535.0);   // the loudest: ln(65536) = 16 ln 2 is the scale, q = 65535
    s.set(12, 255.0);     // ln 256 is half the scale: q = trunc(32767.5)
    s.set(13, 15.0);      // a quarter: q = trunc(16383.75)
    s.set(20, 3.0);       // an eighth: q = trunc(8191.875)
    s.set(21, 0.49);      // below the threshold
    s.set(700, 1e9);      // above 5000 Hz: neither stored nor counted in the scale
    ASSERT_EQ(writeScratch(s, -0.125f), 28u);
    // After bin 20 nothing passes, so bins 276 and 532 are forced to keep the gaps in a byte.
    Bytes expected = storedBlock(6, float(16 * std::log(2.0)), -0.125f, {65535, 32767, 16383, 8191, 0, 0},
                                 {10, 1, 0, 6, 255, 255});
    EXPECT_EQ(scratchBytes(), expected);
}

TEST_F(HiresFTLayout, ASilentBlockKeepsOnlyTheForcedEntriesAt255And511) {
    Spectrum silent;
    ASSERT_EQ(writeScratch(silent), 16u);
    EXPECT_EQ(scratchBytes(), storedBlock(2, float(std::log(1.5)), 0.0f, {0, 0}, {255, 255}));
    Spectrum out;
    out.set(255, 9.0);
    ASSERT_EQ(readScratch(out), 16u);
    for (uint32_t i = 0; i < N; i++) ASSERT_EQ(out.at(i), 0.0) << "bin " << i;
}

TEST_F(HiresFTLayout, DeviationsStayInMemoryAndAreNotStored) {
    Spectrum s;
    s.set(40, 50000.0);
    s.set(41, 40000.0);
    std::vector<float> deviations(N, 0.0f);
    deviations[40] = 3.5f;
    deviations[41] = -2.25f;
    ASSERT_EQ(writeScratch(s, 0.0f, deviations.data()), 10u + 3 * 4);
    ASSERT_EQ(buffer->count, 4);   // 40, 41 and the forced 297 and 553
    EXPECT_EQ(buffer->deviations[0], 3.5f);
    EXPECT_EQ(buffer->deviations[1], -2.25f);
    EXPECT_EQ(buffer->deviations[2], 0.0f);
    EXPECT_EQ(scratchBytes().size(), 22u);
}

TEST_F(HiresFTLayout, ACountOf0ReadsAsNZeroBinsAndNothingPastThem) {
    craftScratch(storedBlock(0, 3.0f, 0.5f, {}, {}));
    std::vector<double> destination(2 * N + 4, 7.0);
    std::vector<float> deviations(N + 4, 7.0f);
    EXPECT_EQ(readHiresFTBlock(scratch, 0, 0, destination.data(), deviations.data()), 10u);
    for (uint32_t i = 0; i < 2 * N; i++) ASSERT_EQ(destination[i], 0.0) << "value " << i;
    for (uint32_t i = 0; i < N; i++) ASSERT_EQ(deviations[i], 0.0f) << "deviation " << i;
    for (int k = 0; k < 4; k++) {
        EXPECT_EQ(destination[2 * N + k], 7.0) << "written past the N bins";
        EXPECT_EQ(deviations[N + k], 7.0f) << "written past the N deviations";
    }
    EXPECT_EQ(messageCount(), 0);
}

// ---- compression and expansion ----

class HiresFTRoundTrip : public HiresFTFixture {};

TEST_F(HiresFTRoundTrip, TheLoudestBinComesBackAs65535WhateverItsLevel) {
    song.waveFormat.bitsPerSample = 8;
    for (double loudest : {0.75, 1.0, 3.3, 1000.0, 123456.789, 1e12, 1e200}) {
        Spectrum s;
        s.set(100, loudest);
        s.set(101, loudest / 3);
        ASSERT_GT(writeScratch(s), 0u);
        ASSERT_GE(buffer->count, 1);
        EXPECT_EQ(buffer->gaps[0], 100);
        EXPECT_EQ(buffer->magnitudes[0], 65535) << "loudest " << loudest;
        Spectrum out;
        ASSERT_GT(readScratch(out), 0u);
        // Only the scale's rounding to a float stands between them.
        EXPECT_NEAR(std::log1p(out.at(100)), std::log1p(loudest), std::log1p(loudest) * 1e-7) << "loudest " << loudest;
    }
}

// Loud bins every 7 bins (so no entry is ever forced) and levels around the threshold t
// in between, over all N bins.
static Spectrum aroundThreshold(double t) {
    Spectrum s;
    const double levels[] = {0.0, t * 0.999, t, t * 1.001, t * 0.5, t * 3.7, t * 2000.0};
    for (uint32_t i = 0; i < N; i++) s.set(i, i % 7 == 0 ? t * 50.0 + i : levels[i % 7]);
    return s;
}

class HiresFTThreshold : public HiresFTFixture {
protected:
    // Every bin below 5000 Hz at or above the threshold comes back within one quantisation
    // step; every other bin comes back 0.
    void checkRoundTrip(double threshold) {
        Spectrum s = aroundThreshold(threshold);
        ASSERT_GT(writeScratch(s), 0u);
        Spectrum out;
        ASSERT_GT(readScratch(out), 0u);
        double loudest = 0.5;
        for (uint32_t i = 0; i < CONSIDERED; i++) loudest = std::max(loudest, s.at(i));
        double step = std::log1p(loudest) / 65535 * 1.01;   // log units, room for the scale's float rounding
        for (uint32_t i = 0; i < N; i++) {
            double m = s.at(i);
            if (i < CONSIDERED && m >= threshold)
                ASSERT_NEAR(std::log1p(out.at(i)), std::log1p(m), step) << "bin " << i;
            else
                ASSERT_EQ(out.at(i), 0.0) << "bin " << i << " holding " << m;
            ASSERT_EQ(out.bins[2 * size_t(i) + 1], 0.0);
        }
    }
};

TEST_F(HiresFTThreshold, SixteenBitKeepsEveryBinFrom32768AndEightBitFromOneHalfAndClearsTheRest) {
    song.waveFormat.bitsPerSample = 16;
    checkRoundTrip(32768.0);
    song.waveFormat.bitsPerSample = 8;
    checkRoundTrip(0.5);
}

TEST_F(HiresFTRoundTrip, DeviationsFollowTheOffsetFromEachBinsCentre) {
    const double tolerance = 0.01;   // Hz
    Spectrum s;
    s.set(0, 40000.0);     // centre 1000 Hz
    s.set(75, 40000.0);    // 1500 Hz
    s.set(150, 50000.0);   // 2000 Hz
    ASSERT_GT(writeScratch(s, float(std::log(1.5))), 0u);   // every stored bin half again as high
    Spectrum out;
    std::vector<float> deviations(N, 9.0f);
    ASSERT_GT(readScratch(out, deviations.data()), 0u);
    for (auto [bin, deviation] : {std::pair(0, 500.0), std::pair(75, 750.0), std::pair(150, 1000.0)})
        EXPECT_NEAR(deviations[bin], deviation, tolerance) << bin;
    EXPECT_EQ(std::pair(deviations[1], deviations[599]), std::pair(0.0f, 0.0f)) << "a bin not stored has no deviation";

    ASSERT_GT(writeScratch(s, float(std::log(0.5))), 0u);   // an octave down
    ASSERT_GT(readScratch(out, deviations.data()), 0u);
    EXPECT_NEAR(deviations[150], -1000.0, tolerance);
}

TEST_F(HiresFTRoundTrip, NaNAndInfiniteMagnitudesGiveAFiniteBlock) {
    song.waveFormat.bitsPerSample = 8;
    Spectrum s;
    s.set(5, std::numeric_limits<double>::quiet_NaN());
    s.set(6, -4.0);
    s.set(7, std::numeric_limits<double>::infinity());
    s.set(8, 1000.0);
    ASSERT_GT(writeScratch(s), 0u);
    EXPECT_TRUE(std::isfinite(buffer->scale));
    Spectrum out;
    ASSERT_GT(readScratch(out), 0u);
    EXPECT_EQ(out.at(5), 0.0);
    EXPECT_EQ(out.at(6), 0.0);
    EXPECT_TRUE(std::isfinite(out.at(7)));
    EXPECT_GT(out.at(8), 0.0);
}

TEST_F(HiresFTRoundTrip, WhenEveryBinLiesBelow5000HzTheLastIsLeftOutSoTheBlockStaysReadable) {
    // 8000 Hz audio: all N bins lie below 5000 Hz, and every one passes 8-bit's threshold.
    hiresGeometry = HiresGeometry{300, 15.625, 1.0, 0.03125};
    song.waveFormat.bitsPerSample = 8;
    Spectrum s;
    for (uint32_t i = 0; i < 300; i++) s.set(i, 10.0 + i);
    std::vector<double> source(s.bins.begin(), s.bins.begin() + 600);
    std::fclose(scratch);
    scratch = fileOpen(scratchPath, "wb+");
    ASSERT_EQ(writeHiresFTBlock(scratch, 0, 0, buffer, source.data(), nullptr), 10u + 3 * 299);
    std::vector<double> out(600, 0.0);
    std::rewind(scratch);
    ASSERT_EQ(readHiresFTBlock(scratch, 0, 0, out.data(), nullptr), 10u + 3 * 299);
    EXPECT_NEAR(out[2 * 298], 308.0, 308.0 * 1e-3);
    EXPECT_EQ(out[2 * 299], 0.0);
}

// ---- damaged blocks ----

class HiresFTCorruptBlocks : public HiresFTFixture {};

// A count of N or more, a block cut short, a scale or offset that is not a number or infinite,
// or a negative scale: the block is refused with the bins it would have filled cleared.
TEST_F(HiresFTCorruptBlocks, ADamagedHeadOrABlockCutShortIsRefusedWithBinsCleared) {
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const float inf = std::numeric_limits<float>::infinity();
    Bytes whole = storedBlock(4, 1.0f, 0.0f, {1, 2, 3, 4}, {3, 0, 0, 0});
    std::vector<Bytes> damaged = {storedBlock(uint16_t(N), 1.0f, 0.0f, std::vector<uint16_t>(N, 1), Bytes(N, 0))};
    for (size_t length : {size_t(0), size_t(5), size_t(10), size_t(17), whole.size() - 1})
        damaged.emplace_back(whole.begin(), whole.begin() + long(length));
    for (auto [scale, offset] : {std::pair{nan, 0.0f}, {inf, 0.0f}, {-1.0f, 0.0f}, {1.0f, nan}, {1.0f, -inf}})
        damaged.push_back(storedBlock(1, scale, offset, {100}, {3}));
    for (const Bytes& bytes : damaged) {
        clearUiCalls();
        craftScratch(bytes);
        Spectrum out;
        out.set(3, 5.0);
        std::vector<float> deviations(N, 0.0f);
        EXPECT_EQ(readScratch(out, deviations.data()), 0u) << bytes.size() << " bytes";
        EXPECT_EQ(lastMessageText(), CORRUPT_TEXT);
        EXPECT_EQ(out.at(3), 0.0);
        std::rewind(scratch);
        EXPECT_EQ(readCompressedHiresBlock(scratch, buffer), 0u);
    }
    EXPECT_EQ(buffer->count, 0);
    // N - 1 entries are the most a block holds.
    clearUiCalls();
    Spectrum out;
    craftScratch(storedBlock(uint16_t(N - 1), 1.0f, 0.0f, std::vector<uint16_t>(N - 1, 65535), Bytes(N - 1, 0)));
    EXPECT_EQ(readScratch(out), 10u + 3 * (N - 1));
    EXPECT_NEAR(out.at(N - 2), std::exp(1.0) - 1, 1e-12);
    EXPECT_EQ(out.at(N - 1), 0.0);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(HiresFTCorruptBlocks, EntriesWhoseGapsRunPastTheLastBinAreIgnored) {
    const uint32_t bins = 500;
    hiresGeometry.bins = bins;
    craftScratch(storedBlock(3, 2.0f, 0.0f, {65535, 65535, 65535}, {200, 255, 255}));
    std::vector<double> destination(2 * bins + 2, 7.0);
    std::vector<float> deviations(bins + 1, 7.0f);
    EXPECT_EQ(readHiresFTBlock(scratch, 0, 0, destination.data(), deviations.data()), 19u);
    EXPECT_NEAR(destination[2 * 200], std::exp(2.0) - 1, 1e-9);
    EXPECT_NEAR(destination[2 * 456], std::exp(2.0) - 1, 1e-9);
    EXPECT_EQ(destination[2 * bins], 7.0) << "the entry for bin 712 lies past N and must be dropped";
    EXPECT_EQ(destination[2 * bins + 1], 7.0);
    EXPECT_EQ(deviations[bins], 7.0f);
}

TEST_F(HiresFTCorruptBlocks, AHugeScaleGivesLargeButFiniteMagnitudes) {
    craftScratch(storedBlock(1, 3.0e38f, 80.0f, {65535}, {0}));
    Spectrum out;
    std::vector<float> deviations(N, 0.0f);
    ASSERT_EQ(readScratch(out, deviations.data()), 13u);
    EXPECT_TRUE(std::isfinite(out.at(0)));
    EXPECT_TRUE(std::isfinite(deviations[0]));
}

TEST_F(HiresFTCorruptBlocks, ACountLargerThanTheBufferIsRefused) {
    CompressedHiresBuffer* small = allocCompressedHiresBuffer(2);
    ASSERT_NE(small, nullptr);
    craftScratch(storedBlock(3, 1.0f, 0.0f, {1, 2, 3}, {0, 0, 0}));
    EXPECT_EQ(readCompressedHiresBlock(scratch, small), 0u);
    EXPECT_EQ(lastMessageText(), CORRUPT_TEXT);
    freeCompressedHiresBuffer(small);
}

TEST_F(HiresFTCorruptBlocks, ACompressedBlockIsCopiedWithoutRequantising) {
    Bytes block = storedBlock(3, 7.25f, -0.5f, {1, 40000, 65535}, {4, 0, 250});
    craftScratch(block);
    ASSERT_EQ(readCompressedHiresBlock(scratch, buffer), 19u);
    EXPECT_EQ(buffer->deviations[2], 0.0f);
    FILE* copy = fileOpen(folder.file("copy"), "wb");
    ASSERT_EQ(writeCompressedHiresBlock(copy, buffer), 19u);
    fileClose(copy);
    EXPECT_EQ(readFileBytes(folder.file("copy")), block);
}

// ---- messages that need no store files ----

class HiresFTMessages : public HiresFTFixture {};

TEST_F(HiresFTMessages, MissingFilesAreRefused) {
    Spectrum s;
    const char* cannotRead = "File handle not valid so cannot read data - readHiresFTBlock (1)";
    const char* cannotWrite = "File handle not valid so cannot write data - writeHiresFTBlock (1)";
    EXPECT_EQ(readHiresFTBlock(nullptr, 0, 0, s.bins.data(), nullptr), 0u);
    EXPECT_EQ(lastMessageText(), cannotRead);
    EXPECT_EQ(writeHiresFTBlock(nullptr, 0, 0, buffer, s.bins.data(), nullptr), 0u);
    EXPECT_EQ(lastMessageText(), cannotWrite);
    EXPECT_EQ(readCompressedHiresBlock(nullptr, buffer), 0u);
    EXPECT_EQ(lastMessageText(), cannotRead);
    EXPECT_EQ(writeCompressedHiresBlock(nullptr, buffer), 0u);
    EXPECT_EQ(lastMessageText(), cannotWrite);
    EXPECT_EQ(messageCount(), 4);
}

TEST_F(HiresFTMessages, BlocksOutsideTheWindowAreNotInMemory) {
    ftBlockWindow.firstBlock = 10;
    ftBlockWindow.endBlock = 14;
    ftBlockWindow.capacity = 4;
    craftScratch(storedBlock(0, 1.0f, 0.0f, {}, {}));
    EXPECT_EQ(readHiresFTBlock(scratch, 10, 14, nullptr, nullptr), 0u);
    EXPECT_EQ(lastMessageText(), "Block to read not in memory so cannot read data - readHiresFTBlock (2)");
    clearUiCalls();
    // Inside the window but before the first block the caller counts from.
    EXPECT_EQ(readHiresFTBlock(scratch, 12, 11, nullptr, nullptr), 0u);
    EXPECT_EQ(lastMessageText(), "Block to read not in memory so cannot read data - readHiresFTBlock (2)");
    clearUiCalls();
    EXPECT_EQ(writeHiresFTBlock(scratch, 10, 9, buffer, nullptr, nullptr), 0u);
    EXPECT_EQ(lastMessageText(), "Block to write not in memory so cannot write data - writeHiresFTBlock (2)");

    clearUiCalls();
    EXPECT_EQ(readHiresFTBlock(scratch, 10, 13, nullptr, nullptr), 10u);
    EXPECT_EQ(messageCount(), 0);
    ASSERT_NE(hiresBuffer.bins, nullptr);
    EXPECT_EQ(hiresBuffer.blocks, 4u);
}

TEST_F(HiresFTMessages, AllocationFailuresNameTheRecordOrTheArrays) {
    failAllocation(1);
    EXPECT_EQ(allocCompressedHiresBuffer(0), nullptr);
    EXPECT_EQ(lastMessageText(), "Could not allocate compressed hires buffer - allocCompressedHiresBuffer (1)");
    for (int array = 2; array <= 4; array++) {
        clearUiCalls();
        failAllocation(array);
        EXPECT_EQ(allocCompressedHiresBuffer(0), nullptr);
        EXPECT_EQ(lastMessageText(), "Could not allocate compressed hires buffer - allocCompressedHiresBuffer (2)");
    }
    clearUiCalls();
    ftBlockWindow.endBlock = 2;
    ftBlockWindow.capacity = 2;
    craftScratch(storedBlock(0, 1.0f, 0.0f, {}, {}));
    failAllocation(1);
    EXPECT_EQ(readHiresFTBlock(scratch, 0, 1, nullptr, nullptr), 0u);
    EXPECT_EQ(lastMessageText(), "Could not allocate Hires buffer - allocHiresBuffer (1)");
}

TEST_F(HiresFTMessages, AShortWriteIsAFailure) {
    Spectrum s;
    s.set(3, 1e6);
    std::fclose(scratch);
    scratch = fileOpen(scratchPath, "wb+");
    failFileCall(FILE_OP_WRITE, 2);
    EXPECT_EQ(writeHiresFTBlock(scratch, 0, 0, buffer, s.bins.data(), nullptr), 0u);
    EXPECT_EQ(lastMessageText(), "Bytes were not stored properly");
}

// ---- the store files ----

class HiresFTFiles : public HiresFTFixture {
protected:
    // A window of count blocks whose Hires buffer holds block b with (b + 1) loud bins, so
    // that every block has its own size.
    void fillWindow(uint32_t count) {
        song.blockCount = count;
        ftBlockWindow.firstBlock = 0;
        ftBlockWindow.endBlock = count;
        ftBlockWindow.capacity = count;
        ASSERT_EQ(allocHiresBuffer(), 1);
        for (uint32_t b = 0; b < count; b++)
            for (uint32_t k = 0; k <= b; k++) hiresBuffer.bins[(size_t(b) * N + 3 * k + b) * 2] = 40000.0 + 1000 * k;
    }
    // Writes the window's blocks into the store files.
    void storeWindow(uint32_t count) {
        ASSERT_EQ(openHiresFTFile(FT_UPDATE), 1);
        ASSERT_EQ(writeHiresFTBlocks(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, 0, count), 1);
        ASSERT_EQ(closeHiresFTFile(1), 1);
    }
    static Bytes dataBytes() { return readFileBytes(sharedFilePath("CS.ft+")); }
    static Bytes indexBytes() { return readFileBytes(sharedFilePath("CS.fi+")); }
    // The stored blocks, cut out of the data file by the index.
    static std::vector<Bytes> storedBlocks() {
        Bytes data = dataBytes(), index = indexBytes();
        std::vector<Bytes> blocks;
        for (uint32_t i = 0; i < getU32(index, 0); i++) {
            uint32_t offset = getU32(index, 4 + 8 * i), size = getU32(index, 8 + 8 * i);
            blocks.emplace_back(data.begin() + offset, data.begin() + offset + size);
        }
        return blocks;
    }
    // The files a store holding blocks in this order must consist of.
    static void expectFilesHold(const std::vector<Bytes>& blocks) {
        Bytes data, index;
        putU32(index, uint32_t(blocks.size()));
        for (const Bytes& block : blocks) {
            putU32(index, uint32_t(data.size()));
            putU32(index, uint32_t(block.size()));
            data.insert(data.end(), block.begin(), block.end());
        }
        EXPECT_EQ(dataBytes(), data);
        EXPECT_EQ(indexBytes(), index);
    }
};

TEST_F(HiresFTFiles, TheAnalysisStoreLaysBlocksOutOneAfterAnother) {
    fillWindow(5);
    storeWindow(5);
    std::vector<Bytes> blocks = storedBlocks();
    ASSERT_EQ(blocks.size(), 5u);
    for (uint32_t b = 0; b < 5; b++) {
        // b + 1 loud bins and the forced entries behind them, up to bin 599.
        uint32_t last = 3 * b + b;
        uint32_t forced = (CONSIDERED - 1 - last) / 256;
        EXPECT_EQ(blocks[b].size(), 10u + 3 * (b + 1 + forced)) << "block " << b;
        EXPECT_EQ(getU16(blocks[b], 0), b + 1 + forced);
    }
    expectFilesHold(blocks);
    // Read back through the index, the blocks give the window's spectra.
    ASSERT_EQ(openHiresFTFile(FT_READ), 1);
    int ok = 0;
    seekToFTBlock(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, 2, 0, 0, &ok);
    ASSERT_EQ(ok, 1);
    Spectrum block2, block3;
    EXPECT_GT(readHiresFTBlock(hiresFiles.hiresFile, 0, 2, block2.bins.data(), nullptr), 0u);
    EXPECT_GT(readHiresFTBlock(hiresFiles.hiresFile, 0, 3, block3.bins.data(), nullptr), 0u);
    EXPECT_NEAR(block2.at(2 + 6), 42000.0, 42000.0 * 1e-3);
    EXPECT_EQ(block2.at(2 + 7), 0.0);
    EXPECT_NEAR(block3.at(3 + 9), 43000.0, 43000.0 * 1e-3);
    ASSERT_EQ(closeHiresFTFile(0), 1);
    // With wave editing disabled nothing is written.
    writeFileBytes(sharedFilePath("CS.ft+"), {});
    writeFileBytes(sharedFilePath("CS.fi+"), {});
    generalSettings.disableWaveEditing = true;
    storeWindow(5);
    EXPECT_TRUE(dataBytes().empty());
    EXPECT_TRUE(indexBytes().empty());
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(HiresFTFiles, ARewriteInPlaceMustKeepTheBlocksSize) {
    fillWindow(3);
    storeWindow(3);
    Bytes data = dataBytes(), index = indexBytes();
    hiresBuffer.bins[(size_t(1) * N + 100) * 2] = 90000.0;   // block 1 now stores five bins instead of four
    hiresBuffer.bins[(size_t(1) * N + 200) * 2] = 90000.0;
    ASSERT_EQ(openHiresFTFile(FT_UPDATE), 1);
    EXPECT_EQ(storeHiresFTBlock(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, 0, buffer, 1, 0), 0u);
    EXPECT_EQ(lastMessageText(),
              "Data size written to Hires FT file is inconsistent with current value - writeHiresFTBlock (1)");
    EXPECT_FALSE(hiresFilesOpen()) << "both files are closed after the message";
    EXPECT_EQ(dataBytes(), data);
    EXPECT_EQ(indexBytes(), index);
    // Of the same size, a rewrite in place changes only that block.
    std::vector<Bytes> before = storedBlocks();
    hiresBuffer.bins[(size_t(1) * N + 100) * 2] = 0.0;
    hiresBuffer.bins[(size_t(1) * N + 200) * 2] = 0.0;
    hiresBuffer.bins[(size_t(1) * N + 1) * 2] = 1e9;   // louder, same bins stored
    ASSERT_EQ(openHiresFTFile(FT_UPDATE), 1);
    EXPECT_EQ(storeHiresFTBlock(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, 0, buffer, 1, 0), before[1].size());
    ASSERT_EQ(closeHiresFTFile(1), 1);
    std::vector<Bytes> after = storedBlocks();
    ASSERT_EQ(after.size(), 3u);
    EXPECT_EQ(after[0], before[0]);
    EXPECT_NE(after[1], before[1]);
    EXPECT_EQ(after[2], before[2]);
}

TEST_F(HiresFTFiles, OpeningTwiceOrWithoutFilesIsRefused) {
    ASSERT_EQ(openHiresFTFile(FT_UPDATE), 1);
    EXPECT_TRUE(hiresFilesOpen());
    EXPECT_EQ(openHiresFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "Hires FT File(s) already open - openHiresFTFile (1)");
    ASSERT_EQ(closeHiresFTFile(0), 1);
    EXPECT_FALSE(hiresFilesOpen());

    clearUiCalls();
    failFileCall(FILE_OP_OPEN, 1);
    EXPECT_EQ(openHiresFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "Could not open Hires FT file - openHiresFTFile (2)");
    EXPECT_FALSE(hiresFilesOpen());

    clearUiCalls();
    failFileCall(FILE_OP_OPEN, 2);
    EXPECT_EQ(openHiresFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "Could not open Hires FT index file - openHiresFTFile (3)");
    EXPECT_FALSE(hiresFilesOpen()) << "the Hires FT file is closed again";

    clearUiCalls();
    fileDelete(sharedFilePath("CS.fi+"));
    EXPECT_EQ(openHiresFTFile(FT_READ), 0);
    EXPECT_EQ(lastMessageText(), "Could not open Hires FT index file - openHiresFTFile (3)");
}

// ---- cutting blocks ----

class HiresFTRemove : public HiresFTFiles {};

TEST_F(HiresFTRemove, CuttingBlocksFromTheMiddleFromTheStartAndAtTheEndMatchesTheModel) {
    fillWindow(10);
    storeWindow(10);
    std::vector<Bytes> model = storedBlocks();
    ASSERT_EQ(model.size(), 10u);
    struct Cut {
        uint32_t first, count;
    };
    for (Cut cut : {Cut{3, 4}, Cut{0, 2}, Cut{2, 2}}) {
        clearUiCalls();
        ASSERT_EQ(removeHiresFTBlocksFromSong(cut.first, cut.count), 1);
        model.erase(model.begin() + cut.first, model.begin() + cut.first + cut.count);
        song.blockCount -= cut.count;
        expectFilesHold(model);
        EXPECT_EQ(messageCount(), 0);
        EXPECT_FALSE(fileExists(sharedFilePath("CS.tw")));
        EXPECT_FALSE(hiresFilesOpen());
    }
    EXPECT_EQ(model.size(), 2u);
}

// A failed copy of the tail, a damaged block in it, a cut past the stored blocks or an index
// entry past the data or running backwards: the cut is refused and the files stay as they were.
TEST_F(HiresFTRemove, ARefusedCutLeavesTheFilesAsTheyWere) {
    fillWindow(6);
    storeWindow(6);
    const Bytes data = dataBytes(), index = indexBytes();
    const char* seekPastEnd = "Attempting to seeking past end of file in seekToFTBlock (2). Data will probably be corrupted.";
    Bytes countN = data;
    size_t block4 = getU32(index, 4 + 8 * 4);
    countN[block4] = uint8_t(N & 0xFF);
    countN[block4 + 1] = uint8_t(N >> 8);
    auto block3At = [&](uint32_t offset) {
        Bytes moved = index;
        for (int k = 0; k < 4; k++) moved[4 + 8 * 3 + k] = uint8_t(offset >> (8 * k));
        return moved;
    };
    struct Case {
        Bytes data, index;
        uint32_t songBlocks, first, count;
        int failingWrite;   // the first write goes into CS.tw
        std::string text;
    } cases[] = {
        {data, index, 6, 1, 2, 1, "bytesWritten does not equal bytesRead - removeHiresFTBlocksFromSong (1). Data may be corrupted."},
        {countN, index, 6, 1, 2, 0, CORRUPT_TEXT},
        {data, index, 8, 5, 3, 0, "Index for FT block is not stored - getFTBlockIndex (1)."},
        {data, block3At(uint32_t(data.size() + 1)), 6, 1, 2, 0, seekPastEnd},
        {data, block3At(0xFFFFFF00u), 6, 1, 2, 0, seekPastEnd},
        {data, block3At(0), 6, 1, 2, 0, seekPastEnd},
    };
    for (const Case& c : cases) {
        writeFileBytes(sharedFilePath("CS.ft+"), c.data);
        writeFileBytes(sharedFilePath("CS.fi+"), c.index);
        song.blockCount = c.songBlocks;   // 8: the song claims more blocks than the Hires store holds
        failFileCall(FILE_OP_WRITE, c.failingWrite);
        EXPECT_EQ(removeHiresFTBlocksFromSong(c.first, c.count), 0) << c.text;
        EXPECT_EQ(lastMessageText(), c.text);
        EXPECT_EQ(dataBytes(), c.data);
        EXPECT_EQ(indexBytes(), c.index);
        EXPECT_FALSE(fileExists(sharedFilePath("CS.tw")));
        EXPECT_FALSE(hiresFilesOpen());
    }
}
