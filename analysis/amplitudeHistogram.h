#pragma once
// Two histogram rules of the analysis. The 16-bin rule finds a robust maximum that ignores
// rare spikes: the silence gate of the spectrogram, the normaliser of the pitch map and
// recognition's syllable cues use it. histogramThreshold splits a 256-bin histogram of level
// bytes into two classes: the automatic cut-off level of each chunk's FT entries.

#include <cstdint>

constexpr int SPIKE_HISTOGRAM_BINS = 16;
constexpr int LEVEL_HISTOGRAM_BINS = 256;

// The 16-bin rule on bin counts: the bins are ranked by count, largest first (equal counts
// keep their order), and the highest bin index among the first trunc(spikeThreshold x 16)
// of them is returned. At least the first ranked bin is taken, so a threshold below 1/16
// gives the most populated bin rather than no bin at all.
int spikeHistogramTop(const uint32_t counts[SPIKE_HISTOGRAM_BINS], float spikeThreshold);

// The 16-bin bin of value against maximum: value x 15 / maximum, truncated, at most 15
// (0 when maximum is 0).
int spikeHistogramBin(uint64_t value, uint64_t maximum);
int spikeHistogramBin(double value, double maximum);

// The cut-off of a histogram of relative frequencies: for every split t from 1 to 254, the
// counts below t and from t on each have their mean bin index (65536 for an empty side);
// the split whose summed squared deviations from the two means is smallest wins, the first
// one on ties. Sums of 16777216 or more never win; 0 when none is below.
int histogramThreshold(const double relative[LEVEL_HISTOGRAM_BINS]);
