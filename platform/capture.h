#pragma once
// Audio capture as the recorder uses it: a capture object for the default input, and one
// looping capture buffer that the input fills while it runs. Each notification position the
// filling passes signals the main loop's capture event; the recorder then reads the buffer's
// position and locks the stretch it has not taken yet, in one or two parts where the stretch
// wraps. Backends deliver the input: PulseAudio's default source (platform/pulse/), a wave
// file fed at real-time pace or faster (tests and demos), or none (the object cannot be made).

#include <cstddef>
#include <cstdint>
#include <string>

constexpr int CAPTURE_NOTIFICATION_POSITIONS = 16;

struct CaptureFormat {
    uint32_t rate;       // frames per second
    uint16_t bits;       // 8 (unsigned) or 16 (signed)
    uint16_t channels;   // 1 or 2
};

enum CaptureResult {
    CAPTURE_OK = 0,
    CAPTURE_NO_OBJECT = 1,    // no capture object: no input to capture from
    CAPTURE_NO_BUFFER = 2,    // no buffer, or the call does not fit it
    CAPTURE_FAILED = 3        // the input failed or went away
};

// The capture object: 1 when an input exists to capture from (made at start-up), else 0.
int createCaptureObject();
void releaseCaptureObject();
bool captureObjectCreated();
// 1 when a buffer of format could be made (the format probe).
int captureFormatAvailable(const CaptureFormat& format);

// Makes the looping buffer of bytes for format, releasing an earlier one; it does not run yet.
int createCaptureBuffer(const CaptureFormat& format, uint32_t bytes);
void releaseCaptureBuffer();
bool captureBufferCreated();
// The buffer offsets whose passing signals the capture event (up to 16).
int setCaptureNotificationPositions(const uint32_t* offsets, int count);
// Starts (looping) and stops the input filling the buffer.
int startCaptureBuffer();
int stopCaptureBuffer();
bool captureRunning();
// The offset up to which the buffer holds captured data: everything before it, back to the
// last stretch taken, may be read. CAPTURE_FAILED once the input has failed.
int captureReadPosition(uint32_t* position);
// The stretch of bytes from offset: *part1 of *bytes1, and where it wraps *part2 of *bytes2
// (else null and 0). Unlock releases it.
int lockCaptureBuffer(uint32_t offset, uint32_t bytes, const uint8_t** part1, uint32_t* bytes1, const uint8_t** part2,
                      uint32_t* bytes2);
int unlockCaptureBuffer();

// ---- for the backends ----
// Appends captured bytes (in the buffer's format) at the write position, signalling the
// capture event for every notification position passed. From any thread.
void deliverCapturedBytes(const uint8_t* bytes, size_t count);
// Bytes the buffer can take before it would overwrite what the recorder has not read: a
// feeder waits rather than overrun, a real input cannot.
size_t captureRoom();
// The input has failed (the server went away): positions report CAPTURE_FAILED from now on,
// and the capture event is signalled so that the recorder notices.
void reportCaptureFailure();

struct CaptureBackend {
    int (*available)();                                 // an input exists
    int (*formatAvailable)(const CaptureFormat& format);
    int (*start)(const CaptureFormat& format);          // begin delivering; CAPTURE_OK or a failure
    void (*stop)();                                     // stop delivering; returns when no more comes
};
// Installs a backend; nullptr goes back to none (no input).
void setCaptureBackend(const CaptureBackend* backend);

// ---- the wave-file feeder ----
// A wave file stands in for the input: its samples converted to the buffer's format (channels
// averaged or doubled, 8/16 bits, linear interpolation between rates), delivered in 10 ms
// pieces at pace times real time (1.0: as a microphone; 0: as fast as the recorder takes
// them), then silence. 1 when the file can be read (16 channels at most, 8 or 16 bits).
int installCaptureFeeder(const std::string& path, double pace);
// Frames of the file delivered so far.
uint64_t captureFeederFramesDelivered();
