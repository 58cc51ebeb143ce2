// The song's time axis: conversions between seconds and blocks over unequal durations.
#include <gtest/gtest.h>

#include "store/song.h"

// Blocks of 1/128 s: binary fractions, so boundaries and half-way points are exact.
static const double D = 1.0 / 128;

class TimeAxis : public ::testing::Test {
protected:
    // A song of count blocks of duration seconds each.
    void makeSong(uint32_t count, double duration = D) {
        resetSong();
        song.sampleBlockDuration = duration;
        ASSERT_EQ(growSampleBlockDurations(count), 1);
        for (uint32_t k = 0; k < count; k++) song.sampleBlockDurations[k] = duration;
        song.blockCount = count;
    }
    void TearDown() override { resetSong(); }
};

TEST_F(TimeAxis, TheArrayGrowsInStepsOfThreeHundredSecondsAndNewEntriesAreZero) {
    resetSong();
    song.sampleBlockDuration = 0.01;
    ASSERT_EQ(growSampleBlockDurations(1), 1);
    EXPECT_EQ(song.sampleBlockDurations.size(), 30000u);
    ASSERT_EQ(growSampleBlockDurations(30001), 1);
    EXPECT_EQ(song.sampleBlockDurations.size(), 60000u);
    EXPECT_EQ(song.sampleBlockDurations[59999], 0.0);
}

TEST_F(TimeAxis, BlockTimesAreSumsOfDurations) {
    makeSong(10);
    EXPECT_DOUBLE_EQ(songTimeOfBlock(0), 0.0);
    EXPECT_DOUBLE_EQ(songTimeOfBlock(4), 4 * D);
    EXPECT_DOUBLE_EQ(songTimeOfBlock(6, 2), 4 * D);
    EXPECT_DOUBLE_EQ(songDuration(), 10 * D);
    // Entries past the block count are 0, so sums reaching past the end add nothing.
    EXPECT_DOUBLE_EQ(songTimeOfBlock(5000), 10 * D);
    EXPECT_DOUBLE_EQ(blockDuration(3), D);
    EXPECT_DOUBLE_EQ(blockDuration(100000), 0.0);
}

// The nearest boundary, half-way rounding up; times at or past the end give the block count;
// without an array every time is block 0.
TEST_F(TimeAxis, BlockAtTimeFindsTheNearestBoundaryAndHalfWayRoundsUp) {
    makeSong(10);
    const std::pair<double, uint32_t> cases[] = {{0.0, 0},     {1.49 * D, 1},  {1.5 * D, 2},  {1.51 * D, 2},
                                                 {3 * D, 3},   {-0.5, 0},      {10 * D, 10},  {9.6 * D, 10},
                                                 {25.0, 10}};
    for (auto [t, block] : cases) EXPECT_EQ(blockAtTime(t), block) << t / D << " blocks";
    resetSong();
    EXPECT_DOUBLE_EQ(songTimeOfBlock(10), 0.0);
    EXPECT_EQ(blockAtTime(1.0), 0u);
}

TEST_F(TimeAxis, ChangedDurationsMoveBlockTimes) {
    makeSong(10);
    double before = songTimeOfBlock(6);
    song.sampleBlockDurations[2] = 2 * D;    // a timing edit slows block 2 down
    song.sampleBlockDurations[3] = 0.5 * D;  // and speeds block 3 up
    EXPECT_DOUBLE_EQ(songTimeOfBlock(6), before + 0.5 * D);
    EXPECT_EQ(blockAtTime(4 * D), 3u) << "block 3 now starts at 4 D";
    EXPECT_EQ(blockAtTime(4.25 * D), 4u) << "half-way through the short block 3";
    EXPECT_DOUBLE_EQ(snapTimeToBlock(4.1 * D), 4 * D);
}

TEST_F(TimeAxis, SnapPastTheEndGoesOnWithTheLastBlocksDuration) {
    makeSong(10);
    song.sampleBlockDurations[9] = 2 * D;   // the song now ends at 11 D
    EXPECT_DOUBLE_EQ(snapTimeToBlock(0.0), 0.0);
    EXPECT_DOUBLE_EQ(snapTimeToBlock(11.8 * D), 11 * D);
    EXPECT_DOUBLE_EQ(snapTimeToBlock(14.5 * D), 15 * D);
    EXPECT_DOUBLE_EQ(snapTimeToBlock(15.5 * D), 15 * D);
}

// The summed grid snaps as the walk does, before, inside and past the song, on uneven blocks.
TEST_F(TimeAxis, TheBlockGridSnapsAsTheWalkDoes) {
    makeSong(10);
    song.sampleBlockDurations[2] = 2 * D;
    song.sampleBlockDurations[3] = 0.5 * D;
    song.sampleBlockDurations[9] = 3 * D;
    BlockGrid grid = makeBlockGrid();
    ASSERT_EQ(grid.starts.size(), 11u);
    for (double t = -1.5 * D; t < 20 * D; t += 0.0625 * D) EXPECT_EQ(grid.snap(t), snapTimeToBlock(t)) << t / D << " D";
    resetSong();
    EXPECT_EQ(makeBlockGrid().snap(1.0), 0.0);
}

TEST_F(TimeAxis, AWalkMayStartFromAKnownBlockAndOffset) {
    makeSong(10);
    EXPECT_EQ(blockAtTime(5.1 * D, 5, 5 * D), 5u);
    EXPECT_EQ(blockAtTime(6.1 * D, 5, 5 * D), 6u);
    EXPECT_EQ(blockAtTime(6.1 * D + 1.0, 0, 0.0, 1.0), 6u);
    EXPECT_DOUBLE_EQ(snapTimeToBlock(7.8 * D, 5, 5 * D), 8 * D);
}
