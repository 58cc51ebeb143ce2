// The clean-up filters of polyphonic recognition. Each is a plain pass over one chunk's
// level bytes; decisions that depend on neighbours are taken from the scratch copy, so a
// level removed early in a pass does not change what the pass decides further on.
#include "analysis/polyphonicFilters.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "analysis/recognitionOptions.h"

static uint8_t* row(const PitchMapView& map, uint32_t block) { return map.levels + size_t(block) * map.bins; }
static const uint8_t* before(const PitchMapView& map, uint32_t block) { return map.scratch + size_t(block) * map.bins; }

// Keeps a copy of the levels as they were when the pass began.
static void snapshot(const PitchMapView& map) { std::memcpy(map.scratch, map.levels, size_t(map.blocks) * map.bins); }

static uint64_t blockSum(const uint8_t* levels, int bins) {
    uint64_t sum = 0;
    for (int p = 0; p < bins; p++) sum += levels[p];
    return sum;
}

// The block is an attack: its levels together rise to more than ATTACK_RISE times those of
// the block before. The chunk's first block has no block before it here.
static bool isAttack(const PitchMapView& map, uint32_t block) {
    if (block == 0) return false;
    uint64_t now = blockSum(before(map, block), map.bins);
    uint64_t previous = blockSum(before(map, block - 1), map.bins);
    return now > ATTACK_RISE * previous;
}

// The bin or a neighbour of it sounds in the block (in the pass's copy).
static bool soundsNear(const PitchMapView& map, uint32_t block, int p) {
    const uint8_t* levels = before(map, block);
    for (int q = std::max(0, p - 1); q <= std::min(map.bins - 1, p + 1); q++)
        if (levels[q]) return true;
    return false;
}

void removeLowAmplitudes(const PitchMapView& map, uint8_t cutOff, unsigned secondaryPercent) {
    for (uint32_t i = 0; i < map.blocks; i++) {
        uint8_t* levels = row(map, i);
        uint8_t strongest = *std::max_element(levels, levels + map.bins);
        unsigned secondary = strongest * secondaryPercent / 100;
        for (int p = 0; p < map.bins; p++)
            if (levels[p] < cutOff || levels[p] < secondary) levels[p] = 0;
    }
}

void removeBassNoise(const PitchMapView& map, int bassBins, bool removeHum) {
    bassBins = std::min(bassBins, map.bins);
    if (map.blocks == 0) return;
    std::vector<uint8_t> column(map.blocks);
    for (int p = 0; p < bassBins; p++) {
        for (uint32_t i = 0; i < map.blocks; i++) column[i] = row(map, i)[p];
        std::sort(column.begin(), column.end());
        uint8_t profile = column[0];
        // The median: the level the bin holds in at least half the blocks.
        if (removeHum) profile = std::max(profile, column[(map.blocks - 1) / 2]);
        for (uint32_t i = 0; i < map.blocks; i++) {
            uint8_t& level = row(map, i)[p];
            level = level > profile ? uint8_t(level - profile) : 0;
        }
    }
}

void removeExcessiveAttackNoise(const PitchMapView& map) {
    snapshot(map);
    for (uint32_t i = 1; i < map.blocks; i++) {
        if (!isAttack(map, i)) continue;
        uint32_t last = std::min(map.blocks - 1, i + ATTACK_CONFIRM_BLOCKS);
        // An attack at the chunk's end cannot be confirmed here: it is left alone.
        if (last == i) continue;
        uint8_t* levels = row(map, i);
        for (int p = 0; p < map.bins; p++) {
            if (!levels[p]) continue;
            bool goesOn = false;
            for (uint32_t k = i + 1; k <= last && !goesOn; k++) goesOn = soundsNear(map, k, p);
            if (!goesOn) levels[p] = 0;
        }
    }
}

void removeAttackInterference(const PitchMapView& map) {
    snapshot(map);
    for (uint32_t i = 1; i + 1 < map.blocks; i++) {
        if (!isAttack(map, i)) continue;
        uint8_t* levels = row(map, i);
        for (int p = 0; p < map.bins; p++)
            if (levels[p] && before(map, i - 1)[p] && !soundsNear(map, i + 1, p)) levels[p] = 0;
    }
}

void stripSurroundingAmplitudes(const PitchMapView& map) {
    snapshot(map);
    for (uint32_t i = 0; i < map.blocks; i++) {
        const uint8_t* was = before(map, i);
        uint8_t* levels = row(map, i);
        for (int p = 0; p < map.bins; p++) {
            uint8_t below = p > 0 ? was[p - 1] : 0;
            uint8_t above = p + 1 < map.bins ? was[p + 1] : 0;
            if (was[p] < below || was[p] < above) levels[p] = 0;
        }
    }
}

void removeAmplitudeBlips(const PitchMapView& map, int endBin) {
    snapshot(map);
    endBin = std::min(endBin, map.bins);
    for (uint32_t i = 1; i + 1 < map.blocks; i++) {
        uint8_t* levels = row(map, i);
        for (int p = 0; p < endBin; p++)
            if (levels[p] && !soundsNear(map, i - 1, p) && !soundsNear(map, i + 1, p)) levels[p] = 0;
    }
}

void removeWeakNoteTrails(const PitchMapView& map, unsigned secondaryPercent) {
    for (int p = 0; p < map.bins; p++) {
        uint32_t i = 0;
        while (i < map.blocks) {
            if (!row(map, i)[p]) {
                i++;
                continue;
            }
            uint32_t peakAt = i;
            while (i < map.blocks && row(map, i)[p]) {
                if (row(map, i)[p] > row(map, peakAt)[p]) peakAt = i;
                i++;
            }
            unsigned trail = row(map, peakAt)[p] * secondaryPercent / 100;
            // From the peak on, the run ends where it has fallen below the trail level.
            uint32_t k = peakAt + 1;
            while (k < i && row(map, k)[p] >= trail) k++;
            for (; k < i; k++) row(map, k)[p] = 0;
        }
    }
}

void removeNoteJoins(const PitchMapView& map) {
    snapshot(map);
    for (uint32_t s = 1; s < map.blocks; s++) {
        for (int q = 0; q < map.bins; q++) {
            // A new note starts at block s in bin q.
            if (!before(map, s)[q] || before(map, s - 1)[q]) continue;
            for (int p = 0; p < map.bins; p++) {
                if (p >= q - 1 && p <= q + 1) continue;
                if (!before(map, s - 1)[p] || !before(map, s)[p]) continue;
                // The old note sounds across the start; find where it ends.
                uint32_t end = s;
                while (end < map.blocks && before(map, end)[p]) end++;
                if (end == map.blocks || end - s > NOTE_JOIN_BLOCKS) continue;
                for (uint32_t k = s; k < end; k++) row(map, k)[p] = 0;
            }
        }
    }
}

static unsigned secondaryCutOff() {
    const RecognitionOptions& o = recognitionOptions;
    return o.learningInstruments ? o.learningSecondaryCutOffLevel : o.secondaryCutOffLevel;
}

void runCleanUpFiltersBeforeOrig(const PitchMapView& map, uint8_t cutOff, int bassBins) {
    const RecognitionOptions& o = recognitionOptions;
    if (o.removeLowAmplitudes) removeLowAmplitudes(map, cutOff, secondaryCutOff());
    if (o.removeBassNoise) {
        removeBassNoise(map, bassBins, o.removeBassHum);
        // What the subtraction left weak goes as well.
        if (o.removeLowAmplitudes) removeLowAmplitudes(map, cutOff, secondaryCutOff());
    }
}

void runCleanUpFiltersAfterOrig(const PitchMapView& map, uint8_t cutOff, int blipEndBin) {
    const RecognitionOptions& o = recognitionOptions;
    if (o.removeExcessiveAttackNoise) removeExcessiveAttackNoise(map);
    if (o.removeLowAmplitudes) removeLowAmplitudes(map, cutOff, secondaryCutOff());
    if (o.removeAttackInterference) removeAttackInterference(map);
    if (o.stripSurroundingAmplitudes) stripSurroundingAmplitudes(map);
    if (o.removeAmplitudeBlips) removeAmplitudeBlips(map, blipEndBin);
    if (o.removeWeakNoteTrails) removeWeakNoteTrails(map, secondaryCutOff());
    // Learning an instrument wants every join it played: they belong to its sound.
    if (o.removeNoteJoins && !o.learningInstruments) removeNoteJoins(map);
}
