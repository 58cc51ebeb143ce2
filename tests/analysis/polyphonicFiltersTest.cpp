// The clean-up filters of polyphonic recognition, each on a small pitch map drawn by hand
// (rows are blocks, columns pitch bins), and their place in frequency table creation: only
// with monophonic recognition off, with origDataBuffer taken between the two halves.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "analysis/analysisFixtures.h"
#include "analysis/polyphonicFilters.h"

// A pitch map drawn as rows of levels.
struct DrawnMap {
    std::vector<uint8_t> levels;
    std::vector<uint8_t> scratch;
    uint32_t blocks;
    int bins;
    explicit DrawnMap(const std::vector<std::vector<int>>& rows)
        : blocks(uint32_t(rows.size())), bins(int(rows[0].size())) {
        for (const std::vector<int>& r : rows)
            for (int v : r) levels.push_back(uint8_t(v));
        scratch.resize(levels.size());
    }
    PitchMapView view() { return PitchMapView{levels.data(), scratch.data(), blocks, bins}; }
    std::vector<int> row(uint32_t b) const {
        return std::vector<int>(levels.begin() + ptrdiff_t(b * bins), levels.begin() + ptrdiff_t((b + 1) * bins));
    }
};

using Row = std::vector<int>;

TEST(PolyphonicFilter, RemoveLowAmplitudesDropsLevelsUnderTheCutOffOrFarUnderTheBlocksPeak) {
    DrawnMap map({{200, 100, 30, 80}, {40, 0, 60, 0}});
    removeLowAmplitudes(map.view(), 50, 45);
    EXPECT_EQ(map.row(0), (Row{200, 100, 0, 0})) << "30 is under the cut-off, 80 under 45 % of 200";
    EXPECT_EQ(map.row(1), (Row{0, 0, 60, 0}));
}

TEST(PolyphonicFilter, RemoveBassNoiseSubtractsTheSteadyBassAndLeavesNotes) {
    // Bins 0 and 1 are bass: bin 0 carries steady noise of 60 under a note; bin 3 is not bass.
    DrawnMap map({{60, 0, 0, 50}, {60, 0, 0, 50}, {200, 0, 0, 50}, {200, 0, 0, 50}});
    removeBassNoise(map.view(), 2, false);
    EXPECT_EQ(map.row(0), (Row{0, 0, 0, 50}));
    EXPECT_EQ(map.row(2), (Row{140, 0, 0, 50})) << "the note keeps what rises above the noise";
}

TEST(PolyphonicFilter, RemoveBassHumAlsoTakesAwayHumThatStopsNowAndThen) {
    DrawnMap noiseOnly({{80, 0}, {80, 0}, {0, 0}, {80, 0}, {120, 0}});
    removeBassNoise(noiseOnly.view(), 1, false);
    EXPECT_EQ(noiseOnly.row(0), (Row{80, 0})) << "the bin is silent once: no steady noise";
    DrawnMap hum({{80, 0}, {80, 0}, {0, 0}, {80, 0}, {120, 0}});
    removeBassNoise(hum.view(), 1, true);
    EXPECT_EQ(hum.row(0), (Row{0, 0})) << "the level held most of the time is hum";
    EXPECT_EQ(hum.row(4), (Row{40, 0}));
}

TEST(PolyphonicFilter, RemoveExcessiveAttackNoiseKeepsOnlyWhatGoesOnAfterTheAttack) {
    DrawnMap map({{0, 0, 0, 0, 0, 10},
                  {90, 0, 200, 0, 70, 10},
                  {0, 0, 180, 0, 0, 0},
                  {0, 0, 160, 0, 0, 0}});
    removeExcessiveAttackNoise(map.view());
    EXPECT_EQ(map.row(1), (Row{0, 0, 200, 0, 0, 0})) << "only the note's bin goes on";
    EXPECT_EQ(map.row(2), (Row{0, 0, 180, 0, 0, 0})) << "blocks that are no attack stay";
}

TEST(PolyphonicFilter, RemoveAttackInterferenceDropsThePreviousNoteDyingUnderTheAttack) {
    DrawnMap map({{0, 0, 0, 50, 0}, {200, 0, 0, 40, 0}, {190, 0, 0, 0, 0}});
    removeAttackInterference(map.view());
    EXPECT_EQ(map.row(1), (Row{200, 0, 0, 0, 0}));
    EXPECT_EQ(map.row(0), (Row{0, 0, 0, 50, 0}));
}

TEST(PolyphonicFilter, StripSurroundingAmplitudesKeepsOnlyThePeaks) {
    DrawnMap map({{0, 50, 200, 60, 0, 0, 100, 0}, {30, 30, 0, 0, 0, 0, 0, 255}});
    stripSurroundingAmplitudes(map.view());
    EXPECT_EQ(map.row(0), (Row{0, 0, 200, 0, 0, 0, 100, 0}));
    EXPECT_EQ(map.row(1), (Row{30, 30, 0, 0, 0, 0, 0, 255})) << "equal neighbours are both peaks";
}

TEST(PolyphonicFilter, RemoveAmplitudeBlipsDropsLevelsAloneInTime) {
    DrawnMap map({{0, 0, 0, 0}, {0, 90, 0, 90}, {0, 0, 0, 0}, {0, 0, 0, 0}, {0, 0, 80, 0}, {0, 0, 80, 0}});
    removeAmplitudeBlips(map.view(), 3);
    EXPECT_EQ(map.row(1), (Row{0, 0, 0, 90})) << "bin 3 lies beyond the bins the filter looks at";
    EXPECT_EQ(map.row(4), (Row{0, 0, 80, 0})) << "two blocks are a note";
    EXPECT_EQ(map.row(5), (Row{0, 0, 80, 0})) << "the chunk's last block is not judged";
}

TEST(PolyphonicFilter, RemoveWeakNoteTrailsCutsTheFadeAfterThePeak) {
    DrawnMap map({{120, 0}, {200, 0}, {180, 0}, {150, 0}, {60, 0}, {40, 0}, {0, 0}, {30, 0}});
    removeWeakNoteTrails(map.view(), 45);
    std::vector<int> bin0;
    for (uint32_t b = 0; b < map.blocks; b++) bin0.push_back(map.row(b)[0]);
    EXPECT_EQ(bin0, (Row{120, 200, 180, 150, 0, 0, 0, 30})) << "under 90 after the peak of 200 is a trail";
}

TEST(PolyphonicFilter, RemoveNoteJoinsCutsTheOldNotesOverlapWithTheNext) {
    // Bin 0's note runs two blocks into the note that starts in bin 5 at block 2.
    DrawnMap map({{200, 0, 0, 0, 0, 0}, {200, 0, 0, 0, 0, 0}, {150, 0, 0, 0, 0, 220}, {90, 0, 0, 0, 0, 220},
                  {0, 0, 0, 0, 0, 220}});
    removeNoteJoins(map.view());
    EXPECT_EQ(map.row(2), (Row{0, 0, 0, 0, 0, 220}));
    EXPECT_EQ(map.row(3), (Row{0, 0, 0, 0, 0, 220}));
    EXPECT_EQ(map.row(1), (Row{200, 0, 0, 0, 0, 0}));
    // A note that goes on past the join is a second voice, not a join.
    DrawnMap chord({{200, 0, 0, 0}, {200, 0, 0, 220}, {200, 0, 0, 220}, {200, 0, 0, 220}, {200, 0, 0, 220},
                    {0, 0, 0, 220}, {0, 0, 0, 0}});
    removeNoteJoins(chord.view());
    EXPECT_EQ(chord.row(2), (Row{200, 0, 0, 220}));
}

class PolyphonicFilterPlace : public AnalysisTest {};

TEST_F(PolyphonicFilterPlace, MonophonicRecognitionLeavesTheFiltersOut) {
    setSongFormat(44100, 16);
    std::vector<uint8_t> bytes = toSampleBytes(toneSignal(220.0, 8000.0, 1.5, 44100, {1.0, 0.5, 0.3}), 16);
    std::vector<AnalysedBlock> mono = analyseWholeSignal(bytes, uint32_t(bytes.size() / 2));
    emptyAnalysisState();
    setSongFormat(44100, 16);
    recognitionOptions.monophonicRecognition = false;
    std::vector<AnalysedBlock> poly = analyseWholeSignal(bytes, uint32_t(bytes.size() / 2));
    ASSERT_EQ(poly.size(), mono.size());
    size_t removed = 0;
    for (size_t b = 0; b < poly.size(); b++) {
        // dataBuffer holds what the later filters left of origDataBuffer, unchanged.
        const FTDataBuffer& orig = poly[b].orig;
        const FTDataBuffer& data = poly[b].data;
        uint32_t j = 0;
        for (uint32_t i = 0; i < data.nEntries; i++) {
            while (j < orig.nEntries && orig.entries[j].frequency != data.entries[i].frequency) j++;
            ASSERT_LT(j, orig.nEntries) << "block " << b;
            EXPECT_EQ(orig.entries[j].amplitude, data.entries[i].amplitude);
        }
        removed += orig.nEntries - data.nEntries;
        EXPECT_LE(poly[b].data.nEntries, mono[b].data.nEntries) << "block " << b;
    }
    EXPECT_GT(removed, 0u) << "the skirts around the partials are stripped";
}
