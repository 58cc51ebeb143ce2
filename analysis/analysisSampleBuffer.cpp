// Reading song positions through the analysis sample buffer.
#include "analysis/analysisSampleBuffer.h"

#include <algorithm>
#include <cstring>

AnalysisSampleBuffer analysisSampleBuffer = {nullptr, 0, 0, -1};

void setAnalysisSampleBuffer(const uint8_t* samples, uint32_t sampleCount, int64_t firstSample, int64_t endOfSong) {
    analysisSampleBuffer = AnalysisSampleBuffer{samples, samples ? sampleCount : 0, firstSample, endOfSong};
}

void clearAnalysisSampleBuffer() { analysisSampleBuffer = AnalysisSampleBuffer{nullptr, 0, 0, -1}; }

int64_t analysisBufferEnd() { return analysisSampleBuffer.firstSample + analysisSampleBuffer.sampleCount; }

template <class T>
static void readSamples(int64_t position, uint32_t count, int bitsPerSample, T* out) {
    const AnalysisSampleBuffer& b = analysisSampleBuffer;
    int64_t end = position + count;
    // The part of [position, end) that holds song samples: inside the buffer, not before
    // the song's start, not past its end.
    int64_t from = std::max({position, b.firstSample, int64_t(0)});
    int64_t to = std::min(end, b.firstSample + int64_t(b.sampleCount));
    if (b.endOfSong >= 0) to = std::min(to, b.endOfSong);
    if (!b.samples || to <= from) {
        std::fill(out, out + count, T(0));
        return;
    }
    std::fill(out, out + (from - position), T(0));
    std::fill(out + (to - position), out + count, T(0));
    T* o = out + (from - position);
    size_t first = size_t(from - b.firstSample);
    size_t n = size_t(to - from);
    if (bitsPerSample == 16) {
        const uint8_t* p = b.samples + 2 * first;
        for (size_t i = 0; i < n; i++) {
            int16_t v;
            std::memcpy(&v, p + 2 * i, 2);
            o[i] = T(v);
        }
    } else {
        const uint8_t* p = b.samples + first;
        for (size_t i = 0; i < n; i++) o[i] = T(int(p[i]) - 128);
    }
}

void readAnalysisSamples(int64_t position, uint32_t count, int bitsPerSample, double* out) {
    readSamples(position, count, bitsPerSample, out);
}

void readAnalysisSamples(int64_t position, uint32_t count, int bitsPerSample, float* out) {
    readSamples(position, count, bitsPerSample, out);
}
