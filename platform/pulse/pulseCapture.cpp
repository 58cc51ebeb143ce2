// Capture from the server's default source: a record stream whose data the loop thread hands
// to the capture buffer as it arrives. A stream the server breaks (it stopped, the source went
// away) is reported as the input's failure, so that the recorder finishes what it has.
#include "platform/capture.h"
#include "platform/pulse/pulseBackends.h"
#include "platform/pulse/pulseServer.h"

// Data arrives in pieces of this length: short enough for the level meter to move smoothly.
static const pa_usec_t CAPTURE_FRAGMENT = 20 * PA_USEC_PER_MSEC;

static pa_stream* recordStream = nullptr;   // between start and stop; under the loop's lock

static void dataArrived(pa_stream* stream, size_t, void*) {
    const void* data = nullptr;
    size_t bytes = 0;
    while (pa_stream_readable_size(stream) > 0) {
        if (pa_stream_peek(stream, &data, &bytes) < 0 || bytes == 0) return;
        // A hole in the stream (data == nullptr) is silence that was never captured.
        if (data) deliverCapturedBytes(static_cast<const uint8_t*>(data), bytes);
        pa_stream_drop(stream);
    }
}

static void recordStreamChanged(pa_stream* stream, void*) {
    pulseSignal();
    pa_stream_state_t state = pa_stream_get_state(stream);
    if (state == PA_STREAM_FAILED || state == PA_STREAM_TERMINATED) reportCaptureFailure();
}

static void endRecordStream() {
    if (!recordStream) return;
    pa_stream_set_state_callback(recordStream, nullptr, nullptr);
    pa_stream_set_read_callback(recordStream, nullptr, nullptr);
    pa_stream_disconnect(recordStream);
    pa_stream_unref(recordStream);
    recordStream = nullptr;
}

static int pulseCaptureAvailable() {
    PulseLock lock;
    return pulseContext() ? 1 : 0;
}

// The server converts any of these from what the source delivers.
static int pulseCaptureFormatAvailable(const CaptureFormat& format) {
    return format.rate >= 1000 && format.rate <= 192000 && (format.bits == 8 || format.bits == 16) &&
           (format.channels == 1 || format.channels == 2);
}

static int pulseCaptureStart(const CaptureFormat& format) {
    PulseLock lock;
    endRecordStream();
    pa_context* context = pulseContext();
    if (!context) return CAPTURE_NO_OBJECT;
    pa_sample_spec spec = {format.bits == 8 ? PA_SAMPLE_U8 : PA_SAMPLE_S16LE, format.rate, uint8_t(format.channels)};
    recordStream = pa_stream_new(context, "Melodrift recording", &spec, nullptr);
    if (!recordStream) return CAPTURE_FAILED;
    pa_stream_set_state_callback(recordStream, recordStreamChanged, nullptr);
    pa_stream_set_read_callback(recordStream, dataArrived, nullptr);
    pa_buffer_attr attributes = {uint32_t(-1), uint32_t(-1), uint32_t(-1), uint32_t(-1),
                                 uint32_t(pa_usec_to_bytes(CAPTURE_FRAGMENT, &spec))};
    if (pa_stream_connect_record(recordStream, nullptr, &attributes, PA_STREAM_ADJUST_LATENCY) < 0) {
        endRecordStream();
        return CAPTURE_FAILED;
    }
    bool timedOut = false;
    for (int waited = 0; pa_stream_get_state(recordStream) == PA_STREAM_CREATING && !timedOut; waited += 100) {
        pulseWait(100);
        timedOut = waited >= PULSE_TIMEOUT_MS;
    }
    if (pa_stream_get_state(recordStream) != PA_STREAM_READY) {
        endRecordStream();
        return CAPTURE_FAILED;
    }
    return CAPTURE_OK;
}

static void pulseCaptureStop() {
    PulseLock lock;
    endRecordStream();
}

static const CaptureBackend pulseCaptureBackend = {pulseCaptureAvailable, pulseCaptureFormatAvailable,
                                                   pulseCaptureStart, pulseCaptureStop};

void installPulseCapture() { setCaptureBackend(&pulseCaptureBackend); }
