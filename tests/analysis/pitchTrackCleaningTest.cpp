// The passes over a decided pitch track: octave excursions folded back, sibilants appended,
// weak runs removed, phrases fitted to the semitone grid, boundaries sharpened and dropouts
// bridged, and the flattening of vibrato and glissando.
#include <gtest/gtest.h>

#include "analysis/pitchFlattening.h"
#include "analysis/pitchTrackCleaning.h"
#include "analysis/recognitionFixtures.h"

class RecognitionOctaveJumps : public RecognitionTest {};

// A three-block excursion an octave up inside a long note is folded back; a long one is a
// melody, and one that does not come back stays; blocks before the pass are read, not changed.
TEST_F(RecognitionOctaveJumps, AShortExcursionAnOctaveUpInsideALongNoteIsFoldedBack) {
    struct Case {
        uint32_t excursionEnd;   // the excursion (440 Hz) runs from block 60
        double after;            // the pitch after it
        uint32_t finalBlock;     // the first block the pass decides
        uint32_t block;
        double expected;
    } cases[] = {{63, 220.0, 0, 61, 220.0}, {63, 220.0, 0, 63, 220.0}, {90, 220.0, 0, 70, 440.0},
                 {63, 330.0, 0, 61, 440.0}, {63, 220.0, 62, 61, 440.0}, {63, 220.0, 62, 62, 220.0}};
    for (const Case& c : cases) {
        makeSong(160);
        setPitches(0, 60, 220.0);
        setPitches(60, c.excursionEnd, 440.0);
        setPitches(c.excursionEnd, 160, c.after);
        correctOctaveJumps(0, c.finalBlock, 160);
        EXPECT_NEAR(blockPitch(c.block), c.expected, 1e-3) << c.excursionEnd << " " << c.after << " " << c.finalBlock;
    }
}

TEST_F(RecognitionOctaveJumps, TheWholePassFoldsTheExcursionOfAnAnalysedNote) {
    makeSong(120);
    setBlocks(0, 120, {{220.0, 180}}, 150);
    setBlocks(60, 63, {{440.0, 200}}, 150);
    recognisePitchTrack(0, 0);
    for (uint32_t b = 58; b < 66; b++) EXPECT_NEAR(cents(blockPitch(b), 220.0), 0.0, 10.0) << "block " << b;
}

class RecognitionSibilants : public RecognitionTest {
protected:
    // A row whose only magnitudes lie at 200 Hz (low band) and 4.3 kHz (high band).
    void sibilantRow(uint32_t* row, uint32_t low, uint32_t high) {
        row[binOf(200.0)] = low;
        row[binOf(4300.0)] = high;
    }
};

TEST_F(RecognitionSibilants, ASibilantRowNeedsAHighBandOfAtLeast1024AboveTheLowBand) {
    makeSong(10);
    std::vector<uint32_t> row(magnitudeSpectrogram.binsPerRow, 0u);
    double width = magnitudeSpectrogram.binWidth;
    sibilantRow(row.data(), 0, 1024);
    EXPECT_EQ(isSibilantRow(row.data(), uint32_t(row.size()), width), 1);
    sibilantRow(row.data(), 0, 1023);
    EXPECT_EQ(isSibilantRow(row.data(), uint32_t(row.size()), width), 0);
    sibilantRow(row.data(), 3000, 2000);
    EXPECT_EQ(isSibilantRow(row.data(), uint32_t(row.size()), width), 0);
    sibilantRow(row.data(), 3000, 3001);
    EXPECT_EQ(isSibilantRow(row.data(), uint32_t(row.size()), width), 1);
    // Above 6600 Hz nothing counts; the first three magnitudes belong to no band.
    std::fill(row.begin(), row.end(), 0u);
    row[binOf(7000.0)] = 5000;
    row[2] = 5000;
    EXPECT_EQ(isSibilantRow(row.data(), uint32_t(row.size()), width), 0);
}

TEST_F(RecognitionSibilants, AnSAfterASteadyNoteLongerThanItCarriesItsPitch) {
    makeSong(60);
    setPitches(0, 50, 220.0);
    // Two rows per block; blocks 50 .. 59 are sibilant.
    makeRows(120, [&](uint32_t r, uint32_t* row) { sibilantRow(row, 500, r >= 100 ? 4000u : 100u); });
    appendSibilants(0, 60);
    for (uint32_t b = 50; b < 60; b++) EXPECT_NEAR(blockPitch(b), 220.0, 1e-3) << "block " << b;
    // A note shorter than the S does not carry it.
    makeSong(60);
    setPitches(45, 50, 220.0);
    makeRows(120, [&](uint32_t r, uint32_t* row) { sibilantRow(row, 500, r >= 100 ? 4000u : 100u); });
    appendSibilants(0, 60);
    EXPECT_EQ(blockPitch(55), 0.0);
}

TEST_F(RecognitionSibilants, AnSBeforeANoteTakesThePitchOfTheNoteAfterIt) {
    makeSong(60);
    setPitches(20, 60, 330.0);
    makeRows(120, [&](uint32_t r, uint32_t* row) { sibilantRow(row, 500, r >= 20 && r < 40 ? 4000u : 100u); });
    appendSibilants(0, 60);
    for (uint32_t b = 10; b < 20; b++) EXPECT_NEAR(blockPitch(b), 330.0, 1e-3) << "block " << b;
    EXPECT_EQ(blockPitch(9), 0.0);
}

TEST_F(RecognitionSibilants, HissUnderTheWholeRecordingIsNoSibilant) {
    // Hiss (high band 1500, above the 1024 rule and the low band) everywhere: the ten blocks
    // after the note are no louder than the rest, so they are no "S".
    makeSong(60);
    setPitches(0, 50, 220.0);
    makeRows(120, [&](uint32_t, uint32_t* row) { sibilantRow(row, 500, 1500u); });
    appendSibilants(0, 60);
    EXPECT_EQ(blockPitch(50), 0.0);
    // An "S" standing four times above the hiss is one.
    makeRows(120, [&](uint32_t r, uint32_t* row) { sibilantRow(row, 500, r >= 100 ? 6000u : 1500u); });
    appendSibilants(0, 60);
    for (uint32_t b = 50; b < 60; b++) EXPECT_NEAR(blockPitch(b), 220.0, 1e-3) << "block " << b;
}

class RecognitionCleaning : public RecognitionTest {};

TEST_F(RecognitionCleaning, ARunBelowHalfTheCutOffLevelLosesItsEntriesUpToASyllableStart) {
    makeSong(100);
    setPitches(0, 30, 220.0, 19);    // below 40 / 2
    setPitches(40, 70, 330.0, 19);
    setPitch(55, 330.0, 20);         // one block at half the cut-off keeps the run
    removeLowAmplitudeNotes(0, 100);
    EXPECT_EQ(blockData(10).nEntries, 0u);
    EXPECT_EQ(blockData(50).nEntries, 1u);
    // A syllable start ends a run.
    makeSong(100);
    setPitches(0, 60, 220.0, 19);
    setPitches(30, 60, 220.0, 100);
    blockData(30).blockFlags |= BLOCK_SYLLABLE_START;
    removeLowAmplitudeNotes(0, 100);
    EXPECT_EQ(blockData(10).nEntries, 0u);
    EXPECT_EQ(blockData(40).nEntries, 1u);
}

TEST_F(RecognitionCleaning, APhraseThirtyCentsFlatMovesFiveSixteenthsOfASemitoneUp) {
    makeSong(100);
    double flat = 440.0 * std::exp2(-0.3 / 12.0);
    setPitches(0, 40, flat);
    setPitches(60, 100, 440.0);   // a phrase of its own after a gap of 0.23 s
    fitPhrasesToSemitones(0, 100);
    EXPECT_NEAR(blockPitch(20), 440.3178, 1e-3);
    EXPECT_NEAR(blockPitch(80), 440.0, 1e-3) << "an in-tune phrase stays";
}

TEST_F(RecognitionCleaning, TheBoundaryMovesBackToWhereTheNextNoteIsStronger) {
    makeSong(60);
    setBlocks(0, 27, {{220.0, 200}}, 150);
    setBlocks(27, 30, {{220.0, 30}, {330.0, 150}}, 150);
    setBlocks(30, 60, {{330.0, 200}}, 150);
    setPitches(0, 30, 220.0);
    setPitches(30, 60, 330.0);
    sharpenTransitions(0, 60);
    EXPECT_NEAR(blockPitch(26), 220.0, 1e-3);
    for (uint32_t b = 27; b < 30; b++) EXPECT_NEAR(blockPitch(b), 330.0, 1e-3) << "block " << b;
}

TEST_F(RecognitionCleaning, AtATransitionTheNextNoteStartsWhereItRoseUnderTheFadingOne) {
    makeSong(80);
    setBlocks(0, 40, {{220.0, 200}}, 150);
    // The lower note fades out over ten blocks while the upper one rises under it; from block
    // 43 on the upper one is the stronger.
    for (uint32_t b = 40; b < 50; b++) setBlock(b, {{220.0, 60 - 5 * int(b - 40)}, {330.0, 30 + 10 * int(b - 40)}}, 150);
    setBlocks(50, 80, {{330.0, 200}}, 150);
    recognisePitchTrack(0, 0);
    EXPECT_NEAR(cents(blockPitch(39), 220.0), 0.0, 5.0);
    for (uint32_t b = 40; b < 44; b++) EXPECT_NEAR(cents(blockPitch(b), 330.0), 0.0, 5.0) << "block " << b;
    recognitionOptions.refineNoteBoundaries = false;
    recognisePitchTrack(0, 0);
    EXPECT_NEAR(cents(blockPitch(42), 220.0), 0.0, 5.0) << "the decision alone keeps the fading note";
}

TEST_F(RecognitionCleaning, AnUnevenReleaseStillGivesTheBlocksToTheNoteRisingUnderIt) {
    // A choir lets go of the lower note unevenly (it swells once more at block 45) while the
    // upper note's slow attack is faintly there from block 41 on.
    makeSong(80);
    setBlocks(0, 41, {{220.0, 200}}, 150);
    const int lower[] = {100, 70, 40, 45, 60, 20};
    const int upper[] = {2, 3, 5, 8, 10, 30};
    for (uint32_t b = 41; b < 47; b++) setBlock(b, {{220.0, lower[b - 41]}, {330.0, upper[b - 41]}}, 150);
    setBlocks(47, 80, {{330.0, 200}}, 150);
    recognisePitchTrack(0, 0);
    EXPECT_NEAR(cents(blockPitch(40), 220.0), 0.0, 5.0);
    for (uint32_t b = 41; b < 47; b++) EXPECT_NEAR(cents(blockPitch(b), 330.0), 0.0, 5.0) << "block " << b;
}

TEST_F(RecognitionCleaning, ANoteThatHoldsOnKeepsItsBlocksFromAFaintNextOne) {
    makeSong(80);
    setBlocks(0, 40, {{220.0, 200}}, 150);
    // The upper note is faintly there (20) for five blocks while the lower one holds at 200.
    setBlocks(40, 45, {{220.0, 200}, {330.0, 20}}, 150);
    setBlocks(45, 80, {{330.0, 200}}, 150);
    recognisePitchTrack(0, 0);
    EXPECT_NEAR(cents(blockPitch(44), 220.0), 0.0, 5.0);
    EXPECT_NEAR(cents(blockPitch(45), 330.0), 0.0, 5.0);
}

TEST_F(RecognitionCleaning, AShortDropoutInsideANoteIsBridgedUnlessASyllableStartsThereOrTheNotesDiffer) {
    makeSong(60);
    setPitches(0, 20, 220.0);
    setPitches(22, 40, 222.0);
    setPitches(42, 60, 222.0);
    blockData(42).blockFlags |= BLOCK_SYLLABLE_START;
    bridgeShortDropouts(0, 60);
    EXPECT_GT(blockPitch(20), 220.0);
    EXPECT_LT(blockPitch(21), 222.0);
    EXPECT_EQ(blockPitch(40), 0.0);
    EXPECT_EQ(blockPitch(41), 0.0);
    // A dropout between different notes or longer than three blocks stays.
    makeSong(60);
    setPitches(0, 20, 220.0);
    setPitches(22, 30, 262.0);
    setPitches(34, 60, 262.0);
    bridgeShortDropouts(0, 60);
    EXPECT_EQ(blockPitch(20), 0.0);
    EXPECT_EQ(blockPitch(31), 0.0);
}

class RecognitionFlattening : public RecognitionTest {};

TEST_F(RecognitionFlattening, AVibratoOfHalfASemitoneBecomesSteadyButOneWaveIsNone) {
    makeSong(120);
    double blockSeconds = song.sampleBlockDuration;
    for (uint32_t b = 0; b < 120; b++) setPitch(b, 440.0 * std::exp2(0.5 * std::sin(TWO_PI * 5.5 * b * blockSeconds) / 12.0));
    flattenVibrato(0, 120);
    int flagged = 0;
    double widest = 0.0;
    for (uint32_t b = 0; b < 120; b++) {
        if (!(blockData(b).blockFlags & BLOCK_VIBRATO)) continue;
        flagged++;
        widest = std::max(widest, std::fabs(cents(blockPitch(b), 440.0)));
    }
    EXPECT_GT(flagged, 100);
    EXPECT_LT(widest, 12.0) << "from 50 cents either way";
    // One wave is no vibrato.
    makeSong(120);
    for (uint32_t b = 0; b < 120; b++)
        setPitch(b, 440.0 * std::exp2((b < 16 ? 0.5 * std::sin(TWO_PI * 5.5 * b * blockSeconds) : 0.0) / 12.0));
    flattenVibrato(0, 120);
    for (uint32_t b = 0; b < 120; b++) EXPECT_FALSE(blockData(b).blockFlags & BLOCK_VIBRATO) << "block " << b;
}

TEST_F(RecognitionFlattening, AGlideIntoASteadyNoteTakesItsPitch) {
    makeSong(60);
    for (uint32_t b = 0; b < 10; b++) setPitch(b, 220.0 * std::exp2((-4.0 + 0.4 * b) / 12.0));
    setPitches(10, 60, 220.0);
    flattenGlissando(0, 60);
    // Blocks 8 and 9 lie within a semitone of the note and belong to its steady stretch.
    for (uint32_t b = 0; b < 8; b++) {
        EXPECT_NEAR(cents(blockPitch(b), 220.0), 0.0, 3.0) << "block " << b;
        EXPECT_EQ(blockData(b).blockFlags & (BLOCK_GLISSANDO | BLOCK_LONG_GLISSANDO), BLOCK_GLISSANDO);
    }
    EXPECT_NEAR(cents(blockPitch(8), 220.0), -80.0, 0.01);
    EXPECT_FALSE(blockData(8).blockFlags & BLOCK_GLISSANDO);
    EXPECT_FALSE(blockData(10).blockFlags & BLOCK_GLISSANDO);
}

// A glide longer than a fifth of a second is marked long; a scoop of less than two semitones,
// or a glide into a stretch shorter than a tenth of a second, stays.
TEST_F(RecognitionFlattening, OnlyAGlideOfTwoSemitonesIntoASteadyStretchIsFlattened) {
    struct Case {
        uint32_t glideBlocks;
        double from, step;      // semitones below the note, and per block
        uint32_t steadyEnd;     // the steady note runs from the glide's end to here
        uint8_t flags;          // of block 0 afterwards
    } cases[] = {{30, -4.0, 0.133, 80, BLOCK_GLISSANDO | BLOCK_LONG_GLISSANDO},
                 {10, -1.5, 0.15, 60, 0},
                 {10, -4.0, 0.4, 15, 0}};
    for (const Case& c : cases) {
        makeSong(80);
        for (uint32_t b = 0; b < c.glideBlocks; b++) setPitch(b, 220.0 * std::exp2((c.from + c.step * b) / 12.0));
        setPitches(c.glideBlocks, c.steadyEnd, 220.0);
        flattenGlissando(0, 80);
        EXPECT_EQ(blockData(0).blockFlags & (BLOCK_GLISSANDO | BLOCK_LONG_GLISSANDO), c.flags) << c.from;
        if (!c.flags) { EXPECT_NEAR(blockPitch(0), 220.0 * std::exp2(c.from / 12.0), 1e-3) << "stays"; }
    }
}
