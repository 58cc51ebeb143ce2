// The looping capture buffer every capture backend fills, and the dispatch to the installed
// backend. The buffer is written by the backend's thread and read by the recorder on the main
// thread; one lock guards it, and no backend is called while it is held (a backend's thread
// delivers holding its own lock). Nothing blocks the writer: a recorder that falls a whole
// buffer behind loses the oldest stretch, as a capture device does.
#include "platform/capture.h"

#include <mutex>
#include <vector>

#include "platform/allocation.h"
#include "platform/mainloop.h"

static int noneAvailable() { return 0; }
static int noneFormatAvailable(const CaptureFormat&) { return 0; }
static int noneStart(const CaptureFormat&) { return CAPTURE_NO_OBJECT; }
static void noneStop() {}
static const CaptureBackend noneBackend = {noneAvailable, noneFormatAvailable, noneStart, noneStop};

struct CaptureBufferState {
    std::mutex lock;                      // guards everything below
    const CaptureBackend* backend = &noneBackend;
    bool objectCreated = false;           // createCaptureObject succeeded
    std::vector<uint8_t> bytes;           // the looping buffer; empty when none
    CaptureFormat format{};
    uint32_t positions[CAPTURE_NOTIFICATION_POSITIONS] = {};
    int positionCount = 0;
    uint64_t written = 0;                 // bytes delivered since the buffer was made
    uint64_t taken = 0;                   // bytes the recorder has locked and unlocked
    uint64_t lockedEnd = 0;               // where the stretch locked last ends
    bool running = false;                 // between start and stop
    bool failed = false;                  // the input failed while running
};
static CaptureBufferState capture;

void setCaptureBackend(const CaptureBackend* backend) {
    std::lock_guard<std::mutex> guard(capture.lock);
    capture.backend = backend ? backend : &noneBackend;
}

int createCaptureObject() {
    const CaptureBackend* backend;
    {
        std::lock_guard<std::mutex> guard(capture.lock);
        backend = capture.backend;
    }
    int available = backend->available();
    std::lock_guard<std::mutex> guard(capture.lock);
    capture.objectCreated = available != 0;
    return capture.objectCreated ? 1 : 0;
}

void releaseCaptureObject() {
    releaseCaptureBuffer();
    std::lock_guard<std::mutex> guard(capture.lock);
    capture.objectCreated = false;
}

bool captureObjectCreated() {
    std::lock_guard<std::mutex> guard(capture.lock);
    return capture.objectCreated;
}

int captureFormatAvailable(const CaptureFormat& format) {
    const CaptureBackend* backend;
    {
        std::lock_guard<std::mutex> guard(capture.lock);
        if (!capture.objectCreated) return 0;
        backend = capture.backend;
    }
    return backend->formatAvailable(format);
}

int createCaptureBuffer(const CaptureFormat& format, uint32_t bytes) {
    releaseCaptureBuffer();
    if (!captureObjectCreated()) return CAPTURE_NO_OBJECT;
    // The backend is asked outside the lock: its own thread delivers holding its lock first.
    if (bytes == 0 || !captureFormatAvailable(format)) return CAPTURE_NO_BUFFER;
    std::lock_guard<std::mutex> guard(capture.lock);
    if (!tryAllocate([&] { capture.bytes.assign(bytes, format.bits == 8 ? 0x80 : 0); })) return CAPTURE_NO_BUFFER;
    capture.format = format;
    capture.positionCount = 0;
    capture.written = capture.taken = capture.lockedEnd = 0;
    capture.failed = false;
    return CAPTURE_OK;
}

void releaseCaptureBuffer() {
    stopCaptureBuffer();
    std::lock_guard<std::mutex> guard(capture.lock);
    std::vector<uint8_t>().swap(capture.bytes);
    capture.positionCount = 0;
}

bool captureBufferCreated() {
    std::lock_guard<std::mutex> guard(capture.lock);
    return !capture.bytes.empty();
}

int setCaptureNotificationPositions(const uint32_t* offsets, int count) {
    std::lock_guard<std::mutex> guard(capture.lock);
    if (capture.bytes.empty() || count < 0 || count > CAPTURE_NOTIFICATION_POSITIONS) return CAPTURE_NO_BUFFER;
    for (int i = 0; i < count; i++)
        if (offsets[i] >= capture.bytes.size()) return CAPTURE_NO_BUFFER;
    std::copy(offsets, offsets + count, capture.positions);
    capture.positionCount = count;
    return CAPTURE_OK;
}

int startCaptureBuffer() {
    const CaptureBackend* backend;
    CaptureFormat format;
    {
        std::lock_guard<std::mutex> guard(capture.lock);
        if (capture.bytes.empty()) return CAPTURE_NO_BUFFER;
        if (capture.running) return CAPTURE_OK;
        capture.running = true;
        capture.failed = false;
        backend = capture.backend;
        format = capture.format;
    }
    int result = backend->start(format);
    if (result != CAPTURE_OK) {
        std::lock_guard<std::mutex> guard(capture.lock);
        capture.running = false;
    }
    return result;
}

int stopCaptureBuffer() {
    const CaptureBackend* backend;
    {
        std::lock_guard<std::mutex> guard(capture.lock);
        if (!capture.running) return capture.bytes.empty() ? CAPTURE_NO_BUFFER : CAPTURE_OK;
        capture.running = false;
        backend = capture.backend;
    }
    // Outside the lock: the backend's thread may be delivering, which takes it.
    backend->stop();
    return CAPTURE_OK;
}

bool captureRunning() {
    std::lock_guard<std::mutex> guard(capture.lock);
    return capture.running;
}

int captureReadPosition(uint32_t* position) {
    std::lock_guard<std::mutex> guard(capture.lock);
    if (capture.bytes.empty()) return CAPTURE_NO_BUFFER;
    if (capture.failed) return CAPTURE_FAILED;
    *position = uint32_t(capture.written % capture.bytes.size());
    return CAPTURE_OK;
}

int lockCaptureBuffer(uint32_t offset, uint32_t bytes, const uint8_t** part1, uint32_t* bytes1, const uint8_t** part2,
                      uint32_t* bytes2) {
    std::lock_guard<std::mutex> guard(capture.lock);
    size_t size = capture.bytes.size();
    if (size == 0 || offset >= size || bytes > size) return CAPTURE_NO_BUFFER;
    uint32_t first = uint32_t(std::min<size_t>(bytes, size - offset));
    *part1 = capture.bytes.data() + offset;
    *bytes1 = first;
    *part2 = bytes > first ? capture.bytes.data() : nullptr;
    *bytes2 = bytes - first;
    // The stretch ends at the absolute position congruent to offset + bytes that lies within
    // the last buffer's worth of what was written.
    uint64_t end = (uint64_t(offset) + bytes) % size;
    uint64_t behind = (capture.written % size + size - end) % size;
    capture.lockedEnd = capture.written - behind;
    return CAPTURE_OK;
}

int unlockCaptureBuffer() {
    std::lock_guard<std::mutex> guard(capture.lock);
    if (capture.bytes.empty()) return CAPTURE_NO_BUFFER;
    capture.taken = std::max(capture.taken, capture.lockedEnd);
    return CAPTURE_OK;
}

void deliverCapturedBytes(const uint8_t* bytes, size_t count) {
    bool passed = false;
    {
        std::lock_guard<std::mutex> guard(capture.lock);
        size_t size = capture.bytes.size();
        if (!capture.running || size == 0 || count == 0) return;
        size_t at = size_t(capture.written % size);
        for (int i = 0; i < capture.positionCount; i++) {
            // Position p is passed once byte p has been written.
            size_t distance = (capture.positions[i] + 1 + size - at) % size;
            if (distance == 0) distance = size;
            if (distance <= count) passed = true;
        }
        for (size_t done = 0; done < count;) {
            size_t piece = std::min(count - done, size - at);
            std::copy(bytes + done, bytes + done + piece, capture.bytes.data() + at);
            done += piece;
            at = (at + piece) % size;
        }
        capture.written += count;
    }
    if (passed) signalCaptureEvent();
}

size_t captureRoom() {
    std::lock_guard<std::mutex> guard(capture.lock);
    uint64_t unread = capture.written - std::min(capture.written, capture.taken);
    return capture.bytes.size() > unread ? size_t(capture.bytes.size() - unread) : 0;
}

void reportCaptureFailure() {
    {
        std::lock_guard<std::mutex> guard(capture.lock);
        if (!capture.running) return;
        capture.failed = true;
    }
    signalCaptureEvent();
}
