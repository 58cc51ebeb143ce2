#pragma once
// Opening a wave file into the song: the checks and refusals on the main thread that set up
// the opening state the worker (audio/openWaveWorker.h) reads and advances, and the waits and
// resets around a running opening. Used by the Open command's queue, the desktop program's
// command line and melodrift-cli.

#include <cstdint>
#include <string>

#include "audio/levelMeter.h"
#include "audio/openWaveWorker.h"

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

// Waits on the main thread until a running opening has ended, serving the headless main loop
// meanwhile so that the worker's posted calls run (the command-line tool, tests, benchmarks).
void waitForOpeningToEnd();

// Stops and joins a running worker, clears the opening flag and empties the opening state
// and the meter (tests between cases; shut-down).
void resetOpeningState();
