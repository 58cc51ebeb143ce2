// The magnitude spectrogram: Hann-windowed transforms of 2 Nb samples centred on each hop,
// or averaged power spectra with "Power Spectrum Analysis", with a silence gate per call.
#include "analysis/spectrogram.h"

#include <algorithm>
#include <cmath>

#include "analysis/amplitudeHistogram.h"
#include "analysis/analysisGeometry.h"
#include "analysis/analysisSampleBuffer.h"
#include "analysis/recognitionOptions.h"
#include "analysis/vector/elementwise.h"
#include "analysis/vector/fft.h"
#include "analysis/vector/spectrum.h"
#include "analysis/vector/vectorTable.h"
#include "analysis/vector/window.h"
#include "platform/allocation.h"
#include "platform/ui.h"
#include "resources/strings.h"

MagnitudeSpectrogram magnitudeSpectrogram;

static const uint32_t SILENCE_LEVEL_8_BIT = 1024;   // x 2^(bits - 8): the silence gate's level

uint32_t spectrogramBinsForRate(uint32_t sampleRate) {
    if (sampleRate < 16538) return 512;
    if (sampleRate < 33075) return 1024;
    if (sampleRate < 66150) return 2048;
    return 4096;
}

uint32_t spectrogramHopForRate(uint32_t sampleRate) {
    uint32_t limit = sampleRate / 100 + 1;
    uint32_t hop = 4;
    while (hop * 2 <= limit) hop *= 2;
    return hop;
}

static void showMemoryMessage() { showMessage(MESSAGE_ERROR, resourceString(10401)); }

int resetMagnitudeSpectrogram(uint32_t sampleRate, int bitsPerSample) {
    MagnitudeSpectrogram& s = magnitudeSpectrogram;
    s.rowCount = 0;
    s.firstRowPosition = 0;
    s.sampleRate = sampleRate;
    s.bitsPerSample = bitsPerSample;
    s.binsPerRow = spectrogramBinsForRate(sampleRate);
    s.hop = spectrogramHopForRate(sampleRate);
    s.binWidth = float(sampleRate / 2.0 / s.binsPerRow);
    if (!tryResize(s.window, 2 * s.binsPerRow)) {
        freeMagnitudeSpectrogram();
        showMemoryMessage();
        return 0;
    }
    VF_Hann(s.window.data(), 2 * s.binsPerRow);
    return 1;
}

void freeMagnitudeSpectrogram() {
    MagnitudeSpectrogram& s = magnitudeSpectrogram;
    std::vector<uint32_t>().swap(s.magnitudes);
    std::vector<float>().swap(s.window);
    s.rowCount = 0;
    s.firstRowPosition = 0;
}

const uint32_t* spectrogramRow(uint32_t r) {
    return magnitudeSpectrogram.magnitudes.data() + size_t(r) * magnitudeSpectrogram.binsPerRow;
}

static uint32_t toMagnitude(float value) {
    if (!(value > 0)) return 0;
    if (value >= 4294967040.0f) return UINT32_MAX;
    return uint32_t(value);
}

// One row by the default method: 2 Nb samples, windowed, transformed; the magnitudes of bins
// 1 .. Nb. The samples are real, so the real transform gives the same bins as a complex
// transform of the samples with zero imaginary parts, for half the work: its element 0 holds
// the DC and Nyquist values, elements 1 .. Nb-1 the bins between.
static void transformRow(int64_t frameStart, float* samples, fComplex* spectrum, uint32_t* row) {
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    uint32_t length = 2 * s.binsPerRow;
    readAnalysisSamples(frameStart, length, s.bitsPerSample, samples);
    VF_mulV(samples, samples, s.window.data(), length);
    VF_FFT(&spectrum[0].Re, samples, length, 1, nullptr);
    float nyquist = std::fabs(spectrum[0].Im);
    VF_CtoAbs(samples, spectrum + 1, s.binsPerRow - 1);
    samples[s.binsPerRow - 1] = nyquist;
    for (uint32_t k = 0; k < s.binsPerRow; k++) row[k] = toMagnitude(samples[k]);
}

// One row with "Power Spectrum Analysis": the averaged power spectrum of lookahead-frames x Nb
// samples in segments of 2 Nb, then its square root: bins 0 .. Nb - 1.
//
// The averaged spectrum is normalised by the window's energy, the segment count and Nb, which
// leaves a sine of amplitude A at about A / 1.7, while the silence gate's level and the
// thresholds note recognition applies to the rows (a sibilant band of at least 1024) are
// those of the plain transform, about A x Nb / 2: every row of 16-bit audio would be gated to
// silence. The root is therefore scaled back by sqrt(window energy x segments x Nb), which
// puts the rows on the plain transform's scale (for one segment, exactly its magnitudes).
static void powerSpectrumRow(int64_t frameStart, uint32_t length, float segments, float* samples, float* magnitudes,
                             uint32_t* row) {
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    readAnalysisSamples(frameStart, length, s.bitsPerSample, samples);
    VFp_spectrum(magnitudes, s.binsPerRow, samples, length, s.window.data());
    VF_sqrt(magnitudes, magnitudes, s.binsPerRow);
    float scale = std::sqrt(VF_ssq(s.window.data(), 2 * s.binsPerRow) * segments * float(s.binsPerRow));
    for (uint32_t k = 0; k < s.binsPerRow; k++) row[k] = toMagnitude(magnitudes[k] * scale);
}

// The silence gate over the rows just written: their robust maximum (the 16-bin rule) below
// the silence level, after the amplitude boost, zeroes them all.
static void gateSilentRows(uint32_t* rows, size_t values) {
    const RecognitionOptions& o = recognitionOptions;
    uint32_t m = 0;
    for (size_t i = 0; i < values; i++) m = std::max(m, rows[i]);
    uint64_t level = m;
    if (o.spikeThreshold < 1.0f) {
        uint32_t counts[SPIKE_HISTOGRAM_BINS] = {};
        for (size_t i = 0; i < values; i++) counts[spikeHistogramBin(uint64_t(rows[i]), uint64_t(m))]++;
        level = uint64_t(m / 16) * uint64_t(spikeHistogramTop(counts, o.spikeThreshold));
    }
    double boosted = std::trunc(double(level) / o.amplitudeBoost);
    double silence = std::ldexp(double(SILENCE_LEVEL_8_BIT), magnitudeSpectrogram.bitsPerSample - 8);
    if (boosted < silence) std::fill(rows, rows + values, 0u);
}

int createMagnitudeSpectrogram(uint32_t firstSample) {
    MagnitudeSpectrogram& s = magnitudeSpectrogram;
    if (s.window.empty() || s.binsPerRow == 0) return -1;
    if (s.rowCount == 0) s.firstRowPosition = firstSample;
    int64_t start = int64_t(s.firstRowPosition) + int64_t(s.rowCount) * s.hop;
    // Rows need the samples around their hop: the lookahead on the right. At the song's known
    // end the rest is silence, so the rows go on up to the end.
    int64_t limit = analysisBufferEnd() - analysisGeometry.lookaheadSamples;
    const AnalysisSampleBuffer& b = analysisSampleBuffer;
    if (b.endOfSong >= 0 && analysisBufferEnd() >= b.endOfSong) limit = b.endOfSong;
    int first = int(s.rowCount);
    if (limit <= start) return first;
    uint32_t rows = uint32_t((limit - start) / s.hop);
    if (rows == 0) return first;
    size_t values = size_t(rows) * s.binsPerRow;
    if (!tryResize(s.magnitudes, size_t(s.rowCount) * s.binsPerRow + values)) {
        showMemoryMessage();
        return -1;
    }
    bool power = recognitionOptions.powerSpectrumAnalysis;
    uint32_t frames = recognitionOptions.lookaheadFrames ? recognitionOptions.lookaheadFrames : 1;
    uint32_t length = power ? frames * s.binsPerRow : 2 * s.binsPerRow;   // Fl
    uint32_t hopFrame = power ? frames * s.hop : 2 * s.hop;                 // F0
    // Each frame is centred on the middle of its hop.
    int64_t offset = -int64_t(length - hopFrame) / 2 - int64_t(hopFrame - s.hop) / 2;
    float* samples = VF_vector(std::max(length, 2 * s.binsPerRow));
    fComplex* spectrum = VCF_vector(s.binsPerRow);   // the packed transform, or the power spectrum
    uint32_t* out = s.magnitudes.data() + size_t(s.rowCount) * s.binsPerRow;
    for (uint32_t r = 0; r < rows; r++) {
        int64_t frameStart = start + int64_t(r) * s.hop + offset;
        uint32_t* row = out + size_t(r) * s.binsPerRow;
        if (power) powerSpectrumRow(frameStart, length, float(length / s.binsPerRow - 1), samples, &spectrum[0].Re, row);
        else transformRow(frameStart, samples, spectrum, row);
    }
    V_free(spectrum);
    V_free(samples);
    gateSilentRows(out, values);
    s.rowCount += rows;
    return first;
}

void dropSpectrogramRowsBefore(uint32_t samplePosition) {
    MagnitudeSpectrogram& s = magnitudeSpectrogram;
    if (s.rowCount == 0 || samplePosition <= s.firstRowPosition || s.hop == 0) return;
    uint32_t k = std::min(s.rowCount, (samplePosition - s.firstRowPosition) / s.hop);
    if (k == 0) return;
    size_t kept = size_t(s.rowCount - k) * s.binsPerRow;
    std::copy(s.magnitudes.begin() + ptrdiff_t(size_t(k) * s.binsPerRow),
              s.magnitudes.begin() + ptrdiff_t(size_t(s.rowCount) * s.binsPerRow), s.magnitudes.begin());
    s.magnitudes.resize(kept);
    s.rowCount -= k;
    s.firstRowPosition += k * s.hop;
}
