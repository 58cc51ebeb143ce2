// The monitor capture of the real-audio tests and the signal measures they use.
#include "monitorCapture.h"

#include <algorithm>
#include <cmath>

#include "platform/clock.h"

bool MonitorCapture::start() {
    pa_sample_spec spec{PA_SAMPLE_S16LE, MONITOR_RATE, 1};
    // Small fragments for fine arrival times; a long queue so that a busy machine loses nothing.
    pa_buffer_attr attributes{uint32_t(-1), uint32_t(-1), uint32_t(-1), uint32_t(-1), MONITOR_READ_FRAMES * 2};
    int error = 0;
    stream = pa_simple_new(nullptr, "melodrift-test", PA_STREAM_RECORD, "md_sink.monitor", "monitor", &spec, nullptr,
                           &attributes, &error);
    if (!stream) return false;
    running = true;
    reader = std::thread([this] {
        std::vector<int16_t> buffer(MONITOR_READ_FRAMES);
        while (running) {
            int error = 0;
            if (pa_simple_read(stream, buffer.data(), buffer.size() * 2, &error) < 0) break;
            uint32_t now = clockMilliseconds();
            std::lock_guard<std::mutex> guard(lock);
            captured.insert(captured.end(), buffer.begin(), buffer.end());
            reads.push_back({captured.size(), now});
        }
    });
    return true;
}

void MonitorCapture::stop() {
    if (!stream) return;
    running = false;
    if (reader.joinable()) reader.join();
    pa_simple_free(stream);
    stream = nullptr;
}

// The monitor runs at its rate without a break (the sink plays silence when nothing comes), so
// sample k is heard at t0 + k / rate. A read returns once its last sample is there, or later
// when this thread was kept waiting: the earliest of the reads gives t0.
static double firstSampleHeard(const std::vector<MonitorRead>& reads) {
    double t0 = 1e18;
    for (const MonitorRead& read : reads) t0 = std::min(t0, read.clockMs - double(read.end - 1) * 1000.0 / MONITOR_RATE);
    return t0;
}

double MonitorCapture::heardAt(size_t k) const {
    if (reads.empty()) return -1;
    return firstSampleHeard(reads) + double(k) * 1000.0 / MONITOR_RATE;
}

double MonitorCapture::sampleAt(double ms) const {
    if (reads.empty()) return -1;
    double k = (ms - firstSampleHeard(reads)) * MONITOR_RATE / 1000.0;
    return k < 0 ? -1 : std::min(k, double(reads.back().end - 1));
}

long findExactly(const std::vector<int16_t>& samples, const std::vector<int16_t>& reference, size_t count) {
    if (count == 0 || count > reference.size() || samples.size() < count) return -1;
    for (size_t k = 0; k + count <= samples.size(); k++) {
        size_t i = 0;
        while (i < count && samples[k + i] == reference[i]) i++;
        if (i == count) return long(k);
    }
    return -1;
}

double correlation(const int16_t* a, const int16_t* b, size_t n) {
    double ab = 0, aa = 0, bb = 0;
    for (size_t i = 0; i < n; i++) {
        ab += double(a[i]) * b[i];
        aa += double(a[i]) * a[i];
        bb += double(b[i]) * b[i];
    }
    return aa > 0 && bb > 0 ? ab / std::sqrt(aa * bb) : 0.0;
}

double tonePower(const std::vector<int16_t>& samples, size_t from, size_t n, double hz) {
    double coefficient = 2 * std::cos(2 * M_PI * hz / MONITOR_RATE);
    double s1 = 0, s2 = 0;
    for (size_t i = from; i < from + n && i < samples.size(); i++) {
        double s0 = samples[i] + coefficient * s1 - s2;
        s2 = s1;
        s1 = s0;
    }
    return (s1 * s1 + s2 * s2 - coefficient * s1 * s2) / double(n);
}
