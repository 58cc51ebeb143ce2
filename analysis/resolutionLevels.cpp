// The resolution levels and their combination.
//
// Level l splits the group into G / 2^l frames of N0 2^l bins. Every shorter level tells how
// the energy of a bin of the next longer level divides between its two half-frames (the
// ratio of a frame's power to the summed power of its pair), and the longest level gives
// the energy of the fine bin over the whole group. The product of the ratios down the levels
// with the longest level's power puts each fine bin's energy into its block. Summed over the
// G blocks the ratios give 1, so a fine bin's energies add up to the longest transform's
// energy in that bin, and a block's fine bins add up to the block's energy: the values are
// energies of the block's samples, the unit the noise floor, the Hires store's threshold
// and resynthesis all read them in.
#include "analysis/resolutionLevels.h"

#include <algorithm>
#include <cmath>

#include "analysis/analysisGeometry.h"
#include "analysis/analysisSampleBuffer.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/vector/fft.h"

double analyseResolutionLevel(uint32_t n, double* powerOut, dComplex* phaseOut, uint32_t firstFrame,
                              uint32_t endFrame, int level) {
    FrequencyAnalysisState& a = frequencyAnalysis;
    const AnalysisGeometry& g = analysisGeometry;
    uint32_t length = 2 * n;
    const double* window = a.hannWindows.data() + a.hannOffsets[level];
    double* x = a.frameSamples.data();
    dComplex* frame = a.frame.data();
    double total = 0;
    for (uint32_t f = firstFrame; f < endFrame; f++) {
        int64_t start = int64_t(a.chunkStartSample) + int64_t(n) * f - n / 2;
        readAnalysisSamples(start, length, g.bitsPerSample, x);
        // Et: the energy of the hop the frame stands for, its middle half.
        double et = 0;
        for (uint32_t i = n / 2; i < n / 2 + n; i++) et += x[i] * x[i];
        double ew = 0;
        for (uint32_t i = 0; i < length; i++) {
            double re = x[i] * window[i];
            frame[i] = dComplex{re, 0.0};
            ew += re * re;
        }
        double* power = powerOut + size_t(f - firstFrame) * n;
        dComplex* phase = phaseOut ? phaseOut + size_t(f - firstFrame) * n : nullptr;
        power[0] = 0;
        if (phase) phase[0] = dComplex{0, 0};
        if (et == 0 || ew == 0) {
            // Silence: every power is 0; the phases are those of a zero spectrum (argument 0).
            std::fill(power + 1, power + n, 0.0);
            if (phase)
                for (uint32_t k = 1; k < n; k++) phase[k] = dComplex{k % 4 == 0 ? 1.0 : k % 4 == 2 ? -1.0 : 0.0,
                                                                     k % 4 == 1 ? 1.0 : k % 4 == 3 ? -1.0 : 0.0};
            continue;
        }
        VCD_FFT(frame, frame, length, 1);
        // The window takes energy away; scaling by sqrt(Et / Ew) gives it back, so that the
        // n - 1 powers (2 a^2 / 2n each) add up to Et whatever the frame length.
        double scale = std::sqrt(et) / std::sqrt(ew);
        double factor = scale * scale / n;
        for (uint32_t k = 1; k < n; k++) {
            double re = frame[k].Re, im = frame[k].Im;
            double magnitude2 = re * re + im * im;
            double p = magnitude2 * factor;
            power[k] = p;
            total += p;
            if (phase) {
                // The bin's argument plus k pi/2, which moves the phase to the frame's centre:
                // a rotation by a whole quarter turn, so no trigonometry is needed.
                double r = std::sqrt(magnitude2);
                double c = r > 0 ? re / r : 1.0, s = r > 0 ? im / r : 0.0;
                switch (k % 4) {
                case 0: phase[k] = dComplex{c, s}; break;
                case 1: phase[k] = dComplex{-s, c}; break;
                case 2: phase[k] = dComplex{-c, -s}; break;
                default: phase[k] = dComplex{s, -c}; break;
                }
            }
        }
    }
    return total;
}

// Marks the coarse bins c for which every level has some energy among its frames and the
// bins that belong to c (level l's bins 2^l (c + 1) .. 2^l (c + 2) - 1). A coarse bin that
// some level sees as silent stays 0 in every block.
static void markLiveCoarseBins(const AnalysisGeometry& g, FrequencyAnalysisState& a) {
    uint32_t n0 = g.blockSamples;
    std::fill(a.coarseBinLive.begin(), a.coarseBinLive.end(), uint8_t(1));
    std::vector<uint8_t> any(n0);
    for (int l = 0; l < g.levels; l++) {
        uint32_t bins = n0 << l, frames = g.group >> l;
        const double* p = a.levelPowers.data() + size_t(l) * g.group * n0;
        std::fill(any.begin(), any.end(), uint8_t(0));
        for (uint32_t t = 0; t < frames; t++) {
            const double* row = p + size_t(t) * bins;
            for (uint32_t b = 1u << l; b < bins; b++)
                if (row[b] > 0) any[(b >> l) - 1] = 1;
        }
        for (uint32_t c = 0; c < n0; c++) a.coarseBinLive[c] &= any[c];
    }
}

// Level l < L-1, in place: each power becomes its share of the summed power of its pair of
// frames (0 where the pair holds none), for the bins below limitBin.
static void pairRatios(double* p, uint32_t frames, uint32_t bins, uint32_t limitBin) {
    for (uint32_t k = 0; k + 1 < frames; k += 2) {
        double* first = p + size_t(k) * bins;
        double* second = first + bins;
        for (uint32_t b = 0; b < limitBin; b++) {
            double sum = first[b] + second[b];
            if (sum > 0) {
                first[b] /= sum;
                second[b] /= sum;
            } else {
                first[b] = 0;
                second[b] = 0;
            }
        }
    }
}

void analyseBlockGroup(uint32_t groupBlock) {
    FrequencyAnalysisState& a = frequencyAnalysis;
    const AnalysisGeometry& g = analysisGeometry;
    uint32_t n0 = g.blockSamples, G = g.group, H = g.hiresBins;
    int L = g.levels;
    for (int l = 0; l < L; l++) {
        double* powers = a.levelPowers.data() + size_t(l) * G * n0;
        dComplex* phases = g.keepPhases ? a.levelPhases.data() + size_t(l) * G * n0 : nullptr;
        analyseResolutionLevel(n0 << l, powers, phases, groupBlock >> l, (groupBlock + G) >> l, l);
    }
    markLiveCoarseBins(g, a);

    // Coarse bins below the combination limit get the full product; above it each fine bin
    // takes the shortest transform's power in its coarse bin, shared evenly among its G fine bins.
    uint32_t productBins = 0;
    while (productBins < n0 && (productBins + 1) * g.binSpacing < g.combinationLimit) productBins++;
    for (int l = 0; l + 1 < L; l++)
        pairRatios(a.levelPowers.data() + size_t(l) * G * n0, G >> l, n0 << l,
                   std::min(n0 << l, (productBins + 1) << l));

    double* hires = a.hiresSpectrum.data() + size_t(groupBlock) * H;
    double* product = a.combination.data();   // G rows (blocks) of up to G partial products
    const double* level0 = a.levelPowers.data();
    for (uint32_t c = 0; c < n0; c++) {
        bool live = a.coarseBinLive[c] && c + 1 < n0;
        if (c < productBins && live) {
            for (uint32_t t = 0; t < G; t++) product[size_t(t) * G] = level0[size_t(t) * n0 + c + 1];
            // Level k refines each partial product of level k-1 into two: the fine index at
            // level k is f >> (L-1-k), so entry m takes its parent m >> 1. Going down from the
            // top keeps each parent until both children have used it.
            for (int k = 1; k < L; k++) {
                const double* p = a.levelPowers.data() + size_t(k) * G * n0;
                uint32_t bins = n0 << k, children = 1u << k, base = (c + 1) << k;
                for (uint32_t t = 0; t < G; t++) {
                    const double* q = p + size_t(t >> k) * bins + base;
                    double* row = product + size_t(t) * G;
                    for (uint32_t m = children; m-- > 0;) row[m] = row[m >> 1] * q[m];
                }
            }
            for (uint32_t t = 0; t < G; t++)
                std::copy(product + size_t(t) * G, product + size_t(t) * G + G, hires + size_t(t) * H + size_t(c) * G);
        } else {
            for (uint32_t t = 0; t < G; t++) {
                double value = live && c >= productBins ? level0[size_t(t) * n0 + c + 1] / G : 0.0;
                std::fill(hires + size_t(t) * H + size_t(c) * G, hires + size_t(t) * H + size_t(c) * G + G, value);
            }
        }
    }
}
