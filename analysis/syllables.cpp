// Syllable starts from the spectrogram: dips of the loudness between two loud stretches (a
// re-articulated vowel), and, with "CS Detect syllables", consonants (short peaks of the
// brightness ratio). Rows are mapped to blocks through the blocks' middles.
#include "analysis/syllables.h"

#include <algorithm>
#include <cmath>

#include "analysis/amplitudeHistogram.h"
#include "analysis/recognitionBlocks.h"
#include "analysis/pitchTrackCleaning.h"
#include "analysis/spectrogram.h"
#include "shell/settings.h"
#include "store/song.h"

Syllables syllables;

void releaseSyllables() { std::vector<uint32_t>().swap(syllables.startBlocks); }

double brightnessRatio(const uint32_t* magnitudes, uint32_t count, double binWidth, double fundamental) {
    double split = std::min(2.0 * fundamental, SYLLABLE_SPLIT_LIMIT_HZ);
    double above = 0.0, below = 0.0;
    for (uint32_t i = 3; i < count; i++) {
        if ((i + 1) * binWidth > split) above += magnitudes[i];
        else below += magnitudes[i];
    }
    double ratio = below > 0.0 ? above / below : above;
    if (fundamental >= SYLLABLE_BRIGHT_PITCH_HZ) ratio /= fundamental / SYLLABLE_BRIGHT_PITCH_HZ;
    return ratio;
}

std::vector<double> rowColour(const uint32_t* magnitudes, uint32_t count, double binWidth, double* loudness) {
    std::vector<double> sums(VOWEL_BANDS, 0.0);
    double bandsPerOctave = 3.0;
    for (uint32_t i = 0; i < count; i++) {
        double f = (i + 1) * binWidth;
        if (f < VOWEL_LOWEST_BAND_HZ) continue;
        int band = int(std::floor(bandsPerOctave * std::log2(f / VOWEL_LOWEST_BAND_HZ)));
        if (band >= VOWEL_BANDS) break;
        sums[size_t(band)] += magnitudes[i];
    }
    std::vector<double> colour(VOWEL_BANDS);
    double mean = 0.0, power = 0.0;
    for (int k = 0; k < VOWEL_BANDS; k++) {
        colour[size_t(k)] = 20.0 * std::log10(sums[size_t(k)] + 1.0);
        mean += colour[size_t(k)];
        power += (sums[size_t(k)] + 1.0) * (sums[size_t(k)] + 1.0);
    }
    mean /= VOWEL_BANDS;
    for (double& c : colour) c -= mean;
    if (loudness) *loudness = 10.0 * std::log10(power);
    return colour;
}

// Rows of the spectrogram from row 0 of the cues: first row, their block (or -1), totals and ratios.
struct SyllableCues {
    uint32_t firstRow;
    std::vector<int> blockOfRow;     // song block whose middle lies in the row's hop, -1 when none
    std::vector<double> totals;      // loudness: magnitudes from the fourth bin up to the loudness limit
    std::vector<double> ratios;      // brightness ratios
    std::vector<std::vector<double>> colours;   // rowColour of each row
    std::vector<double> levels;      // each row's level over the colour bands, dB
};

static void dipStarts(const SyllableCues& c, std::vector<size_t>& starts) {
    size_t n = c.totals.size();
    if (n < 3) return;
    double largest = 0.0;
    std::vector<double> smooth(n);
    for (size_t r = 0; r < n; r++) {
        double sum = c.totals[r];
        int count = 1;
        if (r > 0) sum += c.totals[r - 1], count++;
        if (r + 1 < n) sum += c.totals[r + 1], count++;
        smooth[r] = sum / count;
        largest = std::max(largest, smooth[r]);
    }
    if (largest <= 0.0) return;
    uint32_t counts[SPIKE_HISTOGRAM_BINS] = {};
    for (double v : smooth) counts[spikeHistogramBin(v, largest)]++;
    double robust = largest * spikeHistogramTop(counts, SYLLABLE_SPIKE_THRESHOLD) / SPIKE_HISTOGRAM_BINS;
    double loud = DIP_MIN_LEVEL * robust;
    double rowSeconds = double(magnitudeSpectrogram.hop) / song.waveFormat.samplesPerSec;
    size_t reach = std::max<size_t>(1, size_t(DIP_REACH_SECONDS / rowSeconds + 0.5));
    for (size_t r = 1; r + 1 < n; r++) {
        if (!(smooth[r] <= smooth[r - 1] && smooth[r] < smooth[r + 1])) continue;
        double before = 0.0, after = 0.0;
        for (size_t k = r > reach ? r - reach : 0; k < r; k++) before = std::max(before, smooth[k]);
        for (size_t k = r + 1; k < n && k <= r + reach; k++) after = std::max(after, smooth[k]);
        if (!(before >= loud && after >= loud && before >= DIP_DEPTH * smooth[r] && after >= DIP_DEPTH * smooth[r]))
            continue;
        // The syllable starts where the voice let go, not at the quietest point: the first row
        // of the fall below the middle (in level) of the loudness before and the valley.
        double middle = std::sqrt(before * smooth[r]);
        size_t start = r;
        while (start > 0 && r - start < reach && smooth[start - 1] < middle) start--;
        starts.push_back(start);
    }
}

static void vowelChangeStarts(const SyllableCues& c, std::vector<size_t>& starts) {
    size_t n = c.colours.size();
    double rowSeconds = double(magnitudeSpectrogram.hop) / song.waveFormat.samplesPerSec;
    size_t side = std::max<size_t>(1, size_t(VOWEL_SIDE_SECONDS / rowSeconds + 0.5));
    if (n < 2 * side + 2) return;
    double loudest = *std::max_element(c.levels.begin(), c.levels.end());
    // Running sums of the colours (row r's sums at r x VOWEL_BANDS) make every side's mean one
    // subtraction.
    const size_t bands = size_t(VOWEL_BANDS);
    std::vector<double> running((n + 1) * bands, 0.0);
    for (size_t r = 0; r < n; r++)
        for (size_t b = 0; b < bands; b++) running[(r + 1) * bands + b] = running[r * bands + b] + c.colours[r][b];
    std::vector<double> change(n, 0.0);
    for (size_t r = side; r + side <= n; r++) {
        double sum = 0.0;
        for (size_t b = 0; b < bands; b++) {
            double before = (running[r * bands + b] - running[(r - side) * bands + b]) / double(side);
            double after = (running[(r + side) * bands + b] - running[r * bands + b]) / double(side);
            sum += std::fabs(after - before);
        }
        change[r] = sum / double(bands);
    }
    for (size_t r = side + 1; r + side < n; r++) {
        if (change[r] < VOWEL_CHANGE_DB || change[r] < change[r - 1] || change[r] <= change[r + 1]) continue;
        // Only where the voice sounds: within the dip rule's reach of the loudest row's level.
        if (c.levels[r] < loudest + 20.0 * std::log10(DIP_MIN_LEVEL)) continue;
        double before = -1e300, after = -1e300, valley = 1e300;
        for (size_t k = r - side; k < r; k++) before = std::max(before, c.levels[k]);
        for (size_t k = r; k < r + side; k++) after = std::max(after, c.levels[k]);
        for (size_t k = r - 2; k <= r + 2 && k < n; k++) valley = std::min(valley, c.levels[k]);
        if (std::min(before, after) - valley < VOWEL_DIP_DB) continue;
        starts.push_back(r);
    }
}

// Within reach rows from r in direction step, the first row where the ratio lies rise below
// the peak, or flatRise below it after a flat stretch; n when there is none.
static size_t fallRow(const std::vector<double>& ratio, size_t r, int step, size_t reach, size_t flat) {
    size_t n = ratio.size();
    double peak = ratio[r];
    for (size_t d = 1; d <= reach; d++) {
        if ((step < 0 && d > r) || (step > 0 && r + d >= n)) break;
        size_t k = step < 0 ? r - d : r + d;
        if (ratio[k] <= peak - CONSONANT_RISE) return k;
        if (ratio[k] <= peak - CONSONANT_FLAT_RISE) {
            // The stretch beyond k, flat to within the limit for flat rows.
            double low = ratio[k], high = ratio[k];
            size_t seen = 0;
            for (size_t e = 1; e <= flat; e++) {
                if ((step < 0 && e > k) || (step > 0 && k + e >= n)) break;
                double v = ratio[step < 0 ? k - e : k + e];
                low = std::min(low, v);
                high = std::max(high, v);
                seen++;
            }
            if (seen == flat && high - low <= CONSONANT_FLAT_CHANGE) return k;
        }
    }
    return n;
}

static void consonantStarts(const SyllableCues& c, std::vector<size_t>& starts) {
    // The thresholds apply to the share of the magnitude above the split, ratio / (1 + ratio):
    // the ratio itself runs far above 1 in every vowel of a voice rich in harmonics, where
    // steps of 0.1 are mere flicker, while the share keeps a consonant's rise on one scale
    // for thin and rich voices alike.
    std::vector<double> ratio(c.ratios.size());
    for (size_t r = 0; r < ratio.size(); r++) ratio[r] = c.ratios[r] / (1.0 + c.ratios[r]);
    size_t n = ratio.size();
    double rowSeconds = double(magnitudeSpectrogram.hop) / song.waveFormat.samplesPerSec;
    size_t reach = std::max<size_t>(1, size_t(CONSONANT_REACH_SECONDS / rowSeconds + 0.5));
    size_t flat = std::max<size_t>(1, size_t(CONSONANT_FLAT_SECONDS / rowSeconds + 0.5));
    size_t around = std::max<size_t>(1, size_t(CONSONANT_LOUDNESS_SECONDS / rowSeconds + 0.5));
    for (size_t r = 1; r + 1 < n; r++) {
        if (ratio[r] < CONSONANT_MIN_RATIO || ratio[r] < ratio[r - 1] || ratio[r] <= ratio[r + 1]) continue;
        // A consonant interrupts the voice: it is quieter than the vowels on both sides of it. A
        // vowel changing colour brightens without losing loudness, and the bright attack of an
        // instrument's note fades into a quieter but still sounding note.
        double loudBefore = 0.0, loudAfter = 0.0;
        for (size_t k = r > around ? r - around : 0; k < r; k++) loudBefore = std::max(loudBefore, c.totals[k]);
        for (size_t k = r + 1; k < n && k <= r + around; k++) loudAfter = std::max(loudAfter, c.totals[k]);
        if (c.totals[r] > CONSONANT_QUIETER * std::min(loudBefore, loudAfter)) continue;
        if (fallRow(ratio, r, -1, reach, flat) == n) continue;
        size_t after = fallRow(ratio, r, 1, reach, flat);
        if (after == n) continue;
        starts.push_back(after);
    }
}

void findSyllables(uint32_t from, uint32_t end) {
    releaseSyllables();
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    if (end <= from || !s.rowCount || !song.waveFormat.samplesPerSec) return;
    std::vector<int> rows(end - from);
    spectrogramRowsOfBlocks(from, end, rows.data());
    uint32_t firstCovered = end, lastRow = 0;
    for (uint32_t b = from; b < end; b++)
        if (rows[b - from] >= 0) {
            if (firstCovered == end) firstCovered = b;
            lastRow = uint32_t(rows[b - from]);
        }
    if (firstCovered == end) return;
    for (uint32_t b = firstCovered; b < end; b++) {
        if (rows[b - from] < 0) continue;
        blockData(b).blockFlags &= uint8_t(~BLOCK_SYLLABLE_START);
        blockOrigData(b).blockFlags &= uint8_t(~BLOCK_SYLLABLE_START);
    }

    // The cues reach back a consonant's reach before the first covered block.
    double rowSeconds = double(s.hop) / song.waveFormat.samplesPerSec;
    uint32_t back = uint32_t(CONSONANT_REACH_SECONDS / rowSeconds + 0.5);
    uint32_t firstRow = uint32_t(rows[firstCovered - from]);
    firstRow = firstRow > back ? firstRow - back : 0;
    SyllableCues c{firstRow, std::vector<int>(lastRow + 1 - firstRow, -1), {}, {}};
    for (uint32_t b = firstCovered; b < end; b++)
        if (rows[b - from] >= 0) c.blockOfRow[size_t(rows[b - from]) - firstRow] = int(b);
    // Rows between two block middles belong to the later block; the rows before the first
    // covered block only give the consonant search its reach.
    size_t firstOwned = size_t(rows[firstCovered - from]) - firstRow;
    int next = -1;
    for (size_t k = c.blockOfRow.size(); k-- > firstOwned;) {
        if (c.blockOfRow[k] >= 0) next = c.blockOfRow[k];
        else c.blockOfRow[k] = next;
    }
    size_t n = c.blockOfRow.size();
    c.totals.resize(n);
    c.ratios.resize(n);
    c.colours.resize(n);
    c.levels.resize(n);
    uint32_t refresh = std::max(1u, uint32_t(SYLLABLE_ESTIMATE_SECONDS / rowSeconds + 0.5));
    double estimate = SYLLABLE_DEFAULT_PITCH_HZ;
    for (uint32_t b = from; b < end; b++)
        if (blockPitch(b) > 0.0) {
            estimate = blockPitch(b);
            break;
        }
    uint32_t sinceRefresh = refresh;
    for (size_t k = 0; k < n; k++) {
        const uint32_t* row = spectrogramRow(firstRow + uint32_t(k));
        double total = 0.0;
        for (uint32_t i = 3; i < s.binsPerRow && (i + 1) * s.binWidth <= SYLLABLE_LOUDNESS_LIMIT_HZ; i++) total += row[i];
        c.totals[k] = total;
        if (++sinceRefresh >= refresh && c.blockOfRow[k] >= 0 && blockPitch(uint32_t(c.blockOfRow[k])) > 0.0) {
            estimate = blockPitch(uint32_t(c.blockOfRow[k]));
            sinceRefresh = 0;
        }
        c.ratios[k] = brightnessRatio(row, s.binsPerRow, s.binWidth, estimate);
        c.colours[k] = rowColour(row, s.binsPerRow, s.binWidth, &c.levels[k]);
    }

    std::vector<size_t> starts;
    dipStarts(c, starts);
    if (generalSettings.detectSyllables) {
        consonantStarts(c, starts);
        vowelChangeStarts(c, starts);
    }
    std::sort(starts.begin(), starts.end());
    uint32_t spacing = uint32_t(std::max(1, blocksForSeconds(SYLLABLE_MIN_SPACING_SECONDS)));
    for (size_t r : starts) {
        int b = c.blockOfRow[r];
        if (b < int(firstCovered)) continue;
        uint32_t block = uint32_t(b);
        if (!syllables.startBlocks.empty() && block - syllables.startBlocks.back() < spacing) continue;
        syllables.startBlocks.push_back(block);
        blockData(block).blockFlags |= BLOCK_SYLLABLE_START;
        blockOrigData(block).blockFlags |= BLOCK_SYLLABLE_START;
    }
}
