// The wave-file feeder: a capture backend that plays a wave file into the capture buffer, as a
// microphone would deliver it, for tests, benchmarks and demonstrations without sound. The file
// is read whole when installed; its thread converts and delivers 10 ms at a time.
#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <mutex>
#include <thread>
#include <vector>

#include "platform/capture.h"
#include "platform/mediaFiles.h"

struct CaptureFeeder {
    std::vector<float> frames;           // the file as mono frames, -1 .. 1
    uint32_t rate = 0;                   // the file's frames per second
    double pace = 1.0;                   // times real time; 0: as fast as the buffer takes it
    CaptureFormat format{};              // what the buffer wants
    std::thread thread;
    std::atomic<bool> running{false};
    std::atomic<uint64_t> delivered{0};  // frames of the file delivered
};
static CaptureFeeder feeder;

// Frame k of the output at the buffer's rate, read from the file between its two nearest frames.
static float frameAt(uint64_t k) {
    double at = double(k) * feeder.rate / feeder.format.rate;
    size_t i = size_t(at);
    if (i >= feeder.frames.size()) return 0.0f;
    float next = i + 1 < feeder.frames.size() ? feeder.frames[i + 1] : 0.0f;
    float fraction = float(at - double(i));
    return feeder.frames[i] * (1 - fraction) + next * fraction;
}

static void putSample(std::vector<uint8_t>& out, float value, int bits) {
    value = std::max(-1.0f, std::min(value, 32767.0f / 32768.0f));
    if (bits == 8) {
        out.push_back(uint8_t(std::lround(value * 128.0f) + 128));
    } else {
        int16_t s = int16_t(std::lround(value * 32768.0f));
        out.push_back(uint8_t(s));
        out.push_back(uint8_t(uint16_t(s) >> 8));
    }
}

static void feed() {
    const CaptureFormat format = feeder.format;
    const uint32_t pieceFrames = std::max(1u, format.rate / 100);
    const size_t frameBytes = size_t(format.bits / 8) * format.channels;
    auto begun = std::chrono::steady_clock::now();
    // As fast as the recorder takes it, but no more than a quarter of the buffer ahead of it,
    // so that a recording stopped at a given length does not run on by the whole buffer.
    const size_t lowestRoom = captureRoom() * 3 / 4;
    uint64_t next = 0;   // output frames delivered
    std::vector<uint8_t> piece;
    while (feeder.running) {
        if (feeder.pace > 0) {
            auto due = begun + std::chrono::duration<double>(double(next) / format.rate / feeder.pace);
            std::this_thread::sleep_until(due);
        } else if (captureRoom() < std::max(lowestRoom, pieceFrames * frameBytes)) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
            continue;
        }
        piece.clear();
        for (uint32_t i = 0; i < pieceFrames; i++) {
            float value = frameAt(next + i);
            for (int c = 0; c < format.channels; c++) putSample(piece, value, format.bits);
        }
        deliverCapturedBytes(piece.data(), piece.size());
        next += pieceFrames;
        feeder.delivered = std::min<uint64_t>(uint64_t(double(next) * feeder.rate / format.rate), feeder.frames.size());
    }
}

static int feederAvailable() { return 1; }

static int feederFormatAvailable(const CaptureFormat& format) {
    return format.rate > 0 && (format.bits == 8 || format.bits == 16) && (format.channels == 1 || format.channels == 2);
}

static void feederStop() {
    feeder.running = false;
    if (feeder.thread.joinable()) feeder.thread.join();
}

static int feederStart(const CaptureFormat& format) {
    feederStop();
    feeder.format = format;
    feeder.delivered = 0;
    feeder.running = true;
    feeder.thread = std::thread(feed);
    return CAPTURE_OK;
}

static const CaptureBackend feederBackend = {feederAvailable, feederFormatAvailable, feederStart, feederStop};

int installCaptureFeeder(const std::string& path, double pace) {
    MediaWaveInfo info{};
    if (!readMediaWaveInfo(path, &info)) return 0;
    FILE* file = std::fopen(path.c_str(), "rb");
    if (!file) return 0;
    std::vector<uint8_t> data(info.dataBytes);
    bool read = std::fseek(file, long(info.dataOffset), SEEK_SET) == 0 &&
                std::fread(data.data(), 1, data.size(), file) == data.size();
    std::fclose(file);
    if (!read) return 0;
    feederStop();
    size_t sampleBytes = info.bits / 8;
    size_t count = data.size() / (sampleBytes * info.channels);
    feeder.frames.assign(count, 0.0f);
    for (size_t k = 0; k < count; k++) {
        float sum = 0;
        for (int c = 0; c < info.channels; c++) {
            const uint8_t* s = data.data() + (k * info.channels + size_t(c)) * sampleBytes;
            sum += sampleBytes == 1 ? (float(s[0]) - 128.0f) / 128.0f : float(int16_t(s[0] | s[1] << 8)) / 32768.0f;
        }
        feeder.frames[k] = sum / float(info.channels);
    }
    feeder.rate = info.rate;
    feeder.pace = pace;
    setCaptureBackend(&feederBackend);
    return 1;
}

uint64_t captureFeederFramesDelivered() { return feeder.delivered; }
