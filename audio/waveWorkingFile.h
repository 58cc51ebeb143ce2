#pragma once
// The song's wave working file CS.fw in the shared folder: the song's format, the file's
// creation with its 56-byte header, its masking while at rest, the header patches after
// audio was appended or a recording ended, and the standalone wave file written from a time
// range of it (saving, and the playback file CS.fp). Used by recording, opening, time
// editing, resynthesis, playback and the command-line tool.

#include <cstdint>
#include <cstdio>
#include <string>

#include "audio/waveFile.h"

// Users of CS.fw keep this order: waitForUndoSnapshotWriter (never while holding the
// mutex), take CSAccessWaveFileMutex, unmaskWaveWorkingFile, wioFileOpen for the offsets,
// wioFileClose, reopen for the work, patch the header, close, maskWaveWorkingFile, release.

constexpr uint32_t WORKING_WAVE_HEADER_BYTES = 56;   // samples of CS.fw begin here
constexpr uint32_t WORKING_WAVE_FACT_OFFSET = 44;    // the fact value of CS.fw
constexpr uint32_t WAVE_SEGMENT_HEADER_BYTES = 44;   // header of a file written by writeWaveSegment

// XORed over the first 56 bytes of CS.fw while it is at rest. It must never change: a file
// masked with one wording cannot be unmasked with another.
constexpr char waveMaskText[] = "Melodrift keeps its working audio here; please leave it.";
static_assert(sizeof(waveMaskText) - 1 == WORKING_WAVE_HEADER_BYTES, "the mask covers the whole header");

enum WaveMaskState { WAVE_PLAIN = 0, WAVE_MASKED = 1 };

// Refused (0) when the song holds blocks and format's rate or bits differ from the song's;
// otherwise the first 16 bytes of format become song.waveFormat (1). Channels are not
// compared: every source is reduced to one channel.
int acceptWaveFormat(const WaveFormatRecord& format);

// Creates CS.fw with the 56-byte header for one channel of song.waveFormat's rate and bits
// and no data, and sets song.workingWaveBytes to 0. Takes CSAccessWaveFileMutex itself;
// the file is left plain. 0 on success, 1 when it could not be written (reported).
int createWaveWorkingFile();

// Brings the file at path into the wanted WaveMaskState: its first min(56, length) bytes
// are XORed with waveMaskText unless its state already matches (plain when it begins with
// "RIFF"). 1 when the file is (now) in that state, 0 when it cannot be read or rewritten.
// A file shorter than 4 bytes has no state to test and is left alone (1).
int applyWaveMask(const std::string& path, int wanted);
// applyWaveMask on CS.fw; the caller holds CSAccessWaveFileMutex.
int maskWaveWorkingFile();
int unmaskWaveWorkingFile();

// After data were appended: writes dataBytes into the data-size field, dataBytes x 8 / bits
// into the fact value (when the file has one) and dataOffset + dataBytes - 8 into the RIFF
// size, at the offsets wioFileOpen found for layout. file is open for update. 1 written;
// 0 when a file routine failed (it has shown its message).
int patchWaveHeader(FILE* file, const WaveReadInfo& layout, uint32_t dataBytes, uint16_t bits);

// Appends count bytes of samples to CS.fw after its first storedBytes data bytes, under the
// usual order for CS.fw (the file is left plain, as a recording or an opening keeps it), and
// patches its header for storedBytes + count. 1; 0 after openFailureText (CS.fw is no wave file)
// or a file routine's own message.
int appendToWaveWorkingFile(uint32_t storedBytes, const uint8_t* samples, size_t count, const char* openFailureText);

// Result codes of finaliseWaveWorkingFile.
enum WaveFinaliseResult {
    WAVE_FINALISED = 0,        // header patched, file cut to data offset + data bytes
    WAVE_NOT_OPENED = 1,       // CS.fw could not be opened as a wave file; nothing shown
    WAVE_NOT_FINALISED = 2     // a file routine failed and has shown its message
};
// Ends a recording: patches CS.fw's header for the song's length (frames = total block
// duration x rate, rounded; data bytes = frames x bits / 8) and makes the file exactly data
// offset + data bytes long. Called holding CSAccessWaveFileMutex with the file plain, as it
// is throughout a recording; the recorder masks it when its last blocks are stored.
int finaliseWaveWorkingFile();

// Writes the song's audio from start to end (seconds; -1.0 for the song's start or end) as a
// standalone 44-byte-header wave file at path, under the usual order for CS.fw. 1 written;
// 0 while a recording or an opening runs, when CS.fw cannot be read, or when the output
// cannot be written (reported by the file routines, "Cannot " and the path first).
int writeWaveSegment(const std::string& path, double start, double end);
