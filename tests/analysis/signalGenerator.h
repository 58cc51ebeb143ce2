#pragma once
// Test and benchmark audio made in code: steady sines and harmonic tones, silence, noise and
// a sung-like melody, as 16-bit or 8-bit mono samples. The melody is computed sample by
// sample from its position, so a long one can be produced chunk by chunk without holding it.

#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

constexpr double TWO_PI = 6.283185307179586;

// A tone of frequency Hz with the given harmonic amplitudes (1 = the fundamental alone),
// peak amplitude in sample units, duration seconds.
inline std::vector<double> toneSignal(double frequency, double amplitude, double seconds, uint32_t rate,
                                      const std::vector<double>& harmonics = {1.0}) {
    std::vector<double> x(size_t(seconds * rate));
    double sum = 0;
    for (double h : harmonics) sum += h;
    for (size_t i = 0; i < x.size(); i++) {
        double v = 0;
        for (size_t k = 0; k < harmonics.size(); k++)
            v += harmonics[k] * std::sin(TWO_PI * frequency * double(k + 1) * double(i) / rate);
        x[i] = amplitude * v / sum;
    }
    return x;
}

inline std::vector<double> silenceSignal(double seconds, uint32_t rate) {
    return std::vector<double>(size_t(seconds * rate), 0.0);
}

// Deterministic white noise of the given peak amplitude.
inline std::vector<double> noiseSignal(double amplitude, double seconds, uint32_t rate, uint32_t seed = 12345) {
    std::vector<double> x(size_t(seconds * rate));
    uint32_t state = seed;
    for (double& v : x) {
        state = state * 1664525u + 1013904223u;
        v = amplitude * (double(state >> 8) / double(1u << 24) * 2.0 - 1.0);
    }
    return x;
}

inline std::vector<double> concatenate(std::initializer_list<std::vector<double>> parts) {
    std::vector<double> x;
    for (const std::vector<double>& p : parts) x.insert(x.end(), p.begin(), p.end());
    return x;
}

// The samples as the song holds them: 16-bit signed little-endian, or 8-bit unsigned.
inline std::vector<uint8_t> toSampleBytes(const std::vector<double>& x, int bits) {
    std::vector<uint8_t> bytes(x.size() * size_t(bits / 8));
    for (size_t i = 0; i < x.size(); i++) {
        if (bits == 16) {
            double v = std::round(x[i]);
            int16_t s = int16_t(v > 32767 ? 32767 : v < -32768 ? -32768 : v);
            std::memcpy(&bytes[2 * i], &s, 2);
        } else {
            double v = std::round(x[i] + 128);
            bytes[i] = uint8_t(v > 255 ? 255 : v < 0 ? 0 : v);
        }
    }
    return bytes;
}

// A sung-like melody: notes of a scale, each 0.4 s with a short gap, five harmonics, a
// 5.5 Hz vibrato of a third of a semitone and a little breath noise.
struct MelodyGenerator {
    uint32_t rate = 44100;
    uint64_t position = 0;       // next sample
    double phase = 0;            // of the fundamental, radians
    uint32_t noise = 987654321;  // noise generator state

    static double noteFrequency(uint64_t note) {
        static const int steps[] = {0, 2, 4, 5, 7, 9, 7, 5, 4, 2, 0, -3, -5, -3, 0, 4};
        return 220.0 * std::exp2(steps[note % 16] / 12.0);
    }
    double next() {
        double t = double(position) / rate;
        const double noteSeconds = 0.4, gapSeconds = 0.05;
        uint64_t note = uint64_t(t / noteSeconds);
        double inNote = t - double(note) * noteSeconds;
        double f = noteFrequency(note) * std::exp2(std::sin(TWO_PI * 5.5 * t) / 36.0);
        phase += TWO_PI * f / rate;
        if (phase > TWO_PI) phase -= TWO_PI;
        double envelope = inNote < gapSeconds ? 0.0 : std::min(1.0, (inNote - gapSeconds) / 0.03);
        double v = 0;
        const double harmonics[] = {1.0, 0.6, 0.4, 0.25, 0.15};
        for (int k = 0; k < 5; k++) v += harmonics[k] * std::sin(phase * (k + 1));
        noise = noise * 1664525u + 1013904223u;
        double breath = (double(noise >> 8) / double(1u << 24) - 0.5) * 200.0;
        position++;
        return 6000.0 * envelope * v + breath;
    }
    // count 16-bit samples into destination.
    void fill16(uint8_t* destination, uint32_t count) {
        for (uint32_t i = 0; i < count; i++) {
            double v = std::round(next());
            int16_t s = int16_t(v > 32767 ? 32767 : v < -32768 ? -32768 : v);
            std::memcpy(destination + 2 * i, &s, 2);
        }
    }
};
