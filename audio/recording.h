#pragma once
// Live recording: the capture buffer filled by the default input (platform/capture.h), each
// new stretch moved into CS.fw on the main thread when the capture event is served, and the
// opening worker analysing the growing file chunk by chunk (its recording branch). Stopping
// drains what is left, finalises CS.fw and closes the analysis files. Recording into a song
// with audio appends to it, in the song's format.

#include <atomic>
#include <cstdint>
#include <string>

#include "platform/capture.h"

constexpr int RECORDING_FORMAT_COUNT = 20;            // "CS Input wave quality" indexes 0 .. 19
constexpr int64_t RECORDING_DISK_SPACE_MINIMUM = 104857600;   // bytes free to start a recording
constexpr int64_t RECORDING_DISK_SPACE_STOP = 20971520;       // below it (or one stretch) a recording stops
constexpr uint32_t RECORD_PRESS_REPEAT = 10;          // hundredths: presses this soon after the last are ignored
constexpr double SPEED_WARNING_LAG = 5.0;             // seconds of unanalysed audio that bring the information box

constexpr const char* RECORDING_DISK_LOW_TEXT =
    "Disk space is low on the Torvellan Shared drive so recording cannot begin. Please free some space or choose an "
    "alternative drive from Preferences.";
constexpr const char* RECORDING_DISK_VERY_LOW_TEXT =
    "Disk space is very low on the Torvellan Shared drive so recording will stop. Please free some space or choose "
    "an alternative drive from Preferences.";
constexpr const char* NO_DIRECTSOUND_TEXT =
    "Sorry - DirectSound does not appear to be available for recording. Please ensure that DirectX is installed on "
    "your computer and that your sound card drivers are properly installed.";
constexpr const char* QUALITY_NOT_AVAILABLE_TEXT =
    "Sorry - The recording quality currently selected in preferences does not appear to be available.\n\nPlease "
    "ensure at least DirectX v8.1 is installed on your system.";
constexpr const char* BLOCK_ALIGNMENT_TEXT = "Block alignment problem";
constexpr const char* CAPTURE_BUFFER_ERROR_TEXT = "Error with DirectSoundCapture buffer.";
constexpr const char* CAPTURE_BUFFER_ERROR_TITLE = "DirectSound Sample";
constexpr const char* HANDLER_OPEN_TEXT = "Input Wave file could not be opened by CSRecordCapturedDataThread (1)";
constexpr const char* STOP_OPEN_TEXT = "Input Wave file could not be opened by CSStopCapturingWave (1)";
constexpr const char* COMPAND_TOO_LOW_TEXT = "The Waveform Input levels are too low to effectively compand.";
constexpr const char* SPEED_WARNING_TITLE = "Information for Recording in Real-Time";
constexpr const char* SPEED_WARNING_TEXT =
    "Your computer is not keeping up with analysing the recording as it is made. Carry on singing: nothing is lost, "
    "and processing will continue after 'Stop recording' until the whole recording has been analysed.\n\n"
    "Maximize speed switches on \"Boost speed\" and records in the \"Low\" quality from the next song on.";
constexpr const char* SPEED_CHANGES_LATER_TEXT =
    "These preference changes will come into effect after the current song is closed.";
// A new recording's song names.
constexpr const char* RECORDED_AUDIO_NAME = "Recorded Audio";
// The recovery of a recording the program did not finish (start-up).
constexpr const char* RECORDING_MARKER_FILE = "CS.rec";   // in the shared folder while a recording runs

// The Record command's label in its three states.
enum RecordLabelState { RECORD_LABEL_IDLE = 0, RECORD_LABEL_RECORDING = 1, RECORD_LABEL_FINISHING = 2 };

struct RecordingState {
    CaptureFormat captureFormat{};              // of the recording that runs or ran last
    bool formatAvailable[RECORDING_FORMAT_COUNT] = {};   // by quality index (probeRecordingFormats)
    uint32_t notificationSize = 0;              // N: chunk bytes / 2
    uint32_t bufferSize = 0;                    // 16 N
    uint32_t nextCaptureOffset = 0;             // where the next stretch is taken from the capture buffer
    uint32_t startBytes = 0;                    // CS.fw's data bytes when this recording started
    double recordedSeconds = 0;                 // CS.fw's audio, seconds
    std::atomic<bool> captureStopped{false};    // the capture buffer has been stopped
    std::atomic<int> stopPending{-1};           // 1 from the user's stop until the worker has drained; else -1
    uint32_t lastRecordPress = 0;               // time counter at the last Record press acted on
    std::atomic<double> processingLag{0.0};     // seconds captured but not analysed (worker)
    bool speedWarningShown = false;             // the information box came in this recording
    uint32_t startTime = 0;                     // time counter at the start
    int labelState = RECORD_LABEL_IDLE;         // RecordLabelState
    bool monitoring = false;                    // the capture runs only to show the input's level
};
extern RecordingState recordingState;

// What the layers above show of the recorder. A null entry is left out.
struct RecordingHooks {
    // The recording preferences before recording into an empty song; 1 to go on, 0 cancelled (desktop program).
    int (*quickPreferences)();
    // Dialog 1132, "Information for Recording in Real-Time", not modal; on the main thread (desktop program).
    void (*showSpeedWarning)();
    // The Record label changed (recording, finishing, ended): the song's window follows (shell).
    void (*stateChanged)();
    // The level monitor put a new level in the meter's history: the meter shows it (desktop program).
    void (*levelChanged)();
};
extern RecordingHooks recordingHooks;

// Record: starts a recording, or stops the one that runs. 0 started or nothing to do; 1
// refused (after its message).
int startRecording();
// The user's stop: the capture stops, the last stretch is stored and the worker analyses what
// is left, then finalises. 1 without a capture object; else 0 (or CSStopCapturingWave's).
int stopRecording();
// The capture event, on the main thread: the newly captured stretch, in whole blocks, goes into
// CS.fw. 0 handled or nothing to take; 1 without a capture buffer, or when the recording had to
// stop.
int handleCaptureNotification();
// Stops the capture and has the worker finish the recording now: what is in CS.fw is analysed
// and kept. Called on any capture failure and when a finishing recording is pressed again. 0.
int CSStopCapturingWave();
// Fills formatAvailable from the capture object (all clear without one: DirectSound is not
// available), with the wait cursor.
void probeRecordingFormats();
// The capture format of a quality index: mono PCM of its rate and bits.
CaptureFormat captureFormatOfQuality(int index);

// The worker's part of a recording (installed in the opening state by startRecording): after
// each chunk the processing lag and the information box when due; as it finishes, CS.fw
// finalised for the song's length (header, exact length); and, posted as its last act, the
// recording's end on the main thread (flags, labels, the capture buffer, the view).
void recordingChunkDone(uint32_t samplesAnalysed);
void finishRecording();
void recordingEnded();
// CS.fw's data bytes stored so far in this recording (read by the worker as it analyses).
uint32_t recordedBytesStored();

// The input's level on the meter before a recording: the capture runs without storing
// anything, and each stretch only moves the meter. The song's format when it holds audio, else
// the chosen quality's. 1 when it runs; 0 without an input. A recording stops it.
int startLevelMonitor();
void stopLevelMonitor();
bool levelMonitorRunning();

// The label the Record command shows: "&Record Audio...", "&Stop Recording" or "Finishing...".
const char* recordLabel();

// The information box's buttons: "&Maximize speed" switches "CS Boost speed" on and the
// recording quality to "Low" (index 8) and says when that takes effect; "&Show this next time"
// sets "Show CSSpeedWarning dialog".
void maximizeRecordingSpeed();
void setShowSpeedWarning(bool show);

// Compands an 8-bit song held in memory (count samples at rate): each second's loudest
// stretch is brought to a common level. 1 when done; 0 after "The Waveform Input levels are
// too low to effectively compand." when the song is shorter than a segment or silent.
int compandWave(uint8_t* samples, uint32_t count, uint32_t rate);

// Start-up: a CS.fw left plain by a recording that never finished is kept as
// "Recovered recording <date and time>.wav" in the shared folder, and the user is told where.
// Returns the path kept, or "".
std::string recoverUnfinishedRecording();

// Back to no recording (tests, shut-down): the capture stopped, the buffer released, the state cleared.
void resetRecordingState();
