#pragma once
// What the test daemon's null sink plays, captured from its monitor on a thread of its own,
// with the process clock's reading at each read, so that the time a sample was heard can be
// told to within a few milliseconds.

#include <pulse/simple.h>

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

constexpr uint32_t MONITOR_RATE = 44100;
constexpr uint32_t MONITOR_READ_FRAMES = 220;   // 5 ms

struct MonitorRead {
    size_t end;        // samples captured after this read
    uint32_t clockMs;  // when it returned
};

class MonitorCapture {
public:
    // Starts capturing "md_sink.monitor" (mono, 16 bits, 44,100 Hz); false when it cannot.
    bool start();
    // Ends the capture; samples() and heardAt() are complete afterwards.
    void stop();
    ~MonitorCapture() { stop(); }
    const std::vector<int16_t>& samples() const { return captured; }
    // Process clock milliseconds at which sample k reached the monitor.
    double heardAt(size_t k) const;
    // The sample heard at clock reading ms (fractional index; -1 before the first read).
    double sampleAt(double ms) const;

private:
    pa_simple* stream = nullptr;
    std::thread reader;
    std::atomic<bool> running{false};
    std::mutex lock;
    std::vector<int16_t> captured;
    std::vector<MonitorRead> reads;
};

// The first k at which reference[0 .. count) appears sample for sample in samples from; -1 when nowhere.
long findExactly(const std::vector<int16_t>& samples, const std::vector<int16_t>& reference, size_t count);
// Normalised correlation of a and b over n samples (1.0 for identical signals).
double correlation(const int16_t* a, const int16_t* b, size_t n);
// Power of frequency hz in samples [from, from + n) at MONITOR_RATE (Goertzel), per sample.
double tonePower(const std::vector<int16_t>& samples, size_t from, size_t n, double hz);
