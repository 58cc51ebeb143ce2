// The playback devices over PulseAudio. A device is a playback stream on the default sink
// fed by the server's requests from the loop thread: a wave file straight from disk, a MIDI
// file rendered as it goes. When the source is exhausted the stream is drained, and the
// drain's completion (the server has played the last sample) is the device's end notice.
// A stream the server breaks (it stopped, or went away) ends the device the same way, so
// playback never waits for a sound that will not come.
#include <cstdio>
#include <map>
#include <memory>

#include "platform/clock.h"
#include "platform/mainloop.h"
#include "platform/media.h"
#include "platform/mediaFiles.h"
#include "platform/pulse/midiSynth.h"
#include "platform/pulse/pulseBackends.h"
#include "platform/pulse/pulseServer.h"

// The server is asked to keep about this much audio queued: enough to ride over a busy
// moment of the machine, and a stop silences it at once anyway.
static const pa_usec_t PLAYBACK_TARGET_LATENCY = 200 * PA_USEC_PER_MSEC;

struct PulseDevice {
    int type;                        // MEDIA_TYPE_WAVEAUDIO or MEDIA_TYPE_SEQUENCER
    FILE* file = nullptr;            // wave: the file, at the next byte to send
    MediaWaveInfo wave{};            // wave: its format and data
    uint32_t bytesSent = 0;          // wave: data bytes handed to the server
    pa_sample_spec spec{};           // what the stream carries
    pa_stream* stream = nullptr;     // between play and stop
    pa_operation* drain = nullptr;   // the drain under way at the source's end
    bool draining = false;           // the source is exhausted
    bool noticed = false;            // the end notice has been posted
    MediaNotify notify = nullptr;
};

// Everything below is touched only holding the loop's lock (PulseLock, or inside a callback).
static std::map<int, std::unique_ptr<PulseDevice>> devices;
static int nextDeviceId = 1;
static PulseMediaTimes times;

static PulseDevice* deviceOf(void* userdata) {
    auto it = devices.find(int(reinterpret_cast<intptr_t>(userdata)));
    return it == devices.end() ? nullptr : it->second.get();
}

static void postNotice(int id, PulseDevice* device) {
    if (device->noticed || !device->notify) return;
    device->noticed = true;
    MediaNotify notify = device->notify;
    postToMainLoop([notify, id] { notify(id); });
}

static void drained(pa_stream*, int, void* userdata) {
    PulseDevice* device = deviceOf(userdata);
    if (!device) return;
    if (device->drain) pa_operation_unref(device->drain);
    device->drain = nullptr;
    postNotice(int(reinterpret_cast<intptr_t>(userdata)), device);
}

// Fills size bytes at data from the device's source; returns the bytes filled. Fewer than
// asked means the source has ended.
static size_t fillFromSource(PulseDevice* device, void* data, size_t size) {
    if (device->type == MEDIA_TYPE_SEQUENCER) {
        int frames = int(size / 4);
        return size_t(renderMidiSynth(static_cast<int16_t*>(data), frames)) * 4;
    }
    size_t frameBytes = pa_frame_size(&device->spec);
    size_t wanted = std::min<size_t>(size, device->wave.dataBytes - device->bytesSent);
    wanted -= wanted % frameBytes;
    size_t got = wanted ? std::fread(data, 1, wanted, device->file) : 0;
    got -= got % frameBytes;
    device->bytesSent += uint32_t(got);
    // A file cut short while it plays ends where it ends.
    if (got < wanted) device->bytesSent = device->wave.dataBytes;
    return got;
}

static void writeRequested(pa_stream* stream, size_t nbytes, void* userdata) {
    PulseDevice* device = deviceOf(userdata);
    if (!device || device->draining) return;
    void* data = nullptr;
    size_t size = nbytes;
    if (pa_stream_begin_write(stream, &data, &size) < 0 || !data) return;
    size_t filled = fillFromSource(device, data, size);
    if (filled > 0) {
        pa_stream_write(stream, data, filled, nullptr, 0, PA_SEEK_RELATIVE);
        if (times.firstWrite == 0) times.firstWrite = clockMilliseconds();
    } else {
        pa_stream_cancel_write(stream);
    }
    if (filled < size) {
        device->draining = true;
        device->drain = pa_stream_drain(stream, drained, userdata);
    }
}

static void streamChanged(pa_stream* stream, void* userdata) {
    pulseSignal();
    pa_stream_state_t state = pa_stream_get_state(stream);
    if (state != PA_STREAM_FAILED && state != PA_STREAM_TERMINATED) return;
    if (PulseDevice* device = deviceOf(userdata)) postNotice(int(reinterpret_cast<intptr_t>(userdata)), device);
}

static void endStream(PulseDevice* device) {
    if (!device->stream) return;
    if (device->drain) {
        pa_operation_cancel(device->drain);
        pa_operation_unref(device->drain);
        device->drain = nullptr;
    }
    pa_stream_set_state_callback(device->stream, nullptr, nullptr);
    pa_stream_set_write_callback(device->stream, nullptr, nullptr);
    pa_stream_disconnect(device->stream);
    pa_stream_unref(device->stream);
    device->stream = nullptr;
}

static int pulseOpen(int type, const std::string& path, int* deviceId) {
    PulseLock lock;
    if (!pulseContext()) return MEDIA_ERROR_NO_SERVER;
    auto device = std::make_unique<PulseDevice>();
    device->type = type;
    if (type == MEDIA_TYPE_WAVEAUDIO) {
        if (!readMediaWaveInfo(path, &device->wave)) return MEDIA_ERROR_FILE;
        device->file = std::fopen(path.c_str(), "rb");
        if (!device->file || std::fseek(device->file, long(device->wave.dataOffset), SEEK_SET) != 0) {
            if (device->file) std::fclose(device->file);
            return MEDIA_ERROR_FILE;
        }
        device->spec = {device->wave.bits == 8 ? PA_SAMPLE_U8 : PA_SAMPLE_S16LE, device->wave.rate,
                        uint8_t(device->wave.channels)};
    } else if (type == MEDIA_TYPE_SEQUENCER) {
        if (int result = openMidiSynth(path)) return result;
        device->spec = {PA_SAMPLE_S16LE, MIDI_SYNTH_RATE, 2};
    } else {
        return MEDIA_ERROR_TYPE;
    }
    *deviceId = nextDeviceId++;
    devices[*deviceId] = std::move(device);
    return MEDIA_OK;
}

static int pulsePlay(int deviceId, MediaNotify notify) {
    PulseLock lock;
    auto it = devices.find(deviceId);
    if (it == devices.end()) return MEDIA_ERROR_DEVICE;
    PulseDevice* device = it->second.get();
    times = PulseMediaTimes{clockMilliseconds(), 0};
    pa_context* context = pulseContext();
    if (!context) return MEDIA_ERROR_NO_SERVER;
    endStream(device);
    device->notify = notify;
    device->noticed = false;
    void* userdata = reinterpret_cast<void*>(intptr_t(deviceId));
    device->stream = pa_stream_new(context, "Melodrift playback", &device->spec, nullptr);
    if (!device->stream) return MEDIA_ERROR_STREAM;
    pa_stream_set_state_callback(device->stream, streamChanged, userdata);
    pa_stream_set_write_callback(device->stream, writeRequested, userdata);
    pa_buffer_attr attributes = {uint32_t(-1), uint32_t(pa_usec_to_bytes(PLAYBACK_TARGET_LATENCY, &device->spec)),
                                 uint32_t(-1), uint32_t(-1), uint32_t(-1)};
    pa_stream_flags_t flags =
        pa_stream_flags_t(PA_STREAM_INTERPOLATE_TIMING | PA_STREAM_AUTO_TIMING_UPDATE | PA_STREAM_ADJUST_LATENCY);
    if (pa_stream_connect_playback(device->stream, nullptr, &attributes, flags, nullptr, nullptr) < 0) {
        endStream(device);
        return MEDIA_ERROR_STREAM;
    }
    uint32_t asked = clockMilliseconds();
    pa_stream_state_t state;
    while ((state = pa_stream_get_state(device->stream)) == PA_STREAM_CREATING &&
           clockMilliseconds() - asked < uint32_t(PULSE_TIMEOUT_MS))
        pulseWait(PULSE_TIMEOUT_MS);
    if (state != PA_STREAM_READY) {
        endStream(device);
        return MEDIA_ERROR_STREAM;
    }
    return MEDIA_OK;
}

static int pulseStop(int deviceId) {
    PulseLock lock;
    auto it = devices.find(deviceId);
    if (it == devices.end()) return MEDIA_ERROR_DEVICE;
    endStream(it->second.get());
    return MEDIA_OK;
}

static int pulseClose(int deviceId) {
    PulseLock lock;
    auto it = devices.find(deviceId);
    if (it == devices.end()) return MEDIA_ERROR_DEVICE;
    PulseDevice* device = it->second.get();
    endStream(device);
    if (device->file) std::fclose(device->file);
    if (device->type == MEDIA_TYPE_SEQUENCER) closeMidiSynth();
    devices.erase(it);
    return MEDIA_OK;
}

static int pulsePlayedMilliseconds(int deviceId, uint32_t* milliseconds) {
    PulseLock lock;
    auto it = devices.find(deviceId);
    if (it == devices.end() || !it->second->stream) return 0;
    pa_usec_t played = 0;
    if (pa_stream_get_time(it->second->stream, &played) < 0) return 0;
    *milliseconds = uint32_t(played / PA_USEC_PER_MSEC);
    return 1;
}

static const MediaBackend pulseMediaBackend = {pulseOpen, pulsePlay, pulseStop, pulseClose, pulsePlayedMilliseconds};

void installPulseMedia() { setMediaBackend(&pulseMediaBackend); }

PulseMediaTimes lastPulseMediaTimes() {
    PulseLock lock;
    return times;
}
