// The per-block pitch decision: which entry is the fundamental, how its band grows, what the
// merged entry holds, the dropout stand-ins, the octave check and the detected frequencies.
#include <gtest/gtest.h>

#include <tuple>

#include "analysis/pitchDecision.h"
#include "analysis/recognitionFixtures.h"

class PitchDecision : public RecognitionTest {
protected:
    void decide(uint32_t from, uint32_t to, uint32_t end) {
        RecognitionPass pass{from, to, end, {}};
        decideBlockPitches(pass);
    }
};

TEST_F(PitchDecision, MergedPitchIsTheAmplitudeWeightedMeanOfTheBand) {
    makeSong(60);
    setBlocks(0, 60, {{260.0, 100}, {270.0, 80}}, 20);
    decide(0, 0, 60);
    const FTDataBuffer& data = blockData(30);
    ASSERT_EQ(data.nEntries, 1u);
    EXPECT_NEAR(data.entries[0].frequency, 264.3979, 1e-3);
    EXPECT_NEAR(data.entries[0].frequencyWidth, 25.3027, 1e-3) << "band 252.49 .. 277.80 Hz";
    // The amplitude is (100 + 80 + loudness 20) / 2.
    const FrequencyEntry& e = data.entries[0];
    EXPECT_EQ(std::tuple(e.amplitude, e.initialAmplitude, e.cutOffLevel), std::tuple(100, 100, TEST_CUT_OFF));
}

TEST_F(PitchDecision, APartialSplitOverTwoBinsIsCentredOnItsStrongerBin) {
    // A partial at 400 Hz lights its own bin (400.0 Hz, 185) and the bin below with a pulled
    // frequency (385.0 Hz, 103, 66 cents lower); the lower bin is visited first.
    makeSong(60);
    setBlocks(0, 60, {{385.0, 103}, {400.0, 185}}, 100);
    decide(0, 0, 60);
    double merged = std::exp((103 * std::log(385.0) + 185 * std::log(400.0)) / 288.0);
    EXPECT_NEAR(blockPitch(30), merged, 1e-2) << "both bins, weighted: 16 cents below the partial";
    EXPECT_LT(std::fabs(cents(blockPitch(30), 400.0)), 25.0);
}

// Which entry is the note: the fundamental of a low voice over its stronger second harmonic;
// through a bright voice's loud third harmonic, which counts for its fundamental (a rumble at
// 100 Hz keeps the fundamental from dominating what lies below it); a weak fundamental that
// holds on under a strong octave. An entry outside the band adds to the amplitude (capped at
// 255) but not to the pitch.
TEST_F(PitchDecision, TheFundamentalIsChosenAndItsBandMerged) {
    struct Case {
        std::vector<TestEntry> entries;
        int loudness;
        double pitch;
        int amplitude;   // -1: any
    } cases[] = {
        {{{103.8, 12}, {207.7, 120}, {311.5, 14}, {415.3, 8}}, 150, 103.8, -1},
        {{{100.0, 20}, {138.6, 17}, {277.2, 28}, {415.8, 69}}, 150, 138.6, -1},
        {{{230.0, 4}, {460.0, 200}}, 150, 230.0, -1},
        {{{260.0, 100}, {300.0, 90}}, 0, 260.0, 95},
        {{{260.0, 255}, {270.0, 255}}, 255, 264.9, 255},
    };
    for (const Case& c : cases) {
        makeSong(60);
        setBlocks(0, 60, c.entries, c.loudness);
        decide(0, 0, 60);
        EXPECT_NEAR(cents(blockPitch(30), c.pitch), 0.0, 50.0) << c.pitch;
        if (c.amplitude >= 0) { EXPECT_EQ(blockData(30).entries[0].amplitude, c.amplitude) << c.pitch; }
    }
}

TEST_F(PitchDecision, AStrayEntryAnOctaveBelowDoesNotTakeTheNote) {
    makeSong(60);
    for (uint32_t b = 0; b < 60; b++)
        setBlock(b, b % 3 == 0 ? std::vector<TestEntry>{{220.0, 3}, {440.0, 200}} : std::vector<TestEntry>{{440.0, 200}}, 150);
    decide(0, 0, 60);
    EXPECT_NEAR(blockPitch(30), 440.0, 0.01);
}

TEST_F(PitchDecision, ADropoutKeepsTheLastPitchAtAmplitudeZeroFor006Seconds) {
    makeSong(60);
    setBlocks(0, 40, {{220.0, 150}}, 100);
    decide(0, 0, 60);
    for (uint32_t b = 40; b < 45; b++) {
        ASSERT_EQ(blockData(b).nEntries, 1u) << "block " << b;
        EXPECT_NEAR(blockData(b).entries[0].frequency, 220.0, 0.01);
        EXPECT_EQ(blockData(b).entries[0].amplitude, 0);
        EXPECT_EQ(blockPitch(b), 0.0);
    }
    EXPECT_EQ(blockData(45).nEntries, 0u) << "five blocks are 0.058 s; the sixth is past 0.06 s";
}

TEST_F(PitchDecision, ABlockDecidedBeforeIsLeftAsItIs) {
    makeSong(60);
    setBlocks(0, 60, {{260.0, 100}, {270.0, 80}}, 20);
    setPitches(0, 30, 300.0, 77);
    decide(0, 30, 60);
    EXPECT_NEAR(blockPitch(10), 300.0, 1e-3);
    EXPECT_EQ(blockData(10).entries[0].amplitude, 77);
    EXPECT_NEAR(blockPitch(40), 264.3979, 1e-3);
}

// The octave check keeps a note away from a rumble two octaves below the recent pitches, but a
// melody leaping past the range still gets its pitch; without the check the lowest strong
// entry wins.
TEST_F(PitchDecision, TheOctaveCheckKeepsTheNoteNearTheRecentPitches) {
    struct Case {
        bool octaveCheck;
        std::vector<TestEntry> entries;
        double pitch;
    } cases[] = {{true, {{55.0, 200}, {220.0, 150}}, 220.0}, {true, {{55.0, 200}}, 55.0},
                 {false, {{55.0, 200}, {220.0, 150}}, 55.0}};
    for (const Case& c : cases) {
        makeSong(200);
        recognitionOptions.octaveCheck = c.octaveCheck;
        setBlocks(100, 200, c.entries, 150);
        setPitches(0, 100, 220.0);
        decide(0, 100, 200);
        EXPECT_NEAR(blockPitch(150), c.pitch, 0.01);
    }
}

// ---- the detected frequencies, through the whole pass ----

class RecognitionDetected : public PitchDecision {};

TEST_F(RecognitionDetected, ABlockWithNoEntriesKeepsTheLastDetectedFrequency) {
    makeSong(120);
    setBlocks(0, 40, {{220.0, 150}}, 100);
    recognisePitchTrack(0, 0);
    const FTDetectedBuffer& held = blockDetected(39);
    const FTDetectedBuffer& empty = blockDetected(80);
    ASSERT_EQ(blockData(80).nEntries, 0u);
    ASSERT_EQ(empty.nEntries, 1u);
    EXPECT_NEAR(empty.entries[0].frequency, 220.0, 0.5);
    EXPECT_EQ(empty.entries[0].frequency, held.entries[0].frequency);
    EXPECT_EQ(empty.entries[0].amplitude, held.entries[0].amplitude);
    EXPECT_GT(empty.entries[0].amplitude, 0);
}

TEST_F(RecognitionDetected, ThePitchSpreadIsTheWidthInSemitones) {
    makeSong(60);
    setBlocks(0, 60, {{260.0, 100}, {270.0, 80}}, 20);
    recognisePitchTrack(0, 0);
    const FrequencyEntry& d = blockDetected(30).entries[0];
    const FrequencyEntry& e = blockData(30).entries[0];
    // The band 252.49 .. 277.80 Hz around 264.40 Hz spans 1.66 semitones.
    EXPECT_NEAR(d.frequencyWidth, 1.657, 0.01);
    EXPECT_EQ(d.amplitude, e.amplitude);
}
