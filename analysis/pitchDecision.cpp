// The fundamental of a block is the lowest strong entry that holds on: candidates are visited
// from the lowest up, the first whose band energy dominates the energy just below it for
// ONSET_SECONDS around the block wins at once, and entries an octave above a candidate count
// for it instead of against it. A weak entry is a strong candidate too when its second and
// third harmonics are there, or when it holds on under a strong octave. The bands then grow over the neighbouring bins of the same
// partial, short octave slips take their neighbours' band, and each block's pitch is the
// amplitude-weighted geometric mean of the entries within its band.
#include "analysis/pitchDecision.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/bandEnergy.h"
#include "analysis/mainsHum.h"
#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "store/song.h"

struct BlockBand {
    double lower;   // Hz; 0 when the block has no band
    double upper;   // Hz
};

struct Candidate {
    uint32_t entry;     // index in the block's entries
    double frequency;   // Hz
    double weight;      // amplitude x highest analysed / frequency: low candidates weigh more
    double support;     // weights of the entries an octave above it
    bool strong;        // amplitude at least the entry limit, or carried by its harmonics
    bool carried;       // its harmonics carry it: its own band energy may lie below the band limit
};

int isOctaveStep(double a, double b) {
    if (!(a > 0.0) || !(b > 0.0)) return 0;
    double r = (a < recognitionOptions.lowPitchLimit || b < recognitionOptions.lowPitchLimit) ? LOW_OCTAVE_STEP_RATIO
                                                                                              : OCTAVE_STEP_RATIO;
    double ratio = b / a;
    return (ratio >= r && ratio <= OCTAVE_STEP_LIMIT) || (ratio <= 1.0 / r && ratio >= 1.0 / OCTAVE_STEP_LIMIT);
}

// The pitches decided lately, as a histogram of semitones, for the octave check.
struct ReferenceRange {
    int counts[MAX_SEMITONE + 1];   // decided blocks per semitone within the reference span
    int total;                      // blocks counted
    std::vector<int> recent;        // semitone of each block in the span, oldest first (-1: none)
    size_t next;                    // the oldest slot of recent, a ring
};

static void addReference(ReferenceRange& r, int semitone) {
    int& slot = r.recent[r.next];
    if (slot >= 0) {
        r.counts[slot]--;
        r.total--;
    }
    slot = semitone;
    if (semitone >= 0) {
        r.counts[semitone]++;
        r.total++;
    }
    r.next = (r.next + 1) % r.recent.size();
}

// The 5th and 95th percentile semitones; 0 when too few pitches were decided.
static int referenceLimits(const ReferenceRange& r, int needed, int* low, int* high) {
    if (r.total < needed || r.total == 0) return 0;
    int lowCount = r.total / 20, highCount = r.total - 1 - r.total / 20;
    int seen = 0;
    *low = *high = -1;
    for (int s = 0; s <= MAX_SEMITONE; s++) {
        if (!r.counts[s]) continue;
        if (*low < 0 && seen + r.counts[s] > lowCount) *low = s;
        seen += r.counts[s];
        if (seen > highCount) {
            *high = s;
            break;
        }
    }
    if (*high < 0) *high = MAX_SEMITONE;
    return *low >= 0;
}

// The candidate's band energy dominates the energy at lowerFrequency for ONSET_SECONDS of
// blocks ahead. Only when the look-ahead runs into the end of the blocks analysed so far
// (the newest blocks of a chunk) do the blocks behind count too: a note that is fading
// must not hold a block where the next note is already rising.
static bool isOnset(uint32_t block, uint32_t endBlock, double frequency, double lowerFrequency, double bandLimit) {
    int needed = std::max(1, blocksForSeconds(ONSET_SECONDS));
    int quietLimit = blocksForSeconds(ONSET_QUIET_SECONDS);
    uint32_t reach = block + uint32_t(blocksForSeconds(ONSET_AHEAD_SECONDS)) + 1;
    uint32_t ahead = std::min<uint32_t>(endBlock, reach);
    int count = 0, quiet = 0;
    bool ended = false;
    for (uint32_t b = block; b < ahead; b++) {
        double e = blockBandEnergy(b, frequency, true);
        if (e < bandLimit) {
            if (++quiet > quietLimit) {
                ended = true;
                break;
            }
            continue;
        }
        quiet = 0;
        if (e > ONSET_DOMINANCE * blockBandEnergy(b, lowerFrequency, true) && ++count >= needed) return true;
    }
    if (ended || ahead == reach) return false;
    uint32_t behind = uint32_t(blocksForSeconds(ONSET_BEHIND_SECONDS));
    uint32_t first = ftBlockWindow.firstBlock;
    quiet = 0;
    for (uint32_t b = block; b > first && block - b < behind;) {
        b--;
        double e = blockBandEnergy(b, frequency, true);
        if (e < bandLimit) {
            if (++quiet >= quietLimit) break;
            continue;
        }
        quiet = 0;
        if (e > ONSET_DOMINANCE * blockBandEnergy(b, lowerFrequency, true) && ++count >= needed) return true;
    }
    return false;
}

// The largest amplitude among the non-hum entries within half a semitone of frequency.
static int amplitudeNear(const FTDataBuffer& data, double frequency) {
    int largest = 0;
    for (uint32_t i = 0; i < data.nEntries; i++) {
        const FrequencyEntry& e = data.entries[i];
        if (e.frequency > frequency * 1.06) break;
        if (e.amplitude > largest && nearFrequency(e.frequency, frequency, HALF_SEMITONE_TOLERANCE) &&
            !isHumFrequency(e.frequency))
            largest = e.amplitude;
    }
    return largest;
}

// A weak entry is still a strong candidate when its second and third harmonics are present
// and, with its fourth, carry the entry limit: the level bytes weigh low frequencies down, so
// a low voice's fundamental can lie far below its second harmonic. Both the second and the
// third are asked for, so that a stray entry an octave below a note does not take it over.
static bool harmonicsCarry(const FTDataBuffer& data, uint32_t entry, int entryLimit) {
    double f = data.entries[entry].frequency;
    int second = amplitudeNear(data, 2 * f), third = amplitudeNear(data, 3 * f);
    if (!second || !third) return false;
    return data.entries[entry].amplitude + second + third + amplitudeNear(data, 4 * f) >= entryLimit;
}

// A weak entry whose octave is strong is that note's fundamental when it holds on around the
// block: some voices and instruments (a choir's "aah") sound their fundamental far below
// their second harmonic, while a stray entry an octave below a note comes and goes.
static bool octaveCarries(uint32_t block, uint32_t endBlock, const FTDataBuffer& data, uint32_t entry, int entryLimit) {
    double f = data.entries[entry].frequency;
    if (amplitudeNear(data, 2 * f) < entryLimit) return false;
    uint32_t reach = uint32_t(blocksForSeconds(OCTAVE_PRESENCE_SECONDS));
    uint32_t first = std::max(ftBlockWindow.firstBlock, block > reach ? block - reach : 0u);
    uint32_t end = std::min(endBlock, block + reach + 1);
    uint32_t present = 0;
    for (uint32_t b = first; b < end; b++) present += blockBandEnergy(b, f, true) > 0.0;
    return present * OCTAVE_PRESENCE_SHARE_DIVISOR >= (end - first) * OCTAVE_PRESENCE_SHARE_MULTIPLE;
}

// What the choice of one block's fundamental looks at, and what it found besides the entry.
struct FundamentalChoice {
    uint32_t block;        // the block decided
    uint32_t endBlock;     // the pass's end: band energies are not read beyond it
    bool useRange;         // the octave check's range applies: entries more than an octave outside
    int rangeLow;          // ... the semitones rangeLow .. rangeHigh (MIDI numbers) are left out
    int rangeHigh;
    bool faint;            // entries below the band limit may decide (CARRIED_BAND_LIMIT instead)
    bool skippedByRange;   // set when an entry was left out for lying outside the range
};

// The chosen entry of the block, or -1.
static int chooseFundamental(FundamentalChoice& choice) {
    uint32_t block = choice.block, endBlock = choice.endBlock;
    const FTDataBuffer& data = blockOrigData(block);
    const AnalysisGeometry& g = analysisGeometry;
    int cutOff = data.nEntries ? data.entries[0].cutOffLevel : 0;
    double bandLimit = choice.faint ? CARRIED_BAND_LIMIT : std::max(BAND_LEVEL_LIMIT, cutOff / 8);
    // In a quiet block no entry reaches the entry limit; the strongest entries of the block
    // then stand in for strong ones, so that the harmonics of a quiet note still point to
    // its fundamental rather than leaving the choice to the loudest partial.
    int strongest = 0;
    for (uint32_t i = 0; i < data.nEntries; i++)
        if (!isHumFrequency(data.entries[i].frequency)) strongest = std::max<int>(strongest, data.entries[i].amplitude);
    int entryLimit = std::min(std::max(ENTRY_LEVEL_LIMIT, cutOff), std::max(int(bandLimit), strongest / 2));
    if (entryLimit < 1) entryLimit = 1;
    Candidate candidates[FT_DATA_ENTRIES];
    int count = 0;
    bool anyStrong = false;
    for (uint32_t i = 0; i < data.nEntries; i++) {
        const FrequencyEntry& e = data.entries[i];
        if (!e.amplitude || isHumFrequency(e.frequency)) continue;
        if (choice.useRange) {
            double p = frequencyToPitch(e.frequency);
            if (p < choice.rangeLow - OCTAVE_CHECK_SEMITONES || p > choice.rangeHigh + OCTAVE_CHECK_SEMITONES) {
                choice.skippedByRange = true;
                continue;
            }
        }
        bool carried = harmonicsCarry(data, i, entryLimit) || (e.amplitude < entryLimit &&
                                                                octaveCarries(block, endBlock, data, i, entryLimit));
        if (!carried && originalStrengthAt(block, endBlock, e.frequency, CANDIDATE_STRENGTH_SECONDS) < bandLimit)
            continue;
        bool strong = e.amplitude >= entryLimit || carried;
        anyStrong = anyStrong || strong;
        candidates[count++] =
            Candidate{i, e.frequency, e.amplitude * g.highestAnalysed / e.frequency, 0.0, strong, carried};
    }
    // Without a strong candidate the block is an onset or a fading end: its strongest
    // persistent entries still decide it, and the cleaning passes drop what stays weak.
    int last = -1, best = -1;
    double previousFrequency = 0.0;
    for (int c = 0; c < count; c++) {
        Candidate& k = candidates[c];
        if (anyStrong && !k.strong) continue;
        if (last >= 0) {
            double semitones = 12.0 * std::log2(k.frequency / candidates[last].frequency);
            double lowest = previousFrequency < recognitionOptions.lowPitchLimit ? 5.0 : 10.0;
            // Its octave, or its twelfth (the third harmonic, which a bright voice sounds
            // louder than both the fundamental and the octave), counts for it.
            // A faint entry does not take over a loud partial as its harmonic.
            bool twelfth = semitones >= TWELFTH_LOW_SEMITONES && semitones <= TWELFTH_HIGH_SEMITONES &&
                           TWELFTH_SHARE * data.entries[candidates[last].entry].amplitude >= data.entries[k.entry].amplitude;
            if ((semitones >= lowest && semitones <= 14.0) || twelfth) {
                candidates[last].support += k.weight;
                previousFrequency = k.frequency;
                continue;
            }
        }
        double lower = k.entry > 0 ? data.entries[k.entry - 1].frequency : g.lowestAnalysed;
        if (isOnset(block, endBlock, k.frequency, lower, k.carried ? CARRIED_BAND_LIMIT : bandLimit)) return int(k.entry);
        if (best < 0 || k.weight + k.support > candidates[best].weight + candidates[best].support) best = c;
        last = c;
        previousFrequency = k.frequency;
    }
    return best >= 0 ? int(candidates[best].entry) : -1;
}

// One partial often lights two neighbouring pitch bins, the weaker with its frequency pulled
// towards its own bin. The candidates are visited from the lowest up, so the weaker lower
// bin can win the choice; the partial's frequency is its stronger bin's. From the chosen entry
// this climbs to the loudest entry of its partial: neighbours within a semitone of each other,
// each louder than the one before.
static int peakOfPartial(const FTDataBuffer& data, int chosen) {
    for (int direction : {1, -1}) {
        for (int i = chosen + direction; i >= 0 && i < int(data.nEntries); i += direction) {
            const FrequencyEntry& e = data.entries[i];
            const FrequencyEntry& previous = data.entries[i - direction];
            if (!nearFrequency(e.frequency, previous.frequency, SEMITONE_TOLERANCE) || isHumFrequency(e.frequency) ||
                e.amplitude <= previous.amplitude)
                break;
            chosen = i;
        }
    }
    return chosen;
}

// The band of the chosen entry, grown over its neighbours of the same partial.
static BlockBand growBand(uint32_t block, int chosen) {
    const FTDataBuffer& data = blockOrigData(block);
    const AnalysisGeometry& g = analysisGeometry;
    auto clampBand = [&g](double f) { return std::min(g.highestAnalysed, std::max(g.lowestAnalysed, f)); };
    const FrequencyEntry& c = data.entries[chosen];
    BlockBand band{clampBand(c.frequency - c.frequency / HALF_SEMITONE_TOLERANCE),
                   clampBand(c.frequency + c.frequency / HALF_SEMITONE_TOLERANCE)};
    for (int direction : {-1, 1}) {
        const FrequencyEntry* previous = &c;
        for (int i = chosen + direction; i >= 0 && i < int(data.nEntries); i += direction) {
            const FrequencyEntry& e = data.entries[i];
            if (!nearFrequency(e.frequency, previous->frequency, SEMITONE_TOLERANCE) || isHumFrequency(e.frequency) ||
                2 * e.amplitude < c.amplitude || e.amplitude > previous->amplitude)
                break;
            if (direction < 0) band.lower = clampBand(e.frequency - e.frequency / HALF_SEMITONE_TOLERANCE);
            else band.upper = clampBand(e.frequency + e.frequency / HALF_SEMITONE_TOLERANCE);
            previous = &e;
        }
    }
    return band;
}

static bool hasBand(const BlockBand& b) { return b.lower > 0.0; }

static double bandCentre(const BlockBand& b) { return std::sqrt(b.lower * b.upper); }

static bool bandsJump(const BlockBand& a, const BlockBand& b) { return isOctaveStep(bandCentre(a), bandCentre(b)); }

// Short runs a jump away from their neighbours take the neighbours' band. Only runs that lie
// wholly in the blocks being decided change.
static void smoothBands(std::vector<BlockBand>& bands, const RecognitionPass& pass) {
    size_t n = bands.size(), changeable = pass.finalBlock - pass.firstBlock;
    size_t longest = size_t(std::max(1, blocksForSeconds(BAND_SMOOTHING_SECONDS)));
    for (int round = 0; round < BAND_SMOOTHING_ROUNDS; round++) {
        bool changed = false;
        size_t start = 0;
        while (start < n) {
            if (!hasBand(bands[start])) {
                start++;
                continue;
            }
            size_t end = start + 1;
            while (end < n && hasBand(bands[end]) && !bandsJump(bands[end - 1], bands[end])) end++;
            bool before = start > 0 && hasBand(bands[start - 1]);
            bool after = end < n && hasBand(bands[end]);
            if (end - start <= longest && start >= changeable && (before || after)) {
                BlockBand replacement;
                if (before && after) {
                    const BlockBand &a = bands[start - 1], &b = bands[end];
                    if (a.lower <= b.upper && b.lower <= a.upper) replacement = {std::min(a.lower, b.lower), std::max(a.upper, b.upper)};
                    else replacement = a;
                } else {
                    replacement = before ? bands[start - 1] : bands[end];
                }
                for (size_t k = start; k < end; k++) bands[k] = replacement;
                changed = true;
            }
            start = end;
        }
        if (!changed) break;
    }
}

// The block's pitch from the entries within its band, as one dataBuffer entry.
static bool mergeBand(uint32_t block, const BlockBand& band) {
    FTDataBuffer& data = blockData(block);
    double sum = 0.0, sumLog = 0.0;
    int initial = 0;
    uint8_t cutOff = data.nEntries ? data.entries[0].cutOffLevel : 0;
    for (uint32_t i = 0; i < data.nEntries; i++) {
        const FrequencyEntry& e = data.entries[i];
        if (isHumFrequency(e.frequency)) continue;
        initial += e.initialAmplitude;
        // Entries outside the band count for nothing (their amplitudes are cleared).
        if (!hasBand(band) || !e.amplitude || e.frequency < band.lower || e.frequency > band.upper) continue;
        sum += e.amplitude;
        sumLog += e.amplitude * std::log(double(e.frequency));
    }
    if (sum <= 0.0) {
        data.nEntries = 0;
        return false;
    }
    double pitch = std::exp(sumLog / sum);
    double width = std::max(pitch * analysisGeometry.pitchStep, band.upper - band.lower);
    // The loudness of a block with a pitch is at least 1, so that a quiet block still counts.
    int amplitude = std::max(1, std::min(255, (initial + data.blockLoudness) / 2));
    data.entries[0] = FrequencyEntry{float(pitch), float(width), uint8_t(amplitude), uint8_t(amplitude), cutOff, 0};
    data.nEntries = 1;
    return true;
}

void decideBlockPitches(const RecognitionPass& pass) {
    const RecognitionOptions& o = recognitionOptions;
    uint32_t first = pass.firstBlock, final = pass.finalBlock, end = pass.endBlock;
    std::vector<BlockBand> bands(end - first, BlockBand{0.0, 0.0});
    const AnalysisGeometry& g = analysisGeometry;
    // Blocks decided before keep their pitch; their band is the half semitone around it.
    for (uint32_t b = first; b < final; b++) {
        double p = blockPitch(b);
        if (p > 0.0)
            bands[b - first] = {std::max(g.lowestAnalysed, p - p / HALF_SEMITONE_TOLERANCE),
                                std::min(g.highestAnalysed, p + p / HALF_SEMITONE_TOLERANCE)};
    }

    ReferenceRange reference{};
    reference.recent.assign(size_t(std::max(1, blocksForSeconds(REFERENCE_SECONDS))), -1);
    uint32_t windowFirst = ftBlockWindow.firstBlock;
    uint32_t from = final - windowFirst > reference.recent.size() ? final - uint32_t(reference.recent.size()) : windowFirst;
    for (uint32_t b = from; b < final; b++) {
        double p = blockPitch(b);
        addReference(reference, p > 0.0 ? frequencyToSemitone(p) : -1);
    }
    int needed = std::max(1, blocksForSeconds(REFERENCE_MIN_SECONDS));

    for (uint32_t b = final; b < end; b++) {
        int low = 0, high = 0;
        bool useRange = o.octaveCheck && referenceLimits(reference, needed, &low, &high);
        FundamentalChoice choice{b, end, useRange, low, high, false, false};
        int chosen = chooseFundamental(choice);
        // The range keeps stray entries out; it must not silence a melody that leaps past it.
        if (chosen < 0 && choice.skippedByRange) {
            choice.useRange = false;
            chosen = chooseFundamental(choice);
        }
        // Where nothing reaches the band limit a note may be rising or handing over to the
        // next: a faint entry that holds on ahead still decides the block, and the cleaning
        // passes drop what stays weak.
        if (chosen < 0) {
            choice.useRange = useRange;
            choice.faint = true;
            chosen = chooseFundamental(choice);
        }
        if (chosen >= 0) chosen = peakOfPartial(blockOrigData(b), chosen);
        if (chosen >= 0) bands[b - first] = growBand(b, chosen);
        addReference(reference, chosen >= 0 ? frequencyToSemitone(blockOrigData(b).entries[chosen].frequency) : -1);
    }

    smoothBands(bands, pass);

    int bridge = blocksForSeconds(DROPOUT_BRIDGE_SECONDS);
    int emptyRun = 0;
    for (uint32_t b = final; b > windowFirst && blockPitch(b - 1) <= 0.0 && blockData(b - 1).nEntries;) {
        b--;
        emptyRun++;
    }
    for (uint32_t b = final; b < end; b++) {
        if (mergeBand(b, bands[b - first])) {
            emptyRun = 0;
            continue;
        }
        emptyRun++;
        FTDataBuffer& data = blockData(b);
        if (b > windowFirst && blockData(b - 1).nEntries && emptyRun <= bridge) {
            const FrequencyEntry& previous = blockData(b - 1).entries[0];
            data.entries[0] = FrequencyEntry{previous.frequency, previous.frequencyWidth, 0, 0, previous.cutOffLevel, 0};
            data.nEntries = 1;
        }
    }
}
