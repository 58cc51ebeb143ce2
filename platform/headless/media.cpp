// The null playback device, for machines and tests without sound: it reads its file's length
// and reports completion once that much time has passed on the program's clock, through a
// main-loop timer. The functions of platform/media.h dispatch to an installed backend.
#include "platform/media.h"

#include <map>

#include "platform/clock.h"
#include "platform/mainloop.h"
#include "platform/mediaFiles.h"

static const MediaBackend* installedBackend = nullptr;   // nullptr: the null device

// Main-loop timer ids of the null devices: the device id added to this, clear of the
// program's other timers.
static const int NULL_MEDIA_TIMER_BASE = 0x200000;
static const int NULL_MEDIA_TIMER_MS = 10;

struct NullDevice {
    int type;                 // MEDIA_TYPE_WAVEAUDIO or MEDIA_TYPE_SEQUENCER
    uint32_t durationMs;      // the media's length
    bool playing;             // between play and stop
    uint32_t startedAt;       // clock reading at play
    MediaNotify notify;       // called at completion
};

struct NullMedia {
    std::map<int, NullDevice> devices;   // open devices by id
    int nextId = 1;                      // ids are not reused
    int openFailure = MEDIA_OK;          // the next open's forced result
    int playFailure = MEDIA_OK;          // the next play's forced result
};
static NullMedia nullMedia;

static int nullOpen(int type, const std::string& path, int* deviceId) {
    if (int failure = nullMedia.openFailure) {
        nullMedia.openFailure = MEDIA_OK;
        return failure;
    }
    NullDevice device{};
    device.type = type;
    if (type == MEDIA_TYPE_WAVEAUDIO) {
        MediaWaveInfo info{};
        if (!readMediaWaveInfo(path, &info)) return MEDIA_ERROR_FILE;
        device.durationMs = mediaWaveMilliseconds(info);
    } else if (type == MEDIA_TYPE_SEQUENCER) {
        // Like a MIDI output port, the sequencer serves one file at a time.
        for (auto& [id, open] : nullMedia.devices)
            if (open.type == MEDIA_TYPE_SEQUENCER) return MEDIA_ERROR_IN_USE;
        if (!readMidiFileDuration(path, &device.durationMs)) return MEDIA_ERROR_FILE;
    } else {
        return MEDIA_ERROR_TYPE;
    }
    *deviceId = nullMedia.nextId++;
    nullMedia.devices[*deviceId] = device;
    return MEDIA_OK;
}

static void checkCompletion(int deviceId) {
    auto it = nullMedia.devices.find(deviceId);
    if (it == nullMedia.devices.end()) return;
    NullDevice& device = it->second;
    if (!device.playing || clockMilliseconds() - device.startedAt < device.durationMs) return;
    device.playing = false;
    stopTimer(NULL_MEDIA_TIMER_BASE + deviceId);
    MediaNotify notify = device.notify;
    if (notify) postToMainLoop([notify, deviceId] { notify(deviceId); });
}

static int nullPlay(int deviceId, MediaNotify notify) {
    auto it = nullMedia.devices.find(deviceId);
    if (it == nullMedia.devices.end()) return MEDIA_ERROR_DEVICE;
    if (int failure = nullMedia.playFailure) {
        nullMedia.playFailure = MEDIA_OK;
        return failure;
    }
    NullDevice& device = it->second;
    device.playing = true;
    device.startedAt = clockMilliseconds();
    device.notify = notify;
    startTimer(NULL_MEDIA_TIMER_BASE + deviceId, NULL_MEDIA_TIMER_MS, [deviceId] { checkCompletion(deviceId); });
    return MEDIA_OK;
}

static int nullStop(int deviceId) {
    auto it = nullMedia.devices.find(deviceId);
    if (it == nullMedia.devices.end()) return MEDIA_ERROR_DEVICE;
    it->second.playing = false;
    stopTimer(NULL_MEDIA_TIMER_BASE + deviceId);
    return MEDIA_OK;
}

static int nullClose(int deviceId) {
    int result = nullStop(deviceId);
    nullMedia.devices.erase(deviceId);
    return result;
}

static int nullPlayedMilliseconds(int deviceId, uint32_t* milliseconds) {
    auto it = nullMedia.devices.find(deviceId);
    if (it == nullMedia.devices.end() || !it->second.playing) return 0;
    uint32_t elapsed = clockMilliseconds() - it->second.startedAt;
    *milliseconds = elapsed < it->second.durationMs ? elapsed : it->second.durationMs;
    return 1;
}

static const MediaBackend nullBackend = {nullOpen, nullPlay, nullStop, nullClose, nullPlayedMilliseconds};

static const MediaBackend& backend() { return installedBackend ? *installedBackend : nullBackend; }

int mediaOpen(int type, const std::string& path, int* deviceId) { return backend().open(type, path, deviceId); }
int mediaPlay(int deviceId, MediaNotify notify) { return backend().play(deviceId, notify); }
int mediaStop(int deviceId) { return backend().stop(deviceId); }
int mediaClose(int deviceId) { return backend().close(deviceId); }
int mediaPlayedMilliseconds(int deviceId, uint32_t* milliseconds) {
    return backend().playedMilliseconds(deviceId, milliseconds);
}

std::string mediaErrorString(int result) {
    switch (result) {
    case MEDIA_OK: return "";
    case MEDIA_ERROR_NO_SERVER:
        return "The sound server is not running or cannot be reached, so nothing can be played. Start PulseAudio "
               "(or the PulseAudio service of PipeWire) and try again.";
    case MEDIA_ERROR_FILE: return "The file cannot be played: it cannot be read, or it is damaged or of an unknown format.";
    case MEDIA_ERROR_NO_SOUNDFONT:
        return "No General MIDI sound font was found. Install the package timgm6mb-soundfont or fluid-soundfont-gm.";
    case MEDIA_ERROR_DEVICE: return "The playback device is not open.";
    case MEDIA_ERROR_IN_USE: return "The MIDI device is already in use.";
    case MEDIA_ERROR_STREAM: return "The sound server refused to play the audio, or stopped playing it.";
    case MEDIA_ERROR_TYPE: return "There is no playback device of that type.";
    default: return "Playback failed.";
    }
}

void setMediaBackend(const MediaBackend* backendToUse) { installedBackend = backendToUse; }

void failNextNullMediaOpen(int result) { nullMedia.openFailure = result; }
void failNextNullMediaPlay(int result) { nullMedia.playFailure = result; }
int openNullMediaDevices() { return int(nullMedia.devices.size()); }

void resetNullMedia() {
    for (auto& [id, device] : nullMedia.devices) stopTimer(NULL_MEDIA_TIMER_BASE + id);
    nullMedia.devices.clear();
    nullMedia.openFailure = MEDIA_OK;
    nullMedia.playFailure = MEDIA_OK;
}
