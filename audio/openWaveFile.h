#pragma once
// Opening a wave file into the song: the checks and refusals on the main thread, the opening
// state the worker (audio/openWaveWorker.h) reads and advances, the end of an opening handed
// back to the main loop, and the level meter's history that opening and recording feed.
// Used by the Open command's queue, the desktop program's command line and melodrift-cli.

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include "audio/waveFile.h"
#include "platform/sync.h"

constexpr uint32_t HIGHEST_OPENING_RATE = 44100;              // Hz; faster files are refused
constexpr int64_t OPENING_DISK_SPACE_MINIMUM = 104857600;     // bytes free on the shared folder's drive

constexpr const char* RATE_TOO_HIGH_TEXT =
    "Sorry - this wave file cannot be opened.\n\n44100Hz is the highest sample rate supported by this product.";
constexpr const char* TOO_MANY_CHANNELS_TEXT = "This waveform contains too many channels and cannot be loaded.";
constexpr const char* CANNOT_APPEND_TEXT =
    "This waveform cannot be appended to the current document as it either has a different sample rate, bit size "
    "or number of channels.";
constexpr const char* OPENING_DISK_LOW_TEXT =
    "Disk space is low on the Torvellan Shared drive so recording cannot begin. Please free some space or choose an "
    "alternative drive from Preferences.";

// The opening in progress (one song, one opening at a time). The main thread fills it in
// openWaveFile before the worker starts; from then on the worker owns every field but the
// worker handle, and the main thread reads them again once the worker has ended.
struct OpeningState {
    std::string sourcePath;         // full path of the file being opened
    WaveFormatRecord sourceFormat;  // copy of the file's format; the default record (PCM) when none is open
    float sourceDuration;           // data samples / samples per second of the file, seconds
    uint32_t samplesBefore;         // song samples that existed when the opening started (0 for a new song)
    uint32_t samplesDone;           // song samples handed to analysis: where the next frequency table starts
    uint32_t samplesRead;           // frames of the file read so far
    uint32_t sourceBytesRead;       // bytes of the file's data chunk consumed so far
    uint32_t storedSamples;         // song samples CS.fw holds
    std::vector<uint8_t> chunkBuffer;   // the song's sample size: history (a silent lead-in at first), then a chunk
    uint32_t bufferBytes;           // valid bytes in chunkBuffer
    uint32_t bufferSamples;         // valid samples in chunkBuffer
    int64_t bufferFirstSample;      // song position of chunkBuffer's first sample (negative in a new song's lead-in)
    int64_t endOfSource;            // song position after the file's last whole block once it is all read, else -1
    double recognitionShare;        // of the time since recognition last started that it may take (0.2, 0.1 with boost)
    double displayShare;            // the same for redrawing the song view (0.1, 0.05 with boost)
    uint32_t startTime;             // time counter when the opening started, hundredths of a second
    int (*quickPreferences)();      // installed by the desktop program: the accuracy/speed preferences before
                                    // opening into an empty song; 1 confirmed, 0 cancelled; null: not offered
    bool recording;                 // the worker reads a recording from CS.fw rather than a file (recorder)
    std::atomic<uint32_t> recordedBytes;    // while recording: CS.fw's data bytes stored so far (recorder)
    std::atomic<bool> recordingComplete;    // while recording: the last stretch is stored, no more comes (recorder)
    // The recorder's part at a recording's moments (audio/recording.h fills them): after each
    // chunk, with the samples analysed; as the worker finishes (CS.fw finalised); and posted as
    // the worker's last act, in place of openingEnded.
    void (*recordingChunkDone)(uint32_t samplesAnalysed);
    void (*finishRecording)();
    void (*recordingEnded)();
    SuspendableWorker worker;       // CSOpenWaveFileDataThread; its stop request is the user's stop
};
extern OpeningState openingState;

// What the level meter draws: the newest levels, oldest first. Written by opening and
// recording on their worker, read by the meter's painting on the user interface thread.
constexpr int LEVEL_METER_BARS = 32;
constexpr int LEVEL_METER_FULL_SCALE = 255;   // the meter height the level rule scales to
struct LevelMeter {
    std::mutex lock;                  // guards levels
    int levels[LEVEL_METER_BARS];     // 0 .. LEVEL_METER_FULL_SCALE; 0 draws no bar
};
extern LevelMeter levelMeter;

// Opens the wave file at path into the song: a new song when it is empty, else appended.
// Runs on the main thread; the analysis runs on CSOpenWaveFileDataThread. Refuses, with the
// user's message and the song left as it was, while a recording or an opening runs, when the
// shared folder's drive is low, when the file cannot be read, is faster than 44100 Hz, has
// more than 16 channels, is not 8- or 16-bit PCM, or does not match the song's rate and bits.
// 1 when the path was dealt with (opening started, or refused with a message); 0 when nothing
// was done (the quick preferences were cancelled).
int openWaveFile(const std::string& path);

// Shared by opening and recording, holding CSWaveProcessingMutex: a new analysis pass from the
// song's present end (samples before, start time, analysis tables). 1; 0 when the tables cannot
// be made (reported).
int beginSongAnalysis();
// The worker's counters for a pass over sourcePath (CS.fw when recording), before it starts.
void prepareSongWorker(const std::string& sourcePath, bool recording);

// The user's stop (the song view): the worker finishes at the next chunk boundary and the
// song keeps what was analysed. Nothing happens when no opening runs.
void requestOpeningStop();

// Posted to the main loop by the worker as its last act: joins the thread, clears the
// opening flag and redraws the song view, the meter and the frame's status.
void openingEnded();

// Waits on the main thread until a running opening has ended, serving the headless main loop
// meanwhile so that the worker's posted calls run (the command-line tool, tests, benchmarks).
void waitForOpeningToEnd();

// Stops and joins a running worker, clears the opening flag and empties the opening state
// and the meter (tests between cases; shut-down).
void resetOpeningState();

// The level of count samples of the song's size (8-bit unsigned or 16-bit signed, one
// channel): rms against the format's reference level on a logarithmic scale of 0 ..
// LEVEL_METER_FULL_SCALE. Louder than the reference counts as full scale.
int levelMeterValue(const uint8_t* samples, uint32_t count, int bitsPerSample);
// Shifts the meter's history by one and appends value.
void pushLevelMeterValue(int value);
