// The mains hum table: steady or repeatedly present members of the 50 Hz and 60 Hz families
// become hum and are ignored by the pitch decision; a lone unsteady member does not.
#include <gtest/gtest.h>

#include "analysis/recognitionFixtures.h"

class MainsHum : public RecognitionTest {
protected:
    static const MainsHumEntry& entryFor(int frequency) {
        for (const MainsHumEntry& e : mainsHumTable.entries)
            if (e.frequency == frequency) return e;
        static const MainsHumEntry none{};
        return none;
    }
    // Four seconds of song: 345 blocks, scanned in windows of 43 blocks from block 0.
    static constexpr uint32_t BLOCKS = 345;
    // Present in every window yet absent for 24 blocks (longer than a steady hum's gaps) at
    // every other window boundary: each window loses at most 12 of its 43 blocks.
    static bool presentButUnsteady(uint32_t b) {
        for (uint32_t boundary : {86u, 172u, 258u})
            if (b + 12 >= boundary && b < boundary + 12) return false;
        return true;
    }
};

TEST_F(MainsHum, SteadyFiftyAndHundredHertzHumIsIgnoredUnderANote) {
    makeSong(BLOCKS);
    for (uint32_t b = 0; b < BLOCKS; b++) {
        std::vector<TestEntry> entries{{50.0, 60}, {100.0, 50}};
        if (b >= 100 && b < 200) entries.push_back({220.0, 150});
        setBlock(b, entries, 120);
    }
    recognisePitchTrack(0, 0);
    EXPECT_TRUE(entryFor(50).hum && entryFor(100).hum);
    EXPECT_TRUE(entryFor(50).steady);
    EXPECT_TRUE(entryFor(150).hum) << "the whole family is hum";
    EXPECT_FALSE(entryFor(60).hum) << "the 60 Hz family is not";
    EXPECT_NEAR(blockPitch(150), 220.0, 0.01);
    EXPECT_EQ(blockData(50).nEntries, 0u) << "hum alone is no pitch";
}

TEST_F(MainsHum, WithoutHumRemovalTheHumIsTheLowestNote) {
    makeSong(BLOCKS);
    recognitionOptions.mainsHumRemoval = false;
    for (uint32_t b = 0; b < BLOCKS; b++) setBlock(b, {{50.0, 60}, {100.0, 50}, {220.0, 150}}, 120);
    recognisePitchTrack(0, 0);
    EXPECT_FALSE(entryFor(50).hum);
    EXPECT_LT(blockPitch(150), 110.0);
}

TEST_F(MainsHum, ASingleUnsteadyHundredFiftyHertzEntryIsNotHum) {
    makeSong(BLOCKS);
    for (uint32_t b = 0; b < BLOCKS; b++) setBlock(b, presentButUnsteady(b) ? std::vector<TestEntry>{{150.0, 120}} : std::vector<TestEntry>{}, 120);
    recognisePitchTrack(0, 0);
    EXPECT_TRUE(entryFor(150).present);
    EXPECT_FALSE(entryFor(150).steady);
    EXPECT_FALSE(entryFor(150).hum);
    EXPECT_EQ(isHumFrequency(150.0), 0);
    EXPECT_NEAR(blockDetected(40).entries[0].frequency, 150.0, 0.01) << "the pitch as detected, before the phrase fit";
}

TEST_F(MainsHum, TwoPresentMembersMakeTheirFamilyHumEvenWhenNeitherIsSteady) {
    makeSong(BLOCKS);
    for (uint32_t b = 0; b < BLOCKS; b++)
        setBlock(b, presentButUnsteady(b) ? std::vector<TestEntry>{{120.0, 90}, {240.0, 70}} : std::vector<TestEntry>{}, 90);
    scanMainsHum(BLOCKS);
    EXPECT_FALSE(entryFor(120).steady);
    EXPECT_TRUE(entryFor(120).hum && entryFor(240).hum && entryFor(60).hum);
    EXPECT_FALSE(entryFor(50).hum);
}

TEST_F(MainsHum, TwoSecondsOfSongAreTooFewToScan) {
    makeSong(172);   // 1.997 s
    setBlocks(0, 172, {{50.0, 60}}, 60);
    scanMainsHum(172);
    EXPECT_FALSE(entryFor(50).present);
    EXPECT_FALSE(mainsHumTable.anyHum);
}

TEST_F(MainsHum, HumReachesAQuarterSemitoneAroundItsFrequency) {
    makeSong(BLOCKS);
    setBlocks(0, BLOCKS, {{50.0, 60}}, 60);
    scanMainsHum(BLOCKS);
    ASSERT_TRUE(entryFor(50).hum);
    EXPECT_EQ(isHumFrequency(50.7), 1);    // 24 cents
    EXPECT_EQ(isHumFrequency(51.0), 0);    // 34 cents
    EXPECT_EQ(isHumFrequency(98.6), 1);    // 100 Hz is hum too, 24 cents below it
    clearMainsHum();
    EXPECT_EQ(isHumFrequency(50.0), 0);
}
