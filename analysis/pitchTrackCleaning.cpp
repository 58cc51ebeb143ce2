// The cleaning passes over a decided pitch track. A block's pitch is its one dataBuffer entry
// with a non-zero amplitude; a zero-amplitude entry only stands in across a dropout.
#include "analysis/pitchTrackCleaning.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/recognitionBlocks.h"
#include "analysis/pitchDecision.h"
#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "analysis/spectrogram.h"
#include "store/song.h"

static uint8_t blockAmplitude(uint32_t b) { return blockData(b).nEntries ? blockData(b).entries[0].amplitude : 0; }

static void setPitch(uint32_t b, const FrequencyEntry& like, double frequency, uint8_t amplitude) {
    FTDataBuffer& data = blockData(b);
    data.entries[0] = FrequencyEntry{float(frequency), like.frequencyWidth, amplitude, amplitude, like.cutOffLevel, 0};
    data.nEntries = 1;
}

void spectrogramRowsOfBlocks(uint32_t from, uint32_t end, int* rows) {
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    uint32_t rate = song.waveFormat.samplesPerSec;
    double t = songTimeOfBlock(from);
    for (uint32_t b = from; b < end; b++) {
        double d = blockDuration(b);
        rows[b - from] = -1;
        if (s.rowCount && s.hop && rate) {
            double middle = (t + d / 2) * rate - double(s.firstRowPosition);
            if (middle >= 0.0) {
                double r = middle / s.hop;
                if (r < s.rowCount) rows[b - from] = int(r);
            }
        }
        t += d;
    }
}

// The low and high sibilant bands of a row.
static void sibilantBands(const uint32_t* magnitudes, uint32_t count, double binWidth, uint64_t* low, uint64_t* high) {
    *low = *high = 0;
    for (uint32_t i = 3; i < count; i++) {
        double f = (i + 1) * binWidth;
        if (f <= SIBILANT_SPLIT_HZ) *low += magnitudes[i];
        else if (f < SIBILANT_HIGH_LIMIT_HZ) *high += magnitudes[i];
        else break;
    }
}

static bool sibilantBandsPass(uint64_t low, uint64_t high) { return high >= SIBILANT_MIN_HIGH_BAND && high > low; }

int isSibilantRow(const uint32_t* magnitudes, uint32_t count, double binWidth) {
    uint64_t low, high;
    sibilantBands(magnitudes, count, binWidth, &low, &high);
    return sibilantBandsPass(low, high);
}

// The high band of the background: the SIBILANT_FLOOR_PERCENT-th percentile of the rows' high
// bands. Hiss or noise under the whole recording passes the sibilant test everywhere it is
// louder than the voice; a sibilant stands out of it.
static uint64_t sibilantFloor(const std::vector<int>& rows) {
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    std::vector<uint64_t> highs;
    for (int r : rows) {
        if (r < 0) continue;
        uint64_t low, high;
        sibilantBands(spectrogramRow(uint32_t(r)), s.binsPerRow, s.binWidth, &low, &high);
        highs.push_back(high);
    }
    if (highs.empty()) return 0;
    size_t k = highs.size() * SIBILANT_FLOOR_PERCENT / 100;
    std::nth_element(highs.begin(), highs.begin() + long(k), highs.end());
    return highs[k];
}

// The blocks [from, to) all hold a pitch within two semitones of pitch.
static bool steadyAround(uint32_t from, uint32_t to, double pitch) {
    for (uint32_t b = from; b < to; b++) {
        double p = blockPitch(b);
        if (p <= 0.0 || !nearFrequency(p, pitch, TWO_SEMITONE_TOLERANCE)) return false;
    }
    return true;
}

// The run's own loudness, at least 1: the sibilant carries no partial of the note's pitch.
static uint8_t sibilantAmplitude(uint32_t b) {
    return uint8_t(std::max(1, std::min(255, int(blockData(b).blockLoudness) / 2)));
}

void appendSibilants(uint32_t from, uint32_t end) {
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    if (end <= from || !s.rowCount) return;
    std::vector<int> rows(end - from);
    spectrogramRowsOfBlocks(from, end, rows.data());
    std::vector<uint8_t> sibilant(end - from, 0);
    uint64_t floor = sibilantFloor(rows);
    for (uint32_t b = from; b < end; b++) {
        int r = rows[b - from];
        if (r < 0 || blockPitch(b) > 0.0) continue;
        uint64_t low, high;
        sibilantBands(spectrogramRow(uint32_t(r)), s.binsPerRow, s.binWidth, &low, &high);
        sibilant[b - from] = sibilantBandsPass(low, high) && high >= SIBILANT_FLOOR_FACTOR * floor;
    }
    uint32_t windowFirst = ftBlockWindow.firstBlock;
    for (uint32_t b = from; b < end;) {
        if (!sibilant[b - from]) {
            b++;
            continue;
        }
        uint32_t runEnd = b;
        while (runEnd < end && sibilant[runEnd - from]) runEnd++;
        uint32_t n = runEnd - b;
        // After a note: the blocks before the run, as many as the run, hold the note's pitch.
        if (b > windowFirst && b - windowFirst >= n && blockPitch(b - 1) > 0.0 &&
            steadyAround(b - n, b, blockPitch(b - 1))) {
            FrequencyEntry like = blockData(b - 1).entries[0];
            for (uint32_t k = b; k < runEnd; k++) setPitch(k, like, like.frequency, sibilantAmplitude(k));
        } else if (runEnd + n <= end && blockPitch(runEnd) > 0.0 && steadyAround(runEnd, runEnd + n, blockPitch(runEnd))) {
            FrequencyEntry like = blockData(runEnd).entries[0];
            for (uint32_t k = b; k < runEnd; k++) setPitch(k, like, like.frequency, sibilantAmplitude(k));
        }
        b = runEnd;
    }
}

void correctOctaveJumps(uint32_t first, uint32_t from, uint32_t end) {
    if (end <= first) return;
    uint32_t gapLimit = uint32_t(blocksForSeconds(DROPOUT_BRIDGE_SECONDS));
    uint32_t shortRun = uint32_t(std::max(1, blocksForSeconds(OCTAVE_JUMP_SECONDS)));
    // Runs of the current phrase: [start, end) block spans, split at jumps.
    struct Run {
        uint32_t start, end;
    };
    std::vector<Run> runs;
    auto foldPhrase = [&]() {
        // runs[0] is the run before; a short run k with a jump on both sides is folded when
        // the run after it comes back to the pitch before it.
        size_t k = 1;
        uint32_t beforeLength = runs.empty() ? 0 : runs[0].end - runs[0].start;
        while (k + 1 < runs.size()) {
            Run& r = runs[k];
            uint32_t length = r.end - r.start;
            double before = 0.0;
            for (uint32_t b = r.start; b-- > runs[k - 1].start;)
                if ((before = blockPitch(b)) > 0.0) break;
            double after = blockPitch(runs[k + 1].start);
            double at = blockPitch(r.start);
            if (length < shortRun && 3 * length < beforeLength && nearFrequency(after, before, TWO_SEMITONE_TOLERANCE)) {
                double shift = std::log(at) - std::log(before);
                for (uint32_t b = std::max(r.start, from); b < r.end; b++) {
                    FTDataBuffer& data = blockData(b);
                    if (!data.nEntries) continue;
                    data.entries[0].frequency = float(std::exp(std::log(double(data.entries[0].frequency)) - shift));
                }
                // The folded run and the one after it continue the run before.
                beforeLength += length + (runs[k + 1].end - runs[k + 1].start);
                runs[k + 1].start = runs[k - 1].start;
                k += 2;
                continue;
            }
            beforeLength = length;
            k++;
        }
        runs.clear();
    };
    double previous = 0.0;
    uint32_t gap = 0;
    for (uint32_t b = first; b < end; b++) {
        double p = blockPitch(b);
        if (p <= 0.0) {
            if (++gap > gapLimit && !runs.empty()) foldPhrase();
            continue;
        }
        gap = 0;
        if (runs.empty() || isOctaveStep(previous, p)) runs.push_back(Run{b, b + 1});
        else runs.back().end = b + 1;
        previous = p;
    }
    foldPhrase();
}

void writeDetectedFrequencies(uint32_t from, uint32_t end) {
    uint32_t windowFirst = ftBlockWindow.firstBlock;
    for (uint32_t b = from; b < end; b++) {
        FTDetectedBuffer& detected = blockDetected(b);
        const FTDataBuffer& data = blockData(b);
        if (data.nEntries && data.entries[0].amplitude) {
            const FrequencyEntry& e = data.entries[0];
            double f = e.frequency, w = e.frequencyWidth;
            double spread = frequencyToPitch(f + w / 2) - frequencyToPitch(f - w / 2);
            detected.entries[0] = FrequencyEntry{e.frequency, float(spread), e.amplitude, e.amplitude, e.cutOffLevel, 0};
            detected.nEntries = 1;
        } else if (b > windowFirst && blockDetected(b - 1).nEntries) {
            detected.entries[0] = blockDetected(b - 1).entries[0];
            detected.nEntries = 1;
        }
    }
}

void removeLowAmplitudeNotes(uint32_t from, uint32_t end) {
    uint32_t b = from;
    while (b < end) {
        double p = blockPitch(b);
        if (p <= 0.0) {
            b++;
            continue;
        }
        uint32_t start = b;
        double sum = 0.0, sumLog = 0.0;
        int largest = 0;
        while (b < end) {
            p = blockPitch(b);
            if (p <= 0.0) break;
            if (b > start) {
                if (blockData(b).blockFlags & BLOCK_SYLLABLE_START) break;
                if (!nearFrequency(p, std::exp(sumLog / sum), SEMITONE_TOLERANCE)) break;
            }
            int a = blockAmplitude(b);
            sum += a;
            sumLog += a * std::log(p);
            largest = std::max(largest, a);
            b++;
        }
        int cutOff = blockData(start).entries[0].cutOffLevel;
        if (2 * largest < cutOff)
            for (uint32_t k = start; k < b; k++) blockData(k).nEntries = 0;
    }
}

// Distance of ln f to the nearest equal-tempered note (A = 440 Hz), natural-log units.
static double gridDistance(double logFrequency) {
    static const double LOG_SEMITONE = std::log(2.0) / 12.0;
    static const double LOG_A = std::log(440.0);
    double semitones = (logFrequency - LOG_A) / LOG_SEMITONE + 69.0;
    double nearest = std::min(127.0, std::max(0.0, std::floor(semitones + 0.5)));
    return std::fabs(semitones - nearest) * LOG_SEMITONE;
}

static void fitPhrase(uint32_t start, uint32_t end) {
    static const double SHIFT_STEP = std::log(440.0 / 415.3047) / 16.0;
    uint32_t step = uint32_t(wholeBlocksIn(PHRASE_SAMPLE_SECONDS));
    double bestMean = 65536.0;
    int best = 0;
    for (int k = -7; k <= 7; k++) {
        double s = k * SHIFT_STEP, sum = 0.0, weight = 0.0;
        for (uint32_t b = start; b < end; b += step) {
            double p = blockPitch(b);
            if (p <= 0.0) continue;
            double a = blockAmplitude(b);
            sum += a * gridDistance(std::log(p) + s);
            weight += a;
        }
        double mean = weight > 0.0 ? sum / weight : 65536.0;
        if (mean < bestMean) {
            bestMean = mean;
            best = k;
        }
    }
    if (best == 0) return;
    double factor = std::exp(best * SHIFT_STEP);
    for (uint32_t b = start; b < end; b++) {
        FTDataBuffer& data = blockData(b);
        if (!data.nEntries) continue;
        data.entries[0].frequency = float(data.entries[0].frequency * factor);
        data.entries[0].frequencyWidth = float(data.entries[0].frequencyWidth * factor);
    }
}

void fitPhrasesToSemitones(uint32_t from, uint32_t end) {
    uint32_t gapBlocks = uint32_t(std::max(1, blocksForSeconds(PHRASE_GAP_SECONDS)));
    uint32_t b = from;
    while (b < end) {
        if (blockPitch(b) <= 0.0) {
            b++;
            continue;
        }
        uint32_t start = b, last = b, gap = 0;
        for (; b < end; b++) {
            if (blockPitch(b) > 0.0) {
                last = b;
                gap = 0;
            } else if (++gap >= gapBlocks) {
                break;
            }
        }
        fitPhrase(start, last + 1);
        b = last + 1;
    }
}

// The largest amplitude of the entries (as the analysis made them) within half a semitone of
// frequency, and their amplitude-weighted geometric mean frequency (0 when there is none).
static int partialAmplitude(uint32_t b, double frequency, double* where) {
    const FTDataBuffer& data = blockOrigData(b);
    int largest = 0;
    double sum = 0.0, sumLog = 0.0;
    for (uint32_t i = 0; i < data.nEntries; i++) {
        const FrequencyEntry& e = data.entries[i];
        if (!e.amplitude || !nearFrequency(e.frequency, frequency, HALF_SEMITONE_TOLERANCE)) continue;
        largest = std::max<int>(largest, e.amplitude);
        sum += e.amplitude;
        sumLog += e.amplitude * std::log(double(e.frequency));
    }
    if (where) *where = sum > 0.0 ? std::exp(sumLog / sum) : 0.0;
    return largest;
}

// b's ratio to a lies within a semitone of 1/3, 1/2, 2 or 3: one may be a harmonic of the
// other, and their partials cannot be weighed against each other.
static bool harmonicallyRelated(double a, double b) {
    for (double k : {1.0 / 3.0, 0.5, 1.0, 2.0, 3.0})
        if (nearFrequency(b, a * k, SEMITONE_TOLERANCE)) return true;
    return false;
}

static void takePartial(uint32_t b, double frequency) {
    double where = 0.0;
    int amplitude = partialAmplitude(b, frequency, &where);
    FTDataBuffer& data = blockData(b);
    uint8_t kept = data.nEntries ? data.entries[0].amplitude : 0;
    FrequencyEntry like = data.nEntries ? data.entries[0] : FrequencyEntry{0.0f, 0.0f, 0, 0, 0, 0};
    if (!data.nEntries) like.cutOffLevel = blockOrigData(b).nEntries ? blockOrigData(b).entries[0].cutOffLevel : 0;
    like.frequencyWidth = float(frequency * analysisGeometry.pitchStep);
    setPitch(b, like, where > 0.0 ? where : frequency, kept ? kept : uint8_t(std::max(1, std::min(255, amplitude))));
}

// The largest amplitude of the partial at frequency over the TRANSITION_PEAK_SECONDS before
// block b, reading no block before lowest.
static int recentPeak(uint32_t b, double frequency, uint32_t lowest) {
    uint32_t span = uint32_t(std::max(1, blocksForSeconds(TRANSITION_PEAK_SECONDS)));
    int peak = 0;
    for (uint32_t k = b; k > lowest && b - k < span;) peak = std::max(peak, partialAmplitude(--k, frequency, nullptr));
    return peak;
}

void sharpenTransitions(uint32_t from, uint32_t end) {
    uint32_t reach = uint32_t(std::max(1, blocksForSeconds(TRANSITION_REACH_SECONDS)));
    uint32_t gapLimit = uint32_t(std::max(1, blocksForSeconds(DROPOUT_FILL_SECONDS)));
    uint32_t last = end;   // the last pitched block seen
    for (uint32_t t = from; t < end; t++) {
        double fb = blockPitch(t);
        if (fb <= 0.0) continue;
        uint32_t a = last;
        last = t;
        if (a == end || t - a - 1 > gapLimit) continue;
        double fa = blockPitch(a);
        if (nearFrequency(fb, fa, SEMITONE_TOLERANCE) || harmonicallyRelated(fa, fb)) continue;
        // The stretch the boundary may move in: A's blocks back to reach, the gap, B's blocks
        // up to reach.
        uint32_t lo = a;
        while (lo > from && a - (lo - 1) < reach && blockPitch(lo - 1) > 0.0 && nearFrequency(blockPitch(lo - 1), fa, SEMITONE_TOLERANCE)) lo--;
        uint32_t hi = t + 1;
        while (hi < end && hi - t < reach && blockPitch(hi) > 0.0 && nearFrequency(blockPitch(hi), fb, SEMITONE_TOLERANCE)) hi++;
        // The boundary is the first block from which B's partial is the stronger in two blocks running.
        uint32_t boundary = t;
        for (uint32_t k = lo; k < hi; k++) {
            int pa = partialAmplitude(k, fa, nullptr), pb = partialAmplitude(k, fb, nullptr);
            int qa = k + 1 < hi ? partialAmplitude(k + 1, fa, nullptr) : pa, qb = k + 1 < hi ? partialAmplitude(k + 1, fb, nullptr) : pb;
            if (pb > pa && qb > qa) {
                boundary = k;
                break;
            }
        }
        // B began where its partial appeared and kept sounding up to the boundary, while A's was
        // already fading (or no more than TRANSITION_RISE_SHARE times B's): the old note's
        // release outweighs a slow attack for a while.
        uint32_t riseReach = uint32_t(std::max(1, blocksForSeconds(TRANSITION_RISE_SECONDS)));
        uint32_t riseLo = std::min(boundary, lo);
        while (riseLo > from && a - (riseLo - 1) < riseReach && blockPitch(riseLo - 1) > 0.0 &&
               nearFrequency(blockPitch(riseLo - 1), fa, SEMITONE_TOLERANCE))
            riseLo--;
        for (uint32_t k = boundary; k > riseLo;) {
            int pa = partialAmplitude(k - 1, fa, nullptr), pb = partialAmplitude(k - 1, fb, nullptr);
            bool fading = FADE_SHARE * recentPeak(k - 1, fa, riseLo) > 4.0 * pa;
            if (pb <= 0 || (!fading && TRANSITION_RISE_SHARE * pb < pa)) break;
            boundary = --k;
        }
        for (uint32_t k = std::min(lo, boundary); k < hi; k++) {
            bool isA = k <= a, isB = k >= t;
            if (k < boundary && !isA && partialAmplitude(k, fa, nullptr) > 0) takePartial(k, fa);
            else if (k >= boundary && !isB && partialAmplitude(k, fb, nullptr) > 0) takePartial(k, fb);
        }
        last = std::max(last, hi - 1);
        t = std::max(t, hi - 1);
    }
}

void bridgeShortDropouts(uint32_t from, uint32_t end) {
    uint32_t longest = uint32_t(std::max(1, blocksForSeconds(DROPOUT_FILL_SECONDS)));
    uint32_t b = from;
    while (b < end && blockPitch(b) <= 0.0) b++;
    while (b < end) {
        // b holds a pitch; find the next unpitched stretch and the pitch after it.
        while (b + 1 < end && blockPitch(b + 1) > 0.0) b++;
        uint32_t gapStart = b + 1, gapEnd = gapStart;
        while (gapEnd < end && blockPitch(gapEnd) <= 0.0) gapEnd++;
        if (gapEnd >= end) break;
        uint32_t length = gapEnd - gapStart;
        bool syllable = false;
        for (uint32_t k = gapStart; k <= gapEnd; k++) syllable = syllable || (blockData(k).blockFlags & BLOCK_SYLLABLE_START);
        double a = blockPitch(b), c = blockPitch(gapEnd);
        if (length <= longest && !syllable && nearFrequency(c, a, SEMITONE_TOLERANCE)) {
            FrequencyEntry like = blockData(b).entries[0];
            uint8_t amplitude = std::min(blockAmplitude(b), blockAmplitude(gapEnd));
            for (uint32_t k = gapStart; k < gapEnd; k++) {
                double x = double(k - b) / double(gapEnd - b);
                setPitch(k, like, std::exp((1 - x) * std::log(a) + x * std::log(c)), amplitude);
            }
        }
        b = gapEnd;
    }
}
