// The 16-bin robust-maximum rule and the two-class split of level histograms.
#include "analysis/amplitudeHistogram.h"

#include <cmath>

int spikeHistogramTop(const uint32_t counts[SPIKE_HISTOGRAM_BINS], float spikeThreshold) {
    int order[SPIKE_HISTOGRAM_BINS];
    for (int i = 0; i < SPIKE_HISTOGRAM_BINS; i++) order[i] = i;
    // Insertion sort, largest count first: stable, so equal counts keep their order.
    for (int i = 1; i < SPIKE_HISTOGRAM_BINS; i++) {
        int bin = order[i];
        int k = i;
        while (k > 0 && counts[order[k - 1]] < counts[bin]) {
            order[k] = order[k - 1];
            k--;
        }
        order[k] = bin;
    }
    int taken = int(spikeThreshold * SPIKE_HISTOGRAM_BINS);
    if (taken < 1) taken = 1;
    if (taken > SPIKE_HISTOGRAM_BINS) taken = SPIKE_HISTOGRAM_BINS;
    int top = 0;
    for (int i = 0; i < taken; i++)
        if (order[i] > top) top = order[i];
    return top;
}

int spikeHistogramBin(uint64_t value, uint64_t maximum) {
    if (maximum == 0) return 0;
    // value x 15 / maximum in integers. For values below 2^32 the double quotient never
    // rounds up to the next whole number (its distance from it is at least 2^-36 of it), so
    // truncating it gives the integer quotient; a double division is several times faster.
    if (value < (uint64_t(1) << 32) && maximum < (uint64_t(1) << 32)) {
        int bin = int(double(value * 15) / double(maximum));
        return bin > 15 ? 15 : bin;
    }
    uint64_t bin = value * 15 / maximum;
    return bin > 15 ? 15 : int(bin);
}

int spikeHistogramBin(double value, double maximum) {
    if (!(maximum > 0)) return 0;
    double bin = std::trunc(value * 15.0 / maximum);
    if (!(bin > 0)) return 0;
    return bin > 15 ? 15 : int(bin);
}

static const double EMPTY_SIDE_MEAN = 65536.0;
static const double LARGEST_SPLIT_SUM = 16777216.0;

int histogramThreshold(const double relative[LEVEL_HISTOGRAM_BINS]) {
    int best = 0;
    double bestSum = LARGEST_SPLIT_SUM;
    for (int t = 1; t < LEVEL_HISTOGRAM_BINS - 1; t++) {
        double weightBelow = 0, sumBelow = 0, weightAbove = 0, sumAbove = 0;
        for (int i = 0; i < t; i++) {
            weightBelow += relative[i];
            sumBelow += relative[i] * i;
        }
        for (int i = t; i < LEVEL_HISTOGRAM_BINS; i++) {
            weightAbove += relative[i];
            sumAbove += relative[i] * i;
        }
        double meanBelow = weightBelow > 0 ? sumBelow / weightBelow : EMPTY_SIDE_MEAN;
        double meanAbove = weightAbove > 0 ? sumAbove / weightAbove : EMPTY_SIDE_MEAN;
        double sum = 0;
        for (int i = 0; i < t; i++) sum += relative[i] * (i - meanBelow) * (i - meanBelow);
        for (int i = t; i < LEVEL_HISTOGRAM_BINS; i++) sum += relative[i] * (i - meanAbove) * (i - meanAbove);
        if (sum < bestSum) {
            bestSum = sum;
            best = t;
        }
    }
    return best;
}
