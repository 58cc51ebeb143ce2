#pragma once
// The playback devices as the program opens them by file: a waveaudio device plays a wave
// file, a sequencer device plays a Standard MIDI File. A device is opened on its file, played
// from the start with a completion notice, stopped and closed. The notice reaches the main
// loop when the last sample has been played, not when it was handed over.
// The default backend is the null device (no sound: a device completes after its media's
// duration); programs with sound install the PulseAudio backend (platform/pulse/).

#include <cstdint>
#include <string>

// Device types, as the playback path asks for them.
constexpr int MEDIA_TYPE_WAVEAUDIO = 522;
constexpr int MEDIA_TYPE_SEQUENCER = 523;

// Results of the device calls; mediaErrorString gives the user's text for each.
enum MediaResult {
    MEDIA_OK = 0,
    MEDIA_ERROR_NO_SERVER = 1,      // no sound server to play through
    MEDIA_ERROR_FILE = 2,           // the file cannot be read, or is no file the device plays
    MEDIA_ERROR_NO_SOUNDFONT = 3,   // the sequencer has no General MIDI sound font
    MEDIA_ERROR_DEVICE = 4,         // the device id is not open
    MEDIA_ERROR_IN_USE = 5,         // the sequencer is already open
    MEDIA_ERROR_STREAM = 6,         // the server refused or broke the stream
    MEDIA_ERROR_TYPE = 7            // not a device type the program has
};

// The completion notice: called on the main thread with the id of the device that finished.
typedef void (*MediaNotify)(int deviceId);

// Opens a device of type on the file at path; *deviceId receives its id (ids are never
// reused while the program runs). MEDIA_OK or the reason it failed.
int mediaOpen(int type, const std::string& path, int* deviceId);
// Plays the whole file from its start; notify(deviceId) is posted to the main loop when the
// last sample has been played. A device that is stopped or closed first never notifies.
int mediaPlay(int deviceId, MediaNotify notify);
// Stops the sound at once; the device stays open.
int mediaStop(int deviceId);
// Stops and releases the device and its file.
int mediaClose(int deviceId);
// The audio clock: milliseconds of the media played so far (what has reached the listener),
// in *milliseconds. 1 when the device knows it, 0 when not (not playing, or no such device).
int mediaPlayedMilliseconds(int deviceId, uint32_t* milliseconds);
// The text shown for a result other than MEDIA_OK.
std::string mediaErrorString(int result);

struct MediaBackend {
    int (*open)(int type, const std::string& path, int* deviceId);
    int (*play)(int deviceId, MediaNotify notify);
    int (*stop)(int deviceId);
    int (*close)(int deviceId);
    int (*playedMilliseconds)(int deviceId, uint32_t* milliseconds);
};
// Installs a backend; nullptr goes back to the null device.
void setMediaBackend(const MediaBackend* backend);

// ---- The null device: for tests, it can be made to fail ----
// The next open (play) of any device returns result instead of MEDIA_OK; MEDIA_OK clears it.
void failNextNullMediaOpen(int result);
void failNextNullMediaPlay(int result);
// Devices of the null backend now open; closes them all and clears the failures (between tests).
int openNullMediaDevices();
void resetNullMedia();
